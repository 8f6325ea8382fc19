// SPDX-License-Identifier: Apache-2.0
// The services of a shading call. docs/services.md describes them.
#include "sampling/directions.h"
#include "shading/shadingContext.h"

#include <limits>

namespace zsi::host {
namespace {

/// Rays that count less than this are traced with a chance in proportion, and count for more.
constexpr float kFullImportance = 1.0f / 32.0f;
/// From this depth on that goes for all that count less than 1, so that chains end by themselves.
constexpr std::uint32_t kRouletteDepth = 3;
/// Of a camera sample that has sent out more rays than this, further ones are traced with a chance
/// that falls with their number: materials that send on more light than they get, by several rays
/// each, would otherwise double their number with every bounce.
constexpr float kFullRays = 256.0f;
/// A shadow ray that went through so many surfaces is taken for blocked.
constexpr int kMaxShadowSurfaces = 256;
/// Shadow segments end a little before their goal, which may be a surface.
constexpr float kShadowEnd = 1.0f - 1e-5f;

bool unit(Vec3f& v)
{
    float const l = length(v);
    if (!(l > 0.0f) || !std::isfinite(l))
        return false;
    v = v / l;
    return true;
}

} // namespace

LightSample* ShadingContext::getLightSamples(int, Vec3f const* P, Vec3f const* normal)
{
    if (!call_ || !tellsOf(*normal))
        return nullptr;
    call_->askedLights_ = true;
    LightSample* head = nullptr;
    LightSample** end = &head;
    if (*P == call_->surface.P && scene_.listsSky(call_->material, call_->ray.type)) {
        call_->askedSky_ = true;
        if (LightSample sample; askSky(*normal, sample)) {
            head = &lightRecords_.add();
            *head = sample;
            end = &head->next;
        }
    }
    auto const random = [this] { return sampler_->next(); };
    scene_.lights().forEach(*P, *normal, random, [&](std::size_t light, float scale) {
        Arrival picked;
        LightSample sample;
        if (!pickLight(light, *P, *normal, picked) || !arriving(light, *P, *normal, picked, sample))
            return;
        if (picked.density > 0.0f && call_->material.scatters())
            if (float const lobe = lobeDensity(picked.L); !std::isinf(lobe))
                scale *= picked.density / (picked.density + lobe);
        sample.color = sample.color * scale;
        LightSample& kept = lightRecords_.add();
        kept = sample;
        *end = &kept;
        end = &kept.next;
    });
    return head;
}

bool ShadingContext::tellsOf(Vec3f normal)
{
    if (call_->answers_ == Answers::All)
        return true;
    Vec3f const Ng = call_->surface.Ng;
    bool const isFar = dot(normal, Ng) * dot(call_->ray.direction, Ng) > 0.0f;
    return isFar && tellsBeyond();
}

bool ShadingContext::tellsBeyond()
{
    if (call_->answers_ == Answers::All)
        return true;
    call_->asked_ |= kBeyond;
    bool const tells = call_->answers_ == Answers::Beside && !call_->material.transmits;
    call_->heard_ = call_->heard_ || tells;
    return tells;
}

bool ShadingContext::pickLight(std::size_t light, Vec3f P, Vec3f normal, Arrival& picked)
{
    LightSet const& lights = scene_.lights();
    Vec2f const u = lights.isSpread(light) ? sampler_->next2D() : Vec2f(0, 0);
    std::optional<Arrival> const a = lights.arrival(light, P, normal, u);
    if (a)
        picked = *a;
    return a.has_value();
}

bool ShadingContext::arriving(std::size_t light, Vec3f P, Vec3f normal, Arrival const& picked,
                              LightSample& sample)
{
    if (auto const* const shader = std::get_if<ShaderLight>(&scene_.lights()[light])) {
        ShadeState state = call_->state;
        if (!askLight(*shader, picked.to, P, normal, this, state, sample))
            return false;
    } else {
        sample = {};
        sample.L = picked.L;
        sample.color = picked.color;
        sample.weight = minOf(dot(picked.L, normal), 1.0f);
        sample.shadow = picked.isFar ? transmit(P, shadowStart(P, picked.L), picked.L,
                                                std::numeric_limits<float>::infinity())
                                     : shadowTransmission(&P, &picked.to);
    }
    sample.color = finite(sample.color);
    sample.shadow = finite(sample.shadow);
    return true;
}

float ShadingContext::lobeDensity(Vec3f L)
{
    ShadeState state = call_->state;
    state.sampleDirection = L;
    state.outBrdf = {0, 0, 0};
    state.sampleCosine = 0.0f;
    call_->material.shader->transfer(this, state);
    float const density = call_->material.density(state.outBrdf * state.sampleCosine);
    return density > 0.0f && std::isfinite(density) ? density
                                                    : std::numeric_limits<float>::infinity();
}

bool ShadingContext::askSky(Vec3f normal, LightSample& sample)
{
    DirectionMap const& map = scene_.sky(kRayReflection);
    auto const [d, drawn] = map.sample(sampler_->next2D());
    float const cosine = dot(d, normal);
    if (!(cosine > 0.0f))
        return false;
    float const lobe = lobeDensity(d);
    if (std::isinf(lobe)) // nothing is sent on from there
        return false;
    Vec3f const light = sky(kRayReflection, d);
    if (!(maxComponent(light) > 0.0f))
        return false;
    ++rays_.shadow;
    if (scene_.rays().occluded({shadowStart(call_->surface.P, d), d}, Visibility::All))
        return false;
    sample = {};
    sample.L = d;
    sample.color = light / (3.14159265f * (drawn + lobe));
    sample.shadow = {1, 1, 1};
    sample.weight = minOf(cosine, 1.0f);
    return true;
}

Vec3f ShadingContext::ambientLight(Vec3f const* P, Vec3f const* N)
{
    if (!call_)
        return settings_.ambient;
    call_->asked_ |= kAmbient;
    if (call_->isSilent())
        return {0, 0, 0};
    call_->gathered_ = {true, *P, *N, settings_.ambient, {0, 0, 0}};
    call_->heard_ = call_->heard_ || !(settings_.ambient == Vec3f(0, 0, 0));
    return settings_.ambient;
}

Vec3f ShadingContext::shadowTransmission(Vec3f const* from, Vec3f const* to)
{
    Vec3f direction = *to - *from;
    if (!unit(direction))
        return {1, 1, 1};
    Vec3f const origin = shadowStart(*from, direction);
    direction = *to - origin;
    float const distance = length(direction);
    if (!unit(direction))
        return {1, 1, 1};
    return transmit(*from, origin, direction, distance * kShadowEnd);
}

Vec3f ShadingContext::transmit(Vec3f E, Vec3f origin, Vec3f direction, float tMax)
{
    ++rays_.shadow;
    if (scene_.rays().occluded({origin, direction, tMax}, Visibility::Opaque))
        return {0, 0, 0};

    PathRay ray = query(kRayShadow, direction);
    ray.E = E;
    ray.origin = origin;
    if (call_)
        ray.cone = call_->cone_;
    if (call_ && E == call_->surface.P)
        changeMedia(ray, call_->ray.direction, call_->surface, call_->material.ior);
    Vec3f passed{1, 1, 1};
    for (int i = 0; i < kMaxShadowSurfaces; ++i) {
        Hit hit;
        if (!scene_.rays().intersect({ray.origin, direction, tMax}, Visibility::Clear, hit))
            return passed;
        SurfacePoint const surface = scene_.rays().surface(hit);
        PreparedMaterial const& material = scene_.materialOf(surface);
        {
            Call call(*this, ray, surface);
            material.shader->transmission(this, call.state);
            passed *= finite(call.state.transmissionColor);
        }
        if (passed == Vec3f(0, 0, 0))
            return passed;
        changeMedia(ray, direction, surface, material.ior);
        // Each stretch between two surfaces is a ray of its own: where the next surface absorbs
        // over the distance from `E`, that is the way inside the medium.
        ray.E = surface.P;
        ray.origin =
            offsetPoint(surface.P, dot(direction, surface.Ng) > 0.0f ? surface.Ng : -surface.Ng);
        tMax -= hit.t;
        if (!(tMax > 0.0f))
            return passed;
    }
    return {0, 0, 0};
}

bool ShadingContext::isSent(float& scale)
{
    float const all = kFullRays * static_cast<float>(std::max(1, settings_.indirectSamples));
    if (sent_ >= all) {
        float const chance = all / (sent_ + 1.0f);
        if (!(sampler_->next() < chance))
            return false;
        scale /= chance;
    }
    sent_ += 1.0f;
    return true;
}

bool ShadingContext::depart(Vec3f const* origin, Vec3f const* direction, PathRay& ray) const
{
    if (!call_ || !isFinite(*origin))
        return false;
    ray = call_->ray;
    ray.direction = *direction;
    if (!unit(ray.direction))
        return false;
    ray.E = *origin;
    ray.origin = rayStart(*origin, ray.direction);
    ray.ignored = 0;
    ray.cone = call_->cone_;
    ray.skyDensity = std::numeric_limits<float>::infinity();
    return true;
}

bool ShadingContext::child(Vec3f const* origin, Vec3f const* direction, float importance,
                           PathRay& ray, float& scale)
{
    if (importance <= 0.0f || !depart(origin, direction, ray))
        return false;
    ray.depth += 1;
    ray.importance *= importance < 1.0f ? importance : 1.0f;
    scale = 1.0f;
    float const full = ray.depth > kRouletteDepth ? 1.0f : kFullImportance;
    if (ray.importance < full) {
        float const chance = ray.importance / full;
        if (!(sampler_->next() < chance))
            return false;
        scale = 1.0f / chance;
        ray.importance = full;
    }
    if (!isSent(scale))
        return false;
    ray.scatteredAt = *origin;
    ray.lobeDensity = std::numeric_limits<float>::infinity();
    bool const listed = scene_.lights().hasSurfaces() && call_->askedLights_;
    if (call_->askedSky_ || (listed && call_->material.scatters())) {
        float const lobe = lobeDensity(ray.direction);
        if (listed)
            ray.lobeDensity = lobe;
        if (call_->askedSky_)
            ray.skyDensity = lobe;
    }

    changeMedia(ray, call_->ray.direction, call_->surface, call_->material.ior);
    ray.cone = bentCone(ray);
    return true;
}

bool ShadingContext::continuation(Vec3f const* origin, Vec3f const* direction, float importance,
                                  PathRay& ray, float& scale)
{
    scale = 1.0f;
    if (!depart(origin, direction, ray))
        return false;
    ray.passes += 1;
    ray.importance *= importance < 1.0f ? maxOf(importance, 0.0f) : 1.0f;
    return isSent(scale);
}

Vec3f ShadingContext::traceContinue(int rayType, Vec3f const* origin, Vec3f const* direction,
                                    float importance)
{
    if (call_ && call_->answers_ != Answers::All)
        return rgb(traceThrough(origin, direction, importance));
    PathRay ray;
    float scale;
    if (!continuation(origin, direction, importance, ray, scale))
        return {0, 0, 0};
    ray.type = static_cast<std::uint32_t>(rayType);
    return rgb(answered(ray)) * scale;
}

Vec4f ShadingContext::traceThrough(Vec3f const* P, Vec3f const* I, float importance)
{
    if (call_ && call_->answers_ != Answers::All) {
        call_->asked_ |= kStraight;
        return call_->answers_ == Answers::Behind ? Vec4f(1, 1, 1, 0) : Vec4f(0, 0, 0, 1);
    }
    PathRay ray;
    float scale;
    if (!continuation(P, I, importance, ray, scale))
        return {0, 0, 0, 0};
    if (ray.type == kRayCamera)
        ray.type = kRayTransmission;
    return answered(ray) * scale;
}

Vec3f ShadingContext::traceReflection(Vec3f const* origin, Vec3f const* direction, float importance)
{
    return traceSpecular(origin, direction, 0.0f, importance);
}

Vec3f ShadingContext::traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                                    float importance)
{
    if (call_ && call_->answers_ != Answers::All)
        return {0, 0, 0};
    return traceLobe(origin, direction, spread, 2.0f, importance);
}

