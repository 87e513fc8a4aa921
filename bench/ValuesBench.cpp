// Values: dictionary set/get against std::unordered_map, building interned strings against
// ICU, and string equality against std::u16string.
#include <absl/container/flat_hash_map.h>
#include <benchmark/benchmark.h>
#include <unicode/unistr.h>

#include <string>
#include <unordered_map>
#include <vector>

#include "BenchSupport.h"
#include "ZYRStd.h"

namespace {

using namespace ZYRStd;

constexpr unsigned int kKeys = 100000;

std::string keyText(unsigned int n) {
    return "ColorantKey/" + std::to_string(n * 2654435761u);
}

const std::vector<CZYRUniString>& ourKeys() {
    static const std::vector<CZYRUniString> keys = [] {
        std::vector<CZYRUniString> out;
        out.reserve(kKeys);
        for (unsigned int n = 0; n < kKeys; ++n)
            out.emplace_back(keyText(n).c_str());
        return out;
    }();
    return keys;
}

const std::vector<std::u16string>& peerKeys() {
    static const std::vector<std::u16string> keys = [] {
        std::vector<std::u16string> out;
        out.reserve(kKeys);
        for (unsigned int n = 0; n < kKeys; ++n) {
            const std::string text = keyText(n);
            out.emplace_back(text.begin(), text.end());
        }
        return out;
    }();
    return keys;
}

void BM_DictSetGet(benchmark::State& state) {
    const auto& keys = ourKeys();
    for (auto _ : state) {
        CZYRDict dict;
        for (unsigned int n = 0; n < kKeys; ++n)
            dict.set(keys[n], n);
        unsigned int sum = 0;
        for (unsigned int n = 0; n < kKeys; ++n) {
            unsigned int value = 0;
            dict.get(keys[n], &value);
            sum += value;
        }
        benchmark::DoNotOptimize(sum);
    }
}

void BM_UnorderedMapSetGet(benchmark::State& state) {
    const auto& keys = peerKeys();
    for (auto _ : state) {
        std::unordered_map<std::u16string, uint32_t> map;
        for (unsigned int n = 0; n < kKeys; ++n)
            map[keys[n]] = n;
        unsigned int sum = 0;
        for (unsigned int n = 0; n < kKeys; ++n)
            sum += map.find(keys[n])->second;
        benchmark::DoNotOptimize(sum);
    }
}

// The stronger peer: an open-addressing table with SIMD probing.
void BM_AbslFlatHashMapSetGet(benchmark::State& state) {
    const auto& keys = peerKeys();
    for (auto _ : state) {
        absl::flat_hash_map<std::u16string, uint32_t> map;
        for (unsigned int n = 0; n < kKeys; ++n)
            map[keys[n]] = n;
        unsigned int sum = 0;
        for (unsigned int n = 0; n < kKeys; ++n)
            sum += map.find(keys[n])->second;
        benchmark::DoNotOptimize(sum);
    }
}

void BM_InternedUniString(benchmark::State& state) {
    for (auto _ : state) {
        CZYRUniString s("DeviceCMYK");
        benchmark::DoNotOptimize(s.getImpl());
    }
}

void BM_IcuUnicodeString(benchmark::State& state) {
    for (auto _ : state) {
        icu::UnicodeString s("DeviceCMYK", "ASCII");
        benchmark::DoNotOptimize(s.getBuffer());
    }
}

const char16_t kText32[] = u"ColorSpaceConversionParams/Prime";
static_assert(sizeof kText32 / sizeof kText32[0] == 33);

void BM_UniStringEquals(benchmark::State& state) {
    C_Error err;
    const CZYRUniString a(createUniString(kText32, err), false);
    const CZYRUniString b(createUniString(kText32, err), false);
    for (auto _ : state)
        benchmark::DoNotOptimize(a == b);
}

void BM_U16StringEquals(benchmark::State& state) {
    const std::u16string a(kText32), b(kText32);
    for (auto _ : state)
        benchmark::DoNotOptimize(a == b);
}

BENCHMARK(BM_DictSetGet)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_UnorderedMapSetGet)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_AbslFlatHashMapSetGet)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_InternedUniString);
BENCHMARK(BM_IcuUnicodeString);
BENCHMARK(BM_UniStringEquals);
BENCHMARK(BM_U16StringEquals);

} // namespace

int main(int argc, char** argv) {
    zyrbench::installFront();
    InitCommonUniStrings();
    InitDynamicUniStringCache();
    ourKeys();
    peerKeys();
    const int result = zyrbench::runWithRatios(
        argc, argv,
        {{"dict_set_get_100k", "BM_DictSetGet", "BM_UnorderedMapSetGet"},
         {"dict_vs_absl", "BM_DictSetGet", "BM_AbslFlatHashMapSetGet"},
         {"unistring_interned_build", "BM_InternedUniString", "BM_IcuUnicodeString"},
         {"unistring_equals_32", "BM_UniStringEquals", "BM_U16StringEquals"}});
    ReleaseDynamicUniStringCache();
    ReleaseCommonUniStrings();
    return result;
}
