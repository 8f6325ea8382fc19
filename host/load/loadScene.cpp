// SPDX-License-Identifier: Apache-2.0
#include "load/loadScene.h"

#include "base/error.h"
#include "base/names.h"
#include "integrate/integrators.h"
#include "integrate/layers.h"
#include "light/lightCheck.h"
#include "load/jsonReader.h"
#include "load/parameterValues.h"
#include "load/sceneFile.h"
#include "load/transforms.h"
#include "load/unwrittenParameters.h"
#include "mesh/meshCompletion.h"
#include "mesh/meshFile.h"
#include "mesh/meshShapes.h"
#include "texture/textureStore.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <map>
#include <unordered_map>

namespace zsi::host {

namespace {

constexpr int kLargestFilm = 32768; // pixels a side
constexpr int kMostSamples = 1 << 20;
constexpr int kMostSegments = 4096;
constexpr float kRadians = 0.0174532925f; // of a degree

Vec3f readPosition(JsonReader const& reader)
{
    Vec3f const v = reader.toVec3f();
    if (!(maxOf(std::fabs(v.x), maxOf(std::fabs(v.y), std::fabs(v.z))) <= kFarthest))
        reader.fail(fmt::format("lies farther out than rays go, which is {}", kFarthest));
    return v;
}

Camera readCamera(JsonReader const& reader)
{
    reader.expectKeys({"position", "target", "up", "fov", "lensRadius", "focusDistance"});
    Camera camera;
    if (auto const v = reader.find("position"))
        camera.position = readPosition(*v);
    if (auto const v = reader.find("target"))
        camera.target = readPosition(*v);
    if (auto const v = reader.find("up"))
        camera.up = v->toVec3f();
    if (auto const v = reader.find("fov")) {
        camera.verticalFov = v->toPositive();
        if (camera.verticalFov >= 180.0f)
            v->failExpected("degrees below 180");
    }
    if (auto const v = reader.find("lensRadius"))
        camera.lensRadius = v->toFloat(0, kFarthest / 2);
    if (auto const v = reader.find("focusDistance"))
        camera.focusDistance = v->toFloat(0, kFarthest);
    Vec3f const view = camera.target - camera.position;
    if (!(length(view) > 0.0f) || !std::isfinite(length(view)))
        reader.fail("the target has no direction from the position");
    if (!(length(cross(normalize(view), normalize(camera.up))) > 1e-5f))
        reader.fail("up must point across the view, not along it");
    return camera;
}

FilmSettings readFilm(JsonReader const& reader)
{
    reader.expectKeys({"width", "height", "exposure", "alpha", "crop", "layers"});
    FilmSettings film;
    if (auto const v = reader.find("width"))
        film.width = v->toInt(1, kLargestFilm);
    if (auto const v = reader.find("height"))
        film.height = v->toInt(1, kLargestFilm);
    if (auto const v = reader.find("exposure"))
        film.exposure = v->toFloat(-64, 64);
    if (auto const v = reader.find("alpha"))
        film.alpha = v->toBool();
    if (auto const v = reader.find("layers"))
        for (JsonReader const& name : v->items())
            film.layers.push_back(layerNames()[name.toChoice(layerNames())]);
    if (auto const v = reader.find("crop")) {
        std::vector<JsonReader> const items = v->items();
        if (items.size() != 4)
            v->failExpected("[x0, y0, x1, y1] in pixels, the end exclusive");
        int const x0 = items[0].toInt(0, film.width - 1), y0 = items[1].toInt(0, film.height - 1);
        int const x1 = items[2].toInt(x0 + 1, film.width);
        int const y1 = items[3].toInt(y0 + 1, film.height);
        film.crop = {x0, y0, x1, y1};
    }
    return film;
}

Settings readSettings(JsonReader const& reader)
{
    reader.expectKeys({"samples", "maxDepth", "occlusionSamples", "indirectSamples",
                       "occlusionDistance", "ambient", "sampleClamp", "seed", "integrator"});
    Settings settings;
    if (auto const v = reader.find("samples"))
        settings.samples = v->toInt(1, kMostSamples);
    if (auto const v = reader.find("maxDepth"))
        settings.maxDepth = v->toInt(0, 1000);
    if (auto const v = reader.find("occlusionSamples"))
        settings.occlusionSamples = v->toInt(1, 4096);
    if (auto const v = reader.find("indirectSamples"))
        settings.indirectSamples = v->toInt(1, 4096);
    if (auto const v = reader.find("occlusionDistance"))
        settings.occlusionDistance = v->toFloat(0);
    if (auto const v = reader.find("ambient"))
        settings.ambient = v->toVec3f();
    if (auto const v = reader.find("sampleClamp"))
        settings.sampleClamp = v->toFloat(0);
    if (auto const v = reader.find("seed"))
        settings.seed = v->toUint32();
    if (auto const v = reader.find("integrator")) {
        settings.integrator = integratorNames()[v->toChoice(integratorNames())];
    }
    return settings;
}

/// A positive number for all axes or one for each.
std::vector<float> readSize(JsonReader const& reader, std::size_t axes)
{
    if (reader.kind() != JsonValue::Kind::Array)
        return std::vector<float>(axes, reader.toPositive());
    if (reader.value().items.size() != axes)
        reader.failExpected(fmt::format("a number or an array of {}", axes));
    std::vector<float> size;
    for (JsonReader const& item : reader.items())
        size.push_back(item.toPositive());
    return size;
}

Mesh readMeshFromFile(JsonReader const& reader, std::vector<std::string>& warnings)
{
    reader.expectKeys({"file", "up", "normals"});
    JsonReader const name = reader.at("file");
    std::filesystem::path const file = name.toFile();
    Mesh mesh;
    try {
        mesh = readMeshFile(file);
    } catch (InputError const& error) {
        name.fail(error.what());
    }
    auto const up = reader.find("up");
    if (up ? up->toChoice({"y", "z"}) == 0 : isYUp(file))
        turnYUp(mesh);
    NormalSource source = NormalSource::File;
    if (auto const normals = reader.find("normals")) {
        constexpr NormalSource kSources[] = {NormalSource::File, NormalSource::Smooth,
                                             NormalSource::Flat};
        source = kSources[normals->toChoice({"file", "smooth", "flat"})];
    }
    std::vector<std::string> repairs;
    completeMesh(mesh, source, repairs);
    for (std::string const& repair : repairs)
        warnings.push_back(fmt::format("{}: {}: {}", name.place(), file.string(), repair));
    if (mesh.triangles.empty())
        name.fail(file.string() + ": has no triangles that can be seen");
    return mesh;
}

Mesh readMesh(JsonReader const& reader, std::vector<std::string>& warnings)
{
    std::vector<std::string> const kinds{"file", "sphere", "box", "plane"};
    if (!reader.isObject())
        reader.failExpected("an object");
    if (reader.find("file") && !reader.find("sphere") && !reader.find("box")
        && !reader.find("plane"))
        return readMeshFromFile(reader, warnings);
    reader.expectKeys({"sphere", "box", "plane", "file"});
    JsonReader const shape = reader.onlyOf(kinds);
    if (reader.find("sphere")) {
        shape.expectKeys({"radius", "segments"});
        auto const radius = shape.find("radius"), segments = shape.find("segments");
        return sphereMesh(radius ? radius->toPositive() : 1.0f,
                          segments ? segments->toInt(3, kMostSegments) : 64);
    }
    shape.expectKeys({"size"});
    auto const size = shape.find("size");
    if (reader.find("box")) {
        std::vector<float> const s = size ? readSize(*size, 3) : std::vector<float>(3, 1.0f);
        return boxMesh({s[0], s[1], s[2]});
    }
    std::vector<float> const s = size ? readSize(*size, 2) : std::vector<float>(2, 1.0f);
    return planeMesh({s[0], s[1]});
}

/// Indices of things that later parts of the scene refer to by name.
class Names {
public:
    explicit Names(char const* what)
        : what_(what)
    {
    }
    void add(std::string const& name)
    {
        indices_.emplace(name, static_cast<int>(names_.size()));
        names_.push_back(name);
    }
    int indexOf(JsonReader const& reader) const
    {
        std::string const& name = reader.toString();
        auto const found = indices_.find(name);
        if (found == indices_.end())
            reader.fail(fmt::format("unknown {} \"{}\"{}", what_, printable(name),
                                    suggestion(name, names_)));
        return found->second;
    }

private:
    char const* what_;
    std::vector<std::string> names_; ///< in the file's order
    std::unordered_map<std::string, int> indices_;
};

/// Reads the parts of one scene in order; later ones refer to earlier ones by name.
class Loader {
public:
    Loader(Scene& scene, ShaderSource const& shaders, LoadOptions const& options)
        : scene_(scene)
        , shaders_(shaders)
        , options_(options)
    {
    }

