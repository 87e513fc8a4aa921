// Every setup-file key the start-up options know, with how it is read and how its effective
// value prints, and the host's start-up order over them. One list for hosts, tools and tests.
#pragma once

#include <cstdio>
#include <cstring>
#include <string>

#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

// How a key's value is read (see the key setters).
enum class eZYRStartupReading {
    kBool,     // TrueOrFalse
    kHighLow,  // HighOrLow
    kInt,      // atoi
    kUnsigned, // atoi taken as unsigned
    kInt64,    // a signed 64-bit number
    kFloat,    // atof narrowed to 32 bits
    kText,     // copied as it is
    kWord,     // one of a few names
    kSpecial,  // a rule of its own: rounded, clamped, a bit of a word, or handed elsewhere
};

struct sZYRStartupOptionKey {
    const char* key;
    eZYRStartupReading reading;
    // The effective value as text; null for a key that only acts on something else.
    std::string (*show)();
};

namespace detail {
inline std::string showValue(bool v) {
    return v ? "true" : "false";
}
inline std::string showValue(int32_t v) {
    return std::to_string(v);
}
inline std::string showValue(unsigned int v) {
    return std::to_string(v);
}
inline std::string showValue(long long v) {
    return std::to_string(v);
}
inline std::string showValue(unsigned long long v) {
    return std::to_string(v);
}
inline std::string showValue(float v) {
    char text[64];
    std::snprintf(text, sizeof text, "%g", static_cast<double>(v));
    return text;
}
inline std::string showValue(const std::string& v) {
    return v;
}
} // namespace detail

