// SPDX-License-Identifier: Apache-2.0
/// Layers of a film as a screen shows them.
#pragma once

#include "film/film.h"
#include "film/screenTransform.h"
#include "scene/scene.h"

#include <cstdint>
#include <string>
#include <vector>

namespace zsi::view {

/// A picture for the screen: RGBA of 8 bits, rows from the top.
struct ShownPicture {
    int width = 0, height = 0;
    std::vector<std::uint8_t> rgba;
};

/// How a layer's numbers become colours. Light goes through the film's exposure and view; albedo is
/// sRGB; normals are spread from -1..1; positions and distances are relative to how far the camera
/// looks; shares of names get a colour each; counts are relative to the scene's samples.
class Display {
public:
    explicit Display(host::Scene const& scene);

    /// Writes pixels of `layer`, one of a picture of the film, over those of `shown` in its
    /// window. Throws InputError as `screenTransform` does.
    void show(host::Picture const& picture, host::Layer const& layer, ShownPicture& shown) const;

private:
    host::ScreenView view_;
    Vec3f target_;
    float reach_; ///< from the camera to its target
    float samples_;
};

/// The layer that shows what a page asks for; those of names have several. Null: not there.
host::Layer const* layerFor(host::Picture const& picture, std::string const& name);

} // namespace zsi::view
