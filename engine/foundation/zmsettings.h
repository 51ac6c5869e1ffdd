#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// The process-wide defaults of the engine.
///
/// One object, made on the first call of ZmGlobalSettings. It is written during set-up only;
/// afterwards every thread reads it without a lock. Nothing is kept on disk.
namespace zm {

class TStream;
class TBitmap;
class TTIFFLZWDecodeState;
class TTIFFLZWEncodeState;
struct TZmFileFormatInfo;
struct TZmGIFLZWDecodeCall;
struct TZmGIFLZWEncodeCall;
struct TZmConvertColorCall;

/// Languages of the texts that the engine shows; msSystem follows the user's locale.
enum TMsgLanguage : std::uint8_t {
    msSystem,
    msEnglish,
    msItalian,
    msGerman,
    msSpanish,
    msFrench,
    msPortuguese,
    msGreek,
    msRussian,
    msDutch,
    msSwedish,
    msPolish,
    msJapanese,
    msCzech,
    msFinnish,
    msFarsi,
    msChinese,
    msChineseTraditionalBig5,
    msDanish,
    msTurkish,
    msKorean,
    msHungarian,
    msArabic,
    msSerbian,
    msNorwegian,
};
inline constexpr int kMsgLanguageCount = 25;

/// Versions of the operating system; the order counts, later ones being Unicode systems.
enum TZmOpSys : std::uint8_t {
    zmosWin95,
    zmosWin98,
    zmosWinME,
    zmosWinNT4,
    zmosWin2000,
    zmosWinXP,
    zmosWin2003,
    zmosWinVista,
    zmosWin7,
    zmosWin8,
    zmosWin10,
    zmosUnknown,
};

/// Background of preview pictures; further values belong to the viewers.
enum TZmBackgroundStyle : std::uint8_t { zmbsSolid };

/// How the pixel range of a DICOM image is found.
enum TZmDICOMWindowingStrategy : std::uint8_t {
    zmwsUseProvidedPixelRanges,
    zmwsCalculateFromBitsStored,
    zmwsCalculateFromActualPixels,
};

enum TZmDialogBackgroundStyle : std::uint8_t { zmdbDefault, zmdbPaper, zmdbMetal, zmdbCustom };

enum TZmCameraRawEngine : std::uint8_t { zmcrAuto, zmcrLibRaw, zmcrWIC, zmcrDCRaw };

/// Use of the interoperability index of an EXIF block in finding the colour space.
enum TZmEXIFInteroperabilityIndexUsage : std::uint8_t {
    zmiiNone,
    zmiiApplyOnly,
    zmiiApplyAndReset,
};

/// What happens to EXIF maker notes.
enum TZmEXIFMakerNotesHandling : std::uint8_t { zmmhDiscard, zmmhPreserve };

/// LZW coders of the GIF codec. The call records are the codec's; a call reports bad data in its
/// record.
using TGIFLZWDecompFunc = void (*)(TZmGIFLZWDecodeCall& call);
using TGIFLZWCompFunc = void (*)(TZmGIFLZWEncodeCall& call);

/// One row of `row_bytes` bytes, or nil when the data ended or are bad. A first call with a nil
/// state makes it; a call with a nil source and a live state frees it. `fill_order` 2 reverses
/// the bits of each source byte.
using TTIFFLZWDecompFunc = std::uint8_t* (*)(const std::uint8_t* source, std::int32_t source_bytes,
                                             std::int32_t row_bytes, TTIFFLZWDecodeState*& state,
                                             std::int32_t fill_order);
/// Compresses one row to the stream. A first call with a nil state makes it; a nil row flushes
/// and frees it.
using TTIFFLZWCompFunc = void (*)(const std::uint8_t* row, std::int32_t row_bytes, TStream& output,
                                  TTIFFLZWEncodeState*& state);

/// Converts a row from a file's colour layout to the bitmap's.
using TZmConvertColorFunction = void (*)(const TZmConvertColorCall& call);

/// Typeface of the dialogs.
struct TZmFontRecord {
    std::u16string Name;
    std::int32_t Size = 0;   ///< points
    std::uint8_t Style = 0;  ///< bit 0 bold, 1 italic, 2 underline, 3 strike-out
};

/// Pen of a grid, as a new pen stands: solid, black, one pixel wide.
struct TZmPenRecord {
    TColor Color = 0;
    std::int32_t Width = 1;
    std::uint8_t Style = 0;
};

struct TZmHintStyle {
    TColor BorderColor = static_cast<TColor>(0xFF000015);
    TColor FillColor = 0xFFFFFF;
    std::int32_t Transparency = 128;
};

/// Look of the transition that draws a word.
struct TZmWordTransitionParams {
    std::u16string Word = u"A";
    std::u16string FontName = u"Arial";
    std::uint8_t Style = 1;  ///< font style bits; 1 is bold
    std::uint16_t Quality = 200;
};

/// Defaults that `TIOParams` takes over. Enumerations of the file parameters stand here by
/// their ordinals.
struct TIOParamDefaults {
    bool EnableAdjustOrientation = false;
    bool RAW_AutoAdjustColors = false;
    bool RAW_HalfSize = false;
    bool RAW_GetEmbeddedJpeg = false;
    std::int32_t RAW_EmbeddedJpegMinWidth = 800;
    std::int32_t RAW_EmbeddedJpegMinHeight = 800;
    std::uint8_t RAW_EmbeddedJpegLoading = 0;
    std::uint8_t RAW_Interpolation = 0;
    bool RAW_QuickInterpolate = true;
    bool RAW_UseAutoWB = false;
    bool RAW_UseCameraWB = false;
    std::uint8_t JPEG_DCTMethod = 0;
    std::int32_t JPEG_Quality = 80;
    std::uint8_t JPEG_Scale = 1;  ///< full size
    bool PSD_LoadLayers = false;
    std::uint8_t DICOM_Range = 0;
};

/// Buttons or entries that a viewer's toolbar or popup menu shows, one bit each.
struct TZmButtonSet {
    std::u16string Name;
    std::uint64_t Buttons = ~std::uint64_t{0};
};

/// A toolbar that wants to hear of changed settings. Borrowed by the settings between AddToolbar
/// and RemoveToolbar.
class TZmToolbar {
public:
    virtual ~TZmToolbar() = default;
    virtual void Update(bool full_update) = 0;
};

/// A short cut: key code in the low byte, kShortCutCtrl and the like above it.
using TShortCut = std::uint16_t;
inline constexpr TShortCut kShortCutCtrl = 0x4000;

class TZmZalmoGlobalSettings {
public:
    /// Takes the values that depend on the machine from the platform.
    TZmZalmoGlobalSettings();
    ~TZmZalmoGlobalSettings();
    TZmZalmoGlobalSettings(const TZmZalmoGlobalSettings&) = delete;
    TZmZalmoGlobalSettings& operator=(const TZmZalmoGlobalSettings&) = delete;

