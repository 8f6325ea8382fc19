/// How the light that leaves a hit is shared out among the layers of a surface.
#pragma once

#include "runtime/arithmetic.h"

namespace zsi {

/// Per channel; the five add up to 1.
struct SurfaceShares {
    Vec3f reflection; ///< mirrored
    Vec3f clear; ///< comes from behind
    Vec3f highlight[2];
    Vec3f base; ///< of the opaque part, under everything
};

/// All arguments are shares. Reflection comes first; of the rest, transparency divides; of the
/// opaque part the highlights take what they ask for while there is enough, else in proportion.
/// transparencyBlocks: reflection and highlights are on the opaque part alone.
inline SurfaceShares shareOut(Vec3f reflectivity, Vec3f transparency, Vec3f highlight,
                              Vec3f highlight2, bool transparencyBlocks)
{
    Vec3f const kOne(1.0f, 1.0f, 1.0f);
    Vec3f const opaque = kOne - transparency;
    if (transparencyBlocks) {
        reflectivity *= opaque;
        highlight *= opaque;
        highlight2 *= opaque;
    }
    Vec3f const under = kOne - reflectivity;
    Vec3f const room = opaque * under;
    Vec3f const asked = highlight + highlight2;
    auto const granted = [](float room_, float asked_) {
        return asked_ > room_ ? room_ / asked_ : 1.0f;
    };
    Vec3f const part(granted(room.x, asked.x), granted(room.y, asked.y), granted(room.z, asked.z));
    SurfaceShares s{reflectivity, transparency * under, {highlight * part, highlight2 * part}, {}};
    s.base = room - (s.highlight[0] + s.highlight[1]);
    s.base = {maxOf(s.base.x, 0.0f), maxOf(s.base.y, 0.0f), maxOf(s.base.z, 0.0f)};
    return s;
}

} // namespace zsi
