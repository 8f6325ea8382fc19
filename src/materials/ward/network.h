// SPDX-License-Identifier: Apache-2.0
/// Networks of procedural textures: where they are asked, and the bump that they make.
///
/// A network is written out in its class: `<NODE>_ROWS(U, path)` states the parameters of a node,
/// `<NODE>_VALUE(site, path, inputs...)` is its value. `path` is the beginning of the parameters'
/// names, which tells the node's place: "_ward_", the channel, and for each node on the way to this
/// one its type and the input that it feeds.
#pragma once

#include "materials/physical/shared/shadingFrame.h"

namespace zsi {

/// Where a network is asked for its value.
struct NetworkSite {
    IShaderAPI* api;
    ShadeState const& state;
    Vec2f uv;
    Vec3f position; ///< reference position, `Pref`
};

/// Values of the two nodes that feed one. Written in braces, they are asked for in this order.
struct NodeInputs {
    Vec4f first, second;
};

/// Unit vector of a world direction in the space of the object, where reference positions live.
/// Rows of the inverse matrix are cross products of the rows, but for the determinant.
inline Vec3f objectDirection(Mat4f const& objectToWorld, Vec3f d)
{
    float const* m = objectToWorld.m;
    Vec3f const x(m[0], m[1], m[2]), y(m[4], m[5], m[6]), z(m[8], m[9], m[10]);
    Vec3f const yz = cross(y, z);
    Vec3f const v(dot(d, yz), dot(d, cross(z, x)), dot(d, cross(x, y)));
    return normalize(dot(x, yz) < 0.0f ? -v : v);
}

/// Heights (r + g + b) of `value(NetworkSite)` at uv and position and one step away, for forward
/// differences: along u and the tangent, then along v and the bitangent. The uv steps are those of
/// a height map. Positions move by as many of their own units, so that patterns of the position,
/// which know no uv, have a slope too.
template <class Value>
SLArray<float> f_bumpLookup(IShaderAPI* api, ShadeState const& state, Value const& value,
                            SLArray<Vec3f> const& frame, Vec2f uv, Vec3f position)
{
    auto const moved = [&](Vec3f along) {
        return objectDirection(state.objectToWorld, along) * kBumpStep;
    };
    auto const height = [&](Vec2f uvStep, Vec3f step) {
        Vec4f const c = value(NetworkSite{api, state, uv + uvStep, position + step});
        return c.x + c.y + c.z;
    };
    return {{height({0.0f, 0.0f}, {0.0f, 0.0f, 0.0f}), height({kBumpStep, 0.0f}, moved(frame[0])),
             height({0.0f, kBumpStep}, moved(frame[1]))}};
}

} // namespace zsi
