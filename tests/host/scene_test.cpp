// SPDX-License-Identifier: Apache-2.0
#include "light/lights.h"
#include "load/loadScene.h"
#include "mesh/meshCompletion.h"
#include "mesh/meshFile.h"
#include "mesh/meshShapes.h"
#include "support/hostLibraries.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <ctime>
#include <fstream>
#include <gtest/gtest.h>
#include <limits>
#include <numeric>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;
using test::errorOf;
using test::expectContains;

using test::libraries;
using test::value;

fs::path const kData = fs::path(ZSI_SOURCE_DIR) / "tests/data";

/// A scene.json that is written beside the files of tests/data/scenes and a.png.
class SceneFile : public testing::Test {
protected:
    SceneFile()
    {
        fs::copy(kData / "scenes", folder.path, fs::copy_options::recursive);
        fs::copy(fs::path(ZSI_SOURCE_DIR) / "assets/textures/checker.png", folder.path / "a.png");
    }
    Scene load(std::string const& text) const
    {
        return loadScene(folder.write("scene.json", text), libraries());
    }

    test::TemporaryFolder folder;
};

/// A material without parameters, which no library offers.
struct TinyLess final : MaterialShader {
    void registerShader(IShaderManager* m) override { m->declareEntryPoints(this, kShade); }
    void copy(IShaderBase const*) override { }
    void shade(IShaderAPI*, ShadeState&) const override { }
};

IShaderBase* makeTinyLess() { return new TinyLess; }

std::vector<float> numbers(auto const& v)
{
    std::vector<float> result(sizeof(v) / sizeof(float));
    std::memcpy(result.data(), &v, sizeof(v));
    return result;
}

void expectNear(std::vector<float> const& got, std::vector<float> const& want)
{
    ASSERT_EQ(got.size(), want.size());
    for (std::size_t i = 0; i < got.size(); ++i)
        EXPECT_NEAR(got[i], want[i], 1e-6f) << "number " << i;
}

/// A scene of a file of tests/data/scenes and parts of the message that it brings.
struct ToldScene {
    std::string text;
    std::vector<std::string> parts;
};

std::vector<ToldScene> toldScenes(char const* file)
{
    std::ifstream in(kData / "scenes" / file);
    std::vector<ToldScene> scenes;
    bool inside = false;
    for (std::string line; std::getline(in, line);) {
        if (line.empty() || line.starts_with('#')) {
            inside = false;
            continue;
        }
        if (!std::exchange(inside, true))
            scenes.emplace_back();
        if (line.starts_with("> "))
            scenes.back().parts.push_back(line.substr(2));
        else
            scenes.back().text += line + '\n';
    }
    return scenes;
}

TEST_F(SceneFile, BadScenesSayWhereAndWhatWasExpected)
{
    std::vector<ToldScene> bad = toldScenes("bad.txt");
    EXPECT_GT(bad.size(), 50u);
    bad.push_back({"", {"scene.json:1:1: no valid JSON"}});
    bad.push_back({"{\"film\": {\"width\": \"\xff\"}}", {"no valid JSON"}});
    for (ToldScene const& scene : bad) {
        SCOPED_TRACE(scene.text);
        expectContains(errorOf([&] { load(scene.text); }), scene.parts);
    }
    for (auto const& [name, part] : {std::pair{"no.json", "no such file"}, {"", "is a folder"}})
        expectContains(errorOf([&, file = folder.path / name] { loadScene(file, libraries()); }),
                       {part});
}

TEST_F(SceneFile, WarnsOfUnwrittenParametersThatWillBeRead)
{
    for (ToldScene const& told : toldScenes("warned.txt")) {
        SCOPED_TRACE(told.text);
        Scene const scene = load(told.text);
        ASSERT_EQ(scene.warnings.size(), told.parts.size());
        if (!told.parts.empty())
            expectContains(scene.warnings[0], {"scene.json:1: ", told.parts[0]});
    }
}

