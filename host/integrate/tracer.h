/// Light along rays: the renderer's side of a shading call.
#pragma once

#include "light/lightList.h"
#include "sampling/sampler.h"
#include "shading/media.h"
#include "shading/preparedScene.h"

#include <zsi/vecmath.h>

namespace zsi::host {

/// A ray on its way through the scene.
struct PathRay {
    Vec3f E; ///< where it began, as the record tells
    Vec3f origin; ///< from where it is traced: `E` off its surface, or behind an ignored hit
    Vec3f direction; ///< unit
    std::uint32_t type = kRayCamera;
    std::uint32_t depth = 0; ///< bends and bounces before it; going on straight does not count
    int passes = 0; ///< how often it went on straight through a surface
    int diffuseBounces = 0;
    float importance = 1.0f; ///< the most that it counts in the picture
    MediumStack media = {};
};

/// One thread's renderer, and the services that its shading calls get. See docs/services.md for
/// what each service does.
class Tracer final : public IShaderAPI {
public:
    /// `scene` must outlive this.
    explicit Tracer(PreparedScene const& scene);

    /// Colour and alpha along the camera ray of a sample. `sampler` is drawn from; `rasterX`,
    /// `rasterY` are pixels. Returns false when the result is not finite.
    bool cameraSample(Vec3f origin, Vec3f direction, float rasterX, float rasterY, Sampler& sampler,
                      Vec4f& result);

    std::uint64_t rays() const { return rays_; }
    std::uint64_t nonFinite() const { return nonFinite_; }

    LightSample* getLightSamples(int category, Vec3f const* P, Vec3f const* normal) override;
    Vec3f ambientLight(Vec3f const* P, Vec3f const* N) override;
    Vec3f shadowTransmission(Vec3f const* from, Vec3f const* to) override;
    Vec3f traceContinue(int rayType, Vec3f const* origin, Vec3f const* direction,
                        float importance) override;
    Vec3f traceReflection(Vec3f const* origin, Vec3f const* direction, float importance) override;
    Vec4f traceThrough(Vec3f const* P, Vec3f const* I, float importance) override;
    Vec3f traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                        float importance) override;
    Vec3f traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                          float importance) override;
    Vec3f occlusion(Vec3f const* P, Vec3f const* N, float importance) override;
    Vec3f indirectDiffuse(Vec3f const* P, Vec3f const* N, float importance) override;
    float random() override;
    Vec2f random2D() override;
    float cellNoise1D(float x) override;
    float noise2D(Vec2f const* p) override;
    float noise3DPoint(Vec3f const* p) override;
    float noise3D(Vec4f const* pointAndPhase) override;
    float noise3DRecord(Vec3f const* p) override;
    Vec3f cellNoise3D(Vec3f const* p) override;

private:
    /// The hit that the running entry point is asked about. Light lists made for it are released
    /// with it.
    class Call {
    public:
        Call(Tracer& tracer, PathRay const& ray, SurfacePoint const& surface);
        ~Call();
        Call(Call const&) = delete;
        Call& operator=(Call const&) = delete;

        PathRay const& ray;
        SurfacePoint const& surface;
        ShadeState state; ///< inputs filled, results neutral

    private:
        Tracer& tracer_;
        Call* outer_;
        std::size_t lightMark_;
    };

    Vec4f radiance(PathRay ray);
    Vec4f environment(PathRay const& ray);
    bool shade(PathRay const& ray, SurfacePoint const& surface, Vec4f& result);

    /// What a path gathers and what remains of it.
    struct Path {
        Vec3f light{0, 0, 0};
        Vec3f throughput{1, 1, 1};
        bool straight = true; ///< still on the line of the ray that it began as
    };
    bool scatter(PathRay& ray, SurfacePoint const& surface, Path& path);
    Vec3f directLight(Call& call);
    bool survives(PathRay& ray, Path& path);

    ShadeState record(PathRay const& ray) const;
    void fillSurface(PathRay const& ray, SurfacePoint const& s, ShadeState& state) const;

    /// A ray from the running call's surface; false when there is none to trace. `scale` makes up
    /// for the rays that are left out at random.
    bool child(Vec3f const* origin, Vec3f const* direction, float importance, PathRay& ray,
               float& scale);
    bool continuation(Vec3f const* origin, Vec3f const* direction, float importance, PathRay& ray);
    Vec3f traceLobe(Vec3f const* origin, Vec3f const* direction, float spread, float turn,
                    float importance);
    /// The media of `next`, which leaves `s`, when a ray along `arrived` met it. `ior`: of what
    /// lies behind the surface, null where it bounds no medium.
    static void changeMedia(PathRay& next, Vec3f arrived, SurfacePoint const& s, float const* ior);
    Vec3f start(Vec3f origin, Vec3f direction) const;
    Vec3f shadowStart(Vec3f origin, Vec3f direction) const;
    Vec3f gatherNormal(Vec3f P, Vec3f N) const;
    Vec3f transmit(Vec3f E, Vec3f origin, Vec3f direction, float tMax);
    Vec3f finite(Vec3f v);

    PreparedScene const& scene_;
    Settings const& settings_;
    bool paths_;
    std::uint32_t maxDepth_;
    LightRecords lightRecords_;
    Sampler* sampler_ = nullptr;
    Call* call_ = nullptr;
    float rasterX_ = 0.0f, rasterY_ = 0.0f;
    std::uint64_t rays_ = 0;
    std::uint64_t nonFinite_ = 0;
};

inline bool isFinite(Vec3f v)
{
    return std::isfinite(v.x) && std::isfinite(v.y) && std::isfinite(v.z);
}

} // namespace zsi::host
