// SPDX-License-Identifier: Apache-2.0
#include "view/liveScene.h"

#include "integrate/layers.h"
#include "load/environment.h"
#include "load/lights.h"
#include "load/objectLengths.h"
#include "load/pictureSettings.h"
#include "load/placing.h"
#include "load/sceneBuilder.h"
#include "load/shaders.h"
#include "render/render.h"
#include "scene/resize.h"

#include <algorithm>
#include <map>
#include <set>

namespace zsi::view {

using host::Scene;

/// What of a scene has to be read again; `reload`: everything.
struct LiveScene::Plan {
    bool camera = false, film = false, settings = false, environment = false, reload = false;
    std::set<std::string> materials, instances, lights;
};

/// What has been read, before it goes into the scene.
struct LiveScene::Parts {
    std::optional<host::Camera> camera;
    std::optional<host::FilmSettings> film;
    std::optional<host::Settings> settings;
    bool environment = false, environmentVisible = false;
    std::optional<host::Shader> environmentShader;
    host::JsonValue environmentTree;
    struct Material {
        std::size_t index;
        host::Shader shader;
        std::vector<host::SceneBuilder::OpenLength> lengths;
    };
    std::vector<Material> materials;
    std::map<std::size_t, host::Instance> instances;
    std::map<std::size_t, host::Light> lights;
    std::vector<std::string> warnings;
};

namespace {

std::size_t indexOf(std::vector<std::string> const& names, std::string const& name)
{
    return static_cast<std::size_t>(std::find(names.begin(), names.end(), name) - names.begin());
}

/// Moves the meshes of a scene into another one for as long as it lives.
class LentMeshes {
public:
    LentMeshes(Scene& from, Scene& to)
        : from_(from)
        , to_(to)
    {
        to_.meshes.swap(from_.meshes);
    }
    ~LentMeshes() { to_.meshes.swap(from_.meshes); }
    LentMeshes(LentMeshes const&) = delete;
    LentMeshes& operator=(LentMeshes const&) = delete;

private:
    Scene &from_, &to_;
};

Json const& member(Json const& object, char const* section, std::string const& name)
{
    static Json const kNone;
    auto const s = object.find(section);
    if (s == object.end() || !s->is_object())
        return kNone;
    auto const found = s->find(name);
    return found == s->end() ? kNone : *found;
}

std::string text(Json const& object, char const* key)
{
    auto const found = object.find(key);
    return found != object.end() && found->is_string() ? found->get<std::string>() : std::string();
}

/// Whether a light has changed only where it stands and how it shines.
bool keepsShape(Json const& before, Json const& after)
{
    if (!before.is_object() || !after.is_object() || text(before, "kind") != text(after, "kind"))
        return false;
    std::string const kind = text(after, "kind");
    auto const same = [&](char const* key) {
        return before.value(key, Json()) == after.value(key, Json());
    };
    return kind == "rectangle" ? same("size")
        : kind == "disc"       ? same("radius")
        : kind == "mesh"       ? same("mesh")
                               : true;
}

host::FilmSettings filmOf(Json const& document, std::filesystem::path const& file)
{
    if (!document.contains("film"))
        return {};
    host::JsonValue const tree = toTree(document["film"], file);
    return host::readFilm(host::JsonReader(tree, "film"));
}

} // namespace

LiveScene::LiveScene(host::JsonValue const& tree, std::filesystem::path file,
                     host::ShaderSource const& shaders, host::BuildProgress const& progress)
    : file_(std::move(file))
    , shaders_(shaders)
    , scene_(std::make_unique<Scene>(host::loadScene(tree, file_, shaders)))
    , film_(scene_->film)
{
    if (host::JsonValue const* const environment = tree.find("environment"))
        environment_ = *environment;
    session_ = std::make_unique<host::Session>(*scene_, progress);
}

LiveScene::Plan LiveScene::planned(std::vector<Difference> const& changes, Json const& before,
                                   Json const& after) const
{
    Plan plan;
    for (Difference const& change : changes) {
        std::string const section = change.path.empty() ? std::string() : change.path[0];
        std::string const name = change.path.size() > 1 ? change.path[1] : std::string();
        bool const inside = change.path.size() > 2
            && member(before, section.c_str(), name).is_object()
            && member(after, section.c_str(), name).is_object();
        std::string const key = change.path.size() > 2 ? change.path[2] : std::string();
        if (section == "camera")
            plan.camera = true;
        else if (section == "film")
            plan.film = true;
        else if (section == "settings")
            plan.settings = true;
        else if (section == "environment")
            plan.environment = true;
        else if (section == "materials" && inside)
            plan.materials.insert(name);
        else if (section == "instances" && inside
                 && (key == "transform"
                     || (key == "material" && !change.value.is_null()
                         && member(before, "instances", name).contains("material"))))
            plan.instances.insert(name);
        else if (section == "lights" && inside
                 && keepsShape(member(before, "lights", name), member(after, "lights", name)))
            plan.lights.insert(name);
        else
            plan.reload = true;
    }
    return plan;
}

SceneChange LiveScene::change(Json const& before, Json const& after,
                              host::BuildProgress const& progress)
{
    std::vector<Difference> const changes = differences(before, after);
    SceneChange change;
    for (Difference const& difference : changes) {
        std::string const path = pathText(difference.path);
        bool const shown = path == "film.exposure" || path == "film.view" || path == "film.alpha";
        bool const counted = path == "settings.samples"; // more of the same
        (shown ? change.display : change.picture) |= !counted;
    }
    Plan const plan = planned(changes, before, after);
    if (plan.reload) {
        reload(before, after, change, progress);
    } else {
        Parts parts = read(plan, after);
        change.warnings = std::move(parts.warnings);
        commit(std::move(parts), progress);
    }
    return change;
}

void LiveScene::reload(Json const& before, Json const& after, SceneChange& change,
                       host::BuildProgress const& progress)
{
    host::LoadOptions options;
    options.textureStore = scene_->textures;
    options.knownMesh = [&](std::string const& name) -> std::optional<host::Mesh> {
        if (member(before, "meshes", name) != member(after, "meshes", name))
            return {};
        for (host::Mesh const& mesh : scene_->meshes)
            if (mesh.name == name && !mesh.triangles.empty())
                return mesh;
        return {};
    };
    auto scene =
        std::make_unique<Scene>(host::loadScene(toTree(after, file_), file_, shaders_, options));
    auto session = std::make_unique<host::Session>(*scene, progress);
    session_ = std::move(session);
    scene_ = std::move(scene);
    film_ = scene_->film;
    environment_ =
        after.contains("environment") ? toTree(after["environment"], file_) : host::JsonValue();
    change.reloaded = true;
    change.warnings = scene_->warnings;
    fitFilm();
}

LiveScene::Parts LiveScene::read(Plan const& plan, Json const& after)
{
    Parts parts;
    auto const section = [&](char const* name) {
        return after.contains(name) ? toTree(after[name], file_) : toTree(Json::object(), file_);
    };
    if (plan.camera)
        parts.camera = host::readCamera(host::JsonReader(section("camera"), "camera"));
    if (plan.film) {
        parts.film = filmOf(after, file_);
        host::chooseLayers(parts.film->layers);
        host::screenTransform(host::screenView(*parts.film)); // refuses an unknown view
    }
    if (plan.settings)
        parts.settings = host::readSettings(host::JsonReader(section("settings"), "settings"));

    Scene scratch;
    scratch.file = scene_->file;
    scratch.textures = scene_->textures;
    host::LoadOptions const options;
    if (plan.environment) {
        parts.environment = true;
        if (after.contains("environment")) {
            host::SceneBuilder builder(scratch, shaders_, options);
            parts.environmentTree = section("environment");
            host::readEnvironment(host::JsonReader(parts.environmentTree, "environment"), builder);
            parts.environmentVisible = scratch.environmentVisible;
            parts.environmentShader = std::move(scratch.environment);
        }
    }
    for (std::string const& name : plan.materials) {
        host::SceneBuilder builder(scratch, shaders_, options);
        host::JsonValue const tree = toTree(member(after, "materials", name), file_);
        host::JsonReader const reader(tree, "materials." + name);
        reader.expectKeys({"class", "parameters"});
        host::Shader shader = host::readShader(reader, kMaterial, builder);
        std::size_t const index = indexOf(scene_->materialNames, name);
        for (auto& length : builder.openLengths)
            length.material = index;
        parts.materials.push_back({index, std::move(shader), std::move(builder.openLengths)});
    }
    parts.warnings = std::move(scratch.warnings);
    readPlaces(plan, after, parts);
    return parts;
}

/// Instances and lights that stand elsewhere.
void LiveScene::readPlaces(Plan const& plan, Json const& after, Parts& parts)
{
    host::LoadOptions const options;
    for (std::string const& name : plan.instances) {
        Scene scratch;
        LentMeshes const lent(*scene_, scratch);
        host::SceneBuilder builder(scratch, shaders_, options);
        for (std::string const& material : scene_->materialNames)
            builder.materials.add(material);
        host::JsonValue const tree = toTree(member(after, "instances", name), file_);
        host::JsonReader const reader(tree, "instances." + name);
        reader.expectKeys({"mesh", "material", "materials", "transform"});
        for (std::size_t i = 0; i < scene_->instances.size(); ++i) {
            std::string const& called = scene_->instanceNames[i];
            if (scene_->instances[i].light >= 0
                || (called != name && !called.starts_with(name + '/')))
                continue;
            host::Instance instance = scene_->instances[i];
            instance.objectToWorld = host::readPlacing(reader);
            if (auto const material = reader.find("material"))
                instance.material = builder.materials.indexOf(*material);
            builder.addInstance(reader, instance);
            parts.instances[i] = instance;
        }
    }
    for (std::string const& name : plan.lights) {
        Scene scratch;
        scratch.textures = scene_->textures;
        host::JsonValue const tree = toTree(member(after, "lights", name), file_);
        host::JsonReader const reader(tree, "lights." + name);
        std::optional<LentMeshes> lent;
        host::SceneBuilder builder(scratch, shaders_, options);
        if (text(member(after, "lights", name), "kind") == "mesh") {
            lent.emplace(*scene_, scratch);
            for (host::Mesh const& mesh : scratch.meshes)
                builder.meshes.add(mesh.name);
        }
        host::readLight(reader, builder);
        std::size_t const index = indexOf(scene_->lightNames, name);
        host::Light light = std::move(scratch.lights.back());
        if (auto* const surface = std::get_if<host::SurfaceLight>(&light)) {
            surface->instance = std::get<host::SurfaceLight>(scene_->lights[index]).instance;
            auto const at = static_cast<std::size_t>(surface->instance);
            host::Instance instance = scene_->instances[at];
            instance.objectToWorld = scratch.instances.back().objectToWorld;
            parts.instances[at] = instance;
        }
        parts.lights.emplace(index, std::move(light));
        parts.warnings.insert(parts.warnings.end(), scratch.warnings.begin(),
                              scratch.warnings.end());
    }
}

void LiveScene::commit(Parts parts, host::BuildProgress const& progress)
{
    if (parts.camera)
        scene_->camera = *parts.camera;
    if (parts.settings)
        scene_->settings = *parts.settings;
    bool const isMoved = !parts.instances.empty(), isLit = !parts.lights.empty();
    for (auto& [index, instance] : parts.instances)
        scene_->instances[index] = instance;
    for (auto& [index, light] : parts.lights)
        scene_->lights[index] = std::move(light);
    for (Parts::Material& material : parts.materials) {
        scene_->materials[material.index] = std::move(material.shader);
        host::LoadOptions const options;
        host::SceneBuilder builder(*scene_, shaders_, options);
        builder.openLengths = std::move(material.lengths);
        host::suitOpenLengths(builder);
        session_->materialChanged(material.index);
    }
    if (isMoved)
        session_->instancesChanged(progress);
    else if (isLit)
        session_->lightsChanged();
    if (parts.environment) {
        scene_->environment = std::move(parts.environmentShader);
        scene_->environmentVisible = parts.environmentVisible;
        environment_ = std::move(parts.environmentTree);
        session_->environmentChanged();
    }
    if (parts.film)
        film_ = *parts.film;
    if (parts.film || parts.environment)
        fitFilm();
}

bool LiveScene::countsPixels() const
{
    return scene_->environment
        && (scene_->environment->find("uv_scale") || scene_->environment->find("render_size"));
}

void LiveScene::setSize(int width, int height)
{
    bool const isOther = width != scene_->film.width || height != scene_->film.height;
    width_ = width;
    height_ = height;
    if (isOther)
        fitFilm();
}

/// The document's film at the size that is wanted, whole.
void LiveScene::fitFilm()
{
    if (countsPixels()) { // its numbers were fitted to the size before
        Scene scratch;
        scratch.textures = scene_->textures;
        host::LoadOptions const options;
        host::SceneBuilder builder(scratch, shaders_, options);
        host::readEnvironment(host::JsonReader(environment_, "environment"), builder);
        scene_->environment = std::move(scratch.environment);
        session_->environmentChanged();
    }
    scene_->film = film_;
    scene_->film.crop.reset();
    if (width_ > 0)
        host::resize(*scene_, width_, height_);
}

} // namespace zsi::view
