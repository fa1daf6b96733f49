#include <gtest/gtest.h>

#include "platform/PropertyValue.h"

using namespace orvane;

TEST(PropertyValue, BooleansAndNumbersAreNumbersStringsAreNot) {
    EXPECT_TRUE(PropertyValue(true).isNumber());
    EXPECT_TRUE(PropertyValue(int64_t{3}).isNumber());
    EXPECT_TRUE(PropertyValue(2.5).isNumber());
    EXPECT_FALSE(PropertyValue("1").isNumber());
    EXPECT_FALSE(PropertyValue(PropertyArray{}).isNumber());
}

TEST(PropertyValue, TruthOfANumberIsNonZero) {
    EXPECT_TRUE(PropertyValue(int64_t{2}).truth());
    EXPECT_FALSE(PropertyValue(int64_t{0}).truth());
    EXPECT_TRUE(PropertyValue(0.5).truth());
    EXPECT_FALSE(PropertyValue("yes").truth());
}

TEST(PropertyValue, OnlyTheBooleanTrueObjectIsBooleanTrue) {
    EXPECT_TRUE(PropertyValue(true).isBooleanTrue());
    EXPECT_FALSE(PropertyValue(int64_t{1}).isBooleanTrue());
    EXPECT_FALSE(PropertyValue(false).isBooleanTrue());
}

TEST(PropertyValue, CopiesDoNotShareMutations) {
    PropertyValue a(PropertyArray{int64_t{1}});
    PropertyValue b = a;
    b.mutableArray().push_back(int64_t{2});
    EXPECT_EQ(a.arrayValue().size(), 1u);
    EXPECT_EQ(b.arrayValue().size(), 2u);
}

TEST(PropertyValue, FindLooksUpDictionaryKeys) {
    PropertyValue d(PropertyDictionary{{"Width", int64_t{655360}}});
    ASSERT_NE(d.find("Width"), nullptr);
    EXPECT_EQ(d.find("Width")->integerValue(), 655360);
    EXPECT_EQ(d.find("Height"), nullptr);
    EXPECT_EQ(PropertyValue(int64_t{1}).find("Width"), nullptr);
}

TEST(PropertyValue, DescriptionsReadLikeAPropertyList) {
    EXPECT_EQ(PropertyValue().description(), "(null)");
    EXPECT_EQ(PropertyValue(int64_t{13}).description(), "13");
    EXPECT_EQ(PropertyValue(PropertyArray{"a", int64_t{1}}).description(), "( a, 1 )");
    EXPECT_EQ(PropertyValue(PropertyDictionary{{"k", true}}).description(), "{ k = 1; }");
    EXPECT_EQ(PropertyValue(PropertyDictionary{}).description(), "{}");
}

TEST(PropertyValue, EveryIntegerTypeMakesAnInteger) {
    EXPECT_EQ(PropertyValue(7u).integerValue(), 7);
    EXPECT_EQ(PropertyValue(7ll).integerValue(), 7);
    EXPECT_EQ(PropertyValue(size_t{7}).kind(), PropertyValue::Kind::Integer);
    EXPECT_EQ(PropertyValue(short{-2}).integerValue(), -2);
    EXPECT_EQ(PropertyValue(true).kind(), PropertyValue::Kind::Boolean);
}
