#include "tools/host/PlugInHost.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>

#include "ToolTestSupport.h"
#include "platform/PlugInBundle.h"
#include "tools/formats/EventJson.h"

namespace orvane::host {
namespace {

using tooltest::CapturedLog;
using tooltest::ScratchFolder;

const char* const kFakeBundle = "org.orvane.tests.FakeServiceFilter";

HIDEventServiceRef trackpad(PropertyDictionary extra = {}) {
    PropertyDictionary properties{
        {"SurfaceDimensions", PropertyValue(PropertyDictionary{{"Width", PropertyValue(int64_t{655360})},
                                                               {"Height", PropertyValue(int64_t{327680})}})},
        {"Transport", PropertyValue("USB")}};
    for (auto& [k, v] : extra) properties[k] = v;
    return std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}}, properties);
}

HIDEventRef contactFrame(uint64_t timestamp) {
    auto frame = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    auto finger = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    finger->setDoubleValue(0.5, kHIDEventFieldDigitizerX);
    finger->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    frame->appendEvent(finger);
    return frame;
}

std::shared_ptr<HIDEventDispatcher> collecting(std::vector<std::string>* sent) {
    return std::make_shared<CallbackEventDispatcher>(
        [sent](const HIDEventRef& event) { sent->push_back(formats::eventToJson(*event)); });
}

// A folder with the fake module (a link to it) and an information dictionary of the test's own.
std::string folderWithInfo(const ScratchFolder& scratch, const std::string& info) {
    scratch.write("OrvaneServiceFilter.json", info);
    const std::string module = scratch.file("FakeServiceFilter.so");
    EXPECT_EQ(::symlink(tooltest::kFakePlugInModule, module.c_str()), 0);
    return module;
}

TEST(PlugInHost, LoadsAModuleFromItsFolderAndRegistersItsInfoDictionary) {
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.load(tooltest::kFakePlugInDirectory, {}, &error)) << error;
    EXPECT_TRUE(host.isLoaded());
    EXPECT_EQ(host.info().bundleIdentifier, kFakeBundle);
    EXPECT_EQ(host.info().className, "FakeServiceFilter");
    EXPECT_EQ(host.info().factoryName, "FakeServiceFilterPlugIn");
    EXPECT_EQ(host.info().modulePath, std::string(tooltest::kFakePlugInDirectory) + "/FakeServiceFilter.so");
    EXPECT_EQ(PlugInBundle::objectForInfoDictionaryKey(kFakeBundle, "Version").stringValue(), "1.0");
    EXPECT_TRUE(PlugInBundle::objectForInfoDictionaryKey(kFakeBundle, "Acceleration").isNone());
}

TEST(PlugInHost, LoadsAModuleByFilePathWithItsDictionaryBesideIt) {
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.load(tooltest::kFakePlugInModule, {}, &error)) << error;
    EXPECT_EQ(host.info().infoPath, std::string(tooltest::kFakePlugInDirectory) + "/OrvaneServiceFilter.json");
}

TEST(PlugInHost, RecordingBundleEntriesOverrideTheInfoDictionary) {
    PlugInHost host;
    std::string error;
    const PropertyDictionary overrides{
        {"Acceleration", PropertyValue(PropertyDictionary{{"Speed", PropertyValue(2.5)}})},
        {"Version", PropertyValue("9.9")}};
    ASSERT_TRUE(host.load(tooltest::kFakePlugInDirectory, overrides, &error)) << error;
    EXPECT_EQ(PlugInBundle::objectForInfoDictionaryKey(kFakeBundle, "Version").stringValue(), "9.9");
    EXPECT_EQ(PlugInBundle::objectForInfoDictionaryKey(kFakeBundle, "Acceleration").find("Speed")->doubleValue(), 2.5);
    EXPECT_EQ(PlugInBundle::objectForInfoDictionaryKey(kFakeBundle, "ClassName").stringValue(), "FakeServiceFilter");
}

