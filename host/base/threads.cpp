// SPDX-License-Identifier: Apache-2.0
#include "base/threads.h"

#include <exception>
#include <mutex>
#include <system_error>
#include <thread>
#include <vector>

namespace zsi::host {

void onThreads(int count, std::function<void()> const& work)
{
    if (count <= 0)
        count = static_cast<int>(std::thread::hardware_concurrency());
    std::mutex lock;
    std::exception_ptr first;
    auto const guarded = [&]() noexcept {
        try {
            work();
        } catch (...) {
            std::lock_guard const guard(lock);
            if (!first)
                first = std::current_exception();
        }
    };
    {
        std::vector<std::jthread> others;
        try {
            for (int i = 1; i < count; ++i)
                others.emplace_back(guarded);
        } catch (std::system_error const&) { // no more to be had: these do
        } catch (std::bad_alloc const&) {
        }
        guarded();
    }
    if (first)
        std::rethrow_exception(first);
}

} // namespace zsi::host
