// The built plug-in module, loaded by path as a host would.

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <cstring>

#include "platform/HIDServiceFilter.h"

using namespace orvane;

namespace {
struct Module {
    void* handle = dlopen(ORVANE_PLUGIN_MODULE, RTLD_NOW | RTLD_LOCAL);
    ~Module() {
        if (handle) dlclose(handle);
    }
    void* symbol(const char* name) const { return handle ? dlsym(handle, name) : nullptr; }
};
}  // namespace

TEST(PlugInModule, ExportsTheVersionSymbols) {
    Module m;
    ASSERT_NE(m.handle, nullptr) << dlerror();
    auto number = static_cast<const double*>(m.symbol("OrvaneServiceFilterVersionNumber"));
    auto text = static_cast<const char*>(m.symbol("OrvaneServiceFilterVersionString"));
    ASSERT_NE(number, nullptr);
    ASSERT_NE(text, nullptr);
    EXPECT_EQ(*number, 27.0);
    EXPECT_STREQ(text, "@(#)PROGRAM:OrvaneServiceFilter  PROJECT:Orvane-27\n");  // two spaces, a newline
}

TEST(PlugInModule, ExportsTheLoggingFunctionsAndTheInternalBuildTest) {
    Module m;
    ASSERT_NE(m.handle, nullptr) << dlerror();
    for (const char* name : {"LoggingServiceFilter", "LoggingServiceFilterVerbose", "_isInternalBuild",
                             "getCosineThetas", "OrvaneServiceFilterPlugIn"}) {
        EXPECT_NE(m.symbol(name), nullptr) << name;
    }
    auto internal = reinterpret_cast<bool (*)()>(m.symbol("_isInternalBuild"));
    ASSERT_NE(internal, nullptr);
    EXPECT_FALSE(internal());  // this program runs as a plain build
}

TEST(PlugInModule, TheFactoryMatchesAndBuildsTheFilter) {
    Module m;
    ASSERT_NE(m.handle, nullptr) << dlerror();
    auto factory = reinterpret_cast<HIDServiceFilterPlugInFactory>(m.symbol("OrvaneServiceFilterPlugIn"));
    ASSERT_NE(factory, nullptr);
    const HIDServiceFilterPlugIn* plugIn = factory();
    EXPECT_STREQ(plugIn->className, "OrvaneServiceFilter");
    auto service = std::make_shared<HIDEventService>(
        std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}},
        PropertyDictionary{{"SurfaceDimensions",
                            PropertyDictionary{{"Width", int64_t{655360}}, {"Height", int64_t{327680}}}}});
    int64_t score = 0;
    ASSERT_TRUE(plugIn->matchService(service, {}, &score));
    EXPECT_EQ(score, 500);
    HIDServiceFilterRef filter = plugIn->create(service);
    ASSERT_NE(filter, nullptr);
    EXPECT_EQ(filter->description(), "OrvaneServiceFilter");
    auto keyboard = HIDEvent::create(kHIDEventTypeKeyboard, 1);
    EXPECT_EQ(filter->filterEvent(keyboard), keyboard);
    filter.reset();  // released before the module goes
}

TEST(PlugInModule, ExportsNothingBeyondItsCInterface) {
    Module m;
    ASSERT_NE(m.handle, nullptr) << dlerror();
    // The filter's C++ classes stay inside the module.
    EXPECT_EQ(m.symbol("_ZN6orvane19OrvaneServiceFilter14initWithServiceERKSt10shared_ptrINS_15HIDEventServiceEE"),
              nullptr);
}
