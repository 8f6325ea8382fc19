// SPDX-License-Identifier: Apache-2.0
/// Kernels that are timed, or counted in instructions, on the same fixed inputs.
///
///   build/bench/kernels [FILTER [MS]]     ns per call: median, min, max of 15 interleaved rounds
///   scripts/instructions.sh [FILTER]      instructions per call, by valgrind's callgrind
///
/// A pass is 4096 calls on fixed random inputs; every round runs each kernel once, so that a noisy
/// neighbour hits all of them alike.
#pragma once

#include <cmath>
#include <functional>
#include <string>

// One real call: neither inlined nor specialised for the arguments of this program.
#if defined(__clang__)
#define BENCH_NOINLINE __attribute__((noinline))
#else
#define BENCH_NOINLINE __attribute__((noipa))
#endif

namespace bench {

struct V3 {
    float x, y, z;
};

inline V3 operator+(V3 a, V3 b) { return {a.x + b.x, a.y + b.y, a.z + b.z}; }
inline V3 operator-(V3 a, V3 b) { return {a.x - b.x, a.y - b.y, a.z - b.z}; }
inline V3 operator*(V3 a, float k) { return {a.x * k, a.y * k, a.z * k}; }
inline V3 operator*(V3 a, V3 b) { return {a.x * b.x, a.y * b.y, a.z * b.z}; }
inline float dot(V3 a, V3 b) { return a.x * b.x + a.y * b.y + a.z * b.z; }
inline V3 cross(V3 a, V3 b)
{
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}
inline float clamp01(float t) { return t < 0 ? 0.f : t > 1 ? 1.f : t; }
inline V3 normalized(V3 a)
{
    float l = std::sqrt(dot(a, a));
    return l > 0 ? a * (1 / l) : a;
}
inline float sum(V3 a) { return a.x + a.y + a.z; }

struct Frame { // rows: the object-to-world rotation is applied to the tangent, then made
               // orthonormal
    V3 t, b, n;
    V3 in(V3 d) const { return {dot(t, d), dot(b, d), dot(n, d)}; }
    V3 out(V3 d) const { return t * d.x + b * d.y + n * d.z; }
};
inline Frame frame(float const* m, V3 n, V3 tangent)
{
    V3 t = {m[0] * tangent.x + m[3] * tangent.y + m[6] * tangent.z,
            m[1] * tangent.x + m[4] * tangent.y + m[7] * tangent.z,
            m[2] * tangent.x + m[5] * tangent.y + m[8] * tangent.z};
    t = normalized(t - n * dot(t, n));
    return {t, normalized(cross(n, t)), n};
}

/// Everything a scattering call may want, in the local frame (z = normal) and in world space.
/// wo points away from the surface towards the viewer.
struct Item {
    V3 wo; ///< z > 0.02
    V3 wi; ///< z > 0.02
    V3 wt; ///< as wi, but in either hemisphere (half the items below)
    float u[3]; ///< uniform in [0, 1)
    V3 n, t; ///< world-space unit normal, and a tangent not orthogonal to it
    V3 woW, wiW, wtW; ///< wo, wi, wt in world space (frame of n and t)
};

/// n calls; returns a sum, so that nothing is optimised away.
using Loop = std::function<float(Item const*, int n)>;

void add(std::string name, Loop loop);

/// A loop that calls F once per item and sums what it returns.
template <class F>
float each(Item const* it, int n, F f)
{
    float s = 0;
    for (int i = 0; i < n; ++i)
        s += f(it[i]);
    return s;
}

/// Object-to-world rotation of every kernel; visible from elsewhere, so that nothing folds it.
extern float toWorld[9];

void registerFloors();
void registerLibrary(char const* sharedObject);

} // namespace bench
