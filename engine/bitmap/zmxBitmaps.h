#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/bitmap/zmbitmapenums.h"
#include "engine/bitmap/zmbitmapstate.h"
#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmsurface.h"
#include "engine/foundation/zmdefs.h"

namespace zm {

class TIOParams;
class TStream;
class TZmDibbitmap;
class TZmMask;
struct TZmRowLayout;

/// `FillColor` of Crop that means: leave the grown area as allocated.
inline constexpr TColor kCropNoFill = 0x1FFFFFFF;

/// The image container of the whole engine. Pixels have one addressing model, by row, over four
/// storage places: one block of memory, fragments of memory, a temporary file mapped row by row,
/// and a platform bitmap. Code asks for a row and never learns where it lies.
///
/// Coordinates have their origin at the top left; x1, y1 and x2, y2 of a region are inclusive
/// unless said otherwise. An image whose width, height, row length or bit count is 0 is empty.
///
/// Alpha is no channel of the pixel but a second bitmap of format `zm8g`, 255 opaque, owned by
/// the image. Typed pixel access and rows do not test their arguments in release builds.
///
/// Drawing, the display adjustments, canvases and clipboard are members of the base classes.
///
/// Not thread-safe, not even for reading rows of a file-backed image through GetScanLine.
class TZmBitmap : public TZmBitmapSurface {
public:
    // Construction.
    TZmBitmap();
    TZmBitmap(std::int32_t width, std::int32_t height, TZmPixelFormat format);
    /// A copy of another bitmap / of a rectangle of it (right and bottom exclusive).
    explicit TZmBitmap(TZmBitmap& source);
    TZmBitmap(TZmBitmap& source, const TRect& rect);
    /// The image of a file, found by extension, then by content (see Read, which may raise).
    /// Empty when the load fails.
    TZmBitmap(const std::u16string& file_name, TIOParams* params);
    /// A copy of a platform bitmap / of a rectangle of it.
    explicit TZmBitmap(TBitmap& source);
    TZmBitmap(TBitmap& source, const TRect& rect);
    /// Borrows pixels, top row first, rows aligned to 32 bits (see EncapsulateMemory).
    TZmBitmap(void* memory, std::int32_t width, std::int32_t height, TZmPixelFormat format);
    ~TZmBitmap() override;

    // Size and format. Getters first look at a platform bitmap that may have changed.
    std::int32_t GetBitCount() override;
    std::int32_t GetChannelCount();
    std::int32_t GetHeight() override;
    std::int32_t GetWidth() override;
    void SetWidth(std::int32_t width) override;
    void SetHeight(std::int32_t height) override;
    TZmPixelFormat GetPixelFormat() override;
    /// Converts the pixels to another format (see CopyAndConvertFormat). A conversion that finds
    /// no room leaves the bitmap as it was and returns False.
    bool SetPixelFormat(TZmPixelFormat format);
    std::int64_t GetRowLen() override;
    bool IsEmpty();

    // Storage.
    /// With the size and format that the bitmap already has, nothing is done to the pixels unless
    /// fFullReallocate is set. Sizes below 1, unknown formats, rows beyond 32 bits and images that
    /// no place has room for give False and size 0.
    bool Allocate(std::int32_t width, std::int32_t height, TZmPixelFormat format) override;
    bool Allocate(std::int32_t width, std::int32_t height, TColor fill_color,
                  std::int32_t alpha) override;
    /// Frees the pixels, and the alpha plane when asked. The format is kept.
    void FreeImage(bool free_alpha);
    /// FreeImage with the alpha, and the format zmnull.
    void Clear();
    /// Borrows a platform bitmap; the caller keeps it alive longer than this object uses it.
    void EncapsulateTBitmap(TBitmap* bitmap, bool do_free_image);
    /// Borrows rows in memory, aligned to fBitAlignment, in the order that `origin` tells.
    void EncapsulateMemory(void* memory, std::int32_t width, std::int32_t height,
                           TZmPixelFormat format, bool do_free_image, TZmBitmapOrigin origin);
    /// Hands the image over without a copy; this object is left empty and ready.
    void SwitchTo(TZmBitmap* target);
    /// Pushes a copy of the image on a stack / brings the last one back.
    void SaveState();
    void RestoreState();
    void UpdateFromTBitmap();
    /// AssignEx with / without file parameters.
    void Assign(TZmBaseBitmap* source) override;
    void AssignImage(TZmBaseBitmap* source) override;
    /// Copies pixels, palette, alpha plane, row alignment and the display settings; where the
    /// pixels go stays this object's own choice (location, file limit, allocator, origin). File
    /// name, type and, when the source has some, file parameters follow only when asked. Without
    /// room this bitmap is empty afterwards.
    void AssignEx(TZmBaseBitmap* source, bool with_params);

