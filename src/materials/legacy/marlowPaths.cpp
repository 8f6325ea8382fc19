// SPDX-License-Identifier: Apache-2.0
// Where the legacy material sends light on: the layers of `shade`, drawn one at a time.
#include "materials/legacy/MarlowLegacy.h"
#include "materials/physical/shared/materialSkeleton.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"
#include "runtime/builtins.h"

namespace zsi {
namespace {

constexpr Vec3f kWhite(1.0f, 1.0f, 1.0f);

/// How often a layer of this weight is drawn, before the sum of all is scaled to 1.
float probability(Vec3f weight)
{
    return saturate(weight.x) + saturate(weight.y) + saturate(weight.z);
}

/// True normal on the viewer's side.
Vec3f facedNg(ShadeState const& state)
{
    return dot(state.I, state.Ng) > 0.0f ? -state.Ng : state.Ng;
}

bool isFinite(Vec3f v) { return std::isfinite(v.x) && std::isfinite(v.y) && std::isfinite(v.z); }

Vec3f cosineHemisphere(Vec2f u)
{
    float const r = std::sqrt(u.x), phi = 2.0f * kPi * u.y;
    return {r * std::cos(phi), r * std::sin(phi), std::sqrt(1.0f - u.x)};
}

/// What a path goes on with.
struct Event {
    Vec3f direction{0.0f, 0.0f, 0.0f};
    Vec3f value{0.0f, 0.0f, 0.0f};
    float cosine = 1.0f;
    float invPdf = 1.0f;
    SampleType type = kSampleNone;
};

} // namespace

/// Direction that the surface mirrors into the viewer's, world space, above the true surface: drawn
/// as the lobe scatters, or without a lobe the plain mirror direction.
Vec3f MarlowLegacy::mirrorDirection(IShaderAPI* api, ShadeState const& state, Surface const& at,
                                    GlossyLobe const& lobe) const
{
    Vec3f const ng = facedNg(state);
    constexpr int kMostDraws = 16; // seen from above, the widest lobe takes 3 in the mean
    for (int i = 0; i < kMostDraws && !lobe.empty(); ++i) {
        Vec3f const l = lobe.sample(at.v, api->random2D());
        Vec3f const direction = toWorld(at.frame, l);
        if (api->random() < lobe.unmasked(at.v, l) && dot(direction, ng) > 0.0f)
            return direction;
    }
    return f_safe_reflect(api, state, state.I, ng, at.facing());
}

/// Direction into or out of the body, not unit; mirrored at total reflection.
Vec3f MarlowLegacy::refractedDirection(IShaderAPI* api, ShadeState const& state,
                                       Surface const& at) const
{
    // Blurred by the facets that the viewer sees. What they mask of each other is not taken away.
    Vec3f facet = at.facing();
    if (blurs(at)) {
        float const width = lobeWidth(surfaceRoughness);
        AnisotropicGgx const facets{width, width};
        Vec3f const l = facets.mirrorVisible(at.v, facets.stretched(at.v), api->random2D());
        facet = toWorld(at.frame, normalize(at.v + l));
    }
    bool const leaving = dot(state.I, reverseNormal ? -state.Ng : state.Ng) > 0.0f;
    float const eta =
        leaving ? refractiveIndex / state.beyondIor : state.incomingIor / refractiveIndex;
    Vec3f const ng = facedNg(state);
    Vec3f const T = sl_lib_refract(state.I, facet, eta);
    if (T == kBlack)
        return f_safe_reflect(api, state, state.I, ng, facet);
    float const height = dot(T, ng);
    return height > 0.0f ? T - (2.0f * height) * ng : T;
}

/// Scattering value of base and lobes, without cosine and mask. l: local.
Vec3f MarlowLegacy::scattered(Surface const& at, Layers const& layers, Vec3f l) const
{
    if (unlitSurface || !at.clears(l))
        return kBlack;
    float const outside = at.behind ? -l.z : l.z;
    Vec3f value = kBlack;
    if (faceLight ? l.z != 0.0f : outside > 0.0f)
        value = layers.albedo.base * layers.diffuse * kInvPi;
    auto const add = [&](GlossyLobe const& lobe) {
        if (!lobe.empty())
            value += lobe.albedo * lobe.value(at.v, l);
    };
    add(layers.highlight[0]);
    add(layers.highlight[1]);
    if (layers.mirrorsLights)
        add(layers.reflection);
    return value;
}

void MarlowLegacy::transfer(IShaderAPI* api, ShadeState& state) const
{
    Surface const at = surface(api, state);
    Vec3f const l = toLocal(at.frame, state.sampleDirection);
    Vec3f const coverage = kWhite - saturate(mask(api, state));
    Vec3f const value = coverage * scattered(at, layersAt(api, state, at), l);
    state.outBrdf = isFinite(value) ? value : kBlack;
    state.sampleCosine = std::isfinite(l.z) ? std::fabs(l.z) : 0.0f;
}

void MarlowLegacy::sample(IShaderAPI* api, ShadeState& state) const
{
    bool const reflects = anySwitch(state.allowReflection);
    bool const transmits = anySwitch(state.allowTransmission);
    state.sampleType = kSampleNone;
    if (!reflects && !transmits)
        return;

    Surface const at = surface(api, state);
    Layers const layers = layersAt(api, state, at);
    Vec3f const masked = saturate(mask(api, state));
    Vec3f const coverage = kWhite - masked;

    // One of: straight on, refracted, mirrored; diffuse and up to three lobes, which are a mixture.
    constexpr int kStraight = 0, kRefracted = 1, kMirrored = 2, kDiffuse = 3, kLobes = 4, kAll = 7;
    Vec3f weight[kAll] = {};
    if (transmits) {
        Vec3f const clear = coverage * layers.albedo.transmission;
        weight[kStraight] = masked;
        if (bends())
            weight[kRefracted] = clear;
        else
            weight[kStraight] += clear * paneTransmittance(api, state, minOf(at.v.z, 1.0f));
    }
    GlossyLobe const* const lobes[] = {&layers.highlight[0], &layers.highlight[1],
                                       &layers.reflection};
    if (reflects && !unlitSurface) {
        weight[kMirrored] = coverage * layers.albedo.reflection;
        weight[kDiffuse] = coverage * layers.albedo.base * layers.diffuse;
        for (int i = 0; i < 3; ++i)
            weight[kLobes + i] = coverage * lobes[i]->albedo;
        // Either an event of its own or part of the mixture.
        weight[layers.mirrorsLights ? kMirrored : kLobes + 2] = kBlack;
    }
    float chance[kAll], total = 0.0f;
    for (int i = 0; i < kAll; ++i)
        total += chance[i] = probability(weight[i]);
    if (!(total > 0.0f))
        return;
    float pick = api->random() * total;
    int drawn = 0;
    while (drawn + 1 < kAll && !(pick < chance[drawn]))
        pick -= chance[drawn++];
    if (!(chance[drawn] > 0.0f)) // rounding went past the last
        return;

    Event e;
    if (drawn == kStraight) {
        e.direction = state.I;
        e.type = kSampleStraight;
    } else if (drawn == kRefracted) {
        e.direction = normalize(refractedDirection(api, state, at));
        e.type = blurs(at) ? kSampleRough : kSampleSmooth;
    } else if (drawn == kMirrored) {
        e.direction = normalize(mirrorDirection(api, state, at, layers.reflection));
        e.type = kSampleStraight;
    } else {
        Vec2f const u = api->random2D();
        Vec3f l = drawn == kDiffuse ? cosineHemisphere(u) : lobes[drawn - kLobes]->sample(at.v, u);
        if (!(l.z > 0.0f))
            return;
        if (drawn == kDiffuse && at.behind) // the base faces away
            l.z = -l.z;
        if (!at.clears(l))
            return;
        float const outside = at.behind ? -l.z : l.z;
        float density = chance[kDiffuse] * maxOf(outside, 0.0f) * kInvPi;
        for (int i = 0; i < 3; ++i)
            if (chance[kLobes + i] > 0.0f && l.z > 0.0f)
                density += chance[kLobes + i] * lobes[i]->density(at.v, l);
        e = {toWorld(at.frame, l), coverage * scattered(at, layers, l), std::fabs(l.z),
             total / density, kSampleMixture};
    }
    if (e.type != kSampleMixture)
        e.value = weight[drawn] * (total / chance[drawn]);
    if (!isFinite(e.value) || !isFinite(e.direction) || !std::isfinite(e.invPdf))
        return;
    state.sampleDirection = e.direction;
    state.outBrdf = e.value;
    state.sampleCosine = e.cosine;
    state.sampleInvPdf = e.invPdf;
    state.sampleType = e.type;
}

} // namespace zsi
