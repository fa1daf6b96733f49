#include <gtest/gtest.h>

#include "FilterTestSupport.h"
#include "platform/DispatchQueue.h"
#include "platform/PlugInBundle.h"

using namespace orvane;
using namespace orvane::test;

namespace {
const char* kSetSig = "-[OrvaneServiceFilter setProperty:forKey:client:]";

struct Fixture {
    HIDEventServiceRef service = trackpadService();
    std::shared_ptr<OrvaneServiceFilter> filter = OrvaneServiceFilter::initWithService(service);
};

const PropertyValue* settings(const PropertyValue& debug) { return debug.find("settings"); }
}  // namespace

TEST(TapSettings, SettingTheCurrentValueIsNoChange) {
    Fixture f;
    EXPECT_FALSE(f.filter->setProperty(false, "TapToClickEnabled", nullptr));
    EXPECT_FALSE(f.filter->parser()->tapToClickEnabled());
}

TEST(TapSettings, SettingTheOtherValueChangesTheParser) {
    Fixture f;
    EXPECT_TRUE(f.filter->setProperty(true, "TapToClickEnabled", nullptr));
    EXPECT_TRUE(f.filter->parser()->tapToClickEnabled());
    EXPECT_FALSE(f.filter->setProperty(int64_t{5}, "TapToClickEnabled", nullptr));  // still true: no change
    EXPECT_TRUE(f.filter->setProperty(int64_t{0}, "TapToClickEnabled", nullptr));
    EXPECT_FALSE(f.filter->parser()->tapToClickEnabled());
}

TEST(TapSettings, SecondaryClickIsItsOwnSetting) {
    Fixture f;
    EXPECT_TRUE(f.filter->setProperty(1.0, "TwoFingersSecondaryClickEnabled", nullptr));
    EXPECT_TRUE(f.filter->parser()->twoFingersSecondaryClickEnabled());
    EXPECT_FALSE(f.filter->parser()->tapToClickEnabled());
}

TEST(TapSettings, ValuesThatAreNotNumbersChangeNothing) {
    Fixture f;
    for (const PropertyValue& v : {PropertyValue("1"), PropertyValue(PropertyArray{int64_t{1}}),
                                   PropertyValue(PropertyDictionary{{"a", int64_t{1}}}), PropertyValue()}) {
        EXPECT_FALSE(f.filter->setProperty(v, "TapToClickEnabled", nullptr));
        EXPECT_FALSE(f.filter->setProperty(v, "TwoFingersSecondaryClickEnabled", nullptr));
    }
    EXPECT_FALSE(f.filter->parser()->tapToClickEnabled());
    EXPECT_FALSE(f.filter->parser()->twoFingersSecondaryClickEnabled());
}

TEST(TapSettings, AreReadBackAsNumbers) {
    Fixture f;
    f.filter->setProperty(true, "TwoFingersSecondaryClickEnabled", nullptr);
    EXPECT_EQ(f.filter->propertyForKey("TapToClickEnabled", nullptr), PropertyValue(int64_t{0}));
    EXPECT_EQ(f.filter->propertyForKey("TwoFingersSecondaryClickEnabled", nullptr), PropertyValue(int64_t{1}));
    EXPECT_TRUE(f.filter->propertyForKey("SomethingElse", nullptr).isNone());
}

TEST(UnknownKeys, AreNotTaken) {
    Fixture f;
    EXPECT_FALSE(f.filter->setProperty(true, "SomethingElse", nullptr));
}

TEST(HostState, ScreenOnAndCoveredSetSwitchOneAndKeyboardZero) {
    Fixture f;
    LogCapture logs;
    EXPECT_TRUE(f.filter->setProperty(
        PropertyDictionary{{"ScreenOn", int64_t{1}}, {"DigitizerSurfaceCovered", int64_t{1}}}, "HostStateNotification",
        nullptr));
    EXPECT_EQ(f.service->propertyForKey("DigitizerSurfaceSwitch"), PropertyValue(int64_t{1}));
    EXPECT_EQ(f.service->propertyForKey("KeyboardEnabled"), PropertyValue(int64_t{0}));
    EXPECT_TRUE(logs.contains(std::string(kSetSig) + " Setting DigitizerSurfaceSwitch to 1"));
    EXPECT_TRUE(logs.contains(std::string(kSetSig) + " Setting KeyboardEnabled to 0"));
}

TEST(HostState, AnEmptyDictionaryTurnsTheSurfaceOffAndTheKeyboardOn) {
    Fixture f;
    EXPECT_TRUE(f.filter->setProperty(PropertyDictionary{}, "HostStateNotification", nullptr));
    EXPECT_EQ(f.service->propertyForKey("DigitizerSurfaceSwitch"), PropertyValue(int64_t{0}));
    EXPECT_EQ(f.service->propertyForKey("KeyboardEnabled"), PropertyValue(int64_t{1}));
}