TEST_F(SceneFile, AnIncludingSceneChangesTheIncludedOne)
{
    Scene const scene = loadScene(folder.path / "over.json", libraries());
    EXPECT_EQ(scene.film.width, 200);
    EXPECT_EQ(scene.film.height, 50);
    EXPECT_EQ(scene.meshes[1].triangles.size(), 12u);
    EXPECT_EQ(scene.meshes[0].triangles.size(), 1u) << "relative to the file that names it";
    // Another class takes no parameters over; the same one keeps those that are not named.
    EXPECT_EQ(scene.materials[1].className(), "corvid_Mtl_Unlit");
    EXPECT_EQ(value<int>(scene.materials[2], "count"), 3);
    EXPECT_EQ(value<float>(scene.materials[2], "amount"), 6.0f);
    expectNear(numbers(value<Vec2f>(scene.materials[2], "pair")),
               numbers(value<Vec2f>(libraries().create("TinyMaterial"), "pair")));
    ASSERT_EQ(scene.instances.size(), 2u);
    EXPECT_EQ(scene.instances[0].objectToWorld.m[0], 1.0f) << "transforms are replaced whole";
    EXPECT_EQ(scene.instances[0].objectToWorld.m[14], 3.0f);
    EXPECT_TRUE(scene.lights.empty());
}

TEST_F(SceneFile, PartsOfAFileTakeMaterialsByName)
{
    std::string const head = R"({"meshes": {"car": {"file": "parts.gltf", "up": "z"}},
        "materials": {"a": {"class": "corvid_Mtl_Unlit"}, "b": {"class": "corvid_Mtl_Unlit"},
                      "c": {"class": "corvid_Mtl_Unlit"}},
        "instances": {"car": {"mesh": "car", )";
    Scene const scene = load(head + R"("materials": {"Glass": "b", "Left": "c", "*": "a"}}}})");
    struct Part {
        int material;
        Vec3f corner;
    };
    // Body in paint and glass, the wheel twice.
    Part const parts[] = {{0, {0, 0, 0}}, {1, {0, 0, 1}}, {2, {10, 0, 0}}, {0, {20, 0, 0}}};
    ASSERT_EQ(scene.instances.size(), 4u);
    for (std::size_t i = 0; i < 4; ++i) {
        Mesh const& mesh = scene.meshes[static_cast<std::size_t>(scene.instances[i].mesh)];
        EXPECT_EQ(scene.instances[i].material, parts[i].material) << i;
        EXPECT_EQ(mesh.triangles.size(), 1u);
        EXPECT_TRUE(std::count(mesh.positions.begin(), mesh.positions.end(), parts[i].corner)) << i;
        EXPECT_EQ(mesh.normals.size(), 3u);
    }
    EXPECT_TRUE(scene.meshes[0].positions.empty()) << "nothing shows it as a whole";
    Scene const whole = load(head + R"("material": "b"}}})");
    ASSERT_EQ(whole.instances.size(), 1u);
    EXPECT_EQ(whole.meshes[0].triangles.size(), 4u);
    expectContains(errorOf([&] { load(head + R"("materials": {"Glas": "b"}}}})"); }),
                   {"materials.Glas", "Body (Paint), Body (Glass), Left (Rubber), Right (Rubber)"});
    expectContains(errorOf([&] { load(head + R"("materials": {"Body": "b", "Left": "a"}}}})"); }),
                   {"no material for the part Right (Rubber)"});
}

TEST_F(SceneFile, AnEnvironmentCanBeAPicture)
{
    Scene const brief = load(R"({"environment": {"file": "a.png", "rotate": 30,
                                 "intensity": [1, 2, 3], "diffuseBlur": 20}})");
    Scene const full = load(R"({"environment": {"class": "corvid_Env_Default", "parameters": {
        "globalIBLMatrix": {"rotate": [0, 0, 1, 30]}, "backgroundColor": [0, 0, 0],
        "reflectIBLGainMode": 1, "reflectIBLGain": [1, 2, 3],
        "diffuseIBLGainMode": 1, "diffuseIBLGain": [1, 2, 3]}}})");
    expectNear(numbers(value<Mat3f>(*brief.environment, "globalIBLMatrix")),
               numbers(value<Mat3f>(*full.environment, "globalIBLMatrix")));
    for (char const* name : {"reflectIBLGain", "diffuseIBLGain", "backgroundColor"})
        expectNear(numbers(value<Vec3f>(*brief.environment, name)),
                   numbers(value<Vec3f>(*full.environment, name)));
    for (char const* name : {"reflectIBLGainMode", "diffuseIBLGainMode"})
        EXPECT_EQ(value<int>(*brief.environment, name), 1);
    auto const sharp = value<TextureSamplerCube>(*brief.environment, "reflectionCube").texture;
    auto const blurred = value<TextureSamplerCube>(*brief.environment, "diffuseCube").texture;
    EXPECT_TRUE(sharp && blurred && sharp != blurred);
    EXPECT_TRUE(brief.environmentVisible);
    EXPECT_FALSE(full.environmentVisible);
    expectContains(errorOf([&] { load(R"({"environment": {"file": "no.exr"}})"); }),
                   {"environment.file", "no.exr"});
}

