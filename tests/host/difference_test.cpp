// SPDX-License-Identifier: Apache-2.0
// Differences of pictures as numbers.
#include "view/difference.h"

#include <cmath>
#include <gtest/gtest.h>
#include <numeric>

namespace {

using zsi::view::ShownPicture;

constexpr int kSide = 80;

/// Grey of 8 bits by `value(x, y)`.
template <class Value>
ShownPicture grey(Value&& value)
{
    ShownPicture picture{kSide, kSide, {}};
    for (int y = 0; y < kSide; ++y)
        for (int x = 0; x < kSide; ++x) {
            auto const v = static_cast<std::uint8_t>(value(x, y));
            picture.rgba.insert(picture.rgba.end(), {v, v, v, 255});
        }
    return picture;
}

double meanFlip(ShownPicture const& a, ShownPicture const& b, double pixelsPerDegree = 67.0206)
{
    auto const flip = zsi::view::flipDifference(a, b, pixelsPerDegree);
    return std::accumulate(flip.begin(), flip.end(), 0.0) / static_cast<double>(flip.size());
}

// Of pictures of one colour there are no edges, and the filter of the eye changes nothing.
// Black against white: L* differs by 100; green against blue, the most, by hand:
// (87.735, -86.183, 83.179) and (32.297, 79.187, -107.860), chroma times 0.01 L*, city block and
// distance 203.3. So 100^0.7 = 25.12 of 41.28, beyond the knee at 16.51:
// 0.95 + 0.05 (25.12 - 16.51) / (41.28 - 16.51) = 0.9674.
// sRGB 119 against 120: L* 50.034 and 50.431, below the knee: 0.397^0.7 0.95 / 16.51 = 0.0302.
TEST(Difference, FlipOfEvenPicturesIsThatOfTheirColours)
{
    auto const even = [](int value) { return grey([=](int, int) { return value; }); };
    EXPECT_NEAR(meanFlip(even(0), even(255)), 0.9674, 1e-3);
    EXPECT_NEAR(meanFlip(even(119), even(120)), 0.0302, 5e-4);
    EXPECT_EQ(meanFlip(even(7), even(7)), 0);
}

// A board of black and white pixels against its mean (linear 0.5 is sRGB 188): from afar nobody
// tells them apart, from near everybody does. A displaced edge counts for more than its colours
// alone.
TEST(Difference, FlipSeesWhatTheEyeResolves)
{
    ShownPicture const board = grey([](int x, int y) { return (x + y) % 2 ? 255 : 0; });
    ShownPicture const mean = grey([](int, int) { return 188; });
    constexpr std::size_t kCentre =
        (kSide / 2) * kSide + kSide / 2; // farther from borders than filters reach
    EXPECT_LT(zsi::view::flipDifference(board, mean, 200)[kCentre], 0.03f);
    EXPECT_GT(zsi::view::flipDifference(board, mean, 15)[kCentre], 0.3f);
    auto const stepAt = [](int at) { return grey([=](int x, int) { return x < at ? 100 : 130; }); };
    auto const flip = zsi::view::flipDifference(stepAt(20), stepAt(22));
    auto const at = [&](int x) { return flip[static_cast<std::size_t>(24 * kSide + x)]; };
    EXPECT_GT(at(21), 0.1f); // 11.6 of L* at most, which are 0.32 without the filter
    EXPECT_LT(at(44), 0.01f);
}

TEST(Difference, LinearLeavesAlphaOut)
{
    auto const difference =
        zsi::view::linearDifference({0, 0, 0, 1, 1, 2, 3, 0}, {0, 3, 0, 0, 1, 2, 3, 1});
    EXPECT_DOUBLE_EQ(difference.rmse, std::sqrt(9.0 / 6.0));
    EXPECT_DOUBLE_EQ(difference.largest, 3.0);
}

} // namespace
