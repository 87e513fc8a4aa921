// Byte streams: the stream interfaces, the access-mode bits and the mode holder.
#pragma once

#include "I_Error.h"
#include "ZYRStdExport.h"
#include "CZYRBaseRefCnt.h"

namespace ZYRStd {
class CZYRUniString;
}

namespace ZYRStreams {

using ZYRPublic::eZYRErrorType;

// Access-mode bits; clients pass them as numbers, so the values are fixed.
constexpr unsigned int kZYRStreamRead = 0x001;
constexpr unsigned int kZYRStreamWrite = 0x002;
// Writes allowed; the position starts at the end and existing content is kept.
constexpr unsigned int kZYRStreamAppend = 0x004;
// The file goes away when its last handle closes; no flush at close.
constexpr unsigned int kZYRStreamDeleteOnClose = 0x008;
constexpr unsigned int kZYRStreamNoBuffering = 0x010;
constexpr unsigned int kZYRStreamTruncate = 0x020;
constexpr unsigned int kZYRStreamRandomAccess = 0x040;
constexpr unsigned int kZYRStreamSequentialScan = 0x080;
constexpr unsigned int kZYRStreamWriteThrough = 0x100;
constexpr unsigned int kZYRStreamNoFlushOnClose = 0x200;

// Any stream: memory or file. Reads and writes move size * count bytes (the product in
// 32 bits) and return bytes, not items. The error-reporting overloads never throw: they
// store the error type in `err` and return 0.
class ZYRSTD_API IZYRStream : public ZYRStd::CZYRBaseRefCnt {
public:
    ~IZYRStream() override;
    virtual void reOpen(unsigned int mode) = 0;
    virtual unsigned int read(void* buf, unsigned int size, unsigned int count,
                              eZYRErrorType& err) = 0;
    virtual unsigned int read(void* buf, unsigned int size, unsigned int count) = 0;
    virtual unsigned int write(const void* buf, unsigned int size, unsigned int count,
                               eZYRErrorType& err) = 0;
    virtual unsigned int write(const void* buf, unsigned int size, unsigned int count) = 0;
    virtual unsigned long long setPos(const unsigned long long& pos) = 0;
    virtual unsigned long long getPos() = 0;
    // Moves the position to the end of data.
    virtual void setEOF() = 0;
    virtual unsigned long long getEOF() = 0;
    virtual unsigned long long getSize() = 0;
    virtual unsigned long long getCapacity() = 0;
    virtual unsigned int getAccessMode() = 0;
};

// A stream backed by a named file.
class ZYRSTD_API IZYRFStream : public IZYRStream {
public:
    ~IZYRFStream() override;
    virtual bool isOpen() = 0;
    virtual void close() = 0;
    virtual void flush() = 0;
    virtual const ZYRStd::CZYRUniString& getFilePath() = 0;
    // True when the file now ends at the current position.
    virtual bool truncate() = 0;
    virtual void removeFile() = 0;
};

// A file stream whose bytes are reached through a mapped view.
class ZYRSTD_API IZYRMemMapFStream : public IZYRFStream {
public:
    ~IZYRMemMapFStream() override;
    virtual bool isMapped() = 0;
    // The base of the mapped bytes; `offset` and `length` describe them in the file.
    virtual void* getMapAttributes(unsigned long long& offset, unsigned int& length) = 0;
};

} // namespace ZYRStreams

namespace ZYRFileSys {

// The access mode of one stream, fixed at creation and replaced by reOpen.
class ZYRSTD_API CStreamAccess {
public:
    explicit CStreamAccess(unsigned int mode = 0) noexcept : mode_(mode) {}
    CStreamAccess(const CStreamAccess&) = default;
    CStreamAccess& operator=(const CStreamAccess&) = default;
    virtual ~CStreamAccess();

    unsigned int mode() const noexcept { return mode_; }
    void setMode(unsigned int mode) noexcept { mode_ = mode; }
    bool has(unsigned int bits) const noexcept { return (mode_ & bits) != 0; }
    bool isReadable() const noexcept { return has(ZYRStreams::kZYRStreamRead); }
    // Append implies writing.
    bool isWritable() const noexcept {
        return has(ZYRStreams::kZYRStreamWrite | ZYRStreams::kZYRStreamAppend);
    }

private:
    unsigned int mode_;
};

} // namespace ZYRFileSys
