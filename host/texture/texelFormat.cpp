// SPDX-License-Identifier: Apache-2.0
#include "texture/texelFormat.h"

#include <OpenImageIO/half.h>
#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <emmintrin.h>
#include <limits>
#include <vector>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

/// IEC 61966-2-1.
float decodeSrgb(float encoded)
{
    return encoded <= 0.04045f ? encoded / 12.92f : std::pow((encoded + 0.055f) / 1.055f, 2.4f);
}

float encodeSrgb(float linear)
{
    return linear <= 0.0031308f ? 12.92f * linear : 1.055f * std::pow(linear, 1 / 2.4f) - 0.055f;
}

/// The same of four numbers in [0, 1], to 2e-6: the curve is nearly a polynomial of the fourth root
/// of its argument; coefficients of the least largest error.
__m128 encodeUnitSrgb(__m128 linear)
{
    __m128 const r = _mm_sqrt_ps(_mm_sqrt_ps(linear));
    __m128 curve = _mm_set1_ps(0.0682079345f);
    for (float const c :
         {-0.31841585f, 0.657188058f, -0.852957308f, 1.36592102f, 0.139604151f, -0.0595466085f})
        curve = _mm_add_ps(_mm_mul_ps(curve, r), _mm_set1_ps(c));
    __m128 const isStraight = _mm_cmple_ps(linear, _mm_set1_ps(0.0031308f));
    __m128 const straight = _mm_mul_ps(linear, _mm_set1_ps(12.92f));
    return _mm_or_ps(_mm_and_ps(isStraight, straight), _mm_andnot_ps(isStraight, curve));
}

/// The nearest codes to values in [0, 1], others as the nearer end.
template <class Code>
void encodeIntegers(float const* values, std::size_t count, bool srgb, std::byte* codes)
{
    auto const encode = [srgb](float const* four, Code* to) {
        __m128 v = _mm_min_ps(_mm_max_ps(_mm_loadu_ps(four), _mm_setzero_ps()), _mm_set1_ps(1.0f));
        if (srgb)
            v = encodeUnitSrgb(v);
        v = _mm_add_ps(_mm_mul_ps(v, _mm_set1_ps(Code(~Code(0)))), _mm_set1_ps(0.5f));
        // Packing knows signed numbers only.
        __m128i const low = _mm_set1_epi32(sizeof(Code) == 1 ? 0 : 0x8000);
        __m128i const shorts = _mm_packs_epi32(_mm_sub_epi32(_mm_cvttps_epi32(v), low), low);
        __m128i const packed = sizeof(Code) == 1
            ? _mm_packus_epi16(shorts, shorts)
            : _mm_xor_si128(shorts, _mm_set1_epi16(std::numeric_limits<std::int16_t>::min()));
        std::memcpy(to, &packed, 4 * sizeof(Code));
    };
    Code four[4];
    std::size_t i = 0;
    for (; i + 4 <= count; i += 4) {
        encode(values + i, four);
        std::memcpy(codes + i * sizeof(Code), four, sizeof four);
    }
    float rest[4] = {};
    std::copy(values + i, values + count, rest);
    encode(rest, four);
    std::memcpy(codes + i * sizeof(Code), four, (count - i) * sizeof(Code));
}

float valueOf(std::uint8_t code) { return static_cast<float>(code) * (1.0f / 255.0f); }
float valueOf(std::uint16_t code) { return static_cast<float>(code) * (1.0f / 65535.0f); }
float valueOf(half code) { return code; }

/// The values of four finite halves, in the lower 16 bits of each part, by arithmetic: a table of
/// all is larger than the nearest cache.
__m128 valuesOfFinite(__m128i bits)
{
    __m128i const rest = _mm_and_si128(bits, _mm_set1_epi32(0x7fff));
    __m128i const sign = _mm_slli_epi32(_mm_xor_si128(bits, rest), 16);
    __m128i const normal = _mm_add_epi32(_mm_slli_epi32(rest, 13), _mm_set1_epi32(112 << 23));
    __m128 const tiny = _mm_mul_ps(_mm_cvtepi32_ps(rest), _mm_set1_ps(0x1p-24f));
    __m128i const isTiny = _mm_cmplt_epi32(rest, _mm_set1_epi32(0x400));
    __m128i const value = _mm_or_si128(_mm_and_si128(isTiny, _mm_castps_si128(tiny)),
                                       _mm_andnot_si128(isTiny, normal));
    return _mm_castsi128_ps(_mm_or_si128(value, sign));
}

