// SPDX-License-Identifier: Apache-2.0
/// Random directions around an axis.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {

/// Two unit vectors that make a right-handed frame with unit `n`.
/// Duff et al. 2017, "Building an Orthonormal Basis, Revisited".
inline void basisAround(Vec3f n, Vec3f& t, Vec3f& b)
{
    float const s = std::copysign(1.0f, n.z);
    float const a = -1.0f / (s + n.z);
    float const c = n.x * n.y * a;
    t = {1.0f + s * n.x * n.x * a, s * c, -s * n.x};
    b = {c, s + n.y * n.y * a, -n.y};
}

/// The direction at `cosine` from `axis` and `u` of a turn around it.
inline Vec3f around(Vec3f axis, float cosine, float u)
{
    Vec3f t, b;
    basisAround(axis, t, b);
    float const sine = std::sqrt(maxOf(0.0f, 1.0f - cosine * cosine));
    float const phi = 6.28318531f * u;
    return normalize(t * (sine * std::cos(phi)) + b * (sine * std::sin(phi)) + axis * cosine);
}

/// Density cosine / pi around `n`.
inline Vec3f cosineDirection(Vec3f n, Vec2f u) { return around(n, std::sqrt(1.0f - u.x), u.y); }

/// The angle of (x, y) as of std::atan2, to 3e-7, at half its cost: Abramowitz and Stegun 4.4.49.
inline float angleOf(float y, float x)
{
    float const across = std::fabs(x), up = std::fabs(y);
    float const larger = maxOf(across, up);
    float const t = larger > 0.0f ? minOf(across, up) / larger : 0.0f, t2 = t * t;
    float const series = 1.0f
        + t2
            * (-0.3333314528f
               + t2
                   * (0.1999355085f
                      + t2
                          * (-0.1420889944f
                             + t2
                                 * (0.1065626393f
                                    + t2
                                        * (-0.0752896400f
                                           + t2
                                               * (0.0429096138f
                                                  + t2
                                                      * (-0.0161657367f + t2 * 0.0028662257f)))))));
    float angle = t * series;
    angle = up > across ? 1.57079633f - angle : angle;
    angle = x < 0.0f ? 3.14159265f - angle : angle;
    return std::copysign(angle, y);
}

/// Around `axis`, as far off it as a facet of a GGX surface of width `alpha` (Walter et al. 2007,
/// eq. 35) turns a ray: `turn` times the facet's tilt, 2 for a reflection.
inline Vec3f lobeDirection(Vec3f axis, float alpha, float turn, Vec2f u)
{
    float const t2 =
        alpha * alpha * u.x / (1.0f - u.x); // of the facet's tilt, the square of its tangent
    float const cosine =
        turn == 2.0f ? (1.0f - t2) / (1.0f + t2) : std::cos(turn * std::atan(std::sqrt(t2)));
    return around(axis, cosine, u.y);
}

/// Density of `lobeDirection` at `cosine` from its axis, 1/sr.
inline float lobeDensity(float cosine, float alpha, float turn)
{
    float const a2 = alpha * alpha;
    if (turn == 2.0f) { // below, without the angle
        if (!(cosine > -1.0f))
            return 0.0f;
        float const t2 = maxOf(0.0f, 1.0f - cosine) / (1.0f + cosine);
        return a2 * (1.0f + t2) / ((a2 + t2) * (a2 + t2) * (1.0f + cosine) * 6.28318531f);
    }
    float const angle = std::acos(minOf(cosine, 1.0f));
    float const tilt = angle / turn;
    if (!(tilt < 1.5707f))
        return 0.0f;
    float const t = std::tan(tilt), t2 = t * t;
    // u = t^2 / (a^2 + t^2): du by the angle, over the circle 2 pi sin(angle); at the axis its
    // limit.
    float const du = 2.0f * a2 * (1.0f + t2) / ((a2 + t2) * (a2 + t2) * turn);
    float const ratio = angle > 1e-4f ? t / std::sin(angle) : 1.0f / turn;
    return du * ratio / 6.28318531f;
}

/// `d` mirrored to the side of the plane that `n` points to, where it is not there.
inline Vec3f towardsSide(Vec3f d, Vec3f n)
{
    float const h = dot(d, n);
    return h < 0.0f ? d - n * (2.0f * h) : d;
}

} // namespace zsi::host
