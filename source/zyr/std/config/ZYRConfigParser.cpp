// The setup-file parser and the value readings the option setters share.
#include "zyr/std/config/ZYRConfigParser.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <limits>
#include <utility>

#include "zyr/std/config/internal/ZYRConfigValues.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/CZYRBaseStream.h"
#include "zyr/std/io/CZYRFileSys.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/memory/CZYRMemBuffer.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/ZYRConfigParser";
// Source lines of the parser's errors, as its clients have always seen them.
constexpr int kMissingValueLine = 178;
constexpr int kInvalidDataLine = 195;
constexpr int kInvalidTypeLine = 237;

// A longer line is cut: its first bytes form one line, the next byte is dropped.
constexpr unsigned int kMaxLineBytes = 1024;
// Read-ahead block; large enough that the stream calls cost nothing next to the scanning.
constexpr unsigned int kBlockBytes = 64 * 1024;
// A byte that ends the text where a line would start.
constexpr unsigned char kEndOfText = 0xFF;

// Byte classes. Blanks are what the C library's isspace calls blank in the "C" locale;
// delimiters are the strtok set " \t=\n"; the zero byte ends a line's text as it does a
// C string.
enum : uint8_t { kBlank = 1, kLineEnd = 2, kDelimiter = 4, kZero = 8 };

constexpr std::array<uint8_t, 256> kByteClass = [] {
    std::array<uint8_t, 256> table{};
    for (const unsigned char c : {' ', '\t', '\n', '\v', '\f', '\r'})
        table[c] |= kBlank;
    table['\n'] |= kLineEnd;
    table['\r'] |= kLineEnd;
    for (const unsigned char c : {' ', '\t', '=', '\n'})
        table[c] |= kDelimiter;
    table[0] |= kZero;
    return table;
}();

bool is(unsigned char c, uint8_t classes) {
    return (kByteClass[c] & classes) != 0;
}

// Reads a stream block by block and delivers its pairs.
class ConfigScanner {
public:
    ConfigScanner(CZYRBaseStream& stream, IZYRConfigParserCBProc& cb)
        : stream_(stream), cb_(cb), lineCb_(dynamic_cast<IZYRConfigParserLineCBProc*>(&cb)) {
        block_.grow(kBlockBytes + 1); // one spare byte for a terminating zero
        std::memset(block_.data(), 0, kBlockBytes);
    }

    void run() {
        unsigned char* const block = block_.data();
        for (;;) {
            // Blanks and line ends before a line cost nothing.
            unsigned char c;
            for (;;) {
                if (pos_ == end_ && !refill())
                    return;
                c = block[pos_];
                if (!is(c, kBlank))
                    break;
                countLineEnd(c);
                ++pos_;
            }
            if (c == kEndOfText)
                return;
            afterCR_ = false;
            const unsigned int lineNumber = physicalLine_;

            const unsigned int start = pos_;
            const unsigned int limit = std::min(end_, start + kMaxLineBytes);
            unsigned int at = start;
            while (at < limit && !is(block[at], kLineEnd))
                ++at;
            if (at < end_) {
                // The byte at `at` is a line end or the one dropped after a full line; it is
                // consumed either way, and its place holds the terminating zero.
                countLineEnd(block[at]);
                pos_ = at + 1;
                parseLine(block + start, at - start, lineNumber);
                continue;
            }
            // The line goes on in the next block.
            unsigned int length = at - start;
            std::memcpy(line_, block + start, length);
            pos_ = end_;
            for (;;) {
                if (pos_ == end_ && !refill())
                    break;
                c = block[pos_++];
                if (is(c, kLineEnd)) {
                    countLineEnd(c);
                    break;
                }
                if (length == kMaxLineBytes)
                    break; // `c` is dropped
                line_[length++] = c;
            }
            parseLine(line_, length, lineNumber);
        }
    }

private:
    bool refill() {
        if (failure_)
            std::rethrow_exception(std::exchange(failure_, nullptr));
        if (atEnd_)
            return false;
        pos_ = 0;
        unsigned char* const block = block_.data();
        // A read may fill part of the block and then throw (a decoding filter meeting a bad
        // byte). The whole lines it delivered are parsed before the error goes on, as a
        // byte-by-byte reader would have: on a cleared block they end at its last line end.
        // Bytes beyond a successful read's count were never written, so clearing what the
        // last read delivered clears the block.
        std::memset(block, 0, end_);
        try {
            end_ = stream_.read(block, 1, kBlockBytes);
        } catch (...) {
            unsigned int delivered = kBlockBytes;
            while (delivered > 0 && !is(block[delivered - 1], kLineEnd))
                --delivered;
            if (delivered == 0)
                throw;
            failure_ = std::current_exception();
            end_ = delivered;
            atEnd_ = true;
        }
        atEnd_ = atEnd_ || end_ == 0;
        return end_ > 0;
    }

    // LF, CR and CR LF each end one line.
    void countLineEnd(unsigned char c) {
        if (c == '\n') {
            if (!afterCR_)
                ++physicalLine_;
            afterCR_ = false;
        } else if (c == '\r') {
            ++physicalLine_;
            afterCR_ = true;
        } else {
            afterCR_ = false;
        }
    }

