// SPDX-License-Identifier: Apache-2.0
/// Suggestions for names that a user mistyped.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace zsi::host {

/// Up to three of `candidates` that are close to `name` by edit distance (insertion, deletion,
/// replacement, swap of neighbours; letter case counts nothing) or that contain it, nearest first;
/// where there are none, those that share the stem of a word with it, as "rough" in "roughness".
std::vector<std::string> nearestNames(std::string_view name,
                                      std::vector<std::string> const& candidates);

/// The end of an error message: "; did you mean a or b?", or "; known: a, b, c" when nothing is
/// near and there are few, or nothing.
std::string suggestion(std::string_view name, std::vector<std::string> const& candidates);

std::string lowered(std::string_view text); ///< ASCII letters

/// `text` for a message: control characters escaped, and cut when very long.
std::string printable(std::string_view text);

} // namespace zsi::host
