/// Scattering of the Ward family for path tracing: shadow rays, evaluation, sampling.
#pragma once

#include "materials/ward/wardFrame.h"
#include "materials/ward/wardLobes.h"

#include <limits>

namespace zsi {

/// Path tracing members of a Ward class.
template <class Shader>
struct WardScatteringFunctions {
    /// What a shadow ray keeps: the hole of the cut-out, or the transparency, which replaces it.
    void transmissionWard(IShaderAPI* api, ShadeState& state) const
    {
        auto const& s = self();
        Vec3f result(0.0f, 0.0f, 0.0f);
        if (float const c = s.cutout(api, state); c != 1.0f)
            result = grey(1.0f - c);
        if (s.u_transparency) {
            float const side = facingSign(state.I, state.Ng);
            Vec3f const n = side > 0.0f ? -state.N : state.N;
            // Positive on the front, negative on the far side, which then shows its grazing
            // reflectivity.
            float const cosTheta = side * dot(n, state.I);
            Vec3f diffuse, specular, filter;
            s.f_computeWardLobeColors(api, state, side <= 0.0f, true, cosTheta, diffuse, specular,
                                      result, filter, state.Pref);
        }
        state.transmissionColor = result;
    }

    /// Diffuse plus glossy value for `sampleDirection`.
    void transferWard(IShaderAPI* api, ShadeState& state) const
    {
        Surface const at = surface(api, state);
        Vec3f const l = toLocal(at.frame, state.sampleDirection);
        if (!(l.z > 0.0f && at.v.z < 0.0f)) {
            state.sampleCosine = 0.0f;
            state.outBrdf = {0.0f, 0.0f, 0.0f};
            return;
        }
        float const cosine = cosineOf(state, at.Nf, l.z);
        if (cosine <= 0.0f) {
            state.sampleCosine = 0.0f;
            state.outBrdf = {0.0f, 0.0f, 0.0f};
            return;
        }
        float const glossy = roughness(api, state).value(at.v, l);
        Lobes const lobes = frontLobes(api, state, at.v.z);
        state.sampleCosine = cosine;
        state.outBrdf = lobes.diffuse * kWardInvPi + lobes.specular * glossy;
    }

    /// A direction from the mixture of both lobes, or from the glossy lobe alone where the host
    /// asks for neither of the first two kinds of reflected samples.
    void sampleWard(IShaderAPI* api, ShadeState& state) const
    {
        Surface const at = surface(api, state);
        if (!(at.v.z < 0.0f)) {
            state.sampleType = kSampleNone;
            return;
        }
        WardLobe const glossy = roughness(api, state);
        Lobes const lobes = frontLobes(api, state, at.v.z);
        Vec3f const diffuse = lobes.diffuse * kWardInvPi;

        if (!state.allowReflection[0] && !state.allowReflection[1]) {
            WardGlossySample const g = sampleWardLobe(glossy, at.v, api->random2D());
            if (!(g.direction.z >= 0.0f)) {
                state.sampleType = kSampleNone;
                return;
            }
            if (g.direction.z > 0.0f && !(g.density >= kLeastDensity)) {
                state.sampleType = kSampleNone;
                return;
            }
            state.sampleDirection = toWorld(at.frame, g.direction);
            state.sampleCosine = cosineOf(state, at.Nf, g.direction.z); // either sign
            state.sampleInvPdf = 1.0f / g.density;
            // The diffuse part goes in and out again: the rounding is that of the mixture.
            state.outBrdf = (diffuse + lobes.specular * g.value) - diffuse;
            state.sampleType = kSampleStraight;
            return;
        }

        float const pd = maxComponent(lobes.diffuse) == 0.0f ? 0.0f
            : maxComponent(lobes.specular) == 0.0f           ? 1.0f
                                                             : 0.5f;
        WardGlossySample g;
        if (api->random() <= pd) {
            g = evaluateWardLobe(glossy, at.v, sampleCosineHemisphere(api->random2D()));
        } else {
            g = sampleWardLobe(glossy, at.v, api->random2D());
            if (!(g.direction.z >= 0.0f)) {
                state.sampleType = kSampleNone;
                return;
            }
        }
        state.sampleDirection = toWorld(at.frame, g.direction);
        state.sampleCosine = cosineOf(state, at.Nf, g.direction.z);
        float const pdf = g.direction.z * kWardInvPi * pd + (1.0f - pd) * g.density;
        if (state.sampleCosine < 0.0f || !(pdf >= kLeastDensity)) {
            state.sampleType = kSampleNone;
            return;
        }
        state.sampleInvPdf = 1.0f / pdf;
        state.outBrdf = diffuse + lobes.specular * g.value;
        state.sampleType = kSampleMixture;
    }

private:
    /// Densities below have no finite inverse.
    static constexpr float kLeastDensity = std::numeric_limits<float>::min();

    struct Surface {
        Vec3f Nf; ///< plain normal on the viewer's side; zero edge on
        SLArray<Vec3f> frame;
        Vec3f v; ///< incident direction, local
    };
    struct Lobes {
        Vec3f diffuse, specular;
    };

    Shader const& self() const { return static_cast<Shader const&>(*this); }

    [[gnu::always_inline]] Surface surface(IShaderAPI* api, ShadeState const& state) const
    {
        Surface at;
        at.Nf = state.N * -facingSign(state.I, state.Ng);
        self().f_computeShadingFrame(api, state, state.P, at.Nf, state.objectToWorld, at.frame);
        at.v = toLocal(at.frame, state.I);
        return at;
    }
    WardLobe roughness(IShaderAPI* api, ShadeState const& state) const
    {
        WardLobe lobe;
        self().f_computeWardRoughness(api, state, lobe.ax, lobe.ay);
        return lobe;
    }
    Lobes frontLobes(IShaderAPI* api, ShadeState const& state, float vz) const
    {
        Lobes lobes;
        Vec3f transmit, filter;
        self().f_computeWardLobeColors(api, state, true, false, -vz, lobes.diffuse, lobes.specular,
                                       transmit, filter, state.Pref);
        return lobes;
    }
    float cosineOf(ShadeState const& state, Vec3f Nf, float localZ) const
    {
        return self().u_cosineUsesBump ? localZ : dot(Nf, state.sampleDirection);
    }
};

} // namespace zsi
