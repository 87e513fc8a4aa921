// The library's file system on POSIX.
#include "zyr/std/ZYRFileSys_Posix.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <dirent.h>
#include <fcntl.h>
#include <new>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

#include "zyr/std/CZYRError.h"
#include "zyr/std/CZYRMemBuffer.h"
#include "zyr/std/ZYRFileSys_OEM.h"
#include "zyr/std/ZYRFileSys_helper.h"
#include "zyr/std/ZYRPosixIO.h"

namespace ZYRPosixFileSys {

using namespace ZYRStreams;
using ZYRFileSys::IImpZYRMemStream;
using ZYRFileSys::reportStreamError;
using ZYRFileSys::utf16ToUTF8;
using ZYRFileSys::widePathOf;
using ZYRStd::CZYRError;
using ZYRStd::CZYRString;
using ZYRStd::CZYRUniString;
using ZYRStd::CZYRWString;

namespace {

// The errors keep the name their clients have always seen.
constexpr const char* kSource = "source/zyr/std/ZYRFileSys_Windows";

[[noreturn]] void raise(const char* message, int line) {
    throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, message, kSource, line);
}

// The error rule of the system calls: a failure whose cause is "already exists" counts as
// success where that was the goal; every other failure raises.
void checkCall(bool ok, const char* message, int line, bool existsIsSuccess = false) {
    if (ok || (existsIsSuccess && errno == EEXIST))
        return;
    raise(message, line);
}

// fsync of a pipe, a terminal or a read-only file system has nothing to flush.
bool syncFile(int fd) {
    return ::fsync(fd) == 0 || errno == EINVAL || errno == EROFS;
}

// Owns a descriptor.
class Descriptor {
public:
    explicit Descriptor(int fd = -1) noexcept : fd_(fd) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    ~Descriptor() {
        if (fd_ >= 0)
            ::close(fd_);
    }
    int get() const noexcept { return fd_; }
    int release() noexcept { return std::exchange(fd_, -1); }
    // Closes now and reports whether the close worked.
    bool close() noexcept {
        const int fd = fd_;
        fd_ = -1;
        return fd < 0 || ::close(fd) == 0;
    }

private:
    int fd_;
};

struct DirCloser {
    void operator()(DIR* dir) const noexcept { ::closedir(dir); }
};

int openRetrying(const char* path, int flags, mode_t mode = 0) {
    int fd;
    do {
        fd = ::open(path, flags, mode);
    } while (fd < 0 && errno == EINTR);
    return fd;
}

bool writeAll(int fd, const unsigned char* p, size_t n) {
    const ZYRStd::posixio::Transfer t = ZYRStd::posixio::writeFully(fd, p, n);
    if (t.error != 0)
        errno = t.error;
    return t.error == 0;
}

CZYRString nativePathOf(IZYRFileName* name) {
    return utf16ToUTF8(widePathOf(name));
}

// The system's temporary directory, for temporary files when no directory is named.
CZYRString systemTempDir() {
    const char* dir = std::getenv("TMPDIR");
    return CZYRString(dir && *dir ? dir : "/tmp");
}

// One level: the parent must exist.
void prepareDirectory(const CZYRUniString& dir, const char* tooLong, int line) {
    const CZYRWString wide = ZYRStd::UniStringToWString(dir);
    if (wide.length() >= 246)
        throw CZYRError(ZYRPublic::kZYRErrorLimitCheck, tooLong, kSource, line);
    if (wide.empty())
        return;
    const CZYRString path = utf16ToUTF8(wide);
    struct stat st;
    if (::stat(path.c_str(), &st) == 0)
        return;
    checkCall(::mkdir(path.c_str(), 0777) == 0, "Directory create failed", __LINE__, true);
}

} // namespace

// ---- CFile ---------------------------------------------------------------------------------

CFile::CFile(const CZYRUniString& path, unsigned int mode)
    : path_(path), nativePath_(ZYRFileSys::nativePathOf(path)), access_(mode) {}

CFile::~CFile() {
    try {
        close();
    } catch (...) {
        // A destructor has no one to report to.
    }
}

void CFile::open() {
    openWith(false);
}

