// Tests of the zyrstd command-line host, run as a separate process.
#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <unistd.h>
#include <vector>

#include "TestSupport.h"

namespace {

using zyrtest::Outcome;
using zyrtest::readFile;
using zyrtest::writeFile;

// A program that does not start fails the test that ran it.
Outcome run(const std::string& program, const std::vector<std::string>& args,
            const zyrtest::TempDir& dir, const std::string& input = "/dev/null") {
    Outcome outcome = zyrtest::runProgram(program, args, dir, input);
    if (outcome.exitCode == -1)
        ADD_FAILURE() << "cannot start " << program;
    return outcome;
}

class ZyrstdToolTest : public ::testing::Test {
protected:
    void SetUp() override {
        const char* path = std::getenv("ZYRSTD_TOOL");
        if (!path || !*path)
            GTEST_SKIP() << "ZYRSTD_TOOL does not name the zyrstd program";
        tool_ = path;
    }
    Outcome zyrstd(const std::vector<std::string>& args, const std::string& input = "/dev/null") {
        return run(tool_, args, dir_, input);
    }

    std::string tool_;
    zyrtest::TempDir dir_;
};

constexpr const char* kEmptyDigest = "d41d8cd98f00b204e9800998ecf8427e";

} // namespace

TEST_F(ZyrstdToolTest, Md5OfFiles) {
    const std::string empty = dir_.file("empty");
    writeFile(empty, "");
    Outcome result = zyrstd({"md5", empty});
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.out, std::string(kEmptyDigest) + "  " + empty + "\n");
    EXPECT_EQ(result.err, "");

    // Not a multiple of the read size, so the last read is a partial one.
    std::string bytes(3 * 1024 * 1024 + 12345, '\0');
    std::mt19937 random(7);
    for (char& c : bytes)
        c = static_cast<char>(random());
    const std::string large = dir_.file("large.bin");
    writeFile(large, bytes);
    const std::string odd = dir_.file("back\\slash\nnew line");
    writeFile(odd, "abc");

    const std::vector<std::string> args{large, empty, odd};
    std::vector<std::string> md5Args{"md5"};
    md5Args.insert(md5Args.end(), args.begin(), args.end());
    result = zyrstd(md5Args);
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_NE(result.out.find("\\900150983cd24fb0d6963f7d28e17f72  " + dir_.path() +
                              "/back\\\\slash\\nnew line\n"),
              std::string::npos)
        << result.out;
    if (::access("/usr/bin/md5sum", X_OK) == 0) {
        const Outcome reference = run("/usr/bin/md5sum", args, dir_);
        ASSERT_EQ(reference.exitCode, 0) << reference.err;
        EXPECT_EQ(result.out, reference.out);
    }
}

TEST_F(ZyrstdToolTest, Md5OfStandardInput) {
    const std::string input = dir_.file("input");
    writeFile(input, "abc");
    const std::string expected = "900150983cd24fb0d6963f7d28e17f72  -\n";

    Outcome result = zyrstd({"md5"}, input);
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.out, expected);

    result = zyrstd({"md5", "-"}, input);
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.out, expected);
}

TEST_F(ZyrstdToolTest, Md5ReportsUnreadableFilesAndGoesOn) {
    const std::string missing = dir_.file("missing");
    const std::string present = dir_.file("present");
    writeFile(present, "");

    const Outcome result = zyrstd({"md5", missing, dir_.path(), present});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.out, std::string(kEmptyDigest) + "  " + present + "\n");
    EXPECT_EQ(result.err, "zyrstd: md5: " + missing + ": No such file or directory\n" +
                              "zyrstd: md5: " + dir_.path() + ": Is a directory\n");
}

TEST_F(ZyrstdToolTest, CommandLine) {
    for (const char* help : {"--help", "-h", "help"}) {
        const Outcome result = zyrstd({help});
        EXPECT_EQ(result.exitCode, 0) << help;
        EXPECT_NE(result.out.find("md5"), std::string::npos) << help << ": " << result.out;
        EXPECT_NE(result.out.find("demo"), std::string::npos) << help << ": " << result.out;
        EXPECT_EQ(result.err, "") << help;
    }

    Outcome result = zyrstd({"no-such-command"});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_EQ(result.out, "");
    EXPECT_NE(result.err.find("no-such-command"), std::string::npos) << result.err;
    EXPECT_NE(result.err.find("--help"), std::string::npos) << result.err;

    result = zyrstd({});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_NE(result.err.find("--help"), std::string::npos) << result.err;
}
