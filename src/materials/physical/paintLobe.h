// SPDX-License-Identifier: Apache-2.0
/// Reflection of metallic paint: one set of lobes that lights, paths and traced rays share.
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

/// Rough diffuse reflection that keeps its energy: Portsmouth, Kutz and Hill 2025, "EON: A
/// Practical Energy-Preserving Rough Diffuse BRDF". Directions are local, with z above 0.
class RoughDiffuse {
public:
    /// color, rough: 0..1.
    RoughDiffuse(Vec3f color, float rough, Vec3f v)
        : color_(color)
        , rough_(rough < kLeastRough ? 0.0f : rough)
        , v_(v)
    {
        if (rough_ == 0.0f)
            return;
        scale_ = 1.0f / (1.0f + kLoss * rough);
        float const mean = scale_ * (1.0f + kMeanRise * rough);
        lostV_ = 1.0f - albedoOnce(v.z);
        auto const again = [&](float c) { return c * c * mean / (1.0f - c * (1.0f - mean)); };
        again_ = Vec3f(again(color.x), again(color.y), again(color.z));
        broad_ = again_ * (lostV_ / (1.0f - mean));
    }

    /// What the value times pi is at least.
    Vec3f least() const { return color_ * (scale_ * (1.0f - rough_)); }
    /// Share of the light along v that leaves.
    Vec3f albedo() const { return color_ * (1.0f - lostV_) + again_ * lostV_; }
    /// Scattering value times pi.
    Vec3f operator()(Vec3f l) const
    {
        if (rough_ == 0.0f)
            return color_;
        float const s = dot(v_, l) - v_.z * l.z;
        float const t = s > 0.0f ? maxOf(v_.z, l.z) : 1.0f;
        return color_ * (scale_ * (1.0f + rough_ * s / t)) + broad_ * (1.0f - albedoOnce(l.z));
    }

private:
    static constexpr float kLeastRough = 1e-3f; // below, nothing shows and quotients lose digits
    static constexpr float kLoss = 0.28779341f; // 1/2 - 2/(3 pi)
    static constexpr float kMeanRise = 0.072488213f; // 2/3 - 28/(15 pi)

    /// Of white after one bounce, by the paper's fit.
    float albedoOnce(float c) const
    {
        float const m = 1.0f - c;
        return scale_
            * (1.0f
               + rough_ * m
                   * (0.0571085289f
                      + m * (0.491881867f + m * (-0.332181442f + m * 0.0714429953f))));
    }

    Vec3f color_;
    float rough_;
    Vec3f v_;
    float scale_ = 1.0f, lostV_ = 0.0f;
    Vec3f again_{0.0f, 0.0f, 0.0f}; ///< colour of what leaves after more bounces
    Vec3f broad_{0.0f, 0.0f, 0.0f};
};

/// Which layers a value or a sample is of.
struct PaintLayers {
    bool coat, base, flakes;
};

/// Metallic paint seen from one direction: a rough diffuse base, flakes that cover a part of it,
/// and a clear coat over both with a normal of its own. Values are 1/sr.
class PaintLobe {
public:
    /// v: unit, world space, above the frames. Ng: faced geometric normal. folds: whether the coat
    /// can mirror light below Ng; what it does comes up again, mirrored.
    PaintLobe(PaintColors const& colors, FlakeFootprint const& flakes, PaintFrames const& frames,
              float coatReflectance, float coatWidth, Vec3f v, Vec3f Ng, bool folds)
        : colors_(colors)
        , frames_(frames)
        , v_(toLocal(frames.base, v))
        , Ng_(Ng)
        , folds_(folds)
        , coat_(coatReflectance, coatWidth, toLocal(frames.coat, v))
        // A relief throws light to the horizon, where alone a coat that mirrors lets it pass.
        , base_(colors.base, colors.baseRough * (1.0f - coatReflectance * coatReflectance), v_)
        , flakes_(flakes, v_, coat_.fall())
        , bare_(1.0f - flakes.coverage())
    {
    }

