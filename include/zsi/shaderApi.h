// SPDX-License-Identifier: Apache-2.0
/// The host's services during one shading call.
#pragma once

#include <cstddef>
#include <zsi/types.h>

namespace zsi {

/// One light of the list that `getLightSamples` returns. Owned by the host, read-only to
/// shaders, valid until the entry point returns. 88 bytes.
struct LightSample {
    Vec3f L; ///< unit direction from the shading point towards the light
    std::uint8_t host12[32];
    Vec3f color; ///< light arriving at the point, linear RGB, unshadowed
    Vec3f shadow; ///< shadow transmission towards the light; (1, 1, 1) unshadowed
    float weight; ///< what the light counts beside its colour: the host's cosine term
    std::int32_t hostInt;
    LightSample* next; ///< null after the last
};

static_assert(offsetof(LightSample, L) == 0 && offsetof(LightSample, color) == 44);
static_assert(offsetof(LightSample, shadow) == 56 && offsetof(LightSample, weight) == 68);
static_assert(offsetof(LightSample, hostInt) == 72 && offsetof(LightSample, next) == 80);
static_assert(sizeof(LightSample) == 88);

/// Services that shaders call while shading. Points and directions are world space; colours are
/// linear RGB. `importance` is the largest channel of the weight that the caller puts on the
/// result (1 when it is used as it is). A service that finds nothing returns the neutral value:
/// a null list, (1, 1, 1) transmission, (0, 0, 0) colour. Nothing here may throw.
///
/// The order of declaration is the layout; additions go to the end.
class IShaderAPI {
public:
    /// Lights that reach `P`; null when there are none. Category 0 is the common list; the legacy
    /// material asks for -1024 and the measured paint for -2.
    virtual LightSample* getLightSamples(int category, Vec3f const* P, Vec3f const* normal) = 0;
    /// Ambient light arriving at `P` around `N`.
    virtual Vec3f ambientLight(Vec3f const* P, Vec3f const* N) = 0;
    /// Colour transmitted along the segment; (1, 1, 1) when nothing blocks it.
    virtual Vec3f shadowTransmission(Vec3f const* from, Vec3f const* to) = 0;
    /// Colour along the ray that goes on through the surface with the given `RayType`.
    virtual Vec3f traceContinue(int rayType, Vec3f const* origin, Vec3f const* direction,
                                float importance) = 0;
    /// Colour seen along a perfect mirror ray.
    virtual Vec3f traceReflection(Vec3f const* origin, Vec3f const* direction,
                                  float importance) = 0;
    /// Colour and alpha seen straight through the surface: the incident ray continued from `P`.
    virtual Vec4f traceThrough(Vec3f const* P, Vec3f const* I, float importance) = 0;
    /// Colour around a reflected direction; `spread` is the roughness of the lobe, 0 a mirror.
    virtual Vec3f traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                                float importance) = 0;
    /// Colour around a refracted direction; `spread` as for `traceSpecular`.
    virtual Vec3f traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                                  float importance) = 0;
    /// Unoccluded fraction around `N` per channel; (1, 1, 1) fully open.
    virtual Vec3f occlusion(Vec3f const* P, Vec3f const* N, float importance) = 0;
    /// Indirect diffuse light arriving at `P` around `N`.
    virtual Vec3f indirectDiffuse(Vec3f const* P, Vec3f const* N, float importance) = 0;
    /// Uniform in [0, 1); advances the host's sequence.
    virtual float random() = 0;
    /// Two numbers, uniform in [0, 1); advances the host's sequence.
    virtual Vec2f random2D() = 0;
    /// In [0, 1), constant between integers.
    virtual float cellNoise1D(float x) = 0;
    /// Smooth noise in [0, 1].
    virtual float noise2D(Vec2f const* p) = 0;
    /// Smooth signed noise.
    virtual float noise3DPoint(Vec3f const* p) = 0;
    /// Smooth noise in [0, 1] of a point x, y, z and a phase w.
    virtual float noise3D(Vec4f const* pointAndPhase) = 0;
    /// Smooth noise in [0, 1]; the flake pattern of the metallic paint.
    virtual float noise3DRecord(Vec3f const* p) = 0;
    /// Three numbers in [0, 1), constant within an integer cell.
    virtual Vec3f cellNoise3D(Vec3f const* p) = 0;

protected:
    ~IShaderAPI() = default; // owned by the host, never deleted through this class
};

} // namespace zsi
