// What the legacy material shows, and what it lets through to lights.
#include "materials/legacy/MarlowLegacy.h"

#include "materials/physical/shared/facedNormal.h"
#include "materials/physical/shared/safeReflect.h"
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
    float const gain[3] = {specularLightGainValue, specular2LightGainValue, 1.0f};
    for (int side = 0; side < (faceLight ? 2 : 1); ++side) {
        Vec3f const n = side == 0 ? at.n() : -at.n();
        float const up = side == 0 ? 1.0f : -1.0f;
        Vec3f const v(at.v.x, at.v.y, up * at.v.z);
        LightSample const* s = api->getLightSamples(kLightCategory, &state.P, &n);
        for (; s; s = s->next) {
            Vec3f l = toLocal(at.frame, s->L);
            l.z *= up;
            if (faceLight && !(l.z > 0.0f)) // the other side counts it
                continue;
            Vec3f const shadow = fullShadow * (kWhite - s->shadow) + s->shadow;
            Vec3f const light = s->color * shadow * s->weight;
            if (light == kBlack)
                continue;
            lit.diffuse += light;
            for (int i = 0; i < 3; ++i)
                if (!(layers.lobe[i].part == kBlack))
                    lit.glossy +=
                        light * layers.lobe[i].part * (gain[i] * kPi * layers.lobe[i].value(v, l));
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
    Vec3f const highlights = layers.lobe[0].part + layers.lobe[1].part;
    Vec3f const reflection = layers.shares.reflection;
    if (highlights == kBlack && reflection == kBlack)
        return kBlack;
    Vec3f const Ng = dot(state.I, state.Ng) > 0.0f ? -state.Ng : state.Ng;
    Vec3f const upper = at.v.z < 0.0f ? -at.n() : at.n();
    Vec3f const r = f_safe_reflect(api, state, state.I, Ng, upper);
    // A ray that gathers light would carry the image of a lamp as a speck: it sees a matt surface.
    auto const seen = [&](float width, Vec3f const& weight) {
        float const importance = maxComponent(weight);
        return weight
            * (state.rayType == kRayDiffuse ? api->indirectDiffuse(&state.P, &upper, importance)
                                            : api->traceSpecular(&state.P, &r, width, importance));
    };

    Vec3f sum = kBlack;
    bool const blurred = IBLSpecMode >= 0 && specularIBLCube.texture;
    if (blurred && !(highlights == kBlack)) {
        Vec3f const light =
            gradeChannel(globalIbl(*this, specularIBLCube, r),
                         {specularIBLChannelContrastPivot, specularIBLChannelContrastValue,
                          specularIBLChannelGainColor, specularIBLChannelGainSource,
                          specularIBLChannelGainValue, specularIBLChannelSatValue});
        sum += highlights * open
            * gradeChannel(light,
                           {specularIBLContrastPivot, specularIBLContrastValue,
                            specularIBLGainColor, specularIBLGainSource, specularIBLGainValue});
    }
    if (!blurred || IBLSpecMode > 0) {
        for (int i = 0; i < 2; ++i)
            if (!(layers.lobe[i].part == kBlack))
                sum += seen(layers.lobe[i].width, layers.lobe[i].part);
    }

    if (reflection == kBlack)
        return sum;
    if (useReflectionCubeIBL && reflectionCubeIBL.texture) {
        Vec3f const light =
            gradeChannel(globalIbl(*this, reflectionCubeIBL, r),
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
    return sum + seen(surfaceRoughness, reflection);
}

/// Everything but what comes from behind.
Vec3f MarlowLegacy::opaquePart(IShaderAPI* api, ShadeState const& state, Surface const& at,
                               Layers const& layers) const
{
    Vec3f const base = layers.shares.base * layers.diffuse;
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
    Vec3f const removed = saturate(mask(api, state));
    if (removed == kWhite) {
        state.discardHit = 1;
        return;
    }
    Vec3f const kept = kWhite - removed;
    Vec3f through = removed; // what is seen straight behind
    Vec3f color;
    if (showNormalsOnly) {
        color = kept * facingColor(state, reverseNormal, faceForward, faceLight);
    } else if (showAmbientOnly) {
        color = kept * grey(minComponent(f_calcAmbientOcclusion(api, state, 1.0f)));
    } else {
        Surface const at = surface(api, state);
        Layers const layers = layersAt(api, state, at);
        color = kept * opaquePart(api, state, at, layers);
        Vec3f const clear = kept * layers.shares.clear;
        if (!bends()) {
            through += clear * paneTransmittance(api, state, minOf(std::fabs(at.v.z), 1.0f));
        } else if (!(clear == kBlack)) {
            Vec3f const T = refracted(api, state, at.v.z < 0.0f ? -at.n() : at.n());
            color +=
                clear * api->traceRefraction(&state.P, &T, surfaceRoughness, maxComponent(clear));
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
