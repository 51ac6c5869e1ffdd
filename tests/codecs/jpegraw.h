#pragma once

#include <cstdio>

#include <jpeglib.h>

#include <jerror.h>

#include <csetjmp>
#include <cstdint>
#include <cstdlib>
#include <functional>
#include <vector>

#include "engine/bitmap/zmpixelformats.h"

/// The JPEG library by itself, as encoder of test files and as the other opinion on ours.
namespace zm::test {

struct TRawError {
    jpeg_error_mgr base;
    std::jmp_buf jump;
    bool met_end;     ///< the data ended before the end marker
    bool ends_early;  ///< and pixels were missing then
};

inline void WatchWarnings(j_common_ptr library, int level) {
    auto* error = reinterpret_cast<TRawError*>(library->err);
    if (level < 0) {
        error->met_end = error->met_end || error->base.msg_code == JWRN_JPEG_EOF;
        error->ends_early =
            error->ends_early || (error->met_end && error->base.msg_code == JWRN_HIT_MARKER);
    }
}

inline jpeg_error_mgr* InitRawError(TRawError& error) {
    jpeg_std_error(&error.base);
    error.base.error_exit = [](j_common_ptr library) {
        std::longjmp(reinterpret_cast<TRawError*>(library->err)->jump, 1);
    };
    error.base.emit_message = WatchWarnings;
    error.met_end = error.ends_early = false;
    return &error.base;
}

struct TRawJpeg {
    bool is_good = false;
    bool ends_early = false;  ///< the library had to make up pixels behind the end of the data
    int width = 0;
    int height = 0;
    int components = 0;
    int channels = 0;  ///< of `pixels`
    J_COLOR_SPACE color_space = JCS_UNKNOWN;
    int h_factors[4] = {};
    int v_factors[4] = {};
    bool progressive = false;
    bool has_jfif = false;
    bool has_adobe = false;
    int density_unit = 0;
    int x_density = 0;
    int y_density = 0;
    int first_quantizer = 0;
    std::vector<std::uint8_t> pixels;
};

/// Decodes to `output` (RGB, gray or CMYK) at the scale 1 / denominator.
inline void DecodeRawJpeg(const std::vector<std::uint8_t>& bytes, J_COLOR_SPACE output,
                          unsigned denominator, TRawJpeg& raw) {
    jpeg_decompress_struct decoder = {};
    TRawError error;
    decoder.err = InitRawError(error);
    jpeg_create_decompress(&decoder);
    if (setjmp(error.jump) == 0) {
        jpeg_mem_src(&decoder, bytes.data(), static_cast<unsigned long>(bytes.size()));
        jpeg_read_header(&decoder, TRUE);
        raw.components = decoder.num_components;
        raw.color_space = decoder.jpeg_color_space;
        for (int i = 0; i < decoder.num_components; ++i) {
            raw.h_factors[i] = decoder.comp_info[i].h_samp_factor;
            raw.v_factors[i] = decoder.comp_info[i].v_samp_factor;
        }
        raw.progressive = decoder.progressive_mode != FALSE;
        raw.has_jfif = decoder.saw_JFIF_marker != FALSE;
        raw.has_adobe = decoder.saw_Adobe_marker != FALSE;
        raw.density_unit = decoder.density_unit;
        raw.x_density = decoder.X_density;
        raw.y_density = decoder.Y_density;
        raw.first_quantizer = decoder.quant_tbl_ptrs[0]->quantval[0];
        decoder.out_color_space = output;
        decoder.scale_num = 1;
        decoder.scale_denom = denominator;
        jpeg_start_decompress(&decoder);
        raw.width = static_cast<int>(decoder.output_width);
        raw.height = static_cast<int>(decoder.output_height);
        raw.channels = decoder.output_components;
        const std::size_t row_bytes = static_cast<std::size_t>(decoder.output_width) *
                                      static_cast<std::size_t>(decoder.output_components);
        raw.pixels.resize(row_bytes * decoder.output_height);
        while (decoder.output_scanline < decoder.output_height) {
            JSAMPROW row = raw.pixels.data() + decoder.output_scanline * row_bytes;
            jpeg_read_scanlines(&decoder, &row, 1);
        }
        jpeg_finish_decompress(&decoder);
        raw.ends_early = error.ends_early;
        raw.is_good = true;
    }
    jpeg_destroy_decompress(&decoder);
}

/// Colour of a pixel; inks as such files store them, 255 for none.
inline TRGB RawColor(const TRawJpeg& raw, std::int32_t x, std::int32_t y) {
    const std::uint8_t* pixel = raw.pixels.data() + (y * raw.width + x) * raw.channels;
    const auto channel = [pixel, &raw](int i) {
        return raw.channels == 4 ? static_cast<std::uint8_t>(pixel[3] * pixel[i] / 255)
                                 : pixel[raw.channels == 1 ? 0 : i];
    };
    return TRGB{channel(2), channel(1), channel(0)};
}

struct TRawSettings {
    int width = 19;
    int height = 13;
    J_COLOR_SPACE input = JCS_RGB;
    J_COLOR_SPACE file = JCS_YCbCr;
    int h_factor = 2;
    int v_factor = 2;
    bool progressive = false;
    bool arithmetic = false;
    int density_unit = 0;
    int x_density = 1;
    int y_density = 1;
    std::uint8_t flat = 0;  ///< all samples have this value when it is not 0
    std::function<void(jpeg_compress_struct&)> write_markers;
};

/// Apart from the function with the jump, whose frame then holds nothing that a jump could spoil.
[[gnu::noinline]] inline std::vector<std::uint8_t> MakeRawRow(int width, int components) {
    return std::vector<std::uint8_t>(static_cast<std::size_t>(width * components));
}

/// Everything that may jump out of the library; no object is made or freed here.
[[gnu::noinline]] inline bool WriteRawJpeg(jpeg_compress_struct& encoder, TRawError& error,
                                           const TRawSettings& settings,
                                           std::vector<std::uint8_t>& row) {
    if (setjmp(error.jump) != 0) {
        return false;
    }
    jpeg_set_defaults(&encoder);
    jpeg_set_colorspace(&encoder, settings.file);
    encoder.density_unit = static_cast<UINT8>(settings.density_unit);
    encoder.X_density = static_cast<UINT16>(settings.x_density);
    encoder.Y_density = static_cast<UINT16>(settings.y_density);
    encoder.comp_info[0].h_samp_factor = settings.h_factor;
    encoder.comp_info[0].v_samp_factor = settings.v_factor;
    encoder.arith_code = settings.arithmetic ? TRUE : FALSE;
    if (settings.progressive) {
        jpeg_simple_progression(&encoder);
    }
    jpeg_start_compress(&encoder, TRUE);
    if (settings.write_markers) {
        settings.write_markers(encoder);
    }
    for (int y = 0; y < settings.height; ++y) {
        for (std::size_t i = 0; i < row.size(); ++i) {
            const auto value = static_cast<std::uint8_t>(i * 7 + static_cast<std::size_t>(y) * 11);
            row[i] = settings.flat != 0 ? settings.flat : value;
        }
        JSAMPROW line = row.data();
        jpeg_write_scanlines(&encoder, &line, 1);
    }
    jpeg_finish_compress(&encoder);
    return true;
}

/// Empty when the library refuses the settings.
inline std::vector<std::uint8_t> EncodeRawJpeg(const TRawSettings& settings) {
    jpeg_compress_struct encoder = {};
    TRawError error;
    encoder.err = InitRawError(error);
    jpeg_create_compress(&encoder);
    unsigned char* memory = nullptr;
    unsigned long size = 0;
    jpeg_mem_dest(&encoder, &memory, &size);
    encoder.image_width = static_cast<JDIMENSION>(settings.width);
    encoder.image_height = static_cast<JDIMENSION>(settings.height);
    encoder.input_components = settings.input == JCS_GRAYSCALE ? 1
                               : settings.input == JCS_CMYK    ? 4
                                                               : 3;
    encoder.in_color_space = settings.input;
    std::vector<std::uint8_t> row(
        static_cast<std::size_t>(settings.width * encoder.input_components));
    const bool is_written = WriteRawJpeg(encoder, error, settings, row);
    jpeg_destroy_compress(&encoder);
    std::vector<std::uint8_t> bytes;
    if (is_written) {
        bytes.assign(memory, memory + size);
    }
    std::free(memory);
    return bytes;
}

}  // namespace zm::test
