/// Shading frame of the Ward family: bumps, procedural patterns, rotation, visible normals.
#pragma once

#include "materials/physical/shared/anisoRotation.h"
#include "materials/physical/shared/proceduralNormal.h"
#include "materials/physical/shared/shadingFrame.h"
#include "materials/ward/wardNoise.h"
#include "runtime/builtins.h"

namespace zsi {

/// Frame members of a Ward class.
template <class Shader>
struct WardFrameFunctions {
    // Splice point, like those of `WardLobeFunctions`.

    /// Heights (r + g + b) of the first bump map: here, one step along the tangent or u, one step
    /// along the bitangent or v. frame: tangent, bitangent, normal so far; uv: the uv attribute;
    /// position: `Pref`.
    SLArray<float> normal0Heights(IShaderAPI*, ShadeState const&, SLArray<Vec3f> const& /*frame*/,
                                  Vec2f uv, Vec3f /*position*/) const
    {
        auto const& s = self();
        return bumpHeights(s.u_normal0Map, s.u_normal0Transform, uv);
    }

    /// Tangent, bitangent and normal at `P`, bent by the pattern or the first bump map, then by
    /// the second, then turned about the normal. toWorld takes the "tangent" attribute to world
    /// space: a Mat3f, or the Mat4f that holds it, which then is not copied. A pattern leaves the
    /// normal's length as it comes out.
    template <class Matrix>
    [[gnu::always_inline]] void
    f_computeShadingFrame(IShaderAPI* api, ShadeState const& state, Vec3f const& P, Vec3f N,
                          Matrix const& toWorld, SLArray<Vec3f>& frame) const
    {
        auto const& s = self();
        if (s.u_normal0MapEnable || isProcedure(s.u_procedureMapEnable) || s.u_normal1MapEnable)
            [[unlikely]]
            frame = bentFrame(api, state, P, scalars(N), toWorld);
        else
            frame = computeBaseFrame(Shader::attribute_tangent(state), N, Mat3f(toWorld));
        s.f_anisoRotateFrame(api, state, frame, 0.0f);
    }

    /// Makes tangent and bitangent unit and perpendicular to the normal, which stays.
    void f_basisOrthonormalize(IShaderAPI*, ShadeState const&, SLArray<Vec3f>& frame) const
    {
        reorthogonalize(frame);
    }

    /// A bumped normal that the viewer can see. viewer: towards the viewer; plain: the unbumped
    /// normal on the viewer's side. Where the tilt between plain and bumped normal carries it
    /// more than 89 degrees away from the viewer (measured in the plane of the tilt), or from the
    /// plain normal, it is turned back along that arc. Unit length.
    Vec3f f_adjustBumpNormal(IShaderAPI*, ShadeState const&, Vec3f viewer, Vec3f plain,
                             Vec3f bumped) const
    {
        constexpr float kMaxAngle = 1.553343f; // 89 degrees
        constexpr float kSmallTilt = 0.08f; // below: sin(a)/sin(b) loses digits
        Vec3f const v = normalize(viewer);
        Vec3f const n = normalize(plain);
        Vec3f const m = normalize(bumped);
        float const cosTilt = clamp(dot(n, m), -1.0f, 1.0f);
        Vec3f const across = normalize(m - n * cosTilt);
        float const tilt = std::acos(cosTilt);
        // Where the viewer stands along the arc, seen from the plain normal.
        float const seen = std::atan2(dot(v, across), dot(v, n));
        float const kept = clamp(minOf(tilt, seen + kMaxAngle), 0.0f, kMaxAngle);
        if (!(kept < tilt))
            return m;
        if (tilt < kSmallTilt) {
            float const w = (1.0f - std::cos(kept)) / (1.0f - cosTilt);
            return normalize(n * (1.0f - w) + m * w);
        }
        float const sinTilt = std::sin(tilt);
        return normalize(n * (std::sin(tilt - kept) / sinTilt) + m * (std::sin(kept) / sinTilt));
    }

private:
    Shader const& self() const { return static_cast<Shader const&>(*this); }

    /// The whole frame, so that one that nothing bends need not be in memory for this.
    template <class Matrix>
    [[gnu::noinline]] SLArray<Vec3f> bentFrame(IShaderAPI* api, ShadeState const& state,
                                               Vec3f const& P, Vec3f N,
                                               Matrix const& objectToWorld) const
    {
        auto const& s = self();
        Mat3f const toWorld(objectToWorld);
        SLArray<Vec3f> frame = computeBaseFrame(Shader::attribute_tangent(state), N, toWorld);
        Vec2f const uv = Shader::attribute_uv(state);
        if (s.u_normal0MapEnable) {
            float const amount = s.u_normal0Amount
                * Shader::scalar(state, s.u_normal0AmountMapEnable, s.u_normal0AmountMap,
                                 s.u_normal0AmountTransform, 1.0f, 1.0f);
            bend(frame, s.normal0Heights(api, state, frame, uv, state.Pref), amount);
        } else if (isProcedure(s.u_procedureMapEnable)) {
            perturbByPattern(api, state, P, toWorld, frame);
        }
        if (s.u_normal1MapEnable)
            bend(frame, bumpHeights(s.u_normal1Map, s.u_normal1Transform, uv), s.u_normal1Amount);
        return frame;
    }

    static void bend(SLArray<Vec3f>& frame, SLArray<float> const& heights, float amount)
    {
        bendByHeights(frame, heights, amount);
        normalizeAndReorthogonalize(frame);
    }

    /// Adds the pattern's offset, in frame coordinates, to the normal; its length is left as it
    /// comes out, and tangent and bitangent follow it.
    void perturbByPattern(IShaderAPI* api, ShadeState const& state, Vec3f P, Mat3f const& toWorld,
                          SLArray<Vec3f>& frame) const
    {
        auto const& s = self();
        int const kind = s.u_procedureMapEnable;
        Vec3f offset(0.0f, 0.0f, 0.0f);
        if (kind == kProcedureNoise) {
            offset = castRippleOffset(api, state, P, toWorld, s.u_procedureMapTiling, frame);
        } else {
            auto const pattern = [&](Vec3f at) {
                return f_elm_rtpb_XYZGenerator(
                    api, state, kPatternObject, at, toWorld, Vec4f(0.0f, 0.0f, 0.0f, 0.0f),
                    s.u_procedureMapTiling, Vec3f(-0.6f, -0.6f, 0.5f), 0.0f, 0.0f);
            };
            // Slopes per cell of the pattern: neither its tiling nor its kind changes the depth.
            constexpr float kStep = 0.1f; // cells
            float const step = kStep / s.patternFrequency(kind);
            Vec3f const p = pattern(P);
            float const here = s.patternHeight(api, state, kind, p);
            auto const slope = [&](Vec3f along) {
                Vec3f const q = p + normalize(pattern(P + along) - p) * step;
                return (here - s.patternHeight(api, state, kind, q)) / kStep;
            };
            offset.x = slope(frame[0]);
            offset.y = slope(frame[1]);
        }
        bendByOffset(frame, offset * s.u_procedureMapAmount);
    }
};

} // namespace zsi
