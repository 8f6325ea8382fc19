#include "materials/physical/corvid_Mtl_MetallicPaint.h"

#include "materials/physical/paintLobe.h"
#include "materials/physical/shared/indirectDiffuse.h"
#include "materials/physical/shared/lightFade.h"
#include "materials/physical/shared/proceduralNormal.h"
#include "materials/physical/shared/textureChannel.h"
#include "runtime/builtins.h"

namespace zsi {

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
                                             Vec3f const& Nf) const
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
        if (dot(f.coat[2], -state.I) > kLeastCosine)
            return f;
    }
    f.coat = f.base;
    return f;
}

FlakeFootprint corvid_Mtl_MetallicPaint::footprint(IShaderAPI* api, ShadeState const& state) const
{
    FlakeRecipe const flakes{u_flakeSize, saturate(u_flakeDensity), saturate(u_flakeSpread),
                             saturate(u_flakeRoughValue, 0.01f, 1.0f)};
    // Gathered light has no pixel that could show flakes.
    if (flakes.density == 0.0f || !(flakes.size > 0.0f) || state.rayType == kRayDiffuse)
        return FlakeFootprint(flakes);
    // Flakes stick to the object and have their size in the world.
    float const* m = state.objectToWorld.m;
    Vec3f const axes[3] = {{m[0], m[1], m[2]}, {m[4], m[5], m[6]}, {m[8], m[9], m[10]}};
    float const scale =
        std::sqrt((dot(axes[0], axes[0]) + dot(axes[1], axes[1]) + dot(axes[2], axes[2])) / 3.0f);
    Vec3f const p = state.Pref * (scale / flakes.size);
    // The record has no ray differentials: a pixel is taken as 1/1000 rad from the ray's origin,
    // some 1000 pixels across a usual view, stretched along the surface at grazing angles.
    constexpr float kPixelAngle = 0.001f, kLeastCosine = 0.05f;
    float const width = length(state.P - state.E) * kPixelAngle / flakes.size;
    float const cosine = maxOf(std::fabs(dot(state.I, state.Ng)), kLeastCosine);
    SLArray<Vec3f> along{{kBlack, kBlack, state.Nref}};
    orthonormalTangent(along);
    return {flakes, api, p, along[0], along[1], width * width / cosine};
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
    return saturate(width, 0.001f, 0.5f);
}

/// Nf: the normal as faced by V, the direction to the viewer.
inline PaintLobe corvid_Mtl_MetallicPaint::lobe(IShaderAPI* api, ShadeState const& state,
                                                Vec3f const& Nf, Vec3f const& V) const
{
    return {colors(state),          footprint(api, state),
            frames(api, state, Nf), saturate(u_coatReflectivity),
            coatWidth(state),       V};
}

void corvid_Mtl_MetallicPaint::f_calculateColors(IShaderAPI* api, ShadeState const& state,
                                                 PhysicalColors& out) const
{
    float const side = -facingSign(state.I, state.Ng);
    Vec3f const Ngf = state.Ng * side;
    Vec3f const Nf = state.N * side;
    Vec3f V = -state.I;
    bool const seen = dot(Nf, V) > 0.0f;
    if (!seen) // an interpolated normal that faces away still mirrors, at grazing incidence
        V = V - Nf * dot(Nf, V);
    PaintLobe const paint = lobe(api, state, Nf, V);
    PaintFrames const& f = paint.frames();
    Vec3f const& N = f.base[2];

    if (seen)
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next) {
            float const fade = lightFade(dot(light->L, Ngf));
            if (fade == 0.0f || !(dot(N, light->L) > 0.0f))
                continue;
            PaintLobe::Value const value = paint(light->L, false);
            Vec3f const arriving = light->color * light->shadow * (light->weight * fade);
            out.lit += arriving * value.under;
            out.highlight += arriving * value.coat;
        }

    out.reflectionWeight = grey(paint.coatAlbedo());
    if (paint.coatAlbedo() > 0.0f) {
        Vec3f const R = f_safe_reflect(api, state, state.I, Ngf, f.coat[2]);
        out.reflection = api->traceSpecular(&state.P, &R, paint.coatWidth(), paint.coatAlbedo())
            * paint.coatAlbedo();
    }
    if (paint.flakeCoverage() > 0.0f) {
        // One of the flakes in view, so that each shows its own part of the surroundings.
        FlakeFootprint::Pick const flake = paint.pickFlake(api->random());
        Vec3f const n = normalize(toWorld(f.base, Vec3f(flake.slope.x, flake.slope.y, 1.0f)));
        Vec3f const weight = paint.flakeAlbedo(clamp01(-dot(n, state.I)));
        if (!(weight == kBlack)) {
            Vec3f const R = f_safe_reflect(api, state, state.I, Ngf, n);
            out.reflection +=
                api->traceSpecular(&state.P, &R, flake.width, maxComponent(weight)) * weight;
            out.reflectionWeight += weight;
        }
    }

    // Ambient light has no direction: flakes and base return it alike.
    out.indirectWeight = paint.baseAlbedo() + paint.flakeAlbedo(1.0f);
    out.indirect =
        occludedDiffuse(api, out.indirectWeight, api->ambientLight(&state.P, &N), state.P, N);
}

void corvid_Mtl_MetallicPaint::shade(IShaderAPI* api, ShadeState& state) const
{
    shadePhysical(api, state);
}

void corvid_Mtl_MetallicPaint::transfer(IShaderAPI* api, ShadeState& state) const
{
    Vec3f const Nf = -state.N * facingSign(state.I, state.Ng);
    float const cosine = dot(Nf, state.sampleDirection);
    if (!(dot(Nf, state.I) < 0.0f && cosine > 0.0f)) {
        state.outBrdf = kBlack;
        state.sampleCosine = 0.0f;
        return;
    }
    PaintLobe const paint = lobe(api, state, Nf, -state.I);
    PaintLobe::Value const value = paint(state.sampleDirection, false);
    state.outBrdf = value.under + grey(value.coat);
    state.sampleCosine = cosine;
}

void corvid_Mtl_MetallicPaint::sample(IShaderAPI* api, ShadeState& state) const
{
    state.sampleType = kSampleNone;
    Vec3f const Nf = -state.N * facingSign(state.I, state.Ng);
    if (!anySwitch(state.allowReflection) || !(dot(Nf, state.I) < 0.0f))
        return;
    // The third switch alone asks for what mirrors: coat and flakes.
    bool const glossyOnly = !(state.allowReflection[0] | state.allowReflection[1]);
    PaintLobe const paint = lobe(api, state, Nf, -state.I);
    float const pick = api->random();
    Vec3f const direction = paint.sample(pick, api->random2D(), glossyOnly);
    float const cosine = dot(Nf, direction);
    if (!(cosine > 0.0f))
        return;
    PaintLobe::Value const value = paint(direction, glossyOnly);
    if (!(value.pdf > 0.0f))
        return;
    state.sampleDirection = direction;
    state.outBrdf = value.under + grey(value.coat);
    state.sampleCosine = cosine;
    state.sampleInvPdf = 1.0f / value.pdf;
    state.sampleType = glossyOnly ? kSampleStraight : kSampleMixture;
}

} // namespace zsi