    TZmLocation GetLocation() const { return fLocation; }
    /// The place for the next allocation; allocation may choose between memory and file itself.
    /// Pixels that are there already move at once; without room they stay where they are.
    void SetLocation(TZmLocation location);
    std::int64_t GetMinFileSize() const { return fMinFileSize; }
    void SetMinFileSize(std::int64_t bytes) { fMinFileSize = bytes; }
    TZmMemoryAllocator GetMemoryAllocator() const { return fMemoryAllocator; }
    void SetMemoryAllocator(TZmMemoryAllocator allocator) { fMemoryAllocator = allocator; }
    std::int32_t GetBitAlignment() const { return fBitAlignment; }
    /// Row alignment in bits for the next allocation: a power of two from 8 to 1024.
    void SetBitAlignment(std::int32_t bits);
    TZmBitmapOrigin GetOrigin() const { return fOrigin; }
    void SetOrigin(TZmBitmapOrigin origin) { fOrigin = origin; }
    std::int32_t GetFragmentsCount() const { return fFragmentsCount; }
    bool GetFullReallocate() const { return fFullReallocate; }
    void SetFullReallocate(bool full) { fFullReallocate = full; }
    /// First byte of a memory image (its last row with the default origin); nil elsewhere.
    std::uint8_t* GetMemory() const { return fMemory; }

    // Rows.
    std::uint8_t* GetScanLine(std::int32_t row) override;
    /// As GetScanLine, but the row of a file-backed image stays valid until FreeRow.
    virtual std::uint8_t* GetRow(std::int32_t row);
    virtual void FreeRow(std::int32_t row);
    /// Address of pixel `col` of a row (formats of whole bytes).
    virtual std::uint8_t* GetSegment(std::int32_t row, std::int32_t col, std::int32_t width);
    void SetAccess(TZmDataAccess access) { fAccess = access; }

    // Palette (256 entries for zm8p, else empty).
    const std::vector<TRGB>& GetPaletteArray() override { return fRGBPalette; }
    TRGB GetPalette(std::int32_t index) override;
    void SetPalette(std::int32_t index, TRGB value) override;
    std::int32_t GetPaletteLen() override;
    std::int32_t GetPaletteUsed() override { return fPaletteUsed; }
    void SetPaletteUsed(std::int32_t count) override;
    void CopyPaletteTo(TZmBaseBitmap* dest) override;
    void SetGrayPalette();

