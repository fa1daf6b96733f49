#include "DispatchQueue.h"

namespace orvane {

DispatchQueue::DispatchQueue(std::string label) : label_(std::move(label)) {}

void DispatchQueue::async(std::function<void()> work) {
    std::lock_guard<std::mutex> lock(mutex_);
    work_.push_back(std::move(work));
}

size_t DispatchQueue::drain() {
    size_t ran = 0;
    for (;;) {
        std::function<void()> next;
        {
            std::lock_guard<std::mutex> lock(mutex_);
            if (work_.empty()) return ran;
            next = std::move(work_.front());
            work_.pop_front();
        }
        if (next) next();
        ++ran;
    }
}

size_t DispatchQueue::pending() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return work_.size();
}

std::string DispatchQueue::description() const { return "<DispatchQueue " + label_ + ">"; }

}  // namespace orvane