TEST_F(SceneFile, SpotsFadeFromTheInnerConeToTheOuter)
{
    Scene const scene = load(R"({"lights": {"l": {
        "kind": "spot", "position": [0, 0, 2], "target": [5, 0, 2], "color": [8, 4, 0],
        "angle": 120, "innerAngle": 60}}})");
    LightSet const lights(scene);
    auto const at = [&](float degrees) {
        float const angle = degrees * 0.0174532925f;
        auto const seen =
            lights.arrival(0, {2 * std::cos(angle), 2 * std::sin(angle), 2}, {-1, 0, 0}, {});
        return seen ? numbers(seen->color) : numbers(Vec3f(0, 0, 0));
    };
    expectNear(at(0), {2, 1, 0});
    expectNear(at(29.9f), {2, 1, 0});
    float const middle = std::acos((std::cos(0.5235988f) + 0.5f) / 2) / 0.0174532925f;
    expectNear(at(middle), {1, 0.5f, 0});
    expectNear(at(-middle), {1, 0.5f, 0});
    expectNear(at(60.1f), {0, 0, 0});
}

TEST_F(SceneFile, AssignmentsStandInThePlaceOfTheFile)
{
    fs::path const file = folder.write("scene.json", R"({
        "camera": {"position": [1, 2, 3]},
        "materials": {"m.1": {"class": "TinyMaterial", "parameters": {"amount": 2, "count": 9}}},
        "lights": {"l": {"class": "voPointLight", "position": [0, 0, 1]}}})");
    auto const with = [&](std::vector<std::string> const& assignments) {
        return loadScene(file, libraries(), {assignments});
    };
    Scene const scene =
        with({"materials.m.1.parameters.amount=6.5", "camera.position[1]=-7",
              "materials.m.1.parameters.pair=[3, 4]", "film={\"width\": 20}",
              "settings.integrator=path", "lights.l=null", "materials.m.1.parameters.count=null"});
    EXPECT_EQ(value<float>(scene.materials[0], "amount"), 6.5f);
    EXPECT_EQ(value<int>(scene.materials[0], "count"), 3) << "its default";
    expectNear(numbers(value<Vec2f>(scene.materials[0], "pair")), {3, 4});
    expectNear(numbers(scene.camera.position), {1, -7, 3});
    EXPECT_EQ(scene.film.width, 20);
    EXPECT_EQ(scene.settings.integrator, "path");
    EXPECT_TRUE(scene.lights.empty());

    struct Bad {
        char const* assignment;
        std::vector<std::string> parts;
    };
    for (Bad const& bad : {Bad{"film.width", {"PATH=VALUE"}},
                           {"film.width=wide", {"film.width: expected", "\"wide\""}},
                           {"film.width=[1", {"film.width: [1: ", "no valid JSON"}},
                           {"flim.width=1", {"flim.width", "did you mean film?"}},
                           {"lights.m.position=[0, 0, 0]", {"lights has no \"m\""}},
                           {"camera.position[3]=1", {"camera.position[3]", "3 elements"}},
                           {"camera.position.x=1", {"camera.position is no object"}},
                           {"lights.k=null", {"nothing here", "did you mean l?"}},
                           {"lights.l.parameters.colour=1", {"did you mean color?"}}})
        expectContains(errorOf([&] { with({bad.assignment}); }),
                       std::vector<std::string>(bad.parts.begin(), bad.parts.end()));
    expectContains(errorOf([&] { with({"film=1"}); }), {"--set: film: expected an object"});
}

