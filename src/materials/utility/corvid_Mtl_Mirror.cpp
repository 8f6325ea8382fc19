// SPDX-License-Identifier: Apache-2.0
#include "materials/utility/corvid_Mtl_Mirror.h"

#include "materials/physical/shared/fresnel.h"
#include "materials/physical/shared/safeReflect.h"
#include "runtime/builtins.h"

namespace zsi {
namespace {

/// Reflectance at normal incidence, and what grazing adds, so that both make exactly 1.
constexpr float kNormalReflectance = 0.92f;
constexpr float kGrazingRise = 1.0f - 0.92f;

} // namespace

void corvid_Mtl_Mirror::shade(IShaderAPI* api, ShadeState& state) const
{
    shadeMasked(*this, api, state, [&] {
        Vec3f const& I = state.I;
        float const c = minOf(1.0f, std::fabs(dot(I, state.N)));
        float const F = schlickWeight(c) * kGrazingRise + kNormalReflectance;

        float const side = dot(I, state.Ng);
        Vec3f const Nf = -state.N * sign(side); // no normal where the ray runs along the surface
        Vec3f const Ngf = side <= 0.0f ? state.Ng : -state.Ng;
        Vec3f const R = f_safe_reflect(api, state, I, Ngf, Nf);

        Vec3f const tint = u_tintColor * F;
        return tint * api->traceReflection(&state.P, &R, maxComponent(tint));
    });
}

void corvid_Mtl_Mirror::transfer(IShaderAPI*, ShadeState&) const { }

void corvid_Mtl_Mirror::sample(IShaderAPI*, ShadeState& state) const
{
    if (!state.allowReflection[2]) [[unlikely]] {
        state.sampleType = kSampleNone;
        return;
    }
    auto const [cosine, along] = incidence(state);
    state.sampleType = kSampleStraight;
    state.sampleInvPdf = 1.0f;
    state.sampleCosine = cosine;
    state.sampleDirection = state.I - state.N * (2.0f * along); // not kept above the surface
    state.outBrdf = u_tintColor * (1.0f / cosine); // without the rise of `shade`
}

} // namespace zsi
