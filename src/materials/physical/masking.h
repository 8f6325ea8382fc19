/// The mask that cuts a material out: parameters and evaluation.
#pragma once

#include "runtime/shaderTable.h"

#include <zsi/vecmath.h>

namespace zsi {

#define MASKING(P, U, A)                                                                          \
    P(Vec3f, maskingColor, (0.0f, 0.0f, 0.0f), "mask of mode 0: 0 keeps the material, 1 removes") \
    P(int, maskingMode, (0), "-1 off, 0 constant, 1 UV, 2 planar, 3 box, 4 cylindrical")          \
    P(TextureSampler2D, maskingTexture, (), "mask map")                                           \
    U(Mat4f, maskingTextureMatrix, "position to texture, modes 2 to 4")                           \
    P(bool, maskingInvertTexture, (false), "invert the mask, modes above 0")                      \
    P(float, maskingAngularRepeat, (1.0f), "repeats around the axis, mode 4")                     \
    U(Mat3f, maskingUVMatrix, "UV transform, mode 1")                                             \
    P(bool, maskingFromAlpha, (false), "take the mask from the alpha of the map")

} // namespace zsi
