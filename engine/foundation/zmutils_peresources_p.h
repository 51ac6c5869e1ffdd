#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "engine/foundation/zmstreams.h"

/// Reading of the resources in a Windows module (PE format), as data: nothing of it is loaded or
/// run, and the result is the same on every system, for 32-bit and 64-bit modules.
namespace zm {

/// Name of a resource or of a type: a number, or a text.
struct TPeName {
    bool is_number = true;
    std::uint32_t number = 0;
    std::u16string text;
};

/// One resource. Of several languages the first in the module counts.
struct TPeResource {
    TPeName name;
    std::uint32_t data_address = 0;  ///< relative virtual address
    std::uint32_t data_bytes = 0;
};

struct TPeResourceType {
    TPeName name;
    std::vector<TPeResource> resources;
};

/// The module's types in its own order; none when the stream is no module or has no resources. A
/// faulty directory gives the entries that can be read. The tree's tables and names together are
/// read up to 16 MiB, each read counting as 64 bytes at least: that bounds the work that tables
/// pointing at one another can cause.
std::vector<TPeResourceType> ReadPeResources(TStream& module);

/// The bytes of a resource; none when they do not lie in the module's file.
std::vector<std::uint8_t> ReadPeResourceData(TStream& module, const TPeResource& resource);

}  // namespace zm
