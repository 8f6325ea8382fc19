/// The normal that the utility materials shade with.
#pragma once

#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// `N`, reversed on request, then turned away from the far side on request: the test takes the
/// geometric normal, so a bent shading normal never decides the side.
inline Vec3f facedNormal(ShadeState const& state, bool reverseNormal, bool faceForward)
{
    Vec3f const n = reverseNormal ? -state.N : state.N;
    return faceForward && dot(state.Ng, state.I) > 0.0f ? -n : n;
}

/// Writes the colour and leaves the alpha.
inline void writeRgb(ShadeState& state, Vec3f c)
{
    state.Ci.x = c.x;
    state.Ci.y = c.y;
    state.Ci.z = c.z;
}

} // namespace zsi
