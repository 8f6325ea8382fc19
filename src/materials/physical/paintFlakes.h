// SPDX-License-Identifier: Apache-2.0
/// Flakes of a metallic paint: those under one footprint, and the lobe that a crowd of them makes.
///
/// A flake is a facet of slope s (the tangent-plane part of its normal over the upright part) with
/// a gloss of its own; both are Gaussian, so that many flakes together are one lobe whose squared
/// width is the sum of theirs (Olano and Baker 2010, "LEAN Mapping"). A footprint of n flakes is
/// their mean, as in Jakob et al. 2014, "Discrete Stochastic Microfacet Models"; the contrast that
/// n flakes have left is what is resolved here, and the rest is the crowd.
///
/// Flakes come in opposite pairs, the walls of V-shaped grooves (Torrance and Sparrow 1967, "Theory
/// for Off-Specular Reflection From Roughened Surfaces"): each groove keeps its own balance of
/// light, so each footprint does, and the value is linear in the distribution of slopes, so the
/// crowd is the mean of its flakes in every direction.
/// Local directions: unit, z along the normal.
#pragma once

#include "materials/physical/paintTables.h"
#include "materials/physical/shared/facetLoss.h"
#include "materials/physical/shared/fresnel.h"
#include "materials/physical/shared/tiltedFacets.h"
#include "runtime/arithmetic.h"

#include <iterator>
#include <zsi/zsi.h>

