#include "scene/loadScene.h"
#include "scene/meshCompletion.h"
#include "scene/meshFile.h"
#include "scene/meshShapes.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"

#include <cmath>
#include <cstring>
#include <gtest/gtest.h>
#include <limits>
#include <random>
#include <set>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;
using test::errorOf;
using test::expectContains;

ShaderLibraries const& libraries()
{
    static ShaderLibraries const loaded = [] {
        ShaderLibraries l;
        l.load(ZSI_SHADER_LIBRARY);
        l.load(fs::path(ZSI_FIXTURE_DIR) / "tinyShaders" / "tinyShaders.so");
        return l;
    }();
    return loaded;
}

class SceneFile : public testing::Test {
protected:
    Scene load(std::string const& text) const
    {
        return loadScene(folder.write("scene.json", text), libraries());
    }
    std::string error(std::string const& text) const
    {
        return errorOf([&] { load(text); });
    }

    test::TemporaryFolder folder;
};

template <class Value>
Value value(Shader const& shader, char const* name)
{
    return *static_cast<Value const*>(shader.find(name)->field);
}

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

TEST_F(SceneFile, BadScenesSayWhereAndWhatWasExpected)
{
    folder.write("loop.json", R"({"include": "scene.json"})");
    folder.write("base.json",
                 R"({"lights": {"spot": {"class": "voSpotLight", "position": [0, 0, 1]}}})");
    folder.write("broken.obj", "v 0 0 0\nv 1 0 0\nf 1 2 9\n");
    folder.write("points.ply",
                 "ply\nformat ascii 1.0\nelement vertex 1\nproperty float x\nproperty float y\n"
                 "property float z\nend_header\n0 0 0\n");
    folder.write("flat.obj", "v 0 0 0\nv 1 0 0\nv 2 0 0\nf 1 2 3\n");
    folder.write("text.png", "no picture");
    std::string const ball = R"("meshes": {"ball": {"sphere": {}}}, )";
    std::string const mirror = R"("materials": {"mirror": {"class": "corvid_Mtl_Mirror"}}, )";
    auto const material = [](std::string const& parameters) {
        return R"({"materials": {"m": {"class": "TinyMaterial", "parameters": {)" + parameters
            + "}}}}";
    };
    auto const transform = [&](std::string const& t) {
        return "{" + ball + mirror
            + R"("instances": {"i": {"mesh": "ball", "material": "mirror", "transform": )" + t
            + "}}}";
    };
    struct Bad {
        std::string text;
        std::vector<std::string> parts; ///< of the message
    };
    std::vector<Bad> const kBad{
        // what is no scene at all
        {"", {"scene.json:1:1: no valid JSON"}},
        {"[1]", {"scene.json:1", "expected an object, got an array of 1"}},
        {"{\n  \"film\": {\"width\": 5,}\n}", {"scene.json:2:23: no valid JSON"}},
        {"{} {}", {"no valid JSON"}},
        {"{\"film\": {\"width\": \"\xff\"}}", {"no valid JSON"}},
        {R"({"film": {"exposure": 1e999}})", {"scene.json:1", "number overflow"}},
        {R"({"film": {}, "film": {}})", {"scene.json:1:19", "\"film\" stands twice"}},
        {std::string(100, '['), {"nested deeper than"}},
        // includes
        {R"({"include": "none.json"})", {"include: ", "none.json: no such file"}},
        {R"({"include": "loop.json"})", {"loop.json:1: include: ", "includes itself"}},
        {R"({"include": 5})", {"include: expected a string, got 5"}},
        {R"({"include": "base.json", "lights": {"spott": null}})",
         {"scene.json:1: lights.spott", "did you mean spot?"}},
        {R"({"camera": null})", {"camera", "nothing to take out"}},
        // keys and types
        {"{\n\n\"cemera\": {}}", {"scene.json:3: cemera: unknown key; did you mean camera?"}},
        {R"({"settings": {"sample": 4}})", {"settings.sample: unknown key; did you mean samples"}},
        {R"({"settings": {"samples": 0}})",
         {"settings.samples: expected an integer from 1", "got 0"}},
        {R"({"settings": {"samples": 2.5}})", {"settings.samples: expected an integer", "got 2.5"}},
        {R"({"settings": {"seed": -1}})",
         {"settings.seed: expected an integer from 0 to 4294967295"}},
        {R"({"settings": {"integrator": "pth"}})", {"expected \"shade\" or \"path\", got \"pth\""}},
        {R"({"film": {"width": 0}})", {"film.width: expected an integer from 1"}},
        {R"({"film": {"exposure": NaN}})", {"no valid JSON"}},
        {R"({"film": {"exposure": "1"}})", {"film.exposure: expected a number", "got \"1\""}},
        {R"({"film": {"width": 10, "height": 10, "crop": [2, 2, 11, 5]}})",
         {"film.crop[2]: expected an integer from 3 to 10, got 11"}},
        {R"({"camera": {"fov": 180}})", {"camera.fov: expected degrees below 180, got 180"}},
        {R"({"camera": {"position": [1, 2, 1e39]}})", {"camera.position[2]: ", "32-bit float"}},
        {R"({"camera": {"position": [1, 2]}})",
         {"expected an array of 3 numbers, got an array of 2"}},
        {R"({"camera": {"position": [0, 0, 5], "up": [0, 0, 1]}})",
         {"camera: up must point across"}},
        {R"({"camera": {"position": [0, 0, 0]}})", {"camera: the target has no direction"}},
        // meshes
        {R"({"meshes": {"a": {}}})", {"meshes.a: expected the key \"file\", \"sphere\""}},
        {R"({"meshes": {"a": {"box": {}, "plane": {}}}})", {"meshes.a", "only one of"}},
        {R"({"meshes": {"a": {"sphere": {"radius": -1}}}})",
         {"meshes.a.sphere.radius: expected a number above 0, got -1"}},
        {R"({"meshes": {"a": {"file": "none.obj"}}})",
         {"meshes.a.file: ", "none.obj: no such file"}},
        {R"({"meshes": {"a": {"file": "scene.json"}}})",
         {"meshes.a.file", "expected a mesh file (.obj"}},
        {R"({"meshes": {"a": {"file": "broken.obj"}}})", {"meshes.a.file: ", "broken.obj: "}},
        {R"({"meshes": {"a": {"file": "points.ply"}}})", {"points.ply: "}},
        {R"({"meshes": {"a": {"file": "flat.obj"}}})", {"flat.obj: has no triangles"}},
        // shaders and their parameters
        {R"({"materials": {"m": {}}})", {"materials.m: the key \"class\" is missing"}},
        {R"({"materials": {"m": {"class": "corvid_Mtl_Miror"}}})",
         {"materials.m.class", "did you mean corvid_Mtl_Mirror"}},
        {R"({"materials": {"m": {"class": "voSpotLight"}}})",
         {"materials.m.class: voSpotLight is a light, expected a material"}},
        {R"({"environment": {"class": "corvid_Env_Default", "parameters": {"reflectoinCube": 1}}})",
         {"environment.parameters.reflectoinCube: unknown parameter of corvid_Env_Default; did you "
          "mean reflectionCube?"}},
        {material(R"("flag": 1)"), {"materials.m.parameters.flag: expected true or false, got 1"}},
        {material(R"("count": 1.5)"), {"count: expected an integer of 32 bits, got 1.5"}},
        {material(R"("count": 3000000000)"), {"count: expected an integer of 32 bits"}},
        {material(R"("amount": "a")"), {"amount: expected a number, got \"a\""}},
        {material(R"("tint": [1, 1])"), {"tint: expected an array of 3 numbers"}},
        {material(R"("tint": [1, true, 1])"), {"tint[1]: expected a number, got true"}},
        {material(R"("map": "a.png")"), {"map: expected {\"texture\": file"}},
        {material(R"("map": {"texture": "none.png"})"),
         {"map.texture: ", "none.png: no such file"}},
        {material(R"("map": {"texture": "text.png"})"), {"text.png: cannot be read as a picture"}},
        {material(R"("map": {"texture": "a.png", "colorSpace": "rgb"})"),
         {"map.colorSpace: expected \"auto\", \"linear\" or \"srgb\""}},
        {material(R"("cube": {"cube": "a.exr", "blur": 5, "irradiance": true})"), {"cube.blur"}},
        {material(R"("cube": {"texture": "a.exr"})"), {"cube.texture: unknown key"}},
        {material(R"("matrix": [1, 2])"), {"matrix: expected 16 numbers, 4 rows of 4, or"}},
        {material(R"("uvMatrix": {"rotate": [0, 0, 0, 5]})"), {"uvMatrix.rotate", "axis"}},
        {material(R"("uvMatrix": {"rotate": [0, 0, 1, 5], "translate": [1, 1]})"),
         {"uvMatrix.translate", "directions"}},
        // what stands where
        {"{" + ball + R"("instances": {"i": {"mesh": "bal", "material": "m"}}})",
         {"instances.i.mesh: unknown mesh \"bal\"; did you mean ball?"}},
        {"{" + ball + mirror + R"("instances": {"i": {"mesh": "ball", "material": "miror"}}})",
         {"instances.i.material: unknown material \"miror\"; did you mean mirror?"}},
        {transform(R"({"scale": [1, 0, 1]})"), {"instances.i.transform: flattens"}},
        {transform(R"({"rotate": [[0, 0, 1]]})"), {"transform.rotate[0]: expected an array of 4"}},
        {transform("[1,0,0,1, 0,1,0,0, 0,0,1,0, 0,0,0,1]"), {"transform: the last column"}},
        {R"({"lights": {"l": {"class": "voPointLight"}}})", {"lights.l: the key \"position\""}},
        {R"({"lights": {"l": {"class": "voPointLight", "position": [0, 0, 1], "target": [0, 0, 1]}}})",
         {"lights.l.target: the light stands on its target"}},
        {R"({"lights": {"l": {"class": "voPointLight", "position": [0, 0, 1], "radius": -1}}})",
         {"lights.l.radius: expected a number of 0 or more, got -1"}},
    };
    for (Bad const& bad : kBad) {
        SCOPED_TRACE(bad.text);
        expectContains(error(bad.text), bad.parts);
    }
    EXPECT_NE(
        errorOf([&] { loadScene(folder.path / "no.json", libraries()); }).find("no such file"),
        std::string::npos);
}

