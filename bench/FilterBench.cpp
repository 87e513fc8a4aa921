// ASCII85 and ASCIIHex encoding of 64 MiB: the library's filters in memory against plain
// peers, and the whole zyrstd process against coreutils' basenc on the same file.
#include <benchmark/benchmark.h>
#include <openssl/crypto.h>

#include <cerrno>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <random>
#include <spawn.h>
#include <string>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

#include "BenchSupport.h"
#include "zyr/std/io/CZYRStreamsFilterASCII85.h"
#include "zyr/std/io/CZYRStreamsFilterASCIIHEX.h"
#include "zyr/std/io/IImpZYRMemStream.h"

extern char** environ;

namespace {

using ZYRStd::CZYRSmartZYRRefPtr;

constexpr unsigned int kInputSize = 64u << 20;

const std::vector<unsigned char>& input() {
    static const std::vector<unsigned char> bytes = [] {
        std::vector<unsigned char> out(kInputSize);
        std::mt19937 random(85);
        for (auto& b : out)
            b = static_cast<unsigned char>(random());
        return out;
    }();
    return bytes;
}

CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> memoryTarget(unsigned int capacity) {
    return CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>(
        new ZYRFileSys::IImpZYRMemStream(ZYRStreams::kZYRStreamWrite, capacity, nullptr));
}

// Writes zeros over the whole capacity once, then rewinds.
void touch(ZYRStreams::IZYRStream& target) {
    const std::vector<char> zeros(1 << 20, 0);
    target.reOpen(ZYRStreams::kZYRStreamWrite);
    for (unsigned long long left = target.getCapacity(); left > 0;) {
        const auto n = static_cast<unsigned int>(std::min<unsigned long long>(left, zeros.size()));
        target.write(zeros.data(), 1, n);
        left -= n;
    }
    target.reOpen(ZYRStreams::kZYRStreamWrite);
}

// ---- in memory ------------------------------------------------------------------------------

void BM_ASCII85_Ours(benchmark::State& state) {
    const auto& in = input();
    // 5 characters per 4 bytes, 2 line-end bytes per 80 characters, and the tail.
    // One target for all iterations, as the peer reuses its buffer: page faults are not
    // what is measured.
    auto target = memoryTarget(kInputSize / 4 * 5 / 80 * 82 + 1024);
    touch(*target);
    for (auto _ : state) {
        target->reOpen(ZYRStreams::kZYRStreamWrite);
        ZYRStd::CZYRStreamFilterASCII85 filter(target);
        filter.write(in.data(), 1, kInputSize);
        filter.close();
        benchmark::DoNotOptimize(target->getEOF());
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kInputSize);
}

// A plain encoder, written the obvious way: a group at a time, one character at a time.
void BM_ASCII85_Plain(benchmark::State& state) {
    const auto& in = input();
    std::string out;
    out.reserve(kInputSize / 4 * 5 / 80 * 82 + 1024);
    for (auto _ : state) {
        out.clear();
        unsigned int column = 0;
        for (size_t i = 0; i + 4 <= in.size(); i += 4) {
            uint32_t v = (uint32_t{in[i]} << 24) | (uint32_t{in[i + 1]} << 16) |
                         (uint32_t{in[i + 2]} << 8) | in[i + 3];
            char digits[5];
            for (int d = 4; d >= 0; --d) {
                digits[d] = static_cast<char>('!' + v % 85);
                v /= 85;
            }
            for (char c : digits) {
                if (column == 80) {
                    out += "\r\n";
                    column = 0;
                }
                out += c;
                ++column;
            }
        }
        out += "~>\r\n";
        benchmark::DoNotOptimize(out.data());
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kInputSize);
}

void BM_ASCIIHex_Ours(benchmark::State& state) {
    const auto& in = input();
    auto target = memoryTarget(
        ZYRStd::CZYRStreamFilterASCIIHEX::approximateEncodedLength(kInputSize, nullptr, nullptr));
    // The peer's buffer is zero-filled before its loop; touch ours too, so that neither
    // side counts first-touch page faults.
    touch(*target);
    for (auto _ : state) {
        target->reOpen(ZYRStreams::kZYRStreamWrite);
        ZYRStd::CZYRStreamFilterASCIIHEX filter(target);
        filter.write(in.data(), 1, kInputSize);
        filter.close();
        benchmark::DoNotOptimize(target->getEOF());
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kInputSize);
}

// OpenSSL's hexadecimal text of a buffer (upper case, no line breaks).
void BM_ASCIIHex_OpenSSL(benchmark::State& state) {
    const auto& in = input();
    std::vector<char> out(2 * size_t{kInputSize} + 1);
    for (auto _ : state) {
        size_t length = 0;
        OPENSSL_buf2hexstr_ex(out.data(), out.size(), &length, in.data(), in.size(), '\0');
        benchmark::DoNotOptimize(length);
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kInputSize);
}

// ---- whole processes ------------------------------------------------------------------------

// A 64 MiB file of random bytes, and a place for the outputs, for the life of the program.
struct Workspace {
    Workspace() {
        std::string pattern = (std::filesystem::temp_directory_path() / "zyrbench-XXXXXX").string();
        if (::mkdtemp(pattern.data()))
            dir = pattern;
        std::ofstream(inputPath(), std::ios::binary)
            .write(reinterpret_cast<const char*>(input().data()), kInputSize);
    }
    ~Workspace() {
        std::error_code ignored;
        std::filesystem::remove_all(dir, ignored);
    }
    std::string inputPath() const { return dir + "/input.bin"; }
    std::string outputPath() const { return dir + "/output.txt"; }
    std::string dir;
};

const Workspace& workspace() {
    static const Workspace w;
    return w;
}

std::string zyrstdPath() {
    std::error_code ignored;
    const auto self = std::filesystem::read_symlink("/proc/self/exe", ignored);
    return (self.parent_path() / "zyrstd").string();
}

// Runs the command with its standard output in the workspace; false when it failed.
bool runProcess(std::vector<std::string> args) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 0, "/dev/null", O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, 1, workspace().outputPath().c_str(),
                                     O_WRONLY | O_CREAT | O_TRUNC, 0600);
    std::vector<char*> argv;
    for (std::string& arg : args)
        argv.push_back(arg.data());
    argv.push_back(nullptr);
    pid_t pid = 0;
    const int spawned = posix_spawnp(&pid, argv[0], &actions, nullptr, argv.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    if (spawned != 0)
        return false;
    int status = 0;
    while (::waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

void processBenchmark(benchmark::State& state, const std::vector<std::string>& command) {
    if (!runProcess(command)) {
        state.SkipWithError(("cannot run " + command[0]).c_str());
        return;
    }
    for (auto _ : state)
        if (!runProcess(command))
            state.SkipWithError(("failed: " + command[0]).c_str());
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kInputSize);
}

void BM_Process_Zyrstd_ASCII85(benchmark::State& state) {
    processBenchmark(state, {zyrstdPath(), "encode", "ascii85", workspace().inputPath()});
}

void BM_Process_Basenc_Z85(benchmark::State& state) {
    processBenchmark(state, {"basenc", "--z85", workspace().inputPath()});
}

void BM_Process_Zyrstd_ASCIIHex(benchmark::State& state) {
    processBenchmark(state, {zyrstdPath(), "encode", "asciihex", workspace().inputPath()});
}

void BM_Process_Basenc_Base16(benchmark::State& state) {
    processBenchmark(state, {"basenc", "--base16", workspace().inputPath()});
}

BENCHMARK(BM_ASCII85_Ours)->Repetitions(5)->MinTime(0.5)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_ASCII85_Plain)->Repetitions(5)->MinTime(0.5)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_ASCIIHex_Ours)->Repetitions(5)->MinTime(0.5)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_ASCIIHex_OpenSSL)->Repetitions(5)->MinTime(0.5)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Process_Zyrstd_ASCII85)
    ->Repetitions(5)
    ->Iterations(2)
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Process_Basenc_Z85)
    ->Repetitions(5)
    ->Iterations(2)
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Process_Zyrstd_ASCIIHex)
    ->Repetitions(5)
    ->Iterations(2)
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Process_Basenc_Base16)
    ->Repetitions(5)
    ->Iterations(2)
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);

} // namespace

int main(int argc, char** argv) {
    return zyrbench::runWithRatios(
        argc, argv,
        {{"ascii85_64MiB_memory", "BM_ASCII85_Ours", "BM_ASCII85_Plain"},
         {"asciihex_64MiB_memory", "BM_ASCIIHex_Ours", "BM_ASCIIHex_OpenSSL"},
         {"zyrstd_ascii85_vs_basenc_z85", "BM_Process_Zyrstd_ASCII85/iterations:2/real_time",
          "BM_Process_Basenc_Z85/iterations:2/real_time"},
         {"zyrstd_asciihex_vs_basenc_base16", "BM_Process_Zyrstd_ASCIIHex/iterations:2/real_time",
          "BM_Process_Basenc_Base16/iterations:2/real_time"}});
}
