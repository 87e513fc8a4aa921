// Tests of zyrstd config, run as separate processes on setup files in a fresh directory.
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "TestSupport.h"

namespace {

using zyrtest::Outcome;
using zyrtest::writeFile;

// Every option with its default, in print order; the RAM budget depends on the machine.
constexpr const char* kDefaultsBeforeRAM = "NumMTRThreads = -1\n"
                                           "NumMTBThreads = -1\n"
                                           "MTRThreshold = 100000\n"
                                           "MTRFallbackPerBand = true\n"
                                           "HasExternalCompositor = false\n";
constexpr const char* kDefaultsAfterRAM = "XObjDLCacheMaxDisk = 9223372036854775807\n"
                                          "VDPThroughFlattener = true\n"
                                          "XObjDLSharedCache = false\n"
                                          "MaxPatternCacheEntry = 50\n"
                                          "ImageMarkerType = 0\n"
                                          "ImageMarkerTiling = 0\n"
                                          "ImageMarkerFactorSourceStep = 1.5\n"
                                          "ImageMarkerFactorTiling = 1\n"
                                          "MeshMarkerFactorD11 = 0.125\n"
                                          "MeshMarkerFactorD18 = 0.125\n"
                                          "MeshMarkerFactorD48 = 0.25\n"
                                          "SSE2 = 1\n"
                                          "UseNewImageMarker = 1\n"
                                          "OverScanIdntImageMaskMarking = true\n"
                                          "SLCompression = 1\n"
                                          "SLCompressionRatio = 1.5\n"
                                          "SL0CompressionRatio = 2\n"
                                          "UseNullGraphics = false\n"
                                          "MaxCacheShades = 100\n"
                                          "RasterizeTilingPattern = true\n"
                                          "TileSuperCell = true\n"
                                          "OptimizePortPipeLine = 0\n"
                                          "RenderAllInterpretedSurfaces = false\n"
                                          "SingleThreadProcess = false\n"
                                          "SurfaceOverLap = 3\n"
                                          "XPVDPCacheOverlapThreshold = 100\n"
                                          "XPVDPOptimizeFlattening = 1\n"
                                          "AdjustImageNearCopydot = false\n"
                                          "DisableAxialShadeOptimization = false\n"
                                          "SplitShadeWithAbruptColorChange = true\n"
                                          "SplitShadeAbruptChangeThreshold = 30\n"
                                          "ClipsubPathStackSizeThreshold = 14\n"
                                          "CopyDotMethod = 1\n"
                                          "EnableBPCbyObjectType = false\n"
                                          "EnableExternalDLCachePurge = true\n"
                                          "EnableXObjDLCachePurge = false\n"
                                          "EnableXPVDPDLCachePurge = false\n"
                                          "GRMemoryThreshold = 0\n"
                                          "GRPMThreshold = 0\n"
                                          "GRFLThreshold = 0\n"
                                          "GROption = 0\n"
                                          "UseFasterOpaqueMarking = -1\n"
                                          "ConvertComplexPatternToImage = true\n"
                                          "DontCopyDevImage = true\n"
                                          "UsePathCache = true\n"
                                          "UseInPlaceComposition = true\n"
                                          "GRSAOCTilingPattern = false\n"
                                          "GRCacheOpaqueTilingPattern = true\n"
                                          "DisableOPInMarker = true\n"
                                          "UseFasterTransparencyTilingPattern = true\n"
                                          "UseOldHOVReducer = true\n"
                                          "MaxGlyphCache = 67108864\n"
                                          "MaxGraphPathCache = 134217728\n"
                                          "OptimizeArtworkTree = true\n"
                                          "OverscanImageMasksThreshold = 1\n"
                                          "PDFGCPageInterval = 5000\n"
                                          "PDFGCMemoryThreshold = 8388608\n"
                                          "PDFGCInterpreterThreadMemoryThreshold = 0\n"
                                          "PDFGCMainThreadMemoryThreshold = 0\n"
                                          "PathWidthAdjustment = 0\n"
                                          "SubPathSizeThreshold = 24\n"
                                          "AdjustPathWidthInsideTilingPattern = false\n"
                                          "DiscardEmptyPathAfterAdjustment = true\n"
                                          "ReplaceSourceColorPrecision = true\n"
                                          "ShiftImageMaskDeviceDelta = 0.1\n"
                                          "ShipXPImageSlicesInOrder = false\n"
                                          "TrapPixelOverlap = 1\n"
                                          "TrappingLibraryPath = \n"
                                          "UseNewTrapReducer = true\n"
                                          "XObjDLCachePurgeChild = true\n"
                                          "XObjDLCachePurgePercentage = 0\n"
                                          "DisableXPImageDLOptimization = false\n"
                                          "EmitIMG_META = true\n"
                                          "AtomicRegionDirectCMYKOption = 1\n"
                                          "ThreadPriority = false\n"
                                          "UseNullXPDevice = false\n"
                                          "UseNullXPImage = false\n"
                                          "XPShadeCache = true\n"
                                          "RasterizeAllTransparencyShades = false\n";

// The defaults with some lines replaced, as "Key = value" lines.
std::string defaultsWith(const std::string& ramLine, const std::vector<std::string>& lines) {
    // A leading line end lets every key be found as "\nKey = ".
    std::string out = "\n" + std::string(kDefaultsBeforeRAM) + ramLine + kDefaultsAfterRAM;
    for (const std::string& line : lines) {
        const std::string key = line.substr(0, line.find(" = ") + 3);
        const size_t at = out.find("\n" + key);
        if (at == std::string::npos) {
            ADD_FAILURE() << "no default line for " << key;
            continue;
        }
        const size_t end = out.find('\n', at + 1);
        out.replace(at + 1, end - at - 1, line);
    }
    return out.substr(1);
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
    // The defaults' RAM line, taken from --defaults.
    std::string ramLine() {
        const Outcome defaults = zyrstd({"config", "--defaults"});
        const std::string key = "\nXObjDLCacheMaxRAM = ";
        const size_t at = defaults.out.find(key);
        const size_t end = defaults.out.find('\n', at + 1);
        if (at == std::string::npos || end == std::string::npos ||
            defaults.out.find_first_not_of("0123456789", at + key.size()) != end) {
            ADD_FAILURE() << "no RAM budget in " << defaults.out;
            return "";
        }
        return defaults.out.substr(at + 1, end - at);
    }

    std::string tool_;
    zyrtest::TempDir dir_;
};

} // namespace

TEST_F(ZyrstdConfigTest, Defaults) {
    const Outcome result = zyrstd({"config", "--defaults"});
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.err, "");
    const std::string ram = ramLine();
    ASSERT_FALSE(ram.empty());
    const unsigned long long budget = std::stoull(ram.substr(ram.find('=') + 2));
    EXPECT_GT(budget, 0u);
    EXPECT_EQ(budget % 4096, 0u) << "a whole number of pages";
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
        defaultsWith("XObjDLCacheMaxRAM = 1073741824\n",
                     {"NumMTRThreads = 8", "MaxCacheShades = 10", "GROption = 1",
                      "TrappingLibraryPath = /opt/trap/libtrap.so", "SingleThreadProcess = true",
                      "SurfaceOverLap = 1", "OverscanImageMasksThreshold = 0",
                      "SLCompressionRatio = 0.75", "XObjDLSharedCache = true",
                      "XPVDPOptimizeFlattening = 0"});
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