TEST_F(SceneFile, AnIncludingSceneChangesTheIncludedOne)
{
    fs::create_directory(folder.path / "sub");
    folder.write("sub/floor.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\nf 1 2 3\n");
    folder.write("sub/base.json", R"({
        "film": {"width": 100, "height": 50}, // kept but for the width
        "meshes": {"floor": {"file": "floor.obj"}, "ball": {"sphere": {"radius": 2}}},
        "materials": {
            "a": {"class": "voidless"},
            "b": {"class": "corvid_Mtl_Solid", "parameters": {"patchState": 2}},
            "c": {"class": "TinyMaterial", "parameters": {"count": 3, "amount": 5, "pair": [1, 2]}}},
        "instances": {"x": {"mesh": "ball", "material": "b", "transform": {"scale": 3}},
                      "y": {"mesh": "floor", "material": "c"}},
        "lights": {"l": {"class": "voPointLight", "position": [0, 0, 1]}}})");
    Scene const scene = load(R"({
        "include": "sub/base.json",
        "film": {"width": 200},
        "meshes": {"ball": {"box": {}}},
        "materials": {
            "a": {"class": "corvid_Mtl_Mirror"},
            "b": {"class": "corvid_Mtl_Unlit", "parameters": {"diffuseColor": [1, 2, 3]}},
            "c": {"parameters": {"amount": 6, "pair": null}}},
        "instances": {"x": {"transform": {"translate": [1, 2, 3]}}},
        "lights": {"l": null}})");
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

