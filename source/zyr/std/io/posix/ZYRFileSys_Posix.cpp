// The library's file system on POSIX.
#include "zyr/std/io/posix/ZYRPosixSupport.h"

namespace ZYRPosixFileSys {

using namespace detail;

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
    const CZYRUniString path = uniPathOf(pattern.c_str(), pattern.length());
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
        result = cb(uniPathOf(full.c_str(), full.length()), attributes);
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
