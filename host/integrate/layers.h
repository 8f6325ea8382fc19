// SPDX-License-Identifier: Apache-2.0
/// What layers of a film can show.
#pragma once

#include "film/film.h"
#include "integrate/integrator.h"

namespace zsi::host {

/// A kind of layer: its place in a film, and what a camera sample adds to it.
struct LayerKind {
    LayerFormat format;
    std::string meaning; ///< one line, with the unit
    SampleWants wants; ///< beside the sample's colour
    /// Writes a value for each channel; false where the sample has none. Null for counts.
    bool (*values)(CameraSample const& sample, float* values);
};

/// All kinds; the first, what the camera sees, is part of every film.
std::vector<LayerKind> const& layerKinds();
std::vector<std::string> layerNames(); ///< of those that a film may have beside the first

/// The layers of a film that has the first kind, and those of `names` in the order of
/// `layerKinds`, each once. "halves" stands for halves of the beauty and of what a denoiser wants
/// beside it; `halved` has them of the beauty alone. Throws InputError for an unknown name.
std::vector<LayerFormat> chooseLayers(std::vector<std::string> const& names, bool halved = false);

/// The kind of a layer of such a film; null for a layer of another origin.
LayerKind const* kindOf(LayerFormat const& format);

} // namespace zsi::host
