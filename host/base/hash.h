// SPDX-License-Identifier: Apache-2.0
/// Integer hashing for random sequences and noise.
#pragma once

#include <bit>
#include <cstdint>

namespace zsi::host {

/// A bijection of 32 bits with low bias (the "lowbias32" constants of C. Wellons, 2018).
constexpr std::uint32_t hash32(std::uint32_t x)
{
    x ^= x >> 16;
    x *= 0x7feb352du;
    x ^= x >> 15;
    x *= 0x846ca68bu;
    x ^= x >> 16;
    return x;
}

constexpr std::uint32_t hashCombine(std::uint32_t seed, std::uint32_t value)
{
    return hash32(seed ^ (value + 0x9e3779b9u + (seed << 6) + (seed >> 2)));
}

/// The top 24 bits as a float in [0, 1): every value is exact, 1 never comes out.
constexpr float toUnitFloat(std::uint32_t bits) { return static_cast<float>(bits >> 8) * 0x1p-24f; }

} // namespace zsi::host
