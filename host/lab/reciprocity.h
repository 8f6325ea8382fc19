// SPDX-License-Identifier: Apache-2.0
/// Whether light goes either way alike.
#pragma once

#include "lab/specimen.h"

namespace zsi::lab {

/// Two values that should be one, relative to the larger; next to nothing counts as alike.
double reciprocityError(Vec3f there, Vec3f back);

} // namespace zsi::lab
