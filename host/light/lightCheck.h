// SPDX-License-Identifier: Apache-2.0
/// Lights that cannot light anything.
#pragma once

#include "scene/scene.h"

namespace zsi::host {

/// Whether the light brings anything anywhere; one of a shader is asked along its axis, from a
/// thousandth of a unit to a million units away, with nothing in between.
bool lightsAnything(Light const& light);

} // namespace zsi::host
