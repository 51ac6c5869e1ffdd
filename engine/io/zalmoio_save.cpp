#include <algorithm>
#include <string_view>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zalmoio_codecs_p.h"
#include "engine/io/zalmoio_headers_p.h"
#include "engine/io/zmfileformats.h"

// Saving: choice of the type, where the bytes go, and the steps that all codecs share.
namespace zm {

namespace {

std::string Base64Text(const std::vector<std::uint8_t>& bytes) {
    constexpr std::string_view kDigits =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    constexpr std::size_t kGroup = 3;
    std::string text;
    text.reserve((bytes.size() / kGroup + 1) * 4);
    for (std::size_t i = 0; i < bytes.size(); i += kGroup) {
        const std::size_t count = std::min(kGroup, bytes.size() - i);
        std::uint32_t group = 0;
        for (std::size_t k = 0; k < kGroup; ++k) {
            group = group << 8 | (k < count ? bytes[i + k] : 0u);
        }
        for (std::size_t k = 0; k < 4; ++k) {
            text += k <= count ? kDigits[group >> (18 - 6 * k) & 63] : '=';
        }
    }
    return text;
}

std::string HexText(const std::vector<std::uint8_t>& bytes) {
    constexpr std::string_view kDigits = "0123456789abcdef";
    std::string text;
    text.reserve(bytes.size() * 2);
    for (const std::uint8_t byte : bytes) {
        text += kDigits[byte >> 4];
        text += kDigits[byte & 15];
    }
    return text;
}

}  // namespace

void TZalmoIO::PrepareSave(std::int32_t type, const std::u16string& name) {
    TIOParams& params = *GetParams();
    if (type == ioPSD && MatchesExtensionList(name, "*.PSB")) {
        params.fPSD_LargeDocumentFormat = true;
    }
    const auto is_unset = [](const TZmIconSize& size) { return size == TZmIconSize{}; };
    if (type == ioICO && std::ranges::all_of(params.ICO_Sizes, is_unset)) {
        params.ICO_Sizes[0] = {fZmBitmap->GetWidth(), fZmBitmap->GetHeight()};
    }
}

TZalmoIO::TWriter TZalmoIO::CodecWriter(std::int32_t type) {
    const TZmSaveCodec* codec = FindInternalSaveCodec(type);
    return codec == nullptr ? TWriter{} : TWriter{type, codec->accepted, codec, nullptr};
}

/// An internal row's function is no writer: its type either has a codec or cannot be written.
TZalmoIO::TWriter TZalmoIO::RowWriter(const TZmFileFormatInfo* row) {
    if (row == nullptr || row->InternalFormat || row->WriteFunction == nullptr) {
        return {};
    }
    return {row->FileType, kColorOrTwoLevels, nullptr, row};
}

TZalmoIO::TWriter TZalmoIO::WriterOfType(std::int32_t type) {
    const TWriter writer = CodecWriter(type);
    return writer ? writer : RowWriter(FindFormatInfo(type));
}

bool TZalmoIO::SaveFileBy(const TWriter& writer, const std::u16string& name) {
    if (!writer) {
        return Fail();
    }
    return RunOrFail(
        [&] { return RunOrStart([this, writer, name] { return SaveFileNow(writer, name); }); });
}

bool TZalmoIO::SaveFileAs(std::int32_t type, const std::u16string& name) {
    CheckAttachedBitmap(type);
    return SaveFileBy(WriterOfType(type), name);
}

bool TZalmoIO::SaveStreamAs(std::int32_t type, TStream& stream) {
    CheckAttachedBitmap(type);
    const TWriter writer = WriterOfType(type);
    if (!writer) {
        return Fail();
    }
    return RunOrFail([&] {
        return RunOrStart([this, writer, &stream] { return SaveStreamNow(writer, stream); });
    });
}

bool TZalmoIO::SaveFileNow(const TWriter& writer, const std::u16string& name) {
    fAborting = true;  // stands when the file cannot be created
    TZmSaveFileStream stream(name);
    return RunToNotice(kAfterSave, [&](bool& aborting) {
        TIOParams& params = *GetParams();
        params.fFileName = name;
        params.fFileType = writer.type;
        PrepareSave(writer.type, name);
        SaveSteps(writer, stream, aborting);
        aborting = aborting || fAborting || !stream.Commit();
    });
}

bool TZalmoIO::SaveStreamNow(const TWriter& writer, TStream& stream) {
    return RunToNotice(kAfterSave, [&](bool& aborting) {
        PrepareSave(writer.type, {});
        const bool has_header = fStreamHeaders && HasStreamHeader(writer.type);
        const std::int64_t start = has_header ? ReserveStreamHeader(stream) : 0;
        SaveSteps(writer, stream, aborting);
        if (has_header && !aborting) {
            FillStreamHeader(writer.type, stream, start);
        }
    });
}

void TZalmoIO::SaveSteps(const TWriter& writer, TStream& stream, bool& aborting) {
    TProgressRec progress = MakeProgress(aborting);
    std::unique_ptr<TZmBitmap> converted;
    TZmBitmap* bitmap = PrepareBitmap() ? BitmapToWrite(writer.accepted, converted) : nullptr;
    if (bitmap == nullptr) {
        aborting = true;
        return;
    }
    TIOParams& params = *GetParams();
    if (writer.codec != nullptr) {
        TZmSaveCall call{stream, *bitmap, params, progress, fBackground};
        writer.codec->write(call);
    } else {
        params.fFileType = writer.type;
        writer.row->WriteFunction(stream, *bitmap, params, progress);
    }
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
    if (file_type == ioLYR) {
        return SaveToFileZMN(file_name);
    }
    if (file_type != ioPDF && file_type != ioSVG) {
        CheckAttachedBitmap(file_type);
    }
    if (file_type == ioOtherWIC) {
        return SaveToFileWIC(file_name, BuiltInSaveType(file_name));
    }
    const TWriter writer = CodecWriter(file_type);
    if (writer || !is_by_name) {
        return SaveFileBy(writer ? writer : RowWriter(FindFormatInfo(file_type)), file_name);
    }
    return SaveFileBy(RowWriter(FindFormatInfoByExtension(FileExtension(file_name))), file_name);
}

bool TZalmoIO::SaveToStream(TStream& stream, std::int32_t file_type) {
    if (file_type == ioUnknown) {
        file_type = GetParams()->fFileType;
    }
    return SaveStreamAs(file_type == ioUnknown ? ioJPEG : file_type, stream);
}

bool TZalmoIO::SaveToText(TStream& stream, std::int32_t file_type, TZmTextFormat format) {
    if (format != zmtfBase64 && format != zmtfHex) {
        throw EZmException("Unsupported text format");
    }
    TMemoryStream file;
    const TInPlace in_place(*this);
    return SaveToStream(file, file_type) && RunOrFail([&] {
               const std::string text =
                   format == zmtfBase64 ? Base64Text(file.Bytes()) : HexText(file.Bytes());
               stream.WriteBuffer(text.data(), text.size());
               return true;
           });
}

bool TZalmoIO::SaveToText(const std::u16string& file_name, std::int32_t file_type,
                          TZmTextFormat format) {
    fAborting = true;  // stands when the file cannot be created
    TZmSaveFileStream stream(file_name);
    return SaveToText(stream, file_type, format) && (stream.Commit() || Fail());
}

}  // namespace zm
