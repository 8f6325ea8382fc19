// SPDX-License-Identifier: Apache-2.0
#include "materials/physical/corvid_Mtl_MetallicPaint.h"

#include "materials/physical/paintLobe.h"
#include "materials/physical/shared/indirectDiffuse.h"
#include "materials/physical/shared/proceduralNormal.h"
#include "materials/physical/shared/textureChannel.h"
#include "runtime/builtins.h"

#include <optional>

namespace zsi {
namespace {

constexpr PaintLayers kAllLayers{true, true, true};

} // namespace

/// A drawn direction: value, cosine on the base and reciprocal density.
struct corvid_Mtl_MetallicPaint::Event {
    Vec3f direction, value;
    float cosine, invPdf;
};

void corvid_Mtl_MetallicPaint::f_computeShadingFrame(IShaderAPI* api, ShadeState const& state,
                                                     Vec3f const& P, Vec3f const& N,
                                                     Mat3f const& toWorld, SLArray<Vec3f>& frame,
                                                     SLArray<Vec3f>& peelFrame) const
{
    frame = computeBaseFrame(attribute_tangent(state), N, toWorld);
    peelFrame = frame;
    if (u_finish == 1)
        bendByOffset(peelFrame, rippleOffset(api, state, P * 0.8f, peelFrame) * u_finishPeelamount);
}

/// Orthonormal frames of the lobes. Where the peel turns the coat away from the viewer, it is
/// taken as level: a silhouette has no black rim.
PaintFrames corvid_Mtl_MetallicPaint::frames(IShaderAPI* api, ShadeState const& state,
                                             Vec3f const& Nf, Vec3f const& V) const
{
    PaintFrames f;
    f_computeShadingFrame(api, state, state.P, Nf, Mat3f(state.objectToWorld), f.base, f.coat);
    orthonormalTangent(f.base);
    if (u_finish == 1) {
        // The coat is the same around its normal, so any tangent does: the bent frame's own may
        // be lost to rounding under a strong peel.
        f.coat = {{kBlack, kBlack, normalize(f.coat[2])}};
        orthonormalTangent(f.coat);
        constexpr float kLeastCosine = 0.01f;
        if (dot(f.coat[2], V) > kLeastCosine)
            return f;
    }
    f.coat = f.base;
    return f;
}

FlakeFootprint corvid_Mtl_MetallicPaint::footprint(IShaderAPI* api, ShadeState const& state) const
{
    constexpr float kLeastDensity = 1e-6f;
    FlakeRecipe flakes{u_flakeSize, saturate(u_flakeDensity), saturate(u_flakeSpread),
                       saturate(u_flakeRoughValue, 0.01f, 1.0f)};
    if (flakes.density < kLeastDensity)
        flakes.density = 0.0f;
    // Of all rays but the camera's the record tells neither width nor way so far: they may be any
    // lobe's, and see the flakes' mean.
    bool const camera = state.rayType == kRayCamera && state.rayDepth == 0;
    if (flakes.density == 0.0f || !(flakes.size > 0.0f) || !camera)
        return FlakeFootprint(flakes);
    // Flakes stick to the object and have their size in the world.
    float const* m = state.objectToWorld.m;
    Vec3f const axes[3] = {{m[0], m[1], m[2]}, {m[4], m[5], m[6]}, {m[8], m[9], m[10]}};
    float const scale =
        std::sqrt((dot(axes[0], axes[0]) + dot(axes[1], axes[1]) + dot(axes[2], axes[2])) / 3.0f);
    // The record has no field of view: the picture is taken to open 40 degrees upwards, and a pixel
    // to be square, stretched along the surface at grazing angles.
    constexpr float kPictureHeight = 0.72794047f; // 2 tan 20 degrees, at distance 1
    constexpr float kLeastCosine = 0.05f;
    float const pixels = state.imageHeight > 0 ? static_cast<float>(state.imageHeight) : 1000.0f;
    float const width = length(state.P - state.E) * (kPictureHeight / pixels) / flakes.size;
    float const cosine = maxOf(std::fabs(dot(state.I, state.Ng)), kLeastCosine);
    FlakePlace const place{state.Pref * (scale / flakes.size), std::floor(state.rasterX),
                           std::floor(state.rasterY), width, width * width / cosine};
    // A size that leaves no room for numbers.
    if (!(place.underneath < 1e30f && dot(place.p, place.p) < 1e30f))
        return FlakeFootprint(flakes);
    return {flakes, api, place};
}

PaintColors corvid_Mtl_MetallicPaint::colors(ShadeState const& state) const
{
    Vec3f const base = u_baseMapEnable
        ? mappedColor(u_baseMap, u_baseTransform, u_baseAmount, attribute_uv(state))
        : u_baseColor;
    Vec3f const flake = u_flakeMapEnable
        ? mappedColor(u_flakeMap, u_flakeTransform, u_flakeAmount, attribute_uv(state))
        : u_flakeColor;
    return {saturate(base), saturate(u_baseRoughValue), saturate(flake),
            withAlpha(saturate(rgb(u_pearlColor)), saturate(u_pearlColor.w))};
}

float corvid_Mtl_MetallicPaint::coatWidth(ShadeState const& state) const
{
    float const width = u_coatRoughMapEnable
        ? mappedValue(u_coatRoughMap, u_coatRoughTransform, u_coatRoughAmount, attribute_uv(state))
        : u_coatRoughValue;
    // A highlight of a twentieth of a degree is a mirror's, and still has a finite density.
    return saturate(width, ClearCoat::kLeastWidth, ClearCoat::kMostWidth);
}

/// The paint as this ray meets it; none where the ray runs along the surface.
/// Nf: the normal on the ray's side, by Ng.
inline std::optional<PaintLobe> corvid_Mtl_MetallicPaint::lobe(IShaderAPI* api,
                                                               ShadeState const& state) const
{
    float const side = -facingSign(state.I, state.Ng);
    if (side == 0.0f)
        return std::nullopt;
    Vec3f const Nf = state.N * side;
    // An interpolated normal that faces away is seen at grazing incidence.
    constexpr float kLeastCosine = 1e-4f;
    Vec3f V = -state.I;
    float const cosine = dot(Nf, V);
    if (!(cosine > kLeastCosine))
        V = normalize(V + Nf * (kLeastCosine - cosine));
    return PaintLobe(colors(state), footprint(api, state), frames(api, state, Nf, V),
                     saturate(u_coatReflectivity), coatWidth(state), V, state.Ng * side,
                     u_finish == 1 || !(state.N == state.Ng));
}

/// Draws a direction of some layers; none below the surface, where no light comes from either.
bool corvid_Mtl_MetallicPaint::draw(IShaderAPI* api, PaintLobe const& paint, PaintLayers layers,
                                    Event& event)
{
    float const pick = api->random();
    event.direction = paint.direction(pick, api->random2D(), layers);
    if (!paint.lights(event.direction, event.cosine))
        return false;
    PaintLobe::Value const value = paint(event.direction, layers);
    constexpr float kLeastDensity = 1e-30f; // its reciprocal is a number
    if (!(value.pdf > kLeastDensity))
        return false;
    event.value = value.under + grey(value.coat);
    event.invPdf = 1.0f / value.pdf;
    return true;
}

/// What is seen along a drawn direction.
Vec3f corvid_Mtl_MetallicPaint::traced(IShaderAPI* api, ShadeState const& state,
                                       PaintLobe const& paint, PaintLayers layers)
{
    Event event;
    if (!draw(api, paint, layers, event))
        return kBlack;
    Vec3f const weight = event.value * (event.cosine * event.invPdf);
    if (weight == kBlack)
        return kBlack;
    return api->traceSpecular(&state.P, &event.direction, 0.0f, maxComponent(weight)) * weight;
}

void corvid_Mtl_MetallicPaint::f_calculateColors(IShaderAPI* api, ShadeState const& state,
                                                 PhysicalColors& out) const
{
    std::optional<PaintLobe> const seen = lobe(api, state);
    if (!seen)
        return;
    PaintLobe const& paint = *seen;
    Vec3f const& N = paint.frames().base[2];

    for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
         light = light->next) {
        float cosine;
        if (!paint.lights(light->L, cosine))
            continue;
        PaintLobe::Value const value = paint(light->L, kAllLayers);
        // A light of colour 1 brings the irradiance pi.
        Vec3f const arriving = light->color * light->shadow * (light->weight * kPi);
        out.lit += arriving * value.under;
        out.highlight += arriving * value.coat;
    }

