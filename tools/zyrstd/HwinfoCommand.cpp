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

namespace zyrtool {

namespace {

std::string utf8(const std::wstring& text) {
    std::string out;
    for (const wchar_t wc : text) {
        auto c = static_cast<char32_t>(wc);
        if (c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF))
            c = 0xFFFD;
        if (c < 0x80) {
            out += static_cast<char>(c);
        } else if (c < 0x800) {
            out += static_cast<char>(0xC0 | (c >> 6));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else if (c < 0x10000) {
            out += static_cast<char>(0xE0 | (c >> 12));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else {
            out += static_cast<char>(0xF0 | (c >> 18));
            out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        }
    }
    return out;
}

void emit(const std::string& text) {
    std::fwrite(text.data(), 1, text.size(), stdout);
}

} // namespace

int runHwinfo(int argc, char** argv) {
    const char* root = "/";
    for (int i = 1; i < argc; ++i) {
        if (std::strcmp(argv[i], "--root") == 0 && i + 1 < argc) {
            root = argv[++i];
        } else {
            std::fprintf(stderr,
                         "zyrstd: hwinfo: unexpected argument '%s'\n"
                         "usage: zyrstd hwinfo [--root DIR]\n",
                         argv[i]);
            return kUsageError;
        }
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