    // Typed pixel access, no range test in release builds.
    bool GetPixels_zm1g(std::int32_t x, std::int32_t y);
    void SetPixels_zm1g(std::int32_t x, std::int32_t y, bool value);
    std::uint8_t GetPixels_zm8(std::int32_t x, std::int32_t y);
    void SetPixels_zm8(std::int32_t x, std::int32_t y, std::uint8_t value);
    std::uint16_t GetPixels_zm16g(std::int32_t x, std::int32_t y);
    void SetPixels_zm16g(std::int32_t x, std::int32_t y, std::uint16_t value);
    TRGB GetPixels_zm24RGB(std::int32_t x, std::int32_t y);
    void SetPixels_zm24RGB(std::int32_t x, std::int32_t y, TRGB value);
    TRGB* GetPPixels_zm24RGB(std::int32_t x, std::int32_t y);
    TRGBA GetPixels_zm32RGB(std::int32_t x, std::int32_t y);
    void SetPixels_zm32RGB(std::int32_t x, std::int32_t y, TRGBA value);
    TRGBA* GetPPixels_zm32RGB(std::int32_t x, std::int32_t y);
    float GetPixels_zm32f(std::int32_t x, std::int32_t y);
    void SetPixels_zm32f(std::int32_t x, std::int32_t y, float value);
    TCMYK GetPixels_zmCMYK(std::int32_t x, std::int32_t y);
    void SetPixels_zmCMYK(std::int32_t x, std::int32_t y, TCMYK value);
    TCIELab GetPixels_zmCIELab(std::int32_t x, std::int32_t y);
    void SetPixels_zmCIELab(std::int32_t x, std::int32_t y, TCIELab value);
    TRGB48 GetPixels_zm48RGB(std::int32_t x, std::int32_t y);
    void SetPixels_zm48RGB(std::int32_t x, std::int32_t y, TRGB48 value);
    TRGB48* GetPPixels_zm48RGB(std::int32_t x, std::int32_t y);
    /// Any format, as RGB.
    TRGB GetPixels(std::int32_t x, std::int32_t y);
    void SetPixels(std::int32_t x, std::int32_t y, TRGB value);
    /// Alpha of a pixel; 255 without a plane. Setting creates the plane.
    std::uint8_t GetAlpha(std::int32_t x, std::int32_t y);
    void SetAlpha(std::int32_t x, std::int32_t y, std::uint8_t value);

    // Formats.
    /// Fills this allocated bitmap from one of the same size and another format; does nothing
    /// when the sizes differ. The source may change its own format on the way (the routes
    /// through zm24RGB). The source's alpha plane is copied along.
    void CopyAndConvertFormat(TZmBitmap* source);
    /// Whether the format is one of `allowed` (an empty set allows all); otherwise, with
    /// `auto_convert`, converts to the best allowed format and returns True.
    bool CheckFormat(const TZmPixelFormatSet& allowed, bool auto_convert);
    /// A grey format; zm24RGB, zm32RGB, zm48RGB with equal channels in all pixels; zm8p with
    /// equal channels in all used entries.
    bool IsGrayScale();
    TZmDitherMethod GetDefaultDitherMethod() const { return fDefaultDitherMethod; }
    void SetDefaultDitherMethod(TZmDitherMethod method) { fDefaultDitherMethod = method; }

