// Tests of zyrstd encode and decode, run as separate processes on files in a fresh
// temporary directory. The codecs themselves are checked against Python's base64 by the
// filter tests.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
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