namespace zsi {

/// How a layer of flakes is made.
struct FlakeRecipe {
    float size; ///< width of a flake, world units
    float density; ///< share of the surface that they cover, 0..1
    float spread; ///< width of their slopes, 0..1
    float gloss; ///< width of the lobe of one flake, 0.01..1
};

/// Light that grooves lose after one bounce, and send out after more.
namespace grooves {

/// The mean of max(0, x) for x about d, Gaussian but for its tails: a quartic with the Gaussian's
/// value at d = 0, where `reach` is 1.504 times the Gaussian's width (1 / e).
inline float softRamp(float d, float reach)
{
    if (d >= reach)
        return d;
    if (d <= -reach)
        return 0.0f;
    float const t = d / reach, rise = 1.0f + t;
    return reach * (rise * rise * rise * (3.0f - t)) * (1.0f / 16.0f);
}

/// Of the light along w, for facets of the slopes +-s and Gaussian width a, narrow against 1.
///
/// A wall of slope s shows the area p = min(1, u/2), with u = 1 + w.s / w.z, and mirrors w to the
/// height B = 2 u / (1 + s.s) - 1, both over w.z; it sends out min(p, B). The width makes each
/// difference a blurred one, by its gradient over the slope.
inline float lossOfNarrow(Vec3f w, Vec2f s, float a)
{
    float const invZ = 1.0f / w.z;
    float const lean = (w.x * s.x + w.y * s.y) * invZ;
    float const tan2 = (w.x * w.x + w.y * w.y) * (invZ * invZ), steep2 = s.x * s.x + s.y * s.y;
    float const k = 2.0f / (1.0f + steep2 + a * a);
    float const reach = maxOf(1.504f * a, 1e-6f), tangent = std::sqrt(tan2);
    float lost = 0.0f;
    for (float const side : {lean, -lean}) {
        float const half = 0.5f * (1.0f + side), y = 2.0f * k * half, high = y - 1.0f;
        // Gradients: of u the tangent t of w; of B k (t - y s); of B - u/2 that less t/2.
        float const bend = k * k * y * y * steep2;
        auto const reachOf = [&](float along) {
            float const g2 = along * along * tan2 - 2.0f * along * k * y * side + bend;
            return reach * std::sqrt(maxOf(g2, 0.0f)) + 1e-6f;
        };
        float const reachB = reachOf(k), reachHalf = reach * 0.5f * tangent + 1e-6f;
        lost += softRamp(half, reachHalf) - softRamp(high, reachB);
        if (k >= 1.0f) // the wall is shown whole before its light is
            lost += softRamp(high - half, reachOf(k - 0.5f));
        else
            lost += softRamp(high - 1.0f, reachB) - softRamp(half - 1.0f, reachHalf);
    }
    return lost;
}

/// The same for widths up to a half: wide lobes are four narrower ones about the same mean.
inline float loss(Vec3f w, Vec2f s, float a)
{
    constexpr float kNarrow = 0.12f;
    float const sine = std::sqrt(w.x * w.x + w.y * w.y);
    float sum;
    if (a <= kNarrow) {
        sum = lossOfNarrow(w, s, a);
    } else {
        Vec2f const along =
            sine > 0.0f ? Vec2f(w.x, w.y) * (0.8f * a / sine) : Vec2f(0.8f * a, 0.0f);
        Vec2f const across(-along.y, along.x);
        float const part = 0.6f * a; // 0.8^2 + 0.6^2 = 1
        sum = 0.25f
            * (lossOfNarrow(w, s + along, part) + lossOfNarrow(w, s - along, part)
               + lossOfNarrow(w, s + across, part) + lossOfNarrow(w, s - across, part));
    }
    // Towards the horizon few slopes along w lose anything: their density, 1 / (sqrt(pi) a) at
    // most, times the integral over lean of what they lose, which grows with the slope.
    float const few = (0.1f + 0.7f * (s.x * s.x + s.y * s.y + 0.5f * a * a)) * w.z;
    return saturate(minOf(sum, few / maxOf(a * sine, 1e-30f)));
}

/// What grooves of the slopes +-s and Gaussian width a, below a half, send out lower than it came,
/// times what Schlick's weight is more there. In the plane of w the width is quartiles of slopes.
inline float lowered(Vec3f w, Vec2f s, float a)
{
    float const tangent = std::sqrt(w.x * w.x + w.y * w.y) / w.z;
    float const along = tangent > 0.0f ? (w.x * s.x + w.y * s.y) / (w.z * tangent) : s.x;
    float const across2 = s.x * s.x + s.y * s.y - along * along + 0.5f * a * a;
    float const here = schlickWeight(w.z);
    float sum = 0.0f;
    for (float const quartile : {-0.81338f, -0.22531f, 0.22531f, 0.81338f}) { // of width 1
        float const slope = along + quartile * a;
        for (float const side : {1.0f + slope * tangent, 1.0f - slope * tangent}) {
            float const high = 2.0f * side / (1.0f + slope * slope + across2) - 1.0f;
            if (high > 0.0f && high < 1.0f)
                sum += minOf(0.5f * side, high) * (schlickWeight(high * w.z) - here);
        }
    }
    return 0.25f * sum;
}

/// Of Gaussian slopes about the level, any width up to 1.5.
class LevelShares {
public:
    explicit LevelShares(float width)
        : width_(width)
        , node_(std::sqrt(width * (1.0f / 1.5f)) * (kSpreads - 1))
    {
    }
    float loss(float c) const { return at(kFlakeLoss, c); }
    float meanLoss() const
    {
        float const w2 = width_ * width_;
        return mean(0) * w2 / (1.0f + std::sqrt(1.0f + w2));
    }
    float lowered(float c) const { return at(kFlakeLowered, c); }
    float meanLowered() const { return mean(1) * width_; }
    /// Mean of Schlick's weight, weighted with the loss and the cosine.
    float meanSchlick() const { return mean(2); }

private:
    static constexpr int kSpreads = std::size(kFlakeLoss), kCosines = std::size(kFlakeLoss[0]);
    static float lerp(float a, float b, float t) { return a + t * (b - a); }

    float at(float const (&table)[kSpreads][kCosines], float c) const
    {
        TablePosition<kCosines> const at(c * (1.0f + width_) / (c + width_) * (kCosines - 1));
        float const* const below = table[node_.node] + at.node;
        float const* const above = below + kCosines;
        return lerp(lerp(below[0], below[1], at.fraction), lerp(above[0], above[1], at.fraction),
                    node_.fraction);
    }
    float mean(int which) const
    {
        return lerp(kFlakeMeans[node_.node][which], kFlakeMeans[node_.node + 1][which],
                    node_.fraction);
    }

