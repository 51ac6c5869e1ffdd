#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"
#include "engine/proc/zmdither.h"
#include "engine/proc/zmoperations.h"
#include "engine/proc/zmpalettes.h"

namespace zm {

struct TZmTextRequest;

/// Keywords that stand for a coordinate of TextOut, resolved for each axis by itself. The margin
/// is 1/20 of the image's side.
inline constexpr std::int32_t TextPosMargin = -901;     ///< the margin
inline constexpr std::int32_t TextPosCenter = -902;     ///< centred, truncated toward zero
inline constexpr std::int32_t TextPosFarMargin = -903;  ///< the margin before the far side
inline constexpr std::int32_t TextPosEnd = -904;        ///< at the far side

/// What an undo item holds.
enum TZmUndoSource : std::uint8_t {
    zmuUnknown,
    zmuImage,
    zmuSelection,
    zmuObject,
    zmuLayer,
    zmuFullLayer,
    zmuObjectsAndLayers,
};

/// What is known of a saved state.
struct TZmUndoStoreInfo {
    std::u16string Caption;
    TZmUndoSource Source = zmuUnknown;
    std::int32_t Operation = kOperationNone;
    std::int32_t MViewIndex = -1;
    std::int32_t LayerIndex = -1;
};

/// Saved images with what is known of each, oldest first; owns them. Indexes count from 0, the
/// oldest, and have to be inside the list unless said otherwise.
class TZmUndoStore {
public:
    /// Appends an item with an empty caption and no layer.
    void Add(std::unique_ptr<TZmBitmap> object, TZmUndoSource source, std::int32_t operation,
             std::int32_t mview_index);
    /// Removes an item; with `free_undo_image` false the image is returned instead of freed.
    std::unique_ptr<TZmBitmap> ClearAt(std::int32_t index, bool free_undo_image);
    void ClearAll();
    std::int32_t Count() const { return static_cast<std::int32_t>(fObjectList.size()); }
    /// Nil outside the list.
    TZmBitmap* GetObject(std::int32_t index) const;
    TZmUndoStoreInfo& GetInfo(std::int32_t index);

private:
    std::vector<std::unique_ptr<TZmBitmap>> fObjectList;
    std::vector<TZmUndoStoreInfo> fInfoList;
};

/// The driver of all image processing, attached to one bitmap. It makes the bitmap ready,
/// records an undo state, hands the region to a pixel routine and tells that the image changed.
/// Operations do not report: an empty bitmap or an unfitting format ends the call silently.
/// Works on the caller's thread; kernel filters report progress from a worker thread.
///
/// A bitmap is the only source of undo states here: sources other than zmuImage belong to viewers
/// and save nothing.
class TZalmoProc {
public:
    /// `has_owner`: components with an owner save undo states by default.
    explicit TZalmoProc(bool has_owner);
    /// Attached to a bitmap that the caller keeps, without undo.
    explicit TZalmoProc(TZmBitmap* bitmap);
    /// The same over a platform bitmap, which takes every change and has no alpha.
    explicit TZalmoProc(TBitmap* bitmap);
    ~TZalmoProc();
    TZalmoProc(const TZalmoProc&) = delete;
    TZalmoProc& operator=(const TZalmoProc&) = delete;

    /// The bitmap worked on; never nil unless nil was attached.
    TZmBitmap* GetAttachedZmBitmap() const { return fZmBitmap; }
    /// Attaches a bitmap that the caller keeps; the processor's own one is freed. Nil detaches.
    void SetAttachedZmBitmap(TZmBitmap* bitmap);
    /// Tells that the bitmap changed. A platform bitmap loses its alpha, against white, and is
    /// marked as modified.
    void Update();

    bool GetAutoUndo() const { return fAutoUndo; }
    void SetAutoUndo(bool auto_undo) { fAutoUndo = auto_undo; }
    bool GetAutoConvertFormat() const { return fAutoConvertFormat; }
    /// With False a format that an operation does not take ends it, instead of a conversion.
    void SetAutoConvertFormat(bool auto_convert) { fAutoConvertFormat = auto_convert; }
    void SetOnProgress(TZmBitmapProgressEvent event) { fOnProgress = std::move(event); }
    void SetOnFinishWork(TZmNotifyEvent event) { fOnFinishWork = std::move(event); }

