// SPDX-License-Identifier: Apache-2.0
#include "lab/legend.h"

#include <cmath>
#include <fmt/format.h>

namespace zsi::lab {
namespace {

constexpr double kRadius = 310, kPi = 3.14159265358979323846;

} // namespace

std::string drawPolar(Chart const& chart)
{
    std::vector<double> ys;
    bool below = false;
    for (Curve const& curve : chart.curves) {
        ys.insert(ys.end(), curve.y.begin(), curve.y.end());
        for (std::size_t i = 0; i < curve.x.size(); ++i)
            below = below || (std::fabs(curve.x[i]) > 90 && curve.y[i] > 0);
    }
    Axis const scale = fitted(chart.y, ys, 6);
    Svg svg;
    double const top = drawTitle(svg, chart.title, chart.note);
    double const radius = below ? kRadius * 0.8 : kRadius;
    double const cx = kChartWidth / 2, cy = top + 24 + radius;
    double const bottom = below ? cy + radius + 24 : cy + 38;
    struct Point {
        double x, y;
    };
    auto const at = [&](double degrees, double distance) -> Point {
        double const a = degrees * kPi / 180;
        return {cx + std::sin(a) * distance, cy - std::cos(a) * distance};
    };

    for (int angle = -180; angle < 180; angle += 15) {
        if (!below && std::abs(angle) > 90)
            continue;
        Point const end = at(angle, radius);
        svg.line(cx, cy, end.x, end.y, "grid");
        if (angle % 30 == 0 || std::abs(angle) == 90) {
            Point const label = at(angle, radius + 14);
            svg.text(label.x, label.y + 4, numberText(std::abs(angle)) + "°", Svg::Anchor::Middle);
        }
    }
    auto const ring = [&](double distance) {
        if (below)
            svg.circle(cx, cy, distance, "grid");
        else
            for (int angle = -90; angle < 90; angle += 3) { // an arc, as short straight pieces
                Point const a = at(angle, distance), b = at(angle + 3, distance);
                svg.line(a.x, a.y, b.x, b.y, "grid");
            }
    };
    std::vector<double> const rings = ticksOf(scale, 5);
    for (double const value : rings)
        if (double const place = placeOn(scale, value); place > 1e-6)
            ring(radius * std::min(place, 1.0));
    for (Curve const& curve : chart.curves) {
        std::string path;
        bool drawing = false;
        for (std::size_t i = 0; i < curve.x.size(); ++i) {
            bool const shown = std::isfinite(curve.y[i]) && (below || std::fabs(curve.x[i]) <= 90);
            if (shown) {
                double const place =
                    curve.y[i] > 0 ? std::max(0.0, placeOn(scale, curve.y[i])) : 0.0;
                Point const p = at(curve.x[i], radius * place);
                path += fmt::format("{}{:.2f} {:.2f}", drawing ? 'L' : 'M', p.x, p.y);
            }
            drawing = shown;
        }
        if (!path.empty())
            svg.curve(path, curve.color, curve.dash);
    }
    svg.line(cx - radius, cy, cx + radius, cy, "frame");
    // The first ring of a logarithmic scale is the middle itself.
    for (double const value : rings)
        if (double const place = placeOn(scale, value); place <= 1.0)
            svg.text(cx + radius * place, cy + 15, numberText(value), Svg::Anchor::Middle, "note");
    svg.text(16, bottom - 12, chart.y.title, Svg::Anchor::Start, "note");
    double const legend = drawLegend(svg, chart.curves, bottom + 4);
    return svg.document(kChartWidth, bottom + 4 + legend, chart.title);
}

} // namespace zsi::lab
