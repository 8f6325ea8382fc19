#include "integrate/noise.h"

#include <cmath>
#include <functional>
#include <gtest/gtest.h>
#include <limits>
#include <random>
#include <vector>

using namespace zsi;

namespace {

struct Noise {
    char const* name;
    int dimensions;
    float low, high;
    std::function<float(Vec4f)> at;
};

std::vector<Noise> const kNoises = {
    {"2D", 2, 0, 1,
     [](Vec4f p) {
         return host::noise2D({p.x, p.y});
     }},
    {"signed 3D", 3, -1, 1,
     [](Vec4f p) {
         return host::signedNoise3D({p.x, p.y, p.z});
     }},
    {"3D", 3, 0, 1,
     [](Vec4f p) {
         return host::noise3D({p.x, p.y, p.z});
     }},
    {"4D", 4, 0, 1, [](Vec4f p) { return host::noise4D(p); }},
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
        double const range = static_cast<double>(noise.high - noise.low);
        double const mean = sum / n, deviation = std::sqrt(squares / n - mean * mean);
        EXPECT_GE(low, noise.low) << noise.name;
        EXPECT_LE(high, noise.high) << noise.name;
        // Four standard errors of a mean of independent values, which distant points are.
        double const middle = 0.5 * static_cast<double>(noise.low + noise.high);
        EXPECT_NEAR(mean, middle, 4 * deviation / std::sqrt(n)) << noise.name;
        EXPECT_GT(deviation, 0.1 * range) << noise.name << ": flat";
        EXPECT_GT(static_cast<double>(high - low), 0.8 * range) << noise.name;
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
            double xy = 0, xx = 0, yy = 0;
            double const middle = 0.5 * static_cast<double>(noise.low + noise.high);
            int const n = 4000;
            for (int i = 0; i < n; ++i) {
                Vec4f const p = points.next();
                double const x = static_cast<double>(noise.at(p)) - middle;
                Vec4f const q{p.x + period, p.y, p.z, p.w};
                double const y = static_cast<double>(noise.at(q)) - middle;
                xy += x * y, xx += x * x, yy += y * y;
            }
            EXPECT_LT(std::fabs(xy) / std::sqrt(xx * yy), 5 / std::sqrt(n))
                << noise.name << ' ' << period;
        }
}

TEST(Noise, StableAnywhere)
{
    float const inf = std::numeric_limits<float>::infinity();
    for (Noise const& noise : kNoises)
        for (float const c :
             {0.0f, -0.0f, -1e-30f, 1e-30f, 3e9f, -3e9f, 1e30f, -1e30f, inf, -inf, std::nanf("")}) {
            float const v = noise.at({c, c, c, c});
            EXPECT_TRUE(v >= noise.low && v <= noise.high) << noise.name << ' ' << c << ' ' << v;
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
        Vec3f const a{p.x, p.y, p.z};
        Vec3f const v = host::cellNoise3D(a);
        EXPECT_TRUE(v == host::cellNoise3D(cell));
        float const line = host::cellNoise1D(p.x);
        EXPECT_EQ(line, host::cellNoise1D(cell.x));
        EXPECT_NE(line, host::cellNoise1D(cell.x + 1));
        int c = 0;
        for (float const x : {v.x, v.y, v.z}) {
            ASSERT_TRUE(x >= 0.0f && x < 1.0f);
            mean[c++] += static_cast<double>(x) / n;
        }
        // The three numbers of a cell are unrelated.
        mean[3] += static_cast<double>((v.x - 0.5f) * (v.y - 0.5f)) / n;
    }
    for (int c = 0; c < 3; ++c) // standard deviation of a uniform number: sqrt(1/12)
        EXPECT_NEAR(mean[c], 0.5, 4 * std::sqrt(1.0 / 12 / n));
    EXPECT_NEAR(mean[3], 0.0, 4.0 / 12 / std::sqrt(n));
}

} // namespace
