// Tests of zyrstd config, run as separate processes on setup files in a fresh directory.
#include <gtest/gtest.h>

#include <cstdlib>
#include <ranges>
#include <string>
#include <string_view>
#include <vector>

#include "TestSupport.h"

namespace {

using zyrtest::Outcome;
using zyrtest::writeFile;

// Every option with its default, in print order, "; " between them; the RAM budget depends
// on the machine.
constexpr const char* kDefaults =
    "NumMTRThreads = -1; NumMTBThreads = -1; MTRThreshold = 100000; "
    "MTRFallbackPerBand = true; HasExternalCompositor = false; XObjDLCacheMaxRAM = ; "
    "XObjDLCacheMaxDisk = 9223372036854775807; VDPThroughFlattener = true; "
    "XObjDLSharedCache = false; MaxPatternCacheEntry = 50; ImageMarkerType = 0; "
    "ImageMarkerTiling = 0; ImageMarkerFactorSourceStep = 1.5; "
    "ImageMarkerFactorTiling = 1; MeshMarkerFactorD11 = 0.125; "
    "MeshMarkerFactorD18 = 0.125; MeshMarkerFactorD48 = 0.25; SSE2 = 1; "
    "UseNewImageMarker = 1; OverScanIdntImageMaskMarking = true; SLCompression = 1; "
    "SLCompressionRatio = 1.5; SL0CompressionRatio = 2; UseNullGraphics = false; "
    "MaxCacheShades = 100; RasterizeTilingPattern = true; TileSuperCell = true; "
    "OptimizePortPipeLine = 0; RenderAllInterpretedSurfaces = false; "
    "SingleThreadProcess = false; SurfaceOverLap = 3; XPVDPCacheOverlapThreshold = 100; "
    "XPVDPOptimizeFlattening = 1; AdjustImageNearCopydot = false; "
    "DisableAxialShadeOptimization = false; SplitShadeWithAbruptColorChange = true; "
    "SplitShadeAbruptChangeThreshold = 30; ClipsubPathStackSizeThreshold = 14; "
    "CopyDotMethod = 1; EnableBPCbyObjectType = false; "
    "EnableExternalDLCachePurge = true; EnableXObjDLCachePurge = false; "
    "EnableXPVDPDLCachePurge = false; GRMemoryThreshold = 0; GRPMThreshold = 0; "
    "GRFLThreshold = 0; GROption = 0; UseFasterOpaqueMarking = -1; "
    "ConvertComplexPatternToImage = true; DontCopyDevImage = true; UsePathCache = true; "
    "UseInPlaceComposition = true; GRSAOCTilingPattern = false; "
    "GRCacheOpaqueTilingPattern = true; DisableOPInMarker = true; "
    "UseFasterTransparencyTilingPattern = true; UseOldHOVReducer = true; "
    "MaxGlyphCache = 67108864; MaxGraphPathCache = 134217728; "
    "OptimizeArtworkTree = true; OverscanImageMasksThreshold = 1; "
    "PDFGCPageInterval = 5000; PDFGCMemoryThreshold = 8388608; "
    "PDFGCInterpreterThreadMemoryThreshold = 0; PDFGCMainThreadMemoryThreshold = 0; "
    "PathWidthAdjustment = 0; SubPathSizeThreshold = 24; "
    "AdjustPathWidthInsideTilingPattern = false; DiscardEmptyPathAfterAdjustment = true; "
    "ReplaceSourceColorPrecision = true; ShiftImageMaskDeviceDelta = 0.1; "
    "ShipXPImageSlicesInOrder = false; TrapPixelOverlap = 1; TrappingLibraryPath = ; "
    "UseNewTrapReducer = true; XObjDLCachePurgeChild = true; "
    "XObjDLCachePurgePercentage = 0; DisableXPImageDLOptimization = false; "
    "EmitIMG_META = true; AtomicRegionDirectCMYKOption = 1; ThreadPriority = false; "
    "UseNullXPDevice = false; UseNullXPImage = false; XPShadeCache = true; "
    "RasterizeAllTransparencyShades = false";

// The defaults as printed, with the RAM budget `ram` and some "Key = value" lines replaced.
std::string defaultsWith(const std::string& ram, const std::vector<std::string>& lines) {
    std::string out;
    for (const auto part : std::views::split(std::string_view(kDefaults), std::string_view("; "))) {
        std::string line(part.begin(), part.end());
        const std::string key = line.substr(0, line.find(" = ") + 3);
        if (key == "XObjDLCacheMaxRAM = ")
            line += ram;
        for (const std::string& changed : lines) {
            if (changed.starts_with(key))
                line = changed;
        }
        out += line + "\n";
    }
    return out;
}

class ZyrstdConfigTest : public ::testing::Test {
protected:
    void SetUp() override {
        const char* path = std::getenv("ZYRSTD_TOOL");
        if (!path || !*path)
            GTEST_SKIP() << "ZYRSTD_TOOL does not name the zyrstd program";
        tool_ = path;
    }
    Outcome zyrstd(const std::vector<std::string>& args) {
        Outcome outcome = zyrtest::runProgram(tool_, args, dir_);
        if (outcome.exitCode == -1)
            ADD_FAILURE() << "cannot start " << tool_;
        return outcome;
    }
    std::string file(const std::string& name, const std::string& text) {
        const std::string path = dir_.file(name);
        writeFile(path, text);
        return path;
    }

