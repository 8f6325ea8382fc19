/// Brickwork over the unit square of a texture coordinate.
#pragma once

#include "materials/ward/network.h"
#include "runtime/shaderTable.h"

namespace zsi {

/// The numbers of a brickwork, names behind `prefix`.
#define TILE_SHAPE_ROWS(U, prefix)                                                              \
    U(float, prefix##verticalCount, "rows of bricks in the square")                             \
    U(float, prefix##horizontalCount, "bricks of a row in the square")                          \
    U(float, prefix##colorVariance, "spread of the brightness of bricks, 0 none .. 1")          \
    U(float, prefix##fadeVariance, "second, independent spread of the brightness, 0 none .. 1") \
    U(float, prefix##horizontalGap, "mortar on each side of a brick, in cells; 0.5 hides it")   \
    U(float, prefix##verticalGap, "mortar above and below a brick, in cells; 0.5 hides it")     \
    U(float, prefix##edgeRoughness, "waviness of edges, in thousandths of the square")          \
    U(int, prefix##randomSeed, "chooses another wall")                                          \
    U(float, prefix##lineShift, "shift of every second row, in bricks, beyond the half brick")  \
    U(float, prefix##randomShift, "spread of the random shift of rows, in bricks")              \
    U(float, prefix##changeRow, "width of the bricks of edited rows, times; above 0")           \
    U(int, prefix##perRow, "every how many rows one is edited")                                 \
    U(bool, prefix##useColumnEdit, "edit columns")                                              \
    U(bool, prefix##useRowEdit, "edit rows")                                                    \
    U(float, prefix##changeColumn, "height of the bricks of edited columns, times; above 0")    \
    U(int, prefix##perColumn, "every how many columns one is edited")                           \
    U(int, prefix##holes, "n of n + 1 bricks are missing; 100 all, 0 none")                     \
    U(float, prefix##brickHeight, "height of a brick in cells; 0 and below count as 1")         \
    U(float, prefix##brickWidth, "width of a brick in cells; 0 and below count as 1")           \
    U(bool, prefix##repeatX, "go on beyond 0..1 in x; transparent there otherwise")             \
    U(bool, prefix##repeatY, "go on beyond 0..1 in y; transparent there otherwise")

#define TILE_ROWS(U, path)                                                               \
    U(Mat4f, path##_Tile_xform, "(u, v, 1, 1) to the square that the bricks fill, 0..1") \
    TILE_SHAPE_ROWS(U, path##_Tile_)

#define TILE_FIELD_VALUE(T, name, meaning) name,
#define TILE_VALUE(site, path, brickColor, mortarColor)                                        \
    tileNode(site, {brickColor, mortarColor}, path##_Tile_xform,                               \
             {TILE_SHAPE_ROWS(TILE_FIELD_VALUE, path##_Tile_)}, attribute_tangent(site.state), \
             attribute_bitangent(site.state))

struct TileShape {
    TILE_SHAPE_ROWS(ZSI_ROW_UNSET, )
};

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
