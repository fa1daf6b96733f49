#include "PropertyValue.h"

#include <cstdio>

namespace orvane {

PropertyValue::PropertyValue(std::vector<uint8_t> v)
    : kind_(Kind::Data), data_(std::make_shared<std::vector<uint8_t>>(std::move(v))) {}
PropertyValue::PropertyValue(PropertyArray v)
    : kind_(Kind::Array), array_(std::make_shared<PropertyArray>(std::move(v))) {}
PropertyValue::PropertyValue(PropertyDictionary v)
    : kind_(Kind::Dictionary), dictionary_(std::make_shared<PropertyDictionary>(std::move(v))) {}

int64_t PropertyValue::integerValue() const {
    switch (kind_) {
    case Kind::Integer:
    case Kind::Boolean: return integer_;
    case Kind::Real: return static_cast<int64_t>(real_);
    default: return 0;
    }
}

double PropertyValue::doubleValue() const {
    switch (kind_) {
    case Kind::Integer:
    case Kind::Boolean: return static_cast<double>(integer_);
    case Kind::Real: return real_;
    default: return 0.0;
    }
}

bool PropertyValue::truth() const {
    switch (kind_) {
    case Kind::Integer:
    case Kind::Boolean: return integer_ != 0;
    case Kind::Real: return real_ != 0.0;
    default: return false;
    }
}

namespace {
const std::string kEmptyString;
const std::vector<uint8_t> kEmptyData;
const PropertyArray kEmptyArray;
const PropertyDictionary kEmptyDictionary;
}  // namespace

const std::string& PropertyValue::stringValue() const { return string_ ? *string_ : kEmptyString; }
const std::vector<uint8_t>& PropertyValue::dataValue() const { return data_ ? *data_ : kEmptyData; }
const PropertyArray& PropertyValue::arrayValue() const { return array_ ? *array_ : kEmptyArray; }
const PropertyDictionary& PropertyValue::dictionaryValue() const {
    return dictionary_ ? *dictionary_ : kEmptyDictionary;
}

// Values share their storage; a mutable view first makes the storage this value's own.
PropertyArray& PropertyValue::mutableArray() {
    if (kind_ != Kind::Array || !array_) {
        *this = PropertyValue(PropertyArray{});
    } else if (array_.use_count() > 1) {
        array_ = std::make_shared<PropertyArray>(*array_);
    }
    return *array_;
}

PropertyDictionary& PropertyValue::mutableDictionary() {
    if (kind_ != Kind::Dictionary || !dictionary_) {
        *this = PropertyValue(PropertyDictionary{});
    } else if (dictionary_.use_count() > 1) {
        dictionary_ = std::make_shared<PropertyDictionary>(*dictionary_);
    }
    return *dictionary_;
}

const PropertyValue* PropertyValue::find(const std::string& key) const {
    if (kind_ != Kind::Dictionary || !dictionary_) return nullptr;
    auto it = dictionary_->find(key);
    return it == dictionary_->end() ? nullptr : &it->second;
}

bool PropertyValue::operator==(const PropertyValue& o) const {
    if (kind_ != o.kind_) return false;
    switch (kind_) {
    case Kind::None: return true;
    case Kind::Integer:
    case Kind::Boolean: return integer_ == o.integer_;
    case Kind::Real: return real_ == o.real_;
    case Kind::String: return stringValue() == o.stringValue();
    case Kind::Data: return dataValue() == o.dataValue();
    case Kind::Array: return arrayValue() == o.arrayValue();
    case Kind::Dictionary: return dictionaryValue() == o.dictionaryValue();
    }
    return false;
}

std::string PropertyValue::description() const {
    char buf[64];
    switch (kind_) {
    case Kind::None: return "(null)";
    case Kind::Integer:
        std::snprintf(buf, sizeof buf, "%lld", static_cast<long long>(integer_));
        return buf;
    case Kind::Boolean: return integer_ ? "1" : "0";
    case Kind::Real:
        std::snprintf(buf, sizeof buf, "%.17g", real_);
        return buf;
    case Kind::String: return stringValue();
    case Kind::Data: {
        std::string s = "<";
        for (uint8_t b : dataValue()) {
            std::snprintf(buf, sizeof buf, "%02x", b);
            s += buf;
        }
        return s + ">";
    }
    case Kind::Array: {
        std::string s = "(";
        bool first = true;
        for (const auto& v : arrayValue()) {
            s += first ? " " : ", ";
            s += v.description();
            first = false;
        }
        return s + (first ? ")" : " )");
    }
    case Kind::Dictionary: {
        std::string s = "{";
        for (const auto& [k, v] : dictionaryValue()) s += " " + k + " = " + v.description() + ";";
        return s + (dictionaryValue().empty() ? "}" : " }");
    }
    }
    return {};
}

}  // namespace orvane
