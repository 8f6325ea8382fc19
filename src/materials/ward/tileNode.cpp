// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/tileNode.h"

#include <zsi/vecmath.h>

namespace zsi {
namespace {

/// Angle of a pixel times the image height, for a vertical field of view of 45 degrees: the record
/// has the height but not the field.
constexpr float kFieldOfView = 0.8284271f; // 2 tan(22.5 degrees)

/// Waves of the rough edges per brick.
constexpr float kRoughnessFrequency = 17.0f;
constexpr float kRoughnessScale = 0.001f;

/// Brings `x` into 0..1, or tells that nothing is there.
bool intoSquare(float& x, bool repeat)
{
    if (x >= 0.0f && x <= 1.0f)
        return true;
    if (!repeat)
        return false;
    x = fract(x);
    return true;
}

/// Size of a cell of one axis.
float cellSize(float count, float gap, float brick)
{
    return (brick > 0.0f ? brick : 1.0f) / (count + gap);
}

/// A cell that the square can be divided by.
float divisor(float cell)
{
    constexpr float kFinest = 1e-12f; // far below what a picture shows
    return std::fabs(cell) > kFinest ? cell : kFinest;
}

/// Whether the cell with this index, from 1, is one that an edit of every n-th meets.
bool edited(bool use, float index, int n)
{
    if (!use || n < 1)
        return false;
    float const period = static_cast<float>(n);
    return index - period * std::floor(index / period) == 0.0f;
}

/// Average of a step from 0 to 1 at `edge` over a box of this width round `x`.
float filteredStep(float edge, float x, float width) { return clamp01((x - edge) / width + 0.5f); }

/// Share of brick, 0..1, in a box of this width (in cells) round `x` in 0..1, where cells are brick
/// but for `gap` at either end. A box that spans a cell or more sees the mean.
float brickCoverage(float x, float gap, float width)
{
    gap = maxOf(gap, 0.0f);
    if (gap >= 0.5f)
        return 0.0f;
    if (!(width < 1.0f))
        return 1.0f - 2.0f * gap;
    width = maxOf(width, 1e-7f);
    // The brick of this cell, and as much as the box may see of those before and behind.
    float const here = filteredStep(gap, x, width) - filteredStep(1.0f - gap, x, width);
    float const before = 1.0f - filteredStep(-gap, x, width);
    float const behind = filteredStep(1.0f + gap, x, width);
    return clamp01(before + here + behind);
}

float variation(float random, float spread)
{
    return maxOf(0.0f, (2.0f * random - 1.0f) * spread + 1.0f);
}

} // namespace

Vec4f f_Tile(IShaderAPI* api, ShadeState const&, Vec2f uv, Vec3f, Vec4f brickColor,
             Vec4f mortarColor, TileShape const& tile, Mat4f const& xform, Vec2f footprint)
{
    Vec3f const placed = transformPoint(xform, {uv.x, uv.y, 1.0f});
    float s = placed.x;
    float t = placed.y;
    if (!intoSquare(s, tile.repeatX) || !intoSquare(t, tile.repeatY))
        return {0.0f, 0.0f, 0.0f, 0.0f};

    float cellWidth = cellSize(tile.horizontalCount, tile.horizontalGap, tile.brickWidth);
    float cellHeight = cellSize(tile.verticalCount, tile.verticalGap, tile.brickHeight);
    float const columnIndex = std::floor(s / cellWidth) + 1.0f;
    float const rowIndex = std::floor(t / cellHeight) + 1.0f;
    if (edited(tile.useRowEdit, rowIndex, tile.perRow) && tile.changeRow > 0.0f)
        cellWidth *= tile.changeRow;
    if (edited(tile.useColumnEdit, columnIndex, tile.perColumn) && tile.changeColumn > 0.0f)
        cellHeight *= tile.changeColumn;
    cellWidth = divisor(cellWidth);
    cellHeight = divisor(cellHeight);

    if (tile.edgeRoughness != 0.0f) {
        Vec2f const at(s / (cellWidth / kRoughnessFrequency),
                       t / (cellHeight / kRoughnessFrequency));
        float const d = (2.0f * api->noise2D(&at) - 1.0f) * tile.edgeRoughness * kRoughnessScale;
        s += d;
        t += d;
    }

    float const seed = static_cast<float>(tile.randomSeed);
    float const rows = t / cellHeight;
    float const row = std::floor(rows);
    float columns = s / cellWidth;
    if (tile.randomShift != 0.0f) {
        float const r = api->cellNoise1D(seed + 0.5f + row);
        columns += (2.0f * r - 1.0f - 0.5f) * tile.randomShift;
    }
    if (fract(rows * 0.5f) > 0.5f)
        columns += tile.lineShift + 0.5f;

    float const ds = std::fabs(xform.m[0]) * footprint.x + std::fabs(xform.m[4]) * footprint.y;
    float const dt = std::fabs(xform.m[1]) * footprint.x + std::fabs(xform.m[5]) * footprint.y;
    float mask = brickCoverage(fract(columns), tile.horizontalGap, ds / std::fabs(cellWidth))
        * brickCoverage(fract(rows), tile.verticalGap, dt / std::fabs(cellHeight));

    float shade = 1.0f;
    bool const someHoles = tile.holes > 0 && tile.holes < 100;
    if (tile.holes >= 100) {
        mask = 0.0f;
    } else if (someHoles || tile.colorVariance != 0.0f || tile.fadeVariance != 0.0f) {
        float column = std::floor(columns);
        if (tile.repeatX) {
            // A brick that is cut at one end of the square goes on at the other.
            float const inRow = maxOf(1.0f, std::floor(1.0f / std::fabs(cellWidth) + 0.5f));
            column -= inRow * std::floor(column / inRow);
        }
        Vec3f const cell(column + 0.5f, row + 0.5f, seed + 0.5f);
        Vec3f const random = api->cellNoise3D(&cell);
        if (someHoles && random.x > 1.0f / static_cast<float>(tile.holes + 1))
            mask = 0.0f;
        shade = variation(random.y, tile.colorVariance) * variation(random.z, tile.fadeVariance);
    }

    Vec4f const c = mortarColor * (1.0f - mask) + brickColor * (shade * mask);
    return {clamp01(c.x), clamp01(c.y), clamp01(c.z), clamp01(c.w)};
}

Vec2f uvFootprint(ShadeState const& state, Vec3f tangent, Vec3f bitangent)
{
    if (state.imageHeight < 1)
        return {0.0f, 0.0f};
    float const pixel =
        length(state.P - state.E) * kFieldOfView / static_cast<float>(state.imageHeight);
    float const cosine = dot(state.I, state.Ng);
    auto const along = [&](Vec3f axis) {
        Vec3f const world = transformDirection(state.objectToWorld, axis);
        float const perUnit = length(world);
        if (!(perUnit > 0.0f))
            return pixel;
        float const slope = dot(world, state.I) / (perUnit * cosine);
        return pixel * std::sqrt(1.0f + slope * slope) / perUnit;
    };
    return {along(tangent), along(bitangent)};
}

} // namespace zsi
