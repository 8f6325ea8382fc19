// SPDX-License-Identifier: Apache-2.0
/// Sums of samples that do not depend on the order of adding.
#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>

namespace zsi::host {

/// A 96-bit fixed-point number in units of 2^-48. Each float is rounded to it once; adding is then
/// exact, so that however a picture's samples are divided among threads, runs or machines, the sums
/// have the same bits. Values beyond 2^40 count as 2^40, about 1e12; a sum holds 2^47.
class ExactSum {
public:
    void add(float value)
    {
        constexpr double kLargest = 0x1p40, kUnits = 0x1p48;
        set(wide()
            + static_cast<__int128>(std::clamp(static_cast<double>(value), -kLargest, kLargest)
                                    * kUnits));
    }
    void add(ExactSum const& other) { set(wide() + other.wide()); }

    double value() const { return static_cast<double>(wide()) * 0x1p-48; }

    /// The number in three words, the lowest first, for files.
    std::uint32_t word(int i) const
    {
        return i == 0 ? low_ : static_cast<std::uint32_t>(high_ >> (32 * (i - 1)));
    }
    static ExactSum fromWords(std::uint32_t low, std::uint32_t middle, std::uint32_t high)
    {
        ExactSum sum;
        sum.low_ = low;
        sum.setHigh(static_cast<std::int64_t>((static_cast<std::uint64_t>(high) << 32) | middle));
        return sum;
    }
    bool operator==(ExactSum const&) const = default;

private:
    __int128 wide() const { return (static_cast<__int128>(high()) << 32) | low_; }
    void set(__int128 sum)
    {
        constexpr __int128 kMost = (static_cast<__int128>(1) << 95) - 1;
        sum = std::clamp(sum, -kMost, kMost);
        low_ = static_cast<std::uint32_t>(sum);
        setHigh(static_cast<std::int64_t>(sum >> 32));
    }
    std::int64_t high() const { return high_; }
    void setHigh(std::int64_t value) { high_ = value; }

    std::uint32_t low_ = 0;
    std::int64_t high_ __attribute__((packed)) = 0; // twelve bytes, not sixteen
};
static_assert(sizeof(ExactSum) == 12);

} // namespace zsi::host
