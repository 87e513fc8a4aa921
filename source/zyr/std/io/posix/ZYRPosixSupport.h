// What the POSIX file system's sources share: the error rule of the system calls, an owned
// descriptor, and the path and directory helpers. Internal to those sources.
#pragma once

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

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/internal/ZYRFileSys_OEM.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/io/posix/ZYRFileSys_Posix.h"
#include "zyr/std/io/posix/ZYRPosixIO.h"
#include "zyr/std/memory/CZYRMemBuffer.h"

namespace ZYRPosixFileSys {

using namespace ZYRStreams;
using ZYRFileSys::IImpZYRMemStream;
using ZYRFileSys::reportStreamError;
using ZYRFileSys::uniPathOf;
using ZYRFileSys::utf16ToUTF8;
using ZYRFileSys::widePathOf;
using ZYRStd::CZYRError;
using ZYRStd::CZYRString;
using ZYRStd::CZYRUniString;
using ZYRStd::CZYRWString;

namespace detail {

// The errors keep the name their clients have always seen.
inline constexpr const char* kSource = "source/zyr/std/ZYRFileSys_Windows";

[[noreturn]] inline void raise(const char* message, int line) {
    throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, message, kSource, line);
}

// The error rule of the system calls: a failure whose cause is "already exists" counts as
// success where that was the goal; every other failure raises.
inline void checkCall(bool ok, const char* message, int line, bool existsIsSuccess = false) {
    if (ok || (existsIsSuccess && errno == EEXIST))
        return;
    raise(message, line);
}

// fsync of a pipe, a terminal or a read-only file system has nothing to flush.
inline bool syncFile(int fd) {
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

inline int openRetrying(const char* path, int flags, mode_t mode = 0) {
    int fd;
    do {
        fd = ::open(path, flags, mode);
    } while (fd < 0 && errno == EINTR);
    return fd;
}

inline bool writeAll(int fd, const unsigned char* p, size_t n) {
    const ZYRStd::posixio::Transfer t = ZYRStd::posixio::writeFully(fd, p, n);
    if (t.error != 0)
        errno = t.error;
    return t.error == 0;
}

inline CZYRString nativePathOf(IZYRFileName* name) {
    return utf16ToUTF8(widePathOf(name));
}

// The system's temporary directory, for temporary files when no directory is named.
inline CZYRString systemTempDir() {
    const char* dir = std::getenv("TMPDIR");
    return CZYRString(dir && *dir ? dir : "/tmp");
}

// One level: the parent must exist.
inline void prepareDirectory(const CZYRUniString& dir, const char* tooLong, int line) {
    const CZYRWString wide = ZYRFileSys::pathUnitsOf(dir);
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

} // namespace detail
} // namespace ZYRPosixFileSys
