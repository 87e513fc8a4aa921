#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <random>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include "TestSupport.h"
#include "ZYRHostKit.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/CZYRBaseStream.h"
#include "zyr/std/io/CZYRFileSys.h"
#include "zyr/std/io/CZYRStreamsFilterASCII85.h"
#include "zyr/std/io/CZYRStreamsFilterASCIIHEX.h"
#include "zyr/std/io/IImpZYRMemStream.h"

namespace {

using namespace ZYRStreams;
using ZYRFileSys::IImpZYRMemStream;
using ZYRStd::CZYRError;
using ZYRStd::CZYRSmartZYRRefPtr;
using ZYRStd::CZYRStreamFilterASCII85;
using ZYRStd::CZYRStreamFilterASCII85Decode;
using ZYRStd::CZYRStreamFilterASCIIHEX;
using ZYRStd::CZYRStreamFilterASCIIHEXDecode;
using namespace std::string_literals;

std::string withoutLine(const std::string& error) {
    return error.substr(0, error.rfind(':'));
}
template <class Body>
void expectError(Body body, int type, const char* message,
                 const char* source = "source/zyr/std/IImpZYRMemStream") {
    EXPECT_EQ(withoutLine(zyrtest::thrown(body)),
              withoutLine(zyrtest::describe(type, message, source, 0)));
}

CZYRSmartZYRRefPtr<IImpZYRMemStream> memStream(unsigned int mode, unsigned int capacity,
                                               void* buffer = nullptr) {
    return CZYRSmartZYRRefPtr<IImpZYRMemStream>(new IImpZYRMemStream(mode, capacity, buffer));
}

const char* const kPastEnd = "write past end of stream";

// Random modes, capacities, own or caller's buffers and transfers against a model.
TEST(ZYRStreamsTest, MemoryStreamMatchesAModelAndWrappersForward) {
    std::mt19937 random(3);
    const unsigned int R = kZYRStreamRead, W = kZYRStreamWrite, A = kZYRStreamAppend,
                       T = kZYRStreamTruncate;
    const auto randomMode = [&] {
        const unsigned int bits = random() % 16;
        return (bits & (R | W | A)) | (bits & 8 ? T : 0);
    };
    for (int round = 0; round < 400; ++round) {
        unsigned int mode = randomMode();
        const unsigned int capacity = random() % 40;
        const bool caller = random() % 2;
        std::string callerBytes(capacity, 'c');
        auto s = memStream(mode, capacity, caller ? callerBytes.data() : nullptr);
        std::string data = caller ? callerBytes : std::string(capacity, '\0');
        if (!caller && capacity) // our own bytes start undefined
            std::memset(s->data(), 0, capacity);
        unsigned int eof = caller && (mode & R) && !(mode & T) ? capacity : 0;
        unsigned int pos = mode & A ? eof : 0;
        for (int step = 0; step < 30; ++step) {
            const unsigned int size = 1 + random() % 3, count = random() % 6, n = size * count;
            const unsigned int action = random() % 6;
            if (action < 2 && !(mode & (W | A))) {
                expectError([&] { s->write("", size, count); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                            "stream is not writable");
            } else if (action < 2 && pos + n > capacity) {
                expectError([&] { s->write("", size, count); }, ZYRPublic::kZYRErrorInvalidData,
                            kPastEnd);
            } else if (action < 2) {
                const std::string bytes(n, static_cast<char>('a' + random() % 26));
                ASSERT_EQ(s->write(bytes.data(), size, count), n) << "a byte count";
                data.replace(pos, n, bytes);
                pos += n;
                eof = n ? std::max(eof, pos) : eof; // writing nothing moves no EOF
            } else if (action < 4 && !(mode & R)) {
                expectError([&] { s->read(nullptr, size, count); },
                            ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not readable");
            } else if (action < 4 && pos > eof) {
                expectError([&] { s->read(nullptr, size, count); }, ZYRPublic::kZYRErrorInvalidData,
                            "attempt to read negative bytes");
            } else if (action < 4) {
                std::string out(n, '\0');
                const unsigned int got = std::min(n, eof - pos);
                ASSERT_EQ(s->read(out.data(), size, count), got) << "up to the EOF";
                ASSERT_EQ(out.substr(0, got), data.substr(pos, got));
                pos += got;
            } else if (action == 4) {
                const unsigned int to = random() % (capacity + 3);
                if (to > capacity) {
                    expectError([&] { s->setPos(to); }, ZYRPublic::kZYRErrorLimitCheck,
                                "Attempt to setPos beyond Mem Stream size");
                } else {
                    ASSERT_EQ(s->setPos(to), to);
                    pos = to;
                }
            } else if (random() % 2) {
                s->setEOF();
                pos = eof;
            } else {
                mode = randomMode();
                s->reOpen(mode);
                if ((mode & T) || ((mode & W) && !(mode & (R | A))))
                    eof = 0;
                pos = mode & A ? eof : (eof = 0);
            }
            ASSERT_EQ(std::tuple(s->getPos(), s->getEOF(), s->getSize(), s->getAccessMode()),
                      std::tuple(pos, eof, eof, mode))
                << "round " << round << " step " << step;
            ASSERT_EQ(capacity ? std::string(reinterpret_cast<char*>(s->data()), capacity) : "",
                      data);
        }
        s.reset();
        ASSERT_EQ(caller ? callerBytes : data, data) << "writes go into the caller's bytes";
    }
    // The 32-bit product and sum of a huge write must not slip past the capacity check.
    auto s = memStream(R | W, 8);
    s->setPos(4);
    expectError([&] { s->write("", 0x10000, 0x10000 - 1); }, ZYRPublic::kZYRErrorInvalidData,
                kPastEnd);
    ZYRPublic::eZYRErrorType e1 = {}, e2 = {}, e3 = {};
    EXPECT_EQ(s->read(nullptr, 1, 1, e1) + s->write("abcde", 1, 5, e2), 0u);
    EXPECT_EQ(s->write("abcd", 1, 4, e3), 4u);
    EXPECT_EQ(std::tuple(e1, e2, e3),
              std::tuple(ZYRPublic::kZYRErrorInvalidData, ZYRPublic::kZYRErrorInvalidData,
                         ZYRPublic::kZYRErrorNoError));
    zyrtest::FailingHost host; // on the stack, so that the buffer is the only allocation
    host.failAll = true;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    expectError([] { IImpZYRMemStream s(kZYRStreamWrite, 64, nullptr); },
                ZYRPublic::kZYRErrorOutOfMemory, nullptr);
    zyrtest::installFront(0);
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
    EXPECT_THROW(ZYRStd::CZYRBaseStream(kZYRStreamWrite, 16, nullptr), CZYRError)
        << "wrappers make their streams through the file system";
    static ZYRFileSys::IZYRFileSys* installed = nullptr;
    const std::unique_ptr<ZYRFileSys::IZYRFileSys> fileSys(ZYRFileSys::createDefaultFileSystem(
        ZYRStd::CZYRUniString(), ZYRStd::CZYRUniString(), nullptr));
    installed = fileSys.get();
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc([] { return installed; });
    ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
    ZYRStd::ZYRStdInit_SetZYRFactoryProc(ZYRHostKit::posixFileNameFactory);
    ZYRStd::CZYRBaseStream empty, base(kZYRStreamRead | kZYRStreamWrite, 16, nullptr), copy(base);
    EXPECT_TRUE(!empty.isValid() && base.isShared() && base.write("abc", 1, 3) == 3 &&
                base.getPos() == 3);
    expectError([&] { empty.getPos(); }, ZYRPublic::kZYRErrorInvalidObject, "Null object",
                "source/zyr/std/CZYRBaseStream");
    zyrtest::TempDir dir;
    const std::string path = dir.file("wrapped.txt");
    ZYRStd::CZYRFStream(ZYRStd::CZYRFileName(path.c_str()), kZYRStreamWrite).write("text", 1, 4);
    EXPECT_EQ(zyrtest::readFile(path), "text");
    ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
}

using Stream = CZYRSmartZYRRefPtr<IImpZYRMemStream>;

Stream sink(unsigned int capacity = 1 << 20) {
    return memStream(kZYRStreamRead | kZYRStreamWrite, capacity);
}

std::string contents(const Stream& s) {
    return std::string(reinterpret_cast<const char*>(s->data()), s->getEOF());
}

Stream source(const std::string& text) {
    Stream s = sink(static_cast<unsigned int>(text.size()) + 1);
    s->write(text.data(), 1, static_cast<unsigned int>(text.size()));
    s->setPos(0);
    return s;
}

std::string randomBytes(size_t n, unsigned int seed, bool zeroRuns = false) {
    std::mt19937 random(seed);
    std::string out(n, '\0');
    for (size_t i = 0; i < n; ++i)
        out[i] = (zeroRuns && (i / 8) % 3 == 0) ? '\0' : static_cast<char>(random());
    return out;
}

// Encodes through writes of `chunk` bytes (all at once for 0), decodes through reads of
// `step` bytes.
template <class Encoder, class... Args>
std::string encode(const std::string& bytes, size_t chunk, Args... args) {
    Stream out = sink();
    {
        Encoder filter(CZYRSmartZYRRefPtr<IZYRStream>(out), args...);
        const size_t step = chunk ? chunk : std::max<size_t>(bytes.size(), 1);
        for (size_t at = 0; at < bytes.size(); at += step) {
            const size_t n = std::min(step, bytes.size() - at);
            EXPECT_EQ(filter.write(bytes.data() + at, 1, static_cast<unsigned int>(n)), n);
        }
        filter.close();
    }
    return contents(out);
}

std::string encode85(const std::string& bytes, const char* prefix = nullptr,
                     const char* eod = nullptr, bool allowZ = true, size_t chunk = 0) {
    return encode<CZYRStreamFilterASCII85>(bytes, chunk, prefix, eod, allowZ);
}
std::string encodeHex(const std::string& bytes, const char* prefix = nullptr,
                      const char* eod = nullptr, size_t chunk = 0) {
    return encode<CZYRStreamFilterASCIIHEX>(bytes, chunk, prefix, eod);
}

template <class Decoder> std::string decode(const std::string& text, unsigned int step = 4096) {
    Decoder decoder(CZYRSmartZYRRefPtr<IZYRStream>(source(text)));
    std::string out;
    std::vector<char> buf(step);
    for (;;) {
        const unsigned int got = decoder.read(buf.data(), 1, step);
        out.append(buf.data(), got);
        if (got < step)
            break;
    }
    EXPECT_TRUE(decoder.isAtEOD());
    EXPECT_EQ(decoder.read(buf.data(), 1, step), 0u);
    return out;
}

std::string decode85(const std::string& text, unsigned int step = 4096) {
    return decode<CZYRStreamFilterASCII85Decode>(text, step);
}
std::string decodeHex(const std::string& text, unsigned int step = 4096) {
    return decode<CZYRStreamFilterASCIIHEXDecode>(text, step);
}

// The first decoding error of `text`, which stays; `where` gets it with byte and offset.
template <class Decoder>
CZYRError firstError(const std::string& text, std::string* where = nullptr) {
    Decoder decoder(CZYRSmartZYRRefPtr<IZYRStream>(source(text)));
    char buf[64];
    const std::string first = zyrtest::thrown([&] {
        while (decoder.read(buf, 1, sizeof buf) > 0) {
        }
    });
    EXPECT_EQ(zyrtest::thrown([&] { decoder.read(buf, 1, sizeof buf); }), first);
    const int c = decoder.getFailureCharacter();
    std::snprintf(buf, sizeof buf, " 0x%02X at offset %llu", c < 0 ? 0 : c,
                  decoder.getFailureOffset());
    try {
        decoder.read(buf + 40, 1, 1);
    } catch (const CZYRError& e) {
        if (where)
            *where = e.getMessage() + std::string(buf + (c < 0 ? 5 : 0));
        return e;
    }
    return CZYRError(ZYRPublic::kZYRErrorNoError, "(no error)", "", 0);
}
template <class Decoder> std::string decodeError(const std::string& text) {
    std::string where;
    firstError<Decoder>(text, &where);
    return where;
}

constexpr const char* kA85Source = "source/zyr/std/CZYRStreamsFilterASCII85";
constexpr const char* kHexSource = "source/zyr/std/CZYRStreamsFilterASCIIHEX";

TEST(CZYRStreamsFilterTest, RoundTripsLayoutsArgumentsAndFailures) {
    for (size_t n = 0; n < 300; ++n) {
        for (bool zeros : {false, true}) {
            const std::string bytes = randomBytes(n, static_cast<unsigned int>(n), zeros);
            const std::string a85 = encode85(bytes, nullptr, nullptr, true, 1 + n % 7);
            ASSERT_EQ(decode85(a85, 1 + n % 5), bytes) << n << " bytes: " << a85;
            ASSERT_EQ(encode85(bytes, nullptr, nullptr, true, 1), a85)
                << "byte by byte or in bulk, the same text";
            const std::string hex = encodeHex(bytes, "  ", nullptr, 1 + n % 9);
            ASSERT_EQ(decodeHex(hex, 1 + n % 5), bytes) << n << " bytes: " << hex;
        }
    }
    for (size_t n : {4095u, 65536u, 65537u, 200001u}) {
        const std::string bytes = randomBytes(n, 99, true);
        EXPECT_EQ(decode85(encode85(bytes, "  ", nullptr, true)), bytes) << n;
        EXPECT_EQ(decode85(encode85(bytes, nullptr, nullptr, false), 1000), bytes) << n;
        EXPECT_EQ(decodeHex(encodeHex(bytes)), bytes) << n;
    }
    EXPECT_EQ(encodeHex("") + encodeHex("\x01\xab\xff"), ">\r\n01abff>\r\n") << "a marker always";

    EXPECT_EQ(encodeHex(std::string(41, '\xaa'), "  "),
              "  " + std::string(80, 'a') + "\r\n  aa>\r\n");
    // 39 bytes fill 78 of 80 characters: a 3-character marker needs a line of its own.
    EXPECT_EQ(encodeHex(randomBytes(39, 4), nullptr, "EOD").substr(78) +
                  encodeHex(randomBytes(39, 4), nullptr, "E").substr(78),
              "\r\nEOD\r\nE\r\n");
    EXPECT_EQ(CZYRStreamFilterASCIIHEX::approximateEncodedLength(0, nullptr, nullptr) +
                  CZYRStreamFilterASCIIHEX::approximateEncodedLength(40, "ab", "EOD"),
              83u + 2 * 82 + 4 + 3);
    for (unsigned int n : {0u, 1u, 39u, 40u, 41u, 4096u})
        EXPECT_GE(CZYRStreamFilterASCIIHEX::approximateEncodedLength(n, "ab", nullptr),
                  encodeHex(randomBytes(n, n), "ab").size());
    EXPECT_EQ(CZYRStreamFilterASCIIHEX::approximateEncodedLength(0xFFFFFFFFu, nullptr, nullptr),
              0xFFFFFFFFu)
        << "saturates rather than wrapping to a small size";

    const Stream hexOut = sink();
    const CZYRSmartZYRRefPtr<IZYRStream> out(hexOut);
    expectError(
        [&] { CZYRStreamFilterASCIIHEX f(out, "abc", nullptr); }, ZYRPublic::kZYRErrorBadParam,
        "CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX: prefix is too long", kHexSource);
    expectError([&] { CZYRStreamFilterASCIIHEX f(out, nullptr, "123456789012345"); },
                ZYRPublic::kZYRErrorBadParam,
                "CZYRStreamFilterASCIIHEX::CZYRStreamFilterASCIIHEX: eod is too long", kHexSource);
    ZYRStd::C_Error err;
    {
        CZYRStreamFilterASCIIHEX hex{out};
        err.setError(ZYRPublic::kZYRErrorBadParam, "earlier", "elsewhere", 1);
        EXPECT_EQ(hex.write("Man", 1, 3, err), 3u) << "whatever the status holds";
    }
    EXPECT_EQ(contents(hexOut), "4d616e>\r\n") << "the destructor closes";
    CZYRStreamFilterASCIIHEX closed{out};
    closed.close();
    err.reset();
    EXPECT_EQ(closed.write("x", 1, 1, err), 0u);
    EXPECT_STREQ(err.getMessage(), "CZYRStreamFilterASCIIHEX::write - stream invalid");
    // A full group at close is never z; nothing written gives nothing, not even the marker.
    EXPECT_EQ(
        std::vector<std::string>({encode85(std::string(4, '\0')), encode85(std::string(8, '\0')),
                                  encode85(std::string(8, '\0'), nullptr, nullptr, false),
                                  encode85("A"), encode85(""), encode85("Man is", "  ", "EOD")}),
        std::vector<std::string>({"!!!!!~>\r\n", "z!!!!!~>\r\n", "!!!!!!!!!!~>\r\n", "5l~>\r\n", "",
                                  "  9jqo^BlaEOD\r\n"}));

    const std::string text = encode85(std::string(64, '\x7f')), group = text.substr(0, 5);
    EXPECT_EQ(text.substr(80), "\r\n~>\r\n") << "80 digits, then the marker alone";
    EXPECT_EQ(encode85(std::string(68, '\x7f') + "x").find("\r\n"), 80u);
    // A group split over two lines: one 'z' first moves every group by one character.
    const std::string split = encode85(std::string(4, '\0') + std::string(68, '\x7f'));
    EXPECT_EQ(split.substr(76, 4) + split.substr(80, 3), group.substr(0, 4) + "\r\n" + group[4]);

    // At close, the split never leaves a single character for the next line. `zeros` 'z'
    // characters and 15 groups of digits come first; then "A" gives "5l", "AB" "5sb".
    const std::tuple<unsigned int, const char*, const char*, size_t, const char*> closings[] = {
        {2, nullptr, "A", 79, "~>\r\n"},    // 77 + "5l~>": 3 would fit and leave ">" alone
        {3, nullptr, "A", 80, "~>\r\n"},    // 78: 2 fit, 2 go on
        {4, nullptr, "A", 80, "l~>\r\n"},   // 79: 1 fits, 3 go on
        {4, "", "A", 79, "5l\r\n"},         // 79 + "5l": "l" would be alone, so both go on
        {3, "~", "A", 79, "l~\r\n"},        // 78 + "5l~": "~" would be alone
        {4, nullptr, "AB", 80, "sb~>\r\n"}, // 79 + "5sb~>": 1 fits, 4 go on
    };
    for (const auto& [zeros, eod, last, lineEnd, second] : closings) {
        const std::string t =
            encode85(std::string(4 * zeros, '\0') + std::string(60, '\x7f') + last, nullptr, eod);
        EXPECT_EQ(t.find("\r\n") == lineEnd ? t.substr(lineEnd + 2) : t, second) << zeros;
    }
    Stream a85Out = sink();
    const CZYRSmartZYRRefPtr<IZYRStream> target(a85Out);
    EXPECT_NO_THROW(CZYRStreamFilterASCII85(target, "ab", "12345678901234"));
    expectError([&] { CZYRStreamFilterASCII85 f(target, nullptr, "123456789012345"); },
                ZYRPublic::kZYRErrorBadParam,
                "CZYRStreamFilterASCII85::CZYRStreamFilterASCII85: eod is too long", kA85Source);
    expectError([&] { CZYRStreamFilterASCII85 f(target, "abc", nullptr); },
                ZYRPublic::kZYRErrorBadParam,
                "CZYRStreamFilterASCII85::CZYRStreamFilterASCII85: prefix is too long", kA85Source);

    CZYRStreamFilterASCII85 filter(target, nullptr, nullptr, true);
    CZYRStreamFilterASCII85{target}.write("A", 1, 1); // the destructor closes
    EXPECT_EQ(filter.write("A", 1, 1), 1u);
    filter.close();
    filter.close();
    EXPECT_EQ(contents(a85Out), "5l~>\r\n5l~>\r\n");
    expectError([&] { filter.write("x", 1, 1); }, ZYRPublic::kZYRErrorFileOpFailed,
                "CZYRStreamFilterASCII85::write - stream invalid", kA85Source);
    // Too small for the second line: the target is dropped, the destructor does not throw.
    Stream small = sink(90);
    {
        CZYRStreamFilterASCII85 f{CZYRSmartZYRRefPtr<IZYRStream>(small)};
        const std::string bytes(200, '\x7f');
        ZYRStd::C_Error writeErr;
        EXPECT_EQ(f.write(bytes.data(), 1, 200, writeErr), 0u);
        EXPECT_TRUE(!strcmp(writeErr.getMessage(), kPastEnd) && !f.getTargetStream());
    }
    EXPECT_EQ(small->peekRefCnt(), 1);
}

TEST(CZYRStreamsFilterTest, DecodeRulesAndErrorTextsThatOutliveTheThread) {
    using A85 = CZYRStreamFilterASCII85Decode;
    using Hex = CZYRStreamFilterASCIIHEXDecode;
    using Rows = std::vector<std::pair<std::string, std::string>>;
    // White space anywhere, Adobe's opening bracket, the end of the source ends the data,
    // nothing after the marker is read, an odd last hex digit is followed by 0.
    const std::string a85[] = {" 9jq\no^\tBl\rbD-\f~ >",
                               "Man is d",
                               "<~9jqo^~>",
                               "Man ",
                               "5l",
                               "A",
                               "~>garbage{",
                               "",
                               "s8W-!~>",
                               "\xff\xff\xff\xff",
                               "",
                               ""};
    const std::string hex[] = {
        "4d616E>", "Man", " 4 d\r\n61\t6e\f>", "Man", "4d6>", "M`", "4d6", "M`", ">4d", "", "", ""};
    for (size_t i = 0; i < std::size(a85); i += 2) // text, then what it decodes to
        EXPECT_EQ(decode85(a85[i]) + "|" + decodeHex(hex[i]), a85[i + 1] + "|" + hex[i + 1]) << i;
    for (const auto& [text, want] : Rows{{"9jqo^{", "invalid character 0x7B at offset 5"},
                                         {"9jz", "'z' inside a group at offset 2"},
                                         {"9jqo^5~>", "final group of one character at offset 5"},
                                         {"s8W-\"~>", "group out of range at offset 0"},
                                         {"9j~x", "'~' not followed by '>' at offset 2"},
                                         {"9j~", "'~' not followed by '>' at offset 2"}})
        EXPECT_EQ(decodeError<A85>(text), "ASCII85Decode: " + want);
    EXPECT_EQ(decodeError<Hex>("4d6g>"), "ASCIIHexDecode: invalid character 0x67 at offset 3");
    // The offset counts from the start of the encoded data across buffer refills.
    std::string longText = encode85(randomBytes(100000, 5));
    longText.insert(70000, "v");
    EXPECT_EQ(decodeError<A85>(longText), "ASCII85Decode: invalid character 0x76 at offset 70000");
    longText = encodeHex(randomBytes(50000, 6));
    longText.insert(70001, "~");
    EXPECT_EQ(decodeError<Hex>(longText), "ASCIIHexDecode: invalid character 0x7E at offset 70001");

    ZYRStd::C_Error err;
    A85 decoder(CZYRSmartZYRRefPtr<IZYRStream>(source("ab{")));
    char buf[8];
    EXPECT_EQ(decoder.read(buf, 1, 8, err), 0u);
    EXPECT_EQ(withoutLine(zyrtest::describe(err)),
              withoutLine(zyrtest::describe(ZYRPublic::kZYRErrorInvalidData,
                                            "ASCII85Decode: invalid character", kA85Source, 0)));
    const CZYRError bad85 = firstError<CZYRStreamFilterASCII85Decode>("9jqo^{");
    CZYRError fromThread(ZYRPublic::kZYRErrorNoError, nullptr, "", 0);
    firstError<CZYRStreamFilterASCII85Decode>("9jz"); // a later error of the same kind
    std::thread([&] { fromThread = firstError<CZYRStreamFilterASCIIHEXDecode>("zz"); }).join();
    EXPECT_EQ(std::string(bad85.getMessage()) + "|" + fromThread.getMessage(),
              "ASCII85Decode: invalid character|ASCIIHexDecode: invalid character");
}

} // namespace
