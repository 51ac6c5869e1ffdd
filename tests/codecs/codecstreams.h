#pragma once

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmprogress.h"

/// Streams that misbehave and a progress record with its flag, for tests of codecs.
namespace zm::test {

/// Progress with a flag of its own; counts calls and can abort at one of them (from 1).
class TTestProgress {
public:
    explicit TTestProgress(int abort_at_call = 0) {
        record.Aborting = &aborting;
        record.fOnProgress = [this, abort_at_call](void*, std::int32_t percent) {
            percents.push_back(percent);
            if (static_cast<int>(percents.size()) == abort_at_call) {
                aborting = true;
            }
        };
    }
    TTestProgress(const TTestProgress&) = delete;
    TTestProgress& operator=(const TTestProgress&) = delete;

    TProgressRec record;
    bool aborting = false;
    std::vector<std::int32_t> percents;
};

/// Takes `room` bytes in all, then falls short or raises.
class TFullStream : public TStream {
public:
    TFullStream(std::int64_t room, bool raises) : room_(room), raises_(raises) {}
    std::int32_t Read(void*, std::int32_t) override { return 0; }
    std::int32_t Write(const void*, std::int32_t count) override {
        if (count <= room_) {
            room_ -= count;
            return count;
        }
        if (raises_) {
            throw EWriteError("full");
        }
        const auto taken = static_cast<std::int32_t>(room_);
        room_ = 0;
        return taken;
    }
    std::int64_t Seek(std::int64_t, TSeekOrigin) override { return 0; }

private:
    std::int64_t room_;
    bool raises_;
};

/// Bytes that raise an exception when read past `good_bytes`.
class TRaisingStream : public TMemoryStream {
public:
    TRaisingStream(std::vector<std::uint8_t> bytes, std::int64_t good_bytes)
        : TMemoryStream(std::move(bytes)), good_bytes_(good_bytes) {}
    std::int32_t Read(void* buffer, std::int32_t count) override {
        if (GetPosition() + count > good_bytes_) {
            throw EReadError("broken");
        }
        return TMemoryStream::Read(buffer, count);
    }

private:
    std::int64_t good_bytes_;
};

/// The first `count` bytes.
inline std::vector<std::uint8_t> FirstBytes(const std::vector<std::uint8_t>& bytes,
                                            std::size_t count) {
    return {bytes.begin(), bytes.begin() + static_cast<std::ptrdiff_t>(count)};
}

}  // namespace zm::test
