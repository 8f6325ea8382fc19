// SPDX-License-Identifier: Apache-2.0
/// Hits at random for tests of whole materials.
#pragma once

#include "support/record.h"

namespace zsi::test {

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
