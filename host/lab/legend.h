// SPDX-License-Identifier: Apache-2.0
/// What charts of all kinds have: title and legend.
#pragma once

#include "lab/chart.h"
#include "lab/svg.h"

namespace zsi::lab {

constexpr double kChartWidth = 720;

/// Writes title and note at the top; the height that they take.
double drawTitle(Svg& svg, std::string const& title, std::string const& note);
/// Writes the curves' labels in as many rows as they take, from `y` on; the height of that.
double drawLegend(Svg& svg, std::vector<Curve> const& curves, double y);

} // namespace zsi::lab
