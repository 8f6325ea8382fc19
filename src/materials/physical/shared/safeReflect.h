// SPDX-License-Identifier: Apache-2.0
/// Mirror directions that stay above the geometric surface.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// Least height of a reflected direction above the geometric surface, as a cosine.
inline constexpr float kReflectMargin = 0.05f;

/// The unit vector in the plane of I and N whose height above the surface is the margin, or N where
/// there is none.
inline Vec3f atReflectMargin(Vec3f I, Vec3f Ng, Vec3f N)
{
    // R' = alpha I + beta N with |R'| = 1 and R'.Ng = margin: a quadratic in beta.
    float const g = dot(I, Ng), s = dot(Ng, N), d = dot(I, N);
    if (g == 0.0f) // along the surface, where alpha below would be a quotient of zeros
        return N;
    float const A = s * s + g * g - 2.0f * (d * g) * s;
    float const B = (d * g - s) * 2.0f * kReflectMargin;
    float const C = 0.0025f - g * g;
    float beta;
    if (A != 0.0f) {
        float const discriminant = B * B - 4.0f * A * C;
        if (discriminant < 0.0f)
            return N;
        float const root = std::sqrt(discriminant);
        beta = maxOf((-root - B) / (2.0f * A), (root - B) / (2.0f * A));
    } else {
        if (B == 0.0f)
            return N;
        beta = -C / B;
    }
    float const alpha = (kReflectMargin - beta * s) / g;
    return normalize(alpha * I + beta * N);
}

/// `R`, or the vector at the margin where it dips below that. I: towards the surface; Ng, N: on the
/// viewer's side; R: the mirror direction of I about N.
inline Vec3f keepAboveSurface(Vec3f R, Vec3f I, Vec3f Ng, Vec3f N)
{
    if (dot(R, Ng) >= kReflectMargin) [[likely]]
        return R;
    return atReflectMargin(I, Ng, N);
}

/// What `mirroringNormal` does where N leans far.
[[gnu::noinline]] inline Vec3f raisedNormal(Vec3f V, Vec3f Ng, Vec3f N)
{
    float const height = minOf(kReflectMargin, 0.5f * dot(V, Ng));
    Vec3f const R = N * (2.0f * dot(V, N)) - V;
    float const mirrored = dot(R, Ng);
    if (mirrored >= height)
        return N;
    Vec3f const along = normalize(R - Ng * mirrored);
    return normalize(V + along * std::sqrt(1.0f - height * height) + Ng * height);
}

/// `N`, or where its mirror direction of V would dip below the surface, the normal in their plane
/// that keeps it above: by the margin, at grazing incidence by half of V's own height. So a bump
/// that faces away still mirrors. V: away from the surface; Ng: unit, on V's side.
inline Vec3f mirroringNormal(Vec3f V, Vec3f Ng, Vec3f N)
{
    if (dot(V, N) * dot(N, Ng) >= 0.75f * dot(V, Ng)) [[likely]] // mirrored to half of its height
        return N;
    return raisedNormal(V, Ng, N);
}

/// How the ray of a hit meets the shading normal, the side told by the geometric one.
struct Incidence {
    float cosine; ///< -I.N for the normal faced to the viewer; a zero along Ng's plane
    float along; ///< I.N for the normal as it is: I - 2 along N is the mirror direction
};
inline Incidence incidence(ShadeState const& state)
{
    float const side = dot(state.I, state.Ng);
    float const along = dot(state.I, state.N);
    if (side < 0.0f) [[likely]]
        return {-along, along};
    if (side > 0.0f)
        return {along, along};
    // Neither side: no normal to mirror at. What divides by the zero takes its sign.
    return {-dot(state.I, -state.N * 0.0f), 0.0f};
}

/// I mirrored about N, kept above the surface.
inline Vec3f f_safe_reflect(IShaderAPI*, ShadeState const&, Vec3f I, Vec3f Ng, Vec3f N)
{
    return keepAboveSurface(I - 2.0f * dot(N, I) * N, I, Ng, N);
}

/// The same as a member; derive from this where the shading language had one.
struct SafeReflectFunctions {
    Vec3f f_safe_reflect(IShaderAPI* api, ShadeState const& state, Vec3f I, Vec3f Ng, Vec3f N) const
    {
        return zsi::f_safe_reflect(api, state, I, Ng, N);
    }
};

} // namespace zsi
