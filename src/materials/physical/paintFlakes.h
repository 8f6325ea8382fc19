/// Flakes of a metallic paint: those under one footprint, and the lobe that a crowd of them makes.
///
/// A flake is a facet of slope s (the tangent-plane part of its normal over the upright part) with
/// a gloss of its own; both are Gaussian, so that many flakes together are one lobe whose squared
/// width is the sum of theirs (Olano and Baker 2010, "LEAN Mapping"). A footprint of n flakes is
/// their mean, as in Jakob et al. 2014, "Discrete Stochastic Microfacet Models"; the contrast that
/// n flakes have left, 1/sqrt(n), is what is told apart here, and the rest is the crowd.
///
/// Flakes come in opposite pairs, like the walls of the grooves of Torrance and Sparrow 1967: each
/// patch then is level on average, and keeps its own balance of light whatever its slope.
/// Local directions: unit, z along the normal.
#pragma once

#include "materials/physical/shared/ggx.h"
#include "materials/physical/shared/tiltedFacets.h"

#include <zsi/zsi.h>

namespace zsi {

/// How a layer of flakes is made.
struct FlakeRecipe {
    float size; ///< width of a flake, world units
    float density; ///< share of the surface that they cover, 0..1
    float spread; ///< width of their slopes, 0 or more
    float gloss; ///< width of the lobe of one flake, above 0
};

/// The flakes that one ray meets.
class FlakeFootprint {
public:
    /// More flakes than these look no different from the crowd.
    static constexpr int kMost = 8;

    /// The crowd alone.
    explicit FlakeFootprint(FlakeRecipe const& recipe)
        : coverage_(recipe.density)
        , crowdShare_(1.0f)
        , gloss2_(recipe.gloss * recipe.gloss)
        , crowd2_(gloss2_ + recipe.spread * recipe.spread)
    {
    }

    /// The flakes around p. p: position that sticks to the surface, in flakes; x, y: unit, along
    /// the surface there; underneath: flakes under the footprint, any number above 0.
    FlakeFootprint(FlakeRecipe const& recipe, IShaderAPI* api, Vec3f p, Vec3f x, Vec3f y,
                   float underneath)
        : FlakeFootprint(recipe)
    {
        float const told = minOf(maxOf(underneath, 1.0f), static_cast<float>(kMost));
        // Contrast under this is not worth a look-up.
        constexpr float kFaint = 0.02f;
        float const contrast = underneath > told ? std::sqrt(told / underneath) : 1.0f;
        float const resolved = (contrast - kFaint) / (1.0f - kFaint);
        if (!(resolved > 0.0f))
            return;
        bool const alone = !(underneath > 1.0f);
        float const width = std::sqrt(underneath);
        float present = 0.0f;
        for (int i = 0; static_cast<float>(i) < told; ++i) {
            Vec3f cell;
            if (alone) {
                cell = flakeAt(api, p);
            } else {
                // R2 sequence: Roberts 2018, "The Unreasonable Effectiveness of Quasirandom
                // Sequences".
                float const k = static_cast<float>(i);
                Vec3f const q = p + x * (width * (fract(0.5f + k * 0.7548777f) - 0.5f))
                    + y * (width * (fract(0.5f + k * 0.5698403f) - 0.5f));
                cell = {std::floor(q.x), std::floor(q.y), std::floor(q.z)};
            }
            // In the decimals of a smooth noise every value is as likely as any other. Two steps of
            // the golden ratio's kin keep the points of cells off the noise's lattice.
            constexpr Vec3f kStride(1.6180340f, 1.4142136f, 1.7320508f);
            Vec3f at = cell * kStride + grey(0.37f);
            float const share = minOf(1.0f, told - static_cast<float>(i)) / told;
            if (recipe.density < 1.0f) {
                Vec3f const other = at + grey(0.29f);
                if (!(fract(api->noise3DRecord(&other) * 64.0f) < recipe.density))
                    continue;
            }
            float const n = api->noise3DRecord(&at) * 64.0f;
            float const r = recipe.spread * std::sqrt(-std::log(1.0f - fract(n)));
            float const phi = kPi * fract(n * 64.0f); // half a turn: the pair has the other half
            flake_[count_++] = {{r * std::cos(phi), r * std::sin(phi)}, resolved * share};
            present += share;
        }
        coverage_ = resolved * present + (1.0f - resolved) * recipe.density;
        if (!(coverage_ > 0.0f))
            return;
        for (int i = 0; i < count_; ++i)
            flake_[i].share /= coverage_;
        crowdShare_ = (1.0f - resolved) * recipe.density / coverage_;
    }

    /// Share of the surface that flakes cover, 0..1.
    float coverage() const { return coverage_; }

