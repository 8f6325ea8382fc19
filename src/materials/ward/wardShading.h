/// Shading of the Ward family: lights, traced and indirect light, cut-out, occlusion, mask.
#pragma once

#include "materials/physical/indirectDiffuse.h"
#include "materials/physical/lightFade.h"
#include "materials/physical/materialSkeleton.h"
#include "materials/physical/safeReflect.h"
#include "materials/ward/wardFrame.h"
#include "materials/ward/wardLobes.h"

namespace zsi {

/// Shading members of a Ward class.
template <class Shader>
struct WardShadingFunctions {
    void shadeWard(IShaderAPI* api, ShadeState& state) const { self().shadePhysical(api, state); }

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const
    {
        auto const& s = self();
        constexpr Vec3f kBlack(0.0f, 0.0f, 0.0f);
        float const c = s.cutout(api, state);
        Vec3f seen = kBlack;
        if (c != 1.0f) [[unlikely]] {
            seen = rgb(api->traceThrough(&state.P, &state.I, 1.0f - c));
            if (c == 0.0f) {
                out.refraction = seen;
                out.transmissionWeight = {1.0f, 1.0f, 1.0f};
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

        WardLobe const* const shine = glossy && v.z < 0.0f ? &lobe : nullptr;
        addLights(api, state, N, frame, v, diffuse, specular, shine, out);

        Vec3f translucent = kBlack;
        if (far) {
            Vec3f ignored;
            s.f_computeWardLobeColors(api, state, false, false, -v.z, translucent, ignored,
                                      transmit, filter, state.Pref);
            translucent *= filter;
            out.lit += translucent * lightBehind(api, state, -N);
        }
        out.transmissionWeight = transmit;

        Vec3f const NgFaced = state.Ng * -side;
        if (side < 0.0f && glossy && !s.u_reflectionHighlightOnly) {
            Vec3f const R = s.f_safe_reflect(api, state, state.I, NgFaced, frame[2]);
            Vec3f const traced =
                api->traceSpecular(&state.P, &R, s.u_reflectGlossyValue, maxComponent(specular));
            out.reflectionWeight = specular;
            out.reflection = traced * specular;
        }
        if (s.u_transparency && !(transmit == kBlack)) {
            float const eta = far ? s.u_ior / state.beyondIor : state.incomingIor / s.u_ior;
            Vec3f T = sl_lib_refract(state.I, N, eta);
            if (T == kBlack) // total reflection
                T = s.f_safe_reflect(api, state, state.I, NgFaced, N);
            out.refraction = transmit
                * api->traceRefraction(&state.P, &T, refractionSpread(state),
                                       maxComponent(transmit));
        }

        out.indirect = s.f_rtIndirectDiffuse(api, state, diffuse, state.P, N);
        out.indirectWeight = diffuse;
        if (far) {
            out.indirect += s.f_rtIndirectDiffuse(api, state, translucent, state.P, -N);
            out.indirectWeight += translucent;
        }

        out.additional = s.u_additionalColor;
        if (s.u_additionalMapEnable) [[unlikely]]
            out.additional *= s.u_additionalAmount
                * clamp01(rgb(Shader::texel(state, s.u_additionalMap, s.u_additionalMapTransform)));

        if (s.u_cutoutMapEnable) [[unlikely]]
            out = cutOut(out, seen, c);
    }

private:
    /// Highlights below this are not worth their exponential.
    static constexpr float kSpecularThreshold = 1e-5f;

    Shader const& self() const { return static_cast<Shader const&>(*this); }

    /// Lights on the viewer's side. shine: the glossy lobe, null where it does not count.
    [[gnu::always_inline]] static void addLights(IShaderAPI* api, ShadeState const& state, Vec3f N,
                                                 SLArray<Vec3f> const& frame, Vec3f v,
                                                 Vec3f diffuse, Vec3f specular,
                                                 WardLobe const* shine, PhysicalColors& out)
    {
        Vec3f lit(0.0f, 0.0f, 0.0f), highlight(0.0f, 0.0f, 0.0f);
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next) {
            float const w = light->weight * lightFade(dot(light->L, N));
            if (w == 0.0f || light->color == Vec3f(0.0f, 0.0f, 0.0f))
                continue;
            Vec3f const arriving = light->color * light->shadow * w;
            lit += diffuse * arriving;
            if (!shine)
                continue;
            Vec3f const l = toLocal(frame, light->L);
            if (l.z > 0.0f)
                highlight += specular * shine->value(v, l) * arriving;
        }
        out.lit = lit;
        out.highlight = highlight;
    }

    /// Light that arrives on the side of `N`, with the horizon fade.
    Vec3f lightBehind(IShaderAPI* api, ShadeState const& state, Vec3f N) const
    {
        Vec3f sum(0.0f, 0.0f, 0.0f);
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next)
            if (!(light->color == Vec3f(0.0f, 0.0f, 0.0f)))
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
    static PhysicalColors cutOut(PhysicalColors out, Vec3f seen, float c)
    {
        out.lit *= c;
        out.highlight *= c;
        out.reflection *= c;
        out.indirect *= c;
        out.additional *= c;
        out.refraction = seen * (1.0f - c) + out.refraction * c;
        out.transmissionWeight = out.transmissionWeight * c + grey(1.0f - c);
        return out;
    }
};

} // namespace zsi
