// SPDX-License-Identifier: Apache-2.0
#include "view/difference.h"

#include "base/error.h"

#include <array>
#include <cmath>
#include <numbers>

// Numbers of sections and tables are those of the paper.
namespace zsi::view {
namespace {

using Plane = std::vector<double>;

struct Size {
    int width, height;
    std::size_t pixels() const
    {
        return static_cast<std::size_t>(width) * static_cast<std::size_t>(height);
    }
};

/// Weights from -radius to radius.
template <class Weight>
Plane kernel(int radius, Weight&& weight)
{
    Plane values;
    for (int i = -radius; i <= radius; ++i)
        values.push_back(weight(static_cast<double>(i)));
    return values;
}

double sumOf(Plane const& values, bool positiveOnly = false)
{
    double sum = 0;
    for (double const v : values)
        sum += positiveOnly && v < 0 ? 0 : v;
    return sum;
}

Plane scaled(Plane values, double by)
{
    for (double& v : values)
        v *= by;
    return values;
}

/// `across` along rows, then `down` along columns; edges go on as they end.
Plane filtered(Plane const& in, Size size, Plane const& across, Plane const& down)
{
    auto const pass = [&](Plane const& from, Plane const& k, bool rows) {
        int const radius = static_cast<int>(k.size() / 2);
        int const last = (rows ? size.width : size.height) - 1;
        Plane to(from.size());
        for (int y = 0; y < size.height; ++y)
            for (int x = 0; x < size.width; ++x) {
                double sum = 0;
                for (int i = 0; i <= 2 * radius; ++i) {
                    int const at = std::clamp((rows ? x : y) + i - radius, 0, last);
                    auto const row = static_cast<std::size_t>(rows ? y : at);
                    auto const column = static_cast<std::size_t>(rows ? at : x);
                    sum += k[static_cast<std::size_t>(i)]
                        * from[row * static_cast<std::size_t>(size.width) + column];
                }
                to[static_cast<std::size_t>(y) * static_cast<std::size_t>(size.width)
                   + static_cast<std::size_t>(x)] = sum;
            }
        return to;
    };
    return pass(pass(in, across, true), down, false);
}

using Color = std::array<double, 3>;
using Planes = std::array<Plane, 3>;

/// Linear Rec. 709 to CIE XYZ, relative to the white (1, 1, 1), and back.
constexpr std::array<Color, 3> kToXyz{{{0.4124564, 0.3575761, 0.1804375},
                                       {0.2126729, 0.7151522, 0.0721750},
                                       {0.0193339, 0.1191920, 0.9503041}}};
constexpr std::array<Color, 3> kFromXyz{{{3.2404542, -1.5371385, -0.4985314},
                                         {-0.9692660, 1.8760108, 0.0415560},
                                         {0.0556434, -0.2040259, 1.0572252}}};
constexpr Color kWhite{0.95047, 1.0, 1.08883};

Color times(std::array<Color, 3> const& m, Color const& c)
{
    Color r;
    for (std::size_t i = 0; i < 3; ++i)
        r[i] = m[i][0] * c[0] + m[i][1] * c[1] + m[i][2] * c[2];
    return r;
}

/// A linear opponent space, in which the eye's contrast sensitivity is known (4.1.1).
Color toOpponent(Color const& rgb)
{
    Color xyz = times(kToXyz, rgb);
    for (std::size_t i = 0; i < 3; ++i)
        xyz[i] /= kWhite[i];
    return {116 * xyz[1] - 16, 500 * (xyz[0] - xyz[1]), 200 * (xyz[1] - xyz[2])};
}

Color fromOpponent(Color const& c)
{
    double const y = (c[0] + 16) / 116;
    return times(kFromXyz,
                 {(y + c[1] / 500) * kWhite[0], y * kWhite[1], (y - c[2] / 200) * kWhite[2]});
}

/// CIE L*a*b* with the chroma of dark colours reduced (Hunt effect, 4.1.2).
Color toHuntLab(Color const& rgb)
{
    Color f = times(kToXyz, rgb);
    for (std::size_t i = 0; i < 3; ++i) {
        double const t = f[i] / kWhite[i];
        constexpr double kDelta = 6.0 / 29.0;
        f[i] = t > kDelta * kDelta * kDelta ? std::cbrt(t) : t / (3 * kDelta * kDelta) + 4.0 / 29.0;
    }
    double const lightness = 116 * f[1] - 16;
    double const chroma = 0.01 * lightness;
    return {lightness, 500 * (f[0] - f[1]) * chroma, 200 * (f[1] - f[2]) * chroma};
}

double hyab(Color const& a, Color const& b)
{
    return std::fabs(a[0] - b[0]) + std::hypot(a[1] - b[1], a[2] - b[2]);
}

Planes opponentOf(ShownPicture const& picture)
{
    Planes planes;
    for (Plane& plane : planes)
        plane.resize(picture.rgba.size() / 4);
    for (std::size_t i = 0; i < planes[0].size(); ++i) {
        Color rgb;
        for (std::size_t c = 0; c < 3; ++c) {
            double const s = picture.rgba[4 * i + c] / 255.0;
            rgb[c] = s <= 0.04045 ? s / 12.92 : std::pow((s + 0.055) / 1.055, 2.4);
        }
        Color const o = toOpponent(rgb);
        for (std::size_t c = 0; c < 3; ++c)
            planes[c][i] = o[c];
    }
    return planes;
}

/// What the eye resolves of a channel: sums of Gaussians (table 1).
struct Sensitivity {
    double a1, b1, a2, b2;
};
constexpr std::array<Sensitivity, 3> kSensitivity{
    {{1, 0.0047, 0, 1e-5}, {1, 0.0053, 0, 1e-5}, {34.1, 0.04, 13.5, 0.025}}};

Plane seen(Plane const& plane, Size size, Sensitivity const& s, double ppd)
{
    using std::numbers::pi;
    int const radius = static_cast<int>(std::ceil(3 * std::sqrt(0.04 / (2 * pi * pi)) * ppd));
    auto const gaussian = [&](double b) {
        return kernel(radius,
                      [&](double x) { return std::exp(-pi * pi * x * x / (b * ppd * ppd)); });
    };
    Plane const g1 = gaussian(s.b1), g2 = gaussian(s.b2);
    double const w1 = s.a1 * std::sqrt(pi / s.b1) * sumOf(g1) * sumOf(g1);
    double const w2 = s.a2 * std::sqrt(pi / s.b2) * sumOf(g2) * sumOf(g2);
    Plane result = filtered(plane, size, scaled(g1, 1 / sumOf(g1)), scaled(g1, 1 / sumOf(g1)));
    if (w2 > 0) {
        Plane const other =
            filtered(plane, size, scaled(g2, 1 / sumOf(g2)), scaled(g2, 1 / sumOf(g2)));
        for (std::size_t i = 0; i < result.size(); ++i)
            result[i] = (w1 * result[i] + w2 * other[i]) / (w1 + w2);
    }
    return result;
}

/// Colours as they are seen, in the space where they are compared.
std::vector<Color> labOf(Planes const& opponent, Size size, double ppd)
{
    Planes filteredPlanes;
    for (std::size_t c = 0; c < 3; ++c)
        filteredPlanes[c] = seen(opponent[c], size, kSensitivity[c], ppd);
    std::vector<Color> lab(size.pixels());
    for (std::size_t i = 0; i < lab.size(); ++i) {
        Color rgb =
            fromOpponent({filteredPlanes[0][i], filteredPlanes[1][i], filteredPlanes[2][i]});
        for (double& v : rgb)
            v = std::clamp(v, 0.0, 1.0);
        lab[i] = toHuntLab(rgb);
    }
    return lab;
}

/// Lengths of the gradients of edges and of points (4.2).
std::array<Plane, 2> featuresOf(Plane const& luminance, Size size, double ppd)
{
    double const sigma = 0.5 * 0.082 * ppd;
    int const radius = static_cast<int>(std::ceil(3 * sigma));
    auto const g = [&](double x) { return std::exp(-x * x / (2 * sigma * sigma)); };
    Plane smooth = kernel(radius, g);
    smooth = scaled(smooth, 1 / sumOf(smooth));
    Plane edge = kernel(radius, [&](double x) { return -x * g(x); });
    edge = scaled(edge, 1 / sumOf(edge, true));
    Plane point = kernel(radius, [&](double x) { return (x * x / (sigma * sigma) - 1) * g(x); });
    double const positive = sumOf(point, true), negative = positive - sumOf(point);
    for (double& v : point)
        v /= v > 0 ? positive : negative;
    Plane y = luminance;
    for (double& v : y)
        v = (v + 16) / 116;
    std::array<Plane, 2> lengths;
    std::array<Plane, 2> const kernels{edge, point};
    for (std::size_t k = 0; k < 2; ++k) {
        Plane const along = filtered(y, size, kernels[k], smooth);
        lengths[k] = filtered(y, size, smooth, kernels[k]);
        for (std::size_t i = 0; i < along.size(); ++i)
            lengths[k][i] = std::hypot(along[i], lengths[k][i]);
    }
    return lengths;
}

} // namespace

LinearDifference linearDifference(std::vector<float> const& a, std::vector<float> const& b)
{
    LinearDifference difference;
    for (std::size_t i = 0; i < a.size(); ++i) {
        if (i % 4 == 3)
            continue;
        double const d = std::fabs(static_cast<double>(a[i]) - static_cast<double>(b[i]));
        difference.rmse += d * d;
        difference.largest = std::max(difference.largest, d);
    }
    difference.rmse =
        std::sqrt(difference.rmse / std::max(1.0, 0.75 * static_cast<double>(a.size())));
    return difference;
}

std::vector<float> flipDifference(ShownPicture const& reference, ShownPicture const& test,
                                  double pixelsPerDegree)
{
    if (reference.width != test.width || reference.height != test.height)
        throw host::InputError("the pictures have different sizes");
    Size const size{reference.width, reference.height};
    Planes const a = opponentOf(reference), b = opponentOf(test);
    std::vector<Color> const labA = labOf(a, size, pixelsPerDegree);
    std::vector<Color> const labB = labOf(b, size, pixelsPerDegree);
    auto const featuresA = featuresOf(a[0], size, pixelsPerDegree);
    auto const featuresB = featuresOf(b[0], size, pixelsPerDegree);
    // Large colour differences are pressed into the upper 5 % (4.1.3).
    constexpr double kExponent = 0.7, kKnee = 0.4, kKneeValue = 0.95;
    double const most = std::pow(hyab(toHuntLab({0, 1, 0}), toHuntLab({0, 0, 1})), kExponent);
    std::vector<float> flip(size.pixels());
    for (std::size_t i = 0; i < flip.size(); ++i) {
        double const e = std::pow(hyab(labA[i], labB[i]), kExponent);
        double const color = e < kKnee * most
            ? e * kKneeValue / (kKnee * most)
            : kKneeValue + (e - kKnee * most) / (most - kKnee * most) * (1 - kKneeValue);
        double const edges = std::fabs(featuresA[0][i] - featuresB[0][i]);
        double const points = std::fabs(featuresA[1][i] - featuresB[1][i]);
        double const feature = std::sqrt(std::max(edges, points) / std::numbers::sqrt2);
        flip[i] = static_cast<float>(std::pow(color, 1 - feature));
    }
    return flip;
}

} // namespace zsi::view
