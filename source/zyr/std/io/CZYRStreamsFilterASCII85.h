/// \file
/// ASCII85: the encoder that writes the text of the PDF filter ASCII85Decode into a
/// stream, line by line, and the decoder that reads such text back from a stream.
#pragma once

#include "IZYRStream.h"
#include "I_Error.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/io/ZYRStreamsFilterCommon.h"

namespace ZYRStd {

/// Lines hold the prefix, at most 80 encoded characters and "\r\n". A group of four bytes
/// is encoded when the next byte arrives or at close, so a line goes out only when it is
/// full and more text follows.
class ZYRSTD_API CZYRStreamFilterASCII85 : public CZYRClientBase {
public:
    /// `eod` null means "~>" (at most 14 characters); `prefix` null means none (at most 2);
    /// longer ones raise kZYRErrorBadParam. `allowZ` writes an all-zero group as "z".
    CZYRStreamFilterASCII85(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target,
                            const char* prefix = nullptr, const char* eod = nullptr,
                            bool allowZ = true);
    /// Copies the encoder's state; both copies then write to the same target.
    CZYRStreamFilterASCII85(const CZYRStreamFilterASCII85& other) = default;
    /// Copies the encoder's state; both copies then write to the same target.
    CZYRStreamFilterASCII85& operator=(const CZYRStreamFilterASCII85& other) = default;
    /// Closes; an error of that last write is dropped (call close() to see it).
    ~CZYRStreamFilterASCII85() override;

    /// Encodes size * count bytes and returns that number. A failing target write drops
    /// the target; every later write raises kZYRErrorFileOpFailed.
    unsigned int write(const void* buf, unsigned int size, unsigned int count);
    /// The same, recording any failure in `err` and returning 0; it encodes also when `err`
    /// already holds an error.
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::I_Error& err);
    /// Encodes the last partial group, writes the end marker and the last line, and drops
    /// the target. Writes nothing when no byte was ever written; a second close does nothing.
    void close();

    /// The filter's name.
    const char* getFilterName() const { return "ASCII85"; }
    /// The target stream, with one more reference; empty after close.
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> getTargetStream() const { return lines_.target; }

private:
    void encodeGroups(const unsigned char* p, unsigned int n);
    /// Places encoded characters, completing and emitting the line when they do not fit.
    /// `keepPair` never leaves a single character for the next line.
    void place(const char* chars, unsigned int n, bool keepPair = false);

    unsigned char group_[4] = {};
    unsigned int groupCount_ = 0;
    bool allowZ_;
    StreamsFilterCommon::EncodedLines lines_;
};

/// Reads ASCII85 text (ISO 32000-1, 7.4.2) from a stream and gives back the bytes. White
/// space is ignored, "z" stands for four zero bytes between groups, a final partial group
/// of 2 to 4 characters gives 1 to 3 bytes, "~>" ends the data (so does the end of the
/// source) and a leading "<~" (Adobe's framing) is skipped. Anything else raises
/// kZYRErrorInvalidData with a literal text naming the filter and the fault; the offset in the
/// encoded data and the offending byte are kept by the filter.
class ZYRSTD_API CZYRStreamFilterASCII85Decode : public CZYRClientBase {
public:
    /// Decodes what it reads from `source` (one more reference held until close).
    explicit CZYRStreamFilterASCII85Decode(
        /// Decodes what it reads from `source` (one more reference held until close).
        const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& source);
    CZYRStreamFilterASCII85Decode(const CZYRStreamFilterASCII85Decode&) = delete;
    CZYRStreamFilterASCII85Decode& operator=(const CZYRStreamFilterASCII85Decode&) = delete;
    ~CZYRStreamFilterASCII85Decode() override;

    /// Up to size * count decoded bytes; fewer only at the end of the data, then 0.
    unsigned int read(void* buf, unsigned int size, unsigned int count);
    /// The same, recording a failure in `err` and returning 0.
    unsigned int read(void* buf, unsigned int size, unsigned int count, ZYRPublic::I_Error& err);
    /// True once the end of the data has been reached and every byte handed out.
    bool isAtEOD() const { return done_ && outPos_ == outLength_; }
    /// Drops the source; later reads raise kZYRErrorFileOpFailed.
    void close() { input_.source.reset(); }

    /// The filter's name.
    const char* getFilterName() const { return "ASCII85Decode"; }
    /// The source stream, with one more reference; empty after close.
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> getSourceStream() const { return input_.source; }
    /// After a decoding error: its offset in the encoded data, and the offending byte (-1
    /// when the fault is not one byte's).
    unsigned long long getFailureOffset() const { return failure_.offset; }
    /// After a decoding error: the offending byte, -1 when the fault is not one byte's.
    int getFailureCharacter() const { return failure_.character; }

private:
    void consume(unsigned char c, unsigned long long offset);
    void digit(unsigned int value, unsigned long long offset);
    void finish(unsigned long long offset);
    void emit(uint32_t value, unsigned int bytes);
    [[noreturn]] void fail(const char* what, int character, unsigned long long offset, int line);

    StreamsFilterCommon::DecodeInput input_;
    uint64_t value_ = 0;
    unsigned int digits_ = 0;
    unsigned long long groupOffset_ = 0;
    bool atStart_ = true;  ///< only white space so far
    bool sawOpen_ = false; ///< a leading '<' that may start "<~"
    bool sawTilde_ = false;
    unsigned long long tildeOffset_ = 0;
    bool done_ = false;
    /// Decoded bytes waiting for room in the caller's buffer.
    unsigned char pending_[4] = {};
    unsigned int outPos_ = 0;
    unsigned int outLength_ = 0;
    /// Where the caller's buffer is being filled during read().
    unsigned char* dest_ = nullptr;
    unsigned int destRoom_ = 0;
    StreamsFilterCommon::DecodeFailure failure_;
};

} // namespace ZYRStd