void CFile::openForMapping() {
    openWith(true);
}

void CFile::openWith(bool forMapping) {
    if (isOpen()) {
        try {
            close();
        } catch (const CZYRError&) {
            // The old handle is gone either way; the new open decides.
        }
    }
    if (nativePath_.empty()) {
        errno = ENOENT;
        raise("error opening file", __LINE__);
    }
    const bool readable = access_.isReadable() || (forMapping && access_.isWritable());
    const bool writable = access_.isWritable();
    int flags = O_CLOEXEC;
    flags |= writable ? (readable ? O_RDWR : O_WRONLY) : O_RDONLY;
    if (writable) {
        // Truncate or write only: created anew; read-write or append: created if missing.
        flags |= O_CREAT;
        if (access_.has(kZYRStreamTruncate) ||
            !(access_.isReadable() || access_.has(kZYRStreamAppend)))
            flags |= O_TRUNC;
    }
    if (access_.has(kZYRStreamWriteThrough))
        flags |= O_DSYNC;
    // kZYRStreamNoBuffering is not O_DIRECT: that would make every unaligned transfer fail.
    Descriptor fd(openRetrying(nativePath_.c_str(), flags, 0666));
    checkCall(fd.get() >= 0, "error opening file", __LINE__);
    struct stat st;
    checkCall(::fstat(fd.get(), &st) == 0, "error opening file", __LINE__);
    if (S_ISDIR(st.st_mode)) {
        errno = EISDIR;
        raise("error opening file", __LINE__);
    }
    if (access_.has(kZYRStreamRandomAccess))
        ::posix_fadvise(fd.get(), 0, 0, POSIX_FADV_RANDOM);
    if (access_.has(kZYRStreamSequentialScan))
        ::posix_fadvise(fd.get(), 0, 0, POSIX_FADV_SEQUENTIAL);
    device_ = st.st_dev;
    inode_ = st.st_ino;
    fd_ = fd.release();
}

void CFile::close() {
    if (!isOpen())
        return;
    const bool flushFirst = !access_.has(kZYRStreamDeleteOnClose) && mappedViewCount_ == 0 &&
                            access_.isWritable() &&
                            !access_.has(kZYRStreamNoBuffering | kZYRStreamNoFlushOnClose);
    const bool flushed = !flushFirst || syncFile(fd_);
    const int flushError = errno;
    const int fd = fd_;
    fd_ = -1;
    const bool closed = ::close(fd) == 0;
    const int closeError = errno;
    if (access_.has(kZYRStreamDeleteOnClose)) {
        struct stat st;
        if (::stat(nativePath_.c_str(), &st) == 0 && st.st_dev == device_ && st.st_ino == inode_)
            ::unlink(nativePath_.c_str());
    }
    if (!flushed) {
        errno = flushError;
        raise("error flushing file", __LINE__);
    }
    if (!closed) {
        errno = closeError;
        raise("error closing file", __LINE__);
    }
}

unsigned long long CFile::setPos(const unsigned long long& pos) {
    const off_t at = ::lseek(fd_, static_cast<off_t>(pos), SEEK_SET);
    checkCall(at >= 0, "error seeking in file", __LINE__);
    return static_cast<unsigned long long>(at);
}

unsigned long long CFile::getPos() {
    const off_t at = ::lseek(fd_, 0, SEEK_CUR);
    checkCall(at >= 0, "error seeking in file", __LINE__);
    return static_cast<unsigned long long>(at);
}

unsigned long long CFile::setEOF() {
    const off_t at = ::lseek(fd_, 0, SEEK_END);
    checkCall(at >= 0, "error seeking in file", __LINE__);
    return static_cast<unsigned long long>(at);
}

unsigned int CFile::read(void* buf, unsigned int bytes) {
    // A short read is the end of the file, so keep going until it says so.
    const ZYRStd::posixio::Transfer t = ZYRStd::posixio::readFully(fd_, buf, bytes);
    if (t.error != 0) {
        errno = t.error;
        raise("error reading from file", __LINE__);
    }
    return static_cast<unsigned int>(t.done);
}

unsigned int CFile::write(const void* buf, unsigned int bytes) {
    checkCall(writeAll(fd_, static_cast<const unsigned char*>(buf), bytes), "error writing to file",
              __LINE__);
    return bytes;
}

