// Immutable byte buffers behind I_DataBuffer, and their value wrapper.
#pragma once

#include "C_SmartPtr.h"
#include "I_DataBuffer.h"
#include "I_Error.h"
#include "ZYRStdExport.h"
#include "zyr/std/values/CZYRPublicObject.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_DataBuffer;

// A private copy of `length` bytes, one reference for the caller; null data or zero length
// gives a valid empty buffer.
[[nodiscard]] ZYRSTD_API I_DataBuffer* createDataBuffer(const char* data, unsigned int length,
                                                        ZYRPublic::I_Error& err);

class ZYRSTD_API CZYRDataBuffer : public CZYRInterfaceValue<I_DataBuffer> {
public:
    CZYRDataBuffer() = default;
    CZYRDataBuffer(const CZYRDataBuffer& other) = default;
    CZYRDataBuffer(CZYRDataBuffer&& other) noexcept = default;
    CZYRDataBuffer(const C_SmartPtr<I_DataBuffer>& buffer)
        : CZYRInterfaceValue(buffer.get(), true) {}
    CZYRDataBuffer(I_DataBuffer* buffer, bool addRef) : CZYRInterfaceValue(buffer, addRef) {}
    // Throws what createDataBuffer recorded.
    CZYRDataBuffer(const char* data, unsigned int length);
    CZYRDataBuffer& operator=(const CZYRDataBuffer& other) = default;
    CZYRDataBuffer& operator=(CZYRDataBuffer&& other) noexcept = default;
    ~CZYRDataBuffer() override;
    const char* getBuffer() const { return impl_ ? impl_->getBuffer() : nullptr; }
    unsigned int getLength() const { return impl_ ? impl_->getLength() : 0; }
    // Throws kZYRErrorInvalidObject for an invalid wrapper.
    unsigned long long getUniqueID() const;
    unsigned int debugRefCount() const { return impl_ ? impl_->debugGetRefCount() : 0; }
};

} // namespace ZYRStd
