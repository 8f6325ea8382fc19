// SPDX-License-Identifier: Apache-2.0
// The value over half and difference angle as a picture (Burley 2012, "Physically Based Shading at
// Disney", 3): highlights stand at the left, grazing retro-reflection and Fresnel at the top.
#include "lab/report.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <limits>

namespace zsi::lab {
namespace {

constexpr double kRadians = 3.14159265358979323846 / 180;
constexpr int kSide = 90;

Vec3f vector(double x, double y, double z)
{
    return {static_cast<float>(x), static_cast<float>(y), static_cast<float>(z)};
}

} // namespace

void measureSlice(Report& report)
{
    // With an azimuth of 90 degrees the difference vector stands square to the plane of the half
    // vector: both directions lie equally high.
    std::vector<Vec3f> wi, wo;
    for (int row = 0; row < kSide; ++row)
        for (int column = 0; column < kSide; ++column) {
            double const half = (column + 0.5) * kRadians * 90 / kSide;
            double const difference = (kSide - row - 0.5) * kRadians * 90 / kSide;
            double const x = std::sin(half) * std::cos(difference), y = std::sin(difference);
            double const z = std::cos(half) * std::cos(difference);
            wi.push_back(vector(x, y, z));
            wo.push_back(vector(x, -y, z));
        }
    Map map;
    map.title = "Slice: value of transfer over half and difference angle";
    map.note = "Logarithm of the luminance; azimuth of the difference 90 degrees";
    map.x = {"half angle, degrees", false, 0, 90, 30};
    map.y = {"difference angle, degrees", false, 0, 90, 30};
    map.scale = {"value, 1/sr", true};
    Csv csv("material,half_deg,difference_deg,r,g,b");
    std::vector<double> all;
    for (Specimen const& specimen : report.specimens) {
        if (!specimen.hasValues())
            continue;
        std::vector<Vec3f> values(wi.size());
        specimen.values(wi, wo, values, report.options.threads);
        Panel panel{specimen.label(), kSide, kSide, {}};
        for (std::size_t i = 0; i < values.size(); ++i) {
            panel.values.push_back(luminance(values[i]));
            std::size_t const row = i / kSide;
            csv.row(specimen.label(),
                    {(static_cast<double>(i % kSide) + 0.5) * 90 / kSide,
                     (kSide - static_cast<double>(row) - 0.5) * 90 / kSide,
                     static_cast<double>(values[i].x), static_cast<double>(values[i].y),
                     static_cast<double>(values[i].z)});
        }
        all.insert(all.end(), panel.values.begin(), panel.values.end());
        map.panels.push_back(std::move(panel));
    }
    if (map.panels.empty())
        return;
    // Without the last few at the horizon, where many values have no bound.
    std::erase_if(all, [](double v) { return !(v > 0); });
    std::sort(all.begin(), all.end());
    all.resize(all.size() - all.size() / 50);
    map.scale = fitted(map.scale, all, 4);
    for (std::size_t i = 0; i < map.panels.size(); ++i)
        report.add(map.panels.size() == 1 ? "slice.png" : fmt::format("slice-{}.png", i + 1),
                   pngOf(map.panels[i], map.scale, map.colors));
    report.add("slice.svg", drawMap(map));
    report.add("slice.csv", csv.text());
}

} // namespace zsi::lab
