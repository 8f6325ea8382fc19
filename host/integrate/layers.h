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
    /// Writes a value for each channel; false where the sample has none. Null for counts.
    bool (*values)(CameraSample const& sample, float* values);
};

/// All kinds; the first, what the camera sees, is part of every film.
std::vector<LayerKind> const& layerKinds();
std::vector<std::string> layerNames(); ///< of those that a film may have beside the first

/// The first kind, and those of `names` in the order of `layerKinds`, each once. Throws InputError
/// for an unknown name.
std::vector<LayerKind> chooseLayers(std::vector<std::string> const& names);

} // namespace zsi::host
