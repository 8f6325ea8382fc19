#include "materials/utility/corvid_Mtl_NormalsOnly.h"

#include "materials/utility/facedNormal.h"

namespace zsi {

void corvid_Mtl_NormalsOnly::shade(IShaderAPI*, ShadeState& state) const
{
    float const d = dot(state.I, facedNormal(state, reverseNormal, faceForward));
    Vec3f c;
    if (faceForward)
        c = Vec3f(0.05f, 0.8f, 0.05f) * std::fabs(d);
    else if (faceLight)
        c = Vec3f(0.45f, 0.65f, 0.35f) * std::fabs(d);
    else if (dot(state.I, reverseNormal ? -state.Ng : state.Ng) > 0.0f)
        // The side is the geometric normal's, d the shading normal's: where they disagree, black.
        c = {d, d, 0.0f};
    else
        c = {-0.05f * d, -0.05f * d, -0.8f * d};
    state.Ci = withAlpha(clamp01(c), 1.0f);
}

} // namespace zsi
