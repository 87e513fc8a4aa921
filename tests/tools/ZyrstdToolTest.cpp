// The zyrstd command-line tool, run as a separate program on files in a fresh directory:
// the command line, md5, config, encode and decode, and hwinfo over a prepared tree.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <random>
#include <sstream>
#include <string>
#include <unistd.h>
#include <vector>

#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;
using zyrtest::Outcome;
using zyrtest::readFile;
using Args = std::vector<std::string>;

class ZyrstdToolTest : public ::testing::Test {
protected:
    void SetUp() override {
        const char* path = std::getenv("ZYRSTD_TOOL");
        if (!path || !*path)
            GTEST_SKIP() << "ZYRSTD_TOOL does not name the zyrstd program";
        tool_ = path;
    }
    // A program that does not start fails the test that ran it.
    Outcome run(const std::string& program, const Args& args, const std::string& input) {
        Outcome outcome = zyrtest::runProgram(program, args, dir_, input);
        if (outcome.exitCode == -1)
            ADD_FAILURE() << "cannot start " << program;
        return outcome;
    }
    Outcome zyrstd(const Args& args, const std::string& input = "/dev/null") {
        return run(tool_, args, input);
    }
    // A file of the directory with `bytes` in it (directories made as needed).
    std::string file(const std::string& name, const std::string& bytes) {
        const fs::path path = fs::path(dir_.path()) / name;
        fs::create_directories(path.parent_path());
        zyrtest::writeFile(path.string(), bytes);
        return path.string();
    }
    // The names in the directory, but for the captured output streams.
    std::vector<std::string> listing() const {
        std::vector<std::string> names;
        for (const auto& entry : fs::directory_iterator(dir_.path()))
            if (entry.path().filename().string()[0] != '.')
                names.push_back(entry.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }

    std::string tool_;
    zyrtest::TempDir dir_;
};

std::string randomBytes(size_t n, unsigned int seed) {
    std::mt19937 random(seed);
    std::string out(n, '\0');
    for (size_t i = 0; i < n; ++i)
        out[i] = (i / 16) % 5 == 0 ? '\0' : static_cast<char>(random());
    return out;
}

// Every option with its default, in print order; the RAM budget depends on the machine.
constexpr const char* kDefaults =
    R"(NumMTRThreads=-1 NumMTBThreads=-1 MTRThreshold=100000 MTRFallbackPerBand=true
HasExternalCompositor=false XObjDLCacheMaxRAM= XObjDLCacheMaxDisk=9223372036854775807
VDPThroughFlattener=true XObjDLSharedCache=false MaxPatternCacheEntry=50 ImageMarkerType=0
ImageMarkerTiling=0 ImageMarkerFactorSourceStep=1.5 ImageMarkerFactorTiling=1
MeshMarkerFactorD11=0.125 MeshMarkerFactorD18=0.125 MeshMarkerFactorD48=0.25 SSE2=1
UseNewImageMarker=1 OverScanIdntImageMaskMarking=true SLCompression=1 SLCompressionRatio=1.5
SL0CompressionRatio=2 UseNullGraphics=false MaxCacheShades=100 RasterizeTilingPattern=true
TileSuperCell=true OptimizePortPipeLine=0 RenderAllInterpretedSurfaces=false
SingleThreadProcess=false SurfaceOverLap=3 XPVDPCacheOverlapThreshold=100
XPVDPOptimizeFlattening=1 AdjustImageNearCopydot=false DisableAxialShadeOptimization=false
SplitShadeWithAbruptColorChange=true SplitShadeAbruptChangeThreshold=30
ClipsubPathStackSizeThreshold=14 CopyDotMethod=1 EnableBPCbyObjectType=false
EnableExternalDLCachePurge=true EnableXObjDLCachePurge=false EnableXPVDPDLCachePurge=false
GRMemoryThreshold=0 GRPMThreshold=0 GRFLThreshold=0 GROption=0 UseFasterOpaqueMarking=-1
ConvertComplexPatternToImage=true DontCopyDevImage=true UsePathCache=true
UseInPlaceComposition=true GRSAOCTilingPattern=false GRCacheOpaqueTilingPattern=true
DisableOPInMarker=true UseFasterTransparencyTilingPattern=true UseOldHOVReducer=true
MaxGlyphCache=67108864 MaxGraphPathCache=134217728 OptimizeArtworkTree=true
OverscanImageMasksThreshold=1 PDFGCPageInterval=5000 PDFGCMemoryThreshold=8388608
PDFGCInterpreterThreadMemoryThreshold=0 PDFGCMainThreadMemoryThreshold=0
PathWidthAdjustment=0 SubPathSizeThreshold=24 AdjustPathWidthInsideTilingPattern=false
DiscardEmptyPathAfterAdjustment=true ReplaceSourceColorPrecision=true
ShiftImageMaskDeviceDelta=0.1 ShipXPImageSlicesInOrder=false TrapPixelOverlap=1
TrappingLibraryPath= UseNewTrapReducer=true XObjDLCachePurgeChild=true
XObjDLCachePurgePercentage=0 DisableXPImageDLOptimization=false EmitIMG_META=true
AtomicRegionDirectCMYKOption=1 ThreadPriority=false UseNullXPDevice=false
UseNullXPImage=false XPShadeCache=true RasterizeAllTransparencyShades=false)";

