// SPDX-License-Identifier: Apache-2.0
#include "integrate/features.h"

#include "shading/forwardedServices.h"

#include <algorithm>

namespace zsi::host {
namespace {

/// Rays that count less, and those that were bent more often, are not followed.
constexpr float kLeastImportance = 0.1f;
constexpr std::uint32_t kMostBends = 8;
/// Lobes up to this spread are followed as if they had none: what is seen in them is hardly
/// blurred.
constexpr float kHardlySpread = 0.05f;

Vec3f inUnit(Vec3f v)
{
    if (!isFinite(v))
        return {0, 0, 0};
    v = {maxOf(v.x, 0.0f), maxOf(v.y, 0.0f), maxOf(v.z, 0.0f)};
    return v / maxOf(maxComponent(v), 1.0f);
}

/// What one finding needs all along the way.
struct Search {
    ShadingContext& context;
    Sampler random;
};

Feature follow(Search& search, PathRay ray, float importance);

/// Answers 1 for all light that a surface gathers, and follows what goes straight on or is bent
/// without being spread.
class Furnace final : public ForwardedServices {
public:
    Furnace(Search& search, ShadingContext::Call& call, float importance, bool isSmooth)
        : ForwardedServices(search.context)
        , search_(search)
        , call_(call)
        , importance_(importance)
        , isSmooth_(isSmooth)
    {
    }

    /// Of the surface that has shown `shown`, with what was found behind it.
    Feature result(Vec3f shown) const
    {
        float const own = maxOf(maxComponent(shown) - followed_, 0.0f), all = own + followed_;
        if (!(all > 0.0f))
            return {shown, call_.surface.N, length(call_.surface.P - call_.ray.E)};
        return {shown, (call_.surface.N * own + normals_) / all,
                length(call_.surface.P - call_.ray.E) + depths_ / all};
    }

    LightSample* getLightSamples(int, Vec3f const*, Vec3f const*) override { return nullptr; }
    Vec3f ambientLight(Vec3f const*, Vec3f const*) override { return {0, 0, 0}; }
    Vec3f shadowTransmission(Vec3f const*, Vec3f const*) override { return {1, 1, 1}; }
    Vec3f occlusion(Vec3f const*, Vec3f const*, float) override { return {1, 1, 1}; }
    Vec3f indirectDiffuse(Vec3f const*, Vec3f const*, float) override { return {1, 1, 1}; }
    float random() override { return search_.random.next(); }
    Vec2f random2D() override { return search_.random.next2D(); }
    Vec3f traceContinue(int, Vec3f const* origin, Vec3f const* direction, float importance) override
    {
        return behind(*origin, *direction, true, importance);
    }
    Vec4f traceThrough(Vec3f const* P, Vec3f const* I, float importance) override
    {
        return withAlpha(behind(*P, *I, true, importance), 1.0f);
    }
    Vec3f traceReflection(Vec3f const* origin, Vec3f const* direction, float importance) override
    {
        // A direction without a spread may be one that a rough material has drawn.
        return isSmooth_ ? behind(*origin, *direction, false, importance) : Vec3f(1, 1, 1);
    }
    Vec3f traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                        float importance) override
    {
        return spread > 0.0f ? traceRefraction(origin, direction, spread, importance)
                             : traceReflection(origin, direction, importance);
    }
    Vec3f traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                          float importance) override
    {
        return spread <= kHardlySpread ? behind(*origin, *direction, false, importance)
                                       : Vec3f(1, 1, 1);
    }

private:
    Vec3f behind(Vec3f origin, Vec3f direction, bool straight, float importance)
    {
        float const all = importance_ * importance;
        PathRay next = call_.ray;
        if (!(all >= kLeastImportance) || next.depth >= kMostBends || !isFinite(origin)
            || !(dot(direction, direction) > 0.0f))
            return {1, 1, 1};
        next.E = origin;
        next.direction = normalize(direction);
        next.origin = search_.context.rayStart(origin, next.direction);
        next.ignored = 0;
        if (straight) {
            ++next.passes;
            next.type = next.type == kRayCamera ? std::uint32_t(kRayTransmission) : next.type;
        } else {
            ++next.depth;
            next.type = kRayReflection;
            ShadingContext::changeMedia(next, call_.ray.direction, call_.surface,
                                        call_.material.ior);
        }
        Feature const found = follow(search_, next, all);
        float const counts = importance * maxComponent(found.albedo);
        followed_ += counts;
        normals_ += found.normal * counts;
        depths_ += found.depth * counts;
        return found.albedo;
    }

    Search& search_;
    ShadingContext::Call& call_;
    float importance_;
    bool isSmooth_;
    float followed_ = 0.0f, depths_ = 0.0f;
    Vec3f normals_{0, 0, 0};
};

/// Whether the material bends rays here without spreading them, by what it draws.
bool isSmooth(Furnace& services, ShadingContext::Call const& call)
{
    if (!(call.material.entryPoints & kSample))
        return false;
    ShadeState state = call.state;
    std::fill_n(state.allowReflection, 3, std::uint8_t(1));
    std::fill_n(state.allowTransmission, 3, std::uint8_t(1));
    state.sampleType = kSampleNone;
    call.material.shader->sample(&services, state);
    return (state.sampleType == kSampleSmooth || state.sampleType == kSampleStraight)
        && state.sampleInvPdf == 1.0f;
}

Feature follow(Search& search, PathRay ray, float importance)
{
    for (;;) {
        SurfacePoint surface;
        Vec4f seen;
        if (!search.context.intersect(ray, surface, seen))
            return {inUnit(rgb(seen))};
        {
            ShadingContext::Call call(search.context, ray, surface);
            Furnace drawn(search, call, importance, false);
            Furnace services(search, call, importance, isSmooth(drawn, call));
            call.state.Ci = {0, 0, 0, 1};
            call.material.shader->shade(&services, call.state);
            if (!call.state.discardHit)
                return services.result(inUnit(rgb(call.state.Ci)));
        }
        ShadingContext::passIgnored(ray, surface);
    }
}

} // namespace

Feature findFeature(ShadingContext& context, PathRay const& ray, Sampler random)
{
    Search search{context, random};
    return follow(search, ray, 1.0f);
}

} // namespace zsi::host
