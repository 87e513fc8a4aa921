/// \file
/// A small POSIX host for the library: file-name objects with their factory, and the host
/// file-procedure record filled with POSIX procedures. The library implements neither;
/// hosts, tests and zyrstd link this kit to have them.
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>

#include "C_SmartPtr.h"
#include "IZYRFileName.h"
#include "IZYRFileSys.h"
#include "I_Dict.h"
#include "I_Job.h"
#include "ZYRPDLFileSysRec.h"
#include "sZYRTraceMsg.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/values/CZYRString.h"

namespace ZYRHostKit {

/// The path forms of this host's file names: zero-terminated UTF-8 bytes.
constexpr ZYRStd::eZYRPathSpecType kPathSpecUTF8 = static_cast<ZYRStd::eZYRPathSpecType>(1);
/// Zero-terminated UTF-16 units.
constexpr ZYRStd::eZYRPathSpecType kPathSpecUTF16 = static_cast<ZYRStd::eZYRPathSpecType>(2);

/// A POSIX path held as UTF-16 (the library's path text) and as UTF-8 (the bytes the
/// system is given).
class CPosixFileName : public ZYRFileName::IZYRFileName {
public:
    /// Holds `path`; an empty path makes an empty name.
    explicit CPosixFileName(const ZYRStd::CZYRWString& path);
    ~CPosixFileName() override;

    bool isEmpty() const override { return path_.empty(); }
    /// The part before the last '/' ("/" for a file in the root, empty without a '/').
    ZYRStd::CZYRWString getFileDirPath() const override;
    ZYRStd::CZYRString getFileDirPathInZYRString() const override;
    /// The part after the last '/'.
    ZYRStd::CZYRWString getFileName() const override;
    ZYRStd::eZYRPathSpecType GetPathSpecDefaultType() const override { return kPathSpecUTF8; }
    bool pathSpecTypeSupported(ZYRStd::eZYRPathSpecType type) const override;
    /// UTF-8 bytes or UTF-16 units, zero-terminated; `length` counts bytes without the zero.
    const void* getPathSpec(ZYRStd::eZYRPathSpecType type, unsigned int* length) const override;
    const ZYRStd::CZYRWString* getFullPath() const override { return &path_; }
    IZYRFileName* clone() const override { return new CPosixFileName(path_); }

private:
    ZYRStd::CZYRWString path_;
    ZYRStd::CZYRString utf8_;
};

/// The factory, one per process; fits ZYRStdInit_SetZYRFactoryProc.
ZYRFactory::IZYRFactory* posixFileNameFactory();

/// Host procedures over POSIX calls. DI paths are malloc'd UTF-8 strings, handles own a
/// descriptor; both go back through the record's `free` and `close`.
ZYRPublic::_t_ZYRPDLFileSysRec posixFileProcs();

/// Path bytes to UTF-16: UTF-8, and each byte outside it as the lone surrogate U+DC80 +
/// (byte - 0x80), which the library turns back into that byte.
ZYRStd::CZYRWString utf8ToUTF16(const char* text);

/// The host memory procedures over the C runtime heap (malloc, realloc, free).
ZYRStd::tZYRMemMgr crtMemMgr();

/// The count protocol of the engine's interfaces for a host's own objects; the last release
/// deletes.
template <class Interface> class Counted : public Interface {
public:
    /// Takes one more reference; any thread. Relaxed: a caller already holds a reference,
    /// so the object cannot go away meanwhile, and nothing is published with the count.
    void addRef() override { count_.fetch_add(1, std::memory_order_relaxed); }
    /// Drops one reference; the last one deletes the object.
    void release() override {
        if (count_.fetch_sub(1, std::memory_order_acq_rel) == 1)
            delete this;
    }
    /// True while more than one reference is held.
    bool isShared() const override { return count_.load(std::memory_order_acquire) > 1; }
    /// The present count, for diagnostics only.
    unsigned int debugGetRefCount() const override {
        return count_.load(std::memory_order_acquire);
    }
    virtual ~Counted() = default;

private:
    std::atomic<unsigned int> count_{1};
};

/// What the host's progress interface does with each trace message the library sends it.
using TraceSink = std::function<void(const ZYRPublic::sZYRTraceMsg& message,
                                     const ZYRPublic::sZYRTraceMsgDetail& detail)>;

/// A job as a small host hands it to the library: its identifier, its job dictionary
/// (`params`, shared, e.g. with a trace configuration under "ZYRTraceMsg"), and an interface
/// set whose only interface is a progress interface passing trace messages to `onTrace`
/// (dropped when it is empty).
ZYRPublic::C_SmartPtr<ZYRPublic::I_Job> makeHostJob(uint64_t jobID, ZYRPublic::I_Dict* params,
                                                    TraceSink onTrace = {});

/// The library as a small host sets it up: the common strings and the dynamic string
/// cache, the POSIX file-name factory and the native file system as the default one; all
/// undone in reverse order by the destructor. The memory procedures must be installed
/// first (ZYRStdInit_ZYRMemMgrSet). One session at a time; throws CZYRError when the file
/// system cannot be created, with nothing left set up.
class HostSession {
public:
    HostSession();
    ~HostSession();
    HostSession(const HostSession&) = delete;
    HostSession& operator=(const HostSession&) = delete;

    /// The native file system installed as the default, borrowed for the session's life.
    ZYRFileSys::IZYRFileSys& fileSystem() const { return *fileSys_; }

private:
    void shutDown() noexcept;

    ZYRFileSys::IZYRFileSys* fileSys_ = nullptr;
};

} // namespace ZYRHostKit
