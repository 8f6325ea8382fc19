// SPDX-License-Identifier: Apache-2.0
// What the legacy material shows, and what it lets through to lights.
#include "materials/legacy/MarlowLegacy.h"

#include "materials/physical/shared/facedNormal.h"
#include "materials/physical/shared/shadingFrame.h"

#include <limits>

namespace zsi {
namespace {

constexpr Vec3f kWhite(1.0f, 1.0f, 1.0f);

/// The light category of scenes that this material comes from.
constexpr int kLightCategory = -1024;

/// The nearest number; NaN is none.
float bounded(float x)
{
    constexpr float kMost = std::numeric_limits<float>::max();
    return x == x ? clamp(x, -kMost, kMost) : 0.0f;
}
Vec3f bounded(Vec3f c) { return {bounded(c.x), bounded(c.y), bounded(c.z)}; }

float mean(Vec3f c) { return (c.x + c.y + c.z) * (1.0f / 3.0f); }

} // namespace

/// Every term is what a light of irradiance pi sends to the viewer: a white base that faces a light
/// of colour 1 shows 1.
MarlowLegacy::Lit MarlowLegacy::lights(IShaderAPI* api, ShadeState const& state, Surface const& at,
                                       Layers const& layers) const
{
    Lit lit{kBlack, kBlack};
    Vec3f const fullShadow = shadowColor * shadowIntensity + grey(1.0f - shadowIntensity);
    for (int side = 0; side < (faceLight ? 2 : 1); ++side) {
        Vec3f const n = side == 0 ? at.n() : -at.n();
        LightSample const* s = api->getLightSamples(kLightCategory, &state.P, &n);
        for (; s; s = s->next) {
            if (faceLight && !(dot(n, s->L) > 0.0f)) // the other side counts it
                continue;
            Vec3f const shadow = fullShadow * (kWhite - s->shadow) + s->shadow;
            Vec3f const light = s->color * shadow * s->weight;
            Vec3f const l = toLocal(at.frame, s->L);
            if (light == kBlack || !at.clears(l))
                continue;
            lit.diffuse += light;
            auto const add = [&](GlossyLobe const& lobe, float gain) {
                if (!lobe.empty())
                    lit.glossy += light * lobe.albedo * (gain * kPi * lobe.value(at.v, l));
            };
            add(layers.highlight[0], specularLightGainValue);
            add(layers.highlight[1], specular2LightGainValue);
            if (layers.mirrorsLights)
                add(layers.reflection, 1.0f);
        }
    }
    return lit;
}

/// Light of the surroundings on a white base. weight: on the result.
Vec3f MarlowLegacy::diffuseSurroundings(IShaderAPI* api, ShadeState const& state, Vec3f const& n,
                                        Vec3f const& weight) const
{
    bool const cube = IBLDiffMode >= 0 && diffuseIBLCube.texture;
    Vec3f sum = kBlack;
    if (cube) {
        Vec3f const light =
            gradeChannel(globalIbl(*this, diffuseIBLCube, n),
                         {diffuseIBLChannelContrastPivot, diffuseIBLChannelContrastValue,
                          diffuseIBLChannelGainColor, diffuseIBLChannelGainSource,
                          diffuseIBLChannelGainValue, diffuseIBLChannelSatValue});
        sum = gradeChannel(light,
                           {diffuseIBLContrastPivot, diffuseIBLContrastValue, diffuseIBLGainColor,
                            diffuseIBLGainSource, diffuseIBLGainValue});
    }
    if ((!cube || IBLDiffMode > 0) && globalIllumIntensity != 0.0f)
        sum += api->indirectDiffuse(&state.P, &n, maxComponent(weight) * globalIllumIntensity)
            * globalIllumIntensity;
    return sum;
}

/// Surroundings in the highlights and in the reflection. open: unoccluded share, for the cubes,
/// which know nothing of the scene.
Vec3f MarlowLegacy::mirrored(IShaderAPI* api, ShadeState const& state, Surface const& at,
                             Layers const& layers, Vec3f const& open) const
{
    Vec3f const highlights = layers.albedo.highlight[0] + layers.albedo.highlight[1];
    Vec3f const reflection = layers.albedo.reflection;
    if (highlights == kBlack && reflection == kBlack)
        return kBlack;
    Vec3f const& facing = at.facing();
    Vec3f const mirror = mirrorDirection(api, state, at, GlossyLobe());
    auto const seen = [&](GlossyLobe const& lobe, Vec3f const& weight) {
        float const importance = maxComponent(weight);
        // A ray that gathers light would carry the image of a lamp as a speck: it sees a matt
        // surface.
        if (state.rayType == kRayDiffuse)
            return weight * api->indirectDiffuse(&state.P, &facing, importance);
        // A ray of the lobe itself: the host is left nothing to spread.
        Vec3f const r = lobe.empty() ? mirror : mirrorDirection(api, state, at, lobe);
        return weight * api->traceSpecular(&state.P, &r, 0.0f, importance);
    };

    Vec3f sum = kBlack;
    bool const blurred = IBLSpecMode >= 0 && specularIBLCube.texture;
    if (blurred && !(highlights == kBlack)) {
        Vec3f const light =
            gradeChannel(globalIbl(*this, specularIBLCube, mirror),
                         {specularIBLChannelContrastPivot, specularIBLChannelContrastValue,
                          specularIBLChannelGainColor, specularIBLChannelGainSource,
                          specularIBLChannelGainValue, specularIBLChannelSatValue});
        sum += highlights * open
            * gradeChannel(light,
                           {specularIBLContrastPivot, specularIBLContrastValue,
                            specularIBLGainColor, specularIBLGainSource, specularIBLGainValue});
    }
    if (!blurred || IBLSpecMode > 0) {
        for (GlossyLobe const& lobe : layers.highlight)
            if (!lobe.empty())
                sum += seen(lobe, lobe.albedo);
    }

    if (reflection == kBlack)
        return sum;
    if (useReflectionCubeIBL && reflectionCubeIBL.texture) {
        Vec3f const light =
            gradeChannel(globalIbl(*this, reflectionCubeIBL, mirror),
                         {reflectIBLChannelContrastPivot, reflectIBLChannelContrastValue,
                          reflectIBLChannelGainColor, reflectIBLChannelGainSource,
                          reflectIBLChannelGainValue, reflectIBLChannelSatValue});
        return sum
            + reflection * open
            * gradeChannel(light,
                           {.gainColor = reflectIBLGainColor,
                            .gainSource = reflectIBLGainSource,
                            .gain = reflectIBLGainValue});
    }
    return sum + seen(layers.reflection, reflection);
}

/// Everything but what comes from behind.
Vec3f MarlowLegacy::opaquePart(IShaderAPI* api, ShadeState const& state, Surface const& at,
                               Layers const& layers) const
{
    Vec3f const base = layers.albedo.base * layers.diffuse;
    if (unlitSurface)
        return base;
    Vec3f const open = f_calcAmbientOcclusion(api, state, 1.0f);
    Lit const lit = lights(api, state, at, layers);
    Vec3f sum = lit.glossy + mirrored(api, state, at, layers, open);
    if (!(base == kBlack)) {
        sum += base * open
            * (lit.diffuse * diffuseLightGainValue
               + diffuseSurroundings(api, state, at.n(), base * open));
        if (selfIlluminance)
            sum += base;
    }
    return sum;
}

void MarlowLegacy::shade(IShaderAPI* api, ShadeState& state) const
{
    Vec3f const masked = saturate(mask(api, state));
    if (masked == kWhite) {
        state.discardHit = 1;
        return;
    }
    Vec3f const coverage = kWhite - masked;
    Vec3f through = masked; // what is seen straight behind
    Vec3f color;
    if (showNormalsOnly) {
        color = coverage * facingColor(state, reverseNormal, faceForward, faceLight);
    } else if (showAmbientOnly) {
        color = coverage * grey(minComponent(f_calcAmbientOcclusion(api, state, 1.0f)));
    } else {
        Surface const at = surface(api, state);
        Layers const layers = layersAt(api, state, at);
        color = coverage * opaquePart(api, state, at, layers);
        Vec3f const clear = coverage * layers.albedo.transmission;
        if (!bends()) {
            through += clear * paneTransmittance(api, state, minOf(at.v.z, 1.0f));
        } else if (!(clear == kBlack)) {
            Vec3f const T = refractedDirection(api, state, at);
            color += clear * api->traceRefraction(&state.P, &T, 0.0f, maxComponent(clear));
        }
    }
    float alpha = 1.0f;
    if (!(through == kBlack)) {
        Vec4f const behind = api->traceThrough(&state.P, &state.I, maxComponent(through));
        color += through * rgb(behind);
        if (useAlpha)
            alpha = 1.0f - mean(through) * (1.0f - behind.w);
    }
    state.Ci = usingHDRbuffer ? withAlpha(bounded(color), bounded(alpha))
                              : withAlpha(saturate(color), saturate(alpha));
}

void MarlowLegacy::transmission(IShaderAPI* api, ShadeState& state) const
{
    Vec3f t = transparency(api, state);
    float const cosine = minOf(std::fabs(dot(state.I, state.N)), 1.0f);
    Vec3f reflection = reflectance(cosine);
    if (!(reflection == kBlack)) {
        if (transparencyBlocksHighlights)
            reflection *= kWhite - saturate(t);
        t *= kWhite - reflection;
    }
    if (simulatedThickness > 0.0f)
        t *= paneTransmittance(api, state, cosine);
    state.transmissionColor = bounded(kWhite - (kWhite - t) * (kWhite - mask(api, state)));
}

} // namespace zsi
