/// \file
/// The installed file system as static calls, and the file-name value class.
#pragma once

#include "IZYRFileName.h"
#include "IZYRFileSys.h"
#include "IZYRStream.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/values/CZYRString.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

/// One counted reference to a host file-name object. Built from text, the object comes
/// from the host's factory (kZYRErrorFatal when none is installed).
class ZYRSTD_API CZYRFileName : public CZYRClientBase {
public:
    CZYRFileName() = default;
    /// Shares the name object: one more reference.
    CZYRFileName(const CZYRFileName& other) = default;
    /// Shares the other's name object and releases the one held before.
    CZYRFileName& operator=(const CZYRFileName& other) = default;
    /// `addRef` false adopts the caller's reference.
    CZYRFileName(ZYRFileName::IZYRFileName* name, bool addRef);
    /// Narrow text is path bytes: UTF-8, and any other byte kept as it is.
    CZYRFileName(const char* path);
    /// A name for the UTF-16 `path`, made by the host's factory.
    CZYRFileName(const CZYRWString& path);
    /// A name for `path`, made by the host's factory.
    CZYRFileName(const CZYRUniString& path);
    ~CZYRFileName() override;

    /// A new name object with the same path (ZYRFileName::IZYRFileName::clone).
    CZYRFileName clone() const;
    /// Forwards to the same operation of ZYRFileName::IZYRFileName; throws
    /// kZYRErrorInvalidObject on an empty wrapper.
    ///@{
    CZYRWString getFileDirPath() const;
    CZYRString getFileDirPathInZYRString() const;
    CZYRWString getFileName() const;
    eZYRPathSpecType GetPathSpecDefaultType() const;
    bool pathSpecTypeSupported(eZYRPathSpecType type) const;
    const void* getPathSpec(eZYRPathSpecType type, unsigned int* length) const;
    ///@}
    /// True also for a wrapper without an object.
    bool isEmpty() const;
    /// A copy of the full path; empty when the object has none.
    CZYRWString getWStringPath() const;

    /// The wrapped object, without a reference.
    operator ZYRFileName::IZYRFileName*() const { return name_.get(); }

private:
    /// The object, or kZYRErrorInvalidObject for a wrapper without one.
    ZYRFileName::IZYRFileName& object() const;

    CZYRSmartZYRRefPtr<ZYRFileName::IZYRFileName> name_;
};

/// Every call goes to the installed file system; without one each raises
/// kZYRErrorFileSystemNotInitialized.
class ZYRSTD_API CZYRFileSys {
public:
    /// Forwards to the same operation of the installed ZYRFileSys::IZYRFileSys (see there
    /// for what each does and raises); the streams come with one reference for the caller.
    ///@{
    static CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    createFileStream(const CZYRFileName& name, unsigned int mode, bool viaHost);
    static CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>
    createTmpFileStream(const CZYRFileName& dir, const char16_t* prefix, unsigned int mode);
    static CZYRSmartZYRRefPtr<ZYRStreams::IZYRMemMapFStream>
    createMemMappedFileStream(const CZYRFileName& name, unsigned int mode,
                              const unsigned long long& offset, unsigned int length);
    static CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>
    createMemStream(unsigned int mode, unsigned int capacity, void* buffer);
    static void copy(const CZYRFileName& from, const CZYRFileName& to, bool failIfExists);
    static void remove(const CZYRFileName& name, bool quiet);
    static bool fileExists(const CZYRFileName& name);
    static void rename(const CZYRFileName& from, const CZYRFileName& to);
    static bool isSameFile(const CZYRFileName& a, const CZYRFileName& b);
    static void makeDirectory(const CZYRFileName& name);
    static bool enumDirectory(const CZYRFileName& dir, ZYRFileSys::IDirEnumCBProc& cb);
    static const CZYRUniString& getTempDirName();
    static const CZYRUniString& getDLCacheDirName();
    ///@}
};

} // namespace ZYRStd
