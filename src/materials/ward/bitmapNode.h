// SPDX-License-Identifier: Apache-2.0
/// A picture laid along the uv attribute or on a box round the reference position.
#pragma once

#include "materials/physical/shared/masking.h"
#include "materials/ward/network.h"

namespace zsi {

#define BITMAP_ROWS(U, path)                                                                    \
    U(Mat4f, path##_UnifiedBitmap_xform,                                                        \
      "uv, or the reference position if isCube, to the picture", group(#path "_UnifiedBitmap"), \
      when(#path "_UnifiedBitmap_texture"))                                                     \
    U(TextureSampler2D, path##_UnifiedBitmap_texture, "the picture, linear RGBA")               \
    U(float, path##_UnifiedBitmap_amount, "multiplier of the picture, alpha included",          \
      slider(0, 2))                                                                             \
    U(bool, path##_UnifiedBitmap_isCube,                                                        \
      "lay the picture on the six faces of a box, not along uv", groupEnd())

#define BITMAP_VALUE(site, path)                                               \
    bitmapNode(site, path##_UnifiedBitmap_xform, path##_UnifiedBitmap_texture, \
               path##_UnifiedBitmap_amount, path##_UnifiedBitmap_isCube)

inline Vec4f bitmapNode(NetworkSite const& at, Mat4f const& xform, TextureSampler2D const& texture,
                        float amount, bool isCube)
{
    Vec2f picture;
    if (isCube) {
        picture = maskCoordinate(kMaskBox, transformPoint(xform, at.position),
                                 transformDirection(xform, at.state.Nref), 1.0f);
    } else {
        Vec3f const q = transformPoint(xform, {at.uv.x, at.uv.y, 1.0f});
        picture = {q.x, q.y};
    }
    return texture.lookup(picture) * amount;
}

} // namespace zsi
