// SPDX-License-Identifier: Apache-2.0
/// Colour grading with a gain source, for materials that look up cube maps and pictures of their
/// own.
#pragma once

#include "environments/iblGrading.h"

namespace zsi {

/// Graded in this order: contrast, gain, saturation. Every field at its default here leaves a
/// colour to the bit.
struct ChannelGrade {
    Vec3f contrastPivot{1.0f, 1.0f, 1.0f}; ///< per channel, what contrast leaves in place
    float contrast = 1.0f; ///< 0 the pivot, 1 unchanged, above 1 steeper
    Vec3f gainColor{1.0f, 1.0f, 1.0f};
    int gainSource = 0; ///< what the value scales: 0 colour, 1 colour times gainColor per channel,
                        ///< 2 gainColor times luminance; others as 0
    float gain = 1.0f;
    float saturation = 1.0f; ///< 0 grey, 1 unchanged
};

/// Luminance of linear Rec. 709 colours, with the weights that the environments default to.
constexpr float luminance(Vec3f c) { return 0.2125f * c.x + 0.7154f * c.y + 0.0721f * c.z; }

/// Contrast and saturation can take more away than there is; what is below 0 then is dark. NaN
/// stays.
constexpr Vec3f notBelowZero(Vec3f c)
{
    return {0.0f > c.x ? 0.0f : c.x, 0.0f > c.y ? 0.0f : c.y, 0.0f > c.z ? 0.0f : c.z};
}

inline Vec3f gradeChannel(Vec3f c, ChannelGrade const& grade)
{
    if (grade.contrast != 1.0f)
        c = notBelowZero(c * grade.contrast + grade.contrastPivot * (1.0f - grade.contrast));
    if (grade.gainSource == 1)
        c = c * grade.gainColor;
    else if (grade.gainSource == 2)
        c = grade.gainColor * luminance(c);
    c = c * grade.gain;
    if (grade.saturation != 1.0f)
        c = notBelowZero(c * grade.saturation + grey(luminance(c) * (1.0f - grade.saturation)));
    return c;
}

/// Rows of the grade that all cubes of a material have, and of their rotation. After P, U and A
/// comes when that is read: with which cubes.
#define GLOBAL_IBL(P, U, A, ...)                                                               \
    P(Vec3f, globalIBLContrastPivot, (1.0f, 1.0f, 1.0f), "all cubes: contrast pivot",          \
      group("grading of all cubes"))                                                           \
    P(float, globalIBLContrastValue, (1.0f), "all cubes: contrast, 1 unchanged", slider(0, 2)) \
    P(Vec3f, globalIBLGainColor, (1.0f, 1.0f, 1.0f), "all cubes: gain colour")                 \
    P(float, globalIBLSatValue, (1.0f), "all cubes: saturation, 1 unchanged, 0 grey",          \
      slider(0, 2))                                                                            \
    P(int, globalIBLGainSource, (0), "all cubes: 0 value, 1 colour, 2 colour of luminance",    \
      slider(0, 2))                                                                            \
    P(float, globalIBLGainValue, (1.0f), "all cubes: gain", slider(0, 4))                      \
    U(Mat3f, globalIBLMatrix, "rotation of directions before cube lookups", groupEnd(), __VA_ARGS__)

/// Light from a world direction by a cube of a shader that has these rows, graded for all its
/// cubes.
inline Vec3f globalIbl(auto const& s, TextureSamplerCube const& cube, Vec3f const& direction)
{
    return gradeChannel(rgb(lookupIbl(cube, s.globalIBLMatrix, direction)),
                        {s.globalIBLContrastPivot, s.globalIBLContrastValue, s.globalIBLGainColor,
                         s.globalIBLGainSource, s.globalIBLGainValue, s.globalIBLSatValue});
}

} // namespace zsi
