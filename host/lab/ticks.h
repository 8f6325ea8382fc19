// SPDX-License-Identifier: Apache-2.0
/// Where an axis has its numbers, and how they are written.
#pragma once

#include <string>
#include <vector>

namespace zsi::lab {

/// What an axis shows. The range follows from the data where it is not given.
struct Axis {
    std::string title; ///< with its unit
    bool logarithmic = false;
    double from = 0, to = 0; ///< equal: to be chosen
    double step = 0; ///< between numbers of a linear axis; 0: to be chosen

    bool isSet() const { return from < to; }
};

/// `axis` with a range that holds all of the finite `values` and ends at numbers. A logarithmic one
/// begins no further than `decades` below the largest, so that a vanishing tail does not press the
/// rest together.
Axis fitted(Axis axis, std::vector<double> const& values, int decades = 5);

/// Numbers of a fitted axis: 1, 2 or 5 times a power of ten apart (Heckbert 1990, "Nice Numbers for
/// Graph Labels"), about `count` of them; decades of a logarithmic one.
std::vector<double> ticksOf(Axis const& axis, int count = 6);

/// Share of the axis at `value`, 0 at its beginning.
double placeOn(Axis const& axis, double value);

/// Shortest text of a number on an axis, with a true minus sign.
std::string numberText(double value);

} // namespace zsi::lab
