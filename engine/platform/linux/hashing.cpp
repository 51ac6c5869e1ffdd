// Hashes of the system's libcrypto. It is bound by name at run time: a machine without it lacks
// hashes and nothing else.
#include "engine/platform/hashing.h"

#include <dlfcn.h>

#include <array>

namespace zm::platform {
namespace {

constexpr std::size_t kMaxDigestBytes = 64;

/// The functions of the library that are used; its objects are opaque here.
struct TCrypto {
    void* (*new_context)() = nullptr;
    void (*free_context)(void* context) = nullptr;
    int (*begin)(void* context, const void* algorithm, void* engine) = nullptr;
    int (*update)(void* context, const void* bytes, std::size_t count) = nullptr;
    int (*finish)(void* context, unsigned char* digest, unsigned int* size) = nullptr;
    const void* (*algorithm_by_name)(const char* name) = nullptr;
    bool complete = false;
};

template <typename TFunction>
bool Bind(void* library, const char* name, TFunction& function) {
    function = reinterpret_cast<TFunction>(::dlsym(library, name));
    return function != nullptr;
}

TCrypto LoadCrypto() {
    TCrypto crypto;
    void* library = nullptr;
    for (const char* const name : {"libcrypto.so.3", "libcrypto.so.1.1"}) {
        library = library != nullptr ? library : ::dlopen(name, RTLD_NOW | RTLD_LOCAL);
    }
    // Never unloaded: the library registers clean-up of its own for the end of the process.
    crypto.complete = library != nullptr && Bind(library, "EVP_MD_CTX_new", crypto.new_context) &&
                      Bind(library, "EVP_MD_CTX_free", crypto.free_context) &&
                      Bind(library, "EVP_DigestInit_ex", crypto.begin) &&
                      Bind(library, "EVP_DigestUpdate", crypto.update) &&
                      Bind(library, "EVP_DigestFinal_ex", crypto.finish) &&
                      Bind(library, "EVP_get_digestbyname", crypto.algorithm_by_name);
    return crypto;
}

const TCrypto& Crypto() {
    static const TCrypto crypto = LoadCrypto();
    return crypto;
}

struct TAlgorithm {
    std::uint32_t id;
    const char* name;
};
constexpr TAlgorithm kAlgorithms[] = {
    {0x8003, "MD5"}, {0x8004, "SHA1"}, {0x800C, "SHA256"}, {0x800D, "SHA384"}, {0x800E, "SHA512"},
};

const void* FindAlgorithm(std::uint32_t id) {
    for (const TAlgorithm& algorithm : kAlgorithms) {
        if (algorithm.id == id) {
            return Crypto().algorithm_by_name(algorithm.name);
        }
    }
    return nullptr;
}

class TLinuxHash : public THash {
public:
    TLinuxHash() : context_(Crypto().new_context()) {}
    ~TLinuxHash() override { Crypto().free_context(context_); }  // takes nil too
    TLinuxHash(const TLinuxHash&) = delete;
    TLinuxHash& operator=(const TLinuxHash&) = delete;
    bool Begin(const void* algorithm) {
        is_open_ = context_ != nullptr && Crypto().begin(context_, algorithm, nullptr) == 1;
        return is_open_;
    }
    bool Add(const void* bytes, std::size_t count) override {
        return is_open_ && (count == 0 || Crypto().update(context_, bytes, count) == 1);
    }
    bool Finish(std::vector<std::uint8_t>& digest) override {
        std::array<unsigned char, kMaxDigestBytes> bytes{};
        unsigned int size = 0;
        const bool finished =
            is_open_ && Crypto().finish(context_, bytes.data(), &size) == 1 && size <= bytes.size();
        is_open_ = false;
        if (finished) {
            digest.assign(bytes.begin(), bytes.begin() + size);
        }
        return finished;
    }

private:
    void* context_;
    bool is_open_ = false;
};

}  // namespace

std::unique_ptr<THash> CreateHash(std::uint32_t algorithm, THashFailure& failure) {
    failure = hfNoProvider;
    if (!Crypto().complete) {
        return nullptr;
    }
    failure = hfNoAlgorithm;
    const void* const method = FindAlgorithm(algorithm);
    auto hash = std::make_unique<TLinuxHash>();
    if (method == nullptr || !hash->Begin(method)) {
        return nullptr;
    }
    failure = hfNone;
    return hash;
}

}  // namespace zm::platform
