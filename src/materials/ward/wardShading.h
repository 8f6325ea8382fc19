/// Shading of the Ward family: lights, traced and indirect light, cut-out, occlusion, mask.
#pragma once

#include "materials/physical/shared/indirectDiffuse.h"
#include "materials/physical/shared/lightFade.h"
#include "materials/physical/shared/materialSkeleton.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/ward/wardFrame.h"
#include "materials/ward/wardLobes.h"
#include "runtime/arithmetic.h"

namespace zsi {

/// Shading members of a Ward class.
template <class Shader>
struct WardShadingFunctions {
    void shadeWard(IShaderAPI* api, ShadeState& state) const { self().shadePhysical(api, state); }

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const
    {
        if (self().u_cutoutMapEnable) [[unlikely]]
            out = colorsWithHoles(api, state);
        else
            surfaceColors(api, state, out);
    }

private:
    /// Highlights below this are not worth their exponential.
    static constexpr float kSpecularThreshold = 1e-5f;

    Shader const& self() const { return static_cast<Shader const&>(*this); }

    /// Every term, blended with what is seen through the holes of the cut-out. The transmission
    /// weight stays that of the surface: occlusion darkens what is left of it in full.
    [[gnu::noinline]] PhysicalColors colorsWithHoles(IShaderAPI* api, ShadeState const& state) const
    {
        PhysicalColors out;
        float const c = self().cutout(api, state); // 0 hole .. 1 surface
        Vec3f seen = kBlack;
        if (c != 1.0f) {
            seen = rgb(api->traceThrough(&state.P, &state.I, 1.0f - c));
            if (c == 0.0f) {
                out.refraction = seen;
                out.transmissionWeight = {1.0f, 1.0f, 1.0f};
                return out;
            }
        }
        surfaceColors(api, state, out);
        out.lit *= c;
        out.highlight *= c;
        out.reflection *= c;
        out.indirect *= c;
        out.additional *= c;
        out.refraction = seen * (1.0f - c) + out.refraction * c;
        return out;
    }

    /// The terms of the surface itself.
    [[gnu::always_inline]] void surfaceColors(IShaderAPI* api, ShadeState const& state,
                                              PhysicalColors& out) const
    {
        auto const& s = self();
        float const side = facingSign(state.I, state.Ng);
        bool const far = side > 0.0f;
        Vec3f const Nf = state.N * -side;
        SLArray<Vec3f> frame;
        s.f_computeShadingFrame(api, state, state.P, Nf, state.objectToWorld, frame);
        bool const bent = !(frame[2] == Nf);
        if (bent) [[unlikely]] // the frame of a plain normal is square and visible already
            frame = visibleFrame(api, state, scalars(Nf), scalars(frame[0]), scalars(frame[2]));
        Vec3f const v = toLocal(frame, state.I);
        WardLobe lobe;
        s.f_computeWardRoughness(api, state, lobe.ax, lobe.ay);
        Vec3f diffuse, specular, transmit, filter;
        s.f_computeWardLobeColors(api, state, true, false, -v.z, diffuse, specular, transmit,
                                  filter, state.Pref);
        Vec3f N = scalars(Nf);
        if (s.u_normal1AsShadingNormal) [[unlikely]]
            N = scalars(frame[2]);
        bool const glossy = maxComponent(specular) > kSpecularThreshold;

        bool const shines = glossy && v.z < 0.0f;
        addLights(api, state, N, bent, frame, v, diffuse, specular, lobe, shines, out);

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
            if (!(dot(T, T) > 0.0f)) // total reflection, or no index
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
    }

    /// The frame of a bent normal turned to where the viewer can see it. By components, so that a
    /// frame that needs none of this need not be in memory.
    [[gnu::noinline]] SLArray<Vec3f> visibleFrame(IShaderAPI* api, ShadeState const& state,
                                                  Vec3f Nf, Vec3f tangent, Vec3f normal) const
    {
        Vec3f const visible = self().f_adjustBumpNormal(api, state, -state.I, Nf, normal);
        SLArray<Vec3f> frame{{tangent, tangent, visible}};
        self().f_basisOrthonormalize(api, state, frame);
        return frame;
    }

    /// Lights on the viewer's side. bent: whether N may differ from the frame's normal; shines:
    /// whether the glossy lobe counts.
    [[gnu::always_inline]] static void addLights(IShaderAPI* api, ShadeState const& state, Vec3f N,
                                                 bool bent, SLArray<Vec3f> const& frame, Vec3f v,
                                                 Vec3f diffuse, Vec3f specular, WardLobe lobe,
                                                 bool shines, PhysicalColors& out)
    {
        Vec3f lit(0.0f, 0.0f, 0.0f), highlight(0.0f, 0.0f, 0.0f);
        float const norm = lobe.norm();
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next) {
            float const height = dot(frame[2], light->L);
            float const w = light->weight * lightFade(bent ? dot(N, light->L) : height);
            if (w == 0.0f)
                continue;
            auto const black = [&] { return light->color == kBlack; };
            auto const arriving = [&] { return light->color * light->shadow * w; };
            if (shines && height > 0.0f) {
                // The lobe before the colours: no register outlives the call of its exponential.
                Vec3f const l(dot(frame[0], light->L), dot(frame[1], light->L), height);
                float const glossy = lobe.value(v, l, norm);
                if (black()) [[unlikely]]
                    continue;
                Vec3f const c = arriving();
                lit += diffuse * c;
                highlight += specular * glossy * c;
            } else if (!black()) {
                lit += diffuse * arriving();
            }
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
};

} // namespace zsi
