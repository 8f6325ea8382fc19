// SPDX-License-Identifier: Apache-2.0
#include "base/error.h"
#include "base/grid.h"
#include "lab/legend.h"

#include <OpenImageIO/filesystem.h>
#include <OpenImageIO/imageio.h>
#include <algorithm>
#include <array>
#include <cmath>
#include <memory>

namespace zsi::lab {
namespace {

using Rgb = std::array<unsigned char, 3>;

/// Every sixteenth colour of viridis (van der Walt and Smith 2015), which rises evenly in lightness
/// and is read by the colour-blind.
constexpr Rgb kViridis[] = {{68, 1, 84},    {72, 26, 108},  {71, 47, 125},  {65, 68, 135},
                            {57, 86, 140},  {49, 104, 142}, {42, 120, 142}, {35, 136, 142},
                            {31, 152, 139}, {34, 168, 132}, {53, 183, 121}, {84, 197, 104},
                            {122, 209, 81}, {165, 219, 54}, {210, 226, 27}, {253, 231, 37}};
/// From too little to too much; orange and blue are told apart by all.
constexpr Rgb kOrangeBlue[] = {{179, 88, 6},    {224, 130, 20},  {253, 184, 99},
                               {254, 224, 182}, {247, 247, 247}, {209, 229, 240},
                               {146, 197, 222}, {67, 147, 195},  {33, 102, 172}};
constexpr Rgb kNothing = {128, 128, 128};

Rgb colorOf(double value, Axis const& scale, ColorScale colors)
{
    if (!std::isfinite(value))
        return kNothing;
    double place = value > 0 || !scale.logarithmic ? placeOn(scale, value) : 0.0;
    place = std::clamp(place, 0.0, 1.0);
    auto const between = [&](auto const& table) {
        double const at = place * static_cast<double>(std::size(table) - 1);
        auto const i = std::min(static_cast<std::size_t>(at), std::size(table) - 2);
        Rgb result;
        for (std::size_t c = 0; c < 3; ++c)
            result[c] = static_cast<unsigned char>(std::lround(
                std::lerp(static_cast<double>(table[i][c]), static_cast<double>(table[i + 1][c]),
                          at - static_cast<double>(i))));
        return result;
    };
    return colors == ColorScale::Values ? between(kViridis) : between(kOrangeBlue);
}

std::string encoded(int width, int height, std::vector<unsigned char> const& rgb)
{
    std::vector<unsigned char> bytes;
    OIIO::Filesystem::IOVecOutput memory(bytes);
    auto const output = OIIO::ImageOutput::create("png", &memory);
    OIIO::ImageSpec spec(width, height, 3, OIIO::TypeDesc::UINT8);
    spec.attribute("oiio:ColorSpace", "sRGB");
    if (!output || !output->open("map.png", spec)
        || !output->write_image(OIIO::TypeDesc::UINT8, rgb.data()) || !output->close())
        throw host::InputError("cannot make a PNG: "
                               + (output ? output->geterror() : OIIO::geterror()));
    return {bytes.begin(), bytes.end()};
}

} // namespace

std::string pngOf(Panel const& panel, Axis const& scale, ColorScale colors)
{
    std::vector<unsigned char> rgb;
    rgb.reserve(panel.values.size() * 3);
    for (double const value : panel.values) {
        Rgb const c = colorOf(value, scale, colors);
        rgb.insert(rgb.end(), c.begin(), c.end());
    }
    return encoded(panel.width, panel.height, rgb);
}

std::string drawMap(Map const& map)
{
    constexpr double kLeft = 62, kGap = 36, kBar = 14, kBarRoom = 84;
    auto const count = static_cast<double>(std::max<std::size_t>(map.panels.size(), 1));
    std::vector<double> all;
    for (Panel const& panel : map.panels)
        all.insert(all.end(), panel.values.begin(), panel.values.end());
    Axis const scale = fitted(map.scale, all);

    Svg svg;
    double const head = drawTitle(svg, map.title, map.note);
    double const width = std::min(400.0, (kChartWidth - kLeft - kBarRoom - kGap * count) / count);
    double const height = map.panels.empty() || map.panels[0].width == 0
        ? width
        : width * map.panels[0].height / map.panels[0].width;
    double const top = head + 16, bottom = top + height;
    double left = kLeft;
    for (Panel const& panel : map.panels) {
        svg.text(left, top - 6, panel.title, Svg::Anchor::Start, "note");
        svg.image(left, top, width, height, pngOf(panel, scale, map.colors));
        svg.rectangle(left, top, width, height, "frame");
        for (double const x : ticksOf(map.x, width > 250 ? 6 : 3)) {
            double const at = left + width * placeOn(map.x, x);
            svg.line(at, bottom, at, bottom + 4, "frame");
            svg.text(at, bottom + 17, numberText(x), Svg::Anchor::Middle);
        }
        if (&panel == &map.panels.front())
            for (double const y : ticksOf(map.y)) {
                double const at = bottom - height * placeOn(map.y, y);
                svg.line(left - 4, at, left, at, "frame");
                svg.text(left - 8, at + 4, numberText(y), Svg::Anchor::End);
            }
        svg.text(left + width / 2, bottom + 36, map.x.title, Svg::Anchor::Middle);
        left += width + kGap;
    }
    svg.text(18, top + height / 2, map.y.title, Svg::Anchor::Middle, "text", -90);

    Panel bar{"", 1, 256, {}};
    for (int i = 0; i < bar.height; ++i) {
        double const place = 1 - (i + 0.5) / bar.height;
        bar.values.push_back(scale.logarithmic ? scale.from * std::pow(scale.to / scale.from, place)
                                               : std::lerp(scale.from, scale.to, place));
    }
    svg.image(left, top, kBar, height, pngOf(bar, scale, map.colors));
    svg.rectangle(left, top, kBar, height, "frame");
    for (double const value : ticksOf(scale))
        svg.text(left + kBar + 5, bottom - height * placeOn(scale, value) + 4, numberText(value));
    svg.text(left + kBar + 54, top + height / 2, scale.title, Svg::Anchor::Middle, "text", 90);
    return svg.document(kChartWidth, bottom + 50, map.title);
}

} // namespace zsi::lab
