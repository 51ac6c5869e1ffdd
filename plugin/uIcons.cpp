#include "plugin/uIcons.h"

#include <algorithm>
#include <array>
#include <iterator>
#include <string_view>
#include <utility>

#include "engine/foundation/zmassert.h"
#include "engine/platform/icons.h"

namespace zm {
namespace {

constexpr std::int32_t kSide = 16;
constexpr std::size_t kFileHeaderBytes = 6 + 16;
constexpr std::uint32_t kImageBytes = static_cast<std::uint32_t>(kIconFileBytes - kFileHeaderBytes);
constexpr std::uint8_t kTransparent = 0;

/// What the letters of a drawing mean. Entry 0 is black under the mask: see-through.
struct TInk {
    char letter;
    std::uint8_t blue;
    std::uint8_t green;
    std::uint8_t red;
};
constexpr TInk kInks[] = {
    {'.', 0, 0, 0},        // see-through
    {'#', 64, 48, 40},     // outline
    {'w', 255, 255, 255},  // paper
    {'b', 214, 142, 58},   // sky, arrows
    {'g', 76, 160, 72},    // hills
    {'y', 64, 200, 248},   // sun, folder
    {'r', 52, 60, 214},    // marks
    {'s', 176, 168, 160},  // metal, shade
};

using TDrawing = std::array<std::string_view, kSide>;

constexpr TDrawing kDrawings[kIconGlyphCount] = {
    TDrawing{"................", ".##############.", ".#bbbbbbbbbbbb#.", ".#bbbbbbbbyybb#.",
             ".#bbbbbbbyyyyb#.", ".#bbbbbbbyyyyb#.", ".#bbbbbbbbyybb#.", ".#bbbgbbbbbbbb#.",
             ".#bbgggbbbbbbb#.", ".#bgggggbbgbbb#.", ".#ggggggggggbb#.", ".#gggggggggggb#.",
             ".#gggggggggggg#.", ".#gggggggggggg#.", ".##############.", "................"},
    TDrawing{"................", "................", "..####..........", ".#yyyy#.........",
             ".#yyyyy######...", ".#yyyyyyyyyyy#..", ".#yyyyyyyyyyy#..", ".#yy############",
             ".#yy#yyyyyyyyyy#", ".#y#yyyyyyyyyy#.", ".#y#yyyyyyyyyy#.", ".##yyyyyyyyyy#..",
             ".##yyyyyyyyyy#..", ".############...", "................", "................"},
    TDrawing{"................", ".##############.", ".#b#ssssssss#b#.", ".#b#swwwwwws#b#.",
             ".#b#swwwwwws#b#.", ".#b#swwwwwws#b#.", ".#b#ssssssss#b#.", ".#bb########bb#.",
             ".#bbbbbbbbbbbb#.", ".#bbb######bbb#.", ".#bbb#sss##bbb#.", ".#bbb#sss##bbb#.",
             ".#bbb#sss##bbb#.", "..#############.", "................", "................"},
    TDrawing{"................", ".######.........", ".#bbbb#.........", ".#bbbb#..rrrrr..",
             ".#gggg#.....rr..", ".######....r.r..", "..........r..r..", ".........r...r..",
             "........r.......", ".##############.", ".#bbbbbbbbbbbb#.", ".#bbbbbbbbyybb#.",
             ".#bbgbbbbbbbbb#.", ".#ggggbbggggbb#.", ".##############.", "................"},
    TDrawing{"...r............", "...r............", "...r............", "rrrrrrrrrrrrr...",
             "...rbbbbbbbbr...", "...rbbbbbyybr...", "...rbbbbbyybr...", "...rbbbbbbbbr...",
             "...rbbgbbbbbr...", "...rbgggbbgbr...", "...rgggggggbr...", "...rggggggggr...",
             "...rrrrrrrrrrrrr", "............r...", "............r...", "............r..."},
    TDrawing{"................", ".....bbbbb...b..", "...bbb...bbb.b..", "..bb.......bbb..",
             "..b.......bbbb..", ".bb.............", ".b....######....", ".b....#bbyb#....",
             ".b....#bbbb#....", ".b....#gbgg#....", ".bb...######....", "..b..........b..",
             "..bb........bb..", "...bbb....bbb...", ".....bbbbbb.....", "................"},
    TDrawing{"................", ".############...", ".############...", ".##..####..##...",
             ".#....##....#...", "......##........", "......##........", "......##........",
             "......##....rr..", "......##....rr..", "......##..rrrrrr", "......##..rrrrrr",
             "......##....rr..", ".....####...rr..", "....######......", "................"},
    TDrawing{"................", "##########......", "#bbbbbbbb#......", "#bbbbbbyb#......",
             "#bbbbbbbb#......", "#bbbb###########", "#bbgb#wwwwwwwww#", "#bggg#wwwwwwyyw#",
             "#gggg#wwwwwwyyw#", "#gggg#wwwwwwwww#", "#####wwwwrwwwww#", ".....#wwrrrwwww#",
             ".....#wrrrrrwrw#", ".....#rrrrrrrrr#", ".....###########", "................"},
    TDrawing{"rrrrrrrrrrrrrrrr", "rrrrrrrrrrrrrrrr", "rr############rr", "rr#bbbbbbbbbb#rr",
             "rr#bbbbbbyybb#rr", "rr#bbbbbbyybb#rr", "rr#bbbbbbbbbb#rr", "rr#bbgbbbbbbb#rr",
             "rr#bgggbbgbbb#rr", "rr#ggggggggbb#rr", "rr#gggggggggb#rr", "rr#gggggggggg#rr",
             "rr#gggggggggg#rr", "rr############rr", "rrrrrrrrrrrrrrrr", "rrrrrrrrrrrrrrrr"},
};

class TByteWriter {
public:
    explicit TByteWriter(std::vector<std::uint8_t>& bytes) : bytes_(bytes) {}
    void Byte(std::uint32_t value) { bytes_.push_back(static_cast<std::uint8_t>(value)); }
    void Word(std::uint32_t value) {
        Byte(value);
        Byte(value >> 8);
    }
    void Long(std::uint32_t value) {
        Word(value);
        Word(value >> 16);
    }

private:
    std::vector<std::uint8_t>& bytes_;
};

/// Palette index of a letter.
std::uint8_t InkOf(char letter) {
    const TInk* const found = std::find_if(std::begin(kInks), std::end(kInks),
                                           [letter](TInk ink) { return ink.letter == letter; });
    ZM_ASSERT(found != std::end(kInks));
    return static_cast<std::uint8_t>(found - std::begin(kInks));
}

void WriteHeaders(TByteWriter& out) {
    out.Word(0);
    out.Word(1);  // an icon, not a cursor
    out.Word(1);  // entries
    out.Byte(kSide);
    out.Byte(kSide);
    out.Byte(0);  // 256 colours
    out.Byte(0);
    out.Word(1);  // planes
    out.Word(8);  // bits per pixel
    out.Long(kImageBytes);
    out.Long(kFileHeaderBytes);

    out.Long(40);
    out.Long(kSide);
    out.Long(2 * kSide);  // colour rows and mask rows
    out.Word(1);
    out.Word(8);
    for (int field = 0; field < 6; ++field) {
        out.Long(0);  // uncompressed, sizes and counts as derived
    }
}

void WritePalette(TByteWriter& out) {
    for (std::size_t index = 0; index < 256; ++index) {
        const TInk ink = index < std::size(kInks) ? kInks[index] : kInks[0];
        out.Byte(ink.blue);
        out.Byte(ink.green);
        out.Byte(ink.red);
        out.Byte(0);
    }
}

/// A bit per pixel, set where the drawing is see-through, in rows of four bytes.
void WriteMaskRow(TByteWriter& out, std::string_view row) {
    std::uint32_t bits = 0;
    for (const char letter : row) {
        bits = bits << 1 | (InkOf(letter) == kTransparent ? 1u : 0u);
    }
    out.Byte(bits >> 8);
    out.Byte(bits);
    out.Word(0);
}

}  // namespace

TIcon::~TIcon() {
    platform::DestroyIconHandle(handle_);
}

void TIcon::LoadFromFileImage(std::vector<std::uint8_t> file_image) {
    platform::DestroyIconHandle(std::exchange(handle_, nullptr));
    file_image_ = std::move(file_image);
}

void* TIcon::GetHandle() {
    if (handle_ == nullptr && file_image_.size() > kFileHeaderBytes) {
        handle_ = platform::CreateIconHandle(file_image_.data() + kFileHeaderBytes,
                                             file_image_.size() - kFileHeaderBytes, kSide, kSide);
    }
    return handle_;
}

std::vector<std::uint8_t> BuildIconFile(TIconGlyph glyph) {
    const TDrawing& drawing = kDrawings[glyph];
    std::vector<std::uint8_t> bytes;
    bytes.reserve(kIconFileBytes);
    TByteWriter out(bytes);
    WriteHeaders(out);
    WritePalette(out);
    for (std::size_t y = kSide; y-- > 0;) {
        for (const char letter : drawing[y]) {
            out.Byte(InkOf(letter));
        }
    }
    for (std::size_t y = kSide; y-- > 0;) {
        WriteMaskRow(out, drawing[y]);
    }
    ZM_ASSERT(bytes.size() == kIconFileBytes);
    return bytes;
}

}  // namespace zm
