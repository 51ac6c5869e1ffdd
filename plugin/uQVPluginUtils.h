#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "actions/uActionContext.h"
#include "plugin/AFTypes.h"

namespace zm {

enum TQVPluginParamsType : std::uint8_t { ptAction, ptEvent };

/// A step's settings as both ends of the plug-in see them: lines `key=value` with CR LF ends, in
/// zero-terminated UTF-16, which the host stores without knowing what they mean.
///
/// A key is the text up to the first equals sign of its line, compared without case; the first
/// line of a key wins, lines without an equals sign have none. Nothing in a text is an error:
/// an unknown key and a malformed value give the default. A list under the key `name` is the
/// line `name_count=N` and lines `name_0` to `name_(N-1)`.
///
/// An object lives for one host call and belongs to its thread.
class TQVPluginParams : public IStepSettings {
public:
    /// Reads the text up to its terminator; the record's size is not consulted. A nil text is
    /// empty.
    explicit TQVPluginParams(const TAFActionParams& params);
    explicit TQVPluginParams(const TAFEventParams& params);

    TQVPluginParamsType GetParamsType() const { return FParamsType; }
    std::int32_t GetTaskId() const override { return FTaskId; }
    std::int32_t GetStepNum() const { return FSTepNum; }    ///< 0 for an event
    std::int32_t GetUniqueId() const { return FUniqueId; }  ///< 0 for an action
    bool GetIsRemote() const { return FIsRemote; }

    bool ParamExist(std::u16string_view key) const;
    std::u16string GetString(std::u16string_view key) const override;
    std::u16string GetStringDef(std::u16string_view key,
                                std::u16string_view default_value) const override;
    std::int32_t GetInteger(std::u16string_view key) const override;
    std::int32_t GetIntegerDef(std::u16string_view key, std::int32_t default_value) const override;
    bool GetBool(std::u16string_view key) const override;
    bool GetBoolDef(std::u16string_view key, bool default_value) const override;
    /// The items of a list joined by CR LF (an empty first item adds no line break of its own);
    /// the default when that is empty. At most kMaxListItems items are read.
    std::u16string GetStrings(std::u16string_view key) const;
    std::u16string GetStringsDef(std::u16string_view key, std::u16string_view default_value) const;

    void SetInteger(std::u16string_view key, std::int32_t value) override;
    /// Replaces the value of the key's line or appends a line. An empty value removes the line.
    void SetString(std::u16string_view key, std::u16string_view value) override;
    void SetBool(std::u16string_view key, bool value) override;
    /// Lines of a longer earlier list stay.
    void SetStrings(std::u16string_view key, const std::vector<std::u16string>& values);
    void Clear() override { FList.clear(); }

    /// Puts the text in place of the record's block, both of the host's heap. Raises
    /// EPluginException on an object of the other kind, std::bad_alloc when the host has no
    /// memory (the record is then empty).
    void ToActionParams(TAFActionParams& params) const;
    void ToEventParams(TAFEventParams& params) const;

private:
    using TLines = std::vector<std::u16string>;

    TLines::const_iterator FindLine(std::u16string_view key) const;
    void WriteBlock(std::int32_t& size, void*& block) const;

    TLines FList;
    TQVPluginParamsType FParamsType;
    std::int32_t FTaskId;
    std::int32_t FSTepNum = 0;
    std::int32_t FUniqueId = 0;
    bool FIsRemote;
};

/// Bound on the items of a list, far above what a form stores: a text can claim any count.
inline constexpr std::int32_t kMaxListItems = 100000;

}  // namespace zm
