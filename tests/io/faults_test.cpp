#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <new>
#include <vector>

#include "engine/bitmap/zmbitmapmemory_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zalmoio.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

// What may go wrong around a codec, at every point where it may. This program replaces the
// allocator, so that the n-th allocation of a thread can be made to fail.
namespace {

thread_local std::int64_t t_allocations_left = -1;  // negative: no failure

void* AllocateOrNil(std::size_t size) noexcept {
    if (t_allocations_left == 0) {
        t_allocations_left = -1;
        return nullptr;
    }
    if (t_allocations_left > 0) {
        --t_allocations_left;
    }
    return std::malloc(size > 0 ? size : 1);
}

void* AllocateOrFail(std::size_t size) {
    void* const block = AllocateOrNil(size);
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    return block;
}

}  // namespace

void* operator new(std::size_t size) {
    return AllocateOrFail(size);
}
void* operator new[](std::size_t size) {
    return AllocateOrFail(size);
}
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    return AllocateOrNil(size);
}
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
    return AllocateOrNil(size);
}
void operator delete(void* block) noexcept {
    std::free(block);
}
void operator delete[](void* block) noexcept {
    std::free(block);
}
void operator delete(void* block, std::size_t) noexcept {
    std::free(block);
}
void operator delete[](void* block, std::size_t) noexcept {
    std::free(block);
}

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

/// Gives at most `piece` bytes a call; raises at a read past `good_bytes`.
class TAwkwardStream : public TStream {
public:
    TAwkwardStream(const TBytes& bytes, std::int32_t piece, std::int64_t good_bytes)
        : source_(bytes.data(), static_cast<std::int64_t>(bytes.size())),
          piece_(piece),
          good_bytes_(good_bytes) {}
    std::int32_t Read(void* buffer, std::int32_t count) override {
        const std::int32_t taken = std::min(count, piece_);
        if (source_.GetPosition() + taken > good_bytes_) {
            throw EReadError("broken");
        }
        return source_.Read(buffer, taken);
    }
    std::int32_t Write(const void*, std::int32_t) override { return 0; }
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override {
        return source_.Seek(offset, origin);
    }
    std::int64_t GetSize() override { return source_.GetSize(); }

private:
    TBorrowedMemoryStream source_;
    std::int32_t piece_;
    std::int64_t good_bytes_;
};

class Faults : public ::testing::TestWithParam<std::int32_t> {
protected:
    void SetUp() override {
        image_ = test::MakeGradient(zm24RGB, 31, 17);
        test::AddNoiseAlpha(*image_, 3);
        io_ = TZalmoIO::CreateFromBitmap(image_.get());
        TMemoryStream stream;
        ASSERT_TRUE(io_->SaveToStream(stream, GetParam()));
        bytes_ = stream.Bytes();
        io_->SetOnFinishWork([this](void*) { ++finish_count_; });
    }
    void TearDown() override {
        t_allocations_left = -1;
        SetLargestBitmapBlock(-1);
        io_.reset();
        DestroySingletonInstance();
    }
    bool Load(TZalmoIO& io) {
        TBorrowedMemoryStream stream(bytes_.data(), static_cast<std::int64_t>(bytes_.size()));
        return io.LoadFromStream(stream, GetParam());
    }
    /// Aborts at progress call `step` (from 1); the calls that came in all.
    int WatchSteps(int step) {
        calls_ = 0;
        io_->SetOnProgress([this, step](void*, std::int32_t) {
            if (++calls_ == step) {
                io_->SetAborting(true);
            }
        });
        return step;
    }

    std::unique_ptr<TZmBitmap> image_;
    std::unique_ptr<TZalmoIO> io_;
    TBytes bytes_;
    int finish_count_ = 0;
    int calls_ = 0;
};

TEST_P(Faults, AbortAtEveryStepOfALoad) {
    WatchSteps(0);
    ASSERT_TRUE(Load(*io_));
    const int steps = calls_ - 1;  // the last call is the finish's own
    ASSERT_GT(steps, 3);
    for (int step = WatchSteps(1); step <= steps; step = WatchSteps(step + 1)) {
        finish_count_ = 0;
        EXPECT_FALSE(Load(*io_)) << step;
        EXPECT_EQ(step + 1, calls_);
        EXPECT_EQ(1, finish_count_);
        EXPECT_TRUE(io_->GetAborting());
    }
    WatchSteps(0);
    EXPECT_TRUE(Load(*io_));
}

TEST_P(Faults, AbortAtEveryStepOfASaveKeepsTheOldFile) {
    const test::TempFolder folder;
    const std::u16string name = folder.Name("a.img");
    const TBytes old{1, 2, 3};
    WatchSteps(0);
    ASSERT_TRUE(io_->SaveToFile(name, GetParam()));
    const int steps = calls_ - 1;
    ASSERT_GT(steps, 3);
    for (int step = WatchSteps(1); step <= steps; step = WatchSteps(step + 1)) {
        test::WriteFileBytes(folder.File("a.img"), old);
        EXPECT_FALSE(io_->SaveToFile(name, GetParam())) << step;
        EXPECT_EQ(old, test::ReadFileBytes(folder.File("a.img")));
        EXPECT_EQ(1u, test::ListFolder(folder.Path()).size());
    }
}