TEST_F(SceneFile, ValuesReachTheParameters)
{
    fs::copy_file(fs::path(ZSI_SOURCE_DIR) / "assets/textures/checker.png", folder.path / "a.png");
    Scene const scene = load(R"({
        "camera": {"fov": 30, "lensRadius": 0.5},
        "settings": {"seed": 4294967295, "ambient": [1, 2, 3], "integrator": "path"},
        "materials": {
            "a": {"class": "TinyMaterial", "parameters": {
                "flag": true, "count": -2147483648, "amount": 2, "pair": [1, -2.5], "tint": [1, 2, 3],
                "quad": [1, 2, 3, 4], "map": {"texture": "a.png", "colorSpace": "srgb"},
                "ramp": {"texture": "a.png"}, "cube": {"cube": "a.png", "blur": 20},
                "uvMatrix": {"scale": [2, 3], "rotate": 90, "translate": [10, 20]},
                "matrix": {"scale": [2, 3, 4], "rotate": [[0, 0, 2, 90], [1, 0, 0, 90]],
                           "translate": [7, 8, 9]}}},
            "b": {"class": "TinyMaterial", "parameters": {
                "tint": [0, 0, 0], "uvMatrix": {"rotate": [0, 0, 1, 30]},
                "matrix": [[1, 2, 3, 4], [5, 6, 7, 8], [9, 10, 11, 12], [13, 14, 15, 16]]}}},
        "lights": {"l": {"class": "voSpotLight", "position": [1, 0, 5], "target": [1, 0, 2]}}})");
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
    expectNear(numbers(scene.lights[0].axis), {0, 0, -1});
    EXPECT_EQ(scene.settings.seed, 4294967295u);
    EXPECT_EQ(scene.settings.integrator, "path");
}

