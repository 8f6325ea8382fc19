/// Reflection of metallic paint: one set of lobes that lights, paths and evaluation share.
#pragma once

#include "materials/physical/clearCoat.h"
#include "materials/physical/paintFlakes.h"
#include "materials/physical/shared/shadingFrame.h"

namespace zsi {

/// Colours under the coat, each channel 0..1.
struct PaintColors {
    Vec3f base;
    float baseRough; ///< of the base's relief, 0..1
    Vec3f flake;
    Vec4f pearl; ///< colour of flakes met edge on, and how much of it shows, 0..1

    /// Of flakes met at the cosine c. The path through a thin film shortens with the squared sine,
    /// to first order: Belcour and Barla 2017, "A Practical Extension to Microfacet Theory for the
    /// Modeling of Varying Iridescence", eq. 3.
    Vec3f flakeAt(float c) const { return mix(flake, rgb(pearl), pearl.w * (1.0f - c * c)); }
};

/// Orthonormal frames of a hit: of base and flakes, and of the coat.
struct PaintFrames {
    SLArray<Vec3f> base, coat;
};

/// Rough diffuse reflection of albedo 1, times pi: Oren and Nayar 1994, "Generalization of
/// Lambert's Reflectance Model", in the form of Fujii, "A Tiny Improvement of Oren-Nayar
/// Reflectance Model", eq. 2, whose albedo stays within 1. rough: 0..1.
inline float roughDiffuse(Vec3f v, Vec3f l, float rough)
{
    constexpr float kLoss = 0.28779341f; // 1/2 - 2/(3 pi)
    float const s = dot(v, l) - v.z * l.z;
    float const t = s > 0.0f ? maxOf(v.z, l.z) : 1.0f;
    return (1.0f + rough * s / t) / (1.0f + kLoss * rough);
}

/// Metallic paint seen from one direction: a rough diffuse base, flakes that cover a part of it,
/// and a clear coat over both with a normal of its own. Values are 1/sr.
class PaintLobe {
public:
    /// v: unit, world space, not below the frames.
    PaintLobe(PaintColors const& colors, FlakeFootprint const& flakes, PaintFrames const& frames,
              float coatReflectance, float coatWidth, Vec3f v)
        : colors_(colors)
        , flakes_(flakes)
        , frames_(frames)
        , v_(toLocal(frames.base, v))
        , coat_(coatReflectance, coatWidth, toLocal(frames.coat, v))
        , coatAlbedo_(coat_.albedo(dot(frames.coat[2], v)))
        , passed_(coat_.passedV())
        , area_(flakes.seenArea(v_))
    {
    }

    struct Value {
        Vec3f under; ///< base and flakes
        float coat;
        float pdf; ///< of `sample`, 1/sr
    };
    /// Scattering value without the cosine on the base frame, for a direction above that frame.
    /// glossyOnly: without the base.
    Value operator()(Vec3f direction, bool glossyOnly) const
    {
        Vec3f const l = toLocal(frames_.base, direction);
        Vec3f const lc = toLocal(frames_.coat, direction);
        Chances const chance = chances(glossyOnly);
        ClearCoat::Value const coat = coat_(lc);
        // The cosine that goes with the value is the base's.
        Value sum{{0.0f, 0.0f, 0.0f}, coat.value * (lc.z / l.z), chance.coat * coat.pdf};
        float const both = passed_ * coat_.passed(lc.z);
        if (!glossyOnly) {
            // What the coat throws back from below reaches the base again.
            float const again = kInvPi / maxOf(coat_.meanPassed(), 1e-6f);
            sum.under = colors_.base
                * (roughDiffuse(v_, l, colors_.baseRough) * (1.0f - flakes_.coverage()) * both
                   * again);
            sum.pdf += chance.base * l.z * kInvPi;
        }
        if (flakes_.coverage() > 0.0f) {
            Vec3f const h = v_ + l;
            float const hh = dot(h, h), cosine = minOf(0.5f * std::sqrt(hh), 1.0f);
            FlakeFootprint::Density const d = flakes_(h / (2.0f * cosine), v_, area_);
            sum.under += colors_.flakeAt(cosine)
                * (flakes_.coverage() * both * d.normals / (4.0f * area_ * flakes_.seenArea(l)));
            sum.pdf += chance.flakes * d.picked * (h.z / (8.0f * cosine * cosine));
        }
        return sum;
    }

    /// A direction, world space; it may point below the surface. pick: in [0, 1), of the lobe.
    Vec3f sample(float pick, Vec2f u, bool glossyOnly) const
    {
        Chances const chance = chances(glossyOnly);
        if (pick < chance.coat)
            return toWorld(frames_.coat, coat_.direction(u));
        pick -= chance.coat;
        if (pick < chance.base || !(chance.flakes > 0.0f)) {
            float const r = std::sqrt(u.y), phi = 2.0f * kPi * u.x;
            return toWorld(frames_.base,
                           {r * std::cos(phi), r * std::sin(phi), std::sqrt(1.0f - u.y)});
        }
        Vec3f const h = FlakeFootprint::normal(
            flakes_.pick(v_, area_, (pick - chance.base) / chance.flakes), u);
        return toWorld(frames_.base, h * (2.0f * dot(v_, h)) - v_);
    }

    PaintFrames const& frames() const { return frames_; }
    float coatAlbedo() const { return coatAlbedo_; }
    float coatWidth() const { return coat_.width(); }
    /// Share of light from all around that comes back through the coat, and of flakes in it.
    Vec3f baseAlbedo() const { return colors_.base * (passed_ * (1.0f - flakes_.coverage())); }
    Vec3f flakeAlbedo(float cosine) const
    {
        return colors_.flakeAt(cosine) * (passed_ * passed_ * flakes_.coverage());
    }
    float flakeCoverage() const { return flakes_.coverage(); }
    /// A flake that v meets, or the crowd. u: in [0, 1).
    FlakeFootprint::Pick pickFlake(float u) const { return flakes_.pick(v_, area_, u); }

private:
    struct Chances {
        float coat, base, flakes;
    };
    Chances chances(bool glossyOnly) const
    {
        float const base = glossyOnly ? 0.0f : maxComponent(baseAlbedo());
        float const brightest =
            maxOf(maxComponent(colors_.flake), colors_.pearl.w * maxComponent(rgb(colors_.pearl)));
        float const flakes = passed_ * flakes_.coverage() * brightest;
        float const sum = coatAlbedo_ + base + flakes;
        if (!(sum > 0.0f))
            return {1.0f, 0.0f, 0.0f};
        return {coatAlbedo_ / sum, base / sum, flakes / sum};
    }

    PaintColors colors_;
    FlakeFootprint flakes_;
    PaintFrames frames_;
    Vec3f v_;
    ClearCoat coat_;
    float coatAlbedo_, passed_, area_;
};

} // namespace zsi
