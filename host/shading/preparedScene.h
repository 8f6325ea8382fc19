// SPDX-License-Identifier: Apache-2.0
/// A scene made ready for rendering: acceleration structure and what each material needs.
#pragma once

#include "light/directionMap.h"
#include "light/lights.h"
#include "trace/rayScene.h"

#include <memory>
#include <mutex>

namespace zsi::host {

/// How a material's `shade` brings the same light by its list and by its rays.
struct SharedLobes {
    bool same = false; ///< by both alike, so that they may divide it between them
    bool gathers = false; ///< some of it by gathered rays, which see the diffuse picture of the sky
};

struct PreparedMaterial {
    enum class Source { Uv, Uv1, Tangent, Bitangent, Color };
    struct Slot {
        Source source;
        std::size_t offset; ///< into `ShadeState::attributes`
    };

    MaterialShader const* shader;
    int entryPoints;
    /// The parameter that holds the index of the medium behind the surface; null for a material
    /// that bounds none.
    float const* ior;
    std::vector<Slot> attributes;

    // What calls of its entry points have shown (PreparedScene::examineMaterials).

    /// Its samples are drawn from the lobes that `transfer` tells, so that both may share lights
    /// between them: some of its draws say so (kSampleMixture).
    bool mixes = false;
    /// Of `shade`, where it mixes: asked by gathered rays, and by others.
    SharedLobes ofGathered, ofOthers;
    /// Paths go on by its samples: it mixes, and `shade` does not take its surroundings from
    /// pictures of its own, which samples would count again.
    bool continuesPaths = false;
    /// Its samples go through the surface too: what lies behind is theirs, not `shade`'s alone.
    bool transmits = false;
    /// `shade` shows more than `sample` and `transfer` stand for (ShadingContext::shadeBeside),
    /// where the face looks at the viewer, and away.
    bool showsMoreInFront = false, showsMoreBehind = false;
    /// `shade` darkens the light of lights by occlusion.
    bool occludesLights = false;
    /// 1 over the mean weight of its draws, in the brightest channel.
    float perAlbedo = 1.0f;

    /// Per steradian, how likely its samples go where `transfer`, times its cosine, gives `value`:
    /// an estimate, but the same one wherever draws and lights share what they bring.
    float density(Vec3f value) const { return maxComponent(value) * perAlbedo; }

    /// Whether it tells of its scattering at all.
    bool scatters() const { return (entryPoints & kSample) && (entryPoints & kTransfer); }
};

/// Holds on to the scene's own data, which must outlive it. What is changed there between two
/// renderings is told by the functions below; each renews what stands on it and nothing else. A
/// parameter's value, the camera, the film and the settings are read where they stand and need no
/// telling.
class PreparedScene {
public:
    /// Throws std::bad_alloc, or Cancelled when `progress` says so.
    explicit PreparedScene(Scene const& scene, BuildProgress const& progress = {});

    /// The shader of material `index` is another one.
    void materialChanged(std::size_t index);
    /// Instances stand elsewhere, are more or fewer, or have another material or mesh.
    void instancesChanged(BuildProgress const& progress = {});
    /// Lights are others, or surface lights stand elsewhere.
    void lightsChanged() { lights_ = LightSet(scene_); }
    /// The environment or its parameters are others. Not told, pictures stay right but take longer
    /// to become smooth.
    void environmentChanged();
    /// Meshes are others. Renews all that stands on them.
    void meshesChanged(BuildProgress const& progress = {});

    /// Finds out what materials do by the values that their parameters have now.
    void examineMaterials();

    Scene const& scene() const { return scene_; }
    RayScene const& rays() const { return rays_; }
    LightSet const& lights() const { return lights_; }
    EnvironmentShader const* environment() const
    {
        return scene_.environment ? scene_.environment->environment() : nullptr;
    }
    /// Where the environment is brightest, as rays of the type see it.
    DirectionMap const& sky(std::uint32_t rayType) const;
    /// Whether the material's `shade`, for a ray of the type, may have the sky in its list of
    /// lights.
    bool listsSky(PreparedMaterial const& material, std::uint32_t rayType) const;
    std::vector<PreparedMaterial> const& materials() const { return materials_; }
    PreparedMaterial const& materialOf(SurfacePoint const& s) const
    {
        return materials_[static_cast<std::size_t>(scene_.instances[s.instance].material)];
    }
    /// Writes the vertex attributes that the material of `s` declared.
    void fillAttributes(SurfacePoint const& s, PreparedMaterial const& material,
                        ShadeState& state) const;

    /// Texture coordinates per unit of world space around `s`: of its triangle, and of the uv set
    /// that runs slower. 0 where they tell nothing.
    float uvDensity(SurfacePoint const& s) const;
    /// 1 / radius, world space, of the surface that the normals around `s` describe; positive where
    /// it bulges to the side of `Ng`.
    float curvature(SurfacePoint const& s) const;

private:
    /// Made when it is first asked for, by whichever thread that is.
    struct Sky {
        std::once_flag made;
        DirectionMap map;
    };

    struct Triangle;
    Triangle triangleOf(SurfacePoint const& s) const;

    Scene const& scene_;
    RayScene rays_;
    LightSet lights_;
    std::vector<PreparedMaterial> materials_;
    std::unique_ptr<Sky[]> skies_; ///< reflected, diffuse
    bool skiesAgree_ = true; ///< both rays see the same
};

} // namespace zsi::host
