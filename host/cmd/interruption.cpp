#include "cmd/interruption.h"

#include <csignal>
#include <unistd.h>

namespace zsi::cmd {
namespace {

std::atomic<bool> deferred{false};
std::atomic<bool> requested{false};
std::atomic<int> received{0};
static_assert(std::atomic<bool>::is_always_lock_free && std::atomic<int>::is_always_lock_free);

void onSignal(int signal)
{
    if (!deferred)
        _exit(128 + signal);
    received = signal;
    requested = true;
}

constexpr int kSignals[] = {SIGINT, SIGTERM};

} // namespace

Interruption::Interruption()
{
    struct sigaction action = {};
    action.sa_handler = onSignal;
    action.sa_flags = SA_RESTART;
    for (int const signal : kSignals)
        sigaction(signal, &action, nullptr);
}

Interruption::~Interruption()
{
    for (int const signal : kSignals)
        std::signal(signal, SIG_DFL);
    deferred = requested = false;
    received = 0;
}

std::atomic<bool> const& Interruption::defer()
{
    deferred = true;
    return requested;
}

int Interruption::status() const { return received ? 128 + received : 0; }

} // namespace zsi::cmd