    void read(JsonReader const& root)
    {
        root.expectKeys({"include", "camera", "film", "settings", "meshes", "materials",
                         "instances", "lights", "environment"});
        if (auto const v = root.find("camera"))
            scene_.camera = readCamera(*v);
        if (auto const v = root.find("film"))
            scene_.film = readFilm(*v);
        if (auto const v = root.find("settings"))
            scene_.settings = readSettings(*v);
        if (auto const v = root.find("meshes"))
            for (auto const& [name, mesh] : v->members()) {
                begin(mesh);
                scene_.meshes.push_back(readMesh(mesh, scene_.warnings));
                scene_.meshes.back().name = name;
                meshes_.add(name);
            }
        if (auto const v = root.find("materials"))
            for (auto const& [name, material] : v->members()) {
                material.expectKeys({"class", "parameters"});
                scene_.materials.push_back(readShader(material, kMaterial));
                scene_.materialNames.push_back(name);
                materials_.add(name);
            }
        if (auto const v = root.find("instances"))
            for (auto const& [name, instance] : v->members())
                readInstance(instance);
        if (auto const v = root.find("lights"))
            for (auto const& [name, light] : v->members())
                readLight(light);
        if (auto const v = root.find("environment"))
            readEnvironment(*v);
        dropWholeMeshes();
    }

private:
    void begin(JsonReader const& reader) const
    {
        if (options_.progress)
            options_.progress(reader.path());
    }

