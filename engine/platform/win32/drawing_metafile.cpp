#include <algorithm>
#include <cstring>

#include "engine/foundation/zmbytereader.h"
#include "engine/platform/win32/drawing_graphics_p.h"

// Metafiles, read and played by the library.
namespace zm::platform {
namespace {

/// No metafile is shorter than the smallest header.
constexpr std::size_t kMinMetafileBytes = 18;

/// A stream over a copy of the bytes, released with its end; the library keeps its own hold.
class TMemoryStream {
public:
    explicit TMemoryStream(std::span<const std::uint8_t> bytes) {
        HGLOBAL const block = ::GlobalAlloc(GMEM_MOVEABLE, bytes.size());
        if (block == nullptr) {
            return;
        }
        if (void* const place = ::GlobalLock(block)) {
            std::memcpy(place, bytes.data(), bytes.size());
            ::GlobalUnlock(block);
        }
        if (FAILED(::CreateStreamOnHGlobal(block, TRUE, &stream_))) {
            stream_ = nullptr;
            ::GlobalFree(block);
        }
    }
    ~TMemoryStream() {
        if (stream_ != nullptr) {
            stream_->Release();
        }
    }
    TMemoryStream(const TMemoryStream&) = delete;
    TMemoryStream& operator=(const TMemoryStream&) = delete;
    IStream* Get() const { return stream_; }

private:
    IStream* stream_ = nullptr;
};

/// Whether the records of the extended kind in a comment have sizes that lead on.
bool CommentLeadsOn(std::span<const std::uint8_t> comment) {
    constexpr std::uint32_t kExtended = 0x2B464D45;
    constexpr std::size_t kLeast = 12;
    TZmByteReader reader(comment);
    reader.Skip(8);
    const std::size_t data_bytes = reader.U32LE();
    const std::size_t end = kLeast + std::min(data_bytes, comment.size() - kLeast);
    const bool is_extended = reader.U32LE() == kExtended;
    for (std::size_t place = 16; is_extended && place + kLeast <= end;) {
        reader.MoveTo(place + 4);
        const std::size_t size = reader.U32LE();
        if (size < kLeast || size > end - place) {
            return false;
        }
        place += size;
    }
    return true;
}

/// Some releases of the library never end where such records have no size. What else is wrong
/// with the bytes they find themselves.
bool CommentsLeadOn(std::span<const std::uint8_t> bytes) {
    constexpr std::uint32_t kComment = 70;
    constexpr std::size_t kLeastComment = 12;
    TZmByteReader reader(bytes);
    for (std::size_t place = 0; bytes.size() - place >= 8;) {
        reader.MoveTo(place);
        const std::uint32_t type = reader.U32LE();
        const std::size_t size = reader.U32LE();
        if (size < 8 || size > bytes.size() - place) {
            break;
        }
        if (type == kComment && size >= kLeastComment &&
            !CommentLeadsOn(bytes.subspan(place, size))) {
            return false;
        }
        place += size;
    }
    return true;
}

bool IsEnhanced(Gdiplus::MetafileType type) {
    return type == Gdiplus::MetafileTypeEmf || type == Gdiplus::MetafileTypeEmfPlusOnly ||
           type == Gdiplus::MetafileTypeEmfPlusDual;
}

TDrawMetafileHeader HeaderOf(const Gdiplus::MetafileHeader& native) {
    TDrawMetafileHeader header;
    header.type = static_cast<std::int32_t>(native.Type);
    header.size_bytes = native.Size;
    header.version = native.Version;
    header.dpi_x = native.DpiX;
    header.dpi_y = native.DpiY;
    header.x = native.X;
    header.y = native.Y;
    header.width = native.Width;
    header.height = native.Height;
    if (IsEnhanced(native.Type)) {
        const RECTL& frame = native.EmfHeader.rclFrame;
        header.frame = {frame.left, frame.top, frame.right, frame.bottom};
    }
    return header;
}

}  // namespace

std::unique_ptr<TDrawMetafile> CreateMetafile(std::span<const std::uint8_t> bytes) {
    const TGdiPlusEntries* entries = GdiPlus();
    if (entries == nullptr || bytes.size() < kMinMetafileBytes || !CommentsLeadOn(bytes)) {
        return nullptr;
    }
    const TMemoryStream stream(bytes);
    std::unique_ptr<TGdiPlusMetafile> result(new (std::nothrow) TGdiPlusMetafile);
    Gdiplus::MetafileHeader header{};
    if (result == nullptr || stream.Get() == nullptr ||
        !IsDone(entries->GdipCreateMetafileFromStream(stream.Get(), result->metafile.Receive())) ||
        !IsDone(entries->GdipGetMetafileHeaderFromMetafile(result->metafile.Get(), &header))) {
        return nullptr;
    }
    result->header = HeaderOf(header);
    return result;
}

}  // namespace zm::platform
