// SPDX-License-Identifier: Apache-2.0
/// For all tests of shading: a plain hit, vectors in double, deterministic random numbers.
#pragma once

#include <cmath>
#include <cstring>
#include <gtest/gtest.h>
#include <random>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi::test {

/// A camera hit at the origin seen head-on along -z, normal +z, identity transform.
inline ShadeState plainHit()
{
    ShadeState s;
    std::memset(static_cast<void*>(&s), 0, sizeof s);
    s.E = {0, 0, 1};
    s.I = {0, 0, -1};
    s.N = s.Ng = s.Nref = {0, 0, 1};
    s.incomingIor = s.beyondIor = 1.0f;
    s.objectToWorld = Mat4f::identity();
    s.rayType = kRayCamera;
    s.maxRayDepth = 8;
    return s;
}

template <class T>
void setAttribute(ShadeState& s, long offset, T const& value)
{
    std::memcpy(s.attributes + offset, &value, sizeof value);
}

/// For oracles: vectors in double.
struct Vec3d {
    double x = 0, y = 0, z = 0;

    constexpr Vec3d() = default;
    constexpr Vec3d(double x_, double y_, double z_)
        : x(x_)
        , y(y_)
        , z(z_)
    {
    }
    constexpr Vec3d(Vec3f v)
        : Vec3d(double(v.x), double(v.y), double(v.z))
    {
    }
    friend constexpr Vec3d operator+(Vec3d a, Vec3d b) { return {a.x + b.x, a.y + b.y, a.z + b.z}; }
    friend constexpr Vec3d operator-(Vec3d a, Vec3d b) { return {a.x - b.x, a.y - b.y, a.z - b.z}; }
    friend constexpr Vec3d operator-(Vec3d a) { return {-a.x, -a.y, -a.z}; }
    friend constexpr Vec3d operator*(Vec3d a, double k) { return {a.x * k, a.y * k, a.z * k}; }
    friend constexpr double dot(Vec3d a, Vec3d b) { return a.x * b.x + a.y * b.y + a.z * b.z; }
    friend constexpr Vec3d cross(Vec3d a, Vec3d b)
    {
        return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
    }
    friend Vec3d normalize(Vec3d a)
    {
        double const l = std::sqrt(dot(a, a));
        return l > 0 ? a * (1 / l) : a;
    }
};
inline Vec3f toFloat(Vec3d a) { return {float(a.x), float(a.y), float(a.z)}; }
inline double distance(Vec3d a, Vec3d b) { return std::sqrt(dot(a - b, a - b)); }

/// Whether the distance is within the tolerance; NaN never is.
inline testing::AssertionResult near(Vec3d got, Vec3d want, double tolerance)
{
    if (distance(got, want) <= tolerance)
        return testing::AssertionSuccess();
    auto const text = [](Vec3d a) { return testing::PrintToString(std::tuple(a.x, a.y, a.z)); };
    return testing::AssertionFailure() << text(got) << " is not " << text(want);
}
inline testing::AssertionResult near(Vec4f got, Vec4f want, double tolerance)
{
    if (!(std::fabs(double(got.w) - double(want.w)) <= tolerance))
        return testing::AssertionFailure() << "alpha " << got.w << " is not " << want.w;
    return near(Vec3d(rgb(got)), Vec3d(rgb(want)), tolerance);
}

/// Random inputs with a fixed seed.
struct Random {
    std::mt19937 engine{20240517u};

    float in(float lo, float hi) { return std::uniform_real_distribution<float>(lo, hi)(engine); }
    Vec3f unit()
    {
        float const z = in(-1, 1), phi = in(0, 6.2831853f), r = std::sqrt(1 - z * z);
        return {r * std::cos(phi), r * std::sin(phi), z};
    }
    Vec3f color() { return {in(0, 1), in(0, 1), in(0, 1)}; }
};

} // namespace zsi::test
