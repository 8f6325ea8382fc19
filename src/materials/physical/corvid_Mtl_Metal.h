// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/physical/metalLobe.h"
#include "materials/physical/shared/anisoRotation.h"
#include "materials/physical/shared/materialSkeleton.h"
#include "materials/physical/shared/safeReflect.h"

namespace zsi {

/// Polished to rough, brushed or patterned metal: anisotropic GGX facets with the light that
/// bounces between them, coloured by a conductor's reflectance, and a cut-out.
#define METAL(P, U, A)                                                                           \
    PHYSICAL_FRONT(P, U, A)                                                                      \
    P(bool, u_patternEnable, (false), "pattern bump map on", group("bump"))                      \
    P(TextureSampler2D, u_patternMap, (), "pattern bump map: height, r + g + b")                 \
    U(Mat3f, u_patternTransform, "UV transform of the pattern", when("u_patternEnable"),         \
      when("u_patternMap"))                                                                      \
    P(float, u_patternAmount, (0.0f), "depth of pattern and facets, either sign", slider(-1, 1)) \
    P(int, u_bumpSwitcher, (0), "1: pyramid facets by uv, on top of the pattern", slider(0, 1))  \
    P(float, u_uvScale, (1.0f), "pyramid facets per two uv units", slider(0, 100))               \
    P(bool, u_reflectMapEnable, (false), "colour from the map", group("colour"))                 \
    P(TextureSampler2D, u_reflectMap, (), "reflectance at normal incidence")                     \
    P(Vec3f, u_reflectColor, (0.91f, 0.92f, 0.92f), "reflectance at normal incidence, 0..1")     \
    U(Mat3f, u_reflectTransform, "UV transform of the colour map", when("u_reflectMapEnable"),   \
      when("u_reflectMap"))                                                                      \
    P(float, u_reflectAmount, (1.0f), "multiplier of the colour map", slider(0, 2))              \
    P(bool, u_edgeMapEnable, (false), "edge tint from the map", group("edge tint"))              \
    P(TextureSampler2D, u_edgeMap, (), "edge tint")                                              \
    P(Vec3f, u_edgeColor, (1.0f, 1.0f, 1.0f), "tint of the reflectance at 82 degrees, 0..1")     \
    U(Mat3f, u_edgeTransform, "UV transform of the edge tint map", when("u_edgeMapEnable"),      \
      when("u_edgeMap"))                                                                         \
    P(float, u_edgeAmount, (1.0f), "multiplier of the edge tint map", slider(0, 2))              \
    P(bool, u_roughMapEnable, (false), "roughness from the map", group("roughness"))             \
    P(TextureSampler2D, u_roughMap, (), "roughness in its red channel")                          \
    P(float, u_roughValue, (0.2f), "width of the facets' slopes along the tangent, 0.001..1",    \
      slider(0.001f, 1))                                                                         \
    U(Mat3f, u_roughTransform, "UV transform of the roughness map", when("u_roughMapEnable"),    \
      when("u_roughMap"))                                                                        \
    P(float, u_roughAmount, (1.0f), "multiplier of the roughness map", slider(0, 2))             \
    P(bool, u_anisotropyMapEnable, (false), "anisotropy from the map", group("anisotropy"))      \
    P(TextureSampler2D, u_anisotropyMap, (), "anisotropy in its red channel")                    \
    P(float, u_anisotropyValue, (1.0f), "width along the bitangent over the other, 0.1..10",     \
      slider(0.1f, 10))                                                                          \
    U(Mat3f, u_anisotropyTransform, "UV transform of the anisotropy map",                        \
      when("u_anisotropyMapEnable"), when("u_anisotropyMap"))                                    \
    P(float, u_anisotropyAmount, (1.0f), "multiplier of the anisotropy map", slider(0, 2))       \
    P(bool, u_anisoRotationMapEnable, (false), "rotation of the tangent from the map")           \
    P(TextureSampler2D, u_anisoRotationMap, (), "rotation in its red channel, radians")          \
    P(float, u_anisoRotationValue, (0.0f), "rotation of the tangent to the bitangent, radians",  \
      slider(-3.1416f, 3.1416f))                                                                 \
    U(Mat3f, u_anisoRotationTransform, "UV transform of the rotation map",                       \
      when("u_anisoRotationMapEnable"), when("u_anisoRotationMap"))                              \
    P(bool, u_cutoutMapEnable, (false), "cut holes by the map", group("cut-out"))                \
    P(TextureSampler2D, u_cutoutMap, (), "1 keeps the metal, 0 is a hole, in its red channel")   \
    U(Mat3f, u_cutoutTransform, "UV transform of the cut-out map", when("u_cutoutMapEnable"),    \
      when("u_cutoutMap"))                                                                       \
    P(float, u_cutoutAmount, (1.0f), "multiplier of the cut-out map", slider(0, 2))

class corvid_Mtl_Metal final : public MaterialShader,
                               public PhysicalShading<corvid_Mtl_Metal>,
                               public AnisoRotationFunctions<corvid_Mtl_Metal>,
                               public SafeReflectFunctions {
public:
    static constexpr bool kMaskSaturates = true;

    SHADER(corvid_Mtl_Metal, kShade | kTransmission | kTransfer | kSample, METAL)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
    void transfer(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const;
    /// Frame of a world-space normal, bent by the pattern, then by the pyramid facets; the facets
    /// leave the normal unnormalised.
    void f_computeShadingFrameNative(IShaderAPI* api, ShadeState const& state, Vec3f const& P,
                                     Vec3f const& N, Mat3f const& toWorld,
                                     SLArray<Vec3f>& frame) const;

private:
    /// What a ray meets: the lobe's orthonormal frame, its tangent along the brush marks, the
    /// geometric normal on the ray's side, and the way back in the frame.
    struct Surface {
        SLArray<Vec3f> frame;
        Vec3f Ng, v;
    };
    struct Reflected {
        Vec3f direction;
        MetalLobe::Sample sample;
    };
    SLArray<Vec3f> bentFrame(IShaderAPI* api, ShadeState const& state, Vec3f Nf, Vec3f Ng) const;
    void bendByFacets(IShaderAPI* api, ShadeState const& state, SLArray<Vec3f>& frame) const;
    Surface surface(IShaderAPI* api, ShadeState const& state) const;
    AnisotropicGgx facets(ShadeState const& state) const;
    float coverage(ShadeState const& state) const;
    MetalLobe lobe(ShadeState const& state, Vec3f const& v) const;
    static Reflected sampleReflected(IShaderAPI* api, MetalLobe const& metal, Surface const& s);
};

} // namespace zsi
