// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/noiseNode.h"

#include <zsi/vecmath.h>

namespace zsi {
namespace {

/// Octaves beyond this are finer than a float of the sum can tell.
constexpr int kMaxOctaves = 32;

/// Sum of octaves of the signed noise, each of twice the frequency and half the weight of the one
/// before. A fraction of `levels` adds one more octave in full.
template <class Octave>
float sumOctaves(float levels, Octave const& octave)
{
    float sum = 0.0f;
    float frequency = 1.0f;
    for (int i = 0; i < kMaxOctaves && levels > 0.0f; ++i) {
        sum += octave(frequency) / frequency;
        frequency *= 2.0f;
        levels -= 1.0f;
    }
    return sum;
}

float noiseValue(IShaderAPI* api, Vec3f q, float levels, float phase, int type)
{
    auto const noise = [&](float frequency) {
        Vec4f const at = withAlpha(q * frequency, phase);
        return api->noise3D(&at);
    };
    auto const signedNoise = [&](float frequency) { return 2.0f * noise(frequency) - 1.0f; };
    switch (type) {
    case 0:
        return noise(1.0f);
    case 1:
        return (sumOctaves(levels, signedNoise) + 1.0f) * 0.5f;
    case 2:
        return sumOctaves(levels, [&](float f) { return std::fabs(signedNoise(f)); });
    default:
        return 0.0f;
    }
}

/// 0 below low, 1 above high, linear between; `v` itself where they are equal.
float blendWeight(float v, float low, float high)
{
    if (low - high == 0.0f)
        return v;
    if (v < low)
        return 0.0f;
    if (v > high)
        return 1.0f;
    return (v - low) / (high - low);
}

} // namespace

Vec4f f_Noise(IShaderAPI* api, ShadeState const&, Vec2f, Vec3f p, Vec4f color1, Vec4f color2,
              float thresholdLow, float thresholdHigh, Mat4f const& xform, float size, float levels,
              float phase, int type)
{
    Vec3f const placed = transformPoint(xform, p);
    Vec3f const q = size != 0.0f ? placed / size : placed;
    float const v = noiseValue(api, q, levels, phase, type);
    float const w = blendWeight(v, thresholdLow, thresholdHigh);
    return color1 * (1.0f - w) + color2 * w;
}

} // namespace zsi
