// An event keeps the platform's known integer and double fields in fixed slots and every other
// field in a short sorted list. Here it is held against a plain model of an event's fields (a
// map from selector to field, with the kind rules spelt out) on random sequences of writes,
// reads, copies and pool round trips, and on the frames of the random sessions; and the
// creation calls that write their slots at once are held against their field-by-field forms.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <iterator>
#include <limits>
#include <map>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "bench/support/AllocationCounter.h"
#include "platform/HIDEvent.h"
#include "platform/HIDEventPool.h"
#include "PerfSessions.h"

namespace orvane {
namespace {

using Field = HIDEvent::Field;

// The fields of an event written out plainly: a map from selector to field. A known field
// keeps its kind whatever setter is used; an unknown one takes the setter's kind and keeps
// what the other setters wrote before.
class LiteralFields {
public:
    void setInteger(int64_t value, uint32_t selector) {
        switch (hidFieldKind(selector, HIDFieldKind::Integer)) {
        case HIDFieldKind::Integer: write(selector, HIDFieldKind::Integer).integer = value; break;
        case HIDFieldKind::Double: write(selector, HIDFieldKind::Double).real = static_cast<double>(value); break;
        case HIDFieldKind::Data: break;
        }
    }
    void setDouble(double value, uint32_t selector) {
        switch (hidFieldKind(selector, HIDFieldKind::Double)) {
        case HIDFieldKind::Double: write(selector, HIDFieldKind::Double).real = value; break;
        case HIDFieldKind::Integer: write(selector, HIDFieldKind::Integer).integer = truncate(value); break;
        case HIDFieldKind::Data: break;
        }
    }
    void setData(const std::vector<uint8_t>& bytes, uint32_t selector) {
        if (hidFieldKind(selector, HIDFieldKind::Data) != HIDFieldKind::Data) return;
        write(selector, HIDFieldKind::Data).data = bytes;
    }
    int64_t integer(uint32_t selector) const {
        const auto it = fields_.find(selector);
        if (it == fields_.end()) return 0;
        switch (it->second.kind) {
        case HIDFieldKind::Integer: return it->second.integer;
        case HIDFieldKind::Double: return truncate(it->second.real);
        case HIDFieldKind::Data: return 0;
        }
        return 0;
    }
    double real(uint32_t selector) const {
        const auto it = fields_.find(selector);
        if (it == fields_.end()) return 0.0;
        switch (it->second.kind) {
        case HIDFieldKind::Integer: return static_cast<double>(it->second.integer);
        case HIDFieldKind::Double: return it->second.real;
        case HIDFieldKind::Data: return 0.0;
        }
        return 0.0;
    }
    std::vector<uint8_t> data(uint32_t selector) const {
        const auto it = fields_.find(selector);
        return it != fields_.end() && it->second.kind == HIDFieldKind::Data ? it->second.data : std::vector<uint8_t>{};
    }
    bool has(uint32_t selector) const { return fields_.count(selector) != 0; }
    std::vector<Field> list() const {
        std::vector<Field> out;
        for (const auto& [selector, field] : fields_) out.push_back(field);
        return out;
    }
    void clear() { fields_.clear(); }

private:
    static int64_t truncate(double v) {
        if (std::isnan(v)) return 0;
        if (v >= 9.2233720368547758e18) return std::numeric_limits<int64_t>::max();
        if (v <= -9.2233720368547758e18) return std::numeric_limits<int64_t>::min();
        return static_cast<int64_t>(v);
    }
    Field& write(uint32_t selector, HIDFieldKind kind) {
        Field& f = fields_.try_emplace(selector, Field{selector, kind, 0, 0.0, {}}).first->second;
        f.kind = kind;
        return f;
    }

