#include "engine/io/zmbufferedstreams.h"

#include <algorithm>
#include <cstring>
#include <exception>
#include <limits>

namespace zm {

namespace {

std::int64_t AddSaturated(std::int64_t a, std::int64_t b) {
    std::int64_t sum = 0;
    if (__builtin_add_overflow(a, b, &sum)) {
        return b < 0 ? std::numeric_limits<std::int64_t>::min()
                     : std::numeric_limits<std::int64_t>::max();
    }
    return sum;
}

/// -|value|, which every 64-bit value has.
std::int64_t NegativeMagnitude(std::int64_t value) {
    return value < 0 ? value : -value;
}

std::size_t BufferBytes(std::int32_t size) {
    return static_cast<std::size_t>(std::max(size, 0));
}

}  // namespace

TZmBufferedReadStream::TZmBufferedReadStream(TStream* input, std::int32_t buffer_size,
                                             bool use_relative_position)
    : fStream(input), fBufferSize(std::max(buffer_size, 0)), fMemory(BufferBytes(buffer_size)) {
    fSize = fStream->GetSize();
    fPosition = fStream->GetPosition();
    fRelativePosition = use_relative_position ? fPosition : 0;
    if (fBufferSize > 0) {
        Fetch();
    }
}

TZmBufferedReadStream::~TZmBufferedReadStream() {
    if (fBufferSize == 0) {
        return;
    }
    try {
        fStream->SetPosition(fPosition);
    } catch (const std::exception&) {
        // A destructor cannot report; whoever uses the broken stream next meets the failure.
    }
}

void TZmBufferedReadStream::Fetch() {
    const std::int64_t left = std::max<std::int64_t>(fSize - fPosition, 0);
    const auto wanted = static_cast<std::int32_t>(std::min<std::int64_t>(fBufferSize, left));
    fPositionBuf = 0;
    fetched_ = 0;
    fStream->SetPosition(fPosition);
    while (fetched_ < wanted) {
        const std::int32_t got = fStream->Read(fMemory.data() + fetched_, wanted - fetched_);
        if (got <= 0) {
            break;
        }
        fetched_ += got;
    }
}

std::int32_t TZmBufferedReadStream::Read(void* buffer, std::int32_t count) {
    if (fBufferSize == 0) {
        return fStream->Read(buffer, count);
    }
    fOverPosition = false;
    if (count < 1) {
        return 0;
    }
    const std::int64_t left = std::max<std::int64_t>(fSize - fPosition, 0);
    if (left < count) {
        count = static_cast<std::int32_t>(left);
        fOverPosition = true;
    }
    auto* target = static_cast<std::uint8_t*>(buffer);
    if (count == 1 && fPositionBuf < fetched_) {
        *target = fMemory[static_cast<std::size_t>(fPositionBuf)];
        ++fPositionBuf;
        ++fPosition;
        return 1;
    }
    std::int32_t copied = 0;
    while (copied < count) {
        if (fPositionBuf >= fBufferSize) {
            Fetch();
        }
        const std::int32_t piece = std::min(fetched_ - fPositionBuf, count - copied);
        if (piece <= 0) {  // the stream gave less than its size promised
            fOverPosition = true;
            break;
        }
        std::memcpy(target + copied, fMemory.data() + fPositionBuf,
                    static_cast<std::size_t>(piece));
        copied += piece;
        fPositionBuf += piece;
        fPosition += piece;
    }
    return copied;
}

std::int32_t TZmBufferedReadStream::Write(const void*, std::int32_t) {
    throw EZmException("TZmBufferedReadStream cannot write!");
}

std::int64_t TZmBufferedReadStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    if (fBufferSize == 0) {
        return fStream->Seek(offset, origin);
    }
    std::int64_t target = 0;
    switch (origin) {
        case soBeginning: target = AddSaturated(fRelativePosition, offset); break;
        case soCurrent: target = AddSaturated(fPosition, offset); break;
        case soEnd:
            // Required: both signs count backwards; callers rely on either.
            target = AddSaturated(fSize, NegativeMagnitude(offset));
            break;
    }
    target = std::max<std::int64_t>(target, 0);
    if (target >= fSize) {
        target = fSize;
        fOverPosition = true;
    }
    const std::int64_t place = fPositionBuf + (target - fPosition);
    fPosition = target;
    if (place >= 0 && place < fBufferSize) {
        fPositionBuf = static_cast<std::int32_t>(place);
    } else {
        Fetch();
    }
    return fPosition - fRelativePosition;
}

std::int64_t TZmBufferedReadStream::GetSize() {
    const std::int64_t end = fBufferSize == 0 ? fStream->GetSize() : fSize - fRelativePosition;
    return std::max<std::int64_t>(end, 0);
}

TZmBufferedWriteStream::TZmBufferedWriteStream(TStream* output, std::int32_t buffer_size)
    : fStream(output), fMemory(BufferBytes(buffer_size)), fBufferSize(std::max(buffer_size, 0)) {}

TZmBufferedWriteStream::~TZmBufferedWriteStream() {
    try {
        Flush();
    } catch (const std::exception&) {
        // A destructor cannot report; writers that need to know force the data out by a Seek.
    }
}

std::int32_t TZmBufferedWriteStream::Read(void*, std::int32_t) {
    throw EZmException("TZmBufferedWriteStream cannot read!");
}

void TZmBufferedWriteStream::Flush() {
    if (fBufferPos == 0) {
        return;
    }
    const std::int32_t count = fBufferPos;
    fBufferPos = 0;
    if (fStream->Write(fMemory.data(), count) != count) {
        failed_ = true;
    }
}

std::int32_t TZmBufferedWriteStream::Write(const void* buffer, std::int32_t count) {
    if (count < 1 || failed_) {
        return 0;
    }
    if (fBufferSize == 0) {
        const std::int32_t written = fStream->Write(buffer, count);
        failed_ = written != count;
        return written;
    }
    const auto* source = static_cast<const std::uint8_t*>(buffer);
    std::int32_t taken = 0;
    while (taken < count && !failed_) {
        const std::int32_t piece = std::min(fBufferSize - fBufferPos, count - taken);
        std::memcpy(fMemory.data() + fBufferPos, source + taken, static_cast<std::size_t>(piece));
        fBufferPos += piece;
        if (fBufferPos == fBufferSize) {
            Flush();
        }
        if (!failed_) {
            taken += piece;
        }
    }
    return taken;
}

std::int64_t TZmBufferedWriteStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    Flush();
    return fStream->Seek(offset, origin);
}

}  // namespace zm
