// Tests of zyrstd encode and decode, run as separate processes on files in a fresh
// temporary directory, against Python's base64 and coreutils' basenc where present.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <vector>

#include "TestSupport.h"

namespace {

using zyrtest::Outcome;
using zyrtest::readFile;
using zyrtest::writeFile;

std::string randomBytes(size_t n, unsigned int seed) {
    std::mt19937 random(seed);
    std::string out(n, '\0');
    for (size_t i = 0; i < n; ++i)
        out[i] = (i / 16) % 5 == 0 ? '\0' : static_cast<char>(random());
    return out;
}

class ZyrstdEncodeTest : public ::testing::Test {
protected:
    void SetUp() override {
        const char* path = std::getenv("ZYRSTD_TOOL");
        if (!path || !*path)
            GTEST_SKIP() << "ZYRSTD_TOOL does not name the zyrstd program";
        tool_ = path;
    }
    Outcome zyrstd(const std::vector<std::string>& args, const std::string& input = "/dev/null") {
        return zyrtest::runProgram(tool_, args, dir_, input);
    }
    // The names in the directory, but for the captured output streams.
    std::vector<std::string> listing() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(dir_.path())) {
            const std::string name = entry.path().filename().string();
            if (name != ".stdout" && name != ".stderr")
                names.push_back(name);
        }
        std::sort(names.begin(), names.end());
        return names;
    }
    bool python(const std::string& script, const std::string& input, std::string& output) {
        writeFile(dir_.file("py.in"), input);
        const Outcome o = zyrtest::runProgram("python3", {"-c", script}, dir_, dir_.file("py.in"));
        output = o.out;
        ::unlink(dir_.file("py.in").c_str());
        return o.exitCode == 0;
    }

    std::string tool_;
    zyrtest::TempDir dir_;
};

TEST_F(ZyrstdEncodeTest, RoundTripsThroughFilesAndStandardStreams) {
    for (size_t n : {0u, 1u, 4u, 5u, 79u, 1000u, 1u << 20}) {
        const std::string bytes = randomBytes(n, static_cast<unsigned int>(n));
        const std::string in = dir_.file("in.bin"), text = dir_.file("in.txt"),
                          back = dir_.file("back.bin");
        writeFile(in, bytes);
        for (const char* kind : {"ascii85", "asciihex"}) {
            Outcome o = zyrstd({"encode", kind, in, text});
            ASSERT_EQ(o.exitCode, 0) << o.err;
            EXPECT_EQ(o.out, "");
            o = zyrstd({"decode", kind, text, back});
            ASSERT_EQ(o.exitCode, 0) << o.err;
            EXPECT_EQ(readFile(back), bytes) << kind << ", " << n << " bytes";

            // Standard input and output when no file is named.
            const Outcome encoded = zyrstd({"encode", kind}, in);
            ASSERT_EQ(encoded.exitCode, 0) << encoded.err;
            EXPECT_EQ(encoded.out, readFile(text));
            const Outcome decoded = zyrstd({"decode", kind, "-"}, text);
            ASSERT_EQ(decoded.exitCode, 0) << decoded.err;
            EXPECT_EQ(decoded.out, bytes);
        }
    }
    const std::vector<std::string> expected{"back.bin", "in.bin", "in.txt"};
    EXPECT_EQ(listing(), expected) << "no temporary file is left";

    writeFile(dir_.file("z.bin"), std::string(8, '\0') + "A");
    Outcome o = zyrstd(
        {"encode", "ascii85", "--prefix", "> ", "--eod", "EOD", "--no-z", dir_.file("z.bin")});
    ASSERT_EQ(o.exitCode, 0) << o.err;
    EXPECT_EQ(o.out, "> !!!!!!!!!!5lEOD\r\n");
    o = zyrstd({"encode", "asciihex", "--prefix", "  ", dir_.file("z.bin")});
    EXPECT_EQ(o.out, "  000000000000000041>\r\n");
}

