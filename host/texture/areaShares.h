// SPDX-License-Identifier: Apache-2.0
/// Resampling by area: which cells of one even division lie in which of another.
#pragma once

#include <algorithm>
#include <cstddef>

namespace zsi::host {

/// Of one length cut into `from` cells, and into `to`: calls f(cell, share) for each of the latter
/// that cell `i` of the former touches, in order, with the share of it that lies in `i`.
template <class F>
void forAreaShares(std::size_t i, std::size_t from, std::size_t to, F&& f)
{
    std::size_t const begin = i * to, end = begin + to; // in parts, `from` of which are one cell
    for (std::size_t cell = begin / from; cell * from < end; ++cell) {
        std::size_t const shared = std::min(end, (cell + 1) * from) - std::max(begin, cell * from);
        f(cell, static_cast<float>(shared) / static_cast<float>(from));
    }
}

/// Whether cell `i` is the last that touches `cell`.
constexpr bool endsArea(std::size_t cell, std::size_t i, std::size_t from, std::size_t to)
{
    return (cell + 1) * from <= (i + 1) * to;
}

} // namespace zsi::host
