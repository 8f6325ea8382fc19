/// Hits at random for tests of whole materials.
#pragma once

#include "support/record.h"

namespace zsi::test {

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
} // namespace zsi::test
