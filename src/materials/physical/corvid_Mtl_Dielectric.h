// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/physical/shared/materialSkeleton.h"

namespace zsi {

/// Glass: a smooth or rough refracting interface with highlights of lights, traced reflection and
/// refraction, and coloured absorption inside.
#define DIELECTRIC(P, U, A)                                                                        \
    PHYSICAL_FRONT(P, U, A)                                                                        \
    P(bool, u_transmittanceMapEnable, (false), "absorption from the map, for traced refraction",   \
      group("absorption map"))                                                                     \
    P(TextureSampler2D, u_transmittanceMap, (), "colour kept after u_absorptionCoef of depth")     \
    U(Mat3f, u_transmittanceTransform, "UV transform of that map",                                 \
      when("u_transmittanceMapEnable"), when("u_transmittanceMap"))                                \
    P(float, u_transmittanceAmount, (1.0f), "multiplier of the map's colour", slider(0, 2))        \
    P(int, u_procedureMapEnable, (0), "1: cast ripple, where the first bump map is off",           \
      slider(0, 1), group("bump"))                                                                 \
    P(Vec3f, u_procedureMapTiling, (1.0f, 1.0f, 1.0f), "repeats of the ripple per world unit")     \
    P(float, u_procedureMapAmount, (0.0f), "depth of the ripple, either sign, about 0..0.5",       \
      slider(-0.5f, 0.5f))                                                                         \
    P(bool, u_normal0MapEnable, (false), "first bump map on")                                      \
    P(TextureSampler2D, u_normal0Map, (), "first bump map: height, r + g + b")                     \
    U(Mat3f, u_normal0Transform, "UV transform of the first bump map", when("u_normal0MapEnable"), \
      when("u_normal0Map"))                                                                        \
    P(float, u_normal0Amount, (0.0f), "depth of the first bump, either sign", slider(-1, 1))       \
    P(float, u_normal0UVScale, (1.0f), "further scale of the first bump's coordinate",             \
      slider(0, 10))                                                                               \
    P(bool, u_normal1MapEnable, (false), "second bump map on, on top of the first")                \
    P(TextureSampler2D, u_normal1Map, (), "second bump map: height, r + g + b")                    \
    U(Mat3f, u_normal1Transform, "UV transform of the second bump map",                            \
      when("u_normal1MapEnable"), when("u_normal1Map"))                                            \
    P(float, u_normal1Amount, (0.0f), "depth of the second bump, either sign", slider(-1, 1))      \
    P(bool, u_roughMapEnable, (false), "roughness from the map", group("roughness"))               \
    P(TextureSampler2D, u_roughMap, (), "roughness in its red channel")                            \
    P(float, u_roughValue, (0.0004f), "roughness without a map, above 0; below 0.01 smooth",       \
      slider(0, 1))                                                                                \
    U(Mat3f, u_roughTransform, "UV transform of the roughness map", when("u_roughMapEnable"),      \
      when("u_roughMap"))                                                                          \
    P(float, u_glossyValue, (0.0f), "not read by this material", slider(0, 1))                     \
    P(float, u_roughAmount, (1.0f), "multiplier of the roughness map", slider(0, 2))               \
    P(float, u_ior, (1.52f), "refractive index, above 0", slider(1, 3), group("glass"))            \
    P(float, u_reflectance, (0.1f), "reflectance at normal incidence, 0..1", slider(0, 1))         \
    P(Vec3f, u_absorptionCoef, (0.0f, 0.0f, 0.0f), "decades per world unit and channel")           \
    P(bool, u_falloffEnable, (false), "absorb along traced paths too, not only shadow rays")       \
    P(Vec3f, u_refractColor, (1.0f, 1.0f, 1.0f), "tint of transmitted light, linear RGB")          \
    P(Vec3f, u_reflectColor, (1.0f, 1.0f, 1.0f), "tint of reflected light, linear RGB")

class corvid_Mtl_Dielectric final : public MaterialShader,
                                    public PhysicalShading<corvid_Mtl_Dielectric> {
public:
    SHADER(corvid_Mtl_Dielectric, kShade | kTransmission | kTransfer | kSample, DIELECTRIC)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
    void transfer(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const;
    /// Frame of a world-space normal, bent by the ripple or the first bump map, then the second.
    void f_computeShadingFrame(IShaderAPI* api, ShadeState const& state, Vec3f const& P,
                               Vec3f const& N, Mat4f const& toWorld, SLArray<Vec3f>& frame) const;

private:
    /// Refractive indices on the two sides: of the incident ray, and beyond the surface.
    struct Indices {
        float outer, inner;
        float eta() const { return outer / inner; }
    };
    /// What becomes of a path at a facet of normal m: it goes on along `alongFacet` m - `alongView`
    /// v, or ends where the weight is negative.
    struct Event {
        float weight, alongFacet, alongView;
        bool refracts;
        bool ends() const { return weight < 0.0f; }
    };
    Indices indices(ShadeState const& state, bool leaving) const;
    float roughness(ShadeState const& state) const;
    float mappedRoughness(ShadeState const& state) const;
    bool bends() const;
    SLArray<Vec3f> bentFrame(IShaderAPI* api, ShadeState const& state, Vec3f const& P,
                             Mat4f const& toWorld, SLArray<Vec3f> frame) const;
    float lightValue(SLArray<Vec3f> const& frame, Vec3f v, Vec3f L, Indices n, float r,
                     float F) const;
    Vec3f pathTransmittance(ShadeState const& state) const;
    Event chooseEvent(IShaderAPI* api, ShadeState const& state, float cosine, float c,
                      float eta) const;
    void samplePolished(IShaderAPI* api, ShadeState& state, SLArray<Vec3f>& frame, bool framed,
                        Indices n) const;
    void sampleRough(IShaderAPI* api, ShadeState& state, SLArray<Vec3f>& frame, bool framed,
                     Indices n, float r) const;
    static void continuePath(ShadeState& state, SLArray<Vec3f> const& frame, Vec3f d, float weight,
                             Event event, Indices n);
};

} // namespace zsi