    float width_;
    TablePosition<kSpreads> node_;
};

} // namespace grooves

/// Where a footprint lies.
struct FlakePlace {
    Vec3f p; ///< position that sticks to the surface, in flakes
    float pixelX, pixelY; ///< of the picture, whole numbers
    float width; ///< of the pixel there, in flakes
    float underneath; ///< flakes under the pixel, above 0
};

/// The flakes that one ray meets.
class FlakeFootprint {
public:
    /// More flakes than these look no different from the crowd.
    static constexpr int kMost = 8;

    /// The crowd alone.
    explicit FlakeFootprint(FlakeRecipe const& recipe)
        : coverage_(recipe.density)
        , crowd_(recipe.density)
        , gloss_(recipe.gloss)
        , crowd2_(recipe.gloss * recipe.gloss + recipe.spread * recipe.spread)
    {
    }

    FlakeFootprint(FlakeRecipe const& recipe, IShaderAPI* api, FlakePlace const& place)
        : FlakeFootprint(recipe)
    {
        bool const alone = !(place.underneath > 1.0f);
        // A pixel that cuts flakes shows parts of more of them: the variance of the mean of cells
        // over a square n cells large is (1 - 1 / (3 sqrt n))^2 / n of theirs.
        float const cut = 1.0f - 0.33333333f / std::sqrt(place.underneath);
        float const seen = alone ? 1.0f : place.underneath / (cut * cut);
        float const resolved = minOf(seen, static_cast<float>(kMost));
        // Contrast under this is not worth a look-up, and flakes as dull as this are no sparkles.
        constexpr float kFaint = 0.02f, kDull = 0.35f, kDulling = 0.15f;
        float const contrast = (std::sqrt(resolved / seen) - kFaint) / (1.0f - kFaint)
            * saturate((kDull - recipe.gloss) / kDulling);
        if (!(contrast > 0.0f))
            return;
        Vec3f const first = alone ? flakeAt(api, place.p) : pixelSeed(place);
        coverage_ = crowd_ = (1.0f - contrast) * recipe.density;
        for (int i = 0; static_cast<float>(i) < resolved; ++i) {
            // In the decimals of a smooth noise every value is as likely as any other. Two steps of
            // the golden ratio's kin keep the points of cells off the noise's lattice.
            constexpr Vec3f kStride(1.6180340f, 1.4142136f, 1.7320508f);
            Vec3f at = first * kStride + grey(0.37f);
            at.z += 5.1961524f * static_cast<float>(i);
            if (recipe.density < 1.0f) {
                Vec3f const other = at + grey(0.29f);
                if (!(fract(api->noise3DRecord(&other) * 64.0f) < recipe.density))
                    continue;
            }
            // The last digits give the lean, which has a tail to fill, those before them the
            // azimuth, turned further with the lean so that flakes of one azimuth are not in a row.
            float const n = api->noise3DRecord(&at) * 64.0f;
            float const lean = fract(n * 128.0f);
            float const r = recipe.spread * std::sqrt(-std::log(1.0f - lean));
            float const phi = kPi * fract(n + 61.8f * lean); // half a turn: the pair has the other
            float const share =
                contrast * (minOf(1.0f, resolved - static_cast<float>(i)) / resolved);
            flake_[count_++] = {{r * std::cos(phi), r * std::sin(phi)}, share};
            coverage_ += share;
        }
    }

    /// Share of the surface that flakes cover, 0..1.
    float coverage() const { return coverage_; }

    /// Density of facet normals at h, 1/sr, over the whole surface: its integral with the cosine is
    /// the coverage.
    float density(Vec3f h) const
    {
        float sum = crowd_ > 0.0f ? crowd_ * facetsAbout(h, {0.0f, 0.0f}, crowd2_) : 0.0f;
        float const gloss2 = gloss_ * gloss_;
        for (int i = 0; i < count_; ++i) {
            Flake const& f = flake_[i];
            sum += 0.5f * f.share
                * (facetsAbout(h, f.slope, gloss2) + facetsAbout(h, f.slope * -1.0f, gloss2));
        }
        return sum * kInvPi;
    }

