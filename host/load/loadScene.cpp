// SPDX-License-Identifier: Apache-2.0
#include "load/loadScene.h"

#include "load/environment.h"
#include "load/instances.h"
#include "load/lights.h"
#include "load/meshes.h"
#include "load/objectLengths.h"
#include "load/pictureSettings.h"
#include "load/sceneBuilder.h"
#include "load/sceneFile.h"
#include "load/shaders.h"

namespace zsi::host {
namespace {

/// Parts in order; later ones refer to earlier ones by name.
void read(JsonReader const& root, SceneBuilder& builder, LoadOptions const& options)
{
    root.expectKeys({"$schema", "include", "camera", "film", "settings", "meshes", "materials",
                     "instances", "lights", "environment"});
    if (auto const v = root.find("$schema")) // for editors
        v->toString();
    if (auto const v = root.find("camera"))
        builder.scene.camera = readCamera(*v);
    if (auto const v = root.find("film"))
        builder.scene.film = readFilm(*v);
    if (auto const v = root.find("settings"))
        builder.scene.settings = readSettings(*v);
    if (auto const v = root.find("meshes"))
        for (auto const& [name, mesh] : v->members()) {
            builder.begin(mesh);
            std::optional<Mesh> known;
            if (options.knownMesh)
                known = options.knownMesh(name);
            builder.addMesh(known ? std::move(*known) : readMesh(mesh, builder.scene));
            builder.scene.meshes.back().name = name;
            builder.meshes.add(name);
        }
    if (auto const v = root.find("materials"))
        for (auto const& [name, material] : v->members()) {
            material.expectKeys({"class", "parameters"});
            builder.scene.materials.push_back(readShader(material, kMaterial, builder));
            builder.scene.materialNames.push_back(name);
            builder.materials.add(name);
        }
    if (auto const v = root.find("instances"))
        for (auto const& [name, instance] : v->members())
            readInstance(instance, builder);
    if (auto const v = root.find("lights"))
        for (auto const& [name, light] : v->members()) {
            readLight(light, builder);
            builder.scene.lightNames.push_back(name);
        }
    if (auto const v = root.find("environment"))
        readEnvironment(*v, builder);
    builder.dropWholeMeshes();
    suitOpenLengths(builder);
}

} // namespace

Scene loadScene(std::filesystem::path const& file, ShaderSource const& shaders,
                LoadOptions const& options)
{
    std::vector<std::string> warnings;
    Scene scene =
        loadScene(readSceneFile(file, options.assignments, &warnings), file, shaders, options);
    scene.warnings.insert(scene.warnings.begin(), warnings.begin(), warnings.end());
    return scene;
}

Scene loadScene(JsonValue const& document, std::filesystem::path const& file,
                ShaderSource const& shaders, LoadOptions const& options)
{
    Scene scene;
    scene.file = file.string();
    scene.textures = options.textureStore ? options.textureStore
                                          : std::make_shared<TextureStore>(options.textures);
    SceneBuilder builder(scene, shaders, options);
    read(JsonReader(document), builder, options);
    for (std::string const& warning : scene.textures->warnings())
        scene.warnings.push_back(scene.file + ": " + warning);
    return scene;
}

} // namespace zsi::host
