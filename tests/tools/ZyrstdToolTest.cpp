#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>

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
    Outcome zyrstd(const Args& args, const std::string& input = "/dev/null") {
        Outcome outcome = zyrtest::runProgram(tool_, args, dir_, input);
        if (outcome.exitCode == -1)
            ADD_FAILURE() << "cannot start " << tool_;
        return outcome;
    }
    std::string file(const std::string& name, const std::string& bytes) {
        const fs::path path = fs::path(dir_.path()) / name;
        fs::create_directories(path.parent_path());
        zyrtest::writeFile(path.string(), bytes);
        return path.string();
    }
    Args listing() const {
        Args names;
        for (const auto& entry : fs::directory_iterator(dir_.path()))
            if (entry.path().filename().string()[0] != '.')
                names.push_back(entry.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }
    void expectFailure(const Outcome& o, int exitCode, const std::string& message) {
        EXPECT_TRUE(o.exitCode == exitCode && o.out.empty()) << o.exitCode << " " << o.out;
        EXPECT_NE(o.err.find(message), std::string::npos) << o.err;
    }

    std::string tool_;
    zyrtest::TempDir dir_;
};

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

TEST_F(ZyrstdToolTest, CommandLineAndMd5) {
    const Outcome help = zyrstd({"--help"});
    EXPECT_TRUE(help.exitCode == 0 && help.err.empty());
    EXPECT_EQ(zyrstd({"-h"}).out + zyrstd({"help"}).out, help.out + help.out);
    EXPECT_EQ(zyrstd({"--version"}).out, "zyrstd " ZYRSTD_VERSION_STRING "\n");
    // Each command's usage: on standard output when asked for, after the reason on standard
    // error for a wrong command line; the list of commands shows each synopsis.
    const std::pair<Args, std::string> usageErrors[] = {
        {{"md5", "--bogus"}, "unknown option '--bogus'"},
        {{"encode"}, "no encoding given"},
        {{"encode", "base64"}, "unknown encoding 'base64'"},
        {{"encode", "asciihex", "--no-z"}, "--no-z applies to ascii85 only"},
        {{"encode", "ascii85", "--prefix", "abc"}, "--prefix takes at most 2 characters"},
        {{"encode", "ascii85", "--eod", "123456789012345"}, "--eod takes at most 14 characters"},
        {{"decode", "ascii85", "--prefix", "a"}, "unknown option '--prefix'"},
        {{"decode", "ascii85", "a", "b", "c"}, "too many arguments"},
        {{"config"}, "no setup file given"},
        {{"config", "--defaults", "a.cfg"}, "--defaults takes no setup file"},
        {{"config", "-x"}, "unknown option '-x'"},
        {{"hwinfo", "--root"}, "--root needs a folder"},
        {{"hwinfo", "--bogus"}, "unexpected argument '--bogus'"},
        {{"demo", "now"}, "takes no arguments"},
    };
    for (const auto& [args, why] : usageErrors) {
        const Outcome usage = zyrstd({args[0], "--help"});
        EXPECT_TRUE(usage.exitCode == 0 && usage.err.empty() &&
                    zyrtest::startsWith(usage.out, "usage: zyrstd " + args[0]))
            << args[0];
        EXPECT_EQ(zyrstd({args[0], "-x", "-h"}).out, usage.out);
        EXPECT_NE(help.out.find("\n  " + usage.out.substr(14, usage.out.find('\n') - 14) + "\n"),
                  std::string::npos)
            << args[0];
        expectFailure(zyrstd(args), 2, "zyrstd: " + args[0] + ": " + why + "\n" + usage.out);
    }
    EXPECT_EQ(zyrstd({"encode", "asciihex", "--prefix", "-h"}, file("a", "A")).out, "-h41>\r\n")
        << "an option's value is not a request for help";
    expectFailure(zyrstd({"md5", "--", "-h"}), 1, "zyrstd: md5: -h: No such file or directory");
    expectFailure(zyrstd({"no-such-command"}), 2, "'no-such-command'");
    expectFailure(zyrstd({}), 2, "\nTry 'zyrstd --help'.\n");

    const std::string empty = file("empty", ""), abc = file("abc", "abc");
    const std::string odd = file("back\\slash\nnew line", "abc"), missing = dir_.file("missing");
    const std::string kEmpty = "d41d8cd98f00b204e9800998ecf8427e",
                      kAbc = "900150983cd24fb0d6963f7d28e17f72";
    const Outcome o = zyrstd({"md5", missing, empty, dir_.path(), odd});
    EXPECT_EQ(std::to_string(o.exitCode) + o.out, "1" + kEmpty + "  " + empty + "\n\\" + kAbc +
                                                      "  " + dir_.path() +
                                                      "/back\\\\slash\\nnew line\n");
    EXPECT_EQ(o.err, "zyrstd: md5: " + missing + ": No such file or directory\nzyrstd: md5: " +
                         dir_.path() + ": Is a directory\n");
    for (const Args& args : {Args{"md5"}, Args{"md5", "-"}})
        EXPECT_EQ(zyrstd(args, abc).out, kAbc + "  -\n");
}

