// SPDX-License-Identifier: Apache-2.0
#include "materials/physical/corvid_Mtl_Glazing.h"

#include "materials/physical/shared/ggx.h"
#include "materials/physical/shared/lightFade.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"
#include "runtime/builtins.h"

namespace zsi {

Vec3f corvid_Mtl_Glazing::transmissionTint(ShadeState const& state) const
{
    if (!u_transmittanceMapEnable)
        return u_refractColor;
    Vec2f const uv = transformUv(u_transmittanceTransform, attribute_uv(state));
    Vec3f const c = rgb(u_transmittanceMap.lookup(uv)) * u_transmittanceAmount;
    float const root = 1.0f / u_level;
    return {std::pow(c.x, root), std::pow(c.y, root), std::pow(c.z, root)};
}

void corvid_Mtl_Glazing::f_calculateColors(IShaderAPI* api, ShadeState const& state,
                                           PhysicalColors& out) const
{
    // Lights see the pane's normal as it is, the reflection that of the viewer's side.
    SLArray<Vec3f> const frame =
        computeBaseFrame(attribute_tangent(state), state.N, Mat3f(state.objectToWorld));
    Vec3f const v = toLocal(frame, -state.I);
    float const R = reflectance();
    Ggx const facets{.alpha2 = u_rough};

    for (LightSample const* light = api->getLightSamples(0, &state.P, &frame[2]); light;
         light = light->next) {
        float const fade = lightFade(dot(light->L, state.Ng));
        if (fade == 0.0f)
            continue;
        Vec3f const l = toLocal(frame, light->L);
        float const specular = facets.reflection(v, l, reflectionHalf(v, l));
        if (specular > 0.0f)
            out.lit += light->color * light->shadow * (specular * R * light->weight * fade);
    }

    out.reflectionWeight = u_reflectColor * R;
    if (!(out.reflectionWeight == kBlack)) {
        float const side = dot(state.I, state.Ng) > 0.0f ? -1.0f : 1.0f;
        Vec3f const direction =
            f_safe_reflect(api, state, state.I, state.Ng * side, state.N * side);
        out.reflection =
            api->traceReflection(&state.P, &direction, maxComponent(out.reflectionWeight))
            * out.reflectionWeight;
    }

    out.transmissionWeight = transmissionTint(state) * (1.0f - R);
    if (!(out.transmissionWeight == kBlack))
        out.refraction =
            rgb(api->traceThrough(&state.P, &state.I, maxComponent(out.transmissionWeight)))
            * out.transmissionWeight;
}

void corvid_Mtl_Glazing::shade(IShaderAPI* api, ShadeState& state) const
{
    shadePhysical(api, state);
}

void corvid_Mtl_Glazing::transmission(IShaderAPI*, ShadeState& state) const
{
    state.transmissionColor = u_refractColor * (1.0f - reflectance());
}

void corvid_Mtl_Glazing::transfer(IShaderAPI*, ShadeState& state) const
{
    Vec3f const N = -state.N * facingSign(state.I, state.Ng);
    SLArray<Vec3f> const frame =
        computeBaseFrame(attribute_tangent(state), N, Mat3f(state.objectToWorld));
    Vec3f const v = toLocal(frame, -state.I);
    Vec3f const l = toLocal(frame, state.sampleDirection);
    Vec3f const mirrored(l.x, l.y, -l.z);
    // Through the pane with index 1 on both sides the Jacobian is that of the mirrored reflection.
    Ggx const facets{.alpha2 = u_rough};
    float const R = reflectance();
    state.sampleCosine = std::fabs(l.z);
    state.outBrdf =
        grey(R * facets.reflection(v, l, reflectionHalf(v, l))
             + (1.0f - R) * facets.reflection(v, mirrored, reflectionHalf(v, mirrored)));
}

/// The pane's mirror image. factor: what the choice of this event leaves of its reflectance.
inline void corvid_Mtl_Glazing::sampleReflected(ShadeState& state, float factor) const
{
    auto const [cosine, along] = incidence(state);
    state.sampleType = kSampleStraight;
    state.sampleInvPdf = 1.0f;
    state.sampleCosine = cosine;
    state.sampleDirection = state.I - state.N * (2.0f * along);
    state.outBrdf = u_reflectColor * (factor / cosine);
}

/// Straight on. Value and cosine are negative: their product counts.
inline void corvid_Mtl_Glazing::sampleTransmitted(ShadeState& state, float factor) const
{
    float const cosine = -incidence(state).cosine;
    state.sampleType = kSampleSmooth;
    state.sampleInvPdf = 1.0f;
    state.sampleCosine = cosine;
    state.sampleDirection = state.I;
    state.outBrdf = u_refractColor * (factor / cosine);
}

void corvid_Mtl_Glazing::sample(IShaderAPI* api, ShadeState& state) const
{
    bool const mayReflect = anySwitch(state.allowReflection);
    bool const mayTransmit = anySwitch(state.allowTransmission);
    if (mayReflect && mayTransmit) [[likely]] {
        if (api->random() > reflectance())
            sampleTransmitted(state, 1.0f);
        else
            sampleReflected(state, 1.0f);
    } else if (mayReflect) {
        sampleReflected(state, reflectance());
    } else if (mayTransmit) {
        sampleTransmitted(state, 1.0f - reflectance());
    } else {
        state.sampleType = kSampleNone;
    }
}

} // namespace zsi
