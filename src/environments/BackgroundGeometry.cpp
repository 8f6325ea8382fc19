// SPDX-License-Identifier: Apache-2.0
#include "environments/BackgroundGeometry.h"

#include "environments/mappedBump.h"
#include "materials/physical/shared/fresnel.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/straightThrough.h"
#include "runtime/arithmetic.h"

namespace zsi {

Vec3f BackgroundGeometry::bumpedNormal(IShaderAPI* api, ShadeState const& state) const
{
    if (bumpMode == kMapNone || bumpScale == 0.0f || !bumpTexture.texture)
        return state.N;
    MappedChannel const bump{bumpMode,          kBlack,      bumpTexture, bumpTextureMatrix,
                             bumpAngularRepeat, bumpUVMatrix};
    BumpPlacement placement{bump, bumpTextureMatrixInverse, attribute_tangent(state),
                            attribute_bitangent(state)};
    // Box axes by the reference normal; the picture's are chosen by the world normal.
    Vec4f const texel =
        evalChannel(api, state, bump, state.Nref, attribute_uv(state), placement.axes);
    return bendNormal(placement, texel, bumpScale, state.N, state.objectToWorld);
}

/// Graded for all cubes, then for this one.
Vec3f BackgroundGeometry::cube(TextureSamplerCube const& cube, Vec3f direction,
                               ChannelGrade const& grade) const
{
    return gradeChannel(globalIbl(*this, cube, direction), grade);
}

/// Light on a white surface here: every light in its shadow, as far as the shadow shows, and what
/// the occlusion leaves of the sky.
Vec3f BackgroundGeometry::receivedLight(IShaderAPI* api, ShadeState const& state, Vec3f n) const
{
    Vec3f const fullShadow = shadowColor * shadowIntensity + grey(1.0f - shadowIntensity);
    bool const bumped = !(n == state.N);
    Vec3f light = kBlack;
    for (LightSample const* s = api->getLightSamples(0, &state.P, &state.N); s; s = s->next) {
        float relief = 1.0f;
        if (bumped) {
            // The weight knows the smooth surface: cosines of the bump over those. Low light
            // would make that ratio boundless.
            constexpr float kLeastCosine = 0.1f, kMostRelief = 2.0f;
            relief =
                clamp(dot(n, s->L) / maxOf(dot(state.N, s->L), kLeastCosine), 0.0f, kMostRelief);
        }
        Vec3f const shadow = fullShadow * (grey(1.0f) - s->shadow) + s->shadow;
        light += s->color * shadow * (s->weight * relief);
    }
    Vec3f const open = api->occlusion(&state.P, &n, 1.0f);
    if (diffuseCube.texture)
        light += open
            * cube(diffuseCube, n,
                   {diffuseIBLContrastPivot, diffuseIBLContrastValue, diffuseIBLGainColor,
                    diffuseIBLGainSource, diffuseIBLGainValue});
    return light;
}

/// What the ground mirrors. Rough ground mirrors sharply only towards the horizon: of its
/// reflectivity, the share of a clear interface without reflectance of its own goes to the sharp
/// environment and the rest to the blurred one.
Vec3f BackgroundGeometry::reflections(IShaderAPI* api, ShadeState const& state, Vec3f n) const
{
    MappedAxes axes;
    Vec3f const reflectivity =
        rgb(evalChannel(api, state,
                        {specularMode, specularColor, specularTexture, specularTextureMatrix,
                         specularAngularRepeat, specularUVMatrix},
                        state.N, attribute_uv(state), axes));
    if (reflectivity == kBlack)
        return reflectivity;

    Vec3f const r = f_safe_reflect(api, state, state.I, state.Ng, n);
    float const sharp = schlick(0.0f, std::fabs(dot(state.I, n)));
    Vec3f seen = kBlack;
    if (specularCube.texture)
        seen = (1.0f - sharp)
            * cube(specularCube, r,
                   {specularIBLContrastPivot, specularIBLContrastValue, specularIBLGainColor,
                    specularIBLGainSource, specularIBLGainValue});
    float const importance = sharp * maxComponent(reflectivity);
    if (!useCubeReflection)
        seen += sharp * api->traceReflection(&state.P, &r, importance);
    else if (reflectCube.texture)
        seen += sharp
            * cube(reflectCube, r,
                   {.gainColor = reflectIBLChannelGainColor,
                    .gainSource = reflectIBLChannelGainSource,
                    .gain = reflectIBLChannelGainValue,
                    .saturation = reflectIBLChannelSatValue});
    return reflectivity * seen;
}

void BackgroundGeometry::shade(IShaderAPI* api, ShadeState& state) const
{
    if (dot(state.I, state.Ng) >= 0.0f) {
        state.discardHit = 1;
        return;
    }
    MappedAxes axes;
    Vec4f const picture = evalChannel(api, state,
                                      {diffuseMode, diffuseColor, diffuseTexture,
                                       diffuseTextureMatrix, diffuseAngularRepeat, diffuseUVMatrix},
                                      state.N, attribute_uv(state), axes);
    constexpr float kCutOut = 0.05f; // alpha below it is no surface
    if (kCutOut > picture.w) {
        state.discardHit = 1;
        return;
    }
    bool const clear = 1.0f > picture.w;
    Vec4f const behind =
        clear ? api->traceThrough(&state.P, &state.I, 1.0f) : Vec4f(0.0f, 0.0f, 0.0f, 0.0f);
    // Up to here all kinds of rays ask the host for the same.
    Vec3f const n = bumpedNormal(api, state);

    Vec3f color;
    if (state.rayType == kRayReflection && useCubeReflection && reflectCube.texture) {
        // To reflections the ground is the environment that it stands for.
        color = cube(reflectCube, state.I,
                     {.gainColor = reflectIBLChannelGainColor,
                      .gainSource = reflectIBLChannelGainSource,
                      .gain = reflectIBLChannelGainValue,
                      .saturation = reflectIBLChannelSatValue});
    } else {
        // Rays that only gather light see no mirror of a mirror.
        bool const gathers = state.rayType == kRayDiffuse || state.rayType == kRayReflection;
        color = gradeChannel(rgb(picture),
                             {.gainColor = diffuseTextureGainColor,
                              .gainSource = diffuseTextureGainSource,
                              .gain = diffuseTextureGainValue,
                              .saturation = diffuseTextureSatValue})
            * receivedLight(api, state, n);
        if (!gathers)
            color += reflections(api, state, n);
    }
    if (!clear) {
        state.Ci = withAlpha(color, 1.0f);
        return;
    }
    float const through = 1.0f - picture.w;
    state.Ci = withAlpha(color * picture.w + rgb(behind) * through, picture.w + behind.w * through);
}

void BackgroundGeometry::transmission(IShaderAPI*, ShadeState& state) const
{
    // Only ground that faces up along z holds up shadow rays; NaN does too.
    constexpr float kUpward = 0.9f;
    bool const clear = state.rayType != kRayShadow || kUpward > state.N.z;
    state.transmissionColor = grey(clear ? 1.0f : 0.0f);
}

void BackgroundGeometry::sample(IShaderAPI*, ShadeState& state) const
{
    sampleStraightThrough(state);
}

} // namespace zsi
