/// Shading of the Ward family: lights, traced and indirect light, cut-out, occlusion, mask.
#pragma once

#include "materials/physical/indirectDiffuse.h"
#include "materials/physical/lightFade.h"
#include "materials/physical/safeReflect.h"
#include "materials/ward/wardFrame.h"
#include "materials/ward/wardLobes.h"

namespace zsi {

/// What a Ward surface sends to the viewer, before occlusion and mask.
struct WardColors {
    Vec4f diffuseLit; ///< lights through the diffuse layer; the only term that occlusion darkens
    Vec4f glossyLit; ///< highlights of lights
    Vec4f reflection;
    Vec4f refraction; ///< and what shows through the holes of the cut-out
    Vec4f indirect;
    Vec4f additional;
    Vec3f indirectWeight; ///< sum of the diffuse colours that weigh the indirect light
    Vec3f transparency; ///< weight of what lies behind
};

/// Shading members of a Ward class.
template <class Shader>
struct WardShadingFunctions {
    void shadeWard(IShaderAPI* api, ShadeState& state) const
    {
        auto const& s = self();
        Vec3f const mask =
            s.f_calcMasking(api, state, Shader::attribute_uv(state), state.Pref, state.Nref);
        if (mask == Vec3f(1.0f, 1.0f, 1.0f)) {
            state.discardHit = 1;
            return;
        }
        WardColors c;
        s.f_calculateColors(api, state, c);
        Vec3f const open =
            s.f_calcAmbientOcclusion(api, state, 1.0f - maxComponent(c.transparency));
        Vec3f const total = rgb(c.diffuseLit) * open + rgb(c.glossyLit) + rgb(c.reflection)
            + rgb(c.refraction) + rgb(c.indirect) + rgb(c.additional);
        if (mask == Vec3f(0.0f, 0.0f, 0.0f)) {
            state.Ci = withAlpha(total, 1.0f);
            return;
        }
        Vec4f const behind = api->traceThrough(&state.P, &state.I, 1.0f);
        // Alpha takes the mask's fourth weight, which is 1: that of what lies behind.
        state.Ci = withAlpha(mix(total, rgb(behind), mask), behind.w);
    }

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, WardColors& out) const
    {
        auto const& s = self();
        constexpr Vec3f kBlack(0.0f, 0.0f, 0.0f);
        out = {kOpaque, kOpaque, kOpaque, kOpaque, kOpaque, kOpaque, kBlack, kBlack};

        float const c = s.cutout(api, state);
        Vec3f seen = kBlack;
        if (c != 1.0f) [[unlikely]] {
            seen = rgb(api->traceThrough(&state.P, &state.I, 1.0f - c));
            if (c == 0.0f) {
                out.refraction = withAlpha(seen, 1.0f);
                out.transparency = {1.0f, 1.0f, 1.0f};
                return;
            }
        }

        float const side = facingSign(state.I, state.Ng);
        bool const far = side > 0.0f;
        Vec3f const Nf = state.N * -side;
        SLArray<Vec3f> frame;
        s.f_computeShadingFrame(api, state, state.P, Nf, Mat3f(state.objectToWorld), frame);
        if (!(frame[2] == Nf)) [[unlikely]] { // an unbent frame is square and visible already
            frame[2] = s.f_adjustBumpNormal(api, state, -state.I, Nf, frame[2]);
            s.f_basisOrthonormalize(api, state, frame);
        }
        Vec3f const v = toLocal(frame, state.I);
        WardLobe lobe;
        s.f_computeWardRoughness(api, state, lobe.ax, lobe.ay);
        Vec3f diffuse, specular, transmit, filter;
        s.f_computeWardLobeColors(api, state, true, false, -v.z, diffuse, specular, transmit,
                                  filter, state.Pref);
        Vec3f const N = s.u_normal1AsShadingNormal ? frame[2] : Nf;
        bool const glossy = maxComponent(specular) > kSpecularThreshold;

        Vec3f diffuseLit = kBlack;
        Vec3f glossyLit = kBlack;
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next) {
            float const w = light->weight * lightFade(dot(light->L, N));
            if (w == 0.0f || light->color == kBlack)
                continue;
            Vec3f const arriving = light->color * light->shadow * w;
            diffuseLit += diffuse * arriving;
            if (!glossy || !(v.z < 0.0f))
                continue;
            Vec3f const l = toLocal(frame, light->L);
            if (l.z > 0.0f)
                glossyLit += specular * lobe.value(v, l) * arriving;
        }