TEST_F(ZyrstdToolTest, ConfigPrintsTheEffectiveOptions) {
    const Outcome defaults = zyrstd({"config", "--defaults"});
    EXPECT_TRUE(defaults.exitCode == 0 && defaults.err.empty()) << defaults.err;
    const std::string key = "\nXObjDLCacheMaxRAM = ";
    ASSERT_NE(defaults.out.find(key), std::string::npos) << defaults.out;
    const size_t at = defaults.out.find(key) + key.size();
    const std::string ram = defaults.out.substr(at, defaults.out.find('\n', at) - at);
    ASSERT_TRUE(!ram.empty() && ram.find_first_not_of("0123456789") == ram.npos) << ram;
    EXPECT_EQ(defaults.out, defaultsWith(ram, {}));
    EXPECT_EQ(
        zyrstd({"config", file("empty.cfg", ""), file("notes.cfg", "# a\r\n%b c\r\n\r\n")}).out,
        defaults.out);

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

    const std::string good = file("good.cfg", "TrapPixelOverlap 2\n"),
                      missing = dir_.file("no.cfg");
    const std::string bad = file("bad.cfg", "A = 1\r\n\r\n# c\r\nLonely\r\nB = 2\r\n");
    const std::string huge = file("huge.cfg", "");
    fs::resize_file(huge, (64ull << 20) + 1); // sparse: one byte over the bound
    const std::tuple<Args, int, std::string> cases[] = {
        {{"config", good, bad}, 1, bad + ":4: Setup file is missing Key Value\n"},
        {{"config", good, missing},
         1,
         "zyrstd: config: cannot read '" + missing + "': No such file or directory\n"},
        {{"config", dir_.path()}, 1, ""},
        {{"config", "/dev/zero"},
         1,
         "zyrstd: config: cannot read '/dev/zero': not a regular file\n"},
        {{"config", huge}, 1, "zyrstd: config: cannot read '" + huge + "': larger than 64 MiB\n"},
    };
    for (const auto& [args, exitCode, err] : cases) {
        const Outcome failed = zyrstd(args);
        expectFailure(failed, exitCode, err.empty() ? dir_.path() : err);
        EXPECT_TRUE(err.empty() ? failed.err.find('\n') == failed.err.size() - 1
                                : failed.err == err)
            << failed.err;
    }
}

TEST_F(ZyrstdToolTest, EncodeAndDecodeWriteWholeFilesOrNone) {
    const std::string bytes("\0\0\0\0\0\0\0\0A\xff", 10), in = file("in.bin", bytes);
    const std::string text = dir_.file("in.txt"), back = dir_.file("back.bin");
    for (const char* kind : {"ascii85", "asciihex"}) {
        ASSERT_EQ(zyrstd({"encode", kind, in, text}).out, "") << kind;
        ASSERT_EQ(zyrstd({"decode", kind, text, back}).exitCode, 0) << kind;
        EXPECT_EQ(readFile(back), bytes) << kind;
        EXPECT_EQ(zyrstd({"encode", kind}, in).out, readFile(text)) << kind;
        EXPECT_EQ(zyrstd({"decode", kind, "-"}, text).out, bytes) << kind;
    }
    EXPECT_EQ(zyrstd({"encode", "ascii85", "--prefix", "> ", "--eod", "EOD", "--no-z", in}).out,
              "> !!!!!!!!!!62pEOD\r\n");
    EXPECT_EQ(zyrstd({"encode", "asciihex", "--prefix", "  ", in}).out,
              "  000000000000000041ff>\r\n");

    const std::string out = dir_.file("out.txt");
    const std::string badA85 = file("bad.a85", std::string(100000, 'A') + "{~>");
    const std::pair<Args, const char*> failures[] = {
        {{"encode", "ascii85", dir_.file("missing.bin"), out},
         "missing.bin: No such file or directory"},
        {{"decode", "ascii85", dir_.path(), out}, "Is a directory"},
        {{"decode", "ascii85", badA85, out},
         "ASCII85Decode: invalid character 0x7B at offset 100000"},
        {{"decode", "asciihex", file("bad.hex", "41 42 4z>"), out},
         "ASCIIHexDecode: invalid character 0x7A at offset 7"},
        {{"encode", "ascii85", badA85, dir_.file("no/such/dir/out")},
         "cannot create the output file"},
    };
    for (const auto& [args, err] : failures)
        expectFailure(zyrstd(args), 1, err);
    EXPECT_EQ(listing(), (Args{"back.bin", "bad.a85", "bad.hex", "in.bin", "in.txt"}))
        << "no output, no temporary file";
    zyrtest::writeFile(out, "precious");
    EXPECT_TRUE(zyrstd({"decode", "ascii85", badA85, out}).exitCode == 1 &&
                readFile(out) == "precious");
}

