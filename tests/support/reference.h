/// Formulas of the physical materials in double precision, in the form that their models state.
#pragma once

#include "support/record.h"

#include <numbers>

namespace zsi::test {

using D3 = Vec3d;

/// Tangent frame of a normal; the tangent goes through the 3x3 part as a row vector.
struct DFrame {
    Vec3d t, b, n;

    DFrame(Vec3f tangent, Vec3d normal, Mat4f const& toWorld)
        : n(normal)
    {
        float const in[3] = {tangent.x, tangent.y, tangent.z};
        for (int row = 0; row < 3; ++row)
            t = t
                + Vec3d(Vec3f(toWorld.m[4 * row], toWorld.m[4 * row + 1], toWorld.m[4 * row + 2]))
                    * double(in[row]);
        settle();
    }
    /// The normal by slopes along tangent and bitangent, which turn after it.
    void bend(double du, double dv, bool unit)
    {
        n = n + t * du + b * dv;
        if (unit)
            n = normalize(n);
        settle();
    }
    Vec3d in(Vec3d d) const { return {dot(t, d), dot(b, d), dot(n, d)}; }
    Vec3d out(Vec3d d) const { return t * d.x + b * d.y + n * d.z; }

private:
    void settle()
    {
        t = normalize(t - n * dot(t, n));
        b = normalize(cross(n, t));
    }
};

inline double schlickOf(double r0, double c)
{
    return clampUnit(r0 + std::pow(1 - clampUnit(c), 5) * (1 - r0));
}
inline double tan2Of(double c) { return (1 - c * c) / (c * c); }
inline double smithG1(double a2, Vec3d w, Vec3d h)
{
    return dot(w, h) * w.z > 0 ? 2 / (1 + std::sqrt(1 + a2 * tan2Of(w.z))) : 0;
}
inline double ggxOf(double a2, double c)
{
    double const k = tan2Of(c) + a2;
    return c > 0 ? a2 / (std::pow(c, 4) * std::numbers::pi * k * k) : 0;
}
/// Fade of lights over the horizon: nothing up to 0.05, all from 0.25 on.
inline double fadeOf(double cosine)
{
    double const x = clampUnit((cosine - 0.05) / 0.2);
    return x * x * (3 - 2 * x);
}
inline double reflectedOf(double a2, Vec3d v, Vec3d l, Vec3d h)
{
    return smithG1(a2, v, h) * smithG1(a2, l, h) * ggxOf(a2, h.z) / (4 * std::fabs(v.z * l.z));
}

/// A hit with everything at random: P and E, normals that lean apart a little, tangent and uv at
/// the offsets of the physical materials, media, an object transform that turns and scales.
inline ShadeState randomHit(Random& random, bool front)
{
    ShadeState s = plainHit();
    s.P = {random.in(-2, 2), random.in(-2, 2), random.in(-2, 2)};
    s.E = {random.in(-2, 2), random.in(-2, 2), random.in(-2, 2)};
    do {
        s.I = random.unit();
        s.Ng = random.unit();
        s.N = normalize(s.Ng + random.unit() * 0.3f);
    } while ((dot(s.I, s.Ng) < 0) != front || std::fabs(dot(s.I, s.Ng)) < 0.05f
             || dot(s.I, s.N) * dot(s.I, s.Ng) < 0.01f);
    s.incomingIor = random.in(1, 1.2f);
    s.beyondIor = random.in(1, 2.2f);
    for (float& m : s.objectToWorld.m)
        m = random.in(-2, 2);
    setAttribute(s, 36, random.unit());
    setAttribute(s, 48, Vec2f(random.in(0, 1), random.in(0, 1)));
    return s;
}
inline Vec3f tangentOf(ShadeState const& s)
{
    Vec3f t;
    std::memcpy(&t, s.attributes + 36, sizeof t);
    return t;
}
/// The shading frame of a hit whose normal, times `side`, nothing bends.
inline DFrame frameOf(ShadeState const& s, double side)
{
    return {tangentOf(s), Vec3d(s.N) * side, s.objectToWorld};
}

} // namespace zsi::test
