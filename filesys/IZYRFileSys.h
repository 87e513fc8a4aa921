/// \file
/// The file system: the interface every file access goes through, the directory
/// enumeration callback and the low-level file under every file stream.
#pragma once

#include "CZYRBaseRefCnt.h"
#include "IZYRFileName.h"
#include "IZYRStream.h"
#include "ZYRPDLFileSysRec.h"
#include "ZYRStdExport.h"

namespace ZYRFileSys {

using ZYRFileName::IZYRFileName;
using ZYRStd::CZYRSmartZYRRefPtr;

/// Attribute bits given to an enumeration callback; a plain file has 0.
constexpr unsigned int kZYRFileAttrDirectory = 0x10000000; ///< the entry is a directory
constexpr unsigned int kZYRFileAttrReadOnly = 0x1;         ///< the entry cannot be written
constexpr unsigned int kZYRFileAttrHidden = 0x2;           ///< the entry is hidden
constexpr unsigned int kZYRFileAttrSystem = 0x4; ///< the entry belongs to the operating system

/// The callback of IZYRFileSys::enumDirectory, called on the enumerating thread.
class ZYRSTD_API IDirEnumCBProc {
public:
    virtual ~IDirEnumCBProc();
    /// `path` is the entry's full path; return false to stop the enumeration.
    virtual bool operator()(const ZYRStd::CZYRUniString& path, unsigned int attributes) = 0;
};

/// No reference count: the side that installed it owns it.
class ZYRSTD_API IZYRFileSys {
public:
    virtual ~IZYRFileSys();
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    /// Opens the file `name` with the stream access mode `mode`, through the host's
    /// procedures when `viaHost`. The stream comes with one reference for the caller.
    /// Failures throw ZYRStd::CZYRError.
    createFileStream(IZYRFileName* name, unsigned int mode, bool viaHost) = 0;
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    /// Creates and opens a new temporary file in `dir`, its name starting with `prefix`.
    createTmpFileStream(IZYRFileName* dir, const char16_t* prefix, unsigned int mode) = 0;
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRMemMapFStream>
    /// Maps `length` bytes of the file `name` from `offset` into memory.
    createMemMappedFileStream(IZYRFileName* name, unsigned int mode,
                              const unsigned long long& offset, unsigned int length) = 0;
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>
    /// A stream over memory: `buffer` of `capacity` bytes (borrowed, kept by the caller)
    /// or, when null, memory of its own that grows on writes.
    createMemStream(unsigned int mode, unsigned int capacity, void* buffer) = 0;
    /// Copies the file `from` to `to`; throws when `to` exists and `failIfExists` is set.
    virtual void copy(IZYRFileName* from, IZYRFileName* to, bool failIfExists) = 0;
    /// Deletes the file `name`; a failure throws unless `quiet`.
    virtual void remove(IZYRFileName* name, bool quiet) = 0;
    /// True when a file or directory `name` exists.
    virtual bool fileExists(IZYRFileName* name) = 0;
    /// Moves the file `from` to `to`; throws on failure.
    virtual void rename(IZYRFileName* from, IZYRFileName* to) = 0;
    /// True when both names reach the same file.
    virtual bool isSameFile(IZYRFileName* a, IZYRFileName* b) = 0;
    /// Creates the directory `name`; throws on failure.
    virtual void makeDirectory(IZYRFileName* name) = 0;
    /// Calls `cb` for each entry of `dir`; false when the directory cannot be read.
    virtual bool enumDirectory(IZYRFileName* dir, IDirEnumCBProc& cb) = 0;
    /// The directory for temporary files; borrowed from the file system.
    virtual const ZYRStd::CZYRUniString& getTempDirName() = 0;
    /// The directory of the download cache; borrowed from the file system.
    virtual const ZYRStd::CZYRUniString& getDLCacheDirName() = 0;
};

/// The low-level file under a file stream; the stream that made it owns it.
class ZYRSTD_API IFile {
public:
    virtual ~IFile();
    /// Opens the file by its stored path and access mode; throws on failure.
    virtual void open() = 0;
    /// Closes the file; nothing when it is not open.
    virtual void close() = 0;
    /// Moves the position; returns the new one.
    virtual unsigned long long setPos(const unsigned long long& pos) = 0;
    /// The position in bytes from the start.
    virtual unsigned long long getPos() = 0;
    /// Moves the position to the end of the file; returns it.
    virtual unsigned long long setEOF() = 0;
    /// Reads up to `bytes` bytes; returns the count read.
    virtual unsigned int read(void* buf, unsigned int bytes) = 0;
    /// Writes `bytes` bytes; returns the count written.
    virtual unsigned int write(const void* buf, unsigned int bytes) = 0;
    /// The size of the file in bytes.
    virtual unsigned long long getSize() = 0;
    /// The bytes the file can hold without growing.
    virtual unsigned long long getCapacity() = 0;
    /// Replaces the access-mode bits used by the next open.
    virtual void setAccessMode(unsigned int mode) = 0;
    /// The access-mode bits (ZYRStreams::kZYRStreamRead and the others).
    virtual unsigned int getAccessMode() = 0;
    /// The file's path; borrowed from this object.
    virtual const ZYRStd::CZYRUniString& getFilePath() = 0;
    /// Writes buffered data out.
    virtual void flush() = 0;
    /// Ends the file at the current position; true on success.
    virtual bool truncate() = 0;
    /// True when any of `bits` is in the access mode.
    virtual bool hasAccessMode(unsigned int bits) = 0;
    /// True while the file is open.
    virtual bool isOpen() = 0;
    /// Deletes the file.
    virtual void remove() = 0;
};

/// The library's file system: native files, and the host's procedures for files the host
/// names by its own paths when `record` is given. Null when it cannot be allocated.
[[nodiscard]] ZYRSTD_API IZYRFileSys*
createDefaultFileSystem(const ZYRStd::CZYRUniString& tempDir,
                        const ZYRStd::CZYRUniString& dlCacheDir,
                        ZYRPublic::_t_ZYRPDLFileSysRec* record);

} // namespace ZYRFileSys