    // Coat and flakes mirror what their lobes see, each by a direction of its own.
    out.reflectionWeight = grey(paint.coatAlbedo()) + paint.flakeAlbedo();
    if (paint.coatAlbedo() > 0.0f)
        out.reflection = traced(api, state, paint, {true, false, false});
    if (!(paint.flakeAlbedo() == kBlack))
        out.reflection += traced(api, state, paint, {false, false, true});

    // The base gathers what it sends on alike from everywhere, and asks along a direction of its
    // own for the rest. Gathered rays know what stands in their way, ambient light does not.
    out.indirectWeight = paint.baseAlbedo();
    if (out.indirectWeight == kBlack)
        return;
    out.indirect =
        occludedDiffuse(api, out.indirectWeight, api->ambientLight(&state.P, &N), state.P, N);
    Vec3f const even = paint.evenAlbedo();
    if (!(even == kBlack))
        out.indirect += api->indirectDiffuse(&state.P, &N, maxComponent(even)) * even;
    Vec3f weight;
    Vec3f const L = paint.restDirection(api->random2D(), weight);
    float cosine;
    if (paint.lights(L, cosine) && !(weight == kBlack))
        out.indirect += api->traceSpecular(&state.P, &L, 0.0f, maxComponent(weight)) * weight;
}

void corvid_Mtl_MetallicPaint::shade(IShaderAPI* api, ShadeState& state) const
{
    shadePhysical(api, state);
}

void corvid_Mtl_MetallicPaint::transfer(IShaderAPI* api, ShadeState& state) const
{
    state.outBrdf = kBlack;
    state.sampleCosine = 0.0f;
    std::optional<PaintLobe> const paint = lobe(api, state);
    float cosine;
    if (!paint || !paint->lights(state.sampleDirection, cosine))
        return;
    PaintLobe::Value const value = (*paint)(state.sampleDirection, kAllLayers);
    state.outBrdf = value.under + grey(value.coat);
    state.sampleCosine = cosine;
}

void corvid_Mtl_MetallicPaint::sample(IShaderAPI* api, ShadeState& state) const
{
    state.sampleType = kSampleNone;
    if (!anySwitch(state.allowReflection))
        return;
    // The third switch alone asks for what mirrors: coat and flakes.
    bool const glossyOnly = !(state.allowReflection[0] | state.allowReflection[1]);
    std::optional<PaintLobe> const paint = lobe(api, state);
    Event event;
    if (!paint || !draw(api, *paint, {true, !glossyOnly, true}, event))
        return;
    state.sampleDirection = event.direction;
    state.outBrdf = event.value;
    state.sampleCosine = event.cosine;
    state.sampleInvPdf = event.invPdf;
    state.sampleType = glossyOnly ? kSampleStraight : kSampleMixture;
}

} // namespace zsi