    struct Value {
        Vec3f under; ///< base and flakes
        float coat;
        float pdf; ///< of `direction`, 1/sr
    };
    /// Scattering value without the cosine on the base frame. l: above that frame and above Ng.
    Value operator()(Vec3f direction, PaintLayers layers) const
    {
        Vec3f const l = toLocal(frames_.base, direction);
        Vec3f const lc = toLocal(frames_.coat, direction);
        Chances const chance = chances(layers);
        Value sum{kBlack, 0.0f, 0.0f};
        if (layers.coat) {
            ClearCoat::Value coat = coat_(lc);
            if (folds_) {
                ClearCoat::Value const below = coat_(toLocal(frames_.coat, folded(direction)));
                coat = {coat.value + below.value, coat.pdf + below.pdf};
            }
            sum.coat = coat.value / l.z; // the cosine that goes with the value is the base's
            sum.pdf = chance.coat * coat.pdf;
        }
        if (!layers.base && !(layers.flakes && flakes_.coverage() > 0.0f))
            return sum;
        float const passedL = coat_.passed(lc.z);
        if (layers.base && bare_ > 0.0f) {
            sum.under = base_(l) * (baseScale() * passedL * kInvPi);
            sum.pdf += chance.base * l.z * kInvPi;
        }
        if (layers.flakes && flakes_.coverage() > 0.0f) {
            FlakeLobe::Value const value = flakes_(l);
            if (value.once > 0.0f)
                sum.under += throughCoat(colors_.flakeAt(value.cosine), passedL) * value.once;
            if (value.further > 0.0f)
                sum.under += furtherThroughCoat(passedL) * value.further;
            if (value.thrown > 0.0f)
                sum.under += thrownColor() * value.thrown;
            sum.pdf += chance.flakes * value.pdf;
        }
        return sum;
    }

    /// A direction, world space; it may point below the surface. pick: in [0, 1), of the lobe.
    Vec3f direction(float pick, Vec2f u, PaintLayers layers) const
    {
        Chances const chance = chances(layers);
        if (pick < chance.coat) {
            Vec3f const local = coat_.direction(u);
            if (!(local.z > 0.0f)) // lost to the coat's facets, even where a peel leans it up
                return -Ng_;
            Vec3f const d = toWorld(frames_.coat, local);
            return folds_ && dot(d, Ng_) < 0.0f ? folded(d) : d;
        }
        pick -= chance.coat;
        if (pick < chance.base || !(chance.flakes > 0.0f))
            return toWorld(frames_.base, FlakeLobe::cosineDirection(u));
        // Below 1 whatever the rounding.
        pick = minOf((pick - chance.base) / chance.flakes, 1.0f - 0x1p-24f);
        return toWorld(frames_.base, flakes_.direction(pick, u));
    }

    /// Whether light from a direction falls on the surface: above Ng and the base frame.
    bool lights(Vec3f direction, float& cosine) const
    {
        constexpr float kLeastCosine = 1e-6f;
        cosine = dot(frames_.base[2], direction);
        return cosine > kLeastCosine && dot(Ng_, direction) > 0.0f;
    }