/// Of finite halves, three for a texel: twelve values of a row are three vectors, whose parts are
/// told apart when all rows are added up.
Vec4f sumOfRgb(std::byte const* const* rows, float const* across, float const* down)
{
    __m128i const zero = _mm_setzero_si128();
    __m128 sums[3] = {};
    for (int j = 0; j < 4; ++j) {
        auto const eight = _mm_loadu_si128(reinterpret_cast<__m128i const*>(rows[j]));
        auto const four = _mm_loadl_epi64(reinterpret_cast<__m128i const*>(rows[j] + 16));
        __m128i const bits[3] = {_mm_unpacklo_epi16(eight, zero), _mm_unpackhi_epi16(eight, zero),
                                 _mm_unpacklo_epi16(four, zero)};
        __m128 const weight = _mm_set1_ps(down[j]);
        for (int i = 0; i < 3; ++i)
            sums[i] = _mm_add_ps(sums[i], _mm_mul_ps(valuesOfFinite(bits[i]), weight));
    }
    alignas(16) float v[12];
    for (int i = 0; i < 3; ++i)
        _mm_store_ps(v + 4 * i, sums[i]);
    auto const channel = [&](int c) {
        return v[c] * across[0] + v[c + 3] * across[1] + v[c + 6] * across[2]
            + v[c + 9] * across[3];
    };
    float const all =
        (across[0] + across[1] + across[2] + across[3]) * (down[0] + down[1] + down[2] + down[3]);
    return {channel(0), channel(1), channel(2), all};
}

/// The same with four for a texel: a vector each.
Vec4f sumOfRgba(std::byte const* const* rows, float const* across, float const* down)
{
    __m128i const zero = _mm_setzero_si128();
    __m128 sums[4] = {};
    for (int j = 0; j < 4; ++j)
        for (int i = 0; i < 2; ++i) {
            auto const two = _mm_loadu_si128(reinterpret_cast<__m128i const*>(rows[j] + 16 * i));
            __m128 const weight = _mm_set1_ps(down[j]);
            __m128& first = sums[2 * i];
            __m128& second = sums[2 * i + 1];
            first = _mm_add_ps(first,
                               _mm_mul_ps(valuesOfFinite(_mm_unpacklo_epi16(two, zero)), weight));
            second = _mm_add_ps(second,
                                _mm_mul_ps(valuesOfFinite(_mm_unpackhi_epi16(two, zero)), weight));
        }
    __m128 sum = _mm_setzero_ps();
    for (int i = 0; i < 4; ++i)
        sum = _mm_add_ps(sum, _mm_mul_ps(sums[i], _mm_set1_ps(across[i])));
    alignas(16) float v[4];
    _mm_store_ps(v, sum);
    return {v[0], v[1], v[2], v[3]};
}

/// The nearest half to a number, the even one of two; by arithmetic for the same reason.
std::uint16_t nearestHalf(float v)
{
    std::uint32_t const all = std::bit_cast<std::uint32_t>(v), rest = all & 0x7fffffffu;
    std::uint32_t const normal = (rest - (112u << 23) + 0xfffu + (rest >> 13 & 1u)) >> 13;
    // The last place of 0.5 is that of the smallest halves.
    std::uint32_t const tiny =
        std::bit_cast<std::uint32_t>(std::bit_cast<float>(rest) + 0.5f) - (126u << 23);
    std::uint32_t const beyond = rest > 0x7f800000u ? 0x7e00u : 0x7c00u;
    std::uint32_t const finite = rest < (113u << 23) ? tiny : normal;
    return static_cast<std::uint16_t>((rest < (143u << 23) ? finite : beyond)
                                      | (all >> 16 & 0x8000u));
}

template <class T>
T at(std::byte const* values, std::size_t index)
{
    T v;
    std::memcpy(&v, values + index * sizeof(T), sizeof(T));
    return v;
}

/// Where the table has the value of a code.
std::size_t codeIndex(std::uint8_t code) { return code; }
std::size_t codeIndex(std::uint16_t code) { return code; }
std::size_t codeIndex(half code) { return code.bits(); }

template <class T>
std::vector<float> makeTable(bool encoded)
{
    std::vector<float> table(std::size_t(1) << (8 * sizeof(T)));
    for (std::size_t i = 0; i < table.size(); ++i) {
        auto const bits = static_cast<std::uint16_t>(i);
        T code;
        if constexpr (std::is_same_v<T, half>)
            code.setBits(bits);
        else
            code = static_cast<T>(bits);
        table[i] = encoded ? decodeSrgb(valueOf(code)) : valueOf(code);
    }
    return table;
}

template <class T>
float const* tableOf(bool encoded)
{
    if (encoded) {
        static std::vector<float> const table = makeTable<T>(true);
        return table.data();
    }
    static std::vector<float> const table = makeTable<T>(false);
    return table.data();
}

/// Calls `f` with a value of the type's own C++ type.
template <class F>
auto withType(TexelType type, F&& f)
{
    switch (type) {
    case TexelType::UInt8: // NOLINT(bugprone-branch-clone): alike but for the type
        return f(std::uint8_t());
    case TexelType::UInt16:
        return f(std::uint16_t());
    case TexelType::Half:
        return f(half());
    case TexelType::Float:
        break;
    }
    return f(0.0f);
}

} // namespace

std::size_t TexelFormat::channelBytes() const
{
    return withType(type, [](auto v) { return sizeof v; });
}