    // Alpha.
    /// The plane, created all opaque when there is none; nil on a plane itself.
    TZmBitmap* GetAlphaChannel() override;
    /// The plane or nil; never creates one.
    TZmBitmap* GetAlphaChannelRaw() override { return fAlphaChannel.get(); }
    static std::unique_ptr<TZmBitmap> CreateAsAlphaChannel(std::int32_t width, std::int32_t height,
                                                           TZmLocation location);
    bool HasAlphaChannel() const { return fAlphaChannel != nullptr; }
    /// Frees the plane; with `merge` zm24RGB pixels first take the background by their alpha.
    void RemoveAlphaChannel(bool merge, TColor background);
    void ReplaceAlphaChannel(std::unique_ptr<TZmBitmap> plane);
    std::unique_ptr<TZmBitmap> DetachAlphaChannel(bool create_if_not_exists);
    /// Run on a plane: fFull says whether all values are 255 (on others, all bytes of pixels).
    void SyncFull();
    bool GetFull() const { return fFull; }
    void SetFull(bool full) { fFull = full; }
    bool GetIsAlpha() const { return fIsAlpha; }
    /// Makes the plane when there is none, otherwise resamples it to the image's size (smoothly
    /// or by nearest neighbour) and refreshes the marks of full planes. Engine/proc.
    void SyncAlphaChannel(bool anti_alias);
    /// Moves the fourth byte of zm32RGB to the plane or back.
    void SynchronizeRGBA(bool rgba_to_alpha, bool update_pixel_format);
    void AlphaFill(std::int32_t value);
    /// Fills a rectangle of the plane, made when needed, with a value / with a gradient that
    /// starts and ends at the rectangle's sides, also where these lie outside the plane.
    void AlphaFillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                       std::int32_t value);
    void AlphaFillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                       std::int32_t start_value, std::int32_t end_value,
                       TZmGradientDirection direction);
    /// Merges a rectangle of this plane (255 without one) into the plane of `dest`, made when
    /// needed; results are rounded to the nearest and clamped. Clipped like CopyRectTo.
    void MergeAlphaRectTo(TZmBitmap* dest, std::int32_t src_x, std::int32_t src_y,
                          std::int32_t dst_x, std::int32_t dst_y, std::int32_t rect_width,
                          std::int32_t rect_height, TZmAlphaMergeMode mode, double rate);
    /// Fades the plane toward its transparent pixels (value 0): less than n = `feather_depth` + 1
    /// pixels from the nearest one, at distance d, a value becomes value * d / n, rounded to the
    /// nearest. Distances are straight lines, or with `quick` counted in steps to any of the
    /// eight neighbours. Depths below 1 do nothing, those above 65533 count as that.
    void FeatherAlphaEdges(std::int32_t feather_depth, bool quick);
    /// Gives the pixels whose colour channels all lie within two colours, bounds included, an
    /// alpha. The plane is made when needed.
    void SetTransparentColors(TRGB min_color, TRGB max_color, std::int32_t alpha);
    /// Plane from an 8-bit or 1-bit mask (set bits opaque) / mask from the plane.
    void CopyFromTZmMask(TZmMask& source);
    void CopyToTZmMask(TZmMask& dest);

    // Geometry.
    /// Makes the inclusive rectangle the new image; what lies beyond the old one is filled with
    /// `fill_color` (kCropNoFill: left as allocated) and opaque. An empty rectangle does nothing.
    /// Without room the image stays as it was and the result is False.
    bool Crop(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
              TColor fill_color);
    bool Crop(const TRect& inclusive_rect, TColor fill_color);
    /// Crops to the pixels that are not transparent. False when nothing changed, which is also
    /// the answer for an image without alpha, or all transparent.
    bool CropAlpha();
    /// Changes the size of the canvas; the picture keeps its own and goes to the given side, a
    /// centre offset being truncated. New pixels take the value (see Fill) and, in an alpha
    /// plane, `fill_alpha`. Sizes below 1 do nothing; False without room.
    bool Resize(std::int32_t new_width, std::int32_t new_height, double background_value,
                std::int32_t fill_alpha, TZmHorizAlign horiz_align, TZmVertAlign vert_align);
    /// Adds to each side, or takes away; nothing of the picture may be left.
    bool Resize(std::int32_t add_left, std::int32_t add_top, std::int32_t add_right,
                std::int32_t add_bottom, double background_value, std::int32_t fill_alpha);
    /// Moves a rectangle, alpha included, to another place; what leaves the image is lost. With
    /// `clear_region` the rectangle takes the value and alpha first.
    void MoveRegion(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                    std::int32_t dst_x, std::int32_t dst_y, double background_value,
                    std::int32_t fill_alpha, bool clear_region);
    /// Copies a rectangle, clipped to both images, converting pixels where the formats differ.
    void CopyRectTo(TZmBitmap* dest, std::int32_t src_x, std::int32_t src_y, std::int32_t dst_x,
                    std::int32_t dst_y, std::int32_t rect_width, std::int32_t rect_height,
                    bool copy_alpha);
    void CopyToEx(TZmBitmap* dest, std::int32_t src_x, std::int32_t src_y, std::int32_t dst_x,
                  std::int32_t dst_y, std::int32_t rect_width, std::int32_t rect_height,
                  bool copy_alpha, bool elliptical_copy);
    /// Value by format: zm1g zero or not; zm8p, zm8g a byte; zm16g a word; the colour formats a
    /// colour value; zm32f the float.
    void Fill(double value);
    void Fill(TRGBA value);
    void FillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2, double value);
    /// Fills with a gradient, each channel of the format on a straight line between the two
    /// colours, rounded to the nearest, ties to even. In zm1g and zm8p colours go along the line
    /// and pixels take the nearer of black and white, or the nearest palette entry. The alpha
    /// plane stays. GradientFillRect starts and ends at the rectangle's sides, also outside.
    void GradientFill(TColor start_color, TColor end_color, TZmGradientDirection direction);
    void GradientFillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                          TColor start_color, TColor end_color, TZmGradientDirection direction);

    // Processing and I/O, defined in the rooms above.
    /// Mirrors / turns in place, by degrees counter-clockwise (engines: the rotation header). An
    /// angle of 0 does nothing, not even tell Changed; without room the image stays as it was.
    void Flip(TFlipDir direction);
    void Rotate(double angle, TZmAntialiasMode mode, TColor background);
    void Rotate(double angle, bool antialias, TZmAntialiasMode mode, TColor background);
    void RotateEx(double angle, TZmAntialiasMode mode, TColor background, void* sender,
                  const TZmBitmapProgressEvent& on_progress);
    /// Resizes in place (sizing rule and engines: the resampling header).
    void Resample(std::int32_t new_width, std::int32_t new_height, TResampleFilter filter,
                  bool maintain_aspect_ratio, bool shrink_only);
    void Resample(double scale_by, TResampleFilter filter);
    /// As AssignEx without parameters from an image that is given up: no copy is made and
    /// `source` is left empty. Events, file parameters and place settings of this object stay.
    void TakeOver(TZmBitmap& source);
    /// Loads a file: type by extension, then, with `check_unknown`, by content. With nil
    /// parameters the bitmap's own are used when enabled. A file that cannot be opened raises
    /// EFOpenError.
    bool Read(const std::u16string& file_name, TIOParams* params, bool check_unknown);
    /// File type 0 means: found by content. The caller keeps the stream.
    bool Read(TStream* stream, std::int32_t file_type, TIOParams* params);
    bool Read(const void* buffer, std::int64_t size_bytes, std::int32_t file_type,
              TIOParams* params);
    /// A resource of a module, by the names of its type and of itself (see TZalmoIO).
    bool LoadFromResource(const std::u16string& module_path, const std::u16string& resource_type,
                          const std::u16string& resource_name, std::int32_t file_type);
    /// Saves. Nil parameters: the bitmap's own, bits and samples brought in line with the format;
    /// otherwise the given values are assigned over the bitmap's own first. A file that cannot
    /// be created raises EFCreateError.
    bool Write(const std::u16string& file_name, TIOParams* params);
    bool Write(const std::u16string& file_name, std::int32_t file_type, TIOParams* params);
    bool Write(TStream* stream, std::int32_t file_type, TIOParams* params);
    /// Own file parameters: made when enabled, freed when disabled.
    bool GetParamsEnabled() const { return fIOParams != nullptr; }
    void SetParamsEnabled(bool enabled);
    TIOParams* GetParams() const { return fIOParams.get(); }

    // Exchange in memory: the raw form (contract in zmrawblob.h), device-independent bitmaps
    // (zmdibbitmap.h, zmdib.h). False leaves this bitmap as it was.
    std::int32_t CalcRAWSize();
    bool SaveRAWToBufferOrStream(void* Buffer, std::int64_t buffer_bytes, TStream* Stream,
                                 bool StreamHasSize);
    bool LoadRAWFromBufferOrStream(const void* Buffer, std::int64_t buffer_bytes, TStream* Stream);
    bool CopyFromTDibBitmap(TZmDibbitmap* source);
    bool CopyToTDibBitmap(TZmDibbitmap* dest, std::int32_t source_x, std::int32_t source_y,
                          std::int32_t sourceWidth, std::int32_t sourceHeight);
    void MergeFromTDibBitmap(TZmDibbitmap* source, std::int32_t x, std::int32_t y);
    bool CopyFromDIB(const void* dib, std::int64_t dib_bytes);
    bool CopyFromDIB(const void* bitmap_info, std::int64_t info_bytes, const void* pixels,
                     std::int64_t pixel_bytes);
    std::vector<std::uint8_t> CreateDIB(std::int32_t dpi_x = 0, std::int32_t dpi_y = 0);
    std::vector<std::uint8_t> CreateDIB(std::int32_t x1, std::int32_t y1, std::int32_t x2,
                                        std::int32_t y2, std::int32_t dpi_x = 0,
                                        std::int32_t dpi_y = 0);

    const std::u16string& GetFilename() const { return fFilename; }
    void SetFilename(const std::u16string& name) { fFilename = name; }
    std::int32_t GetFileType() const { return fFileType; }
    void SetFileType(std::int32_t file_type) { fFileType = file_type; }
    bool GetWicFastLoading() const { return fWicFastLoading; }

    // Virtual bitmaps: no pixels, rows are rendered on demand.
    void SetVirtualProvider(TZmVirtualBitmapProvider* provider);
    void SetOnRenderVirtualPixel(TZmRenderVirtualPixelEvent event);
    bool GetIsVirtual() const { return fIsVirtual; }

    // Notification.
    void Changed();
    void SetOnChanged(TZmNotifyEvent event) { fOnChanged = std::move(event); }
    void SetOnProgress(TZmBitmapProgressEvent event) { fOnProgress = std::move(event); }
    const TZmBitmapProgressEvent& GetOnProgress() const { return fOnProgress; }
    bool GetModified() const { return fModified; }
    void SetModified(bool modified) { fModified = modified; }

