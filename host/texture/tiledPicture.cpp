// SPDX-License-Identifier: Apache-2.0
#include "texture/tiledPicture.h"

#include "texture/areaShares.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

/// One step past an edge.
int beyond(int i, int n, bool clamp)
{
    if (i >= 0 && i < n) [[likely]]
        return i;
    return (i < 0) == clamp ? 0 : n - 1;
}

} // namespace

TiledPicture::TiledPicture(TexelFormat const& format, int width, int height, bool levels,
                           TileMemory& memory)
    : codec_(format)
    , texelBytes_(format.bytes())
{
    std::size_t size = 0;
    for (;; width = std::max(1, width / 2), height = std::max(1, height / 2)) {
        auto const tiles = [](int n) { return (static_cast<std::size_t>(n) + kTileMask) / kTile; };
        levels_.push_back({width, height, tiles(width), size});
        size += tiles(width) * tiles(height) * kTile * kTile * texelBytes_;
        if (!levels || (width == 1 && height == 1))
            break;
    }
    block_ = memory.allocate(size);
}

Vec4f TiledPicture::sumOfBlock(Level const& level, Place const* rows, float const* across,
                               float const* down) const
{
    constexpr std::size_t kLargestTexel = 16;
    std::byte copies[4][4 * kLargestTexel];
    std::byte const* texels[4];
    for (int j = 0; j < 4; ++j) {
        auto const [x, y] = rows[j];
        // A row of a tile is in memory side by side.
        if ((static_cast<std::size_t>(x) & kTileMask) + 3 < kTile && x + 3 < level.width) {
            texels[j] = at(level, x, y);
            continue;
        }
        for (int i = 0; i < 4; ++i)
            std::memcpy(copies[j] + static_cast<std::size_t>(i) * texelBytes_,
                        at(level, (x + i) % level.width, y), texelBytes_);
        texels[j] = copies[j];
    }
    return codec_.sumOfBlock(texels, across, down);
}

Vec4f TiledPicture::bilinear(Level const& level, float s, float t) const
{
    float const x = s * static_cast<float>(level.width) - 0.5f;
    float const y = t * static_cast<float>(level.height) - 0.5f;
    float const left = std::floor(x), top = std::floor(y);
    float const fx = x - left, fy = y - top;
    int const x0 = beyond(static_cast<int>(left), level.width, clampAcross_);
    int const x1 = beyond(static_cast<int>(left) + 1, level.width, clampAcross_);
    int const y0 = beyond(static_cast<int>(top), level.height, clampDown_);
    int const y1 = beyond(static_cast<int>(top) + 1, level.height, clampDown_);
    Vec4f const above = texel(level, x0, y0) * (1.0f - fx) + texel(level, x1, y0) * fx;
    Vec4f const below = texel(level, x0, y1) * (1.0f - fx) + texel(level, x1, y1) * fx;
    return above * (1.0f - fy) + below * fy;
}

Vec4f TiledPicture::filtered(float width, float s, float t) const
{
    Level const& first = levels_.front();
    float const texels =
        width * std::sqrt(static_cast<float>(first.width) * static_cast<float>(first.height));
    if (!(texels > 1.0f))
        return bilinear(first, s, t);
    auto const last = static_cast<float>(levels_.size() - 1);
    float const at = minOf(std::log2(texels), last);
    float const below = std::floor(at), share = at - below;
    auto const i = static_cast<std::size_t>(below);
    Vec4f const fine = bilinear(levels_[i], s, t);
    if (!(share > 0.0f))
        return fine;
    return fine * (1.0f - share) + bilinear(levels_[i + 1], s, t) * share;
}

namespace {

/// Means of two by two texels of two rows: `count` texels.
template <std::size_t Channels>
void halve(float const* upper, float const* lower, std::size_t count, float* means)
{
    for (std::size_t x = 0; x < count; ++x)
        for (std::size_t c = 0; c < Channels; ++c) {
            std::size_t const left = 2 * x * Channels + c, right = left + Channels;
            means[x * Channels + c] =
                0.25f * ((upper[left] + upper[right]) + (lower[left] + lower[right]));
        }
}

constexpr std::array kHalve = {halve<1>, halve<2>, halve<3>, halve<4>};

} // namespace

/// One level while it is made.
struct TiledPictureWriter::LevelWriter {
    TiledPicture::Level level;
    std::size_t channels;
    int row = 0; ///< the next
    std::vector<std::byte> tiles; ///< a row of tiles
    std::array<std::vector<float>, 2> rows; ///< linear values of the last rows, by turns
    std::vector<float> narrow; ///< a row of the level above at this one's width
    std::vector<std::byte> encoded;