TEST(PlugInHost, DrivesTheFilterThroughItsLifeInTheHostsOrder) {
    CapturedLog log;
    std::vector<std::string> sent;
    {
        PlugInHost host;
        std::string error;
        auto service = trackpad();
        ASSERT_TRUE(host.open(tooltest::kFakePlugInDirectory, {}, service, {}, collecting(&sent), &error)) << error;
        HIDEventRef result;
        ASSERT_TRUE(host.filterEvent(contactFrame(8000000), &result, &error)) << error;
        ASSERT_TRUE(result);
        EXPECT_EQ(result->type(), kHIDEventTypePointer);
        ASSERT_TRUE(host.cancel(&error)) << error;
        EXPECT_EQ(host.cancelHandlerCalls(), 1);
        EXPECT_FALSE(host.filter());
        host.unload();
        EXPECT_FALSE(host.isLoaded());
    }
    EXPECT_EQ(log.messages("FakeServiceFilter"),
              (std::vector<std::string>{"matchService score 0", "create", "setDispatchQueue", "setEventDispatcher",
                                        "setCancelHandler", "activate Acceleration (null)", "filterEvent 11",
                                        "cancel", "cancel handler", "dealloc"}));
}

TEST(PlugInHost, DispatchedEventsReachTheDispatcherAsSent) {
    CapturedLog log;
    std::vector<std::string> sent;
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.open(tooltest::kFakePlugInDirectory, {}, trackpad(), {}, collecting(&sent), &error)) << error;
    HIDEventRef result;
    ASSERT_TRUE(host.filterEvent(contactFrame(5), &result, &error)) << error;
    // The fake changes the button mask to 7 after sending it.
    EXPECT_EQ(sent, (std::vector<std::string>{"{\"type\": 2, \"timestamp\": 5, \"fields\": {\"0x20000\": 1}}"}));
    ASSERT_TRUE(host.cancel(&error)) << error;
}

TEST(PlugInHost, EventsWithoutAResultComeBackAsNone) {
    CapturedLog log;
    std::vector<std::string> sent;
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.open(tooltest::kFakePlugInDirectory, {}, trackpad(), {}, collecting(&sent), &error)) << error;
    HIDEventRef result = HIDEvent::create(1, 1);
    ASSERT_TRUE(host.filterEvent(HIDEvent::create(kHIDEventTypeVendorDefined, 1), &result, &error)) << error;
    EXPECT_FALSE(result);
    ASSERT_TRUE(host.cancel(&error)) << error;
}

TEST(PlugInHost, PropertiesAndClientNotificationsAreForwarded) {
    CapturedLog log;
    std::vector<std::string> sent;
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.open(tooltest::kFakePlugInDirectory, {}, trackpad(), {}, collecting(&sent), &error)) << error;
    auto client = std::make_shared<HIDConnection>(3);
    ASSERT_TRUE(host.clientNotification(client, true, &error)) << error;
    bool accepted = false;
    ASSERT_TRUE(host.setProperty(PropertyValue(true), "TapToClickEnabled", client, &accepted, &error)) << error;
    EXPECT_TRUE(accepted);
    ASSERT_TRUE(host.setProperty(PropertyValue(1), "Refused", nullptr, &accepted, &error)) << error;
    EXPECT_FALSE(accepted);
    PropertyValue value;
    ASSERT_TRUE(host.propertyForKey("ClassName", client, &value, &error)) << error;
    EXPECT_EQ(value.stringValue(), "FakeServiceFilter");
    ASSERT_TRUE(host.cancel(&error)) << error;
    const auto messages = log.messages("FakeServiceFilter");
    EXPECT_NE(std::find(messages.begin(), messages.end(), "clientNotification <HIDConnection 3> added 1"),
              messages.end());
    EXPECT_NE(std::find(messages.begin(), messages.end(), "setProperty TapToClickEnabled = 1 client <HIDConnection 3>"),
              messages.end());
}

