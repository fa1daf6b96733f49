#include "PlugInHost.h"

#include <dlfcn.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <fstream>
#include <sstream>

#include <nlohmann/json.hpp>

#include "platform/PlugInBundle.h"

#ifndef ORVANE_DEFAULT_PLUGIN_DIRECTORY
#define ORVANE_DEFAULT_PLUGIN_DIRECTORY "."
#endif

namespace orvane::host {

namespace {

using Json = nlohmann::json;

bool isDirectory(const std::string& path) {
    struct stat st;
    return ::stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

bool exists(const std::string& path) {
    struct stat st;
    return ::stat(path.c_str(), &st) == 0;
}

std::string directoryOf(const std::string& path) {
    const size_t slash = path.find_last_of('/');
    if (slash == std::string::npos) return ".";
    if (slash == 0) return "/";
    return path.substr(0, slash);
}

std::string joinPath(const std::string& directory, const std::string& name) {
    if (name.empty() || name.front() == '/') return name;
    if (directory.empty() || directory.back() == '/') return directory + name;
    return directory + "/" + name;
}

// The information dictionary as property-list values: true/false booleans, integers
// Integer, other numbers Real.
bool toPropertyValue(const Json& json, PropertyValue* out, std::string* error) {
    switch (json.type()) {
    case Json::value_t::boolean: *out = PropertyValue(json.get<bool>()); return true;
    case Json::value_t::number_integer: *out = PropertyValue(json.get<int64_t>()); return true;
    case Json::value_t::number_unsigned: {
        const uint64_t u = json.get<uint64_t>();
        if (u > static_cast<uint64_t>(INT64_MAX)) *out = PropertyValue(static_cast<double>(u));
        else *out = PropertyValue(static_cast<int64_t>(u));
        return true;
    }
    case Json::value_t::number_float: *out = PropertyValue(json.get<double>()); return true;
    case Json::value_t::string: *out = PropertyValue(json.get<std::string>()); return true;
    case Json::value_t::array: {
        PropertyArray array;
        for (const Json& element : json) {
            PropertyValue v;
            if (!toPropertyValue(element, &v, error)) return false;
            array.push_back(std::move(v));
        }
        *out = PropertyValue(std::move(array));
        return true;
    }
    case Json::value_t::object: {
        PropertyDictionary dictionary;
        for (const auto& [key, element] : json.items()) {
            PropertyValue v;
            if (!toPropertyValue(element, &v, error)) return false;
            dictionary.emplace(key, std::move(v));
        }
        *out = PropertyValue(std::move(dictionary));
        return true;
    }
    default: *error = "null is not a property-list value"; return false;
    }
}

bool readInfoDictionary(const std::string& infoPath, PropertyDictionary* dictionary, std::string* error) {
    std::ifstream file(infoPath, std::ios::binary);
    if (!file) {
        *error = infoPath + ": the plug-in's information dictionary cannot be read (" + std::strerror(errno) + ")";
        return false;
    }
    std::ostringstream text;
    text << file.rdbuf();
    Json json;
    try {
        json = Json::parse(text.str());
    } catch (const Json::parse_error& e) {
        std::string what = e.what();
        const size_t colon = what.find(": ");
        if (colon != std::string::npos) what = what.substr(colon + 2);
        *error = infoPath + ": invalid JSON in the plug-in's information dictionary: " + what;
        return false;
    }
    if (!json.is_object()) {
        *error = infoPath + ": the plug-in's information dictionary must be a JSON object";
        return false;
    }
    PropertyValue value;
    std::string inner;
    if (!toPropertyValue(json, &value, &inner)) {
        *error = infoPath + ": " + inner;
        return false;
    }
    *dictionary = value.dictionaryValue();
    for (const char* key : {"BundleIdentifier", "ClassName", "Executable", "PlugInFactory"}) {
        const auto it = dictionary->find(key);
        if (it == dictionary->end() || !it->second.isString() || it->second.stringValue().empty()) {
            *error = infoPath + ": the plug-in's information dictionary needs \"" + key + "\", a non-empty string";
            return false;
        }
    }
    const auto acceleration = dictionary->find("Acceleration");
    if (acceleration != dictionary->end() && !acceleration->second.isDictionary()) {
        *error = infoPath + ": \"Acceleration\" in the plug-in's information dictionary must be an object";
        return false;
    }
    return true;
}

std::string exceptionText(std::exception_ptr e) {
    try {
        std::rethrow_exception(e);
    } catch (const std::exception& x) {
        return x.what();
    } catch (...) {
        return "an exception of unknown type";
    }
}

}  // namespace

PlugInHost::PlugInHost() = default;

PlugInHost::~PlugInHost() { unload(); }

std::string PlugInHost::builtInPlugInDirectory() { return ORVANE_DEFAULT_PLUGIN_DIRECTORY; }

std::string PlugInHost::defaultPlugInPath() {
    const char* env = std::getenv(kPlugInPathEnvironment);
    if (env && *env) return env;
    return builtInPlugInDirectory();
}

int PlugInHost::cancelHandlerCalls() const { return cancelCalls_ ? cancelCalls_->load() : 0; }

bool PlugInHost::load(const std::string& path, const PropertyDictionary& bundleOverrides, std::string* error) {
    if (state_ != State::Unloaded) {
        *error = "a plug-in is already loaded (" + info_.modulePath + ")";
        return false;
    }
    if (path.empty() || !exists(path)) {
        *error = (path.empty() ? std::string("(no path)") : path) + ": no plug-in module there";
        return false;
    }
    PlugInInfo info;
    const bool directory = isDirectory(path);
    const std::string folder = directory ? path : directoryOf(path);
    info.infoPath = joinPath(folder, kInfoDictionaryFileName);

    PropertyDictionary dictionary;
    if (!readInfoDictionary(info.infoPath, &dictionary, error)) return false;
    info.bundleIdentifier = dictionary["BundleIdentifier"].stringValue();
    info.className = dictionary["ClassName"].stringValue();
    info.executable = dictionary["Executable"].stringValue();
    info.factoryName = dictionary["PlugInFactory"].stringValue();
    info.modulePath = directory ? joinPath(folder, info.executable) : path;
    if (!exists(info.modulePath)) {
        *error = info.modulePath + ": no plug-in module there (named by \"Executable\" in " + info.infoPath + ")";
        return false;
    }

    for (const auto& [key, value] : bundleOverrides) dictionary[key] = value;
    info.infoDictionary = dictionary;
    PlugInBundle::setInfoDictionary(info.bundleIdentifier, dictionary);

    // The module stays mapped after it is closed: objects it made (property values,
    // events, callbacks) may outlive the filter in the caller's hands, and their code must
    // still be there when they are destroyed. An event system never unmaps a plug-in either.
    dlerror();
    void* module = dlopen(info.modulePath.c_str(), RTLD_NOW | RTLD_LOCAL | RTLD_NODELETE);
    if (!module) {
        const char* why = dlerror();
        *error = info.modulePath + ": the plug-in module cannot be loaded (" + (why ? why : "unknown reason") + ")";
        return false;
    }
    dlerror();
    void* symbol = dlsym(module, info.factoryName.c_str());
    if (!symbol) {
        *error = info.modulePath + ": the plug-in module has no function \"" + info.factoryName +
                 "\" (named by \"PlugInFactory\" in " + info.infoPath + ")";
        dlclose(module);
        return false;
    }
    const auto factory = reinterpret_cast<HIDServiceFilterPlugInFactory>(symbol);
    const HIDServiceFilterPlugIn* plugIn = nullptr;
    try {
        plugIn = factory();
    } catch (...) {
        *error = info.modulePath + ": the plug-in factory \"" + info.factoryName + "\" threw " +
                 exceptionText(std::current_exception());
        dlclose(module);
        return false;
    }
    if (!plugIn || !plugIn->matchService || !plugIn->create) {
        *error = info.modulePath + ": the plug-in factory \"" + info.factoryName +
                 (plugIn ? "\" gave a record without matching or construction" : "\" gave no plug-in");
        dlclose(module);
        return false;
    }
    if (plugIn->className && info.className != plugIn->className) {
        *error = info.modulePath + ": the module's class is \"" + plugIn->className +
                 "\" but its information dictionary names \"" + info.className + "\"";
        dlclose(module);
        return false;
    }

    module_ = module;
    plugIn_ = plugIn;
    info_ = std::move(info);
    state_ = State::Loaded;
    return true;
}

bool PlugInHost::requireState(State wanted, const char* operation, std::string* error) const {
    if (state_ == wanted) return true;
    const char* why = "";
    switch (state_) {
    case State::Unloaded: why = "no plug-in is loaded"; break;
    case State::Loaded: why = "no filter has been created"; break;
    case State::Created: why = "the filter has not been activated"; break;
    case State::Active: why = "the filter is already active"; break;
    }
    *error = std::string(operation) + ": " + why;
    return false;
}

bool PlugInHost::drain(const char* after, std::string* error) {
    if (!queue_) return true;
    try {
        queue_->drain();
        return true;
    } catch (...) {
        *error = std::string("work queued by the filter during ") + after + " threw " +
                 exceptionText(std::current_exception());
        return false;
    }
}

bool PlugInHost::matchService(const HIDEventServiceRef& service, const PropertyDictionary& options, int64_t* score,
                              std::string* error) {
    if (!requireState(State::Loaded, "matchService", error)) return false;
    if (!service) {
        *error = "matchService: no service";
        return false;
    }
    *score = 0;
    bool matched = false;
    try {
        matched = plugIn_->matchService(service, options, score);
    } catch (...) {
        *error = info_.className + " threw while matching " + service->description() + ": " +
                 exceptionText(std::current_exception());
        return false;
    }
    if (!matched) {
        *error = info_.className + " does not match the service " + service->description();
        return false;
    }
    return true;
}

bool PlugInHost::createFilter(const HIDEventServiceRef& service, std::string* error) {
    if (!requireState(State::Loaded, "createFilter", error)) return false;
    if (!service) {
        *error = "createFilter: no service";
        return false;
    }
    try {
        filter_ = plugIn_->create(service);
    } catch (...) {
        *error = info_.className + " threw while being created for " + service->description() + ": " +
                 exceptionText(std::current_exception());
        return false;
    }
    if (!filter_) {
        *error = info_.className + " refused the service " + service->description() + " (no filter was created)";
        return false;
    }
    queue_ = std::make_shared<DispatchQueue>(info_.bundleIdentifier + ".service");
    cancelCalls_ = std::make_shared<std::atomic<int>>(0);
    state_ = State::Created;
    return true;
}

bool PlugInHost::activate(std::shared_ptr<HIDEventDispatcher> dispatcher, std::string* error) {
    if (!requireState(State::Created, "activate", error)) return false;
    if (!dispatcher) {
        *error = "activate: no event dispatcher";
        return false;
    }
    dispatcher_ = std::move(dispatcher);
    std::shared_ptr<std::atomic<int>> calls = cancelCalls_;
    try {
        filter_->setDispatchQueue(queue_);
        filter_->setEventDispatcher(dispatcher_);
        filter_->setCancelHandler([calls] { ++*calls; });
        filter_->activate();
    } catch (...) {
        *error = info_.className + " threw while being configured and activated: " +
                 exceptionText(std::current_exception());
        return false;
    }
    state_ = State::Active;
    return drain("activation", error);
}

bool PlugInHost::open(const std::string& path, const PropertyDictionary& bundleOverrides,
                      const HIDEventServiceRef& service, const PropertyDictionary& options,
                      std::shared_ptr<HIDEventDispatcher> dispatcher, std::string* error) {
    int64_t score = 0;
    return load(path, bundleOverrides, error) && matchService(service, options, &score, error) &&
           createFilter(service, error) && activate(std::move(dispatcher), error);
}

bool PlugInHost::filterEvent(const HIDEventRef& event, HIDEventRef* result, std::string* error) {
    if (!requireState(State::Active, "filterEvent", error)) return false;
    try {
        *result = filter_->filterEvent(event);
    } catch (...) {
        *error = info_.className + " threw while filtering an event: " + exceptionText(std::current_exception());
        return false;
    }
    return drain("filterEvent", error);
}

bool PlugInHost::setProperty(const PropertyValue& value, const std::string& key, const HIDConnectionRef& client,
                             bool* result, std::string* error) {
    if (!requireState(State::Active, "setProperty", error)) return false;
    try {
        *result = filter_->setProperty(value, key, client);
    } catch (...) {
        *error = info_.className + " threw while setting the property \"" + key +
                 "\": " + exceptionText(std::current_exception());
        return false;
    }
    return drain("setProperty", error);
}

bool PlugInHost::propertyForKey(const std::string& key, const HIDConnectionRef& client, PropertyValue* result,
                                std::string* error) {
    if (!requireState(State::Active, "propertyForKey", error)) return false;
    try {
        *result = filter_->propertyForKey(key, client);
    } catch (...) {
        *error = info_.className + " threw while reading the property \"" + key +
                 "\": " + exceptionText(std::current_exception());
        return false;
    }
    return drain("propertyForKey", error);
}

bool PlugInHost::clientNotification(const HIDConnectionRef& client, bool added, std::string* error) {
    if (!requireState(State::Active, "clientNotification", error)) return false;
    try {
        filter_->clientNotification(client, added);
    } catch (...) {
        *error = info_.className + " threw on a client notification: " + exceptionText(std::current_exception());
        return false;
    }
    return drain("clientNotification", error);
}

bool PlugInHost::cancel(std::string* error) {
    if (!requireState(State::Active, "cancel", error)) return false;
    bool ok = true;
    try {
        filter_->cancel();
    } catch (...) {
        *error = info_.className + " threw while being cancelled: " + exceptionText(std::current_exception());
        ok = false;
    }
    if (ok) ok = drain("cancel", error);
    if (ok) {
        const int calls = cancelCalls_->load();
        if (calls != 1) {
            *error = info_.className + (calls == 0 ? std::string(" did not call its cancel handler after cancel")
                                                   : " called its cancel handler " + std::to_string(calls) +
                                                         " times after cancel; once is expected");
            ok = false;
        }
    }
    // The filter is released whatever happened; work it queues while going runs too.
    filter_.reset();
    std::string drainError;
    if (!drain("release", &drainError) && ok) {
        *error = drainError;
        ok = false;
    }
    state_ = State::Loaded;
    return ok;
}

void PlugInHost::unload() {
    if (state_ == State::Active) {
        std::string ignored;
        cancel(&ignored);
    }
    try {
        filter_.reset();
        if (queue_) queue_->drain();
    } catch (...) {
    }
    queue_.reset();
    dispatcher_.reset();
    plugIn_ = nullptr;
    if (module_) dlclose(module_);
    module_ = nullptr;
    state_ = State::Unloaded;
}

}  // namespace orvane::host
