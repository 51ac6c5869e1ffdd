#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/foundation/zmdefs.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/io/zmprogress.h"

namespace zm {

class TBitmap;
class TStream;
class TZmBitmap;
class TZmMask;
struct TZmFileFormatInfo;

using TZmFinishWorkEvent = std::function<void(void* sender)>;

/// The load and save driver: loads one image into one bitmap and saves it from there. It chooses
/// the codec by file type and runs the steps that are the same for all codecs: progress, abort,
/// reset of the parameters, resolution defaults, alpha, notices.
///
/// Failures: the Boolean result is the negation of GetAborting(), which stays set after a failed
/// call. Nothing is rolled back: the bitmap holds what the codec wrote before it stopped. Raised
/// are: EFOpenError when a file cannot be opened, EFCreateError when one cannot be created,
/// EZmException "Active layer does not contain bitmap" when no bitmap can be reached, and what a
/// codec raises; the finish notice has run then. Running out of memory is a failure, not raised.
///
/// A save never changes the bitmap; a codec that needs another pixel format gets a copy. A save
/// to a file replaces the target only when it is complete, so that the same file can be input
/// and output.
///
/// Works on the caller's thread. Codecs are re-entrant; one object serves one thread.
class TZalmoIO : public TZmParamsOwner {
public:
    /// With an empty bitmap of its own.
    TZalmoIO();
    /// Works on the given bitmap, which the caller keeps.
    static std::unique_ptr<TZalmoIO> CreateFromBitmap(TZmBitmap* bitmap);
    static std::unique_ptr<TZalmoIO> CreateFromBitmap(TBitmap* bitmap);
    ~TZalmoIO() override;
    TZalmoIO(const TZalmoIO&) = delete;
    TZalmoIO& operator=(const TZalmoIO&) = delete;

    /// The bitmap's own parameters when it has some, else the driver's.
    TIOParams* GetParams() const;
    TZmBitmap* GetZmBitmap() const { return fZmBitmap; }
    /// Works on another bitmap from now on; the driver's own one is freed. Nil detaches.
    void AttachZmBitmap(TZmBitmap* bitmap);
    /// Works on a platform bitmap, through a bitmap of the driver's own.
    void AttachTBitmap(TBitmap* bitmap);
    TZmBitmap* GetParamsBitmap() override { return fZmBitmap; }

    // Loading, file type known, told by the name, or found by content.
    /// File type 0: found by content.
    virtual bool LoadFromFile(const std::u16string& file_name, std::int32_t file_type);
    /// Type by extension; with `check_unknown`, by content when that fails.
    virtual bool LoadFromFile(const std::u16string& file_name, bool check_unknown);
    /// Type by content, else by extension.
    virtual bool LoadFromFileAuto(const std::u16string& file_name);
    /// As the first form, but type 0 is a failure.
    virtual bool LoadFromFileFormat(const std::u16string& file_name, std::int32_t file_type);
    virtual bool LoadFromStreamFormat(TStream& stream, std::int32_t file_type);
    /// File type 0: found by content at the stream's position.
    virtual bool LoadFromStream(TStream& stream, std::int32_t file_type);
    /// The memory is read in place; nil or a size below 1 is a failure.
    virtual bool LoadFromBuffer(const void* buffer, std::int64_t size_bytes,
                                std::int32_t file_type);

    // Saving.
    /// File type below 1: by the name's extension, else the parameters' fFileType, else JPEG. An
    /// empty name does nothing.
    virtual bool SaveToFile(const std::u16string& file_name, std::int32_t file_type);
    /// File type 0: the parameters' fFileType, else JPEG.
    virtual bool SaveToStream(TStream& stream, std::int32_t file_type);

    // The family of one format each.
    bool LoadFromFileBMP(const std::u16string& file_name);
    bool LoadFromStreamBMP(TStream& stream);
    bool SaveToFileBMP(const std::u16string& file_name);
    bool SaveToStreamBMP(TStream& stream);
    bool LoadFromFilePNG(const std::u16string& file_name);
    bool LoadFromStreamPNG(TStream& stream);
    bool SaveToFilePNG(const std::u16string& file_name);
    bool SaveToStreamPNG(TStream& stream);
    bool LoadFromFileJpeg(const std::u16string& file_name);
    bool LoadFromStreamJpeg(TStream& stream);
    bool SaveToFileJpeg(const std::u16string& file_name);
    bool SaveToStreamJpeg(TStream& stream);