    /// A facet normal that v sees, unit: the slope by its density, then of the two walls of its
    /// groove one by the area that v sees of it (Heitz and d'Eon 2014, "Importance Sampling
    /// Microfacet-Based BSDFs using the Distribution of Visible Normals"). pick, u: in [0, 1).
    Vec3f visibleNormal(Vec3f v, float pick, Vec2f u) const
    {
        float left = pick * coverage_, share = crowd_, width = std::sqrt(crowd2_);
        Vec2f slope(0.0f, 0.0f);
        for (int i = 0; i < count_ && !(left < share); ++i) {
            left -= share;
            share = flake_[i].share;
            slope = flake_[i].slope;
            width = gloss_;
        }
        float const r = width * std::sqrt(-std::log(1.0f - u.y)), phi = 2.0f * kPi * u.x;
        Vec2f const s(slope.x + r * std::cos(phi), slope.y + r * std::sin(phi));
        float const lean = v.x * s.x + v.y * s.y;
        bool const first = left * (2.0f * v.z) < share * (v.z + lean);
        return normalize(first ? Vec3f(s.x, s.y, 1.0f) : Vec3f(-s.x, -s.y, 1.0f));
    }

    /// Of the light along w, what the flakes lose after one bounce, and what they send out lower,
    /// times what Schlick's weight is more there. crowd: as `crowd()` gives it.
    ///
    /// A single flake's share is the crowd's, plus what its own exceeds that by as far as the mean
    /// of its formula over all flakes is the crowd's: not where next to nothing is lost, and the
    /// less so the wider its own lobe is against that of the crowd.
    struct Shares {
        float lost, lowered;
    };
    Shares shares(Vec3f w, grooves::LevelShares const& crowd) const
    {
        Shares const mean{crowd.loss(w.z), crowd.lowered(w.z)};
        Shares sum{coverage_ * mean.lost, coverage_ * mean.lowered};
        float const wide = gloss_ / std::sqrt(crowd2_), least = 0.003f + 0.02f * wide;
        auto const told = [&](float share) {
            float const t = saturate(0.5f * share / least - 0.5f);
            return t * t * (3.0f - 2.0f * t) * (1.0f - wide * wide);
        };
        float const lost = told(mean.lost), lowered = told(1.5f * mean.lowered);
        for (int i = 0; i < count_; ++i) {
            Flake const& f = flake_[i];
            if (lost > 0.0f)
                sum.lost += f.share * lost * (grooves::loss(w, f.slope, gloss_) - mean.lost);
            if (lowered > 0.0f)
                sum.lowered +=
                    f.share * lowered * (grooves::lowered(w, f.slope, gloss_) - mean.lowered);
        }
        return sum;
    }
    grooves::LevelShares crowd() const { return grooves::LevelShares(std::sqrt(crowd2_)); }

private:
    struct Flake {
        Vec2f slope; ///< of one of the pair
        float share; ///< of the surface, for both
    };

    /// Keeps coordinates of the noise small enough for their decimals.
    static float wrapped(float cell, float period)
    {
        return cell - period * std::floor(cell / period);
    }

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
        constexpr float kPeriod = 4096.0f;
        return {wrapped(nearest.x, kPeriod), wrapped(nearest.y, kPeriod),
                wrapped(nearest.z, kPeriod)};
    }

    /// Stands for the cells under a pixel: the same for all samples of the pixel on a part of the
    /// surface many pixels wide.
    static Vec3f pixelSeed(FlakePlace const& place)
    {
        int octave;
        std::frexp(place.width, &octave);
        float const part = std::ldexp(32.0f, octave);
        constexpr float kPeriod = 64.0f;
        auto const seed = [&](float p, float stride) {
            return stride * wrapped(std::floor(p / part), kPeriod);
        };
        return {place.pixelX + seed(place.p.x, 131.0f), place.pixelY + seed(place.p.y, 137.0f),
                seed(place.p.z, 139.0f)};
    }

