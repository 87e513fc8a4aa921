// zyrstd hwinfo: the five hardware reports and the three timing lines, in UTF-8.
#include <cstdio>
#include <cstring>
#include <memory>
#include <sstream>
#include <string>
#include <string_view>

#include "Commands.h"
#include "ToolSupport.h"
#include "ZYRStd.h"
#include "zyr/std/core/internal/ZYRUTF8.h"

namespace zyrtool {

namespace {

std::string utf8(const std::wstring& text) {
    std::string out;
    ZYRStd::detail::appendUTF8(out, text.data(), text.size());
    return out;
}

void emit(const std::string& text) {
    std::fwrite(text.data(), 1, text.size(), stdout);
}

} // namespace

int runHwinfo(int argc, char** argv) {
    const char* root = "/";
    for (int i = 1; i < argc; ++i) {
        if (std::strcmp(argv[i], "--root") != 0)
            return usageError("hwinfo", std::string("unexpected argument '") + argv[i] + "'");
        if (i + 1 >= argc)
            return usageError("hwinfo", "--root needs a folder");
        root = argv[++i];
    }
    std::unique_ptr<ZYRStd::IHardwareInfo> info(ZYRStd::createHardwareInfo(root));
    if (!info)
        return report("hwinfo", "out of memory");

    int status = 0;
    const auto failed = [&](const char* what) {
        std::fflush(stdout);
        std::fprintf(stderr, "zyrstd: hwinfo: cannot read the %s\n", what);
        status = kFailure;
    };
    // One record per query: each query zero-fills its record.
    ZYRStd::HardwareInfoRec rec{};
    ZYRStd::PerformanceRec perf{};
    std::wostringstream out;
    if (info->getMemoryInfo(&rec))
        info->printMemoryInfo(&rec, out);
    else
        failed("memory modules");
    emit(utf8(out.str()));
    out.str(L"");
    if (info->getProcessorAndOSInfo(&rec))
        info->printProcessorAndOSInfo(&rec, out);
    else
        failed("processors and operating system");
    emit(utf8(out.str()));
    out.str(L"");
    if (info->getDiskInfo(&rec))
        info->printDiskInfo(&rec, out);
    else
        failed("disks");
    emit(utf8(out.str()));
    out.str(L"");
    if (info->getMemoryPerformance(&perf))
        info->printMemoryPerformance(&perf, out);
    else
        failed("memory performance");
    emit(utf8(out.str()));
    out.str(L"");
    if (info->getCPUPerformance(&perf))
        info->printCPUPerformance(&perf, out);
    else
        failed("processor performance");
    emit(utf8(out.str()));

    ZYRStd::ZYRTimingManager::Initialize();
    emit(ZYRStd::ZYRTimingManager::GetTimerAccuracyLine());
    emit(ZYRStd::ZYRTimingManager::GetBusSpeedLine());
    emit(ZYRStd::ZYRTimingManager::GetCacheSpeedLine());
    emit("\n");
    if (std::fflush(stdout) != 0 || std::ferror(stdout)) {
        std::fprintf(stderr, "zyrstd: hwinfo: write error\n");
        status = kFailure;
    }
    return status;
}

} // namespace zyrtool
