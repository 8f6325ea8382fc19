// SPDX-License-Identifier: Apache-2.0
#include "cmd/interruption.h"

#include "base/replacedFile.h"

#include <csignal>
#include <unistd.h>

namespace zsi::cmd {
namespace {

std::atomic<bool> deferred{false};
std::atomic<bool> requested{false};
std::atomic<int> received{0};
static_assert(std::atomic<bool>::is_always_lock_free && std::atomic<int>::is_always_lock_free);

[[noreturn]] void end(int signal)
{
    host::ReplacedFile::removeAll();
    _exit(128 + signal);
}

/// There was no occasion for a second: a single sample can take as long as a scene wants.
void onAlarm(int)
{
    constexpr char kMessage[] = "zsi: interrupted, no picture written\n";
    if (write(STDERR_FILENO, kMessage, sizeof(kMessage) - 1) < 0)
        end(received); // nowhere to tell it
    end(received);
}

void onSignal(int signal)
{
    if (!deferred || requested) // the second one ends the program where it stands
        end(signal);
    received = signal;
    requested = true;
    alarm(1);
}

constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP};

} // namespace

Interruption::Interruption()
{
    struct sigaction action = {};
    action.sa_handler = onSignal;
    action.sa_flags = SA_RESTART;
    std::signal(SIGALRM, onAlarm);
    for (std::size_t i = 0; i < std::size(kSignals); ++i) {
        sigaction(kSignals[i], nullptr, &before_[i]);
        // Whoever started the program with a signal ignored, as nohup does, has it stay so.
        if (before_[i].sa_handler != SIG_IGN)
            sigaction(kSignals[i], &action, nullptr);
    }
}

Interruption::~Interruption()
{
    for (std::size_t i = 0; i < std::size(kSignals); ++i)
        sigaction(kSignals[i], &before_[i], nullptr);
    deferred = requested = false;
    received = 0;
}

std::atomic<bool> const& Interruption::defer()
{
    deferred = true;
    return requested;
}

int Interruption::resume()
{
    deferred = false;
    alarm(0);
    return received ? 128 + received : 0;
}

} // namespace zsi::cmd
