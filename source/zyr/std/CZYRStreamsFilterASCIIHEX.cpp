// ASCIIHex encoder and decoder over streams.
#include "zyr/std/CZYRStreamsFilterASCIIHEX.h"

#include <array>
#include <cstdio>
#include <cstring>

#include "zyr/std/CZYRError.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRStreamsFilterASCIIHEX";
constexpr unsigned int kInputChunk = 64 * 1024;

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

} // namespace

// ---- CZYRStreamFilterASCIIHEX --------------------------------------------------------------

CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX(
    const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target, const char* prefix, const char* eod)
    : target_(target) {
    const char* marker = eod ? eod : ">";
    const size_t markerLength = std::strlen(marker);
    if (markerLength >= sizeof eod_)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                        "CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX: eod is too long",
                        kSource, __LINE__);
    const char* lead = prefix ? prefix : "";
    const size_t leadLength = std::strlen(lead);
    if (leadLength >= sizeof prefix_)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                        "CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX: prefix is too long",
                        kSource, __LINE__);
    std::memcpy(eod_, marker, markerLength + 1);
    eodLength_ = static_cast<unsigned int>(markerLength);
    std::memcpy(prefix_, lead, leadLength + 1);
    prefixLength_ = static_cast<unsigned int>(leadLength);
    linePos_ = prefixLength_;
}

CZYRStreamFilterASCIIHEX::~CZYRStreamFilterASCIIHEX() {
    try {
        close();
    } catch (...) {
        // A destructor has no one to report to.
    }
}

unsigned int CZYRStreamFilterASCIIHEX::write(const void* buf, unsigned int size,
                                             unsigned int count) {
    if (!target_)
        throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed,
                        "CZYRStreamFilterASCIIHEX::write - stream invalid", kSource, __LINE__);
    const unsigned int total = size * count;
    const auto* p = static_cast<const unsigned char*>(buf);
    unsigned int remaining = total;
    // Every byte adds two digits and a full line goes out at once, so lines break after
    // 40 bytes however the input is divided.
    while (remaining > 0) {
        unsigned int n = (kLineChars - lineLength_) / 2;
        if (n > remaining)
            n = remaining;
        char* out = line_ + linePos_;
        for (unsigned int i = 0; i < n; ++i)
            std::memcpy(out + 2 * i, &kHexPairs[2 * p[i]], 2);
        p += n;
        remaining -= n;
        lineLength_ += 2 * n;
        linePos_ += 2 * n;
        if (kLineChars - lineLength_ < 2)
            emitLine();
    }
    return total;
}

unsigned int CZYRStreamFilterASCIIHEX::write(const void* buf, unsigned int size, unsigned int count,
                                             ZYRPublic::I_Error& err) {
    if (err.errorOccurred())
        return 0;
    try {
        return write(buf, size, count);
    } catch (const CZYRError& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (const ZYRPublic::I_Error& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (...) {
        err.setError(ZYRPublic::kZYRErrorFileOpFailed, "CZYRStreamFilterASCIIHEX::write - failed",
                     kSource, __LINE__);
    }
    return 0;
}

void CZYRStreamFilterASCIIHEX::emitLine() {
    std::memcpy(line_, prefix_, prefixLength_);
    line_[linePos_] = '\r';
    line_[linePos_ + 1] = '\n';
    const unsigned int n = linePos_ + 2;
    lineLength_ = 0;
    linePos_ = prefixLength_;
    try {
        target_->write(line_, 1, n);
    } catch (...) {
        target_.reset();
        throw;
    }
}

void CZYRStreamFilterASCIIHEX::close() {
    if (!target_)
        return;
    if (lineLength_ + eodLength_ > kLineChars)
        emitLine();
    std::memcpy(line_ + linePos_, eod_, eodLength_);
    lineLength_ += eodLength_;
    linePos_ += eodLength_;
    emitLine();
    target_.reset();
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
    : source_(source) {
    input_.grow(kInputChunk);
}

CZYRStreamFilterASCIIHEXDecode::~CZYRStreamFilterASCIIHEXDecode() = default;

[[noreturn]] void CZYRStreamFilterASCIIHEXDecode::fail(int character, unsigned long long offset,
                                                       int line) {
    failedCharacter_ = character;
    failedOffset_ = offset;
    failedLine_ = line;
    // Error texts are not owned by the errors that carry them; this one lives until the
    // next decoding error on the same thread.
    thread_local char text[128];
    std::snprintf(text, sizeof text, "ASCIIHexDecode: invalid character 0x%02X at offset %llu",
                  character, offset);
    throw CZYRError(ZYRPublic::kZYRErrorInvalidData, text, kSource, line);
}

bool CZYRStreamFilterASCIIHEXDecode::fill() {
    inOffset_ += inLength_;
    inPos_ = 0;
    inLength_ = source_->read(input_.data(), 1, input_.count());
    return inLength_ > 0;
}

unsigned int CZYRStreamFilterASCIIHEXDecode::read(void* buf, unsigned int size,
                                                  unsigned int count) {
    if (failedCharacter_ >= 0)
        fail(failedCharacter_, failedOffset_, failedLine_);
    if (!source_)
        throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed,
                        "CZYRStreamFilterASCIIHEXDecode::read - stream invalid", kSource, __LINE__);
    const unsigned int wanted = size * count;
    auto* out = static_cast<unsigned char*>(buf);
    unsigned int got = 0;
    while (got < wanted && !done_) {
        if (inPos_ == inLength_ && !fill()) {
            if (high_ >= 0)
                out[got++] = static_cast<unsigned char>(high_ << 4);
            high_ = -1;
            done_ = true;
            break;
        }
        const unsigned char* in = input_.data();
        unsigned int pos = inPos_;
        while (got < wanted && pos < inLength_) {
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
                inPos_ = pos;
                fail(c, inOffset_ + pos, __LINE__);
            }
            ++pos;
        }
        inPos_ = pos;
    }
    return got;
}

unsigned int CZYRStreamFilterASCIIHEXDecode::read(void* buf, unsigned int size, unsigned int count,
                                                  ZYRPublic::I_Error& err) {
    if (err.errorOccurred())
        return 0;
    try {
        return read(buf, size, count);
    } catch (const CZYRError& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (const ZYRPublic::I_Error& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (...) {
        err.setError(ZYRPublic::kZYRErrorFileOpFailed,
                     "CZYRStreamFilterASCIIHEXDecode::read - failed", kSource, __LINE__);
    }
    return 0;
}

} // namespace ZYRStd