TEST(HostState, AStringScreenOnCountsAsFalse) {
    Fixture f;
    EXPECT_TRUE(f.filter->setProperty(PropertyDictionary{{"ScreenOn", "1"}, {"DigitizerSurfaceCovered", "1"}},
                                      "HostStateNotification", nullptr));
    EXPECT_EQ(f.service->propertyForKey("DigitizerSurfaceSwitch"), PropertyValue(int64_t{0}));
    // A covered flag that is not a number counts as absent: the keyboard stays on.
    EXPECT_EQ(f.service->propertyForKey("KeyboardEnabled"), PropertyValue(int64_t{1}));
}

TEST(HostState, BooleansAreNumbers) {
    Fixture f;
    EXPECT_TRUE(f.filter->setProperty(PropertyDictionary{{"ScreenOn", true}, {"DigitizerSurfaceCovered", false}},
                                      "HostStateNotification", nullptr));
    EXPECT_EQ(f.service->propertyForKey("DigitizerSurfaceSwitch"), PropertyValue(int64_t{1}));
    EXPECT_EQ(f.service->propertyForKey("KeyboardEnabled"), PropertyValue(int64_t{1}));
}

TEST(HostState, AValueThatIsNotADictionaryIsRefused) {
    Fixture f;
    EXPECT_FALSE(f.filter->setProperty(int64_t{1}, "HostStateNotification", nullptr));
    EXPECT_TRUE(f.service->propertyForKey("DigitizerSurfaceSwitch").isNone());
}

TEST(HostState, ARefusedKeyboardWriteGivesFalseAndTheErrorText) {
    Fixture f;
    f.service->refuseProperty("KeyboardEnabled");
    LogCapture logs;
    EXPECT_FALSE(f.filter->setProperty(PropertyDictionary{{"ScreenOn", int64_t{1}}}, "HostStateNotification", nullptr));
    bool found = false;
    for (const auto& e : logs.entries()) {
        if (e.message == std::string(kSetSig) + " Error setting KeyboardEnabled to 1") {
            found = true;
            EXPECT_EQ(e.level, LogLevel::Error);
        }
    }
    EXPECT_TRUE(found);
}

TEST(HostState, ARefusedSurfaceSwitchIsLoggedButStillTrue) {
    Fixture f;
    f.service->refuseProperty("DigitizerSurfaceSwitch");
    LogCapture logs;
    EXPECT_TRUE(f.filter->setProperty(PropertyDictionary{{"ScreenOn", int64_t{1}}}, "HostStateNotification", nullptr));
    EXPECT_TRUE(logs.contains(std::string(kSetSig) + " Error setting DigitizerSurfaceSwitch to 1"));
    EXPECT_EQ(f.service->propertyForKey("KeyboardEnabled"), PropertyValue(int64_t{1}));
}

TEST(SetProperty, LogsTheOutcomeAtDebugLevel) {
    Fixture f;
    LogCapture logs;
    Logging::setDebugEnabled("ServiceFilter", true);
    f.filter->setProperty(true, "TapToClickEnabled", std::make_shared<HIDConnection>(2));
    Logging::setDebugEnabled(false);
    bool found = false;
    for (const auto& e : logs.entries()) {
        if (e.message == std::string(kSetSig) + " 1, key TapToClickEnabled, client <HIDConnection 2>, result 1") {
            found = true;
            EXPECT_EQ(e.level, LogLevel::Debug);
        }
    }
    EXPECT_TRUE(found);
}

TEST(DebugSnapshot, BeforeAQueueOrCancelHandlerBothAreFalse) {
    Fixture f;
    PropertyValue debug = f.filter->propertyForKey("ServiceFilterDebug", nullptr);
    ASSERT_TRUE(debug.isDictionary());
    EXPECT_EQ(*debug.find("FilterName"), PropertyValue("OrvaneServiceFilter"));
    EXPECT_EQ(*debug.find("cancelHandler"), PropertyValue(false));
    EXPECT_EQ(*debug.find("dispatchQueue"), PropertyValue(false));
    EXPECT_EQ(*debug.find("activated"), PropertyValue(int64_t{0}));
    EXPECT_EQ(*debug.find("clientAdded"), PropertyValue(int64_t{0}));
    EXPECT_EQ(debug.dictionaryValue().size(), 6u);
    ASSERT_NE(settings(debug), nullptr);
    EXPECT_EQ(settings(debug)->dictionaryValue().size(), 2u);
    EXPECT_EQ(*settings(debug)->find("TapToClickEnabled"), PropertyValue(int64_t{0}));
}

