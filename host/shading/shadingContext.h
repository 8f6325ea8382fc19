// SPDX-License-Identifier: Apache-2.0
/// One thread's shading calls: the record that a material gets, and the services behind it.
#pragma once

#include "sampling/sampler.h"
#include "shading/lightParts.h"
#include "shading/noiseServices.h"
#include "shading/pathRay.h"
#include "shading/preparedScene.h"
#include "texture/textureFootprint.h"

#include <optional>
#include <zsi/vecmath.h>

namespace zsi::host {

/// The surface that a camera sample first shows, for layers of the film.
struct FirstHit {
    SurfacePoint surface;
    float distance; ///< from the camera
};

/// Rays that were traced, by kind.
struct RayCounts {
    std::uint64_t camera = 0, reflection = 0, diffuse = 0, shadow = 0;

    std::uint64_t sum() const { return camera + reflection + diffuse + shadow; }
    void add(RayCounts const& more)
    {
        camera += more.camera;
        reflection += more.reflection;
        diffuse += more.diffuse;
        shadow += more.shadow;
    }
    bool operator==(RayCounts const&) const = default;
};

/// What rays that services sent out have brought, before the services weighted it.
struct Arrived {
    Vec3f all{0, 0, 0};
    LightParts parts = {}; ///< of `all`
};

/// See docs/services.md for what the record holds and what each service does.
class ShadingContext final : public NoiseServices {
public:
    /// Both must outlive this. `source` answers the rays that services send out.
    ShadingContext(PreparedScene const& scene, RadianceSource& source);

    /// Begins a camera sample: random numbers come from `sampler`; `rasterX`, `rasterY` are pixels.
    /// `keepsParts`: light is told apart by the way on which it came (`parts`).
    void start(Sampler& sampler, float rasterX, float rasterY, bool keepsParts = false);

    PreparedScene const& scene() const { return scene_; }
    Sampler& sampler() { return *sampler_; }
    /// Of a camera ray: a pixel, less what the filter of the film blurs anyway.
    RayCone cameraCone() const;
    /// Of a ray that leaves the running call's surface unscattered.
    RayCone bentCone(PathRay const& next) const;
    RayCounts const& rays() const { return rays_; }
    std::uint64_t nonFinite() const { return nonFinite_; }
    /// The same by material, and behind the last one of the environment.
    std::vector<std::uint64_t> const& nonFiniteOf() const { return nonFiniteOf_; }
    /// Of the running call's material, else of the one that the camera sees, else the environment.
    void countNonFinite();
    /// Of the running sample; null while no surface was shown.
    FirstHit const* firstHit() const { return hasFirstHit_ ? &firstHit_ : nullptr; }

    /// Of the light that was found last by `intersect`, `shade` or an integrator's `radiance`; of
    /// what lies behind the second bend nothing is told.
    LightParts const& parts() const { return parts_; }
    void setParts(LightParts const& parts) { parts_ = parts; }
    Arrived& arrived() { return arrived_; }

    // What an integrator is made of.

    /// The surface that the ray meets, to be shaded. False where there is nothing to shade; `seen`
    /// is then what the ray shows: the environment, a light's surface, or black where it has been
    /// on its way for too long.
    bool intersect(PathRay const& ray, SurfacePoint& surface, Vec4f& seen);
    /// The colour that the material's `shade` gives the hit; false when it discards the hit, which
    /// is then to be passed (`passIgnored`).
    bool shade(PathRay const& ray, SurfacePoint const& surface, Vec4f& result);
    /// The same ray goes on behind the surface as if nothing had been there.
    static void passIgnored(PathRay& ray, SurfacePoint const& surface);
    /// The ray goes on straight through the surface, as `traceThrough` sends one.
    static void passStraight(PathRay& ray, SurfacePoint const& surface);

    /// What `shade` shows of a hit beside what `transfer` and `sample` stand for.
    struct Beside {
        Vec3f color{0, 0, 0}; ///< emitted, ambient, lit or shining through from the far side
        Vec3f behind{0, 0, 0}; ///< how much is seen of what lies straight behind
        float clear = 0.0f; ///< how much of the alpha is that of what lies there
    };
    /// Of a material that `showsMore`; false when it discards the hit.
    bool shadeBeside(PathRay const& ray, SurfacePoint const& surface, Beside& result);

    /// `v`, or black when it is not finite, which is counted.
    Vec3f finite(Vec3f v);