    Flake flake_[kMost]{};
    int count_ = 0;
    float coverage_, crowd_; ///< of the surface; the second by what is not resolved
    float gloss_, crowd2_;
};

/// Flakes seen along v under a coat: mirrored once; what grooves send out after further bounces,
/// loss(v) loss(l) / (pi mean), a broad lobe as by Kulla and Conty 2017, "Revisiting Physically
/// Based Shading at Imageworks"; and what the coat throws back of light that is mirrored lower than
/// it came, a lobe of the same form. Further bounces are on any flakes, so that the share along v
/// alone is that of the flakes seen, and share along l and mean are the crowd's: so everything is
/// linear in the distribution of slopes. By it single flakes are not reciprocal; the crowd is.
class FlakeLobe {
public:
    /// thrown: what the coat throws back of light from the horizon, 0..1.
    FlakeLobe(FlakeFootprint const& flakes, Vec3f v, float thrown)
        : flakes_(flakes)
        , v_(v)
        , crowd_(flakes.crowd())
    {
        if (!(flakes.coverage() > 0.0f))
            return;
        FlakeFootprint::Shares const shares = flakes.shares(v, crowd_);
        furtherV_ = shares.lost * kInvPi / crowd_.meanLoss();
        float const thrownV = thrown * shares.lowered;
        thrownV_ = thrownV * kInvPi / crowd_.meanLowered();
        // Less than the share may be: facets are to be drawn wherever they still send light.
        constexpr float kMostBroad = 0.75f;
        broadChance_ = minOf((shares.lost + thrownV) / flakes.coverage(), kMostBroad);
    }

    float coverage() const { return flakes_.coverage(); }
    /// Of a layer of such flakes.
    grooves::LevelShares const& crowd() const { return crowd_; }

    /// Scattering values without the cosine, 1/sr.
    struct Value {
        float once, further, thrown;
        float cosine; ///< on the facet that mirrors
        float pdf; ///< of `direction`, 1/sr
    };
    /// l: z above 0.
    Value operator()(Vec3f l) const
    {
        Vec3f const h = v_ + l;
        float const m2 = 0.25f * dot(h, h); // squared cosine on the facet
        float const cosine = minOf(std::sqrt(m2), 1.0f);
        float const density = 0.25f * flakes_.density(h * (0.5f / std::sqrt(m2)));
        // Masking of grooves: min(1, k cos v, k cos l), k = 2 h.z / v.h.
        float const k = h.z / m2;
        float const higher = maxOf(v_.z, l.z), lower = minOf(v_.z, l.z);
        Value value{};
        value.cosine = cosine;
        value.once = density * minOf(1.0f, k * lower) / (higher * lower);
        if (furtherV_ > 0.0f)
            value.further = crowd_.loss(l.z) * furtherV_;
        if (thrownV_ > 0.0f)
            value.thrown = crowd_.lowered(l.z) * thrownV_;
        value.pdf =
            (1.0f - broadChance_) * density * minOf(1.0f, k * v_.z) / (v_.z * flakes_.coverage())
            + broadChance_ * l.z * kInvPi;
        return value;
    }

    /// A direction by the facets that v sees, or by the cosine about as often as light bounces
    /// further; it may point below the surface. pick: in [0, 1).
    Vec3f direction(float pick, Vec2f u) const
    {
        if (pick < broadChance_)
            return cosineDirection(u);
        Vec3f const h = flakes_.visibleNormal(v_, (pick - broadChance_) / (1.0f - broadChance_), u);
        return h * (2.0f * dot(v_, h)) - v_;
    }

    static Vec3f cosineDirection(Vec2f u)
    {
        float const r = std::sqrt(u.y), phi = 2.0f * kPi * u.x;
        return {r * std::cos(phi), r * std::sin(phi), std::sqrt(1.0f - u.y)};
    }

private:
    FlakeFootprint flakes_;
    Vec3f v_;
    grooves::LevelShares crowd_;
    float furtherV_ = 0.0f, thrownV_ = 0.0f; ///< shares along v over pi and their mean
    float broadChance_ = 0.0f; ///< of a direction by the cosine
};

} // namespace zsi
