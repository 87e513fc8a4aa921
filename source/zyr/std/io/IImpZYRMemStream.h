/// \file
/// The memory stream: a fixed-capacity stream over its own bytes or a caller's buffer.
#pragma once

#include "IZYRStream.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/memory/CZYRMemBuffer.h"

namespace ZYRFileSys {

/// Never grows: a write past the capacity fails and changes nothing. The access bits that
/// only concern files are stored and ignored.
class ZYRSTD_API IImpZYRMemStream : public ZYRStreams::IZYRStream,
                                    public ZYRStd::CZYRClientBase,
                                    private ZYRStd::CZYRPolicyNoCopy {
public:
    /// A null `buffer` with a capacity allocates the bytes; a caller's buffer is used in
    /// place, never freed, and is the content when the mode is readable without truncate.
    IImpZYRMemStream(unsigned int mode, unsigned int capacity, void* buffer);
    ~IImpZYRMemStream() override;

    void reOpen(unsigned int mode) override;
    /// Reads up to `size` * `count` bytes; records kZYRErrorFileOpFailed-style failures in
    /// `err` and returns 0 instead of throwing.
    unsigned int read(void* buf, unsigned int size, unsigned int count,
                      ZYRPublic::eZYRErrorType& err) override;
    unsigned int read(void* buf, unsigned int size, unsigned int count) override;
    /// Writes `size` * `count` bytes, growing owned memory; records a failure in `err` and
    /// returns 0 instead of throwing.
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::eZYRErrorType& err) override;
    unsigned int write(const void* buf, unsigned int size, unsigned int count) override;
    unsigned long long setPos(const unsigned long long& pos) override;
    unsigned long long getPos() override { return position_; }
    void setEOF() override { position_ = eof_; }
    unsigned long long getEOF() override { return eof_; }
    unsigned long long getSize() override { return eof_; }
    unsigned long long getCapacity() override { return capacity_; }
    unsigned int getAccessMode() override { return access_.mode(); }

    /// The bytes in use (the caller's or our own).
    unsigned char* data() const { return data_; }

private:
    unsigned int capacity_;
    unsigned int position_ = 0;
    unsigned int eof_ = 0; ///< invariant: position_ <= capacity_ and eof_ <= capacity_
    CStreamAccess access_;
    ZYRStd::CZYRMemBuffer<unsigned char> ownBuffer_;
    unsigned char* data_ = nullptr;
};

} // namespace ZYRFileSys
