// MD5 of 1 MiB: createMD5Hash, update and getDigest against OpenSSL's EVP digest.
#include <benchmark/benchmark.h>
#include <openssl/evp.h>

#include <memory>
#include <random>
#include <vector>

#include "BenchSupport.h"
#include "ZYRStd.h"

namespace {

constexpr unsigned int kInputSize = 1 << 20;

const std::vector<unsigned char>& input() {
    static const std::vector<unsigned char> bytes = [] {
        std::vector<unsigned char> out(kInputSize);
        std::mt19937 random(1321);
        for (auto& b : out)
            b = static_cast<unsigned char>(random());
        return out;
    }();
    return bytes;
}

ZYRStd::ZYRDigest ourDigest(const std::vector<unsigned char>& in) {
    std::unique_ptr<ZYRStd::CZYRHash> hash(ZYRStd::createMD5Hash());
    hash->update(in.data(), static_cast<unsigned int>(in.size()));
    return hash->getDigest();
}

ZYRStd::ZYRDigest peerDigest(const std::vector<unsigned char>& in) {
    std::unique_ptr<EVP_MD_CTX, decltype(&EVP_MD_CTX_free)> context(EVP_MD_CTX_new(),
                                                                    EVP_MD_CTX_free);
    ZYRStd::ZYRDigest digest{};
    EVP_DigestInit_ex(context.get(), EVP_md5(), nullptr);
    EVP_DigestUpdate(context.get(), in.data(), in.size());
    EVP_DigestFinal_ex(context.get(), digest.data(), nullptr);
    return digest;
}

void BM_MD5_Ours(benchmark::State& state) {
    const auto& in = input();
    if (ourDigest(in) != peerDigest(in)) {
        state.SkipWithError("our digest differs from OpenSSL's");
        return;
    }
    for (auto _ : state)
        benchmark::DoNotOptimize(ourDigest(in));
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kInputSize);
}

void BM_MD5_OpenSSL(benchmark::State& state) {
    const auto& in = input();
    for (auto _ : state)
        benchmark::DoNotOptimize(peerDigest(in));
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kInputSize);
}

BENCHMARK(BM_MD5_Ours)->Repetitions(5)->MinTime(0.2)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_MD5_OpenSSL)->Repetitions(5)->MinTime(0.2)->Unit(benchmark::kMicrosecond);

} // namespace

int main(int argc, char** argv) {
    return zyrbench::runWithRatios(argc, argv, {{"md5_1MiB", "BM_MD5_Ours", "BM_MD5_OpenSSL"}});
}
