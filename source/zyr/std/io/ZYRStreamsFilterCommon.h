/// \file
/// Pieces shared by the text filters over streams (ASCII85, ASCIIHex): the line an encoder
/// builds and sends to its target, the buffered input a decoder reads from its source, the
/// decoding failure that every later read raises again, and the recording of errors in an
/// error status. Each filter passes its own texts, source name and line, so its errors keep
/// naming its own class.
#pragma once

#include <cstddef>
#include <cstdio>
#include <cstring>

#include "IZYRStream.h"
#include "I_Error.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/memory/CZYRMemBuffer.h"

namespace ZYRStd::StreamsFilterCommon {

/// Runs `call` (a read or a write), recording a failure in `err` and returning 0 instead of
/// throwing. The call runs whatever `err` already holds: an encoder's data must not be
/// dropped because of some earlier, unrelated failure. `failed`, `source` and `line`
/// describe a failure that is not an error of the library.
template <class Call>
unsigned int recordingErrors(ZYRPublic::I_Error& err, const char* failed, const char* source,
                             int line, Call&& call) {
    try {
        return call();
    } catch (const CZYRError& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (const ZYRPublic::I_Error& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (...) {
        err.setError(ZYRPublic::kZYRErrorFileOpFailed, failed, source, line);
    }
    return 0;
}

/// For destructors: closes `filter`, dropping any error, which has no one to report to.
template <class Filter> void closeQuietly(Filter& filter) noexcept {
    try {
        filter.close();
    } catch (...) {
    }
}

/// The line an encoder fills: the prefix, at most kLineChars encoded characters and "\r\n",
/// sent to the target as a whole. The end marker and the prefix are kept for the filter.
struct EncodedLines {
    static constexpr unsigned int kLineChars = 80;
    static constexpr unsigned int kMaxEod = 14;
    static constexpr unsigned int kMaxPrefix = 2;

    /// `eod` null means `defaultEod`, `prefix` null means none; a longer one than allowed
    /// raises kZYRErrorBadParam with `eodTooLong` or `prefixTooLong`, checked in that order.
    EncodedLines(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target, const char* prefix,
                 const char* eod, const char* defaultEod, const char* eodTooLong,
                 const char* prefixTooLong, const char* source, int line)
        : target(target) {
        const char* marker = eod ? eod : defaultEod;
        const size_t markerLength = std::strlen(marker);
        if (markerLength > kMaxEod)
            throw CZYRError(ZYRPublic::kZYRErrorBadParam, eodTooLong, source, line);
        const char* lead = prefix ? prefix : "";
        const size_t leadLength = std::strlen(lead);
        if (leadLength > kMaxPrefix)
            throw CZYRError(ZYRPublic::kZYRErrorBadParam, prefixTooLong, source, line);
        std::memcpy(this->eod, marker, markerLength + 1);
        eodLength = static_cast<unsigned int>(markerLength);
        std::memcpy(this->prefix, lead, leadLength + 1);
        prefixLength = static_cast<unsigned int>(leadLength);
        pos = prefixLength;
    }

    /// Raises kZYRErrorFileOpFailed with `message` once the target is gone.
    void requireTarget(const char* message, const char* source, int line) const {
        if (!target)
            throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, message, source, line);
    }

    unsigned int room() const { return kLineChars - length; }
    char* next() { return line + pos; }
    /// Counts n characters just placed at next().
    void advance(unsigned int n) {
        length += n;
        pos += n;
    }
    void append(const char* chars, unsigned int n) {
        std::memcpy(next(), chars, n);
        advance(n);
    }

    /// Completes the line and writes it to the target, starting a new one; a failing write
    /// drops the target.
    void emit() {
        std::memcpy(line, prefix, prefixLength);
        line[pos] = '\r';
        line[pos + 1] = '\n';
        const unsigned int n = pos + 2;
        length = 0;
        pos = prefixLength;
        try {
            target->write(line, 1, n);
        } catch (...) {
            target.reset();
            throw;
        }
    }

    char line[kMaxPrefix + kLineChars + 2] = {};
    unsigned int pos = 0;    ///< next free byte of line
    unsigned int length = 0; ///< encoded characters in line
    char eod[kMaxEod + 1] = {};
    unsigned int eodLength = 0;
    char prefix[kMaxPrefix + 1] = {};
    unsigned int prefixLength = 0;
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> target;
};

/// The encoded text a decoder reads from its source, a chunk at a time.
struct DecodeInput {
    static constexpr unsigned int kChunk = 64 * 1024;

    explicit DecodeInput(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& source)
        : source(source) {
        buffer.grow(kChunk);
    }

    /// Raises kZYRErrorFileOpFailed with `message` once the source is gone.
    void requireSource(const char* message, const char* sourceName, int line) const {
        if (!source)
            throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, message, sourceName, line);
    }

    /// Reads the next chunk; false at the end of the source.
    bool fill() {
        offset += length;
        pos = 0;
        length = source->read(buffer.data(), 1, buffer.count());
        return length > 0;
    }

    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> source;
    CZYRMemBuffer<unsigned char> buffer;
    unsigned int pos = 0;
    unsigned int length = 0;
    unsigned long long offset = 0; ///< of buffer[0] in the encoded data
};

/// A decoding failure, kept so that every later read raises it again.
struct DecodeFailure {
    const char* what = nullptr; ///< "<filter>: <what>", a literal; null: none
    int character = -1;         ///< the offending byte, or -1
    unsigned long long offset = 0;
    int line = 0;

    /// Raises kZYRErrorInvalidData with `what`. Errors do not own their texts and outlive
    /// the filter and its thread, so the text is a literal; the offending byte and the
    /// offset stay with the filter for its caller to ask.
    [[noreturn]] void raise(const char* source) const {
        throw CZYRError(ZYRPublic::kZYRErrorInvalidData, what, source, line);
    }
};

} // namespace ZYRStd::StreamsFilterCommon
