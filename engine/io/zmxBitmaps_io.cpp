#include "engine/bitmap/zmxBitmaps.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmioparams.h"

// The members of the bitmap that load and save it: each makes a temporary driver on the bitmap.
namespace zm {

namespace {

/// The driver of one load. `params`, when given, are its starting values.
std::unique_ptr<TZalmoIO> MakeReader(TZmBitmap& bitmap, const TIOParams* params) {
    if (bitmap.IsEmpty()) {
        bitmap.SetPixelFormat(zm24RGB);
    }
    auto driver = TZalmoIO::CreateFromBitmap(&bitmap);
    if (params != nullptr) {
        driver->GetParams()->Assign(*params);
    }
    driver->SetWicFastLoading(bitmap.GetWicFastLoading());
    driver->SetOnProgress(bitmap.GetOnProgress());
    return driver;
}

/// Takes over what the load told: name, type, and the parameters for a caller that gave some.
bool FinishRead(TZmBitmap& bitmap, const TZalmoIO& driver, const std::u16string& file_name,
                TIOParams* params) {
    bitmap.SetFilename(file_name);
    bitmap.SetFileType(driver.GetParams()->fFileType);
    if (params != nullptr) {
        params->Assign(*driver.GetParams());
    }
    return !driver.GetAborting();
}

/// The driver of one save, with the parameters that the file is to be written by.
std::unique_ptr<TZalmoIO> MakeWriter(TZmBitmap& bitmap, const TIOParams* params) {
    auto driver = TZalmoIO::CreateFromBitmap(&bitmap);
    if (params == nullptr) {
        driver->GetParams()->UpdateBPSAndSPP(bitmap.GetPixelFormat());
    } else {
        // Required: the given values replace the bitmap's own for good. A job that saves without
        // metadata has none left for a later save.
        driver->GetParams()->Assign(*params);
    }
    driver->SetOnProgress(bitmap.GetOnProgress());
    return driver;
}

}  // namespace

void TIOParamsDeleter::operator()(TIOParams* params) const {
    delete params;
}

void TZmBitmap::SetParamsEnabled(bool enabled) {
    if (!enabled) {
        fIOParams.reset();
    } else if (fIOParams == nullptr) {
        fIOParams.reset(new TIOParams(this));
    }
}

void TZmBitmap::AssignParamsFrom(TZmBitmap& source) {
    if (source.fIOParams != nullptr) {
        SetParamsEnabled(true);
        fIOParams->Assign(*source.fIOParams);
    }
}

TZmBitmap::TZmBitmap(const std::u16string& file_name, TIOParams* params) : TZmBitmap() {
    if (!Read(file_name, params, /*check_unknown=*/true)) {
        FreeImage(/*free_alpha=*/true);
    }
}

bool TZmBitmap::Read(const std::u16string& file_name, TIOParams* params, bool check_unknown) {
    const auto driver = MakeReader(*this, params);
    driver->LoadFromFile(file_name, check_unknown);
    return FinishRead(*this, *driver, file_name, params);
}

bool TZmBitmap::Read(TStream* stream, std::int32_t file_type, TIOParams* params) {
    const auto driver = MakeReader(*this, params);
    driver->LoadFromStream(*stream, file_type);
    return FinishRead(*this, *driver, {}, params);
}

bool TZmBitmap::Read(const void* buffer, std::int64_t size_bytes, std::int32_t file_type,
                     TIOParams* params) {
    const auto driver = MakeReader(*this, params);
    driver->LoadFromBuffer(buffer, size_bytes, file_type);
    return FinishRead(*this, *driver, {}, params);
}

bool TZmBitmap::LoadFromResource(const std::u16string& module_path,
                                 const std::u16string& resource_type,
                                 const std::u16string& resource_name, std::int32_t file_type) {
    const auto driver = MakeReader(*this, nullptr);
    driver->LoadFromResource(module_path, resource_type, resource_name, file_type);
    return FinishRead(*this, *driver, {}, nullptr);
}

bool TZmBitmap::Write(const std::u16string& file_name, TIOParams* params) {
    return Write(file_name, 0, params);
}

bool TZmBitmap::Write(const std::u16string& file_name, std::int32_t file_type, TIOParams* params) {
    const auto driver = MakeWriter(*this, params);
    driver->SaveToFile(file_name, file_type);
    fFilename = file_name;
    fFileType = driver->GetParams()->fFileType;
    return !driver->GetAborting();
}

bool TZmBitmap::Write(TStream* stream, std::int32_t file_type, TIOParams* params) {
    const auto driver = MakeWriter(*this, params);
    driver->SaveToStream(*stream, file_type);
    return !driver->GetAborting();
}

}  // namespace zm
