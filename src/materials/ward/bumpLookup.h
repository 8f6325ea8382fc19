/// Heights of a network for the bump of the first normal channel.
#pragma once

#include "materials/physical/shadingFrame.h"
#include "materials/ward/network.h"

namespace zsi {

/// Members of a class whose normal channel is a network of noises and pictures.
struct BumpLookupFunctions {
    /// Heights (r + g + b) of `value(Site)` at `at` and one step away, for forward differences:
    /// along u and the tangent, then along v and the bitangent. The uv steps are those of a height
    /// map. Positions move by as many world units, so that patterns of the position, which know
    /// no uv, have a slope too.
    template <class Value>
    SLArray<float> f_bumpLookup(IShaderAPI*, ShadeState const&, Value const& value,
                                SLArray<Vec3f> const& frame, network::Site const& at) const
    {
        auto const height = [&](Vec2f uvStep, Vec3f step) {
            Vec4f const c = value(network::Site{at.uv + uvStep, at.position + step});
            return c.x + c.y + c.z;
        };
        return {{height({0.0f, 0.0f}, {0.0f, 0.0f, 0.0f}),
                 height({kBumpStep, 0.0f}, frame[0] * kBumpStep),
                 height({0.0f, kBumpStep}, frame[1] * kBumpStep)}};
    }
};

} // namespace zsi
