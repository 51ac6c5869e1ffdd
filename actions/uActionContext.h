#pragma once

#include <cstdint>
#include <string>
#include <string_view>

/// What the actions see of the floor above: a step's parameters and the host's services. The
/// plug-in shell implements both; the actions never learn of the host's records.
namespace zm {

/// Reading side of a step's key=value text. An object belongs to one call.
///
/// A key is found without case, the first line of that key winning. Integers are decimal; a
/// missing key, an empty value and one that does not parse give the default.
class IStepParams {
public:
    virtual ~IStepParams() = default;
    /// The running job; all steps of one job carry the same number.
    virtual std::int32_t GetTaskId() const = 0;
    /// The value, or an empty text.
    virtual std::u16string GetString(std::u16string_view key) const = 0;
    /// The value when the key exists, else the default.
    virtual std::u16string GetStringDef(std::u16string_view key,
                                        std::u16string_view default_value) const = 0;
    virtual std::int32_t GetInteger(std::u16string_view key) const = 0;
    virtual std::int32_t GetIntegerDef(std::u16string_view key,
                                       std::int32_t default_value) const = 0;
    virtual bool GetBool(std::u16string_view key) const = 0;
    /// An absent or empty value gives the default; one that is no integer counts as 0.
    virtual bool GetBoolDef(std::u16string_view key, bool default_value) const = 0;
};

/// Both sides of it. A key is stored in its old place or at the end; storing an empty text removes
/// the key.
class IStepSettings : public IStepParams {
public:
    virtual void SetInteger(std::u16string_view key, std::int32_t value) = 0;
    virtual void SetString(std::u16string_view key, std::u16string_view value) = 0;
    /// Stores 0 or 1.
    virtual void SetBool(std::u16string_view key, bool value) = 0;
    /// Removes all keys.
    virtual void Clear() = 0;
};

/// Kind of a host log line that tells of an error.
inline constexpr std::int32_t kInfoKindError = 2;

/// Services of the host, callable from any thread (the host makes its own callbacks safe).
class IHostServices {
public:
    virtual ~IHostServices() = default;
    /// Block of the host's heap; raises std::bad_alloc when the host has none.
    virtual void* GetMemory(std::int32_t size_bytes) = 0;
    /// `size_bytes` is the size that the block was allocated with.
    virtual void FreeMemory(void* block, std::int32_t size_bytes) = 0;
    /// Expands variables into a buffer; status and size as in the host contract.
    virtual void ExpandText(const char16_t* text, char16_t* buffer, std::int32_t* size_bytes,
                            std::int32_t* status) = 0;
    /// Lets the user pick a variable; `max_length` counts characters.
    virtual void SelectVar(char16_t* buffer, std::int32_t max_length) = 0;
    virtual void InfoOut(std::int32_t kind, const std::u16string& line) = 0;
    /// Does nothing with a host that has no such service.
    virtual void SetLastError(std::int32_t job_id, std::int32_t code,
                              const std::u16string& text) = 0;
    /// The host's scale of its forms, 100 to 250 percent.
    virtual std::int32_t DefaultScale() const = 0;
    /// The host's main window as the host gave it; nil when it has none.
    virtual void* MainWindow() const = 0;
};

/// Installs the services for the process; the caller keeps them alive. Done at start, before
/// any job runs; nil takes them away again.
void InstallHostServices(IHostServices* services);

/// The installed services. Raises EZmException when there are none.
IHostServices& HostServices();

/// Reports one error: the whole message once as the step's last error, and line by line, without
/// empty lines, in the host's log.
void ReportJobError(std::int32_t job_id, std::int32_t code, const std::u16string& message);

/// `text` with the host's variables replaced. A text without a brace comes back as it is, without
/// a call of the host. Expansions that exceed 65535 bytes take a second call; a host that then
/// asks for still more has its result cut at what it asked for first.
std::u16string ExpandVariables(const std::u16string& text);

/// Lets the user pick a variable's name; empty when the user picked none.
std::u16string SelectVariable();

}  // namespace zm
