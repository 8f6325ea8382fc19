/// Records for tests: a plain hit, stray-write checks, deterministic random numbers.
#pragma once

#include <array>
#include <cmath>
#include <cstring>
#include <random>
#include <string>
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

/// Names the first byte that differs outside the given [offset, size) spans; empty when none does.
template <std::size_t N>
std::string strayWrite(ShadeState const& before, ShadeState const& after,
                       std::array<std::pair<std::size_t, std::size_t>, N> const& allowed)
{
    auto const* a = reinterpret_cast<unsigned char const*>(&before);
    auto const* b = reinterpret_cast<unsigned char const*>(&after);
    for (std::size_t i = 0; i < sizeof(ShadeState); ++i) {
        if (a[i] == b[i])
            continue;
        bool ok = false;
        for (auto const& [offset, size] : allowed)
            ok = ok || (i >= offset && i < offset + size);
        if (!ok)
            return "byte " + std::to_string(i) + " was written";
    }
    return {};
}

/// For oracles: the products and the sum in double.
inline double dotOf(Vec3f a, Vec3f b)
{
    return double(a.x) * double(b.x) + double(a.y) * double(b.y) + double(a.z) * double(b.z);
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
