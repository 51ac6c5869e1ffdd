#include "engine/foundation/zmutils_resources.h"

#include <algorithm>

#include "engine/foundation/zmstrings.h"

namespace zm {

using platform::TResource;
using platform::TResourceName;
using platform::TResourceType;

namespace {

// Numbers of resource types.
constexpr std::uint32_t kCursorType = 1;
constexpr std::uint32_t kIconType = 3;
constexpr std::uint32_t kCursorGroupType = 12;
constexpr std::uint32_t kIconGroupType = 14;

struct TFriendlyName {
    std::uint32_t number;
    const char16_t* text;
};
constexpr TFriendlyName kFriendlyNames[] = {
    {1, u"Cursor"},         {2, u"Bitmap"},         {3, u"Icon"},
    {4, u"Menu"},           {5, u"Dialog"},         {6, u"String Table"},
    {7, u"Font Directory"}, {8, u"Font"},           {9, u"Accelerators"},
    {10, u"RC Data"},       {11, u"Message Table"}, {12, u"Cursor Group"},
    {14, u"Icon Group"},    {16, u"Version"},       {17, u"Dialog Include"},
    {19, u"Plug and Play"}, {20, u"VXD"},           {21, u"Animated Cursor"},
    {22, u"Animated Icon"}, {23, u"HTML"},          {24, u"Manifest"},
};

/// A group's directory: six bytes with the count of frames in the last two, then fourteen bytes
/// for each frame with the number of its resource in the last two.
constexpr std::size_t kGroupHeaderBytes = 6;
constexpr std::size_t kGroupCountOffset = 4;
constexpr std::size_t kGroupEntryBytes = 14;
constexpr std::size_t kGroupNumberOffset = 12;
constexpr std::uint32_t kMaxGroupBytes = kGroupHeaderBytes + 65535 * kGroupEntryBytes;
constexpr std::uint32_t kMinGroupCost = 64;         // a small one takes a call of the system too
constexpr std::int64_t kMaxSearchBytes = 16 << 20;  // of groups looked through for a frame

std::u16string NameText(const TResourceName& name) {
    return name.is_number ? u"#" + IntegerToText(name.number) : name.text;
}

std::uint32_t FrameTypeOf(const TResourceName& group_type) {
    if (!group_type.is_number) {
        return 0;
    }
    return group_type.number == kIconGroupType     ? kIconType
           : group_type.number == kCursorGroupType ? kCursorType
                                                   : 0;
}

template <typename TItem>
const TItem* ItemAt(const std::vector<TItem>& items, std::int32_t index) {
    const bool inside = index >= 0 && static_cast<std::size_t>(index) < items.size();
    return inside ? &items[static_cast<std::size_t>(index)] : nullptr;
}

template <typename TItem>
std::int32_t CountOf(const std::vector<TItem>& items) {
    return static_cast<std::int32_t>(items.size());
}

}  // namespace

TZmResourceExtractor::TZmResourceExtractor(const std::u16string& Filename)
    : m_hlib(platform::OpenResourceModule(Filename)) {
    if (m_hlib != nullptr) {
        m_typesList = m_hlib->ReadTypes();
    }
}

TZmResourceExtractor::~TZmResourceExtractor() = default;

bool TZmResourceExtractor::HasName(std::int32_t type, std::int32_t name) const {
    return name >= 0 && name < GetNamesCount(type);
}

std::int32_t TZmResourceExtractor::GetTypesCount() const {
    return CountOf(m_typesList);
}

std::u16string TZmResourceExtractor::GetTypes(std::int32_t TypeIndex) const {
    const TResourceType* const type = ItemAt(m_typesList, TypeIndex);
    return type != nullptr ? NameText(type->name) : std::u16string();
}

std::u16string TZmResourceExtractor::GetFriendlyTypes(std::int32_t TypeIndex) const {
    const TResourceType* const type = ItemAt(m_typesList, TypeIndex);
    if (type != nullptr && type->name.is_number) {
        for (const TFriendlyName& friendly : kFriendlyNames) {
            if (friendly.number == type->name.number) {
                return friendly.text;
            }
        }
    }
    return GetTypes(TypeIndex);
}

std::int32_t TZmResourceExtractor::IndexOfType(const std::u16string& TypeName) const {
    for (std::int32_t i = 0; i < GetTypesCount(); ++i) {
        if (KeysEqualNoCase(GetTypes(i), TypeName) ||
            KeysEqualNoCase(GetFriendlyTypes(i), TypeName)) {
            return i;
        }
    }
    return -1;
}

std::int32_t TZmResourceExtractor::IndexOfNumber(std::uint32_t type_number) const {
    const auto found =
        std::find_if(m_typesList.begin(), m_typesList.end(), [&](const TResourceType& type) {
            return type.name.is_number && type.name.number == type_number;
        });
    return found == m_typesList.end() ? -1 : static_cast<std::int32_t>(found - m_typesList.begin());
}

std::int32_t TZmResourceExtractor::GetNamesCount(std::int32_t TypeIndex) const {
    const TResourceType* const type = ItemAt(m_typesList, TypeIndex);
    return type != nullptr ? CountOf(type->resources) : 0;
}

std::u16string TZmResourceExtractor::GetNames(std::int32_t TypeIndex,
                                              std::int32_t NameIndex) const {
    if (!HasName(TypeIndex, NameIndex)) {
        return {};
    }
    return NameText(ItemAt(ItemAt(m_typesList, TypeIndex)->resources, NameIndex)->name);
}

std::vector<std::uint8_t> TZmResourceExtractor::GetBuffer(std::int32_t TypeIndex,
                                                          std::int32_t NameIndex) const {
    if (!HasName(TypeIndex, NameIndex)) {
        return {};
    }
    const TResourceType& type = *ItemAt(m_typesList, TypeIndex);
    return m_hlib->ReadData(*ItemAt(type.resources, NameIndex));
}

std::vector<std::uint8_t> TZmResourceExtractor::GetBuffer(
    const TZmResourceBookmark& Bookmark) const {
    return Bookmark.FrameIndex < 0
               ? GetBuffer(Bookmark.TypeIndex, Bookmark.NameIndex)
               : GetFrameBuffer(Bookmark.TypeIndex, Bookmark.NameIndex, Bookmark.FrameIndex);
}

bool TZmResourceExtractor::GetIsGroup(std::int32_t TypeIndex) const {
    const TResourceType* const type = ItemAt(m_typesList, TypeIndex);
    return type != nullptr && FrameTypeOf(type->name) != 0;
}

bool TZmResourceExtractor::GetIsGrouped(std::int32_t TypeIndex) const {
    const TResourceType* const type = ItemAt(m_typesList, TypeIndex);
    return type != nullptr && type->name.is_number &&
           (type->name.number == kIconType || type->name.number == kCursorType);
}

/// Numbers of the resources that are a group's frames; as many as the group's bytes hold.
std::vector<std::uint32_t> TZmResourceExtractor::FrameNumbers(std::int32_t type,
                                                              std::int32_t name) const {
    std::vector<std::uint32_t> numbers;
    if (!GetIsGroup(type) || !HasName(type, name)) {
        return numbers;
    }
    TResource head = *ItemAt(ItemAt(m_typesList, type)->resources, name);
    head.data_bytes = std::min(head.data_bytes, kMaxGroupBytes);
    const std::vector<std::uint8_t> group = m_hlib->ReadData(head);
    if (group.size() < kGroupHeaderBytes) {
        return numbers;
    }
    const auto u16_at = [&](std::size_t at) {
        return static_cast<std::uint32_t>(group[at] | group[at + 1] << 8);
    };
    const std::size_t held = (group.size() - kGroupHeaderBytes) / kGroupEntryBytes;
    const std::size_t count = std::min<std::size_t>(u16_at(kGroupCountOffset), held);
    for (std::size_t i = 0; i < count; ++i) {
        numbers.push_back(u16_at(kGroupHeaderBytes + i * kGroupEntryBytes + kGroupNumberOffset));
    }
    return numbers;
}

std::int32_t TZmResourceExtractor::GetFramesCount(std::int32_t TypeIndex,
                                                  std::int32_t NameIndex) const {
    return CountOf(FrameNumbers(TypeIndex, NameIndex));
}

std::vector<std::uint8_t> TZmResourceExtractor::GetFrameBuffer(std::int32_t TypeIndex,
                                                               std::int32_t NameIndex,
                                                               std::int32_t FrameIndex) const {
    const std::vector<std::uint32_t> numbers = FrameNumbers(TypeIndex, NameIndex);
    const std::uint32_t* const number = ItemAt(numbers, FrameIndex);
    if (number == nullptr) {
        return {};
    }
    const std::int32_t frames = IndexOfNumber(FrameTypeOf(ItemAt(m_typesList, TypeIndex)->name));
    for (std::int32_t i = 0; i < GetNamesCount(frames); ++i) {
        const TResourceName& name = ItemAt(ItemAt(m_typesList, frames)->resources, i)->name;
        if (name.is_number && name.number == *number) {
            return GetBuffer(frames, i);
        }
    }
    return {};
}

bool TZmResourceExtractor::GetGroupAndFrame(std::int32_t TypeIndex, std::int32_t NameIndex,
                                            std::int32_t& GroupTypeIndex, std::int32_t& GroupIndex,
                                            std::int32_t& FrameIndex) const {
    if (!GetIsGrouped(TypeIndex) || !HasName(TypeIndex, NameIndex)) {
        return false;
    }
    const TResourceType& type = *ItemAt(m_typesList, TypeIndex);
    const TResourceName& name = ItemAt(type.resources, NameIndex)->name;
    const std::int32_t groups =
        IndexOfNumber(type.name.number == kIconType ? kIconGroupType : kCursorGroupType);
    std::int64_t bytes_left = kMaxSearchBytes;
    for (std::int32_t i = 0; name.is_number && i < GetNamesCount(groups); ++i) {
        const TResource& group = *ItemAt(ItemAt(m_typesList, groups)->resources, i);
        bytes_left -= std::clamp(group.data_bytes, kMinGroupCost, kMaxGroupBytes);
        if (bytes_left < 0) {
            return false;
        }
        const std::vector<std::uint32_t> numbers = FrameNumbers(groups, i);
        const auto found = std::find(numbers.begin(), numbers.end(), name.number);
        if (found != numbers.end()) {
            GroupTypeIndex = groups;
            GroupIndex = i;
            FrameIndex = static_cast<std::int32_t>(found - numbers.begin());
            return true;
        }
    }
    return false;
}

const TZmResourceBookmark* TZmResourceExtractor::GetResourceBookmark(std::int32_t TypeIndex,
                                                                     std::int32_t NameIndex,
                                                                     std::int32_t FrameIndex) {
    const std::int32_t frame = std::max(FrameIndex, -1);
    if (!HasName(TypeIndex, NameIndex) || frame >= GetFramesCount(TypeIndex, NameIndex)) {
        return nullptr;
    }
    for (const auto& bookmark : m_resourceBookmarks) {
        if (bookmark->TypeIndex == TypeIndex && bookmark->NameIndex == NameIndex &&
            bookmark->FrameIndex == frame) {
            return bookmark.get();
        }
    }
    m_resourceBookmarks.push_back(std::make_unique<TZmResourceBookmark>());
    *m_resourceBookmarks.back() = {TypeIndex, NameIndex, frame};
    return m_resourceBookmarks.back().get();
}

}  // namespace zm
