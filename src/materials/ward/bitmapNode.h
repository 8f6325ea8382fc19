/// A picture laid along the uv attribute or on a box round the reference position.
#pragma once

#include "runtime/shaderTable.h"

#include <zsi/vecmath.h>

namespace zsi {

#define BITMAP_NODE(P, U, A)                                                   \
    U(Mat4f, xform, "uv, or the reference position if isCube, to the picture") \
    U(TextureSampler2D, texture, "the picture, linear RGBA")                   \
    U(float, amount, "multiplier of the picture, alpha included")              \
    U(bool, isCube, "lay the picture on the six faces of a box, not along uv")

} // namespace zsi