    /// Area of the flakes that w sees, per area of surface: at least w.z, and never less than the
    /// true one, so that w.z over it is a masking that keeps the energy. The area of Gaussian
    /// slopes is held from above by that of a hyperbola with the same value at grazing incidence.
    float seenArea(Vec3f w) const
    {
        float sum = crowdShare_ > 0.0f ? crowdShare_ * seen(w.z, across(w, crowd2_)) : 0.0f;
        float const q = across(w, gloss2_);
        for (int i = 0; i < count_; ++i) {
            float const lean = w.x * flake_[i].slope.x + w.y * flake_[i].slope.y;
            sum += 0.5f * flake_[i].share * (seen(w.z + lean, q) + seen(w.z - lean, q));
        }
        return sum;
    }

    struct Density {
        float normals; ///< of facet normals at h, 1/sr
        float picked; ///< the same with each flake weighted by the area that v sees of it
    };
    /// h: unit; area: `seenArea(v)`.
    Density operator()(Vec3f h, Vec3f v, float area) const
    {
        Density sum{0.0f, 0.0f};
        auto const add = [&](Vec2f slope, float alpha2, float share) {
            float const d = share * kInvPi * facetsAbout(h, slope, alpha2);
            sum.normals += d;
            float const lean = v.x * slope.x + v.y * slope.y;
            sum.picked += d * seen(v.z + lean, across(v, alpha2)) / area;
        };
        if (crowdShare_ > 0.0f)
            add({0.0f, 0.0f}, crowd2_, crowdShare_);
        for (int i = 0; i < count_; ++i) {
            add(flake_[i].slope, gloss2_, 0.5f * flake_[i].share);
            add(flake_[i].slope * -1.0f, gloss2_, 0.5f * flake_[i].share);
        }
        return sum;
    }

    /// One flake, or the crowd.
    struct Pick {
        Vec2f slope;
        float width;
    };
    /// By the area that v sees of each. area: `seenArea(v)`; u: in [0, 1).
    Pick pick(Vec3f v, float area, float u) const
    {
        float left = u * area;
        float const q = across(v, gloss2_);
        for (int i = 0; i < count_; ++i) {
            Vec2f const s = flake_[i].slope;
            float const lean = v.x * s.x + v.y * s.y;
            float const one = 0.5f * flake_[i].share * seen(v.z + lean, q);
            if (left < one)
                return {s, std::sqrt(gloss2_)};
            left -= one;
            float const other = 0.5f * flake_[i].share * seen(v.z - lean, q);
            if (left < other || (i + 1 == count_ && !(crowdShare_ > 0.0f)))
                return {s * -1.0f, std::sqrt(gloss2_)};
            left -= other;
        }
        return {{0.0f, 0.0f}, std::sqrt(crowd2_)};
    }

    /// A facet normal of the picked lobe, by its density times its cosine; unit. u: in [0, 1).
    static Vec3f normal(Pick const& p, Vec2f u)
    {
        float const r = p.width * std::sqrt(-std::log(1.0f - u.y)), phi = 2.0f * kPi * u.x;
        return normalize({p.slope.x + r * std::cos(phi), p.slope.y + r * std::sin(phi), 1.0f});
    }

private:
    struct Flake {
        Vec2f slope; ///< of one of the pair
        float share; ///< of what flakes cover, for both
    };

    /// The cell whose flake covers p: of the jittered centres of cells the nearest.
    static Vec3f flakeAt(IShaderAPI* api, Vec3f p)
    {
        Vec3f const below(std::floor(p.x - 0.5f), std::floor(p.y - 0.5f), std::floor(p.z - 0.5f));
        Vec3f nearest = below;
        float best = 9.0f;
        for (int i = 0; i < 8; ++i) {
            Vec3f const cell = below
                + Vec3f(static_cast<float>(i & 1), static_cast<float>(i >> 1 & 1),
                        static_cast<float>(i >> 2));
            Vec3f const middle = cell + grey(0.5f);
            // Half of the jitter: then no flake further off can be the nearest.
            Vec3f const d = middle + (api->cellNoise3D(&middle) - grey(0.5f)) * 0.5f - p;
            float const distance2 = dot(d, d);
            if (distance2 < best) {
                best = distance2;
                nearest = cell;
            }
        }
        return nearest;
    }

    /// What spreads the slopes in the plane of w: 2/pi of their variance there, alpha^2 sin^2 / 2.
    static float across(Vec3f w, float alpha2)
    {
        constexpr float kOverInvPi = 0.3184f;
        return kOverInvPi * alpha2 * (w.x * w.x + w.y * w.y);
    }
    /// Area seen of a lobe whose mean shows the cosine c over its upright part.
    static float seen(float c, float q) { return 0.5f * (c + std::sqrt(c * c + q)); }

    Flake flake_[kMost]{};
    int count_ = 0;
    float coverage_, crowdShare_;
    float gloss2_, crowd2_;
};

} // namespace zsi
