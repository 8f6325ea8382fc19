// SPDX-License-Identifier: Apache-2.0
/// The photographer's studio that models and classes are shown in.
#pragma once

#include "json/jsonTree.h"

#include <zsi/types.h>

namespace zsi::host {

/// Which parts of the studio there are.
struct StageParts {
    bool camera = true, lights = true, ground = true;
};

/// First all lengths are multiplied by `scale`, then all is turned around z and moved.
struct StagePlacing {
    float scale = 1;
    float turn = 0; ///< radians, counterclockwise from above
    Vec3f at{0, 0, 0};
};

/// A scene with film, settings and what `parts` names: a floor that bends up into a wall
/// (named "ground", of material "ground"), soft boxes ("key", "top", "rim", "front") and a dim
/// ceiling. What stands in it is about 2.4 wide around (0, 0, 0.95), on z = 0; `placing` says where
/// it is.
JsonValue stage(StagePlacing const& placing, StageParts const& parts);

} // namespace zsi::host
