// SPDX-License-Identifier: Apache-2.0
/// Value types of the shading language: what parameters, records and services are made of.
///
/// Plain data with 4-byte alignment and no padding (texture handles: two 8-byte words).
/// Default initialisation leaves them unset, value initialisation (`Vec3f{}`) zeroes them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>

namespace zsi {

/// Two floats; texture coordinates.
struct Vec2f {
    float x, y;

    Vec2f() = default;
    constexpr Vec2f(float x_, float y_)
        : x(x_)
        , y(y_)
    {
    }
};

/// Three floats; a point, direction, normal, or a linear RGB colour as (r, g, b).
struct Vec3f {
    float x, y, z;

    Vec3f() = default;
    constexpr Vec3f(float x_, float y_, float z_)
        : x(x_)
        , y(y_)
        , z(z_)
    {
    }

    /// Exact comparison, x first; false as soon as a component is NaN.
    constexpr bool operator==(Vec3f const& other) const
    {
        return x == other.x && y == other.y && z == other.z;
    }
};

/// Four floats; a colour with alpha as (r, g, b, a).
struct Vec4f {
    float x, y, z, w;

    Vec4f() = default;
    constexpr Vec4f(float x_, float y_, float z_, float w_)
        : x(x_)
        , y(y_)
        , z(z_)
        , w(w_)
    {
    }
};

/// Three signed integers; cell coordinates.
struct Vec3i {
    std::int32_t x, y, z;

    Vec3i() = default;
    constexpr Vec3i(std::int32_t x_, std::int32_t y_, std::int32_t z_)
        : x(x_)
        , y(y_)
        , z(z_)
    {
    }
};

/// Sixteen floats, row by row. Points transform as row vectors: the translation is m[12..14].
struct Mat4f {
    float m[16];

    Mat4f() = default;
    constexpr Mat4f(float m0, float m1, float m2, float m3, float m4, float m5, float m6, float m7,
                    float m8, float m9, float m10, float m11, float m12, float m13, float m14,
                    float m15)
        : m{m0, m1, m2, m3, m4, m5, m6, m7, m8, m9, m10, m11, m12, m13, m14, m15}
    {
    }

    static constexpr Mat4f identity() { return {1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}; }
};

/// Nine floats, row by row.
struct Mat3f {
    float m[9];

    Mat3f() = default;
    constexpr Mat3f(float m0, float m1, float m2, float m3, float m4, float m5, float m6, float m7,
                    float m8)
        : m{m0, m1, m2, m3, m4, m5, m6, m7, m8}
    {
    }

    /// The upper-left 3x3 block; fourth row and column are dropped.
    constexpr explicit Mat3f(Mat4f const& a)
        : m{a.m[0], a.m[1], a.m[2], a.m[4], a.m[5], a.m[6], a.m[8], a.m[9], a.m[10]}
    {
    }

    static constexpr Mat3f identity() { return {1, 0, 0, 0, 1, 0, 0, 0, 1}; }
};

/// A fixed number of values in place. A shading frame is an `SLArray<Vec3f>` that holds
/// tangent, bitangent, normal, in this order.
template <class T, int N = 3>
struct SLArray {
    T element[static_cast<std::size_t>(N)];

    constexpr T& operator[](int i) { return element[i]; }
    constexpr T const& operator[](int i) const { return element[i]; }
    static constexpr int size() { return N; }
};

static_assert(sizeof(Vec2f) == 8 && sizeof(Vec3f) == 12 && sizeof(Vec4f) == 16);
static_assert(sizeof(Mat3f) == 36 && sizeof(Mat4f) == 64 && sizeof(Vec3i) == 12);
static_assert(alignof(Mat4f) == 4 && alignof(Vec4f) == 4 && std::is_trivial_v<Vec3f>);

} // namespace zsi
