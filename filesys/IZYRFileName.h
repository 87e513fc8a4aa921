/// \file
/// File names: the host's file-name objects and the factory that makes them.
#pragma once

#include "ZYRStdExport.h"
#include "CZYRBaseRefCnt.h"

namespace ZYRStd {
class CZYRString;
class CZYRWString;
class CZYRUniString;

/// Kinds of host path form. The values belong to the host's file-name
/// implementation; the library only passes them through.
enum eZYRPathSpecType : int {};
} // namespace ZYRStd

namespace ZYRFileName {

/// A reference-counted file name. The library has no implementation: every one comes
/// from the host's factory.
class ZYRSTD_API IZYRFileName : public ZYRStd::CZYRBaseRefCnt {
public:
    ~IZYRFileName() override;
    /// True when the name holds no path.
    virtual bool isEmpty() const = 0;
    /// The directory part of the path.
    virtual ZYRStd::CZYRWString getFileDirPath() const = 0;
    /// The directory part of the path as narrow text.
    virtual ZYRStd::CZYRString getFileDirPathInZYRString() const = 0;
    /// The file-name part of the path.
    virtual ZYRStd::CZYRWString getFileName() const = 0;
    /// The host's default path form for this name.
    virtual ZYRStd::eZYRPathSpecType GetPathSpecDefaultType() const = 0;
    /// True when the name can be given in the path form `type`.
    virtual bool pathSpecTypeSupported(ZYRStd::eZYRPathSpecType type) const = 0;
    /// The name in the path form `type`, borrowed from this object; its size goes to `*length`.
    virtual const void* getPathSpec(ZYRStd::eZYRPathSpecType type, unsigned int* length) const = 0;
    /// The full path; may be null, which every user reads as the empty path.
    virtual const ZYRStd::CZYRWString* getFullPath() const = 0;
    /// A new object with one reference for the caller.
    virtual IZYRFileName* clone() const = 0;
};

} // namespace ZYRFileName

namespace ZYRFactory {

/// Supplied by the host and owned by it; the library never deletes it.
class ZYRSTD_API IZYRFactory {
public:
    IZYRFactory() = default;
    /// Copies nothing but the interface.
    IZYRFactory(const IZYRFactory&) = default;
    /// Copies nothing but the interface.
    IZYRFactory& operator=(const IZYRFactory&) = default;

    /// A new file name for `path`, with one reference for the caller.
    virtual ZYRStd::CZYRSmartZYRRefPtr<ZYRFileName::IZYRFileName>
    createFileName(const ZYRStd::CZYRUniString& path) = 0;

protected:
    ~IZYRFactory() = default;
};

} // namespace ZYRFactory
