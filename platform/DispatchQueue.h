#pragma once
// A serial queue with asynchronous submission. Work runs in submission order, one item
// at a time, when the queue is drained: by the host between events, or by a test.

#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <string>

namespace orvane {

class DispatchQueue {
public:
    explicit DispatchQueue(std::string label);

    const std::string& label() const { return label_; }
    // Queues the work and returns at once.
    void async(std::function<void()> work);
    // Runs queued work, including work queued while draining; returns how many items ran.
    size_t drain();
    size_t pending() const;
    std::string description() const;

private:
    std::string label_;
    mutable std::mutex mutex_;
    std::deque<std::function<void()>> work_;
};

using DispatchQueueRef = std::shared_ptr<DispatchQueue>;

}  // namespace orvane