private:
    friend class TZmBitmapStorageTest;
    friend class TZmBitmapSurface;

    bool AllocateStorage();
    bool AllocateNewStorage(std::int32_t width, std::int32_t height, TZmPixelFormat format);
    bool AllocateFirstPixels(TZmPixelFormat format);
    bool ChooseAndAllocate(std::int64_t size_bytes);
    bool AllocateInMemory(std::int64_t size_bytes);
    bool AllocateInFile(std::int64_t size_bytes);
    bool AllocateFragments();
    bool AllocateInTBitmap(std::int64_t size_bytes);
    bool DeriveFields();
    void FreeMemoryBlock();
    void FreeFragments();
    void FreePixels();
    void DropCanvases();
    void UnMapRows();
    void BuildBitmapScanlines();
    void ResetAfterSwitch();
    void MovePixelsFrom(TZmBitmap& source);
    void CopySettingsFrom(const TZmBitmap& source);
    void AssignAlphaFrom(TZmBitmap& source);
    void AssignParamsFrom(TZmBitmap& source);  // defined beside SetParamsEnabled
    std::uint8_t* RowInMemory(std::int32_t row) const;
    std::uint8_t* MapFileRow(std::int32_t row);
    std::uint8_t* GetVirtualRow(std::int32_t row);
    void SetVirtual(bool is_virtual);
    std::uint8_t* RenderVirtualSegment(std::int32_t row, std::int32_t start, std::int32_t width);
    void ResizeSide(std::int32_t new_width, std::int32_t new_height);
    TZmRowLayout GetRowLayout();
    bool ReplaceTBitmapPixels(TZmBitmap& pixels);
    bool ConvertTBitmapFormat(TZmPixelFormat format);
    bool ConvertPixelsFrom(TZmBitmap& source);
    void ConvertRowsFrom(TZmBitmap& source);
    void ConvertToOneBitFrom(TZmBitmap& source);
    void ConvertGrayRangeFrom(TZmBitmap& source);
    void QuantizeFrom(TZmBitmap& source);
    void CopyPixelsFrom(TZmBaseBitmap* source);
    void CopyRGBAToPlane();
    void CopyPlaneToRGBA();
    bool CropTo(const TRect& inclusive_rect, const double* fill_value, std::int32_t fill_alpha);
    bool CropAlphaFrom(TZmBitmap& source, std::int32_t x1, std::int32_t y1, std::int32_t alpha);
    void CropPixelsFrom(TZmBitmap& source, std::int32_t x1, std::int32_t y1,
                        const double* fill_value);
    bool TakeCropped(TZmBitmap& cropped);
    bool TakeRaw(TZmBitmap& loaded);
    void CopyRowsTo(TZmBitmap& dest, const TRect& area, std::int32_t shift_x, std::int32_t shift_y,
                    const TRect* frame);
    bool ResizePixels(std::int32_t new_width, std::int32_t new_height);
    void UpdateTBitmapPalette();
};

}  // namespace zm
