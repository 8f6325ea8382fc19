// SPDX-License-Identifier: Apache-2.0
/// Ambient occlusion that most materials carry: parameters, attributes and evaluation.
#pragma once

#include "runtime/builtins.h"
#include "runtime/shaderTable.h"

namespace zsi {

#define AMBIENT_OCCLUSION_BAKED(P, U, A)                                                           \
    P(TextureSampler2D, ambientOcclusionTexture, (), "baked occlusion in its red channel, by uv1", \
      group("ambient occlusion"))                                                                  \
    P(int, ambientOcclusionMode, (0), "baked source: 1 texture, 2 vertex colour, others none",     \
      slider(0, 2))                                                                                \
    P(float, ambientOcclusionFactor, (1.0f), "strength of the occlusion", slider(0, 1))            \
    P(Vec3f, ambientOcclusionColor, (0.0f, 0.0f, 0.0f), "colour of fully occluded areas")          \
    P(bool, usePrecalcAO, (true), "use the baked source that ambientOcclusionMode tells",          \
      groupEnd())

#define AMBIENT_OCCLUSION_SWITCHES(P, U, A)                                                        \
    P(bool, showAmbientOnly, (false), "show the occlusion alone, where a material offers it",      \
      group("ambient occlusion"))                                                                  \
    P(bool, usingRaytracedAO, (false), "ask the host for occlusion where no baked source applies", \
      groupEnd())

#define AMBIENT_OCCLUSION_PARAMETERS(P, U, A) \
    AMBIENT_OCCLUSION_BAKED(P, U, A)          \
    AMBIENT_OCCLUSION_SWITCHES(P, U, A)

#define AMBIENT_OCCLUSION_ATTRIBUTES(P, U, A) \
    A(Vec2f, uv1)                             \
    A(Vec4f, vtxcolor)

/// The block as almost every class places it.
#define AMBIENT_OCCLUSION(P, U, A)        \
    AMBIENT_OCCLUSION_PARAMETERS(P, U, A) \
    AMBIENT_OCCLUSION_ATTRIBUTES(P, U, A)

/// Occlusion multiplier per channel; (1, 1, 1) fully open. A class gets it as a member by
/// deriving from this with itself as the argument.
template <class Shader>
struct AmbientOcclusionFunctions {
    /// weight: how much of the occlusion counts, 0..1; 1 for an opaque surface.
    Vec3f f_calcAmbientOcclusion(IShaderAPI* api, ShadeState const& state, float weight) const
    {
        auto const& s = static_cast<Shader const&>(*this);
        if (s.usePrecalcAO && s.ambientOcclusionMode == 1) {
            float const open = s.ambientOcclusionTexture.lookup(Shader::attribute_uv1(state)).x;
            return tint((1.0f - open) * s.ambientOcclusionFactor * weight);
        }
        if (s.usePrecalcAO && s.ambientOcclusionMode == 2) {
            float const open = Shader::attribute_vtxcolor(state).x;
            return tint((1.0f - open) * s.ambientOcclusionFactor * weight);
        }
        if (s.usingRaytracedAO) {
            Vec3f const faced = -state.N * facingSign(state.I, state.Ng);
            Vec3f const open = api->occlusion(&state.P, &faced, 1.0f);
            float const f = s.ambientOcclusionFactor;
            return tint((grey(1.0f) - (grey(1.0f - f) + open * f)) * weight);
        }
        return {1.0f, 1.0f, 1.0f};
    }

private:
    Vec3f tint(Vec3f k) const
    {
        return (grey(1.0f) - k) + static_cast<Shader const&>(*this).ambientOcclusionColor * k;
    }
    Vec3f tint(float k) const { return tint(grey(k)); }
};

} // namespace zsi
