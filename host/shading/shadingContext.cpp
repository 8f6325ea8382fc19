// SPDX-License-Identifier: Apache-2.0
#include "shading/shadingContext.h"

#include "sampling/directions.h"
#include "shading/partsOfShade.h"

#include <algorithm>
#include <cstring>

namespace zsi::host {
namespace {

// Bounds on rays that never leave by themselves, far above what scenes need.
constexpr int kMaxPasses = 128;
constexpr int kMaxIgnoredHits = 1024;

bool isFront(Vec3f I, Vec3f Ng) { return dot(I, Ng) <= 0.0f; }

} // namespace

ShadingContext::Call::Call(ShadingContext& context, PathRay const& ray_,
                           SurfacePoint const& surface_, PreparedMaterial const& material_)
    : ray(ray_)
    , surface(surface_)
    , material(material_)
    , state(context.record(ray_))
    , context_(context)
    , cone_(ray_.cone.after(length(surface_.P - ray_.E)))
    , footprint_(context.footprint(cone_, surface_))
    , outer_(context.call_)
    , lightMark_(context.lightRecords_.mark())
{
    state.P = surface.P;
    state.N = surface.N;
    state.Ng = surface.Ng;
    state.Pref = surface.objectP;
    state.Nref = surface.objectN;
    context.call_ = this;
}

ShadingContext::Call::Call(ShadingContext& context, PathRay const& ray_,
                           SurfacePoint const& surface_)
    : Call(context, ray_, surface_, context.scene_.materialOf(surface_))
{
    context.fillSurface(ray, surface, material, state);
    if (ray.type == kRayCamera && !context.hasFirstHit_) {
        context.firstHit_ = {surface, length(surface.P - ray.E)};
        context.hasFirstHit_ = true;
    }
}

ShadingContext::Call::~Call()
{
    context_.lightRecords_.release(lightMark_);
    context_.call_ = outer_;
}

ShadingContext::ShadingContext(PreparedScene const& scene, RadianceSource& source)
    : scene_(scene)
    , settings_(scene.scene().settings)
    , source_(source)
    , maxDepth_(static_cast<std::uint32_t>(settings_.maxDepth > 0 ? settings_.maxDepth : 0))
    , nonFiniteOf_(scene.scene().materials.size() + 1)
{
    for (Shader const& material : scene.scene().materials)
        mapScales_.push_back(mapScale(material));
    hasMaps_ = std::any_of(mapScales_.begin(), mapScales_.end(), [](float s) { return s > 0.0f; });
}

RayCone ShadingContext::cameraCone() const
{
    // Half a pixel: look-ups are interpolated, and several samples spread over the pixel.
    Scene const& scene = scene_.scene();
    return {0.0f,
            std::tan(scene.camera.verticalFov * (3.14159265f / 360.0f))
                / static_cast<float>(scene.film.height)};
}

RayCone ShadingContext::bentCone(PathRay const& next) const
{
    if (!hasMaps_)
        return {};
    PathRay const& ray = call_->ray;
    SurfacePoint const& s = call_->surface;
    float const outwards = scene_.curvature(s);
    float const curvature = isFront(ray.direction, s.Ng) ? outwards : -outwards;
    if (dot(ray.direction, s.Ng) * dot(next.direction, s.Ng) < 0.0f)
        return call_->cone_.mirrored(curvature);
    return call_->cone_.refracted(curvature, ray.media.current(), next.media.current());
}

float ShadingContext::mapScale(Shader const& material) const
{
    bool maps = false;
    float slowest = std::numeric_limits<float>::infinity();
    for (Parameter const& p : material.parameters()) {
        if (p.type == ParameterType::Texture2D)
            maps |= static_cast<TextureSampler2D const*>(p.field)->texture != nullptr;
        else if (p.type == ParameterType::Mat4f) {
            // Laid on by position, at a pace of its own.
            auto const& m = static_cast<Mat4f const*>(p.field)->m;
            if (std::any_of(std::begin(m), std::end(m), [](float v) { return v != 0.0f; }))
                return 0.0f;
        } else if (p.type == ParameterType::Mat3f) {
            auto const& m = static_cast<Mat3f const*>(p.field)->m;
            float const pace = minOf(std::hypot(m[0], m[1]), std::hypot(m[3], m[4]));
            if (pace > 0.0f) // 0: not written, not used
                slowest = minOf(slowest, pace);
        }
    }
    return !maps ? 0.0f : std::isinf(slowest) ? 1.0f : slowest;
}

float ShadingContext::footprint(RayCone const& cone, SurfacePoint const& surface) const
{
    int const material = scene_.scene().instances[surface.instance].material;
    float const scale = mapScales_[static_cast<std::size_t>(material)];
    return scale > 0.0f ? std::fabs(cone.width) * scene_.uvDensity(surface) * scale : 0.0f;
}

void ShadingContext::start(Sampler& sampler, float rasterX, float rasterY, bool keepsParts)
{
    keepsParts_ = keepsParts;
    parts_ = {};
    sampler_ = &sampler;
    rasterX_ = rasterX;
    rasterY_ = rasterY;
    sent_ = 0.0f;
    hasFirstHit_ = false;
}

bool ShadingContext::intersect(PathRay const& ray, SurfacePoint& surface, Vec4f& seen)
{
    ++(ray.type == kRayReflection    ? rays_.reflection
           : ray.type == kRayDiffuse ? rays_.diffuse
                                     : rays_.camera);
    Hit hit;
    if (!scene_.rays().intersect({ray.origin, ray.direction}, Visibility::All, hit)) {
        seen = environment(ray);
        parts_ = {rgb(seen)};
        return false;
    }
    bool const isLight = scene_.scene().instances[hit.instance].light >= 0;
    seen = {0, 0, 0, 1};
    parts_ = {};
    if (!isLight
        && (ray.depth >= maxDepth_ || ray.passes > kMaxPasses || ray.ignored > kMaxIgnoredHits))
        return false;
    surface = scene_.rays().surface(hit);
    if (!isLight)
        return true;
    if (ray.type == kRayCamera && !hasFirstHit_) {
        firstHit_ = {surface, length(surface.P - ray.E)};
        hasFirstHit_ = true;
    }
    seen = withAlpha(emission(ray, surface), 1.0f);
    parts_.emission = rgb(seen);
    return false;
}

Vec3f ShadingContext::emission(PathRay const& ray, SurfacePoint const& surface) const
{
    auto const light = static_cast<std::size_t>(scene_.scene().instances[surface.instance].light);
    if (!isFront(ray.direction, surface.Ng) || !(ray.lobeDensity > 0.0f))
        return {0, 0, 0};
    Vec3f const emitted = std::get<SurfaceLight>(scene_.lights()[light]).emission;
    if (std::isinf(ray.lobeDensity))
        return emitted;
    float const listed =
        scene_.lights().surface(light).density(ray.scatteredAt, surface.P, surface.Ng);
    return std::isinf(listed) ? Vec3f(0, 0, 0)
                              : emitted * (ray.lobeDensity / (ray.lobeDensity + listed));
}

Vec4f ShadingContext::environment(PathRay const& ray)
{
    EnvironmentShader const* const environment = scene_.environment();
    if (!environment)
        return {0, 0, 0, 0};
    TextureFootprint const whole(0.0f);
    ShadeState state = record(ray);
    if (scene_.scene().environmentVisible
        && (ray.type == kRayCamera || ray.type == kRayTransmission))
        state.maxRayDepth = state.rayDepth;
    environment->shade(this, state);
    if (!isFinite(rgb(state.Ci))) {
        ++nonFinite_;
        ++nonFiniteOf_.back();
        return withAlpha({0, 0, 0}, state.Ci.w);
    }
    if (std::isinf(ray.skyDensity))
        return state.Ci;
    float const shared = scene_.sky(ray.type).density(ray.direction);
    if (!(shared > 0.0f))
        return state.Ci;
    return withAlpha(rgb(state.Ci) * (ray.skyDensity / (ray.skyDensity + shared)), state.Ci.w);
}

PathRay ShadingContext::query(std::uint32_t type, Vec3f direction) const
{
    PathRay ray;
    if (call_)
        ray = call_->ray;
    ray.type = type;
    ray.depth += 1;
    ray.direction = direction;
    return ray;
}

Vec3f ShadingContext::sky(std::uint32_t rayType, Vec3f d)
{
    PathRay ray = query(rayType, d);
    ray.skyDensity = std::numeric_limits<float>::infinity();
    return rgb(environment(ray));
}

ShadeState ShadingContext::trialRecord(PreparedMaterial const& material, std::uint32_t rayType)
{
    using Source = PreparedMaterial::Source;
    Vec2f const place = sampler_->next2D(), way = sampler_->next2D();
    PathRay ray;
    ray.type = rayType;
    ray.direction = -around({0, 0, 1}, 0.2f + 0.8f * way.x, way.y);
    ShadeState state = record(ray);
    state.P = state.Pref = {place.x, place.y, 0};
    state.E = state.P - ray.direction;
    state.N = state.Ng = state.Nref = {0, 0, 1};
    auto const deliver = [&](PreparedMaterial::Slot const& slot, auto const& value) {
        std::memcpy(state.attributes + slot.offset, &value, sizeof value);
    };
    for (PreparedMaterial::Slot const& slot : material.attributes)
        if (slot.source == Source::Uv || slot.source == Source::Uv1)
            deliver(slot, place);
        else if (slot.source == Source::Color)
            deliver(slot, Vec4f(1, 1, 1, 1));
        else
            deliver(slot, slot.source == Source::Tangent ? Vec3f(1, 0, 0) : Vec3f(0, 1, 0));
    std::fill_n(state.allowReflection, 3, std::uint8_t(1));
    std::fill_n(state.allowTransmission, 3, std::uint8_t(1));
    return state;
}

void ShadingContext::examine(PreparedMaterial const& material, Findings& findings)
{
    ShadeState const trial = trialRecord(material, kRayCamera);
    SurfacePoint s{};
    s.N = s.Ng = s.objectN = trial.N;
    // Near and far: projected maps have a depth.
    float const reach = std::exp2(12.0f * sampler_->next() - 4.0f);
    s.P = s.objectP = Vec3f(trial.P.x, trial.P.y, sampler_->next()) * reach;
    PathRay ray;
    ray.direction = sampler_->next() < 0.5f ? trial.I : -trial.I;
    ray.E = s.P - ray.direction;

    Call call(*this, ray, s, material);
    ShadeState& state = call.state;
    std::memcpy(state.attributes, trial.attributes, sizeof state.attributes);

    call.smoothStart_ = s.P; // the place is of no mesh
    call.answers_ = Answers::None;
    Findings::Side& side = isFront(ray.direction, s.Ng) ? findings.front : findings.back;
    // As the face looks, and with a normal that may lean away from the viewer: some ask by that.
    Vec2f const lean = sampler_->next2D();
    for (Vec3f const N : {s.N, around({0, 0, 1}, 1.0f - 0.9f * lean.x, lean.y)}) {
        state.N = N;
        state.Ci = {0, 0, 0, 0};
        material.shader->shade(this, state);
        side.emits = side.emits || !(rgb(state.Ci) == Vec3f(0, 0, 0));
        side.asked |= call.asked_ | (state.discardHit ? kStraight : 0u);
    }
    state.N = s.N;

    std::fill_n(state.allowTransmission, 3, std::uint8_t(1));
    state.sampleType = kSampleNone;
    material.shader->sample(this, state);
    findings.transmits = findings.transmits
        || (state.sampleType != kSampleNone
            && dot(state.sampleDirection, s.Ng) * dot(ray.direction, s.Ng) > 0.0f);
    std::fill_n(state.allowReflection, 3, std::uint8_t(1));
    state.sampleType = kSampleNone;
    material.shader->sample(this, state);
    findings.mixes = findings.mixes || state.sampleType == kSampleMixture;
}

bool ShadingContext::shade(PathRay const& ray, SurfacePoint const& surface, Vec4f& result)
{
    bool const hadFirstHit = hasFirstHit_;
    Call call(*this, ray, surface);
    call.state.Ci = {0, 0, 0, 1};
    LightParts parts;
    if (keepsParts_ && ray.depth <= 1)
        parts = shadeInParts(*this, call);
    else
        call.material.shader->shade(this, call.state);
    parts_ = parts; // rays on its behalf have left theirs
    if (call.state.discardHit) {
        hasFirstHit_ = hadFirstHit;
        return false;
    }
    result = call.state.Ci;
    // A camera sample is left out as a whole; further down what can be saved of it is.
    if (ray.depth > 0 || ray.passes > 0)
        result = withAlpha(finite(rgb(result)), std::isfinite(result.w) ? result.w : 1.0f);
    return true;
}

Vec4f ShadingContext::answered(PathRay const& ray)
{
    Arrived const before = arrived_; // what arrives in the course of it is its own affair
    Vec4f const light = source_.radiance(ray);
    arrived_ = before;
    arrived_.all += rgb(light);
    arrived_.parts.add(parts_);
    return light;
}

void ShadingContext::passIgnored(PathRay& ray, SurfacePoint const& surface)
{
    ray.origin =
        offsetPoint(surface.P, surface.Ng * (dot(ray.direction, surface.Ng) < 0.0f ? -1.0f : 1.0f));
    ray.skyDensity = std::numeric_limits<float>::infinity(); // what lies behind is its alone
    ++ray.ignored;
}

void ShadingContext::passStraight(PathRay& ray, SurfacePoint const& surface)
{
    passIgnored(ray, surface);
    ray.ignored = 0;
    ray.cone = ray.cone.after(length(surface.P - ray.E));
    ray.E = surface.P;
    ray.passes += 1;
    if (ray.type == kRayCamera)
        ray.type = kRayTransmission;
}

bool ShadingContext::shadeBeside(PathRay const& ray, SurfacePoint const& surface, Beside& result)
{
    bool const hadFirstHit = hasFirstHit_;
    Call call(*this, ray, surface);
    auto const shown = [&](Answers answers) {
        call.answers_ = answers;
        call.state.Ci = {0, 0, 0, 1};
        call.material.shader->shade(this, call.state);
        return call.state.Ci;
    };
    if (keepsParts_ && ray.depth <= 1) {
        call.answers_ = Answers::Beside;
        call.state.Ci = {0, 0, 0, 1};
        parts_ = shadeInParts(*this, call);
    } else {
        shown(Answers::Beside);
        parts_ = {};
    }
    Vec3f const color = rgb(call.state.Ci);
    if (call.state.discardHit) {
        hasFirstHit_ = hadFirstHit;
        return false;
    }
    result.color = finite(color);
    if (!(call.asked_ & kStraight) || call.material.transmits)
        return true;
    // What it shows is linear in what it is told.
    Vec4f const white = shown(Answers::Behind);
    Vec3f const own = call.heard_ ? rgb(shown(Answers::None)) : color;
    Vec3f const behind = finite(rgb(white) - own);
    result.behind = {clamp(behind.x, 0.0f, 1.0f), clamp(behind.y, 0.0f, 1.0f),
                     clamp(behind.z, 0.0f, 1.0f)};
    result.clear = clamp(1.0f - white.w, 0.0f, 1.0f);
    return true;
}

ShadeState ShadingContext::record(PathRay const& ray) const
{
    ShadeState state{};
    state.E = ray.E;
    state.I = ray.direction;
    state.rasterX = rasterX_;
    state.rasterY = rasterY_;
    state.imageHeight = scene_.scene().film.height;
    state.incomingIor = state.beyondIor = ray.media.current();
    state.objectToWorld = Mat4f::identity();
    state.rayType = ray.type;
    state.rayDepth = ray.depth;
    state.maxRayDepth = maxDepth_;
    return state;
}

void ShadingContext::fillSurface(PathRay const& ray, SurfacePoint const& s,
                                 PreparedMaterial const& material, ShadeState& state) const
{
    state.objectToWorld = scene_.scene().instances[s.instance].objectToWorld;
    if (!isFront(ray.direction, s.Ng))
        state.beyondIor = ray.media.without(s.instance);
    else if (material.ior)
        state.beyondIor = *material.ior;
    scene_.fillAttributes(s, material, state);
}

void ShadingContext::changeMedia(PathRay& next, Vec3f arrived, SurfacePoint const& s,
                                 float const* ior)
{
    bool const front = isFront(arrived, s.Ng);
    bool const inwards = dot(next.direction, s.Ng) < 0.0f;
    if (front && inwards && ior)
        next.media.enter(s.instance, *ior);
    else if (!front && !inwards)
        next.media.leave(s.instance);
}

Vec3f ShadingContext::finite(Vec3f v)
{
    if (isFinite(v))
        return v;
    countNonFinite();
    return {0, 0, 0};
}

void ShadingContext::countNonFinite()
{
    ++nonFinite_;
    SurfacePoint const* const surface = call_ ? &call_->surface
        : hasFirstHit_                        ? &firstHit_.surface
                                              : nullptr;
    int const material =
        surface ? scene_.scene().instances[surface->instance].material : -1; // a light has none
    ++nonFiniteOf_[material < 0 ? nonFiniteOf_.size() - 1 : static_cast<std::size_t>(material)];
}

} // namespace zsi::host
