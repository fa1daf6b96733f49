#pragma once
// Loads a service-filter plug-in module and drives one filter through its life the way the
// HID event system does: load the module and its information dictionary, match a service,
// construct, then setDispatchQueue, setEventDispatcher, setCancelHandler and activate, in
// that order; events one at a time; cancel, drain the queue, release, close the module.
//
// Every operation reports failure as a message; no exception leaves this class. The queue
// is drained after every call into the filter, as the event system does between events.

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

#include "platform/DispatchQueue.h"
#include "platform/HIDEvent.h"
#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"
#include "platform/HIDServiceFilter.h"
#include "platform/PropertyValue.h"

namespace orvane::host {

// What the loaded module's information dictionary says, and where things were found.
struct PlugInInfo {
    std::string bundleIdentifier;
    std::string className;
    std::string executable;
    std::string factoryName;
    std::string modulePath;  // the file that was opened
    std::string infoPath;    // the information dictionary that was read
    PropertyDictionary infoDictionary;  // as registered, recording overrides merged in
};

class PlugInHost {
public:
    // The information dictionary's file name, beside the module.
    static constexpr const char* kInfoDictionaryFileName = "OrvaneServiceFilter.json";
    // Environment variable that overrides the built-in plug-in location.
    static constexpr const char* kPlugInPathEnvironment = "ORVANE_PLUGIN_PATH";

    PlugInHost();
    ~PlugInHost();
    PlugInHost(const PlugInHost&) = delete;
    PlugInHost& operator=(const PlugInHost&) = delete;

    // ORVANE_PLUGIN_PATH when it is set and not empty, else the folder the build puts the
    // plug-in module and its information dictionary in.
    static std::string defaultPlugInPath();
    // The built-in folder alone.
    static std::string builtInPlugInDirectory();

    // `path` is a module file with its information dictionary beside it, or a folder holding
    // the dictionary and the module it names under "Executable". The dictionary (keys
    // "BundleIdentifier", "ClassName", "Executable", "PlugInFactory", optional
    // "Acceleration") is registered under its bundle identifier with `bundleOverrides`
    // merged in (their keys win); then the module is opened and its factory called.
    bool load(const std::string& path, const PropertyDictionary& bundleOverrides, std::string* error);
    bool isLoaded() const { return plugIn_ != nullptr; }
    const PlugInInfo& info() const { return info_; }

    // The class-level match with the score starting at 0. On no match returns false with a
    // message and leaves `score` as the plug-in left it.
    bool matchService(const HIDEventServiceRef& service, const PropertyDictionary& options, int64_t* score,
                      std::string* error);
    // Constructs the filter; a refusal (no instance) is an error.
    bool createFilter(const HIDEventServiceRef& service, std::string* error);
    // setDispatchQueue, setEventDispatcher, setCancelHandler, activate, in that order. The
    // host keeps the dispatcher alive; the filter may hold it weakly.
    bool activate(std::shared_ptr<HIDEventDispatcher> dispatcher, std::string* error);

    // Load, match, construct and activate in one call.
    bool open(const std::string& path, const PropertyDictionary& bundleOverrides, const HIDEventServiceRef& service,
              const PropertyDictionary& options, std::shared_ptr<HIDEventDispatcher> dispatcher, std::string* error);

    // Calls into the active filter. `result` receives the filter's answer.
    bool filterEvent(const HIDEventRef& event, HIDEventRef* result, std::string* error);
    bool setProperty(const PropertyValue& value, const std::string& key, const HIDConnectionRef& client,
                     bool* result, std::string* error);
    bool propertyForKey(const std::string& key, const HIDConnectionRef& client, PropertyValue* result,
                        std::string* error);
    bool clientNotification(const HIDConnectionRef& client, bool added, std::string* error);

    // Cancels the filter, drains the queue, checks that the cancel handler ran exactly
    // once and releases the filter.
    bool cancel(std::string* error);
    // Releases the filter (cancelling it first if it is active) and closes the module.
    void unload();

    const DispatchQueueRef& queue() const { return queue_; }
    const HIDServiceFilterRef& filter() const { return filter_; }
    int cancelHandlerCalls() const;

private:
    enum class State { Unloaded, Loaded, Created, Active };

    bool requireState(State wanted, const char* operation, std::string* error) const;
    bool drain(const char* after, std::string* error);

    State state_ = State::Unloaded;
    void* module_ = nullptr;
    const HIDServiceFilterPlugIn* plugIn_ = nullptr;
    PlugInInfo info_;
    DispatchQueueRef queue_;
    std::shared_ptr<HIDEventDispatcher> dispatcher_;
    HIDServiceFilterRef filter_;
    std::shared_ptr<std::atomic<int>> cancelCalls_;
};

}  // namespace orvane::host