// The demo's logs and session live in a folder of its own: names planted in the shared
// temporary folder are neither followed nor removed, and nothing is left behind. The folder's
// path is bytes: UTF-8 or not, the logs land inside it.
TEST_F(ZyrstdToolTest, DemoKeepsToAFolderOfItsOwn) {
    const std::string precious = file("precious", "keep");
    const char* saved = std::getenv("TMPDIR");
    const std::string savedText = saved ? saved : "";
    for (const std::string tmp : {"plain", "d\xc3\xa9j\xc3\xa0-\xd0\xb2\xd1\x8e", "\xff\xfe"}) {
        const std::string folder = dir_.file(tmp);
        fs::create_directory(folder);
        for (const char* name : {"zyrstd-demo-dmm.log", "zyrstd-demo-trace.log"})
            fs::create_symlink(precious, folder + "/" + name);
        ::setenv("TMPDIR", folder.c_str(), 1);
        const Outcome o = zyrstd({"demo"});
        saved ? ::setenv("TMPDIR", savedText.c_str(), 1) : ::unsetenv("TMPDIR");
        EXPECT_EQ(o.exitCode, 0) << o.err;
        for (const std::string& line :
             {"the trace log (" + folder + "/zyrstd-demo-", std::string("/trace.log):\n   | "),
              "session file: " + folder + "/zyrstd-demo-",
              std::string(R"("key":"SurfaceCount","time":)"),
              std::string(R"("type":"session_close")")})
            EXPECT_NE(o.out.find(line), std::string::npos) << tmp << ": no " << line;
        EXPECT_EQ(std::distance(fs::directory_iterator(folder), {}), 2) << tmp;
    }
    EXPECT_EQ(readFile(precious), "keep");
}

// The library's reports, whose texts its own tests pin, in UTF-8 and followed by the timing
// lines; a report that cannot be read is named on standard error and fails the command.
TEST_F(ZyrstdToolTest, HwinfoPrintsTheReportsInUtf8) {
    const std::string root = dir_.file("root");
    file("root/proc/cpuinfo", "processor\t: 0\nmodel name\t: Xeon \xe2\x84\xa2 \xf0\x9f\x98\x80\n");
    file("root/etc/os-release", "PRETTY_NAME='Debian 12'\n");
    file("root/proc/meminfo", "MemTotal:        1048576 kB\n");
    const Outcome o = zyrstd({"hwinfo", "--root", root});
    EXPECT_EQ(o.exitCode, 1);
    size_t at = 0;
    for (const char* part :
         {"\tMemory 1\n\t\tCapacity: 1024 MB\n", "\tOperating System \n",
          "\t\tName: Xeon \xe2\x84\xa2 \xf0\x9f\x98\x80\n", "\nTimer Accuracy -- ",
          "\nMeasured Cache Memory Speed (using \"C\" loop) -- "}) {
        EXPECT_NE(at = o.out.find(part, at), std::string::npos) << part << " in order";
        at = at == std::string::npos ? 0 : at;
    }
    EXPECT_EQ(o.out.back(), '\n');
    EXPECT_EQ(o.err, "zyrstd: hwinfo: cannot read the disks\nzyrstd: hwinfo: cannot read the "
                     "memory performance\nzyrstd: hwinfo: cannot read the processor performance\n");
}
