// zyrstd config: plays a host's start-up over setup files and prints the effective options.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include "Commands.h"
#include "ToolSupport.h"
#include "ZYRHostKit.h"
#include "ZYRStd.h"
#include "zyr/std/config/internal/ZYRStartupOptionKeys.h"

namespace zyrtool {

namespace {

struct Pair {
    std::string key;
    std::string value;
    const char* file;
    unsigned int line;
};

// A setup file is a few kilobytes; anything this big is a mistake, and the parser takes a
// 32-bit size.
constexpr off_t kMaxSetupFile = 64 * 1024 * 1024;

// Returns 0 and the file's bytes, or the errno value that stopped the reading; `refusal`
// says why a file that opened is not read at all.
int readWholeFile(const char* path, std::vector<unsigned char>& bytes, const char*& refusal) {
    // Non-blocking, so that a FIFO without a writer is refused rather than waited for.
    const int fd = ::open(path, O_RDONLY | O_CLOEXEC | O_NOCTTY | O_NONBLOCK);
    if (fd < 0)
        return errno;
    struct stat info {};
    const int statError = ::fstat(fd, &info) != 0 ? errno : 0;
    if (statError || !S_ISREG(info.st_mode) || info.st_size > kMaxSetupFile) {
        ::close(fd);
        if (statError || S_ISDIR(info.st_mode))
            return statError ? statError : EISDIR;
        refusal = S_ISREG(info.st_mode) ? "larger than 64 MiB" : "not a regular file";
        return EINVAL;
    }
    int error = 0;
    unsigned char chunk[64 * 1024];
    for (;;) {
        // A file that grows while it is read is still cut at the bound.
        if (bytes.size() > static_cast<size_t>(kMaxSetupFile)) {
            refusal = "larger than 64 MiB";
            error = EFBIG;
            break;
        }
        const ssize_t got = ::read(fd, chunk, sizeof chunk);
        if (got < 0) {
            if (errno == EINTR)
                continue;
            error = errno;
            break;
        }
        if (got == 0)
            break;
        bytes.insert(bytes.end(), chunk, chunk + got);
    }
    ::close(fd);
    return error;
}

// Keeps every pair with where it came from.
class PairCollector : public ZYRStd::IZYRConfigParserLineCBProc {
public:
    PairCollector(const char* file, std::vector<Pair>& pairs) : file_(file), pairs_(pairs) {}
    void atLine(unsigned int line) override { line_ = line; }
    void proc(const char* key, const char* value) override {
        pairs_.push_back({key, value, file_, line_});
    }
    unsigned int line() const { return line_; }

private:
    const char* file_;
    std::vector<Pair>& pairs_;
    unsigned int line_ = 0;
};

// Parses one file into `pairs`; false after printing why it could not.
bool collectPairs(const char* file, std::vector<Pair>& pairs) {
    std::vector<unsigned char> bytes;
    const char* refusal = nullptr;
    if (const int error = readWholeFile(file, bytes, refusal)) {
        std::fprintf(stderr, "zyrstd: config: cannot read '%s': %s\n", file,
                     refusal ? refusal : std::strerror(error));
        return false;
    }
    if (bytes.empty())
        return true; // no pairs; the parser takes an empty buffer for a missing one
    PairCollector collector(file, pairs);
    try {
        ZYRStd::ParseConfigData(bytes.data(), ZYRPublic::kZYRConfigDataBuffer,
                                static_cast<unsigned int>(bytes.size()), collector);
    } catch (const ZYRStd::CZYRError& e) {
        std::fprintf(stderr, "%s:%u: %s\n", file, collector.line(),
                     e.getMessage() ? e.getMessage() : "error");
        return false;
    }
    return true;
}

void printOptions() {
    for (const ZYRStd::sZYRStartupOptionKey& row : ZYRStd::kZYRStartupOptionKeys) {
        if (row.show)
            std::printf("%s = %s\n", row.key, row.show().c_str());
    }
}

} // namespace

int runConfig(int argc, char** argv) {
    std::vector<const char*> files;
    bool defaults = false, optionsDone = false;
    for (int i = 1; i < argc; ++i) {
        const std::string_view arg = argv[i];
        if (!optionsDone && arg == "--")
            optionsDone = true;
        else if (!optionsDone && arg == "--defaults")
            defaults = true;
        else if (!optionsDone && arg.size() > 1 && arg[0] == '-')
            return usageError("config", "unknown option '" + std::string(arg) + "'");
        else
            files.push_back(argv[i]);
    }
    if (files.empty() == !defaults)
        return usageError("config",
                          defaults ? "--defaults takes no setup file" : "no setup file given");

    // Everything is parsed before anything is set, so that a bad file leaves no output.
    std::vector<Pair> pairs;
    // The parser reads through the installed file system's memory streams.
    const ZYRHostKit::HostSession session;
    if (!defaults) {
        for (const char* file : files) {
            if (!collectPairs(file, pairs))
                return 1;
        }
    }

    ZYRStd::CZYRStartupOptionFeeder feeder;
    for (const Pair& pair : pairs) {
        if (!ZYRStd::ZYRIsStartupOptionKey(pair.key.c_str())) {
            std::fflush(stdout); // keep both streams in order when they go to one place
            std::fprintf(stderr, "%s:%u: unknown key '%s'\n", pair.file, pair.line,
                         pair.key.c_str());
        }
        feeder.feed(pair.key.c_str(), pair.value.c_str());
    }
    feeder.store();
    printOptions();
    if (std::fflush(stdout) != 0 || std::ferror(stdout)) {
        std::fprintf(stderr, "zyrstd: config: write error: %s\n", std::strerror(errno));
        return 1;
    }
    return 0;
}

} // namespace zyrtool
