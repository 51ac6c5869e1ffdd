#include "engine/io/zmformatdetect.h"

#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfileformats.h"
#include "engine/io/zmformatdetect_tests_p.h"
#include "engine/platform/files.h"

namespace zm {

namespace {

struct TDetectTest {
    std::int32_t size_above;  ///< the size must exceed it; kNoLimit: any size
    bool (*holds)(TDetectSource& source);
    std::int32_t type;
};

constexpr std::int32_t kNoLimit = -1;

bool IsJPEGBehindRawSignature(TDetectSource& source) {
    return !HasRawSignature(source) && FindJPEGStart(source) >= 0;
}

bool IsPlainTIFF(TDetectSource& source) {
    return IsTIFF(source) && !IsCameraRawTIFF(source);
}

// Formats without a reliable magic stand behind those that have one; the order decides.
constexpr TDetectTest kTests[] = {
    {12, [](TDetectSource& s) { return HasZeroPaddedMagic(s, "JFIF", 12); }, ioJPEG},
    {13, IsGIF, ioGIF},
    {12, [](TDetectSource& s) { return HasZeroPaddedMagic(s, "PCX2", 12); }, ioPCX},
    {4, [](TDetectSource& s) { return HasZeroPaddedMagic(s, "PCX", 4); }, ioPCX},
    {14, IsBMP, ioBMP},
    {128, IsPCX, ioPCX},
    {12, [](TDetectSource& s) { return HasZeroPaddedMagic(s, "TIFF", 12); }, ioTIFF},
    {kNoLimit, IsHDPhoto, ioHDP},
    {kNoLimit, [](TDetectSource& s) { return IsPlainTIFF(s) && HasRawSignature(s); }, ioRAW},
    {kNoLimit, IsPlainTIFF, ioTIFF},
    {8, IsPNG, ioPNG},
    {kNoLimit, IsDICOM, ioDICOM},
    {kNoLimit, [](TDetectSource& s) { return IsIconDirectory(s, 1); }, ioICO},
    {kNoLimit, [](TDetectSource& s) { return IsIconDirectory(s, 2); }, ioCUR},
    {kNoLimit, IsTGA, ioTGA},
    {kNoLimit, IsPXM, ioPXM},
    {kNoLimit, IsJP2, ioJP2},
    {kNoLimit, IsJ2K, ioJ2K},
    {kNoLimit, IsAVI, ioAVI},
    {kNoLimit, IsDCX, ioDCX},
    {kNoLimit, IsWMF, ioWMF},
    {kNoLimit, IsEMF, ioEMF},
    {kNoLimit, IsPSD, ioPSD},
    {kNoLimit, [](TDetectSource& s) { return IsVectorObjects(s, 0); }, ioZMV},
    {kNoLimit, [](TDetectSource& s) { return IsLayers(s, 0); }, ioLYR},
    {kNoLimit, IsLayersAndVectors, ioALL},
    {kNoLimit, IsJPEGBehindRawSignature, ioJPEG},
};

std::int32_t TypeBySignature(TDetectSource& source) {
    for (const TDetectTest& test : kTests) {
        const bool size_fits = test.size_above == kNoLimit || source.LimitSize() > test.size_above;
        if (size_fits && test.holds(source)) {
            return test.type;
        }
    }
    return ioUnknown;
}

std::int32_t TypeByRows(TDetectSource& source) {
    for (const auto& row : ZmGlobalSettings().fFileFormats) {
        if (row->TryFunction == nullptr) {
            continue;
        }
        source.Rewind();
        if (row->TryFunction(source.Stream(), row->FileType)) {
            return row->FileType;
        }
    }
    return ioUnknown;
}

/// Both words on an icon or cursor, or a row of the content's own type.
std::int32_t MatchContentWithExtension(std::int32_t content, const TZmFileFormatInfo* row,
                                       const std::u16string& extension) {
    if (row != nullptr) {
        const bool is_icon = content == ioICO || content == ioCUR;
        return is_icon || row->FileType == content ? row->FileType : ioUnknown;
    }
    return content == ioAVI && extension == u".avi" ? ioAVI : ioUnknown;
}

std::int32_t ContentOfFile(const std::u16string& file_name) {
    TFileStream stream(file_name, fmOpenRead);
    return FindStreamFormat(stream);
}

}  // namespace

std::int32_t FindStreamFormat(TStream& stream) {
    TDetectSource source(stream);
    const std::int32_t type = TypeBySignature(source);
    return type != ioUnknown ? type : TypeByRows(source);
}

std::int32_t FindFileFormat(const std::u16string& file_name, TZmFindFormatMethod method) {
    if (file_name.empty() || !platform::FileExists(file_name)) {
        return ioUnknown;
    }
    const std::int32_t content = ContentOfFile(file_name);
    const std::u16string extension = AsciiLower(FileExtension(file_name));
    const TZmFileFormatInfo* row = FindFormatInfoByExtension(extension);
    if (row != nullptr && row->FileType == ioRAW &&
        (content == ioTIFF || (content == ioOtherWIC && method != zmfmContentOnly))) {
        return ioRAW;
    }
    if (row != nullptr && !row->InternalFormat) {
        return row->FileType;
    }
    if (method == zmfmContentMatchingExtension && content != ioUnknown) {
        return MatchContentWithExtension(content, row, extension);
    }
    if (method == zmfmContentElseExtension && content == ioUnknown && row != nullptr) {
        return row->FileType;
    }
    return content;
}

}  // namespace zm
