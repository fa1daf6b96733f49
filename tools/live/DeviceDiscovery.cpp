#include "DeviceDiscovery.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "DeviceAccess.h"
#include "tools/evemu/EvdevCodes.h"

namespace orvane::live {

namespace {

constexpr unsigned kInputPropPointer = 0;
constexpr unsigned kSwLid = 0;
constexpr unsigned kBitsPerWord = sizeof(unsigned long) * CHAR_BIT;

std::string firstLine(const std::filesystem::path& file) {
    std::ifstream in(file);
    std::string line;
    std::getline(in, line);
    while (!line.empty() && (line.back() == '\r' || line.back() == ' ')) line.pop_back();
    return line;
}

// A sysfs bitmap: words of the kernel's long in hex, the most significant first.
std::vector<bool> bitmap(const std::filesystem::path& file) {
    std::istringstream words(firstLine(file));
    std::vector<std::string> parts;
    for (std::string w; words >> w;) parts.push_back(w);
    std::vector<bool> bits(parts.size() * kBitsPerWord, false);
    for (size_t i = 0; i < parts.size(); ++i) {
        const unsigned long word = std::strtoul(parts[parts.size() - 1 - i].c_str(), nullptr, 16);
        for (unsigned b = 0; b < kBitsPerWord; ++b)
            if (word >> b & 1ul) bits[i * kBitsPerWord + b] = true;
    }
    return bits;
}

bool has(const std::vector<bool>& bits, unsigned n) { return n < bits.size() && bits[n]; }

uint16_t hexNumber(const std::filesystem::path& file) {
    return static_cast<uint16_t>(std::strtoul(firstLine(file).c_str(), nullptr, 16));
}

std::string lower(std::string s) {
    for (char& c : s) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return s;
}

}  // namespace

std::string InputDeviceInfo::describe() const {
    char id[64];
    std::snprintf(id, sizeof(id), "%s, %04x:%04x", evemu::transportForBus(bus).c_str(), vendor, product);
    return (name.empty() ? std::string("unnamed device") : "\"" + name + "\"") + " (" + id + ")";
}

bool InputDeviceInfo::sameDevice(const InputDeviceInfo& other) const {
    return name == other.name && bus == other.bus && vendor == other.vendor && product == other.product;
}

std::vector<const InputDeviceInfo*> InputDeviceScan::touchpads() const {
    std::vector<const InputDeviceInfo*> out;
    for (const InputDeviceInfo& d : devices)
        if (d.touchpad) out.push_back(&d);
    return out;
}

std::vector<const InputDeviceInfo*> InputDeviceScan::lidSwitches() const {
    std::vector<const InputDeviceInfo*> out;
    for (const InputDeviceInfo& d : devices)
        if (d.lidSwitch) out.push_back(&d);
    return out;
}

InputDeviceScan scanInputDevices(const std::string& sysfs, const std::string& devices) {
    namespace fs = std::filesystem;
    InputDeviceScan scan;
    std::error_code ec;
    for (fs::directory_iterator it(sysfs, ec), end; !ec && it != end; it.increment(ec)) {
        const std::string entry = it->path().filename().string();
        if (entry.rfind("event", 0) != 0 || entry.size() == 5 ||
            !std::all_of(entry.begin() + 5, entry.end(), [](char c) { return c >= '0' && c <= '9'; }))
            continue;
        const fs::path device = it->path() / "device";
        InputDeviceInfo info;
        info.node = devices + "/" + entry;
        info.number = std::atoi(entry.c_str() + 5);
        info.name = firstLine(device / "name");
        info.bus = hexNumber(device / "id" / "bustype");
        info.vendor = hexNumber(device / "id" / "vendor");
        info.product = hexNumber(device / "id" / "product");
        const std::vector<bool> abs = bitmap(device / "capabilities" / "abs");
        const std::vector<bool> properties = bitmap(device / "properties");
        info.touchpad = has(abs, evemu::kAbsMtSlot) && has(abs, evemu::kAbsMtTrackingId) &&
                        has(abs, evemu::kAbsMtPositionX) && has(abs, evemu::kAbsMtPositionY) &&
                        has(properties, kInputPropPointer);
        info.lidSwitch = has(bitmap(device / "capabilities" / "sw"), kSwLid);
        if (info.touchpad || info.lidSwitch) {
            const int fd = ::open(info.node.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
            if (fd >= 0) {
                info.readable = true;
                ::close(fd);
            } else {
                info.problem = describeOpenFailure(info.node, errno);
            }
        }
        scan.devices.push_back(std::move(info));
    }
    std::sort(scan.devices.begin(), scan.devices.end(),
              [](const InputDeviceInfo& a, const InputDeviceInfo& b) { return a.number < b.number; });
    return scan;
}

const InputDeviceInfo* chooseTouchpad(const InputDeviceScan& scan, const std::string& wanted) {
    const std::vector<const InputDeviceInfo*> pads = scan.touchpads();
    if (wanted.empty()) {
        for (const InputDeviceInfo* d : pads)
            if (d->readable) return d;
        return pads.empty() ? nullptr : pads.front();
    }
    if (wanted.find('/') != std::string::npos) {
        std::error_code ec;
        const std::filesystem::path real = std::filesystem::weakly_canonical(wanted, ec);
        for (const InputDeviceInfo& d : scan.devices)
            if (d.node == wanted || (!ec && d.node == real.string())) return &d;
        return nullptr;
    }
    const std::string needle = lower(wanted);
    for (const InputDeviceInfo* d : pads)
        if (lower(d->name).find(needle) != std::string::npos) return d;
    return nullptr;
}

}  // namespace orvane::live
