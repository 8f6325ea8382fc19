// SPDX-License-Identifier: Apache-2.0
#include "lab/ticks.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <limits>

namespace zsi::lab {
namespace {

/// 1, 2 or 5 times a power of ten that divides `range` into about `count` parts.
double niceStep(double range, int count)
{
    double const rough = range / count;
    double const power = std::pow(10.0, std::floor(std::log10(rough)));
    double const share = rough / power;
    return power * (share < 1.5 ? 1 : share < 3 ? 2 : share < 7 ? 5 : 10);
}

} // namespace

Axis fitted(Axis axis, std::vector<double> const& values, int decades)
{
    if (axis.isSet())
        return axis;
    double least = std::numeric_limits<double>::infinity(), most = -least;
    for (double const v : values)
        if (std::isfinite(v) && (v > 0 || !axis.logarithmic)) {
            least = std::min(least, v);
            most = std::max(most, v);
        }
    if (!(least <= most))
        least = axis.logarithmic ? 0.1 : 0, most = 1;
    if (axis.logarithmic) {
        double const top = std::ceil(std::log10(most) - 1e-9);
        double const bottom = std::floor(std::log10(least) + 1e-9);
        axis.to = std::pow(10.0, top);
        axis.from = std::pow(10.0, std::max(std::min(bottom, top - 1), top - decades));
        return axis;
    }
    least = std::min(least, 0.0);
    if (!(most > least))
        most = least + 1;
    double const step = niceStep(most - least, 5);
    axis.from = std::floor(least / step + 1e-9) * step;
    axis.to = std::ceil(most / step - 1e-9) * step;
    return axis;
}

std::vector<double> ticksOf(Axis const& axis, int count)
{
    std::vector<double> ticks;
    if (axis.logarithmic) {
        int const first = static_cast<int>(std::ceil(std::log10(axis.from) - 1e-9));
        int const last = static_cast<int>(std::floor(std::log10(axis.to) + 1e-9));
        int const step = std::max(1, (last - first + count - 1) / count);
        for (int e = first; e <= last; e += step)
            ticks.push_back(std::pow(10.0, e));
        return ticks;
    }
    double const step = axis.step > 0 ? axis.step : niceStep(axis.to - axis.from, count);
    auto const last = static_cast<long>(std::floor(axis.to / step + 1e-6));
    for (auto i = static_cast<long>(std::ceil(axis.from / step - 1e-6)); i <= last; ++i)
        ticks.push_back(static_cast<double>(i) * step);
    return ticks;
}

double placeOn(Axis const& axis, double value)
{
    if (axis.logarithmic)
        return std::log(value / axis.from) / std::log(axis.to / axis.from);
    return (value - axis.from) / (axis.to - axis.from);
}

std::string numberText(double value)
{
    constexpr char const* kRaised[] = {"⁰", "¹", "²", "³", "⁴", "⁵", "⁶", "⁷", "⁸", "⁹"};
    double const size = std::fabs(value);
    std::string text = value < 0 ? "\u2212" : "";
    if (size == 0 || (size >= 0.9e-3 && size < 0.9e5)) {
        text += fmt::format("{:.6g}", size);
        return text;
    }
    auto const exponent = static_cast<int>(std::floor(std::log10(size) + 1e-9));
    double const mantissa = size / std::pow(10.0, exponent);
    if (std::fabs(mantissa - 1) > 1e-6)
        text += fmt::format("{:.3g}·", mantissa);
    text += "10";
    if (exponent < 0)
        text += "⁻";
    for (char const digit : std::to_string(std::abs(exponent)))
        text += kRaised[digit - '0'];
    return text;
}

} // namespace zsi::lab
