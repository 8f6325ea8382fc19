// SPDX-License-Identifier: Apache-2.0
// What sample draws against the density that it tells.
#include "base/grid.h"
#include "lab/densityTest.h"
#include "lab/report.h"

#include <cmath>
#include <fmt/format.h>
#include <limits>

namespace zsi::lab {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr int kWidth = 180, kHeight = 120; ///< of a panel, pixels

/// A cell's number wherever the cell is.
template <class Number>
Panel painted(std::string title, DensityTest const& test, double lowest, Number const& number)
{
    Panel panel{std::move(title), kWidth, kHeight, {}};
    panel.values.assign(host::cellCount(kWidth, kHeight), std::numeric_limits<double>::quiet_NaN());
    for (DensityCell const& cell : test.cells) {
        double const value = number(cell);
        auto const row = [&](double z) { return (1 - z) / (1 - lowest) * kHeight; };
        auto const column = [](double phi) { return (phi / (2 * kPi) + 0.5) * kWidth; };
        // Pixels whose middle is in the cell; a lobe narrower than that has one all the same.
        int const y0 = static_cast<int>(std::lround(row(cell.z1)));
        int const x0 = static_cast<int>(std::lround(column(cell.phi0)));
        int const y1 = std::max(y0 + 1, static_cast<int>(std::lround(row(cell.z0))));
        int const x1 = std::max(x0 + 1, static_cast<int>(std::lround(column(cell.phi1))));
        for (int y = y0; y < std::min(y1, kHeight); ++y)
            for (int x = x0; x < std::min(x1, kWidth); ++x)
                panel.values[host::cellIndex(x, y, kWidth)] = value;
    }
    return panel;
}

void drawFigures(Report& report, std::string const& suffix, Specimen const& specimen, double angle,
                 DensityTest const& test)
{
    bool below = false;
    for (DensityCell const& cell : test.cells)
        below = below || (cell.z1 <= 0 && cell.count > 0);
    double const lowest = below ? -1 : 0;
    auto const drawn = [&](DensityCell const& cell) {
        return cell.count / (cell.solidAngle() * test.draws);
    };
    Map map;
    map.title = "Density of sample: " + specimen.label() + ", " + degreesText(angle);
    map.note =
        fmt::format("chi-square {:.0f} of {} cells, p {:.3g}; {:.1f} % of {} draws judged",
                    test.chiSquare, test.degrees, test.pValue, 100 * test.judged, test.draws);
    map.x = {"azimuth from mirrored, degrees", false, -180, 180, 90};
    map.y = {"cosine from the normal", false, lowest, 1, 0.25};
    map.scale = {"density, 1/sr", true};
    map.panels = {painted("histogram of the draws", test, lowest, drawn),
                  painted("as sample tells it", test, lowest,
                          [](DensityCell const& cell) { return cell.told; })};
    report.add("density" + suffix + ".svg", drawMap(map));
    map.title = "Density of sample, deviation: " + specimen.label() + ", " + degreesText(angle);
    map.scale = {"standard errors", false, -5, 5};
    map.colors = ColorScale::Deviations;
    map.panels = {painted("drawn too often (blue), too rarely (orange); not judged (grey)", test,
                          lowest, [](DensityCell const& cell) {
                              return cell.judged ? cell.deviation
                                                 : std::numeric_limits<double>::quiet_NaN();
                          })};
    report.add("density-deviation" + suffix + ".svg", drawMap(map));
}

} // namespace

void measureDensity(Report& report)
{
    Csv csv("material,incident_deg,cos_low,cos_high,azimuth_low_deg,azimuth_high_deg,draws,"
            "density_drawn,density_told,standard_errors,judged");
    Json tests = Json::array();
    for (std::size_t s = 0; s < report.specimens.size(); ++s) {
        Specimen const& specimen = report.specimens[s];
        if (!specimen.has(kSample))
            continue;
        host::MaterialProbe const probe(*specimen.shader());
        bool drawn = false;
        for (double const angle : report.options.incident) {
            if (report.isCancelled())
                return;
            DensityTest const test = testDensity(probe, incidentAt(angle), report.options.draws,
                                                 report.options.seed, report.options.threads);
            tests.push_back({{"material", specimen.label()},
                             {"incident", angle},
                             {"draws", test.draws},
                             {"chiSquare", test.chiSquare},
                             {"degreesOfFreedom", test.degrees},
                             {"scale", test.scale},
                             {"scaleError", test.scaleError},
                             {"pValue", test.applies() ? Json(test.pValue) : Json()},
                             {"judged", test.judged},
                             {"declined", test.declined},
                             {"specular", test.specular},
                             {"spreadWithoutDensity", test.untold}});
            for (DensityCell const& cell : test.cells)
                csv.row(specimen.label(),
                        {angle, cell.z0, cell.z1, cell.phi0 * 180 / kPi, cell.phi1 * 180 / kPi,
                         static_cast<double>(cell.count),
                         cell.count / (cell.solidAngle() * test.draws), cell.told, cell.deviation,
                         cell.judged ? 1.0 : 0.0});
            // A figure at the first oblique angle: straight from above there is no azimuth.
            if (!drawn && test.applies() && (angle > 0 || report.options.incident.size() == 1)) {
                drawFigures(report, report.specimens.size() == 1 ? "" : fmt::format("-{}", s + 1),
                            specimen, angle, test);
                drawn = true;
            }
        }
    }
    if (tests.empty())
        return;
    report.summary["density"] = std::move(tests);
    report.add("density.csv", csv.text());
}

} // namespace zsi::lab