    // Selection of a bitmap without a view; a new one takes the place of the last.
    /// By rectangle, right and bottom exclusive.
    void Select(const TRect& rect);
    /// By a mask whose corner lies at the image's, which is copied. An empty one selects nothing,
    /// as Deselect. Raises std::bad_alloc without room.
    void SelectMask(TZmMask& mask);
    void Deselect();
    /// Region to work on, x2 and y2 exclusive: the whole bitmap, and False, without a selection
    /// or with an empty one. A selection beside the bitmap gives an empty region, and True. `mask`
    /// is that of a selection by mask, with the region around its pixels, otherwise nil; it stays
    /// valid until the selection changes.
    bool GetReSel(std::int32_t& x1, std::int32_t& y1, std::int32_t& x2, std::int32_t& y2,
                  TZmMask*& mask);

    // Frame of an operation.
    /// True when the operation may run; x2, y2 are exclusive limits. Saves undo first when that
    /// is on. A missing bitmap raises EZmException. For operations that take selections: with a
    /// selection by mask `proc_bitmap` is a copy of the region, with its alpha, which stays the
    /// processor's and lives until the operation ends; otherwise it is the attached bitmap. False
    /// as well when no selected pixel lies on the image, or there is no room for the copy.
    bool BeginImageProcessing(const TZmPixelFormatSet& allowed, std::int32_t& x1, std::int32_t& y1,
                              std::int32_t& x2, std::int32_t& y2, const std::u16string& op_name,
                              TZmBitmap*& proc_bitmap, TZmMask*& mask, std::int32_t operation);
    /// For operations that do not take selections: they work on the attached bitmap.
    bool BeginImageProcessing(const TZmPixelFormatSet& allowed, std::int32_t& x1, std::int32_t& y1,
                              std::int32_t& x2, std::int32_t& y2, const std::u16string& op_name,
                              TZmBitmap*& proc_bitmap, std::int32_t operation);
    /// Ends what the last Begin started, with what that gave: a copy is written back through the
    /// mask, pixels and alpha, and freed.
    void EndImageProcessing(TZmBitmap* proc_bitmap, TZmMask* mask = nullptr);
    /// For operations that only read, with selections: no undo is saved and nothing goes back.
    bool BeginImageAnalysis(const TZmPixelFormatSet& allowed, std::int32_t& x1, std::int32_t& y1,
                            std::int32_t& x2, std::int32_t& y2, TZmBitmap*& proc_bitmap,
                            TZmMask*& mask);
    void EndImageAnalysis(TZmBitmap* proc_bitmap);

    // Undo. Positions count back from the latest item (0); one outside does nothing.
    /// States kept per list, 1 at first; 0 keeps none.
    std::int32_t GetUndoLimit() const { return fUndoLimit; }
    void SetUndoLimit(std::int32_t limit) { fUndoLimit = limit; }
    TZmLocation GetUndoLocation() const { return fUndoLocation; }
    /// Where states are kept: zmMemory, or a temporary file each (zmFile, at first).
    void SetUndoLocation(TZmLocation location) { fUndoLocation = location; }
    /// Saves a copy of the bitmap, dropping the oldest states beyond the limit. An image of one
    /// row or one column is not saved.
    void SaveUndo(TZmUndoSource source, bool clear_redo);
    void SaveUndo(const std::u16string& caption, TZmUndoSource source, bool clear_redo,
                  std::int32_t operation);
    void SaveUndoCaptioned(const std::u16string& caption, TZmUndoSource source);
    void Undo(bool auto_redo) { UndoAt(0, auto_redo); }
    /// Brings a saved state back. With `auto_redo` the present state and all states newer than
    /// the wanted one go to the redo list, and the wanted item leaves this list, so that repeated
    /// calls walk back in time. Otherwise the lists stay as they are, until ClearUndo.
    void UndoAt(std::int32_t position, bool auto_redo);
    /// Restores an inclusive rectangle from the newest item.
    void UndoRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2);
    void ClearUndo();
    void ClearUndoAt(std::int32_t position);
    void ClearAllUndo() { fUndoList.ClearAll(); }
    std::int32_t GetUndoCount() const { return fUndoList.Count(); }
    /// Item by position from the latest; nil outside.
    const TZmUndoStoreInfo* GetUndoInfo(std::int32_t position);
    // The same for the redo list.
    void SaveRedo(const std::u16string& caption, TZmUndoSource source, std::int32_t operation);
    void Redo(bool auto_undo) { RedoAt(0, auto_undo); }
    void RedoAt(std::int32_t position, bool auto_undo);
    void ClearRedo();
    void ClearRedoAt(std::int32_t position);
    void ClearAllRedo() { fRedoList.ClearAll(); }
    std::int32_t GetRedoCount() const { return fRedoList.Count(); }
    const TZmUndoStoreInfo* GetRedoInfo(std::int32_t position);
    void SetOnSaveUndo(std::function<void(void* sender, TZmUndoSource source)> event) {
        fOnSaveUndo = std::move(event);
    }
    /// Fires after a state was brought back.
    void SetOnUndoRedoEvent(TZmNotifyEvent event) { fOnUndoRedoEvent = std::move(event); }

