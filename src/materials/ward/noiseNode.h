/// Two-colour noise of a position: plain, fractal or turbulent.
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

#define NOISE_NODE_PLACE(P, U, A)                                     \
    U(Mat4f, xform, "reference position to noise space, before size") \
    U(int, type, "0 plain, 1 fractal, 2 turbulence; others a noise value of 0")
#define NOISE_NODE_COLORS(P, U, A)                       \
    U(Vec4f, color1, "colour of low noise, linear RGBA") \
    U(Vec4f, color2, "colour of high noise, linear RGBA")
#define NOISE_NODE_SHAPE(P, U, A)                                                  \
    U(float, size, "size of a noise cell, in units of noise space; 0 counts as 1") \
    U(float, thresholdLow, "noise value below which color1 is pure")               \
    U(float, thresholdHigh, "noise value above which color2 is pure")              \
    U(float, levels, "octaves of types 1 and 2; a fraction counts as a whole one") \
    U(float, phase, "fourth coordinate of the noise, to animate it")

/// Members of a class whose network has a noise node.
struct NoiseFunctions {
    /// color1 and color2 blended by the noise value between the thresholds; equal thresholds
    /// blend by the noise value itself. p: reference position. xform: see the rows.
    /// Octaves as in Perlin 1985, "An Image Synthesizer".
    Vec4f f_Noise(IShaderAPI* api, ShadeState const& state, Vec2f uv, Vec3f p, Vec4f color1,
                  Vec4f color2, float thresholdLow, float thresholdHigh, Mat4f const& xform,
                  float size, float levels, float phase, int type) const;
};

} // namespace zsi
