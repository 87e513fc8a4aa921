// The installed file system as static calls, and the file-name value class.
#include "zyr/std/io/CZYRFileSys.h"

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"

namespace ZYRStd {

using ZYRFileName::IZYRFileName;

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRFileSys";

ZYRFileSys::IZYRFileSys& installed() {
    const tZYRDefaultFileSysProc proc = ZYRGetDefaultFileSysProc();
    ZYRFileSys::IZYRFileSys* fileSys = proc ? proc() : nullptr;
    if (!fileSys)
        throw CZYRError(ZYRPublic::kZYRErrorFileSystemNotInitialized,
                        "A FileSys  not installed. Install one with ZYRFileSys_SetDefaultFileSys "
                        "method",
                        kSource, __LINE__);
    return *fileSys;
}

CZYRSmartZYRRefPtr<IZYRFileName> fromFactory(const CZYRUniString& path) {
    return ZYRGetFactory()->createFileName(path);
}

} // namespace

// ---- CZYRFileName --------------------------------------------------------------------------

CZYRFileName::CZYRFileName(IZYRFileName* name, bool addRef) : name_(name, addRef) {}

CZYRFileName::CZYRFileName(const char* path) : name_(fromFactory(ZYRFileSys::uniPathOf(path))) {}

CZYRFileName::CZYRFileName(const CZYRWString& path)
    : name_(fromFactory(CZYRUniString(path.c_str()))) {}

CZYRFileName::CZYRFileName(const CZYRUniString& path) : name_(fromFactory(path)) {}

CZYRFileName::~CZYRFileName() = default;

IZYRFileName& CZYRFileName::object() const {
    if (!name_)
        throw CZYRError(ZYRPublic::kZYRErrorInvalidObject, "Null object", kSource, __LINE__);
    return *name_;
}

CZYRFileName CZYRFileName::clone() const {
    return CZYRFileName(object().clone(), false);
}

CZYRWString CZYRFileName::getFileDirPath() const {
    return object().getFileDirPath();
}

CZYRString CZYRFileName::getFileDirPathInZYRString() const {
    return object().getFileDirPathInZYRString();
}

CZYRWString CZYRFileName::getFileName() const {
    return object().getFileName();
}

eZYRPathSpecType CZYRFileName::GetPathSpecDefaultType() const {
    return object().GetPathSpecDefaultType();
}

bool CZYRFileName::pathSpecTypeSupported(eZYRPathSpecType type) const {
    return object().pathSpecTypeSupported(type);
}

const void* CZYRFileName::getPathSpec(eZYRPathSpecType type, unsigned int* length) const {
    return object().getPathSpec(type, length);
}

bool CZYRFileName::isEmpty() const {
    return !name_ || name_->isEmpty();
}

CZYRWString CZYRFileName::getWStringPath() const {
    const CZYRWString* path = object().getFullPath();
    return path ? *path : CZYRWString();
}

// ---- CZYRFileSys ---------------------------------------------------------------------------

CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
CZYRFileSys::createFileStream(const CZYRFileName& name, unsigned int mode, bool viaHost) {
    return installed().createFileStream(name, mode, viaHost);
}

CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
CZYRFileSys::createTmpFileStream(const CZYRFileName& dir, const char16_t* prefix,
                                 unsigned int mode) {
    return installed().createTmpFileStream(dir, prefix, mode);
}

CZYRSmartZYRRefPtr<ZYRStreams::IZYRMemMapFStream>
CZYRFileSys::createMemMappedFileStream(const CZYRFileName& name, unsigned int mode,
                                       const unsigned long long& offset, unsigned int length) {
    return installed().createMemMappedFileStream(name, mode, offset, length);
}

CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>
CZYRFileSys::createMemStream(unsigned int mode, unsigned int capacity, void* buffer) {
    return installed().createMemStream(mode, capacity, buffer);
}

void CZYRFileSys::copy(const CZYRFileName& from, const CZYRFileName& to, bool failIfExists) {
    installed().copy(from, to, failIfExists);
}

void CZYRFileSys::remove(const CZYRFileName& name, bool quiet) {
    installed().remove(name, quiet);
}

bool CZYRFileSys::fileExists(const CZYRFileName& name) {
    return installed().fileExists(name);
}

void CZYRFileSys::rename(const CZYRFileName& from, const CZYRFileName& to) {
    installed().rename(from, to);
}

bool CZYRFileSys::isSameFile(const CZYRFileName& a, const CZYRFileName& b) {
    return installed().isSameFile(a, b);
}

void CZYRFileSys::makeDirectory(const CZYRFileName& name) {
    installed().makeDirectory(name);
}

bool CZYRFileSys::enumDirectory(const CZYRFileName& dir, ZYRFileSys::IDirEnumCBProc& cb) {
    return installed().enumDirectory(dir, cb);
}

const CZYRUniString& CZYRFileSys::getTempDirName() {
    return installed().getTempDirName();
}

const CZYRUniString& CZYRFileSys::getDLCacheDirName() {
    return installed().getDLCacheDirName();
}

} // namespace ZYRStd
