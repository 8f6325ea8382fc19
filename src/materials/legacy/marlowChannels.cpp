// SPDX-License-Identifier: Apache-2.0
// What the parameters and textures of the legacy material say at a hit.
#include "environments/mappedBump.h"
#include "materials/legacy/MarlowLegacy.h"
#include "materials/legacy/curveFresnel.h"
#include "materials/physical/shared/facedNormal.h"
#include "materials/physical/shared/shadingFrame.h"

namespace zsi {
namespace {

/// Width of the lobes that rays which gather light see at least: a narrow highlight that one of
/// many such rays meets would be a speck in the picture. Kaplanyan and Dachsbacher 2013, "Path
/// Space Regularization for Holistic and Robust Light Transport".
constexpr float kGatheredWidth = 0.3f;

/// Below it, mirrored and refracted light is not blurred.
constexpr float kSmooth = 0.005f;

} // namespace

Vec3f MarlowLegacy::f_beersUnabsorbedRGB(IShaderAPI*, ShadeState const&, Vec3f absorbance,
                                         float distance) const
{
    auto const left = [distance](float a) { return a == -1.0f ? 0.0f : std::exp(-distance * a); };
    return {left(absorbance.x), left(absorbance.y), left(absorbance.z)};
}

Vec4f MarlowLegacy::channel(IShaderAPI* api, ShadeState const& state, MappedChannel const& c,
                            bool alphaAsColor) const
{
    MappedAxes axes;
    return evalChannel(api, state, c, triplanarXY, alphaAsColor, attribute_uv(state), axes);
}

/// 1 removes the surface.
Vec3f MarlowLegacy::mask(IShaderAPI* api, ShadeState const& state) const
{
    Vec3f const m = rgb(channel(api, state,
                                {maskingMode, maskingColor, maskingTexture, maskingTextureMatrix,
                                 maskingAngularRepeat, maskingUVMatrix},
                                maskingFromAlpha));
    return maskingInvertTexture && maskingMode > 0 ? grey(1.0f) - m : m;
}

Vec4f MarlowLegacy::diffuse(IShaderAPI* api, ShadeState const& state, bool alphaAsColor) const
{
    return channel(api, state,
                   {diffuseMode, diffuseColor, diffuseTexture, diffuseTextureMatrix,
                    diffuseAngularRepeat, diffuseUVMatrix},
                   alphaAsColor);
}

/// 1 is clear.
Vec3f MarlowLegacy::transparency(IShaderAPI* api, ShadeState const& state) const
{
    Vec3f const t =
        rgb(transparencyFromDiffuse ? diffuse(api, state, diffuseTexture.texture != nullptr)
                                    : channel(api, state,
                                              {transparencyMode, transparencyColor,
                                               transparencyTexture, transparencyTextureMatrix,
                                               transparencyAngularRepeat, transparencyUVMatrix}));
    return transparencyInvert ? grey(1.0f) - t : t;
}

/// Albedo of the reflection. cosine: of the viewer, 0..1.
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
        MappedChannel const bump{bumpMode,          kBlack,      bumpTexture, bumpTextureMatrix,
                                 bumpAngularRepeat, bumpUVMatrix};
        BumpPlacement placement{bump, bumpTextureMatrixInverse, attribute_tangent(state),
                                attribute_bitangent(state)};
        Vec4f const texel =
            evalChannel(api, state, bump, triplanarXY, false, attribute_uv(state), placement.axes);
        n = bendNormal(placement, texel, bumpDepth, n, state.objectToWorld);
    }
    if (faceForward && dot(state.Ng, state.I) > 0.0f)
        n = -n;
    bool const behind = dot(n, state.I) > 0.0f;
    Surface at{frameAbout(behind ? -n : n), {}, {}, behind};
    at.v = toLocal(at.frame, -state.I);
    at.ng = toLocal(at.frame, dot(at.facing(), state.Ng) < 0.0f ? -state.Ng : state.Ng);
    return at;
}

MarlowLegacy::Layers MarlowLegacy::layersAt(IShaderAPI* api, ShadeState const& state,
                                            Surface const& at) const
{
    Layers l{rgb(diffuse(api, state, false)), {}, {}, {}, false};
    Vec3f const clear = saturate(transparency(api, state));
    float const cosine = minOf(at.v.z, 1.0f);
    // Lights in front of a surface seen from behind reach its base alone.
    bool const glossy = !unlitSurface && at.v.z > 0.0f && (!at.behind || faceLight);
    Highlight const first(specularREG), second(specular2REG);
    Vec3f highlight[2] = {kBlack, kBlack};
    if (glossy) {
        Vec3f const color =
            rgb(channel(api, state,
                        {specularMode, specularColor, specularTexture, specularTextureMatrix,
                         specularAngularRepeat, specularUVMatrix}));
        highlight[0] = saturate(color * first.strength(cosine));
        highlight[1] = saturate(specular2Color * second.strength(cosine));
    }
    l.albedo = layerAlbedo(reflectance(cosine), clear, highlight[0], highlight[1],
                           transparencyBlocksHighlights);
    l.mirrorsLights = glossy && reflectLight;

    float const leastWidth = state.rayType == kRayDiffuse ? kGatheredWidth : kLeastWidth;
    auto const set = [&](GlossyLobe& lobe, float width, Vec3f const& albedo) {
        if (!(albedo == kBlack))
            lobe.set(maxOf(width, leastWidth), at.v, albedo);
    };
    set(l.highlight[0], first.width, l.albedo.highlight[0]);
    set(l.highlight[1], second.width, l.albedo.highlight[1]);
    if (l.mirrorsLights || blurs(at))
        set(l.reflection, lobeWidth(surfaceRoughness), l.albedo.reflection);
    return l;
}

/// Whether the clear part is a body that light is bent into; a pane lets it straight on.
bool MarlowLegacy::bends() const
{
    return refractiveIndex > 0.0f && refractiveIndex != 1.0f && !(simulatedThickness > 0.0f);
}

/// Whether mirrored and refracted light is blurred.
bool MarlowLegacy::blurs(Surface const& at) const
{
    return std::fabs(surfaceRoughness) > kSmooth && at.v.z > 0.0f;
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
