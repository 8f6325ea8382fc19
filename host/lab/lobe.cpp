// SPDX-License-Identifier: Apache-2.0
// The value over exit angles in the plane of incidence.
#include "lab/report.h"

#include <algorithm>
#include <cmath>

namespace zsi::lab {
namespace {

/// Every degree, and closer and closer towards the mirrored direction, where narrow lobes are.
std::vector<double> exitAngles(double mirrored)
{
    std::vector<double> angles;
    for (int i = -180; i <= 180; ++i)
        angles.push_back(i);
    for (double away = 0.01; away < 12; away *= 1.15)
        for (double const side : {-1.0, 1.0})
            angles.push_back(mirrored + side * away);
    angles.push_back(mirrored);
    std::sort(angles.begin(), angles.end());
    return angles;
}

} // namespace

void measureLobe(Report& report)
{
    Chart chart;
    chart.title = "Lobe: value of transfer over the exit angle";
    chart.note = "In the plane of incidence, without the cosine, for each incident angle";
    chart.x = {"exit angle, degrees (positive: the mirrored side)", false, -90, 90, 30};
    chart.y.title = "value, 1/sr (luminance)";
    Csv csv("material,incident_deg,exit_deg,r,g,b");
    Json series = Json::array();
    double most = 0, typical = 0;
    std::vector<double> const& incident = report.options.incident;
    for (std::size_t s = 0; s < report.specimens.size(); ++s) {
        Specimen const& specimen = report.specimens[s];
        if (!specimen.hasValues())
            continue;
        for (std::size_t a = 0; a < incident.size(); ++a) {
            std::vector<double> const angles = exitAngles(incident[a]);
            std::vector<Vec3f> exits, values(angles.size());
            for (double const angle : angles)
                exits.push_back(exitAt(angle));
            Vec3f const wi = incidentAt(incident[a]);
            specimen.values({&wi, 1}, exits, values, report.options.threads);
            Curve curve;
            style(curve, report, s, a);
            bool through = false; // to the other side of the surface
            for (std::size_t i = 0; i < angles.size(); ++i)
                through = through || (std::fabs(angles[i]) > 90.5 && luminance(values[i]) > 0);
            if (through)
                chart.x = {chart.x.title, false, -180, 180, 60};
            for (std::size_t i = 0; i < angles.size(); ++i) {
                double const away = std::fabs(angles[i]);
                if (away > (through ? 180 : 90) || std::fabs(away - 90) < 0.5)
                    continue; // no cosine to divide by at the horizon itself
                double const value = luminance(values[i]);
                curve.x.push_back(angles[i]);
                curve.y.push_back(value);
                csv.row(specimen.label(),
                        {incident[a], angles[i], static_cast<double>(values[i].x),
                         static_cast<double>(values[i].y), static_cast<double>(values[i].z)});
                if (std::isfinite(value))
                    most = std::max(most, value);
            }
            std::vector<double> sorted;
            std::copy_if(curve.y.begin(), curve.y.end(), std::back_inserter(sorted),
                         [](double v) { return v > 0; });
            std::sort(sorted.begin(), sorted.end());
            if (!sorted.empty())
                typical = std::max(typical, sorted[sorted.size() / 4]);
            series.push_back({{"material", specimen.label()},
                              {"incident", incident[a]},
                              {"exit", jsonOf(curve.x)},
                              {"value", jsonOf(curve.y)}});
            chart.curves.push_back(std::move(curve));
        }
    }
    if (series.empty())
        return;
    chart.marks = incident;
    // A highlight far above the rest of its curve hides the rest on a linear axis.
    chart.y.logarithmic = most > 20 * typical;
    report.summary["lobe"] = {{"unit", "1/sr"}, {"series", std::move(series)}};
    report.add("lobe.svg", drawChart(chart));
    chart.title = "Lobe: value of transfer, polar";
    report.add("lobe-polar.svg", drawPolar(chart));
    report.add("lobe.csv", csv.text());
}

} // namespace zsi::lab