Vec3f ShadingContext::traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                                      float importance)
{
    if (call_ && !tellsBeyond())
        return {0, 0, 0};
    // A refracted ray turns by |1 - 1/n| to |n - 1| of the facet's tilt: about a half for glass.
    return traceLobe(origin, direction, spread, 0.5f, importance);
}

Vec3f ShadingContext::traceLobe(Vec3f const* origin, Vec3f const* direction, float spread,
                                float turn, float importance)
{
    Vec3f axis = *direction;
    if (!call_ || !unit(axis))
        return {0, 0, 0};
    Vec3f const Ng = call_->surface.Ng;
    Vec3f const side = dot(axis, Ng) < 0.0f ? -Ng : Ng;
    float const width = minOf(spread, 1.0f);
    Vec3f const way = spread > 0.0f
        ? towardsSide(lobeDirection(axis, width, turn, sampler_->next2D()), side)
        : axis;
    PathRay ray;
    float scale;
    if (!child(origin, &way, importance, ray, scale))
        return {0, 0, 0};
    ray.type = kRayReflection;
    if (!(spread > 0.0f))
        return rgb(answered(ray)) * scale;
    leaveToLightList(ray);
    auto const density = [&](Vec3f d) {
        return dot(d, side) < 0.0f ? 0.0f
                                   : host::lobeDensity(dot(axis, d), width, turn)
                + host::lobeDensity(dot(axis, d - side * (2.0f * dot(d, side))), width, turn);
    };
    ray.cone = ray.cone.scattered(density(ray.direction));
    if (!(*origin == call_->surface.P))
        return rgb(answered(ray)) * scale;
    return gather(ray, density) * scale;
}

