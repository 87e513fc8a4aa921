// ASCIIHex: the encoder that writes the text of the PDF filter ASCIIHexDecode into a
// stream, line by line, and the decoder that reads such text back from a stream.
#pragma once

#include "IZYRStream.h"
#include "I_Error.h"
#include "ZYRStdExport.h"
#include "zyr/std/CZYRClientBase.h"
#include "zyr/std/CZYRMemBuffer.h"
#include "zyr/std/CZYRSmartPtr.h"

namespace ZYRStd {

// Lines hold the prefix, 80 lower-case digits (40 bytes) and "\r\n"; a full line goes
// out at once. The end marker follows the last digits at close.
class ZYRSTD_API CZYRStreamFilterASCIIHEX : public CZYRClientBase {
public:
    // `eod` null means ">" (at most 14 characters); `prefix` null means none (at most 2);
    // longer ones raise kZYRErrorBadParam.
    CZYRStreamFilterASCIIHEX(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& target,
                             const char* prefix = nullptr, const char* eod = nullptr);
    CZYRStreamFilterASCIIHEX(const CZYRStreamFilterASCIIHEX& other) = default;
    CZYRStreamFilterASCIIHEX& operator=(const CZYRStreamFilterASCIIHEX& other) = default;
    // Closes; an error of that last write is dropped (call close() to see it).
    ~CZYRStreamFilterASCIIHEX() override;

    // Encodes size * count bytes and returns that number. A failing target write drops
    // the target; every later write raises kZYRErrorFileOpFailed.
    unsigned int write(const void* buf, unsigned int size, unsigned int count);
    // The same, recording any failure in `err` and returning 0; a status that already
    // holds an error makes it a no-op.
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::I_Error& err);
    // Writes the end marker and the last line (also when no byte was written) and drops
    // the target; a second close does nothing.
    void close();

    const char* getFilterName() const { return "ASCIIHEX"; }
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> getTargetStream() const { return target_; }

    // An upper estimate of the encoded size of n bytes, for sizing a buffer; saturates at
    // the largest unsigned value.
    static unsigned int approximateEncodedLength(unsigned int n, const char* prefix,
                                                 const char* eod);

private:
    static constexpr unsigned int kLineChars = 80;

    void emitLine();

    unsigned int lineLength_ = 0;
    char eod_[15] = {};
    unsigned int eodLength_ = 0;
    char prefix_[3] = {};
    unsigned int prefixLength_ = 0;
    char line_[100] = {};
    unsigned int linePos_ = 0; // next free byte of line_
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> target_;
};

// Reads ASCIIHex text (ISO 32000-1, 7.4.3) from a stream and gives back the bytes. White
// space is ignored, digits of either case pair up into bytes, ">" ends the data (so does
// the end of the source) and an odd last digit counts as followed by 0. Anything else
// raises kZYRErrorInvalidData naming the filter and the offset in the encoded data; the
// message stays valid until the next decoding error on the same thread.
class ZYRSTD_API CZYRStreamFilterASCIIHEXDecode : public CZYRClientBase {
public:
    explicit CZYRStreamFilterASCIIHEXDecode(
        const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& source);
    CZYRStreamFilterASCIIHEXDecode(const CZYRStreamFilterASCIIHEXDecode&) = delete;
    CZYRStreamFilterASCIIHEXDecode& operator=(const CZYRStreamFilterASCIIHEXDecode&) = delete;
    ~CZYRStreamFilterASCIIHEXDecode() override;

    // Up to size * count decoded bytes; fewer only at the end of the data, then 0.
    unsigned int read(void* buf, unsigned int size, unsigned int count);
    unsigned int read(void* buf, unsigned int size, unsigned int count, ZYRPublic::I_Error& err);
    bool isAtEOD() const { return done_; }
    // Drops the source; later reads raise kZYRErrorFileOpFailed.
    void close() { source_.reset(); }

    const char* getFilterName() const { return "ASCIIHexDecode"; }
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> getSourceStream() const { return source_; }

private:
    bool fill();
    [[noreturn]] void fail(int character, unsigned long long offset, int line);

    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> source_;
    CZYRMemBuffer<unsigned char> input_;
    unsigned int inPos_ = 0;
    unsigned int inLength_ = 0;
    unsigned long long inOffset_ = 0; // of input_[0] in the encoded data
    int high_ = -1;                   // a first digit waiting for its pair
    bool done_ = false;
    int failedCharacter_ = -1; // -1: no failure
    unsigned long long failedOffset_ = 0;
    int failedLine_ = 0;
};

} // namespace ZYRStd
