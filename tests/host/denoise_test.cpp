// SPDX-License-Identifier: Apache-2.0
#include "denoise/denoise.h"
#include "support/inputError.h"

#include <cmath>
#include <gtest/gtest.h>
#include <random>

namespace zsi::host {
namespace {

constexpr int kWidth = 72, kHeight = 40, kEdge = 37;

/// Two albedos that meet in an edge, under light that falls off smoothly.
float albedoAt(int x) { return x < kEdge ? 0.2f : 0.8f; }
float truth(int x, int y)
{
    return albedoAt(x) * (1.0f + 0.5f * std::sin(0.05f * static_cast<float>(x + y)));
}

std::array<Picture, 2> noisyHalves(float deviation)
{
    std::mt19937 random(7);
    std::normal_distribution<float> noise(0.0f, deviation);
    std::array<Picture, 2> halves;
    for (Picture& half : halves) {
        half = {kWidth,
                kHeight,
                {0, 0, kWidth, kHeight},
                {{"beauty", {"R", "G", "B", "A"}, {}},
                 {"albedo", {"R", "G", "B"}, {}},
                 {"normal", {"X", "Y", "Z"}, {}},
                 {"depth", {"Z"}, {}}}};
        for (int y = 0; y < kHeight; ++y)
            for (int x = 0; x < kWidth; ++x) {
                for (float share : {1.0f, 0.7f, 0.4f})
                    half.layers[0].values.push_back(share * truth(x, y) + noise(random));
                half.layers[0].values.push_back(1.0f);
                half.layers[1].values.insert(half.layers[1].values.end(), 3, albedoAt(x));
                half.layers[2].values.insert(half.layers[2].values.end(), {0, 0, 1});
                half.layers[3].values.push_back(5.0f);
            }
    }
    return halves;
}

std::size_t redOf(int x, int y) { return static_cast<std::size_t>(y * kWidth + x) * 4; }

double meanOf(std::vector<float> const& rgba)
{
    double sum = 0;
    for (std::size_t i = 0; i < rgba.size(); ++i)
        sum += i % 4 < 3 ? static_cast<double>(rgba[i]) : 0.0;
    return sum / static_cast<double>(rgba.size() / 4 * 3);
}

TEST(Denoise, TakesNoiseAndLeavesEdgesAndTheMean)
{
    std::array<Picture, 2> halves = noisyHalves(0.2f);
    std::vector<float> noisy = halves[0].rgba();
    for (std::size_t i = 0; i < noisy.size(); ++i)
        noisy[i] = 0.5f * (noisy[i] + halves[1].rgba()[i]);
    std::vector<float> const clean = denoised(halves)->values;
    double before = 0, after = 0, left = 0, right = 0;
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) {
            double const error = static_cast<double>(clean[redOf(x, y)] - truth(x, y));
            after += error * error;
            before += std::pow(static_cast<double>(noisy[redOf(x, y)] - truth(x, y)), 2);
            left += x == kEdge - 1 ? error / kHeight : 0;
            right += x == kEdge ? error / kHeight : 0;
        }
    // A window has 361 pixels and the plane 8 unknowns, of which these features make 2 count.
    EXPECT_GT(before / after, 20);
    // A twentieth of the step. Without the place among the features the slope of the light alone
    // is 0.05 on the right.
    EXPECT_NEAR(left, 0, 0.03);
    EXPECT_NEAR(right, 0, 0.03);
    EXPECT_NEAR(meanOf(clean) / meanOf(noisy), 1, 0.005);
    EXPECT_EQ(clean[redOf(3, 3) + 3], 1.0f) << "opaque";

    // Rounding and the order of sums do not depend on who works; nor does a cancelled call end in
    // half a picture.
    EXPECT_EQ(denoised(halves, {.threads = 1})->values, denoised(halves, {.threads = 3})->values);
    std::atomic<bool> const stop{true};
    EXPECT_FALSE(denoised(halves, {.cancel = &stop}));

    // A single bright sample is spread, not lost and not left alone.
    halves[0].layers[0].values[redOf(20, 20)] += 60.0f;
    std::vector<float> const spread = denoised(halves)->values;
    EXPECT_LT(spread[redOf(20, 20)], 1.0f);
    EXPECT_NEAR(meanOf(spread) - meanOf(clean), 30.0 / (3 * kWidth * kHeight), 0.001);
}

TEST(Denoise, SaysWhichLayerIsMissing)
{
    for (std::size_t layer = 0; layer < 4; ++layer) {
        std::array<Picture, 2> halves = noisyHalves(0.1f);
        std::string const name = halves[1].layers[layer].name;
        halves[1].layers.erase(halves[1].layers.begin() + static_cast<std::ptrdiff_t>(layer));
        test::expectContains(test::errorOf([&] { denoised(halves); }), {name, "missing"});
    }
    Picture whole = noisyHalves(0.1f)[0];
    test::expectContains(test::errorOf([&] { denoised(whole); }), {"halfA", "halves"});
}

} // namespace
} // namespace zsi::host