unsigned long long CFile::getSize() {
    struct stat st;
    checkCall(::fstat(fd_, &st) == 0, "error setting EOF", __LINE__);
    return static_cast<unsigned long long>(st.st_size);
}

void CFile::flush() {
    checkCall(fd_ >= 0 ? syncFile(fd_) : (errno = EBADF, false), "error flushing file", __LINE__);
}

bool CFile::truncate() {
    const off_t at = ::lseek(fd_, 0, SEEK_CUR);
    return at >= 0 && ::ftruncate(fd_, at) == 0;
}

void CFile::remove() {
    checkCall(!nativePath_.empty() && ::unlink(nativePath_.c_str()) == 0, "File delete failed",
              __LINE__);
}

// ---- IImpZYRFStream ------------------------------------------------------------------------

IImpZYRFStream::IImpZYRFStream(std::unique_ptr<IFile> file, unsigned int mode)
    : file_(std::move(file)), mode_(mode) {
    if (!file_)
        return;
    try {
        file_->open();
        if (file_->hasAccessMode(kZYRStreamAppend))
            file_->setEOF();
    } catch (const CZYRError&) {
        // Whether the file opened is what isOpen reports.
    }
}

IImpZYRFStream::~IImpZYRFStream() = default;

IFile& IImpZYRFStream::file(int line) const {
    if (!file_)
        throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, "file stm not open", kSource, line);
    return *file_;
}

void IImpZYRFStream::reOpen(unsigned int mode) {
    IFile& f = file(__LINE__);
    f.close();
    f.setAccessMode(mode);
    mode_ = mode;
    f.open();
}

unsigned int IImpZYRFStream::read(void* buf, unsigned int size, unsigned int count,
                                  ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return read(buf, size, count); });
}

unsigned int IImpZYRFStream::read(void* buf, unsigned int size, unsigned int count) {
    if (!(getAccessMode() & kZYRStreamRead))
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not readable", kSource,
                        __LINE__);
    return file(__LINE__).read(buf, size * count);
}

unsigned int IImpZYRFStream::write(const void* buf, unsigned int size, unsigned int count,
                                   ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return write(buf, size, count); });
}

unsigned int IImpZYRFStream::write(const void* buf, unsigned int size, unsigned int count) {
    if (!(getAccessMode() & (kZYRStreamWrite | kZYRStreamAppend)))
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not writable", kSource,
                        __LINE__);
    return file(__LINE__).write(buf, size * count);
}

unsigned long long IImpZYRFStream::setPos(const unsigned long long& pos) {
    return file(__LINE__).setPos(pos);
}

unsigned long long IImpZYRFStream::getPos() {
    return file(__LINE__).getPos();
}

void IImpZYRFStream::setEOF() {
    file(__LINE__).setEOF();
}

unsigned long long IImpZYRFStream::getEOF() {
    return getSize();
}

unsigned long long IImpZYRFStream::getSize() {
    return file(__LINE__).getSize();
}

unsigned long long IImpZYRFStream::getCapacity() {
    return file(__LINE__).getCapacity();
}

unsigned int IImpZYRFStream::getAccessMode() {
    return file_ ? file_->getAccessMode() : mode_;
}

bool IImpZYRFStream::isOpen() {
    return file_ && file_->isOpen();
}

void IImpZYRFStream::close() {
    if (file_)
        file_->close();
}

void IImpZYRFStream::flush() {
    file(__LINE__).flush();
}

const CZYRUniString& IImpZYRFStream::getFilePath() {
    static const CZYRUniString none;
    return file_ ? file_->getFilePath() : none;
}

bool IImpZYRFStream::truncate() {
    return file_ && file_->truncate();
}

void IImpZYRFStream::removeFile() {
    file(__LINE__).remove();
}

// ---- IImpZYRMemMapFStream ------------------------------------------------------------------

IImpZYRMemMapFStream::IImpZYRMemMapFStream(const CZYRUniString& path, unsigned int mode,
                                           unsigned long long offset, unsigned int length)
    : file_(path, mode), offset_(offset), length_(length) {
    map();
}

