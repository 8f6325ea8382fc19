// SPDX-License-Identifier: Apache-2.0
/// Arithmetic on the value types, for shaders and hosts that have none of their own.
/// Not part of `zsi.h`, so that a host's own operators never clash with these.
/// Sums run x, y, z in order; no function substitutes a value for a degenerate input.
#pragma once

#include <cmath>
#include <zsi/types.h>

namespace zsi {

constexpr Vec2f operator+(Vec2f a, Vec2f b) { return {a.x + b.x, a.y + b.y}; }
constexpr Vec2f operator-(Vec2f a, Vec2f b) { return {a.x - b.x, a.y - b.y}; }
constexpr Vec2f operator*(Vec2f a, float k) { return {a.x * k, a.y * k}; }

constexpr Vec3f operator+(Vec3f a, Vec3f b) { return {a.x + b.x, a.y + b.y, a.z + b.z}; }
constexpr Vec3f operator-(Vec3f a, Vec3f b) { return {a.x - b.x, a.y - b.y, a.z - b.z}; }
constexpr Vec3f operator-(Vec3f a) { return {-a.x, -a.y, -a.z}; }
constexpr Vec3f operator*(Vec3f a, Vec3f b) { return {a.x * b.x, a.y * b.y, a.z * b.z}; }
constexpr Vec3f operator*(Vec3f a, float k) { return {a.x * k, a.y * k, a.z * k}; }
constexpr Vec3f operator*(float k, Vec3f a) { return a * k; }
constexpr Vec3f operator/(Vec3f a, float k) { return {a.x / k, a.y / k, a.z / k}; }
constexpr Vec3f& operator+=(Vec3f& a, Vec3f b) { return a = a + b; }
constexpr Vec3f& operator*=(Vec3f& a, Vec3f b) { return a = a * b; }
constexpr Vec3f& operator*=(Vec3f& a, float k) { return a = a * k; }

constexpr Vec4f operator+(Vec4f a, Vec4f b) { return {a.x + b.x, a.y + b.y, a.z + b.z, a.w + b.w}; }
constexpr Vec4f operator*(Vec4f a, float k) { return {a.x * k, a.y * k, a.z * k, a.w * k}; }

constexpr Vec3f grey(float v) { return {v, v, v}; }
constexpr Vec3f rgb(Vec4f c) { return {c.x, c.y, c.z}; }
constexpr Vec4f withAlpha(Vec3f c, float a) { return {c.x, c.y, c.z, a}; }

constexpr float dot(Vec3f a, Vec3f b) { return a.x * b.x + a.y * b.y + a.z * b.z; }
constexpr Vec3f cross(Vec3f a, Vec3f b)
{
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}
inline float length(Vec3f a) { return std::sqrt(dot(a, a)); }

/// Unit vector; a vector of length 0 (or NaN) stays as it is.
inline Vec3f normalize(Vec3f a)
{
    float const l = length(a);
    return l > 0.0f ? a / l : a;
}

constexpr float maxOf(float a, float b) { return a > b ? a : b; }
constexpr float minOf(float a, float b) { return a < b ? a : b; }
constexpr float maxComponent(Vec3f a) { return maxOf(a.x, maxOf(a.y, a.z)); }
constexpr float minComponent(Vec3f a) { return minOf(a.x, minOf(a.y, a.z)); }

/// [lo, hi]; NaN passes through.
constexpr float clamp(float t, float lo, float hi) { return lo > t ? lo : (hi < t ? hi : t); }
/// [0, 1]; NaN passes through.
constexpr float clamp01(float t) { return clamp(t, 0.0f, 1.0f); }
constexpr Vec3f clamp01(Vec3f a) { return {clamp01(a.x), clamp01(a.y), clamp01(a.z)}; }

/// -1, 0 or +1; 0 for NaN.
constexpr float sign(float t) { return t < 0.0f ? -1.0f : (t > 0.0f ? 1.0f : 0.0f); }
inline float fract(float t) { return t - std::floor(t); }

constexpr Vec3f mix(Vec3f a, Vec3f b, float t) { return a * (1.0f - t) + b * t; }
constexpr Vec3f mix(Vec3f a, Vec3f b, Vec3f t) { return (grey(1.0f) - t) * a + t * b; }

/// (u, v, 1) x M: a texture coordinate through a 2D texture transform.
constexpr Vec2f transformUv(Mat3f const& m, Vec2f uv)
{
    return {m.m[0] * uv.x + m.m[3] * uv.y + m.m[6], m.m[1] * uv.x + m.m[4] * uv.y + m.m[7]};
}
/// v x M: a direction as a row vector.
constexpr Vec3f transformDirection(Mat3f const& m, Vec3f v)
{
    return {m.m[0] * v.x + m.m[3] * v.y + m.m[6] * v.z, m.m[1] * v.x + m.m[4] * v.y + m.m[7] * v.z,
            m.m[2] * v.x + m.m[5] * v.y + m.m[8] * v.z};
}
/// M x v: a direction as a column vector, row by row.
constexpr Vec3f rotate(Mat3f const& m, Vec3f v)
{
    return {m.m[0] * v.x + m.m[1] * v.y + m.m[2] * v.z, m.m[3] * v.x + m.m[4] * v.y + m.m[5] * v.z,
            m.m[6] * v.x + m.m[7] * v.y + m.m[8] * v.z};
}
/// (p, 1) x M without the last column.
constexpr Vec3f transformPoint(Mat4f const& m, Vec3f p)
{
    return {m.m[0] * p.x + m.m[4] * p.y + m.m[8] * p.z + m.m[12],
            m.m[1] * p.x + m.m[5] * p.y + m.m[9] * p.z + m.m[13],
            m.m[2] * p.x + m.m[6] * p.y + m.m[10] * p.z + m.m[14]};
}
/// (v, 0) x M without the last column.
constexpr Vec3f transformDirection(Mat4f const& m, Vec3f v)
{
    return {m.m[0] * v.x + m.m[4] * v.y + m.m[8] * v.z, m.m[1] * v.x + m.m[5] * v.y + m.m[9] * v.z,
            m.m[2] * v.x + m.m[6] * v.y + m.m[10] * v.z};
}

} // namespace zsi
