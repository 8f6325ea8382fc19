// SPDX-License-Identifier: Apache-2.0
/// What threads spend their time with, by looking now and then.
#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <stop_token>
#include <thread>

namespace zsi::host {

enum class Activity : unsigned char { Shading, Tracing, Textures };
inline constexpr std::size_t kActivities = 3;

/// While one lives, its thread does what it says. Costs two stores.
class Doing {
public:
    explicit Doing(Activity what)
        : before_(current.load(std::memory_order_relaxed))
    {
        current.store(what, std::memory_order_relaxed);
    }
    ~Doing() { current.store(before_, std::memory_order_relaxed); }
    Doing(Doing const&) = delete;
    Doing& operator=(Doing const&) = delete;

    static thread_local constinit std::atomic<Activity> current;

private:
    Activity before_;
};

/// While one lives, its thread's activity is looked at: that of a thread which renders.
class WatchedThread {
public:
    WatchedThread();
    ~WatchedThread();
    WatchedThread(WatchedThread const&) = delete;
    WatchedThread& operator=(WatchedThread const&) = delete;
};

/// While one lives, looks at all watched threads a thousand times a second.
class ActivitySampler {
public:
    ActivitySampler();
    /// How often a watched thread was seen at each activity.
    std::array<std::uint64_t, kActivities> counts() const;

private:
    std::array<std::atomic<std::uint64_t>, kActivities> counts_{};
    std::jthread thread_; // last: ends before the rest goes
};

} // namespace zsi::host
