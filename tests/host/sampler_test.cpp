// SPDX-License-Identifier: Apache-2.0
#include "sampling/pixelFilter.h"
#include "sampling/sampler.h"

#include <cmath>
#include <functional>
#include <gtest/gtest.h>
#include <set>
#include <vector>

using namespace zsi;
using host::Sampler;

namespace {

// Of the first 2^k samples of each pixel in an aligned block of 2^m x 2^m, each box of any shape of
// area 2^-(k + 2m) holds exactly one point of a pair of dimensions.
TEST(Sampler, PairsAreNetsOverSamplesAndPixels)
{
    struct Block {
        int x, y, m, k;
    };
    for (Block const block : {Block{17, 5, 0, 8}, Block{6, 2, 1, 0}, Block{6, 2, 1, 5},
                              Block{8, 12, 2, 0}, Block{8, 12, 2, 3}, Block{64, 32, 4, 2}}) {
        int const size = 1 << block.m, bits = block.k + 2 * block.m, n = 1 << bits;
        for (int dimension = 0; dimension < 5; ++dimension) {
            std::vector<Vec2f> points;
            for (int pixel = 0; pixel < size * size; ++pixel) {
                Sampler sampler(3, block.x + pixel % size, block.y + pixel / size);
                for (int i = 0; i < 1 << block.k; ++i) {
                    sampler.start(static_cast<std::uint32_t>(i));
                    for (int d = 0; d < dimension; ++d)
                        sampler.next2D();
                    points.push_back(sampler.next2D());
                }
            }
            for (int split = 0; split <= bits; ++split) {
                std::set<std::pair<int, int>> boxes;
                for (Vec2f const p : points)
                    boxes.emplace(static_cast<int>(p.x * static_cast<float>(1 << split)),
                                  static_cast<int>(p.y * static_cast<float>(1 << (bits - split))));
                EXPECT_EQ(boxes.size(), static_cast<std::size_t>(n))
                    << block.m << ' ' << block.k << ' ' << dimension << ' ' << split;
            }
        }
    }
}

// A query of several points per sample is stratified over all samples together.
TEST(Sampler, PointsOfAQueryAreStratifiedOverSamples)
{
    int const samples = 64, count = 4, n = samples * count;
    Sampler sampler(1, 0, 0);
    std::set<int> strata;
    std::set<float> lines;
    for (int s = 0; s < samples; ++s) {
        sampler.start(static_cast<std::uint32_t>(s));
        lines.insert(std::floor(sampler.next() * static_cast<float>(samples)));
        Sampler::Points const points = sampler.next2D(count);
        for (int i = 0; i < count; ++i)
            strata.insert(static_cast<int>(points[i].x * static_cast<float>(n)));
    }
    EXPECT_EQ(strata.size(), static_cast<std::size_t>(n));
    EXPECT_EQ(lines.size(), static_cast<std::size_t>(samples));
}

// Dimensions and seeds are unrelated, and so are pixels where they do not share points: products of
// centred numbers average to 0.
TEST(Sampler, DimensionsPixelsAndSeedsAreUnrelated)
{
    struct Case {
        char const* why;
        std::function<double(int)> product;
    };
    constexpr int kLate = Sampler::kShared;
    auto const draw = [](std::uint32_t seed, int x, int y, int skip) {
        Sampler sampler(seed, x, y);
        sampler.start(0);
        for (int i = 0; i < skip; ++i)
            sampler.next();
        return static_cast<double>(sampler.next()) - 0.5;
    };
    Case const cases[] = {
        {"dimensions", [&](int i) { return draw(1, i, 0, 0) * draw(1, i, 0, 1); }},
        {"late dimensions", [&](int i) { return draw(1, i, 0, 7) * draw(1, i, 0, kLate); }},
        {"neighbours", [&](int i) { return draw(1, i, 7, kLate) * draw(1, i + 1, 7, kLate); }},
        {"transposed", [&](int i) { return draw(1, i, 9999, 2) * draw(1, 9999, i, 2); }},
        {"seeds", [&](int i) { return draw(1, i, 3, 0) * draw(2, i, 3, 0); }},
    };
    int const n = 4000;
    for (Case const& c : cases) {
        double sum = 0;
        for (int i = 0; i < n; ++i)
            sum += c.product(i);
        EXPECT_LT(std::fabs(sum / n), 4.0 / 12 / std::sqrt(n)) << c.why; // variance of each: 1/12
    }
}

// The sampled offsets have the moments of a four-term window of radius 1.5: mean 0, and a variance
// from the integral of x^2 cos(k pi x) over [-1, 1], which is 4 (-1)^k / (k pi)^2.
TEST(PixelFilter, SamplesFollowTheWindow)
{
    double const a[] = {0.35875, 0.48829, 0.14128, 0.01168}, pi = 3.14159265358979;
    double const want =
        1.5 * 1.5 * (1.0 / 3 + 2 / (pi * pi * a[0]) * (-a[1] + a[2] / 4 - a[3] / 9));

    host::PixelFilter const filter;
    double mean = 0, variance = 0;
    int const n = 4096;
    for (int i = 0; i < n; ++i) {
        float const u = (static_cast<float>(i) + 0.5f) / static_cast<float>(n);
        Vec2f const o = filter.offset({u, 1.0f - u});
        EXPECT_NEAR(o.x, -o.y, 2e-3f); // symmetric
        mean += static_cast<double>(o.x) / n;
        variance += static_cast<double>(o.x) * static_cast<double>(o.x) / n;
    }
    EXPECT_NEAR(mean, 0, 1e-4);
    EXPECT_NEAR(variance, want, 0.005 * want);
    for (float const u : {0.0f, 0.99999994f})
        EXPECT_LE(std::fabs(filter.offset({u, u}).x), 1.5f);
}

} // namespace