    Shader readShader(JsonReader const& reader, ShaderKind wanted)
    {
        begin(reader);
        JsonReader const className = reader.at("class");
        Shader shader = createShader(className);
        if (shader.kind() != wanted) {
            constexpr char const* kKinds[] = {"a material", "a light", "an environment"};
            className.fail(fmt::format("{} is {}, expected {}", shader.className(),
                                       kKinds[shader.kind()], kKinds[wanted]));
        }
        std::set<std::string> written;
        if (auto const parameters = reader.find("parameters"))
            for (auto const& [name, value] : parameters->members()) {
                Parameter const* const parameter = shader.find(name);
                if (!parameter)
                    value.fail(fmt::format("unknown parameter of {}{}", shader.className(),
                                           suggestion(name, shader.parameterNames())));
                shader.set(name, readParameterValue(value, parameter->type, *scene_.textures));
                written.insert(name);
            }
        warnAboutUnwritten(reader, shader, written);
        return shader;
    }

    Shader createShader(JsonReader const& className) const
    {
        std::string const& name = className.toString();
        try {
            return shaders_.create(name);
        } catch (InputError const& error) {
            className.fail(error.what());
        }
    }

    void warnAboutUnwritten(JsonReader const& reader, Shader const& shader,
                            std::set<std::string> const& written)
    {
        std::vector<std::string> const names = unwrittenParameters(shader, written);
        if (names.empty())
            return;
        scene_.warnings.push_back(
            fmt::format("{}: {} reads {}, which {} no default and {} not written here (0 is used)",
                        reader.place(), shader.className(), fmt::join(names, ", "),
                        names.size() == 1 ? "has" : "have", names.size() == 1 ? "is" : "are"));
    }