TEST_F(ZyrstdEncodeTest, AgreesWithIndependentCodecs) {
    const std::string bytes = randomBytes(300001, 17);
    const std::string in = dir_.file("in.bin");
    writeFile(in, bytes);
    const Outcome a85 = zyrstd({"encode", "ascii85", in});
    ASSERT_EQ(a85.exitCode, 0) << a85.err;
    const Outcome hex = zyrstd({"encode", "asciihex", in});
    ASSERT_EQ(hex.exitCode, 0) << hex.err;

    std::string decoded, text;
    if (python("pass", "", decoded)) {
        // Our text with Adobe's framing around it: the line ends are white space.
        ASSERT_TRUE(python("import sys,base64; d=sys.stdin.buffer.read().rstrip(b'\\r\\n');"
                           "sys.stdout.buffer.write(base64.a85decode(b'<~'+d, adobe=True))",
                           a85.out, decoded));
        EXPECT_TRUE(decoded == bytes) << "python3 decodes our ASCII85 to the original bytes";
        ASSERT_TRUE(python("import sys,base64; sys.stdout.buffer.write(base64.a85encode("
                           "sys.stdin.buffer.read(), adobe=True, wrapcol=75))",
                           bytes, text));
        writeFile(dir_.file("py.a85"), text);
        const Outcome o = zyrstd({"decode", "ascii85", dir_.file("py.a85")});
        ASSERT_EQ(o.exitCode, 0) << o.err;
        EXPECT_TRUE(o.out == bytes) << "we decode python3's ASCII85";
    }
    if (zyrtest::runProgram("basenc", {"--version"}, dir_).exitCode == 0) {
        const Outcome b16 = zyrtest::runProgram("basenc", {"--base16", in}, dir_);
        ASSERT_EQ(b16.exitCode, 0);
        writeFile(dir_.file("basenc.hex"), b16.out);
        const Outcome o = zyrstd({"decode", "asciihex", dir_.file("basenc.hex")});
        ASSERT_EQ(o.exitCode, 0) << o.err;
        EXPECT_TRUE(o.out == bytes) << "we decode basenc's upper-case, wrapped hex";

        // basenc takes neither lower case, nor carriage returns, nor our marker.
        std::string upper;
        for (char c : hex.out.substr(0, hex.out.rfind('>')))
            if (c != '\r')
                upper += static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
        writeFile(dir_.file("upper.hex"), upper);
        const Outcome back2 =
            zyrtest::runProgram("basenc", {"-d", "--base16", dir_.file("upper.hex")}, dir_);
        EXPECT_EQ(back2.exitCode, 0) << back2.err;
        EXPECT_TRUE(back2.out == bytes) << "basenc decodes our hex digits";
    }
}

TEST_F(ZyrstdEncodeTest, FailuresLeaveNoOutput) {
    const std::string out = dir_.file("out.txt");
    Outcome o = zyrstd({"encode", "ascii85", dir_.file("missing.bin"), out});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_NE(o.err.find("missing.bin: No such file or directory"), std::string::npos) << o.err;

    o = zyrstd({"decode", "ascii85", dir_.path(), out});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_NE(o.err.find("Is a directory"), std::string::npos) << o.err;

    writeFile(dir_.file("bad.a85"), std::string(100000, 'A') + "{" + "~>");
    o = zyrstd({"decode", "ascii85", dir_.file("bad.a85"), out});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_NE(o.err.find("ASCII85Decode: invalid character 0x7B at offset 100000"),
              std::string::npos)
        << o.err;
    writeFile(dir_.file("bad.hex"), "41 42 4z>");
    o = zyrstd({"decode", "asciihex", dir_.file("bad.hex"), out});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_NE(o.err.find("ASCIIHexDecode: invalid character 0x7A at offset 7"), std::string::npos)
        << o.err;
    writeFile(dir_.file("z.a85"), "9jzqo^~>");
    o = zyrstd({"decode", "ascii85", dir_.file("z.a85"), out});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_NE(o.err.find("'z' inside a group at offset 2"), std::string::npos) << o.err;

    const std::vector<std::string> inputs{"bad.a85", "bad.hex", "z.a85"};
    EXPECT_EQ(listing(), inputs) << "no output and no temporary file";

    // A failed decode leaves an existing output as it was.
    writeFile(out, "precious");
    o = zyrstd({"decode", "ascii85", dir_.file("bad.a85"), out});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_EQ(readFile(out), "precious");

    o = zyrstd({"encode", "ascii85", dir_.file("bad.a85"), dir_.file("no/such/dir/out")});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_NE(o.err.find("cannot create the output file"), std::string::npos) << o.err;

    // Usage errors.
    for (const std::vector<std::string>& args :
         std::vector<std::vector<std::string>>{{"encode"},
                                               {"encode", "base64"},
                                               {"encode", "asciihex", "--no-z"},
                                               {"encode", "ascii85", "--prefix", "abc"},
                                               {"encode", "ascii85", "--eod", "123456789012345"},
                                               {"decode", "ascii85", "--prefix", "a"},
                                               {"decode", "ascii85", "a", "b", "c"}}) {
        o = zyrstd(args);
        EXPECT_EQ(o.exitCode, 2) << args.back();
        EXPECT_NE(o.err.find("usage: zyrstd"), std::string::npos) << o.err;
    }
}

} // namespace
