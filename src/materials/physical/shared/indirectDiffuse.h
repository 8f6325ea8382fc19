// SPDX-License-Identifier: Apache-2.0
/// Indirect light on a diffuse layer.
#pragma once

#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// weight x arriving x occlusion; the host is asked only where the product is not black already.
inline Vec3f occludedDiffuse(IShaderAPI* api, Vec3f weight, Vec3f arriving, Vec3f P, Vec3f N)
{
    if (arriving == Vec3f(0.0f, 0.0f, 0.0f))
        return arriving;
    Vec3f const lit = weight * arriving;
    return lit * api->occlusion(&P, &N, maxComponent(lit));
}

/// Member for the classes that gather indirect light.
struct IndirectDiffuseFunctions {
    /// weight: the diffuse colour. weight x (ambient + indirect) x occlusion; the services are
    /// asked only as far as the result can still differ from black.
    Vec3f f_rtIndirectDiffuse(IShaderAPI* api, ShadeState const&, Vec3f weight, Vec3f const& P,
                              Vec3f const& N) const
    {
        if (weight == Vec3f(0.0f, 0.0f, 0.0f))
            return weight;
        // Two statements: as operands of one sum they would be asked in any order.
        Vec3f const ambient = api->ambientLight(&P, &N);
        Vec3f const arriving = ambient + api->indirectDiffuse(&P, &N, maxComponent(weight));
        return occludedDiffuse(api, weight, arriving, P, N);
    }
};

} // namespace zsi
