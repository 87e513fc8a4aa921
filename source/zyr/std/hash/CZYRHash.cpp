// MD5 (RFC 1321) and the unique-identifier counter.
#include "zyr/std/hash/CZYRHash.h"

#include <algorithm>
#include <atomic>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

namespace {

constexpr const char* kHashSource = "source/zyr/std/CZYRHash";

// The RFC 1321 context: 88 bytes, laid out as the reference code has it.
struct MD5Context {
    uint32_t state[4];
    uint32_t count[2]; // message length in bits, low word first
    unsigned char buffer[64];
};
static_assert(sizeof(MD5Context) == 88);

// MD5 reads its input as little-endian words; memcpy keeps unaligned input legal.
inline uint32_t loadWord(const unsigned char* block, int index) {
    uint32_t word;
    std::memcpy(&word, block + 4 * index, sizeof word);
    if constexpr (std::endian::native == std::endian::big)
        word = __builtin_bswap32(word);
    return word;
}

inline void storeWord(unsigned char* out, uint32_t word) {
    for (int i = 0; i < 4; ++i)
        out[i] = static_cast<unsigned char>(word >> (8 * i));
}

// In each step the newest word is b, so the terms that do not need it (a, the message
// word, the constant, and the parts of the round function built from c and d only) are
// summed first and leave b's chain as short as possible.
template <int S>
inline void stepF(uint32_t& a, uint32_t b, uint32_t c, uint32_t d, uint32_t m, uint32_t k) {
    a = std::rotl(a + m + k + (d ^ (b & (c ^ d))), S) + b;
}

// G = (b & d) | (c & ~d); the two halves never share a bit, so they may be added.
template <int S>
inline void stepG(uint32_t& a, uint32_t b, uint32_t c, uint32_t d, uint32_t m, uint32_t k) {
    a = std::rotl(a + m + k + (c & ~d) + (b & d), S) + b;
}

template <int S>
inline void stepH(uint32_t& a, uint32_t b, uint32_t c, uint32_t d, uint32_t m, uint32_t k) {
    a = std::rotl(a + m + k + (b ^ (c ^ d)), S) + b;
}

template <int S>
inline void stepI(uint32_t& a, uint32_t b, uint32_t c, uint32_t d, uint32_t m, uint32_t k) {
    a = std::rotl(a + m + k + (c ^ (b | ~d)), S) + b;
}

// Runs the compression function over whole 64-byte blocks read in place.
void compressBlocks(uint32_t state[4], const unsigned char* p, std::size_t blocks) {
    uint32_t a = state[0], b = state[1], c = state[2], d = state[3];
    for (; blocks != 0; --blocks, p += 64) {
        const uint32_t a0 = a, b0 = b, c0 = c, d0 = d;

        stepF<7>(a, b, c, d, loadWord(p, 0), 0xd76aa478);
        stepF<12>(d, a, b, c, loadWord(p, 1), 0xe8c7b756);
        stepF<17>(c, d, a, b, loadWord(p, 2), 0x242070db);
        stepF<22>(b, c, d, a, loadWord(p, 3), 0xc1bdceee);
        stepF<7>(a, b, c, d, loadWord(p, 4), 0xf57c0faf);
        stepF<12>(d, a, b, c, loadWord(p, 5), 0x4787c62a);
        stepF<17>(c, d, a, b, loadWord(p, 6), 0xa8304613);
        stepF<22>(b, c, d, a, loadWord(p, 7), 0xfd469501);
        stepF<7>(a, b, c, d, loadWord(p, 8), 0x698098d8);
        stepF<12>(d, a, b, c, loadWord(p, 9), 0x8b44f7af);
        stepF<17>(c, d, a, b, loadWord(p, 10), 0xffff5bb1);
        stepF<22>(b, c, d, a, loadWord(p, 11), 0x895cd7be);
        stepF<7>(a, b, c, d, loadWord(p, 12), 0x6b901122);
        stepF<12>(d, a, b, c, loadWord(p, 13), 0xfd987193);
        stepF<17>(c, d, a, b, loadWord(p, 14), 0xa679438e);
        stepF<22>(b, c, d, a, loadWord(p, 15), 0x49b40821);

        stepG<5>(a, b, c, d, loadWord(p, 1), 0xf61e2562);
        stepG<9>(d, a, b, c, loadWord(p, 6), 0xc040b340);
        stepG<14>(c, d, a, b, loadWord(p, 11), 0x265e5a51);
        stepG<20>(b, c, d, a, loadWord(p, 0), 0xe9b6c7aa);
        stepG<5>(a, b, c, d, loadWord(p, 5), 0xd62f105d);
        stepG<9>(d, a, b, c, loadWord(p, 10), 0x02441453);
        stepG<14>(c, d, a, b, loadWord(p, 15), 0xd8a1e681);
        stepG<20>(b, c, d, a, loadWord(p, 4), 0xe7d3fbc8);
        stepG<5>(a, b, c, d, loadWord(p, 9), 0x21e1cde6);
        stepG<9>(d, a, b, c, loadWord(p, 14), 0xc33707d6);
        stepG<14>(c, d, a, b, loadWord(p, 3), 0xf4d50d87);
        stepG<20>(b, c, d, a, loadWord(p, 8), 0x455a14ed);
        stepG<5>(a, b, c, d, loadWord(p, 13), 0xa9e3e905);
        stepG<9>(d, a, b, c, loadWord(p, 2), 0xfcefa3f8);
        stepG<14>(c, d, a, b, loadWord(p, 7), 0x676f02d9);
        stepG<20>(b, c, d, a, loadWord(p, 12), 0x8d2a4c8a);

        stepH<4>(a, b, c, d, loadWord(p, 5), 0xfffa3942);
        stepH<11>(d, a, b, c, loadWord(p, 8), 0x8771f681);
        stepH<16>(c, d, a, b, loadWord(p, 11), 0x6d9d6122);
        stepH<23>(b, c, d, a, loadWord(p, 14), 0xfde5380c);
        stepH<4>(a, b, c, d, loadWord(p, 1), 0xa4beea44);
        stepH<11>(d, a, b, c, loadWord(p, 4), 0x4bdecfa9);
        stepH<16>(c, d, a, b, loadWord(p, 7), 0xf6bb4b60);
        stepH<23>(b, c, d, a, loadWord(p, 10), 0xbebfbc70);
        stepH<4>(a, b, c, d, loadWord(p, 13), 0x289b7ec6);
        stepH<11>(d, a, b, c, loadWord(p, 0), 0xeaa127fa);
        stepH<16>(c, d, a, b, loadWord(p, 3), 0xd4ef3085);
        stepH<23>(b, c, d, a, loadWord(p, 6), 0x04881d05);
        stepH<4>(a, b, c, d, loadWord(p, 9), 0xd9d4d039);
        stepH<11>(d, a, b, c, loadWord(p, 12), 0xe6db99e5);
        stepH<16>(c, d, a, b, loadWord(p, 15), 0x1fa27cf8);
        stepH<23>(b, c, d, a, loadWord(p, 2), 0xc4ac5665);

        stepI<6>(a, b, c, d, loadWord(p, 0), 0xf4292244);
        stepI<10>(d, a, b, c, loadWord(p, 7), 0x432aff97);
        stepI<15>(c, d, a, b, loadWord(p, 14), 0xab9423a7);
        stepI<21>(b, c, d, a, loadWord(p, 5), 0xfc93a039);
        stepI<6>(a, b, c, d, loadWord(p, 12), 0x655b59c3);
        stepI<10>(d, a, b, c, loadWord(p, 3), 0x8f0ccc92);
        stepI<15>(c, d, a, b, loadWord(p, 10), 0xffeff47d);
        stepI<21>(b, c, d, a, loadWord(p, 1), 0x85845dd1);
        stepI<6>(a, b, c, d, loadWord(p, 8), 0x6fa87e4f);
        stepI<10>(d, a, b, c, loadWord(p, 15), 0xfe2ce6e0);
        stepI<15>(c, d, a, b, loadWord(p, 6), 0xa3014314);
        stepI<21>(b, c, d, a, loadWord(p, 13), 0x4e0811a1);
        stepI<6>(a, b, c, d, loadWord(p, 4), 0xf7537e82);
        stepI<10>(d, a, b, c, loadWord(p, 11), 0xbd3af235);
        stepI<15>(c, d, a, b, loadWord(p, 2), 0x2ad7d2bb);
        stepI<21>(b, c, d, a, loadWord(p, 9), 0xeb86d391);

        a += a0;
        b += b0;
        c += c0;
        d += d0;
    }
    state[0] = a;
    state[1] = b;
    state[2] = c;
    state[3] = d;
}

class CZYRMD5Hash final : public CZYRHash {
public:
    void update(void const* data, unsigned int length) override {
        if (finalized_)
            throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall,
                            "Can't Update MD5Hash after finalized", kHashSource, __LINE__);
        if (!data || length == 0)
            return;
        absorb(static_cast<const unsigned char*>(data), length);
    }

