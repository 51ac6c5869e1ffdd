// The scaler of the Windows Imaging Component, fed row by row through a bitmap source of our own.
// COM is bound by name, as no other part of the module needs it.

#include "engine/platform/imagescaler.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstring>
#include <exception>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include "engine/platform/module.h"
#include "engine/platform/win32/support_p.h"

// The identifiers declared from here on get their values in this file.
#include <initguid.h>

#include <wincodec.h>

namespace zm::platform {
namespace {

/// COM's entries; loaded once and kept.
struct TComLibrary {
    std::unique_ptr<TLibrary> library;
    decltype(&::CoInitializeEx) initialize = nullptr;
    decltype(&::CoUninitialize) uninitialize = nullptr;
    decltype(&::CoCreateInstance) create_instance = nullptr;
    bool is_ready = false;
};

template <typename TFunction>
bool Bind(TLibrary& library, const char* name, TFunction& function) {
    function = reinterpret_cast<TFunction>(library.FindSymbol(name));
    return function != nullptr;
}

TComLibrary* LoadCom() {
    auto com = std::make_unique<TComLibrary>();
    std::string error_text;
    com->library = LoadInstalledLibrary("ole32.dll", error_text);
    com->is_ready = com->library != nullptr &&
                    Bind(*com->library, "CoInitializeEx", com->initialize) &&
                    Bind(*com->library, "CoUninitialize", com->uninitialize) &&
                    Bind(*com->library, "CoCreateInstance", com->create_instance);
    return com.release();
}

TComLibrary& Com() {
    static TComLibrary* const com = LoadCom();
    return *com;
}

/// COM on this thread. A host that has it running in another manner keeps that.
class TComScope {
public:
    TComScope() : is_ours_(SUCCEEDED(Com().initialize(nullptr, COINIT_MULTITHREADED))) {}
    ~TComScope() {
        if (is_ours_) {
            Com().uninitialize();
        }
    }
    TComScope(const TComScope&) = delete;
    TComScope& operator=(const TComScope&) = delete;

private:
    bool is_ours_;
};

/// A reference to an object; given back with its end.
template <typename TInterface>
class TReference {
public:
    TReference() = default;
    ~TReference() {
        if (object_ != nullptr) {
            object_->Release();
        }
    }
    TReference(const TReference&) = delete;
    TReference& operator=(const TReference&) = delete;
    TInterface* operator->() const { return object_; }
    TInterface* Get() const { return object_; }
    /// For a call that makes the object.
    TInterface** Place() { return &object_; }

private:
    TInterface* object_ = nullptr;
};

struct TLayoutInfo {
    const GUID* format;
    std::int32_t pixel_bytes;
};

/// Four bytes go as amounts of ink, which have no alpha that the component could multiply by.
TLayoutInfo InfoOf(TScalerLayout layout) {
    switch (layout) {
        case TScalerLayout::kOneWord: return {&GUID_WICPixelFormat16bppGray, 2};
        case TScalerLayout::kOneFloat: return {&GUID_WICPixelFormat32bppGrayFloat, 4};
        case TScalerLayout::kThreeBytes: return {&GUID_WICPixelFormat24bppBGR, 3};
        case TScalerLayout::kThreeWords: return {&GUID_WICPixelFormat48bppRGB, 6};
        case TScalerLayout::kFourBytes: return {&GUID_WICPixelFormat32bppCMYK, 4};
        default: return {&GUID_WICPixelFormat8bppGray, 1};
    }
}

/// The source of a request as the component reads it. Lives on the stack: nobody keeps it
/// longer than the call that it is made for.
class TZmWICBitmapWrapper final : public IWICBitmapSource {
public:
    TZmWICBitmapWrapper(const TScalerRequest& request, const TLayoutInfo& layout)
        : request_(request), layout_(layout) {}
    virtual ~TZmWICBitmapWrapper() = default;

    /// The exception that ended a row function; nil without one.
    const std::exception_ptr& Failure() const { return failure_; }

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID id, void** object) override {
        if (object == nullptr) {
            return E_POINTER;
        }
        const bool is_known =
            IsEqualGUID(id, IID_IUnknown) || IsEqualGUID(id, IID_IWICBitmapSource);
        *object = is_known ? static_cast<IWICBitmapSource*>(this) : nullptr;
        return is_known ? S_OK : E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return 1; }
    ULONG STDMETHODCALLTYPE Release() override { return 1; }