// The four records' keys, then the store's, in the order the option tables list them.
inline const sZYRStartupOptionKey kZYRStartupOptionKeys[] = {
    // sMTOptions
    {"NumMTRThreads", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMTOptions().numMTRThreads); }},
    {"NumMTBThreads", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMTOptions().numMTBThreads); }},
    {"MTRThreshold", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMTOptions().mtrThreshold); }},
    {"MTRFallbackPerBand", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetMTOptions().mtrFallbackPerBand); }},
    {"HasExternalCompositor", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetMTOptions().hasExternalCompositor); }},
    // sDLCacheOptions
    {"XObjDLCacheMaxRAM", eZYRStartupReading::kSpecial,
     [] { return detail::showValue(ZYRGetDLCacheOptions().maxRAM); }},
    {"XObjDLCacheMaxDisk", eZYRStartupReading::kSpecial,
     [] { return detail::showValue(ZYRGetDLCacheOptions().maxDisk); }},
    {"VDPThroughFlattener", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetDLCacheOptions().vdpThroughFlattener); }},
    {"XObjDLSharedCache", eZYRStartupReading::kSpecial,
     [] { return detail::showValue(ZYRGetDLCacheOptions().sharedCache); }},
    {"MaxPatternCacheEntry", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetDLCacheOptions().maxPatternCacheEntry); }},
    // sMarkerOptions
    {"ImageMarkerType", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMarkerOptions().imageMarkerType); }},
    {"ImageMarkerTiling", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMarkerOptions().imageMarkerTiling); }},
    {"ImageMarkerFactorSourceStep", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetMarkerOptions().imageMarkerFactorSourceStep); }},
    {"ImageMarkerFactorTiling", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMarkerOptions().imageMarkerFactorTiling); }},
    {"MeshMarkerFactorD11", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetMarkerOptions().meshMarkerFactorD11); }},
    {"MeshMarkerFactorD18", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetMarkerOptions().meshMarkerFactorD18); }},
    {"MeshMarkerFactorD48", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetMarkerOptions().meshMarkerFactorD48); }},
    {"SSE2", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMarkerOptions().sse2); }},
    {"UseNewImageMarker", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMarkerOptions().useNewImageMarker); }},
    {"OverScanIdntImageMaskMarking", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetMarkerOptions().overScanIdntImageMaskMarking); }},
    // sSLDLOptions
    {"SLCompression", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetSLDLOptions().slCompression); }},
    {"SLCompressionRatio", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetSLDLOptions().slCompressionRatio); }},
    {"SL0CompressionRatio", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetSLDLOptions().sl0CompressionRatio); }},
    // the store
    {"UseNullGraphics", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRUseNullGraphics()); }},
    {"MaxCacheShades", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRMaxCacheShades()); }},
    {"RasterizeTilingPattern", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRRasterizeTilingPattern()); }},
    {"TileSuperCell", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRTileSuperCell()); }},
    {"OptimizePortPipeLine", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetOptimizePortPipeLineOption()); }},
    {"RenderAllInterpretedSurfaces", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetRenderAllInterpretedSurfacesOption()); }},
    {"SingleThreadProcess", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRSingleThreadProcess()); }},
    {"SurfaceOverLap", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRSurfaceOverlap()); }},
    {"XPVDPCacheOverlapThreshold", eZYRStartupReading::kUnsigned,
     [] { return detail::showValue(ZYRGetXPVDPCacheOverlapThreshold()); }},
    {"XPVDPOptimizeFlattening", eZYRStartupReading::kSpecial,
     [] { return detail::showValue(ZYRGetXPVDPExperimentalOption()); }},
    {"AdjustImageNearCopydot", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetAdjustImageNearCopydot()); }},
    {"DisableAxialShadeOptimization", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRAxialShadeOptimizationDisabled()); }},
    {"SplitShadeWithAbruptColorChange", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRSplitShadeWithAbruptColorChange()); }},
    {"SplitShadeAbruptChangeThreshold", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRSplitShadeAbruptChangeThreshold()); }},
    {"ClipsubPathStackSizeThreshold", eZYRStartupReading::kUnsigned,
     [] { return detail::showValue(ZYRGetClipsubPathStackSizeThreshold()); }},
    {"CopyDotMethod", eZYRStartupReading::kWord,
     [] { return detail::showValue(ZYRGetCopyDotApproach()); }},
    {"EnableBPCbyObjectType", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYREnableBPCbyObjectType()); }},
    {"EnableExternalDLCachePurge", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYREnableExternalDLCachePurge()); }},
    {"EnableXObjDLCachePurge", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYREnableXObjDLCachePurge()); }},
    {"EnableXPVDPDLCachePurge", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYREnableXPVDPDLCachePurge()); }},
    {"GRMemoryThreshold", eZYRStartupReading::kUnsigned,
     [] { return detail::showValue(ZYRGetGRMemoryThreshold()); }},
    {"GRPMThreshold", eZYRStartupReading::kUnsigned,
     [] { return detail::showValue(ZYRGetGRPMThreshold()); }},
    {"GRFLThreshold", eZYRStartupReading::kUnsigned,
     [] { return detail::showValue(ZYRGetGRFLThreshold()); }},
    {"GROption", eZYRStartupReading::kWord,
     [] { return detail::showValue(static_cast<int32_t>(ZYRGetGROption())); }},
    {"AutomaticGlobalRasterizationOption", eZYRStartupReading::kWord, nullptr},
    {"UseFasterOpaqueMarking", eZYRStartupReading::kSpecial,
     [] { return detail::showValue(ZYRGetUseFasterOpaqueMarking()); }},
    {"ConvertComplexPatternToImage", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetConvertComplexPatternToImage()); }},
    {"DontCopyDevImage", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetDontCopyDevImage()); }},
    {"UsePathCache", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetUsePathCache()); }},
    {"UseInPlaceComposition", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetUseInPlaceComposition()); }},
    {"GRSAOCTilingPattern", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGRSAOCTilingPattern()); }},
    {"GRCacheOpaqueTilingPattern", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGRCacheOpaqueTilingPattern()); }},
    {"DisableOPInMarker", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRIsDisableOPInMarker()); }},
    {"UseFasterTransparencyTilingPattern", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetUseFasterXPTilingPattern()); }},
    {"UseOldHOVReducer", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetUseOldHOVReducer()); }},
    {"MaxGlyphCache", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMaxGlyphCache()); }},
    {"MaxGraphPathCache", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetMaxGraphPathCache()); }},
    {"OptimizeArtworkTree", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetOptimizeArtworkTree()); }},
    {"UseNew1pxImageMaskHandler", eZYRStartupReading::kSpecial, nullptr},
    {"OverscanImageMasksThreshold", eZYRStartupReading::kUnsigned,
     [] { return detail::showValue(ZYRGetOverscanImageMasksThreshold()); }},
    {"PDFGCPageInterval", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetPDFGCPageInterval()); }},
    {"PDFGCMemoryThreshold", eZYRStartupReading::kInt,
     [] { return detail::showValue(ZYRGetPDFGCMemoryThreshold()); }},
    {"PDFGCInterpreterThreadMemoryThreshold", eZYRStartupReading::kInt64,
     [] { return detail::showValue(ZYRGetPDFGCInterpreterThreadMemoryThreshold()); }},
    {"PDFGCMainThreadMemoryThreshold", eZYRStartupReading::kInt64,
     [] { return detail::showValue(ZYRGetPDFGCMainThreadMemoryThreshold()); }},
    {"PathWidthAdjustment", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetPathWidthAdjustment()); }},
    {"SubPathSizeThreshold", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetSubPathSizeThreshold()); }},
    {"AdjustPathWidthInsideTilingPattern", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRAdjustPathWidthInsideTilingPattern()); }},
    {"DiscardEmptyPathAfterAdjustment", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRDiscardEmptyPathAfterAdjustment()); }},
    {"ReplaceSourceColorPrecision", eZYRStartupReading::kHighLow,
     [] { return detail::showValue(ZYRGetReplaceSourceColorPrecision()); }},
    {"ShiftImageMaskDeviceDelta", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetShiftImageMaskDeviceDelta()); }},
    {"ShipXPImageSlicesInOrder", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRShipXPImageSlicesInOrder()); }},
    {"TrapPixelOverlap", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRGetTrapPixelOverlap()); }},
    {"TrappingLibraryPath", eZYRStartupReading::kText,
     [] { return detail::showValue(ZYRGetTrappingLibraryPath()); }},
    {"UseNewTrapReducer", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRUseNewTrapReducer()); }},
    {"XObjDLCachePurgeChild", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRXObjDLCachePurgeChild()); }},
    {"XObjDLCachePurgePercentage", eZYRStartupReading::kFloat,
     [] { return detail::showValue(ZYRXObjDLCachePurgePercentage()); }},
    {"DisableXPImageDLOptimization", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRXPImageDLOptimizationDisabled()); }},
    {"EmitIMG_META", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYREmitIMG_META()); }},
    {"AtomicRegionDirectCMYKOption", eZYRStartupReading::kInt,
     [] { return detail::showValue(static_cast<int32_t>(ZYRAtomicRegionDirectCMYKOption())); }},
    {"ThreadPriority", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRThreadPriority()); }},
    {"UseNullXPDevice", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRUseNullXPDevice()); }},
    {"UseNullXPImage", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRUseNullXPImage()); }},
    {"XPShadeCache", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRXPShadeCache()); }},
    {"RasterizeAllTransparencyShades", eZYRStartupReading::kBool,
     [] { return detail::showValue(ZYRGetRasterizeAllTransparencyShades()); }},
    {"MaxMemLimit", eZYRStartupReading::kSpecial, nullptr},
    {"TestAvailablePhysicalMemory", eZYRStartupReading::kSpecial, nullptr},
    {"BreakOnAllocationCount", eZYRStartupReading::kSpecial, nullptr},
};

