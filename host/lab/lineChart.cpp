// SPDX-License-Identifier: Apache-2.0
#include "lab/legend.h"

#include <cmath>
#include <fmt/format.h>

namespace zsi::lab {
namespace {

constexpr double kLeft = 76, kRight = 20, kHeight = 340;

} // namespace

std::string drawChart(Chart const& chart)
{
    std::vector<double> xs, ys;
    for (Curve const& curve : chart.curves) {
        xs.insert(xs.end(), curve.x.begin(), curve.x.end());
        ys.insert(ys.end(), curve.y.begin(), curve.y.end());
    }
    Axis const ax = fitted(chart.x, xs), ay = fitted(chart.y, ys, 7);
    Svg svg;
    double const top = drawTitle(svg, chart.title, chart.note), bottom = top + kHeight;
    double const width = kChartWidth - kLeft - kRight;
    auto const placeX = [&](double x) { return kLeft + width * placeOn(ax, x); };
    auto const placeY = [&](double y) { return bottom - kHeight * placeOn(ay, y); };

    for (double const x : ticksOf(ax, 8)) {
        svg.line(placeX(x), top, placeX(x), bottom, "grid");
        svg.text(placeX(x), bottom + 17, numberText(x), Svg::Anchor::Middle);
    }
    for (double const y : ticksOf(ay)) {
        svg.line(kLeft, placeY(y), kLeft + width, placeY(y), "grid");
        svg.text(kLeft - 8, placeY(y) + 4, numberText(y), Svg::Anchor::End);
    }
    svg.beginClip(kLeft, top, width, kHeight);
    for (double const x : chart.marks)
        svg.line(placeX(x), top, placeX(x), bottom, "mark");
    for (Curve const& curve : chart.curves) {
        std::string path;
        bool drawing = false;
        for (std::size_t i = 0; i < curve.x.size(); ++i) {
            bool const shown = std::isfinite(curve.y[i]) && (curve.y[i] > 0 || !ay.logarithmic);
            if (shown && curve.dots)
                svg.dot(placeX(curve.x[i]), placeY(curve.y[i]), curve.color);
            else if (shown)
                path += fmt::format("{}{:.2f} {:.2f}", drawing ? 'L' : 'M', placeX(curve.x[i]),
                                    placeY(curve.y[i]));
            drawing = shown;
        }
        if (!path.empty())
            svg.curve(path, curve.color, curve.dash);
    }
    svg.endClip();
    svg.rectangle(kLeft, top, width, kHeight, "frame");
    svg.text(kLeft + width / 2, bottom + 37, ax.title, Svg::Anchor::Middle);
    svg.text(20, top + kHeight / 2, ay.title, Svg::Anchor::Middle, "text", -90);
    double const legend = drawLegend(svg, chart.curves, bottom + 46);
    return svg.document(kChartWidth, bottom + 46 + legend, chart.title);
}

} // namespace zsi::lab