        Vec3f translucent = kBlack;
        if (far) {
            Vec3f ignored;
            s.f_computeWardLobeColors(api, state, false, false, -v.z, translucent, ignored,
                                      transmit, filter, state.Pref);
            translucent *= filter;
            if (!(translucent == kBlack))
                diffuseLit += translucent * lightBehind(api, state, -N);
        }
        out.diffuseLit = withAlpha(diffuseLit, 1.0f);
        out.glossyLit = withAlpha(glossyLit, 1.0f);
        out.transparency = transmit;

        Vec3f const NgFaced = state.Ng * -side;
        if (side < 0.0f && glossy && !s.u_reflectionHighlightOnly) {
            Vec3f const R = s.f_safe_reflect(api, state, state.I, NgFaced, frame[2]);
            Vec3f const traced =
                api->traceSpecular(&state.P, &R, s.u_reflectGlossyValue, maxComponent(specular));
            out.reflection = withAlpha(traced * specular, 1.0f);
        }
        if (s.u_transparency && !(transmit == kBlack)) {
            float const eta = far ? s.u_ior / state.beyondIor : state.incomingIor / s.u_ior;
            Vec3f T = sl_lib_refract(state.I, N, eta);
            if (T == kBlack)
                T = s.f_safe_reflect(api, state, state.I, NgFaced, N);
            Vec3f const traced =
                api->traceRefraction(&state.P, &T, refractionSpread(state), maxComponent(transmit));
            out.refraction = withAlpha(traced * transmit, 1.0f);
        }

        Vec3f const indirect = s.f_rtIndirectDiffuse(api, state, diffuse, state.P, N)
            + s.f_rtIndirectDiffuse(api, state, translucent, state.P, -N);
        out.indirect = withAlpha(indirect, 1.0f);
        out.indirectWeight = diffuse + translucent;

        Vec3f additional = s.u_additionalColor;
        if (s.u_additionalMapEnable) [[unlikely]]
            additional = additional
                * clamp01(rgb(Shader::texel(state, s.u_additionalMap, s.u_additionalMapTransform)))
                * s.u_additionalAmount;
        out.additional = withAlpha(additional, 1.0f);

        if (s.u_cutoutMapEnable) [[unlikely]]
            cutOut(out, seen, c);
    }

private:
    static constexpr Vec4f kOpaque{0.0f, 0.0f, 0.0f, 1.0f};
    /// Highlights below this are not worth their exponential.
    static constexpr float kSpecularThreshold = 1e-5f;

    Shader const& self() const { return static_cast<Shader const&>(*this); }

    /// Light that arrives on the side of `N`, with the horizon fade.
    Vec3f lightBehind(IShaderAPI* api, ShadeState const& state, Vec3f N) const
    {
        Vec3f sum(0.0f, 0.0f, 0.0f);
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next)
            sum += light->color * light->shadow * (light->weight * lightFade(dot(light->L, N)));
        return sum;
    }

    /// Spread of a traced refraction: the plain value as it is, a map read as glossiness.
    float refractionSpread(ShadeState const& state) const
    {
        auto const& s = self();
        if (!s.u_refractGlossyMapEnable)
            return s.u_refractGlossyValue;
        float const t = Shader::texel(state, s.u_refractGlossyMap, s.u_refractGlossyTransform).x;
        return spreadOfGlossiness(clamp01(t * s.u_refractGlossyAmount));
    }

    /// Blends every term with what is seen through the holes. c: 0 hole .. 1 surface.
    static void cutOut(WardColors& out, Vec3f seen, float c)
    {
        Vec4f* const terms[] = {&out.diffuseLit, &out.glossyLit, &out.reflection,
                                &out.refraction, &out.indirect,  &out.additional};
        for (Vec4f* term : terms)
            *term = withAlpha(rgb(*term) * c, 1.0f);
        out.refraction = withAlpha(seen * (1.0f - c) + rgb(out.refraction), 1.0f);
        out.transparency = out.transparency * c + grey(1.0f - c);
    }
};

} // namespace zsi
