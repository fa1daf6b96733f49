#pragma once
// The frame clock the stage classes share: this frame's and the previous frame's time,
// in platform ticks.

namespace orvane {

class HIDTimeState {
public:
    HIDTimeState() = default;
    virtual ~HIDTimeState() = default;

    double currentTimestamp() const { return currentTimestamp_; }
    void setCurrentTimestamp(double t) { currentTimestamp_ = t; }
    double previousTimestamp() const { return previousTimestamp_; }
    void setPreviousTimestamp(double t) { previousTimestamp_ = t; }

    // The current time becomes the previous one, then t becomes current.
    void updateFrameTimestamp(double t) {
        previousTimestamp_ = currentTimestamp_;
        currentTimestamp_ = t;
    }
    // 0 before the first frame, and the full time since 0 after the first.
    double frameInterval() const { return currentTimestamp_ - previousTimestamp_; }

private:
    double currentTimestamp_ = 0.0;
    double previousTimestamp_ = 0.0;
};

}  // namespace orvane
