/// Progress on a terminal.
#pragma once

#include <chrono>

namespace zsi::cmd {

/// One line on stderr with the share done and the time left, redrawn in place a few times a second
/// and wiped at the end. Nothing where stderr is no terminal.
class ProgressBar {
public:
    ProgressBar();
    ~ProgressBar();
    ProgressBar(ProgressBar const&) = delete;
    ProgressBar& operator=(ProgressBar const&) = delete;

    /// `done` in [0, 1]. Calls must not overlap.
    void show(double done);

private:
    using Clock = std::chrono::steady_clock;

    bool terminal_;
    bool drawn_ = false;
    Clock::time_point begin_;
    Clock::time_point next_;
};

} // namespace zsi::cmd
