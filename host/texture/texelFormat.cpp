// SPDX-License-Identifier: Apache-2.0
#include "texture/texelFormat.h"

#include <OpenImageIO/half.h>
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <emmintrin.h>
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

/// The same over [0, 1], to a few millionths: over the square root of its argument the curve is
/// nearly straight, and short straight pieces do.
class FastSrgb {
public:
    float operator()(float linear) const
    {
        float const x = std::sqrt(linear) * kPieces;
        auto const i = static_cast<std::size_t>(x);
        return table_[i] + (table_[i + 1] - table_[i]) * (x - static_cast<float>(i));
    }

private:
    static constexpr int kPieces = 4096;
    static std::vector<float> const& table()
    {
        static std::vector<float> const table = [] {
            std::vector<float> t(kPieces + 2);
            for (int i = 0; i < kPieces + 2; ++i) {
                float const root = static_cast<float>(i) / kPieces;
                t[static_cast<std::size_t>(i)] = encodeSrgb(root * root);
            }
            return t;
        }();
        return table;
    }
    float const* table_ = table().data(); ///< looked for once, not for every value
};

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
    std::size_t const bytes = format_.bytes();
    for (std::size_t i = 0; i < count; ++i)
        for (std::size_t c = 0; c < channels; ++c)
            values[i * channels + c] = value<T>(texels + i * bytes, c);
}

void TexelCodec::decode(std::byte const* texels, std::size_t count, float* values) const
{
    withType(format_.type, [&]<class T>(T) { decodeAs<T>(texels, count, values); });
}

void TexelCodec::encode(float const* values, std::size_t count, std::byte* texels) const
{
    auto const channels = static_cast<std::size_t>(format_.channels);
    withType(format_.type, [&]<class T>(T) {
        FastSrgb const srgb;
        for (std::size_t c = 0; c < channels; ++c) {
            bool const encoded = isEncoded(c);
            for (std::size_t i = c; i < count * channels; i += channels) {
                float v = values[i];
                if (encoded)
                    v = v >= 0.0f && v <= 1.0f ? srgb(v) : encodeSrgb(v);
                T code;
                if constexpr (std::is_integral_v<T>)
                    // NOLINTNEXTLINE(bugprone-incorrect-roundings): never negative
                    code = static_cast<T>(clamp01(v) * static_cast<float>(T(~T(0))) + 0.5f);
                else
                    code = T(v);
                std::memcpy(texels + i * sizeof(T), &code, sizeof(T));
            }
        }
    });
}

} // namespace zsi::host
