#include "engine/foundation/zmutils_hashstream.h"

#include <algorithm>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/platform/hashing.h"

namespace zm {
namespace {

constexpr std::size_t kCopyBytes = 1 << 16;

std::unique_ptr<platform::THash> BeginHash(std::uint32_t algorithm) {
    platform::THashFailure failure = platform::hfNone;
    auto hash = platform::CreateHash(algorithm, failure);
    if (failure == platform::hfNoProvider) {
        throw EZmException("Unable to use CryptoAPI");
    }
    if (hash == nullptr) {
        throw EZmException("Unable to create Crypto Hash");
    }
    return hash;
}

std::string HexText(const std::vector<std::uint8_t>& bytes) {
    static constexpr char kDigits[] = "0123456789abcdef";
    std::string text;
    text.reserve(bytes.size() * 2);
    for (const std::uint8_t byte : bytes) {
        text += kDigits[byte >> 4];
        text += kDigits[byte & 15];
    }
    return text;
}

std::string FinishHash(platform::THash& hash) {
    std::vector<std::uint8_t> digest;
    if (!hash.Finish(digest)) {
        throw EZmException("Unable to create hash");
    }
    return HexText(digest);
}

}  // namespace

TZmHashStream::TZmHashStream(std::uint32_t Algorithm, bool Buffered)
    : m_Algorithm(Algorithm),
      m_MemStream(Buffered ? std::make_unique<TMemoryStream>() : nullptr),
      m_CryptHash(BeginHash(Algorithm)) {}

TZmHashStream::~TZmHashStream() = default;

void TZmHashStream::AddData(const void* bytes, std::size_t count) {
    if (!m_CryptHash->Add(bytes, count)) {
        throw EZmException("Unable to add hash data");
    }
}

const TMemoryStream& TZmHashStream::Kept() const {
    if (m_MemStream == nullptr) {
        throw EZmException("Read error. Hash stream not Buffered, please create Buffered stream.");
    }
    return *m_MemStream;
}

std::string TZmHashStream::GetHash() {
    if (m_MemStream != nullptr) {
        m_CryptHash = BeginHash(m_Algorithm);
        AddData(m_MemStream->Bytes().data(), m_MemStream->Bytes().size());
        return FinishHash(*m_CryptHash);
    }
    if (m_Digest.empty()) {
        m_Digest = FinishHash(*m_CryptHash);
    }
    return m_Digest;
}

std::int32_t TZmHashStream::Read(void* buffer, std::int32_t count) {
    Kept();
    return m_MemStream->Read(buffer, count);
}

std::int32_t TZmHashStream::Write(const void* buffer, std::int32_t count) {
    if (m_MemStream != nullptr) {
        return m_MemStream->Write(buffer, count);
    }
    if (count < 1) {
        return 0;
    }
    AddData(buffer, static_cast<std::size_t>(count));
    m_Passed += count;
    return count;
}

std::int64_t TZmHashStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    return m_MemStream != nullptr ? m_MemStream->Seek(offset, origin) : m_Passed;
}

void TZmHashStream::SaveToFile(const std::u16string& FileName) {
    Kept();
    TFileStream file(FileName, fmCreate);
    SaveToStream(file);
}

void TZmHashStream::SaveToStream(TStream& Stream) {
    const auto& bytes = Kept().Bytes();
    if (!bytes.empty()) {
        Stream.WriteBuffer(bytes.data(), bytes.size());
    }
}

void TZmHashStream::LoadFromFile(const std::u16string& FileName) {
    TFileStream file(FileName, fmOpenRead);
    LoadFromStream(file);
}

void TZmHashStream::LoadFromStream(TStream& Stream) {
    std::vector<std::uint8_t> block(kCopyBytes);
    auto loaded = std::make_unique<TMemoryStream>();
    TStream& target = m_MemStream != nullptr ? static_cast<TStream&>(*loaded) : *this;
    Stream.SetPosition(0);
    while (true) {
        const std::int32_t got = Stream.Read(block.data(), static_cast<std::int32_t>(kCopyBytes));
        if (got < 1) {
            break;
        }
        target.WriteBuffer(block.data(), static_cast<std::size_t>(got));
    }
    if (m_MemStream != nullptr) {
        m_MemStream = std::move(loaded);
        m_MemStream->SetPosition(0);
    }
}

}  // namespace zm
