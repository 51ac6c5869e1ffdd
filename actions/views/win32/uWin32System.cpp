#include "actions/views/win32/uWin32System_p.h"

namespace zm {
namespace {

/// Number of the manifest in the module's resources; the system's own number for a library's.
constexpr WORD kManifestId = 2;
constexpr std::uint32_t kSystemColorMark = 0xFF000000;

/// The manifest lies in the module that this code is linked into. A program without one gets no
/// context.
HANDLE NewThemedContext() {
    ACTCTXW context{};
    context.cbSize = sizeof(context);
    context.dwFlags = ACTCTX_FLAG_HMODULE_VALID | ACTCTX_FLAG_RESOURCE_NAME_VALID;
    context.hModule = OwnModule();
    context.lpResourceName = MAKEINTRESOURCEW(kManifestId);
    return CreateActCtxW(&context);
}

/// One for the process; it goes with the process, because windows refer to it.
HANDLE ThemedContext() {
    static const HANDLE context = NewThemedContext();
    return context;
}

}  // namespace

HINSTANCE OwnModule() {
    HMODULE module = nullptr;
    GetModuleHandleExW(
        GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
        reinterpret_cast<const wchar_t*>(&OwnModule), &module);
    return module;
}

FARPROC FindSystemFunction(const wchar_t* library, const char* name) {
    // Stays loaded: windows of its classes outlive a form while others are open.
    const HMODULE module = LoadLibraryW(library);
    const FARPROC function = module == nullptr ? nullptr : GetProcAddress(module, name);
    if (function == nullptr) {
        throw std::runtime_error(std::string("The system lacks the function ") + name);
    }
    return function;
}

TThemedScope::TThemedScope() : context_(ThemedContext()) {
    // Without the manifest the form has the host's look, which is as good to work with.
    active_ = context_ != INVALID_HANDLE_VALUE && ActivateActCtx(context_, &cookie_) != FALSE;
}

TThemedScope::~TThemedScope() {
    if (active_) {
        DeactivateActCtx(0, cookie_);
    }
}

bool HasVisibleDesktop() {
    USEROBJECTFLAGS flags{};
    const HWINSTA station = GetProcessWindowStation();
    return station == nullptr ||
           GetUserObjectInformationW(station, UOI_FLAGS, &flags, sizeof(flags), nullptr) == FALSE ||
           (flags.dwFlags & WSF_VISIBLE) != 0;
}

COLORREF ScreenColor(TColor color) {
    const auto value = static_cast<std::uint32_t>(color);
    const std::uint32_t number = value & ~kSystemColorMark;
    return (value & kSystemColorMark) == kSystemColorMark ? GetSysColor(static_cast<int>(number))
                                                          : number;
}

}  // namespace zm
