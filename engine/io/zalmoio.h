#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <memory>
#include <new>
#include <string>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/foundation/zmdefs.h"
#include "engine/io/zalmoio_formats.h"
#include "engine/io/zalmoio_threads.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/io/zmprogress.h"

namespace zm {

class TBitmap;
class TStream;
class TZmBitmap;
class TZmMask;
struct TZmFileFormatInfo;
struct TZmLoadCall;
using TZmReadFunction = std::function<void(TZmLoadCall&)>;
struct TZmSaveCodec;

using TZmFinishWorkEvent = std::function<void(void* sender)>;

/// Where Seek goes among the images of a file.
enum TZmIOSeekDestination : std::uint8_t {
    zmioSeekFirst,
    zmioSeekPrior,
    zmioSeekNext,
    zmioSeekLast,
};

/// How SaveToText writes the bytes of an image file.
enum TZmTextFormat : std::uint8_t {
    zmtfBase64,  ///< RFC 4648, no line breaks
    zmtfHex,     ///< lower-case hexadecimal
};

/// The load and save driver: loads one image into one bitmap and saves it from there. It chooses
/// the codec by file type and runs the steps that are the same for all codecs: progress, abort,
/// reset of the parameters, resolution defaults, alpha, notices.
///
/// Failures: the Boolean result is the negation of GetAborting(), which stays set after a failed
/// call; operations with a count give -1. Nothing is rolled back: the bitmap holds what the codec
/// wrote before it stopped. Raised are: EFOpenError when a file cannot be opened, EFCreateError
/// when one cannot be created, EZmException "Active layer does not contain bitmap" when no bitmap
/// can be reached, and what a codec raises; the finish notice has run then. Running out of memory
/// is a failure, not raised. A type without a codec fails.
///
/// A save never changes the bitmap; a codec that needs another pixel format gets a copy. A save
/// to a file replaces the target only when it is complete, so that the same file can be input
/// and output.
///
/// Threads: with SetAsyncMode(true), on a bitmap that is not the driver's own, loads and saves run
/// on a thread of the driver and come back at once, with true or -1. Until WaitThreads or the
/// finish notice nobody else touches the bitmap, the parameters and a stream that was handed
/// over. Notices from there wait in a queue for DrainNotices; all else belongs to the owner's
/// thread but SetAborting, GetAborting, SuspendThreads, ResumeThreads and DrainNotices, which any
/// may call. Two works at once on one driver are not kept apart. A class derived from this one
/// calls WaitThreads in its destructor.
class TZalmoIO : public TZmParamsOwner, public TZmIOFormats {
public:
    /// With an empty bitmap of its own.
    TZalmoIO();
    /// Works on the given bitmap, which the caller keeps.
    static std::unique_ptr<TZalmoIO> CreateFromBitmap(TZmBitmap* bitmap);
    static std::unique_ptr<TZalmoIO> CreateFromBitmap(TBitmap* bitmap);
    /// Waits for the threads.
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
    /// File type 0: found by content. A name that is a URL is fetched.
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
    /// The memory is read in place, always on the caller's thread; nil or a size below 1 is a
    /// failure.
    virtual bool LoadFromBuffer(const void* buffer, std::int64_t size_bytes,
                                std::int32_t file_type);
    /// A resource of a Windows module by the names of its type and of itself, both without case.
    bool LoadFromResource(const std::u16string& module_path, const std::u16string& resource_type,
                          const std::u16string& resource_name, std::int32_t file_type);
    /// Fetches http, https or ftp with the proxy of the settings; type by content, else by the
    /// extension in the URL.
    bool LoadFromURL(const std::u16string& url);
    /// Draws a metafile in zm24RGB at a size in pixels: a side below 1 follows the other one, with
    /// both below 1 it has its own size. The limits of the settings hold. `with_alpha`: what is not
    /// drawn on is transparent instead of white. Fails where the system cannot play the file.
    bool ImportMetafile(const std::u16string& file_name, std::int32_t width, std::int32_t height,
                        bool with_alpha);
    /// Moves the image index within the images of the file and loads that one; the new index, or
    /// -1. The stream starts at its present position.
    std::int32_t Seek(TZmIOSeekDestination destination, const std::u16string& file_name);
    std::int32_t Seek(TZmIOSeekDestination destination, TStream& stream, std::int32_t file_type);

    // The header only: fills GetParams() and leaves the bitmap alone.
    /// File type 0: found by content. A failure sets the parameters' fFileType to 0.
    virtual bool ParamsFromFile(const std::u16string& file_name, std::int32_t file_type);
    /// Type by extension when asked and known, else by content.
    virtual bool ParamsFromFile(const std::u16string& file_name, bool use_extension);
    virtual bool ParamsFromStream(TStream& stream, std::int32_t file_type);
    virtual bool ParamsFromBuffer(const void* buffer, std::int64_t size_bytes,
                                  std::int32_t file_type);
    /// Type 0 is a failure.
    virtual bool ParamsFromFileFormat(const std::u16string& file_name, std::int32_t file_type);
    virtual bool ParamsFromStreamFormat(TStream& stream, std::int32_t file_type);

