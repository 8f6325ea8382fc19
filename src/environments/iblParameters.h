// SPDX-License-Identifier: Apache-2.0
/// The grading parameters that both environments begin with.
#pragma once

#include "environments/iblGrading.h"

namespace zsi {

#define IBL_GRADING(P, U, A)                                                                     \
    P(Vec3f, IBLLuminanceFactors, (0.2125f, 0.7154f, 0.0721f),                                   \
      "weights that turn RGB into a luminance", group("grading"))                                \
    U(Mat3f, globalIBLMatrix, "rotation of the ray direction before a cube lookup",              \
      whenAny("reflectionCube", "diffuseCube"))                                                  \
    P(Vec2f, diffuseIBLContrast, (0.5f, 1.0f), "diffuse: contrast pivot, contrast amount")       \
    P(int, diffuseIBLGainMode, (0), "diffuse: 0 none, 1 per channel, 2 gain times luminance",    \
      slider(0, 2))                                                                              \
    P(Vec3f, diffuseIBLGain, (1.0f, 1.0f, 1.0f), "diffuse: gain colour")                         \
    P(float, diffuseIBLSaturation, (1.0f), "diffuse: saturation, 1 unchanged, 0 grey",           \
      slider(0, 2))                                                                              \
    P(Vec2f, reflectIBLContrast, (0.5f, 1.0f), "reflection: contrast pivot, contrast amount")    \
    P(int, reflectIBLGainMode, (0), "reflection: 0 none, 1 per channel, 2 gain times luminance", \
      slider(0, 2))                                                                              \
    P(Vec3f, reflectIBLGain, (1.0f, 1.0f, 1.0f), "reflection: gain colour")                      \
    P(float, reflectIBLSaturation, (1.0f), "reflection: saturation, 1 unchanged, 0 grey",        \
      slider(0, 2), groupEnd())

/// What diffuse rays see of a cube; the alpha of the texel is replaced by 1. The grade is read
/// after the lookup, so that nothing of it is saved across the call.
inline Vec4f diffuseIbl(auto const& s, TextureSamplerCube const& cube, Vec3f const& direction)
{
    Vec4f const texel = lookupIbl(cube, s.globalIBLMatrix, direction);
    IblGrade const grade{s.diffuseIBLContrast, s.diffuseIBLGainMode, s.diffuseIBLGain,
                         s.diffuseIBLSaturation};
    return withAlpha(gradeIbl(rgb(texel), grade, s.IBLLuminanceFactors), 1.0f);
}

/// What reflection rays see of a cube, likewise.
inline Vec4f reflectIbl(auto const& s, TextureSamplerCube const& cube, Vec3f const& direction)
{
    Vec4f const texel = lookupIbl(cube, s.globalIBLMatrix, direction);
    IblGrade const grade{s.reflectIBLContrast, s.reflectIBLGainMode, s.reflectIBLGain,
                         s.reflectIBLSaturation};
    return withAlpha(gradeIbl(rgb(texel), grade, s.IBLLuminanceFactors), 1.0f);
}

} // namespace zsi
