#include "engine/foundation/zmsettings.h"

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <mutex>
#include <new>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/console.h"
#include "engine/platform/screen.h"

namespace zm {
namespace {

/// A version number of the system's and its name here.
struct TOpSysRow {
    platform::TSystemVersion version;
    TZmOpSys name;
};

constexpr TOpSysRow kOpSysRows[] = {
    {{1, 4, 0}, zmosWin95},   {{1, 4, 10}, zmosWin98},   {{1, 4, 90}, zmosWinME},
    {{2, 4, 0}, zmosWinNT4},  {{2, 5, 0}, zmosWin2000},  {{2, 5, 1}, zmosWinXP},
    {{2, 5, 2}, zmosWin2003}, {{2, 6, 0}, zmosWinVista}, {{2, 6, 1}, zmosWin7},
    {{2, 6, 2}, zmosWin8},    {{2, 10, 0}, zmosWin10},
};

/// ISO 639 code of a locale and its language. Codes that share a primary language id of the
/// system's share the language.
struct TLocaleRow {
    const char* code;
    TMsgLanguage language;
};

constexpr TLocaleRow kLocaleRows[] = {
    {"ar", msArabic},     {"bs", msSerbian},   {"cs", msCzech},     {"da", msDanish},
    {"de", msGerman},     {"el", msGreek},     {"es", msSpanish},   {"fa", msFarsi},
    {"fi", msFinnish},    {"fr", msFrench},    {"hr", msSerbian},   {"hu", msHungarian},
    {"it", msItalian},    {"ja", msJapanese},  {"ko", msKorean},    {"nb", msNorwegian},
    {"nl", msDutch},      {"nn", msNorwegian}, {"no", msNorwegian}, {"pl", msPolish},
    {"pt", msPortuguese}, {"ru", msRussian},   {"sr", msSerbian},   {"sv", msSwedish},
    {"tr", msTurkish},
};

/// Languages whose translation is whole; the others are partial.
constexpr TMsgLanguage kFullLanguages[] = {
    msSystem,   msEnglish, msArabic,     msChinese, msChineseTraditionalBig5,
    msDutch,    msFrench,  msGerman,     msGreek,   msItalian,
    msJapanese, msKorean,  msPortuguese, msRussian, msSpanish,
    msTurkish,
};

TZmOpSys OpSysOf(const std::optional<platform::TSystemVersion>& version) {
    for (const TOpSysRow& row : kOpSysRows) {
        if (version && row.version.platform_id == version->platform_id &&
            row.version.major == version->major && row.version.minor == version->minor) {
            return row.name;
        }
    }
    return zmosUnknown;
}

constexpr std::size_t kMaxInitializers = 32;  // rooms above the foundation are far fewer

/// Guarded by the mutex, apart from `instance`, which readers take without it. Holds no memory
/// of its own.
struct TSingletonState {
    std::recursive_mutex mutex;
    std::atomic<TZmZalmoGlobalSettings*> instance{nullptr};
    TZmZalmoGlobalSettings* being_made = nullptr;
    std::array<TZmSettingsInitializer, kMaxInitializers> initializers{};
    std::size_t initializer_count = 0;
    std::int32_t use_count = 0;
};

/// Made on first use, because initialisers are added while other units still start; never
/// destroyed, because units that end late may ask.
TSingletonState& SingletonState() {
    alignas(TSingletonState) static std::byte storage[sizeof(TSingletonState)];
    static auto* const state = new (storage) TSingletonState;
    return *state;
}

/// Frees the settings when the module goes without having been finalised.
struct TUnloadGuard {
    ~TUnloadGuard() { DestroySingletonInstance(); }
};
const TUnloadGuard unload_guard;

/// Makes the settings and lets the rooms fill them; an initialiser that asks for the settings
/// gets the object in the making.
TZmZalmoGlobalSettings& MakeSettings(TSingletonState& state) {
    const std::lock_guard lock(state.mutex);
    if (TZmZalmoGlobalSettings* const made = state.instance.load()) {
        return *made;
    }
    if (state.being_made != nullptr) {
        return *state.being_made;
    }
    auto settings = std::make_unique<TZmZalmoGlobalSettings>();
    state.being_made = settings.get();
    try {
        for (std::size_t i = 0; i < state.initializer_count; ++i) {
            state.initializers[i](*settings);
        }
    } catch (...) {
        state.being_made = nullptr;
        throw;
    }
    state.being_made = nullptr;
    state.instance.store(settings.get(), std::memory_order_release);
    return *settings.release();
}

}  // namespace

TZmZalmoGlobalSettings::TZmZalmoGlobalSettings()
    : fOpSys(OpSysOf(platform::SystemVersion())), fMMX(platform::ProcessorHasMMX()) {
    fUnicodeOS = fOpSys > zmosWinME;
    const platform::TScreenTraits screen = platform::ScreenTraits();
    fSystemColors = screen.bits_per_pixel;
    fIsRemoteSession = screen.is_remote_session;
    fSystemDPIX = screen.dpi_x;
    fSystemDPIY = screen.dpi_y;
    fEdgeX = screen.edge_x;
    fEdgeY = screen.edge_y;
    fBorderX = screen.border_x;
    fBorderY = screen.border_y;
    fVScrollWidth = screen.vertical_scroll_width;
    fHScrollHeight = screen.horizontal_scroll_height;
}

TZmZalmoGlobalSettings::~TZmZalmoGlobalSettings() = default;

TMsgLanguage TZmZalmoGlobalSettings::CurrentMsgLanguage() const {
    return fMsgLanguage != msSystem ? fMsgLanguage : MsgLanguageOfLocale(platform::LocaleName());
}

std::vector<TMsgLanguage> TZmZalmoGlobalSettings::GetLanguages(bool full_only) const {
    std::vector<TMsgLanguage> languages;
    for (int ordinal = 0; ordinal < kMsgLanguageCount; ++ordinal) {
        const auto language = static_cast<TMsgLanguage>(ordinal);
        if (!full_only ||
            std::count(std::begin(kFullLanguages), std::end(kFullLanguages), language) != 0) {
            languages.push_back(language);
        }
    }
    return languages;
}

TZmFileFormatInfo* TZmZalmoGlobalSettings::GetFileFormat(std::int32_t index) const {
    const bool inside = index >= 0 && static_cast<std::size_t>(index) < fFileFormats.size();
    return inside ? fFileFormats[static_cast<std::size_t>(index)].get() : nullptr;
}

void TZmZalmoGlobalSettings::AddToolbar(TZmToolbar* toolbar) {
    if (std::count(toolbars_.begin(), toolbars_.end(), toolbar) == 0) {
        toolbars_.push_back(toolbar);
    }
}

void TZmZalmoGlobalSettings::RemoveToolbar(TZmToolbar* toolbar) {
    std::erase(toolbars_, toolbar);
}

void TZmZalmoGlobalSettings::UpdateToolbars(bool full_update) {
    // A toolbar may add or remove toolbars while it updates.
    const std::vector<TZmToolbar*> known = toolbars_;
    for (TZmToolbar* const toolbar : known) {
        if (std::count(toolbars_.begin(), toolbars_.end(), toolbar) != 0) {
            toolbar->Update(full_update);
        }
    }
}

TZmZalmoGlobalSettings& ZmGlobalSettings() {
    TSingletonState& state = SingletonState();
    TZmZalmoGlobalSettings* const settings = state.instance.load(std::memory_order_acquire);
    return settings != nullptr ? *settings : MakeSettings(state);
}

void DestroySingletonInstance() {
    TSingletonState& state = SingletonState();
    const std::lock_guard lock(state.mutex);
    delete state.instance.exchange(nullptr);
}

bool AddSettingsInitializer(TZmSettingsInitializer initializer) {
    TSingletonState& state = SingletonState();
    const std::lock_guard lock(state.mutex);
    const auto known_end = state.initializers.begin() + state.initializer_count;
    if (std::find(state.initializers.begin(), known_end, initializer) != known_end) {
        return true;
    }
    if (state.initializer_count == kMaxInitializers) {
        return false;
    }
    state.initializers[state.initializer_count++] = initializer;
    if (TZmZalmoGlobalSettings* const settings = state.instance.load()) {
        initializer(*settings);
    }
    return true;
}

void ZmInitializeLibrary() {
    TSingletonState& state = SingletonState();
    const std::lock_guard lock(state.mutex);
    ++state.use_count;
    ZmGlobalSettings();
}

void ZmFinalizeLibrary() {
    TSingletonState& state = SingletonState();
    const std::lock_guard lock(state.mutex);
    if (state.use_count > 0 && --state.use_count == 0) {
        DestroySingletonInstance();
    }
}

TMsgLanguage MsgLanguageOfLocale(const std::string& locale_name) {
    const std::string name = AsciiLower(locale_name.substr(0, locale_name.find_first_of(".@")));
    const auto separator = name.find_first_of("-_");
    const std::string code = name.substr(0, separator);
    if (code == "zh") {
        const std::string region = name.substr(std::min(name.size(), code.size() + 1));
        const bool mainland =
            region == "cn" || region == "hans" || region == "hans_cn" || region == "hans-cn";
        const bool taiwan = region == "tw" || region == "hant_tw" || region == "hant-tw";
        return mainland ? msChinese : taiwan ? msChineseTraditionalBig5 : msSystem;
    }
    for (const TLocaleRow& row : kLocaleRows) {
        if (code == row.code) {
            return row.language;
        }
    }
    return msEnglish;
}

}  // namespace zm
