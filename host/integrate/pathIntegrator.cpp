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

Vec4f PathIntegrator::radiance(PathRay ray)
{
    Path path;
    for (;;) {
        SurfacePoint surface;
        Vec4f seen;
        if (context_.intersect(ray, surface, seen)) {
            if (context_.scene().materialOf(surface).scatters()) {
                if (!scatter(ray, surface, path))
                    return withAlpha(path.light, 1.0f);
                continue;
            }
            if (!context_.shade(ray, surface, seen)) {
                ShadingContext::passIgnored(ray, surface);
                continue;
            }
        }
        return withAlpha(path.light + path.throughput * rgb(seen), path.straight ? seen.w : 1.0f);
    }
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
    for (int side = 0; side < count; ++side)
        for (std::size_t i = 0; i < lights.size(); ++i) {
            if (!material.mixes && std::holds_alternative<SurfaceLight>(lights[i]))
                continue;
            Arrival picked;
            LightSample light;
            if (!context_.pickLight(i, state.P, sides[side], picked))
                continue;
            Vec3f const value = sent(picked.L);
            if (!(maxComponent(value) > 0.0f)
                || !context_.arriving(i, state.P, sides[side], picked, light))
                continue;
            float const share = picked.density > 0.0f
                ? picked.density / (picked.density + maxComponent(value))
                : 1.0f;
            sum += value * light.color * light.shadow * (share * kPi);
        }
    if (material.mixes)
        sum += context_.fromSky(kRayReflection, sent, [&](Vec3f) {
            return maxComponent(state.outBrdf) * state.sampleCosine;
        });
    return context_.finite(sum);
}

bool PathIntegrator::scatter(PathRay& ray, SurfacePoint const& surface, Path& path)
{
    PathRay next = ray;
    {
        ShadingContext::Call call(context_, ray, surface);
        PreparedMaterial const& material = call.material;
        path.light += path.throughput * directLight(call);

        ShadeState& state = call.state;
        std::fill_n(state.allowReflection, 3, std::uint8_t(1));
        std::fill_n(state.allowTransmission, 3, std::uint8_t(1));
        state.sampleType = kSampleNone;
        material.shader->sample(&context_, state);
        if (state.sampleType == kSampleNone)
            return false;
        path.throughput *=
            positive(context_.finite(state.outBrdf * (state.sampleCosine * state.sampleInvPdf)));
        if (maxComponent(path.throughput) <= 0.0f || !isFinite(state.sampleDirection)
            || !(dot(state.sampleDirection, state.sampleDirection) > 0.0f))
            return false;

        next.direction = normalize(state.sampleDirection);
        next.E = surface.P;
        next.ignored = 0;
        next.origin = context_.rayStart(surface.P, next.direction);
        // Straight on, as if nothing were there; a medium's boundary bends even what it hardly
        // bends.
        if (state.sampleDirection == ray.direction && !material.ior) {
            next.passes += 1;
            next.skyDensity = std::numeric_limits<float>::infinity();
            next.type = ray.type == kRayCamera ? std::uint32_t(kRayTransmission) : ray.type;
        } else {
            next.depth += 1;
            next.type = kRayReflection;
            next.scatteredAt = surface.P;
            // Lights have been asked for where `transfer` tells what `sample` draws.
            bool const shares = material.mixes && state.sampleType == kSampleMixture
                && (context_.scene().lights().hasSurfaces()
                    || !context_.scene().sky(kRayReflection).isEmpty());
            next.lobeDensity = next.skyDensity = shares ? context_.lobeDensity(next.direction)
                                                        : std::numeric_limits<float>::infinity();
            path.straight = false;
        }
        ShadingContext::changeMedia(next, ray.direction, surface,
                                    material.ior ? &state.beyondIor : nullptr);
    }
    ray = next;
    return survives(ray, path);
}

bool PathIntegrator::survives(PathRay const& ray, Path& path)
{
    float const kept = maxComponent(path.throughput);
    if (ray.depth < kRouletteDepth || kept >= 1.0f)
        return true;
    float const chance = maxOf(kept, 0.05f);
    if (!(context_.sampler().next() < chance))
        return false;
    path.throughput = path.throughput / chance;
    return true;
}

} // namespace zsi::host