    // Size; the sizing rule is CalcResampleSize. Selections are ignored.
    /// Resizes the attached bitmap in place: the image and its alpha plane, not its file
    /// parameters, events and place settings. Exactly the present size, two negative sizes or a
    /// size without room: nothing happens.
    void Resample(std::int32_t new_width, std::int32_t new_height, TResampleFilter filter,
                  bool maintain_aspect_ratio);
    /// Both sides times `scale_by`, rounded; a factor that is not above 0 does nothing.
    void Resample(double scale_by, TResampleFilter filter);
    /// Writes the resized image to `target`, another bitmap, and leaves the attached one. A size
    /// without room leaves `target` empty.
    void ResampleTo(TZmBitmap* target, std::int32_t new_width, std::int32_t new_height,
                    TResampleFilter filter, bool maintain_aspect_ratio);

    // Rotation and flips of the whole bitmap (engines: the rotation header). Selections are
    // ignored; an angle of 0, or no finite number, does nothing.
    /// A background of -1 is the processor's own colour.
    void Rotate(double angle, TZmAntialiasMode mode, TColor background);
    void Rotate(double angle, bool antialias, TZmAntialiasMode mode, TColor background);
    void Flip(TFlipDir direction);
    TColor GetBackground() const { return fBackground; }
    /// Colour of what a growing image leaves free; black at first.
    void SetBackground(TColor color) { fBackground = color; }

