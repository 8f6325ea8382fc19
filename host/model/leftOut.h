// SPDX-License-Identifier: Apache-2.0
/// What of a model has no counterpart in a scene.
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace zsi::host {

/// Each thing is told once, with those that have it.
class LeftOut {
public:
    /// `what`: a sentence's end, such as "sheen is left out"; `who`: a material's name, or nothing.
    void add(std::string const& what, std::string const& who = {});
    /// "car.glb: sheen is left out (Seat, Roof and 2 more)".
    std::vector<std::string> warnings(std::string const& file) const;

private:
    std::vector<std::pair<std::string, std::vector<std::string>>> things_;
};

} // namespace zsi::host