IImpZYRMemMapFStream::~IImpZYRMemMapFStream() {
    try {
        unmap();
    } catch (...) {
        // A destructor has no one to report to; the file closes with file_.
    }
}

void IImpZYRMemMapFStream::map() {
    file_.openForMapping();
    try {
        const unsigned long long fileSize = file_.getSize();
        unsigned long long length = length_;
        if (offset_ == 0 && length_ == 0) {
            if (fileSize == 0)
                raise("Error mapping empty file", __LINE__);
            // The inner memory stream is 32-bit.
            if (fileSize > 0xFFFFFFFFull) {
                errno = EFBIG;
                raise("error mapping view of file", __LINE__);
            }
            length = fileSize;
        }
        const auto page = static_cast<unsigned long long>(::sysconf(_SC_PAGESIZE));
        const unsigned long long start = offset_ - offset_ % page;
        const unsigned long long viewLength = length + (offset_ - start);
        if (length == 0 || offset_ > ~0ull - length ||
            start > static_cast<unsigned long long>(INT64_MAX)) {
            errno = EINVAL;
            raise("error mapping view of file", __LINE__);
        }
        const unsigned long long viewEnd = start + viewLength;
        const bool writable = file_.hasAccessMode(kZYRStreamWrite | kZYRStreamAppend);
        if (fileSize < viewEnd) {
            // A read-only view past the end would fault on first touch, so refuse it; a
            // writable file grows to cover the view.
            if (!writable) {
                errno = EINVAL;
                raise("error mapping view of file", __LINE__);
            }
            checkCall(::ftruncate(file_.descriptor(), static_cast<off_t>(viewEnd)) == 0,
                      "error mapping view of file", __LINE__);
        }
        const int protection = writable ? PROT_READ | PROT_WRITE : PROT_READ;
        void* view = ::mmap(nullptr, static_cast<size_t>(viewLength), protection, MAP_SHARED,
                            file_.descriptor(), static_cast<off_t>(start));
        checkCall(view != MAP_FAILED, "error mapping view of file", __LINE__);
        view_ = view;
        viewLength_ = static_cast<size_t>(viewLength);
        file_.viewMapped();
        length_ = static_cast<unsigned int>(length);
        inner_ = CZYRSmartZYRRefPtr<IImpZYRMemStream>(new IImpZYRMemStream(
            file_.getAccessMode(), length_, static_cast<unsigned char*>(view) + (offset_ - start)));
    } catch (...) {
        try {
            unmap();
            file_.close();
        } catch (...) {
            // The mapping failure is the error worth reporting.
        }
        throw;
    }
}

void IImpZYRMemMapFStream::unmap() {
    inner_.reset();
    if (!view_)
        return;
    void* view = view_;
    view_ = nullptr;
    file_.viewUnmapped();
    checkCall(::munmap(view, viewLength_) == 0, "error unmapping view of file", __LINE__);
}

ZYRFileSys::IImpZYRMemStream& IImpZYRMemMapFStream::inner(int line) const {
    if (!inner_)
        raise("file stm not mapped", line);
    return *inner_;
}

void IImpZYRMemMapFStream::reOpen(unsigned int mode) {
    unmap();
    file_.close();
    file_.setAccessMode(mode);
    map();
}

unsigned int IImpZYRMemMapFStream::read(void* buf, unsigned int size, unsigned int count,
                                        ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return read(buf, size, count); });
}

unsigned int IImpZYRMemMapFStream::read(void* buf, unsigned int size, unsigned int count) {
    return inner(__LINE__).read(buf, size, count);
}

unsigned int IImpZYRMemMapFStream::write(const void* buf, unsigned int size, unsigned int count,
                                         ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return write(buf, size, count); });
}

unsigned int IImpZYRMemMapFStream::write(const void* buf, unsigned int size, unsigned int count) {
    return inner(__LINE__).write(buf, size, count);
}

unsigned long long IImpZYRMemMapFStream::setPos(const unsigned long long& pos) {
    return inner(__LINE__).setPos(pos);
}

unsigned long long IImpZYRMemMapFStream::getPos() {
    return inner(__LINE__).getPos();
}

