// SPDX-License-Identifier: Apache-2.0
/// How the light that leaves a hit is divided among the layers of a surface.
#pragma once

#include "runtime/arithmetic.h"

namespace zsi {

/// Of white light, per channel; the five add up to 1.
struct LayerAlbedo {
    Vec3f reflection; ///< mirrored
    Vec3f transmission; ///< comes from behind
    Vec3f highlight[2];
    Vec3f base; ///< of the opaque part, under everything; its colour is not in it
};

/// All arguments are in 0..1. Reflection comes first; of the rest, transparency divides; of the
/// opaque part the highlights take what they ask for while there is enough, else in proportion.
/// transparencyBlocks: reflection and highlights are on the opaque part alone.
inline LayerAlbedo layerAlbedo(Vec3f reflectivity, Vec3f transparency, Vec3f highlight,
                               Vec3f highlight2, bool transparencyBlocks)
{
    Vec3f const opaque = grey(1.0f) - transparency;
    if (transparencyBlocks) {
        reflectivity *= opaque;
        highlight *= opaque;
        highlight2 *= opaque;
    }
    Vec3f const refracted = grey(1.0f) - reflectivity;
    Vec3f const available = opaque * refracted;
    Vec3f const requested = highlight + highlight2;
    auto const scale = [](float available_, float requested_) {
        return requested_ > available_ ? available_ / requested_ : 1.0f;
    };
    Vec3f const scales(scale(available.x, requested.x), scale(available.y, requested.y),
                       scale(available.z, requested.z));
    LayerAlbedo a{
        reflectivity, transparency * refracted, {highlight * scales, highlight2 * scales}, {}};
    Vec3f const base = available - (a.highlight[0] + a.highlight[1]);
    a.base = {maxOf(base.x, 0.0f), maxOf(base.y, 0.0f), maxOf(base.z, 0.0f)};
    return a;
}

} // namespace zsi
