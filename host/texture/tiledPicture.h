// SPDX-License-Identifier: Apache-2.0
/// Pictures as look-ups read them: square tiles of the file's own depth, in levels of half the
/// size.
#pragma once

#include "texture/texelFormat.h"
#include "texture/tileMemory.h"

#include <functional>

namespace zsi::host {

class TiledPicture {
public:
    struct Level {
        int width, height;
        std::size_t tilesAcross;
        std::size_t offset; ///< into the block
    };

    Level const& level(int i) const { return levels_[static_cast<std::size_t>(i)]; }
    int levelCount() const { return static_cast<int>(levels_.size()); }

    /// Linear RGBA of a texel of `level`; 0 <= x < width, 0 <= y < height.
    Vec4f texel(Level const& level, int x, int y) const { return codec_.read(at(level, x, y)); }
    struct Place {
        int x, y;
    };
    /// The texels of four rows, four from each place on, times their weights, which are products of
    /// one of the column and one of the row; a row goes on at its other end.
    Vec4f sumOfBlock(Level const& level, Place const* rows, float const* across,
                     float const* down) const;
    /// Between texel centres; past an edge, what is at the other one, or at this one where that is
    /// chosen. s, t in [0, 1], t from the top.
    Vec4f bilinear(Level const& level, float s, float t) const;
    /// The same over a blend of the two levels whose texels are next to `width`, of which 1 is the
    /// picture. Up to the size of a texel it is `bilinear` of level 0.
    Vec4f filtered(float width, float s, float t) const;

    void clampEdges(bool across, bool down)
    {
        clampAcross_ = across;
        clampDown_ = down;
    }

private:
    friend class TiledPictureWriter;
    static constexpr int kTileBits = 6;
    static constexpr std::size_t kTile = std::size_t(1) << kTileBits, kTileMask = kTile - 1;

    std::byte const* at(Level const& level, int x, int y) const
    {
        auto const column = static_cast<std::size_t>(x), row = static_cast<std::size_t>(y);
        std::size_t const tile = (row >> kTileBits) * level.tilesAcross + (column >> kTileBits);
        std::size_t const within = (row & kTileMask) << kTileBits | (column & kTileMask);
        return block_->read(level.offset + ((tile << 2 * kTileBits) + within) * texelBytes_);
    }

    TiledPicture(TexelFormat const& format, int width, int height, bool levels, TileMemory& memory);

    TexelCodec codec_;
    std::size_t texelBytes_;
    std::vector<Level> levels_;
    std::unique_ptr<TileBlock> block_;
    bool clampAcross_ = false, clampDown_ = false;
};

/// Makes a picture from its rows from the top. Levels are means over area, of linear values.
class TiledPictureWriter {
public:
    /// Without `levels` there is level 0 alone.
    TiledPictureWriter(TexelFormat const& format, int width, int height, bool levels,
                       TileMemory& memory);
    ~TiledPictureWriter();

    void addRow(std::byte const* texels); ///< of the format
    void addLinearRow(float const* values); ///< the format's channels for each texel
    TiledPicture finish(); ///< after the last row

private:
    struct LevelWriter;
    // Of one level, and so of all that follow. Their linear values stand in its `LevelWriter`.
    void add(std::size_t index, std::byte const* texels);
    void addValues(std::size_t index);
    void addBelow(std::size_t index);

    TiledPicture picture_;
    std::vector<LevelWriter> writers_;
};

} // namespace zsi::host
