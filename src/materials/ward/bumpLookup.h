/// Heights of a network for the bump of the first normal channel.
#pragma once

#include "materials/physical/shared/shadingFrame.h"
#include "materials/ward/network.h"

namespace zsi {

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

/// Members of a class whose normal channel is a network of noises and pictures.
struct BumpLookupFunctions {
    /// Heights (r + g + b) of `value(Site)` at `at` and one step away, for forward differences:
    /// along u and the tangent, then along v and the bitangent. The uv steps are those of a height
    /// map. Positions move by as many of their own units, so that patterns of the position, which
    /// know no uv, have a slope too.
    template <class Value>
    SLArray<float> f_bumpLookup(IShaderAPI*, ShadeState const& state, Value const& value,
                                SLArray<Vec3f> const& frame, network::Site const& at) const
    {
        auto const moved = [&](Vec3f along) {
            return objectDirection(state.objectToWorld, along) * kBumpStep;
        };
        auto const height = [&](Vec2f uvStep, Vec3f step) {
            Vec4f const c = value(network::Site{at.uv + uvStep, at.position + step});
            return c.x + c.y + c.z;
        };
        return {{height({0.0f, 0.0f}, {0.0f, 0.0f, 0.0f}),
                 height({kBumpStep, 0.0f}, moved(frame[0])),
                 height({0.0f, kBumpStep}, moved(frame[1]))}};
    }
};

} // namespace zsi
