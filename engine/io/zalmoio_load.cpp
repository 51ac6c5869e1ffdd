#include <algorithm>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/bmpfilt.h"
#include "engine/codecs/jpegfilt.h"
#include "engine/codecs/pngfilt.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmfileformats.h"
#include "engine/io/zmformatdetect.h"

// Loading: choice of the type, the steps that all codecs share, and the family of load operations.
namespace zm {

namespace {

/// The SVG row of the file itself is write-only; a plug-in row that reads takes its place.
std::int32_t ReaderTypeOf(std::int32_t file_type) {
    if (file_type != ioSVG) {
        return file_type;
    }
    for (const std::int32_t plugin_type : {kPluginSvgType, kPluginSvgReaderType}) {
        if (FindFormatInfo(plugin_type) != nullptr) {
            return plugin_type;
        }
    }
    return file_type;
}

}  // namespace

TZalmoIO::TLoadCodec TZalmoIO::LoadCodecBMP() {
    return {ioBMP, [this](TStream& stream, TProgressRec& progress, TZmMask& alpha) {
                TIOParams& params = *GetParams();
                ReadBMPStream(stream, *fZmBitmap, /*byte_limit=*/0,
                              /*ignore_alpha=*/!params.fBMP_HandleTransparency, alpha,
                              /*no_file_header=*/false, /*params_only=*/false, progress, params);
            }};
}

TZalmoIO::TLoadCodec TZalmoIO::LoadCodecPNG() {
    return {ioPNG, [this](TStream& stream, TProgressRec& progress, TZmMask&) {
                TIOParams& params = *GetParams();
                params.fPNG_Background = RGBFromColor(fBackground);
                ReadPNGStream(stream, *fZmBitmap, params, /*params_only=*/false, progress);
                fBackground = ColorFromRGB(params.fPNG_Background);
            }};
}

TZalmoIO::TLoadCodec TZalmoIO::LoadCodecJpeg() {
    return {ioJPEG, [this](TStream& stream, TProgressRec& progress, TZmMask&) {
                TIOParams& params = *GetParams();
                TJpegReadOptions options;
                options.native_format = params.fNativePixelFormat;
                ReadJPEGStream(stream, *fZmBitmap, options, progress, params);
            }};
}

std::optional<TZalmoIO::TLoadCodec> TZalmoIO::InternalLoadCodec(std::int32_t file_type) {
    switch (file_type) {
        case ioBMP: return LoadCodecBMP();
        case ioPNG: return LoadCodecPNG();
        case ioJPEG: return LoadCodecJpeg();
        default: return std::nullopt;
    }
}

bool TZalmoIO::RunLoadFile(const TLoadCodec& codec, const std::u16string& file_name) {
    CheckAttachedBitmap();
    fAborting = true;  // stands when the file cannot be opened
    TFileStream stream(file_name, fmOpenRead);
    return RunLoad(codec, stream, file_name);
}

bool TZalmoIO::RunLoad(const TLoadCodec& codec, TStream& stream, const std::u16string& file_name) {
    CheckAttachedBitmap();
    return RunToNotice([&] { LoadSteps(codec, stream, file_name); });
}

void TZalmoIO::LoadSteps(const TLoadCodec& codec, TStream& stream,
                         const std::u16string& file_name) {
    fAborting = false;
    TProgressRec progress = MakeProgress();
    PrepareBitmap();
    TIOParams& params = *GetParams();
    params.ResetInfo();
    fZmBitmap->RemoveAlphaChannel(/*merge=*/false, /*background=*/0);
    TZmMask alpha;
    codec.read(stream, progress, alpha);
    ApplyResolutionDefaults();
    TakeAlpha(alpha);
    if (!fAborting) {
        params.fFileName = file_name;
        params.fFileType = codec.type;
    }
    Update();
    fZmBitmap->Changed();
}

void TZalmoIO::ApplyResolutionDefaults() {
    constexpr std::int32_t kLeastDpi = 2;
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    TIOParams& params = *GetParams();
    if (params.GetDpiX() < kLeastDpi) {
        params.SetDpiX(settings.fDefaultDPIX);
    }
    if (params.GetDpiY() < kLeastDpi) {
        params.SetDpiY(settings.fDefaultDPIY);
    }
}

void TZalmoIO::TakeAlpha(TZmMask& alpha) {
    const bool fits = alpha.GetWidth() > 0 && alpha.GetWidth() == fZmBitmap->GetWidth() &&
                      alpha.GetHeight() == fZmBitmap->GetHeight();
    if (fits) {
        fZmBitmap->CopyFromTZmMask(alpha);
    }
}

bool TZalmoIO::BeginRowLoad(const TZmFileFormatInfo& row) {
    TIOParams& params = *GetParams();
    fAborting = true;
    params.ResetInfo();
    params.fFileName.clear();
    params.fFileType = ioUnknown;
    // An internal row's function is no reader: its type either has a codec or cannot be read.
    return !row.InternalFormat && row.ReadFunction != nullptr;
}

bool TZalmoIO::LoadFileByRow(const TZmFileFormatInfo& row, const std::u16string& file_name) {
    if (!BeginRowLoad(row)) {
        return FailWithNotice();
    }
    TFileStream stream(file_name, fmOpenRead);
    return RunRowLoad(row, stream, file_name);
}

bool TZalmoIO::LoadStreamByRow(const TZmFileFormatInfo& row, TStream& stream) {
    return BeginRowLoad(row) ? RunRowLoad(row, stream, {}) : FailWithNotice();
}

bool TZalmoIO::RunRowLoad(const TZmFileFormatInfo& row, TStream& stream,
                          const std::u16string& file_name) {
    return RunToNotice([&] {
        TProgressRec progress = MakeProgress();
        PrepareBitmap();
        fAborting = false;
        TIOParams& params = *GetParams();
        params.fFileName = file_name;
        params.fFileType = row.FileType;
        row.ReadFunction(stream, *fZmBitmap, params, progress, /*preview=*/false);
        Update();
        fZmBitmap->Changed();
    });
}

bool TZalmoIO::LoadFromFile(const std::u16string& file_name, std::int32_t file_type) {
    if (fZmBitmap == nullptr) {
        return false;
    }
    if (file_name.empty()) {
        return FailWithNotice();
    }
    if (file_type == ioUnknown) {
        file_type = FindFileFormat(file_name, zmfmContentOnly);
    }
    // Types without a row include the videos, for which there is no player here.
    const TZmFileFormatInfo* row = FindFormatInfo(ReaderTypeOf(file_type));
    if (row == nullptr) {
        return FailWithNotice();
    }
    if (row->InternalFormat) {
        if (const auto codec = InternalLoadCodec(row->FileType)) {
            return RunLoadFile(*codec, file_name);
        }
    }
    return LoadFileByRow(*row, file_name);
}

bool TZalmoIO::LoadFromFile(const std::u16string& file_name, bool check_unknown) {
    const std::u16string extension = AsciiLower(FileExtension(file_name));
    const std::int32_t named_type = extension == u".avi" ? ioAVI : ExtensionToFileType(extension);
    bool is_loaded = false;
    fAborting = true;
    if (named_type != ioUnknown) {
        is_loaded = LoadFromFile(file_name, named_type);
    }
    if (!is_loaded && check_unknown) {
        const std::int32_t found_type = FindFileFormat(file_name, zmfmContentOnly);
        if (found_type != named_type) {
            return LoadFromFile(file_name, found_type);
        }
    }
    if (named_type == ioUnknown) {
        DoFinishWork();
    }
    return is_loaded;
}

bool TZalmoIO::LoadFromFileAuto(const std::u16string& file_name) {
    return LoadFromFile(file_name, FindFileFormat(file_name, zmfmContentElseExtension));
}

bool TZalmoIO::LoadFromFileFormat(const std::u16string& file_name, std::int32_t file_type) {
    return file_type == ioUnknown ? Fail() : LoadFromFile(file_name, file_type);
}

bool TZalmoIO::LoadFromStreamFormat(TStream& stream, std::int32_t file_type) {
    return file_type == ioUnknown ? Fail() : LoadFromStream(stream, file_type);
}

bool TZalmoIO::LoadFromStream(TStream& stream, std::int32_t file_type) {
    if (fZmBitmap == nullptr) {
        return false;
    }
    if (file_type == ioUnknown) {
        file_type = FindStreamFormat(stream);
    }
    if (file_type == ioUnknown) {
        return FailWithNotice();
    }
    const TZmFileFormatInfo* row = FindFormatInfo(file_type);
    if (row == nullptr) {
        return Fail();
    }
    if (row->InternalFormat) {
        if (const auto codec = InternalLoadCodec(file_type)) {
            return RunLoad(*codec, stream, {});
        }
    }
    return LoadStreamByRow(*row, stream);
}

bool TZalmoIO::LoadFromBuffer(const void* buffer, std::int64_t size_bytes, std::int32_t file_type) {
    if (buffer == nullptr || size_bytes < 1) {
        return Fail();
    }
    TBorrowedMemoryStream stream(buffer, size_bytes);
    return LoadFromStream(stream, file_type);
}

bool TZalmoIO::LoadFromFileBMP(const std::u16string& file_name) {
    return RunLoadFile(LoadCodecBMP(), file_name);
}

bool TZalmoIO::LoadFromStreamBMP(TStream& stream) {
    return RunLoad(LoadCodecBMP(), stream, {});
}

bool TZalmoIO::LoadFromFilePNG(const std::u16string& file_name) {
    return RunLoadFile(LoadCodecPNG(), file_name);
}

bool TZalmoIO::LoadFromStreamPNG(TStream& stream) {
    return RunLoad(LoadCodecPNG(), stream, {});
}

bool TZalmoIO::LoadFromFileJpeg(const std::u16string& file_name) {
    return RunLoadFile(LoadCodecJpeg(), file_name);
}

bool TZalmoIO::LoadFromStreamJpeg(TStream& stream) {
    return RunLoad(LoadCodecJpeg(), stream, {});
}

}  // namespace zm
