#include "engine/metadata/zmpngchunks.h"

#include <algorithm>

namespace zm {

namespace {

constexpr std::string_view kXmpKeyword = "XML:com.adobe.xmp";

}  // namespace

bool IsXmpChunk(const TZmPngChunk& chunk) {
    return chunk.kind == kPngChunkText && chunk.key == kXmpKeyword;
}

const TZmPngChunk* TZmPngChunkList::Find(TZmPngChunkKind kind) const {
    const auto found = std::ranges::find(items_, kind, &TZmPngChunk::kind);
    return found == items_.end() ? nullptr : &*found;
}

const TZmPngChunk* TZmPngChunkList::FindText(std::string_view key, std::string_view value) const {
    const auto is_text = [key, value](const TZmPngChunk& chunk) {
        return chunk.kind == kPngChunkText && chunk.key == key &&
               std::equal(
                   chunk.data.begin(), chunk.data.end(), value.begin(), value.end(),
                   [](std::uint8_t byte, char c) { return byte == static_cast<std::uint8_t>(c); });
    };
    const auto found = std::ranges::find_if(items_, is_text);
    return found == items_.end() ? nullptr : &*found;
}

const TZmPngChunk* TZmPngChunkList::FindXmp() const {
    const auto found = std::ranges::find_if(items_, IsXmpChunk);
    return found == items_.end() ? nullptr : &*found;
}

void TZmPngChunkList::Delete(TZmPngChunkKind kind) {
    std::erase_if(items_, [kind](const TZmPngChunk& chunk) { return chunk.kind == kind; });
}

void TZmPngChunkList::DeleteXmp() {
    std::erase_if(items_, IsXmpChunk);
}

void TZmPngChunkList::DeletePlainTexts() {
    std::erase_if(items_, [](const TZmPngChunk& chunk) {
        return chunk.kind == kPngChunkText && !IsXmpChunk(chunk);
    });
}

}  // namespace zm
