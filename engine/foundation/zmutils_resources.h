#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/platform/resources.h"

namespace zm {

/// A place in a module's resources, to be kept and handed back to GetBuffer. Owned by its
/// extractor.
struct TZmResourceBookmark {
    std::int32_t TypeIndex = 0;
    std::int32_t NameIndex = 0;
    std::int32_t FrameIndex = -1;  ///< -1: the resource itself, no frame of a group
};

/// Resources of a Windows module (program, library), read as data on every system: the module is
/// never run, and need not fit the machine. Types and names have indexes from 0 in the module's
/// own order. An index outside answers as the empty text, no bytes, or false.
///
/// A group (of icons or cursors) is a list of frames, each of which is a resource of its own, of
/// the type icon or cursor. Of a resource in several languages the first in the module is taken.
/// Not thread-safe.
class TZmResourceExtractor {
public:
    /// A file that cannot be read, is no module or has no resources gives no types.
    explicit TZmResourceExtractor(const std::u16string& Filename);
    ~TZmResourceExtractor();
    TZmResourceExtractor(const TZmResourceExtractor&) = delete;
    TZmResourceExtractor& operator=(const TZmResourceExtractor&) = delete;

    std::int32_t GetTypesCount() const;
    /// A type's name, or "#" and its number ("#14").
    std::u16string GetTypes(std::int32_t TypeIndex) const;
    /// An English word for a type that the system knows ("Bitmap"), the same as GetTypes for
    /// others.
    std::u16string GetFriendlyTypes(std::int32_t TypeIndex) const;
    /// The first type of a name as either of the two gives it, without case; -1 for none.
    std::int32_t IndexOfType(const std::u16string& TypeName) const;

    std::int32_t GetNamesCount(std::int32_t TypeIndex) const;
    /// A resource's name, or "#" and its number.
    std::u16string GetNames(std::int32_t TypeIndex, std::int32_t NameIndex) const;

    /// The bytes of a resource; none when they are not in the file.
    std::vector<std::uint8_t> GetBuffer(std::int32_t TypeIndex, std::int32_t NameIndex) const;
    std::vector<std::uint8_t> GetBuffer(const TZmResourceBookmark& Bookmark) const;

    /// Whether a type's resources are groups; whether they are the frames of groups.
    bool GetIsGroup(std::int32_t TypeIndex) const;
    bool GetIsGrouped(std::int32_t TypeIndex) const;
    /// Frames of a group; 0 when it is none.
    std::int32_t GetFramesCount(std::int32_t TypeIndex, std::int32_t NameIndex) const;
    /// The bytes of the icon or cursor that is the frame.
    std::vector<std::uint8_t> GetFrameBuffer(std::int32_t TypeIndex, std::int32_t NameIndex,
                                             std::int32_t FrameIndex) const;
    /// The first group, and the frame in it, that a grouped resource belongs to; false when none
    /// does.
    bool GetGroupAndFrame(std::int32_t TypeIndex, std::int32_t NameIndex,
                          std::int32_t& GroupTypeIndex, std::int32_t& GroupIndex,
                          std::int32_t& FrameIndex) const;

    /// A bookmark, valid as long as the extractor; nil for a place that does not exist. The same
    /// place gives the same bookmark.
    const TZmResourceBookmark* GetResourceBookmark(std::int32_t TypeIndex, std::int32_t NameIndex,
                                                   std::int32_t FrameIndex = -1);

private:
    bool HasName(std::int32_t type, std::int32_t name) const;
    std::int32_t IndexOfNumber(std::uint32_t type_number) const;
    std::vector<std::uint32_t> FrameNumbers(std::int32_t type, std::int32_t name) const;

    std::unique_ptr<platform::TResourceModule> m_hlib;  ///< nil when it cannot be read
    std::vector<platform::TResourceType> m_typesList;
    std::vector<std::unique_ptr<TZmResourceBookmark>> m_resourceBookmarks;
};

}  // namespace zm