/// What a value of a file costs must not grow with the file.
TEST_F(SceneFile, LoadingTimeGrowsWithTheFile)
{
    auto const seconds = [&](int count) {
        std::string meshes, materials, instances, over;
        for (int i = 0; i < count; ++i) {
            char const* const comma = i ? ",\n" : "\n";
            std::string const name = '"' + std::to_string(i) + '"';
            meshes += comma + name + R"(: {"plane": {}})";
            materials += comma + name + R"(: {"class": "TinyLess"})";
            instances += comma + name + R"(: {"mesh": )" + name + R"(, "material": )" + name + "}";
            over += comma + name + R"(: {"transform": {"scale": 2}})";
        }
        StaticShaders const tiny({{"TinyLess", &makeTinyLess}});
        folder.write("many.json",
                     "{\"meshes\": {" + meshes + "}, \"materials\": {" + materials
                         + "}, \"instances\": {" + instances + "}}");
        fs::path const file =
            folder.write("scene.json", R"({"include": "many.json", "instances": {)" + over + "}}");
        std::clock_t const start = std::clock();
        Scene const scene = loadScene(file, tiny);
        double const taken = static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC;
        EXPECT_EQ(scene.instances.size(), static_cast<std::size_t>(count));
        EXPECT_EQ(scene.instances.back().material, count - 1);
        return taken;
    };
    double const few = seconds(1000);
    EXPECT_LT(seconds(8000), 24 * few); // 8 times the work; 64 times where something is searched
}

TEST_F(SceneFile, ValuesReachTheParameters)
{
    Scene const scene = loadScene(folder.path / "values.json", libraries());
    Shader const &a = scene.materials[0], &b = scene.materials[1];
    EXPECT_TRUE(value<bool>(a, "flag"));
    EXPECT_EQ(value<int>(a, "count"), std::numeric_limits<int>::min());
    EXPECT_EQ(value<float>(a, "amount"), 2.0f);
    expectNear(numbers(value<Vec2f>(a, "pair")), {1, -2.5f});
    expectNear(numbers(value<Vec4f>(a, "quad")), {1, 2, 3, 4});
    for (char const* const texture : {"map", "ramp", "cube"})
        EXPECT_NE(value<void const*>(a, texture), nullptr) << texture;
    // (1, 0): scaled to (2, 0), turned to (0, 2), moved.
    Vec2f const uv = transformUv(value<Mat3f>(a, "uvMatrix"), {1, 0});
    expectNear({uv.x, uv.y}, {10, 22});
    // (1, 0, 0): scaled to (2, 0, 0), turned about z to (0, 2, 0), about x to (0, 0, 2), moved.
    expectNear(numbers(transformPoint(value<Mat4f>(a, "matrix"), {1, 0, 0})), {7, 8, 11});
    float const c = std::sqrt(0.75f);
    expectNear(numbers(value<Mat3f>(b, "uvMatrix")), {c, 0.5f, 0, -0.5f, c, 0, 0, 0, 1});
    EXPECT_EQ(value<Mat4f>(b, "matrix").m[12], 13.0f);
    expectNear(numbers(std::get<ShaderLight>(scene.lights[0]).axis), {0, 0, -1});
    EXPECT_EQ(scene.settings.seed, 4294967295u);
    EXPECT_EQ(scene.settings.integrator, "path");
}

TEST_F(SceneFile, TheScenesOfTheProjectLoadWithoutWarnings)
{
    int count = 0;
    for (char const* const directory : {"scenes", "scenes/gallery"})
        for (auto const& entry : fs::directory_iterator(fs::path(ZSI_SOURCE_DIR) / directory)) {
            // The stage is for including: it leaves its subject open.
            if (entry.path().extension() != ".json" || entry.path().filename() == "stage.json")
                continue;
            ++count;
            Scene const scene = loadScene(entry.path(), libraries());
            EXPECT_TRUE(scene.warnings.empty()) << entry.path() << ": " << scene.warnings[0];
            EXPECT_TRUE(!scene.instances.empty() || scene.environment) << entry.path();
        }
    EXPECT_GT(count, 0);
}

