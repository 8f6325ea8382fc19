// SPDX-License-Identifier: Apache-2.0
#include "lab/reciprocity.h"

#include "lab/report.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <limits>
#include <zsi/vecmath.h>

namespace zsi::lab {
namespace {

constexpr double kRadians = 3.14159265358979323846 / 180;
constexpr int kSide = 45;
constexpr double kAzimuths[] = {0, 45, 90, 135, 180};

Vec3f directionAt(double angle, double azimuth)
{
    double const s = std::sin(angle * kRadians);
    return {static_cast<float>(s * std::cos(azimuth * kRadians)),
            static_cast<float>(s * std::sin(azimuth * kRadians)),
            static_cast<float>(std::cos(angle * kRadians))};
}

/// The angles at the middle of a pixel.
double firstAngle(std::size_t pixel)
{
    return (static_cast<double>(pixel % kSide) + 0.5) * 90 / kSide;
}
double secondAngle(std::size_t pixel)
{
    std::size_t const row = pixel / kSide;
    return (kSide - static_cast<double>(row) - 0.5) * 90 / kSide;
}

} // namespace

double reciprocityError(Vec3f there, Vec3f back)
{
    double const difference = static_cast<double>(maxComponent(Vec3f(
        std::fabs(there.x - back.x), std::fabs(there.y - back.y), std::fabs(there.z - back.z))));
    double const larger = static_cast<double>(std::max(maxComponent(there), maxComponent(back)));
    return difference / std::max(larger, 1e-4); // 1/sr; a white diffuse surface has 0.3
}

void measureReciprocity(Report& report)
{
    std::vector<Vec3f> first, second;
    for (int row = 0; row < kSide; ++row)
        for (int column = 0; column < kSide; ++column)
            for (double const azimuth : kAzimuths) {
                first.push_back(directionAt((column + 0.5) * 90 / kSide, 0));
                second.push_back(directionAt((kSide - row - 0.5) * 90 / kSide, azimuth));
            }
    Map map;
    map.title = "Reciprocity: how much the value changes when light goes the other way";
    map.note = "Relative to the larger of both; the worst of five azimuths between the directions";
    map.x = {"first angle, degrees", false, 0, 90, 30};
    map.y = {"second angle, degrees", false, 0, 90, 30};
    map.scale = {"relative difference", true, 1e-6, 1};
    Csv csv("material,first_deg,second_deg,relative_difference");
    Json summary = Json::array();
    for (Specimen const& specimen : report.specimens) {
        if (!specimen.hasValues())
            continue;
        std::vector<Vec3f> there(first.size()), back(first.size());
        specimen.values(first, second, there, report.options.threads);
        specimen.values(second, first, back, report.options.threads);
        Panel panel{specimen.label(), kSide, kSide, {}};
        double worst = 0;
        std::size_t place = 0;
        for (std::size_t i = 0; i < kSide * kSide; ++i) {
            double most = std::numeric_limits<double>::quiet_NaN();
            for (std::size_t k = i * std::size(kAzimuths); k < (i + 1) * std::size(kAzimuths); ++k)
                if (double const e = reciprocityError(there[k], back[k]); !(e <= most))
                    most = std::isfinite(e) ? e : most;
            if (most > worst) {
                worst = most;
                place = i;
            }
            panel.values.push_back(std::max(most, 1e-6));
            csv.row(specimen.label(), {firstAngle(i), secondAngle(i), most});
        }
        map.panels.push_back(std::move(panel));
        summary.push_back({{"material", specimen.label()},
                           {"worst", worst},
                           {"first", firstAngle(place)},
                           {"second", secondAngle(place)}});
    }
    if (summary.empty())
        return;
    report.summary["reciprocity"] = std::move(summary);
    report.add("reciprocity.svg", drawMap(map));
    report.add("reciprocity.csv", csv.text());
}

} // namespace zsi::lab
