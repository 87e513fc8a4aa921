// The host file-procedure record over POSIX calls.
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ZYRHostKit.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/io/posix/ZYRPosixIO.h"

namespace ZYRHostKit {

namespace {

// The host's open-file token.
struct HostFile {
    int fd;
};

int descriptorOf(void* handle) {
    return handle ? static_cast<HostFile*>(handle)->fd : -1;
}

char* copyText(const char* text, size_t length) {
    auto* copy = static_cast<char*>(std::malloc(length + 1));
    if (copy) {
        std::memcpy(copy, text, length);
        copy[length] = '\0';
    }
    return copy;
}

int hostClose(void* handle) {
    if (!handle)
        return -1;
    const int result = ::close(descriptorOf(handle));
    delete static_cast<HostFile*>(handle);
    return result == 0 ? 0 : -1;
}

int hostFlush(void* handle) {
    const int fd = descriptorOf(handle);
    return fd >= 0 && (::fsync(fd) == 0 || errno == EINVAL || errno == EROFS) ? 0 : -1;
}

size_t hostRead(void* buffer, size_t size, size_t count, void* handle, int* errorOut) {
    const ZYRStd::posixio::Transfer t =
        ZYRStd::posixio::readFully(descriptorOf(handle), buffer, size * count);
    *errorOut = t.error;
    return t.done;
}

size_t hostWrite(const void* buffer, size_t size, size_t count, void* handle, int* errorOut) {
    const ZYRStd::posixio::Transfer t =
        ZYRStd::posixio::writeFully(descriptorOf(handle), buffer, size * count);
    *errorOut = t.error;
    return t.done;
}

int hostRemove(void* diPath) {
    return diPath && ::unlink(static_cast<const char*>(diPath)) == 0 ? 0 : -1;
}

void* hostTempFile(const char* dirPath) {
    const char* tmp = std::getenv("TMPDIR");
    const char* dir = dirPath && *dirPath ? dirPath : (tmp && *tmp ? tmp : "/tmp");
    const size_t dirLength = std::strlen(dir);
    const char* leaf = dir[dirLength - 1] == '/' ? "zyrXXXXXX" : "/zyrXXXXXX";
    const size_t leafLength = std::strlen(leaf);
    char* path = static_cast<char*>(std::malloc(dirLength + leafLength + 1));
    if (!path)
        return nullptr;
    std::memcpy(path, dir, dirLength);
    std::memcpy(path + dirLength, leaf, leafLength + 1);
    const int fd = ::mkostemp(path, O_CLOEXEC);
    if (fd < 0) {
        std::free(path);
        return nullptr;
    }
    ::close(fd);
    return path;
}

char* hostDIPathToPath(void* diPath, int) {
    return diPath ? copyText(static_cast<const char*>(diPath),
                             std::strlen(static_cast<const char*>(diPath)))
                  : nullptr;
}

void* hostPathToDIPath(const char* path, int) {
    return path && *path ? copyText(path, std::strlen(path)) : nullptr;
}

void hostFree(void* p) {
    std::free(p);
}

int hostOpen64(void* diPath, unsigned short mode, void** handle) {
    *handle = nullptr;
    if (!diPath)
        return -1;
    const bool readable = mode & 0x1, writable = mode & 0x2;
    int flags = O_CLOEXEC | (writable ? (readable ? O_RDWR : O_WRONLY) : O_RDONLY);
    if (writable)
        flags |= O_CREAT;
    if (mode & 0x4)
        flags |= O_TRUNC;
    int fd;
    do {
        fd = ::open(static_cast<const char*>(diPath), flags, 0666);
    } while (fd < 0 && errno == EINTR);
    if (fd < 0)
        return -1;
    if (mode & 0x8)
        ::posix_fadvise(fd, 0, 0, POSIX_FADV_SEQUENTIAL);
    if (mode & 0x20)
        ::posix_fadvise(fd, 0, 0, POSIX_FADV_RANDOM);
    *handle = new HostFile{fd};
    return 0;
}

off_t join(uint32_t low, uint32_t high) {
    return static_cast<off_t>((static_cast<unsigned long long>(high) << 32) | low);
}

int hostSetPos64(void* handle, uint32_t low, uint32_t high) {
    return ::lseek(descriptorOf(handle), join(low, high), SEEK_SET) >= 0 ? 0 : -1;
}

int hostGetPos64(void* handle, unsigned long long* position) {
    const off_t at = ::lseek(descriptorOf(handle), 0, SEEK_CUR);
    if (at < 0)
        return -1;
    *position = static_cast<unsigned long long>(at);
    return 0;
}

int hostSetEOF(void* handle, uint32_t low, uint32_t high) {
    return ::ftruncate(descriptorOf(handle), join(low, high)) == 0 ? 0 : -1;
}

int hostGetEOF64(void* handle, unsigned long long* eof) {
    struct stat st;
    if (::fstat(descriptorOf(handle), &st) != 0)
        return -1;
    *eof = static_cast<unsigned long long>(st.st_size);
    return 0;
}

char16_t* hostDIPathToWPath(void* diPath, int) {
    if (!diPath)
        return nullptr;
    const ZYRStd::CZYRWString wide = utf8ToUTF16(static_cast<const char*>(diPath));
    auto* copy = static_cast<char16_t*>(std::malloc((wide.length() + 1) * sizeof(char16_t)));
    if (copy)
        std::memcpy(copy, wide.c_str(), (wide.length() + 1) * sizeof(char16_t));
    return copy;
}

void* hostWPathToDIPath(const char16_t* path, int) {
    if (!path || !*path)
        return nullptr;
    const ZYRStd::CZYRString narrow = ZYRFileSys::utf16ToUTF8(ZYRStd::CZYRWString(path));
    return copyText(narrow.c_str(), narrow.length());
}

} // namespace

ZYRPublic::_t_ZYRPDLFileSysRec posixFileProcs() {
    ZYRPublic::_t_ZYRPDLFileSysRec record{};
    record.close = hostClose;
    record.flush = hostFlush;
    record.read = hostRead;
    record.write = hostWrite;
    record.remove = hostRemove;
    record.tempFile = hostTempFile;
    record.diPathToPath = hostDIPathToPath;
    record.pathToDIPath = hostPathToDIPath;
    record.free = hostFree;
    record.open64 = hostOpen64;
    record.setpos64 = hostSetPos64;
    record.getpos64 = hostGetPos64;
    record.seteof = hostSetEOF;
    record.geteof64 = hostGetEOF64;
    record.diPathToWPath = hostDIPathToWPath;
    record.wPathToDIPath = hostWPathToDIPath;
    return record;
}

} // namespace ZYRHostKit