template <class Density>
Vec3f ShadingContext::gather(PathRay ray, Density const& density)
{
    if (scene_.sky(ray.type).isEmpty() || call_->askedSky_)
        return rgb(answered(ray));
    ray.skyDensity = density(ray.direction);
    Vec3f const sky = fromSky(
        ray.type, [&](Vec3f d) { return Vec3f(1, 1, 1) * density(d); }, density);
    return rgb(answered(ray)) + sky;
}

void ShadingContext::leaveToLightList(PathRay& ray) const
{
    if (call_->askedLights_ && !call_->material.scatters())
        ray.lobeDensity = 0.0f;
}

Vec3f ShadingContext::gatherNormal(Vec3f P, Vec3f N) const
{
    if (!(P == call_->surface.P))
        return N;
    Vec3f const Ng = call_->surface.Ng;
    return dot(N, Ng) < 0.0f ? -Ng : Ng;
}

Vec3f ShadingContext::occlusion(Vec3f const* P, Vec3f const* N, float)
{
    Vec3f axis = *N;
    if (!call_ || !isFinite(*P) || !unit(axis)) // no normal, no hemisphere to be blocked
        return {1, 1, 1};
    // Traced light has been stopped by all that stands in its way already: where a material asks
    // for the occlusion of ambient and indirect light together, only the ambient part is occluded.
    Call::Gathered& gathered = call_->gathered_;
    bool const ofGathered = gathered.pending && gathered.P == *P && gathered.N == *N
        && !(gathered.ambient + gathered.indirect == Vec3f(0, 0, 0));
    if (ofGathered) {
        gathered.pending = false;
        if (gathered.ambient == Vec3f(0, 0, 0))
            return {1, 1, 1};
    } else if (call_->answers_ != Answers::All) {
        call_->asked_ |= kOcclusion;
        if (call_->isSilent() || !call_->heard_) // there is nothing to be darkened
            return {1, 1, 1};
    }
    float const tMax = settings_.occlusionDistance > 0.0f ? settings_.occlusionDistance
                                                          : std::numeric_limits<float>::infinity();
    int const count = call_->ray.depth == 0 ? std::max(1, settings_.occlusionSamples) : 1;
    Vec3f const side = gatherNormal(*P, axis);
    Sampler::Points const points = sampler_->next2D(count);
    Vec3f open{0, 0, 0};
    for (int i = 0; i < count; ++i) {
        Vec3f const direction = towardsSide(cosineDirection(axis, points[i]), side);
        open += transmit(*P, shadowStart(*P, direction), direction, tMax);
    }
    open = open / static_cast<float>(count); // exactly 1 when every ray is free
    if (!ofGathered)
        return open;
    auto const share = [](float o, float ambient, float indirect) {
        float const all = ambient + indirect;
        return all > 0.0f ? (ambient * o + indirect) / all : o;
    };
    return {share(open.x, gathered.ambient.x, gathered.indirect.x),
            share(open.y, gathered.ambient.y, gathered.indirect.y),
            share(open.z, gathered.ambient.z, gathered.indirect.z)};
}

