// SPDX-License-Identifier: Apache-2.0
/// Scenes as Python holds them.
#pragma once

#include "load/sceneBuilder.h"
#include "plugin/shaderLibrary.h"
#include "values.h"

#include <memory>
#include <optional>

namespace zsi::python {

/// The shader libraries of this process.
host::ShaderLibraries& libraries();

/// A scene that Python edits, with counts of edits that sessions compare.
class SceneData {
public:
    SceneData();
    explicit SceneData(host::Scene scene);

    host::Scene const& scene() const { return scene_; }
    /// For an edit. Throws InputError while the scene is rendered.
    host::Scene& edit();
    /// The same as parts of a scene file are read into it.
    host::SceneBuilder builder();
    /// Warnings since the last call.
    std::vector<std::string> takeWarnings();

    /// How often parts of the scene became others than they were.
    struct Edits {
        int things = 0; ///< meshes or materials
        int instances = 0, lights = 0, environment = 0;
    };
    Edits edits;
    int renderings = 0; ///< running now
    /// Pictures of materials that came from other scenes.
    std::vector<std::shared_ptr<host::TextureStore>> otherTextures;

private:
    host::Scene scene_;
    host::LoadOptions options_;
};

/// A shader of a scene: a material, a light or the environment.
struct ShaderOfScene {
    std::shared_ptr<SceneData> data;
    int kind; ///< a `zsi::ShaderKind`
    std::size_t index = 0;

    host::Shader const& shader() const;
    host::Shader& edit() const; ///< as `SceneData::edit`
    /// Takes values as scene files write them; None unbinds a texture. Throws InputError.
    void set(std::string const& name, py::handle value) const;
};

void bindMaterials(py::module_& m);
void bindScenes(py::module_& m);
void bindRendering(py::module_& m);

} // namespace zsi::python
