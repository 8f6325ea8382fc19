// SPDX-License-Identifier: Apache-2.0
/// The Ward lobe in local coordinates (x tangent, y bitangent, z normal): value, direction,
/// density. `v` is the incident direction and points towards the surface, v.z < 0; `l` and `w`
/// point away from it.
#pragma once

#include <zsi/vecmath.h>

namespace zsi {

inline constexpr float kWardInvPi = 0.3183099f;
inline constexpr float kWard4Pi = 12.566372f;
inline constexpr float kWard2Pi = 6.283185f;
inline constexpr float kWardQuarterPi = 0.78539824f;

/// Anisotropic Gaussian lobe of the half vector's slopes.
/// Ward 1992, "Measuring and Modeling Anisotropic Reflection", eq. 5a; its half vector is left
/// unnormalised, which the division by h.z^2 makes up for (Walter 2005, "Notes on the Ward BRDF").
struct WardLobe {
    float ax, ay; ///< slope deviations along tangent and bitangent; 0 leaves no lobe

    float norm() const { return kWard4Pi * ax * ay; }

    /// exp(-(h.x^2/ax^2 + h.y^2/ay^2) / h.z^2); h of any length.
    float gauss(Vec3f h) const
    {
        float const x = h.x / ax;
        float const y = h.y / ay;
        return std::exp(-(x * x + y * y) / (h.z * h.z));
    }

    /// Value for light from `l`, 1/sr, for v.z < 0 and l.z > 0; n: the norm.
    float value(Vec3f v, Vec3f l, float n) const
    {
        float const s = spread(v, l, n);
        return s > kLeastSpread ? gauss(l - v) / s : 0.0f;
    }
    float value(Vec3f v, Vec3f l) const { return value(v, l, norm()); }

    /// What the Gaussian is divided by. From the least on there is a lobe: below, its width is 0
    /// or a direction lies in the surface.
    static float spread(Vec3f v, Vec3f l, float n) { return std::sqrt(-v.z * l.z) * n; }
    static constexpr float kLeastSpread = 1e-30f; // finite times any colour
};

/// A direction drawn from the lobe.
struct WardGlossySample {
    Vec3f direction; ///< local; at or below the surface where z <= 0, which has no value
    float value; ///< lobe value, 1/sr
    float density; ///< 1/sr; negative where the direction has no value
};

/// Ward 1992, eq. 6 and 7, with the azimuth by its sines and cosines. u: two uniform numbers.
inline WardGlossySample sampleWardLobe(WardLobe lobe, Vec3f v, Vec2f u)
{
    float const phi = kWard2Pi * u.x;
    float const sinPhi = std::sin(phi);
    float const cosPhi = std::cos(phi);
    float const q = (lobe.ay * sinPhi) / (lobe.ax * cosPhi);
    float const c2 = minOf(1.0f, 1.0f / (q * q + 1.0f));
    float const s2 = 1.0f - c2;
    // The exponential of the drawn half vector is 1 - u.y: nothing evaluates it.
    float const e = 1.0f - u.y;
    float const slope = c2 / (lobe.ax * lobe.ax) + s2 / (lobe.ay * lobe.ay);
    float const ct2 = minOf(1.0f, 1.0f / (-std::log(e) / slope + 1.0f));
    float const cosH = std::sqrt(ct2);
    float const sinH = std::sqrt(1.0f - ct2);
    Vec3f const h(std::copysign(std::sqrt(c2), cosPhi) * sinH,
                  std::copysign(std::sqrt(s2), sinPhi) * sinH, cosH);
    float const vh = dot(v, h);
    WardGlossySample s{v - h * (2.0f * vh), 0.0f, -1.0f};
    if (s.direction.z > 0.0f) {
        float const n = lobe.norm();
        float const spread = lobe.spread(v, s.direction, n);
        s.density = e / (cosH * ct2 * -vh * n);
        s.value = spread > WardLobe::kLeastSpread ? e / spread : 0.0f;
    }
    return s;
}

/// Density, 1/sr, with which `sampleWardLobe` is taken to draw `w`, and the lobe's value there.
inline WardGlossySample evaluateWardLobe(WardLobe lobe, Vec3f v, Vec3f w)
{
    WardGlossySample s{w, 0.0f, 0.0f};
    float const n = lobe.norm();
    float const spread = lobe.spread(v, w, n);
    if (!(spread > WardLobe::kLeastSpread))
        return s;
    Vec3f const h = normalize(w - v);
    float const e = lobe.gauss(h);
    s.value = e / spread;
    s.density = e / (-dot(v, h) * h.z * n * h.z * h.z);
    return s;
}

/// Cosine-weighted direction by the concentric map.
/// Shirley, Chiu 1997, "A Low Distortion Map Between Disk and Square".
inline Vec3f sampleCosineHemisphere(Vec2f u)
{
    float const a = 2.0f * u.x - 1.0f;
    float const b = 2.0f * u.y - 1.0f;
    float r;
    float phi;
    if (a > -b) {
        r = a > b ? a : b;
        phi = kWardQuarterPi * (a > b ? b / a : 2.0f - a / b);
    } else if (a < b) {
        r = -a;
        phi = kWardQuarterPi * (4.0f + b / a);
    } else {
        r = -b;
        phi = b == 0.0f ? 0.0f : kWardQuarterPi * (6.0f - a / b);
    }
    r -= 1e-6f; // off the rim, where the direction would lie in the surface
    return {r * std::cos(phi), r * std::sin(phi), std::sqrt(1.0f - r * r)};
}

} // namespace zsi
