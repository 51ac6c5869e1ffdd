#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <unordered_map>

#include "actions/uActionContext.h"
#include "engine/bitmap/zmxBitmaps.h"

namespace zm {

/// The registry of job images: at most one per running job, under the job's id.
///
/// Each operation runs one step. It finds the job's image by the step's task id, reads its keys
/// and returns True on success. Without an image it reports code 1 and returns False. Failures
/// reach the host by ReportJobError with the codes given at each operation; what the engine
/// raises (a file that cannot be created, memory that is out) is not caught.
///
/// Thread rule: jobs run side by side. The lock guards the dictionary alone and is held for
/// single accesses, never while an image is read, changed or written; an image is touched by its
/// own job's thread only.
class TQVImageList {
public:
    TQVImageList() = default;
    ~TQVImageList() = default;
    TQVImageList(const TQVImageList&) = delete;
    TQVImageList& operator=(const TQVImageList&) = delete;

    /// Keys: `source` (0 file, else clipboard), `image_file` (expanded). Code 3: no such file;
    /// 4: not readable, or no image on the clipboard. A failure keeps the job's earlier image.
    bool Open(const IStepParams& params);
    /// Frees the job's image; a job without one is no fault.
    bool Close(const IStepParams& params);
    /// Keys: `dest` (0 file, else clipboard), `image_file` (expanded), `format` (index of the
    /// save formats, 0 to 6), `save_meta`. Code 2: empty name; 5: not saved. The file's type
    /// follows `format`, not the name.
    bool Save(const IStepParams& params);

    /// Keys: `calc_method`, `image_w`, `image_h` (expanded), `keep_aspect_ratio`, `units_w`,
    /// `units_h`. False without a report when the product of both numbers is not above 0.
    bool Resize(const IStepParams& params);
    /// Keys: `l`, `t`, `r`, `b` (expanded) and their units `ul`, `ut`, `ur`, `ub`. Right and
    /// bottom are exclusive, negative values count from the far edge. Code 2: empty rectangle.
    bool Crop(const IStepParams& params);
    /// Keys: `action` (0 rotate, 1 flip horizontally, 2 flip vertically), `angle` (expanded;
    /// degrees clockwise). What a turned picture leaves free is white. False without a report for
    /// an angle of 0 and other actions.
    bool Rotate(const IStepParams& params);
    /// Keys as Crop, as widths of the borders, and `color`.
    bool AddBorder(const IStepParams& params);

    /// Writes a text. Keys: `text` (expanded), `font_name`, `font_size` (points), `font_color`,
    /// `font_styles` (1 bold, 2 italic, 4 underlined, 8 struck out), `x_pos`, `y_pos` (0 left or
    /// top, 1 centred, 2 right or bottom, else `custom_x`, `custom_y`, expanded). A font that is
    /// missing is replaced; an empty text succeeds.
    bool TextOut(const IStepParams& params);
    /// Lays a picture over the image, which becomes zm24RGB and keeps its alpha. Keys:
    /// `image_file` (expanded), positions as above, `opacity` (percent, expanded). False without a
    /// report for a file that is missing, not readable or empty.
    bool DrawImage(const IStepParams& params);

private:
    /// The job's image, or nil after the report of code 1. Valid until the job's next Open or
    /// Close.
    TZmBitmap* JobBitmap(std::int32_t job_id);
    void StoreBitmap(std::int32_t job_id, std::unique_ptr<TZmBitmap> bitmap);
    std::unique_ptr<TZmBitmap> TakeBitmap(std::int32_t job_id);
    bool OpenFromFile(const IStepParams& params, TZmBitmap& bitmap);
    bool OpenFromClipboard(const IStepParams& params, TZmBitmap& bitmap);
    bool SaveToFile(const IStepParams& params, TZmBitmap& bitmap);
    bool SaveToClipboard(const IStepParams& params, TZmBitmap& bitmap);

    std::unordered_map<std::int32_t, std::unique_ptr<TZmBitmap>> FList;
    std::mutex FLock;
};

/// The one list of the process, made when the program or module is loaded and freed, with all
/// images still in it, when it is unloaded.
TQVImageList& GetImageList();

/// The value of `key` expanded and read as a decimal integer; 0 when it does not parse.
std::int32_t ExpandedInteger(const IStepParams& params, std::u16string_view key,
                             std::u16string_view default_text);

/// Save formats by the index that a step stores.
struct TSaveFormat {
    std::int32_t file_type;
    const char16_t* name;
};
inline constexpr std::int32_t kSaveFormatCount = 7;
/// Nil for an index outside 0 to 6.
const TSaveFormat* SaveFormatAt(std::int32_t index);

}  // namespace zm
