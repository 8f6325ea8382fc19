// SPDX-License-Identifier: Apache-2.0
#include "materials/physical/corvid_Mtl_Metal.h"

#include "materials/physical/gradientRamp.h"
#include "materials/physical/shared/shadingFrame.h"
#include "materials/physical/shared/straightThrough.h"
#include "materials/physical/shared/textureChannel.h"
#include "runtime/builtins.h"

namespace zsi {
namespace {

/// Narrowest lobe: a highlight of a twentieth of a degree, which still has a finite density, so
/// polished metal needs no case of its own.
constexpr float kLeastWidth = 0.001f;

float greyOf(Vec4f c) { return (c.x + c.y + c.z) * 0.3333333f; }

} // namespace

/// Pyramids: the slope of a box-shaped ramp over each unit of the scaled coordinate.
void corvid_Mtl_Metal::bendByFacets(IShaderAPI* api, ShadeState const& state,
                                    SLArray<Vec3f>& frame) const
{
    constexpr SLArray<RampKey> kRamp{{{0.0f, {0.0f, 0.0f, 0.0f, 0.0f}},
                                      {0.5f, {0.5f, 0.5f, 0.5f, 0.5f}},
                                      {1.0f, {1.0f, 1.0f, 1.0f, 1.0f}}}};
    Vec2f const s = attribute_uv(state) * u_uvScale * 0.5f;
    auto const height = [&](float x, float y) {
        return greyOf(f_elm_rtpb_gradient_ramp_color(api, state, kRamp, {fract(x), fract(y)}));
    };
    float const h = height(s.x, s.y);
    float const du = (height(s.x + kBumpStep, s.y) - h) / kBumpStep * 0.5f * u_patternAmount;
    float const dv = (height(s.x, s.y + kBumpStep) - h) / kBumpStep * 0.5f * u_patternAmount;
    frame[2] = frame[2] + du * frame[0] + dv * frame[1];
    reorthogonalize(frame);
}

void corvid_Mtl_Metal::f_computeShadingFrameNative(IShaderAPI* api, ShadeState const& state,
                                                   Vec3f const&, Vec3f const& N,
                                                   Mat3f const& toWorld,
                                                   SLArray<Vec3f>& frame) const
{
    frame = computeBaseFrame(attribute_tangent(state), N, toWorld);
    if (u_patternEnable) {
        f_rtBumpPerturb(api, state, frame, attribute_uv(state), u_patternMap, u_patternTransform,
                        u_patternAmount, 1.0f);
        normalizeAndReorthogonalize(frame);
    }
    if (u_bumpSwitcher == 1)
        bendByFacets(api, state, frame);
}

/// Frame of a normal that mirrors above the surface. The whole frame by value, so that one that
/// nothing bends need not be in memory for this. Nf, Ng: on the ray's side.
SLArray<Vec3f> corvid_Mtl_Metal::bentFrame(IShaderAPI* api, ShadeState const& state, Vec3f Nf,
                                           Vec3f Ng) const
{
    SLArray<Vec3f> frame;
    f_computeShadingFrameNative(api, state, state.P, Nf, Mat3f(state.objectToWorld), frame);
    frame[2] = mirroringNormal(-state.I, Ng, normalize(frame[2]));
    reorthogonalize(frame);
    return frame;
}

[[gnu::always_inline]] inline corvid_Mtl_Metal::Surface
corvid_Mtl_Metal::surface(IShaderAPI* api, ShadeState const& state) const
{
    float const side = -facingSign(state.I, state.Ng);
    Vec3f const Nf = state.N * side;
    Surface s;
    s.Ng = state.Ng * side;
    if (u_patternEnable || u_bumpSwitcher == 1) [[unlikely]]
        s.frame = bentFrame(api, state, scalars(Nf), scalars(s.Ng));
    else
        s.frame = computeBaseFrame(attribute_tangent(state), mirroringNormal(-state.I, s.Ng, Nf),
                                   Mat3f(state.objectToWorld));
    orthonormalTangent(s.frame);
    f_anisoRotateFrame(api, state, s.frame, 0.0f);
    s.v = toLocal(s.frame, -state.I);
    return s;
}

inline AnisotropicGgx corvid_Mtl_Metal::facets(ShadeState const& state) const
{
    float r = u_roughValue, k = u_anisotropyValue;
    if (u_roughMapEnable) [[unlikely]]
        r = mappedValue(u_roughMap, u_roughTransform, u_roughAmount, attribute_uv(state));
    if (u_anisotropyMapEnable) [[unlikely]]
        k = mappedValue(u_anisotropyMap, u_anisotropyTransform, u_anisotropyAmount,
                        attribute_uv(state));
    // In this form NaN becomes the narrowest lobe.
    float const ax = minOf(maxOf(r, kLeastWidth), 1.0f);
    float const ay = minOf(maxOf(ax * k, kLeastWidth), 1.0f);
    return {maxOf(ax, ay * FacetLoss::kLeastRatio), maxOf(ay, ax * FacetLoss::kLeastRatio)};
}

/// Part of the surface that the cut-out keeps, 0..1.
inline float corvid_Mtl_Metal::coverage(ShadeState const& state) const
{
    if (u_cutoutMapEnable) [[unlikely]]
        return saturate(
            mappedValue(u_cutoutMap, u_cutoutTransform, u_cutoutAmount, attribute_uv(state)));
    return 1.0f;
}

[[gnu::always_inline]] inline MetalLobe corvid_Mtl_Metal::lobe(ShadeState const& state,
                                                               Vec3f const& v) const
{
    Vec3f r0 = u_reflectColor, edge = u_edgeColor;
    if (u_reflectMapEnable) [[unlikely]]
        r0 = mappedColor(u_reflectMap, u_reflectTransform, u_reflectAmount, attribute_uv(state));
    if (u_edgeMapEnable) [[unlikely]]
        edge = mappedColor(u_edgeMap, u_edgeTransform, u_edgeAmount, attribute_uv(state));
    return {facets(state), ConductorFresnel(saturate(r0), saturate(edge)), v};
}

/// A direction of the lobe; density 0 where it is below the surface.
inline corvid_Mtl_Metal::Reflected
corvid_Mtl_Metal::sampleReflected(IShaderAPI* api, MetalLobe const& metal, Surface const& s)
{
    float const pick = api->random();
    Reflected r{{}, metal.sample(pick, api->random2D())};
    r.direction = toWorld(s.frame, r.sample.l);
    if (!(dot(s.Ng, r.direction) > 0.0f))
        r.sample.pdf = 0.0f;
    return r;
}

void corvid_Mtl_Metal::f_calculateColors(IShaderAPI* api, ShadeState const& state,
                                         PhysicalColors& out) const
{
    float const opacity = coverage(state);
    if (opacity != 1.0f) {
        out.refraction =
            rgb(api->traceThrough(&state.P, &state.I, 1.0f - opacity)) * (1.0f - opacity);
        out.transmissionWeight = grey(1.0f - opacity);
        if (opacity == 0.0f)
            return;
    }
    Surface const s = surface(api, state);
    if (!(s.v.z > 0.0f))
        return;
    MetalLobe const metal = lobe(state, s.v);
    Vec3f const& N = s.frame[2];
    for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
         light = light->next) {
        Vec3f const l = toLocal(s.frame, light->L);
        if (!(l.z > 0.0f && dot(light->L, s.Ng) > 0.0f))
            continue;
        // A light's colour is its irradiance over pi.
        out.lit += light->color * light->shadow * metal.value(l) * (light->weight * kPi * opacity);
    }

