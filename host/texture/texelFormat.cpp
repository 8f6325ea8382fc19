// SPDX-License-Identifier: Apache-2.0
#include "texture/texelFormat.h"

#include <OpenImageIO/half.h>
#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
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

/// The value of a finite half by arithmetic, for many at a time: a table of all is larger than the
/// nearest cache.
float valueOfFinite(std::uint16_t bits)
{
    std::uint32_t const rest = bits & 0x7fffu;
    float const normal = std::bit_cast<float>((rest << 13) + (112u << 23));
    float const tiny = static_cast<float>(static_cast<std::int32_t>(rest)) * 0x1p-24f;
    return std::copysign(rest < 0x400u ? tiny : normal, (bits & 0x8000u) ? -1.0f : 1.0f);
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
void TexelCodec::addFourAs(TexelCodec const& codec, std::byte const* texels, float const* weights,
                           float scale, Vec4f& sum)
{
    auto const add = [&](Vec4f const& texel, float weight) {
        sum.x += texel.x * weight;
        sum.y += texel.y * weight;
        sum.z += texel.z * weight;
        sum.w += texel.w * weight;
    };
    if constexpr (std::is_same_v<T, half> && Channels >= 3)
        if (!codec.format_.srgb) {
            std::uint16_t bits[4 * Channels];
            std::memcpy(bits, texels, sizeof bits);
            float v[4 * Channels];
            for (int i = 0; i < 4 * Channels; ++i)
                v[i] = valueOfFinite(bits[i]);
            for (int i = 0; i < 4; ++i) {
                float const* const texel = v + i * Channels;
                add({texel[0], texel[1], texel[2], Channels == 4 ? texel[Channels - 1] : 1.0f},
                    weights[i] * scale);
            }
            return;
        }
    for (std::size_t i = 0; i < 4; ++i)
        add(readAs<T, Channels>(codec, texels + i * codec.format_.bytes()), weights[i] * scale);
}

TexelCodec::TexelCodec(TexelFormat const& format)
    : format_(format)
{
    withType(format.type, [&]<class T>(T) {
        Vec4f (*const readers[])(TexelCodec const&, std::byte const*) = {
            readAs<T, 1>, readAs<T, 2>, readAs<T, 3>, readAs<T, 4>};
        read_ = readers[format.channels - 1];
        void (*const adders[])(TexelCodec const&, std::byte const*, float const*, float, Vec4f&) = {
            addFourAs<T, 1>, addFourAs<T, 2>, addFourAs<T, 3>, addFourAs<T, 4>};
        addFour_ = adders[format.channels - 1];
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
