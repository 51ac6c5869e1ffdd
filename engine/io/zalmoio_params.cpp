#include <new>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zalmoio_codecs_p.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmfileformats.h"
#include "engine/io/zmformatdetect.h"

// Reading parameters without the image.
namespace zm {

namespace {

constexpr std::int32_t kBufferBytes = 8192;

}  // namespace

bool TZalmoIO::RunParams(std::int32_t type, TStream& stream, const std::u16string& name) {
    TIOParams& params = *GetParams();
    params.fFileType = type;
    params.ResetInfo();
    bool aborting = false;
    TProgressRec progress;
    progress.Aborting = &aborting;
    fAborting = true;  // stands when the codec raises
    try {
        TZmBufferedReadStream buffered(&stream, kBufferBytes,
                                       ZmGlobalSettings().fUseRelativeStreams);
        const TZmFileFormatInfo* row = FindFormatInfo(type);
        const TZmLoadCodec* codec = FindLoadCodec(type);
        TZmBitmap untouched;
        TZmMask alpha;
        if (row != nullptr && !row->InternalFormat && row->ReadFunction != nullptr) {
            row->ReadFunction(buffered, untouched, params, progress, /*preview=*/true);
        } else if (codec != nullptr && (row == nullptr || row->InternalFormat)) {
            TZmLoadCall call{
                buffered, untouched, params, progress, fBackground, /*params_only=*/true, alpha};
            codec->read(call);
            ApplyResolutionDefaults();
        } else {
            aborting = true;
        }
    } catch (const std::bad_alloc&) {
        aborting = true;
    }
    fAborting = aborting;
    if (aborting) {
        params.fFileType = ioUnknown;
    } else if (!name.empty()) {
        params.fFileName = name;
    }
    return !aborting;
}

bool TZalmoIO::ParamsFromFile(const std::u16string& file_name, std::int32_t file_type) {
    fAborting = true;  // stands when the file cannot be opened
    if (file_type == ioUnknown) {
        file_type = FindFileFormat(file_name, zmfmContentOnly);
    }
    if (file_type == ioUnknown) {
        GetParams()->fFileType = ioUnknown;
        return FailWithNotice();
    }
    TFileStream stream(file_name, fmOpenRead);
    return RunParams(file_type, stream, file_name);
}

bool TZalmoIO::ParamsFromFile(const std::u16string& file_name, bool use_extension) {
    const std::int32_t type = use_extension ? FileNameToFileType(file_name) : ioUnknown;
    return ParamsFromFile(file_name, type);
}

bool TZalmoIO::ParamsFromStream(TStream& stream, std::int32_t file_type) {
    if (file_type == ioUnknown) {
        file_type = FindStreamFormat(stream);
    }
    if (file_type == ioUnknown) {
        GetParams()->fFileType = ioUnknown;
        return FailWithNotice();
    }
    return RunParams(file_type, stream, {});
}

bool TZalmoIO::ParamsFromBuffer(const void* buffer, std::int64_t size_bytes,
                                std::int32_t file_type) {
    if (buffer == nullptr || size_bytes < 1) {
        return Fail();
    }
    TBorrowedMemoryStream stream(buffer, size_bytes);
    return ParamsFromStream(stream, file_type);
}

bool TZalmoIO::ParamsFromFileFormat(const std::u16string& file_name, std::int32_t file_type) {
    return file_type == ioUnknown ? Fail() : ParamsFromFile(file_name, file_type);
}

bool TZalmoIO::ParamsFromStreamFormat(TStream& stream, std::int32_t file_type) {
    return file_type == ioUnknown ? Fail() : ParamsFromStream(stream, file_type);
}

namespace {

/// Runs a reading of a driver that starts from `params` and hands its own back.
template <typename TRead>
bool ReadThroughDriver(TIOParams& params, TRead read) {
    TZalmoIO driver;
    driver.GetParams()->Assign(params);
    const bool is_read = read(driver);
    params.Assign(*driver.GetParams());
    return is_read;
}

}  // namespace

bool TIOParams::Read(const std::u16string& file_name, std::int32_t file_type) {
    return ReadThroughDriver(
        *this, [&](TZalmoIO& driver) { return driver.ParamsFromFile(file_name, file_type); });
}

bool TIOParams::Read(const std::u16string& file_name, bool use_extension) {
    return ReadThroughDriver(
        *this, [&](TZalmoIO& driver) { return driver.ParamsFromFile(file_name, use_extension); });
}

bool TIOParams::Read(TStream& stream, std::int32_t file_type) {
    return ReadThroughDriver(
        *this, [&](TZalmoIO& driver) { return driver.ParamsFromStream(stream, file_type); });
}

bool TIOParams::Read(const void* buffer, std::int64_t size_bytes, std::int32_t file_type) {
    return ReadThroughDriver(*this, [&](TZalmoIO& driver) {
        return driver.ParamsFromBuffer(buffer, size_bytes, file_type);
    });
}

}  // namespace zm