void IImpZYRMemMapFStream::setEOF() {
    inner(__LINE__).setEOF();
}

unsigned long long IImpZYRMemMapFStream::getEOF() {
    return inner(__LINE__).getEOF();
}

unsigned long long IImpZYRMemMapFStream::getSize() {
    if (!inner_)
        return 0;
    const unsigned long long fileSize = file_.getSize();
    const unsigned long long inFile = fileSize > offset_ ? fileSize - offset_ : 0;
    const unsigned long long size = inner_->getSize();
    return inFile < size ? inFile : size;
}

unsigned long long IImpZYRMemMapFStream::getCapacity() {
    return inner_ ? inner_->getCapacity() : 0;
}

unsigned int IImpZYRMemMapFStream::getAccessMode() {
    return inner_ ? inner_->getAccessMode() : 0;
}

void IImpZYRMemMapFStream::close() {
    unmap();
    file_.close();
}

void IImpZYRMemMapFStream::flush() {
    if (view_)
        checkCall(::msync(view_, viewLength_, MS_SYNC) == 0, "error flushing file", __LINE__);
}

void* IImpZYRMemMapFStream::getMapAttributes(unsigned long long& offset, unsigned int& length) {
    if (!inner_) {
        offset = 0;
        length = 0;
        return nullptr;
    }
    offset = offset_;
    length = length_;
    return inner_->data();
}

// ---- IImpZYRFileSys_Posix ------------------------------------------------------------------

IImpZYRFileSys_Posix::IImpZYRFileSys_Posix(const CZYRUniString& tempDir,
                                           const CZYRUniString& dlCacheDir,
                                           ZYRPublic::_t_ZYRPDLFileSysRec* record)
    : tempDir_(tempDir), dlCacheDir_(dlCacheDir), record_(record) {
    prepareDirectory(tempDir_, "temp dir filename too long", __LINE__);
    prepareDirectory(dlCacheDir_, "DL Cache dir filename too long", __LINE__);
    nativeTempDir_ = ZYRFileSys::nativePathOf(tempDir_);
    nativeDLCacheDir_ = ZYRFileSys::nativePathOf(dlCacheDir_);
}

IImpZYRFileSys_Posix::~IImpZYRFileSys_Posix() = default;

CZYRSmartZYRRefPtr<IZYRFStream> IImpZYRFileSys_Posix::hostStream(void* diPath, unsigned int mode) {
    std::unique_ptr<IFile> file;
    try {
        file = ZYROEMFileSys::CFile::create(diPath, mode, record_);
    } catch (const CZYRError&) {
        // A stream without a file: isOpen is false and every transfer fails.
    }
    return CZYRSmartZYRRefPtr<IZYRFStream>(new IImpZYRFStream(std::move(file), mode));
}

CZYRSmartZYRRefPtr<IZYRFStream>
IImpZYRFileSys_Posix::createFileStream(IZYRFileName* name, unsigned int mode, bool viaHost) {
    const CZYRWString path = widePathOf(name);
    if (viaHost && record_) {
        void* diPath = nullptr;
        if (record_->wPathToDIPath)
            diPath = record_->wPathToDIPath(path.c_str(), 0);
        else if (record_->pathToDIPath)
            diPath = record_->pathToDIPath(utf16ToUTF8(path).c_str(), 0);
        else
            raise("pathFromDIPath not implemented", __LINE__);
        if (!diPath)
            return {};
        return hostStream(diPath, mode);
    }
    std::unique_ptr<IFile> file(new CFile(CZYRUniString(path.c_str()), mode));
    return CZYRSmartZYRRefPtr<IZYRFStream>(new IImpZYRFStream(std::move(file), mode));
}

