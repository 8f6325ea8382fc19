// SPDX-License-Identifier: Apache-2.0
#include "shading/noise.h"

#include <cmath>
#include <functional>
#include <gtest/gtest.h>
#include <limits>
#include <random>
#include <vector>
#include <zsi/vecmath.h>

using namespace zsi;

namespace {

/// A noise, brought to [-1, 1].
struct Noise {
    char const* name;
    int dimensions;
    std::function<float(Vec4f)> at;
};

std::vector<Noise> const kNoises = {
    {"2D", 2, [](Vec4f p) { return 2 * host::noise2D(Vec2f(p.x, p.y)) - 1; }},
    {"signed 3D", 3, [](Vec4f p) { return host::signedNoise3D(rgb(p)); }},
    {"3D", 3, [](Vec4f p) { return 2 * host::noise3D(rgb(p)) - 1; }},
    {"4D", 4, [](Vec4f p) { return 2 * host::noise4D(p) - 1; }},
};

struct Points {
    std::mt19937 engine{7};
    std::uniform_real_distribution<float> spread{-300.0f, 300.0f};
    Vec4f next() { return {spread(engine), spread(engine), spread(engine), spread(engine)}; }
};

TEST(Noise, RangeMeanAndSpread)
{
    for (Noise const& noise : kNoises) {
        Points points;
        double sum = 0, squares = 0;
        float low = 1e9f, high = -1e9f;
        int const n = 200000;
        for (int i = 0; i < n; ++i) {
            float const v = noise.at(points.next());
            low = std::min(low, v);
            high = std::max(high, v);
            sum += static_cast<double>(v);
            squares += static_cast<double>(v) * static_cast<double>(v);
        }
        EXPECT_TRUE(low >= -1 && high <= 1 && high - low > 1.6f) << noise.name;
        // Four standard errors of a mean of independent values, which distant points are.
        double const deviation = std::sqrt(squares / n);
        EXPECT_NEAR(sum / n, 0, 4 * deviation / std::sqrt(n)) << noise.name;
        EXPECT_GT(deviation, 0.2) << noise.name << ": flat";
    }
}

// No jump and no kink at lattice planes: the second difference stays of second order.
TEST(Noise, SmoothAcrossLatticePlanes)
{
    float const h = 1.0f / 512;
    for (Noise const& noise : kNoises) {
        Points points;
        for (int i = 0; i < 2000; ++i) {
            Vec4f const p = points.next();
            Vec4f at[3] = {p, p, p};
            int const d = i % noise.dimensions;
            for (int k = 0; k < 3; ++k) {
                float& c = d == 0 ? at[k].x : d == 1 ? at[k].y : d == 2 ? at[k].z : at[k].w;
                c = std::floor(c) + static_cast<float>(k - 1) * h;
            }
            float const a = noise.at(at[0]), b = noise.at(at[1]), c = noise.at(at[2]);
            EXPECT_LT(std::fabs(b - a), 4 * h) << noise.name;
            EXPECT_LT(std::fabs(a - 2 * b + c), 40 * h * h) << noise.name;
        }
    }
}

// A hashed lattice has no period: values a period apart are unrelated. Correlation of n
// independent pairs has a standard deviation of 1/sqrt(n).
TEST(Noise, DoesNotRepeat)
{
    for (Noise const& noise : kNoises)
        for (float const period : {16.0f, 255.0f, 256.0f, 4096.0f}) {
            Points points;
            double xy = 0, xx = 0;
            int const n = 4000;
            for (int i = 0; i < n; ++i) {
                Vec4f const p = points.next();
                double const x = static_cast<double>(noise.at(p));
                double const y = static_cast<double>(noise.at({p.x + period, p.y, p.z, p.w}));
                xy += x * y, xx += x * x;
            }
            EXPECT_LT(std::fabs(xy) / xx, 5 / std::sqrt(n)) << noise.name << ' ' << period;
        }
}

TEST(Noise, StableAnywhere)
{
    float const inf = std::numeric_limits<float>::infinity();
    for (Noise const& noise : kNoises)
        for (float const c :
             {0.0f, -0.0f, -1e-30f, 1e-30f, 3e9f, -3e9f, 1e30f, -1e30f, inf, -inf, std::nanf("")}) {
            float const v = noise.at({c, c, c, c});
            EXPECT_TRUE(v >= -1 && v <= 1) << noise.name << ' ' << c << ' ' << v;
        }
}

TEST(CellNoise, ConstantInACellUniformOverCells)
{
    Points points;
    double mean[4] = {};
    int const n = 40000;
    for (int i = 0; i < n; ++i) {
        Vec4f const p = points.next();
        Vec3f const cell{std::floor(p.x), std::floor(p.y), std::floor(p.z)};
        Vec3f const v = host::cellNoise3D(rgb(p));
        EXPECT_TRUE(v == host::cellNoise3D(cell));
        EXPECT_EQ(host::cellNoise1D(p.x), host::cellNoise1D(cell.x));
        EXPECT_NE(host::cellNoise1D(p.x), host::cellNoise1D(cell.x + 1));
        ASSERT_TRUE(minComponent(v) >= 0 && maxComponent(v) < 1);
        mean[0] += static_cast<double>(v.x) / n;
        mean[1] += static_cast<double>(v.y) / n;
        mean[2] += static_cast<double>(v.z) / n;
        mean[3] += static_cast<double>((v.x - 0.5f) * (v.y - 0.5f)) / n; // two of a cell
    }
    for (int c = 0; c < 3; ++c) // standard deviation of a uniform number: sqrt(1/12)
        EXPECT_NEAR(mean[c], 0.5, 4 * std::sqrt(1.0 / 12 / n));
    EXPECT_NEAR(mean[3], 0.0, 4.0 / 12 / std::sqrt(n));
}

} // namespace
