/// Metafiles.

#include <algorithm>
#include <array>
#include <new>

#include "engine/canvas/zmgdiplus.h"

namespace zm {
namespace {

enum TMetafileType : std::int32_t {
    mtWmf = 1,
    mtWmfPlaceable,
    mtEmf,
    mtEmfPlusOnly,
    mtEmfPlusDual
};

/// The largest metafile that is read; real ones have a hundredth of it.
constexpr std::size_t kMostBytes = std::size_t{256} << 20;

/// What is left of a stream; empty when it is more than a metafile may have.
std::vector<std::uint8_t> ReadRest(TStream& stream) {
    std::vector<std::uint8_t> bytes;
    std::array<std::uint8_t, 65536> block;
    std::int32_t count = 0;
    while ((count = stream.Read(block.data(), static_cast<std::int32_t>(block.size()))) > 0) {
        if (bytes.size() + static_cast<std::size_t>(count) > kMostBytes) {
            return {};
        }
        bytes.insert(bytes.end(), block.begin(), block.begin() + count);
    }
    return bytes;
}

}  // namespace

TZmMetafile::TZmMetafile(const std::u16string& Filename) {
    try {
        TFileStream stream(Filename, fmOpenRead);
        Load(stream);
    } catch (const EFOpenError&) {
        fHeader = {};  // as for bytes that cannot be read
    }
}

TZmMetafile::TZmMetafile(TStream& Stream) {
    Load(Stream);
}

TZmMetafile::~TZmMetafile() = default;

void TZmMetafile::Load(TStream& stream) {
    try {
        fHandle = platform::CreateMetafile(ReadRest(stream));
    } catch (const std::bad_alloc&) {
        fHandle.reset();
    }
    if (fHandle != nullptr) {
        fHeader = fHandle->Header();
    }
}

bool TZmMetafile::IsWmf() const {
    return fHeader.type == mtWmf || fHeader.type == mtWmfPlaceable;
}

bool TZmMetafile::IsEmf() const {
    return fHeader.type == mtEmf;
}

bool TZmMetafile::IsEmfPlus() const {
    return fHeader.type == mtEmfPlusOnly || fHeader.type == mtEmfPlusDual;
}

bool TZmMetafile::IsEmfPlusDual() const {
    return fHeader.type == mtEmfPlusDual;
}

}  // namespace zm