TEST(PlugInHost, ServiceThatDoesNotMatchGivesAClearError) {
    CapturedLog log;
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.load(tooltest::kFakePlugInDirectory, {}, &error)) << error;
    auto keyboard = std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{1, 6}}, PropertyDictionary{});
    int64_t score = -1;
    EXPECT_FALSE(host.matchService(keyboard, {}, &score, &error));
    EXPECT_EQ(score, 0);
    EXPECT_EQ(error, "FakeServiceFilter does not match the service <HIDEventService 1 usages 1/6>");
}

TEST(PlugInHost, MatchedServiceGetsThePlugInsScore) {
    CapturedLog log;
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.load(tooltest::kFakePlugInDirectory, {}, &error)) << error;
    int64_t score = 0;
    EXPECT_TRUE(host.matchService(trackpad(), {}, &score, &error)) << error;
    EXPECT_EQ(score, 500);
}

TEST(PlugInHost, RefusedConstructionGivesAClearError) {
    CapturedLog log;
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.load(tooltest::kFakePlugInDirectory, {}, &error)) << error;
    auto bare = std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}}, PropertyDictionary{});
    EXPECT_FALSE(host.createFilter(bare, &error));
    EXPECT_EQ(error, "FakeServiceFilter refused the service <HIDEventService 1 usages 13/5> (no filter was created)");
    EXPECT_FALSE(host.filter());
}

TEST(PlugInHost, CancelHandlerThatNeverRunsIsAnError) {
    CapturedLog log;
    std::vector<std::string> sent;
    PlugInHost host;
    std::string error;
    auto service = trackpad({{"FakeCancelHandlerCalls", PropertyValue(0)}});
    ASSERT_TRUE(host.open(tooltest::kFakePlugInDirectory, {}, service, {}, collecting(&sent), &error)) << error;
    EXPECT_FALSE(host.cancel(&error));
    EXPECT_EQ(error, "FakeServiceFilter did not call its cancel handler after cancel");
    EXPECT_FALSE(host.filter());
}

TEST(PlugInHost, CancelHandlerThatRunsTwiceIsAnError) {
    CapturedLog log;
    std::vector<std::string> sent;
    PlugInHost host;
    std::string error;
    auto service = trackpad({{"FakeCancelHandlerCalls", PropertyValue(2)}});
    ASSERT_TRUE(host.open(tooltest::kFakePlugInDirectory, {}, service, {}, collecting(&sent), &error)) << error;
    EXPECT_FALSE(host.cancel(&error));
    EXPECT_EQ(error, "FakeServiceFilter called its cancel handler 2 times after cancel; once is expected");
}

TEST(PlugInHost, UnloadingAnActiveFilterCancelsItFirst) {
    CapturedLog log;
    std::vector<std::string> sent;
    PlugInHost host;
    std::string error;
    ASSERT_TRUE(host.open(tooltest::kFakePlugInDirectory, {}, trackpad(), {}, collecting(&sent), &error)) << error;
    host.unload();
    const auto messages = log.messages("FakeServiceFilter");
    ASSERT_GE(messages.size(), 3u);
    EXPECT_EQ(messages[messages.size() - 3], "cancel");
    EXPECT_EQ(messages.back(), "dealloc");
}

TEST(PlugInHost, CallsOutOfOrderAreRefused) {
    PlugInHost host;
    std::string error;
    HIDEventRef result;
    EXPECT_FALSE(host.filterEvent(contactFrame(1), &result, &error));
    EXPECT_EQ(error, "filterEvent: no plug-in is loaded");
    CapturedLog log;
    ASSERT_TRUE(host.load(tooltest::kFakePlugInDirectory, {}, &error)) << error;
    EXPECT_FALSE(host.cancel(&error));
    EXPECT_EQ(error, "cancel: no filter has been created");
    EXPECT_FALSE(host.load(tooltest::kFakePlugInDirectory, {}, &error));
}

TEST(PlugInHost, MissingModuleIsAnError) {
    PlugInHost host;
    std::string error;
    EXPECT_FALSE(host.load("/nonexistent/OrvaneServiceFilter.so", {}, &error));
    EXPECT_EQ(error, "/nonexistent/OrvaneServiceFilter.so: no plug-in module there");
}

