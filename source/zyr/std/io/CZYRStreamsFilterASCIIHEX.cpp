// ASCIIHex encoder and decoder over streams.
#include "zyr/std/io/CZYRStreamsFilterASCIIHEX.h"

#include <array>
#if defined(__SSE2__)
#include <emmintrin.h>
#endif
#include <cstring>

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRStreamsFilterASCIIHEX";

// Two lower-case digits per byte value.
constexpr std::array<char, 512> kHexPairs = [] {
    constexpr char digits[] = "0123456789abcdef";
    std::array<char, 512> pairs{};
    for (unsigned int b = 0; b < 256; ++b) {
        pairs[2 * b] = digits[b >> 4];
        pairs[2 * b + 1] = digits[b & 15];
    }
    return pairs;
}();

// What a byte of encoded text is to the decoder: 0 to 15 a digit, or one of these.
constexpr unsigned char kWhite = 16;
constexpr unsigned char kEnd = 17;
constexpr unsigned char kInvalid = 18;

constexpr std::array<unsigned char, 256> kClasses = [] {
    std::array<unsigned char, 256> classes{};
    for (auto& c : classes)
        c = kInvalid;
    for (unsigned int c = 0; c < 10; ++c)
        classes['0' + c] = static_cast<unsigned char>(c);
    for (unsigned int c = 0; c < 6; ++c) {
        classes['a' + c] = static_cast<unsigned char>(10 + c);
        classes['A' + c] = static_cast<unsigned char>(10 + c);
    }
    for (unsigned char c : {'\0', '\t', '\n', '\f', '\r', ' '})
        classes[c] = kWhite;
    classes['>'] = kEnd;
    return classes;
}();

// Writes the 2n lower-case digits of n bytes. Sixteen bytes at a time in SSE2 registers
// (part of every x86-64): nibbles interleave high first, and a digit above 9 moves from
// '0' + d up to 'a' + d - 10.
void encodeHexDigits(const unsigned char* in, unsigned int n, char* out) {
    unsigned int i = 0;
#if defined(__SSE2__)
    const __m128i lowNibbles = _mm_set1_epi8(0x0F);
    const __m128i nine = _mm_set1_epi8(9);
    const __m128i zero = _mm_set1_epi8('0');
    const __m128i letterGap = _mm_set1_epi8('a' - '0' - 10);
    auto toDigits = [&](__m128i nibbles) {
        const __m128i letters = _mm_and_si128(_mm_cmpgt_epi8(nibbles, nine), letterGap);
        return _mm_add_epi8(_mm_add_epi8(nibbles, zero), letters);
    };
    for (; i + 16 <= n; i += 16) {
        const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + i));
        const __m128i high = _mm_and_si128(_mm_srli_epi16(bytes, 4), lowNibbles);
        const __m128i low = _mm_and_si128(bytes, lowNibbles);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 2 * i),
                         toDigits(_mm_unpacklo_epi8(high, low)));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 2 * i + 16),
                         toDigits(_mm_unpackhi_epi8(high, low)));
    }
#endif
    for (; i < n; ++i)
        std::memcpy(out + 2 * i, &kHexPairs[2 * in[i]], 2);
}

} // namespace

// ---- CZYRStreamFilterASCIIHEX --------------------------------------------------------------

CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX(
    const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target, const char* prefix, const char* eod)
    : lines_(target, prefix, eod, ">",
             "CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX: eod is too long",
             "CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX: prefix is too long", kSource,
             __LINE__) {}

CZYRStreamFilterASCIIHEX::~CZYRStreamFilterASCIIHEX() {
    StreamsFilterCommon::closeQuietly(*this);
}

unsigned int CZYRStreamFilterASCIIHEX::write(const void* buf, unsigned int size,
                                             unsigned int count) {
    lines_.requireTarget("CZYRStreamFilterASCIIHEX::write - stream invalid", kSource, __LINE__);
    const unsigned int total = size * count;
    const auto* p = static_cast<const unsigned char*>(buf);
    unsigned int remaining = total;
    // Every byte adds two digits and a full line goes out at once, so lines break after
    // 40 bytes however the input is divided.
    while (remaining > 0) {
        unsigned int n = lines_.room() / 2;
        if (n > remaining)
            n = remaining;
        encodeHexDigits(p, n, lines_.next());
        p += n;
        remaining -= n;
        lines_.advance(2 * n);
        if (lines_.room() < 2)
            lines_.emit();
    }
    return total;
}

