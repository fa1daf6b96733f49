#pragma once
// A single updating line on standard error that tells how far a long run has come
// ("orvane: replaying pad.evemu: 1200 / 5000 records (24%)"), shown only when standard
// error is a terminal and the run has at least kMinimumRecords records; it is redrawn when
// the percentage changes and wiped when the run ends. Nothing is written otherwise.

#include <cstddef>
#include <string>

namespace orvane::cli {

class ProgressLine {
public:
    static constexpr size_t kMinimumRecords = 1000;

    // `enabled` false keeps it silent whatever the terminal (for example while the filter's
    // own log lines go to standard error).
    ProgressLine(const std::string& what, size_t total, bool enabled = true);
    ~ProgressLine();
    ProgressLine(const ProgressLine&) = delete;
    ProgressLine& operator=(const ProgressLine&) = delete;

    void update(size_t done);
    // Wipes the line; later updates write nothing.
    void finish();

    bool shown() const { return active_; }

private:
    std::string what_;
    size_t total_;
    bool active_ = false;
    int lastPercent_ = -1;
};

}  // namespace orvane::cli
