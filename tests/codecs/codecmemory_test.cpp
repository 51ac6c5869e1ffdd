#include <gtest/gtest.h>
#include <png.h>

#include <cstdlib>
#include <functional>
#include <memory>
#include <string>

#include "engine/bitmap/zmmask.h"
#include "engine/codecs/bmpfilt.h"
#include "engine/codecs/jpegfilt.h"
#include "engine/codecs/jpegfilt_p.h"
#include "engine/codecs/pngfilt.h"
#include "engine/codecs/wbmpfilt.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/allocprobe.h"
#include "tests/codecs/codecstreams.h"
#include "tests/codecs/jpegraw.h"
#include "tests/codecs/pngbuilder.h"
#include "tests/support/testimages.h"

// PNG and JPEG when memory ends anywhere, how much of it they take beside their libraries, and
// the readers over streams that raise.
namespace zm::test {
namespace {

constexpr std::int64_t kMostAllocations = 20000;

/// Runs a work with the n-th allocation failing, for every n that it reaches. A work gives false
/// for a failure.
void FailEveryAllocation(const std::function<bool(TAllocProbe&, std::int64_t)>& work) {
    {
        TAllocProbe probe;  // what is made once for the process is made here
        ASSERT_TRUE(work(probe, 0));
    }
    for (std::int64_t n = 1; n < kMostAllocations; ++n) {
        TAllocProbe probe;
        const bool is_done = work(probe, n);
        ASSERT_EQ(probe.LiveBytes(), 0) << "leak, allocation " << n;
        if (!probe.HasFailed()) {
            ASSERT_TRUE(is_done);
            EXPECT_GT(n, 10);
            return;
        }
    }
    FAIL() << "no end";
}

/// A reader raises nothing.
template <typename Read>
bool ReadWithFailure(TAllocProbe& probe, std::int64_t n, const TBytes& file, const Read& read) {
    bool aborting = false;
    TProgressRec progress;
    progress.Aborting = &aborting;
    TZmBitmap bitmap;
    TIOParams params;
    params.fJPEG_EnableAdjustOrientation = true;
    TBorrowedMemoryStream stream(file.data(), static_cast<std::int64_t>(file.size()));
    probe.FailAt(n);
    EXPECT_NO_THROW(read(stream, bitmap, progress, params)) << n;
    probe.FailAt(0);
    EXPECT_TRUE(aborting || !bitmap.IsEmpty()) << n;
    return !aborting;
}

void ReadPng(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress, TIOParams& params) {
    ReadPNGStream(stream, bitmap, params, /*params_only=*/false, progress);
}

void ReadJpeg(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress, TIOParams& params) {
    ReadJPEGStream(stream, bitmap, {}, progress, params);
}

TBytes RichPng() {
    TPngPicture picture{9, 7, 8, 6, true, PngText("Title", "text"), PngText("Last", "text")};
    return picture.Build();
}

TBytes RichJpeg(bool progressive) {
    TRawSettings settings;
    settings.progressive = progressive;
    settings.write_markers = [](jpeg_compress_struct& encoder) {
        const std::string block("Exif\0\0MM\0\52\0\0\0\10\0\1\1\22\0\3\0\0\0\1\0\6\0\0\0\0\0\0",
                                32);
        jpeg_write_marker(&encoder, 0xE1, reinterpret_cast<const JOCTET*>(block.data()),
                          static_cast<unsigned>(block.size()));
        jpeg_write_marker(&encoder, JPEG_COM, reinterpret_cast<const JOCTET*>("text"), 4);
    };
    return EncodeRawJpeg(settings);
}

TEST(CodecMemory, ReadersBearTheFailureOfEveryAllocation) {
    if (!AllocProbeIsThere()) {
        GTEST_SKIP() << "this build cannot watch the heap";
    }
    const TBytes png = RichPng();
    FailEveryAllocation([&png](TAllocProbe& probe, std::int64_t n) {
        return ReadWithFailure(probe, n, png, ReadPng);
    });
    for (const bool progressive : {false, true}) {
        const TBytes jpeg = RichJpeg(progressive);
        JpegMessageText(0);  // the texts are made once
        FailEveryAllocation([&jpeg](TAllocProbe& probe, std::int64_t n) {
            return ReadWithFailure(probe, n, jpeg, ReadJpeg);
        });
    }
}

/// A writer tells by its flag, or raises; the image stays.
template <typename Write>
bool WriteWithFailure(TAllocProbe& probe, std::int64_t n, TZmBitmap& bitmap, const Write& write) {
    bool aborting = false;
    TProgressRec progress;
    progress.Aborting = &aborting;
    TIOParams params;
    params.fPNG_TextKeys = params.fPNG_TextValues = {"Title"};
    params.fJPEG_MarkerList.AddMarker(kMarkerComment, TBytes{1, 2, 3});
    TMemoryStream stream;
    bool has_raised = false;
    probe.FailAt(n);
    try {
        write(stream, bitmap, progress, params);
    } catch (const std::exception&) {
        has_raised = true;
    }
    probe.FailAt(0);
    return !aborting && !has_raised;
}

TEST(CodecMemory, WritersBearTheFailureOfEveryAllocation) {
    if (!AllocProbeIsThere()) {
        GTEST_SKIP() << "this build cannot watch the heap";
    }
    const auto bitmap = MakeGradient(zm24RGB, 33, 21);
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(33, 21, 8));
    mask.Fill(17);
    mask.SetFull(false);
    for (const std::int32_t samples : {1, 4}) {
        FailEveryAllocation([&](TAllocProbe& probe, std::int64_t n) {
            return WriteWithFailure(
                probe, n, *bitmap,
                [&](TStream& stream, TZmBitmap& image, TProgressRec& progress, TIOParams& params) {
                    params.fSamplesPerPixel = samples;
                    WritePNGStream(stream, image, params, &mask, progress);
                });
        });
    }
    for (const bool progressive : {false, true}) {
        FailEveryAllocation([&](TAllocProbe& probe, std::int64_t n) {
            return WriteWithFailure(
                probe, n, *bitmap,
                [&](TStream& stream, TZmBitmap& image, TProgressRec& progress, TIOParams& params) {
                    params.fJPEG_Progressive = progressive;
                    WriteJPEGStream(stream, image, params, progress);
                });
        });
    }
    ExpectSamePixels(*MakeGradient(zm24RGB, 33, 21), *bitmap);
}

/// Takes everything and keeps nothing.
class TSinkStream : public TStream {
public:
    std::int32_t Read(void*, std::int32_t) override { return 0; }
    std::int32_t Write(const void*, std::int32_t count) override { return count; }
    std::int64_t Seek(std::int64_t, TSeekOrigin) override { return 0; }
};

std::int64_t PeakOf(const std::function<void()>& work) {
    TAllocProbe probe;
    work();
    return probe.PeakBytes();
}

std::int64_t ReadPeak(const TBytes& file, const decltype(ReadPng)& read) {
    return PeakOf([&] {
        bool aborting = false;
        TProgressRec progress;
        progress.Aborting = &aborting;
        TZmBitmap bitmap;
        TIOParams params;
        TBorrowedMemoryStream stream(file.data(), static_cast<std::int64_t>(file.size()));
        read(stream, bitmap, progress, params);
        EXPECT_FALSE(aborting);
    });
}

/// The library by itself, with the image in one block and bytes straight from memory.
std::int64_t PngLibraryPeak(const TBytes& file) {
    struct TSource {
        const std::uint8_t* at;
    } source{file.data()};
    return PeakOf([&] {
        png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
        png_infop info = png_create_info_struct(png);
        png_set_read_fn(png, &source, [](png_structp self, png_bytep target, std::size_t count) {
            auto* from = static_cast<TSource*>(png_get_io_ptr(self));
            std::copy(from->at, from->at + count, target);
            from->at += count;
        });
        png_read_info(png, info);
        const std::size_t row_bytes = png_get_rowbytes(png, info);
        std::vector<std::uint8_t> image(row_bytes * png_get_image_height(png, info));
        for (std::size_t at = 0; at < image.size(); at += row_bytes) {
            png_read_row(png, image.data() + at, nullptr);
        }
        png_destroy_read_struct(&png, &info, nullptr);
    });
}

/// Buffers of the streams and small objects, whatever the image's size.
constexpr std::int64_t kFixedBytes = 3 * 65536;
constexpr std::int64_t kWide = 4000;

TEST(CodecMemory, ReadersTakeAtMostOneRowBesideTheLibrary) {
    if (!AllocProbeIsThere()) {
        GTEST_SKIP() << "this build cannot watch the heap";
    }
    for (const int color_type : {2, 6}) {
        const TBytes file = TPngPicture{kWide, 300, 8, color_type, false, {}, {}}.Build();
        EXPECT_LE(ReadPeak(file, ReadPng), PngLibraryPeak(file) + kWide * 4 + kFixedBytes);
    }
    for (const bool progressive : {false, true}) {
        TRawSettings settings;
        settings.width = kWide;
        settings.height = 300;
        settings.progressive = progressive;
        const TBytes file = EncodeRawJpeg(settings);
        const std::int64_t library_peak = PeakOf([&file] {
            TRawJpeg raw;
            DecodeRawJpeg(file, JCS_EXT_BGR, 1, raw);
        });
        EXPECT_LE(ReadPeak(file, ReadJpeg), library_peak + kWide * 3 + kFixedBytes);
    }
}

/// Through the driver, so that what it does around the codec counts as well.
std::int64_t SavePeak(TZmBitmap& bitmap, std::int32_t type, bool grey) {
    const auto driver = TZalmoIO::CreateFromBitmap(&bitmap);
    driver->GetParams()->fSamplesPerPixel = grey ? 1 : 3;
    driver->GetParams()->fJPEG_ColorSpace = grey ? ioJPEG_GRAYLEV : ioJPEG_YCbCr;
    TSinkStream stream;
    return PeakOf([&] { EXPECT_TRUE(driver->SaveToStream(stream, type)); });
}

TEST(CodecMemory, SavesTakeNoSecondImage) {
    if (!AllocProbeIsThere()) {
        GTEST_SKIP() << "this build cannot watch the heap";
    }
    constexpr std::int64_t kOneRow = 4000;
    struct {
        std::int32_t type;
        TZmPixelFormat format;  // rows that go as they are, and rows that are converted
        bool alpha;
    } const cases[] = {{ioPNG, zm48RGB, false}, {ioPNG, zm24RGB, true},  {ioPNG, zm8g, false},
                       {ioJPEG, zm48RGB, true}, {ioJPEG, zmCMYK, false}, {ioJPEG, zm8g, false}};
    for (const auto& one : cases) {
        const auto peak_of = [&one](std::int32_t height) {
            const auto bitmap = MakeGradient(one.format, 1000, height);
            if (one.alpha) {
                AddNoiseAlpha(*bitmap, 1);
            }
            return SavePeak(*bitmap, one.type, one.format == zm8g);
        };
        EXPECT_LE(peak_of(700), peak_of(50) + kOneRow) << one.type << " from " << one.format;
    }
}

void ReadBmp(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress, TIOParams& params) {
    TZmMask alpha;
    ReadBMPStream(stream, bitmap, 0, false, alpha, false, false, progress, params);
}

void ReadWbmp(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress, TIOParams& params) {
    ReadWBMPStream(stream, bitmap, params, /*params_only=*/false, progress);
}

TEST(CodecStreams, StreamsThatRaiseAnywhereEndAsFailure) {
    const auto saved = [](std::int32_t type) {
        TMemoryStream stream;
        TIOParams params;
        EXPECT_TRUE(MakeGradient(zm1g, 40, 9)->Write(&stream, type, &params));
        return stream.Bytes();
    };
    struct {
        TBytes file;
        decltype(ReadPng)* read;
    } const cases[] = {{RichPng(), ReadPng},
                       {RichJpeg(false), ReadJpeg},
                       {saved(ioBMP), ReadBmp},
                       {saved(ioWBMP), ReadWbmp}};
    for (const auto& one : cases) {
        for (std::size_t good = 0; good < one.file.size(); ++good) {
            TRaisingStream stream(one.file, static_cast<std::int64_t>(good));
            TTestProgress progress;
            TZmBitmap bitmap;
            TIOParams params;
            ASSERT_NO_THROW(one.read(stream, bitmap, progress.record, params));
            ASSERT_TRUE(progress.aborting) << good;
        }
    }
}

}  // namespace
}  // namespace zm::test
