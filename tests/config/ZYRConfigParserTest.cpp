#include <gtest/gtest.h>

#include <algorithm>

#include "TestSupport.h"
#include "ZYRHostKit.h"
#include "zyr/std/config/ZYRConfigParser.h"
#include "zyr/std/io/CZYRBaseStream.h"
#include "zyr/std/io/CZYRFileSys.h"
#include "zyr/std/io/IImpZYRMemStream.h"

using namespace ZYRStd;

namespace {

struct Parsed {
    std::string pairs, lines;
};

class Collector : public IZYRConfigParserLineCBProc {
public:
    explicit Collector(Parsed& out) : out_(out) {}
    void atLine(unsigned int line) override { line_ = line; }
    void proc(const char* key, const char* value) override { add(std::string(key) + "=" + value); }
    void add(const std::string& item) {
        out_.pairs += (out_.pairs.empty() ? "" : "|") + item;
        out_.lines += (out_.lines.empty() ? "" : ",") + std::to_string(line_);
    }

private:
    Parsed& out_;
    unsigned int line_ = 0;
};

class TrickleStream : public ZYRFileSys::IImpZYRMemStream {
public:
    TrickleStream(const std::string& text, unsigned int step)
        : IImpZYRMemStream(ZYRStreams::kZYRStreamRead | ZYRStreams::kZYRStreamWrite,
                           static_cast<unsigned int>(text.size()), nullptr),
          step_(step) {
        write(text.data(), 1, static_cast<unsigned int>(text.size()));
        setPos(0);
    }
    using IImpZYRMemStream::read;
    unsigned int read(void* buf, unsigned int size, unsigned int count) override {
        return IImpZYRMemStream::read(buf, 1, std::min(size * count, step_));
    }

private:
    unsigned int step_;
};

Parsed collect(const std::function<void(Collector&)>& parse) {
    Parsed out;
    Collector collector(out);
    const std::string error = zyrtest::thrown([&] { parse(collector); });
    if (error != "no error") {
        EXPECT_EQ(error,
                  "13: Setup file is missing Key Value (source/zyr/std/ZYRConfigParser:178)");
        collector.add("!");
    }
    return out;
}

Parsed parseStream(const std::string& text, unsigned int step) {
    return collect([&](Collector& collector) {
        CZYRBaseStream stream(
            CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>(new TrickleStream(text, step)));
        ParseConfigsBuffer(stream, collector);
    });
}

Parsed parseData(void* data, ZYRPublic::eZYRConfigDataType type, unsigned int size) {
    return collect([&](Collector& collector) {
        ParseConfigData(static_cast<unsigned char*>(data), type, size, collector);
    });
}

class ZYRConfigParserTest : public ::testing::Test {
protected:
    void SetUp() override {
        ZYRStdInit_SetZYRFactoryProc(nullptr);
        ZYRStdInit_SetZYRFactoryProc(ZYRHostKit::posixFileNameFactory);
        fileSys_.reset(
            ZYRFileSys::createDefaultFileSystem(CZYRUniString(), CZYRUniString(), nullptr));
        installed_ = fileSys_.get();
        ZYRStdInit_SetDefaultFileSysProc([] { return installed_; });
    }
    void TearDown() override {
        ZYRStdInit_SetDefaultFileSysProc(nullptr);
        ZYRStdInit_SetZYRFactoryProc(nullptr);
        installed_ = nullptr;
    }
    static inline ZYRFileSys::IZYRFileSys* installed_ = nullptr;
    std::unique_ptr<ZYRFileSys::IZYRFileSys> fileSys_;
    zyrtest::TempDir dir_;
};

} // namespace

TEST_F(ZYRConfigParserTest, PairsOfTheFormat) {
    const std::string k(1000, 'K'), v22(22, 'V'), v23(23, 'V');
    const std::pair<std::string, std::string> cases[] = {
        {"A=1\n# B=2\n%C 3\n\n  D\t4", "A=1|D=4"},
        {"A = 1 2\n", "A=1"},
        {"==A = =\t= B ==\n", "A=B"},
        {"A #1\n#A 1\n", "A=#1"},
        {"A=1\nE\nB=2\n", "A=1|!"},
        {"A = \t\n", "!"},
        {"", ""},
        {" \r\n\t\v\f\n", ""},
        {"A=1\n  \xff"
         "B=2\n",
         "A=1"},
        {"A=\xff\nB=2", "A=\xff|B=2"},
        {"\v\fA\v1 x\n", "A\v1=x"},
        {std::string("A\0=1\n", 5), "!"},
        {k + " " + v23 + "XY=Z\n", k + "=" + v23 + "|Y=Z"},
        {k + " " + v22 + "XY=Z\n", k + "=" + v22 + "X|!"},
        {k + " " + v23 + "\nY=Z\n", k + "=" + v23 + "|Y=Z"},
    };
    for (const auto& [text, expected] : cases) {
        std::string buffer = text; // a buffer of no bytes is refused, below
        const auto size = static_cast<unsigned int>(text.size());
        EXPECT_EQ(size ? parseData(buffer.data(), ZYRPublic::kZYRConfigDataBuffer, size).pairs : "",
                  expected);
        for (const unsigned int step : {1u, 2u, 7u, 1023u, 1025u})
            EXPECT_EQ(parseStream(text, step).pairs, expected) << "reads of " << step;
    }
}

