// The library's file system on POSIX: files, file streams, mapped file streams, and the
// file system that makes them. The original names (ZYRWinFileSys, IImpZYRFileSys_Windows)
// remain as aliases.
#pragma once

#include <memory>
#include <sys/types.h>

#include "IZYRFileSys.h"
#include "IZYRStream.h"
#include "ZYRPDLFileSysRec.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/io/IImpZYRMemStream.h"
#include "zyr/std/values/CZYRString.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRPosixFileSys {

using ZYRFileName::IZYRFileName;
using ZYRFileSys::CStreamAccess;
using ZYRFileSys::IFile;
using ZYRStd::CZYRSmartZYRRefPtr;

// A file through the POSIX calls. Failures raise kZYRErrorFileOpFailed.
class CFile : public ZYRStd::CZYRClientBase, public IFile {
public:
    CFile(const ZYRStd::CZYRUniString& path, unsigned int mode);
    CFile(const CFile&) = delete;
    CFile& operator=(const CFile&) = delete;
    ~CFile() override; // closes; errors are dropped

    void open() override;
    void close() override;
    unsigned long long setPos(const unsigned long long& pos) override;
    unsigned long long getPos() override;
    unsigned long long setEOF() override;
    unsigned int read(void* buf, unsigned int bytes) override;
    unsigned int write(const void* buf, unsigned int bytes) override;
    unsigned long long getSize() override;
    unsigned long long getCapacity() override { return ~0ull; }
    void setAccessMode(unsigned int mode) override { access_.setMode(mode); }
    unsigned int getAccessMode() override { return access_.mode(); }
    const ZYRStd::CZYRUniString& getFilePath() override { return path_; }
    void flush() override;
    bool truncate() override;
    bool hasAccessMode(unsigned int bits) override { return access_.has(bits); }
    bool isOpen() override { return fd_ >= 0; }
    void remove() override;

    // As open(), but a writable file also gets read access, which a shared writable
    // mapping needs.
    void openForMapping();
    int descriptor() const { return fd_; }
    void viewMapped() { ++mappedViewCount_; }
    void viewUnmapped() { --mappedViewCount_; }

private:
    void openWith(bool forMapping);

    int fd_ = -1;
    ZYRStd::CZYRUniString path_;
    ZYRStd::CZYRString nativePath_;
    CStreamAccess access_;
    unsigned int mappedViewCount_ = 0;
    // The file as opened, so that delete-on-close never unlinks another file that took
    // its name in the meantime.
    dev_t device_ = 0;
    ino_t inode_ = 0;
};

// A file stream over an owned IFile: a native file or one of the host's.
class IImpZYRFStream : public ZYRStreams::IZYRFStream,
                       public ZYRStd::CZYRClientBase,
                       private ZYRStd::CZYRPolicyNoCopy {
public:
    // Opens the file and, in append mode, moves to its end. Failures are dropped: isOpen
    // tells. `file` may be null (a host file that could not be made).
    IImpZYRFStream(std::unique_ptr<IFile> file, unsigned int mode);
    ~IImpZYRFStream() override;

    void reOpen(unsigned int mode) override;
    unsigned int read(void* buf, unsigned int size, unsigned int count,
                      ZYRPublic::eZYRErrorType& err) override;
    unsigned int read(void* buf, unsigned int size, unsigned int count) override;
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::eZYRErrorType& err) override;
    unsigned int write(const void* buf, unsigned int size, unsigned int count) override;
    unsigned long long setPos(const unsigned long long& pos) override;
    unsigned long long getPos() override;
    void setEOF() override;
    unsigned long long getEOF() override;
    unsigned long long getSize() override;
    unsigned long long getCapacity() override;
    unsigned int getAccessMode() override;

    bool isOpen() override;
    void close() override;
    void flush() override;
    const ZYRStd::CZYRUniString& getFilePath() override;
    bool truncate() override;
    void removeFile() override;

private:
    IFile& file(int line) const;

    std::unique_ptr<IFile> file_;
    unsigned int mode_; // answers getAccessMode when there is no file
};