/// What every mesh holds to, whatever it was made from.
void expectComplete(Mesh const& mesh)
{
    std::size_t const n = mesh.positions.size();
    ASSERT_TRUE(mesh.normals.size() == n && mesh.uv.size() == n && mesh.tangents.size() == n
                && mesh.bitangents.size() == n);
    for (std::size_t i = 0; i < n; ++i) {
        Vec3f const N = mesh.normals[i], T = mesh.tangents[i], B = mesh.bitangents[i];
        EXPECT_NEAR(length(N), 1.0f, 1e-5f);
        EXPECT_NEAR(length(T), 1.0f, 1e-5f);
        EXPECT_NEAR(dot(N, T), 0.0f, 1e-5f);
        EXPECT_NEAR(std::fabs(dot(B, cross(N, T))), 1.0f, 1e-5f);
    }
    for (auto const& t : mesh.triangles)
        for (std::uint32_t const corner : t)
            ASSERT_LT(corner, n);
}

Vec3f faceNormal(Mesh const& mesh, std::array<std::uint32_t, 3> const& t)
{
    return normalize(cross(mesh.positions[t[1]] - mesh.positions[t[0]],
                           mesh.positions[t[2]] - mesh.positions[t[0]]));
}

TEST(Mesh, ShapesAreClosedFaceOutwardsAndRunWithUv)
{
    constexpr double kPi = 3.14159265358979;
    struct Shape {
        Mesh mesh;
        double volume; ///< within one part in a hundred
    };
    Shape shapes[] = {{sphereMesh(2, 96), 4.0 / 3 * kPi * 8},
                      {boxMesh({1, 2, 3}), 6.0},
                      {planeMesh({2, 3}), 0.0},
                      // Wall, arc and its centre at (2, 1) seen from the origin.
                      {sweepMesh({4, 6, 3}, 1), -4.0 / 3 * (3 * 2 + (2 - 1) + kPi / 2)}};
    for (Shape const& shape : shapes) {
        expectComplete(shape.mesh);
        double volume = 0; // by the divergence theorem
        for (auto const& t : shape.mesh.triangles) {
            Vec3f const* const p = shape.mesh.positions.data();
            volume += static_cast<double>(dot(p[t[0]], cross(p[t[1]], p[t[2]]))) / 6;
            EXPECT_GT(dot(faceNormal(shape.mesh, t), shape.mesh.normals[t[0]]), 0.9f);
        }
        EXPECT_NEAR(volume, shape.volume, 0.01 * std::fabs(shape.volume) + 1e-6);
        // Tangents made anew from uv must be those of the shape, poles included.
        Mesh again = shape.mesh;
        again.tangents.clear();
        std::vector<std::string> warnings;
        completeMesh(again, NormalSource::File, warnings);
        EXPECT_TRUE(warnings.empty());
        for (auto const& t : again.triangles)
            for (std::uint32_t const i : t) {
                EXPECT_GT(dot(again.tangents[i], shape.mesh.tangents[i]), 0.99f);
                EXPECT_GT(dot(again.bitangents[i], shape.mesh.bitangents[i]), 0.99f);
            }
    }
}

/// Positions and triangles of a ball alone, with the seam's corners apart.
Mesh bareSphere()
{
    Mesh const whole = sphereMesh(1, 48);
    Mesh mesh;
    mesh.positions = whole.positions;
    mesh.triangles = whole.triangles;
    return mesh;
}

