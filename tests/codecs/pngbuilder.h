#pragma once

#include <zlib.h>

#include <cstdint>
#include <string>
#include <vector>

/// PNG files made by hand from samples, with no PNG library in between.
namespace zm::test {

using TBytes = std::vector<std::uint8_t>;

inline void PutU32BE(TBytes& bytes, std::uint32_t value) {
    for (int shift = 24; shift >= 0; shift -= 8) {
        bytes.push_back(static_cast<std::uint8_t>(value >> shift));
    }
}

inline TBytes PngChunk(const std::string& name, const TBytes& data) {
    TBytes chunk;
    PutU32BE(chunk, static_cast<std::uint32_t>(data.size()));
    chunk.insert(chunk.end(), name.begin(), name.end());
    chunk.insert(chunk.end(), data.begin(), data.end());
    PutU32BE(chunk, static_cast<std::uint32_t>(
                        crc32(0, chunk.data() + 4, static_cast<uInt>(chunk.size() - 4))));
    return chunk;
}

inline TBytes Deflate(const TBytes& data) {
    uLongf size = compressBound(static_cast<uLong>(data.size()));
    TBytes packed(size);
    compress2(packed.data(), &size, data.data(), static_cast<uLong>(data.size()), 9);
    packed.resize(size);
    return packed;
}

inline TBytes BytesOf(const std::string& text) {
    return {text.begin(), text.end()};
}

inline TBytes PngText(const std::string& key, const std::string& value) {
    return PngChunk("tEXt", BytesOf(key + std::string(1, '\0') + value));
}

struct TPngPicture {
    std::uint32_t width = 1;
    std::uint32_t height = 1;
    int depth = 8;
    int color_type = 2;
    bool interlaced = false;
    TBytes before_data;  ///< chunks between header and image data
    TBytes after_data;   ///< chunks between image data and end

    int Channels() const {
        return color_type == 2 ? 3 : color_type == 4 ? 2 : color_type == 6 ? 4 : 1;
    }
    /// Every sample of the depth, spread over the picture, neighbours different.
    std::uint32_t Sample(std::uint32_t x, std::uint32_t y, int channel) const {
        const std::uint32_t mixed =
            (x * 40503u + y * 30011u + static_cast<std::uint32_t>(channel) * 9973u + 77u) *
            2654435761u;
        return mixed >> (32 - depth);
    }
    /// Palette entry as the PLTE chunk holds it; `channel` 0 is red.
    std::uint8_t PaletteByte(std::uint32_t index, int channel) const {
        return static_cast<std::uint8_t>(index * 29 + static_cast<std::uint32_t>(channel) * 81);
    }
    TBytes Build() const;

private:
    void AppendPass(TBytes& raw, std::uint32_t x0, std::uint32_t y0, std::uint32_t dx,
                    std::uint32_t dy) const;
};

inline void TPngPicture::AppendPass(TBytes& raw, std::uint32_t x0, std::uint32_t y0,
                                    std::uint32_t dx, std::uint32_t dy) const {
    if (x0 >= width) {
        return;
    }
    for (std::uint32_t y = y0; y < height; y += dy) {
        raw.push_back(0);  // no filter
        std::uint32_t bits = 0;
        int bit_count = 0;
        for (std::uint32_t x = x0; x < width; x += dx) {
            for (int channel = 0; channel < Channels(); ++channel) {
                bits = bits << depth | Sample(x, y, channel);
                bit_count += depth;
                while (bit_count >= 8) {
                    bit_count -= 8;
                    raw.push_back(static_cast<std::uint8_t>(bits >> bit_count));
                }
            }
        }
        if (bit_count > 0) {
            raw.push_back(static_cast<std::uint8_t>(bits << (8 - bit_count)));
        }
    }
}

inline TBytes TPngPicture::Build() const {
    TBytes file = {0x89, 'P', 'N', 'G', 13, 10, 26, 10};
    const auto append = [&file](const TBytes& bytes) {
        file.insert(file.end(), bytes.begin(), bytes.end());
    };
    TBytes header;
    PutU32BE(header, width);
    PutU32BE(header, height);
    header.insert(header.end(),
                  {static_cast<std::uint8_t>(depth), static_cast<std::uint8_t>(color_type), 0, 0,
                   static_cast<std::uint8_t>(interlaced ? 1 : 0)});
    append(PngChunk("IHDR", header));
    if (color_type == 3) {
        TBytes palette;
        for (std::uint32_t i = 0; i < 1u << depth; ++i) {
            for (int channel = 0; channel < 3; ++channel) {
                palette.push_back(PaletteByte(i, channel));
            }
        }
        append(PngChunk("PLTE", palette));
    }
    append(before_data);
    TBytes raw;
    if (interlaced) {
        constexpr std::uint32_t kPasses[7][4] = {{0, 0, 8, 8}, {4, 0, 8, 8}, {0, 4, 4, 8},
                                                 {2, 0, 4, 4}, {0, 2, 2, 4}, {1, 0, 2, 2},
                                                 {0, 1, 1, 2}};
        for (const auto& pass : kPasses) {
            AppendPass(raw, pass[0], pass[1], pass[2], pass[3]);
        }
    } else {
        AppendPass(raw, 0, 0, 1, 1);
    }
    append(PngChunk("IDAT", Deflate(raw)));
    append(after_data);
    append(PngChunk("IEND", {}));
    return file;
}

}  // namespace zm::test
