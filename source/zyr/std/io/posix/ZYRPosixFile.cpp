// Files on POSIX: a descriptor with the access rules of the library's files.
#include "zyr/std/io/posix/ZYRPosixSupport.h"

namespace ZYRPosixFileSys {

using namespace detail;

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

} // namespace ZYRPosixFileSys
