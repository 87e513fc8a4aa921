// The file system: the interface every file access goes through, the directory
// enumeration callback and the low-level file under every file stream.
#pragma once

#include "CZYRBaseRefCnt.h"
#include "IZYRFileName.h"
#include "IZYRStream.h"
#include "ZYRPDLFileSysRec.h"
#include "ZYRStdExport.h"

namespace ZYRFileSys {

using ZYRFileName::IZYRFileName;
using ZYRStd::CZYRSmartZYRRefPtr;

// Attribute bits given to an enumeration callback; a plain file has 0.
constexpr unsigned int kZYRFileAttrDirectory = 0x10000000;
constexpr unsigned int kZYRFileAttrReadOnly = 0x1;
constexpr unsigned int kZYRFileAttrHidden = 0x2;
constexpr unsigned int kZYRFileAttrSystem = 0x4;

class ZYRSTD_API IDirEnumCBProc {
public:
    virtual ~IDirEnumCBProc();
    // `path` is the entry's full path; return false to stop the enumeration.
    virtual bool operator()(const ZYRStd::CZYRUniString& path, unsigned int attributes) = 0;
};

// No reference count: the side that installed it owns it.
class ZYRSTD_API IZYRFileSys {
public:
    virtual ~IZYRFileSys();
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    createFileStream(IZYRFileName* name, unsigned int mode, bool viaHost) = 0;
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    createTmpFileStream(IZYRFileName* dir, const char16_t* prefix, unsigned int mode) = 0;
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRMemMapFStream>
    createMemMappedFileStream(IZYRFileName* name, unsigned int mode,
                              const unsigned long long& offset, unsigned int length) = 0;
    virtual CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>
    createMemStream(unsigned int mode, unsigned int capacity, void* buffer) = 0;
    virtual void copy(IZYRFileName* from, IZYRFileName* to, bool failIfExists) = 0;
    virtual void remove(IZYRFileName* name, bool quiet) = 0;
    virtual bool fileExists(IZYRFileName* name) = 0;
    virtual void rename(IZYRFileName* from, IZYRFileName* to) = 0;
    virtual bool isSameFile(IZYRFileName* a, IZYRFileName* b) = 0;
    virtual void makeDirectory(IZYRFileName* name) = 0;
    virtual bool enumDirectory(IZYRFileName* dir, IDirEnumCBProc& cb) = 0;
    virtual const ZYRStd::CZYRUniString& getTempDirName() = 0;
    virtual const ZYRStd::CZYRUniString& getDLCacheDirName() = 0;
};

// The low-level file under a file stream; the stream that made it owns it.
class ZYRSTD_API IFile {
public:
    virtual ~IFile();
    virtual void open() = 0;
    virtual void close() = 0;
    virtual unsigned long long setPos(const unsigned long long& pos) = 0;
    virtual unsigned long long getPos() = 0;
    virtual unsigned long long setEOF() = 0;
    virtual unsigned int read(void* buf, unsigned int bytes) = 0;
    virtual unsigned int write(const void* buf, unsigned int bytes) = 0;
    virtual unsigned long long getSize() = 0;
    virtual unsigned long long getCapacity() = 0;
    virtual void setAccessMode(unsigned int mode) = 0;
    virtual unsigned int getAccessMode() = 0;
    virtual const ZYRStd::CZYRUniString& getFilePath() = 0;
    virtual void flush() = 0;
    virtual bool truncate() = 0;
    virtual bool hasAccessMode(unsigned int bits) = 0;
    virtual bool isOpen() = 0;
    virtual void remove() = 0;
};

// The library's file system: native files, and the host's procedures for files the host
// names by its own paths when `record` is given. Null when it cannot be allocated.
[[nodiscard]] ZYRSTD_API IZYRFileSys*
createDefaultFileSystem(const ZYRStd::CZYRUniString& tempDir,
                        const ZYRStd::CZYRUniString& dlCacheDir,
                        ZYRPublic::_t_ZYRPDLFileSysRec* record);

} // namespace ZYRFileSys
