#include "engine/platform/hashing.h"

#include <windows.h>

#include <wincrypt.h>

#include <algorithm>

namespace zm::platform {
namespace {

constexpr DWORD kProviderType = 24;               // RSA and AES, which brings SHA-2
constexpr DWORD kVerifyContextOnly = 0xF0000000;  // no keys of a user are asked for
constexpr std::size_t kMaxAddBytes = 1 << 30;

class TWin32Hash : public THash {
public:
    TWin32Hash() = default;
    ~TWin32Hash() override {
        if (hash_ != 0) {
            CryptDestroyHash(hash_);
        }
        if (provider_ != 0) {
            CryptReleaseContext(provider_, 0);
        }
    }
    TWin32Hash(const TWin32Hash&) = delete;
    TWin32Hash& operator=(const TWin32Hash&) = delete;
    bool OpenProvider() {
        return CryptAcquireContextW(&provider_, nullptr, nullptr, kProviderType,
                                    kVerifyContextOnly) != FALSE;
    }
    bool Begin(std::uint32_t algorithm) {
        return CryptCreateHash(provider_, algorithm, 0, 0, &hash_) != FALSE;
    }
    bool Add(const void* bytes, std::size_t count) override;
    bool Finish(std::vector<std::uint8_t>& digest) override;

private:
    HCRYPTPROV provider_ = 0;
    HCRYPTHASH hash_ = 0;
    bool finished_ = false;
};

bool TWin32Hash::Add(const void* bytes, std::size_t count) {
    const auto* from = static_cast<const BYTE*>(bytes);
    if (finished_) {
        return false;
    }
    while (count > 0) {
        const std::size_t piece = std::min(count, kMaxAddBytes);
        if (CryptHashData(hash_, from, static_cast<DWORD>(piece), 0) == FALSE) {
            return false;
        }
        from += piece;
        count -= piece;
    }
    return true;
}

bool TWin32Hash::Finish(std::vector<std::uint8_t>& digest) {
    DWORD size = 0;
    DWORD size_bytes = sizeof(size);
    finished_ = true;
    if (CryptGetHashParam(hash_, HP_HASHSIZE, reinterpret_cast<BYTE*>(&size), &size_bytes, 0) ==
        FALSE) {
        return false;
    }
    std::vector<std::uint8_t> bytes(size);
    if (CryptGetHashParam(hash_, HP_HASHVAL, bytes.data(), &size, 0) == FALSE) {
        return false;
    }
    bytes.resize(size);
    digest = std::move(bytes);
    return true;
}

}  // namespace

std::unique_ptr<THash> CreateHash(std::uint32_t algorithm, THashFailure& failure) {
    auto hash = std::make_unique<TWin32Hash>();
    failure = hfNoProvider;
    if (!hash->OpenProvider()) {
        return nullptr;
    }
    failure = hfNoAlgorithm;
    if (!hash->Begin(algorithm)) {
        return nullptr;
    }
    failure = hfNone;
    return hash;
}

}  // namespace zm::platform
