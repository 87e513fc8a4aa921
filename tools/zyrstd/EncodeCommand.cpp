// zyrstd encode and decode: ASCII85 and ASCIIHex text through the library's streams and
// filters.
#include <cstdio>
#include <string>
#include <vector>

#include "AtomicOutput.h"
#include "Commands.h"
#include "EncodeArguments.h"
#include "ToolStreams.h"
#include "ToolSupport.h"
#include "ZYRHostKit.h"
#include "zyr/std/io/CZYRStreamsFilterASCII85.h"
#include "zyr/std/io/CZYRStreamsFilterASCIIHEX.h"

namespace zyrtool {

namespace {

using ZYRStd::CZYRError;

template <class Filter> void encodeAll(IZYRStream& in, Filter& filter) {
    std::vector<unsigned char> chunk(kChunk);
    for (;;) {
        const unsigned int got = in.read(chunk.data(), 1, kChunk);
        if (got == 0)
            break;
        filter.write(chunk.data(), 1, got);
    }
    filter.close();
}

// Bad encoded data is the input's fault: the report names it and where the fault is.
template <class Decoder>
void decodeAll(Decoder& decoder, IZYRStream& out, const std::string& inName) {
    std::vector<unsigned char> chunk(kChunk);
    try {
        for (;;) {
            const unsigned int got = decoder.read(chunk.data(), 1, kChunk);
            if (got == 0)
                break;
            out.write(chunk.data(), 1, got);
        }
    } catch (const CZYRError& e) {
        if (e.getError() != ZYRPublic::kZYRErrorInvalidData)
            throw;
        char where[64];
        if (decoder.getFailureCharacter() >= 0)
            std::snprintf(where, sizeof where, " 0x%02X at offset %llu",
                          decoder.getFailureCharacter(), decoder.getFailureOffset());
        else
            std::snprintf(where, sizeof where, " at offset %llu", decoder.getFailureOffset());
        failWith(inName + ": " + describe(e) + where);
    }
}

int run(int argc, char** argv, bool encoding) {
    const char* command = encoding ? "encode" : "decode";
    EncodeArguments args;
    if (const int usage = parseEncodeArguments(argc, argv, encoding, args))
        return usage;
    const std::string inName = displayName(args.in, "standard input");
    try {
        ZYRHostKit::HostSession session;
        CZYRSmartZYRRefPtr<IZYRStream> in = openInput(args.in);
        AtomicOutput out(args.out);
        try {
            if (encoding && args.kind == "ascii85") {
                ZYRStd::CZYRStreamFilterASCII85 filter(out.streamRef(), args.prefix, args.eod,
                                                       args.allowZ);
                encodeAll(*in, filter);
            } else if (encoding) {
                ZYRStd::CZYRStreamFilterASCIIHEX filter(out.streamRef(), args.prefix, args.eod);
                encodeAll(*in, filter);
            } else if (args.kind == "ascii85") {
                ZYRStd::CZYRStreamFilterASCII85Decode decoder(in);
                decodeAll(decoder, out.stream(), inName);
            } else {
                ZYRStd::CZYRStreamFilterASCIIHEXDecode decoder(in);
                decodeAll(decoder, out.stream(), inName);
            }
        } catch (const CZYRError& e) {
            // Bad encoded data is the input's fault; name it.
            if (e.getError() == ZYRPublic::kZYRErrorInvalidData)
                return report(command, inName + ": " + describe(e));
            throw;
        }
        out.commit();
        return 0;
    } catch (const Failure& f) {
        return report(command, f.message);
    } catch (const CZYRError& e) {
        return report(command, describe(e));
    }
}

} // namespace

int runEncode(int argc, char** argv) {
    return run(argc, argv, true);
}

int runDecode(int argc, char** argv) {
    return run(argc, argv, false);
}

} // namespace zyrtool