TEST_F(SceneFile, WarnsOfUnwrittenParametersThatWillBeRead)
{
    fs::copy_file(fs::path(ZSI_SOURCE_DIR) / "assets/textures/checker.png", folder.path / "a.png");
    struct Case {
        char const* section;
        char const* className;
        char const* parameters;
        std::string names; ///< that the warning lists; empty: no warning
    };
    std::string const black = R"("u_additionalColor": [0, 0, 0])";
    Case const kCases[] = {
        {"materials", "corvid_Mtl_Mirror", "", ""},
        {"materials", "corvid_Mtl_Ward", "", "u_additionalColor"},
        {"materials", "corvid_Mtl_Ward",
         R"("u_additionalColor": [0, 0, 0], "u_diffuseMapEnable": true)", ""},
        {"materials", "corvid_Mtl_Ward",
         R"("u_additionalColor": [0, 0, 0], "u_diffuseMap": {"texture": "a.png"})", ""},
        {"materials", "corvid_Mtl_Ward",
         R"("u_additionalColor": [0, 0, 0], "u_diffuseMapEnable": true,
            "u_diffuseMap": {"texture": "a.png"})",
         "u_diffuseTransform"},
        {"materials", "corvid_Mtl_Ward",
         R"("u_additionalColor": [0, 0, 0], "maskingMode": 1, "maskingTexture": {"texture": "a.png"})",
         "maskingUVMatrix"},
        {"materials", "corvid_Mtl_Mirror",
         R"("maskingMode": 3, "maskingTexture": {"texture": "a.png"})", "maskingTextureMatrix"},
        {"materials", "BackgroundGeometry", "", "specularColor"},
        {"materials", "BackgroundGeometry",
         R"("specularMode": -1, "bumpMode": 4, "bumpTexture": {"texture": "a.png"})",
         "bumpTextureMatrix, bumpTextureMatrixInverse"},
        {"environment", "corvid_Env_Default", "", ""},
        {"environment", "corvid_Env_Default", R"("diffuseCube": {"cube": "a.png"})",
         "globalIBLMatrix"},
        {"environment", "corvid_Env_Backplate",
         R"("backplateCube": {"cube": "a.png"}, "globalIBLMatrix": {})",
         "backplatetransform, backplateCubeRotation"},
    };
    for (Case const& c : kCases) {
        std::string const shader = std::string(R"({"class": ")") + c.className
            + R"(", "parameters": {)" + c.parameters + "}}";
        bool const environment = std::string(c.section) == "environment";
        Scene const scene = load(std::string("{\"") + c.section + "\": "
                                 + (environment ? shader : "{\"m\": " + shader + "}") + "}");
        SCOPED_TRACE(shader);
        ASSERT_EQ(scene.warnings.size(), c.names.empty() ? 0u : 1u)
            << (scene.warnings.empty() ? "" : scene.warnings[0]);
        if (!c.names.empty())
            expectContains(scene.warnings[0],
                           {"scene.json:1: ", std::string(" reads ") + c.names + ", which"});
    }
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
                      {planeMesh({2, 3}), 0.0}};
    for (Shape const& shape : shapes) {
        expectComplete(shape.mesh);
        double volume = 0; // by the divergence theorem
        for (auto const& t : shape.mesh.triangles) {
            Vec3f const* const p = shape.mesh.positions.data();
            volume += static_cast<double>(dot(p[t[0]], cross(p[t[1]], p[t[2]]))) / 6;
            EXPECT_GT(dot(faceNormal(shape.mesh, t), shape.mesh.normals[t[0]]), 0.9f);
        }
        EXPECT_NEAR(volume, shape.volume, 0.01 * shape.volume + 1e-6);
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
    std::string all;
    for (std::string const& warning : warnings)
        all += warning + '\n';
    expectContains(all,
                   {"1 triangle with corners that do not exist left out",
                    "2 triangles with coordinates that are not finite or too large left out",
                    "1 triangle without area left out", "1 texture coordinate"});
}

