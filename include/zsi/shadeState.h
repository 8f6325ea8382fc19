// SPDX-License-Identifier: Apache-2.0
/// The record of one shading request: the host fills it, a shader reads it and writes results.
#pragma once

#include <cstddef>
#include <zsi/types.h>

namespace zsi {

/// Kinds of ray, as `ShadeState::rayType` carries them.
enum RayType : std::uint32_t {
    kRayCamera = 1,
    kRayReflection = 2,
    kRayTransmission = 4, ///< a camera ray that was continued through a surface
    kRayShadow = 16,
    kRayDiffuse = 32, ///< indirect and gather rays
};

/// Kinds of sample, as `ShadeState::sampleType` carries them.
enum SampleType : std::uint32_t {
    kSampleNone = 0, ///< the entry point declined
    kSampleMixture = 2, ///< diffuse and glossy mixture
    kSampleStraight = 4, ///< pass-through, mirror reflection, glossy only
    kSampleRough = 16, ///< rough dielectric event
    kSampleSmooth = 32, ///< smooth dielectric event
};

/// Fixed byte layout, 544 bytes, 16-byte aligned. Directions are unit length, world space;
/// `I` points towards the surface. "in" is filled by the host, "out" by the shader; an entry
/// point writes its own results only, and nothing at all when it declines.
/// Each concurrent request has its own record; shaders keep no reference to it.
struct alignas(16) ShadeState {
    Vec3f E; ///< in: origin of the incident ray
    Vec3f I; ///< in: unit direction of the incident ray, from its origin towards `P`
    Vec3f P; ///< in: shading position
    Vec3f N; ///< in: unit shading normal as interpolated, not turned towards the viewer
    Vec3f Ng; ///< in: geometric normal of the hit face; tells front from back
    Vec3f Pref; ///< in: reference position for projected masks and procedural textures
    Vec3f Nref; ///< in: reference normal that goes with `Pref`
    std::uint8_t host84[12];
    float rasterX; ///< in: raster position of the camera sample, pixels, x to the right
    float rasterY; ///< in: raster position, pixels, y downwards
    std::uint8_t host104[4];
    std::int32_t imageHeight; ///< in: pixels
    float incomingIor; ///< in: refractive index on the incoming side of the surface
    float beyondIor; ///< in/out: refractive index beyond the surface; `sample` stores the new one
    std::uint8_t host120[64];
    Mat4f objectToWorld; ///< in: transform of the hit object
    std::uint8_t host248[72];
    std::uint32_t rayType; ///< in: a `RayType`
    std::uint32_t rayDepth; ///< in: depth of this ray
    std::uint32_t maxRayDepth; ///< in: limit that `rayDepth` is compared with
    std::uint8_t host332[4];
    Vec4f Ci; ///< out of `shade`: linear RGB and alpha
    Vec3f transmissionColor; ///< out of `transmission`: (1, 1, 1) clear, (0, 0, 0) opaque
    Vec3f sampleDirection; ///< out of `sample`, in of `transfer`: unit direction away from `P`
    Vec3f outBrdf; ///< out of `sample` and `transfer`: colour weight of the direction
    float sampleCosine; ///< out of `sample` and `transfer`: cosine term of the direction
    float sampleInvPdf; ///< out of `sample`: 1/density, sr; 1 for perfectly specular samples
    std::uint32_t sampleType; ///< out of `sample`: a `SampleType`
    std::uint8_t allowReflection[3]; ///< in: which reflected samples the host accepts
    std::uint8_t allowTransmission[3]; ///< in: which transmitted samples the host accepts
    std::uint8_t host406[6];
    Vec3f lightPosition; ///< in of `illumination`
    Vec3f lightAxis; ///< in of `illumination`: unit direction the light points to
    Vec3f lightToPoint; ///< in of `illumination`: unit direction from the light to `P`
    float lightDistance; ///< in of `illumination`: from the light to `P`, world units
    Vec3f lightColor; ///< out of `illumination`: light arriving at `P`, unshadowed
    Vec3f lightShadow; ///< out of `illumination`: shadow transmission; (1, 1, 1) unshadowed
    std::uint8_t discardHit; ///< out of `shade`: 1 asks the host to ignore this hit
    std::uint8_t host477[3];
    std::uint8_t attributes[64]; ///< in: vertex attributes at the offsets the shader declared
};

static_assert(offsetof(ShadeState, E) == 0 && offsetof(ShadeState, I) == 12);
static_assert(offsetof(ShadeState, P) == 24 && offsetof(ShadeState, N) == 36);
static_assert(offsetof(ShadeState, Ng) == 48 && offsetof(ShadeState, Pref) == 60);
static_assert(offsetof(ShadeState, Nref) == 72 && offsetof(ShadeState, rasterX) == 96);
static_assert(offsetof(ShadeState, rasterY) == 100 && offsetof(ShadeState, imageHeight) == 108);
static_assert(offsetof(ShadeState, incomingIor) == 112 && offsetof(ShadeState, beyondIor) == 116);
static_assert(offsetof(ShadeState, objectToWorld) == 184 && offsetof(ShadeState, rayType) == 320);
static_assert(offsetof(ShadeState, rayDepth) == 324 && offsetof(ShadeState, maxRayDepth) == 328);
static_assert(offsetof(ShadeState, Ci) == 336 && offsetof(ShadeState, transmissionColor) == 352);
static_assert(offsetof(ShadeState, sampleDirection) == 364 && offsetof(ShadeState, outBrdf) == 376);
static_assert(offsetof(ShadeState, sampleCosine) == 388);
static_assert(offsetof(ShadeState, sampleInvPdf) == 392 && offsetof(ShadeState, sampleType) == 396);
static_assert(offsetof(ShadeState, allowReflection) == 400);
static_assert(offsetof(ShadeState, allowTransmission) == 403);
static_assert(offsetof(ShadeState, lightPosition) == 412 && offsetof(ShadeState, lightAxis) == 424);
static_assert(offsetof(ShadeState, lightToPoint) == 436);
static_assert(offsetof(ShadeState, lightDistance) == 448);
static_assert(offsetof(ShadeState, lightColor) == 452 && offsetof(ShadeState, lightShadow) == 464);
static_assert(offsetof(ShadeState, discardHit) == 476 && offsetof(ShadeState, attributes) == 480);
static_assert(sizeof(ShadeState) == 544 && alignof(ShadeState) == 16);

} // namespace zsi
