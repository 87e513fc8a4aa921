// Immutable byte buffers behind I_DataBuffer, and their value wrapper.
#pragma once

#include "C_SmartPtr.h"
#include "I_DataBuffer.h"
#include "I_Error.h"
#include "ZYRStdExport.h"
#include "zyr/std/CZYRClientBase.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_DataBuffer;

// A private copy of `length` bytes, one reference for the caller; null data or zero length
// gives a valid empty buffer.
ZYRSTD_API I_DataBuffer* createDataBuffer(const char* data, unsigned int length,
                                          ZYRPublic::I_Error& err);

class ZYRSTD_API CZYRDataBuffer : public CZYRClientBase {
public:
    CZYRDataBuffer() = default;
    CZYRDataBuffer(const CZYRDataBuffer& other);
    CZYRDataBuffer(const C_SmartPtr<I_DataBuffer>& buffer);
    CZYRDataBuffer(I_DataBuffer* buffer, bool addRef);
    // Throws what createDataBuffer recorded.
    CZYRDataBuffer(const char* data, unsigned int length);
    CZYRDataBuffer& operator=(const CZYRDataBuffer& other);
    ~CZYRDataBuffer() override;

    operator C_SmartPtr<I_DataBuffer>() const { return C_SmartPtr<I_DataBuffer>(impl_, true); }
    I_DataBuffer* getImpl() const { return impl_; }
    bool isValid() const { return impl_ != nullptr; }
    const char* getBuffer() const { return impl_ ? impl_->getBuffer() : nullptr; }
    unsigned int getLength() const { return impl_ ? impl_->getLength() : 0; }
    // Throws kZYRErrorInvalidObject for an invalid wrapper.
    unsigned long long getUniqueID() const;
    unsigned int debugRefCount() const { return impl_ ? impl_->debugGetRefCount() : 0; }

private:
    I_DataBuffer* impl_ = nullptr;
};

} // namespace ZYRStd
