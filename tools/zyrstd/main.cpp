// zyrstd: the command-line host of the library.
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <string_view>

#include "Commands.h"
#include "ZYRHostKit.h"
#include "ZYRStd.h"

namespace {

struct Command {
    std::string_view name;
    int (*run)(int argc, char** argv);
    std::string_view help;
};

constexpr Command kCommands[] = {
    {"md5", zyrtool::runMd5,
     "md5 [FILE...]   print the MD5 digest of each FILE (standard input for - or none)"},
    {"encode", zyrtool::runEncode,
     "encode ascii85|asciihex [--prefix P] [--eod E] [--no-z] [IN [OUT]]\n"
     "                  encode IN (standard input) as ASCII85 or ASCIIHex text into OUT\n"
     "                  (standard output)"},
    {"decode", zyrtool::runDecode,
     "decode ascii85|asciihex [IN [OUT]]\n"
     "                  decode ASCII85 or ASCIIHex text from IN into OUT"},
    {"config", zyrtool::runConfig,
     "config FILE...  read the setup FILEs as a host does at start-up and print the effective\n"
     "                  options, one 'Key = value' line each; unknown keys are reported\n"
     "                  on standard error\n"
     "  config --defaults\n"
     "                  print the options' defaults"},
    {"hwinfo", zyrtool::runHwinfo,
     "hwinfo [--root DIR]\n"
     "                  print the memory, processor, operating-system, disk and load reports\n"
     "                  and the timing calibration; --root reads /proc, /sys and /etc under DIR"},
    {"demo", zyrtool::runDemo,
     "demo            run a host start-up, allocation under a limit and the leak report"},
};

constexpr int kUsageError = 2;

void printUsage(std::FILE* out) {
    std::fputs("usage: zyrstd COMMAND [ARGUMENT...]\n\ncommands:\n", out);
    for (const Command& command : kCommands)
        std::fprintf(out, "  %.*s\n", static_cast<int>(command.help.size()), command.help.data());
    std::fputs("  help            print this help\n", out);
}

void installHostMemory() {
    // The front copies the record, so a temporary is enough.
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStd::ZYRStdInit_ZYRMemMgrSet(&host);
}

} // namespace

int main(int argc, char** argv) {
    installHostMemory();

    if (argc < 2) {
        std::fputs("zyrstd: no command given\nTry 'zyrstd --help'.\n", stderr);
        return kUsageError;
    }
    const std::string_view name = argv[1];
    if (name == "help" || name == "--help" || name == "-h") {
        printUsage(stdout);
        return 0;
    }
    for (const Command& command : kCommands) {
        if (command.name != name)
            continue;
        try {
            return command.run(argc - 1, argv + 1);
        } catch (const ZYRStd::CZYRError& e) {
            std::fprintf(stderr, "zyrstd: %s: %s (error %d at %s:%d)\n", argv[1],
                         e.getMessage() ? e.getMessage() : "error", static_cast<int>(e.getError()),
                         e.getSrcFileName() ? e.getSrcFileName() : "?", e.getSrcLineNumber());
        } catch (const std::exception& e) {
            std::fprintf(stderr, "zyrstd: %s: %s\n", argv[1], e.what());
        }
        return 1;
    }
    std::fprintf(stderr, "zyrstd: unknown command '%s'\nTry 'zyrstd --help'.\n", argv[1]);
    return kUsageError;
}