    void readEnvironment(JsonReader const& reader)
    {
        reader.onlyOf({"class", "file"});
        auto const visible = reader.find("visible");
        if (!reader.find("file")) {
            reader.expectKeys({"class", "parameters", "visible"});
            scene_.environmentVisible = visible && visible->toBool();
            scene_.environment = readShader(reader, kEnvironment);
            return;
        }
        reader.expectKeys(
            {"file", "colorSpace", "visible", "rotate", "intensity", "diffuseBlur", "background"});
        begin(reader);
        scene_.environmentVisible = !visible || visible->toBool();
        auto const rotate = reader.find("rotate"), intensity = reader.find("intensity");
        auto const blur = reader.find("diffuseBlur"), background = reader.find("background");
        Vec3f gain{1, 1, 1};
        if (intensity && intensity->kind() == JsonValue::Kind::Array)
            gain = intensity->toVec3f();
        else if (intensity)
            gain = gain * intensity->toFloat(0);
        Shader shader = [&] {
            try {
                return shaders_.create("corvid_Env_Default");
            } catch (InputError const& error) {
                reader.fail(error.what());
            }
        }();
        shader.set("globalIBLMatrix", turnAroundZ(rotate ? rotate->toFloat() : 0.0f));
        shader.set("reflectionCube", readPictureAround(reader, 0.0f, *scene_.textures));
        shader.set("diffuseCube",
                   readPictureAround(reader, blur ? blur->toFloat(0, 90) * kRadians : 0.0f,
                                     *scene_.textures));
        for (char const* kind : {"reflect", "diffuse"}) {
            shader.set(std::string(kind) + "IBLGainMode", 1); // by channel
            shader.set(std::string(kind) + "IBLGain", gain);
        }
        shader.set("backgroundColor", background ? background->toVec3f() : Vec3f(0, 0, 0));
        scene_.environment = std::move(shader);
    }

    void readInstance(JsonReader const& reader)
    {
        reader.expectKeys({"mesh", "material", "materials", "transform"});
        int const mesh = meshes_.indexOf(reader.at("mesh"));
        JsonReader const material = reader.onlyOf({"material", "materials"});
        Mat4f const toWorld = readPlacing(reader);
        if (reader.find("material"))
            addInstance(reader, {mesh, materials_.indexOf(material), toWorld});
        else
            readParts(reader, material, mesh, toWorld);
    }

    /// An instance of each part of the mesh; `chosen`: scene materials by the parts' names.
    void readParts(JsonReader const& reader, JsonReader const& chosen, int mesh,
                   Mat4f const& toWorld)
    {
        std::vector<MeshPart> const parts = scene_.meshes[static_cast<std::size_t>(mesh)].parts;
        if (parts.empty())
            chosen.fail("the mesh has no parts; give it a \"material\"");
        std::vector<std::string> names, known;
        for (MeshPart const& part : parts) {
            names.push_back(fmt::format("{} ({})", printable(part.node), printable(part.material)));
            known.insert(known.end(), {part.node, part.material});
        }
        std::map<std::string, int> materials;
        for (auto const& [name, material] : chosen.members()) {
            if (name != "*" && std::find(known.begin(), known.end(), name) == known.end())
                material.fail(fmt::format("no part and no material of the file has this name; its "
                                          "parts, with their materials: {}",
                                          fmt::join(names, ", ")));
            materials[name] = materials_.indexOf(material);
        }
        std::vector<int> const& meshes = splitMesh(mesh);
        for (std::size_t i = 0; i < parts.size(); ++i) {
            auto found = materials.find(parts[i].node);
            for (std::string const& other : {parts[i].material, std::string("*")})
                if (found == materials.end())
                    found = materials.find(other);
            if (found == materials.end())
                chosen.fail(fmt::format("no material for the part {}; name it, its material, or "
                                        "\"*\" for all others",
                                        names[i]));
            if (meshes[i] >= 0)
                addInstance(reader, {meshes[i], found->second, toWorld});
        }
    }

    /// Meshes of the parts, -1 for one without triangles.
    std::vector<int> const& splitMesh(int whole)
    {
        auto const [split, isNew] = split_.try_emplace(whole);
        if (!isNew)
            return split->second;
        Mesh const& mesh = scene_.meshes[static_cast<std::size_t>(whole)];
        std::vector<Mesh> parts = partsOf(mesh);
        for (std::size_t i = 0; i < parts.size(); ++i) {
            bool const isThere = !parts[i].triangles.empty();
            split->second.push_back(isThere ? static_cast<int>(scene_.meshes.size()) : -1);
            if (isThere) {
                Mesh const& from = scene_.meshes[static_cast<std::size_t>(whole)];
                parts[i].name = from.name + '/' + from.parts[i].node;
                scene_.meshes.push_back(std::move(parts[i]));
            }
        }
        return split->second;
    }

