#include "cmd/progressBar.h"

#include <cmath>
#include <cstdio>
#include <fmt/format.h>
#include <unistd.h>

namespace zsi::cmd {
namespace {

constexpr int kWidth = 40;

std::string clockText(double seconds)
{
    auto const s = static_cast<long>(std::ceil(seconds));
    return s < 3600 ? fmt::format("{}:{:02}", s / 60, s % 60)
                    : fmt::format("{}:{:02}:{:02}", s / 3600, s / 60 % 60, s % 60);
}

} // namespace

ProgressBar::ProgressBar()
    : terminal_(isatty(STDERR_FILENO) == 1)
    , begin_(Clock::now())
    , next_(begin_)
{
}

ProgressBar::~ProgressBar()
{
    if (drawn_)
        std::fputs("\r\033[K", stderr);
}

void ProgressBar::show(double done)
{
    auto const now = Clock::now();
    if (!terminal_ || now < next_ || !(done > 0.0))
        return;
    next_ = now + std::chrono::milliseconds(200);
    double const elapsed = std::chrono::duration<double>(now - begin_).count();
    int const filled = static_cast<int>(done * kWidth);
    std::string const line =
        fmt::format("\r[{:#<{}}{:.<{}}] {:3.0f}%  {} left\033[K", "", filled, "", kWidth - filled,
                    std::floor(done * 100.0), clockText(elapsed * (1.0 - done) / done));
    std::fputs(line.c_str(), stderr);
    std::fflush(stderr);
    drawn_ = true;
}

} // namespace zsi::cmd
