#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

/// The system's cryptographic hashes.
namespace zm::platform {

/// A hash under way. One thread at a time.
class THash {
public:
    virtual ~THash() = default;
    /// Adds bytes; false when the system refuses, as it does after Finish.
    virtual bool Add(const void* bytes, std::size_t count) = 0;
    /// Ends the hash and gives its bytes; false when the system refuses.
    virtual bool Finish(std::vector<std::uint8_t>& digest) = 0;
};

/// Why there is no hash.
enum THashFailure : std::uint8_t { hfNone, hfNoProvider, hfNoAlgorithm };

/// Begins a hash; nil with the reason in `failure`. `algorithm` is an identifier of the Windows
/// cryptographic interface (ALG_ID), such as 0x8003 for MD5; elsewhere the MD5 and SHA families
/// are known by the same numbers. Any thread.
std::unique_ptr<THash> CreateHash(std::uint32_t algorithm, THashFailure& failure);

}  // namespace zm::platform
