// SPDX-License-Identifier: Apache-2.0
/// A finished picture.
#pragma once

#include "film/window.h"

#include <string>
#include <vector>

namespace zsi::host {

/// Float channels over the pixels of a window, rows from the top, channels of a pixel together.
struct Layer {
    std::string name;
    std::vector<std::string> channels; ///< such as "R", "G", "B", "A"
    std::vector<float> values;

    bool operator==(Layer const&) const = default;
};

/// A named text of a picture's file, such as the manifest of a layer.
struct Attachment {
    std::string name, text;

    bool operator==(Attachment const&) const = default;
};

/// Layers over one window of a frame. The first is what the camera sees: linear R, G, B and A.
struct Picture {
    int frameWidth = 0, frameHeight = 0; ///< of the whole picture, which a crop is a part of
    Window window; ///< the pixels that are here
    std::vector<Layer> layers;
    std::vector<Attachment> attachments = {}; ///< for the header of an EXR

    int width() const { return window.width(); }
    int height() const { return window.height(); }
    std::vector<float> const& rgba() const { return layers.front().values; }
    Layer const* find(std::string const& name) const ///< null when there is none
    {
        for (Layer const& layer : layers)
            if (layer.name == name)
                return &layer;
        return nullptr;
    }

    bool operator==(Picture const&) const = default;
};

} // namespace zsi::host
