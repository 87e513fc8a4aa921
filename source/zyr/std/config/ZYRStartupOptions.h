// The start-up option store: the engine's tuning switches, their key setters, typed
// setters, getters and the four option records.
#pragma once

#include <cstdint>
#include <string>

#include "ZYRStdExport.h"

namespace ZYRStd {

class CZYRUniString;

// ---- records the host fills, parses and stores whole ------------------------------------------

struct sMTOptions {
    int32_t numMTRThreads;      // "NumMTRThreads"
    int32_t numMTBThreads;      // "NumMTBThreads"
    int32_t mtrThreshold;       // "MTRThreshold"
    bool mtrFallbackPerBand;    // "MTRFallbackPerBand"
    bool hasExternalCompositor; // "HasExternalCompositor"
};

struct sDLCacheOptions {
    unsigned long long maxRAM;    // "XObjDLCacheMaxRAM": bytes; whole pages once the key is set
    long long maxDisk;            // "XObjDLCacheMaxDisk": bytes
    unsigned char reserved[16];   // the engine's own fields; no key sets them
    bool vdpThroughFlattener;     // "VDPThroughFlattener"
    bool sharedCache;             // "XObjDLSharedCache"
    int32_t maxPatternCacheEntry; // "MaxPatternCacheEntry"
};

struct sMarkerOptions {
    int32_t imageMarkerType;           // "ImageMarkerType"
    int32_t imageMarkerTiling;         // "ImageMarkerTiling"
    float imageMarkerFactorSourceStep; // "ImageMarkerFactorSourceStep"
    int32_t imageMarkerFactorTiling;   // "ImageMarkerFactorTiling"
    float meshMarkerFactorD11;         // "MeshMarkerFactorD11"
    float meshMarkerFactorD18;         // "MeshMarkerFactorD18"
    float meshMarkerFactorD48;         // "MeshMarkerFactorD48"
    int32_t sse2;                      // "SSE2"
    int32_t useNewImageMarker;         // "UseNewImageMarker"
    bool overScanIdntImageMaskMarking; // "OverScanIdntImageMaskMarking"
};

struct sSLDLOptions {
    int32_t slCompression;     // "SLCompression"
    float slCompressionRatio;  // "SLCompressionRatio"
    float sl0CompressionRatio; // "SL0CompressionRatio"
};

// The fill functions set the caller's record only; the parsers change the field whose key
// matches and nothing for other keys (a null record is left alone).
ZYRSTD_API void ZYRFillDefaultMTOptions(sMTOptions& options);
ZYRSTD_API void ZYRParseMTOptions(sMTOptions* options, const char* key, const char* value);
ZYRSTD_API void ZYRSetMTOptions(const sMTOptions& options);
ZYRSTD_API const sMTOptions& ZYRGetMTOptions();

// The string is not used. The RAM budget's default is a twentieth of the smaller of the
// physical memory and the virtual address space, rounded up to whole pages.
ZYRSTD_API void ZYRFillDefaultDLCacheOptions(sDLCacheOptions& options, const CZYRUniString& unused);
// Also sets the store options "RasterizeTilingPattern" and "TileSuperCell".
ZYRSTD_API void ZYRParseDLCacheOptions(sDLCacheOptions* options, const char* key,
                                       const char* value);
ZYRSTD_API void ZYRSetDLCacheOptions(const sDLCacheOptions& options);
ZYRSTD_API sDLCacheOptions& ZYRGetDLCacheOptions();

ZYRSTD_API void ZYRFillDefaultMarkerOptions(sMarkerOptions& options);
ZYRSTD_API void ZYRParseMarkerOptions(sMarkerOptions* options, const char* key, const char* value);
ZYRSTD_API void ZYRSetMarkerOptions(const sMarkerOptions& options);
ZYRSTD_API sMarkerOptions& ZYRGetMarkerOptions();

ZYRSTD_API void ZYRFillDefaultSLDLOptions(sSLDLOptions& options);
ZYRSTD_API void ZYRParseSLDLOptions(sSLDLOptions* options, const char* key, const char* value);
ZYRSTD_API void ZYRSetSLDLOptions(const sSLDLOptions& options);
ZYRSTD_API sSLDLOptions& ZYRGetSLDLOptions();

// ---- enumerations
// --------------------------------------------------------------------------------

enum eZYRGROption : int32_t {
    kZYRGROptionAdaptive = 0,    // "Adaptive"
    kZYRGROptionHOV = 1,         // "HOV", "Alternate"
    kZYRGROptionXPDevice = 2,    // "XPDevice", "Consistency"
    kZYRGROptionPerformance = 3, // "Performance"
};
// Values the engine's modules define; the store only keeps them.
enum eZYRPlanarmapPrecisionOption : int32_t {};
enum eZYRAtomicRegionDirectCMYKOption : int32_t {};

// ---- key setters: each acts on its own keys and ignores every other
// ------------------------------

ZYRSTD_API void ZYRGraphicsOptions(const char* key, const char* value);
ZYRSTD_API void ZYRMaxCacheShadesOption(const char* key, const char* value);
ZYRSTD_API void ZYRParseOptimizePortPipeLineOption(const char* key, const char* value);
ZYRSTD_API void ZYRParseRenderAllInterpretedSurfacesOption(const char* key, const char* value);
ZYRSTD_API void ZYRParseSingleThreadOptions(const char* key, const char* value);
ZYRSTD_API void ZYRParseSurfaceOverlapOptions(const char* key, const char* value);
ZYRSTD_API void ZYRParseXPVDPCacheOverlapThreshold(const char* key, const char* value);
ZYRSTD_API void ZYRSetAdjustImageNearCopydot(const char* key, const char* value);
ZYRSTD_API void ZYRSetAxialShadeOptimizationOption(const char* key, const char* value);
ZYRSTD_API void ZYRSetClipsubPathStackSizeParameters(const char* key, const char* value);
ZYRSTD_API void ZYRSetCopyDotApproach(const char* key, const char* value);
ZYRSTD_API void ZYRSetEnableBPCbyObjectType(const char* key, const char* value);
ZYRSTD_API void ZYRSetEnableExternalDLCachePurge(const char* key, const char* value);
ZYRSTD_API void ZYRSetEnableXObjDLCachePurge(const char* key, const char* value);
ZYRSTD_API void ZYRSetEnableXPVDPDLCachePurge(const char* key, const char* value);
ZYRSTD_API void ZYRSetGRParams(const char* key, const char* value);
ZYRSTD_API void ZYRSetMaxGlyphCache(const char* key, const char* value);
ZYRSTD_API void ZYRSetOptimizeArtworkTree(const char* key, const char* value);
ZYRSTD_API void ZYRSetOverscanImageMasksParameters(const char* key, const char* value);
ZYRSTD_API void ZYRSetPDFGCPageInterval(const char* key, const char* value);
ZYRSTD_API void ZYRSetPathWidthAdjustment(const char* key, const char* value);
ZYRSTD_API void ZYRSetReplaceSourceColorPrecision(const char* key, const char* value);
ZYRSTD_API void ZYRSetShiftImageMaskDeviceDelta(const char* key, const char* value);
ZYRSTD_API void ZYRSetShipXPImageSlicesInOrder(const char* key, const char* value);
// Prints "\n   TrapPixelOverlap set to %f\n\n" on standard output after storing.
ZYRSTD_API void ZYRSetTrapPixelOverlap(const char* key, const char* value);
ZYRSTD_API void ZYRSetTrappingLibraryPath(const char* key, const char* value);
ZYRSTD_API void ZYRSetUseNewTrapReducer(const char* key, const char* value);
ZYRSTD_API void ZYRSetXObjDLCachePurgeChild(const char* key, const char* value);
ZYRSTD_API void ZYRSetXObjDLCachePurgePercentage(const char* key, const char* value);
ZYRSTD_API void ZYRSetXPImageDLOptimization(const char* key, const char* value);
ZYRSTD_API void ZYRThreadPriorityOptons(const char* key, const char* value);
ZYRSTD_API void ZYRXPDeviceOptions(const char* key, const char* value);
ZYRSTD_API void ZYRXPImageOptions(const char* key, const char* value);
ZYRSTD_API void ZYRXPShadeCacheOptions(const char* key, const char* value);
// "MaxMemLimit", "TestAvailablePhysicalMemory" and "BreakOnAllocationCount" go straight to
// the allocation front.
ZYRSTD_API void ZYRParseMemoryOptions(const char* key, const char* value);

// ---- getters of the key options
// --------------------------------------------------------------------

ZYRSTD_API bool ZYRUseNullGraphics();
ZYRSTD_API int32_t ZYRMaxCacheShades();
ZYRSTD_API bool ZYRRasterizeTilingPattern();
ZYRSTD_API bool ZYRTileSuperCell();
ZYRSTD_API int32_t ZYRGetOptimizePortPipeLineOption();
ZYRSTD_API bool ZYRGetRenderAllInterpretedSurfacesOption();
// ZYRSingleThreadProcess is declared with the thread utilities.
// 1 while "SingleThreadProcess" is true.
ZYRSTD_API int32_t ZYRSurfaceOverlap();
ZYRSTD_API unsigned int ZYRGetXPVDPCacheOverlapThreshold();
// Bit 0: "XPVDPOptimizeFlattening".
ZYRSTD_API unsigned int ZYRGetXPVDPExperimentalOption();
ZYRSTD_API bool ZYRGetAdjustImageNearCopydot();
ZYRSTD_API bool ZYRAxialShadeOptimizationDisabled();
ZYRSTD_API bool ZYRSplitShadeWithAbruptColorChange();
ZYRSTD_API float ZYRSplitShadeAbruptChangeThreshold();
ZYRSTD_API unsigned int ZYRGetClipsubPathStackSizeThreshold();
// 0 "OldDefault", 1 "CheckArea", 2 "AdjustMatrix".
ZYRSTD_API int32_t ZYRGetCopyDotApproach();
ZYRSTD_API bool ZYREnableBPCbyObjectType();
ZYRSTD_API bool ZYREnableExternalDLCachePurge();
ZYRSTD_API bool ZYREnableXObjDLCachePurge();
ZYRSTD_API bool ZYREnableXPVDPDLCachePurge();
ZYRSTD_API unsigned int ZYRGetGRMemoryThreshold();
ZYRSTD_API unsigned int ZYRGetGRPMThreshold();
ZYRSTD_API unsigned int ZYRGetGRFLThreshold();
ZYRSTD_API eZYRGROption ZYRGetGROption();
// -1 until "UseFasterOpaqueMarking" is given, then 1 or 0.
ZYRSTD_API int32_t ZYRGetUseFasterOpaqueMarking();
ZYRSTD_API bool ZYRGetConvertComplexPatternToImage();
ZYRSTD_API bool ZYRGetDontCopyDevImage();
ZYRSTD_API bool ZYRGetUsePathCache();
ZYRSTD_API bool ZYRGetUseInPlaceComposition();
ZYRSTD_API bool ZYRGRSAOCTilingPattern();
ZYRSTD_API bool ZYRGRCacheOpaqueTilingPattern();
ZYRSTD_API bool ZYRIsDisableOPInMarker();
ZYRSTD_API bool ZYRGetUseFasterXPTilingPattern();
ZYRSTD_API bool ZYRGetUseOldHOVReducer();
ZYRSTD_API int32_t ZYRGetMaxGlyphCache();
ZYRSTD_API int32_t ZYRGetMaxGraphPathCache();
ZYRSTD_API bool ZYRGetOptimizeArtworkTree();
ZYRSTD_API unsigned int ZYRGetOverscanImageMasksThreshold();
ZYRSTD_API int32_t ZYRGetPDFGCPageInterval();
ZYRSTD_API int32_t ZYRGetPDFGCMemoryThreshold();
ZYRSTD_API unsigned long long ZYRGetPDFGCInterpreterThreadMemoryThreshold();
ZYRSTD_API unsigned long long ZYRGetPDFGCMainThreadMemoryThreshold();
ZYRSTD_API float ZYRGetPathWidthAdjustment();
ZYRSTD_API float ZYRGetSubPathSizeThreshold();
ZYRSTD_API bool ZYRAdjustPathWidthInsideTilingPattern();
ZYRSTD_API bool ZYRDiscardEmptyPathAfterAdjustment();
// True for high precision.
ZYRSTD_API bool ZYRGetReplaceSourceColorPrecision();
ZYRSTD_API float ZYRGetShiftImageMaskDeviceDelta();
ZYRSTD_API bool ZYRShipXPImageSlicesInOrder();
ZYRSTD_API float ZYRGetTrapPixelOverlap();
ZYRSTD_API const std::string& ZYRGetTrappingLibraryPath();
ZYRSTD_API bool ZYRUseNewTrapReducer();
ZYRSTD_API bool ZYRXObjDLCachePurgeChild();
ZYRSTD_API float ZYRXObjDLCachePurgePercentage();
ZYRSTD_API bool ZYRXPImageDLOptimizationDisabled();
ZYRSTD_API bool ZYREmitIMG_META();
ZYRSTD_API eZYRAtomicRegionDirectCMYKOption ZYRAtomicRegionDirectCMYKOption();
ZYRSTD_API bool ZYRThreadPriority();
ZYRSTD_API bool ZYRUseNullXPDevice();
ZYRSTD_API bool ZYRUseNullXPImage();
ZYRSTD_API bool ZYRXPShadeCache();
ZYRSTD_API bool ZYRGetRasterizeAllTransparencyShades();

// ---- options with typed setters
// -------------------------------------------------------------------

ZYRSTD_API void ZYRSetDeferImageInterpolation(bool on);
ZYRSTD_API bool ZYRGetDeferImageInterpolation();
ZYRSTD_API void ZYRSetDisableMatrixRoundingOption(bool on);
ZYRSTD_API bool ZYRGetDisableMatrixRoundingOption();
ZYRSTD_API void ZYRSetDisablePatternGstateReset(bool on);
ZYRSTD_API bool ZYRGetDisablePatternGstateReset();
ZYRSTD_API void ZYRSetUseAbsoluteColorimetricForLabAlt(bool on);
ZYRSTD_API bool ZYRGetUseAbsoluteColorimetricForLabAlt();
ZYRSTD_API void ZYRSetUseFindScreenSetEx(bool on);
ZYRSTD_API bool ZYRGetUseFindScreenSetEx();
ZYRSTD_API void ZYRSetUseMainXP(bool on);
ZYRSTD_API bool ZYRGetUseMainXP();
ZYRSTD_API void ZYRSetUseNewellMixing(bool on);
ZYRSTD_API bool ZYRGetUseNewellMixing();
ZYRSTD_API void ZYRSetAnalyticsActive(bool on);
ZYRSTD_API bool ZYRIsAnalyticsActive();
// The pointer itself is kept: the caller keeps the text alive.
ZYRSTD_API void ZYRSetAnalyticsLogFolder(const char16_t* folder);
ZYRSTD_API const char16_t* ZYRGetAnalyticsLogFolder();
ZYRSTD_API void ZYRSetImageBufferSize(unsigned int size);
ZYRSTD_API unsigned int ZYRGetImageBufferSize();
ZYRSTD_API void ZYRSetXPShadeMarkerOption(unsigned int option);
ZYRSTD_API unsigned int ZYRGetXPShadeMarkerOption();
// ZYRSetWorkerID and ZYRGetWorkerID are declared with the start-up hooks.
ZYRSTD_API void ZYRSetMaxXobjToInvestigate(int32_t count);
ZYRSTD_API int32_t ZYRGetMaxXobjToInvestigate();
ZYRSTD_API void ZYRSetLimitPlanarmapPrecision(eZYRPlanarmapPrecisionOption option);
ZYRSTD_API eZYRPlanarmapPrecisionOption ZYRGetLimitPlanarmapPrecision();
ZYRSTD_API void ZYRSetMaxDiskUsage(long long bytes);
ZYRSTD_API long long ZYRGetMaxDiskUsage();
ZYRSTD_API void ZYRSetMaxSLInMemory(long long count);
ZYRSTD_API long long ZYRGetMaxSLInMemory();
ZYRSTD_API void ZYRSetMaxSurfacesOnQueue(long long count);
ZYRSTD_API long long ZYRGetMaxSurfacesOnQueue();
ZYRSTD_API void ZYRSetShadeQuadLimit(double limit);
ZYRSTD_API double ZYRGetShadeQuadLimit();
// Without the top bit the option is off (0). With it, at most one of the low 31 bits may
// be set: more throws kZYRErrorInitFailed, after storing the value.
ZYRSTD_API void ZYRSetObjectInfoOptions(unsigned int options);
ZYRSTD_API unsigned int ZYRGetObjectInfoOptions();
// Writes the default queue length (200) into `out`; the store is not touched.
ZYRSTD_API void ZYRSetDefaultMaxSurfacesOnQueue(long long& out);

} // namespace ZYRStd
