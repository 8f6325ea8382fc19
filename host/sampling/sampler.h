// SPDX-License-Identifier: Apache-2.0
/// Random numbers of one pixel: low-discrepancy over its samples, fixed by seed and position.
#pragma once

#include <cstdint>
#include <zsi/types.h>

namespace zsi::host {

/// Owen-scrambled Sobol points, one independently shuffled and scrambled set per dimension pair.
/// Burley 2020, "Practical Hash-based Owen Scrambling". The first 2^k samples of any pair of
/// dimensions that is drawn together are a (0, k, 2)-net.
class Sampler {
public:
    /// A set of points that one query draws at once; stratified over all samples of the pixel.
    class Points {
    public:
        Points(std::uint32_t seed, std::uint32_t first)
            : seed_(seed)
            , first_(first)
        {
        }
        Vec2f operator[](int i) const; ///< i below the count that the set was asked for

    private:
        std::uint32_t seed_;
        std::uint32_t first_;
    };

    Sampler(std::uint32_t seed, int x, int y);

    /// Begins sample `index` of the pixel; the dimensions start again.
    void start(std::uint32_t index);

    float next(); ///< in [0, 1)
    Vec2f next2D(); ///< two numbers in [0, 1)
    Points next2D(int count);

private:
    std::uint32_t nextSeed();

    std::uint32_t pixelSeed_;
    std::uint32_t index_ = 0;
    std::uint32_t dimension_ = 0;
};

} // namespace zsi::host