// The defaults as printed ("Key = value" lines), with the RAM budget `ram` and the lines
// of `changed` in place of theirs.
std::string defaultsWith(const std::string& ram, const Args& changed) {
    std::istringstream in(kDefaults);
    std::string out;
    for (std::string token; in >> token;) {
        std::string line = token.replace(token.find('='), 1, " = ");
        if (line == "XObjDLCacheMaxRAM = ")
            line += ram;
        for (const std::string& other : changed)
            if (other.starts_with(line.substr(0, line.find(" = ") + 3)))
                line = other;
        out += line + "\n";
    }
    return out;
}

} // namespace

TEST_F(ZyrstdToolTest, CommandLine) {
    for (const char* help : {"--help", "-h", "help"}) {
        const Outcome o = zyrstd({help});
        EXPECT_TRUE(o.exitCode == 0 && o.err.empty()) << help;
        for (const char* line : {"\n  md5 [FILE...]", "\n  config FILE...", "config --defaults",
                                 "\n  encode ascii85|asciihex", "\n  decode ascii85|asciihex",
                                 "\n  hwinfo [--root DIR]\n", "\n  demo ", "\n  help "})
            EXPECT_NE(o.out.find(line), std::string::npos) << help << " lacks " << line;
    }
    for (const Args& args : {Args{"no-such-command"}, Args{}}) {
        const Outcome o = zyrstd(args);
        EXPECT_TRUE(o.exitCode == 2 && o.out.empty()) << o.err;
        EXPECT_NE(o.err.find("\nTry 'zyrstd --help'.\n"), std::string::npos) << o.err;
    }
    EXPECT_NE(zyrstd({"no-such-command"}).err.find("'no-such-command'"), std::string::npos);
}

TEST_F(ZyrstdToolTest, Md5OfFilesAndStandardInput) {
    const std::string empty = file("empty", ""), abc = file("abc", "abc");
    // Not a multiple of the read size, so the last read is a partial one.
    const std::string large = file("large.bin", randomBytes(3 * 1024 * 1024 + 12345, 7));
    const std::string odd = file("back\\slash\nnew line", "abc");
    const std::string kEmpty = "d41d8cd98f00b204e9800998ecf8427e",
                      kAbc = "900150983cd24fb0d6963f7d28e17f72";
    Outcome o = zyrstd({"md5", large, empty, odd});
    EXPECT_TRUE(o.exitCode == 0 && o.err.empty()) << o.err;
    EXPECT_NE(o.out.find("\n" + kEmpty + "  " + empty + "\n\\" + kAbc + "  " + dir_.path() +
                         "/back\\\\slash\\nnew line\n"),
              std::string::npos)
        << o.out;
    if (::access("/usr/bin/md5sum", X_OK) == 0) {
        EXPECT_EQ(o.out, run("/usr/bin/md5sum", {large, empty, odd}, "/dev/null").out);
    }
    for (const Args& args : {Args{"md5"}, Args{"md5", "-"}})
        EXPECT_EQ(zyrstd(args, abc).out, kAbc + "  -\n");

    // Unreadable files are reported and the others still done.
    const std::string missing = dir_.file("missing");
    o = zyrstd({"md5", missing, dir_.path(), empty});
    EXPECT_EQ(o.exitCode, 1);
    EXPECT_EQ(o.out, kEmpty + "  " + empty + "\n");
    EXPECT_EQ(o.err, "zyrstd: md5: " + missing + ": No such file or directory\nzyrstd: md5: " +
                         dir_.path() + ": Is a directory\n");
}

