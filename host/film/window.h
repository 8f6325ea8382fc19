// SPDX-License-Identifier: Apache-2.0
/// A rectangle of pixels.
#pragma once

#include <algorithm>

namespace zsi::host {

/// Pixels from (x0, y0) to before (x1, y1); y runs downwards.
struct Window {
    int x0 = 0, y0 = 0, x1 = 0, y1 = 0;

    int width() const { return std::max(0, x1 - x0); }
    int height() const { return std::max(0, y1 - y0); }
    bool contains(int x, int y) const { return x >= x0 && x < x1 && y >= y0 && y < y1; }
    bool operator==(Window const&) const = default;
};

inline Window intersection(Window const& a, Window const& b)
{
    return {std::max(a.x0, b.x0), std::max(a.y0, b.y0), std::min(a.x1, b.x1), std::min(a.y1, b.y1)};
}

} // namespace zsi::host
