// Start-up and shutdown of a host.
//
// Shows: handing the library the host's memory procedures before the first allocation,
// setting a memory limit, building the common strings, an allocation the limit refuses,
// and the refusal read back from the error stack as text.
#include <cstdio>
#include <string>

#include <ZYRHostKit.h>
#include <ZYRStd.h>

int main() {
    using namespace ZYRStd;
    // First of all: the host's memory procedures (here the C runtime heap).
    tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    ZYRSetMemLimit(400ull << 20); // the smallest limit there is
    // Before the first string made from text.
    InitCommonUniStrings();
    InitDynamicUniStringCache();

    void* block = ZYRMalloc(1 << 20);
    std::printf("1 MiB allocated: %s; usage %llu of %llu bytes\n", block ? "yes" : "no",
                GetMemUsage(), ZYRGetMemLimit());

    // More than the limit leaves: refused, and the reason is on the error stack.
    void* tooBig = ZYRMalloc(static_cast<unsigned int>(ZYRGetMemLimit() - GetMemUsage() + 1));
    std::printf("one byte more than is left: %s\n", tooBig ? "granted" : "refused");
    {
        CZYRErrorStk errors;
        std::u16string text;
        if (errors.getErrorMessage(text))
            std::printf("the error stack says: %s", std::string(text.begin(), text.end()).c_str());
    }

    ZYRFree(block);
    ZYRFree(tooBig);
    // Shutdown, in the reverse order of start-up.
    TerminateErrorStk();
    ReleaseDynamicUniStringCache();
    ReleaseCommonUniStrings();
    std::printf("usage at the end: %llu bytes\n", GetMemUsage());
    return !tooBig && GetMemUsage() == 0 ? 0 : 1;
}
