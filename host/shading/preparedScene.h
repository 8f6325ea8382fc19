/// A scene made ready for rendering: acceleration structure and what each material needs.
#pragma once

#include "trace/rayScene.h"

namespace zsi::host {

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

    /// Whether paths can go on by `sample` with light taken by `transfer`.
    bool scatters() const { return (entryPoints & kSample) && (entryPoints & kTransfer); }
};

struct PreparedScene {
    explicit PreparedScene(Scene const& scene);

    PreparedMaterial const& materialOf(SurfacePoint const& s) const
    {
        return materials[static_cast<std::size_t>(scene.instances[s.instance].material)];
    }
    /// Writes the vertex attributes that the material of `s` declared.
    void fillAttributes(SurfacePoint const& s, ShadeState& state) const;

    Scene const& scene;
    RayScene rays;
    std::vector<PreparedMaterial> materials;
};

} // namespace zsi::host
