#include "EvdevCodes.h"

#include <cstdio>

namespace orvane::evemu {

namespace {

std::string hex(uint16_t value, int digits) {
    char text[16];
    std::snprintf(text, sizeof text, "0x%0*x", digits, unsigned(value));
    return text;
}

const char* absName(uint16_t code) {
    switch (code) {
    case 0x00: return "ABS_X";
    case 0x01: return "ABS_Y";
    case 0x02: return "ABS_Z";
    case 0x18: return "ABS_PRESSURE";
    case 0x19: return "ABS_DISTANCE";
    case 0x1c: return "ABS_TOOL_WIDTH";
    case 0x2f: return "ABS_MT_SLOT";
    case 0x30: return "ABS_MT_TOUCH_MAJOR";
    case 0x31: return "ABS_MT_TOUCH_MINOR";
    case 0x32: return "ABS_MT_WIDTH_MAJOR";
    case 0x33: return "ABS_MT_WIDTH_MINOR";
    case 0x34: return "ABS_MT_ORIENTATION";
    case 0x35: return "ABS_MT_POSITION_X";
    case 0x36: return "ABS_MT_POSITION_Y";
    case 0x37: return "ABS_MT_TOOL_TYPE";
    case 0x38: return "ABS_MT_BLOB_ID";
    case 0x39: return "ABS_MT_TRACKING_ID";
    case 0x3a: return "ABS_MT_PRESSURE";
    case 0x3b: return "ABS_MT_DISTANCE";
    case 0x3c: return "ABS_MT_TOOL_X";
    case 0x3d: return "ABS_MT_TOOL_Y";
    default: return nullptr;
    }
}

const char* keyName(uint16_t code) {
    static const char* const kMouse[] = {"BTN_LEFT",  "BTN_RIGHT",   "BTN_MIDDLE", "BTN_SIDE",
                                         "BTN_EXTRA", "BTN_FORWARD", "BTN_BACK",   "BTN_TASK"};
    static const char* const kDigits[] = {"BTN_0", "BTN_1", "BTN_2", "BTN_3", "BTN_4",
                                          "BTN_5", "BTN_6", "BTN_7", "BTN_8", "BTN_9"};
    static const char* const kTools[] = {
        "BTN_TOOL_PEN",       "BTN_TOOL_RUBBER",    "BTN_TOOL_BRUSH",    "BTN_TOOL_PENCIL",
        "BTN_TOOL_AIRBRUSH",  "BTN_TOOL_FINGER",    "BTN_TOOL_MOUSE",    "BTN_TOOL_LENS",
        "BTN_TOOL_QUINTTAP",  "BTN_STYLUS3",        "BTN_TOUCH",         "BTN_STYLUS",
        "BTN_STYLUS2",        "BTN_TOOL_DOUBLETAP", "BTN_TOOL_TRIPLETAP", "BTN_TOOL_QUADTAP"};
    if (code >= kBtnLeft && code <= kBtnTask) return kMouse[code - kBtnLeft];
    if (code >= kBtn0 && code <= kBtn9) return kDigits[code - kBtn0];
    if (code >= 0x140 && code <= 0x14f) return kTools[code - 0x140];
    return nullptr;
}

const char* synName(uint16_t code) {
    switch (code) {
    case kSynReport: return "SYN_REPORT";
    case kSynConfig: return "SYN_CONFIG";
    case kSynMtReport: return "SYN_MT_REPORT";
    case kSynDropped: return "SYN_DROPPED";
    default: return nullptr;
    }
}

const char* mscName(uint16_t code) {
    switch (code) {
    case 0: return "MSC_SERIAL";
    case 1: return "MSC_PULSELED";
    case 2: return "MSC_GESTURE";
    case 3: return "MSC_RAW";
    case 4: return "MSC_SCAN";
    case 5: return "MSC_TIMESTAMP";
    default: return nullptr;
    }
}

}  // namespace

std::string eventTypeName(uint16_t type) {
    switch (type) {
    case kEvSyn: return "EV_SYN";
    case kEvKey: return "EV_KEY";
    case kEvRel: return "EV_REL";
    case kEvAbs: return "EV_ABS";
    case kEvMsc: return "EV_MSC";
    case 0x05: return "EV_SW";
    case 0x11: return "EV_LED";
    case 0x12: return "EV_SND";
    case 0x14: return "EV_REP";
    case 0x15: return "EV_FF";
    case 0x16: return "EV_PWR";
    case 0x17: return "EV_FF_STATUS";
    default: return "type " + hex(type, 2);
    }
}

std::string eventCodeName(uint16_t type, uint16_t code) {
    const char* name = nullptr;
    switch (type) {
    case kEvSyn: name = synName(code); break;
    case kEvKey: name = keyName(code); break;
    case kEvAbs: name = absName(code); break;
    case kEvMsc: name = mscName(code); break;
    default: break;
    }
    if (name) return name;
    return eventTypeName(type) + " code " + hex(code, type == kEvKey ? 3 : 2);
}

std::string transportForBus(uint16_t bus) {
    switch (bus) {
    case 0x01: return "PCI";
    case 0x03: return "USB";
    case 0x05: return "Bluetooth";
    case 0x06: return "Virtual";
    case 0x11: return "PS/2";
    case 0x18: return "I2C";
    case 0x19: return "Host";
    case 0x1c: return "SPI";
    default: return "bus " + hex(bus, 4);
    }
}

}  // namespace orvane::evemu
