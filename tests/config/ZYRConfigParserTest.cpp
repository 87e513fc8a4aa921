// The setup-file parser: pairs, line rules, errors, sources, line numbers and the value
// readers, checked against a byte-at-a-time model of the format.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <functional>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "ZYRHostKit.h"
#include "zyr/std/config/ZYRConfigParser.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/CZYRBaseStream.h"
#include "zyr/std/io/CZYRFileSys.h"
#include "zyr/std/io/IImpZYRMemStream.h"

using namespace ZYRStd;

namespace {

struct Pair {
    std::string key;
    std::string value;
    bool operator==(const Pair&) const = default;
};

std::ostream& operator<<(std::ostream& out, const Pair& pair) {
    return out << '{' << pair.key << ", " << pair.value << '}';
}

// What one parse gave: the pairs, their lines, and the error that ended it (if any).
struct Parsed {
    std::vector<Pair> pairs;
    std::vector<unsigned int> lines;
    bool missingValue = false;
    unsigned int errorLine = 0;
};

class Collector : public IZYRConfigParserLineCBProc {
public:
    explicit Collector(Parsed& out) : out_(out) {}
    void atLine(unsigned int line) override { line_ = line; }
    void proc(const char* key, const char* value) override {
        out_.pairs.push_back({key, value});
        out_.lines.push_back(line_);
    }
    unsigned int line() const { return line_; }

private:
    Parsed& out_;
    unsigned int line_ = 0;
};

// A memory stream over a text that hands out at most `step` bytes a read.
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

// Runs `parse` on a collector; a missing value ends it with the parser's own error.
template <class Parse> Parsed collect(Parse parse) {
    Parsed out;
    Collector collector(out);
    try {
        parse(collector);
    } catch (const CZYRError& e) {
        EXPECT_EQ(zyrtest::describe(e), "13: Setup file is missing Key Value "
                                        "(source/zyr/std/ZYRConfigParser:178)");
        out.missingValue = true;
        out.errorLine = collector.line();
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

// The format read as its definition says: one byte at a time, strtok on each line.
Parsed parseModel(const std::string& text) {
    Parsed out;
    size_t at = 0;
    const auto next = [&](unsigned char& c) {
        if (at == text.size())
            return false;
        c = static_cast<unsigned char>(text[at++]);
        return true;
    };
    for (;;) {
        unsigned char c;
        bool more;
        while ((more = next(c)) &&
               (c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r')) {
        }
        if (!more || c == 0xFF)
            return out;
        std::string line(1, static_cast<char>(c));
        while (next(c) && c != '\n' && c != '\r' && line.size() < 1024)
            line += static_cast<char>(c);
        std::vector<char> buffer(line.begin(), line.end());
        buffer.push_back(0);
        char* saved = nullptr;
        const char* key = strtok_r(buffer.data(), " \t=\n", &saved);
        if (!key || key[0] == '%' || key[0] == '#')
            continue;
        const char* value = strtok_r(nullptr, " \t=\n", &saved);
        if (!value) {
            out.missingValue = true;
            return out;
        }
        out.pairs.push_back({key, value});
    }
}

// Installs the host kit's file names and the native file system for memory and file streams.
class ZYRConfigParserTest : public ::testing::Test {
protected:
    void SetUp() override {
        ZYRStdInit_SetZYRFactoryProc(nullptr);
        ZYRStdInit_SetZYRFactoryProc(ZYRHostKit::posixFileNameFactory);
        fileSys_ = ZYRFileSys::createDefaultFileSystem(CZYRUniString(), CZYRUniString(), nullptr);
        installed_ = fileSys_;
        ZYRStdInit_SetDefaultFileSysProc([] { return installed_; });
    }
    void TearDown() override {
        ZYRStdInit_SetDefaultFileSysProc(nullptr);
        ZYRStdInit_SetZYRFactoryProc(nullptr);
        installed_ = nullptr;
        delete fileSys_;
    }

    // Through ParseConfigData on a memory buffer, as a host hands over its text.
    static Parsed parseBuffer(std::string text) {
        return collect([&](Collector& collector) {
            ParseConfigData(reinterpret_cast<unsigned char*>(text.data()),
                            ZYRPublic::kZYRConfigDataBuffer, static_cast<unsigned int>(text.size()),
                            collector);
        });
    }

    static inline ZYRFileSys::IZYRFileSys* installed_ = nullptr;
    ZYRFileSys::IZYRFileSys* fileSys_ = nullptr;
    zyrtest::TempDir dir_;
};

} // namespace

TEST_F(ZYRConfigParserTest, PairsOfTheFormat) {
    const std::string longKey(1000, 'K');
    const struct {
        const char* what;
        std::string text;
        std::vector<Pair> pairs;
        bool missingValue;
    } cases[] = {
        {"comments, an empty line, blanks and a last line without its end",
         "A=1\n# B=2\n%C 3\n\n  D\t4",
         {{"A", "1"}, {"D", "4"}},
         false},
        {"a third token is ignored", "A = 1 2\n", {{"A", "1"}}, false},
        {"runs of delimiters count as one", "==A = =\t= B ==\n", {{"A", "B"}}, false},
        {"a comment mark inside a line is text", "A #1\n#A 1\n", {{"A", "#1"}}, false},
        {"a key without a value stops the parse after the earlier pairs",
         "A=1\nE\nB=2\n",
         {{"A", "1"}},
         true},
        {"a key followed only by delimiters has no value", "A = \t\n", {}, true},
        {"empty text", "", {}, false},
        {"only blanks and line ends", " \r\n\t\v\f\n", {}, false},
        {"0xFF first on a line ends the text",
         "A=1\n  \xff"
         "B=2\n",
         {{"A", "1"}},
         false},
        {"0xFF inside a line is an ordinary byte",
         "A=\xff\nB=2",
         {{"A", "\xff"}, {"B", "2"}},
         false},
        {"vertical tab and form feed are blanks before a line, not delimiters",
         "\v\fA\v1 x\n",
         {{"A\v1", "x"}},
         false},
        {"a zero byte ends a line's text", std::string("A\0=1\n", 5), {}, true},
        {"a 1024-byte line drops the next byte",
         longKey + " " + std::string(23, 'V') + "XY=Z\n",
         {{longKey, std::string(23, 'V')}, {"Y", "Z"}},
         false},
        {"a 1023-byte line keeps its next byte",
         longKey + " " + std::string(22, 'V') + "XY=Z\n",
         {{longKey, std::string(22, 'V') + "X"}},
         true},
        {"a line end right after 1024 bytes only ends the line",
         longKey + " " + std::string(23, 'V') + "\nY=Z\n",
         {{longKey, std::string(23, 'V')}, {"Y", "Z"}},
         false},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        const Parsed model = parseModel(c.text);
        ASSERT_EQ(model.pairs, c.pairs) << "the model disagrees with the case";
        ASSERT_EQ(model.missingValue, c.missingValue);
        const Parsed viaBuffer = c.text.empty() ? Parsed{} : parseBuffer(c.text);
        EXPECT_EQ(viaBuffer.pairs, c.pairs);
        EXPECT_EQ(viaBuffer.missingValue, c.missingValue);
        for (const unsigned int step : {1u, 2u, 7u, 1023u, 1025u}) {
            const Parsed trickled = parseStream(c.text, step);
            EXPECT_EQ(trickled.pairs, c.pairs) << "reads of " << step << " bytes";
            EXPECT_EQ(trickled.missingValue, c.missingValue) << "reads of " << step << " bytes";
        }
    }
}

TEST_F(ZYRConfigParserTest, LineEndsAndLineNumbers) {
    const std::string lf = "A=1\n\nB = 2\n# c\nC 3\n";
    std::string crlf;
    for (const char c : lf)
        crlf += c == '\n' ? std::string("\r\n") : std::string(1, c);
    std::string cr = lf;
    std::replace(cr.begin(), cr.end(), '\n', '\r');
    const Parsed fromLF = parseStream(lf, 3);
    EXPECT_EQ(fromLF.pairs, (std::vector<Pair>{{"A", "1"}, {"B", "2"}, {"C", "3"}}));
    EXPECT_EQ(fromLF.lines, (std::vector<unsigned int>{1, 3, 5}));
    for (const std::string& other : {crlf, cr}) {
        // One byte a read puts the CR and the LF of a pair into different reads.
        const Parsed parsed = parseStream(other, 1);
        EXPECT_EQ(parsed.pairs, fromLF.pairs);
        EXPECT_EQ(parsed.lines, fromLF.lines);
    }

    // LF CR is two line ends; a blank between CR and LF makes them two as well.
    EXPECT_EQ(parseStream("\n\rA=1\r \nB=2", 64).lines, (std::vector<unsigned int>{3, 5}));
    // The rest of a cut line belongs to the same line of the file.
    const std::string cut = std::string(1000, 'K') + " " + std::string(23, 'V') + "XY=Z\nW=1";
    EXPECT_EQ(parseStream(cut, 100).lines, (std::vector<unsigned int>{1, 1, 2}));
    // The missing-value error names its own line.
    const Parsed failed = parseBuffer("A=1\r\n\r\n  Lonely\r\nB=2\r\n");
    EXPECT_TRUE(failed.missingValue);
    EXPECT_EQ(failed.errorLine, 3u);
}

// Random texts of the format's hard parts, read in random block sizes, against the model.
TEST_F(ZYRConfigParserTest, AgreesWithTheByteModel) {
    std::mt19937 random(20261206);
    const auto pick = [&](unsigned int n) { return static_cast<unsigned int>(random() % n); };
    const char* const delimiters[] = {" ", "=", " = ", "\t", "==", " \t= "};
    const char* const lineEnds[] = {"\n", "\r", "\r\n", "\n\n", "\r\r\n"};
    const auto word = [&] {
        std::string w;
        const unsigned int length = pick(10) == 0 ? 1000 + pick(40) : 1 + pick(8);
        for (unsigned int i = 0; i < length; ++i)
            w += static_cast<char>('a' + pick(26));
        return w;
    };
    const std::function<std::string()> oddLines[] = {
        [&] { return "# " + word(); },
        [&] { return "%" + word() + " x"; },
        [] { return std::string(" \t"); },
        [&] { return word(); }, // no value
        [&] { return std::string(1, static_cast<char>(0xFF)) + word(); },
        [&] { return std::string("\v\f") + word() + " " + word() + std::string(1, '\0'); },
    };
    unsigned int withError = 0;
    for (int round = 0; round < 300; ++round) {
        std::string text;
        const unsigned int lines = 1 + pick(40);
        for (unsigned int i = 0; i < lines; ++i) {
            if (const unsigned int kind = pick(20); kind < std::size(oddLines)) {
                text += oddLines[kind]();
            } else {
                text += std::string(pick(3), ' ') + word() + delimiters[pick(6)] + word();
                if (pick(4) == 0)
                    text += " extra";
            }
            if (i + 1 < lines || pick(2))
                text += lineEnds[pick(5)];
        }
        const Parsed model = parseModel(text);
        withError += model.missingValue;
        for (const unsigned int step : {1u + pick(5), 1u + pick(2000), 70000u}) {
            const Parsed ours = parseStream(text, step);
            ASSERT_EQ(ours.pairs, model.pairs) << "round " << round << ", reads of " << step;
            ASSERT_EQ(ours.missingValue, model.missingValue) << "round " << round;
        }
    }
    EXPECT_GT(withError, 10u) << "the texts should also exercise the error";
}

TEST_F(ZYRConfigParserTest, DataTypesFilesAndTheirErrors) {
    Parsed none;
    Collector cb(none);
    ParseConfigData(nullptr, ZYRPublic::kZYRConfigDataNone, 0, cb);
    unsigned char text[] = "A=1\n";
    const auto error = [&](unsigned char* data, int type, unsigned int size) {
        return zyrtest::thrown([&] {
            ParseConfigData(data, static_cast<ZYRPublic::eZYRConfigDataType>(type), size, cb);
        });
    };
    const std::string invalid =
        "6: Invalid Config Data buffer (source/zyr/std/ZYRConfigParser:195)";
    EXPECT_EQ(error(text, 1, 0), invalid);
    EXPECT_EQ(error(nullptr, 1, 4), invalid);
    EXPECT_EQ(error(nullptr, 2, 4), invalid);
    EXPECT_EQ(error(text, 5, 4),
              "6: In valid Config data bufer Type (source/zyr/std/ZYRConfigParser:237)");
    EXPECT_TRUE(none.pairs.empty());
    // Only `size` bytes are the text, whatever follows them.
    unsigned char longer[] = "A=12";
    ParseConfigData(longer, ZYRPublic::kZYRConfigDataBuffer, 3, cb);
    EXPECT_EQ(none.pairs, (std::vector<Pair>{{"A", "1"}}));

    // Files by narrow (UTF-8) and wide path.
    std::string path = dir_.file("setup \xc3\xa9.cfg");
    zyrtest::writeFile(path, "Key1 = v1\r\n# note\r\nKey2\tv2\r\n");
    std::u16string widePath(dir_.path().begin(), dir_.path().end());
    widePath += u"/setup \u00e9.cfg";
    const std::vector<Pair> expected{{"Key1", "v1"}, {"Key2", "v2"}};
    EXPECT_EQ(collect([&](Collector& c) {
                  ParseConfigData(reinterpret_cast<unsigned char*>(path.data()),
                                  ZYRPublic::kZYRConfigDataFilePath, 1, c);
              }).pairs,
              expected);
    EXPECT_EQ(collect([&](Collector& c) {
                  ParseConfigData(reinterpret_cast<unsigned char*>(widePath.data()),
                                  ZYRPublic::kZYRConfigDataFilePathW, 1, c);
              }).pairs,
              expected);
    // A file that is not there is an error of the file system, not an empty setup.
    std::string missing = dir_.file("missing.cfg");
    EXPECT_NE(error(reinterpret_cast<unsigned char*>(missing.data()), 2, 1), "no error");
}

TEST(ZYRConfigValueTest, TrueOrFalseAndHighOrLow) {
    const struct {
        const char* text;
        bool value;
    } truth[] = {
        {"true", true},   {"True", true},        {"TRUE", true},       {"tRuE", true},
        {"1", true},      {"7", true},           {"-1", true},         {" 12", true},
        {"3abc", true},   {"99999999999", true}, {"4294967296", true}, {"yes", false},
        {"false", false}, {"0", false},          {"true ", false},     {"tru", false},
        {"truee", false}, {"", false},           {"abc", false},       {"-0", false},
    };
    for (const auto& t : truth)
        EXPECT_EQ(TrueOrFalse(t.text), t.value) << '"' << t.text << '"';

    const struct {
        const char* text;
        bool high;
    } levels[] = {{"low", false}, {"LOW", false}, {"Low", false}, {"lo", true}, {"lowx", true},
                  {"low ", true}, {"high", true}, {"", true},     {"0", true}};
    for (const auto& l : levels)
        EXPECT_EQ(HighOrLow(l.text), l.high) << '"' << l.text << '"';
}
