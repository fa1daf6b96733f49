#pragma once
// A property-list value: number, boolean, string, data, array or dictionary.
// Services, clients and plug-in bundles exchange these.

#include <concepts>
#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace orvane {

class PropertyValue;
using PropertyArray = std::vector<PropertyValue>;
using PropertyDictionary = std::map<std::string, PropertyValue>;

class PropertyValue {
public:
    enum class Kind { None, Integer, Real, Boolean, String, Data, Array, Dictionary };

    PropertyValue() = default;
    // Any integer type but bool is an integer; unsigned values above INT64_MAX wrap.
    template <std::integral T>
        requires(!std::same_as<T, bool>)
    PropertyValue(T v) : kind_(Kind::Integer), integer_(static_cast<int64_t>(v)) {}
    PropertyValue(double v) : kind_(Kind::Real), real_(v) {}
    PropertyValue(bool v) : kind_(Kind::Boolean), integer_(v ? 1 : 0) {}
    PropertyValue(const char* v) : kind_(Kind::String), string_(std::make_shared<std::string>(v)) {}
    PropertyValue(std::string v) : kind_(Kind::String), string_(std::make_shared<std::string>(std::move(v))) {}
    PropertyValue(std::vector<uint8_t> v);
    PropertyValue(PropertyArray v);
    PropertyValue(PropertyDictionary v);

    static PropertyValue data(std::vector<uint8_t> bytes) { return PropertyValue(std::move(bytes)); }

    Kind kind() const { return kind_; }
    bool isNone() const { return kind_ == Kind::None; }
    // Booleans are numbers too: a number is anything with a numeric value.
    bool isNumber() const { return kind_ == Kind::Integer || kind_ == Kind::Real || kind_ == Kind::Boolean; }
    bool isBoolean() const { return kind_ == Kind::Boolean; }
    bool isString() const { return kind_ == Kind::String; }
    bool isData() const { return kind_ == Kind::Data; }
    bool isArray() const { return kind_ == Kind::Array; }
    bool isDictionary() const { return kind_ == Kind::Dictionary; }
    // The boolean true object (not merely a number that is non-zero).
    bool isBooleanTrue() const { return kind_ == Kind::Boolean && integer_ != 0; }

    // Numeric views; 0 for a value that is not a number.
    int64_t integerValue() const;
    int32_t int32Value() const { return static_cast<int32_t>(integerValue()); }
    double doubleValue() const;
    // Truth of a number: non-zero. Not a number: false.
    bool truth() const;

    const std::string& stringValue() const;
    const std::vector<uint8_t>& dataValue() const;
    const PropertyArray& arrayValue() const;
    PropertyArray& mutableArray();
    const PropertyDictionary& dictionaryValue() const;
    PropertyDictionary& mutableDictionary();

    // Dictionary lookup; nullptr when this is not a dictionary or the key is absent.
    const PropertyValue* find(const std::string& key) const;

    bool operator==(const PropertyValue& other) const;
    bool operator!=(const PropertyValue& other) const { return !(*this == other); }

    // A short text for logs ("%@"): numbers as numbers, strings as they are,
    // arrays as ( a, b ), dictionaries as { key = value; }.
    std::string description() const;

private:
    Kind kind_ = Kind::None;
    int64_t integer_ = 0;
    double real_ = 0.0;
    std::shared_ptr<std::string> string_;
    std::shared_ptr<std::vector<uint8_t>> data_;
    std::shared_ptr<PropertyArray> array_;
    std::shared_ptr<PropertyDictionary> dictionary_;
};

}  // namespace orvane
