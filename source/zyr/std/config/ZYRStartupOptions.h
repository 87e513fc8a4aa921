/// \file
/// The start-up option store: the engine's tuning switches, their key setters, typed
/// setters, getters and the four option records.
#pragma once

#include <cstdint>
#include <string>

#include "ZYRStdExport.h"

namespace ZYRStd {

class CZYRUniString;

// ---- records the host fills, parses and stores whole ------------------------------------------

/// Threading of the renderer and the band builder; the field comments name the keys.
struct sMTOptions {
    int32_t numMTRThreads;      ///< "NumMTRThreads"
    int32_t numMTBThreads;      ///< "NumMTBThreads"
    int32_t mtrThreshold;       ///< "MTRThreshold"
    bool mtrFallbackPerBand;    ///< "MTRFallbackPerBand"
    bool hasExternalCompositor; ///< "HasExternalCompositor"
};

/// Budgets of the display-list cache of placed objects.
struct sDLCacheOptions {
    unsigned long long maxRAM;    ///< "XObjDLCacheMaxRAM": bytes; whole pages once the key is set
    long long maxDisk;            ///< "XObjDLCacheMaxDisk": bytes
    unsigned char reserved[16];   ///< the engine's own fields; no key sets them
    bool vdpThroughFlattener;     ///< "VDPThroughFlattener"
    bool sharedCache;             ///< "XObjDLSharedCache"
    int32_t maxPatternCacheEntry; ///< "MaxPatternCacheEntry"
};

/// Image and mesh marking switches.
struct sMarkerOptions {
    int32_t imageMarkerType;           ///< "ImageMarkerType"
    int32_t imageMarkerTiling;         ///< "ImageMarkerTiling"
    float imageMarkerFactorSourceStep; ///< "ImageMarkerFactorSourceStep"
    int32_t imageMarkerFactorTiling;   ///< "ImageMarkerFactorTiling"
    float meshMarkerFactorD11;         ///< "MeshMarkerFactorD11"
    float meshMarkerFactorD18;         ///< "MeshMarkerFactorD18"
    float meshMarkerFactorD48;         ///< "MeshMarkerFactorD48"
    int32_t sse2;                      ///< "SSE2"
    int32_t useNewImageMarker;         ///< "UseNewImageMarker"
    bool overScanIdntImageMaskMarking; ///< "OverScanIdntImageMaskMarking"
};

/// Compression of the scan-line display list.
struct sSLDLOptions {
    int32_t slCompression;     ///< "SLCompression"
    float slCompressionRatio;  ///< "SLCompressionRatio"
    float sl0CompressionRatio; ///< "SL0CompressionRatio"
};

/// Each record has four functions: the fill function sets the defaults in the caller's record
/// only; the parser changes the field whose key matches and nothing for other keys (a null
/// record is left alone); the setter stores a copy of the whole record; the getter reads
/// that copy by reference (all zeros until set). Not locked: use them at start-up.
///@{
ZYRSTD_API void ZYRFillDefaultMTOptions(sMTOptions& options);
ZYRSTD_API void ZYRParseMTOptions(sMTOptions* options, const char* key, const char* value);
ZYRSTD_API void ZYRSetMTOptions(const sMTOptions& options);
ZYRSTD_API const sMTOptions& ZYRGetMTOptions();
///@}

/// As for the threading record.
///@{
/// The string is not used. The RAM budget's default is a twentieth of the smaller of the
/// physical memory and the virtual address space, rounded up to whole pages.
ZYRSTD_API void ZYRFillDefaultDLCacheOptions(sDLCacheOptions& options, const CZYRUniString& unused);
/// Also sets the store options "RasterizeTilingPattern" and "TileSuperCell".
ZYRSTD_API void ZYRParseDLCacheOptions(sDLCacheOptions* options, const char* key,
                                       const char* value);
ZYRSTD_API void ZYRSetDLCacheOptions(const sDLCacheOptions& options);
ZYRSTD_API sDLCacheOptions& ZYRGetDLCacheOptions();
///@}

/// As for the threading record.
///@{
ZYRSTD_API void ZYRFillDefaultMarkerOptions(sMarkerOptions& options);
ZYRSTD_API void ZYRParseMarkerOptions(sMarkerOptions* options, const char* key, const char* value);
ZYRSTD_API void ZYRSetMarkerOptions(const sMarkerOptions& options);
ZYRSTD_API sMarkerOptions& ZYRGetMarkerOptions();
///@}

/// As for the threading record.
///@{
ZYRSTD_API void ZYRFillDefaultSLDLOptions(sSLDLOptions& options);
ZYRSTD_API void ZYRParseSLDLOptions(sSLDLOptions* options, const char* key, const char* value);
ZYRSTD_API void ZYRSetSLDLOptions(const sSLDLOptions& options);
ZYRSTD_API sSLDLOptions& ZYRGetSLDLOptions();
///@}

// ---- enumerations
// --------------------------------------------------------------------------------

/// The global rasterization strategy chosen by "GROption".
enum eZYRGROption : int32_t {
    kZYRGROptionAdaptive = 0,    ///< "Adaptive"
    kZYRGROptionHOV = 1,         ///< "HOV", "Alternate"
    kZYRGROptionXPDevice = 2,    ///< "XPDevice", "Consistency"
    kZYRGROptionPerformance = 3, ///< "Performance"
};
/// Values the engine's modules define; the store only keeps them.
enum eZYRPlanarmapPrecisionOption : int32_t {};
/// Values the engine's modules define; the store only keeps them.
enum eZYRAtomicRegionDirectCMYKOption : int32_t {};

// ---- key setters: each acts on its own keys and ignores every other
// ------------------------------

/// Key setters for the setup-file pairs: each stores the keys it knows (named on the getters) and
/// ignores every other. The store is not locked: call them at start-up, before the worker threads
/// read it.
///@{
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
/// Prints "\n   TrapPixelOverlap set to %f\n\n" on standard output after storing.
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
/// "MaxMemLimit", "TestAvailablePhysicalMemory" and "BreakOnAllocationCount" go straight to
/// the allocation front.
ZYRSTD_API void ZYRParseMemoryOptions(const char* key, const char* value);
///@}

// ---- getters of the key options
// --------------------------------------------------------------------

/// "UseNullGraphics"; default false.
ZYRSTD_API bool ZYRUseNullGraphics();
/// "MaxCacheShades" (at least 10); default 100.
ZYRSTD_API int32_t ZYRMaxCacheShades();
/// "RasterizeTilingPattern"; default true.
ZYRSTD_API bool ZYRRasterizeTilingPattern();
/// "TileSuperCell"; default true.
ZYRSTD_API bool ZYRTileSuperCell();
/// "OptimizePortPipeLine"; default 0.
ZYRSTD_API int32_t ZYRGetOptimizePortPipeLineOption();
/// "RenderAllInterpretedSurfaces"; default false.
ZYRSTD_API bool ZYRGetRenderAllInterpretedSurfacesOption();
// ZYRSingleThreadProcess is declared with the thread utilities.
/// "SurfaceOverLap" (0 read as 1); default 3; 1 while "SingleThreadProcess" is true.
ZYRSTD_API int32_t ZYRSurfaceOverlap();
/// "XPVDPCacheOverlapThreshold" (at most 101); default 100.
ZYRSTD_API unsigned int ZYRGetXPVDPCacheOverlapThreshold();
/// Bit 0: "XPVDPOptimizeFlattening".
ZYRSTD_API unsigned int ZYRGetXPVDPExperimentalOption();
/// "AdjustImageNearCopydot"; default false.
ZYRSTD_API bool ZYRGetAdjustImageNearCopydot();
/// "DisableAxialShadeOptimization"; default false.
ZYRSTD_API bool ZYRAxialShadeOptimizationDisabled();
/// "SplitShadeWithAbruptColorChange"; default true.
ZYRSTD_API bool ZYRSplitShadeWithAbruptColorChange();
/// "SplitShadeAbruptChangeThreshold"; default 30.
ZYRSTD_API float ZYRSplitShadeAbruptChangeThreshold();
/// "ClipsubPathStackSizeThreshold"; default 14.
ZYRSTD_API unsigned int ZYRGetClipsubPathStackSizeThreshold();
/// "CopyDotMethod": 0 "OldDefault", 1 "CheckArea" (the default), 2 "AdjustMatrix".
ZYRSTD_API int32_t ZYRGetCopyDotApproach();
/// "EnableBPCbyObjectType"; default false.
ZYRSTD_API bool ZYREnableBPCbyObjectType();
/// "EnableExternalDLCachePurge"; default true.
ZYRSTD_API bool ZYREnableExternalDLCachePurge();
/// "EnableXObjDLCachePurge"; default false.
ZYRSTD_API bool ZYREnableXObjDLCachePurge();
/// "EnableXPVDPDLCachePurge"; default false.
ZYRSTD_API bool ZYREnableXPVDPDLCachePurge();
/// "GRMemoryThreshold"; default 0.
ZYRSTD_API unsigned int ZYRGetGRMemoryThreshold();
/// "GRPMThreshold"; default 0.
ZYRSTD_API unsigned int ZYRGetGRPMThreshold();
/// "GRFLThreshold"; default 0.
ZYRSTD_API unsigned int ZYRGetGRFLThreshold();
/// "GROption" or "AutomaticGlobalRasterizationOption"; default kZYRGROptionAdaptive.
ZYRSTD_API eZYRGROption ZYRGetGROption();
/// "UseFasterOpaqueMarking": -1 until given, then 1 or 0.
ZYRSTD_API int32_t ZYRGetUseFasterOpaqueMarking();
/// "ConvertComplexPatternToImage"; default true.
ZYRSTD_API bool ZYRGetConvertComplexPatternToImage();
/// "DontCopyDevImage"; default true.
ZYRSTD_API bool ZYRGetDontCopyDevImage();
/// "UsePathCache"; default true.
ZYRSTD_API bool ZYRGetUsePathCache();
/// "UseInPlaceComposition"; default true.
ZYRSTD_API bool ZYRGetUseInPlaceComposition();
/// "GRSAOCTilingPattern"; default false.
ZYRSTD_API bool ZYRGRSAOCTilingPattern();
/// "GRCacheOpaqueTilingPattern"; default true.
ZYRSTD_API bool ZYRGRCacheOpaqueTilingPattern();
/// "DisableOPInMarker"; default true.
ZYRSTD_API bool ZYRIsDisableOPInMarker();
/// "UseFasterTransparencyTilingPattern"; default true.
ZYRSTD_API bool ZYRGetUseFasterXPTilingPattern();
/// "UseOldHOVReducer"; default true.
ZYRSTD_API bool ZYRGetUseOldHOVReducer();
/// "MaxGlyphCache", in bytes; default 64 MiB.
ZYRSTD_API int32_t ZYRGetMaxGlyphCache();
/// "MaxGraphPathCache", in bytes; default 128 MiB.
ZYRSTD_API int32_t ZYRGetMaxGraphPathCache();
/// "OptimizeArtworkTree"; default true.
ZYRSTD_API bool ZYRGetOptimizeArtworkTree();
/// "OverscanImageMasksThreshold", taken only while not 0; "UseNew1pxImageMaskHandler" sets it to 1
/// or 0. Default 1.
ZYRSTD_API unsigned int ZYRGetOverscanImageMasksThreshold();
/// "PDFGCPageInterval"; default 5000.
ZYRSTD_API int32_t ZYRGetPDFGCPageInterval();
/// "PDFGCMemoryThreshold", in bytes; default 8 MiB.
ZYRSTD_API int32_t ZYRGetPDFGCMemoryThreshold();
/// "PDFGCInterpreterThreadMemoryThreshold" (negative read as 0); default 0.
ZYRSTD_API unsigned long long ZYRGetPDFGCInterpreterThreadMemoryThreshold();
/// "PDFGCMainThreadMemoryThreshold" (negative read as 0); default 0.
ZYRSTD_API unsigned long long ZYRGetPDFGCMainThreadMemoryThreshold();
/// "PathWidthAdjustment"; default 0.
ZYRSTD_API float ZYRGetPathWidthAdjustment();
/// "SubPathSizeThreshold"; default 24.
ZYRSTD_API float ZYRGetSubPathSizeThreshold();
/// "AdjustPathWidthInsideTilingPattern"; default false.
ZYRSTD_API bool ZYRAdjustPathWidthInsideTilingPattern();
/// "DiscardEmptyPathAfterAdjustment"; default true.
ZYRSTD_API bool ZYRDiscardEmptyPathAfterAdjustment();
/// "ReplaceSourceColorPrecision": true for "high" (the default), false for "low".
ZYRSTD_API bool ZYRGetReplaceSourceColorPrecision();
/// "ShiftImageMaskDeviceDelta"; default 0.1.
ZYRSTD_API float ZYRGetShiftImageMaskDeviceDelta();
/// "ShipXPImageSlicesInOrder"; default false.
ZYRSTD_API bool ZYRShipXPImageSlicesInOrder();
/// "TrapPixelOverlap" (0 or less read as 1); default 1.
ZYRSTD_API float ZYRGetTrapPixelOverlap();
/// "TrappingLibraryPath", borrowed from the store; empty by default.
ZYRSTD_API const std::string& ZYRGetTrappingLibraryPath();
/// "UseNewTrapReducer"; default true.
ZYRSTD_API bool ZYRUseNewTrapReducer();
/// "XObjDLCachePurgeChild"; default true.
ZYRSTD_API bool ZYRXObjDLCachePurgeChild();
/// "XObjDLCachePurgePercentage", taken only above 0 and up to 100; default 0.
ZYRSTD_API float ZYRXObjDLCachePurgePercentage();
/// "DisableXPImageDLOptimization"; default false.
ZYRSTD_API bool ZYRXPImageDLOptimizationDisabled();
/// "EmitIMG_META"; default true.
ZYRSTD_API bool ZYREmitIMG_META();
/// "AtomicRegionDirectCMYKOption"; default 1.
ZYRSTD_API eZYRAtomicRegionDirectCMYKOption ZYRAtomicRegionDirectCMYKOption();
/// "ThreadPriority"; default false.
ZYRSTD_API bool ZYRThreadPriority();
/// "UseNullXPDevice"; default false.
ZYRSTD_API bool ZYRUseNullXPDevice();
/// "UseNullXPImage"; default false.
ZYRSTD_API bool ZYRUseNullXPImage();
/// "XPShadeCache"; default true.
ZYRSTD_API bool ZYRXPShadeCache();
/// "RasterizeAllTransparencyShades"; default false.
ZYRSTD_API bool ZYRGetRasterizeAllTransparencyShades();

// ---- options with typed setters
// -------------------------------------------------------------------

/// Options the host sets directly: each setter stores its argument as given, each getter returns
/// it. Defaults are 0, false or null, except the matrix-rounding switch, which starts true. Not
/// locked: set them at start-up.
///@{
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
/// The pointer itself is kept: the caller keeps the text alive.
ZYRSTD_API void ZYRSetAnalyticsLogFolder(const char16_t* folder);
ZYRSTD_API const char16_t* ZYRGetAnalyticsLogFolder();
ZYRSTD_API void ZYRSetImageBufferSize(unsigned int size);
ZYRSTD_API unsigned int ZYRGetImageBufferSize();
ZYRSTD_API void ZYRSetXPShadeMarkerOption(unsigned int option);
ZYRSTD_API unsigned int ZYRGetXPShadeMarkerOption();
/// ZYRSetWorkerID and ZYRGetWorkerID are declared with the start-up hooks.
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
///@}
/// Without the top bit the option is off (0). With it, at most one of the low 31 bits may
/// be set: more throws kZYRErrorInitFailed, after storing the value.
ZYRSTD_API void ZYRSetObjectInfoOptions(unsigned int options);
/// The value ZYRSetObjectInfoOptions stored.
ZYRSTD_API unsigned int ZYRGetObjectInfoOptions();
/// Writes the default queue length (200) into `out`; the store is not touched.
ZYRSTD_API void ZYRSetDefaultMaxSurfacesOnQueue(long long& out);

} // namespace ZYRStd