CZYRSmartZYRRefPtr<IZYRFStream> IImpZYRFileSys_Posix::createTmpFileStream(IZYRFileName* dir,
                                                                          const char16_t* prefix,
                                                                          unsigned int mode) {
    CZYRString dirPath = nativePathOf(dir);
    if (record_) {
        if (!record_->tempFile)
            throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "tempFile proc not defined",
                            kSource, __LINE__);
        void* diPath = record_->tempFile(dirPath.c_str());
        if (!diPath)
            return {};
        return hostStream(diPath, mode);
    }
    if (dirPath.empty())
        dirPath = nativeTempDir_.empty() ? systemTempDir() : nativeTempDir_;
    // As GetTempFileName did: at most three characters of the prefix.
    unsigned int prefixLength = 0;
    while (prefix && prefixLength < 3 && prefix[prefixLength])
        ++prefixLength;
    CZYRString pattern = dirPath;
    if (pattern.str().back() != '/')
        pattern += "/";
    if (prefixLength)
        pattern += utf16ToUTF8(prefix, prefixLength);
    pattern += "XXXXXX.TMP";
    Descriptor fd(::mkostemps(pattern.str().data(), 4, O_CLOEXEC));
    checkCall(fd.get() >= 0, "File rename failed", __LINE__);
    fd.close();
    const CZYRUniString path(pattern.c_str(), pattern.length(), "UTF-8");
    std::unique_ptr<IFile> file(new CFile(path, mode));
    return CZYRSmartZYRRefPtr<IZYRFStream>(new IImpZYRFStream(std::move(file), mode));
}

CZYRSmartZYRRefPtr<IZYRMemMapFStream> IImpZYRFileSys_Posix::createMemMappedFileStream(
    IZYRFileName* name, unsigned int mode, const unsigned long long& offset, unsigned int length) {
    const CZYRWString path = widePathOf(name);
    return CZYRSmartZYRRefPtr<IZYRMemMapFStream>(
        new IImpZYRMemMapFStream(CZYRUniString(path.c_str()), mode, offset, length));
}

CZYRSmartZYRRefPtr<IZYRStream>
IImpZYRFileSys_Posix::createMemStream(unsigned int mode, unsigned int capacity, void* buffer) {
    return CZYRSmartZYRRefPtr<IZYRStream>(new IImpZYRMemStream(mode, capacity, buffer));
}

void IImpZYRFileSys_Posix::copy(IZYRFileName* from, IZYRFileName* to, bool failIfExists) {
    const CZYRString source = nativePathOf(from);
    const CZYRString target = nativePathOf(to);
    if (source.empty() || target.empty())
        return;
    Descriptor in(openRetrying(source.c_str(), O_RDONLY | O_CLOEXEC));
    checkCall(in.get() >= 0, "File copy failed", __LINE__);
    struct stat sourceStat;
    checkCall(::fstat(in.get(), &sourceStat) == 0, "File copy failed", __LINE__);
    if (S_ISDIR(sourceStat.st_mode)) {
        errno = EISDIR;
        raise("File copy failed", __LINE__);
    }
    // Truncating the target would destroy a source that is the same file.
    struct stat targetStat;
    if (::stat(target.c_str(), &targetStat) == 0 && targetStat.st_dev == sourceStat.st_dev &&
        targetStat.st_ino == sourceStat.st_ino) {
        errno = EINVAL;
        raise("File copy failed", __LINE__);
    }
    const int flags = O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | (failIfExists ? O_EXCL : 0);
    Descriptor out(openRetrying(target.c_str(), flags, sourceStat.st_mode & 0777));
    // An existing target with failIfExists is a failure, not "already exists" success.
    checkCall(out.get() >= 0, "File copy failed", __LINE__);

    ZYRStd::CZYRMemBuffer<unsigned char> chunk;
    chunk.grow(256 * 1024);
    bool ok = true;
    for (;;) {
        const ssize_t got = ::read(in.get(), chunk.data(), chunk.count());
        if (got < 0 && errno == EINTR)
            continue;
        if (got <= 0) {
            ok = got == 0;
            break;
        }
        if (!writeAll(out.get(), chunk.data(), static_cast<size_t>(got))) {
            ok = false;
            break;
        }
    }
    ok = out.close() && ok;
    if (!ok) {
        const int error = errno;
        ::unlink(target.c_str()); // no half-copied file is left behind
        errno = error;
        raise("File copy failed", __LINE__);
    }
}

void IImpZYRFileSys_Posix::remove(IZYRFileName* name, bool quiet) {
    const CZYRString path = nativePathOf(name);
    if (path.empty())
        return;
    if (::unlink(path.c_str()) != 0 && !quiet)
        raise("File delete failed", __LINE__);
}

