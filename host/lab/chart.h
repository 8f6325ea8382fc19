// SPDX-License-Identifier: Apache-2.0
/// Figures as SVG documents.
#pragma once

#include "lab/ticks.h"

#include <string>
#include <vector>

namespace zsi::lab {

struct Curve {
    std::string label; ///< for the legend; empty: not in it
    std::vector<double> x, y; ///< a value that is not finite leaves a gap
    int color = 0, dash = 0; ///< lab/svg.h
    bool dots = false; ///< rings at the values instead of a line
};

struct Chart {
    std::string title, note; ///< the note stands below the title, smaller
    Axis x, y;
    std::vector<Curve> curves;
    std::vector<double> marks = {}; ///< places on the x axis with a line across
};

std::string drawChart(Chart const& chart);
/// The same over angles: x in degrees from the upward normal, turning right, -180 to 180; y is the
/// distance from the middle. The lower half is shown where a curve has a value there.
std::string drawPolar(Chart const& chart);

/// A colour scale: its colours, from low to high.
enum class ColorScale { Values, Deviations };

/// Values over a rectangle.
struct Panel {
    std::string title;
    int width = 0, height = 0;
    std::vector<double> values; ///< rows from the top; what is not finite is left grey
};
struct Map {
    std::string title, note;
    Axis x, y; ///< with their ranges
    std::vector<Panel> panels; ///< side by side
    Axis scale; ///< of the colours; logarithmic for instance
    ColorScale colors = ColorScale::Values;
};
/// Beside each other, with the scale of colours.
std::string drawMap(Map const& map);
/// A panel alone as a PNG file, a pixel a value.
std::string pngOf(Panel const& panel, Axis const& scale, ColorScale colors);

} // namespace zsi::lab