// A file stream whose bytes are a shared mapping of the file, reached through an inner
// memory stream. The stream starts at the requested offset; the view itself starts at
// that offset rounded down to a page.
class IImpZYRMemMapFStream : public ZYRStreams::IZYRMemMapFStream,
                             public ZYRStd::CZYRClientBase,
                             private ZYRStd::CZYRPolicyNoCopy {
public:
    // Offset and length 0 map the whole file.
    IImpZYRMemMapFStream(const ZYRStd::CZYRUniString& path, unsigned int mode,
                         unsigned long long offset, unsigned int length);
    ~IImpZYRMemMapFStream() override;

    void reOpen(unsigned int mode) override;
    unsigned int read(void* buf, unsigned int size, unsigned int count,
                      ZYRPublic::eZYRErrorType& err) override;
    unsigned int read(void* buf, unsigned int size, unsigned int count) override;
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::eZYRErrorType& err) override;
    unsigned int write(const void* buf, unsigned int size, unsigned int count) override;
    unsigned long long setPos(const unsigned long long& pos) override;
    unsigned long long getPos() override;
    void setEOF() override;
    unsigned long long getEOF() override;
    unsigned long long getSize() override;
    unsigned long long getCapacity() override;
    unsigned int getAccessMode() override;

    bool isOpen() override { return isMapped(); }
    void close() override;
    void flush() override;
    const ZYRStd::CZYRUniString& getFilePath() override { return file_.getFilePath(); }
    bool truncate() override { return false; }
    void removeFile() override { file_.remove(); }

    bool isMapped() override { return view_ != nullptr; }
    void* getMapAttributes(unsigned long long& offset, unsigned int& length) override;

private:
    void map();
    void unmap();
    ZYRFileSys::IImpZYRMemStream& inner(int line) const;

    CFile file_;
    CZYRSmartZYRRefPtr<ZYRFileSys::IImpZYRMemStream> inner_;
    void* view_ = nullptr; // the page-aligned start of the mapping
    size_t viewLength_ = 0;
    unsigned long long offset_; // of the stream's first byte in the file
    unsigned int length_;       // of the stream; the file's size when mapped whole
};

// The file system. The host record, when given, serves the files named by host paths.
class IImpZYRFileSys_Posix : public ZYRFileSys::IZYRFileSys, public ZYRStd::CZYRClientBase {
public:
    // Creates each non-empty directory that does not exist yet (one level).
    IImpZYRFileSys_Posix(const ZYRStd::CZYRUniString& tempDir,
                         const ZYRStd::CZYRUniString& dlCacheDir,
                         ZYRPublic::_t_ZYRPDLFileSysRec* record);
    ~IImpZYRFileSys_Posix() override;

    CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    createFileStream(IZYRFileName* name, unsigned int mode, bool viaHost) override;
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    createTmpFileStream(IZYRFileName* dir, const char16_t* prefix, unsigned int mode) override;
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRMemMapFStream>
    createMemMappedFileStream(IZYRFileName* name, unsigned int mode,
                              const unsigned long long& offset, unsigned int length) override;
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>
    createMemStream(unsigned int mode, unsigned int capacity, void* buffer) override;
    void copy(IZYRFileName* from, IZYRFileName* to, bool failIfExists) override;
    void remove(IZYRFileName* name, bool quiet) override;
    bool fileExists(IZYRFileName* name) override;
    void rename(IZYRFileName* from, IZYRFileName* to) override;
    bool isSameFile(IZYRFileName* a, IZYRFileName* b) override;
    void makeDirectory(IZYRFileName* name) override;
    bool enumDirectory(IZYRFileName* dir, ZYRFileSys::IDirEnumCBProc& cb) override;
    const ZYRStd::CZYRUniString& getTempDirName() override { return tempDir_; }
    const ZYRStd::CZYRUniString& getDLCacheDirName() override { return dlCacheDir_; }

private:
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream> hostStream(void* diPath, unsigned int mode);

    ZYRStd::CZYRUniString tempDir_;
    ZYRStd::CZYRUniString dlCacheDir_;
    ZYRStd::CZYRString nativeTempDir_;
    ZYRStd::CZYRString nativeDLCacheDir_;
    ZYRPublic::_t_ZYRPDLFileSysRec* record_;
};

} // namespace ZYRPosixFileSys

namespace ZYRWinFileSys = ZYRPosixFileSys;

namespace ZYRPosixFileSys {
using IImpZYRFileSys_Windows = IImpZYRFileSys_Posix;
}