TEST(Mesh, MissingNormalsAndUvAreMade)
{
    std::vector<std::string> warnings;
    Mesh smooth = bareSphere();
    completeMesh(smooth, NormalSource::File, warnings);
    expectComplete(smooth);
    EXPECT_TRUE(warnings.empty());
    for (std::size_t i = 0; i < smooth.positions.size(); ++i)
        EXPECT_GT(dot(smooth.normals[i], normalize(smooth.positions[i])), 0.999f);
    // Box projection: inside a triangle, distances along the side that it faces are kept.
    for (auto const& t : smooth.triangles) {
        Vec3f const n = faceNormal(smooth, t);
        Vec2f const a = smooth.uv[t[1]] - smooth.uv[t[0]], b = smooth.uv[t[2]] - smooth.uv[t[0]];
        Vec3f const c = cross(smooth.positions[t[1]] - smooth.positions[t[0]],
                              smooth.positions[t[2]] - smooth.positions[t[0]]);
        float const largest = maxOf(std::fabs(n.x), maxOf(std::fabs(n.y), std::fabs(n.z)));
        EXPECT_NEAR(a.x * b.y - a.y * b.x, largest * length(c), 1e-4f); // and not mirrored
    }
    Mesh flat = bareSphere();
    completeMesh(flat, NormalSource::Flat, warnings);
    expectComplete(flat);
    for (auto const& t : flat.triangles)
        for (std::uint32_t const corner : t)
            EXPECT_NEAR(dot(flat.normals[corner], faceNormal(flat, t)), 1.0f, 1e-5f);
}

TEST(Mesh, BrokenPartsGoAndAreTold)
{
    float const nan = std::numeric_limits<float>::quiet_NaN();
    Mesh mesh = bareSphere();
    std::size_t const good = mesh.triangles.size();
    auto const n = static_cast<std::uint32_t>(mesh.positions.size());
    mesh.normals.assign(n, Vec3f(0, 0, 2));
    mesh.normals[5] = {0, 0, 0};
    mesh.normals[6] = {nan, 0, 0};
    mesh.uv.assign(n, Vec2f(0.5f, 0.5f)); // no direction in it
    mesh.uv[7] = {nan, 0};
    mesh.positions.push_back({nan, 0, 0});
    mesh.positions.push_back({1e30f, 1e30f, 0});
    mesh.normals.resize(n + 2, Vec3f(0, 0, 1));
    mesh.uv.resize(n + 2, Vec2f(0, 0));
    mesh.triangles.push_back({0, 60, n});
    mesh.triangles.push_back({0, n + 1, 60});
    mesh.triangles.push_back({60, 60, 70});
    mesh.triangles.push_back({60, 61, n + 2});
    std::vector<std::string> warnings;
    completeMesh(mesh, NormalSource::File, warnings);
    expectComplete(mesh);
    EXPECT_EQ(mesh.triangles.size(), good);
    for (Vec3f const& p : mesh.positions)
        EXPECT_NEAR(length(p), 1.0f, 1e-5f) << "vertices of dropped triangles must go too";
    expectContains(std::accumulate(warnings.begin(), warnings.end(), std::string()),
                   {"1 triangle with corners that do not exist left out",
                    "2 triangles with coordinates that are not finite or too large left out",
                    "1 triangle without area left out", "1 texture coordinate"});
}

TEST(Mesh, FilesOfEveryKindGiveTheSameTriangle)
{
    // x, y and z of the corners are told apart; as glTF, placed and mirrored by its nodes.
    for (char const* const name : {"a.obj", "a.ply", "a.stl", "a.GLTF"}) {
        fs::path const file = kData / "triangle" / name;
        SCOPED_TRACE(file);
        Mesh mesh = readMeshFile(file);
        if (isYUp(file))
            turnYUp(mesh);
        std::vector<std::string> warnings;
        completeMesh(mesh, NormalSource::File, warnings);
        expectComplete(mesh);
        ASSERT_EQ(mesh.triangles.size(), 1u);
        for (Vec3f const corner : {Vec3f(0, 0, 0), Vec3f(2, 0, 0), Vec3f(2, 3, 0)})
            EXPECT_EQ(std::count_if(mesh.positions.begin(), mesh.positions.end(),
                                    [&](Vec3f p) { return length(p - corner) < 1e-4f; }),
                      1);
        EXPECT_NEAR(mesh.normals[0].z, 1.0f, 1e-5f) << "mirroring keeps the outside";
    }
}

