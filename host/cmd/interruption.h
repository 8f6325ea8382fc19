// SPDX-License-Identifier: Apache-2.0
/// Ctrl-C while a picture is made.
#pragma once

#include <atomic>
#include <csignal>

namespace zsi::cmd {

/// While one lives, SIGINT, SIGTERM and SIGHUP end the program with status 128 + signal, without
/// leaving anything half-written: at once, but between `defer` and `resume` at the next occasion,
/// at the latest after a second; a second one at once in any case. A signal that was ignored before
/// stays so. One at a time.
class Interruption {
public:
    Interruption();
    ~Interruption();
    Interruption(Interruption const&) = delete;
    Interruption& operator=(Interruption const&) = delete;

    /// From now on a signal only sets the flag that this returns.
    std::atomic<bool> const& defer();
    /// From now on a signal ends the program at once again. 0 when there was none meanwhile, else
    /// the exit status that it asks for.
    int resume();

private:
    struct sigaction before_[3];
};

} // namespace zsi::cmd
