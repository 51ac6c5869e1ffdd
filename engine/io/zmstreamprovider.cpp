#include "engine/io/zmstreamprovider.h"

#include <exception>

namespace zm {

std::int64_t TZmVCLStreamProvider::seek(std::int64_t offset, std::int32_t origin) {
    switch (origin) {
        case 0: return m_stream->Seek(offset, soBeginning);
        case 1: return m_stream->Seek(offset, soCurrent);
        case 2: return m_stream->Seek(offset, soEnd);
        default: return tell();
    }
}

// "Silent": the decoders behind this interface are written in C and know no exceptions.
std::int32_t TZmVCLStreamProvider::silent_read(void* buffer, std::int32_t count) {
    try {
        return m_stream->Read(buffer, count);
    } catch (const std::exception&) {
        return 0;
    }
}

std::int32_t TZmVCLStreamProvider::silent_write(const void* buffer, std::int32_t count) {
    try {
        return m_stream->Write(buffer, count);
    } catch (const std::exception&) {
        return 0;
    }
}

std::int32_t TZmVCLStreamProvider::silent_getc() {
    std::uint8_t byte = 0;
    return silent_read(&byte, 1) == 1 ? byte : -1;
}

}  // namespace zm