    // Text over pixels and alpha plane. The image moves to the place zmTBitmap, where its canvas
    // is, with that place's formats: zm16g becomes zm8g, deeper ones raise EZmException and stay.
    // The canvas font keeps what was asked for, all but its colour. Selections are ignored. Raises
    // EZmException "Cannot create TZmCanvas. Ensure GDI+ is installed on system." where the
    // platform's drawing library is missing.
    /// From the top left corner (or keywords) of the text's box on, turned about that corner by
    /// degrees counter-clockwise. `bAntiAlias`: glyphs have coverage; otherwise whole pixels, and
    /// the plane stays. `bAutoEnlarge`: an image that is smaller than the turned box grows to its
    /// size first; new pixels have the processor's colour, and the alpha of the corner pixel.
    void TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text, const TFont& AFont,
                 std::int32_t Angle, bool bAntiAlias, bool bAutoEnlarge);
    /// The same in the canvas font with another colour and style, and another name and size
    /// (points) unless the name is empty or the size not above 0.
    void TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text,
                 const std::u16string& sFontName, std::int32_t iFontSize, TColor cFontColor,
                 TFontStyles Style, std::int32_t Angle, bool bAntiAlias, bool bAutoEnlarge);
    /// Wrapped in a rectangle, with coverage.
    void TextOut(const TRect& Rect, const std::u16string& Text, const TFont& AFont,
                 std::int32_t Angle);
    void TextOut(const TRect& Rect, const std::u16string& Text, const std::u16string& sFontName,
                 std::int32_t iFontSize, TColor cFontColor, TFontStyles Style, std::int32_t Angle);

    // Colours and formats.
    /// Reduces the image to at most 3 to 1024 colours (other counts do nothing), found by
    /// TZmQuantizer; it becomes zm24RGB. zmThreshold takes the found colour of each pixel,
    /// zmOrdered and zmDithering spread what is missing (zmdtOrdered8x8, zmdtErrorDiffusion).
    /// Colours that are in the palette stay.
    void ConvertTo(std::int32_t num_colors, TZmDitherMethod dither_method);
    /// The same with given colours, 1 to 256, which become the palette of a zm8p image.
    void ConvertToPalette(const std::vector<TRGB>& colors, TZmDitherMethod dither_method);
    /// Converts to a format. For zm8p the palette type and the dither type apply (zmptMedianCut:
    /// 256 colours found for the image; a zm8p image then keeps its own). zm1g needs zmptFixedBW:
    /// zmdtSolid cuts at the automatic level, zmdtOrdered8x8 as the format conversion does. Other
    /// formats ignore both types. False for what cannot be converted so, which
    /// `check_parameters_only` only asks, and when there is no room.
    bool ConvertTo(TZmPixelFormat format, TZmPaletteType palette_type, TZmDitherType dither_type,
                   bool check_parameters_only);

    // Clipboard.
    /// Takes the first picture there, in the order: raw form, PNG, device-independent bitmap,
    /// enhanced metafile; one that cannot be read is passed over. Without a selection it becomes
    /// the image. A selection takes it instead, with `stretch` at the selection's size, and with
    /// `merge_alpha` by the picture's alpha; the image is then zm24RGB and its own plane stays.
    /// False, and the image as it was, when there is none or the clipboard cannot be opened.
    bool PasteFromClipboard(bool stretch, bool merge_alpha);

private:
    void PasteIntoSelection(TZmBitmap& picture, bool stretch, bool merge_alpha);
    void DrawTextRequest(TZmTextRequest& request);
    TFont NamedFont(const std::u16string& name, std::int32_t size, TColor color,
                    TFontStyles style) const;
    void ReduceColors(const std::u16string& caption, std::int32_t operation,
                      const std::function<void(TZmBitmap& image)>& reduce);
    bool MakeConsistent(const TZmPixelFormatSet& allowed, bool check_view);
    void RequireBitmap() const;
    void SaveUndoOfOperation(const std::u16string& caption, std::int32_t operation);
    void CutRegion(std::int32_t& x1, std::int32_t& y1, std::int32_t& x2, std::int32_t& y2);
    std::unique_ptr<TZmBitmap> CopyState(TZmUndoSource source);
    void StoreItem(TZmUndoStore& store, std::unique_ptr<TZmBitmap> item,
                   const TZmUndoStoreInfo& info);
    void AddUndoItem(TZmUndoStore& store, const std::u16string& caption, TZmUndoSource source,
                     std::int32_t operation);
    void MoveState(TZmUndoStore& from, TZmUndoStore& to, std::int32_t position, bool record);
    void RecordStates(TZmUndoStore& from, TZmUndoStore& to, std::int32_t index);

    bool fAutoUndo = false;
    TColor fBackground = 0;
    TZmBitmap* fZmBitmap = nullptr;
    std::unique_ptr<TZmBitmap> fOwnedBitmap;
    bool fAutoConvertFormat = true;
    bool fSelected = false;
    TRect fSelectedRect;
    /// The selection by mask, never an empty one.
    std::unique_ptr<TZmMask> fSelectionMask;
    /// The copy of the masked region while an operation runs.
    std::unique_ptr<TZmBitmap> fRegionBitmap;
    TZmUndoStore fUndoList;
    TZmUndoStore fRedoList;
    TZmLocation fUndoLocation = zmFile;
    std::int32_t fUndoLimit = 1;
    std::function<void(void*, TZmUndoSource)> fOnSaveUndo;
    TBitmap* fBitmap = nullptr;
    TZmBitmapProgressEvent fOnProgress;
    TZmNotifyEvent fOnFinishWork;
    std::int32_t fMViewIndex = -1;
    TZmNotifyEvent fOnUndoRedoEvent;
};

}  // namespace zm
