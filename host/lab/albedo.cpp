// SPDX-License-Identifier: Apache-2.0
// What comes back out of a white furnace, over the angle at which it is seen.
#include "lab/integral.h"
#include "lab/report.h"
#include "measure/materialProbe.h"

#include <cmath>

namespace zsi::lab {
namespace {

constexpr double kRadians = 3.14159265358979323846 / 180;

std::vector<Vec3f> albedoOf(Specimen const& specimen, std::vector<double> const& angles,
                            LabOptions const& options)
{
    std::vector<Vec3f> values(angles.size());
    if (specimen.has(kSample)) {
        std::vector<float> radians;
        radians.reserve(angles.size());
        for (double const angle : angles)
            radians.push_back(static_cast<float>(angle * kRadians));
        host::MaterialProbe(*specimen.shader())
            .albedo(radians, options.draws / 16, options.seed, values, options.threads);
    } else {
        for (std::size_t i = 0; i < angles.size(); ++i)
            values[i] =
                reflected(specimen, incidentAt(angles[i]), static_cast<int>(options.draws / 8),
                          options.seed, options.threads)
                    .mean;
    }
    return values;
}

} // namespace

void measureAlbedo(Report& report)
{
    std::vector<double> angles;
    angles.reserve(31);
    for (int i = 0; i < 30; ++i)
        angles.push_back(i * 3);
    angles.push_back(89);
    Chart chart;
    chart.title = "Albedo: share of light that a white furnace gets back";
    chart.note =
        "Mean weight of what sample draws, to both sides; of a table the integral of its values";
    chart.x = {"angle from the normal, degrees", false, 0, 90, 15};
    chart.y.title = "albedo";
    Csv csv("material,angle_deg,r,g,b");
    Json series = Json::array();
    bool const several = report.specimens.size() > 1;
    for (std::size_t s = 0; s < report.specimens.size(); ++s) {
        Specimen const& specimen = report.specimens[s];
        if (!specimen.has(kSample) && !specimen.hasValues())
            continue;
        std::vector<Vec3f> const values = albedoOf(specimen, angles, report.options);
        std::vector<double> channels[3], light;
        bool colored = false;
        for (std::size_t i = 0; i < angles.size(); ++i) {
            double const rgb[] = {static_cast<double>(values[i].x),
                                  static_cast<double>(values[i].y),
                                  static_cast<double>(values[i].z)};
            for (std::size_t c = 0; c < 3; ++c) {
                channels[c].push_back(rgb[c]);
                colored = colored || std::fabs(rgb[c] - rgb[0]) > 2e-3;
            }
            light.push_back(luminance(values[i]));
            csv.row(specimen.label(), {angles[i], rgb[0], rgb[1], rgb[2]});
        }
        series.push_back({{"material", specimen.label()},
                          {"angle", jsonOf(angles)},
                          {"r", jsonOf(channels[0])},
                          {"g", jsonOf(channels[1])},
                          {"b", jsonOf(channels[2])}});
        if (several || !colored) {
            chart.curves.push_back({specimen.label(), angles, light, static_cast<int>(s)});
            continue;
        }
        constexpr char const* kNames[] = {"red", "green", "blue"};
        constexpr int kColors[] = {1, 2, 0}; // those that look most like them
        for (std::size_t c = 0; c < 3; ++c)
            chart.curves.push_back({kNames[c], angles, channels[c], kColors[c], kColors[c]});
    }
    if (series.empty())
        return;
    chart.curves.push_back({"all light", {0, 90}, {1, 1}, 5, 2});
    report.summary["albedo"] = {{"series", std::move(series)}};
    report.add("albedo.svg", drawChart(chart));
    report.add("albedo.csv", csv.text());
}

} // namespace zsi::lab