// Flakes: 0.01 for an object of 5, else as much larger or smaller; of several the median.
TEST_F(SceneFile, LengthsThatAreNotWrittenSuitTheObject)
{
    auto const flakes = [&](std::string const& parameters, std::string const& instances) {
        Scene const scene = load(
            R"({"meshes": {"m": {"box": {"size": [1, 0.1, 2]}}}, "materials": {"other": {"class":
            "corvid_Mtl_Metal"}, "p": {"class": "corvid_Mtl_MetallicPaint", "parameters": {)"
            + parameters + R"(}}}, "instances": {)" + instances + "}}");
        return *static_cast<float const*>(scene.materials[1].find("u_flakeSize")->field);
    };
    auto const instance = [](int i, std::string const& transform, char const* material = "p") {
        return (i ? ", \"" : "\"") + std::to_string(i) + R"(": {"mesh": "m", "material": ")"
            + material + R"(", "transform": {)" + transform + "}}";
    };
    std::string const turned = instance(0, R"("scale": [10, 10, 5], "rotate": [1, 1, 0, 45])");
    EXPECT_FLOAT_EQ(flakes("", turned), 0.02f);
    EXPECT_FLOAT_EQ(flakes(R"("u_flakeSize": 0.03)", turned), 0.03f);
    EXPECT_FLOAT_EQ(flakes("", instance(0, R"("scale": 5)", "other")), 0.01f) << "not in use";
    EXPECT_FLOAT_EQ(flakes("",
                           instance(0, R"("scale": 125)") + instance(1, R"("scale": 0.5)")
                               + instance(2, R"("scale": 5)") + instance(3, R"("scale": 500)")
                               + instance(4, R"("scale": 9)", "other")),
                    0.02f);
}

// The importer leaves out what it does not find.
TEST(Mesh, TextFilesThatAreNotWholeAreRefused)
{
    test::TemporaryFolder const folder;
    auto const read = [&](fs::path const& file, std::string const& text) {
        std::ofstream(folder.path / file, std::ios::binary) << text;
        return readMeshFile(folder.path / file).triangles.size();
    };
    std::string const ply = "ply\nformat ascii 1.0\nelement vertex 4\nproperty float x\n"
                            "property float y\nproperty float z\nelement face 2\n"
                            "property list uchar int vertex_indices\nend_header\n"
                            "0 0 0\n1 0 0\n1 1e-60 0\n+0 1 0\n3 0 1 2\n3 0 2 3\n";
    std::string const facet = "facet normal 0 0 1\nouter loop\nvertex 0 0 0\nvertex 1 0 0\n"
                              "vertex 0 1 0\nendloop\nendfacet\n";
    std::string const stl =
        "solid a b\n" + facet + "ENDSOLID a b\n\nsolid\n" + facet + "endsolid\n";
    std::string const obj = "# x\nv 0 0 0 1\nv 1 0 0\nv 1 1 0\nv 0 1 0\nvt 0 0\n"
                            "f 1 2 -2\nf 1 3 4\n";
    EXPECT_EQ(read("a.ply", ply), 2u);
    EXPECT_EQ(read("a.stl", stl), 2u);
    EXPECT_EQ(read("a.obj", obj), 2u);
    struct Case {
        char const* file;
        std::string text, want;
    };
    auto const with = [](std::string text, std::string const& from, std::string const& to) {
        return text.replace(text.find(from), from.size(), to);
    };
    for (Case const& c :
         {Case{"a.ply", ply.substr(0, ply.rfind("3 0")), "a.ply: ends early"},
          Case{"a.ply", with(ply, "3 0 2 3", "3 0 2 \x01"), "a.ply:15: expected a number"},
          Case{"a.stl", stl.substr(0, stl.rfind("vertex")), "a.stl: ends early"},
          Case{"a.stl", stl.substr(0, stl.rfind("endsolid")), "a.stl: ends early"},
          Case{"a.stl", with(stl, "facet", "fxcet"), "a.stl:2: expected facet or endsolid"},
          Case{"a.obj", with(obj, "1 1 0", "1 1 o"), "a.obj:4: expected a number, found \"o\""},
          Case{"a.obj", with(obj, "1 2 ", "1 2; "), "a.obj:7: expected a corner"},
          Case{"a.obj", obj.substr(0, obj.find(" -2")), "a.obj:7: expected three corners"}})
        expectContains(errorOf([&] { read(c.file, c.text); }), {c.want});
}

} // namespace
} // namespace zsi::host
