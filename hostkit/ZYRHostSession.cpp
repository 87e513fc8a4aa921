// The host kit's session: the library set up as a small POSIX host needs it.
#include <cstdlib>

#include "ZYRHostKit.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRHostKit {

namespace {
// The default-file-system procedure takes no context, so the session's file system is
// reached through this one slot.
ZYRFileSys::IZYRFileSys* currentFileSys = nullptr;
} // namespace

ZYRStd::tZYRMemMgr crtMemMgr() {
    return {[](size_t n, void*) { return std::malloc(n); },
            [](void* p, size_t n, void*) { return std::realloc(p, n); },
            [](void* p, void*) { std::free(p); }, nullptr};
}

HostSession::HostSession() {
    ZYRStd::InitCommonUniStrings();
    ZYRStd::InitDynamicUniStringCache();
    ZYRStd::ZYRStdInit_SetZYRFactoryProc(posixFileNameFactory);
    fileSys_ = ZYRFileSys::createDefaultFileSystem(ZYRStd::CZYRUniString(), ZYRStd::CZYRUniString(),
                                                   nullptr);
    if (!fileSys_) {
        shutDown();
        throw ZYRStd::CZYRError(ZYRPublic::kZYRErrorOutOfMemory, "cannot create the file system",
                                "hostkit/ZYRHostSession", __LINE__);
    }
    currentFileSys = fileSys_;
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc([] { return currentFileSys; });
}

HostSession::~HostSession() {
    shutDown();
}

void HostSession::shutDown() noexcept {
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
    currentFileSys = nullptr;
    delete fileSys_;
    fileSys_ = nullptr;
    ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
    ZYRStd::ReleaseDynamicUniStringCache();
    ZYRStd::ReleaseCommonUniStrings();
}

} // namespace ZYRHostKit
