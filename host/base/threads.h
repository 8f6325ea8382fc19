// SPDX-License-Identifier: Apache-2.0
/// Work on several threads at once.
#pragma once

#include <functional>

namespace zsi::host {

/// Calls `work` on this thread and on `count` - 1 others, or on as many of those as the system
/// starts; count <= 0: one for each processor. Throws what the first one threw, after all are back.
void onThreads(int count, std::function<void()> const& work);

} // namespace zsi::host