    /// True after a failure. Setting it from the progress event stops the work.
    bool GetAborting() const { return fAborting; }
    void SetAborting(bool aborting) { fAborting = aborting; }
    /// Colour behind transparent pixels; PNG files carry it.
    TColor GetBackground() const { return fBackground; }
    void SetBackground(TColor background) { fBackground = background; }
    void SetOnProgress(TZmProgressEvent event) { fOnProgress = std::move(event); }
    /// Called once at the end of each load and save, also of a failed one.
    void SetOnFinishWork(TZmFinishWorkEvent event) { fOnFinishWork = std::move(event); }

protected:
    /// Progress 100, then the finish event.
    virtual void DoFinishWork();
    /// Forwards a codec's progress to the progress event.
    virtual void DoIntProgress(std::int32_t percent);

private:
    /// Reads the image at the stream's position into the bitmap. A mask with a size on return
    /// is the image's alpha.
    using TReadStep = std::function<void(TStream& stream, TProgressRec& progress, TZmMask& alpha)>;
    using TWriteStep =
        std::function<void(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress)>;
    struct TLoadCodec {
        std::int32_t type;
        TReadStep read;
    };
    struct TSaveCodec {
        std::int32_t type;
        TZmPixelFormatSet accepted;  // others are converted to zm24RGB; empty: all are accepted
        TWriteStep write;
    };

    void CheckAttachedBitmap() const;
    bool PrepareBitmap();
    void Update();
    TProgressRec MakeProgress();
    bool Fail();
    bool FailWithNotice();
    bool RunToNotice(const std::function<void()>& work);

    TLoadCodec LoadCodecBMP();
    TLoadCodec LoadCodecPNG();
    TLoadCodec LoadCodecJpeg();
    std::optional<TLoadCodec> InternalLoadCodec(std::int32_t file_type);
    bool RunLoadFile(const TLoadCodec& codec, const std::u16string& file_name);
    bool RunLoad(const TLoadCodec& codec, TStream& stream, const std::u16string& file_name);
    void LoadSteps(const TLoadCodec& codec, TStream& stream, const std::u16string& file_name);
    void ApplyResolutionDefaults();
    void TakeAlpha(TZmMask& alpha);
    bool BeginRowLoad(const TZmFileFormatInfo& row);
    bool LoadFileByRow(const TZmFileFormatInfo& row, const std::u16string& file_name);
    bool LoadStreamByRow(const TZmFileFormatInfo& row, TStream& stream);
    bool RunRowLoad(const TZmFileFormatInfo& row, TStream& stream, const std::u16string& file_name);

    TSaveCodec SaveCodecBMP();
    TSaveCodec SaveCodecPNG();
    TSaveCodec SaveCodecJpeg();
    std::optional<TSaveCodec> InternalSaveCodec(std::int32_t file_type);
    std::optional<TSaveCodec> RowSaveCodec(const TZmFileFormatInfo* row);
    bool RunSaveFile(const TSaveCodec& codec, const std::u16string& file_name);
    bool RunSave(const TSaveCodec& codec, TStream& stream);
    void SaveSteps(const TSaveCodec& codec, TStream& stream);
    TZmBitmap* BitmapToWrite(const TZmPixelFormatSet& accepted,
                             std::unique_ptr<TZmBitmap>& converted);

    std::unique_ptr<TZmBitmap> own_bitmap_;
    TBitmap* fBitmap = nullptr;
    TZmBitmap* fZmBitmap = nullptr;
    std::unique_ptr<TIOParams> fParams;
    TColor fBackground = 0;
    bool fAborting = false;
    TZmProgressEvent fOnProgress;
    TZmFinishWorkEvent fOnFinishWork;
};

}  // namespace zm
