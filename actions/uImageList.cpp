#include "actions/uImageList.h"

#include <array>
#include <utility>

#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/platform/files.h"

namespace zm {
namespace {

constexpr std::int32_t kErrorNoImage = 1;
constexpr std::int32_t kErrorNoFileName = 2;
constexpr std::int32_t kErrorFileMissing = 3;
constexpr std::int32_t kErrorNotReadable = 4;
constexpr std::int32_t kErrorNotSaved = 5;

/// Told of images on the clipboard, in dots per inch.
constexpr std::int32_t kClipboardDpi = 200;

constexpr std::array<TSaveFormat, kSaveFormatCount> kSaveFormatCodes{{
    {ioJPEG, u"JPEG"},
    {ioPNG, u"PNG"},
    {ioGIF, u"GIF"},
    {ioBMP, u"BMP"},
    {ioPDF, u"PDF"},
    {ioTIFF, u"TIFF"},
    {ioJP2, u"JPEG 2000"},
}};

/// The list's life: made with the first user of the unit, freed with the last.
std::int32_t unit_users = 0;
std::unique_ptr<TQVImageList> image_list;

struct TUnitUse {
    TUnitUse() {
        if (unit_users++ == 0) {
            image_list = std::make_unique<TQVImageList>();
        }
    }
    ~TUnitUse() {
        if (--unit_users == 0) {
            image_list.reset();
        }
    }
};
const TUnitUse unit_use;

}  // namespace

TQVImageList& GetImageList() {
    return *image_list;
}

const TSaveFormat* SaveFormatAt(std::int32_t index) {
    return index < 0 || index >= kSaveFormatCount
               ? nullptr
               : &kSaveFormatCodes[static_cast<std::size_t>(index)];
}

std::int32_t ExpandedInteger(const IStepParams& params, std::u16string_view key,
                             std::u16string_view default_text) {
    return ParseInteger(ExpandVariables(params.GetStringDef(key, default_text))).value_or(0);
}

// The dictionary may be rearranged by another job at any moment, so even the test for the key
// takes the lock.
TZmBitmap* TQVImageList::JobBitmap(std::int32_t job_id) {
    {
        const std::lock_guard lock(FLock);
        const auto found = FList.find(job_id);
        if (found != FList.end()) {
            return found->second.get();
        }
    }
    ReportJobError(job_id, kErrorNoImage,
                   u"There is no opened image. Use the Open Image action first.");
    return nullptr;
}

void TQVImageList::StoreBitmap(std::int32_t job_id, std::unique_ptr<TZmBitmap> bitmap) {
    const std::lock_guard lock(FLock);
    // The old image ends in the caller's argument, after the lock has been left.
    FList[job_id].swap(bitmap);
}

std::unique_ptr<TZmBitmap> TQVImageList::TakeBitmap(std::int32_t job_id) {
    const std::lock_guard lock(FLock);
    const auto node = FList.extract(job_id);
    return node.empty() ? nullptr : std::move(node.mapped());
}

bool TQVImageList::OpenFromFile(const IStepParams& params, TZmBitmap& bitmap) {
    const std::u16string name = ExpandVariables(params.GetString(u"image_file"));
    if (!platform::FileExists(name)) {
        ReportJobError(params.GetTaskId(), kErrorFileMissing, u"File \"" + name + u"\" not exists");
        return false;
    }
    bitmap.SetParamsEnabled(true);
    // A file may tell of an image without pixels, and reads well; there is nothing to open in it.
    if (!bitmap.Read(name, nullptr, /*check_unknown=*/true) || bitmap.IsEmpty()) {
        ReportJobError(params.GetTaskId(), kErrorNotReadable,
                       u"Cannot read image file \"" + name + u"\"");
        return false;
    }
    return true;
}

bool TQVImageList::OpenFromClipboard(const IStepParams& params, TZmBitmap& bitmap) {
    if (!bitmap.PasteFromClipboard()) {
        ReportJobError(params.GetTaskId(), kErrorNotReadable,
                       u"Clipboard does not contain image data");
        return false;
    }
    return true;
}

bool TQVImageList::Open(const IStepParams& params) {
    auto bitmap = std::make_unique<TZmBitmap>();
    const bool is_open = params.GetInteger(u"source") != 0 ? OpenFromClipboard(params, *bitmap)
                                                           : OpenFromFile(params, *bitmap);
    if (!is_open) {
        return false;
    }
    StoreBitmap(params.GetTaskId(), std::move(bitmap));
    return true;
}

bool TQVImageList::Close(const IStepParams& params) {
    TakeBitmap(params.GetTaskId());
    return true;
}

bool TQVImageList::SaveToFile(const IStepParams& params, TZmBitmap& bitmap) {
    const std::u16string name = ExpandVariables(params.GetString(u"image_file"));
    const TSaveFormat* format = SaveFormatAt(params.GetInteger(u"format"));
    if (name.empty()) {
        ReportJobError(params.GetTaskId(), kErrorNoFileName, u"File name is empty");
        return false;
    }
    bool saved = false;
    if (format != nullptr) {
        // Required: fresh parameters are assigned over the image's own by the write, so that its
        // metadata is gone for a later save of the same job that wants it.
        std::unique_ptr<TIOParams> fresh;
        if (!params.GetBool(u"save_meta")) {
            fresh = std::make_unique<TIOParams>();
        }
        saved = bitmap.Write(name, format->file_type, fresh.get());
    }
    if (!saved) {
        ReportJobError(params.GetTaskId(), kErrorNotSaved,
                       u"Cannot save image file to \"" + name + u"\"");
    }
    return saved;
}

bool TQVImageList::SaveToClipboard(const IStepParams& params, TZmBitmap& bitmap) {
    const bool copied =
        bitmap.CopyToClipboard(/*IncludeZalmoFormat=*/true,
                               /*IncludePNGFormat=*/false, kClipboardDpi, kClipboardDpi);
    if (!copied) {
        ReportJobError(params.GetTaskId(), kErrorNotSaved, u"Cannot copy image to clipboard");
    }
    return copied;
}

bool TQVImageList::Save(const IStepParams& params) {
    TZmBitmap* bitmap = JobBitmap(params.GetTaskId());
    if (bitmap == nullptr) {
        return false;
    }
    return params.GetInteger(u"dest") != 0 ? SaveToClipboard(params, *bitmap)
                                           : SaveToFile(params, *bitmap);
}

}  // namespace zm
