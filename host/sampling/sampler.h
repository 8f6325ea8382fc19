// SPDX-License-Identifier: Apache-2.0
/// Random numbers of one pixel: low-discrepancy over its samples, fixed by seed and position.
#pragma once

#include <array>
#include <cstdint>
#include <zsi/types.h>

namespace zsi::host {

/// Owen-scrambled Sobol points, one independently shuffled and scrambled set per dimension pair.
/// Burley 2020, "Practical Hash-based Owen Scrambling". The first 2^k samples of any pair of
/// dimensions that is drawn together are a (0, k, 2)-net.
///
/// In the first `kShared` pairs neighbouring pixels divide the points among them: those of an
/// aligned block of 2^m x 2^m pixels are together a (0, k + 2m, 2)-net, for every k and m. Where
/// one pixel errs its neighbours err the other way, so that the noise of the picture is of high
/// frequency: what Ahmed and Wonka 2020 ("Screen-Space Blue-Noise Diffusion of Monte Carlo Sampling
/// Error via Hierarchical Ordering of Pixels") reach for a number of samples that is known
/// beforehand, whenever rendering stops. sampler.cpp tells how.
class Sampler {
    /// What sets the points of one dimension pair apart.
    struct Pair {
        std::uint32_t shuffle, scrambleX, scrambleY; ///< seeds
        std::uint32_t pixelX, pixelY; ///< digits that the pixel adds to those of its samples
    };

public:
    /// Pairs of numbers that pixels share; later ones decide about little.
    static constexpr std::uint32_t kShared = 16;

    /// A set of points that one query draws at once; stratified over all samples of the pixel.
    class Points {
    public:
        Vec2f operator[](int i) const; ///< i below the count that the set was asked for

    private:
        friend Sampler;
        Points(Pair const& pair, std::uint32_t first)
            : pair_(pair)
            , first_(first)
        {
        }

        Pair pair_;
        std::uint32_t first_;
    };

    Sampler(std::uint32_t seed, int x, int y);

    /// Begins sample `index` of the pixel; the dimensions start again.
    void start(std::uint32_t index);

    float next(); ///< in [0, 1)
    Vec2f next2D(); ///< two numbers in [0, 1)
    Points next2D(int count);

private:
    Pair nextPair();

    std::uint32_t seed_;
    std::uint32_t pixelSeed_;
    std::uint32_t pixel_; ///< its place on the Z curve of the picture
    std::uint32_t index_ = 0;
    std::uint32_t dimension_ = 0;
    std::uint32_t known_ = 0; ///< of `shared_`
    std::array<Pair, kShared> shared_; ///< made when they are first drawn
};

} // namespace zsi::host