    std::map<uint32_t, Field> fields_;
};

bool sameBits(double a, double b) { return std::memcmp(&a, &b, sizeof a) == 0; }

bool sameField(const Field& a, const Field& b) {
    return a.selector == b.selector && a.kind == b.kind && a.integer == b.integer && sameBits(a.real, b.real) &&
           a.data == b.data;
}

std::string fieldsText(const std::vector<Field>& fields) {
    std::string s;
    char buf[96];
    for (const Field& f : fields) {
        std::snprintf(buf, sizeof buf, " 0x%x:%d:%lld:%a:%zu", f.selector, static_cast<int>(f.kind),
                      static_cast<long long>(f.integer), f.real, f.data.size());
        s += buf;
    }
    return s;
}

bool sameFields(const std::vector<Field>& a, const std::vector<Field>& b) {
    if (a.size() != b.size()) return false;
    for (size_t i = 0; i < a.size(); ++i) {
        if (!sameField(a[i], b[i])) return false;
    }
    return true;
}

// The description as it was always written, from a list of fields.
std::string literalDescription(const HIDEvent& e, const std::vector<Field>& fields) {
    char buf[96];
    std::snprintf(buf, sizeof buf, "{type %u ts %llu sender %llu phase %u", e.type(),
                  static_cast<unsigned long long>(e.timestamp()), static_cast<unsigned long long>(e.senderID()),
                  static_cast<unsigned>(e.phase()));
    std::string s = buf;
    for (const Field& f : fields) {
        switch (f.kind) {
        case HIDFieldKind::Integer:
            std::snprintf(buf, sizeof buf, " 0x%x=%lld", f.selector, static_cast<long long>(f.integer));
            s += buf;
            break;
        case HIDFieldKind::Double:
            std::snprintf(buf, sizeof buf, " 0x%x=%.9g", f.selector, f.real);
            s += buf;
            break;
        case HIDFieldKind::Data:
            std::snprintf(buf, sizeof buf, " 0x%x=<", f.selector);
            s += buf;
            for (uint8_t b : f.data) {
                std::snprintf(buf, sizeof buf, "%02x", b);
                s += buf;
            }
            s += ">";
            break;
        }
    }
    return s + "}";
}

// Every known selector, the vendor data field among them, and unknown ones of known and
// unknown types around them.
std::vector<uint32_t> selectorsToTry() {
    std::vector<uint32_t> selectors;
    for (uint32_t type = 0; type <= 0x12; ++type) {
        for (uint32_t index = 0; index <= 0x1c; ++index) {
            const uint32_t selector = hidFieldSelector(type, index);
            if (hidFieldIsKnown(selector)) selectors.push_back(selector);
        }
    }
    for (uint32_t selector : {0x0u, 0x5u, 0x10005u, 0x20002u, 0x20003u, 0x30003u, 0x50003u, 0x60003u, 0x70003u,
                              0xb000au, 0xb001au, 0xb001cu, 0xb0042u, 0x110004u, 0x120000u, 0x400000u, 0xffff0000u,
                              0xffffffffu}) {
        selectors.push_back(selector);
    }
    return selectors;
}

// The event agrees with the model in every read, in its list of fields and its description.
void expectAgree(const HIDEvent& e, const LiteralFields& model, const std::vector<uint32_t>& selectors,
                 const std::string& where) {
    for (uint32_t selector : selectors) {
        ASSERT_EQ(e.integerValueForField(selector), model.integer(selector)) << where << std::hex << " 0x" << selector;
        ASSERT_TRUE(sameBits(e.doubleValueForField(selector), model.real(selector)))
            << where << std::hex << " 0x" << selector;
        ASSERT_EQ(e.dataValueForField(selector), model.data(selector)) << where << std::hex << " 0x" << selector;
        ASSERT_EQ(e.hasField(selector), model.has(selector)) << where << std::hex << " 0x" << selector;
    }
    const std::vector<Field> expected = model.list();
    ASSERT_TRUE(sameFields(e.fields(), expected))
        << where << "\n got" << fieldsText(e.fields()) << "\nwant" << fieldsText(expected);
    if (e.children().empty()) {
        ASSERT_EQ(e.description(), literalDescription(e, expected)) << where;
    }
}

class RandomValues {
public:
    explicit RandomValues(uint32_t seed) : random_(seed) {}
    size_t below(size_t n) { return std::uniform_int_distribution<size_t>(0, n - 1)(random_); }
    int64_t integer() {
        static const int64_t special[] = {0, 1, -1, 2, 3, 0x1b, std::numeric_limits<int64_t>::max(),
                                          std::numeric_limits<int64_t>::min(), 1ll << 53, -(1ll << 53) - 1};
        if (below(3) == 0) return special[below(std::size(special))];
        return std::uniform_int_distribution<int64_t>(-1000000, 1000000)(random_);
    }
    double real() {
        static const double special[] = {0.0, -0.0, 1.0, -1.0, 0.5, 2.9, -2.9, 1e300, -1e300,
                                         9.2233720368547758e18, -9.2233720368547758e18, 1e19, -1e19,
                                         std::numeric_limits<double>::infinity(),
                                         -std::numeric_limits<double>::infinity(),
                                         std::numeric_limits<double>::quiet_NaN(), 5e-324};
        if (below(3) == 0) return special[below(std::size(special))];
        return std::uniform_real_distribution<double>(-100.0, 100.0)(random_);
    }
    std::vector<uint8_t> bytes() {
        std::vector<uint8_t> out(below(6));
        for (uint8_t& b : out) b = static_cast<uint8_t>(below(256));
        return out;
    }

private:
    std::mt19937 random_;
};

// One random write to both the event and the model.
void randomWrite(HIDEvent& e, LiteralFields& model, const std::vector<uint32_t>& selectors, RandomValues& r) {
    const uint32_t selector = selectors[r.below(selectors.size())];
    switch (r.below(5)) {
    case 0:
    case 1: {
        const int64_t v = r.integer();
        e.setIntegerValue(v, selector);
        model.setInteger(v, selector);
        break;
    }
    case 2:
    case 3: {
        const double v = r.real();
        e.setDoubleValue(v, selector);
        model.setDouble(v, selector);
        break;
    }
    default: {
        const std::vector<uint8_t> v = r.bytes();
        e.setDataValue(v.data(), v.size(), selector);
        model.setData(v, selector);
        break;
    }
    }
}

TEST(EventFieldSlots, SlotsAreTheKnownNumericFieldsInSelectorOrder) {
    int slots = 0;
    int previous = -1;
    for (uint32_t type = 0; type <= 0x40; ++type) {
        for (uint32_t index = 0; index <= 0x100; ++index) {
            const uint32_t selector = hidFieldSelector(type, index);
            const int slot = hidFieldSlot(selector);
            const bool numeric = hidFieldIsKnown(selector) && hidFieldKind(selector, HIDFieldKind::Data) !=
                                                                  HIDFieldKind::Data;
            ASSERT_EQ(slot >= 0, numeric) << std::hex << selector;
            if (slot < 0) continue;
            ++slots;
            EXPECT_GT(slot, previous) << std::hex << selector;
            previous = slot;
            EXPECT_EQ(hidFieldSlotSelector(slot), selector);
            EXPECT_EQ(hidFieldSlotIsDouble(slot), hidFieldKind(selector, HIDFieldKind::Integer) == HIDFieldKind::Double);
        }
    }
    EXPECT_EQ(slots, kHIDFieldSlotCount);
    EXPECT_EQ(hidFieldSlot(kHIDEventFieldVendorDefinedData), -1);
    EXPECT_EQ(hidFieldSlot(0xffffffffu), -1);
}

TEST(EventFieldSlots, AgreeWithTheMapOfFieldsOnRandomWrites) {
    const std::vector<uint32_t> selectors = selectorsToTry();
    RandomValues r(20260301);
    for (int round = 0; round < 300; ++round) {
        HIDEventRef e = HIDEvent::create(static_cast<uint32_t>(r.below(20)), r.below(1000));
        LiteralFields model;
        const size_t writes = r.below(80);
        for (size_t i = 0; i < writes; ++i) {
            randomWrite(*e, model, selectors, r);
            if (r.below(8) == 0) expectAgree(*e, model, selectors, "round " + std::to_string(round));
            if (::testing::Test::HasFatalFailure()) return;
        }
        expectAgree(*e, model, selectors, "end of round " + std::to_string(round));
        if (::testing::Test::HasFatalFailure()) return;
    }
}

TEST(EventFieldSlots, CopiesAgreeWithTheMapAndStayIndependent) {
    const std::vector<uint32_t> selectors = selectorsToTry();
    RandomValues r(7);
    for (int round = 0; round < 100; ++round) {
        HIDEventRef e = HIDEvent::create(kHIDEventTypeDigitizer, 1);
        LiteralFields model;
        for (size_t i = 0, n = r.below(40); i < n; ++i) randomWrite(*e, model, selectors, r);
        e->appendEvent(HIDEvent::create(kHIDEventTypeDigitizer, 2));
        HIDEventRef copy = e->copy();
        LiteralFields copyModel = model;
        expectAgree(*copy, copyModel, selectors, "copy");
        // Writes to either side leave the other as it was.
        for (size_t i = 0, n = r.below(20); i < n; ++i) randomWrite(*copy, copyModel, selectors, r);
        for (size_t i = 0, n = r.below(20); i < n; ++i) randomWrite(*e, model, selectors, r);
        expectAgree(*copy, copyModel, selectors, "copy written");
        expectAgree(*e, model, selectors, "original written");
        if (::testing::Test::HasFatalFailure()) return;
    }
}

TEST(EventFieldSlots, EventsBackFromThePoolStartEmptyAgain) {
    const std::vector<uint32_t> selectors = selectorsToTry();
    RandomValues r(99);
    for (int round = 0; round < 100; ++round) {
        HIDEventRef e = HIDEvent::create(kHIDEventTypePointer, 1);
        LiteralFields model;
        for (size_t i = 0, n = r.below(60); i < n; ++i) randomWrite(*e, model, selectors, r);
        (void)e->fields();  // listed before it goes back
        const HIDEvent* address = e.get();
        e.reset();
        HIDEventRef again = HIDEvent::create(kHIDEventTypeScroll, 2);
        ASSERT_EQ(again.get(), address);  // the pool hands back the event it took last
        expectAgree(*again, LiteralFields{}, selectors, "reused");
        LiteralFields fresh;
        for (size_t i = 0, n = r.below(10); i < n; ++i) randomWrite(*again, fresh, selectors, r);
        expectAgree(*again, fresh, selectors, "reused and written");
        if (::testing::Test::HasFatalFailure()) return;
    }
}

void expectSameEvent(const HIDEvent& fast, const HIDEvent& literal, const std::string& where) {
    ASSERT_EQ(fast.type(), literal.type()) << where;
    ASSERT_EQ(fast.timestamp(), literal.timestamp()) << where;
    ASSERT_EQ(fast.options(), literal.options()) << where;
    ASSERT_EQ(fast.senderID(), literal.senderID()) << where;
    ASSERT_EQ(fast.phase(), literal.phase()) << where;
    ASSERT_TRUE(sameFields(fast.fields(), literal.fields()))
        << where << "\n got" << fieldsText(fast.fields()) << "\nwant" << fieldsText(literal.fields());
    ASSERT_EQ(fast.description(), literal.description()) << where;
}

void expectCreationCallsAgree(uint64_t t, double x, double y, double z, uint32_t mask, uint32_t options,
                              const std::string& where) {
    expectSameEvent(*HIDEvent::pointerEvent(t, x, y, z, mask, options),
                    *HIDEvent::pointerEventLiteral(t, x, y, z, mask, options), where + " pointer");
    expectSameEvent(*HIDEvent::scrollEvent(t, x, y, z, options),
                    *HIDEvent::threeAxisEventLiteral(kHIDEventTypeScroll, t, x, y, z, options), where + " scroll");
    expectSameEvent(*HIDEvent::createScaleEvent(t, x, y, z, options),
                    *HIDEvent::threeAxisEventLiteral(kHIDEventTypeScale, t, x, y, z, options), where + " scale");
    expectSameEvent(*HIDEvent::createRotationEvent(t, x, y, z, options),
                    *HIDEvent::threeAxisEventLiteral(kHIDEventTypeRotation, t, x, y, z, options),
                    where + " rotation");
}

TEST(EventFieldSlots, CreationCallsMakeTheEventsOfTheirFieldByFieldForms) {
    RandomValues r(4242);
    for (int i = 0; i < 2000; ++i) {
        const uint32_t mask = r.below(4) == 0 ? 0xffffffffu : static_cast<uint32_t>(r.below(8));
        expectCreationCallsAgree(r.below(1u << 30), r.real(), r.real(), r.real(), mask,
                                 static_cast<uint32_t>(r.below(3)), "random " + std::to_string(i));
        if (::testing::Test::HasFatalFailure()) return;
    }
}

TEST(EventFieldSlots, AgreeWithTheMapOnEveryFrameOfTheRandomSessions) {
    const std::vector<uint32_t> selectors = selectorsToTry();
    RandomValues r(2026);
    int events = 0;
    int restingMarks = 0;
    perf::replayRandomSessions([&](HIDParser&, const HIDEventRef& frame) {
        if (::testing::Test::HasFatalFailure()) return;
        std::vector<HIDEventRef> all{frame};
        for (const HIDEventRef& child : frame->children()) all.push_back(child);
        for (const HIDEventRef& event : all) {
            ++events;
            if (event->integerValueForField(kHIDEventFieldDigitizerEventMask) & kHIDDigitizerEventResting) {
                ++restingMarks;
            }
            // The fields as the filter left them, written into the model in a random order.
            std::vector<Field> fields = event->fields();
            std::shuffle(fields.begin(), fields.end(), std::mt19937(static_cast<uint32_t>(events)));
            LiteralFields model;
            HIDEventRef rebuilt = HIDEvent::create(event->type(), event->timestamp());
            for (const Field& f : fields) {
                switch (f.kind) {
                case HIDFieldKind::Integer:
                    model.setInteger(f.integer, f.selector);
                    rebuilt->setIntegerValue(f.integer, f.selector);
                    break;
                case HIDFieldKind::Double:
                    model.setDouble(f.real, f.selector);
                    rebuilt->setDoubleValue(f.real, f.selector);
                    break;
                case HIDFieldKind::Data:
                    model.setData(f.data, f.selector);
                    rebuilt->setDataValue(f.data.data(), f.data.size(), f.selector);
                    break;
                }
            }
            HIDEventRef copy = event->copy();
            expectAgree(*event, model, selectors, "frame event");
            expectAgree(*copy, model, selectors, "copy of frame event");
            expectAgree(*rebuilt, model, selectors, "rebuilt frame event");
            // A few more writes, as the stages after this one might make.
            for (int i = 0; i < 4; ++i) randomWrite(*rebuilt, model, selectors, r);
            expectAgree(*rebuilt, model, selectors, "rebuilt and written");
            if (::testing::Test::HasFatalFailure()) return;
        }
        // The events the gesture stage would make from this frame's values.
        const double x = frame->doubleValueForField(kHIDEventFieldDigitizerX);
        const double y = frame->doubleValueForField(kHIDEventFieldDigitizerY);
        expectCreationCallsAgree(frame->timestamp(), x, y, x - y,
                                 static_cast<uint32_t>(frame->integerValueForField(kHIDEventFieldDigitizerButtonMask)),
                                 0, "frame");
    });
    EXPECT_GT(events, 1000);
    EXPECT_GT(restingMarks, 0);
}

TEST(EventFieldSlots, ListingTheFieldsOfAWarmEventTakesNothingFromTheHeap) {
    HIDEventRef e = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    for (uint32_t index = 0; index <= 9; ++index) e->setIntegerValue(index, hidFieldSelector(kHIDEventTypeDigitizer, index));
    const uint8_t bytes[] = {1, 2, 3};
    e->setDataValue(bytes, sizeof bytes, kHIDEventFieldVendorDefinedData);
    e->setIntegerValue(5, 0xb0042);
    ASSERT_EQ(e->fields().size(), 12u);  // warm: the list has grown to its size once
    const perf::AllocationCount before = perf::allocationCount();
    for (int i = 0; i < 100; ++i) {
        e->setDoubleValue(i * 0.5, kHIDEventFieldDigitizerX);
        e->setIntegerValue(i, 0xb0042);
        ASSERT_EQ(e->fields().size(), 12u);
        ASSERT_EQ(e->fields()[1].real, i * 0.5);  // after the vendor data field
    }
    EXPECT_EQ(perf::allocationCount().allocations, before.allocations);
}

TEST(EventFieldSlots, SeveralThreadsListTheSameEventAlike) {
    HIDEventRef e = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    const uint8_t bytes[] = {4, 5, 6};
    e->setDataValue(bytes, sizeof bytes, kHIDEventFieldVendorDefinedData);
    for (uint32_t index = 0; index <= 9; ++index) e->setDoubleValue(index * 0.25, hidFieldSelector(11, index));
    e->setIntegerValue(-3, 0xb0042);
    const HIDEvent& shared = *e;
    auto reader = [&shared](int* wrong) {
        for (int i = 0; i < 20000; ++i) {
            const std::vector<Field>& list = shared.fields();
            if (list.size() != 12 || list[0].data.size() != 3 || list[11].integer != -3) ++*wrong;
        }
    };
    int wrongA = 0;
    int wrongB = 0;
    std::thread a(reader, &wrongA), b(reader, &wrongB);
    a.join();
    b.join();
    EXPECT_EQ(wrongA, 0);
    EXPECT_EQ(wrongB, 0);
}

}  // namespace
}  // namespace orvane
