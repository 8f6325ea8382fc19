// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/legacy/flakeLayer.h"
#include "materials/physical/shared/materialSkeleton.h"

namespace zsi {

/// Measured metallic car paint: a dark base and a layer of flakes under a clear coat.
#define XRITE(P, U, A)                                                                             \
    AMBIENT_OCCLUSION(P, U, A)                                                                     \
    MASKING(P, U, A)                                                                               \
    P(bool, reverseNormal, (false), "flip the shading normal", group("paint"))                     \
    P(bool, faceForward, (false), "turn the shading normal towards the viewer")                    \
    P(Vec3f, xriteDiffuse, (0.0049f, 0.0049f, 0.0045f), "base colour as measured, Rec. 709")       \
    P(Vec3f, flakeColor, (0.104f, 0.106f, 0.108f), "colour of flakes that lie flat, as measured")  \
    P(Vec3f, flakeColor2, (0.0953f, 0.0958f, 0.0976f), "colour of flakes that lean, as measured")  \
    P(Vec4f, fresnel, (0.04f, 0.9f, 2.5f, 1.0f), "coat: base, scale, exponent, ceiling")           \
    P(bool, xriteIsSolid, (false), "solid paint: no flakes")                                       \
    P(float, coarseness, (0.656f), "scales the slopes of the flakes, 0 all flat; -3 to 3 count",   \
      slider(0, 3))                                                                                \
    P(float, specIntensity, (1.0f), "scales what the coat and the flakes mirror", slider(0, 2))    \
    P(float, diffIntensity, (1.0f), "scales the base", slider(0, 2))                               \
    P(float, contributionFactor, (0.75f), "scales the flakes", slider(0, 2))                       \
    P(float, maxFlakes, (7.0f), "most flakes told apart under one view ray, 0..16",                \
      slider(0, 16, 1))                                                                            \
    P(float, flakeFactor, (4.0f), "repeats of the flake pattern per unit of uv", slider(0, 32))    \
    P(float, flakeSize, (0.001953125f), "width of a flake in one repeat, 1/512", slider(0, 0.01f)) \
    P(TextureSampler2D, flakeNormalTexture, (), "flake normals, (x+1)/2, (y+1)/2, z; linear")      \
    P(TextureSamplerCube, diffuseCube, (), "light on the base; without it, the host's",            \
      group("cubes"))                                                                              \
    P(TextureSamplerCube, specularCube, (), "light on the flakes; without it, traced")             \
    P(TextureSamplerCube, reflectCube, (), "what the coat mirrors; without it, traced")            \
    A(Vec2f, uv)

class XRite final : public MaterialShader,
                    public MaskingFunctions<XRite>,
                    public AmbientOcclusionFunctions<XRite> {
public:
    static constexpr bool kMaskSaturates = true;

    SHADER(XRite, kShade | kTransmission, XRITE)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;

    /// Normal that the flake texture holds at uv, not unit; its z is stored as it is.
    Vec3f f_getFlakeNormal(IShaderAPI* api, ShadeState const& state, Vec2f uv) const;
    /// Reflectance of the coat, `curveFresnel` at v.z. v: local direction to the viewer.
    float f_fast_fresnel(IShaderAPI* api, ShadeState const& state, Vec3f v, Vec4f curve) const;
    /// sRGB transfer curve per channel.
    Vec3f f_r709tosRGB(IShaderAPI* api, ShadeState const& state, Vec3f c) const;

private:
    Vec3f paint(IShaderAPI* api, ShadeState const& state) const;
    FlakeLayer flakes(IShaderAPI* api, ShadeState const& state) const;
    Vec2f flakeSlope(IShaderAPI* api, ShadeState const& state, Vec3i cell, float scale) const;
};

} // namespace zsi
