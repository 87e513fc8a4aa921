// The table of shared strings for frequent fixed texts, and the dynamic cache of others.
#pragma once

#include "C_SmartPtr.h"
#include "I_UniString.h"
#include "ZYRStdExport.h"
#include "zyr/std/CZYRClientBase.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_UniString;

// Rows 0 to 625 of the table have an index and an accessor; 626 to 693 are found by text.
constexpr unsigned int kCommonUniStringRows = 694;
constexpr unsigned int kCommonUniStringAccessors = 626;

// The texts of the rows, in row order.
ZYRSTD_API const char* CommonUniStringText(unsigned int row);

class ZYRSTD_API IZYRCommonUniStrings : public CZYRClientBase {
public:
    ~IZYRCommonUniStrings() override;
    // Row `index` with a reference added; kZYRErrorBadParam from 626 on.
    virtual C_SmartPtr<I_UniString> GetCachedCommonUniString(unsigned int index) const = 0;
    // The table's object for `s`'s text, or `s` itself.
    virtual C_SmartPtr<I_UniString> findCommonUniString(const C_SmartPtr<I_UniString>& s) const = 0;

    // One accessor per row, in row order, named after its text.
    virtual C_SmartPtr<I_UniString> str_a() const { return GetCachedCommonUniString(0); }
    virtual C_SmartPtr<I_UniString> str_AbortJobWhenScreenMatchingFails() const {
        return GetCachedCommonUniString(1);
    }
    virtual C_SmartPtr<I_UniString> str_AbortJobWhenScreenMatchingFailsPolicy() const {
        return GetCachedCommonUniString(2);
    }
    virtual C_SmartPtr<I_UniString> str_AbsoluteColorimetric() const {
        return GetCachedCommonUniString(3);
    }
    virtual C_SmartPtr<I_UniString> str_AccurateScreens() const {
        return GetCachedCommonUniString(4);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRCachePlacedObject() const {
        return GetCachedCommonUniString(5);
    }
    virtual C_SmartPtr<I_UniString> str_ZYREnableMTR() const { return GetCachedCommonUniString(6); }
    virtual C_SmartPtr<I_UniString> str_ZYREnumerateFonts() const {
        return GetCachedCommonUniString(7);
    }
    virtual C_SmartPtr<I_UniString> str_ZYREnumerateHalftones() const {
        return GetCachedCommonUniString(8);
    }
    virtual C_SmartPtr<I_UniString> str_ZYREnumerateSpotColors() const {
        return GetCachedCommonUniString(9);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRFontSubstDict() const {
        return GetCachedCommonUniString(10);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRGStateHash() const {
        return GetCachedCommonUniString(11);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRIccPath() const { return GetCachedCommonUniString(12); }
    virtual C_SmartPtr<I_UniString> str_ZYRIgnoreClipForReuse() const {
        return GetCachedCommonUniString(13);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRIgnoreSuppressableErrors() const {
        return GetCachedCommonUniString(14);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRIgnoreSuppressableErrorsPolicy() const {
        return GetCachedCommonUniString(15);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRImageableAreaDimensions() const {
        return GetCachedCommonUniString(16);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRIsMarkObject() const {
        return GetCachedCommonUniString(17);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRJobManager() const {
        return GetCachedCommonUniString(18);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRRecorder() const { return GetCachedCommonUniString(19); }
    virtual C_SmartPtr<I_UniString> str_ZYRShade() const { return GetCachedCommonUniString(20); }
    virtual C_SmartPtr<I_UniString> str_ZYRSnapImageMtx() const {
        return GetCachedCommonUniString(21);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRSuppressibleErrorHandling() const {
        return GetCachedCommonUniString(22);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRSurfaceID() const {
        return GetCachedCommonUniString(23);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRTemp() const { return GetCachedCommonUniString(24); }
    virtual C_SmartPtr<I_UniString> str_ZYRTempDirectory() const {
        return GetCachedCommonUniString(25);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRTilingParams() const {
        return GetCachedCommonUniString(26);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRTraceMsg() const { return GetCachedCommonUniString(27); }
    virtual C_SmartPtr<I_UniString> str_ZYRTrackHalftoneInsideAtomicRegion() const {
        return GetCachedCommonUniString(28);
    }
    virtual C_SmartPtr<I_UniString> str_ZYRTrackHalftoneInsideAtomicRegionPolicy() const {
        return GetCachedCommonUniString(29);
    }
    virtual C_SmartPtr<I_UniString> str_ActualFilePath() const {
        return GetCachedCommonUniString(30);
    }
    virtual C_SmartPtr<I_UniString> str_Adaptive() const { return GetCachedCommonUniString(31); }
    virtual C_SmartPtr<I_UniString> str_ORMN_URL_FILENAME() const {
        return GetCachedCommonUniString(32);
    }
    virtual C_SmartPtr<I_UniString> str_AddPrivateData() const {
        return GetCachedCommonUniString(33);
    }
    virtual C_SmartPtr<I_UniString> str_Alignment() const { return GetCachedCommonUniString(34); }
    virtual C_SmartPtr<I_UniString> str_All() const { return GetCachedCommonUniString(35); }
    virtual C_SmartPtr<I_UniString> str_ALL() const { return GetCachedCommonUniString(36); }
    virtual C_SmartPtr<I_UniString> str_AllPaper() const { return GetCachedCommonUniString(37); }
    virtual C_SmartPtr<I_UniString> str_AllPaper300() const { return GetCachedCommonUniString(38); }
    virtual C_SmartPtr<I_UniString> str_AllPaper600() const { return GetCachedCommonUniString(39); }
    virtual C_SmartPtr<I_UniString> str_AM() const { return GetCachedCommonUniString(40); }
    virtual C_SmartPtr<I_UniString> str_Amount() const { return GetCachedCommonUniString(41); }
    virtual C_SmartPtr<I_UniString> str_Angle() const { return GetCachedCommonUniString(42); }
    virtual C_SmartPtr<I_UniString> str_AngleMap() const { return GetCachedCommonUniString(43); }
    virtual C_SmartPtr<I_UniString> str_AnglePolicy() const { return GetCachedCommonUniString(44); }
    virtual C_SmartPtr<I_UniString> str_AngleRange() const { return GetCachedCommonUniString(45); }
    virtual C_SmartPtr<I_UniString> str_AnnotationPrintOptions() const {
        return GetCachedCommonUniString(46);
    }
    virtual C_SmartPtr<I_UniString> str_AnnotationPrintOptionsPolicy() const {
        return GetCachedCommonUniString(47);
    }
    virtual C_SmartPtr<I_UniString> str_Any() const { return GetCachedCommonUniString(48); }
    virtual C_SmartPtr<I_UniString> str_ArtBox() const { return GetCachedCommonUniString(49); }
    virtual C_SmartPtr<I_UniString> str_AutomatedOverPrintParams() const {
        return GetCachedCommonUniString(50);
    }
    virtual C_SmartPtr<I_UniString> str_b() const { return GetCachedCommonUniString(51); }
    virtual C_SmartPtr<I_UniString> str_Back() const { return GetCachedCommonUniString(52); }
    virtual C_SmartPtr<I_UniString> str_BandDevice() const { return GetCachedCommonUniString(53); }
    virtual C_SmartPtr<I_UniString> str_BandHeight() const { return GetCachedCommonUniString(54); }
    virtual C_SmartPtr<I_UniString> str_BandMajor() const { return GetCachedCommonUniString(55); }
    virtual C_SmartPtr<I_UniString> str_BandOrdering() const {
        return GetCachedCommonUniString(56);
    }
    virtual C_SmartPtr<I_UniString> str_BandWidth() const { return GetCachedCommonUniString(57); }
    virtual C_SmartPtr<I_UniString> str_BaseName() const { return GetCachedCommonUniString(58); }
    virtual C_SmartPtr<I_UniString> str_Bevel() const { return GetCachedCommonUniString(59); }
    virtual C_SmartPtr<I_UniString> str_BGMap() const { return GetCachedCommonUniString(60); }
    virtual C_SmartPtr<I_UniString> str_Black() const { return GetCachedCommonUniString(61); }
    virtual C_SmartPtr<I_UniString> str_BlackColorLimit() const {
        return GetCachedCommonUniString(62);
    }
    virtual C_SmartPtr<I_UniString> str_BlackDensityLimit() const {
        return GetCachedCommonUniString(63);
    }
    virtual C_SmartPtr<I_UniString> str_BlackPointCompensation() const {
        return GetCachedCommonUniString(64);
    }
    virtual C_SmartPtr<I_UniString> str_BlackThreshold() const {
        return GetCachedCommonUniString(65);
    }
    virtual C_SmartPtr<I_UniString> str_BlackWidth() const { return GetCachedCommonUniString(66); }
    virtual C_SmartPtr<I_UniString> str_BleedBox() const { return GetCachedCommonUniString(67); }
    virtual C_SmartPtr<I_UniString> str_Blue() const { return GetCachedCommonUniString(68); }
    virtual C_SmartPtr<I_UniString> str_BottomCenter() const {
        return GetCachedCommonUniString(69);
    }
    virtual C_SmartPtr<I_UniString> str_BottomLeft() const { return GetCachedCommonUniString(70); }
    virtual C_SmartPtr<I_UniString> str_BottomRight() const { return GetCachedCommonUniString(71); }
    virtual C_SmartPtr<I_UniString> str_CacheMissTime() const {
        return GetCachedCommonUniString(72);
    }
    virtual C_SmartPtr<I_UniString> str_CacheNumHits() const {
        return GetCachedCommonUniString(73);
    }
    virtual C_SmartPtr<I_UniString> str_CacheNumMisses() const {
        return GetCachedCommonUniString(74);
    }
    virtual C_SmartPtr<I_UniString> str_CacheNumSkipped() const {
        return GetCachedCommonUniString(75);
    }
    virtual C_SmartPtr<I_UniString> str_CalibrationMgr() const {
        return GetCachedCommonUniString(76);
    }
    virtual C_SmartPtr<I_UniString> str_Center() const { return GetCachedCommonUniString(77); }
    virtual C_SmartPtr<I_UniString> str_CenterLeft() const { return GetCachedCommonUniString(78); }
    virtual C_SmartPtr<I_UniString> str_CenterRight() const { return GetCachedCommonUniString(79); }
    virtual C_SmartPtr<I_UniString> str_CheckForTransparency() const {
        return GetCachedCommonUniString(80);
    }
    virtual C_SmartPtr<I_UniString> str_Choke() const { return GetCachedCommonUniString(81); }
    virtual C_SmartPtr<I_UniString> str_ClipTrapZone() const {
        return GetCachedCommonUniString(82);
    }
    virtual C_SmartPtr<I_UniString> str_CollectIndex() const {
        return GetCachedCommonUniString(83);
    }
    virtual C_SmartPtr<I_UniString> str_CollectSheetIndex() const {
        return GetCachedCommonUniString(84);
    }
    virtual C_SmartPtr<I_UniString> str_Color() const { return GetCachedCommonUniString(85); }
    virtual C_SmartPtr<I_UniString> str_Colorant() const { return GetCachedCommonUniString(86); }
    virtual C_SmartPtr<I_UniString> str_ColorantAlias() const {
        return GetCachedCommonUniString(87);
    }
    virtual C_SmartPtr<I_UniString> str_ColorantControl() const {
        return GetCachedCommonUniString(88);
    }
    virtual C_SmartPtr<I_UniString> str_ColorantDepth() const {
        return GetCachedCommonUniString(89);
    }
    virtual C_SmartPtr<I_UniString> str_ColorantDetails() const {
        return GetCachedCommonUniString(90);
    }
    virtual C_SmartPtr<I_UniString> str_ColorantName() const {
        return GetCachedCommonUniString(91);
    }
    virtual C_SmartPtr<I_UniString> str_ColorantOrder() const {
        return GetCachedCommonUniString(92);
    }
    virtual C_SmartPtr<I_UniString> str_ColorantParams() const {
        return GetCachedCommonUniString(93);
    }
    virtual C_SmartPtr<I_UniString> str_Colorants() const { return GetCachedCommonUniString(94); }
    virtual C_SmartPtr<I_UniString> str_ColorantZoneDetails() const {
        return GetCachedCommonUniString(95);
    }
    virtual C_SmartPtr<I_UniString> str_ColorMajor() const { return GetCachedCommonUniString(96); }
    virtual C_SmartPtr<I_UniString> str_ColorPool() const { return GetCachedCommonUniString(97); }
    virtual C_SmartPtr<I_UniString> str_ColorProcessing() const {
        return GetCachedCommonUniString(98);
    }
    virtual C_SmartPtr<I_UniString> str_ColorSpaceConversionOp() const {
        return GetCachedCommonUniString(99);
    }
    virtual C_SmartPtr<I_UniString> str_ColorSpaceConversionParams() const {
        return GetCachedCommonUniString(100);
    }
    virtual C_SmartPtr<I_UniString> str_ColorSVCRipConfig() const {
        return GetCachedCommonUniString(101);
    }
    virtual C_SmartPtr<I_UniString> str_ColorType() const { return GetCachedCommonUniString(102); }
    virtual C_SmartPtr<I_UniString> str_ConvertStrokeToFill() const {
        return GetCachedCommonUniString(103);
    }
    virtual C_SmartPtr<I_UniString> str_ConvertTextToOutlines() const {
        return GetCachedCommonUniString(104);
    }
    virtual C_SmartPtr<I_UniString> str_CosID() const { return GetCachedCommonUniString(105); }
    virtual C_SmartPtr<I_UniString> str_CosineDot() const { return GetCachedCommonUniString(106); }
    virtual C_SmartPtr<I_UniString> str_Courier() const { return GetCachedCommonUniString(107); }
    virtual C_SmartPtr<I_UniString> str_CropBox() const { return GetCachedCommonUniString(108); }
    virtual C_SmartPtr<I_UniString> str_Cross() const { return GetCachedCommonUniString(109); }
    virtual C_SmartPtr<I_UniString> str_ctm() const { return GetCachedCommonUniString(110); }
    virtual C_SmartPtr<I_UniString> str_Curve() const { return GetCachedCommonUniString(111); }
    virtual C_SmartPtr<I_UniString> str_Custom() const { return GetCachedCommonUniString(112); }
    virtual C_SmartPtr<I_UniString> str_CuttingInfoMgr() const {
        return GetCachedCommonUniString(113);
    }
    virtual C_SmartPtr<I_UniString> str_Cyan() const { return GetCachedCommonUniString(114); }
    virtual C_SmartPtr<I_UniString> str_DashPattern() const {
        return GetCachedCommonUniString(115);
    }
    virtual C_SmartPtr<I_UniString> str_DashPhase() const { return GetCachedCommonUniString(116); }
    virtual C_SmartPtr<I_UniString> str_DataGroupName() const {
        return GetCachedCommonUniString(117);
    }
    virtual C_SmartPtr<I_UniString> str_Default() const { return GetCachedCommonUniString(118); }
    virtual C_SmartPtr<I_UniString> str_Design() const { return GetCachedCommonUniString(119); }
    virtual C_SmartPtr<I_UniString> str_Device() const { return GetCachedCommonUniString(120); }
    virtual C_SmartPtr<I_UniString> str_DeviceCMY() const { return GetCachedCommonUniString(121); }
    virtual C_SmartPtr<I_UniString> str_DeviceCMYK() const { return GetCachedCommonUniString(122); }
    virtual C_SmartPtr<I_UniString> str_DeviceGray() const { return GetCachedCommonUniString(123); }
    virtual C_SmartPtr<I_UniString> str_DeviceLinkBundle() const {
        return GetCachedCommonUniString(124);
    }
    virtual C_SmartPtr<I_UniString> str_DeviceLinkProfile() const {
        return GetCachedCommonUniString(125);
    }
    virtual C_SmartPtr<I_UniString> str_DeviceN() const { return GetCachedCommonUniString(126); }
    virtual C_SmartPtr<I_UniString> str_DeviceNColor() const {
        return GetCachedCommonUniString(127);
    }
    virtual C_SmartPtr<I_UniString> str_DeviceRGB() const { return GetCachedCommonUniString(128); }
    virtual C_SmartPtr<I_UniString> str_DevImageServer() const {
        return GetCachedCommonUniString(129);
    }
    virtual C_SmartPtr<I_UniString> str_DevImageInterfaceCache() const {
        return GetCachedCommonUniString(130);
    }
    virtual C_SmartPtr<I_UniString> str_Diamond() const { return GetCachedCommonUniString(131); }
    virtual C_SmartPtr<I_UniString> str_DieLine() const { return GetCachedCommonUniString(132); }
    virtual C_SmartPtr<I_UniString> str_DigitalPrintingParams() const {
        return GetCachedCommonUniString(133);
    }
    virtual C_SmartPtr<I_UniString> str_Dimension() const { return GetCachedCommonUniString(134); }
    virtual C_SmartPtr<I_UniString> str_DIS() const { return GetCachedCommonUniString(135); }
    virtual C_SmartPtr<I_UniString> str_DLCacheOEMInfo() const {
        return GetCachedCommonUniString(136);
    }
    virtual C_SmartPtr<I_UniString> str_DocCopies() const { return GetCachedCommonUniString(137); }
    virtual C_SmartPtr<I_UniString> str_DocIndex() const { return GetCachedCommonUniString(138); }
    virtual C_SmartPtr<I_UniString> str_DocRunIndex() const {
        return GetCachedCommonUniString(139);
    }
    virtual C_SmartPtr<I_UniString> str_DocTags() const { return GetCachedCommonUniString(140); }
    virtual C_SmartPtr<I_UniString> str_Document() const { return GetCachedCommonUniString(141); }
    virtual C_SmartPtr<I_UniString> str_DocumentAndStampsOnly() const {
        return GetCachedCommonUniString(142);
    }
    virtual C_SmartPtr<I_UniString> str_DotSize() const { return GetCachedCommonUniString(143); }
    virtual C_SmartPtr<I_UniString> str_DotSizeRange() const {
        return GetCachedCommonUniString(144);
    }
    virtual C_SmartPtr<I_UniString> str_Double() const { return GetCachedCommonUniString(145); }
    virtual C_SmartPtr<I_UniString> str_DoubleDot() const { return GetCachedCommonUniString(146); }
    virtual C_SmartPtr<I_UniString> str_DPM() const { return GetCachedCommonUniString(147); }
    virtual C_SmartPtr<I_UniString> str_Ellipse() const { return GetCachedCommonUniString(148); }
    virtual C_SmartPtr<I_UniString> str_EllipseA() const { return GetCachedCommonUniString(149); }
    virtual C_SmartPtr<I_UniString> str_EllipseB() const { return GetCachedCommonUniString(150); }
    virtual C_SmartPtr<I_UniString> str_EllipseC() const { return GetCachedCommonUniString(151); }
    virtual C_SmartPtr<I_UniString> str_EmulateAllOverprints() const {
        return GetCachedCommonUniString(152);
    }
    virtual C_SmartPtr<I_UniString> str_EmulatedFontInfo() const {
        return GetCachedCommonUniString(153);
    }
    virtual C_SmartPtr<I_UniString> str_EmulateNAInkOverprint() const {
        return GetCachedCommonUniString(154);
    }
    virtual C_SmartPtr<I_UniString> str_EnableCutContourProcessing() const {
        return GetCachedCommonUniString(155);
    }
    virtual C_SmartPtr<I_UniString> str_Enabled() const { return GetCachedCommonUniString(156); }
    virtual C_SmartPtr<I_UniString> str_EnableLowResRasterization() const {
        return GetCachedCommonUniString(157);
    }
    virtual C_SmartPtr<I_UniString> str_EnableNonzeroOverprintSubtractiveSpaces() const {
        return GetCachedCommonUniString(158);
    }
    virtual C_SmartPtr<I_UniString> str_EnableOpsReplaceCMYKSpots() const {
        return GetCachedCommonUniString(159);
    }
    virtual C_SmartPtr<I_UniString> str_EnableStrokeAdjust() const {
        return GetCachedCommonUniString(160);
    }
    virtual C_SmartPtr<I_UniString> str_Encoding() const { return GetCachedCommonUniString(161); }
    virtual C_SmartPtr<I_UniString> str_End() const { return GetCachedCommonUniString(162); }
    virtual C_SmartPtr<I_UniString> str_EndOfDocument() const {
        return GetCachedCommonUniString(163);
    }
    virtual C_SmartPtr<I_UniString> str_EndOfSet() const { return GetCachedCommonUniString(164); }
    virtual C_SmartPtr<I_UniString> str_ExampleExactValueScreens() const {
        return GetCachedCommonUniString(165);
    }
    virtual C_SmartPtr<I_UniString> str_ExampleExactValueScreens180Rotated() const {
        return GetCachedCommonUniString(166);
    }
    virtual C_SmartPtr<I_UniString> str_ExampleFMScreens() const {
        return GetCachedCommonUniString(167);
    }
    virtual C_SmartPtr<I_UniString> str_ExampleNominalValueScreens() const {
        return GetCachedCommonUniString(168);
    }
    virtual C_SmartPtr<I_UniString> str_ExampleNominalValueScreens180Rotated() const {
        return GetCachedCommonUniString(169);
    }
    virtual C_SmartPtr<I_UniString> str_ExampleOtherDotShapes() const {
        return GetCachedCommonUniString(170);
    }
    virtual C_SmartPtr<I_UniString> str_ExampleOtherDotShapes180Rotated() const {
        return GetCachedCommonUniString(171);
    }
    virtual C_SmartPtr<I_UniString> str_Exclude() const { return GetCachedCommonUniString(172); }
    virtual C_SmartPtr<I_UniString> str_ExcludeCMYK000kShades() const {
        return GetCachedCommonUniString(173);
    }
    virtual C_SmartPtr<I_UniString> str_ExcludeRGBGrayShades() const {
        return GetCachedCommonUniString(174);
    }
    virtual C_SmartPtr<I_UniString> str_Export() const { return GetCachedCommonUniString(175); }
    virtual C_SmartPtr<I_UniString> str_ExternalStreamParams() const {
        return GetCachedCommonUniString(176);
    }
    virtual C_SmartPtr<I_UniString> str_ExternalStreamParamsPolicy() const {
        return GetCachedCommonUniString(177);
    }
    virtual C_SmartPtr<I_UniString> str_ExtractCutContours() const {
        return GetCachedCommonUniString(178);
    }
    virtual C_SmartPtr<I_UniString> str_Fail() const { return GetCachedCommonUniString(179); }
    virtual C_SmartPtr<I_UniString> str_File() const { return GetCachedCommonUniString(180); }
    virtual C_SmartPtr<I_UniString> str_FileArray() const { return GetCachedCommonUniString(181); }
    virtual C_SmartPtr<I_UniString> str_FileURL() const { return GetCachedCommonUniString(182); }
    virtual C_SmartPtr<I_UniString> str_FileSpec() const { return GetCachedCommonUniString(183); }
    virtual C_SmartPtr<I_UniString> str_FileType() const { return GetCachedCommonUniString(184); }
    virtual C_SmartPtr<I_UniString> str_Film() const { return GetCachedCommonUniString(185); }
    virtual C_SmartPtr<I_UniString> str_FinalTargetDevice() const {
        return GetCachedCommonUniString(186);
    }
    virtual C_SmartPtr<I_UniString> str_FitPolicy() const { return GetCachedCommonUniString(187); }
    virtual C_SmartPtr<I_UniString> str_Flatness() const { return GetCachedCommonUniString(188); }
    virtual C_SmartPtr<I_UniString> str_FlatnessRange() const {
        return GetCachedCommonUniString(189);
    }
    virtual C_SmartPtr<I_UniString> str_FlatteningPreserveUninvolvedStroke() const {
        return GetCachedCommonUniString(190);
    }
    virtual C_SmartPtr<I_UniString> str_FM() const { return GetCachedCommonUniString(191); }
    virtual C_SmartPtr<I_UniString> str_FontIsAvailable() const {
        return GetCachedCommonUniString(192);
    }
    virtual C_SmartPtr<I_UniString> str_FontIsEmbedded() const {
        return GetCachedCommonUniString(193);
    }
    virtual C_SmartPtr<I_UniString> str_FontMgr() const { return GetCachedCommonUniString(194); }
    virtual C_SmartPtr<I_UniString> str_FontName() const { return GetCachedCommonUniString(195); }
    virtual C_SmartPtr<I_UniString> str_FontPolicy() const { return GetCachedCommonUniString(196); }
    virtual C_SmartPtr<I_UniString> str_FontSubstitutionMap() const {
        return GetCachedCommonUniString(197);
    }
    virtual C_SmartPtr<I_UniString> str_Fonts() const { return GetCachedCommonUniString(198); }
    virtual C_SmartPtr<I_UniString> str_FontWarning() const {
        return GetCachedCommonUniString(199);
    }
    virtual C_SmartPtr<I_UniString> str_ForceCenter() const {
        return GetCachedCommonUniString(200);
    }
    virtual C_SmartPtr<I_UniString> str_ForceChoke() const { return GetCachedCommonUniString(201); }
    virtual C_SmartPtr<I_UniString> str_ForceSeparations() const {
        return GetCachedCommonUniString(202);
    }
    virtual C_SmartPtr<I_UniString> str_ForceSpread() const {
        return GetCachedCommonUniString(203);
    }
    virtual C_SmartPtr<I_UniString> str_FormatConversionParams() const {
        return GetCachedCommonUniString(204);
    }
    virtual C_SmartPtr<I_UniString> str_FormFieldOnly() const {
        return GetCachedCommonUniString(205);
    }
    virtual C_SmartPtr<I_UniString> str_FORMXOBJECT() const {
        return GetCachedCommonUniString(206);
    }
    virtual C_SmartPtr<I_UniString> str_Frame() const { return GetCachedCommonUniString(207); }
    virtual C_SmartPtr<I_UniString> str_FrameBufferWidthInBytes() const {
        return GetCachedCommonUniString(208);
    }
    virtual C_SmartPtr<I_UniString> str_Frequency() const { return GetCachedCommonUniString(209); }
    virtual C_SmartPtr<I_UniString> str_FrequencyPolicy() const {
        return GetCachedCommonUniString(210);
    }
    virtual C_SmartPtr<I_UniString> str_FrequencyRange() const {
        return GetCachedCommonUniString(211);
    }
    virtual C_SmartPtr<I_UniString> str_FromPDF() const { return GetCachedCommonUniString(212); }
    virtual C_SmartPtr<I_UniString> str_Front() const { return GetCachedCommonUniString(213); }
    virtual C_SmartPtr<I_UniString> str_General() const { return GetCachedCommonUniString(214); }
    virtual C_SmartPtr<I_UniString> str_Global() const { return GetCachedCommonUniString(215); }
    virtual C_SmartPtr<I_UniString> str_GlobalRasterization() const {
        return GetCachedCommonUniString(216);
    }
    virtual C_SmartPtr<I_UniString> str_GlobalRasterizationThreshold() const {
        return GetCachedCommonUniString(217);
    }
    virtual C_SmartPtr<I_UniString> str_GraphicStateParams() const {
        return GetCachedCommonUniString(218);
    }
    virtual C_SmartPtr<I_UniString> str_Gray() const { return GetCachedCommonUniString(219); }
    virtual C_SmartPtr<I_UniString> str_Green() const { return GetCachedCommonUniString(220); }
    virtual C_SmartPtr<I_UniString> str_GTS_Env() const { return GetCachedCommonUniString(221); }
    virtual C_SmartPtr<I_UniString> str_GTS_Scope() const { return GetCachedCommonUniString(222); }
    virtual C_SmartPtr<I_UniString> str_GTS_XID() const { return GetCachedCommonUniString(223); }
    virtual C_SmartPtr<I_UniString> str_HalftoneArray() const {
        return GetCachedCommonUniString(224);
    }
    virtual C_SmartPtr<I_UniString> str_HalftoneName() const {
        return GetCachedCommonUniString(225);
    }
    virtual C_SmartPtr<I_UniString> str_HalfTonePhaseOrigin() const {
        return GetCachedCommonUniString(226);
    }
    virtual C_SmartPtr<I_UniString> str_Halftones() const { return GetCachedCommonUniString(227); }
    virtual C_SmartPtr<I_UniString> str_HalftoneType() const {
        return GetCachedCommonUniString(228);
    }
    virtual C_SmartPtr<I_UniString> str_HasTransparency() const {
        return GetCachedCommonUniString(229);
    }
    virtual C_SmartPtr<I_UniString> str_Height() const { return GetCachedCommonUniString(230); }
    virtual C_SmartPtr<I_UniString> str_Height2() const { return GetCachedCommonUniString(231); }
    virtual C_SmartPtr<I_UniString> str_HintingTags() const {
        return GetCachedCommonUniString(232);
    }
    virtual C_SmartPtr<I_UniString> str_HorizontalTiles() const {
        return GetCachedCommonUniString(233);
    }
    virtual C_SmartPtr<I_UniString> str_Identity() const { return GetCachedCommonUniString(234); }
    virtual C_SmartPtr<I_UniString> str_Ignore() const { return GetCachedCommonUniString(235); }
    virtual C_SmartPtr<I_UniString> str_IgnoreFileParams() const {
        return GetCachedCommonUniString(236);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLAllBlendSpaces() const {
        return GetCachedCommonUniString(237);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLBlackPointCompensation() const {
        return GetCachedCommonUniString(238);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLFlatness() const {
        return GetCachedCommonUniString(239);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLLineCapStyle() const {
        return GetCachedCommonUniString(240);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLLineDash() const {
        return GetCachedCommonUniString(241);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLLineJoinStyle() const {
        return GetCachedCommonUniString(242);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLLineWidth() const {
        return GetCachedCommonUniString(243);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLMiterLimit() const {
        return GetCachedCommonUniString(244);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLOverprint() const {
        return GetCachedCommonUniString(245);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLOverprintMode() const {
        return GetCachedCommonUniString(246);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLPageBlendSpace() const {
        return GetCachedCommonUniString(247);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLRenderingIntent() const {
        return GetCachedCommonUniString(248);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLSmoothness() const {
        return GetCachedCommonUniString(249);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLStrokeAdjust() const {
        return GetCachedCommonUniString(250);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLTilingType() const {
        return GetCachedCommonUniString(251);
    }
    virtual C_SmartPtr<I_UniString> str_IgnorePDLUCRBG() const {
        return GetCachedCommonUniString(252);
    }
    virtual C_SmartPtr<I_UniString> str_IgnoreSourceFile() const {
        return GetCachedCommonUniString(253);
    }
    virtual C_SmartPtr<I_UniString> str_IgnoreSourceFilePolicy() const {
        return GetCachedCommonUniString(254);
    }
    virtual C_SmartPtr<I_UniString> str_Image() const { return GetCachedCommonUniString(255); }
    virtual C_SmartPtr<I_UniString> str_ImageBounds() const {
        return GetCachedCommonUniString(256);
    }
    virtual C_SmartPtr<I_UniString> str_ImageHeight() const {
        return GetCachedCommonUniString(257);
    }
    virtual C_SmartPtr<I_UniString> str_ImageInternalTrapping() const {
        return GetCachedCommonUniString(258);
    }
    virtual C_SmartPtr<I_UniString> str_ImageMarkerFactorPIR() const {
        return GetCachedCommonUniString(259);
    }
    virtual C_SmartPtr<I_UniString> str_ImageMarkerFactorSourceStep() const {
        return GetCachedCommonUniString(260);
    }
    virtual C_SmartPtr<I_UniString> str_ImageMarkerFactorTiling() const {
        return GetCachedCommonUniString(261);
    }
    virtual C_SmartPtr<I_UniString> str_ImageMarkerTiling() const {
        return GetCachedCommonUniString(262);
    }
    virtual C_SmartPtr<I_UniString> str_ImageMarkerType() const {
        return GetCachedCommonUniString(263);
    }
    virtual C_SmartPtr<I_UniString> str_ImageMaskTrapping() const {
        return GetCachedCommonUniString(264);
    }
    virtual C_SmartPtr<I_UniString> str_ImageMetadata() const {
        return GetCachedCommonUniString(265);
    }
    virtual C_SmartPtr<I_UniString> str_ImagePhotographic() const {
        return GetCachedCommonUniString(266);
    }
    virtual C_SmartPtr<I_UniString> str_ImageProcessingOp() const {
        return GetCachedCommonUniString(267);
    }
    virtual C_SmartPtr<I_UniString> str_ImageProcessingParams() const {
        return GetCachedCommonUniString(268);
    }
    virtual C_SmartPtr<I_UniString> str_ImageResolution() const {
        return GetCachedCommonUniString(269);
    }
    virtual C_SmartPtr<I_UniString> str_ImageScreenShot() const {
        return GetCachedCommonUniString(270);
    }
    virtual C_SmartPtr<I_UniString> str_ImageSetterParams() const {
        return GetCachedCommonUniString(271);
    }
    virtual C_SmartPtr<I_UniString> str_ImageToImageTrapping() const {
        return GetCachedCommonUniString(272);
    }
    virtual C_SmartPtr<I_UniString> str_ImageToObjectTrapping() const {
        return GetCachedCommonUniString(273);
    }
    virtual C_SmartPtr<I_UniString> str_ImageTrapPlacement() const {
        return GetCachedCommonUniString(274);
    }
    virtual C_SmartPtr<I_UniString> str_ImageTrapWidth() const {
        return GetCachedCommonUniString(275);
    }
    virtual C_SmartPtr<I_UniString> str_ImageWidth() const { return GetCachedCommonUniString(276); }
    virtual C_SmartPtr<I_UniString> str_IMAGEXOBJECT() const {
        return GetCachedCommonUniString(277);
    }
    virtual C_SmartPtr<I_UniString> str_ImposedSheetSetIndex() const {
        return GetCachedCommonUniString(278);
    }
    virtual C_SmartPtr<I_UniString> str_Include() const { return GetCachedCommonUniString(279); }
    virtual C_SmartPtr<I_UniString> str_IncludeCMYGray() const {
        return GetCachedCommonUniString(280);
    }
    virtual C_SmartPtr<I_UniString> str_IncludeOCG() const { return GetCachedCommonUniString(281); }
    virtual C_SmartPtr<I_UniString> str_IncludeProcessSpots() const {
        return GetCachedCommonUniString(282);
    }
    virtual C_SmartPtr<I_UniString> str_IncludeRichBlack() const {
        return GetCachedCommonUniString(283);
    }
    virtual C_SmartPtr<I_UniString> str_IncludeSpotBlacks() const {
        return GetCachedCommonUniString(284);
    }
    virtual C_SmartPtr<I_UniString> str_Indexed() const { return GetCachedCommonUniString(285); }
    virtual C_SmartPtr<I_UniString> str_INLINEIMAGE() const {
        return GetCachedCommonUniString(286);
    }
    virtual C_SmartPtr<I_UniString> str_InstDocID() const { return GetCachedCommonUniString(287); }
    virtual C_SmartPtr<I_UniString> str_Interleaved() const {
        return GetCachedCommonUniString(288);
    }
    virtual C_SmartPtr<I_UniString> str_InterpretingParams() const {
        return GetCachedCommonUniString(289);
    }
    virtual C_SmartPtr<I_UniString> str_InvertedDouble() const {
        return GetCachedCommonUniString(290);
    }
    virtual C_SmartPtr<I_UniString> str_InvertedDoubleDot() const {
        return GetCachedCommonUniString(291);
    }
    virtual C_SmartPtr<I_UniString> str_InvertedEllipseA() const {
        return GetCachedCommonUniString(292);
    }
    virtual C_SmartPtr<I_UniString> str_InvertedEllipseC() const {
        return GetCachedCommonUniString(293);
    }
    virtual C_SmartPtr<I_UniString> str_InvertedSimpleDot() const {
        return GetCachedCommonUniString(294);
    }
    virtual C_SmartPtr<I_UniString> str_IsFrontSide() const {
        return GetCachedCommonUniString(295);
    }
    virtual C_SmartPtr<I_UniString> str_IsLastNonEmptySurfaceOfDoc() const {
        return GetCachedCommonUniString(296);
    }
    virtual C_SmartPtr<I_UniString> str_IsLastNonEmptySurfaceOfSet() const {
        return GetCachedCommonUniString(297);
    }
    virtual C_SmartPtr<I_UniString> str_IsLastSurfaceOfDoc() const {
        return GetCachedCommonUniString(298);
    }
    virtual C_SmartPtr<I_UniString> str_IsLastSurfaceOfSet() const {
        return GetCachedCommonUniString(299);
    }
    virtual C_SmartPtr<I_UniString> str_IsLastSurfaceOfSimilarJob() const {
        return GetCachedCommonUniString(300);
    }
    virtual C_SmartPtr<I_UniString> str_IsPDFPartOfChunked() const {
        return GetCachedCommonUniString(301);
    }
    virtual C_SmartPtr<I_UniString> str_IsPlanarizing() const {
        return GetCachedCommonUniString(302);
    }
    virtual C_SmartPtr<I_UniString> str_IsPlanarizingOverprint() const {
        return GetCachedCommonUniString(303);
    }
    virtual C_SmartPtr<I_UniString> str_IsSurfacePartOfChunked() const {
        return GetCachedCommonUniString(304);
    }
    virtual C_SmartPtr<I_UniString> str_JDFDocID() const { return GetCachedCommonUniString(305); }
    virtual C_SmartPtr<I_UniString> str_JP_IPMVX_Mode() const {
        return GetCachedCommonUniString(306);
    }
    virtual C_SmartPtr<I_UniString> str_JPJobID() const { return GetCachedCommonUniString(307); }
    virtual C_SmartPtr<I_UniString> str_JPSimilarJob() const {
        return GetCachedCommonUniString(308);
    }
    virtual C_SmartPtr<I_UniString> str_KnockOutCMYKWhite() const {
        return GetCachedCommonUniString(309);
    }
    virtual C_SmartPtr<I_UniString> str_L() const { return GetCachedCommonUniString(310); }
    virtual C_SmartPtr<I_UniString> str_Lab() const { return GetCachedCommonUniString(311); }
    virtual C_SmartPtr<I_UniString> str_Line() const { return GetCachedCommonUniString(312); }
    virtual C_SmartPtr<I_UniString> str_LineArt() const { return GetCachedCommonUniString(313); }
    virtual C_SmartPtr<I_UniString> str_LineArtBlackLevel() const {
        return GetCachedCommonUniString(314);
    }
    virtual C_SmartPtr<I_UniString> str_LineCapStyle() const {
        return GetCachedCommonUniString(315);
    }
    virtual C_SmartPtr<I_UniString> str_LineDashPattern() const {
        return GetCachedCommonUniString(316);
    }
    virtual C_SmartPtr<I_UniString> str_LineJoinStyle() const {
        return GetCachedCommonUniString(317);
    }
    virtual C_SmartPtr<I_UniString> str_LineWidth() const { return GetCachedCommonUniString(318); }
    virtual C_SmartPtr<I_UniString> str_LineX() const { return GetCachedCommonUniString(319); }
    virtual C_SmartPtr<I_UniString> str_LineY() const { return GetCachedCommonUniString(320); }
    virtual C_SmartPtr<I_UniString> str_LocID() const { return GetCachedCommonUniString(321); }
    virtual C_SmartPtr<I_UniString> str_Magenta() const { return GetCachedCommonUniString(322); }
    virtual C_SmartPtr<I_UniString> str_ManualFeed() const { return GetCachedCommonUniString(323); }
    virtual C_SmartPtr<I_UniString> str_MapGrayToBlack() const {
        return GetCachedCommonUniString(324);
    }
    virtual C_SmartPtr<I_UniString> str_MappingSelection() const {
        return GetCachedCommonUniString(325);
    }
    virtual C_SmartPtr<I_UniString> str_Marker() const { return GetCachedCommonUniString(326); }
    virtual C_SmartPtr<I_UniString> str_MarkOpaqueRun() const {
        return GetCachedCommonUniString(327);
    }
    virtual C_SmartPtr<I_UniString> str_MarkPath() const { return GetCachedCommonUniString(328); }
    virtual C_SmartPtr<I_UniString> str_Match() const { return GetCachedCommonUniString(329); }
    virtual C_SmartPtr<I_UniString> str_MaxBandHeightInScanlines() const {
        return GetCachedCommonUniString(330);
    }
    virtual C_SmartPtr<I_UniString> str_MaxBandWidthInPixels() const {
        return GetCachedCommonUniString(331);
    }
    virtual C_SmartPtr<I_UniString> str_MaxTileHeightInScanlines() const {
        return GetCachedCommonUniString(332);
    }
    virtual C_SmartPtr<I_UniString> str_MaxTileWidthInBytes() const {
        return GetCachedCommonUniString(333);
    }
    virtual C_SmartPtr<I_UniString> str_Media() const { return GetCachedCommonUniString(334); }
    virtual C_SmartPtr<I_UniString> str_MediaBox() const { return GetCachedCommonUniString(335); }
    virtual C_SmartPtr<I_UniString> str_MediaThickness() const {
        return GetCachedCommonUniString(336);
    }
    virtual C_SmartPtr<I_UniString> str_MediaType() const { return GetCachedCommonUniString(337); }
    virtual C_SmartPtr<I_UniString> str_MediaUnit() const { return GetCachedCommonUniString(338); }
    virtual C_SmartPtr<I_UniString> str_Memory() const { return GetCachedCommonUniString(339); }
    virtual C_SmartPtr<I_UniString> str_MeshMarkerFactorD11() const {
        return GetCachedCommonUniString(340);
    }
    virtual C_SmartPtr<I_UniString> str_MeshMarkerFactorD18() const {
        return GetCachedCommonUniString(341);
    }
    virtual C_SmartPtr<I_UniString> str_MeshMarkerFactorD48() const {
        return GetCachedCommonUniString(342);
    }
    virtual C_SmartPtr<I_UniString> str_Metadata() const { return GetCachedCommonUniString(343); }
    virtual C_SmartPtr<I_UniString> str_MinimumBlackWidth() const {
        return GetCachedCommonUniString(344);
    }
    virtual C_SmartPtr<I_UniString> str_MinimumProratedWidth() const {
        return GetCachedCommonUniString(345);
    }
    virtual C_SmartPtr<I_UniString> str_MinimumLineWidth() const {
        return GetCachedCommonUniString(346);
    }
    virtual C_SmartPtr<I_UniString> str_MinProcessSpots() const {
        return GetCachedCommonUniString(347);
    }
    virtual C_SmartPtr<I_UniString> str_MinRequiredBufs() const {
        return GetCachedCommonUniString(348);
    }
    virtual C_SmartPtr<I_UniString> str_MinShadeRasterizationResolution() const {
        return GetCachedCommonUniString(349);
    }
    virtual C_SmartPtr<I_UniString> str_MirrorAround() const {
        return GetCachedCommonUniString(350);
    }
    virtual C_SmartPtr<I_UniString> str_Miter() const { return GetCachedCommonUniString(351); }
    virtual C_SmartPtr<I_UniString> str_MiterLimit() const { return GetCachedCommonUniString(352); }
    virtual C_SmartPtr<I_UniString> str_MiterLimitRange() const {
        return GetCachedCommonUniString(353);
    }
    virtual C_SmartPtr<I_UniString> str_Mode() const { return GetCachedCommonUniString(354); }
    virtual C_SmartPtr<I_UniString> str_ModePolicy() const { return GetCachedCommonUniString(355); }
    virtual C_SmartPtr<I_UniString> str_Name() const { return GetCachedCommonUniString(356); }
    virtual C_SmartPtr<I_UniString> str_NeutralDensity() const {
        return GetCachedCommonUniString(357);
    }
    virtual C_SmartPtr<I_UniString> str_NodeNames() const { return GetCachedCommonUniString(358); }
    virtual C_SmartPtr<I_UniString> str_None() const { return GetCachedCommonUniString(359); }
    virtual C_SmartPtr<I_UniString> str_none() const { return GetCachedCommonUniString(360); }
    virtual C_SmartPtr<I_UniString> str_Normal() const { return GetCachedCommonUniString(361); }
    virtual C_SmartPtr<I_UniString> str_NumComponents() const {
        return GetCachedCommonUniString(362);
    }
    virtual C_SmartPtr<I_UniString> str_NumPages() const { return GetCachedCommonUniString(363); }
    virtual C_SmartPtr<I_UniString> str_NZOP() const { return GetCachedCommonUniString(364); }
    virtual C_SmartPtr<I_UniString> str_ObjectResolution() const {
        return GetCachedCommonUniString(365);
    }
    virtual C_SmartPtr<I_UniString> str_ObjectTags() const { return GetCachedCommonUniString(366); }
    virtual C_SmartPtr<I_UniString> str_OCGControl() const { return GetCachedCommonUniString(367); }
    virtual C_SmartPtr<I_UniString> str_OCGDefault() const { return GetCachedCommonUniString(368); }
    virtual C_SmartPtr<I_UniString> str_OCGDefaultPolicy() const {
        return GetCachedCommonUniString(369);
    }
    virtual C_SmartPtr<I_UniString> str_OCGIntent() const { return GetCachedCommonUniString(370); }
    virtual C_SmartPtr<I_UniString> str_OCGIntentPolicy() const {
        return GetCachedCommonUniString(371);
    }
    virtual C_SmartPtr<I_UniString> str_OCGLayerName() const {
        return GetCachedCommonUniString(372);
    }
    virtual C_SmartPtr<I_UniString> str_OCGName() const { return GetCachedCommonUniString(373); }
    virtual C_SmartPtr<I_UniString> str_OCGNamePolicy() const {
        return GetCachedCommonUniString(374);
    }
    virtual C_SmartPtr<I_UniString> str_OCGProcess() const { return GetCachedCommonUniString(375); }
    virtual C_SmartPtr<I_UniString> str_OCGProcessPolicy() const {
        return GetCachedCommonUniString(376);
    }
    virtual C_SmartPtr<I_UniString> str_OCGZoom() const { return GetCachedCommonUniString(377); }
    virtual C_SmartPtr<I_UniString> str_OCGZoomPolicy() const {
        return GetCachedCommonUniString(378);
    }
    virtual C_SmartPtr<I_UniString> str_Opaque() const { return GetCachedCommonUniString(379); }
    virtual C_SmartPtr<I_UniString> str_OpaqueIgnore() const {
        return GetCachedCommonUniString(380);
    }
    virtual C_SmartPtr<I_UniString> str_Operation() const { return GetCachedCommonUniString(381); }
    virtual C_SmartPtr<I_UniString> str_OPModel() const { return GetCachedCommonUniString(382); }
    virtual C_SmartPtr<I_UniString> str_OutputIntents() const {
        return GetCachedCommonUniString(383);
    }
    virtual C_SmartPtr<I_UniString> str_Overlap() const { return GetCachedCommonUniString(384); }
    virtual C_SmartPtr<I_UniString> str_Overprint() const { return GetCachedCommonUniString(385); }
    virtual C_SmartPtr<I_UniString> str_OverPrintBlackLineArt() const {
        return GetCachedCommonUniString(386);
    }
    virtual C_SmartPtr<I_UniString> str_OverPrintBlackText() const {
        return GetCachedCommonUniString(387);
    }
    virtual C_SmartPtr<I_UniString> str_OverprintMode() const {
        return GetCachedCommonUniString(388);
    }
    virtual C_SmartPtr<I_UniString> str_OverprintParams() const {
        return GetCachedCommonUniString(389);
    }
    virtual C_SmartPtr<I_UniString> str_PageBox() const { return GetCachedCommonUniString(390); }
    virtual C_SmartPtr<I_UniString> str_PageNum() const { return GetCachedCommonUniString(391); }
    virtual C_SmartPtr<I_UniString> str_Paper() const { return GetCachedCommonUniString(392); }
    virtual C_SmartPtr<I_UniString> str_PathType() const { return GetCachedCommonUniString(393); }
    virtual C_SmartPtr<I_UniString> str_PDFInterpretingParams() const {
        return GetCachedCommonUniString(394);
    }
    virtual C_SmartPtr<I_UniString> str_PDFCreatorApp() const {
        return GetCachedCommonUniString(395);
    }
    virtual C_SmartPtr<I_UniString> str_PDFInfoForAnalytics() const {
        return GetCachedCommonUniString(396);
    }
    virtual C_SmartPtr<I_UniString> str_PDFMajorVersion() const {
        return GetCachedCommonUniString(397);
    }
    virtual C_SmartPtr<I_UniString> str_PDFMinorVersion() const {
        return GetCachedCommonUniString(398);
    }
    virtual C_SmartPtr<I_UniString> str_PDFPage() const { return GetCachedCommonUniString(399); }
    virtual C_SmartPtr<I_UniString> str_PDFPreTrapped() const {
        return GetCachedCommonUniString(400);
    }
    virtual C_SmartPtr<I_UniString> str_PDLSourceProfile() const {
        return GetCachedCommonUniString(401);
    }
    virtual C_SmartPtr<I_UniString> str_Perceptual() const { return GetCachedCommonUniString(402); }
    virtual C_SmartPtr<I_UniString> str_Performance() const {
        return GetCachedCommonUniString(403);
    }
    virtual C_SmartPtr<I_UniString> str_PermDocID() const { return GetCachedCommonUniString(404); }
    virtual C_SmartPtr<I_UniString> str_PlaneNumber() const {
        return GetCachedCommonUniString(405);
    }
    virtual C_SmartPtr<I_UniString> str_Plate() const { return GetCachedCommonUniString(406); }
    virtual C_SmartPtr<I_UniString> str_Polarity() const { return GetCachedCommonUniString(407); }
    virtual C_SmartPtr<I_UniString> str_PoolSheetIndex() const {
        return GetCachedCommonUniString(408);
    }
    virtual C_SmartPtr<I_UniString> str_PortPipeLine() const {
        return GetCachedCommonUniString(409);
    }
    virtual C_SmartPtr<I_UniString> str_PreferredFont() const {
        return GetCachedCommonUniString(410);
    }
    virtual C_SmartPtr<I_UniString> str_PreservePrimariesCMYK() const {
        return GetCachedCommonUniString(411);
    }
    virtual C_SmartPtr<I_UniString> str_PreservePrimariesK() const {
        return GetCachedCommonUniString(412);
    }
    virtual C_SmartPtr<I_UniString> str_Press() const { return GetCachedCommonUniString(413); }
    virtual C_SmartPtr<I_UniString> str_Prime() const { return GetCachedCommonUniString(414); }
    virtual C_SmartPtr<I_UniString> str_Print() const { return GetCachedCommonUniString(415); }
    virtual C_SmartPtr<I_UniString> str_PrintPDFAnnotations() const {
        return GetCachedCommonUniString(416);
    }
    virtual C_SmartPtr<I_UniString> str_PrintPDFAnnotationsPolicy() const {
        return GetCachedCommonUniString(417);
    }
    virtual C_SmartPtr<I_UniString> str_PrintQuality() const {
        return GetCachedCommonUniString(418);
    }
    virtual C_SmartPtr<I_UniString> str_PrintResolution() const {
        return GetCachedCommonUniString(419);
    }
    virtual C_SmartPtr<I_UniString> str_ProcessColorModel() const {
        return GetCachedCommonUniString(420);
    }
    virtual C_SmartPtr<I_UniString> str_ProcessJob() const { return GetCachedCommonUniString(421); }
    virtual C_SmartPtr<I_UniString> str_Proof() const { return GetCachedCommonUniString(422); }
    virtual C_SmartPtr<I_UniString> str_ProrateBlackTraps() const {
        return GetCachedCommonUniString(423);
    }
    virtual C_SmartPtr<I_UniString> str_ProratedStrokeLimit() const {
        return GetCachedCommonUniString(424);
    }
    virtual C_SmartPtr<I_UniString> str_ProratedTextLimit() const {
        return GetCachedCommonUniString(425);
    }
    virtual C_SmartPtr<I_UniString> str_ProxyJobID() const { return GetCachedCommonUniString(426); }
    virtual C_SmartPtr<I_UniString> str_ProxySurfaceID() const {
        return GetCachedCommonUniString(427);
    }
    virtual C_SmartPtr<I_UniString> str_PSL2() const { return GetCachedCommonUniString(428); }
    virtual C_SmartPtr<I_UniString> str_RasterizeRegionsHavingMultipleText() const {
        return GetCachedCommonUniString(429);
    }
    virtual C_SmartPtr<I_UniString> str_RawName() const { return GetCachedCommonUniString(430); }
    virtual C_SmartPtr<I_UniString> str_RawSeparationSpec() const {
        return GetCachedCommonUniString(431);
    }
    virtual C_SmartPtr<I_UniString> str_Record() const { return GetCachedCommonUniString(432); }
    virtual C_SmartPtr<I_UniString> str_RecordLevel() const {
        return GetCachedCommonUniString(433);
    }
    virtual C_SmartPtr<I_UniString> str_Red() const { return GetCachedCommonUniString(434); }
    virtual C_SmartPtr<I_UniString> str_ReferenceFontDir() const {
        return GetCachedCommonUniString(435);
    }
    virtual C_SmartPtr<I_UniString> str_ReferenceXObjParams() const {
        return GetCachedCommonUniString(436);
    }
    virtual C_SmartPtr<I_UniString> str_ReferenceXObjParamsPolicy() const {
        return GetCachedCommonUniString(437);
    }
    virtual C_SmartPtr<I_UniString> str_RelatedJobID() const {
        return GetCachedCommonUniString(438);
    }
    virtual C_SmartPtr<I_UniString> str_RelativeColorimetric() const {
        return GetCachedCommonUniString(439);
    }
    virtual C_SmartPtr<I_UniString> str_RemoveOverprintParams() const {
        return GetCachedCommonUniString(440);
    }
    virtual C_SmartPtr<I_UniString> str_RenderingIntent() const {
        return GetCachedCommonUniString(441);
    }
    virtual C_SmartPtr<I_UniString> str_RenderingParams() const {
        return GetCachedCommonUniString(442);
    }
    virtual C_SmartPtr<I_UniString> str_RepeatToFill() const {
        return GetCachedCommonUniString(443);
    }
    virtual C_SmartPtr<I_UniString> str_RepeatUnclipped() const {
        return GetCachedCommonUniString(444);
    }
    virtual C_SmartPtr<I_UniString> str_ReplacementColor() const {
        return GetCachedCommonUniString(445);
    }
    virtual C_SmartPtr<I_UniString> str_ReplacementColorantName() const {
        return GetCachedCommonUniString(446);
    }
    virtual C_SmartPtr<I_UniString> str_ReplacementSpotName() const {
        return GetCachedCommonUniString(447);
    }
    virtual C_SmartPtr<I_UniString> str_ReplaceSourceColor() const {
        return GetCachedCommonUniString(448);
    }
    virtual C_SmartPtr<I_UniString> str_ReportContents() const {
        return GetCachedCommonUniString(449);
    }
    virtual C_SmartPtr<I_UniString> str_Request1bitMask() const {
        return GetCachedCommonUniString(450);
    }
    virtual C_SmartPtr<I_UniString> str_ResIsPartitioned() const {
        return GetCachedCommonUniString(451);
    }
    virtual C_SmartPtr<I_UniString> str_ResIsPartitionedPolicy() const {
        return GetCachedCommonUniString(452);
    }
    virtual C_SmartPtr<I_UniString> str_Resolution() const { return GetCachedCommonUniString(453); }
    virtual C_SmartPtr<I_UniString> str_Resolve() const { return GetCachedCommonUniString(454); }
    virtual C_SmartPtr<I_UniString> str_ResolveAlways() const {
        return GetCachedCommonUniString(455);
    }
    virtual C_SmartPtr<I_UniString> str_ResolveIfPDFX5() const {
        return GetCachedCommonUniString(456);
    }
    virtual C_SmartPtr<I_UniString> str_ResourceUsage() const {
        return GetCachedCommonUniString(457);
    }
    virtual C_SmartPtr<I_UniString> str_Retag() const { return GetCachedCommonUniString(458); }
    virtual C_SmartPtr<I_UniString> str_ReturnStructureAndMetadata() const {
        return GetCachedCommonUniString(459);
    }
    virtual C_SmartPtr<I_UniString> str_RGBGray2Black() const {
        return GetCachedCommonUniString(460);
    }
    virtual C_SmartPtr<I_UniString> str_RGBGray2BlackThreshold() const {
        return GetCachedCommonUniString(461);
    }
    virtual C_SmartPtr<I_UniString> str_Rhomboid() const { return GetCachedCommonUniString(462); }
    virtual C_SmartPtr<I_UniString> str_RichBlackThreshold() const {
        return GetCachedCommonUniString(463);
    }
    virtual C_SmartPtr<I_UniString> str_Roll() const { return GetCachedCommonUniString(464); }
    virtual C_SmartPtr<I_UniString> str_Rotated() const { return GetCachedCommonUniString(465); }
    virtual C_SmartPtr<I_UniString> str_RotatePolicy() const {
        return GetCachedCommonUniString(466);
    }
    virtual C_SmartPtr<I_UniString> str_Round() const { return GetCachedCommonUniString(467); }
    virtual C_SmartPtr<I_UniString> str_Run() const { return GetCachedCommonUniString(468); }
    virtual C_SmartPtr<I_UniString> str_RunIndex() const { return GetCachedCommonUniString(469); }
    virtual C_SmartPtr<I_UniString> str_RunTag() const { return GetCachedCommonUniString(470); }
    virtual C_SmartPtr<I_UniString> str_RunTags() const { return GetCachedCommonUniString(471); }
    virtual C_SmartPtr<I_UniString> str_Saturation() const { return GetCachedCommonUniString(472); }
    virtual C_SmartPtr<I_UniString> str_ScreeningFamily() const {
        return GetCachedCommonUniString(473);
    }
    virtual C_SmartPtr<I_UniString> str_ScreeningParams() const {
        return GetCachedCommonUniString(474);
    }
    virtual C_SmartPtr<I_UniString> str_ScreeningType() const {
        return GetCachedCommonUniString(475);
    }
    virtual C_SmartPtr<I_UniString> str_ScreeningTypePolicy() const {
        return GetCachedCommonUniString(476);
    }
    virtual C_SmartPtr<I_UniString> str_ScreenMgr() const { return GetCachedCommonUniString(477); }
    virtual C_SmartPtr<I_UniString> str_Screens() const { return GetCachedCommonUniString(478); }
    virtual C_SmartPtr<I_UniString> str_ScreenSelector() const {
        return GetCachedCommonUniString(479);
    }
    virtual C_SmartPtr<I_UniString> str_ScreenSelectorPolicy() const {
        return GetCachedCommonUniString(480);
    }
    virtual C_SmartPtr<I_UniString> str_SearchDir() const { return GetCachedCommonUniString(481); }
    virtual C_SmartPtr<I_UniString> str_SecurityType() const {
        return GetCachedCommonUniString(482);
    }
    virtual C_SmartPtr<I_UniString> str_Separation() const { return GetCachedCommonUniString(483); }
    virtual C_SmartPtr<I_UniString> str_SeparationPolicy() const {
        return GetCachedCommonUniString(484);
    }
    virtual C_SmartPtr<I_UniString> str_SeparationSpec() const {
        return GetCachedCommonUniString(485);
    }
    virtual C_SmartPtr<I_UniString> str_SetDocIndex() const {
        return GetCachedCommonUniString(486);
    }
    virtual C_SmartPtr<I_UniString> str_SetIndex() const { return GetCachedCommonUniString(487); }
    virtual C_SmartPtr<I_UniString> str_SetRunIndex() const {
        return GetCachedCommonUniString(488);
    }
    virtual C_SmartPtr<I_UniString> str_SetTags() const { return GetCachedCommonUniString(489); }
    virtual C_SmartPtr<I_UniString> str_SheetCount() const { return GetCachedCommonUniString(490); }
    virtual C_SmartPtr<I_UniString> str_SheetID() const { return GetCachedCommonUniString(491); }
    virtual C_SmartPtr<I_UniString> str_SheetIndex() const { return GetCachedCommonUniString(492); }
    virtual C_SmartPtr<I_UniString> str_SheetName() const { return GetCachedCommonUniString(493); }
    virtual C_SmartPtr<I_UniString> str_Side() const { return GetCachedCommonUniString(494); }
    virtual C_SmartPtr<I_UniString> str_SignatureName() const {
        return GetCachedCommonUniString(495);
    }
    virtual C_SmartPtr<I_UniString> str_SimpleDot() const { return GetCachedCommonUniString(496); }
    virtual C_SmartPtr<I_UniString> str_SingleUse() const { return GetCachedCommonUniString(497); }
    virtual C_SmartPtr<I_UniString> str_SizePolicy() const { return GetCachedCommonUniString(498); }
    virtual C_SmartPtr<I_UniString> str_SlidingTrapLimit() const {
        return GetCachedCommonUniString(499);
    }
    virtual C_SmartPtr<I_UniString> str_SmallTextLimit() const {
        return GetCachedCommonUniString(500);
    }
    virtual C_SmartPtr<I_UniString> str_SmallTextTrapPlacement() const {
        return GetCachedCommonUniString(501);
    }
    virtual C_SmartPtr<I_UniString> str_SmallTextTrapPlacementLimit() const {
        return GetCachedCommonUniString(502);
    }
    virtual C_SmartPtr<I_UniString> str_SmallTextTrapWidthScaling() const {
        return GetCachedCommonUniString(503);
    }
    virtual C_SmartPtr<I_UniString> str_Smoothness() const { return GetCachedCommonUniString(504); }
    virtual C_SmartPtr<I_UniString> str_SmoothnessRange() const {
        return GetCachedCommonUniString(505);
    }
    virtual C_SmartPtr<I_UniString> str_SmoothShades() const {
        return GetCachedCommonUniString(506);
    }
    virtual C_SmartPtr<I_UniString> str_SourceClipBox() const {
        return GetCachedCommonUniString(507);
    }
    virtual C_SmartPtr<I_UniString> str_SourceColor() const {
        return GetCachedCommonUniString(508);
    }
    virtual C_SmartPtr<I_UniString> str_SourceCS() const { return GetCachedCommonUniString(509); }
    virtual C_SmartPtr<I_UniString> str_SourceFrequency() const {
        return GetCachedCommonUniString(510);
    }
    virtual C_SmartPtr<I_UniString> str_SourceObjects() const {
        return GetCachedCommonUniString(511);
    }
    virtual C_SmartPtr<I_UniString> str_SourceObjectsPolicy() const {
        return GetCachedCommonUniString(512);
    }
    virtual C_SmartPtr<I_UniString> str_SourceProfile() const {
        return GetCachedCommonUniString(513);
    }
    virtual C_SmartPtr<I_UniString> str_SpotColors() const { return GetCachedCommonUniString(514); }
    virtual C_SmartPtr<I_UniString> str_SpotFunction() const {
        return GetCachedCommonUniString(515);
    }
    virtual C_SmartPtr<I_UniString> str_SpotFunctionPolicy() const {
        return GetCachedCommonUniString(516);
    }
    virtual C_SmartPtr<I_UniString> str_SpotName() const { return GetCachedCommonUniString(517); }
    virtual C_SmartPtr<I_UniString> str_Spread() const { return GetCachedCommonUniString(518); }
    virtual C_SmartPtr<I_UniString> str_Square() const { return GetCachedCommonUniString(519); }
    virtual C_SmartPtr<I_UniString> str_SSE2() const { return GetCachedCommonUniString(520); }
    virtual C_SmartPtr<I_UniString> str_Start() const { return GetCachedCommonUniString(521); }
    virtual C_SmartPtr<I_UniString> str_Stats() const { return GetCachedCommonUniString(522); }
    virtual C_SmartPtr<I_UniString> str_StepAndRepeat() const {
        return GetCachedCommonUniString(523);
    }
    virtual C_SmartPtr<I_UniString> str_StepLimit() const { return GetCachedCommonUniString(524); }
    virtual C_SmartPtr<I_UniString> str_Strategy() const { return GetCachedCommonUniString(525); }
    virtual C_SmartPtr<I_UniString> str_Stream() const { return GetCachedCommonUniString(526); }
    virtual C_SmartPtr<I_UniString> str_StreamData() const { return GetCachedCommonUniString(527); }
    virtual C_SmartPtr<I_UniString> str_StretchToFit() const {
        return GetCachedCommonUniString(528);
    }
    virtual C_SmartPtr<I_UniString> str_StructArray() const {
        return GetCachedCommonUniString(529);
    }
    virtual C_SmartPtr<I_UniString> str_StructRoot() const { return GetCachedCommonUniString(530); }
    virtual C_SmartPtr<I_UniString> str_Substitute() const { return GetCachedCommonUniString(531); }
    virtual C_SmartPtr<I_UniString> str_Substitution() const {
        return GetCachedCommonUniString(532);
    }
    virtual C_SmartPtr<I_UniString> str_SubstitutionFontName() const {
        return GetCachedCommonUniString(533);
    }
    virtual C_SmartPtr<I_UniString> str_SubstitutionFontSpec() const {
        return GetCachedCommonUniString(534);
    }
    virtual C_SmartPtr<I_UniString> str_Summary() const { return GetCachedCommonUniString(535); }
    virtual C_SmartPtr<I_UniString> str_SurfaceHeightInScanlines() const {
        return GetCachedCommonUniString(536);
    }
    virtual C_SmartPtr<I_UniString> str_SurfaceHeightInTiles() const {
        return GetCachedCommonUniString(537);
    }
    virtual C_SmartPtr<I_UniString> str_SurfaceOfDoc() const {
        return GetCachedCommonUniString(538);
    }
    virtual C_SmartPtr<I_UniString> str_SurfaceOfSet() const {
        return GetCachedCommonUniString(539);
    }
    virtual C_SmartPtr<I_UniString> str_SurfaceWidthInPixels() const {
        return GetCachedCommonUniString(540);
    }
    virtual C_SmartPtr<I_UniString> str_SurfaceWidthInTiles() const {
        return GetCachedCommonUniString(541);
    }
    virtual C_SmartPtr<I_UniString> str_SWOP() const { return GetCachedCommonUniString(542); }
    virtual C_SmartPtr<I_UniString> str_Tag() const { return GetCachedCommonUniString(543); }
    virtual C_SmartPtr<I_UniString> str_TagPool() const { return GetCachedCommonUniString(544); }
    virtual C_SmartPtr<I_UniString> str_Text() const { return GetCachedCommonUniString(545); }
    virtual C_SmartPtr<I_UniString> str_TextAntiAliasing() const {
        return GetCachedCommonUniString(546);
    }
    virtual C_SmartPtr<I_UniString> str_TextBlackLevel() const {
        return GetCachedCommonUniString(547);
    }
    virtual C_SmartPtr<I_UniString> str_TextSizeThreshold() const {
        return GetCachedCommonUniString(548);
    }
    virtual C_SmartPtr<I_UniString> str_TextTrapPlacement() const {
        return GetCachedCommonUniString(549);
    }
    virtual C_SmartPtr<I_UniString> str_ThinStrokeLimit() const {
        return GetCachedCommonUniString(550);
    }
    virtual C_SmartPtr<I_UniString> str_ThinStrokeTrapping() const {
        return GetCachedCommonUniString(551);
    }
    virtual C_SmartPtr<I_UniString> str_TiffFileFormat() const {
        return GetCachedCommonUniString(552);
    }
    virtual C_SmartPtr<I_UniString> str_TileHeightInScanlines() const {
        return GetCachedCommonUniString(553);
    }
    virtual C_SmartPtr<I_UniString> str_TileIndexX() const { return GetCachedCommonUniString(554); }
    virtual C_SmartPtr<I_UniString> str_TileIndexY() const { return GetCachedCommonUniString(555); }
    virtual C_SmartPtr<I_UniString> str_TileOffsetInPixels() const {
        return GetCachedCommonUniString(556);
    }
    virtual C_SmartPtr<I_UniString> str_TileOffsetInScanlines() const {
        return GetCachedCommonUniString(557);
    }
    virtual C_SmartPtr<I_UniString> str_TileRange() const { return GetCachedCommonUniString(558); }
    virtual C_SmartPtr<I_UniString> str_TileWidthInBytes() const {
        return GetCachedCommonUniString(559);
    }
    virtual C_SmartPtr<I_UniString> str_TileWidthInPixels() const {
        return GetCachedCommonUniString(560);
    }
    virtual C_SmartPtr<I_UniString> str_TilingType() const { return GetCachedCommonUniString(561); }
    virtual C_SmartPtr<I_UniString> str_Title() const { return GetCachedCommonUniString(562); }
    virtual C_SmartPtr<I_UniString> str_TopCenter() const { return GetCachedCommonUniString(563); }
    virtual C_SmartPtr<I_UniString> str_TopLeft() const { return GetCachedCommonUniString(564); }
    virtual C_SmartPtr<I_UniString> str_TopRight() const { return GetCachedCommonUniString(565); }
    virtual C_SmartPtr<I_UniString> str_TotalCollects() const {
        return GetCachedCommonUniString(566);
    }
    virtual C_SmartPtr<I_UniString> str_TotalSheetCount() const {
        return GetCachedCommonUniString(567);
    }
    virtual C_SmartPtr<I_UniString> str_TotalSheetsInCollect() const {
        return GetCachedCommonUniString(568);
    }
    virtual C_SmartPtr<I_UniString> str_TotalSheetsInPool() const {
        return GetCachedCommonUniString(569);
    }
    virtual C_SmartPtr<I_UniString> str_Toyo() const { return GetCachedCommonUniString(570); }
    virtual C_SmartPtr<I_UniString> str_TransferCurve() const {
        return GetCachedCommonUniString(571);
    }
    virtual C_SmartPtr<I_UniString> str_TransferCurvePool() const {
        return GetCachedCommonUniString(572);
    }
    virtual C_SmartPtr<I_UniString> str_TransferCurveSet() const {
        return GetCachedCommonUniString(573);
    }
    virtual C_SmartPtr<I_UniString> str_TransferFunction() const {
        return GetCachedCommonUniString(574);
    }
    virtual C_SmartPtr<I_UniString> str_TransferFunctionControl() const {
        return GetCachedCommonUniString(575);
    }
    virtual C_SmartPtr<I_UniString> str_TransferFunctionSource() const {
        return GetCachedCommonUniString(576);
    }
    virtual C_SmartPtr<I_UniString> str_Transparent() const {
        return GetCachedCommonUniString(577);
    }
    virtual C_SmartPtr<I_UniString> str_TrapColorScaling() const {
        return GetCachedCommonUniString(578);
    }
    virtual C_SmartPtr<I_UniString> str_TrapColorScalingLimit() const {
        return GetCachedCommonUniString(579);
    }
    virtual C_SmartPtr<I_UniString> str_TrapEmulatedDeviceColor() const {
        return GetCachedCommonUniString(580);
    }
    virtual C_SmartPtr<I_UniString> str_TrapEndStyle() const {
        return GetCachedCommonUniString(581);
    }
    virtual C_SmartPtr<I_UniString> str_TrapJoinStyle() const {
        return GetCachedCommonUniString(582);
    }
    virtual C_SmartPtr<I_UniString> str_TrappingDetails() const {
        return GetCachedCommonUniString(583);
    }
    virtual C_SmartPtr<I_UniString> str_TrappingOrder() const {
        return GetCachedCommonUniString(584);
    }
    virtual C_SmartPtr<I_UniString> str_TrappingParams() const {
        return GetCachedCommonUniString(585);
    }
    virtual C_SmartPtr<I_UniString> str_TrapRegion() const { return GetCachedCommonUniString(586); }
    virtual C_SmartPtr<I_UniString> str_trapRegions() const {
        return GetCachedCommonUniString(587);
    }
    virtual C_SmartPtr<I_UniString> str_TrapWidth() const { return GetCachedCommonUniString(588); }
    virtual C_SmartPtr<I_UniString> str_TrapZone() const { return GetCachedCommonUniString(589); }
    virtual C_SmartPtr<I_UniString> str_TrimBox() const { return GetCachedCommonUniString(590); }
    virtual C_SmartPtr<I_UniString> str_TrimSize() const { return GetCachedCommonUniString(591); }
    virtual C_SmartPtr<I_UniString> str_UCRMap() const { return GetCachedCommonUniString(592); }
    virtual C_SmartPtr<I_UniString> str_UID() const { return GetCachedCommonUniString(593); }
    virtual C_SmartPtr<I_UniString> str_UndistortedScaleToFit() const {
        return GetCachedCommonUniString(594);
    }
    virtual C_SmartPtr<I_UniString> str_UnmarkedSurfaceNumChannels() const {
        return GetCachedCommonUniString(595);
    }
    virtual C_SmartPtr<I_UniString> str_UnmarkedSurfaceOutputChannelLabels() const {
        return GetCachedCommonUniString(596);
    }
    virtual C_SmartPtr<I_UniString> str_Untag() const { return GetCachedCommonUniString(597); }
    virtual C_SmartPtr<I_UniString> str_URL() const { return GetCachedCommonUniString(598); }
    virtual C_SmartPtr<I_UniString> str_URLs() const { return GetCachedCommonUniString(599); }
    virtual C_SmartPtr<I_UniString> str_UseDefaultFont() const {
        return GetCachedCommonUniString(600);
    }
    virtual C_SmartPtr<I_UniString> str_UseFontEmulation() const {
        return GetCachedCommonUniString(601);
    }
    virtual C_SmartPtr<I_UniString> str_UseNewImageMarker() const {
        return GetCachedCommonUniString(602);
    }
    virtual C_SmartPtr<I_UniString> str_UseProcessColorValues() const {
        return GetCachedCommonUniString(603);
    }
    virtual C_SmartPtr<I_UniString> str_UseSpotAliasingToMatchCutSpot() const {
        return GetCachedCommonUniString(604);
    }
    virtual C_SmartPtr<I_UniString> str_UseSubstitutionFont() const {
        return GetCachedCommonUniString(605);
    }
    virtual C_SmartPtr<I_UniString> str_VDP() const { return GetCachedCommonUniString(606); }
    virtual C_SmartPtr<I_UniString> str_VDPParsing() const { return GetCachedCommonUniString(607); }
    virtual C_SmartPtr<I_UniString> str_VDPStats() const { return GetCachedCommonUniString(608); }
    virtual C_SmartPtr<I_UniString> str_VDPStatsAtEndSurface() const {
        return GetCachedCommonUniString(609);
    }
    virtual C_SmartPtr<I_UniString> str_VDPTracking() const {
        return GetCachedCommonUniString(610);
    }
    virtual C_SmartPtr<I_UniString> str_VerticalTiles() const {
        return GetCachedCommonUniString(611);
    }
    virtual C_SmartPtr<I_UniString> str_View() const { return GetCachedCommonUniString(612); }
    virtual C_SmartPtr<I_UniString> str_Warning() const { return GetCachedCommonUniString(613); }
    virtual C_SmartPtr<I_UniString> str_White() const { return GetCachedCommonUniString(614); }
    virtual C_SmartPtr<I_UniString> str_Width() const { return GetCachedCommonUniString(615); }
    virtual C_SmartPtr<I_UniString> str_Width2() const { return GetCachedCommonUniString(616); }
    virtual C_SmartPtr<I_UniString> str_WinAnsiEncoding() const {
        return GetCachedCommonUniString(617);
    }
    virtual C_SmartPtr<I_UniString> str_XObjMgr() const { return GetCachedCommonUniString(618); }
    virtual C_SmartPtr<I_UniString> str_XPVDP() const { return GetCachedCommonUniString(619); }
    virtual C_SmartPtr<I_UniString> str_Xsquare() const { return GetCachedCommonUniString(620); }
    virtual C_SmartPtr<I_UniString> str_Yellow() const { return GetCachedCommonUniString(621); }
    virtual C_SmartPtr<I_UniString> str_Ysquare() const { return GetCachedCommonUniString(622); }
    virtual C_SmartPtr<I_UniString> str_Debug() const { return GetCachedCommonUniString(623); }
    virtual C_SmartPtr<I_UniString> str_PatternCache() const {
        return GetCachedCommonUniString(624);
    }
    virtual C_SmartPtr<I_UniString> str_TagPrivateData() const {
        return GetCachedCommonUniString(625);
    }
};

// The host builds the table and the cache at start-up and releases them at shutdown.
ZYRSTD_API void InitCommonUniStrings();
ZYRSTD_API void ReleaseCommonUniStrings();
// Throws kZYRErrorInvalidFuncCall before InitCommonUniStrings.
ZYRSTD_API IZYRCommonUniStrings* GetCommonUniStrings();
ZYRSTD_API void InitDynamicUniStringCache();
ZYRSTD_API void ReleaseDynamicUniStringCache();
// The object cached first for `s`'s text, or `s` (which may then be cached).
ZYRSTD_API C_SmartPtr<I_UniString> GetUniStringFromDynamicCache(const C_SmartPtr<I_UniString>& s);

} // namespace ZYRStd
