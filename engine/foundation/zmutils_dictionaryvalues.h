#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

/// What a dictionary holds. Every value has one owner: a dictionary, a list, or the caller.
namespace zm {

/// Base of all values. A descendant may come from another room: its dump is its class name.
class TObject {
public:
    TObject() = default;
    TObject(const TObject&) = delete;
    TObject& operator=(const TObject&) = delete;
    virtual ~TObject() = default;
    virtual std::string ClassName() const = 0;
    /// A deep copy.
    virtual std::unique_ptr<TObject> Clone() const = 0;
};

class TZmDictionaryValueWideString : public TObject {
public:
    explicit TZmDictionaryValueWideString(std::u16string text) : value(std::move(text)) {}
    std::string ClassName() const override { return "TZmDictionaryValueWideString"; }
    std::unique_ptr<TObject> Clone() const override {
        return std::make_unique<TZmDictionaryValueWideString>(value);
    }
    std::u16string value;
};

class TZmDictionaryValueInteger : public TObject {
public:
    explicit TZmDictionaryValueInteger(std::int32_t number) : value(number) {}
    std::string ClassName() const override { return "TZmDictionaryValueInteger"; }
    std::unique_ptr<TObject> Clone() const override {
        return std::make_unique<TZmDictionaryValueInteger>(value);
    }
    std::int32_t value;
};

class TZmDictionaryValueDouble : public TObject {
public:
    explicit TZmDictionaryValueDouble(double number) : value(number) {}
    std::string ClassName() const override { return "TZmDictionaryValueDouble"; }
    std::unique_ptr<TObject> Clone() const override {
        return std::make_unique<TZmDictionaryValueDouble>(value);
    }
    double value;
};

class TZmDictionaryValueBoolean : public TObject {
public:
    explicit TZmDictionaryValueBoolean(bool flag) : value(flag) {}
    std::string ClassName() const override { return "TZmDictionaryValueBoolean"; }
    std::unique_ptr<TObject> Clone() const override {
        return std::make_unique<TZmDictionaryValueBoolean>(value);
    }
    bool value;
};

/// An ordered list that owns its values.
class TObjectList : public TObject {
public:
    std::string ClassName() const override { return "TObjectList"; }
    std::unique_ptr<TObject> Clone() const override;
    void Add(std::unique_ptr<TObject> item) { items_.push_back(std::move(item)); }
    std::int32_t GetCount() const { return static_cast<std::int32_t>(items_.size()); }
    /// The value at `index`, borrowed until the list changes; nil when there is none.
    TObject* GetItem(std::int32_t index) const;

private:
    std::vector<std::unique_ptr<TObject>> items_;
};

/// A number with a decimal point whatever the locale: an optional sign, digits with at most one
/// point, an optional exponent, nothing around it. Nothing on any other text and outside the
/// range of doubles.
std::optional<double> NeutralTextToDouble(std::u16string_view text);

/// Shortest text that NeutralTextToDouble reads back to the same number. It always holds a
/// point, by which the dictionary's text forms tell doubles from integers. Infinities and
/// not-a-number have no text form and become "0.0".
std::u16string DoubleToNeutralText(double value);

}  // namespace zm