    /// What stands in the scene only in parts needs no memory as a whole.
    void dropWholeMeshes()
    {
        std::set<int> used;
        for (Instance const& instance : scene_.instances)
            used.insert(instance.mesh);
        for (auto const& [whole, parts] : split_)
            if (!used.contains(whole)) {
                Mesh& mesh = scene_.meshes[static_cast<std::size_t>(whole)];
                Mesh empty;
                empty.name = mesh.name;
                mesh = std::move(empty);
            }
    }

    /// The key "transform".
    static Mat4f readPlacing(JsonReader const& reader)
    {
        auto const transform = reader.find("transform");
        if (!transform)
            return Mat4f::identity();
        Mat4f const m = readTransform(*transform);
        if (m.m[3] != 0.0f || m.m[7] != 0.0f || m.m[11] != 0.0f || m.m[15] != 1.0f)
            transform->fail("the last column must be 0, 0, 0, 1 (points are row vectors)");
        Vec3f const x{m.m[0], m.m[1], m.m[2]}, y{m.m[4], m.m[5], m.m[6]};
        float const volume = dot(cross(x, y), {m.m[8], m.m[9], m.m[10]});
        if (volume == 0.0f || !std::isfinite(volume))
            transform->fail("flattens the mesh: it has no inverse");
        return m;
    }

    void addInstance(JsonReader const& reader, Instance const& instance)
    {
        Mat4f const& m = instance.objectToWorld;
        float const largest = largestCoordinate(static_cast<std::size_t>(instance.mesh));
        for (int i = 0; i < 3; ++i) {
            float const scale = std::fabs(m.m[i]) + std::fabs(m.m[4 + i]) + std::fabs(m.m[8 + i]);
            if (!(scale * largest + std::fabs(m.m[12 + i]) <= kFarthest))
                reader.fail(
                    fmt::format("reaches farther out than rays go, which is {}", kFarthest));
        }
        scene_.instances.push_back(instance);
    }

    float largestCoordinate(std::size_t mesh)
    {
        while (largest_.size() <= mesh) {
            float& largest = largest_.emplace_back(0.0f);
            for (Vec3f const& p : scene_.meshes[largest_.size() - 1].positions)
                largest =
                    maxOf(largest, maxOf(std::fabs(p.x), maxOf(std::fabs(p.y), std::fabs(p.z))));
        }
        return largest_[mesh];
    }

    void readLight(JsonReader const& reader)
    {
        scene_.lights.push_back(placedLight(reader));
        if (!lightsAnything(scene_.lights.back()))
            scene_.warnings.push_back(
                fmt::format("{}: lights nothing at any distance; its colour or its fall-off is 0",
                            reader.place()));
    }

    Light placedLight(JsonReader const& reader)
    {
        auto const kind = reader.find("kind");
        if (!kind)
            return readShaderLight(reader);
        switch (kind->toChoice({"point", "sun", "rectangle", "disc", "mesh"})) {
        case 0:
            return readPointLight(reader);
        case 1:
            return readSunLight(reader);
        case 2: {
            reader.expectKeys({"kind", "position", "target", "axis", "up", "size", "emission"});
            auto const size = reader.find("size");
            std::vector<float> const s = size ? readSize(*size, 2) : std::vector<float>(2, 1.0f);
            return readSurfaceLight(reader, addMesh(planeMesh({s[0], s[1]})), readPose(reader));
        }
        case 3: {
            reader.expectKeys({"kind", "position", "target", "axis", "radius", "emission"});
            auto const radius = reader.find("radius");
            return readSurfaceLight(reader, addMesh(discMesh(radius ? radius->toPositive() : 1.0f)),
                                    readPose(reader));
        }
        default:
            reader.expectKeys({"kind", "mesh", "transform", "emission"});
            return readSurfaceLight(reader, meshes_.indexOf(reader.at("mesh")),
                                    readPlacing(reader));
        }
    }