    // Saving.
    /// File type below 1: by the name's extension, else the parameters' fFileType, else JPEG. An
    /// empty name does nothing.
    virtual bool SaveToFile(const std::u16string& file_name, std::int32_t file_type);
    /// File type 0: the parameters' fFileType, else JPEG.
    virtual bool SaveToStream(TStream& stream, std::int32_t file_type);
    /// The image file as text. Another format than those of TZmTextFormat raises EZmException
    /// "Unsupported text format".
    virtual bool SaveToText(const std::u16string& file_name, std::int32_t file_type,
                            TZmTextFormat format);
    virtual bool SaveToText(TStream& stream, std::int32_t file_type, TZmTextFormat format);

    // Metadata put into a JPEG file that stays as it is otherwise, without recoding: the block of
    // the parameters takes the place of the file's own, and without one the file loses its own.
    // EXIF comes from the fields where the room of EXIF blocks is there, else as the marker list
    // has it. The stream forms copy from one stream to another, both from their positions on.
    bool InjectJpegIPTC(const std::u16string& file_name);
    bool InjectJpegIPTCStream(TStream& input, TStream& output);
    bool InjectJpegEXIF(const std::u16string& file_name);
    bool InjectJpegEXIFStream(TStream& input, TStream& output);

    /// True after a failure. Setting it stops the work at its next progress step.
    bool GetAborting() const override { return fAborting; }
    void SetAborting(bool aborting) { fAborting = aborting; }
    /// Colour behind transparent pixels; PNG files carry it.
    TColor GetBackground() const { return fBackground; }
    void SetBackground(TColor background) { fBackground = background; }
    /// Saves to streams in JPEG, PCX and TIFF put a header with the length before the image, and
    /// loads from streams skip it and leave the stream behind the image, so that several follow
    /// one another. The header: the magic in 8 bytes, padded with zeros, and the length in 4.
    bool GetStreamHeaders() const { return fStreamHeaders; }
    void SetStreamHeaders(bool enabled) { fStreamHeaders = enabled; }
    /// After a load with different resolutions across and down, stretches the shorter side so
    /// that both are the same; with the settings' resampling filter, or by repeating pixels.
    bool GetAutoAdjustDPI() const { return fAutoAdjustDPI; }
    void SetAutoAdjustDPI(bool enabled) { fAutoAdjustDPI = enabled; }
    bool GetFilteredAdjustDPI() const { return fFilteredAdjustDPI; }
    void SetFilteredAdjustDPI(bool enabled) { fFilteredAdjustDPI = enabled; }

    /// Loads PNG files, and JPEG files in full size, through the platform's imaging component.
    bool GetWicFastLoading() const { return fWicFastLoading; }
    void SetWicFastLoading(bool enabled) { fWicFastLoading = enabled; }

    void SetOnProgress(TZmProgressEvent event) { fOnProgress = std::move(event); }
    /// Called once at the end of each load and save, also of a failed one.
    void SetOnFinishWork(TZmFinishWorkEvent event) { fOnFinishWork = std::move(event); }
    /// Called at the end of each load, before the finish event.
    void SetOnImageLoaded(TZmFinishWorkEvent event) { fOnImageLoaded = std::move(event); }
    /// Called on the driver's thread when a notice has been queued: the place to wake the owner.
    void SetOnNoticeQueued(TZmFinishWorkEvent event) { fOnNoticeQueued = std::move(event); }

    // Threads.
    bool GetAsyncMode() const { return fAsyncMode; }
    void SetAsyncMode(bool enabled) { fAsyncMode = enabled; }
    std::int32_t GetThreadsCount() const { return threads_.Count(); }
    /// Returns when no thread of the driver is at work; with `abort_all` the works end at their
    /// next progress step, and the flag is set even where none is. Suspended threads are resumed.
    void WaitThreads(bool abort_all);
    /// A pause: returns when each thread stands at a progress step of its work or has ended.
    void SuspendThreads() { threads_.Suspend(); }
    void ResumeThreads() { threads_.Resume(); }
    /// Delivers the queued notices in their order on the caller's thread, the owner's; returns
    /// how many.
    std::int32_t DrainNotices();

protected:
    /// Progress 100, then the finish event.
    virtual void DoFinishWork();
    /// Forwards a codec's progress to the progress event.
    virtual void DoIntProgress(std::int32_t percent);

