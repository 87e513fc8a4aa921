// A program as a host writes it against an installed ZYRStd: one header, a string, a
// dictionary, the host kit.
#include <ZYRHostKit.h>
#include <ZYRStd.h>

#include <cstdio>

int main() {
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStd::ZYRStdInit_ZYRMemMgrSet(&host);
    int failures = 0;
    {
        ZYRHostKit::HostSession session;
        ZYRStd::CZYRDict dict;
        dict.set(ZYRStd::CZYRUniString("Answer"), static_cast<int32_t>(42));
        int32_t answer = 0;
        dict.get(ZYRStd::CZYRUniString("Answer"), &answer);
        if (answer != 42)
            ++failures;
        if (ZYRHostKit::utf8ToUTF16("a/b").length() != 3)
            ++failures;
        if (ZYRStd::FixedMul(0x20000, 0x30000) != 0x60000)
            ++failures;
        int32_t (*viaPointer)(int32_t, int32_t) = &ZYRStd::FixedMul;
        if (viaPointer(0x10000, 0x10000) != 0x10000)
            ++failures;
    }
    std::puts(failures == 0 ? "consumer: ok" : "consumer: wrong results");
    return failures == 0 ? 0 : 1;
}
