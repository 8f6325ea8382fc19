// SPDX-License-Identifier: Apache-2.0
#include "cmd/progressBar.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fmt/format.h>
#include <sys/ioctl.h>
#include <unistd.h>

namespace zsi::cmd {
namespace {

constexpr std::size_t kMostMarks = 40, kFewestMarks = 5;

/// Characters that fit in a line without breaking it.
std::size_t columns()
{
    winsize size = {};
    bool const known = ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
    return (known ? size.ws_col : 80u) - 1u;
}

std::string clockText(double seconds)
{
    auto const s = static_cast<long>(std::ceil(seconds));
    return s < 3600 ? fmt::format("{}:{:02}", s / 60, s % 60)
                    : fmt::format("{}:{:02}:{:02}", s / 3600, s / 60 % 60, s % 60);
}

} // namespace

ProgressBar::ProgressBar(Style style)
    : style_(style == Style::Terminal && isatty(STDERR_FILENO) != 1 ? Style::None : style)
    , begin_(Clock::now())
    , next_(begin_)
{
}

ProgressBar::~ProgressBar()
{
    if (drawn_)
        std::fputs("\r\033[K", stderr);
}

void ProgressBar::show(std::string const& what)
{
    if (style_ == Style::Terminal)
        draw(what);
    else if (style_ == Style::Lines)
        write(0.0, what);
}

void ProgressBar::show(std::string const& what, double done, std::string const& detail)
{
    auto const now = Clock::now();
    if (what != what_) {
        what_ = what;
        begin_ = next_ = now;
    }
    if (style_ == Style::None || now < next_ || !(done > 0.0))
        return;
    next_ = now + std::chrono::milliseconds(200);
    if (style_ == Style::Lines) {
        write(done, detail.empty() ? what : what + ", " + detail);
        return;
    }
    double const elapsed = std::chrono::duration<double>(now - begin_).count();
    std::string const percent = fmt::format("{:3.0f}%", std::floor(done * 100.0));
    std::string const head = what + ' ';
    std::string tail =
        fmt::format(" {}  {} left", percent, clockText(elapsed * (1.0 - done) / done));
    std::size_t const room = columns();
    if (!detail.empty() && head.size() + tail.size() + detail.size() + kFewestMarks + 4 <= room)
        tail += "  " + detail;
    std::size_t const text = head.size() + tail.size() + 2;
    if (room < text + kFewestMarks) {
        draw(room < text ? percent : head + tail);
        return;
    }
    std::size_t const marks = std::min(room - text, kMostMarks);
    auto const filled = static_cast<std::size_t>(done * static_cast<double>(marks));
    draw(head + '[' + std::string(filled, '#') + std::string(marks - filled, '.') + ']' + tail);
}

void ProgressBar::write(double done, std::string const& what)
{
    std::fputs(fmt::format("zsi: progress {:.4f} {}\n", done, what).c_str(), stderr);
}

void ProgressBar::draw(std::string const& line)
{
    std::fputs(('\r' + line.substr(0, columns()) + "\033[K").c_str(), stderr);
    std::fflush(stderr);
    drawn_ = true;
}

} // namespace zsi::cmd
