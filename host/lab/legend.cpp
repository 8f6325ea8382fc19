// SPDX-License-Identifier: Apache-2.0
#include "lab/legend.h"

#include <fmt/format.h>

namespace zsi::lab {
namespace {

constexpr double kMargin = 16, kRow = 19, kSwatch = 28;

/// As much of a text as has room.
std::string cut(std::string const& text, double width)
{
    if (textWidth(text) <= width)
        return text;
    std::size_t end = text.size();
    while (end > 0 && textWidth(text.substr(0, end)) > width - 8)
        --end;
    while (end > 0 && (text[end] & 0xc0) == 0x80)
        --end;
    return text.substr(0, end) + "…";
}

} // namespace

double drawTitle(Svg& svg, std::string const& title, std::string const& note)
{
    constexpr double kRoom = kChartWidth - 2 * kMargin;
    svg.text(kMargin, 24, cut(title, kRoom), Svg::Anchor::Start, "title");
    if (note.empty())
        return 36;
    svg.text(kMargin, 42, cut(note, kRoom), Svg::Anchor::Start, "note");
    return 54;
}

double drawLegend(Svg& svg, std::vector<Curve> const& curves, double y)
{
    double const begin = y;
    double x = kMargin;
    constexpr double kRoom = kChartWidth - 2 * kMargin - kSwatch;
    y += 14;
    for (Curve const& curve : curves) {
        if (curve.label.empty())
            continue;
        std::string const label = cut(curve.label, kRoom);
        double const width = kSwatch + textWidth(label) + 18;
        if (x > kMargin && x + width > kChartWidth - kMargin + 18) {
            x = kMargin;
            y += kRow;
        }
        if (curve.dots)
            svg.dot(x + 11, y - 4, curve.color);
        else
            svg.curve(fmt::format("M{:.1f} {:.1f}h22", x, y - 4), curve.color, curve.dash);
        svg.text(x + kSwatch, y, label);
        x += width;
    }
    return y - begin + 12;
}

} // namespace zsi::lab
