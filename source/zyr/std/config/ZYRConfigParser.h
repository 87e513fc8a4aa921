/// \file
/// The setup-file parser: key and value pairs, in file order, handed to a callback.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"

namespace ZYRPublic {

/// What the `data` argument of ParseConfigData holds.
enum eZYRConfigDataType : int32_t {
    kZYRConfigDataNone = 0,      ///< nothing: the call returns at once
    kZYRConfigDataBuffer = 1,    ///< the text itself, `size` bytes
    kZYRConfigDataFilePath = 2,  ///< a zero-terminated narrow path
    kZYRConfigDataFilePathW = 3, ///< a zero-terminated UTF-16 path
};

} // namespace ZYRPublic

namespace ZYRStd {

class CZYRBaseStream;

/// Receives each pair. Both texts point into the parser's buffer and live only during the
/// call; the result is not used.
class ZYRSTD_API IZYRConfigParserCBProc {
public:
    virtual ~IZYRConfigParserCBProc();
    /// One pair, in file order, on the parsing thread.
    virtual void proc(const char* key, const char* value) = 0;
};

/// A callback that also wants to know where it is: the parser calls `atLine` with the
/// number of the line (from 1; LF, CR and CR LF each end one) that holds the pair it is
/// about to deliver, and also just before it throws the missing-value error of a line.
class ZYRSTD_API IZYRConfigParserLineCBProc : public IZYRConfigParserCBProc {
public:
    ~IZYRConfigParserLineCBProc() override;
    /// The line, counted from 1, of the pair about to be delivered or of the missing value about to
    /// be reported.
    virtual void atLine(unsigned int line) = 0;
};

/// Type 0 returns at once; a null `data` or a `size` of 0 throws kZYRErrorBadParam; type 1
/// parses the `size` bytes at `data`, types 2 and 3 the file named there (the file system's
/// errors pass through); any other type throws kZYRErrorBadParam.
ZYRSTD_API void ParseConfigData(unsigned char* data, ZYRPublic::eZYRConfigDataType type,
                                unsigned int size, IZYRConfigParserCBProc& cb);

/// Parses from the stream's position to its end. A line with a key and no value throws
/// kZYRErrorKeyNotFound after every earlier pair has been delivered. Reads ahead in blocks,
/// so the stream's position afterwards is not the end of the last line parsed.
ZYRSTD_API void ParseConfigsBuffer(CZYRBaseStream& stream, IZYRConfigParserCBProc& cb);

/// "true" in any case, or a number other than 0.
ZYRSTD_API bool TrueOrFalse(const char* s);
/// False only for "low" in any case.
ZYRSTD_API bool HighOrLow(const char* s);

} // namespace ZYRStd
