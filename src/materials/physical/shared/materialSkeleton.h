// SPDX-License-Identifier: Apache-2.0
/// What `shade` of every masked material has in common, and the front of the physical materials.
#pragma once

#include "materials/physical/shared/ambientOcclusion.h"
#include "materials/physical/shared/masking.h"
#include "runtime/arithmetic.h"

namespace zsi {

#define TANGENT_ATTRIBUTES(P, U, A) \
    A(Vec3f, bitangent)             \
    A(Vec3f, tangent)               \
    A(Vec2f, uv)

/// Leading rows of a physical material that declares its attributes together: uv1 at 0, vtxcolor
/// at 8, bitangent at 24, tangent at 36, uv at 48.
#define PHYSICAL_FRONT(P, U, A)           \
    AMBIENT_OCCLUSION_PARAMETERS(P, U, A) \
    MASKING(P, U, A)                      \
    AMBIENT_OCCLUSION_ATTRIBUTES(P, U, A) \
    TANGENT_ATTRIBUTES(P, U, A)

/// Cuts the material out by its mask: `color()` gives what it shows, linear RGB. A full mask
/// discards the hit, no mask gives the colour with alpha 1, and between them what lies behind is
/// blended in per channel and gives the alpha.
template <class Shader, class Color>
inline void shadeMasked(Shader const& shader, IShaderAPI* api, ShadeState& state, Color&& color)
{
    Vec3f mask =
        shader.f_calcMasking(api, state, Shader::attribute_uv(state), state.Pref, state.Nref);
    if constexpr (requires { Shader::kMaskSaturates; }) // a class without light below black
        mask = saturate(mask);
    if (mask == Vec3f(1.0f, 1.0f, 1.0f)) {
        state.discardHit = 1;
        return;
    }
    Vec3f const shown = color();
    if (mask == Vec3f(0.0f, 0.0f, 0.0f)) {
        state.Ci = withAlpha(shown, 1.0f);
        return;
    }
    Vec4f const behind = api->traceThrough(&state.P, &state.I, 1.0f);
    state.Ci = withAlpha(mix(shown, rgb(behind), mask), behind.w);
}

/// What a physical material sends to the viewer, linear RGB, before occlusion and mask. A material
/// leaves the terms that it does not have black.
struct PhysicalColors {
    Vec3f lit{0.0f, 0.0f, 0.0f}; ///< from the lights; the only term that occlusion darkens
    Vec3f highlight{0.0f, 0.0f, 0.0f}; ///< from the lights, not darkened
    Vec3f reflection{0.0f, 0.0f, 0.0f}; ///< traced, times reflectionWeight
    Vec3f refraction{0.0f, 0.0f, 0.0f}; ///< traced, times transmissionWeight
    Vec3f indirect{0.0f, 0.0f, 0.0f};
    Vec3f additional{0.0f, 0.0f, 0.0f};
    Vec3f reflectionWeight{0.0f, 0.0f, 0.0f}; ///< no contribution of its own
    Vec3f indirectWeight{0.0f, 0.0f, 0.0f}; ///< diffuse colours in it; no contribution of its own
    Vec3f transmissionWeight{0.0f, 0.0f, 0.0f}; ///< where it is 1, occlusion counts nothing
};

/// `shade` of a physical material; derive with the class as argument. The class has the rows and
/// members of masking and ambient occlusion, and
/// `void f_calculateColors(IShaderAPI*, ShadeState const&, PhysicalColors&) const`.
template <class Shader>
struct PhysicalShading : MaskingFunctions<Shader>, AmbientOcclusionFunctions<Shader> {
    void shadePhysical(IShaderAPI* api, ShadeState& state) const
    {
        auto const& shader = static_cast<Shader const&>(*this);
        shadeMasked(shader, api, state, [&] {
            PhysicalColors c;
            shader.f_calculateColors(api, state, c);
            float const opacity = 1.0f - maxComponent(c.transmissionWeight);
            Vec3f const open = shader.f_calcAmbientOcclusion(api, state, opacity);
            return c.lit * open + c.highlight + c.reflection + c.refraction + c.indirect
                + c.additional;
        });
    }
};

/// Which events a host accepts from `sample`: any of its three switches.
inline bool anySwitch(std::uint8_t const (&allowed)[3])
{
    return allowed[0] || allowed[1] || allowed[2]; // the first is set most often
}

} // namespace zsi
