/// \file
/// Immutable byte buffers behind I_DataBuffer, and their value wrapper.
#pragma once

#include "C_SmartPtr.h"
#include "I_DataBuffer.h"
#include "I_Error.h"
#include "ZYRStdExport.h"
#include "zyr/std/values/CZYRPublicObject.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_DataBuffer;

/// A private copy of `length` bytes, one reference for the caller; null data or zero length
/// gives a valid empty buffer.
[[nodiscard]] ZYRSTD_API I_DataBuffer* createDataBuffer(const char* data, unsigned int length,
                                                        ZYRPublic::I_Error& err);

/// A shared, immutable byte buffer; copies share it. Any thread may read it.
class ZYRSTD_API CZYRDataBuffer : public CZYRInterfaceValue<I_DataBuffer> {
public:
    CZYRDataBuffer() = default;
    /// Copies and moves share the buffer; the wrappers take one more reference to it, or adopt the
    /// caller's with `addRef` false.
    ///@{
    CZYRDataBuffer(const CZYRDataBuffer& other) = default;
    CZYRDataBuffer(CZYRDataBuffer&& other) noexcept = default;
    CZYRDataBuffer(const C_SmartPtr<I_DataBuffer>& buffer)
        : CZYRInterfaceValue(buffer.get(), true) {}
    CZYRDataBuffer(I_DataBuffer* buffer, bool addRef) : CZYRInterfaceValue(buffer, addRef) {}
    /// Throws what createDataBuffer recorded.
    CZYRDataBuffer(const char* data, unsigned int length);
    CZYRDataBuffer& operator=(const CZYRDataBuffer& other) = default;
    CZYRDataBuffer& operator=(CZYRDataBuffer&& other) noexcept = default;
    ///@}
    ~CZYRDataBuffer() override;
    /// The bytes, borrowed for the buffer's life; null for an invalid wrapper.
    const char* getBuffer() const { return impl_ ? impl_->getBuffer() : nullptr; }
    /// The number of bytes; 0 for an invalid wrapper.
    unsigned int getLength() const { return impl_ ? impl_->getLength() : 0; }
    /// Throws kZYRErrorInvalidObject for an invalid wrapper.
    unsigned long long getUniqueID() const;
    /// The buffer's reference count, for diagnostics only.
    unsigned int debugRefCount() const { return impl_ ? impl_->debugGetRefCount() : 0; }
};

} // namespace ZYRStd
