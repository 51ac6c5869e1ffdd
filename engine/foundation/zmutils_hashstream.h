#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "engine/foundation/zmstreams.h"

namespace zm {

namespace platform {
class THash;
}

/// Hash algorithms, by the numbers of the Windows cryptographic interface.
enum TZmHashAlgorithm : std::uint32_t {
    zmhaMD5 = 0x8003,
    zmhaSHA1 = 0x8004,
    zmhaSHA256 = 0x800C,
    zmhaSHA384 = 0x800D,
    zmhaSHA512 = 0x800E,
};

/// A stream that hashes what is written to it. Failures raise EZmException with the texts given
/// below.
///
/// A buffered stream keeps the data: it can be read, saved and sought in like a memory stream,
/// and its hash is that of all its bytes as they stand, each counted once, at every GetHash. An
/// unbuffered one hashes the bytes as they pass and keeps none: it cannot be read ("Read error.
/// Hash stream not Buffered, please create Buffered stream.") or sought in (its position is the
/// count of bytes so far), and after GetHash it takes no more data.
class TZmHashStream : public TStream {
public:
    /// "Unable to use CryptoAPI" without the system's hashes, "Unable to create Crypto Hash" when
    /// they do not know the algorithm.
    explicit TZmHashStream(std::uint32_t Algorithm, bool Buffered = true);
    ~TZmHashStream() override;

    /// The hash as lower-case hexadecimal text; "Unable to create hash" when the system refuses.
    std::string GetHash();

    std::int32_t Read(void* buffer, std::int32_t count) override;
    /// "Unable to add hash data" when the system refuses.
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;

    /// All data, to a new file or at a stream's position; an unbuffered stream refuses as for
    /// Read. A short write raises EWriteError.
    void SaveToFile(const std::u16string& FileName);
    void SaveToStream(TStream& Stream);
    /// The whole of a file or stream: a buffered stream holds just that afterwards and stands at
    /// its beginning; an unbuffered one adds it to its hash.
    void LoadFromFile(const std::u16string& FileName);
    void LoadFromStream(TStream& Stream);

private:
    void AddData(const void* bytes, std::size_t count);
    const TMemoryStream& Kept() const;

    std::uint32_t m_Algorithm;
    std::unique_ptr<TMemoryStream> m_MemStream;  ///< nil when unbuffered
    std::unique_ptr<platform::THash> m_CryptHash;
    std::int64_t m_Passed = 0;  ///< bytes written, when unbuffered
    std::string m_Digest;       ///< text of an unbuffered stream's finished hash
};

}  // namespace zm
