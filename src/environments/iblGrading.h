// SPDX-License-Identifier: Apache-2.0
/// Image-based lighting that the environments share: cube lookup and colour grading.
#pragma once

#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// How a channel's cube colour is graded, in this order: contrast, gain, saturation.
struct IblGrade {
    Vec2f contrast; ///< pivot, amount; an amount of exactly 1 leaves the colour
    int gainMode; ///< 1: per channel; 2: gain colour times luminance; else none
    Vec3f gain;
    float saturation; ///< exactly 1 leaves the colour
};

/// luminanceFactors: weights that turn RGB into a luminance. Nothing is clamped.
inline Vec3f gradeIbl(Vec3f c, IblGrade const& grade, Vec3f const& luminanceFactors)
{
    Vec3f const f = luminanceFactors;
    float const amount = grade.contrast.y;
    if (amount != 1.0f)
        c = c * amount + grey(grade.contrast.x * (1.0f - amount));
    if (grade.gainMode == 2)
        c = grade.gain * (c.z * f.z + (c.x * f.x + c.y * f.y));
    else if (grade.gainMode == 1)
        c = c * grade.gain;
    if (grade.saturation != 1.0f)
        c = c * grade.saturation + grey(dot(f, c) * (1.0f - grade.saturation));
    return c;
}

/// The axis swap (x, z, -y) that turns the scene's up axis into the cube map's.
constexpr Vec3f cubeCoordinate(Vec3f v) { return {v.x, v.z, -v.y}; }

/// Texel of the cube along a world direction.
inline Vec4f lookupIbl(TextureSamplerCube const& cube, Mat3f const& rotation,
                       Vec3f const& direction)
{
    return cube.lookup(cubeCoordinate(rotate(rotation, direction)));
}

} // namespace zsi
