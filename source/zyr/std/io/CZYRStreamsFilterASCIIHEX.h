/// \file
/// ASCIIHex: the encoder that writes the text of the PDF filter ASCIIHexDecode into a
/// stream, line by line, and the decoder that reads such text back from a stream.
#pragma once

#include "IZYRStream.h"
#include "I_Error.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/io/ZYRStreamsFilterCommon.h"

namespace ZYRStd {

/// Lines hold the prefix, 80 lower-case digits (40 bytes) and "\r\n"; a full line goes
/// out at once. The end marker follows the last digits at close.
class ZYRSTD_API CZYRStreamFilterASCIIHEX : public CZYRClientBase {
public:
    /// `eod` null means ">" (at most 14 characters); `prefix` null means none (at most 2);
    /// longer ones raise kZYRErrorBadParam.
    CZYRStreamFilterASCIIHEX(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target,
                             const char* prefix = nullptr, const char* eod = nullptr);
    /// Copies the encoder's state; both copies then write to the same target.
    CZYRStreamFilterASCIIHEX(const CZYRStreamFilterASCIIHEX& other) = default;
    /// Copies the encoder's state; both copies then write to the same target.
    CZYRStreamFilterASCIIHEX& operator=(const CZYRStreamFilterASCIIHEX& other) = default;
    /// Closes; an error of that last write is dropped (call close() to see it).
    ~CZYRStreamFilterASCIIHEX() override;

    /// Encodes size * count bytes and returns that number. A failing target write drops
    /// the target; every later write raises kZYRErrorFileOpFailed.
    unsigned int write(const void* buf, unsigned int size, unsigned int count);
    /// The same, recording any failure in `err` and returning 0; it encodes also when `err`
    /// already holds an error.
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::I_Error& err);
    /// Writes the end marker and the last line (also when no byte was written) and drops
    /// the target; a second close does nothing.
    void close();

    /// The filter's name.
    const char* getFilterName() const { return "ASCIIHEX"; }
    /// The target stream, with one more reference; empty after close.
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> getTargetStream() const { return lines_.target; }

    /// An upper estimate of the encoded size of n bytes, for sizing a buffer; saturates at
    /// the largest unsigned value.
    static unsigned int approximateEncodedLength(unsigned int n, const char* prefix,
                                                 const char* eod);

private:
    StreamsFilterCommon::EncodedLines lines_;
};

/// Reads ASCIIHex text (ISO 32000-1, 7.4.3) from a stream and gives back the bytes. White
/// space is ignored, digits of either case pair up into bytes, ">" ends the data (so does
/// the end of the source) and an odd last digit counts as followed by 0. Anything else
/// raises kZYRErrorInvalidData with a literal text naming the filter and the fault; the
/// offset in the encoded data and the offending byte are kept by the filter.
class ZYRSTD_API CZYRStreamFilterASCIIHEXDecode : public CZYRClientBase {
public:
    /// Decodes what it reads from `source` (one more reference held until close).
    explicit CZYRStreamFilterASCIIHEXDecode(
        /// Decodes what it reads from `source` (one more reference held until close).
        const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& source);
    CZYRStreamFilterASCIIHEXDecode(const CZYRStreamFilterASCIIHEXDecode&) = delete;
    CZYRStreamFilterASCIIHEXDecode& operator=(const CZYRStreamFilterASCIIHEXDecode&) = delete;
    ~CZYRStreamFilterASCIIHEXDecode() override;

    /// Up to size * count decoded bytes; fewer only at the end of the data, then 0.
    unsigned int read(void* buf, unsigned int size, unsigned int count);
    /// The same, recording a failure in `err` and returning 0.
    unsigned int read(void* buf, unsigned int size, unsigned int count, ZYRPublic::I_Error& err);
    /// True once the end of the data has been reached.
    bool isAtEOD() const { return done_; }
    /// Drops the source; later reads raise kZYRErrorFileOpFailed.
    void close() { input_.source.reset(); }

    /// The filter's name.
    const char* getFilterName() const { return "ASCIIHexDecode"; }
    /// The source stream, with one more reference; empty after close.
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> getSourceStream() const { return input_.source; }
    /// After a decoding error: its offset in the encoded data, and the offending byte (-1
    /// when the fault is not one byte's).
    unsigned long long getFailureOffset() const { return failure_.offset; }
    /// After a decoding error: the offending byte, -1 when the fault is not one byte's.
    int getFailureCharacter() const { return failure_.character; }

private:
    [[noreturn]] void fail(int character, unsigned long long offset, int line);

    StreamsFilterCommon::DecodeInput input_;
    int high_ = -1; ///< a first digit waiting for its pair
    bool done_ = false;
    StreamsFilterCommon::DecodeFailure failure_;
};

} // namespace ZYRStd