unsigned int CZYRStreamFilterASCIIHEX::write(const void* buf, unsigned int size, unsigned int count,
                                             ZYRPublic::I_Error& err) {
    return StreamsFilterCommon::recordingErrors(err, "CZYRStreamFilterASCIIHEX::write - failed",
                                                kSource, __LINE__,
                                                [&] { return write(buf, size, count); });
}

void CZYRStreamFilterASCIIHEX::close() {
    if (!lines_.target)
        return;
    if (lines_.eodLength > lines_.room())
        lines_.emit();
    lines_.append(lines_.eod, lines_.eodLength);
    lines_.emit();
    lines_.target.reset();
}

unsigned int CZYRStreamFilterASCIIHEX::approximateEncodedLength(unsigned int n, const char* prefix,
                                                                const char* eod) {
    // In 64 bits: the 32-bit sum wraps for large n and would undersize the buffer.
    const unsigned long long lines = 2ull * n / 80 + 1;
    const unsigned long long prefixLength = prefix ? std::strlen(prefix) : 0;
    const unsigned long long eodLength = eod ? std::strlen(eod) : 1;
    const unsigned long long total = lines * (prefixLength + 80) + 2 * lines + eodLength;
    return total > 0xFFFFFFFFull ? 0xFFFFFFFFu : static_cast<unsigned int>(total);
}

// ---- CZYRStreamFilterASCIIHEXDecode --------------------------------------------------------

CZYRStreamFilterASCIIHEXDecode::CZYRStreamFilterASCIIHEXDecode(
    const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& source)
    : input_(source) {}

CZYRStreamFilterASCIIHEXDecode::~CZYRStreamFilterASCIIHEXDecode() = default;

[[noreturn]] void CZYRStreamFilterASCIIHEXDecode::fail(int character, unsigned long long offset,
                                                       int line) {
    failure_ = {"ASCIIHexDecode: invalid character", character, offset, line};
    failure_.raise(kSource);
}

unsigned int CZYRStreamFilterASCIIHEXDecode::read(void* buf, unsigned int size,
                                                  unsigned int count) {
    if (failure_.what)
        fail(failure_.character, failure_.offset, failure_.line);
    input_.requireSource("CZYRStreamFilterASCIIHEXDecode::read - stream invalid", kSource,
                         __LINE__);
    const unsigned int wanted = size * count;
    auto* out = static_cast<unsigned char*>(buf);
    unsigned int got = 0;
    while (got < wanted && !done_) {
        if (input_.pos == input_.length && !input_.fill()) {
            if (high_ >= 0)
                out[got++] = static_cast<unsigned char>(high_ << 4);
            high_ = -1;
            done_ = true;
            break;
        }
        const unsigned char* in = input_.buffer.data();
        unsigned int pos = input_.pos;
        while (got < wanted && pos < input_.length) {
            const unsigned char c = in[pos];
            const unsigned char cls = kClasses[c];
            if (cls < 16) {
                if (high_ < 0) {
                    high_ = cls;
                } else {
                    out[got++] = static_cast<unsigned char>((high_ << 4) | cls);
                    high_ = -1;
                }
            } else if (cls == kEnd) {
                if (high_ >= 0)
                    out[got++] = static_cast<unsigned char>(high_ << 4);
                high_ = -1;
                done_ = true;
                ++pos;
                break;
            } else if (cls == kInvalid) {
                input_.pos = pos;
                fail(c, input_.offset + pos, __LINE__);
            }
            ++pos;
        }
        input_.pos = pos;
    }
    return got;
}

unsigned int CZYRStreamFilterASCIIHEXDecode::read(void* buf, unsigned int size, unsigned int count,
                                                  ZYRPublic::I_Error& err) {
    if (err.errorOccurred())
        return 0; // a decoder's status that already failed reads nothing
    return StreamsFilterCommon::recordingErrors(
        err, "CZYRStreamFilterASCIIHEXDecode::read - failed", kSource, __LINE__,
        [&] { return read(buf, size, count); });
}

} // namespace ZYRStd