bool IImpZYRFileSys_Posix::fileExists(IZYRFileName* name) {
    const CZYRString path = nativePathOf(name);
    struct stat st;
    return !path.empty() && ::stat(path.c_str(), &st) == 0;
}

void IImpZYRFileSys_Posix::rename(IZYRFileName* from, IZYRFileName* to) {
    const CZYRString source = nativePathOf(from);
    const CZYRString target = nativePathOf(to);
    if (source.empty() || target.empty())
        return;
    // An existing target is not replaced, and that is a failure.
    int result = ::renameat2(AT_FDCWD, source.c_str(), AT_FDCWD, target.c_str(), RENAME_NOREPLACE);
    if (result != 0 && (errno == EINVAL || errno == ENOSYS)) {
        // The file system cannot refuse atomically; check first.
        struct stat st;
        if (::lstat(target.c_str(), &st) == 0)
            errno = EEXIST;
        else
            result = ::rename(source.c_str(), target.c_str());
    }
    checkCall(result == 0, "File rename failed", __LINE__);
}

bool IImpZYRFileSys_Posix::isSameFile(IZYRFileName* a, IZYRFileName* b) {
    // The texts alone: no normalisation of relative parts or links.
    return widePathOf(a) == widePathOf(b);
}

void IImpZYRFileSys_Posix::makeDirectory(IZYRFileName* name) {
    const CZYRString path = nativePathOf(name);
    if (path.empty()) {
        errno = ENOENT;
        raise("Directory create failed empty filename", __LINE__);
    }
    struct stat st;
    if (::stat(path.c_str(), &st) == 0)
        return;
    checkCall(::mkdir(path.c_str(), 0777) == 0, "Directory create failed", __LINE__, true);
}

bool IImpZYRFileSys_Posix::enumDirectory(IZYRFileName* dir, ZYRFileSys::IDirEnumCBProc& cb) {
    CZYRString path = nativePathOf(dir);
    if (path.empty()) {
        errno = ENOENT;
        raise("Directory create failed empty filename", __LINE__);
    }
    if (path.str().back() != '/')
        path += "/";
    std::unique_ptr<DIR, DirCloser> stream(::opendir(path.c_str()));
    if (!stream) {
        if (errno == 0 || errno == EEXIST)
            return true;
        raise("Directory enum failed", __LINE__);
    }
    bool result = true;
    for (;;) {
        errno = 0;
        const dirent* entry = ::readdir(stream.get());
        if (!entry) {
            checkCall(errno == 0, "Directory enum failed", __LINE__);
            break;
        }
        const char* name = entry->d_name;
        // Only the two navigation entries: "..." is an ordinary name here.
        if (name[0] == '.' && (name[1] == '\0' || (name[1] == '.' && name[2] == '\0')))
            continue;
        unsigned int attributes = 0;
        struct stat st;
        if (::fstatat(::dirfd(stream.get()), name, &st, 0) == 0 ||
            ::fstatat(::dirfd(stream.get()), name, &st, AT_SYMLINK_NOFOLLOW) == 0) {
            if (S_ISDIR(st.st_mode))
                attributes |= ZYRFileSys::kZYRFileAttrDirectory;
            if ((st.st_mode & 0222) == 0)
                attributes |= ZYRFileSys::kZYRFileAttrReadOnly;
        }
        if (name[0] == '.')
            attributes |= ZYRFileSys::kZYRFileAttrHidden;
        CZYRString full = path;
        full += name;
        result = cb(CZYRUniString(full.c_str(), full.length(), "UTF-8"), attributes);
        if (!result)
            break;
    }
    return result;
}

} // namespace ZYRPosixFileSys

namespace ZYRFileSys {

IZYRFileSys* createDefaultFileSystem(const ZYRStd::CZYRUniString& tempDir,
                                     const ZYRStd::CZYRUniString& dlCacheDir,
                                     ZYRPublic::_t_ZYRPDLFileSysRec* record) {
    try {
        return new ZYRPosixFileSys::IImpZYRFileSys_Posix(tempDir, dlCacheDir, record);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

} // namespace ZYRFileSys