    HRESULT STDMETHODCALLTYPE GetSize(UINT* width, UINT* height) override {
        if (width == nullptr || height == nullptr) {
            return E_INVALIDARG;
        }
        *width = static_cast<UINT>(request_.source_width);
        *height = static_cast<UINT>(request_.source_height);
        return S_OK;
    }
    HRESULT STDMETHODCALLTYPE GetPixelFormat(WICPixelFormatGUID* format) override {
        if (format == nullptr) {
            return E_INVALIDARG;
        }
        *format = *layout_.format;
        return S_OK;
    }
    HRESULT STDMETHODCALLTYPE GetResolution(double* dpi_x, double* dpi_y) override {
        constexpr double kScreenDpi = 96;
        if (dpi_x == nullptr || dpi_y == nullptr) {
            return E_INVALIDARG;
        }
        *dpi_x = *dpi_y = kScreenDpi;
        return S_OK;
    }
    HRESULT STDMETHODCALLTYPE CopyPalette(IWICPalette* /*palette*/) override {
        return WINCODEC_ERR_PALETTEUNAVAILABLE;
    }
    HRESULT STDMETHODCALLTYPE CopyPixels(const WICRect* part, UINT stride, UINT buffer_bytes,
                                         BYTE* buffer) override {
        const WICRect all{0, 0, request_.source_width, request_.source_height};
        const WICRect rect = part != nullptr ? *part : all;
        if (buffer == nullptr || !IsInside(rect) || !HasRoom(rect, stride, buffer_bytes)) {
            return E_INVALIDARG;
        }
        try {
            CopyRows(rect, stride, buffer);
            return S_OK;
        } catch (...) {
            // Exceptions do not cross the component; ScaleImage raises it again.
            failure_ = std::current_exception();
            return E_FAIL;
        }
    }

private:
    bool IsInside(const WICRect& rect) const {
        return rect.X >= 0 && rect.Y >= 0 && rect.Width > 0 && rect.Height > 0 &&
               rect.Width <= request_.source_width - rect.X &&
               rect.Height <= request_.source_height - rect.Y;
    }
    bool HasRoom(const WICRect& rect, UINT stride, UINT buffer_bytes) const {
        const std::int64_t row_bytes = std::int64_t{rect.Width} * layout_.pixel_bytes;
        return stride >= row_bytes &&
               (std::int64_t{rect.Height} - 1) * stride + row_bytes <= buffer_bytes;
    }
    void CopyRows(const WICRect& rect, UINT stride, BYTE* buffer) const {
        const std::size_t offset = static_cast<std::size_t>(rect.X) * PixelBytes();
        const std::size_t bytes = static_cast<std::size_t>(rect.Width) * PixelBytes();
        for (INT y = 0; y < rect.Height; ++y, buffer += stride) {
            std::memcpy(buffer, request_.source_row(rect.Y + y) + offset, bytes);
        }
    }
    std::size_t PixelBytes() const { return static_cast<std::size_t>(layout_.pixel_bytes); }

    const TScalerRequest& request_;
    TLayoutInfo layout_;
    std::exception_ptr failure_;
};

/// Gives `scaler` our pixel format where it has chosen another one.
bool ConvertBack(IWICImagingFactory& factory, IWICBitmapSource& scaler, const GUID& format,
                 TReference<IWICFormatConverter>& converter) {
    return SUCCEEDED(factory.CreateFormatConverter(converter.Place())) &&
           SUCCEEDED(converter->Initialize(&scaler, format, WICBitmapDitherTypeNone, nullptr, 0,
                                           WICBitmapPaletteTypeCustom));
}

/// Takes the result in bands of rows, so that no second picture is needed.
bool CopyResult(IWICBitmapSource& result, const TScalerRequest& request, std::int32_t pixel_bytes) {
    constexpr std::int64_t kBandBytes = std::int64_t{1} << 20;
    const std::int64_t row_bytes = std::int64_t{request.target_width} * pixel_bytes;
    if (row_bytes > std::numeric_limits<std::int32_t>::max()) {
        return false;
    }
    const auto band = static_cast<std::int32_t>(
        std::clamp<std::int64_t>(kBandBytes / row_bytes, 1, request.target_height));
    const auto row_size = static_cast<std::size_t>(row_bytes);
    std::vector<std::uint8_t> rows(row_size * static_cast<std::size_t>(band));
    for (std::int32_t top = 0; top < request.target_height;) {
        const std::int32_t count = std::min(band, request.target_height - top);
        const WICRect part{0, top, request.target_width, count};
        if (FAILED(result.CopyPixels(&part, static_cast<UINT>(row_bytes),
                                     static_cast<UINT>(rows.size()), rows.data()))) {
            return false;
        }
        for (std::int32_t y = 0; y < count; ++y) {
            std::memcpy(request.target_row(top + y),
                        rows.data() + static_cast<std::size_t>(y) * row_size, row_size);
        }
        top += count;
    }
    return true;
}

bool ScaleThrough(TZmWICBitmapWrapper& source, const TScalerRequest& request,
                  const TLayoutInfo& layout) {
    constexpr std::array kModes{WICBitmapInterpolationModeNearestNeighbor,
                                WICBitmapInterpolationModeLinear, WICBitmapInterpolationModeCubic,
                                WICBitmapInterpolationModeFant};
    TReference<IWICImagingFactory> factory;
    TReference<IWICBitmapScaler> scaler;
    TReference<IWICFormatConverter> converter;
    WICPixelFormatGUID format{};
    if (FAILED(Com().create_instance(CLSID_WICImagingFactory, nullptr, CLSCTX_INPROC_SERVER,
                                     IID_IWICImagingFactory,
                                     reinterpret_cast<void**>(factory.Place()))) ||
        FAILED(factory->CreateBitmapScaler(scaler.Place())) ||
        FAILED(scaler->Initialize(&source, static_cast<UINT>(request.target_width),
                                  static_cast<UINT>(request.target_height),
                                  kModes[static_cast<std::size_t>(request.mode)])) ||
        FAILED(scaler->GetPixelFormat(&format))) {
        return false;
    }
    if (IsEqualGUID(format, *layout.format)) {
        return CopyResult(*scaler.Get(), request, layout.pixel_bytes);
    }
    return ConvertBack(*factory.Get(), *scaler.Get(), *layout.format, converter) &&
           CopyResult(*converter.Get(), request, layout.pixel_bytes);
}

}  // namespace

bool ScaleImage(const TScalerRequest& request) {
    if (!Com().is_ready) {
        return false;
    }
    const TComScope com;
    const TLayoutInfo layout = InfoOf(request.layout);
    TZmWICBitmapWrapper source(request, layout);
    const bool is_done = ScaleThrough(source, request, layout);
    if (source.Failure() != nullptr) {
        std::rethrow_exception(source.Failure());
    }
    return is_done;
}

}  // namespace zm::platform
