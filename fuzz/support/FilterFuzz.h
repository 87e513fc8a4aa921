// Shared body of the two filter fuzz targets: decode the input as encoded text (errors
// are fine, crashes and leaks are not), and check that decoding the encoding of the
// input gives the input back.
#pragma once

#include <algorithm>
#include <cstdlib>
#include <string>

#include "FuzzSupport.h"

namespace zyrfuzz {

using MemStream = ZYRStd::CZYRSmartZYRRefPtr<ZYRFileSys::IImpZYRMemStream>;
using AnyStream = ZYRStd::CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>;

// A stream holding `text`, with room for at least `room` bytes in all.
inline MemStream memoryStream(const std::string& text, size_t room = 0) {
    MemStream s(new ZYRFileSys::IImpZYRMemStream(
        ZYRStreams::kZYRStreamRead | ZYRStreams::kZYRStreamWrite,
        static_cast<unsigned int>(std::max(room, text.size()) + 64), nullptr));
    s->write(text.data(), 1, static_cast<unsigned int>(text.size()));
    s->setPos(0);
    return s;
}

// Decodes everything the source gives, in reads of `chunk` bytes.
template <class Decoder> std::string decodeAll(const std::string& encoded, unsigned int chunk) {
    Decoder decoder{AnyStream(memoryStream(encoded))};
    std::string out;
    char buffer[257];
    for (;;) {
        const unsigned int n = decoder.read(buffer, 1, chunk);
        out.append(buffer, n);
        if (n == 0)
            return out;
    }
}

template <class Encoder, class Decoder> void fuzzFilter(const uint8_t* data, size_t size) {
    setUpOnce();
    const unsigned int chunk = size ? data[0] % 256 + 1 : 1;
    const std::string input(reinterpret_cast<const char*>(data), size);
    try {
        decodeAll<Decoder>(input, chunk);
    } catch (const ZYRStd::CZYRError&) {
        // Malformed text is refused with an error; that is the contract.
    }

    // Either encoding takes at most three characters a byte, line ends included.
    MemStream encoded = memoryStream("", input.size() * 3);
    {
        Encoder encoder{AnyStream(encoded)};
        encoder.write(input.data(), 1, static_cast<unsigned int>(input.size()));
        encoder.close();
    }
    const std::string text(reinterpret_cast<const char*>(encoded->data()), encoded->getEOF());
    if (decodeAll<Decoder>(text, chunk) != input)
        std::abort();
}

} // namespace zyrfuzz
