// SPDX-License-Identifier: Apache-2.0
/// Channels: a plain value, or a map through a UV transform times an amount.
#pragma once

#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// Colour of a channel whose map is on.
[[gnu::noinline]] inline Vec3f mappedColor(TextureSampler2D const& map, Mat3f const& transform,
                                           float amount, Vec2f uv)
{
    return rgb(map.lookup(transformUv(transform, uv))) * amount;
}

/// Value of a channel whose map is on: the red of the map.
[[gnu::noinline]] inline float mappedValue(TextureSampler2D const& map, Mat3f const& transform,
                                           float amount, Vec2f uv)
{
    return map.lookup(transformUv(transform, uv)).x * amount;
}

} // namespace zsi
