// SPDX-License-Identifier: Apache-2.0
/// A scene while it is read from a file.
#pragma once

#include "load/loadScene.h"
#include "json/jsonReader.h"

#include <map>
#include <unordered_map>

namespace zsi::host {

/// Indices of things that later parts of the scene refer to by name.
class Names {
public:
    explicit Names(char const* what)
        : what_(what)
    {
    }
    void add(std::string const& name);
    int indexOf(JsonReader const& reader) const;

private:
    char const* what_;
    std::vector<std::string> names_; ///< in the file's order
    std::unordered_map<std::string, int> indices_;
};

/// The scene so far, and what its later parts look up in earlier ones.
class SceneBuilder {
public:
    SceneBuilder(Scene& scene_, ShaderSource const& shaders_, LoadOptions const& options)
        : scene(scene_)
        , shaders(shaders_)
        , options_(options)
    {
    }

    /// Tells that `reader` is read next.
    void begin(JsonReader const& reader) const;
    int addMesh(Mesh mesh);
    /// Refuses what reaches farther out than rays go. `part`: of the thing that `reader` names.
    void addInstance(JsonReader const& reader, Instance const& instance,
                     std::string const& part = {});
    /// Meshes of the parts, -1 for one without triangles.
    std::vector<int> const& splitMesh(int whole);
    /// What stands in the scene only in parts needs no memory as a whole.
    void dropWholeMeshes();

    /// A length of a material that the scene does not write, by index and name.
    struct OpenLength {
        std::size_t material;
        std::string parameter;
        double objectSize; ///< for which the default is
    };

    Scene& scene;
    std::vector<OpenLength> openLengths;
    ShaderSource const& shaders;
    Names meshes{"mesh"}, materials{"material"};

private:
    float largestCoordinate(std::size_t mesh);

    LoadOptions const& options_;
    std::vector<float> largest_; ///< coordinate of each mesh, as far as asked for
    std::map<int, std::vector<int>> split_; ///< meshes that stand in the scene in parts
};

} // namespace zsi::host
