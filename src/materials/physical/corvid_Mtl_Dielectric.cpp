// SPDX-License-Identifier: Apache-2.0
#include "materials/physical/corvid_Mtl_Dielectric.h"

#include "materials/physical/shared/fresnel.h"
#include "materials/physical/shared/ggx.h"
#include "materials/physical/shared/lightFade.h"
#include "materials/physical/shared/proceduralNormal.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"
#include "runtime/builtins.h"

namespace zsi {
namespace {

/// Roughness from which on paths scatter; smoother interfaces are sampled as polished.
constexpr float kSmoothRoughness = 0.01f;

bool isLeaving(ShadeState const& state) { return dot(state.Ng, state.I) > 0.0f; }

/// Share of light left after d world units. Base 10: sigma is in decades per unit length.
Vec3f absorb(Vec3f sigma, float d)
{
    return {std::pow(10.0f, -sigma.x * d), std::pow(10.0f, -sigma.y * d),
            std::pow(10.0f, -sigma.z * d)};
}

Vec3f facing(Vec3f N, Vec3f I) { return dot(I, N) > 0.0f ? -N : N; }

/// Value of the interface towards l: what it reflects and what it lets through, grey, 1/sr.
/// v, l: local, unit; nv, nl: the indices that go with them; F: reflectance.
float interfaceValue(Ggx facets, Vec3f v, float nv, Vec3f l, float nl, float F)
{
    return F * facets.reflection(v, l, reflectionHalf(v, l))
        + (1.0f - F) * facets.transmission(v, l, refractionHalf(v, nv, l, nl), nl);
}

} // namespace

inline corvid_Mtl_Dielectric::Indices corvid_Mtl_Dielectric::indices(ShadeState const& state,
                                                                     bool leaving) const
{
    if (leaving)
        return {u_ior, state.beyondIor};
    return {state.incomingIor, u_ior};
}

float corvid_Mtl_Dielectric::roughness(ShadeState const& state) const
{
    if (u_roughMapEnable) [[unlikely]]
        return mappedRoughness(state);
    return u_roughValue;
}

float corvid_Mtl_Dielectric::mappedRoughness(ShadeState const& state) const
{
    Vec2f const uv = transformUv(u_roughTransform, attribute_uv(state));
    return u_roughAmount * u_roughMap.lookup(uv).x;
}

inline bool corvid_Mtl_Dielectric::bends() const
{
    return u_normal0MapEnable || u_normal1MapEnable || u_procedureMapEnable == 1;
}

/// By value, so that a frame that nothing bends need not be in memory.
SLArray<Vec3f> corvid_Mtl_Dielectric::bentFrame(IShaderAPI* api, ShadeState const& state,
                                                Vec3f const& P, Mat4f const& toWorld,
                                                SLArray<Vec3f> frame) const
{
    if (u_normal0MapEnable) {
        f_rtBumpPerturb(api, state, frame, attribute_uv(state), u_normal0Map, u_normal0Transform,
                        u_normal0Amount, u_normal0UVScale);
        normalizeAndReorthogonalize(frame);
    } else if (u_procedureMapEnable == 1) {
        Vec3f const ripple =
            castRippleOffset(api, state, P, Mat3f(toWorld), u_procedureMapTiling, frame);
        bendByOffset(frame, ripple * u_procedureMapAmount); // the normal stays unnormalised
    }
    if (u_normal1MapEnable) {
        f_rtBumpPerturb(api, state, frame, attribute_uv(state), u_normal1Map, u_normal1Transform,
                        u_normal1Amount, 1.0f);
        normalizeAndReorthogonalize(frame);
    }
    return frame;
}

inline void corvid_Mtl_Dielectric::f_computeShadingFrame(IShaderAPI* api, ShadeState const& state,
                                                         Vec3f const& P, Vec3f const& N,
                                                         Mat4f const& toWorld,
                                                         SLArray<Vec3f>& frame) const
{
    frame = computeBaseFrame(attribute_tangent(state), N, Mat3f(toWorld));
    if (bends()) [[unlikely]]
        frame = bentFrame(api, state, P, toWorld, frame);
}

/// Colour per light of the weight, from the direction L.
float corvid_Mtl_Dielectric::lightValue(SLArray<Vec3f> const& frame, Vec3f v, Vec3f L, Indices n,
                                        float r, float F) const
{
    Ggx const facets{.alpha2 = r}; // the roughness itself is the squared width here
    Vec3f const l = toLocal(frame, L);
    Vec3f h = reflectionHalf(v, l);
    if (h.z < 0.0f)
        h = -h;
    float const through =
        facets.transmission(v, l, refractionHalf(v, n.outer, l, n.inner), n.inner);
    return facets.reflection(v, l, h) * F + through * (1.0f - F);
}

/// What the path from the ray's origin to the hit leaves of the light.
Vec3f corvid_Mtl_Dielectric::pathTransmittance(ShadeState const& state) const
{
    Vec3f sigma = u_absorptionCoef;
    if (u_transmittanceMapEnable) {
        Vec2f const uv = transformUv(u_transmittanceTransform, attribute_uv(state));
        Vec3f const t = rgb(u_transmittanceMap.lookup(uv)) * u_transmittanceAmount;
        sigma = {-std::log(t.x) / sigma.x, -std::log(t.y) / sigma.y, -std::log(t.z) / sigma.z};
    }
    return absorb(sigma, length(state.P - state.E));
}

void corvid_Mtl_Dielectric::f_calculateColors(IShaderAPI* api, ShadeState const& state,
                                              PhysicalColors& out) const
{
    bool const leaving = isLeaving(state);
    Indices const n = indices(state, leaving);
    SLArray<Vec3f> frame;
    f_computeShadingFrame(api, state, state.P, state.N, state.objectToWorld, frame);
    Vec3f const& N = frame[2];
    Vec3f const v = toLocal(frame, -state.I);
    float const r = roughness(state);
    float F = schlick(u_reflectance, v.z);

    for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
         light = light->next) {
        float const fade = lightFade(dot(light->L, state.Ng));
        if (fade == 0.0f)
            continue;
        float const value = lightValue(frame, v, light->L, n, r, F);
        out.lit += light->color * light->shadow * (value * light->weight * fade);
    }