TEST(DebugSnapshot, ReflectsTheLifecycleAndSettings) {
    Fixture f;
    f.filter->setDispatchQueue(std::make_shared<DispatchQueue>("q"));
    f.filter->setCancelHandler([] {});
    f.filter->activate();
    f.filter->clientNotification(std::make_shared<HIDConnection>(1), true);
    f.filter->setProperty(true, "TapToClickEnabled", nullptr);
    PropertyValue debug = f.filter->propertyForKey("ServiceFilterDebug", nullptr);
    EXPECT_EQ(*debug.find("cancelHandler"), PropertyValue(true));
    EXPECT_EQ(*debug.find("dispatchQueue"), PropertyValue(true));
    EXPECT_EQ(*debug.find("activated"), PropertyValue(int64_t{1}));
    EXPECT_EQ(*debug.find("clientAdded"), PropertyValue(int64_t{1}));
    EXPECT_EQ(*settings(debug)->find("TapToClickEnabled"), PropertyValue(int64_t{1}));
    EXPECT_EQ(*settings(debug)->find("TwoFingersSecondaryClickEnabled"), PropertyValue(int64_t{0}));
}

TEST(AccelerationSettings, AnswerFirstEvenForTheTapKeys) {
    PlugInBundle::setInfoDictionary(kOrvaneBundleIdentifier,
                                    {{"Acceleration", PropertyDictionary{{"TapToClickEnabled", "from bundle"},
                                                                         {"HIDPointerAcceleration", 45056.0}}}});
    Fixture f;
    PlugInBundle::setInfoDictionary(kOrvaneBundleIdentifier, {});
    EXPECT_EQ(f.filter->propertyForKey("TapToClickEnabled", nullptr), PropertyValue("from bundle"));
    EXPECT_EQ(f.filter->propertyForKey("HIDPointerAcceleration", nullptr), PropertyValue(45056.0));
    EXPECT_EQ(f.filter->propertyForKey("TwoFingersSecondaryClickEnabled", nullptr), PropertyValue(int64_t{0}));
}

TEST(PropertyForKey, LogsKeyClientAndResultAtDebugLevel) {
    Fixture f;
    LogCapture logs;
    Logging::setDebugEnabled("ServiceFilter", true);
    f.filter->propertyForKey("TapToClickEnabled", nullptr);
    Logging::setDebugEnabled(false);
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter propertyForKey:client:] TapToClickEnabled, client (null), result 0"));
}

TEST(ConfigureService, AppendsTheUsagePairsAndDescribesATrackpad) {
    Fixture f;
    const auto pairs = f.service->usagePairs();
    ASSERT_EQ(pairs.size(), 5u);
    EXPECT_EQ(pairs[3], (HIDUsagePair{13, 12}));
    EXPECT_EQ(pairs[4], (HIDUsagePair{1, 2}));
    EXPECT_EQ(f.service->propertyForKey("PrimaryUsagePage"), PropertyValue(int64_t{13}));
    EXPECT_EQ(f.service->propertyForKey("PrimaryUsage"), PropertyValue(int64_t{12}));
    EXPECT_EQ(f.service->propertyForKey("DeviceTypeHint"), PropertyValue("Trackpad"));
    EXPECT_EQ(f.service->propertyForKey("SupportedGestures"),
              PropertyValue(PropertyArray{"Scroll", "Scale", "Rotate", "Translate", "TapToClick",
                                          "TwoFingersSecondaryClick"}));
    EXPECT_EQ(f.service->propertyForKey("NeedsHostState"), PropertyValue(true));
}

TEST(ConfigureService, LeavesAMultiTouchDigitizerServiceAlone) {
    auto service = std::make_shared<HIDEventService>(
        std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}, {13, 12}},
        PropertyDictionary{{"SurfaceDimensions",
                            PropertyDictionary{{"Width", int64_t{655360}}, {"Height", int64_t{327680}}}}});
    auto filter = OrvaneServiceFilter::initWithService(service);
    ASSERT_NE(filter, nullptr);
    EXPECT_EQ(service->usagePairs().size(), 4u);
    EXPECT_TRUE(service->propertyForKey("PrimaryUsagePage").isNone());
    EXPECT_TRUE(service->propertyForKey("PrimaryUsage").isNone());
    EXPECT_EQ(service->propertyForKey("DeviceTypeHint"), PropertyValue("Trackpad"));
    EXPECT_EQ(service->propertyForKey("NeedsHostState"), PropertyValue(true));
}

TEST(ConfigureService, RunsBeforeTheDimensionsAreRead) {
    // Even a refused construction has configured the service.
    auto service = std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}}, PropertyDictionary{});
    EXPECT_EQ(OrvaneServiceFilter::initWithService(service), nullptr);
    EXPECT_EQ(service->propertyForKey("DeviceTypeHint"), PropertyValue("Trackpad"));
}
