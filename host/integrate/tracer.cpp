#include "integrate/tracer.h"

namespace zsi::host {
namespace {

// Bounds on rays that never leave by themselves, far above what scenes need.
constexpr int kMaxPasses = 128;
constexpr int kMaxIgnoredHits = 1024;

bool isFront(Vec3f I, Vec3f Ng) { return dot(I, Ng) <= 0.0f; }

} // namespace

Tracer::Call::Call(Tracer& tracer, PathRay const& ray_, SurfacePoint const& surface_)
    : ray(ray_)
    , surface(surface_)
    , state(tracer.record(ray_))
    , tracer_(tracer)
    , outer_(tracer.call_)
    , lightMark_(tracer.lightRecords_.mark())
{
    tracer.fillSurface(ray, surface, state);
    tracer.call_ = this;
}

Tracer::Call::~Call()
{
    tracer_.lightRecords_.release(lightMark_);
    tracer_.call_ = outer_;
}

Tracer::Tracer(PreparedScene const& scene)
    : scene_(scene)
    , settings_(scene.scene.settings)
    , paths_(settings_.integrator == "path")
    , maxDepth_(static_cast<std::uint32_t>(settings_.maxDepth > 0 ? settings_.maxDepth : 0))
{
}

bool Tracer::cameraSample(Vec3f origin, Vec3f direction, float rasterX, float rasterY,
                          Sampler& sampler, Vec4f& result)
{
    sampler_ = &sampler;
    rasterX_ = rasterX;
    rasterY_ = rasterY;
    PathRay ray;
    ray.E = ray.origin = origin;
    ray.direction = direction;
    std::uint64_t const before = nonFinite_;
    result = radiance(ray);
    if (isFinite(rgb(result)) && std::isfinite(result.w))
        return true;
    if (nonFinite_ == before)
        ++nonFinite_;
    return false;
}

Vec4f Tracer::radiance(PathRay ray)
{
    Path path;
    int ignored = 0;
    for (;;) {
        Hit hit;
        ++rays_;
        bool const stops =
            ray.depth >= maxDepth_ || ray.passes > kMaxPasses || ignored > kMaxIgnoredHits;
        Vec4f seen;
        if (stops || !scene_.rays.intersect({ray.origin, ray.direction}, Visibility::All, hit)) {
            seen = environment(ray);
        } else {
            SurfacePoint const surface = scene_.rays.surface(hit);
            if (paths_ && scene_.materialOf(surface).scatters()) {
                if (!scatter(ray, surface, path))
                    return withAlpha(path.light, 1.0f);
                continue;
            }
            if (!shade(ray, surface, seen)) {
                // Ignored: the same ray goes on behind it as if nothing had been there.
                ray.origin = offsetPoint(
                    surface.P, surface.Ng * (dot(ray.direction, surface.Ng) < 0 ? -1.0f : 1.0f));
                ++ignored;
                continue;
            }
        }
        return withAlpha(path.light + path.throughput * rgb(seen), path.straight ? seen.w : 1.0f);
    }
}

Vec4f Tracer::environment(PathRay const& ray)
{
    if (!scene_.scene.environment)
        return {0, 0, 0, 0};
    ShadeState state = record(ray);
    scene_.scene.environment->environment()->shade(this, state);
    return withAlpha(finite(rgb(state.Ci)), state.Ci.w);
}

bool Tracer::shade(PathRay const& ray, SurfacePoint const& surface, Vec4f& result)
{
    Call call(*this, ray, surface);
    call.state.Ci = {0, 0, 0, 1};
    scene_.materialOf(surface).shader->shade(this, call.state);
    if (call.state.discardHit)
        return false;
    result = call.state.Ci;
    // A camera sample is left out as a whole; further down what can be saved of it is.
    if (ray.depth > 0 || ray.passes > 0)
        result = withAlpha(finite(rgb(result)), std::isfinite(result.w) ? result.w : 1.0f);
    return true;
}

ShadeState Tracer::record(PathRay const& ray) const
{
    ShadeState state{};
    state.E = ray.E;
    state.I = ray.direction;
    state.rasterX = rasterX_;
    state.rasterY = rasterY_;
    state.imageHeight = scene_.scene.film.height;
    state.incomingIor = state.beyondIor = ray.media.current();
    state.objectToWorld = Mat4f::identity();
    state.rayType = ray.type;
    state.rayDepth = ray.depth;
    state.maxRayDepth = maxDepth_;
    return state;
}

void Tracer::fillSurface(PathRay const& ray, SurfacePoint const& s, ShadeState& state) const
{
    state.P = s.P;
    state.N = s.N;
    state.Ng = s.Ng;
    state.Pref = s.objectP;
    state.Nref = s.objectN;
    state.objectToWorld = scene_.scene.instances[s.instance].objectToWorld;
    PreparedMaterial const& material = scene_.materialOf(s);
    if (!isFront(ray.direction, s.Ng))
        state.beyondIor = ray.media.without(s.instance);
    else if (material.ior)
        state.beyondIor = *material.ior;
    scene_.fillAttributes(s, state);
}

void Tracer::changeMedia(PathRay& next, Vec3f arrived, SurfacePoint const& s, float const* ior)
{
    bool const front = isFront(arrived, s.Ng);
    bool const inwards = dot(next.direction, s.Ng) < 0.0f;
    if (front && inwards && ior)
        next.media.enter(s.instance, *ior);
    else if (!front && !inwards)
        next.media.leave(s.instance);
}

Vec3f Tracer::finite(Vec3f v)
{
    if (isFinite(v))
        return v;
    ++nonFinite_;
    return {0, 0, 0};
}

} // namespace zsi::host
