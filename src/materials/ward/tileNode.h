/// Brickwork over the unit square of a texture coordinate.
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

#define TILE_NODE(P, U, A)                                                              \
    U(Mat4f, xform, "(u, v, 1, 1) to the square that the bricks fill, 0..1")            \
    U(float, verticalCount, "rows of bricks in the square")                             \
    U(float, horizontalCount, "bricks of a row in the square")                          \
    U(float, colorVariance, "spread of the brightness of bricks, 0 none .. 1")          \
    U(float, fadeVariance, "second, independent spread of the brightness, 0 none .. 1") \
    U(float, horizontalGap, "mortar on each side of a brick, in cells; 0.5 hides it")   \
    U(float, verticalGap, "mortar above and below a brick, in cells; 0.5 hides it")     \
    U(float, edgeRoughness, "waviness of edges, in thousandths of the square")          \
    U(int, randomSeed, "chooses another wall")                                          \
    U(float, lineShift, "shift of every second row, in bricks, beyond the half brick")  \
    U(float, randomShift, "spread of the random shift of rows, in bricks")              \
    U(float, changeRow, "width of the bricks of edited rows, times; above 0")           \
    U(int, perRow, "every how many rows one is edited")                                 \
    U(bool, useColumnEdit, "edit columns")                                              \
    U(bool, useRowEdit, "edit rows")                                                    \
    U(float, changeColumn, "height of the bricks of edited columns, times; above 0")    \
    U(int, perColumn, "every how many columns one is edited")                           \
    U(int, holes, "n of n + 1 bricks are missing; 100 all, 0 none")                     \
    U(float, brickHeight, "height of a brick in cells; 0 and below count as 1")         \
    U(float, brickWidth, "width of a brick in cells; 0 and below count as 1")           \
    U(bool, repeatX, "go on beyond 0..1 in x; transparent there otherwise")             \
    U(bool, repeatY, "go on beyond 0..1 in y; transparent there otherwise")

struct TileParameters {
    TILE_NODE(ZSI_ROW_NONE, ZSI_ROW_UNSET, ZSI_ROW_NONE)
};

/// Members of a class whose network has a tile node.
struct TileFunctions {
    /// Bricks in mortar, each channel in 0..1; (0, 0, 0, 0) outside the square.
    /// footprint: width and height of the area of uv that the result stands for, over which the
    /// mortar is averaged.
    Vec4f f_Tile(IShaderAPI* api, ShadeState const& state, Vec2f uv, Vec3f p, Vec4f brickColor,
                 Vec4f mortarColor, TileParameters const& tile, Vec2f footprint) const;
};

/// Width and height in uv of what one pixel sees. tangent, bitangent: the attributes, in object
/// space, whose lengths are taken as object units per unit of u and v.
/// The cone of a pixel meets the surface in an ellipse that grows with the distance from the ray's
/// origin and, along the slope, with 1/cos (Igehy 1999, "Tracing Ray Differentials", sec. 3).
Vec2f uvFootprint(ShadeState const& state, Vec3f tangent, Vec3f bitangent);

} // namespace zsi