    /// The language in force: `fMsgLanguage`, or the locale's when that is msSystem.
    TMsgLanguage CurrentMsgLanguage() const;
    bool MsgLanguage_IsEnglish() const { return CurrentMsgLanguage() == msEnglish; }
    /// Languages on offer, in the order of their ordinals; with `full_only` without those whose
    /// translation is partial.
    std::vector<TMsgLanguage> GetLanguages(bool full_only) const;
    /// Row of the format registry, or nil outside it. Owned by `fFileFormats`.
    TZmFileFormatInfo* GetFileFormat(std::int32_t index) const;
    void AddToolbar(TZmToolbar* toolbar);
    void RemoveToolbar(TZmToolbar* toolbar);
    void UpdateToolbars(bool full_update);

    TMsgLanguage fMsgLanguage = msSystem;
    std::int32_t fDefaultCoresCount = -1;  ///< -1 unknown; ZmCoreCount finds it
    std::int32_t fBufferedReadStreamSize = 1024;
    TZmOpSys fOpSys = zmosUnknown;
    bool fUnicodeOS = true;
    TResampleFilter fDefaultPreviewsZoomFilter = rfFastLinear;
    TResampleFilter fDefaultResampleFilter = rfFastLinear;
    TZmAntialiasMode fDefaultRotateAntiAlias = zmrFast;
    std::uint8_t fDefDialogCenter = 0;
    std::optional<TZmFontRecord> fDefaultDialogFont;
    /// Smallest image in bytes that goes to disk; negative: derived from the physical memory.
    std::int64_t fDefMinFileSize = -1;
    std::int32_t fDefaultPreviewHistogramScale = 1;
    bool fAutoLocateOnDisk = true;
    bool fAutoFragmentBitmap = true;
    bool fUseGDIPlus = true;
    bool fUseButtonGlyphsInDialogs = false;
    TZmBackgroundStyle fPreviewImageBackgroundStyle = zmbsSolid;
    TColor fPreviewImageBackgroundColor = static_cast<TColor>(0xFF00000F);
    std::string fPreviewAdditionalMultipageExts = "mpg,mpeg,wmv,avi";
    std::int32_t fSystemColors = 0;  ///< bits per pixel of the screen
    bool fIsRemoteSession = false;
    std::int32_t fSystemDPIX = 0;  ///< pixels per inch of the screen
    std::int32_t fSystemDPIY = 0;
    std::int32_t fDefaultDPIX = 300;  ///< resolution of images whose file tells none
    std::int32_t fDefaultDPIY = 300;
    bool fMMX = false;
    std::int32_t fEdgeX = 0;  ///< width of a raised window edge
    std::int32_t fEdgeY = 0;
    std::int32_t fBorderX = 0;  ///< width of a window border
    std::int32_t fBorderY = 0;
    std::int32_t fVScrollWidth = 0;
    std::int32_t fHScrollHeight = 0;
    std::int32_t fMinZoomDisplayGrid = 400;   ///< percent
    std::int32_t fCustomHintTimeout = 10000;  ///< milliseconds
    std::int32_t fGridMajorStep = 0;
    std::int32_t fGuidelineCount = 5;
    TZmPenRecord fGridPen;
    TColor fSelectionGridColor = 0xA0A0A0;
    std::string fMViewExplorerThumbnailExts =
        "*.AVI;*.MPG;*.MPE;*.MPEG;*.WMV;*.ASF;*.IVF;*.WM;*.MP4;*.MOV;*.QT;*.RM;*.M2TS;*.MTS;"
        "*.MOD;";
    TGIFLZWDecompFunc fDefGIF_LZWDECOMPFUNC = nullptr;  ///< installed by the GIF codec
    TGIFLZWCompFunc fDefGIF_LZWCOMPFUNC = nullptr;
    TTIFFLZWDecompFunc fDefTIFF_LZWDECOMPFUNC = nullptr;  ///< installed by the TIFF codec
    TTIFFLZWCompFunc fDefTIFF_LZWCOMPFUNC = nullptr;
    /// The format registry, filled by the I/O room. Shared so that the row type can stay
    /// incomplete here; this list is the owner.
    std::vector<std::shared_ptr<TZmFileFormatInfo>> fFileFormats;
    bool fUseCMYKProfile = true;
    bool fUseDefaultFileExists = false;
    std::int32_t fMaxImageEMFSize = 8000;
    std::int32_t fMaxImageEMFMatrixSize = 64000000;
    std::u16string fDefTempPath;  ///< folder of temporary files; empty: the system's
    TZmConvertColorFunction fConvertColorFunction = nullptr;  ///< installed by the colour room
    bool fEnableCMS = false;
    std::int32_t fColorReductionAlgorithm = -1;  ///< -1 automatic
    std::int32_t fColorReductionQuality = -1;    ///< -1 automatic
    std::int32_t fObjectsTIFFTag = 40101;
    bool fUseRelativeStreams = false;
    TResampleFilter fPanZoomQualityFilter = rfNone;
    std::int32_t fRedToGrayCoef = 21;  ///< percent
    std::int32_t fGreenToGrayCoef = 71;
    std::int32_t fBlueToGrayCoef = 8;
    TZmEXIFInteroperabilityIndexUsage fEXIFInteroperabilityIndexUsage = zmiiApplyAndReset;
    TZmEXIFMakerNotesHandling fEXIFMakerNotesHandling = zmmhPreserve;
    double fPrintDialogMarginsIncrement = 0.01;
    double fPrintDialogMarginsMinValue = 0;
    TZmWordTransitionParams fWordTransitionParams;
    bool fTransitionsDrawAlternative = false;
    std::uint8_t fTransitionsDrawShape = 15;  ///< ordinal of the shape
    bool fApplyColorProfileOnRendering = true;
    bool fReleaseTwainResources = false;
    std::uint32_t fTwainTransferBufferSize = 1048576;
    bool fTwainCropBufferedTransferedImage = true;
    bool fModelessSelectTwainSource = false;
    bool fIsInsideTwain = false;
    std::int32_t fIOPreviewsDialogWidth = 0;
    std::int32_t fIOPreviewsDialogHeight = 0;
    std::int32_t fImageProcMaxThreads = 4;
    std::int64_t fImageProcThreadsMinSize = 65536;  ///< pixels
    bool fDICOMKeepMainImageTag = false;
    TZmDICOMWindowingStrategy fDICOMWindowingStrategy = zmwsCalculateFromActualPixels;
    std::int32_t fJPEG2000SliceMemoryThreshold = 300000000;  ///< bytes
    TZmDialogBackgroundStyle fDialogBackgroundStyle = zmdbDefault;
    std::shared_ptr<TBitmap> fDialogBackgroundImage;
    std::u16string fProxyAddress;
    std::u16string fProxyUser;
    std::u16string fProxyPassword;
    TZmCameraRawEngine fCameraRawEngine = zmcrAuto;
    std::int32_t fOpenDialogMaxMultiSelFiles = 1000;
    std::string fWICFileTypes;  ///< further extensions for the system's own decoders
    bool fUseEXIFDateTime = false;
    std::int32_t fThumbnailSize = 250;  ///< pixels
    std::uint8_t fDefaultLayerShape = 0;
    std::u16string fDefaultLayerText;
    bool fDefaultLayerEnableFormatting = false;
    bool fEnableTheming = true;
    bool fUTF8EncodeImagingAnnot = true;
    std::int32_t fMeasureDecimalPlaces = 2;
    TIOParamDefaults fIOParamDefaults;
    std::uint8_t fDefaultMeasureUnit = 0;  ///< index into MeasureUnits
    std::int32_t fLayerCurveQuality = 4;
    std::uint8_t fLayerFastDrawingEffects = 183;  ///< set, one bit an effect
    std::int32_t fLayerShadowAlphaThreshold = 50;
    bool fLayerPropertiesAdvancedTab = false;
    std::int32_t fLayerPropertiesDialogWidth = 0;
    std::int32_t fLayerPropertiesDialogHeight = 0;
    std::int32_t fLayerRotationGripMaxDist = 70;
    std::u16string fDLLLoadingLog;
    TZmHintStyle fHintStyle;
    std::string fColorDialogCustomColors;
    bool fUseWindowsOpenSaveDialogs = false;
    std::int32_t fPolygonAutoCloseDistance = 10;
    bool fZmVectBeingUsed = false;
    std::uint8_t fClipboardCopyFormats = 1;  ///< set, one bit a format
    std::vector<TZmButtonSet> fToolbarSets;  ///< none named: every button shows
    std::vector<TZmButtonSet> fPopupMenuSets;
    std::int32_t fPopupMenuImageHue = 0;
    /// Ctrl with L, E, R, J, C, X, V, F, B, I, U, G.
    std::array<TShortCut, 12> MemoShortCuts{
        kShortCutCtrl | 76, kShortCutCtrl | 69, kShortCutCtrl | 82, kShortCutCtrl | 74,
        kShortCutCtrl | 67, kShortCutCtrl | 88, kShortCutCtrl | 86, kShortCutCtrl | 70,
        kShortCutCtrl | 66, kShortCutCtrl | 73, kShortCutCtrl | 85, kShortCutCtrl | 71};
    std::array<std::u16string, 11> MeasureUnits{u"pixels", u"inches", u"km",      u"m",
                                                u"cm",     u"mm",     u"microns", u"nanometers",
                                                u"feet",   u"yards",  u"miles"};

private:
    std::vector<TZmToolbar*> toolbars_;
};

/// The settings; made on the first call, which may come from any thread.
TZmZalmoGlobalSettings& ZmGlobalSettings();

/// Frees the settings; a later call of ZmGlobalSettings makes them anew with their defaults. No
/// other thread may use them meanwhile.
void DestroySingletonInstance();

/// A room above the foundation fills its part of the settings (format rows, coder functions)
/// through such a function.
using TZmSettingsInitializer = void (*)(TZmZalmoGlobalSettings& settings);

/// `initializer` runs once on every settings object: on the present one now, when there is
/// one, and on each that is made later. A function that is known already is ignored. False only
/// when 32 others are known; a namespace-scope constant can hold the call.
bool AddSettingsInitializer(TZmSettingsInitializer initializer);

/// Counted use of the library by modules of one process: the first ZmInitializeLibrary makes the
/// settings, the last ZmFinalizeLibrary frees them. A ZmFinalizeLibrary without its counterpart
/// does nothing.
void ZmInitializeLibrary();
void ZmFinalizeLibrary();

/// The language that a locale name such as "de_DE.UTF-8" or "zh-TW" stands for; msEnglish for
/// unknown names.
TMsgLanguage MsgLanguageOfLocale(const std::string& locale_name);

}  // namespace zm
