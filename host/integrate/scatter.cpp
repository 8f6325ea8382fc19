// Paths by the materials' `sample` and `transfer`.
#include "integrate/tracer.h"

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

Vec3f Tracer::directLight(Call& call)
{
    ShadeState& state = call.state;
    PreparedMaterial const& material = scene_.materialOf(call.surface);
    Vec3f const faced = dot(state.I, state.Ng) <= 0.0f ? state.N : -state.N;
    // Light from behind counts where a surface lets light through.
    Vec3f const sides[2] = {faced, -faced};
    int const count = (material.entryPoints & kTransmission) ? 2 : 1;
    Vec3f sum{0, 0, 0};
    for (int i = 0; i < count; ++i)
        for (LightSample const* l = getLightSamples(0, &state.P, &sides[i]); l; l = l->next) {
            state.sampleDirection = l->L;
            state.outBrdf = {0, 0, 0};
            state.sampleCosine = 0.0f;
            material.shader->transfer(this, state);
            sum += positive(state.outBrdf * maxOf(state.sampleCosine, 0.0f)) * l->color * l->shadow
                * kPi;
        }
    return finite(sum);
}

bool Tracer::scatter(PathRay& ray, SurfacePoint const& surface, Path& path)
{
    PreparedMaterial const& material = scene_.materialOf(surface);
    PathRay next = ray;
    {
        Call call(*this, ray, surface);
        path.light += path.throughput * directLight(call);

        ShadeState& state = call.state;
        std::fill_n(state.allowReflection, 3, std::uint8_t(1));
        std::fill_n(state.allowTransmission, 3, std::uint8_t(1));
        state.sampleType = kSampleNone;
        material.shader->sample(this, state);
        if (state.sampleType == kSampleNone)
            return false;
        path.throughput *=
            positive(finite(state.outBrdf * (state.sampleCosine * state.sampleInvPdf)));
        if (maxComponent(path.throughput) <= 0.0f || !isFinite(state.sampleDirection)
            || !(dot(state.sampleDirection, state.sampleDirection) > 0.0f))
            return false;

        next.direction = normalize(state.sampleDirection);
        next.E = surface.P;
        next.origin = start(surface.P, next.direction);
        // Straight on, as if nothing were there; a medium's boundary bends even what it hardly
        // bends.
        if (state.sampleDirection == ray.direction && !material.ior) {
            next.passes += 1;
            next.type = ray.type == kRayCamera ? std::uint32_t(kRayTransmission) : ray.type;
        } else {
            next.depth += 1;
            next.type = kRayReflection;
            path.straight = false;
        }
        changeMedia(next, ray.direction, surface, material.ior ? &state.beyondIor : nullptr);
    }
    ray = next;
    return survives(ray, path);
}

bool Tracer::survives(PathRay& ray, Path& path)
{
    float const kept = maxComponent(path.throughput);
    if (ray.depth < kRouletteDepth || kept >= 1.0f)
        return true;
    float const chance = maxOf(kept, 0.05f);
    if (!(sampler_->next() < chance))
        return false;
    path.throughput = path.throughput / chance;
    return true;
}

} // namespace zsi::host
