// SPDX-License-Identifier: Apache-2.0
#include "integrate/pathIntegrator.h"

#include <algorithm>

namespace zsi::host {
namespace {

/// A light of colour 1 brings the irradiance pi: a white diffuse surface, whose scattering value
/// is 1/pi, shows 1.
constexpr float kPi = 3.14159265f;

/// Depth from which paths end at random.
constexpr std::uint32_t kRouletteDepth = 3;

Vec3f positive(Vec3f v) { return {maxOf(v.x, 0.0f), maxOf(v.y, 0.0f), maxOf(v.z, 0.0f)}; }

} // namespace

/// Everything further on counts by `weight`.
void PathIntegrator::Path::weigh(Vec3f weight, PathRay& ray)
{
    float const before = maxComponent(throughput);
    throughput *= weight;
    ray.importance *= maxComponent(throughput) / before;
}

Vec4f PathIntegrator::radiance(PathRay ray)
{
    Path path;
    Vec4f seen;
    SurfacePoint surface;
    while (context_.intersect(ray, surface, seen)) {
        if (context_.scene().materialOf(surface).continuesPaths) {
            if (!scatter(ray, surface, path)) {
                context_.setParts(path.parts);
                return withAlpha(path.light, 1.0f - path.clear);
            }
        } else if (context_.shade(ray, surface, seen)) {
            break;
        } else {
            ShadingContext::passIgnored(ray, surface);
        }
    }
    path.add(rgb(seen), context_.parts());
    context_.setParts(path.parts);
    return withAlpha(path.light, 1.0f - path.clear - path.open * (1.0f - seen.w));
}

void PathIntegrator::Path::add(Vec3f arrived, LightParts const& partsOfIt)
{
    light += throughput * arrived;
    if (bends == 0)
        parts.add(partsOfIt * throughput);
    else if (bends == 1)
        parts.direct += partsOfIt.straight() * throughput;
}

Vec3f PathIntegrator::directLight(ShadingContext::Call& call)
{
    ShadeState& state = call.state;
    PreparedMaterial const& material = call.material;
    Vec3f const faced = dot(state.I, state.Ng) <= 0.0f ? state.N : -state.N;
    // Light from behind counts where a surface lets light through.
    Vec3f const sides[2] = {faced, -faced};
    int const count = (material.entryPoints & kTransmission) ? 2 : 1;
    Vec3f sum{0, 0, 0};
    LightSet const& lights = context_.scene().lights();
    // What the surface sends on of a light is known before a ray looks for what stands between.
    auto const sent = [&](Vec3f L) {
        state.sampleDirection = L;
        state.outBrdf = {0, 0, 0};
        state.sampleCosine = 0.0f;
        material.shader->transfer(&context_, state);
        return positive(state.outBrdf * maxOf(state.sampleCosine, 0.0f));
    };
    auto const random = [this] { return context_.sampler().next(); };
    for (int side = 0; side < count; ++side)
        lights.forEach(state.P, sides[side], random, [&](std::size_t i, float scale) {
            Arrival picked;
            LightSample light;
            if (!context_.pickLight(i, state.P, sides[side], picked))
                return;
            Vec3f const value = sent(picked.L);
            if (!(maxComponent(value) > 0.0f)
                || !context_.arriving(i, state.P, sides[side], picked, light))
                return;
            float const share = picked.density > 0.0f
                ? picked.density / (picked.density + material.density(value))
                : 1.0f;
            sum += value * light.color * light.shadow * (share * scale * kPi);
        });
    sum += context_.fromSky(kRayReflection, sent, [&](Vec3f) {
        return material.density(state.outBrdf * state.sampleCosine);
    });
    return context_.finite(sum);
}

bool PathIntegrator::scatter(PathRay& ray, SurfacePoint const& surface, Path& path)
{
    PreparedMaterial const& material = context_.scene().materialOf(surface);
    bool const isFront = dot(ray.direction, surface.Ng) <= 0.0f;
    if ((isFront ? material.showsMoreInFront : material.showsMoreBehind)
        && passes(ray, surface, path))
        return true;
    PathRay next = ray;
    {
        ShadingContext::Call call(context_, ray, surface);
        Vec3f const lit = directLight(call);
        path.add(lit, {.direct = lit});
        if (!draw(next, call, path))
            return false;
    }
    ray = next;
    return survives(ray, path);
}

bool PathIntegrator::passes(PathRay& ray, SurfacePoint const& surface, Path& path)
{
    ShadingContext::Beside beside;
    if (!context_.shadeBeside(ray, surface, beside)) {
        ShadingContext::passIgnored(ray, surface);
        return true;
    }
    path.add(beside.color, context_.parts());
    float const through = maxComponent(path.throughput * beside.behind);
    if (through <= 0.0f)
        return false;
    PathRay straight = ray;
    ShadingContext::passStraight(straight, surface);
    Vec3f const own = Vec3f(1, 1, 1) - beside.behind;
    float const kept = maxComponent(path.throughput * own);
    float const chance = through / (through + kept);
    if (kept > 0.0f && path.open > 0.0f) {
        // Both are followed where the edge of the one before the other is seen.
        straight.importance *= through / maxComponent(path.throughput);
        Vec4f const seen = radiance(straight);
        path.add(beside.behind * rgb(seen), context_.parts() * beside.behind);
        path.clear += path.open * beside.clear * (1.0f - seen.w);
        path.open = 0.0f;
    } else if (!(kept > 0.0f) || context_.sampler().next() < chance) {
        path.open *= beside.clear;
        path.weigh(beside.behind / chance, straight);
        ray = straight;
        return true;
    } else {
        path.weigh(own / (1.0f - chance), ray);
        return false;
    }
    path.weigh(own, ray);
    return false;
}

bool PathIntegrator::draw(PathRay& ray, ShadingContext::Call& call, Path& path)
{
    ShadeState& state = call.state;
    PreparedMaterial const& material = call.material;
    std::fill_n(state.allowReflection, 3, std::uint8_t(1));
    std::fill_n(state.allowTransmission, 3, std::uint8_t(1));
    state.sampleType = kSampleNone;
    material.shader->sample(&context_, state);
    if (state.sampleType == kSampleNone)
        return false;
    Vec3f const weight =
        positive(context_.finite(state.outBrdf * (state.sampleCosine * state.sampleInvPdf)));
    if (maxComponent(path.throughput * weight) <= 0.0f || !isFinite(state.sampleDirection)
        || !(dot(state.sampleDirection, state.sampleDirection) > 0.0f))
        return false;
    float const density = material.density(state.outBrdf * state.sampleCosine);
    path.weigh(weight, ray);

    if (state.sampleType == kSampleStraight && state.sampleDirection == state.I) {
        path.open *= (weight.x + weight.y + weight.z) / 3.0f;
        ShadingContext::passStraight(ray, call.surface);
        return true;
    }
    Vec3f const arrived = ray.direction;
    ray.direction = normalize(state.sampleDirection);
    ray.E = call.surface.P;
    ray.ignored = 0;
    ray.origin = context_.rayStart(call.surface.P, ray.direction);
    ray.depth += 1;
    ray.type = kRayReflection;
    ray.scatteredAt = call.surface.P;
    // Lights have been asked for where `sample` tells the value that `transfer` has.
    bool const shares = state.sampleType == kSampleMixture
        && (context_.scene().lights().hasSurfaces()
            || !context_.scene().sky(kRayReflection).isEmpty());
    ray.lobeDensity = ray.skyDensity = shares ? density : std::numeric_limits<float>::infinity();
    path.open = 0.0f;
    path.bends += 1;
    ShadingContext::changeMedia(ray, arrived, call.surface,
                                material.ior ? &state.beyondIor : nullptr);
    ray.cone = context_.bentCone(ray);
    if (state.sampleType == kSampleMixture)
        ray.cone = ray.cone.scattered(1.0f / state.sampleInvPdf);
    return true;
}

bool PathIntegrator::survives(PathRay& ray, Path& path)
{
    if (ray.depth < kRouletteDepth || ray.importance >= 1.0f)
        return true;
    float const chance = maxOf(ray.importance, 0.05f);
    if (!(context_.sampler().next() < chance))
        return false;
    path.throughput = path.throughput / chance;
    ray.importance /= chance;
    return true;
}

} // namespace zsi::host