    std::string tool_;
    zyrtest::TempDir dir_;
};

} // namespace

TEST_F(ZyrstdConfigTest, Defaults) {
    const Outcome result = zyrstd({"config", "--defaults"});
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.err, "");
    const std::string key = "\nXObjDLCacheMaxRAM = ";
    ASSERT_NE(result.out.find(key), std::string::npos) << result.out;
    const size_t at = result.out.find(key) + key.size();
    const std::string ram = result.out.substr(at, result.out.find('\n', at) - at);
    ASSERT_TRUE(!ram.empty() && ram.find_first_not_of("0123456789") == ram.npos) << ram;
    EXPECT_GT(std::stoull(ram), 0u);
    EXPECT_EQ(std::stoull(ram) % 4096, 0u) << "a whole number of pages";
    EXPECT_EQ(result.out, defaultsWith(ram, {}));

    // An empty setup file and one of comments only change nothing.
    const Outcome empty =
        zyrstd({"config", file("empty.cfg", ""), file("notes.cfg", "# a\r\n%b c\r\n\r\n")});
    EXPECT_EQ(empty.exitCode, 0) << empty.err;
    EXPECT_EQ(empty.out, result.out);

    const Outcome help = zyrstd({"--help"});
    EXPECT_EQ(help.exitCode, 0);
    EXPECT_NE(help.out.find("\n  config FILE..."), std::string::npos) << help.out;
    EXPECT_NE(help.out.find("config --defaults"), std::string::npos) << help.out;
}

TEST_F(ZyrstdConfigTest, EffectiveOptionsOfSetupFiles) {
    const std::string first = file("first.cfg", "# engine setup\r\n"
                                                "NumMTRThreads = 4\r\n"
                                                "MaxCacheShades 3\r\n"
                                                "GROption=Performance\r\n"
                                                "TrappingLibraryPath /opt/trap/libtrap.so\r\n"
                                                "Typo = 1\r\n"
                                                "SingleThreadProcess true\r\n"
                                                "UseNew1pxImageMaskHandler false\r\n"
                                                "MaxMemLimit 100000000\r\n"
                                                "SLCompressionRatio 0.75\r\n");
    const std::string second = file("second.cfg", "NumMTRThreads = 8\n"
                                                  "\n"
                                                  "  XObjDLSharedCache true\n"
                                                  "AutomaticGlobalRasterizationOption HOV\n"
                                                  "OverscanImageMasksThreshold 5\n"
                                                  "XPVDPOptimizeFlattening 0\n"
                                                  "alsoWrong 2\n"
                                                  "TrapPixelOverlap -2");
    const Outcome result = zyrstd({"config", first, second});
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.err,
              first + ":6: unknown key 'Typo'\n" + second + ":7: unknown key 'alsoWrong'\n");
    const std::string expected =
        "\n   TrapPixelOverlap set to 1.000000\n\n" +
        defaultsWith("1073741824", {"NumMTRThreads = 8", "MaxCacheShades = 10", "GROption = 1",
                                    "TrappingLibraryPath = /opt/trap/libtrap.so",
                                    "SingleThreadProcess = true", "SurfaceOverLap = 1",
                                    "OverscanImageMasksThreshold = 0", "SLCompressionRatio = 0.75",
                                    "XObjDLSharedCache = true", "XPVDPOptimizeFlattening = 0"});
    EXPECT_EQ(result.out, expected);
}

TEST_F(ZyrstdConfigTest, BadFiles) {
    const std::string good = file("good.cfg", "TrapPixelOverlap 2\n");
    const std::string bad = file("bad.cfg", "A = 1\r\n\r\n# c\r\nLonely\r\nB = 2\r\n");
    Outcome result = zyrstd({"config", good, bad});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.out, "") << "nothing is printed for a bad setup";
    EXPECT_EQ(result.err, bad + ":4: Setup file is missing Key Value\n");

    const std::string missing = dir_.file("missing.cfg");
    result = zyrstd({"config", good, missing});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err,
              "zyrstd: config: cannot read '" + missing + "': No such file or directory\n");

    result = zyrstd({"config", dir_.path()});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_NE(result.err.find(dir_.path()), std::string::npos) << result.err;
    EXPECT_EQ(result.err.find('\n'), result.err.size() - 1) << "one line: " << result.err;

    result = zyrstd({"config"});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_EQ(result.out, "");
}
