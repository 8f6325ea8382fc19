// SPDX-License-Identifier: Apache-2.0
/// Two-colour noise of a position: plain, fractal or turbulent.
#pragma once

#include "materials/ward/network.h"

namespace zsi {

/// A noise between the values of two nodes.
#define NOISE_ROWS(U, path)   \
    NOISE_PLACE_ROWS(U, path) \
    NOISE_SHAPE_ROWS(U, path)

/// A noise between two constant colours.
#define COLOR_NOISE_ROWS(U, path)                                      \
    NOISE_PLACE_ROWS(U, path)                                          \
    U(Vec4f, path##_Noise_color1, "colour of low noise, linear RGBA")  \
    U(Vec4f, path##_Noise_color2, "colour of high noise, linear RGBA") \
    NOISE_SHAPE_ROWS(U, path)

#define NOISE_PLACE_ROWS(U, path)                                                            \
    U(Mat4f, path##_Noise_xform, "reference position to noise space, before size",           \
      group(#path "_Noise"))                                                                 \
    U(int, path##_Noise_type, "0 plain, 1 fractal, 2 turbulence; others a noise value of 0", \
      slider(0, 2))
#define NOISE_SHAPE_ROWS(U, path)                                                                \
    U(float, path##_Noise_size, "size of a noise cell, in units of noise space; 0 counts as 1",  \
      slider(0, 10))                                                                             \
    U(float, path##_Noise_thresholdLow, "noise value below which color1 is pure", slider(0, 1))  \
    U(float, path##_Noise_thresholdHigh, "noise value above which color2 is pure", slider(0, 1)) \
    U(float, path##_Noise_levels, "octaves of types 1 and 2; a fraction counts as a whole one",  \
      slider(1, 10), when(#path "_Noise_type", 1, 2))                                            \
    U(float, path##_Noise_phase, "fourth coordinate of the noise, to animate it", slider(0, 10), \
      groupEnd())

#define NOISE_VALUE(site, path, color1, color2)                                               \
    noiseNode(site, {color1, color2}, path##_Noise_thresholdLow, path##_Noise_thresholdHigh,  \
              path##_Noise_xform, path##_Noise_size, path##_Noise_levels, path##_Noise_phase, \
              path##_Noise_type)

/// color1 and color2 blended by the noise value between the thresholds; equal thresholds blend by
/// the noise value itself. p: reference position. xform: see the rows.
/// Octaves as in Perlin 1985, "An Image Synthesizer".
Vec4f f_Noise(IShaderAPI* api, ShadeState const& state, Vec2f uv, Vec3f p, Vec4f color1,
              Vec4f color2, float thresholdLow, float thresholdHigh, Mat4f const& xform, float size,
              float levels, float phase, int type);

inline Vec4f noiseNode(NetworkSite const& at, NodeInputs const& colors, float thresholdLow,
                       float thresholdHigh, Mat4f const& xform, float size, float levels,
                       float phase, int type)
{
    return f_Noise(at.api, at.state, at.uv, at.position, colors.first, colors.second, thresholdLow,
                   thresholdHigh, xform, size, levels, phase, type);
}

} // namespace zsi