TEST(PlugInHost, MissingFactoryIsAnError) {
    ScratchFolder scratch;
    const std::string module = folderWithInfo(
        scratch,
        "{\"BundleIdentifier\": \"t\", \"ClassName\": \"FakeServiceFilter\", \"Executable\": \"FakeServiceFilter.so\","
        " \"PlugInFactory\": \"NoSuchFactory\"}");
    PlugInHost host;
    std::string error;
    EXPECT_FALSE(host.load(module, {}, &error));
    EXPECT_EQ(error, module + ": the plug-in module has no function \"NoSuchFactory\" (named by \"PlugInFactory\" in " +
                         scratch.file("OrvaneServiceFilter.json") + ")");
    EXPECT_FALSE(host.isLoaded());
}

TEST(PlugInHost, BadInfoDictionaryJsonIsAnError) {
    ScratchFolder scratch;
    const std::string module = folderWithInfo(scratch, "{\"BundleIdentifier\": ");
    PlugInHost host;
    std::string error;
    EXPECT_FALSE(host.load(module, {}, &error));
    EXPECT_EQ(error.rfind(scratch.file("OrvaneServiceFilter.json") +
                              ": invalid JSON in the plug-in's information dictionary: ",
                          0),
              0u)
        << error;
}

TEST(PlugInHost, InfoDictionaryWithoutAFactoryNameIsAnError) {
    ScratchFolder scratch;
    const std::string module = folderWithInfo(
        scratch, "{\"BundleIdentifier\": \"t\", \"ClassName\": \"FakeServiceFilter\", \"Executable\": \"x.so\"}");
    PlugInHost host;
    std::string error;
    EXPECT_FALSE(host.load(module, {}, &error));
    EXPECT_EQ(error, scratch.file("OrvaneServiceFilter.json") +
                         ": the plug-in's information dictionary needs \"PlugInFactory\", a non-empty string");
}

TEST(PlugInHost, ClassNameThatDisagreesWithTheModuleIsAnError) {
    ScratchFolder scratch;
    const std::string module = folderWithInfo(
        scratch,
        "{\"BundleIdentifier\": \"t\", \"ClassName\": \"OrvaneServiceFilter\", \"Executable\": "
        "\"FakeServiceFilter.so\", \"PlugInFactory\": \"FakeServiceFilterPlugIn\"}");
    PlugInHost host;
    std::string error;
    EXPECT_FALSE(host.load(module, {}, &error));
    EXPECT_EQ(error, module + ": the module's class is \"FakeServiceFilter\" but its information dictionary names "
                              "\"OrvaneServiceFilter\"");
}

TEST(PlugInHost, FileThatIsNotAModuleIsAnError) {
    ScratchFolder scratch;
    scratch.write("OrvaneServiceFilter.json",
                  "{\"BundleIdentifier\": \"t\", \"ClassName\": \"C\", \"Executable\": \"Broken.so\", "
                  "\"PlugInFactory\": \"F\"}");
    const std::string module = scratch.write("Broken.so", "not a shared object");
    PlugInHost host;
    std::string error;
    EXPECT_FALSE(host.load(scratch.path(), {}, &error));
    EXPECT_EQ(error.rfind(module + ": the plug-in module cannot be loaded (", 0), 0u) << error;
}

TEST(PlugInHost, DefaultPathComesFromTheEnvironmentOrTheBuild) {
    ::setenv(PlugInHost::kPlugInPathEnvironment, "/somewhere/else", 1);
    EXPECT_EQ(PlugInHost::defaultPlugInPath(), "/somewhere/else");
    ::unsetenv(PlugInHost::kPlugInPathEnvironment);
    EXPECT_EQ(PlugInHost::defaultPlugInPath(), PlugInHost::builtInPlugInDirectory());
    EXPECT_EQ(PlugInHost::builtInPlugInDirectory(), tooltest::kRealPlugInDirectory);
}

}  // namespace
}  // namespace orvane::host
