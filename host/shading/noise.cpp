// SPDX-License-Identifier: Apache-2.0
#include "shading/noise.h"

#include "base/hash.h"

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

/// A coordinate as the lattice cell below it and the way into that cell.
struct Lattice {
    std::uint32_t cell;
    float offset; ///< [0, 1)

    explicit Lattice(float x)
    {
        if (!std::isfinite(x))
            x = 0.0f;
        float const below = std::floor(x);
        offset = x - below;
        if (offset >= 1.0f) // a tiny negative x rounds up to the next lattice point
            offset = 0.0f;
        // Beyond 32 bits the cells are 256 apart and more: the float's own bits tell them apart.
        cell = std::fabs(below) < 0x1p31f
            ? static_cast<std::uint32_t>(static_cast<std::int64_t>(below))
            : std::bit_cast<std::uint32_t>(below);
    }

    /// Quintic with vanishing first and second derivatives at both ends.
    float fade() const { return offset * offset * offset * (offset * (offset * 6 - 15) + 10); }
};

constexpr float lerp(float t, float a, float b) { return a + t * (b - a); }

/// Eight directions of equal length around the circle.
float gradient2(std::uint32_t hash, float x, float y)
{
    constexpr float kDiagonal = 0.70710678f;
    switch (hash >> 29) {
    case 0:
        return x;
    case 1:
        return -x;
    case 2:
        return y;
    case 3:
        return -y;
    case 4:
        return kDiagonal * (x + y);
    case 5:
        return kDiagonal * (x - y);
    case 6:
        return kDiagonal * (y - x);
    default:
        return -kDiagonal * (x + y);
    }
}

/// The twelve edge directions of a cube, four of them twice.
float gradient3(std::uint32_t hash, float x, float y, float z)
{
    std::uint32_t const h = hash >> 28;
    float const u = h < 8 ? x : y;
    float const v = h < 4 ? y : (h == 12 || h == 14 ? x : z);
    return ((h & 1) ? -u : u) + ((h & 2) ? -v : v);
}

/// The 32 edge directions of a hypercube: one axis left out, three signs.
float gradient4(std::uint32_t hash, float x, float y, float z, float w)
{
    std::uint32_t const h = hash >> 27;
    float const a = h < 24 ? x : y;
    float const b = h < 16 ? y : z;
    float const c = h < 8 ? z : w;
    return ((h & 1) ? -a : a) + ((h & 2) ? -b : b) + ((h & 4) ? -c : c);
}

// Each sum of gradients times its scale has a standard deviation of about 1/4 to 1/3. The 2D sum
// is bounded by sqrt(1/2). In 3D and 4D the scaled sums pass 1 in fewer than one place of a
// thousand, and are held there.
constexpr float kScale2 = 1.41421356f;
constexpr float kScale3 = 1.0f;
constexpr float kScale4 = 0.95f;

float toUnitRange(float signedNoise) { return clamp(0.5f + 0.5f * signedNoise, 0.0f, 1.0f); }

} // namespace

float noise2D(Vec2f p)
{
    Lattice const lx(p.x), ly(p.y);
    float corner[4];
    for (std::uint32_t i = 0; i < 4; ++i) {
        std::uint32_t const dx = i & 1, dy = i >> 1;
        std::uint32_t const h = hashCombine(hash32(lx.cell + dx), ly.cell + dy);
        corner[i] =
            gradient2(h, lx.offset - static_cast<float>(dx), ly.offset - static_cast<float>(dy));
    }
    float const fx = lx.fade(), fy = ly.fade();
    return toUnitRange(kScale2
                       * lerp(fy, lerp(fx, corner[0], corner[1]), lerp(fx, corner[2], corner[3])));
}

float signedNoise3D(Vec3f p)
{
    Lattice const lx(p.x), ly(p.y), lz(p.z);
    float const fx = lx.fade(), fy = ly.fade(), fz = lz.fade();
    float slice[2];
    for (std::uint32_t dz = 0; dz < 2; ++dz) {
        float corner[4];
        std::uint32_t const hz = hash32(lz.cell + dz);
        for (std::uint32_t i = 0; i < 4; ++i) {
            std::uint32_t const dx = i & 1, dy = i >> 1;
            std::uint32_t const h = hashCombine(hashCombine(hz, ly.cell + dy), lx.cell + dx);
            corner[i] =
                gradient3(h, lx.offset - static_cast<float>(dx), ly.offset - static_cast<float>(dy),
                          lz.offset - static_cast<float>(dz));
        }
        slice[dz] = lerp(fy, lerp(fx, corner[0], corner[1]), lerp(fx, corner[2], corner[3]));
    }
    return clamp(kScale3 * lerp(fz, slice[0], slice[1]), -1.0f, 1.0f);
}

float noise3D(Vec3f p) { return toUnitRange(signedNoise3D(p)); }

float noise4D(Vec4f p)
{
    Lattice const lx(p.x), ly(p.y), lz(p.z), lw(p.w);
    float const fx = lx.fade(), fy = ly.fade(), fz = lz.fade(), fw = lw.fade();
    float cube[2];
    for (std::uint32_t dw = 0; dw < 2; ++dw) {
        std::uint32_t const hw = hash32(lw.cell + dw);
        float slice[2];
        for (std::uint32_t dz = 0; dz < 2; ++dz) {
            std::uint32_t const hz = hashCombine(hw, lz.cell + dz);
            float corner[4];
            for (std::uint32_t i = 0; i < 4; ++i) {
                std::uint32_t const dx = i & 1, dy = i >> 1;
                std::uint32_t const h = hashCombine(hashCombine(hz, ly.cell + dy), lx.cell + dx);
                corner[i] = gradient4(
                    h, lx.offset - static_cast<float>(dx), ly.offset - static_cast<float>(dy),
                    lz.offset - static_cast<float>(dz), lw.offset - static_cast<float>(dw));
            }
            slice[dz] = lerp(fy, lerp(fx, corner[0], corner[1]), lerp(fx, corner[2], corner[3]));
        }
        cube[dw] = lerp(fz, slice[0], slice[1]);
    }
    return toUnitRange(kScale4 * lerp(fw, cube[0], cube[1]));
}

float cellNoise1D(float x) { return toUnitFloat(hash32(Lattice(x).cell ^ 0x5bd1e995u)); }

Vec3f cellNoise3D(Vec3f p)
{
    std::uint32_t const h =
        hashCombine(hashCombine(hash32(Lattice(p.x).cell), Lattice(p.y).cell), Lattice(p.z).cell);
    return {toUnitFloat(h), toUnitFloat(hash32(h ^ 0x68e31da4u)),
            toUnitFloat(hash32(h ^ 0xb5297a4du))};
}

} // namespace zsi::host
