// Setup-file parsing: 100,000 lines through ParseConfigData into a counting callback,
// against inih's ini_parse_string on the same pairs written as INI text.
#include <benchmark/benchmark.h>
#include <ini.h>

#include <memory>
#include <random>
#include <string>

#include "BenchSupport.h"
#include "ZYRStd.h"

namespace {

constexpr int kLines = 100000;

struct Texts {
    std::string ours; // Key = Value, Key=Value, Key Value
    std::string peer; // the same pairs with '=' every time
    int pairs = 0;
};

// Mixed pair forms, comments and blank lines with CR LF line ends; both texts hold the same
// lines in the same order.
const Texts& texts() {
    static const Texts built = [] {
        Texts t;
        std::mt19937 random(5021);
        const auto word = [&](const char* stem) {
            return std::string(stem) + std::to_string(random() % 100000);
        };
        for (int line = 0; line < kLines; ++line) {
            const unsigned int kind = random() % 10;
            if (kind == 0) {
                const std::string comment = "# " + word("note about the setting ") + "\r\n";
                t.ours += comment;
                t.peer += comment;
            } else if (kind == 1) {
                t.ours += "\r\n";
                t.peer += "\r\n";
            } else {
                const std::string key = word("SettingName");
                const std::string value = word("");
                const char* const ourForms[] = {" = ", "=", " "};
                t.ours += key + ourForms[kind % 3] + value + "\r\n";
                t.peer += key + (kind % 2 ? " = " : "=") + value + "\r\n";
                ++t.pairs;
            }
        }
        return t;
    }();
    return built;
}

class PairCounter : public ZYRStd::IZYRConfigParserCBProc {
public:
    void proc(const char*, const char*) override { ++pairs; }
    int pairs = 0;
};

int ourCount(std::string& text) {
    PairCounter counter;
    ZYRStd::ParseConfigData(reinterpret_cast<unsigned char*>(text.data()),
                            ZYRPublic::kZYRConfigDataBuffer, static_cast<unsigned int>(text.size()),
                            counter);
    return counter.pairs;
}

int peerCount(const std::string& text) {
    int pairs = 0;
    ini_parse_string(
        text.c_str(),
        [](void* user, const char*, const char*, const char*) {
            ++*static_cast<int*>(user);
            return 1;
        },
        &pairs);
    return pairs;
}

// The parser's memory streams come from the installed file system.
class FileSystemInstalled {
public:
    FileSystemInstalled()
        : fileSys_(ZYRFileSys::createDefaultFileSystem(ZYRStd::CZYRUniString(),
                                                       ZYRStd::CZYRUniString(), nullptr)) {
        current_ = fileSys_.get();
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc([] { return current_; });
    }
    ~FileSystemInstalled() {
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
        current_ = nullptr;
    }
    FileSystemInstalled(const FileSystemInstalled&) = delete;
    FileSystemInstalled& operator=(const FileSystemInstalled&) = delete;

private:
    static inline ZYRFileSys::IZYRFileSys* current_ = nullptr;
    std::unique_ptr<ZYRFileSys::IZYRFileSys> fileSys_;
};

void BM_ConfigParse_Ours(benchmark::State& state) {
    const FileSystemInstalled installed;
    std::string text = texts().ours;
    if (ourCount(text) != texts().pairs || peerCount(texts().peer) != texts().pairs) {
        state.SkipWithError("the parsers disagree on the number of pairs");
        return;
    }
    for (auto _ : state)
        benchmark::DoNotOptimize(ourCount(text));
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * text.size());
}

void BM_ConfigParse_Inih(benchmark::State& state) {
    const std::string& text = texts().peer;
    for (auto _ : state)
        benchmark::DoNotOptimize(peerCount(text));
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * text.size());
}

BENCHMARK(BM_ConfigParse_Ours)->Repetitions(5)->MinTime(0.2)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_ConfigParse_Inih)->Repetitions(5)->MinTime(0.2)->Unit(benchmark::kMillisecond);

} // namespace

int main(int argc, char** argv) {
    return zyrbench::runWithRatios(
        argc, argv, {{"config_parse", "BM_ConfigParse_Ours", "BM_ConfigParse_Inih"}});
}
