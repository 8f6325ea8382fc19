/// Ctrl-C while a picture is made.
#pragma once

#include <atomic>
#include <csignal>

namespace zsi::cmd {

/// While one lives, SIGINT and SIGTERM end the program with status 128 + signal, without leaving
/// anything half-written: at once where nothing is under way, at the next occasion in between
/// `defer` and the end; a second one at once in any case. A signal that was ignored before stays
/// so. One at a time.
class Interruption {
public:
    Interruption();
    ~Interruption();
    Interruption(Interruption const&) = delete;
    Interruption& operator=(Interruption const&) = delete;

    /// From now on a signal only sets the flag that this returns.
    std::atomic<bool> const& defer();
    /// 0 when there was no signal, else the exit status that it asks for.
    int status() const;

private:
    struct sigaction before_[2];
};

} // namespace zsi::cmd
