#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmutils_dictionary.h"
#include "engine/io/zmexiffields.h"
#include "engine/io/zmiofields.h"

namespace zm {

class TStream;
class TZmBitmap;
class TZmFieldReader;
struct TZmIOFieldTable;

/// What an owner of file parameters tells them (the load and save driver).
class TZmParamsOwner {
public:
    virtual ~TZmParamsOwner() = default;
    /// The bitmap whose size the defaults take; nil when there is none.
    virtual TZmBitmap* GetParamsBitmap() = 0;
    /// Whether its last work failed or was stopped.
    virtual bool GetAborting() const = 0;
};

/// The one record through which an image's file-level facts flow: what a reader found in a file
/// and what a writer is to put in one. A file loaded in one format keeps its metadata when it is
/// saved in another. Belongs to its owner's thread; it has no lock.
class TIOParams : public TZmIOFields, public TZmExifFields {
public:
    /// Attached to nothing.
    TIOParams();
    /// Attached to a bitmap / to a driver, which outlives this object. Nil attaches to nothing.
    explicit TIOParams(TZmBitmap* attach_to);
    explicit TIOParams(TZmParamsOwner* attach_to);
    ~TIOParams();
    TIOParams(const TIOParams&) = delete;
    TIOParams& operator=(const TIOParams&) = delete;

    /// All fields to their defaults. The size follows the attached bitmap; the resolution
    /// follows the settings unless a bitmap is the owner, which keeps the present one.
    void SetDefaultParams();
    /// Forgets the kinds of information in the set; the empty set means all kinds.
    void ResetInfo(TZmMetaInfoItems items = TZmMetaInfoItems());
    /// The kinds of information that are present.
    TZmMetaInfoItems ContainsInfo() const;
    /// EXIF fields to those of an image without EXIF, the thumbnail freed, the first EXIF marker
    /// taken out of the marker list and the EXIF block out of the kept PNG chunks.
    void ResetEXIF();
    /// Copies all fields; the owner stays. Objects are cloned.
    void Assign(const TIOParams& source);
    /// Copies what decides how a file is encoded, no metadata.
    void AssignCompressionInfo(const TIOParams& source);
    /// Prepares a load for display in that size; a side below 1 goes back to the settings.
    void OptimizeLoadingParams(std::int32_t display_width, std::int32_t display_height);
    /// Depth and channel count as the format has them; grey also selects the grey JPEG.
    void UpdateBPSAndSPP(TZmPixelFormat format);
    void FreeColorMap();
    /// Makes fEXIF_Bitmap anew from the attached bitmap: zm24RGB in exactly that size. False, and
    /// the old one kept, without a bitmap, for a side below 1 and without room. Defined in the
    /// driver's room.
    bool UpdateEXIFThumbnail(std::int32_t Width, std::int32_t Height,
                             TResampleFilter ResampleFilter);

    /// Writes all persistent fields as a stream of their own format (magic, version, fields); an
    /// old file is replaced only by a complete one. Raises EFCreateError, EWriteError.
    void SaveToFile(const std::u16string& file_name);
    void SaveToStream(TStream& stream);
    /// Reads such a stream, of any version. Fields that its version does not have, and all that a
    /// stream which ends early lacks, get their defaults; fields that are not persistent stay. A
    /// stream without the magic raises EZmException; with `check_magic` false the stream stands
    /// behind the magic already.
    void LoadFromFile(const std::u16string& file_name, bool check_magic);
    void LoadFromStream(TStream& stream, bool check_magic);

    /// Fills these parameters from an image file's header through a driver; the present values
    /// steer the reading. False when the file cannot be read. Defined in the driver's room.
    bool Read(const std::u16string& file_name, std::int32_t file_type);
    /// Type by extension when asked, else by content.
    bool Read(const std::u16string& file_name, bool use_extension);
    bool Read(TStream& stream, std::int32_t file_type);
    bool Read(const void* buffer, std::int64_t size_bytes, std::int32_t file_type);

    /// Text of a field by its key, which is the field's name without its `f`, in any case (the
    /// list of keys: docs/io-parameters.md). Numbers, colours and ordinals of enumerations are
    /// decimal, Booleans "true" and "false". An unknown key gives the empty text.
    std::u16string GetProperty(std::u16string_view key);
    /// Sets a field from its text, blanks around it ignored. An unknown or read-only key does
    /// nothing, nor does a text that is no value of the field.
    void SetProperty(std::u16string_view key, std::u16string_view value);

    /// Turns latitude and longitude, of the position and of the destination, into degrees and
    /// minutes without fractions, minutes and seconds below 60, and a reference without a sign
    /// of its own (a negative latitude in the north is one in the south). Places that are not
    /// given stay.
    void AdjustGPSCoordinates();
    /// Whether the last work of the driver that owns these parameters failed.
    bool OwnerIsAborting() const;

    /// Text of the first IPTC item with both numbers, or empty / puts the text there, as a new
    /// item when there is none / removes it.
    std::string ReadIPTCField(std::uint8_t record, std::uint8_t dataset) const;
    void WriteIPTCField(std::uint8_t record, std::uint8_t dataset, std::string_view text);
    void ClearIPTCField(std::uint8_t record, std::uint8_t dataset);
    /// The same in the record of editorial data.
    std::string GetIPTC_Photoshop(std::uint8_t dataset) const;
    void SetIPTC_Photoshop(std::uint8_t dataset, std::string_view text);
    /// Also parses a packet that is another one than before into fDict, under "XMP"; a packet
    /// that does not parse, or an empty one, leaves no such entry.
    void SetXMP_Info(const std::string& packet);

    std::int32_t GetImageIndex() const { return fImageIndex; }
    /// Also sets the index of TIFF, DCX, GIF, ICO and CUR.
    void SetImageIndex(std::int32_t index);
    std::int32_t GetImageCount() const { return fImageCount; }
    /// Also sets the count of TIFF, GIF, AVI and media files.
    void SetImageCount(std::int32_t count);
    std::int32_t GetDpiX() const { return fDpiX; }
    /// Also sets fEXIF_XResolution.
    void SetDpiX(std::int32_t dpi);
    std::int32_t GetDpiY() const { return fDpiY; }
    /// Also sets fEXIF_YResolution.
    void SetDpiY(std::int32_t dpi);

    /// EXIF thumbnail, or nil.
    std::unique_ptr<TZmBitmap> fEXIF_Bitmap;
    /// Free key-value store of the format readers; also how values reach plug-in readers.
    TZmDictionary fDict;

private:
    friend struct TZmIOFieldTable;

    TZmBitmap* AttachedBitmap() const;
    void LoadFields(TZmFieldReader& reader);
    void TakeSettings();
    void ResetOtherTextMeta();
    bool HasOtherTextMeta() const;

    TZmBitmap* attached_bitmap_ = nullptr;
    TZmParamsOwner* attached_owner_ = nullptr;
    std::int32_t fImageIndex = 0;
    std::int32_t fImageCount = 0;
    std::int32_t fDpiX = 0;
    std::int32_t fDpiY = 0;
};

}  // namespace zm
