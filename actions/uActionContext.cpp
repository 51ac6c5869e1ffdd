#include "actions/uActionContext.h"

#include <algorithm>
#include <memory>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

constexpr std::int32_t kFirstExpansionBytes = 65535;
constexpr std::size_t kVariableBufferLength = 2048;
constexpr std::int32_t kVariableMaxLength = 1024;

IHostServices* installed_services = nullptr;

/// A text buffer of the host's heap. It goes back with the size that it was allocated with, also
/// when the host has changed the size word since: a heap that trusts the size would otherwise be
/// damaged.
class THostTextBuffer {
public:
    explicit THostTextBuffer(std::int32_t size_bytes)
        : text_(static_cast<char16_t*>(HostServices().GetMemory(size_bytes))),
          size_bytes_(size_bytes) {
        std::fill_n(text_, Length() < 1 ? 0 : 1, u'\0');
    }
    ~THostTextBuffer() { HostServices().FreeMemory(text_, size_bytes_); }
    THostTextBuffer(const THostTextBuffer&) = delete;
    THostTextBuffer& operator=(const THostTextBuffer&) = delete;

    char16_t* Text() { return text_; }
    /// The text up to its terminator, never read past the buffer's end.
    std::u16string Value() const {
        return std::u16string(text_, std::find(text_, text_ + Length(), u'\0'));
    }

private:
    std::size_t Length() const { return static_cast<std::size_t>(size_bytes_) / sizeof(char16_t); }

    char16_t* text_;
    std::int32_t size_bytes_;
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
    IHostServices& host = HostServices();
    std::int32_t size_bytes = kFirstExpansionBytes;
    std::int32_t status = 0;
    auto buffer = std::make_unique<THostTextBuffer>(size_bytes);
    host.ExpandText(text.c_str(), buffer->Text(), &size_bytes, &status);
    if (status != 0) {
        buffer.reset();
        if (size_bytes < 1) {
            return {};  // no buffer of that size exists
        }
        buffer = std::make_unique<THostTextBuffer>(size_bytes);
        host.ExpandText(text.c_str(), buffer->Text(), &size_bytes, &status);
    }
    return buffer->Value();
}

std::u16string SelectVariable() {
    std::vector<char16_t> buffer(kVariableBufferLength, u'\0');
    HostServices().SelectVar(buffer.data(), kVariableMaxLength);
    return std::u16string(buffer.begin(), std::find(buffer.begin(), buffer.end(), u'\0'));
}

}  // namespace zm