Vec3f ShadingContext::indirectDiffuse(Vec3f const* P, Vec3f const* N, float importance)
{
    Vec3f axis = *N;
    if (!call_ || !unit(axis))
        return {0, 0, 0};
    call_->asked_ |= kIndirect;
    if (!tellsOf(*N))
        return {0, 0, 0};
    int const count = call_->ray.depth == 0 ? std::max(1, settings_.indirectSamples) : 1;
    Vec3f const side = gatherNormal(*P, axis);
    Sampler::Points const points = sampler_->next2D(count);
    auto const density = [&](Vec3f d) {
        return dot(d, side) < 0.0f
            ? 0.0f
            : (maxOf(dot(axis, d), 0.0f) + maxOf(dot(axis, d - side * (2.0f * dot(d, side))), 0.0f))
                / 3.14159265f;
    };
    Vec3f sum{0, 0, 0};
    for (int i = 0; i < count; ++i) {
        Vec3f const direction = towardsSide(cosineDirection(axis, points[i]), side);
        PathRay ray;
        float scale;
        if (!child(P, &direction, importance, ray, scale))
            continue;
        ray.type = kRayDiffuse;
        ray.cone = ray.cone.scattered(density(ray.direction));
        // Where `transfer` gives nothing, as through a leaf, the list stood for all of the lights.
        if (std::isinf(ray.lobeDensity) && call_->askedLights_)
            ray.lobeDensity = 0.0f;
        ray.origin = shadowStart(*P, direction);
        if (*P == call_->surface.P)
            sum += gather(ray, density) * scale;
        else
            sum += rgb(answered(ray)) * scale;
    }
    sum = sum / static_cast<float>(count);
    Call::Gathered& gathered = call_->gathered_;
    if (!(gathered.pending && gathered.P == *P && gathered.N == *N))
        gathered = {true, *P, *N, {0, 0, 0}, {0, 0, 0}};
    gathered.indirect = sum;
    return sum;
}

Vec3f ShadingContext::rayStart(Vec3f origin, Vec3f direction) const
{
    if (!call_ || !(origin == call_->surface.P))
        return origin;
    Vec3f const Ng = call_->surface.Ng;
    return offsetPoint(origin, dot(direction, Ng) < 0.0f ? -Ng : Ng);
}

Vec3f ShadingContext::shadowStart(Vec3f origin, Vec3f direction) const
{
    if (call_ && origin == call_->surface.P && dot(direction, call_->surface.Ng) > 0.0f) {
        if (!call_->smoothStart_)
            call_->smoothStart_ =
                offsetPoint(scene_.rays().smoothPoint(call_->surface), call_->surface.Ng);
        return *call_->smoothStart_;
    }
    return rayStart(origin, direction);
}

float ShadingContext::random() { return sampler_->next(); }
Vec2f ShadingContext::random2D() { return sampler_->next2D(); }

} // namespace zsi::host