    // strtok's reading of the line: the first token is the key, the second the value.
    void parseLine(unsigned char* text, unsigned int length, unsigned int lineNumber) {
        text[length] = 0;
        unsigned char* p = text;
        while (is(*p, kDelimiter))
            ++p;
        if (*p == 0 || *p == '%' || *p == '#')
            return;
        const unsigned char* key = p;
        while (!is(*p, kDelimiter | kZero))
            ++p;
        if (*p != 0) {
            *p++ = 0;
            while (is(*p, kDelimiter))
                ++p;
        }
        if (lineCb_)
            lineCb_->atLine(lineNumber);
        if (*p == 0)
            throw CZYRError(ZYRPublic::kZYRErrorKeyNotFound, "Setup file is missing Key Value",
                            kSource, kMissingValueLine);
        const unsigned char* value = p;
        while (!is(*p, kDelimiter | kZero))
            ++p;
        *p = 0;
        cb_.proc(reinterpret_cast<const char*>(key), reinterpret_cast<const char*>(value));
    }

    CZYRBaseStream& stream_;
    IZYRConfigParserCBProc& cb_;
    IZYRConfigParserLineCBProc* const lineCb_;
    CZYRMemBuffer<unsigned char> block_;
    unsigned int pos_ = 0;
    unsigned int end_ = 0;
    bool atEnd_ = false;
    std::exception_ptr failure_; // a failed read's error, raised once its lines are parsed
    unsigned int physicalLine_ = 1;
    bool afterCR_ = false;
    unsigned char line_[kMaxLineBytes + 1];
};

bool equalsIgnoringCase(const char* s, const char* lowerWord) {
    for (; *lowerWord; ++s, ++lowerWord) {
        if (*s == 0 || (*s | 0x20) != *lowerWord)
            return false;
    }
    return *s == 0;
}

const char* skipBlanks(const char* s) {
    while (is(static_cast<unsigned char>(*s), kBlank))
        ++s;
    return s;
}

} // namespace

IZYRConfigParserCBProc::~IZYRConfigParserCBProc() = default;
IZYRConfigParserLineCBProc::~IZYRConfigParserLineCBProc() = default;

void ParseConfigsBuffer(CZYRBaseStream& stream, IZYRConfigParserCBProc& cb) {
    ConfigScanner(stream, cb).run();
}

void ParseConfigData(unsigned char* data, ZYRPublic::eZYRConfigDataType type, unsigned int size,
                     IZYRConfigParserCBProc& cb) {
    if (type == ZYRPublic::kZYRConfigDataNone)
        return;
    if (!data || size == 0)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "Invalid Config Data buffer", kSource,
                        kInvalidDataLine);
    if (type == ZYRPublic::kZYRConfigDataBuffer) {
        CZYRBaseStream stream(ZYRStreams::kZYRStreamRead, size, data);
        ParseConfigsBuffer(stream, cb);
        return;
    }
    if (type != ZYRPublic::kZYRConfigDataFilePath && type != ZYRPublic::kZYRConfigDataFilePathW)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "In valid Config data bufer Type", kSource,
                        kInvalidTypeLine);
    // A narrow path is the file system's bytes: UTF-8, and any other byte kept.
    const CZYRUniString path = type == ZYRPublic::kZYRConfigDataFilePath
                                   ? ZYRFileSys::uniPathOf(reinterpret_cast<const char*>(data))
                                   : CZYRUniString(reinterpret_cast<const char16_t*>(data));
    CZYRBaseStream stream(CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>(
        CZYRFileSys::createFileStream(CZYRFileName(path), ZYRStreams::kZYRStreamRead, false)));
    ParseConfigsBuffer(stream, cb);
}

bool TrueOrFalse(const char* s) {
    if (!s)
        return false;
    return equalsIgnoringCase(s, "true") || detail::readInt32(s) != 0;
}

bool HighOrLow(const char* s) {
    return !s || !equalsIgnoringCase(s, "low");
}

namespace detail {

int64_t readInt64(const char* s, bool* found) {
    if (found)
        *found = false;
    if (!s)
        return 0;
    s = skipBlanks(s);
    const bool negative = *s == '-';
    if (*s == '-' || *s == '+')
        ++s;
    // Accumulate towards the sign so that the most negative value is reached exactly.
    constexpr int64_t kMax = std::numeric_limits<int64_t>::max();
    constexpr int64_t kMin = std::numeric_limits<int64_t>::min();
    int64_t value = 0;
    bool saturated = false;
    const char* digits = s;
    for (; *s >= '0' && *s <= '9'; ++s) {
        if (saturated)
            continue;
        const int digit = *s - '0';
        if (negative) {
            if (value < (kMin + digit) / 10) {
                value = kMin;
                saturated = true;
                continue;
            }
            value = value * 10 - digit;
        } else {
            if (value > (kMax - digit) / 10) {
                value = kMax;
                saturated = true;
                continue;
            }
            value = value * 10 + digit;
        }
    }
    if (found)
        *found = s != digits;
    return value;
}

int32_t readInt32(const char* s) {
    const int64_t value = readInt64(s);
    return static_cast<int32_t>(std::clamp<int64_t>(value, std::numeric_limits<int32_t>::min(),
                                                    std::numeric_limits<int32_t>::max()));
}

float readFloat(const char* s) {
    if (!s)
        return 0.0f;
    const double value = std::strtod(s, nullptr);
    // Narrowing a double beyond the float range is undefined; the hardware gives infinity.
    if (std::isfinite(value) && std::fabs(value) > std::numeric_limits<float>::max())
        return value > 0 ? std::numeric_limits<float>::infinity()
                         : -std::numeric_limits<float>::infinity();
    return static_cast<float>(value);
}

bool isWholeNumber(const char* s) {
    if (!s)
        return false;
    s = skipBlanks(s);
    if (*s == '-' || *s == '+')
        ++s;
    const char* digits = s;
    while (*s >= '0' && *s <= '9')
        ++s;
    return s != digits && *s == 0;
}

} // namespace detail

} // namespace ZYRStd
