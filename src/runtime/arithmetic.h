// SPDX-License-Identifier: Apache-2.0
/// Constants and clamps that the shaders share, beside the contract's vector arithmetic.
#pragma once

#include <zsi/vecmath.h>

namespace zsi {

inline constexpr float kPi = 3.14159265f;
inline constexpr float kInvPi = 0.318309886f;

inline constexpr Vec3f kBlack(0.0f, 0.0f, 0.0f);

/// [lo, hi]; NaN becomes lo. `clamp` and `clamp01` let it through.
constexpr float saturate(float x, float lo, float hi) { return minOf(maxOf(x, lo), hi); }
/// [0, 1]; NaN becomes 0.
constexpr float saturate(float x) { return saturate(x, 0.0f, 1.0f); }
constexpr Vec3f saturate(Vec3f c) { return {saturate(c.x), saturate(c.y), saturate(c.z)}; }

} // namespace zsi