TEST_F(ZyrstdToolTest, ConfigPrintsTheEffectiveOptions) {
    const Outcome defaults = zyrstd({"config", "--defaults"});
    EXPECT_TRUE(defaults.exitCode == 0 && defaults.err.empty()) << defaults.err;
    const std::string key = "\nXObjDLCacheMaxRAM = ";
    ASSERT_NE(defaults.out.find(key), std::string::npos) << defaults.out;
    const size_t at = defaults.out.find(key) + key.size();
    const std::string ram = defaults.out.substr(at, defaults.out.find('\n', at) - at);
    ASSERT_TRUE(!ram.empty() && ram.find_first_not_of("0123456789") == ram.npos) << ram;
    EXPECT_TRUE(std::stoull(ram) > 0 && std::stoull(ram) % 4096 == 0) << "whole pages: " << ram;
    EXPECT_EQ(defaults.out, defaultsWith(ram, {}));
    // An empty setup file and one of comments only change nothing.
    const Outcome empty =
        zyrstd({"config", file("empty.cfg", ""), file("notes.cfg", "# a\r\n%b c\r\n\r\n")});
    EXPECT_EQ(empty.exitCode, 0) << empty.err;
    EXPECT_EQ(empty.out, defaults.out);

    // Later files win; unknown keys are reported where they are; the rules are the library's
    // (a shared cache without a budget gets 1 GiB only in a fresh process, as this one is).
    const std::string first =
        file("first.cfg", "# setup\r\nNumMTRThreads = 4\r\nMaxCacheShades 3\r\n"
                          "Typo = 1\r\nSLCompressionRatio 0.75\r\n");
    const std::string second = file("second.cfg", "NumMTRThreads = 8\n\n  XObjDLSharedCache true\n"
                                                  "alsoWrong 2\nTrapPixelOverlap -2");
    const Outcome o = zyrstd({"config", first, second});
    EXPECT_EQ(o.exitCode, 0) << o.err;
    EXPECT_EQ(o.err, first + ":4: unknown key 'Typo'\n" + second + ":4: unknown key 'alsoWrong'\n");
    EXPECT_EQ(o.out, "\n   TrapPixelOverlap set to 1.000000\n\n" +
                         defaultsWith("1073741824",
                                      {"NumMTRThreads = 8", "MaxCacheShades = 10",
                                       "SLCompressionRatio = 0.75", "XObjDLSharedCache = true"}));
}

TEST_F(ZyrstdToolTest, ConfigRefusesBadSetups) {
    const std::string good = file("good.cfg", "TrapPixelOverlap 2\n");
    const std::string bad = file("bad.cfg", "A = 1\r\n\r\n# c\r\nLonely\r\nB = 2\r\n");
    const std::string missing = dir_.file("missing.cfg");
    const struct {
        Args args;
        int exitCode;
        std::string err; // empty: any one line naming the directory
    } cases[] = {
        {{"config", good, bad}, 1, bad + ":4: Setup file is missing Key Value\n"},
        {{"config", good, missing},
         1,
         "zyrstd: config: cannot read '" + missing + "': No such file or directory\n"},
        {{"config", dir_.path()}, 1, ""},
        {{"config"}, 2, "zyrstd: config: no setup file given\nTry 'zyrstd --help'.\n"},
    };
    for (const auto& c : cases) {
        const Outcome o = zyrstd(c.args);
        EXPECT_EQ(o.exitCode, c.exitCode) << c.args.back();
        EXPECT_EQ(o.out, "") << "nothing is printed for a bad setup";
        const bool oneLineNamingTheDirectory =
            o.err.find(dir_.path()) != o.err.npos && o.err.find('\n') == o.err.size() - 1;
        EXPECT_TRUE(c.err.empty() ? oneLineNamingTheDirectory : o.err == c.err) << o.err;
    }
}

