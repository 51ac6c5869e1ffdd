#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/foundation/zmstreams.h"
#include "engine/platform/resources.h"

/// Reading of the resources in a Windows module (PE format), as data: nothing of it is loaded or
/// run, and modules of 32 and of 64 bits give the same. For systems that cannot do it themselves.
namespace zm {

/// The module's types in its own order; none when the stream is no module or has no resources. A
/// faulty directory gives the entries that can be read. The tree's tables and names together are
/// read up to 16 MiB, each read counting as 64 bytes at least: that bounds the work that tables
/// pointing at one another can cause.
/// `is_sound`, when wanted, tells whether all of the tree that was looked at could be read.
std::vector<platform::TResourceType> ReadPeResources(TStream& module, bool* is_sound = nullptr);

/// The bytes of a resource, whose address is relative and virtual; none when they do not lie in the
/// module's file.
std::vector<std::uint8_t> ReadPeResourceData(TStream& module, const platform::TResource& resource);

/// The resources of a file by these functions; nil for a file that cannot be read.
std::unique_ptr<platform::TResourceModule> OpenPeFile(const std::u16string& file_name);

}  // namespace zm
