// SPDX-License-Identifier: Apache-2.0
#include "sampling/pixelFilter.h"

#include <cmath>
#include <vector>

namespace zsi::host {
namespace {

/// Four-term window over [0, 1] (Harris 1978).
double window(double x)
{
    double const t = 2.0 * 3.14159265358979 * x;
    return 0.35875 - 0.48829 * std::cos(t) + 0.14128 * std::cos(2 * t) - 0.01168 * std::cos(3 * t);
}

} // namespace

PixelFilter::PixelFilter()
{
    constexpr int kFine = 4096;
    std::vector<double> sum(kFine + 1, 0.0);
    for (std::size_t i = 0; i < kFine; ++i)
        sum[i + 1] = sum[i] + window((static_cast<double>(i) + 0.5) / kFine);
    std::size_t at = 0;
    for (std::size_t i = 0; i <= kSteps; ++i) {
        double const goal = sum[kFine] * static_cast<double>(i) / kSteps;
        while (at + 1 < kFine && sum[at + 1] < goal)
            ++at;
        double const part = (goal - sum[at]) / (sum[at + 1] - sum[at]);
        double const x = (static_cast<double>(at) + part) / kFine;
        inverse_[i] = static_cast<float>((2.0 * x - 1.0) * static_cast<double>(kRadius));
    }
}

float PixelFilter::offset(float u) const
{
    float const x = u * static_cast<float>(kSteps);
    int const i = static_cast<int>(x);
    auto const at = static_cast<std::size_t>(i < kSteps ? i : kSteps - 1);
    return inverse_[at] + (inverse_[at + 1] - inverse_[at]) * (x - static_cast<float>(at));
}

} // namespace zsi::host