    bool LoadFileAs(std::int32_t type, const std::u16string& name) override;
    bool LoadStreamAs(std::int32_t type, TStream& stream) override;
    bool SaveFileAs(std::int32_t type, const std::u16string& name) override;
    bool SaveStreamAs(std::int32_t type, TStream& stream) override;
    std::int32_t CountFile(std::int32_t type, const std::u16string& name) override;
    std::int32_t CountStream(std::int32_t type, TStream& stream) override;
    bool Refuse() override { return Fail(); }

private:
    /// How a save writes: through a codec, or through the function of an outside row.
    struct TWriter {
        std::int32_t type = 0;
        TZmPixelFormatSet accepted;
        const TZmSaveCodec* codec = nullptr;
        const TZmFileFormatInfo* row = nullptr;
        explicit operator bool() const { return codec != nullptr || row != nullptr; }
    };
    /// Works that use memory of the caller's own frame stay on its thread while one lives.
    class TInPlace {
    public:
        explicit TInPlace(TZalmoIO& driver) : driver_(driver) { ++driver_.in_place_; }
        ~TInPlace() { --driver_.in_place_; }
        TInPlace(const TInPlace&) = delete;
        TInPlace& operator=(const TInPlace&) = delete;

    private:
        TZalmoIO& driver_;
    };
    enum TAfterWork : std::uint8_t { kAfterLoad, kAfterSave };

    void CheckAttachedBitmap(std::int32_t type) const;
    bool PrepareBitmap();
    void Update();
    bool Fail();
    bool FailWithNotice();
    void ClearAborting();
    TProgressRec MakeProgress(bool& aborting);
    bool RunToNotice(TAfterWork after, const std::function<void(bool& aborting)>& work);
    bool StartsThread() const;
    bool RunOrStart(std::function<bool()> work);
    /// Runs `work`; running out of memory before it has begun is a failure like all others.
    template <typename TWork>
    bool RunOrFail(TWork work) {
        try {
            return work();
        } catch (const std::bad_alloc&) {
            return Fail();
        }
    }
    void Notify(const TZmIONotice& notice);
    void Deliver(const TZmIONotice& notice);

    bool LoadFileNow(std::int32_t type, const std::u16string& name);
    bool LoadStreamNow(std::int32_t type, TStream& stream);
    bool RunLoad(std::int32_t type, const TZmReadFunction& read, TStream& stream,
                 const std::u16string& name, bool with_header);
    void LoadSteps(std::int32_t type, const TZmReadFunction& read, TStream& stream,
                   const std::u16string& name, bool with_header, bool& aborting);
    void ApplyResolutionDefaults();
    void TakeAlpha(TZmMask& alpha);
    void AdjustDPI(std::int64_t file_bytes);
    bool StretchBitmap(std::int32_t width, std::int32_t height);
    bool BeginRowLoad(const TZmFileFormatInfo* row);
    bool LoadFileByRow(const TZmFileFormatInfo* row, const std::u16string& name);
    bool LoadStreamByRow(const TZmFileFormatInfo* row, TStream& stream);
    bool RunRowLoad(const TZmFileFormatInfo& row, TStream& stream, const std::u16string& name);
    bool LoadURLNow(const std::u16string& url);
    bool RunParams(std::int32_t type, TStream& stream, const std::u16string& name);
    std::int32_t SeekTarget(TZmIOSeekDestination destination);

    static TWriter CodecWriter(std::int32_t type);
    static TWriter RowWriter(const TZmFileFormatInfo* row);
    static TWriter WriterOfType(std::int32_t type);
    void PrepareSave(std::int32_t type, const std::u16string& name);
    bool SaveFileBy(const TWriter& writer, const std::u16string& name);
    bool SaveFileNow(const TWriter& writer, const std::u16string& name);
    bool SaveStreamNow(const TWriter& writer, TStream& stream);
    void SaveSteps(const TWriter& writer, TStream& stream, bool& aborting);
    TZmBitmap* BitmapToWrite(const TZmPixelFormatSet& accepted,
                             std::unique_ptr<TZmBitmap>& converted);

    std::unique_ptr<TZmBitmap> own_bitmap_;
    TBitmap* fBitmap = nullptr;
    TZmBitmap* fZmBitmap = nullptr;
    std::unique_ptr<TIOParams> fParams;
    TColor fBackground = 0;
    bool fStreamHeaders = false;
    bool fAutoAdjustDPI = false;
    bool fFilteredAdjustDPI = false;
    bool fAsyncMode = false;
    bool fWicFastLoading = false;
    std::atomic<bool> fAborting{false};
    std::atomic<bool> abort_all_{false};  // WaitThreads wants every work to end
    std::atomic<int> in_place_{0};        // works that must not move to a thread
    TZmProgressEvent fOnProgress;
    TZmFinishWorkEvent fOnFinishWork;
    TZmFinishWorkEvent fOnImageLoaded;
    TZmFinishWorkEvent fOnNoticeQueued;
    TZmIONoticeQueue notices_;
    TZmIOThreads threads_;  // last: its end waits for threads that use the rest
};

}  // namespace zm