template <class T>
float TexelCodec::value(std::byte const* texel, std::size_t channel) const
{
    T const code = at<T>(texel, channel);
    if constexpr (std::is_same_v<T, float>)
        return isEncoded(channel) ? decodeSrgb(code) : code;
    else
        return values_[channel][codeIndex(code)];
}

template <class T, int Channels>
Vec4f TexelCodec::readAs(TexelCodec const& codec, std::byte const* texel)
{
    auto const v = [&](std::size_t channel) { return codec.value<T>(texel, channel); };
    if constexpr (Channels <= 2) {
        float const grey = v(0);
        return {grey, grey, grey, Channels == 2 ? v(1) : 1.0f};
    } else {
        return {v(0), v(1), v(2), Channels == 4 ? v(3) : 1.0f};
    }
}

template <class T, int Channels>
Vec4f TexelCodec::sumOfBlockAs(TexelCodec const& codec, std::byte const* const* rows,
                               float const* across, float const* down)
{
    if constexpr (std::is_same_v<T, half> && Channels >= 3)
        if (!codec.format_.srgb)
            return Channels == 3 ? sumOfRgb(rows, across, down) : sumOfRgba(rows, across, down);
    constexpr std::size_t kBytes = sizeof(T) * Channels;
    Vec4f sum{0, 0, 0, 0};
    for (std::size_t j = 0; j < 4; ++j)
        for (std::size_t i = 0; i < 4; ++i)
            sum = sum + readAs<T, Channels>(codec, rows[j] + i * kBytes) * (across[i] * down[j]);
    return sum;
}

TexelCodec::TexelCodec(TexelFormat const& format)
    : format_(format)
{
    withType(format.type, [&]<class T>(T) {
        Vec4f (*const readers[])(TexelCodec const&, std::byte const*) = {
            readAs<T, 1>, readAs<T, 2>, readAs<T, 3>, readAs<T, 4>};
        read_ = readers[format.channels - 1];
        decltype(sumOfBlock_) const blocks[] = {sumOfBlockAs<T, 1>, sumOfBlockAs<T, 2>,
                                                sumOfBlockAs<T, 3>, sumOfBlockAs<T, 4>};
        sumOfBlock_ = blocks[format.channels - 1];
        if constexpr (!std::is_same_v<T, float>)
            for (std::size_t c = 0; c < values_.size(); ++c)
                values_[c] = tableOf<T>(isEncoded(c));
    });
}

template <class T>
void TexelCodec::decodeAs(std::byte const* texels, std::size_t count, float* values) const
{
    auto const channels = static_cast<std::size_t>(format_.channels);
    if constexpr (std::is_same_v<T, half>)
        if (!format_.srgb) {
            std::size_t const all = count * channels;
            std::size_t i = 0;
            for (; i + 4 <= all; i += 4) {
                auto const four =
                    _mm_loadl_epi64(reinterpret_cast<__m128i const*>(texels + i * sizeof(T)));
                _mm_storeu_ps(values + i,
                              valuesOfFinite(_mm_unpacklo_epi16(four, _mm_setzero_si128())));
            }
            for (; i < all; ++i)
                values[i] = valueOf(at<T>(texels, i));
            return;
        }
    std::size_t const bytes = format_.bytes();
    for (std::size_t i = 0; i < count; ++i)
        for (std::size_t c = 0; c < channels; ++c)
            values[i * channels + c] = value<T>(texels + i * bytes, c);
}

void TexelCodec::decode(std::byte const* texels, std::size_t count, float* values) const
{
    withType(format_.type, [&]<class T>(T) { decodeAs<T>(texels, count, values); });
}

template <class T>
void TexelCodec::encodeAs(float const* values, std::size_t count, std::byte* texels) const
{
    auto const channels = static_cast<std::size_t>(format_.channels);
    auto const write = [&](std::size_t first, std::size_t step, auto&& code) {
        for (std::size_t i = first; i < count * channels; i += step) {
            auto const v = code(values[i]);
            std::memcpy(texels + i * sizeof v, &v, sizeof v);
        }
    };
    if constexpr (std::is_integral_v<T>) {
        encodeIntegers<T>(values, count * channels, format_.srgb, texels);
        if (format_.srgb && format_.alphaChannel >= 0)
            write(static_cast<std::size_t>(format_.alphaChannel), channels, [](float v) {
                // NOLINTNEXTLINE(bugprone-incorrect-roundings): never negative
                return static_cast<T>(clamp01(v) * static_cast<float>(T(~T(0))) + 0.5f);
            });
    } else {
        for (std::size_t c = 0; format_.srgb && c < channels; ++c)
            write(c, channels, [&](float v) { return T(isEncoded(c) ? encodeSrgb(v) : v); });
        if (format_.srgb)
            return;
        if constexpr (std::is_same_v<T, half>)
            write(0, 1, nearestHalf);
        else
            std::memcpy(texels, values, count * channels * sizeof(float));
    }
}

void TexelCodec::encode(float const* values, std::size_t count, std::byte* texels) const
{
    withType(format_.type, [&]<class T>(T) { encodeAs<T>(values, count, texels); });
}

} // namespace zsi::host