    PaintFrames const& frames() const { return frames_; }
    float coatAlbedo() const { return coat_.albedo(); }
    /// Shares of the light along v that base and flakes send back.
    Vec3f baseAlbedo() const { return base_.albedo() * (coat_.passedV() * bare_); }
    /// The part of the base that sends on light alike from everywhere, for light that is gathered
    /// around the normal. A coat passes less than this share of its mean only within seven degrees
    /// of the horizon, from where hardly any light falls on the base.
    Vec3f evenAlbedo() const
    {
        return base_.least() * (kEvenShare * coat_.meanPassed() * baseScale());
    }
    /// A direction for the rest of the base, world space, and the weight of what is seen there.
    Vec3f restDirection(Vec2f u, Vec3f& weight) const
    {
        Vec3f const l = FlakeLobe::cosineDirection(u);
        Vec3f const way = toWorld(frames_.base, l);
        float const passedL = coat_.passed(toLocal(frames_.coat, way).z);
        Vec3f const rest = base_(l) * (baseScale() * passedL) - evenAlbedo();
        weight = {maxOf(rest.x, 0.0f), maxOf(rest.y, 0.0f), maxOf(rest.z, 0.0f)};
        return way;
    }
    Vec3f flakeAlbedo() const
    {
        return colors_.flakeAt(v_.z) * (coat_.passedV() * flakes_.coverage());
    }

private:
    struct Chances {
        float coat, base, flakes;
    };
    Chances chances(PaintLayers layers) const
    {
        float const coat = layers.coat ? coat_.albedo() : 0.0f;
        float const base =
            layers.base ? maxComponent(colors_.base) * coat_.passedV() * bare_ : 0.0f;
        float const brightest =
            maxOf(maxComponent(colors_.flake), colors_.pearl.w * maxComponent(rgb(colors_.pearl)));
        float const flakes =
            layers.flakes ? coat_.passedV() * flakes_.coverage() * brightest : 0.0f;
        float const sum = coat + base + flakes;
        if (!(sum > 1e-12f))
            return {1.0f, 0.0f, 0.0f};
        return {coat / sum, base / sum, flakes / sum};
    }

    /// Of what passes the coat along v and is sent on by the base: what the coat throws back from
    /// below reaches the base again.
    float baseScale() const
    {
        return bare_ * coat_.passedV() / maxOf(coat_.meanPassed() * kHeadroom, 1e-6f);
    }
    Vec3f folded(Vec3f d) const { return d - Ng_ * (2.0f * dot(d, Ng_)); }

    /// A colour of flakes times what passes the coat both ways, with what the coat throws back to
    /// them: passed v x passed l / (1 - color x thrown back), the last taken for the direction that
    /// passes more, so that no more comes out than went in.
    Vec3f throughCoat(Vec3f color, float passedL) const
    {
        float const both = coat_.passedV() * passedL;
        float const back = 1.0f - maxOf(coat_.passedV(), passedL);
        auto const channel = [&](float c) {
            return both > 0.0f ? c * both / (1.0f - c * back) : 0.0f;
        };
        return {channel(color.x), channel(color.y), channel(color.z)};
    }
    /// Colour of light that left the flakes after more than one bounce, times what passes the coat
    /// both ways: over the mean for light that leaves so, as `baseScale` for the base.
    Vec3f furtherThroughCoat(float passedL) const
    {
        grooves::LevelShares const& crowd = flakes_.crowd();
        float const lost = crowd.meanLoss();
        float const mean = coat_.meanPassed() - coat_.fall() * (crowd.meanSchlick() - kMeanSchlick);
        float const both = coat_.passedV() * passedL;
        auto const channel = [&](float c) {
            float const f = c * c * (1.0f - lost) / (1.0f - c * lost);
            return both > 0.0f ? f * both / maxOf(1.0f - f * (1.0f - mean), mean) : 0.0f;
        };
        Vec3f const c = meanFlake();
        return {channel(c.x), channel(c.y), channel(c.z)};
    }
    /// Of light that the coat threw back to the flakes.
    Vec3f thrownColor() const
    {
        float const passed = coat_.meanPassed();
        auto const channel = [&](float c) {
            return c > 0.0f ? c * c * passed / (1.0f - c * (1.0f - passed)) : 0.0f;
        };
        Vec3f const c = meanFlake();
        return {channel(c.x), channel(c.y), channel(c.z)};
    }
    Vec3f meanFlake() const
    {
        return colors_.flakeAt(0.70710678f); // mean of its square over the hemisphere: 1/2
    }

    PaintColors colors_;
    PaintFrames frames_;
    Vec3f v_, Ng_;
    bool folds_;
    ClearCoat coat_;
    RoughDiffuse base_;
    FlakeLobe flakes_;
    float bare_;
    /// Of what passes the coat on the way out: a relief throws a little more than the mean through.
    static constexpr float kHeadroom = 1.002f;
    static constexpr float kEvenShare = 0.5f;
    static constexpr float kMeanSchlick =
        1.0f / 21.0f; ///< mean of Schlick's weight over the cosine
};

} // namespace zsi