TEST_F(ZYRConfigParserTest, LineEndsAndLineNumbers) {
    const std::string lf = "A=1\n\nB = 2\n# c\nC 3\n";
    std::string crlf, cr = lf;
    for (const char c : lf)
        crlf += c == '\n' ? std::string("\r\n") : std::string(1, c);
    std::replace(cr.begin(), cr.end(), '\n', '\r');
    for (const std::string& text : {lf, crlf, cr}) {
        const Parsed parsed = parseStream(text, 1);
        EXPECT_EQ(parsed.pairs + " " + parsed.lines, "A=1|B=2|C=3 1,3,5");
    }
    EXPECT_EQ(parseStream("\n\rA=1\r \nB=2", 64).lines, "3,5");
    EXPECT_EQ(
        parseStream(std::string(1000, 'K') + " " + std::string(23, 'V') + "XY=Z\nW=1", 100).lines,
        "1,1,2");
    std::string failing = "A=1\r\n\r\n  Lonely\r\nB=2\r\n";
    const Parsed failed = parseData(failing.data(), ZYRPublic::kZYRConfigDataBuffer,
                                    static_cast<unsigned int>(failing.size()));
    EXPECT_EQ(failed.pairs + " " + failed.lines, "A=1|! 1,3");
}

TEST_F(ZYRConfigParserTest, DataTypesFilesAndTheirErrors) {
    char text[] = "A=12\n";
    const auto error = [&](void* data, int type, unsigned int size) {
        return parseData(data, static_cast<ZYRPublic::eZYRConfigDataType>(type), size).pairs;
    };
    EXPECT_EQ(error(nullptr, 0, 0), "");
    const auto failure = [](void* data, int type, unsigned int size) {
        Parsed none;
        Collector cb(none);
        return zyrtest::thrown([&] {
            ParseConfigData(static_cast<unsigned char*>(data),
                            static_cast<ZYRPublic::eZYRConfigDataType>(type), size, cb);
        });
    };
    for (const auto& [data, type, size] : {std::tuple<void*, int, unsigned>{text, 1, 0},
                                           {nullptr, 1, 4},
                                           {nullptr, 2, 4},
                                           {text, 5, 4}})
        EXPECT_EQ(failure(data, type, size),
                  type == 5
                      ? "6: In valid Config data bufer Type (source/zyr/std/ZYRConfigParser:237)"
                      : "6: Invalid Config Data buffer (source/zyr/std/ZYRConfigParser:195)");
    EXPECT_EQ(error(text, 1, 3), "A=1") << "only `size` bytes are the text";

    std::string path = dir_.file("setup \xc3\xa9.cfg"), missing = dir_.file("missing.cfg");
    zyrtest::writeFile(path, "Key1 = v1\r\n# note\r\nKey2\tv2\r\n");
    std::u16string widePath(dir_.path().begin(), dir_.path().end());
    widePath += u"/setup \u00e9.cfg";
    EXPECT_EQ(error(path.data(), 2, 1), "Key1=v1|Key2=v2");
    EXPECT_EQ(error(widePath.data(), 3, 1), "Key1=v1|Key2=v2");
    EXPECT_NE(failure(missing.data(), 2, 1), "no error");
}

TEST_F(ZYRConfigParserTest, AFailedReadDeliversTheWholeLinesBeforeItsError) {
    struct Broken : TrickleStream { // fills the block, then fails
        using TrickleStream::TrickleStream;
        unsigned int read(void* buf, unsigned int size, unsigned int count) override {
            TrickleStream::read(buf, size, count);
            throw CZYRError(ZYRPublic::kZYRErrorTypeCheck, "read failed", "test", 1);
        }
    };
    for (const auto& [text, pairs] : {std::pair{"A=1\nB=2\rC", "A=1|B=2"}, {"A=1", ""}}) {
        Parsed out;
        Collector collector(out);
        CZYRBaseStream stream(CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>(new Broken(text, 99)));
        EXPECT_EQ(zyrtest::thrown([&] { ParseConfigsBuffer(stream, collector); }),
                  "14: read failed (test:1)");
        EXPECT_EQ(out.pairs, pairs);
    }
}

TEST(ZYRConfigValueTest, TrueOrFalseAndHighOrLow) {
    for (const char* yes : {"true", "True", "TRUE", "tRuE", "1", "7", "-1", " 12", "3abc",
                            "99999999999", "4294967296"})
        EXPECT_TRUE(TrueOrFalse(yes)) << '"' << yes << '"';
    for (const char* no : {"yes", "false", "0", "true ", "tru", "truee", "", "abc", "-0"})
        EXPECT_FALSE(TrueOrFalse(no)) << '"' << no << '"';
    EXPECT_FALSE(TrueOrFalse(nullptr));
    for (const char* low : {"low", "LOW", "Low"})
        EXPECT_FALSE(HighOrLow(low)) << low;
    for (const char* high : {"lo", "lowx", "low ", "high", "", "0"})
        EXPECT_TRUE(HighOrLow(high)) << '"' << high << '"';
    EXPECT_TRUE(HighOrLow(nullptr));
}
