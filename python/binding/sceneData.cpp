// SPDX-License-Identifier: Apache-2.0
#include "sceneData.h"

#include "base/error.h"
#include "load/parameterValues.h"
#include "texture/textureStore.h"

namespace zsi::python {

using host::InputError;

host::ShaderLibraries& libraries()
{
    // Never destroyed: shaders may outlive the interpreter's end.
    static auto& all = *new host::ShaderLibraries;
    return all;
}

SceneData::SceneData() { scene_.textures = std::make_shared<host::TextureStore>(); }

SceneData::SceneData(host::Scene scene)
    : scene_(std::move(scene))
{
}

host::Scene& SceneData::edit()
{
    if (renderings > 0)
        throw InputError("the scene is being rendered; it can be edited afterwards");
    return scene_;
}

host::SceneBuilder SceneData::builder()
{
    host::SceneBuilder all(edit(), libraries(), options_);
    for (host::Mesh const& mesh : scene_.meshes)
        all.meshes.add(mesh.name);
    for (std::string const& name : scene_.materialNames)
        all.materials.add(name);
    return all;
}

std::vector<std::string> SceneData::takeWarnings() { return std::exchange(scene_.warnings, {}); }

host::Shader const& ShaderOfScene::shader() const
{
    host::Scene const& scene = data->scene();
    if (kind == kMaterial)
        return scene.materials.at(index);
    if (kind == kLight)
        return std::get<host::ShaderLight>(scene.lights.at(index)).shader;
    if (!scene.environment)
        throw InputError("the scene has no environment any more");
    return *scene.environment;
}

host::Shader& ShaderOfScene::edit() const
{
    data->edit();
    return const_cast<host::Shader&>(shader());
}

void ShaderOfScene::set(std::string const& name, py::handle value) const
{
    host::Shader& shader = edit();
    host::Parameter const* const parameter = shader.find(name);
    if (!parameter)
        shader.set(name, 0); // tells the nearest names
    using Type = host::ParameterType;
    if (value.is_none() && parameter->type == Type::Texture1D)
        shader.set(name, static_cast<HostTexture1D const*>(nullptr));
    else if (value.is_none() && parameter->type == Type::Texture2D)
        shader.set(name, static_cast<HostTexture2D const*>(nullptr));
    else if (value.is_none() && parameter->type == Type::TextureCube)
        shader.set(name, static_cast<HostTextureCube const*>(nullptr));
    else {
        host::JsonValue json = toJson(value, shader.className());
        if (json.kind == host::JsonValue::Kind::String && parameter->type >= Type::Texture1D)
            json =
                toJson(parameter->type == Type::TextureCube ? "cube" : "texture", std::move(json));
        shader.set(name,
                   host::readParameterValue(host::JsonReader(json, name), parameter->type,
                                            *data->scene().textures));
    }
    if (kind == kEnvironment)
        ++data->edits.environment;
    if (kind == kLight)
        ++data->edits.lights;
}

} // namespace zsi::python
