#include "ProgressLine.h"

#include <unistd.h>

#include <cstdio>

namespace orvane::cli {

ProgressLine::ProgressLine(const std::string& what, size_t total, bool enabled)
    : what_(what), total_(total), active_(enabled && total >= kMinimumRecords && ::isatty(STDERR_FILENO) == 1) {}

ProgressLine::~ProgressLine() { finish(); }

void ProgressLine::update(size_t done) {
    if (!active_) return;
    const int percent = static_cast<int>(done * 100 / total_);
    if (percent == lastPercent_) return;
    lastPercent_ = percent;
    std::fprintf(stderr, "\r\033[Korvane: %s: %zu / %zu records (%d%%)", what_.c_str(), done, total_, percent);
    std::fflush(stderr);
}

void ProgressLine::finish() {
    if (!active_) return;
    active_ = false;
    std::fputs("\r\033[K", stderr);
    std::fflush(stderr);
}

}  // namespace orvane::cli