using tZYRStartupKeySetter = void (*)(const char* key, const char* value);

// Every key setter of the store; each ignores the keys of the others.
inline constexpr tZYRStartupKeySetter kZYRStartupKeySetters[] = {
    ZYRGraphicsOptions,
    ZYRMaxCacheShadesOption,
    ZYRParseOptimizePortPipeLineOption,
    ZYRParseRenderAllInterpretedSurfacesOption,
    ZYRParseSingleThreadOptions,
    ZYRParseSurfaceOverlapOptions,
    ZYRParseXPVDPCacheOverlapThreshold,
    ZYRSetAdjustImageNearCopydot,
    ZYRSetAxialShadeOptimizationOption,
    ZYRSetClipsubPathStackSizeParameters,
    ZYRSetCopyDotApproach,
    ZYRSetEnableBPCbyObjectType,
    ZYRSetEnableExternalDLCachePurge,
    ZYRSetEnableXObjDLCachePurge,
    ZYRSetEnableXPVDPDLCachePurge,
    ZYRSetGRParams,
    ZYRSetMaxGlyphCache,
    ZYRSetOptimizeArtworkTree,
    ZYRSetOverscanImageMasksParameters,
    ZYRSetPDFGCPageInterval,
    ZYRSetPathWidthAdjustment,
    ZYRSetReplaceSourceColorPrecision,
    ZYRSetShiftImageMaskDeviceDelta,
    ZYRSetShipXPImageSlicesInOrder,
    ZYRSetTrapPixelOverlap,
    ZYRSetTrappingLibraryPath,
    ZYRSetUseNewTrapReducer,
    ZYRSetXObjDLCachePurgeChild,
    ZYRSetXObjDLCachePurgePercentage,
    ZYRSetXPImageDLOptimization,
    ZYRThreadPriorityOptons,
    ZYRXPDeviceOptions,
    ZYRXPImageOptions,
    ZYRXPShadeCacheOptions,
    ZYRParseMemoryOptions,
};

// True for a key that some setter or record parser acts on.
inline bool ZYRIsStartupOptionKey(const char* key) {
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys) {
        if (std::strcmp(row.key, key) == 0)
            return true;
    }
    return false;
}

// The host's start-up order: records filled with their defaults, every pair fed to every
// key setter and record parser, then the records stored.
class CZYRStartupOptionFeeder {
public:
    CZYRStartupOptionFeeder() {
        ZYRFillDefaultMTOptions(mt_);
        ZYRFillDefaultDLCacheOptions(dlCache_, CZYRUniString());
        ZYRFillDefaultMarkerOptions(marker_);
        ZYRFillDefaultSLDLOptions(sldl_);
    }

    void feed(const char* key, const char* value) {
        for (const tZYRStartupKeySetter setter : kZYRStartupKeySetters)
            setter(key, value);
        ZYRParseMTOptions(&mt_, key, value);
        ZYRParseDLCacheOptions(&dlCache_, key, value);
        ZYRParseMarkerOptions(&marker_, key, value);
        ZYRParseSLDLOptions(&sldl_, key, value);
    }

    void store() const {
        ZYRSetMTOptions(mt_);
        ZYRSetDLCacheOptions(dlCache_);
        ZYRSetMarkerOptions(marker_);
        ZYRSetSLDLOptions(sldl_);
    }

private:
    sMTOptions mt_;
    sDLCacheOptions dlCache_;
    sMarkerOptions marker_;
    sSLDLOptions sldl_;
};

} // namespace ZYRStd
