// What the parameters and textures of the legacy material say at a hit.
#include "environments/mappedBump.h"
#include "materials/legacy/MarlowLegacy.h"
#include "materials/legacy/curveFresnel.h"
#include "materials/physical/shared/facedNormal.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"
#include "runtime/builtins.h"

namespace zsi {
namespace {

/// Width of the lobes that rays which gather light see at least: a narrow highlight that one of
/// many such rays meets would be a speck in the picture. Kaplanyan and Dachsbacher 2013, "Path
/// Space Regularization for Holistic and Robust Light Transport".
constexpr float kGatheredWidth = 0.3f;

/// What the mapping tells beside the colour, for channels that do not ask.
struct Projection {
    Vec3i boxAxes{0, 1, 2};
    Vec3f tangentU{0.0f, 0.0f, 0.0f}, tangentV{0.0f, 0.0f, 0.0f};
};

} // namespace

Vec3f MarlowLegacy::f_beersUnabsorbedRGB(IShaderAPI*, ShadeState const&, Vec3f absorbance,
                                         float distance) const
{
    auto const left = [distance](float a) { return a == -1.0f ? 0.0f : std::exp(-distance * a); };
    return {left(absorbance.x), left(absorbance.y), left(absorbance.z)};
}

/// 1 removes the surface.
Vec3f MarlowLegacy::mask(IShaderAPI* api, ShadeState const& state) const
{
    Projection p;
    Vec3f const m = rgb(f_evalMapping(api, state, maskingMode, triplanarXY, maskingColor,
                                      maskingTexture, maskingTextureMatrix, maskingAngularRepeat,
                                      state.Pref, state.Nref, maskingFromAlpha, attribute_uv(state),
                                      p.boxAxes, p.tangentU, p.tangentV, maskingUVMatrix));
    return maskingInvertTexture && maskingMode > 0 ? grey(1.0f) - m : m;
}

Vec4f MarlowLegacy::diffuse(IShaderAPI* api, ShadeState const& state, bool alphaAsColor) const
{
    Projection p;
    return f_evalMapping(api, state, diffuseMode, triplanarXY, diffuseColor, diffuseTexture,
                         diffuseTextureMatrix, diffuseAngularRepeat, state.Pref, state.Nref,
                         alphaAsColor, attribute_uv(state), p.boxAxes, p.tangentU, p.tangentV,
                         diffuseUVMatrix);
}

/// 1 is clear.
Vec3f MarlowLegacy::transparency(IShaderAPI* api, ShadeState const& state) const
{
    Vec3f t;
    if (transparencyFromDiffuse) {
        t = rgb(diffuse(api, state, diffuseTexture.texture != nullptr));
    } else {
        Projection p;
        t = rgb(f_evalMapping(
            api, state, transparencyMode, triplanarXY, transparencyColor, transparencyTexture,
            transparencyTextureMatrix, transparencyAngularRepeat, state.Pref, state.Nref, false,
            attribute_uv(state), p.boxAxes, p.tangentU, p.tangentV, transparencyUVMatrix));
    }
    return transparencyInvert ? grey(1.0f) - t : t;
}

/// Share that is mirrored. cosine: of the viewer, 0..1.
Vec3f MarlowLegacy::reflectance(float cosine) const
{
    if (unlitSurface || reflectivityColor == kBlack)
        return kBlack;
    return saturate(useUniformReflectivity ? reflectivityColor
                                           : reflectivityColor * curveFresnel(cosine, fresnel));
}

/// The normal is reversed first, so that the relief rises on the side that counts as outside, then
/// bent, then faced.
MarlowLegacy::Surface MarlowLegacy::surface(IShaderAPI* api, ShadeState const& state) const
{
    Vec3f n = facedNormal(state, reverseNormal, false);
    if (bumpMode > kMapColor && bumpDepth != 0.0f && bumpTexture.texture) {
        BumpPlacement placement{bumpMode,     bumpTextureMatrix,        bumpTextureMatrixInverse,
                                bumpUVMatrix, attribute_tangent(state), attribute_bitangent(state)};
        Vec4f const texel =
            f_evalMapping(api, state, bumpMode, triplanarXY, {}, bumpTexture, bumpTextureMatrix,
                          bumpAngularRepeat, state.Pref, state.Nref, false, attribute_uv(state),
                          placement.boxAxes, placement.tangentU, placement.tangentV, bumpUVMatrix);
        n = bendNormal(placement, texel, bumpDepth, n, state.objectToWorld);
    }
    if (faceForward && dot(state.Ng, state.I) > 0.0f)
        n = -n;
    Surface at{frameAbout(n), {}};
    at.v = toLocal(at.frame, -state.I);
    return at;
}

MarlowLegacy::Layers MarlowLegacy::layersAt(IShaderAPI* api, ShadeState const& state,
                                            Surface const& at) const
{
    Layers l{rgb(diffuse(api, state, false)), {}, {}};
    Vec3f const clear = saturate(transparency(api, state));
    Vec3f part[2] = {kBlack, kBlack};
    float const cosine = minOf(std::fabs(at.v.z), 1.0f);
    if (!unlitSurface) {
        Highlight const first(specularREG), second(specular2REG);
        Projection p;
        Vec3f const color = rgb(f_evalMapping(
            api, state, specularMode, triplanarXY, specularColor, specularTexture,
            specularTextureMatrix, specularAngularRepeat, state.Pref, state.Nref, false,
            attribute_uv(state), p.boxAxes, p.tangentU, p.tangentV, specularUVMatrix));
        part[0] = saturate(color * first.strength(cosine));
        part[1] = saturate(specular2Color * second.strength(cosine));
        l.lobe[0].width = first.width;
        l.lobe[1].width = second.width;
    }
    l.shares = shareOut(reflectance(cosine), clear, part[0], part[1], transparencyBlocksHighlights);
    for (int i = 0; i < 2; ++i)
        l.lobe[i].part = l.shares.highlight[i];
    if (reflectLight)
        l.lobe[2] = {lobeWidth(surfaceRoughness), l.shares.reflection};
    if (state.rayType == kRayDiffuse)
        for (GlossyLobe& lobe : l.lobe)
            lobe.width = maxOf(lobe.width, kGatheredWidth);
    return l;
}

/// Whether the clear part is a body that light is bent into; a pane lets it straight on.
bool MarlowLegacy::bends() const
{
    return refractiveIndex > 0.0f && refractiveIndex != 1.0f && !(simulatedThickness > 0.0f);
}

/// Direction into or out of the body, not unit; mirrored at total reflection. facing: the facet's
/// normal on the viewer's side, unit.
Vec3f MarlowLegacy::refracted(IShaderAPI* api, ShadeState const& state, Vec3f facing) const
{
    bool const leaving = dot(state.I, reverseNormal ? -state.Ng : state.Ng) > 0.0f;
    float const eta =
        leaving ? refractiveIndex / state.beyondIor : state.incomingIor / refractiveIndex;
    Vec3f const T = sl_lib_refract(state.I, facing, eta);
    if (!(T == kBlack))
        return T;
    Vec3f const Ng = dot(state.I, state.Ng) > 0.0f ? -state.Ng : state.Ng;
    return f_safe_reflect(api, state, state.I, Ng, facing);
}

/// What the simulated pane leaves of the light that crosses it. cosine: of the ray outside, 0..1.
Vec3f MarlowLegacy::paneTransmittance(IShaderAPI* api, ShadeState const& state, float cosine) const
{
    if (!(simulatedThickness > 0.0f))
        return {1.0f, 1.0f, 1.0f};
    float const eta = refractiveIndex > 0.0f ? 1.0f / refractiveIndex : 1.0f;
    float const inside2 = 1.0f - eta * eta * (1.0f - cosine * cosine);
    constexpr float kLeastCosine = 0.01f; // a pane has an edge
    float const inside = inside2 > kLeastCosine * kLeastCosine ? std::sqrt(inside2) : kLeastCosine;
    return f_beersUnabsorbedRGB(api, state, absorbanceRGB, simulatedThickness / inside);
}

} // namespace zsi
