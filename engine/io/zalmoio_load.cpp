#include <algorithm>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/foundation/zmutils_resources.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zalmoio_codecs_p.h"
#include "engine/io/zalmoio_headers_p.h"
#include "engine/io/zalmoio_metafile_p.h"
#include "engine/io/zmfileformats.h"
#include "engine/io/zmformatdetect.h"
#include "engine/platform/urlclient.h"

// Loading: choice of the type, where the bytes come from, and the steps that all codecs share.
namespace zm {

namespace {

/// The SVG row of the file itself is write-only, the PDF row too; a plug-in row that reads takes
/// its place.
std::int32_t ReaderTypeOf(std::int32_t file_type) {
    if (file_type == ioSVG) {
        for (const std::int32_t plugin_type : {kPluginSvgType, kPluginSvgReaderType}) {
            if (FindFormatInfo(plugin_type) != nullptr) {
                return plugin_type;
            }
        }
    }
    return file_type;
}

/// The two plug-in rows for PDF stand in for each other.
const TZmFileFormatInfo* FindReaderRow(std::int32_t file_type) {
    const TZmFileFormatInfo* row = FindFormatInfo(file_type);
    const bool is_pdf = file_type == kPluginPdfType || file_type == kPluginPdfWriteType;
    if (row == nullptr && is_pdf) {
        row = FindFormatInfo(kPluginPdfType + kPluginPdfWriteType - file_type);
    }
    return row;
}

bool IsUrl(const std::u16string& name) {
    const std::u16string lower = AsciiLower(name);
    return lower.starts_with(u"http://") || lower.starts_with(u"https://") ||
           lower.starts_with(u"ftp://");
}

/// The part of a URL that names the resource, without query and fragment.
std::u16string_view UrlPath(std::u16string_view url) {
    return url.substr(0, url.find_first_of(u"?#"));
}

/// Index of a resource by name, without case; -1 for none.
std::int32_t FindResourceName(const TZmResourceExtractor& module, std::int32_t type,
                              const std::u16string& name) {
    for (std::int32_t i = 0; i < module.GetNamesCount(type); ++i) {
        if (KeysEqualNoCase(module.GetNames(type, i), name)) {
            return i;
        }
    }
    return -1;
}

/// None when there is no such resource.
std::vector<std::uint8_t> ResourceBytes(const std::u16string& module_path,
                                        const std::u16string& type_name,
                                        const std::u16string& name) {
    const TZmResourceExtractor module(module_path);
    const std::int32_t type = module.IndexOfType(type_name);
    const std::int32_t index = type < 0 ? -1 : FindResourceName(module, type, name);
    return index < 0 ? std::vector<std::uint8_t>() : module.GetBuffer(type, index);
}

}  // namespace

bool TZalmoIO::LoadFileAs(std::int32_t type, const std::u16string& name) {
    CheckAttachedBitmap(type);
    return RunOrFail(
        [&] { return RunOrStart([this, type, name] { return LoadFileNow(type, name); }); });
}

bool TZalmoIO::LoadStreamAs(std::int32_t type, TStream& stream) {
    CheckAttachedBitmap(type);
    return RunOrFail(
        [&] { return RunOrStart([this, type, &stream] { return LoadStreamNow(type, stream); }); });
}

bool TZalmoIO::LoadFileNow(std::int32_t type, const std::u16string& name) {
    const TZmFileFormatInfo* row = FindReaderRow(type);
    const TZmLoadCodec* codec = FindLoadCodec(type);
    if (codec == nullptr || (row != nullptr && !row->InternalFormat)) {
        return LoadFileByRow(row, name);
    }
    fAborting = true;  // stands when the file cannot be opened
    TFileStream stream(name, fmOpenRead);
    return RunLoad(type, codec->read, stream, name, /*with_header=*/false);
}

bool TZalmoIO::ImportMetafile(const std::u16string& file_name, std::int32_t width,
                              std::int32_t height, bool with_alpha) {
    const TMetafileImport import{width, height, with_alpha};
    return RunOrFail([&] {
        return RunOrStart([this, file_name, import] {
            fAborting = true;  // stands when the file cannot be opened
            TFileStream stream(file_name, fmOpenRead);
            const auto read = [&import](TZmLoadCall& call) { ReadMetafile(call, import); };
            const bool is_wmf = FindFileFormat(file_name, zmfmContentOnly) == ioWMF;
            return RunLoad(is_wmf ? ioWMF : ioEMF, read, stream, file_name, /*with_header=*/false);
        });
    });
}

bool TZalmoIO::LoadStreamNow(std::int32_t type, TStream& stream) {
    const TZmFileFormatInfo* row = FindReaderRow(type);
    const TZmLoadCodec* codec = FindLoadCodec(type);
    if (codec == nullptr || (row != nullptr && !row->InternalFormat)) {
        return LoadStreamByRow(row, stream);
    }
    return RunLoad(type, codec->read, stream, {}, fStreamHeaders);
}

bool TZalmoIO::RunLoad(std::int32_t type, const TZmReadFunction& read, TStream& stream,
                       const std::u16string& name, bool with_header) {
    return RunToNotice(kAfterLoad, [&](bool& aborting) {
        LoadSteps(type, read, stream, name, with_header, aborting);
    });
}

void TZalmoIO::LoadSteps(std::int32_t type, const TZmReadFunction& read, TStream& stream,
                         const std::u16string& name, bool with_header, bool& aborting) {
    TProgressRec progress = MakeProgress(aborting);
    if (!PrepareBitmap()) {
        aborting = true;
        return;
    }
    TIOParams& params = *GetParams();
    params.ResetInfo();
    fZmBitmap->RemoveAlphaChannel(/*merge=*/false, /*background=*/0);
    TZmStreamHeaderFind header;
    if (with_header) {
        header = SkipStreamHeader(type, stream);
    }
    const std::int64_t file_bytes = stream.GetSize();
    TZmMask alpha;
    if (header.is_acceptable) {
        TZmLoadCall call{stream, *fZmBitmap, params, progress, fBackground, /*params_only=*/false,
                         alpha};
        read(call);
    } else {
        aborting = true;
    }
    ApplyResolutionDefaults();
    TakeAlpha(alpha);
    if (!aborting) {
        AdjustDPI(file_bytes);
        params.fFileName = name;
        params.fFileType = type;
    }
    if (header.next >= 0) {
        stream.SetPosition(header.next);
    }
    Update();
    Notify({kNoticeBitmapChanged});
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

/// An internal row's function is no reader: its type either has a codec or cannot be read.
bool TZalmoIO::BeginRowLoad(const TZmFileFormatInfo* row) {
    TIOParams& params = *GetParams();
    fAborting = true;
    params.ResetInfo();
    params.fFileName.clear();
    params.fFileType = ioUnknown;
    return row != nullptr && !row->InternalFormat && row->ReadFunction != nullptr;
}

bool TZalmoIO::LoadFileByRow(const TZmFileFormatInfo* row, const std::u16string& name) {
    if (!BeginRowLoad(row)) {
        return FailWithNotice();
    }
    TFileStream stream(name, fmOpenRead);
    return RunRowLoad(*row, stream, name);
}

bool TZalmoIO::LoadStreamByRow(const TZmFileFormatInfo* row, TStream& stream) {
    return BeginRowLoad(row) ? RunRowLoad(*row, stream, {}) : FailWithNotice();
}

bool TZalmoIO::RunRowLoad(const TZmFileFormatInfo& row, TStream& stream,
                          const std::u16string& name) {
    return RunToNotice(kAfterLoad, [&](bool& aborting) {
        TProgressRec progress = MakeProgress(aborting);
        if (!PrepareBitmap()) {
            aborting = true;
            return;
        }
        TIOParams& params = *GetParams();
        params.fFileName = name;
        params.fFileType = row.FileType;
        const std::int64_t file_bytes = stream.GetSize();
        row.ReadFunction(stream, *fZmBitmap, params, progress, /*preview=*/false);
        if (!aborting) {
            AdjustDPI(file_bytes);
        }
        Update();
        Notify({kNoticeBitmapChanged});
    });
}

bool TZalmoIO::LoadFromFile(const std::u16string& file_name, std::int32_t file_type) {
    if (fZmBitmap == nullptr) {
        return false;
    }
    if (file_name.empty()) {
        return FailWithNotice();
    }
    if (IsUrl(file_name)) {
        return LoadFromURL(file_name);
    }
    fAborting = true;  // stands when the file cannot be opened
    if (file_type == ioUnknown) {
        file_type = FindFileFormat(file_name, zmfmContentOnly);
    }
    const bool is_whole_jpeg = file_type == ioJPEG && GetParams()->fJPEG_Scale == ioJPEG_FULLSIZE;
    if (fWicFastLoading && (file_type == ioPNG || is_whole_jpeg)) {
        return LoadFromFileWIC(file_name, file_type);
    }
    // Types without a row include the videos, for which there is no player here.
    const TZmFileFormatInfo* row = FindReaderRow(ReaderTypeOf(file_type));
    return row == nullptr ? FailWithNotice() : LoadFileAs(row->FileType, file_name);
}

bool TZalmoIO::LoadFromFile(const std::u16string& file_name, bool check_unknown) {
    if (IsUrl(file_name)) {
        return LoadFromFile(file_name, ioUnknown);
    }
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
    fAborting = true;  // stands when the file cannot be opened
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
    return FindReaderRow(file_type) == nullptr ? Fail() : LoadStreamAs(file_type, stream);
}

bool TZalmoIO::LoadFromBuffer(const void* buffer, std::int64_t size_bytes, std::int32_t file_type) {
    if (buffer == nullptr || size_bytes < 1) {
        return Fail();
    }
    TBorrowedMemoryStream stream(buffer, size_bytes);
    const TInPlace in_place(*this);
    return LoadFromStream(stream, file_type);
}

bool TZalmoIO::LoadFromResource(const std::u16string& module_path,
                                const std::u16string& resource_type,
                                const std::u16string& resource_name, std::int32_t file_type) {
    std::vector<std::uint8_t> bytes;
    const bool has_room = RunOrFail([&] {
        bytes = ResourceBytes(module_path, resource_type, resource_name);
        return true;
    });
    if (!has_room) {
        return false;
    }
    // The flag goes back also when the load raises.
    struct TFlag {
        TIOParams& params;
        explicit TFlag(TIOParams& owner) : params(owner) { params.fIsResource = true; }
        ~TFlag() { params.fIsResource = false; }
    } const flag(*GetParams());
    return LoadFromBuffer(bytes.data(), static_cast<std::int64_t>(bytes.size()), file_type);
}

bool TZalmoIO::LoadFromURL(const std::u16string& url) {
    CheckAttachedBitmap(ioUnknown);
    if (!IsUrl(url)) {
        return FailWithNotice();
    }
    return RunOrFail([&] { return RunOrStart([this, url] { return LoadURLNow(url); }); });
}

bool TZalmoIO::LoadURLNow(const std::u16string& url) {
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    platform::TUrlRequest request;
    request.url = url;
    request.proxy_address = settings.fProxyAddress;
    request.proxy_user = settings.fProxyUser;
    request.proxy_password = settings.fProxyPassword;
    ClearAborting();
    request.should_stop = [this] {
        threads_.PausePoint();
        return fAborting.load();
    };
    std::string error_text;
    const auto bytes = platform::FetchUrl(request, error_text);
    if (!bytes) {
        return FailWithNotice();
    }
    TMemoryStream stream(std::move(*bytes));
    std::int32_t type = FindStreamFormat(stream);
    if (type == ioUnknown) {
        type = FileNameToFileType(UrlPath(url));
    }
    const TInPlace in_place(*this);
    return type == ioUnknown ? FailWithNotice() : LoadFromStream(stream, type);
}

std::int32_t TZalmoIO::SeekTarget(TZmIOSeekDestination destination) {
    const TIOParams& params = *GetParams();
    const std::int32_t last = std::max(params.GetImageCount(), 1) - 1;
    switch (destination) {
        case zmioSeekFirst: return 0;
        case zmioSeekPrior: return std::clamp(params.GetImageIndex(), 1, last + 1) - 1;
        case zmioSeekNext: return std::clamp(params.GetImageIndex(), -1, last - 1) + 1;
        default: return last;
    }
}

std::int32_t TZalmoIO::Seek(TZmIOSeekDestination destination, const std::u16string& file_name) {
    if (!ParamsFromFile(file_name, std::int32_t{ioUnknown})) {
        return -1;
    }
    const std::int32_t target = SeekTarget(destination);
    const std::int32_t type = GetParams()->fFileType;
    GetParams()->SetImageIndex(target);
    return LoadFromFile(file_name, type) ? target : -1;
}

std::int32_t TZalmoIO::Seek(TZmIOSeekDestination destination, TStream& stream,
                            std::int32_t file_type) {
    const std::int64_t start = stream.GetPosition();
    if (!ParamsFromStream(stream, file_type)) {
        return -1;
    }
    stream.SetPosition(start);
    const std::int32_t target = SeekTarget(destination);
    const std::int32_t type = GetParams()->fFileType;
    GetParams()->SetImageIndex(target);
    return LoadFromStream(stream, type) ? target : -1;
}

}  // namespace zm
