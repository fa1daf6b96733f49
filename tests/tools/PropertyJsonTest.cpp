#include "tools/formats/PropertyJson.h"

#include <gtest/gtest.h>

namespace orvane::formats {
namespace {

TEST(PropertyJson, ValuesAreWrittenAsJson) {
    PropertyDictionary d{{"b", PropertyValue(true)},
                         {"i", PropertyValue(int64_t{-3})},
                         {"r", PropertyValue(1.0)},
                         {"s", PropertyValue("USB")},
                         {"a", PropertyValue(PropertyArray{PropertyValue(1), PropertyValue(0.5)})},
                         {"x", PropertyValue::data({0xde, 0xad})}};
    EXPECT_EQ(propertyValueToJson(PropertyValue(d)),
              "{\"a\": [1, 0.5], \"b\": true, \"i\": -3, \"r\": 1.0, \"s\": \"USB\", \"x\": \"dead\"}");
    EXPECT_EQ(propertyValueToJson(PropertyValue()), "null");
}

TEST(PropertyJson, ValuesReadBackWithTheirKinds) {
    const PropertyDictionary d{{"b", PropertyValue(false)},
                               {"i", PropertyValue(int64_t{7})},
                               {"r", PropertyValue(2.0)},
                               {"n", PropertyValue(PropertyDictionary{{"k", PropertyValue("v")}})}};
    PropertyValue back;
    std::string error;
    ASSERT_TRUE(propertyValueFromJson(propertyValueToJson(PropertyValue(d)), &back, &error)) << error;
    EXPECT_EQ(back, PropertyValue(d));
}

TEST(PropertyJson, NullIsNotAPropertyValue) {
    PropertyValue back;
    std::string error;
    EXPECT_FALSE(propertyValueFromJson("{\"k\": [1, null]}", &back, &error));
    EXPECT_EQ(error, "\"k\": [1]: null is not a property value");
}

}  // namespace
}  // namespace orvane::formats
