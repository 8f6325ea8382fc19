// SPDX-License-Identifier: Apache-2.0
#include "sampling/sampler.h"

#include "base/hash.h"

namespace zsi::host {
namespace {

constexpr std::uint32_t reverseBits(std::uint32_t x)
{
    x = ((x >> 1) & 0x55555555u) | ((x & 0x55555555u) << 1);
    x = ((x >> 2) & 0x33333333u) | ((x & 0x33333333u) << 2);
    x = ((x >> 4) & 0x0f0f0f0fu) | ((x & 0x0f0f0f0fu) << 4);
    x = ((x >> 8) & 0x00ff00ffu) | ((x & 0x00ff00ffu) << 8);
    return (x >> 16) | (x << 16);
}

/// Second Sobol dimension with its bits reversed; the first is the index itself. The matrix is
/// Pascal's triangle modulo 2, which is made of itself at half the size.
constexpr std::uint32_t sobolSecond(std::uint32_t x)
{
    x ^= x >> 16;
    x ^= (x & 0xff00ff00u) >> 8;
    x ^= (x & 0xf0f0f0f0u) >> 4;
    x ^= (x & 0xccccccccu) >> 2;
    return x ^ (x & 0xaaaaaaaau) >> 1;
}

/// Permutes so that each bit depends on the lower ones alone, as nested scrambling does from the
/// other end (Laine and Karras 2011; constants of Vegdahl 2021, which mix better).
constexpr std::uint32_t permuteUpwards(std::uint32_t x, std::uint32_t seed)
{
    x ^= x * 0x3d20adeau;
    x += seed;
    x *= (seed >> 16) | 1u;
    x ^= x * 0x05526c56u;
    x ^= x * 0x53a22864u;
    return x;
}

/// A shuffled order of the indices keeps every aligned run of 2^k together, so that the points of
/// two dimension pairs are unrelated while each stays well spread.
constexpr std::uint32_t shuffled(std::uint32_t index, std::uint32_t seed)
{
    return reverseBits(permuteUpwards(reverseBits(index), seed));
}

/// A Sobol number with its bits reversed, scrambled as nested intervals are.
float scrambled(std::uint32_t reversed, std::uint32_t seed)
{
    return toUnitFloat(reverseBits(permuteUpwards(reversed, hash32(seed))));
}

constexpr std::uint32_t kFirst = 0x68bc21ebu, kSecond = 0x02e5be93u;

Vec2f point(std::uint32_t index, std::uint32_t seed)
{
    std::uint32_t const i = shuffled(index, seed);
    return {scrambled(i, seed ^ kFirst), scrambled(sobolSecond(i), seed ^ kSecond)};
}

} // namespace

Sampler::Sampler(std::uint32_t seed, int x, int y)
    : pixelSeed_(hashCombine(hashCombine(hash32(seed), static_cast<std::uint32_t>(x)),
                             static_cast<std::uint32_t>(y)))
{
}

void Sampler::start(std::uint32_t index)
{
    index_ = index;
    dimension_ = 0;
}

std::uint32_t Sampler::nextSeed() { return hashCombine(pixelSeed_, dimension_++); }

float Sampler::next()
{
    std::uint32_t const seed = nextSeed();
    return scrambled(shuffled(index_, seed), seed ^ kFirst);
}

Vec2f Sampler::next2D() { return point(index_, nextSeed()); }

Sampler::Points Sampler::next2D(int count)
{
    return {nextSeed(), index_ * static_cast<std::uint32_t>(count)};
}

Vec2f Sampler::Points::operator[](int i) const
{
    return point(first_ + static_cast<std::uint32_t>(i), seed_);
}

} // namespace zsi::host
