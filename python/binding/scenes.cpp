// SPDX-License-Identifier: Apache-2.0
// Scenes: loading, looking and editing.
#include "base/error.h"
#include "load/environment.h"
#include "load/instances.h"
#include "load/lights.h"
#include "load/loadScene.h"
#include "load/meshes.h"
#include "load/packScene.h"
#include "load/pictureSettings.h"
#include "load/placing.h"
#include "load/shaders.h"
#include "mesh/meshCompletion.h"
#include "scene/resize.h"
#include "sceneData.h"
#include "texture/textureStore.h"

#include <algorithm>
#include <fmt/format.h>
#include <functional>
#include <pybind11/stl.h>

namespace zsi::python {
namespace {

using host::InputError;
using host::JsonReader;
using host::JsonValue;
using host::Scene;
using Data = std::shared_ptr<SceneData>;

constexpr char const* kOrigin = "scene"; ///< of values that no file has

py::object plain(float v) { return toPython(v); }
py::object plain(Vec3f v) { return toPython(v); }
template <class T>
py::object plain(T const& value)
{
    return py::cast(value);
}

/// A value of one of the scene's parts by the name that scene files have for it.
template <class Part>
struct Field {
    char const* name;
    std::function<py::object(Part const&)> get;
    std::function<void(Part& to, Part const& from)> copy;
};

template <class Part, class T>
Field<Part> field(char const* name, T Part::*member)
{
    return {name, [=](Part const& part) { return plain(part.*member); },
            [=](Part& to, Part const& from) { to.*member = from.*member; }};
}

/// Camera, film or settings: read as a whole, since values must fit together.
template <class Part>
class PictureSettings {
public:
    PictureSettings(char const* name, Part Scene::*part, Part (*read)(JsonReader const&),
                    std::vector<Field<Part>> fields)
        : name_(name)
        , part_(part)
        , read_(read)
        , fields_(std::move(fields))
    {
    }