    /// What services tell a running call.
    enum class Answers {
        All,
        Beside, ///< light from the far side, ambient light, and what `sample` does not trace
        Behind, ///< that white and clear lies straight behind the surface
        None, ///< neutral values
    };
    /// What a call has asked for.
    enum Asked : unsigned {
        kStraight = 1, ///< what lies straight behind
        kBeyond = 2, ///< what is bent through, or lights the far side
        kAmbient = 4,
        kIndirect = 8, ///< light of the surroundings, diffuse
        kOcclusion = 16, ///< of other light than what it has gathered
    };

    /// A running call of a material's entry point. Light lists made for it are released with it.
    class Call {
    public:
        Call(ShadingContext& context, PathRay const& ray, SurfacePoint const& surface);
        ~Call();
        Call(Call const&) = delete;
        Call& operator=(Call const&) = delete;

        PathRay const& ray;
        SurfacePoint const& surface;
        PreparedMaterial const& material;
        ShadeState state; ///< inputs filled, results neutral

    private:
        friend class ShadingContext;

        /// At a place of its own: neither transform nor attributes.
        Call(ShadingContext& context, PathRay const& ray, SurfacePoint const& surface,
             PreparedMaterial const& material);

        /// What the last queries for ambient and indirect light brought.
        struct Gathered {
            bool pending = false; ///< until the occlusion of that light is asked for
            Vec3f P, N, ambient, indirect;
        };

        ShadingContext& context_;
        bool isSilent() const { return answers_ >= Answers::Behind; }

        Answers answers_ = Answers::All;
        unsigned asked_ = 0; ///< of Asked, while not all is answered
        bool heard_ = false; ///< some of it may have been more than a neutral value
        Gathered gathered_;
        bool askedLights_ = false;
        bool askedSky_ = false; ///< as one of the lights
        std::optional<Vec3f> smoothStart_; ///< of shadow rays above the surface, once one asked
        RayCone cone_; ///< of `ray`, where it met the surface
        TextureFootprint footprint_;
        Call* outer_;
        std::size_t lightMark_;
    };

    /// Per steradian, how likely the running call's material sends light on towards unit `L`:
    /// `transfer`, infinite where that gives nothing, since the light list then does neither.
    float lobeDensity(Vec3f L);
    /// What a ray of the type sees in unit direction `d` where nothing stands in its way.
    Vec3f sky(std::uint32_t rayType, Vec3f d);
    /// Light of the sky for a lobe at the running call's surface: one direction drawn from the sky,
    /// for rays of type `rayType` that carry the lobe's density as `skyDensity`. `value(d)` is what
    /// the lobe sends on of radiance from unit `d`, times its density there, 1/sr; `density(d)`
    /// that density.
    template <class Value, class Density>
    Vec3f fromSky(std::uint32_t rayType, Value const& value, Density const& density);
    /// To try a material with: a place, and a ray of the type that meets it from above, drawn from
    /// the sampler; all six switches of `sample` are set.
    ShadeState trialRecord(PreparedMaterial const& material, std::uint32_t rayType);
    /// What a material's entry points turn out to do.
    struct Findings {
        bool mixes = false, transmits = false;
        struct Side {
            bool emits = false;
            unsigned asked = 0; ///< of Asked
        };
        Side front, back; ///< where the face looks at the viewer, and away
    };
    /// Calls the material's entry points at a place of its own choice; adds to `findings`.
    void examine(PreparedMaterial const& material, Findings& findings);
    /// The point of light `light` that is to light `P`: its place, direction and, where rays meet
    /// the light, density are told. False where it is behind `normal` or brings nothing for sure.
    bool pickLight(std::size_t light, Vec3f P, Vec3f normal, Arrival& picked);
    /// What arrives from a picked point, with its shadow: the ray is traced here. False when it is
    /// nothing.
    bool arriving(std::size_t light, Vec3f P, Vec3f normal, Arrival const& picked,
                  LightSample& sample);

    /// Where a ray starts that leaves `origin`: moved off the running call's surface where it lies
    /// on it, any other place as it is.
    Vec3f rayStart(Vec3f origin, Vec3f direction) const;
    /// As `rayStart`, from the curved surface that the normals of a mesh describe.
    Vec3f shadowStart(Vec3f origin, Vec3f direction) const;
    /// The media of `next`, which leaves `s`, when a ray along `arrived` met it. `ior`: of what
    /// lies behind the surface, null where it bounds no medium.
    static void changeMedia(PathRay& next, Vec3f arrived, SurfacePoint const& s, float const* ior);

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

private:
    /// Whether the running call is told of light that arrives from the side of `normal`.
    bool tellsOf(Vec3f normal);
    /// Whether it is told what is bent through the surface or lights its far side.
    bool tellsBeyond();
    /// By material, how much slower than the mesh's own texture coordinates the slowest of its maps
    /// runs; 0: not to be told, or there are none.
    float mapScale(Shader const& material) const;
    /// Width of `cone` in texture coordinates of the surface.
    float footprint(RayCone const& cone, SurfacePoint const& surface) const;