    if (leaving)
        F = 0.0f; // no reflection from inside, after the lights have had theirs
    out.reflectionWeight = u_reflectColor * F;
    if (!leaving && !(out.reflectionWeight == kBlack)) {
        Vec3f const R = f_safe_reflect(api, state, state.I, state.Ng, N);
        out.reflection = api->traceSpecular(&state.P, &R, r, maxComponent(out.reflectionWeight))
            * out.reflectionWeight;
    }

    out.transmissionWeight = u_refractColor * (1.0f - F);
    if (out.transmissionWeight == kBlack)
        return;
    Vec3f const faced = facing(N, state.I);
    Vec3f T = sl_lib_refract(state.I, faced, n.eta());
    if (T == kBlack) // total internal reflection
        T = f_safe_reflect(api, state, state.I, facing(state.Ng, state.I), faced);
    out.refraction = api->traceRefraction(&state.P, &T, r, maxComponent(out.transmissionWeight))
        * out.transmissionWeight;
    if (leaving && u_falloffEnable)
        out.refraction *= pathTransmittance(state);
}

void corvid_Mtl_Dielectric::shade(IShaderAPI* api, ShadeState& state) const
{
    shadePhysical(api, state);
}

void corvid_Mtl_Dielectric::transmission(IShaderAPI*, ShadeState& state) const
{
    float const F = schlick(u_reflectance, facingSign(state.I, state.Ng) * dot(state.N, state.I));
    Vec3f color = u_refractColor * (1.0f - F);
    if (isLeaving(state)) // whatever u_falloffEnable says, and without the map
        color *= absorb(u_absorptionCoef, length(state.P - state.E));
    state.transmissionColor = color;
}

void corvid_Mtl_Dielectric::transfer(IShaderAPI* api, ShadeState& state) const
{
    float const side = dot(state.I, state.Ng);
    Indices const n = indices(state, side > 0.0f);
    SLArray<Vec3f> frame;
    f_computeShadingFrame(api, state, state.P, state.N * -sign(side), state.objectToWorld, frame);
    Vec3f const v = toLocal(frame, -state.I);
    Vec3f const l = toLocal(frame, state.sampleDirection);
    float const r = roughness(state);
    float const F = schlick(u_reflectance, v.z);
    state.sampleCosine = std::fabs(l.z);
    state.outBrdf = grey(interfaceValue(Ggx{.alpha2 = r * r}, v, n.outer, l, n.inner, F));
}

