// SPDX-License-Identifier: Apache-2.0
#include "base/activity.h"

#include <algorithm>
#include <chrono>
#include <mutex>
#include <vector>

namespace zsi::host {
namespace {

struct Watched {
    std::mutex lock;
    std::vector<std::atomic<Activity> const*> threads;
};

Watched& watched()
{
    static Watched all;
    return all;
}

} // namespace

thread_local constinit std::atomic<Activity> Doing::current{Activity::Shading};

WatchedThread::WatchedThread()
{
    std::lock_guard const guard(watched().lock);
    watched().threads.push_back(&Doing::current);
}

WatchedThread::~WatchedThread()
{
    std::lock_guard const guard(watched().lock);
    auto& threads = watched().threads;
    threads.erase(std::find(threads.begin(), threads.end(), &Doing::current));
}

ActivitySampler::ActivitySampler()
    : thread_([this](std::stop_token const& stop) {
        while (!stop.stop_requested()) {
            {
                std::lock_guard const guard(watched().lock);
                for (auto const* thread : watched().threads)
                    ++counts_[static_cast<std::size_t>(thread->load(std::memory_order_relaxed))];
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
    })
{
}

std::array<std::uint64_t, kActivities> ActivitySampler::counts() const
{
    std::array<std::uint64_t, kActivities> counts{};
    for (std::size_t i = 0; i < kActivities; ++i)
        counts[i] = counts_[i].load();
    return counts;
}

} // namespace zsi::host
