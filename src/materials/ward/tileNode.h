// SPDX-License-Identifier: Apache-2.0
/// Brickwork over the unit square of a texture coordinate.
#pragma once

#include "materials/ward/network.h"
#include "runtime/shaderTable.h"

namespace zsi {

/// The numbers of a brickwork: X(U, path, type, name, meaning and facts).
#define TILE_SHAPE(X, U, path)                                                                    \
    X(U, path, float, verticalCount, "rows of bricks in the square", slider(1, 50))               \
    X(U, path, float, horizontalCount, "bricks of a row in the square", slider(1, 50))            \
    X(U, path, float, colorVariance, "spread of the brightness of bricks, 0 none .. 1",           \
      slider(0, 1))                                                                               \
    X(U, path, float, fadeVariance, "second, independent spread of the brightness, 0 none .. 1",  \
      slider(0, 1))                                                                               \
    X(U, path, float, horizontalGap, "mortar on each side of a brick, in cells; 0.5 hides it",    \
      slider(0, 0.5f))                                                                            \
    X(U, path, float, verticalGap, "mortar above and below a brick, in cells; 0.5 hides it",      \
      slider(0, 0.5f))                                                                            \
    X(U, path, float, edgeRoughness, "waviness of edges, in thousandths of the square",           \
      slider(0, 50))                                                                              \
    X(U, path, int, randomSeed, "chooses another wall", slider(0, 1000))                          \
    X(U, path, float, lineShift, "shift of every second row, in bricks, beyond the half brick",   \
      slider(0, 1))                                                                               \
    X(U, path, float, randomShift, "spread of the random shift of rows, in bricks", slider(0, 1)) \
    X(U, path, float, changeRow, "width of the bricks of edited rows, times; above 0",            \
      slider(0.1f, 4), when(#path "_Tile_useRowEdit"))                                            \
    X(U, path, int, perRow, "every how many rows one is edited", slider(1, 10),                   \
      when(#path "_Tile_useRowEdit"))                                                             \
    X(U, path, bool, useColumnEdit, "edit columns")                                               \
    X(U, path, bool, useRowEdit, "edit rows")                                                     \
    X(U, path, float, changeColumn, "height of the bricks of edited columns, times; above 0",     \
      slider(0.1f, 4), when(#path "_Tile_useColumnEdit"))                                         \
    X(U, path, int, perColumn, "every how many columns one is edited", slider(1, 10),             \
      when(#path "_Tile_useColumnEdit"))                                                          \
    X(U, path, int, holes, "n of n + 1 bricks are missing; 100 all, 0 none", slider(0, 100))      \
    X(U, path, float, brickHeight, "height of a brick in cells; 0 and below count as 1",          \
      slider(0, 4))                                                                               \
    X(U, path, float, brickWidth, "width of a brick in cells; 0 and below count as 1",            \
      slider(0, 4))                                                                               \
    X(U, path, bool, repeatX, "go on beyond 0..1 in x; transparent there otherwise")              \
    X(U, path, bool, repeatY, "go on beyond 0..1 in y; transparent there otherwise", groupEnd())

#define TILE_ROW(U, path, T, name, ...) U(T, path##_Tile_##name, __VA_ARGS__)
#define TILE_ROWS(U, path)                                                               \
    U(Mat4f, path##_Tile_xform, "(u, v, 1, 1) to the square that the bricks fill, 0..1", \
      group(#path "_Tile"))                                                              \
    TILE_SHAPE(TILE_ROW, U, path)

#define TILE_FIELD(U, path, T, name, ...) T name{};
struct TileShape {
    TILE_SHAPE(TILE_FIELD, ZSI_ROW_NONE, none)
};

#define TILE_FIELD_VALUE(U, path, T, name, ...) path##_Tile_##name,
#define TILE_VALUE(site, path, brickColor, mortarColor)                                         \
    tileNode(site, {brickColor, mortarColor}, path##_Tile_xform,                                \
             {TILE_SHAPE(TILE_FIELD_VALUE, ZSI_ROW_NONE, path)}, attribute_tangent(site.state), \
             attribute_bitangent(site.state))

/// Bricks in mortar, each channel in 0..1; (0, 0, 0, 0) outside the square.
/// footprint: width and height of the area of uv that the result stands for, over which the mortar
/// is averaged.
Vec4f f_Tile(IShaderAPI* api, ShadeState const& state, Vec2f uv, Vec3f p, Vec4f brickColor,
             Vec4f mortarColor, TileShape const& tile, Mat4f const& xform, Vec2f footprint);

/// Width and height in uv of what one pixel sees. tangent, bitangent: the attributes, in object
/// space, whose lengths are taken as object units per unit of u and v.
/// The cone of a pixel meets the surface in an ellipse that grows with the distance from the ray's
/// origin and, along the slope, with 1/cos (Igehy 1999, "Tracing Ray Differentials", sec. 3).
Vec2f uvFootprint(ShadeState const& state, Vec3f tangent, Vec3f bitangent);

/// tangent, bitangent: the attributes.
inline Vec4f tileNode(NetworkSite const& at, NodeInputs const& colors, Mat4f const& xform,
                      TileShape const& shape, Vec3f tangent, Vec3f bitangent)
{
    return f_Tile(at.api, at.state, at.uv, at.position, colors.first, colors.second, shape, xform,
                  uvFootprint(at.state, tangent, bitangent));
}

} // namespace zsi