    ZYRDigest getDigest() override {
        if (!finalized_)
            finish();
        return digest_;
    }

private:
    void absorb(const unsigned char* in, std::size_t length) {
        std::size_t used = (context_.count[0] >> 3) & 63;
        const uint64_t bits =
            ((uint64_t{context_.count[1]} << 32) | context_.count[0]) + (uint64_t{length} << 3);
        context_.count[0] = static_cast<uint32_t>(bits);
        context_.count[1] = static_cast<uint32_t>(bits >> 32);

        if (used != 0) {
            const std::size_t take = std::min(64 - used, length);
            std::memcpy(context_.buffer + used, in, take);
            in += take;
            length -= take;
            used += take;
            if (used < 64)
                return;
            compressBlocks(context_.state, context_.buffer, 1);
        }
        const std::size_t blocks = length / 64;
        compressBlocks(context_.state, in, blocks);
        in += blocks * 64;
        length -= blocks * 64;
        if (length != 0)
            std::memcpy(context_.buffer, in, length);
    }

    void finish() {
        unsigned char bitCount[8];
        storeWord(bitCount, context_.count[0]);
        storeWord(bitCount + 4, context_.count[1]);

        // Pad with 0x80 and zeros up to 56 bytes into a block, then append the length.
        static constexpr unsigned char padding[64] = {0x80};
        const std::size_t used = (context_.count[0] >> 3) & 63;
        absorb(padding, used < 56 ? 56 - used : 120 - used);
        absorb(bitCount, sizeof bitCount);

        for (int i = 0; i < 4; ++i)
            storeWord(digest_.data() + 4 * i, context_.state[i]);
        // The context may hold the last bytes of the message; leave nothing behind.
        std::memset(&context_, 0, sizeof context_);
        finalized_ = true;
    }

    MD5Context context_{{0x67452301, 0xefcdab89, 0x98badcfe, 0x10325476}, {0, 0}, {}};
    ZYRDigest digest_{};
    bool finalized_ = false;
};

} // namespace

CZYRHash::~CZYRHash() = default;

CZYRHash* createMD5Hash() {
    try {
        return new CZYRMD5Hash();
    } catch (const std::bad_alloc&) {
        // The class-level operator new reports an exhausted front by throwing.
        return nullptr;
    }
}

CZYRHash* createMD5Hash(unsigned char* data, unsigned int length) {
    CZYRHash* hash = createMD5Hash();
    if (hash && data && length != 0)
        hash->update(data, length);
    return hash;
}

} // namespace ZYRStd
