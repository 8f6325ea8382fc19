// SPDX-License-Identifier: Apache-2.0
/// Progress on a terminal.
#pragma once

#include <chrono>
#include <string>

namespace zsi::cmd {

/// One line on stderr: what is being done, the share done and the time left, as much of it as the
/// terminal is wide; redrawn in place a few times a second and wiped at the end. Nothing where
/// stderr is no terminal. For programs, lines "zsi: progress SHARE WHAT", SHARE in [0, 1].
class ProgressBar {
public:
    enum class Style { None, Terminal, Lines };
    explicit ProgressBar(Style style);
    explicit ProgressBar(bool wanted = true)
        : ProgressBar(wanted ? Style::Terminal : Style::None)
    {
    }
    ~ProgressBar();
    ProgressBar(ProgressBar const&) = delete;
    ProgressBar& operator=(ProgressBar const&) = delete;

    /// Calls must not overlap.
    void show(std::string const& what); ///< of unknown length
    /// `done` in [0, 1]; `detail` behind the rest, where there is room for it.
    void show(std::string const& what, double done, std::string const& detail = {});

private:
    using Clock = std::chrono::steady_clock;
    void draw(std::string const& line);
    static void write(double done, std::string const& what);

    Style style_;
    bool drawn_ = false;
    std::string what_;
    Clock::time_point begin_; ///< of `what_`
    Clock::time_point next_;
};

} // namespace zsi::cmd
