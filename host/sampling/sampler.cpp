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
    return __builtin_bswap32(x);
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
    return toUnitFloat(reverseBits(permuteUpwards(reversed, seed)));
}

constexpr std::uint32_t kFirst = 0x68bc21ebu, kSecond = 0x02e5be93u, kPixels = 0x967a889bu;

// Digits of pixels.
//
// Sobol's pair of numbers are Taylor coefficients, at 0 and at 1, of the polynomial over GF(2)
// whose coefficients are the digits of the index (Niederreiter and Xing 1996 see all such sequences
// so): a polynomial with k coefficients that vanishes to the order a at 0 and b at 1, a + b = k, is
// 0, hence 2^k points that fill all boxes of sides 2^-a, 2^-b. A pixel adds a rational function
// with poles at q = t^2 + t + 1, of order j for the jth digit to the base 4 of its place on the Z
// curve. Sums of both, for k digits of the index and m of the place, have k + 2m coefficients, and
// again only 0 has as many zeros: the points of 4^m pixels fill the boxes of area 2^-(k + 2m).

/// A pixel's share of the first number of a pair, reversed as the index is, for each of the four
/// bytes of its place: sums of the Taylor coefficients at 0, lowest in the lowest bit, of 1/q, t/q,
/// 1/q^2, t/q^2, ...
constexpr auto kDigitsAt0 = [] {
    auto const overQ = [](std::uint32_t numerator) {
        std::uint32_t quotient = 0;
        for (int i = 0; i < 32; ++i) {
            std::uint32_t const before =
                (i > 0 ? quotient >> (i - 1) : 0) ^ (i > 1 ? quotient >> (i - 2) : 0);
            quotient |= ((numerator >> i ^ before) & 1u) << i;
        }
        return quotient;
    };
    std::array<std::array<std::uint32_t, 256>, 4> sums{};
    std::uint32_t power = 1;
    for (auto& ofByte : sums)
        for (std::size_t bit = 1; bit < 256; bit <<= 1) {
            bool const odd = (bit & 0xaau) != 0;
            power = odd ? power : overQ(power);
            for (std::size_t below = 0; below < bit; ++below)
                ofByte[bit + below] = ofByte[below] ^ power << odd;
        }
    return sums;
}();

std::uint32_t digitsAt0(std::uint32_t place)
{
    return kDigitsAt0[0][place & 0xffu] ^ kDigitsAt0[1][place >> 8 & 0xffu]
        ^ kDigitsAt0[2][place >> 16 & 0xffu] ^ kDigitsAt0[3][place >> 24];
}

/// Of the second: with t = u + 1 the pole is u^2 + u + 1, and a + b t is a + b + b u.
std::uint32_t digitsAt1(std::uint32_t place)
{
    return digitsAt0(place ^ (place >> 1 & 0x55555555u));
}

/// The lower 16 bits to the even places.
constexpr std::uint32_t spread(std::uint32_t x)
{
    x &= 0xffffu;
    x = (x | x << 8) & 0x00ff00ffu;
    x = (x | x << 4) & 0x0f0f0f0fu;
    x = (x | x << 2) & 0x33333333u;
    return (x | x << 1) & 0x55555555u;
}

} // namespace

Sampler::Sampler(std::uint32_t seed, int x, int y)
    : seed_(hash32(seed))
    , pixelSeed_(hashCombine(hashCombine(seed_, static_cast<std::uint32_t>(x)),
                             static_cast<std::uint32_t>(y)))
    , pixel_(spread(static_cast<std::uint32_t>(x)) | spread(static_cast<std::uint32_t>(y)) << 1)
{
}

void Sampler::start(std::uint32_t index)
{
    index_ = index;
    dimension_ = 0;
}

Sampler::Pair Sampler::nextPair()
{
    std::uint32_t const dimension = dimension_++;
    auto const made = [](std::uint32_t seed, std::uint32_t pixelX, std::uint32_t pixelY) -> Pair {
        return {seed, hash32(seed ^ kFirst), hash32(seed ^ kSecond), pixelX, pixelY};
    };
    if (dimension >= kShared)
        return made(hashCombine(pixelSeed_, dimension), 0, 0);
    Pair& pair = shared_[dimension];
    if (!(known_ >> dimension & 1u)) {
        known_ |= 1u << dimension;
        std::uint32_t const seed = hashCombine(seed_, dimension);
        std::uint32_t const place = shuffled(pixel_, seed ^ kPixels);
        pair = made(seed, digitsAt0(place), digitsAt1(place));
    }
    return pair;
}

float Sampler::next()
{
    Pair const pair = nextPair();
    return scrambled(shuffled(index_, pair.shuffle) ^ pair.pixelX, pair.scrambleX);
}

Vec2f Sampler::next2D() { return next2D(1)[0]; }

Sampler::Points Sampler::next2D(int count)
{
    return {nextPair(), index_ * static_cast<std::uint32_t>(count)};
}

Vec2f Sampler::Points::operator[](int i) const
{
    std::uint32_t const index = shuffled(first_ + static_cast<std::uint32_t>(i), pair_.shuffle);
    return {scrambled(index ^ pair_.pixelX, pair_.scrambleX),
            scrambled(sobolSecond(index) ^ pair_.pixelY, pair_.scrambleY)};
}

} // namespace zsi::host
