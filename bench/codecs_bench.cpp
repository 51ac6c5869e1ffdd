// PNG and JPEG of 12 megapixels through the load and save driver, against the libraries used
// directly in the same run. Library and driver take turns in every iteration; the time shown is
// the driver's, `to_library` the ratio of the fastest runs in processor time. Both start from
// bytes in memory and make a fresh bitmap, or end in a fresh block of memory. Where the JPEG
// library's own programs are installed, `to_program` compares with a run of theirs, start of the
// program included.

#include <benchmark/benchmark.h>

#include <cstdio>
// The library's header needs <cstdio> before it.
#include <jpeglib.h>
#include <png.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"

namespace zm {
namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;
constexpr std::size_t kRowBytes = std::size_t{kWidth} * 3;

using TBytes = std::vector<std::uint8_t>;

/// A picture as cameras make it: smooth shapes under some noise.
const std::unique_ptr<TZmBitmap>& Picture() {
    static const std::unique_ptr<TZmBitmap> picture = [] {
        auto bitmap = std::make_unique<TZmBitmap>(kWidth, kHeight, zm24RGB);
        std::uint32_t noise = 1;
        for (std::int32_t y = 0; y < kHeight; ++y) {
            std::uint8_t* row = bitmap->GetScanLine(y);
            for (std::int32_t i = 0; i < kWidth * 3; ++i) {
                noise = noise * 1664525u + 1013904223u;
                row[i] = static_cast<std::uint8_t>(
                    (i * 255 / (kWidth * 3) + y / 8 + (noise >> 29)) & 255);
            }
        }
        return bitmap;
    }();
    return picture;
}

/// The same with red first, as libraries want it.
const TBytes& PictureRgb() {
    static const TBytes pixels = [] {
        TBytes result(kRowBytes * kHeight);
        for (std::int32_t y = 0; y < kHeight; ++y) {
            const std::uint8_t* row = Picture()->GetScanLine(y);
            std::uint8_t* target = result.data() + static_cast<std::size_t>(y) * kRowBytes;
            for (std::size_t i = 0; i < kRowBytes; i += 3) {
                target[i] = row[i + 2];
                target[i + 1] = row[i + 1];
                target[i + 2] = row[i];
            }
        }
        return result;
    }();
    return pixels;
}

TBytes SaveByDriver(TZmBitmap& bitmap, std::int32_t type) {
    TMemoryStream stream;
    TIOParams params;
    bitmap.Write(&stream, type, &params);
    return stream.Bytes();
}

const TBytes& JpegFile() {
    static const TBytes file = SaveByDriver(*Picture(), ioJPEG);
    return file;
}

const TBytes& PngFile() {
    static const TBytes file = SaveByDriver(*Picture(), ioPNG);
    return file;
}

const TBytes& PngAlphaFile() {
    static const TBytes file = [] {
        TZmBitmap bitmap;
        bitmap.AssignImage(Picture().get());
        TZmBitmap* alpha = bitmap.GetAlphaChannel();
        for (std::int32_t y = 0; y < kHeight; ++y) {
            std::uint8_t* row = alpha->GetScanLine(y);
            for (std::int32_t x = 0; x < kWidth; ++x) {
                row[x] = static_cast<std::uint8_t>(x / 16 + y / 16);
            }
        }
        alpha->SetFull(false);
        return SaveByDriver(bitmap, ioPNG);
    }();
    return file;
}

// The libraries by themselves. Their default error handling ends the program, as it should here.

void DecodeJpeg(const TBytes& file) {
    jpeg_decompress_struct decoder = {};
    jpeg_error_mgr errors = {};
    decoder.err = jpeg_std_error(&errors);
    jpeg_create_decompress(&decoder);
    jpeg_mem_src(&decoder, file.data(), static_cast<unsigned long>(file.size()));
    jpeg_read_header(&decoder, TRUE);
    decoder.dct_method = JDCT_ISLOW;
    jpeg_start_decompress(&decoder);
    TZmBitmap image(kWidth, kHeight, zm24RGB);
    while (decoder.output_scanline < decoder.output_height) {
        JSAMPROW row = image.GetScanLine(static_cast<std::int32_t>(decoder.output_scanline));
        jpeg_read_scanlines(&decoder, &row, 1);
    }
    jpeg_finish_decompress(&decoder);
    jpeg_destroy_decompress(&decoder);
}

void EncodeJpeg() {
    jpeg_compress_struct encoder = {};
    jpeg_error_mgr errors = {};
    encoder.err = jpeg_std_error(&errors);
    jpeg_create_compress(&encoder);
    unsigned char* memory = nullptr;
    unsigned long size = 0;
    jpeg_mem_dest(&encoder, &memory, &size);
    encoder.image_width = kWidth;
    encoder.image_height = kHeight;
    encoder.input_components = 3;
    encoder.in_color_space = JCS_RGB;
    jpeg_set_defaults(&encoder);
    jpeg_set_quality(&encoder, 80, TRUE);
    encoder.dct_method = JDCT_ISLOW;
    jpeg_start_compress(&encoder, TRUE);
    while (encoder.next_scanline < encoder.image_height) {
        auto* row = const_cast<JSAMPROW>(PictureRgb().data() + encoder.next_scanline * kRowBytes);
        jpeg_write_scanlines(&encoder, &row, 1);
    }
    jpeg_finish_compress(&encoder);
    jpeg_destroy_compress(&encoder);
    std::free(memory);
}

void DecodePng(const TBytes& file) {
    const std::uint8_t* at = file.data();
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_set_read_fn(png, &at, [](png_structp self, png_bytep target, std::size_t count) {
        auto** from = static_cast<const std::uint8_t**>(png_get_io_ptr(self));
        std::copy(*from, *from + count, target);
        *from += count;
    });
    png_read_info(png, info);
    TZmBitmap image(kWidth, kHeight, png_get_channels(png, info) == 4 ? zm32RGB : zm24RGB);
    for (std::int32_t row = 0; row < kHeight; ++row) {
        png_read_row(png, image.GetScanLine(row), nullptr);
    }
    png_read_end(png, nullptr);
    png_destroy_read_struct(&png, &info, nullptr);
}

/// The level and the filter that parameters have by default.
void EncodePng() {
    TBytes file;
    png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_set_write_fn(
        png, &file,
        [](png_structp self, png_bytep bytes, std::size_t count) {
            auto* target = static_cast<TBytes*>(png_get_io_ptr(self));
            target->insert(target->end(), bytes, bytes + count);
        },
        [](png_structp) {});
    png_set_IHDR(png, info, kWidth, kHeight, 8, PNG_COLOR_TYPE_RGB, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    png_set_filter(png, PNG_FILTER_TYPE_BASE, PNG_FILTER_NONE);
    png_set_compression_level(png, 5);
    png_write_info(png, info);
    for (std::size_t row = 0; row < kHeight; ++row) {
        png_write_row(png, PictureRgb().data() + row * kRowBytes);
    }
    png_write_end(png, nullptr);
    png_destroy_write_struct(&png, &info);
    benchmark::DoNotOptimize(file.data());
}

// The driver.

void Load(const TBytes& file, std::int32_t type) {
    TZmBitmap bitmap;
    TIOParams params;
    const bool is_read =
        bitmap.Read(file.data(), static_cast<std::int64_t>(file.size()), type, &params);
    if (!is_read) {
        std::abort();
    }
}

void Save(std::int32_t type) {
    TMemoryStream stream;
    TIOParams params;
    if (!Picture()->Write(&stream, type, &params)) {
        std::abort();
    }
}

/// Processor time, which other programs on the machine disturb less.
template <typename Work>
double CpuSecondsOf(const Work& work) {
    const std::clock_t start = std::clock();
    work();
    return static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC;
}

template <typename Work>
double SecondsOf(const Work& work) {
    const auto start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

/// Seconds of a run of a program, the best of a few; 0 when it cannot be run.
double ProgramSeconds(const std::string& command) {
    double best = std::numeric_limits<double>::max();
    for (int run = 0; run < 3; ++run) {
        bool is_run = false;
        const double seconds =
            SecondsOf([&] { is_run = std::system((command + " >/dev/null 2>&1").c_str()) == 0; });
        if (!is_run) {
            return 0;
        }
        best = std::min(best, seconds);
    }
    return best;
}

/// Library and driver in turns; `program` is a command line or empty.
template <typename Library, typename Driver>
void Compare(benchmark::State& state, const Library& library, const Driver& driver,
             const std::string& program) {
    double library_best = std::numeric_limits<double>::max();
    double driver_best = library_best;
    double shown_best = library_best;
    for (auto _ : state) {
        double seconds = 0;
        library_best = std::min(library_best, CpuSecondsOf(library));
        const double cpu_seconds = CpuSecondsOf([&] { seconds = SecondsOf(driver); });
        driver_best = std::min(driver_best, cpu_seconds);
        shown_best = std::min(shown_best, seconds);
        state.SetIterationTime(seconds);
    }
    state.counters["to_library"] = driver_best / library_best;
    const double program_seconds = program.empty() ? 0 : ProgramSeconds(program);
    if (program_seconds > 0) {
        state.counters["to_program"] = shown_best / program_seconds;
    }
}

/// A file beside the benchmark's run, for programs.
class TScratchFile {
public:
    TScratchFile(const std::string& name, const std::string& head, const TBytes& bytes)
        : path_(std::filesystem::temp_directory_path() / name) {
        std::ofstream file(path_, std::ios::binary);
        file << head;
        file.write(reinterpret_cast<const char*>(bytes.data()),
                   static_cast<std::streamsize>(bytes.size()));
    }
    ~TScratchFile() {
        std::error_code ignored;
        std::filesystem::remove(path_, ignored);
    }
    TScratchFile(const TScratchFile&) = delete;
    TScratchFile& operator=(const TScratchFile&) = delete;
    std::string Name() const { return path_.string(); }

private:
    std::filesystem::path path_;
};

void BM_JpegDecode(benchmark::State& state) {
    const TBytes& file = JpegFile();
    const TScratchFile scratch("zmbench.jpg", "", file);
    Compare(
        state, [&file] { DecodeJpeg(file); }, [&file] { Load(file, ioJPEG); },
        "djpeg -dct int -pnm " + scratch.Name());
}

void BM_JpegEncode(benchmark::State& state) {
    const TScratchFile scratch("zmbench.ppm", "P6 4000 3000 255\n", PictureRgb());
    Compare(
        state, EncodeJpeg, [] { Save(ioJPEG); }, "cjpeg -quality 80 -dct int " + scratch.Name());
}

void BM_PngDecode(benchmark::State& state) {
    const TBytes& file = PngFile();
    Compare(
        state, [&file] { DecodePng(file); }, [&file] { Load(file, ioPNG); }, {});
}

void BM_PngAlphaDecode(benchmark::State& state) {
    const TBytes& file = PngAlphaFile();
    Compare(
        state, [&file] { DecodePng(file); }, [&file] { Load(file, ioPNG); }, {});
}

void BM_PngEncode(benchmark::State& state) {
    Compare(state, EncodePng, [] { Save(ioPNG); }, {});
}

BENCHMARK(BM_JpegDecode)->UseManualTime()->Iterations(14)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_JpegEncode)->UseManualTime()->Iterations(14)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_PngDecode)->UseManualTime()->Iterations(10)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_PngAlphaDecode)->UseManualTime()->Iterations(8)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_PngEncode)->UseManualTime()->Iterations(6)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace zm
