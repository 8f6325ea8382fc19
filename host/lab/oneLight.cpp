// SPDX-License-Identifier: Apache-2.0
// What shade shows of one light beside what transfer says of it.
#include "lab/report.h"
#include "measure/materialProbe.h"

#include <algorithm>
#include <cmath>

namespace zsi::lab {

void measureOneLight(Report& report)
{
    constexpr double kPi = 3.14159265358979323846;
    Chart chart;
    chart.title = "One light: what shade shows, and what transfer says";
    chart.note =
        "Lines: shade under a light of colour 1; rings: pi times transfer times its cosine";
    chart.x = {"angle of the light, degrees (positive: the mirrored side)", false, -90, 90, 30};
    chart.y.title = "brightness (luminance)";
    Csv csv("material,view_deg,light_deg,shade_r,shade_g,shade_b,transfer_r,transfer_g,transfer_b");
    Json series = Json::array();
    std::vector<double> angles;
    std::vector<Vec3f> lights;
    for (int i = -89; i <= 89; ++i) {
        angles.push_back(i);
        lights.push_back(exitAt(i));
    }
    double most = 0, typical = 0;
    for (std::size_t s = 0; s < report.specimens.size(); ++s) {
        Specimen const& specimen = report.specimens[s];
        if (!specimen.has(kShade))
            continue;
        host::MaterialProbe const probe(*specimen.shader());
        for (std::size_t a = 0; a < report.options.incident.size(); ++a) {
            Vec3f const wi = incidentAt(report.options.incident[a]);
            std::vector<Vec3f> shown(lights.size()), said(lights.size());
            probe.lit({&wi, 1}, lights, shown, report.options.threads);
            if (specimen.has(kTransfer))
                probe.evaluate({&wi, 1}, lights, true, said, report.options.threads);
            Curve line, rings;
            style(line, report, s, a);
            rings.color = line.color;
            rings.dots = true;
            for (std::size_t i = 0; i < lights.size(); ++i) {
                line.x.push_back(angles[i]);
                line.y.push_back(luminance(shown[i]));
                most = std::max(most, line.y.back());
                if (i % 6 == 5) {
                    rings.x.push_back(angles[i]);
                    rings.y.push_back(kPi * luminance(said[i]));
                }
                csv.row(specimen.label(),
                        {report.options.incident[a], angles[i], static_cast<double>(shown[i].x),
                         static_cast<double>(shown[i].y), static_cast<double>(shown[i].z),
                         kPi * static_cast<double>(said[i].x), kPi * static_cast<double>(said[i].y),
                         kPi * static_cast<double>(said[i].z)});
            }
            std::vector<double> sorted = line.y;
            std::sort(sorted.begin(), sorted.end());
            typical = std::max(typical, sorted[sorted.size() / 2]);
            series.push_back({{"material", specimen.label()},
                              {"view", report.options.incident[a]},
                              {"light", jsonOf(angles)},
                              {"shade", jsonOf(line.y)}});
            chart.curves.push_back(std::move(line));
            if (specimen.has(kTransfer)) {
                std::vector<double> all;
                all.reserve(said.size());
                for (Vec3f const& v : said)
                    all.push_back(kPi * luminance(v));
                series.back()["transfer"] = jsonOf(all);
                chart.curves.push_back(std::move(rings));
            }
        }
    }
    if (series.empty())
        return;
    chart.y.logarithmic = most > 20 * typical && typical > 0;
    report.summary["oneLight"] = {{"series", std::move(series)}};
    report.add("light.svg", drawChart(chart));
    report.add("light.csv", csv.text());
}

} // namespace zsi::lab
