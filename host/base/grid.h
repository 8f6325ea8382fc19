// SPDX-License-Identifier: Apache-2.0
/// Numbers of cells in rows one after another.
#pragma once

#include <cstddef>

namespace zsi::host {

constexpr std::size_t cellCount(int width, int height)
{
    return static_cast<std::size_t>(width) * static_cast<std::size_t>(height);
}

/// Of column x in row y of rows that are `width` long.
constexpr std::size_t cellIndex(int x, int y, int width)
{
    return cellCount(width, y) + static_cast<std::size_t>(x);
}

} // namespace zsi::host
