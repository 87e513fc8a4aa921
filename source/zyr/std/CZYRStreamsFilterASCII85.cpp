// ASCII85 encoder and decoder over streams.
#include "zyr/std/CZYRStreamsFilterASCII85.h"

#include <cstdio>
#include <cstring>

#include "zyr/std/CZYRError.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRStreamsFilterASCII85";
constexpr unsigned int kInputChunk = 64 * 1024;

uint32_t loadBigEndian(const unsigned char* p) {
    return (uint32_t{p[0]} << 24) | (uint32_t{p[1]} << 16) | (uint32_t{p[2]} << 8) | p[3];
}

// The five base-85 digits of `v`, most significant first.
void toDigits(uint32_t v, char* out) {
    for (int i = 4; i >= 0; --i) {
        out[i] = static_cast<char>('!' + v % 85);
        v /= 85;
    }
}

// PDF white space: NUL, tab, line feed, form feed, carriage return and space.
bool isWhite(unsigned char c) {
    return c == ' ' || c == '\n' || c == '\r' || c == '\t' || c == '\f' || c == '\0';
}

// Error texts are not owned by the errors that carry them; this one lives until the next
// decoding error on the same thread.
const char* decodeMessage(const char* filter, const char* what, int character,
                          unsigned long long offset) {
    thread_local char text[160];
    if (character >= 0)
        std::snprintf(text, sizeof text, "%s: %s 0x%02X at offset %llu", filter, what, character,
                      offset);
    else
        std::snprintf(text, sizeof text, "%s: %s at offset %llu", filter, what, offset);
    return text;
}

} // namespace

// ---- CZYRStreamFilterASCII85 ---------------------------------------------------------------

CZYRStreamFilterASCII85::CZYRStreamFilterASCII85(
    const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target, const char* prefix, const char* eod,
    bool allowZ)
    : allowZ_(allowZ), target_(target) {
    const char* marker = eod ? eod : "~>";
    const size_t markerLength = std::strlen(marker);
    if (markerLength >= sizeof eod_)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                        "CZYRStreamFilterASCII85::CZYRStreamFilterASCII85: eod is too long",
                        kSource, __LINE__);
    const char* lead = prefix ? prefix : "";
    const size_t leadLength = std::strlen(lead);
    if (leadLength >= sizeof prefix_)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                        "CZYRStreamFilterASCII85::CZYRStreamFilterASCII85: prefix is too long",
                        kSource, __LINE__);
    std::memcpy(eod_, marker, markerLength + 1);
    eodLength_ = static_cast<unsigned int>(markerLength);
    std::memcpy(prefix_, lead, leadLength + 1);
    prefixLength_ = static_cast<unsigned int>(leadLength);
    linePos_ = prefixLength_;
}

CZYRStreamFilterASCII85::~CZYRStreamFilterASCII85() {
    try {
        close();
    } catch (...) {
        // A destructor has no one to report to.
    }
}

unsigned int CZYRStreamFilterASCII85::write(const void* buf, unsigned int size,
                                            unsigned int count) {
    if (!target_)
        throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed,
                        "CZYRStreamFilterASCII85::write - stream invalid", kSource, __LINE__);
    const unsigned int total = size * count;
    if (total == 0)
        return 0;
    const auto* p = static_cast<const unsigned char*>(buf);
    unsigned int remaining = total;
    while (remaining > 0) {
        if (groupCount_ == 4) {
            encodeGroups(group_, 4);
            groupCount_ = 0;
        }
        if (groupCount_ == 0 && remaining > 4) {
            // Whole groups straight from the input, keeping back the last one (1 to 4
            // bytes), which waits for the next byte or for close.
            const unsigned int bulk = (remaining - 1) / 4 * 4;
            encodeGroups(p, bulk);
            p += bulk;
            remaining -= bulk;
        }
        while (remaining > 0 && groupCount_ < 4) {
            group_[groupCount_++] = *p++;
            --remaining;
        }
    }
    return total;
}

unsigned int CZYRStreamFilterASCII85::write(const void* buf, unsigned int size, unsigned int count,
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
        err.setError(ZYRPublic::kZYRErrorFileOpFailed, "CZYRStreamFilterASCII85::write - failed",
                     kSource, __LINE__);
    }
    return 0;
}

void CZYRStreamFilterASCII85::encodeGroups(const unsigned char* p, unsigned int n) {
    for (const unsigned char* end = p + n; p < end; p += 4) {
        const uint32_t value = loadBigEndian(p);
        if (value == 0 && allowZ_) {
            place("z", 1);
        } else if (lineLength_ + 5 <= kLineChars) {
            toDigits(value, line_ + linePos_);
            lineLength_ += 5;
            linePos_ += 5;
        } else {
            char digits[5];
            toDigits(value, digits);
            place(digits, 5);
        }
    }
}

void CZYRStreamFilterASCII85::place(const char* chars, unsigned int n, bool keepPair) {
    if (lineLength_ + n > kLineChars) {
        unsigned int head = kLineChars - lineLength_;
        if (keepPair && n - head == 1)
            --head;
        std::memcpy(line_ + linePos_, chars, head);
        lineLength_ += head;
        linePos_ += head;
        emitLine();
        chars += head;
        n -= head;
    }
    std::memcpy(line_ + linePos_, chars, n);
    lineLength_ += n;
    linePos_ += n;
}

