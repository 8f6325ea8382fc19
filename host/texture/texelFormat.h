// SPDX-License-Identifier: Apache-2.0
/// How texels lie in memory: at the depth of their file, made linear when they are looked up.
#pragma once

#include <array>
#include <cstddef>
#include <zsi/types.h>

namespace zsi::host {

enum class TexelType { UInt8, UInt16, Half, Float };

struct TexelFormat {
    TexelType type = TexelType::Float;
    int channels = 4; ///< 1: grey, 2: grey and alpha, 3: RGB, 4: RGBA
    bool srgb = false; ///< encoded after IEC 61966-2-1, but for the alpha channel
    int alphaChannel = -1;

    std::size_t channelBytes() const;
    std::size_t bytes() const { return channelBytes() * static_cast<std::size_t>(channels); }
};

/// Reads and writes texels of a format as linear values.
class TexelCodec {
public:
    explicit TexelCodec(TexelFormat const& format);

    TexelFormat const& format() const { return format_; }

    /// RGBA: grey is repeated, alpha is 1 where there is none.
    Vec4f read(std::byte const* texel) const { return read_(*this, texel); }
    /// Four rows of four texels side by side, each times its weights: `across[column] down[row]`.
    Vec4f sumOfBlock(std::byte const* const* rows, float const* across, float const* down) const
    {
        return sumOfBlock_(*this, rows, across, down);
    }
    /// A row of texels to `channels` values for each.
    void decode(std::byte const* texels, std::size_t count, float* values) const;
    /// The nearest that the format holds.
    void encode(float const* values, std::size_t count, std::byte* texels) const;

private:
    template <class T>
    float value(std::byte const* texel, std::size_t channel) const;
    template <class T, int Channels>
    static Vec4f readAs(TexelCodec const& codec, std::byte const* texel);
    template <class T, int Channels>
    static Vec4f sumOfBlockAs(TexelCodec const& codec, std::byte const* const* rows,
                              float const* across, float const* down);
    template <class T>
    void decodeAs(std::byte const* texels, std::size_t count, float* values) const;
    template <class T>
    void encodeAs(float const* values, std::size_t count, std::byte* texels) const;

    bool isEncoded(std::size_t channel) const
    {
        return format_.srgb && static_cast<int>(channel) != format_.alphaChannel;
    }

    TexelFormat format_;
    Vec4f (*read_)(TexelCodec const&, std::byte const*);
    Vec4f (*sumOfBlock_)(TexelCodec const&, std::byte const* const*, float const*, float const*);
    std::array<float const*, 4> values_{}; ///< of each channel: linear values of all codes
};

} // namespace zsi::host
