#include "actions/uActionContext.h"

#include <algorithm>
#include <memory>
#include <utility>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

constexpr std::int32_t kFirstExpansionBytes = 65535;
constexpr std::size_t kVariableBufferLength = 2048;
constexpr std::int32_t kVariableMaxLength = 1024;

IHostServices* installed_services = nullptr;

/// A text buffer of the host's heap, with the size word that goes to the host beside it.
// Required: it goes back with what the word then holds. Hosts know their blocks by the size that
// they wrote themselves.
class THostTextBuffer {
public:
    explicit THostTextBuffer(std::int32_t room_bytes)
        : size_bytes(room_bytes),
          text_(static_cast<char16_t*>(HostServices().GetMemory(room_bytes))),
          length_(static_cast<std::size_t>(room_bytes) / sizeof(char16_t)) {
        std::fill_n(text_, std::min<std::size_t>(length_, 1), u'\0');
    }
    ~THostTextBuffer() { HostServices().FreeMemory(text_, size_bytes); }
    THostTextBuffer(const THostTextBuffer&) = delete;
    THostTextBuffer& operator=(const THostTextBuffer&) = delete;

    /// Lets the host expand a text into the buffer; its status.
    std::int32_t Fill(const std::u16string& text, std::int32_t status) {
        HostServices().ExpandText(text.c_str(), text_, &size_bytes, &status);
        return status;
    }
    /// The text up to its terminator, never read past the buffer's end.
    std::u16string Value() const {
        return std::u16string(text_, std::find(text_, text_ + length_, u'\0'));
    }

    std::int32_t size_bytes;

private:
    char16_t* text_;
    std::size_t length_;
};

}  // namespace

void InstallHostServices(IHostServices* services) {
    installed_services = services;
}

IHostServices& HostServices() {
    if (installed_services == nullptr) {
        throw EZmException("There is no host: the plug-in has not been initialised");
    }
    return *installed_services;
}

void ReportJobError(std::int32_t job_id, std::int32_t code, const std::u16string& message) {
    IHostServices& host = HostServices();
    host.SetLastError(job_id, code, message);
    for (const std::u16string& line : SplitLines(message)) {
        if (!line.empty()) {
            host.InfoOut(kInfoKindError, line);
        }
    }
}

std::u16string ExpandVariables(const std::u16string& text) {
    if (text.find(u'{') == std::u16string::npos) {
        return text;
    }
    auto buffer = std::make_unique<THostTextBuffer>(kFirstExpansionBytes);
    const std::int32_t status = buffer->Fill(text, 0);
    if (status != 0) {
        const std::int32_t wanted_bytes = std::exchange(buffer->size_bytes, kFirstExpansionBytes);
        buffer.reset();
        if (wanted_bytes < 1) {
            return {};  // no buffer of that size exists
        }
        buffer = std::make_unique<THostTextBuffer>(wanted_bytes);
        buffer->Fill(text, status);
    }
    return buffer->Value();
}

std::u16string SelectVariable() {
    std::vector<char16_t> buffer(kVariableBufferLength, u'\0');
    HostServices().SelectVar(buffer.data(), kVariableMaxLength);
    return std::u16string(buffer.begin(), std::find(buffer.begin(), buffer.end(), u'\0'));
}

}  // namespace zm
