#include "engine/platform/resources.h"

#include <windows.h>

#include <algorithm>
#include <new>

#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmutils_peresources_p.h"
#include "engine/platform/files.h"
#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

constexpr std::int32_t kMaxItems = 65536;     // types and resources together
constexpr DWORD kOwnOnly = RESOURCE_ENUM_LN;  // not those of translations in other files

TResourceName NameOf(const wchar_t* name) {
    TResourceName result;
    result.is_number = IS_INTRESOURCE(name);
    if (result.is_number) {
        result.number = static_cast<std::uint32_t>(reinterpret_cast<std::uintptr_t>(name));
    } else {
        result.text = FromWide(name, wcslen(name));
    }
    return result;
}

/// A name as the system's calls take it; valid as long as `name`.
const wchar_t* CallNameOf(const TResourceName& name) {
    return name.is_number ? MAKEINTRESOURCEW(name.number) : WideOf(name.text);
}

/// A list that the system's enumerations fill.
template <typename TItem>
struct TCollector {
    std::vector<TItem>& items;
    std::int32_t& items_left;  // bounds the work that tables pointing at one another can cause

    /// What the enumeration is to return: whether to go on. No exception may cross it.
    BOOL Add(const wchar_t* name) noexcept {
        if (items_left <= 0) {
            return FALSE;
        }
        --items_left;
        try {
            items.emplace_back().name = NameOf(name);
        } catch (const std::bad_alloc&) {
            return FALSE;
        }
        return TRUE;
    }
};

BOOL CALLBACK AddType(HMODULE, wchar_t* type, LONG_PTR types) noexcept {
    return reinterpret_cast<TCollector<TResourceType>*>(types)->Add(type);
}

BOOL CALLBACK AddName(HMODULE, const wchar_t*, wchar_t* name, LONG_PTR resources) noexcept {
    return reinterpret_cast<TCollector<TResource>*>(resources)->Add(name);
}

BOOL CALLBACK TakeFirstLanguage(HMODULE, const wchar_t*, const wchar_t*, WORD language,
                                LONG_PTR first) noexcept {
    *reinterpret_cast<WORD*>(first) = language;
    return FALSE;
}

/// A module that the system has mapped as data.
class TMappedModule : public TResourceModule {
public:
    TMappedModule(HMODULE module, std::int64_t file_bytes)
        : module_(module),
          view_bytes_(static_cast<std::uintptr_t>(
              std::min(static_cast<std::int64_t>(FindViewBytes()), file_bytes))) {}
    ~TMappedModule() override { FreeLibrary(module_); }
    TMappedModule(const TMappedModule&) = delete;
    TMappedModule& operator=(const TMappedModule&) = delete;

    std::vector<TResourceType> ReadTypes() override;
    std::vector<std::uint8_t> ReadData(const TResource& resource) override;

private:
    /// The handle of a module that is mapped as data carries marks in its lowest bits.
    std::uintptr_t ViewStart() const {
        return reinterpret_cast<std::uintptr_t>(module_) & ~std::uintptr_t{3};
    }
    std::uintptr_t FindViewBytes() const;
    bool FindData(const TResourceName& type, TResource& resource) const;

    HMODULE module_;
    std::uintptr_t view_bytes_;
};

/// The mapped pages that follow one another from the view's start; the last one may reach beyond
/// the file.
std::uintptr_t TMappedModule::FindViewBytes() const {
    const std::uintptr_t start = ViewStart();
    std::uintptr_t bytes = 0;
    MEMORY_BASIC_INFORMATION region{};
    const auto is_mapped = [&] {
        return VirtualQuery(reinterpret_cast<const void*>(start + bytes), &region, sizeof region) !=
                   0 &&
               reinterpret_cast<std::uintptr_t>(region.AllocationBase) == start &&
               region.State == MEM_COMMIT;
    };
    while (is_mapped()) {
        bytes += region.RegionSize;
    }
    return bytes;
}

/// False when the system finds no such resource. An address outside the view stands for data that
/// are not there.
bool TMappedModule::FindData(const TResourceName& type, TResource& resource) const {
    const wchar_t* const type_name = CallNameOf(type);
    const wchar_t* const name = CallNameOf(resource.name);
    WORD language = 0;
    EnumResourceLanguagesExW(module_, type_name, name, TakeFirstLanguage,
                             reinterpret_cast<LONG_PTR>(&language), kOwnOnly, 0);
    const HRSRC found = FindResourceExW(module_, type_name, name, language);
    if (found == nullptr) {
        return false;
    }
    const HGLOBAL data = LoadResource(module_, found);
    const void* const bytes = data != nullptr ? LockResource(data) : nullptr;
    resource.data_bytes = SizeofResource(module_, found);
    resource.data_address =
        static_cast<std::uint32_t>(reinterpret_cast<std::uintptr_t>(bytes) - ViewStart());
    return true;
}

std::vector<TResourceType> TMappedModule::ReadTypes() {
    std::int32_t items_left = kMaxItems;
    std::vector<TResourceType> types;
    TCollector<TResourceType> type_collector{types, items_left};
    EnumResourceTypesExW(module_, AddType, reinterpret_cast<LONG_PTR>(&type_collector), kOwnOnly,
                         0);
    for (TResourceType& type : types) {
        TCollector<TResource> collector{type.resources, items_left};
        EnumResourceNamesExW(module_, CallNameOf(type.name), AddName,
                             reinterpret_cast<LONG_PTR>(&collector), kOwnOnly, 0);
        std::erase_if(type.resources,
                      [&](TResource& resource) { return !FindData(type.name, resource); });
    }
    return types;
}

/// The system has not looked whether the data lie within the module.
std::vector<std::uint8_t> TMappedModule::ReadData(const TResource& resource) {
    if (resource.data_address >= view_bytes_ ||
        resource.data_bytes > view_bytes_ - resource.data_address) {
        return {};
    }
    const auto* const first =
        reinterpret_cast<const std::uint8_t*>(ViewStart() + resource.data_address);
    return {first, first + resource.data_bytes};
}

}  // namespace

// The system follows the tables of a module wherever they point, out of the module too. It only
// gets modules whose tables the bounded reader found sound, and that reader serves the others.
std::unique_ptr<TResourceModule> OpenResourceModule(const std::u16string& file_name) {
    bool is_sound = false;
    std::int64_t file_bytes = 0;
    try {
        TFileStream file(file_name, fmOpenRead);
        ReadPeResources(file, &is_sound);
        file_bytes = file.GetSize();
    } catch (const EFOpenError&) {
        return nullptr;
    }
    // An absolute path, because a bare name would be looked for in the system's folders.
    const std::u16string path = NativeName(AbsolutePath(file_name));
    const HMODULE module =
        is_sound ? LoadLibraryExW(WideOf(path), nullptr, LOAD_LIBRARY_AS_DATAFILE) : nullptr;
    if (module == nullptr) {
        return OpenPeFile(file_name);
    }
    return std::make_unique<TMappedModule>(module, file_bytes);
}

}  // namespace zm::platform
