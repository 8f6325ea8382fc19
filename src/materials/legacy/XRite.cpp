// SPDX-License-Identifier: Apache-2.0
#include "materials/legacy/XRite.h"

#include "environments/iblGrading.h"
#include "materials/legacy/curveFresnel.h"
#include "materials/legacy/glossyLobe.h"
#include "materials/physical/shared/facedNormal.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"

#include <bit>

namespace zsi {
namespace {

/// Width of the coat's highlights: lights are points, and a coat is never quite flat.
constexpr float kCoatWidth = 0.04f;

/// Largest colour or intensity; more would lose itself in infinities.
constexpr float kMost = 1e18f;
constexpr float bounded(float x) { return saturate(x, 0.0f, kMost); }
constexpr Vec3f bounded(Vec3f c) { return {bounded(c.x), bounded(c.y), bounded(c.z)}; }

float srgbCurve(float x, float power)
{
    return x > 0.0031308f ? 1.055f * power - 0.055f : 12.92f * x;
}

} // namespace

Vec3f XRite::f_getFlakeNormal(IShaderAPI*, ShadeState const&, Vec2f uv) const
{
    Vec4f const t = flakeNormalTexture.lookup(uv);
    return {2.0f * t.x - 1.0f, 2.0f * t.y - 1.0f, t.z};
}

float XRite::f_fast_fresnel(IShaderAPI*, ShadeState const&, Vec3f v, Vec4f curve) const
{
    return curveFresnel(v.z, curve);
}

Vec3f XRite::f_r709tosRGB(IShaderAPI*, ShadeState const&, Vec3f c) const
{
    // One unit in the last place above the float nearest to 1/2.4.
    constexpr float kExponent = std::bit_cast<float>(0x3ED55556u);
    Vec3f const p(std::pow(c.x, kExponent), std::pow(c.y, kExponent), std::pow(c.z, kExponent));
    return {srgbCurve(c.x, p.x), srgbCurve(c.y, p.y), srgbCurve(c.z, p.z)};
}

/// Slope of the flake of a cell: a draw from the normals that the texture holds, so that flakes
/// are of flakeSize whatever the pattern of the texture.
Vec2f XRite::flakeSlope(IShaderAPI* api, ShadeState const& state, Vec3i cell, float scale) const
{
    if (!flakeNormalTexture.texture)
        return {0.0f, 0.0f};
    // Far from the jitter of the centres, which the plain hash of the cell gives.
    Vec3f const at = cellHash(cell.y ^ 0x2545F491, cell.x);
    Vec3f const n = f_getFlakeNormal(api, state, {at.x, at.y});
    constexpr float kLeastHeight = 0.1f; // no flake stands upright
    return Vec2f(n.x, n.y) * (scale / maxOf(n.z, kLeastHeight));
}

FlakeLayer XRite::flakes(IShaderAPI* api, ShadeState const& state) const
{
    FlakeLayer layer;
    float const scale = saturate(std::fabs(coarseness), 0.0f, kMostCoarseness);
    if (flakeNormalTexture.texture) // without it, flakes lie flat
        layer.spread = kFlakeSlope * scale * scale;
    float const density = flakeFactor / flakeSize; // flakes per unit of uv
    Vec2f const p = attribute_uv(state) * density;
    // Beyond this, cells have no integer number. Negated, so that NaN leaves too.
    constexpr float kMostCells = 1e9f;
    if (!(std::fabs(p.x) < kMostCells && std::fabs(p.y) < kMostCells && density > 0.0f))
        return layer;

    // The record has no ray differentials: a pixel is taken as 1/1000 rad from the ray's origin,
    // and a unit of uv as a unit of length.
    constexpr float kPixelAngle = 0.001f;
    float const footprint = length(state.P - state.E) * kPixelAngle * density; // in flakes
    float const underneath = maxOf(1.0f, footprint * footprint);
    float const most = minOf(minOf(maxFlakes, underneath), static_cast<float>(FlakeLayer::kMost));
    if (!(most > 0.0f) || !(footprint < kMostCells))
        return layer;

    // The contrast of many falls with the root of its number; as many as `most` are averaged here.
    layer.resolved = underneath > most ? std::sqrt(most / underneath) : 1.0f;
    // Alone, a flake has its shape; of many, only cells are drawn.
    bool const alone = underneath <= 1.0f;
    for (int i = 0; static_cast<float>(i) < most; ++i) {
        Vec3i cell;
        if (alone) {
            cell = flakeAt(p);
        } else {
            // R2 sequence: Roberts 2018, "The Unreasonable Effectiveness of Quasirandom Sequences".
            float const k = static_cast<float>(i);
            float const x = p.x + footprint * (fract(0.5f + k * 0.7548777f) - 0.5f);
            float const y = p.y + footprint * (fract(0.5f + k * 0.5698403f) - 0.5f);
            cell = {static_cast<std::int32_t>(std::floor(x)),
                    static_cast<std::int32_t>(std::floor(y)), 0};
        }
        float const weight = minOf(1.0f, most - static_cast<float>(i)) / most;
        layer.flake[layer.count++] = {
            flakeSlope(api, state, cell, std::copysign(scale, coarseness)), weight};
    }
    return layer;
}

Vec3f XRite::paint(IShaderAPI* api, ShadeState const& state) const
{
    Vec3f const occlusion = f_calcAmbientOcclusion(api, state, 1.0f);
    if (showAmbientOnly)
        return grey(minComponent(occlusion));

    Vec3f const n = facedNormal(state, reverseNormal, faceForward);
    SLArray<Vec3f> const frame = frameAbout(n); // flakes lie at random: any turn will do
    Vec3f const v = toLocal(frame, -state.I);
    bool const inside = v.z < 0.0f; // seen from behind, with a normal that is not turned
    Vec3f const upper = inside ? -n : n;
    Vec3f const ng = dot(state.I, state.Ng) > 0.0f ? -state.Ng : state.Ng;

    // The measured colours are taken in the curve of a display.
    auto const measured = [&](Vec3f const& c) { return f_r709tosRGB(api, state, bounded(c)); };
    float const specular = bounded(specIntensity);
    Vec3f const base = measured(xriteDiffuse) * bounded(diffIntensity);
    float const flakeScale = xriteIsSolid ? 0.0f : bounded(contributionFactor) * specular;
    bool const flaky = flakeScale != 0.0f;
    Vec3f color = kBlack, color2 = kBlack;
    FlakeLayer layer;
    if (flaky) {
        color = measured(flakeColor);
        color2 = measured(flakeColor2);
        layer = flakes(api, state);
    }
    float const coat = saturate(f_fast_fresnel(api, state, {0.0f, 0.0f, std::fabs(v.z)}, fresnel));
    float const under = 1.0f - coat;

    // Lights. Every term is what a light of irradiance pi sends to the viewer: a white base that
    // faces a light of colour 1 shows 1.
    Vec3f diffuse = kBlack, glints = kBlack, mirrored = kBlack;
    GlossyLobe lobe;
    lobe.set(kCoatWidth, v, grey(1.0f));
    for (LightSample const* s = api->getLightSamples(-2, &state.P, &n); s; s = s->next) {
        Vec3f const light = s->color * s->shadow * s->weight;
        if (light == kBlack)
            continue;
        diffuse += light;
        Vec3f const l = toLocal(frame, s->L);
        if (l.z <= 0.0f || v.z <= 0.0f)
            continue;
        mirrored += light * (kPi * lobe.value(v, l));
        if (flaky)
            glints += light * layer.glint(v, l, normalize(v + l), color, color2);
    }
    if (!(glints == kBlack))
        glints = glints / layer.albedo(v);

    // Surroundings: a cube where one is bound, the host's rays otherwise.
    diffuse += occlusion
        * (diffuseCube.texture ? rgb(diffuseCube.lookup(cubeCoordinate(n)))
                               : api->indirectDiffuse(&state.P, &n, under * maxComponent(base)));
    Vec3f const mirror = f_safe_reflect(api, state, state.I, ng, upper);
    if (flaky) {
        // About the mean of the flakes that are told apart, as wide as what they leave.
        Vec3f mean = kBlack, average = kBlack;
        for (int i = 0; i < layer.count; ++i) {
            FlakeLayer::Flake const& f = layer.flake[i];
            mean += Vec3f(f.slope.x, f.slope.y, 0.0f) * f.weight;
            average += mix(color, color2, layer.flop(f)) * f.weight;
        }
        float const flop = layer.spread > 0.0f ? kMeanFlop : 0.0f;
        average = mix(mix(color, color2, flop), average, layer.resolved);
        mean *= layer.resolved;
        mean.z = 1.0f;
        Vec3f const m = normalize(toWorld(frame, mean));
        Vec3f const r =
            layer.count > 0 ? f_safe_reflect(api, state, state.I, ng, inside ? -m : m) : mirror;
        float const left = layer.spread * (1.0f - layer.resolved * layer.resolved);
        glints += average * occlusion
            * (specularCube.texture
                   ? rgb(specularCube.lookup(cubeCoordinate(r)))
                   : api->traceSpecular(&state.P, &r, std::sqrt(kFlakeGloss + left),
                                        under * flakeScale * maxComponent(average)));
    }
    float const mirrors = coat * specular;
    if (reflectCube.texture)
        mirrored += rgb(reflectCube.lookup(cubeCoordinate(mirror))) * occlusion;
    else if (mirrors != 0.0f)
        mirrored += api->traceReflection(&state.P, &mirror, mirrors);

    return bounded(under * (base * diffuse + glints * flakeScale) + mirrored * mirrors);
}

void XRite::shade(IShaderAPI* api, ShadeState& state) const
{
    shadeMasked(*this, api, state, [&] { return paint(api, state); });
}

void XRite::transmission(IShaderAPI* api, ShadeState& state) const
{
    state.transmissionColor =
        f_calcMasking(api, state, attribute_uv(state), state.Pref, state.Nref);
}

} // namespace zsi