void CZYRStreamFilterASCII85::emitLine() {
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

void CZYRStreamFilterASCII85::close() {
    if (!target_)
        return;
    if (groupCount_ > 0) {
        unsigned char last[4] = {};
        std::memcpy(last, group_, groupCount_);
        // k bytes give k + 1 digits; a final group is never "z".
        char tail[5 + sizeof eod_];
        toDigits(loadBigEndian(last), tail);
        std::memcpy(tail + groupCount_ + 1, eod_, eodLength_);
        const unsigned int n = groupCount_ + 1 + eodLength_;
        groupCount_ = 0;
        place(tail, n, true);
        emitLine();
    }
    target_.reset();
}

// ---- CZYRStreamFilterASCII85Decode ---------------------------------------------------------

CZYRStreamFilterASCII85Decode::CZYRStreamFilterASCII85Decode(
    const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& source)
    : source_(source) {
    input_.grow(kInputChunk);
}

CZYRStreamFilterASCII85Decode::~CZYRStreamFilterASCII85Decode() = default;

[[noreturn]] void CZYRStreamFilterASCII85Decode::fail(const char* what, int character,
                                                      unsigned long long offset, int line) {
    failure_ = {what, character, offset, line};
    throw CZYRError(ZYRPublic::kZYRErrorInvalidData,
                    decodeMessage("ASCII85Decode", what, character, offset), kSource, line);
}

bool CZYRStreamFilterASCII85Decode::fill() {
    inOffset_ += inLength_;
    inPos_ = 0;
    inLength_ = source_->read(input_.data(), 1, input_.count());
    return inLength_ > 0;
}

void CZYRStreamFilterASCII85Decode::emit(uint32_t value, unsigned int bytes) {
    for (unsigned int i = 0; i < bytes; ++i) {
        const auto byte = static_cast<unsigned char>(value >> (24 - 8 * i));
        if (destRoom_ > 0) {
            *dest_++ = byte;
            --destRoom_;
        } else {
            pending_[outLength_++] = byte;
        }
    }
}

void CZYRStreamFilterASCII85Decode::digit(unsigned int value, unsigned long long offset) {
    if (digits_ == 0)
        groupOffset_ = offset;
    value_ = value_ * 85 + value;
    if (++digits_ == 5) {
        if (value_ > 0xFFFFFFFFull)
            fail("group out of range", -1, groupOffset_, __LINE__);
        emit(static_cast<uint32_t>(value_), 4);
        value_ = 0;
        digits_ = 0;
    }
}

void CZYRStreamFilterASCII85Decode::finish(unsigned long long offset) {
    if (sawOpen_) {
        // A lone '<' was data after all.
        sawOpen_ = false;
        digit('<' - '!', offset - 1);
    }
    if (digits_ == 1)
        fail("final group of one character", -1, groupOffset_, __LINE__);
    if (digits_ > 1) {
        // Missing digits count as the highest digit, 'u'; k digits give k - 1 bytes.
        const unsigned int bytes = digits_ - 1;
        for (unsigned int i = digits_; i < 5; ++i)
            value_ = value_ * 85 + 84;
        if (value_ > 0xFFFFFFFFull)
            fail("group out of range", -1, groupOffset_, __LINE__);
        emit(static_cast<uint32_t>(value_), bytes);
        value_ = 0;
        digits_ = 0;
    }
    done_ = true;
}

void CZYRStreamFilterASCII85Decode::consume(unsigned char c, unsigned long long offset) {
    if (sawTilde_) {
        if (isWhite(c))
            return;
        if (c != '>')
            fail("'~' not followed by '>'", -1, tildeOffset_, __LINE__);
        finish(offset);
        return;
    }
    if (atStart_) {
        if (isWhite(c))
            return;
        if (sawOpen_) {
            sawOpen_ = false;
            atStart_ = false;
            if (c == '~')
                return; // "<~" opens Adobe's framing
            digit('<' - '!', offset - 1);
        } else if (c == '<') {
            sawOpen_ = true;
            return;
        } else {
            atStart_ = false;
        }
    }
    if (c >= '!' && c <= 'u') {
        digit(c - '!', offset);
    } else if (c == 'z') {
        if (digits_ != 0)
            fail("'z' inside a group", -1, offset, __LINE__);
        emit(0, 4);
    } else if (c == '~') {
        sawTilde_ = true;
        tildeOffset_ = offset;
    } else if (!isWhite(c)) {
        fail("invalid character", c, offset, __LINE__);
    }
}

unsigned int CZYRStreamFilterASCII85Decode::read(void* buf, unsigned int size, unsigned int count) {
    if (failure_.what)
        fail(failure_.what, failure_.character, failure_.offset, failure_.line);
    if (!source_)
        throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed,
                        "CZYRStreamFilterASCII85Decode::read - stream invalid", kSource, __LINE__);
    const unsigned int wanted = size * count;
    dest_ = static_cast<unsigned char*>(buf);
    destRoom_ = wanted;
    while (destRoom_ > 0 && outPos_ < outLength_) {
        *dest_++ = pending_[outPos_++];
        --destRoom_;
    }
    if (outPos_ == outLength_)
        outPos_ = outLength_ = 0;
    while (destRoom_ > 0 && !done_) {
        if (inPos_ == inLength_ && !fill()) {
            if (sawTilde_)
                fail("'~' not followed by '>'", -1, tildeOffset_, __LINE__);
            finish(inOffset_);
            break;
        }
        const unsigned char* in = input_.data();
        while (destRoom_ > 0 && inPos_ < inLength_ && !done_) {
            const unsigned char c = in[inPos_];
            consume(c, inOffset_ + inPos_);
            ++inPos_;
        }
    }
    const unsigned int got = wanted - destRoom_;
    dest_ = nullptr;
    destRoom_ = 0;
    return got;
}

unsigned int CZYRStreamFilterASCII85Decode::read(void* buf, unsigned int size, unsigned int count,
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
                     "CZYRStreamFilterASCII85Decode::read - failed", kSource, __LINE__);
    }
    return 0;
}

} // namespace ZYRStd