TEST_P(Faults, NoRoomForTheBitmap) {
    TZmBitmap bitmap;
    bitmap.SetLocation(zmMemory);
    ZmGlobalSettings().fAutoLocateOnDisk = false;
    ZmGlobalSettings().fAutoFragmentBitmap = false;
    const auto reader = TZalmoIO::CreateFromBitmap(&bitmap);
    SetLargestBitmapBlock(8);
    EXPECT_FALSE(Load(*reader));
    EXPECT_TRUE(reader->GetAborting());
    SetLargestBitmapBlock(-1);
    EXPECT_TRUE(Load(*reader));
    EXPECT_EQ(31, bitmap.GetWidth());
}

// Whatever fails: no crash, the flag set, and the same objects work again afterwards.
TEST_P(Faults, EveryAllocationOfALoadFailsOnce) {
    TZmBitmap bitmap;
    const auto reader = TZalmoIO::CreateFromBitmap(&bitmap);
    ASSERT_TRUE(Load(*reader));
    bool is_loaded = false;
    for (std::int64_t n = 0; !is_loaded; ++n) {
        ASSERT_LT(n, 10000);
        t_allocations_left = n;
        is_loaded = Load(*reader);
        const bool has_failed = t_allocations_left < 0;
        t_allocations_left = -1;
        ASSERT_TRUE(has_failed || is_loaded) << n;
        ASSERT_NE(is_loaded, reader->GetAborting()) << n;
    }
    EXPECT_TRUE(Load(*reader));
    EXPECT_EQ(31, bitmap.GetWidth());
}

// The load then runs in place, or fails; no thread is waited for that never began.
TEST_P(Faults, EveryAllocationOfAThreadsStartFailsOnce) {
    TZmBitmap bitmap;
    const auto reader = TZalmoIO::CreateFromBitmap(&bitmap);
    reader->SetAsyncMode(true);
    bool has_failed = true;
    for (std::int64_t n = 0; has_failed && n < 50; ++n) {
        TBorrowedMemoryStream stream(bytes_.data(), static_cast<std::int64_t>(bytes_.size()));
        t_allocations_left = n;
        const bool is_started = reader->LoadFromStream(stream, GetParam());
        has_failed = t_allocations_left < 0;
        t_allocations_left = -1;
        reader->WaitThreads(/*abort_all=*/false);
        ASSERT_NE(is_started, reader->GetAborting()) << n;
    }
    EXPECT_EQ(31, bitmap.GetWidth());
}

TEST_P(Faults, EveryAllocationOfASaveFailsOnce) {
    bool is_saved = false;
    TBytes saved;
    for (std::int64_t n = 0; !is_saved; ++n) {
        ASSERT_LT(n, 10000);
        TMemoryStream stream;
        t_allocations_left = n;
        is_saved = io_->SaveToStream(stream, GetParam());
        const bool has_failed = t_allocations_left < 0;
        t_allocations_left = -1;
        ASSERT_TRUE(has_failed || is_saved) << n;
        saved = stream.Bytes();
    }
    EXPECT_EQ(bytes_, saved);
}

TEST_P(Faults, StreamsThatGiveLittle) {
    TZmBitmap expected;
    ASSERT_TRUE(Load(*TZalmoIO::CreateFromBitmap(&expected)));
    for (const std::int32_t piece : {1, 7, 100}) {
        TAwkwardStream stream(bytes_, piece, static_cast<std::int64_t>(bytes_.size()));
        TZmBitmap bitmap;
        const auto reader = TZalmoIO::CreateFromBitmap(&bitmap);
        ASSERT_TRUE(reader->LoadFromStream(stream, GetParam())) << piece;
        test::ExpectSamePixels(expected, bitmap);
        stream.SetPosition(0);
        EXPECT_TRUE(reader->ParamsFromStream(stream, GetParam())) << piece;
    }
}

TEST_P(Faults, StreamsThatRaise) {
    for (std::int64_t good = 0; good < static_cast<std::int64_t>(bytes_.size()); good += 13) {
        TAwkwardStream stream(bytes_, 16, good);
        finish_count_ = 0;
        try {
            EXPECT_FALSE(io_->LoadFromStream(stream, GetParam())) << good;
        } catch (const EReadError&) {
        }
        EXPECT_TRUE(io_->GetAborting()) << good;
        EXPECT_EQ(1, finish_count_) << good;
    }
    EXPECT_TRUE(Load(*io_));
}

INSTANTIATE_TEST_SUITE_P(Types, Faults, ::testing::Values(ioBMP, ioPNG, ioJPEG, ioWBMP));

}  // namespace
}  // namespace zm