TEST_F(ZyrstdToolTest, EncodeAndDecodeRoundTrip) {
    const std::string in = dir_.file("in.bin"), text = dir_.file("in.txt"),
                      back = dir_.file("back.bin");
    for (size_t n : {0u, 1u, 4u, 5u, 79u, 1000u, 1u << 20}) {
        const std::string bytes = randomBytes(n, static_cast<unsigned int>(n));
        zyrtest::writeFile(in, bytes);
        for (const char* kind : {"ascii85", "asciihex"}) {
            SCOPED_TRACE(std::string(kind) + ", " + std::to_string(n) + " bytes");
            Outcome o = zyrstd({"encode", kind, in, text});
            ASSERT_TRUE(o.exitCode == 0 && o.out.empty()) << o.err;
            ASSERT_EQ(zyrstd({"decode", kind, text, back}).exitCode, 0);
            EXPECT_EQ(readFile(back), bytes);
            // Standard input and output when no file (or "-") is named.
            EXPECT_EQ(zyrstd({"encode", kind}, in).out, readFile(text));
            EXPECT_EQ(zyrstd({"decode", kind, "-"}, text).out, bytes);
        }
    }
    EXPECT_EQ(listing(), (Args{"back.bin", "in.bin", "in.txt"})) << "no temporary file is left";

    const std::string z = file("z.bin", std::string(8, '\0') + "A");
    EXPECT_EQ(zyrstd({"encode", "ascii85", "--prefix", "> ", "--eod", "EOD", "--no-z", z}).out,
              "> !!!!!!!!!!5lEOD\r\n");
    EXPECT_EQ(zyrstd({"encode", "asciihex", "--prefix", "  ", z}).out, "  000000000000000041>\r\n");
}

TEST_F(ZyrstdToolTest, EncodeAndDecodeFailuresLeaveNoOutput) {
    const std::string out = dir_.file("out.txt");
    const std::string badA85 = file("bad.a85", std::string(100000, 'A') + "{~>");
    const struct {
        Args args;
        const char* err;
    } cases[] = {
        {{"encode", "ascii85", dir_.file("missing.bin"), out},
         "missing.bin: No such file or directory"},
        {{"decode", "ascii85", dir_.path(), out}, "Is a directory"},
        {{"decode", "ascii85", badA85, out},
         "ASCII85Decode: invalid character 0x7B at offset 100000"},
        {{"decode", "asciihex", file("bad.hex", "41 42 4z>"), out},
         "ASCIIHexDecode: invalid character 0x7A at offset 7"},
        {{"decode", "ascii85", file("z.a85", "9jzqo^~>"), out}, "'z' inside a group at offset 2"},
        {{"encode", "ascii85", badA85, dir_.file("no/such/dir/out")},
         "cannot create the output file"},
    };
    for (const auto& c : cases) {
        const Outcome o = zyrstd(c.args);
        EXPECT_EQ(o.exitCode, 1) << c.err;
        EXPECT_NE(o.err.find(c.err), std::string::npos) << o.err;
    }
    EXPECT_EQ(listing(), (Args{"bad.a85", "bad.hex", "z.a85"})) << "no output, no temporary file";
    // A failed decode leaves an existing output as it was.
    zyrtest::writeFile(out, "precious");
    EXPECT_EQ(zyrstd({"decode", "ascii85", badA85, out}).exitCode, 1);
    EXPECT_EQ(readFile(out), "precious");

    for (const Args& args :
         {Args{"encode"}, Args{"encode", "base64"}, Args{"encode", "asciihex", "--no-z"},
          Args{"encode", "ascii85", "--prefix", "abc"},
          Args{"encode", "ascii85", "--eod", "123456789012345"},
          Args{"decode", "ascii85", "--prefix", "a"}, Args{"decode", "ascii85", "a", "b", "c"}}) {
        const Outcome o = zyrstd(args);
        EXPECT_EQ(o.exitCode, 2) << args.back();
        EXPECT_NE(o.err.find("usage: zyrstd"), std::string::npos) << o.err;
    }
}

