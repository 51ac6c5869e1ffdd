#pragma once

#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "engine/foundation/zmbytereader.h"
#include "engine/platform/linux/drawing_vector_p.h"

/// Enhanced metafiles (MS-EMF): recorded drawing calls, played over the figures, pictures and
/// texts of the vector graphics. Lines, shapes, paths, pens, brushes, fonts, texts, uncompressed
/// pictures and rectangular clipping are played; other records, and raster operations other than
/// copying, are passed over. Metafiles of the 16-bit kind are refused.
namespace zm::platform {

class TLinuxMetafile : public TDrawMetafile {
public:
    /// Nil unless the header fits and every record up to the last lies within the bytes.
    static std::unique_ptr<TLinuxMetafile> Create(std::span<const std::uint8_t> bytes);
    TDrawMetafileHeader Header() const override { return header_; }

    struct TRecord {
        std::uint32_t type = 0;
        std::span<const std::uint8_t> bytes;  ///< all of it, type and size included
    };
    /// The record at a place, which moves behind it. Nothing at the end, or where none fits.
    std::optional<TRecord> NextRecord(std::size_t& place) const;
    /// Pixels of the device that it was recorded for, for each millimetre.
    double PixelsPerMillimetreX() const { return pixels_per_mm_x_; }
    double PixelsPerMillimetreY() const { return pixels_per_mm_y_; }
    std::size_t HandleCount() const { return handle_count_; }

private:
    bool ReadHeader();
    bool CheckRecords();
    void FindExtendedType(const TRecord& record);

    std::vector<std::uint8_t> bytes_;
    TDrawMetafileHeader header_;
    double pixels_per_mm_x_ = 0;
    double pixels_per_mm_y_ = 0;
    std::size_t handle_count_ = 0;
};

/// The run of one metafile over graphics, whose state it changes.
class TMetafilePlayer {
public:
    /// The matrix brings pixels of the recorded device to the target's.
    TMetafilePlayer(TLinuxGraphics& graphics, const TLinuxMetafile& metafile,
                    const TDeviceMatrix& to_target);
    void Play();

private:
    using TRecord = TLinuxMetafile::TRecord;
    /// Widths and heights of pens and fonts are in logical units.
    struct TPen {
        TVectorPenRecord record;
        bool is_visible = true;
        bool is_cosmetic = false;
    };
    struct TBrush {
        TVectorBrushRecord record;
        bool is_visible = true;
    };
    struct TFontObject {
        TDrawFont font;
        double angle = 0;  ///< degrees, clockwise
    };
    using TObject = std::variant<std::monostate, TPen, TBrush, TFontObject>;
    struct TState {
        TDeviceMatrix world;
        std::int32_t map_mode = 1;
        TDevicePoint window_origin;
        TDevicePoint window_extent{1, 1};
        TDevicePoint viewport_origin;
        TDevicePoint viewport_extent{1, 1};
        TPen pen;
        TBrush brush;
        TFontObject font;
        TArgb text_color = 0xFF000000;
        TArgb back_color = 0xFFFFFFFF;
        bool is_opaque = true;
        bool is_winding = false;
        bool is_clockwise = false;
        std::uint32_t text_align = 0;
        TDevicePoint position;
        std::optional<TDeviceBox> clip;  ///< in target pixels
    };
    enum TPainting : std::uint8_t { kFilled = 1, kStroked = 2 };
    struct TText {
        TDevicePoint reference;
        std::u16string text;
        std::uint32_t options = 0;
        std::optional<TDeviceBox> rect;
        double advance = 0;  ///< width in logical units, 0 for the font's own
    };
    struct TPicture;

    bool PlaySetting(const TRecord& record, TZmByteReader& reader);
    bool PlayTransform(const TRecord& record, TZmByteReader& reader);
    bool PlayClipping(const TRecord& record, TZmByteReader& reader);
    bool PlayObject(const TRecord& record, TZmByteReader& reader);
    bool PlayPath(const TRecord& record);
    bool PlayLine(const TRecord& record, TZmByteReader& reader);
    bool PlayShape(const TRecord& record, TZmByteReader& reader);
    bool PlayPicture(const TRecord& record, TZmByteReader& reader);
    bool PlayText(const TRecord& record, TZmByteReader& reader);

    TDeviceMatrix PageMatrix() const;
    TDeviceMatrix FullMatrix() const { return to_target_.After(PageMatrix()).After(state_.world); }
    void SetClip(const std::optional<TDeviceBox>& clip);
    void Select(std::uint32_t handle);
    void SelectStock(std::uint32_t number);
    void Keep(std::uint32_t handle, TObject object);
    void Restore(std::int32_t level);
    TVectorPenRecord PenRecord() const;
    TVectorBrushRecord BrushRecord() const;

    template <typename TAdd>
    void Draw(std::int32_t painting, const TAdd& add);
    void Paint(std::int32_t painting, const TOutline& outline);
    void AddBeziers(TOutline& outline, std::span<const TDevicePoint> points) const;
    void PlayPoints(std::int32_t kind, bool is_short, TZmByteReader& reader);
    void PlayManyPoints(bool is_closed, bool is_short, TZmByteReader& reader);
    void PlayArc(std::uint32_t type, TZmByteReader& reader);
    TDeviceBox FrameOf(TZmByteReader& reader) const;
    void FillBox(const TDeviceBox& box, const TVectorBrushRecord& brush);
    void DrawPicture(const TPicture& picture, const TDeviceBox& from, const TDeviceBox& to);
    std::optional<TText> ReadText(const TRecord& record, TZmByteReader& reader, bool is_wide) const;
    std::optional<TText> ReadSmallText(TZmByteReader& reader) const;
    void DrawText(TText text);
    bool Spend(double cost);

    TLinuxGraphics& graphics_;
    const TLinuxMetafile& metafile_;
    const TDeviceMatrix to_target_;
    double budget_;
    TState state_;
    std::vector<TState> saved_;
    std::vector<TObject> objects_;
    std::optional<TOutline> path_;
    bool is_path_open_ = false;
};

}  // namespace zm::platform