/// cosine: of the view direction against the frame normal; c: against the facet.
inline corvid_Mtl_Dielectric::Event corvid_Mtl_Dielectric::chooseEvent(IShaderAPI* api,
                                                                       ShadeState const& state,
                                                                       float cosine, float c,
                                                                       float eta) const
{
    constexpr Event kEnd{-1.0f, 0.0f, 0.0f, false};
    if (c < 0.0f)
        return kEnd;
    bool const mayReflect = anySwitch(state.allowReflection);
    bool const mayTransmit = anySwitch(state.allowTransmission);
    float const F = schlick(u_reflectance, cosine);
    float weight = 1.0f;
    bool refracts = mayTransmit;
    if (mayReflect && mayTransmit)
        refracts = F < api->random();
    else
        weight = mayReflect ? F : 1.0f - F;
    if (refracts) {
        float const k = (c * c - 1.0f) * (eta * eta) + 1.0f;
        if (k >= 0.0f)
            return {weight, eta * c - std::sqrt(k), eta, true};
        if (!mayReflect)
            return kEnd;
        weight = 1.0f; // total internal reflection
    }
    return {weight, 2.0f * c, 1.0f, false};
}

/// d: local direction of the event.
inline void corvid_Mtl_Dielectric::continuePath(ShadeState& state, SLArray<Vec3f> const& frame,
                                                Vec3f d, float weight, Event event, Indices n)
{
    state.sampleCosine = 1.0f;
    state.sampleInvPdf = 1.0f;
    state.beyondIor = event.refracts ? n.inner : n.outer; // a reflection stays in its medium
    state.sampleDirection = toWorld(frame, d);
    state.outBrdf = grey(weight);
}

/// framed: the whole frame stands already, not its normal alone.
inline void corvid_Mtl_Dielectric::samplePolished(IShaderAPI* api, ShadeState& state,
                                                  SLArray<Vec3f>& frame, bool framed,
                                                  Indices n) const
{
    // The facet is the frame normal: the rest of the frame waits until the host has been asked.
    Vec3f const N = frame[2];
    float const c = dot(N, -state.I);
    Event const event = chooseEvent(api, state, c, c, n.eta());
    if (event.ends()) {
        state.sampleType = kSampleNone;
        return;
    }
    if (!framed) [[likely]]
        frame = computeBaseFrame(attribute_tangent(state), N, Mat3f(state.objectToWorld));
    float const b = event.alongView;
    Vec3f d(b * dot(frame[0], state.I), b * dot(frame[1], state.I), event.alongFacet - b * c);
    if (event.refracts)
        d = normalize(d);
    state.sampleType = kSampleSmooth;
    continuePath(state, frame, d, event.weight, event, n);
}

inline void corvid_Mtl_Dielectric::sampleRough(IShaderAPI* api, ShadeState& state,
                                               SLArray<Vec3f>& frame, bool framed, Indices n,
                                               float r) const
{
    Ggx const facets{.alpha2 = r * r};
    Vec2f const xi = api->random2D();
    float const tan2 = facets.sampleTan2(xi.x);
    float const cosine = 1.0f / std::sqrt(1.0f + tan2);
    float const sine = std::sqrt(tan2) * cosine;
    float const phi = 6.283185f * xi.y;
    Vec3f const m(sine * std::cos(phi), sine * std::sin(phi), cosine);

    if (!framed) [[likely]]
        frame = computeBaseFrame(attribute_tangent(state), frame[2], Mat3f(state.objectToWorld));
    Vec3f const v = toLocal(frame, -state.I);
    Event const event = chooseEvent(api, state, v.z, dot(v, m), n.eta());
    if (event.ends()) {
        state.sampleType = kSampleNone;
        return;
    }
    Vec3f d = event.alongFacet * m - event.alongView * v;
    if (event.refracts)
        d = normalize(d);
    float const weight = event.weight * clamp(facets.sampleWeight(v, d, m), 0.0f, 4.0f);
    state.sampleType = kSampleRough;
    continuePath(state, frame, d, weight, event, n);
}

void corvid_Mtl_Dielectric::sample(IShaderAPI* api, ShadeState& state) const
{
    if (!anySwitch(state.allowReflection) && !anySwitch(state.allowTransmission)) {
        state.sampleType = kSampleNone;
        return;
    }
    float const side = dot(state.I, state.Ng);
    bool const leaving = side > 0.0f;
    Indices const n = indices(state, leaving);
    SLArray<Vec3f> frame;
    frame[2] = state.N * -sign(side);
    bool const bent = bends();
    if (bent) [[unlikely]] // bumps are read before the roughness and before the random numbers
        f_computeShadingFrame(api, state, state.P, Vec3f(frame[2]), state.objectToWorld, frame);
    float const r = roughness(state);
    if (leaving || r < kSmoothRoughness)
        samplePolished(api, state, frame, bent, n);
    else
        sampleRough(api, state, frame, bent, n, r);
}

} // namespace zsi
