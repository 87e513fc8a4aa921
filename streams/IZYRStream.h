/// \file
/// Byte streams: the stream interfaces, the access-mode bits and the mode holder.
#pragma once

#include "I_Error.h"
#include "ZYRStdExport.h"
#include "CZYRBaseRefCnt.h"

namespace ZYRStd {
class CZYRUniString;
}

namespace ZYRStreams {

using ZYRPublic::eZYRErrorType;

/// Access-mode bits; clients pass them as numbers, so the values are fixed.
constexpr unsigned int kZYRStreamRead = 0x001;  ///< reads allowed
constexpr unsigned int kZYRStreamWrite = 0x002; ///< writes allowed
/// Writes allowed; the position starts at the end and existing content is kept.
constexpr unsigned int kZYRStreamAppend = 0x004;
/// The file goes away when its last handle closes; no flush at close.
constexpr unsigned int kZYRStreamDeleteOnClose = 0x008;
constexpr unsigned int kZYRStreamNoBuffering = 0x010;    ///< no buffering by the operating system
constexpr unsigned int kZYRStreamTruncate = 0x020;       ///< the file is emptied on opening
constexpr unsigned int kZYRStreamRandomAccess = 0x040;   ///< a hint: access mostly at random places
constexpr unsigned int kZYRStreamSequentialScan = 0x080; ///< a hint: mostly start to end
constexpr unsigned int kZYRStreamWriteThrough = 0x100; ///< writes go to the device before returning
constexpr unsigned int kZYRStreamNoFlushOnClose = 0x200; ///< closing does not flush buffered data

/// Any stream: memory or file. Reads and writes move size * count bytes (the product in
/// 32 bits) and return bytes, not items. The error-reporting overloads never throw: they
/// store the error type in `err` and return 0; the others throw ZYRStd::CZYRError. Not
/// locked: one thread uses a stream at a time, though its count may be shared.
class ZYRSTD_API IZYRStream : public ZYRStd::CZYRBaseRefCnt {
public:
    ~IZYRStream() override;
    /// Starts over with the access mode `mode`; data is kept only with kZYRStreamAppend,
    /// which also puts the position at the end.
    virtual void reOpen(unsigned int mode) = 0;
    /// Reads up to `size` * `count` bytes into `buf`; returns the bytes read.
    ///@{
    virtual unsigned int read(void* buf, unsigned int size, unsigned int count,
                              eZYRErrorType& err) = 0;
    virtual unsigned int read(void* buf, unsigned int size, unsigned int count) = 0;
    ///@}
    /// Writes `size` * `count` bytes from `buf`; returns the bytes written.
    ///@{
    virtual unsigned int write(const void* buf, unsigned int size, unsigned int count,
                               eZYRErrorType& err) = 0;
    virtual unsigned int write(const void* buf, unsigned int size, unsigned int count) = 0;
    ///@}
    /// Moves the position; returns the new one.
    virtual unsigned long long setPos(const unsigned long long& pos) = 0;
    /// The position in bytes from the start.
    virtual unsigned long long getPos() = 0;
    /// Moves the position to the end of data.
    virtual void setEOF() = 0;
    /// The end of data in bytes.
    virtual unsigned long long getEOF() = 0;
    /// The size of the data in bytes (the end of data).
    virtual unsigned long long getSize() = 0;
    /// The bytes the stream can hold before it must grow.
    virtual unsigned long long getCapacity() = 0;
    /// The access-mode bits given at creation or by reOpen.
    virtual unsigned int getAccessMode() = 0;
};

/// A stream backed by a named file.
class ZYRSTD_API IZYRFStream : public IZYRStream {
public:
    ~IZYRFStream() override;
    /// True while the file is open.
    virtual bool isOpen() = 0;
    /// Closes the file, flushing it unless the mode says otherwise.
    virtual void close() = 0;
    /// Writes buffered data out.
    virtual void flush() = 0;
    /// The file's path; borrowed from this stream.
    virtual const ZYRStd::CZYRUniString& getFilePath() = 0;
    /// True when the file now ends at the current position.
    virtual bool truncate() = 0;
    /// Deletes the stream's file by its path.
    virtual void removeFile() = 0;
};

/// A file stream whose bytes are reached through a mapped view.
class ZYRSTD_API IZYRMemMapFStream : public IZYRFStream {
public:
    ~IZYRMemMapFStream() override;
    /// True while the view is mapped.
    virtual bool isMapped() = 0;
    /// The base of the mapped bytes; `offset` and `length` describe them in the file.
    virtual void* getMapAttributes(unsigned long long& offset, unsigned int& length) = 0;
};

} // namespace ZYRStreams

namespace ZYRFileSys {

/// The access mode of one stream, fixed at creation and replaced by reOpen.
class ZYRSTD_API CStreamAccess {
public:
    /// Holds the access-mode bits `mode`.
    explicit CStreamAccess(unsigned int mode = 0) noexcept : mode_(mode) {}
    /// Copies the mode.
    CStreamAccess(const CStreamAccess&) = default;
    /// Copies the mode.
    CStreamAccess& operator=(const CStreamAccess&) = default;
    virtual ~CStreamAccess();

    /// The access-mode bits.
    unsigned int mode() const noexcept { return mode_; }
    /// Replaces the access-mode bits.
    void setMode(unsigned int mode) noexcept { mode_ = mode; }
    /// True when any of `bits` is set.
    bool has(unsigned int bits) const noexcept { return (mode_ & bits) != 0; }
    /// True with kZYRStreamRead.
    bool isReadable() const noexcept { return has(ZYRStreams::kZYRStreamRead); }
    /// Append implies writing.
    bool isWritable() const noexcept {
        return has(ZYRStreams::kZYRStreamWrite | ZYRStreams::kZYRStreamAppend);
    }

private:
    unsigned int mode_;
};

} // namespace ZYRFileSys
