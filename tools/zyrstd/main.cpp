// zyrstd: the command-line host of the library.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <string>
#include <string_view>

#include "Commands.h"
#include "ToolSupport.h"
#include "ZYRHostKit.h"
#include "ZYRStd.h"

namespace {

struct Command {
    std::string_view name;
    int (*run)(int argc, char** argv);
    // Synopsis lines after "zyrstd ", then what the command does; '\n' separates lines.
    std::string_view synopsis;
    std::string_view description;
    // Options whose value follows as the next argument: that value is never a request for help.
    std::string_view valueOptions[2] = {};
};

const Command kCommands[] = {
    {"md5", zyrtool::runMd5, "md5 [FILE...]",
     "print the MD5 digest of each FILE, md5sum's way (standard input for - or none)"},
    {"encode",
     zyrtool::runEncode,
     "encode ascii85|asciihex [--prefix P] [--eod E] [--no-z] [IN [OUT]]",
     "encode IN (standard input) as ASCII85 or ASCIIHex text into OUT (standard output);\n"
     "--prefix and --eod set the text before the data (at most 2 characters) and after it\n"
     "(at most 14); --no-z (ascii85 only) writes four zero bytes as \"!!!!!\", not \"z\"",
     {"--prefix", "--eod"}},
    {"decode", zyrtool::runDecode, "decode ascii85|asciihex [IN [OUT]]",
     "decode ASCII85 or ASCIIHex text from IN (standard input) into OUT (standard output)"},
    {"config", zyrtool::runConfig, "config FILE...\nconfig --defaults",
     "read the setup FILEs as a host does at start-up and print the effective options, one\n"
     "'Key = value' line each; unknown keys are reported on standard error; --defaults\n"
     "prints the options' defaults"},
    {"hwinfo",
     zyrtool::runHwinfo,
     "hwinfo [--root DIR]",
     "print the memory, processor, operating-system, disk and load reports and the timing\n"
     "calibration; --root reads /proc, /sys and /etc under DIR",
     {"--root"}},
    {"demo", zyrtool::runDemo, "demo",
     "run a host start-up, allocation under a limit and under pressure, a traced job, an\n"
     "analytics session and the leak report"},
};

const Command* find(std::string_view name) {
    for (const Command& command : kCommands)
        if (command.name == name)
            return &command;
    return nullptr;
}

// Writes each line of `text` after `first` (the first line) or `indent` (the others).
void printLines(std::FILE* out, std::string_view text, const char* first, const char* indent) {
    for (const char* lead = first; !text.empty(); lead = indent) {
        const std::string_view line = text.substr(0, text.find('\n'));
        std::fprintf(out, "%s%.*s\n", lead, static_cast<int>(line.size()), line.data());
        text.remove_prefix(std::min(text.size(), line.size() + 1));
    }
}

void printUsage(std::FILE* out) {
    std::fputs("usage: zyrstd COMMAND [ARGUMENT...]\n"
               "       zyrstd COMMAND --help\n"
               "       zyrstd --help | --version\n\ncommands:\n",
               out);
    for (const Command& command : kCommands) {
        printLines(out, command.synopsis, "  ", "  ");
        printLines(out, command.description, "      ", "      ");
    }
    std::fputs("  help\n      print this help (also --help, -h)\n"
               "  --version\n      print the version of the tool and its library\n",
               out);
}

// True when the arguments ask for the command's usage rather than for its work.
bool asksForHelp(const Command& command, int argc, char** argv) {
    for (int i = 1; i < argc; ++i) {
        const std::string_view arg = argv[i];
        if (arg == "--")
            return false;
        if (arg == "--help" || arg == "-h")
            return true;
        for (std::string_view option : command.valueOptions)
            if (!option.empty() && arg == option)
                ++i;
    }
    return false;
}

void installHostMemory() {
    // The front copies the record, so a temporary is enough.
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStd::ZYRStdInit_ZYRMemMgrSet(&host);
}

} // namespace

namespace zyrtool {

void printCommandUsage(std::FILE* out, std::string_view name) {
    const Command* command = find(name);
    if (!command)
        return;
    printLines(out, command->synopsis, "usage: zyrstd ", "       zyrstd ");
    std::fputc('\n', out);
    printLines(out, command->description, "", "");
}

int usageError(std::string_view command, const std::string& why) {
    std::fflush(stdout);
    std::fprintf(stderr, "zyrstd: %.*s: %s\n", static_cast<int>(command.size()), command.data(),
                 why.c_str());
    printCommandUsage(stderr, command);
    return kUsageError;
}

} // namespace zyrtool

int main(int argc, char** argv) {
    installHostMemory();

    if (argc < 2) {
        std::fputs("zyrstd: no command given\nTry 'zyrstd --help'.\n", stderr);
        return zyrtool::kUsageError;
    }
    const std::string_view name = argv[1];
    if (name == "help" || name == "--help" || name == "-h") {
        printUsage(stdout);
        return 0;
    }
    if (name == "--version") {
        std::puts("zyrstd " ZYRSTD_VERSION_STRING);
        return 0;
    }
    const Command* command = find(name);
    if (!command) {
        std::fprintf(stderr, "zyrstd: unknown command '%s'\nTry 'zyrstd --help'.\n", argv[1]);
        return zyrtool::kUsageError;
    }
    if (asksForHelp(*command, argc - 1, argv + 1)) {
        zyrtool::printCommandUsage(stdout, name);
        return 0;
    }
    try {
        return command->run(argc - 1, argv + 1);
    } catch (const ZYRStd::CZYRError& e) {
        std::fprintf(stderr, "zyrstd: %s: %s (error %d at %s:%d)\n", argv[1],
                     e.getMessage() ? e.getMessage() : "error", static_cast<int>(e.getError()),
                     e.getSrcFileName() ? e.getSrcFileName() : "?", e.getSrcLineNumber());
    } catch (const std::exception& e) {
        std::fprintf(stderr, "zyrstd: %s: %s\n", argv[1], e.what());
    }
    return 1;
}