    /// Colour and alpha of the environment along the ray.
    Vec4f environment(PathRay const& ray);
    /// What a ray sees of the surface light that it met.
    Vec3f emission(PathRay const& ray, SurfacePoint const& surface) const;
    /// The sky as one light of the running call's list.
    bool askSky(Vec3f normal, LightSample& sample);
    ShadeState record(PathRay const& ray) const;
    void fillSurface(PathRay const& ray, SurfacePoint const& s, PreparedMaterial const& material,
                     ShadeState& state) const;

    /// The running call's ray, if there is one, as a query of the type that counts one bounce more.
    PathRay query(std::uint32_t type, Vec3f direction) const;
    /// The running call's ray as it leaves `origin`; false when there is none to trace.
    bool depart(Vec3f const* origin, Vec3f const* direction, PathRay& ray) const;
    /// A ray that the running call's surface bends or sends back; false when there is none to
    /// trace. `scale` makes up for the rays that are left out at random.
    bool child(Vec3f const* origin, Vec3f const* direction, float importance, PathRay& ray,
               float& scale);
    /// A ray that goes on straight; false when there is none to trace.
    bool continuation(Vec3f const* origin, Vec3f const* direction, float importance, PathRay& ray,
                      float& scale);
    /// Whether one more ray of the camera sample is traced, `scale` made up for those that are not.
    bool isSent(float& scale);
    Vec3f traceLobe(Vec3f const* origin, Vec3f const* direction, float spread, float turn,
                    float importance);
    /// Light along a ray drawn from a lobe at the running call's surface, together with what a
    /// direction drawn from the sky brings; `density(d)` is the lobe's.
    template <class Density>
    Vec3f gather(PathRay ray, Density const& density);
    /// Where the running call has counted surface lights in its list and cannot tell how much of
    /// them its lobe stands for, the ray does not see them.
    void leaveToLightList(PathRay& ray) const;
    Vec3f gatherNormal(Vec3f P, Vec3f N) const;
    Vec3f transmit(Vec3f E, Vec3f origin, Vec3f direction, float tMax);
    /// What the integrator answers for the ray.
    Vec4f answered(PathRay const& ray);

    PreparedScene const& scene_;
    Settings const& settings_;
    RadianceSource& source_;
    std::uint32_t maxDepth_;
    std::vector<float> mapScales_; ///< of each material
    bool hasMaps_ = false; ///< one of them is above 0
    LightRecords lightRecords_;
    Sampler* sampler_ = nullptr;
    Call* call_ = nullptr;
    float rasterX_ = 0.0f, rasterY_ = 0.0f;
    bool keepsParts_ = false;
    LightParts parts_ = {};
    Arrived arrived_ = {};
    float sent_ = 0.0f; ///< rays that services have sent out for the camera sample
    FirstHit firstHit_ = {};
    bool hasFirstHit_ = false;
    RayCounts rays_;
    std::uint64_t nonFinite_ = 0;
    std::vector<std::uint64_t> nonFiniteOf_;
};

template <class Value, class Density>
Vec3f ShadingContext::fromSky(std::uint32_t rayType, Value const& value, Density const& density)
{
    DirectionMap const& map = scene_.sky(rayType);
    if (map.isEmpty())
        return {0, 0, 0};
    auto const [d, drawn] = map.sample(sampler_->next2D());
    Vec3f const sent = value(d);
    if (!(maxComponent(sent) > 0.0f))
        return {0, 0, 0};
    ++rays_.shadow; // directions of the map are bright: what is in the way is asked for first
    if (scene_.rays().occluded({shadowStart(call_->surface.P, d), d}, Visibility::All))
        return {0, 0, 0};
    Vec3f const light = sky(rayType, d);
    Vec3f const brought = finite(sent * light / (drawn + density(d)));
    arrived_.all += brought;
    arrived_.parts.environment += brought;
    return brought;
}

inline bool isFinite(Vec3f v)
{
    return std::isfinite(v.x) && std::isfinite(v.y) && std::isfinite(v.z);
}

} // namespace zsi::host
