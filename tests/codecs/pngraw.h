#pragma once

#include <png.h>

#include <algorithm>
#include <csetjmp>
#include <cstdint>
#include <string>
#include <vector>

#include "engine/bitmap/zmpixelformats.h"

/// The PNG library by itself, as the other opinion on ours.
namespace zm::test {

/// A file as the library sees it.
struct TRawPng {
    bool is_good = false;
    bool is_plain = true;  ///< rows as the file has them, bits unpacked
    png_uint_32 width = 0;
    png_uint_32 height = 0;
    int depth = 0;  ///< of the file
    int color_type = 0;
    int interlace = 0;
    std::size_t channels = 0;                     ///< of the rows
    std::vector<std::vector<std::uint8_t>> rows;  ///< samples of a byte, of two at 16 bits
    std::vector<TRGB> palette;
    std::vector<std::uint8_t> transparency;
    png_uint_32 x_per_meter = 0;
    png_uint_32 y_per_meter = 0;
    png_color_16 background = {};
    bool has_background = false;
    /// "key=text", an international one with its language behind: "key=text@en".
    std::vector<std::string> texts;
};

inline TRGB RawColor(const TRawPng& raw, std::int32_t x, std::int32_t y) {
    const auto bytes = raw.channels * (raw.depth == 16 && raw.is_plain ? 2u : 1u);
    const std::uint8_t* pixel =
        raw.rows.at(static_cast<std::size_t>(y)).data() + static_cast<std::size_t>(x) * bytes;
    if (raw.channels >= 3) {
        return TRGB{pixel[2], pixel[1], pixel[0]};
    }
    if (raw.is_plain && raw.color_type == PNG_COLOR_TYPE_PALETTE) {
        return raw.palette.at(*pixel);
    }
    const bool is_bit = raw.is_plain && raw.depth == 1;
    const std::uint8_t gray = is_bit ? static_cast<std::uint8_t>(*pixel * 255) : *pixel;
    return TRGB{gray, gray, gray};
}

inline void TakeRawInfo(png_structp png, png_infop info, TRawPng& raw) {
    png_get_IHDR(png, info, &raw.width, &raw.height, nullptr, &raw.color_type, &raw.interlace,
                 nullptr, nullptr);
    raw.channels = png_get_channels(png, info);
    png_colorp palette = nullptr;
    int count = 0;
    if (png_get_PLTE(png, info, &palette, &count) != 0) {
        for (int i = 0; i < count; ++i) {
            raw.palette.push_back(TRGB{palette[i].blue, palette[i].green, palette[i].red});
        }
    }
    png_bytep transparency = nullptr;
    if (png_get_tRNS(png, info, &transparency, &count, nullptr) != 0 && transparency != nullptr) {
        raw.transparency.assign(transparency, transparency + count);
    }
    raw.x_per_meter = png_get_x_pixels_per_meter(png, info);
    raw.y_per_meter = png_get_y_pixels_per_meter(png, info);
    png_color_16p background = nullptr;
    if (png_get_bKGD(png, info, &background) != 0) {
        raw.background = *background;
        raw.has_background = true;
    }
    png_textp texts = nullptr;
    const int text_count = png_get_text(png, info, &texts, nullptr);
    for (int i = 0; i < text_count; ++i) {
        const bool is_wide = texts[i].compression > PNG_TEXT_COMPRESSION_zTXt;
        raw.texts.push_back(std::string(texts[i].key) + "=" + texts[i].text +
                            (is_wide ? std::string("@") + texts[i].lang : ""));
    }
}

/// `transforms` are the library's own PNG_TRANSFORM_ flags.
inline void DecodeRawPng(const std::vector<std::uint8_t>& bytes, int transforms, TRawPng& raw) {
    struct TSource {
        const std::uint8_t* at;
        std::size_t left;
    } source{bytes.data(), bytes.size()};
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr,
                                             [](png_structp, png_const_charp) {});
    png_infop info = png_create_info_struct(png);
    if (setjmp(png_jmpbuf(png)) == 0) {
        png_set_read_fn(png, &source, [](png_structp self, png_bytep target, std::size_t count) {
            auto* from = static_cast<TSource*>(png_get_io_ptr(self));
            if (count > from->left) {
                png_error(self, "end");
            }
            std::copy(from->at, from->at + count, target);
            from->at += count;
            from->left -= count;
        });
        png_read_png(png, info, transforms, nullptr);
        TakeRawInfo(png, info, raw);
        raw.is_plain = transforms == PNG_TRANSFORM_PACKING;
        raw.depth = bytes[24];  // the library tells that of the transformed rows
        png_bytepp rows = png_get_rows(png, info);
        for (png_uint_32 y = 0; y < raw.height; ++y) {
            raw.rows.emplace_back(rows[y], rows[y] + png_get_rowbytes(png, info));
        }
        raw.is_good = true;
    }
    png_destroy_read_struct(&png, &info, nullptr);
}

}  // namespace zm::test
