// SPDX-License-Identifier: Apache-2.0
/// From linear light to what a screen is sent.
#pragma once

#include <functional>
#include <span>
#include <string>
#include <vector>

namespace zsi::host {

/// How a linear picture becomes 8 bits for a screen.
struct ScreenView {
    float exposure = 0.0f; ///< stops
    bool alpha = false; ///< PNG alone: with the picture's alpha; otherwise it is opaque
    /// One of `toneCurveNames`, or a view of `ocioConfig`: "VIEW" of its default display, or
    /// "DISPLAY/VIEW". Empty: the config's default view; without a config, the first tone curve.
    std::string view = {};
    std::string ocioConfig = {}; ///< an OpenColorIO config file; empty: none

    bool operator==(ScreenView const&) const = default;
};

/// The default first (docs/scene-format.md tells what they do).
std::vector<std::string> const& toneCurveNames();

/// Takes linear RGB with Rec. 709 primaries, pixel after pixel, to signals of the screen in its
/// place: 0..1, not rounded; NaN becomes 0. Throws InputError for a config that cannot be read and
/// for a view that nobody knows.
std::function<void(std::span<float>)> screenTransform(ScreenView const& view);

} // namespace zsi::host