    LevelWriter(TiledPicture::Level const& level_, TexelFormat const& format)
        : level(level_)
        , channels(static_cast<std::size_t>(format.channels))
        , tiles(level.tilesAcross * TiledPicture::kTile * TiledPicture::kTile * format.bytes())
        , narrow(static_cast<std::size_t>(level.width) * channels)
        , encoded(narrow.size() * format.channelBytes())
    {
        rows.fill(narrow);
    }

    std::vector<float>& values() { return rows[static_cast<std::size_t>(row) % 2]; }
    std::vector<float>& valuesBefore() { return rows[static_cast<std::size_t>(row + 1) % 2]; }

    /// `narrow` from a row of `width` texels: means over area.
    void makeNarrow(float const* above, int width)
    {
        auto const from = static_cast<std::size_t>(width);
        auto const to = static_cast<std::size_t>(level.width);
        std::fill(narrow.begin(), narrow.end(), 0.0f);
        for (std::size_t i = 0; i < from; ++i)
            forAreaShares(i, from, to, [&](std::size_t x, float share) {
                for (std::size_t c = 0; c < channels; ++c)
                    narrow[x * channels + c] += share * above[i * channels + c];
            });
    }
};

TiledPictureWriter::TiledPictureWriter(TexelFormat const& format, int width, int height,
                                       bool levels, TileMemory& memory)
    : picture_(format, width, height, levels, memory)
{
    for (TiledPicture::Level const& level : picture_.levels_)
        writers_.emplace_back(level, format);
}

TiledPictureWriter::~TiledPictureWriter() = default;

void TiledPictureWriter::addRow(std::byte const* texels)
{
    LevelWriter& first = writers_.front();
    if (writers_.size() > 1)
        picture_.codec_.decode(texels, static_cast<std::size_t>(first.level.width),
                               first.values().data());
    add(0, texels);
}

void TiledPictureWriter::addLinearRow(float const* values)
{
    LevelWriter& first = writers_.front();
    std::copy_n(values, first.values().size(), first.values().begin());
    addValues(0);
}

void TiledPictureWriter::addValues(std::size_t index)
{
    LevelWriter& writer = writers_[index];
    picture_.codec_.encode(writer.values().data(), static_cast<std::size_t>(writer.level.width),
                           writer.encoded.data());
    add(index, writer.encoded.data());
}

void TiledPictureWriter::add(std::size_t index, std::byte const* texels)
{
    LevelWriter& writer = writers_[index];
    TiledPicture::Level const& level = writer.level;
    std::size_t const bytes = picture_.texelBytes_;
    auto const row = static_cast<std::size_t>(writer.row);
    auto const width = static_cast<std::size_t>(level.width);
    constexpr std::size_t kTile = TiledPicture::kTile;
    for (std::size_t x = 0; x < width; x += kTile)
        std::memcpy(writer.tiles.data() + (x + row % kTile) * kTile * bytes, texels + x * bytes,
                    std::min(kTile, width - x) * bytes);
    if (row % kTile == kTile - 1 || writer.row + 1 == level.height)
        picture_.block_->write(level.offset + row / kTile * writer.tiles.size(),
                               writer.tiles.data(), writer.tiles.size());
    if (index + 1 < writers_.size())
        addBelow(index);
    ++writer.row;
}

void TiledPictureWriter::addBelow(std::size_t index)
{
    LevelWriter& writer = writers_[index];
    LevelWriter& next = writers_[index + 1];
    auto const row = static_cast<std::size_t>(writer.row);
    if (writer.level.width == 2 * next.level.width
        && writer.level.height == 2 * next.level.height) {
        if (row % 2 == 0)
            return;
        kHalve[writer.channels - 1](writer.valuesBefore().data(), writer.values().data(),
                                    static_cast<std::size_t>(next.level.width),
                                    next.values().data());
        return addValues(index + 1);
    }
    next.makeNarrow(writer.values().data(), writer.level.width);
    auto const from = static_cast<std::size_t>(writer.level.height);
    auto const to = static_cast<std::size_t>(next.level.height);
    forAreaShares(row, from, to, [&](std::size_t y, float share) {
        std::vector<float>& sums = next.values();
        for (std::size_t i = 0; i < sums.size(); ++i)
            sums[i] += share * next.narrow[i];
        if (!endsArea(y, row, from, to))
            return; // more of it is to come
        addValues(index + 1);
        std::fill(next.values().begin(), next.values().end(), 0.0f); // another one's turn
    });
}

TiledPicture TiledPictureWriter::finish()
{
    picture_.block_->seal();
    return std::move(picture_);
}

} // namespace zsi::host