    Reflected const r = sampleReflected(api, metal, s);
    if (!(r.sample.pdf > 0.0f))
        return;
    out.reflectionWeight = r.sample.value * (r.sample.l.z / r.sample.pdf * opacity);
    if (out.reflectionWeight == kBlack)
        return;
    out.reflection =
        api->traceSpecular(&state.P, &r.direction, 0.0f, maxComponent(out.reflectionWeight))
        * out.reflectionWeight;
}

void corvid_Mtl_Metal::shade(IShaderAPI* api, ShadeState& state) const
{
    shadePhysical(api, state);
}

void corvid_Mtl_Metal::transmission(IShaderAPI*, ShadeState& state) const
{
    state.transmissionColor = grey(1.0f - coverage(state));
}

void corvid_Mtl_Metal::transfer(IShaderAPI* api, ShadeState& state) const
{
    Surface const s = surface(api, state);
    Vec3f const l = toLocal(s.frame, state.sampleDirection);
    if (!(s.v.z > 0.0f && l.z > 0.0f && dot(s.Ng, state.sampleDirection) > 0.0f)) {
        state.outBrdf = kBlack;
        state.sampleCosine = 0.0f;
        return;
    }
    state.outBrdf = lobe(state, s.v).value(l) * coverage(state);
    state.sampleCosine = l.z;
}

void corvid_Mtl_Metal::sample(IShaderAPI* api, ShadeState& state) const
{
    bool const mayReflect = anySwitch(state.allowReflection);
    float const opacity = coverage(state);
    float chance = 1.0f; // that the metal is taken, not a hole
    if (opacity < 1.0f && anySwitch(state.allowTransmission)) {
        if (!mayReflect || api->random() >= opacity) {
            sampleStraightThrough(state);
            if (!mayReflect)
                state.outBrdf = grey(1.0f - opacity);
            return;
        }
        chance = opacity;
    }
    state.sampleType = kSampleNone;
    if (!mayReflect || opacity == 0.0f)
        return;
    Surface const s = surface(api, state);
    if (!(s.v.z > 0.0f))
        return;
    Reflected const r = sampleReflected(api, lobe(state, s.v), s);
    if (!(r.sample.pdf > 0.0f))
        return;
    state.sampleDirection = r.direction;
    state.outBrdf = r.sample.value * opacity;
    state.sampleCosine = r.sample.l.z;
    state.sampleInvPdf = 1.0f / (r.sample.pdf * chance);
    state.sampleType = (state.allowReflection[0] | state.allowReflection[1]) != 0 ? kSampleMixture
                                                                                  : kSampleStraight;
}

} // namespace zsi
