// SPDX-License-Identifier: Apache-2.0
/// Lengths that a scene leaves open.
#pragma once

#include "load/sceneBuilder.h"

namespace zsi::host {

/// Scales the defaults of lengths that no one wrote to the objects that show them: the longest side
/// of the instance's box; of several instances the median, the smaller of two. Notes what it did.
void suitOpenLengths(SceneBuilder& builder);

} // namespace zsi::host