    py::dict get(SceneData const& data) const
    {
        py::dict values;
        for (Field<Part> const& f : fields_)
            values[f.name] = f.get(data.scene().*part_);
        return values;
    }
    /// Several at once, so that one that fits only with another can be given with it.
    void set(SceneData& data, py::dict const& changes) const
    {
        py::dict values;
        for (Field<Part> const& f : fields_)
            if (py::object const value = f.get(data.scene().*part_); !value.is_none())
                values[f.name] = value;
        for (auto const& [key, value] : changes)
            values[key] = value;
        JsonValue json = toJson(values, kOrigin);
        std::erase_if(json.members, [](host::JsonMember const& m) {
            return m.value.kind == JsonValue::Kind::Null;
        });
        Part const read = read_(JsonReader(json, name_));
        for (Field<Part> const& f : fields_)
            if (changes.contains(f.name))
                f.copy(data.edit().*part_, read);
    }

private:
    char const* name_;
    Part Scene::*part_;
    Part (*read_)(JsonReader const&);
    std::vector<Field<Part>> fields_;
};

using host::Camera;
using host::FilmSettings;
using host::Settings;

PictureSettings<Camera> const& camera()
{
    static PictureSettings<Camera> const all(
        "camera", &Scene::camera, host::readCamera,
        {field("position", &Camera::position), field("target", &Camera::target),
         field("up", &Camera::up), field("fov", &Camera::verticalFov),
         field("lensRadius", &Camera::lensRadius), field("focusDistance", &Camera::focusDistance)});
    return all;
}

PictureSettings<FilmSettings> const& film()
{
    static PictureSettings<FilmSettings> const all(
        "film", &Scene::film, host::readFilm,
        {field("width", &FilmSettings::width), field("height", &FilmSettings::height),
         field("crop", &FilmSettings::crop), field("exposure", &FilmSettings::exposure),
         field("view", &FilmSettings::view), field("alpha", &FilmSettings::alpha),
         field("layers", &FilmSettings::layers)});
    return all;
}

PictureSettings<Settings> const& settings()
{
    static PictureSettings<Settings> const all(
        "settings", &Scene::settings, host::readSettings,
        {field("samples", &Settings::samples), field("noise", &Settings::noise),
         field("maxDepth", &Settings::maxDepth),
         field("occlusionSamples", &Settings::occlusionSamples),
         field("indirectSamples", &Settings::indirectSamples),
         field("occlusionDistance", &Settings::occlusionDistance),
         field("ambient", &Settings::ambient), field("sampleClamp", &Settings::sampleClamp),
         field("seed", &Settings::seed), field("integrator", &Settings::integrator)});
    return all;
}

host::LoadOptions loadOptions(std::vector<std::string> const& assignments, int cacheMegabytes)
{
    host::LoadOptions options;
    options.assignments = assignments;
    if (cacheMegabytes > 0)
        options.textures.cacheBytes = static_cast<std::size_t>(cacheMegabytes) << 20;
    options.progress = [](std::string const&) {
        py::gil_scoped_acquire locked;
        if (PyErr_CheckSignals() != 0)
            throw py::error_already_set();
    };
    return options;
}

Data load(std::string const& file, std::vector<std::string> const& assignments, int cacheMegabytes)
{
    host::LoadOptions const options = loadOptions(assignments, cacheMegabytes);
    py::gil_scoped_release unlocked;
    return std::make_shared<SceneData>(host::loadScene(file, libraries(), options));
}

/// The scene, and what another machine needs to load it: a text, and files by the names that they
/// have in it.
std::tuple<Data, std::string, std::vector<std::pair<std::string, std::string>>>
pack(std::string const& file, std::vector<std::string> const& assignments)
{
    host::LoadOptions const options = loadOptions(assignments, 0);
    py::gil_scoped_release unlocked;
    host::PackedScene packed = host::packScene(file, libraries(), options);
    return {std::make_shared<SceneData>(std::move(packed.scene)), std::move(packed.text),
            std::move(packed.files)};
}

void refuseTwice(std::string const& section, std::string const& name,
                 std::vector<std::string> const& names)
{
    if (std::find(names.begin(), names.end(), name) != names.end())
        throw InputError(fmt::format("{}: {}.{}: there is one already", kOrigin, section, name));
}

std::vector<std::string> meshNames(SceneData const& data)
{
    std::vector<std::string> names;
    for (host::Mesh const& mesh : data.scene().meshes)
        names.push_back(mesh.name);
    return names;
}

void addMesh(SceneData& data, std::string const& name, host::Mesh mesh)
{
    Scene& scene = data.edit();
    mesh.name = name;
    scene.meshes.push_back(std::move(mesh));
    ++data.edits.things;
}

/// A file or a shape, as scene files name them.
void addMesh(SceneData& data, std::string const& name, py::dict const& keys)
{
    refuseTwice("meshes", name, meshNames(data));
    JsonValue const json = toJson(keys, kOrigin);
    addMesh(data, name, host::readMesh(JsonReader(json, "meshes." + name), data.edit()));
}

template <class Vector>
std::vector<Vector> vertices(py::object const& given, std::string const& place,
                             std::optional<std::size_t> count = {})
{
    std::vector<Vector> all;
    if (given.is_none())
        return all;
    auto const array = given.cast<Floats>();
    constexpr py::ssize_t kSize = sizeof(Vector) / sizeof(float);
    if (array.ndim() != 2 || array.shape(1) != kSize
        || (count && static_cast<std::size_t>(array.shape(0)) != *count))
        throw InputError(fmt::format("{}: expected an array of shape ({}, {}), got {}", place,
                                     count ? std::to_string(*count) : "N", kSize,
                                     py::str(array.attr("shape")).cast<std::string>()));
    auto const* const rows = reinterpret_cast<Vector const*>(array.data());
    all.assign(rows, rows + array.shape(0));
    return all;
}

void addMeshOfArrays(SceneData& data, std::string const& name, py::object const& positions,
                     py::object const& triangles, py::object const& normals, py::object const& uv,
                     py::object const& colors)
{
    refuseTwice("meshes", name, meshNames(data));
    std::string const place = fmt::format("{}: meshes.{}", kOrigin, name);
    host::Mesh mesh;
    mesh.positions = vertices<Vec3f>(positions, place + ".positions");
    std::size_t const count = mesh.positions.size();
    mesh.normals = vertices<Vec3f>(normals, place + ".normals", count);
    mesh.uv = vertices<Vec2f>(uv, place + ".uv", count);
    mesh.colors = vertices<Vec4f>(colors, place + ".colors", count);
    auto const corners =
        triangles.cast<py::array_t<std::int64_t, py::array::c_style | py::array::forcecast>>();
    if (corners.ndim() != 2 || corners.shape(1) != 3)
        throw InputError(fmt::format("{}.triangles: expected an array of shape (M, 3), got {}",
                                     place, py::str(corners.attr("shape")).cast<std::string>()));
    for (py::ssize_t i = 0; i < corners.shape(0); ++i) {
        auto& triangle = mesh.triangles.emplace_back();
        for (std::size_t c = 0; c < 3; ++c) {
            std::int64_t const corner = corners.at(i, static_cast<py::ssize_t>(c));
            if (corner < 0 || corner >= static_cast<std::int64_t>(count))
                throw InputError(
                    fmt::format("{}.triangles[{}]: there is no position {}; there are {}", place, i,
                                corner, count));
            triangle[c] = static_cast<std::uint32_t>(corner);
        }
    }
    std::vector<std::string> repairs;
    host::completeMesh(mesh, host::NormalSource::File, repairs);
    if (mesh.triangles.empty())
        throw InputError(place + ": has no triangles that can be seen");
    for (std::string const& repair : repairs)
        data.edit().warnings.push_back(place + ": " + repair);
    addMesh(data, name, std::move(mesh));
}

ShaderOfScene addMaterial(Data const& data, std::string const& name, py::dict const& keys)
{
    refuseTwice("materials", name, data->scene().materialNames);
    JsonValue const json = toJson(keys, kOrigin);
    host::SceneBuilder builder = data->builder();
    builder.scene.materials.push_back(
        host::readShader(JsonReader(json, "materials." + name), kMaterial, builder));
    builder.scene.materialNames.push_back(name);
    ++data->edits.things;
    return {data, kMaterial, builder.scene.materials.size() - 1};
}

/// A material with the parameters of another one, which may be another scene's.
ShaderOfScene addCopy(Data const& data, std::string const& name, ShaderOfScene const& other)
{
    refuseTwice("materials", name, data->scene().materialNames);
    Scene& scene = data->edit();
    host::Shader copy = libraries().create(other.shader().className());
    copy.object()->copy(other.shader().object());
    if (other.data->scene().textures != scene.textures)
        data->otherTextures.push_back(other.data->scene().textures);
    scene.materials.push_back(std::move(copy));
    scene.materialNames.push_back(name);
    ++data->edits.things;
    return {data, kMaterial, scene.materials.size() - 1};
}

void addInstance(SceneData& data, std::string const& name, py::dict const& keys)
{
    refuseTwice("instances", name, data.scene().instanceNames);
    JsonValue const json = toJson(keys, kOrigin);
    host::SceneBuilder builder = data.builder();
    host::readInstance(JsonReader(json, "instances." + name), builder);
    ++data.edits.instances;
}

void addLight(SceneData& data, std::string const& name, py::dict const& keys)
{
    refuseTwice("lights", name, data.scene().lightNames);
    JsonValue const json = toJson(keys, kOrigin);
    host::SceneBuilder builder = data.builder();
    host::readLight(JsonReader(json, "lights." + name), builder);
    builder.scene.lightNames.push_back(name);
    // A surface is a mesh and an instance, too.
    ++data.edits.things;
}

void setEnvironment(SceneData& data, py::object const& keys)
{
    ++data.edits.environment;
    if (keys.is_none()) {
        data.edit().environment.reset();
        return;
    }
    JsonValue const json = toJson(keys, kOrigin);
    host::SceneBuilder builder = data.builder();
    host::readEnvironment(JsonReader(json, "environment"), builder);
}

host::Instance& instanceOf(SceneData& data, std::size_t index)
{
    return data.edit().instances.at(index);
}

void setTransform(SceneData& data, std::size_t index, py::object const& transform)
{
    py::dict keys;
    keys["transform"] = transform;
    JsonValue const json = toJson(keys, kOrigin);
    std::string const& name = data.scene().instanceNames.at(index);
    instanceOf(data, index).objectToWorld =
        host::readPlacing(JsonReader(json, "instances." + name));
    ++data.edits.instances;
}

void setMaterial(SceneData& data, std::size_t index, std::string const& material)
{
    JsonValue const json = toJson(py::str(material), kOrigin);
    std::string const& name = data.scene().instanceNames.at(index);
    host::SceneBuilder const builder = data.builder();
    instanceOf(data, index).material =
        builder.materials.indexOf(JsonReader(json, "instances." + name + ".material"));
    ++data.edits.instances;
}

/// What can be said of a light beside a shader's parameters.
struct LightField {
    py::object value;
    std::function<void(JsonReader const&)> set;
};

std::vector<std::pair<std::string, LightField>> fieldsOf(SceneData& data, std::size_t index)
{
    std::vector<std::pair<std::string, LightField>> fields;
    auto const add = [&](char const* name, auto& value, auto read) {
        fields.push_back(
            {name, {plain(value), [&value, read](JsonReader const& r) { value = read(r); }}});
    };
    auto const position = [](JsonReader const& r) { return host::readPosition(r); };
    auto const color = [](JsonReader const& r) { return r.toVec3f(); };
    auto const direction = [](JsonReader const& r) {
        return host::toDirection(r, r.toVec3f(), "expected a direction that is not 0");
    };
    auto const radius = [](JsonReader const& r) { return r.toFloat(0, host::kFarthest); };
    auto const cone = [](JsonReader const& r) { return r.toFloat(0, 360); };
    auto const angle = [](JsonReader const& r) { return r.toFloat(0, 180); };
    // Whoever writes has asked for the right to edit.
    host::Light& light = const_cast<host::Light&>(data.scene().lights.at(index));
    if (auto* const l = std::get_if<host::ShaderLight>(&light)) {
        add("position", l->position, position);
        add("axis", l->axis, direction);
        add("radius", l->radius, radius);
    } else if (auto* const p = std::get_if<host::PointLight>(&light)) {
        add("position", p->position, position);
        add("color", p->color, color);
        add("radius", p->radius, radius);
        add("axis", p->axis, direction);
        add("angle", p->angle, cone);
        add("innerAngle", p->innerAngle, cone);
    } else if (auto* const s = std::get_if<host::SunLight>(&light)) {
        add("direction", s->direction, direction);
        add("color", s->color, color);
        add("angle", s->angle, angle);
    } else if (auto* const surface = std::get_if<host::SurfaceLight>(&light)) {
        add("emission", surface->emission, color);
    }
    return fields;
}

py::dict lightValues(SceneData& data, std::size_t index)
{
    py::dict values;
    for (auto const& [name, f] : fieldsOf(data, index))
        values[name.c_str()] = f.value;
    return values;
}

/// False where the light has no such field of its own.
bool setLight(SceneData& data, std::size_t index, std::string const& name, py::object const& value)
{
    data.edit();
    for (auto const& [known, f] : fieldsOf(data, index))
        if (known == name) {
            JsonValue const json = toJson(value, kOrigin);
            f.set(JsonReader(json, "lights." + data.scene().lightNames.at(index) + '.' + name));
            ++data.edits.lights;
            return true;
        }
    return false;
}

} // namespace

void bindScenes(py::module_& m)
{
    m.def("load", load);
    m.def("pack", pack);
    py::class_<SceneData, Data>(m, "Scene")
        .def(py::init<>())
        .def_property_readonly("file", [](SceneData const& d) { return d.scene().file; })
        .def("take_warnings", &SceneData::takeWarnings)
        .def("get_camera", [](SceneData const& d) { return camera().get(d); })
        .def("set_camera", [](SceneData& d, py::dict const& v) { camera().set(d, v); })
        .def("get_film", [](SceneData const& d) { return film().get(d); })
        .def("set_film", [](SceneData& d, py::dict const& v) { film().set(d, v); })
        .def("get_settings", [](SceneData const& d) { return settings().get(d); })
        .def("set_settings", [](SceneData& d, py::dict const& v) { settings().set(d, v); })
        .def("resize",
             [](SceneData& d, int width, int height) { host::resize(d.edit(), width, height); })
        .def("mesh_names", meshNames)
        .def("add_mesh",
             py::overload_cast<SceneData&, std::string const&, py::dict const&>(addMesh))
        .def("add_mesh_of_arrays", addMeshOfArrays)
        .def("material_names", [](SceneData const& d) { return d.scene().materialNames; })
        .def("material",
             [](Data const& d, std::size_t i) {
                 return ShaderOfScene{d, kMaterial, i};
             })
        .def("add_material", addMaterial)
        .def("add_material_copy", addCopy)
        .def("instance_names", [](SceneData const& d) { return d.scene().instanceNames; })
        .def("add_instance", addInstance)
        .def("get_transform",
             [](SceneData const& d, std::size_t i) {
                 return toPython(d.scene().instances.at(i).objectToWorld);
             })
        .def("set_transform", setTransform)
        .def("get_mesh",
             [](SceneData const& d, std::size_t i) {
                 auto const mesh = static_cast<std::size_t>(d.scene().instances.at(i).mesh);
                 return d.scene().meshes.at(mesh).name;
             })
        .def("get_material",
             [](SceneData const& d, std::size_t i) -> std::optional<std::string> {
                 host::Instance const& instance = d.scene().instances.at(i);
                 if (instance.light >= 0)
                     return {};
                 return d.scene().materialNames.at(static_cast<std::size_t>(instance.material));
             })
        .def("set_material", setMaterial)
        .def("light_names", [](SceneData const& d) { return d.scene().lightNames; })
        .def("add_light", addLight)
        .def("get_light", lightValues)
        .def("set_light", setLight)
        .def("light_shader",
             [](Data const& d, std::size_t i) -> std::optional<ShaderOfScene> {
                 if (!std::holds_alternative<host::ShaderLight>(d->scene().lights.at(i)))
                     return {};
                 return ShaderOfScene{d, kLight, i};
             })
        .def("environment",
             [](Data const& d) -> std::optional<ShaderOfScene> {
                 if (!d->scene().environment)
                     return {};
                 return ShaderOfScene{d, kEnvironment};
             })
        .def("set_environment", setEnvironment);
}

} // namespace zsi::python
