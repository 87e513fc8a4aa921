// ASCII85 encoder and decoder over streams.
#include "zyr/std/io/CZYRStreamsFilterASCII85.h"

#include <cstring>

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRStreamsFilterASCII85";

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

} // namespace

// ---- CZYRStreamFilterASCII85 ---------------------------------------------------------------

CZYRStreamFilterASCII85::CZYRStreamFilterASCII85(
    const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target, const char* prefix, const char* eod,
    bool allowZ)
    : allowZ_(allowZ),
      lines_(target, prefix, eod, "~>",
             "CZYRStreamFilterASCII85::CZYRStreamFilterASCII85: eod is too long",
             "CZYRStreamFilterASCII85::CZYRStreamFilterASCII85: prefix is too long", kSource,
             __LINE__) {}

CZYRStreamFilterASCII85::~CZYRStreamFilterASCII85() {
    StreamsFilterCommon::closeQuietly(*this);
}

unsigned int CZYRStreamFilterASCII85::write(const void* buf, unsigned int size,
                                            unsigned int count) {
    lines_.requireTarget("CZYRStreamFilterASCII85::write - stream invalid", kSource, __LINE__);
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
    return StreamsFilterCommon::recordingErrors(err, "CZYRStreamFilterASCII85::write - failed",
                                                kSource, __LINE__,
                                                [&] { return write(buf, size, count); });
}

void CZYRStreamFilterASCII85::encodeGroups(const unsigned char* p, unsigned int n) {
    for (const unsigned char* end = p + n; p < end; p += 4) {
        const uint32_t value = loadBigEndian(p);
        if (value == 0 && allowZ_) {
            place("z", 1);
        } else if (lines_.room() >= 5) {
            toDigits(value, lines_.next());
            lines_.advance(5);
        } else {
            char digits[5];
            toDigits(value, digits);
            place(digits, 5);
        }
    }
}

void CZYRStreamFilterASCII85::place(const char* chars, unsigned int n, bool keepPair) {
    if (n > lines_.room()) {
        unsigned int head = lines_.room();
        if (keepPair && n - head == 1)
            --head;
        lines_.append(chars, head);
        lines_.emit();
        chars += head;
        n -= head;
    }
    lines_.append(chars, n);
}

void CZYRStreamFilterASCII85::close() {
    if (!lines_.target)
        return;
    if (groupCount_ > 0) {
        unsigned char last[4] = {};
        std::memcpy(last, group_, groupCount_);
        // k bytes give k + 1 digits; a final group is never "z".
        char tail[5 + StreamsFilterCommon::EncodedLines::kMaxEod];
        toDigits(loadBigEndian(last), tail);
        std::memcpy(tail + groupCount_ + 1, lines_.eod, lines_.eodLength);
        const unsigned int n = groupCount_ + 1 + lines_.eodLength;
        groupCount_ = 0;
        place(tail, n, true);
        lines_.emit();
    }
    lines_.target.reset();
}

// ---- CZYRStreamFilterASCII85Decode ---------------------------------------------------------

CZYRStreamFilterASCII85Decode::CZYRStreamFilterASCII85Decode(
    const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& source)
    : input_(source) {}

CZYRStreamFilterASCII85Decode::~CZYRStreamFilterASCII85Decode() = default;

[[noreturn]] void CZYRStreamFilterASCII85Decode::fail(const char* what, int character,
                                                      unsigned long long offset, int line) {
    failure_ = {what, character, offset, line};
    failure_.raise(kSource);
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
            fail("ASCII85Decode: group out of range", -1, groupOffset_, __LINE__);
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
        fail("ASCII85Decode: final group of one character", -1, groupOffset_, __LINE__);
    if (digits_ > 1) {
        // Missing digits count as the highest digit, 'u'; k digits give k - 1 bytes.
        const unsigned int bytes = digits_ - 1;
        for (unsigned int i = digits_; i < 5; ++i)
            value_ = value_ * 85 + 84;
        if (value_ > 0xFFFFFFFFull)
            fail("ASCII85Decode: group out of range", -1, groupOffset_, __LINE__);
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
            fail("ASCII85Decode: '~' not followed by '>'", -1, tildeOffset_, __LINE__);
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
            fail("ASCII85Decode: 'z' inside a group", -1, offset, __LINE__);
        emit(0, 4);
    } else if (c == '~') {
        sawTilde_ = true;
        tildeOffset_ = offset;
    } else if (!isWhite(c)) {
        fail("ASCII85Decode: invalid character", c, offset, __LINE__);
    }
}

unsigned int CZYRStreamFilterASCII85Decode::read(void* buf, unsigned int size, unsigned int count) {
    if (failure_.what)
        fail(failure_.what, failure_.character, failure_.offset, failure_.line);
    input_.requireSource("CZYRStreamFilterASCII85Decode::read - stream invalid", kSource, __LINE__);
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
        if (input_.pos == input_.length && !input_.fill()) {
            if (sawTilde_)
                fail("ASCII85Decode: '~' not followed by '>'", -1, tildeOffset_, __LINE__);
            finish(input_.offset);
            break;
        }
        const unsigned char* in = input_.buffer.data();
        while (destRoom_ > 0 && input_.pos < input_.length && !done_) {
            const unsigned char c = in[input_.pos];
            consume(c, input_.offset + input_.pos);
            ++input_.pos;
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
        return 0; // a decoder's status that already failed reads nothing
    return StreamsFilterCommon::recordingErrors(err, "CZYRStreamFilterASCII85Decode::read - failed",
                                                kSource, __LINE__,
                                                [&] { return read(buf, size, count); });
}

} // namespace ZYRStd
