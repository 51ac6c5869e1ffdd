#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmfileformats.h"
#include "tests/support/testbytes.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

namespace zm::test {

/// A plug-in's row at the registry's end.
inline TZmFileFormatInfo& RegisterRow(std::int32_t type, const std::string& extensions,
                                      TZmReadImageStream read = nullptr,
                                      TZmWriteImageStream write = nullptr,
                                      TZmTryImageStream try_function = nullptr) {
    auto row = std::make_shared<TZmFileFormatInfo>();
    row->FileType = type;
    row->Extensions = extensions;
    row->ReadFunction = read;
    row->WriteFunction = write;
    row->TryFunction = try_function;
    RegisterFileFormat(row);
    return *row;
}

/// A driver on a picture of 12 by 9 that counts its finish notices; the settings, and with them
/// the registry, are made anew afterwards.
class DriverFixture : public ::testing::Test {
protected:
    void SetUp() override {
        image_ = MakeGradient(zm24RGB, 12, 9);
        io_ = TZalmoIO::CreateFromBitmap(image_.get());
        io_->SetOnFinishWork([this](void*) { ++finish_count_; });
    }
    void TearDown() override {
        io_.reset();
        DestroySingletonInstance();
    }
    TBytes SavedAs(std::int32_t type) {
        TMemoryStream stream;
        EXPECT_TRUE(io_->SaveToStream(stream, type));
        return stream.Bytes();
    }
    bool LoadBytes(TZalmoIO& io, const TBytes& bytes, std::int32_t type) {
        return io.LoadFromBuffer(bytes.data(), static_cast<std::int64_t>(bytes.size()), type);
    }

    TempFolder folder_;
    std::unique_ptr<TZmBitmap> image_;
    std::unique_ptr<TZalmoIO> io_;
    int finish_count_ = 0;
};

}  // namespace zm::test