// The reports' texts are the library's own; the tool prints them in order, in UTF-8, with
// the timing lines, and reports what it could not read.
TEST_F(ZyrstdToolTest, HwinfoPrintsTheReportsInUtf8) {
    const std::string root = dir_.file("root");
    file("root/proc/cpuinfo",
         "processor\t: 0\nmodel name\t: Intel(R) Xeon(R) Gold 6230 \xe2\x84\xa2\n");
    file("root/etc/os-release", "PRETTY_NAME='Debian 12'\n");
    file("root/proc/meminfo", "MemTotal:        8388608 kB\nCommitLimit:     1000000 kB\n"
                              "Committed_AS:     250000 kB\n");
    file("root/proc/stat", "cpu  1 1 1 1 0 0 0 0\ncpu0 1 1 1 1 0 0 0 0\n");
    file("root/sys/block/sda/device/model", "Disk One\n");
    const Outcome o = zyrstd({"hwinfo", "--root", root});
    EXPECT_TRUE(o.exitCode == 0 && o.err.empty()) << o.err;
    EXPECT_TRUE(zyrtest::startsWith(o.out, "\tMemory 1\n\t\tCapacity: 8192 MB\n")) << o.out;
    size_t at = 0;
    for (const char* part :
         {"\tOperating System \n\t\tCaption: Debian 12\n", "\tProcessor 1\n",
          "\t\tName: Intel(R) Xeon(R) Gold 6230 \xe2\x84\xa2\n", "\tDisk 1\n",
          "\tMemory Performance\n\t\tMEM: 256000000 bytes of1024000000 bytes = 25 % in use\n",
          "\tCPU Performance\n\t\tCPU: 0% busy\n\t\tCore 1 : 0 % busy\n\nTimer Accuracy -- ",
          "\nClocks Per Second -- ", "\nMeasured Bus Speed (using SIMD 'movntps') -- ",
          "\nMeasured Cache Memory Speed (using \"C\" loop) -- "}) {
        EXPECT_NE(at = o.out.find(part, at), std::string::npos) << part << " in order";
        at = at == std::string::npos ? 0 : at;
    }
    EXPECT_EQ(o.out.back(), '\n');

    fs::remove_all(root);
    file("root/proc/meminfo", "MemTotal:        1048576 kB\n");
    const Outcome partial = zyrstd({"hwinfo", "--root", root});
    EXPECT_EQ(partial.exitCode, 1);
    EXPECT_NE(partial.out.find("\tMemory 1\n\t\tCapacity: 1024 MB\n"), std::string::npos);
    EXPECT_NE(partial.out.find("\nTimer Accuracy -- "), std::string::npos);
    for (const char* what : {"processors and operating system", "memory performance"})
        EXPECT_NE(partial.err.find("zyrstd: hwinfo: cannot read the " + std::string(what) + "\n"),
                  std::string::npos)
            << partial.err;
    EXPECT_EQ(partial.err.find("memory modules"), std::string::npos);
    const Outcome bad = zyrstd({"hwinfo", "--bogus"});
    EXPECT_TRUE(bad.exitCode == 2 && bad.out.empty());
    EXPECT_NE(bad.err.find("usage: zyrstd hwinfo [--root DIR]"), std::string::npos);
    EXPECT_EQ(zyrstd({"hwinfo", "--root"}).exitCode, 2);
}