    ShaderLight readShaderLight(JsonReader const& reader)
    {
        reader.expectKeys({"class", "kind", "position", "target", "axis", "radius", "parameters"});
        ShaderLight light{readShader(reader, kLight), readPosition(reader.at("position"))};
        if (auto const v = reader.find("radius"))
            light.radius = v->toFloat(0, kFarthest);
        if (reader.find("target") || reader.find("axis"))
            light.axis = readAxis(reader, light.position);
        return light;
    }

    static PointLight readPointLight(JsonReader const& reader)
    {
        reader.expectKeys({"kind", "position", "color", "radius"});
        PointLight light{readPosition(reader.at("position"))};
        if (auto const v = reader.find("color"))
            light.color = v->toVec3f();
        if (auto const v = reader.find("radius"))
            light.radius = v->toFloat(0, kFarthest);
        return light;
    }

    static SunLight readSunLight(JsonReader const& reader)
    {
        reader.expectKeys({"kind", "direction", "angle", "color"});
        SunLight light;
        if (auto const v = reader.find("direction"))
            light.direction = toDirection(*v, v->toVec3f(), "expected a direction that is not 0");
        if (auto const v = reader.find("angle"))
            light.angle = v->toFloat(0, 180);
        if (auto const v = reader.find("color"))
            light.color = v->toVec3f();
        return light;
    }

    /// Adds the instance that shines.
    SurfaceLight readSurfaceLight(JsonReader const& reader, int mesh, Mat4f const& objectToWorld)
    {
        SurfaceLight light{static_cast<int>(scene_.instances.size())};
        if (auto const v = reader.find("emission"))
            light.emission = v->toVec3f();
        addInstance(reader, {mesh, -1, objectToWorld, static_cast<int>(scene_.lights.size())});
        return light;
    }

    int addMesh(Mesh mesh)
    {
        scene_.meshes.push_back(std::move(mesh));
        return static_cast<int>(scene_.meshes.size()) - 1;
    }

    static Vec3f toDirection(JsonReader const& place, Vec3f v, char const* why)
    {
        if (!(length(v) > 0.0f) || !std::isfinite(length(v)))
            place.fail(why);
        return normalize(v);
    }

    /// Unit, by a point that it aims at or as it is.
    static Vec3f readAxis(JsonReader const& reader, Vec3f position)
    {
        JsonReader const aim = reader.onlyOf({"target", "axis"});
        if (reader.find("target"))
            return toDirection(aim, readPosition(aim) - position, "the light stands on its target");
        return toDirection(aim, aim.toVec3f(), "expected a direction that is not 0");
    }

    /// Turns +z to the axis, by default down, and +y as far as can be to `up`.
    static Mat4f readPose(JsonReader const& reader)
    {
        Vec3f const position = readPosition(reader.at("position"));
        Vec3f const z = reader.find("target") || reader.find("axis") ? readAxis(reader, position)
                                                                     : Vec3f(0, 0, -1);
        auto const given = reader.find("up");
        Vec3f up = given ? given->toVec3f() : Vec3f(0, 0, 1);
        if (!(length(cross(up, z)) > 1e-5f)) {
            if (given)
                given->fail("up must point across the axis, not along it");
            up = {0, 1, 0};
        }
        Vec3f const x = normalize(cross(up, z)), y = cross(z, x);
        return {x.x, x.y, x.z, 0, y.x,        y.y,        y.z,        0,
                z.x, z.y, z.z, 0, position.x, position.y, position.z, 1};
    }

    Scene& scene_;
    ShaderSource const& shaders_;
    LoadOptions const& options_;
    std::vector<float> largest_; ///< coordinate of each mesh, as far as asked for
    std::map<int, std::vector<int>> split_; ///< meshes that stand in the scene in parts
    Names meshes_{"mesh"}, materials_{"material"};
};

} // namespace

Scene loadScene(std::filesystem::path const& file, ShaderSource const& shaders,
                LoadOptions const& options)
{
    JsonValue const tree = readSceneFile(file, options.assignments);
    Scene scene;
    scene.file = file.string();
    scene.textures = std::make_shared<TextureStore>(options.textures);
    Loader(scene, shaders, options).read(JsonReader(tree));
    for (std::string const& warning : scene.textures->warnings())
        scene.warnings.push_back(scene.file + ": " + warning);
    return scene;
}

} // namespace zsi::host
