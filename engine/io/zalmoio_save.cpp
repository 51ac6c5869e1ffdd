#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/bmpfilt.h"
#include "engine/codecs/jpegfilt.h"
#include "engine/codecs/pngfilt.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmfileformats.h"

// Saving: choice of the type, the steps that all codecs share, and the family of save operations.
namespace zm {

namespace {

/// What writers of colour images take as it stands.
constexpr TZmPixelFormatSet kColorOrTwoLevels(zm24RGB, zm1g);

}  // namespace

TZalmoIO::TSaveCodec TZalmoIO::SaveCodecBMP() {
    return {ioBMP, {}, [this](TStream& stream, TZmBitmap& bitmap, TProgressRec& progress) {
                TIOParams& params = *GetParams();
                WriteBMPStream(stream, bitmap, params, params.fBMP_HandleTransparency, progress);
            }};
}

TZalmoIO::TSaveCodec TZalmoIO::SaveCodecPNG() {
    return {ioPNG, {}, [this](TStream& stream, TZmBitmap& bitmap, TProgressRec& progress) {
                TIOParams& params = *GetParams();
                params.fPNG_Background = RGBFromColor(fBackground);
                TZmMask alpha;
                const bool has_alpha = bitmap.HasAlphaChannel();
                if (has_alpha) {
                    bitmap.CopyToTZmMask(alpha);
                    alpha.SyncFull();
                }
                WritePNGStream(stream, bitmap, params, has_alpha ? &alpha : nullptr, progress);
                fBackground = ColorFromRGB(params.fPNG_Background);
            }};
}

TZalmoIO::TSaveCodec TZalmoIO::SaveCodecJpeg() {
    return {ioJPEG, kColorOrTwoLevels,
            [this](TStream& stream, TZmBitmap& bitmap, TProgressRec& progress) {
                WriteJPEGStream(stream, bitmap, *GetParams(), progress);
            }};
}

std::optional<TZalmoIO::TSaveCodec> TZalmoIO::InternalSaveCodec(std::int32_t file_type) {
    switch (file_type) {
        case ioBMP: return SaveCodecBMP();
        case ioPNG: return SaveCodecPNG();
        case ioJPEG: return SaveCodecJpeg();
        default: return std::nullopt;
    }
}

std::optional<TZalmoIO::TSaveCodec> TZalmoIO::RowSaveCodec(const TZmFileFormatInfo* row) {
    // An internal row's function is no writer: its type either has a codec or cannot be written.
    if (row == nullptr || row->InternalFormat || row->WriteFunction == nullptr) {
        return std::nullopt;
    }
    return TSaveCodec{row->FileType, kColorOrTwoLevels,
                      [this, type = row->FileType, write = row->WriteFunction](
                          TStream& stream, TZmBitmap& bitmap, TProgressRec& progress) {
                          GetParams()->fFileType = type;
                          write(stream, bitmap, *GetParams(), progress);
                      }};
}

bool TZalmoIO::RunSaveFile(const TSaveCodec& codec, const std::u16string& file_name) {
    CheckAttachedBitmap();
    fAborting = true;  // stands when the file cannot be created
    TZmSaveFileStream stream(file_name);
    return RunToNotice([&] {
        TIOParams& params = *GetParams();
        params.fFileName = file_name;
        params.fFileType = codec.type;
        SaveSteps(codec, stream);
        if (!fAborting && !stream.Commit()) {
            fAborting = true;
        }
    });
}

bool TZalmoIO::RunSave(const TSaveCodec& codec, TStream& stream) {
    CheckAttachedBitmap();
    return RunToNotice([&] { SaveSteps(codec, stream); });
}

void TZalmoIO::SaveSteps(const TSaveCodec& codec, TStream& stream) {
    fAborting = false;
    TProgressRec progress = MakeProgress();
    std::unique_ptr<TZmBitmap> converted;
    PrepareBitmap();
    TZmBitmap* bitmap = BitmapToWrite(codec.accepted, converted);
    if (bitmap == nullptr) {
        fAborting = true;
        return;
    }
    codec.write(stream, *bitmap, progress);
}

/// The bitmap as the codec takes it; nil for an empty one, which would replace the target by an
/// empty file, and when a copy finds no room.
TZmBitmap* TZalmoIO::BitmapToWrite(const TZmPixelFormatSet& accepted,
                                   std::unique_ptr<TZmBitmap>& converted) {
    if (fZmBitmap->IsEmpty()) {
        return nullptr;
    }
    if (accepted.IsEmpty() || accepted.Contains(fZmBitmap->GetPixelFormat())) {
        return fZmBitmap;
    }
    converted = std::make_unique<TZmBitmap>();
    converted->AssignImage(fZmBitmap);
    const bool is_converted = !converted->IsEmpty() && converted->SetPixelFormat(zm24RGB);
    return is_converted ? converted.get() : nullptr;
}

bool TZalmoIO::SaveToFile(const std::u16string& file_name, std::int32_t file_type) {
    if (file_name.empty()) {
        return !fAborting;
    }
    CheckAttachedBitmap();
    const bool is_by_name = file_type < 1;
    if (is_by_name) {
        file_type = SaveExtensionToFileType(file_name);
        if (file_type == ioUnknown) {
            file_type = GetParams()->fFileType;
        }
        if (file_type == ioUnknown) {
            file_type = ioJPEG;
        }
    }
    if (const auto codec = InternalSaveCodec(file_type)) {
        return RunSaveFile(*codec, file_name);
    }
    const auto row_codec =
        RowSaveCodec(is_by_name ? FindFormatInfoByExtension(FileExtension(file_name))
                                : FindFormatInfo(file_type));
    return row_codec ? RunSaveFile(*row_codec, file_name) : Fail();
}

bool TZalmoIO::SaveToStream(TStream& stream, std::int32_t file_type) {
    CheckAttachedBitmap();
    if (file_type == ioUnknown) {
        file_type = GetParams()->fFileType;
    }
    if (file_type == ioUnknown) {
        file_type = ioJPEG;
    }
    if (const auto codec = InternalSaveCodec(file_type)) {
        return RunSave(*codec, stream);
    }
    const auto row_codec = RowSaveCodec(FindFormatInfo(file_type));
    return row_codec ? RunSave(*row_codec, stream) : Fail();
}

bool TZalmoIO::SaveToFileBMP(const std::u16string& file_name) {
    return RunSaveFile(SaveCodecBMP(), file_name);
}

bool TZalmoIO::SaveToStreamBMP(TStream& stream) {
    return RunSave(SaveCodecBMP(), stream);
}

bool TZalmoIO::SaveToFilePNG(const std::u16string& file_name) {
    return RunSaveFile(SaveCodecPNG(), file_name);
}

bool TZalmoIO::SaveToStreamPNG(TStream& stream) {
    return RunSave(SaveCodecPNG(), stream);
}

bool TZalmoIO::SaveToFileJpeg(const std::u16string& file_name) {
    return RunSaveFile(SaveCodecJpeg(), file_name);
}

bool TZalmoIO::SaveToStreamJpeg(TStream& stream) {
    return RunSave(SaveCodecJpeg(), stream);
}

}  // namespace zm