TEST(Mesh, FilesOfEveryKindGiveTheSameTriangle)
{
    test::TemporaryFolder const folder;
    // x, y and z of the corners are told apart; as glTF, placed and mirrored by its nodes.
    fs::path const files[] = {
        folder.write("a.obj",
                     "o one\nv 0 0 0\nv 2 0 0\nv 2 3 0\nvt 0 0\nvt 1 0\nvt 0 1\n"
                     "f 1/1 2/2 3/3\nl 1 2\n"),
        folder.write("a.ply",
                     "ply\nformat ascii 1.0\nelement vertex 3\nproperty float x\n"
                     "property float y\nproperty float z\nelement face 1\n"
                     "property list uchar int vertex_indices\nend_header\n"
                     "0 0 0\n2 0 0\n2 3 0\n3 0 1 2\n"),
        folder.write("a.stl",
                     "solid a\nfacet normal 0 0 1\nouter loop\nvertex 0 0 0\n"
                     "vertex 2 0 0\nvertex 2 3 0\nendloop\nendfacet\nendsolid a\n"),
        folder.write("a.GLTF", R"({"asset": {"version": "2.0"}, "scene": 0,
            "scenes": [{"nodes": [0]}],
            "nodes": [{"scale": [2, 1, 1], "children": [1]},
                      {"rotation": [-0.70710678, 0, 0, 0.70710678], "scale": [-1, 3, 1],
                       "translation": [1, 0, 0], "mesh": 0}],
            "meshes": [{"primitives": [{"attributes": {"POSITION": 0}, "indices": 1}]}],
            "buffers": [{"byteLength": 42, "uri": "data:application/octet-stream;base64,AAAAAAAAAAAAAAAAAACAPwAAAAAAAAAAAAAAAAAAgD8AAAAAAAABAAIA"}],
            "bufferViews": [{"buffer": 0, "byteLength": 36},
                            {"buffer": 0, "byteOffset": 36, "byteLength": 6}],
            "accessors": [{"bufferView": 0, "componentType": 5126, "count": 3, "type": "VEC3",
                           "min": [0, 0, 0], "max": [1, 1, 0]},
                          {"bufferView": 1, "componentType": 5123, "count": 3, "type": "SCALAR"}]})"),
    };
    for (fs::path const& file : files) {
        SCOPED_TRACE(file);
        Mesh mesh = readMeshFile(file);
        if (isYUp(file))
            turnYUp(mesh);
        std::vector<std::string> warnings;
        completeMesh(mesh, NormalSource::File, warnings);
        expectComplete(mesh);
        ASSERT_EQ(mesh.triangles.size(), 1u);
        std::set<std::array<float, 3>> corners;
        for (Vec3f const& p : mesh.positions)
            corners.insert({std::round(p.x * 1e4f) / 1e4f + 0.0f,
                            std::round(p.y * 1e4f) / 1e4f + 0.0f,
                            std::round(p.z * 1e4f) / 1e4f + 0.0f});
        EXPECT_EQ(corners, (std::set<std::array<float, 3>>{{0, 0, 0}, {2, 0, 0}, {2, 3, 0}}));
        EXPECT_NEAR(mesh.normals[0].z, 1.0f, 1e-5f) << "mirroring keeps the outside";
    }
}

} // namespace
} // namespace zsi::host
