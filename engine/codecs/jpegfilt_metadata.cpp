// The markers of a JPEG file that carry metadata (EXIF 2.32 section 4.7; XMP part 3, 1.1.3; ICC.1
// annex B.4; IPTC in resource blocks): found in the marker list, handed to the rooms that know
// them, and profiles cut into markers again.

#include <algorithm>
#include <array>
#include <string_view>

#include "engine/codecs/jpegfilt_p.h"
#include "engine/codecs/orientation.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/metadata/zmexiforientation.h"
#include "engine/metadata/zmmetahooks.h"

namespace zm {

namespace {

constexpr std::string_view kResourcePrefix = "Photoshop 3.0";
constexpr std::string_view kXmpPrefix{"http://ns.adobe.com/xap/1.0/\0", 29};
constexpr std::string_view kProfilePrefix{"ICC_PROFILE\0", 12};
constexpr std::size_t kExifPrefixBytes = 6;

/// A profile's piece: the prefix, the piece's number from 1, the count of pieces, the bytes.
constexpr std::size_t kProfileHeadBytes = kProfilePrefix.size() + 2;
constexpr std::size_t kProfilePieceBytes = kJpegMarkerDataBytes - kProfileHeadBytes;
constexpr std::size_t kMostProfilePieces = 255;

using TBytes = std::span<const std::uint8_t>;

bool StartsWith(TBytes data, std::string_view prefix) {
    return data.size() >= prefix.size() &&
           std::equal(prefix.begin(), prefix.end(), data.begin(), [](char c, std::uint8_t byte) {
               return static_cast<std::uint8_t>(c) == byte;
           });
}

/// Calls `use` with each marker of the type until it gives true; whether it did.
template <typename Use>
bool SearchMarkers(const TZmMarkerList& markers, std::uint8_t type, const Use& use) {
    for (std::int32_t i = 0; i < markers.Count(); ++i) {
        if (markers.GetMarkerType(i) == type && use(markers.GetMarkerData(i))) {
            return true;
        }
    }
    return false;
}

void ReadIptc(TIOParams& params) {
    SearchMarkers(params.fJPEG_MarkerList, kMarkerApp13, [&params](TBytes data) {
        return IsJpegResourceMarker(kMarkerApp13, data) &&
               params.fIPTC_Info.LoadFromStandardBuffer(data);
    });
}

/// The resolution of the block counts when the file has only the placeholder.
void TakeExifResolution(TIOParams& params) {
    if (params.GetDpiX() == 1 && params.GetDpiY() == 1) {
        params.SetDpiX(TruncToInt(params.fEXIF_XResolution));
        params.SetDpiY(TruncToInt(params.fEXIF_YResolution));
    }
}

void ReadExif(TIOParams& params) {
    const auto read = MetadataHooks().read_exif;
    SearchMarkers(params.fJPEG_MarkerList, kMarkerApp1, [&params, read](TBytes data) {
        if (!IsExifMarkerData(data)) {
            return false;
        }
        const TBytes block = data.subspan(kExifPrefixBytes);
        if (const std::int32_t orientation = ReadExifOrientation(block); orientation != 0) {
            params.fEXIF_Orientation = orientation;
        }
        if (read != nullptr && read(params, block)) {
            TakeExifResolution(params);
        }
        params.fTIFF_Orientation = params.fEXIF_Orientation;
        return true;
    });
}

void ReadXmp(TIOParams& params) {
    SearchMarkers(params.fJPEG_MarkerList, kMarkerApp1, [&params](TBytes data) {
        if (!StartsWith(data, kXmpPrefix)) {
            return false;
        }
        const TBytes packet = data.subspan(kXmpPrefix.size());
        params.SetXMP_Info(std::string(packet.begin(), packet.end()));
        return true;
    });
}

bool ReadProfile(TIOParams& params) {
    const auto read = MetadataHooks().read_input_profile;
    if (read == nullptr) {
        return false;
    }
    const std::vector<std::uint8_t> profile = JoinJpegProfile(params.fJPEG_MarkerList);
    return !profile.empty() && read(params, profile);
}

/// Cameras name the colour space in the block instead of adding a profile.
bool MakeInteropProfile(TIOParams& params) {
    const auto make = MetadataHooks().make_interop_profile;
    return make != nullptr && !params.fEXIF_InteropIndex.empty() &&
           ZmGlobalSettings().fEXIFInteroperabilityIndexUsage != zmiiNone && make(params);
}

}  // namespace

bool IsJpegResourceMarker(std::uint8_t type, std::span<const std::uint8_t> data) {
    return type == kMarkerApp13 && StartsWith(data, kResourcePrefix);
}

bool IsJpegProfileMarker(std::uint8_t type, std::span<const std::uint8_t> data) {
    return type == kMarkerApp2 && data.size() >= kProfileHeadBytes &&
           StartsWith(data, kProfilePrefix);
}

std::vector<std::uint8_t> JoinJpegProfile(const TZmMarkerList& markers) {
    std::array<TBytes, kMostProfilePieces + 1> pieces;  // by their number
    std::size_t count = 0;
    for (std::int32_t i = 0; i < markers.Count(); ++i) {
        const TBytes data = markers.GetMarkerData(i);
        if (!IsJpegProfileMarker(markers.GetMarkerType(i), data)) {
            continue;
        }
        const std::size_t number = data[kProfilePrefix.size()];
        const std::size_t total = data[kProfilePrefix.size() + 1];
        const bool is_repeated = pieces[number].data() != nullptr;
        if (number < 1 || number > total || (count != 0 && total != count) || is_repeated) {
            return {};
        }
        count = total;
        pieces[number] = data.subspan(kProfileHeadBytes);
    }
    std::vector<std::uint8_t> profile;
    for (std::size_t number = 1; number <= count; ++number) {
        if (pieces[number].data() == nullptr) {
            return {};
        }
        profile.insert(profile.end(), pieces[number].begin(), pieces[number].end());
    }
    return profile;
}

void CutJpegProfile(std::span<const std::uint8_t> profile, TZmMarkerList& markers) {
    const std::size_t count = (profile.size() + kProfilePieceBytes - 1) / kProfilePieceBytes;
    if (count > kMostProfilePieces) {
        return;
    }
    for (std::size_t number = 1; number <= count; ++number) {
        const std::size_t start = (number - 1) * kProfilePieceBytes;
        const TBytes piece =
            profile.subspan(start, std::min(kProfilePieceBytes, profile.size() - start));
        std::vector<std::uint8_t> data(kProfilePrefix.begin(), kProfilePrefix.end());
        data.push_back(static_cast<std::uint8_t>(number));
        data.push_back(static_cast<std::uint8_t>(count));
        data.insert(data.end(), piece.begin(), piece.end());
        markers.AddMarker(kMarkerApp2, data);
    }
}

TZmMarkerList JpegMarkersToWrite(TIOParams& params) {
    TZmMarkerList result;
    const auto output_profile = MetadataHooks().output_profile;
    if (output_profile != nullptr) {
        CutJpegProfile(output_profile(params, ioJPEG), result);
    }
    const bool has_profile = result.Count() > 0;
    const TZmMarkerList& markers = params.fJPEG_MarkerList;
    for (std::int32_t i = 0; i < markers.Count(); ++i) {
        const std::uint8_t type = markers.GetMarkerType(i);
        const TBytes data = markers.GetMarkerData(i);
        // Two profiles in one file would be read as one damaged one.
        const bool is_replaced = has_profile && IsJpegProfileMarker(type, data);
        if (type != kMarkerApp14 && !is_replaced) {
            result.AddMarker(type, data);
        }
    }
    return result;
}

TJpegMetadata ReadJpegMetadata(TIOParams& params) {
    TJpegMetadata found;
    params.fEXIF_Orientation = kOrientationUpright;
    ReadIptc(params);
    ReadExif(params);
    found.orientation = params.fEXIF_Orientation;
    ReadXmp(params);
    found.has_input_profile = ReadProfile(params) || MakeInteropProfile(params);
    return found;
}

bool ApplyJpegOrientation(TZmBitmap& bitmap, TIOParams& params, std::int32_t orientation) {
    if (!TurnUpright(bitmap, orientation)) {
        return false;
    }
    params.fEXIF_Orientation = kOrientationUpright;
    params.fTIFF_Orientation = kOrientationUpright;
    // The block goes out again as it is when the image is saved, and readers must not turn the
    // upright picture once more.
    TZmMarkerList& markers = params.fJPEG_MarkerList;
    for (std::int32_t i = 0; i < markers.Count(); ++i) {
        const TBytes data = markers.GetMarkerData(i);
        if (markers.GetMarkerType(i) != kMarkerApp1 || !IsExifMarkerData(data)) {
            continue;
        }
        std::vector<std::uint8_t> changed(data.begin(), data.end());
        if (SetExifOrientation(std::span(changed).subspan(kExifPrefixBytes), kOrientationUpright)) {
            markers.DeleteMarker(i);
            markers.InsertMarker(i, kMarkerApp1, changed);
        }
    }
    return true;
}

}  // namespace zm
