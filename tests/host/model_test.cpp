// SPDX-License-Identifier: Apache-2.0
// Models in the place of scenes. Numbers are worked out by hand.
#include "load/loadScene.h"
#include "load/sceneFile.h"
#include "mesh/meshFile.h"
#include "support/hostLibraries.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"
#include "texture/heightsOfNormals.h"
#include "json/jsonReader.h"
#include "json/jsonText.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <gtest/gtest.h>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;
using test::errorOf;
using test::expectContains;
using test::libraries;

template <class T>
std::string bytesOf(std::vector<T> const& values)
{
    return {reinterpret_cast<char const*>(values.data()), values.size() * sizeof(T)};
}

/// A binary glTF file.
std::string glb(std::string json, std::string data)
{
    json.resize((json.size() + 3) / 4 * 4, ' ');
    data.resize((data.size() + 3) / 4 * 4, '\0');
    auto const size = [](std::string const& s) { return static_cast<std::uint32_t>(s.size()); };
    return "glTF"
        + bytesOf<std::uint32_t>({2, 28 + size(json) + size(data), size(json), 0x4E4F534A}) + json
        + bytesOf<std::uint32_t>({size(data), 0x004E4942}) + data;
}

/// (0,0,0), (1,0,0), (0,1,0), at their places as uv; then three indices, of 2 bytes.
std::string const kData = bytesOf<float>({0, 0, 0, 1, 0, 0, 0, 1, 0})
    + bytesOf<float>({0, 0, 1, 0, 0, 1}) + bytesOf<std::uint16_t>({0, 1, 2, 0});

std::string const kBuffers = R"(
  "buffers": [{"byteLength": 68}],
  "bufferViews": [{"buffer": 0, "byteLength": 36}, {"buffer": 0, "byteOffset": 36, "byteLength": 24},
                  {"buffer": 0, "byteOffset": 60, "byteLength": 8}],
  "accessors": [{"bufferView": 0, "componentType": 5126, "count": 3, "type": "VEC3"},
                {"bufferView": 1, "componentType": 5126, "count": 3, "type": "VEC2"},
                {"bufferView": 2, "componentType": 5123, "count": 3, "type": "SCALAR"}])";

std::string const kMesh =
    R"("meshes": [{"primitives": [{"attributes": {"POSITION": 0, "TEXCOORD_0": 1}, "indices": 2}]}])";

std::string const kNodes = R"("scenes": [{"nodes": [0]}], "nodes": [{"mesh": 0}])";

std::string model(std::string const& sections)
{
    return R"({"asset": {"version": "2.0"}, )" + sections + "}";
}

class Model : public testing::Test {
protected:
    fs::path write(std::string const& sections) const
    {
        return folder.write("m.glb", glb(model(sections), kData));
    }
    Scene load(std::string const& sections) const
    {
        return loadScene(write(sections), libraries());
    }
    /// As one line of JSON, without the stage's things.
    static std::string told(JsonValue const* value)
    {
        std::string text = value ? jsonText(*value) : "nothing";
        std::erase(text, '\n');
        return text;
    }

    test::TemporaryFolder folder;
};

Vec3f placed(Scene const& scene, std::size_t instance, std::size_t corner)
{
    Instance const& i = scene.instances[instance];
    return transformPoint(i.objectToWorld,
                          scene.meshes[static_cast<std::size_t>(i.mesh)].positions[corner]);
}

void expectNear(Vec3f got, Vec3f want)
{
    EXPECT_LT(length(got - want), 1e-5f) << got.x << ' ' << got.y << ' ' << got.z;
}

TEST_F(Model, NodesStandWhereTheyAreAndShareTheirMeshes)
{
    // A quarter turn around the file's y, (0, sin 45, 0, cos 45), takes x to -z; upright, -z is +y.
    Scene const scene = load(kBuffers + "," + kMesh + R"(,
      "scenes": [{"nodes": [0]}],
      "nodes": [{"translation": [0, 10, 0], "scale": [2, 2, 2], "children": [1, 2]},
                {"mesh": 0, "name": "turned", "rotation": [0, 0.70710678, 0, 0.70710678]},
                {"mesh": 0, "matrix": [-1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 3, 0, 0, 1]}])");
    EXPECT_EQ(scene.instanceNames[0], "turned");
    EXPECT_EQ(scene.instances[0].mesh, scene.instances[1].mesh);
    expectNear(placed(scene, 0, 0), {0, 0, 10});
    expectNear(placed(scene, 0, 1), {0, 2, 10});
    expectNear(placed(scene, 0, 2), {0, 0, 12});
    expectNear(placed(scene, 1, 1), {4, 0, 10});
    Mesh const& mesh = scene.meshes[static_cast<std::size_t>(scene.instances[0].mesh)];
    EXPECT_EQ(mesh.uv[2].y, 0.0f) << "v of the file runs downwards";
}

TEST_F(Model, AccessorsGiveWhatTheyEncode)
{
    // Positions in signed shorts, normalised, 8 bytes apart; the last one replaced from a list; as
    // a strip of two triangles of which the second is wound the other way.
    std::string const data =
        bytesOf<std::int16_t>({0, 0, 0, 7, 32767, 0, 0, 7, 0, 32767, 0, 7, 0, 0, 0, 7})
        + bytesOf<std::uint8_t>({3, 0, 0, 0}) + bytesOf<std::int16_t>({32767, 32767, -32767, 0});
    fs::path const file = folder.write("m.glb",
                                       glb(model(R"(
      "buffers": [{"byteLength": 44}],
      "bufferViews": [{"buffer": 0, "byteLength": 32, "byteStride": 8},
                      {"buffer": 0, "byteOffset": 32, "byteLength": 1},
                      {"buffer": 0, "byteOffset": 36, "byteLength": 6}],
      "accessors": [{"bufferView": 0, "componentType": 5122, "normalized": true, "count": 4, "type": "VEC3",
        "sparse": {"count": 1, "indices": {"bufferView": 1, "componentType": 5121},
                   "values": {"bufferView": 2}}}],
      "meshes": [{"primitives": [{"attributes": {"POSITION": 0}, "mode": 5}]}],)"
                                                 + kNodes),
                                           data));
    Scene const scene = loadScene(file, libraries());
    Mesh const& mesh = scene.meshes[static_cast<std::size_t>(scene.instances[0].mesh)];
    ASSERT_EQ(mesh.triangles.size(), 2u);
    auto const corner = [&](std::size_t t, std::size_t c) {
        return mesh.positions[mesh.triangles[t][c]];
    };
    expectNear(corner(0, 1), {1, 0, 0});
    expectNear(corner(1, 0), {1, 0, 0});
    expectNear(corner(1, 1), {1, 1, 1});
    expectNear(corner(1, 2), {0, 0, 1});
}

/// A material's JSON, and parts of the scene's.
struct Mapped {
    std::string material;
    std::vector<std::string> parts;
};

TEST_F(Model, MaterialsBecomeTheNearestClass)
{
    Mapped const cases[] = {
        {R"("pbrMetallicRoughness": {"baseColorFactor": [1, 0.5, 0.25, 1], "roughnessFactor": 0.5})",
         {"corvid_Mtl_Metal", R"("u_reflectColor": [1, 0.5, 0.25])", R"("u_roughValue": 0.25)"}},
        {R"("pbrMetallicRoughness": {"metallicFactor": 0, "roughnessFactor": 0.3})",
         {"corvid_Mtl_MetallicPaint", R"("u_coatReflectivity": 0.04,)",
          R"("u_coatRoughValue": 0.09)", R"("u_flakeDensity": 0)"}},
        {R"("pbrMetallicRoughness": {"metallicFactor": 0, "roughnessFactor": 0},
            "extensions": {"KHR_materials_transmission": {"transmissionFactor": 1},
              "KHR_materials_ior": {"ior": 2},
              "KHR_materials_volume": {"thicknessFactor": 1, "attenuationDistance": 2,
                                       "attenuationColor": [1, 0.1, 0.01]}})",
         // ((2 - 1) / (2 + 1))²; a tenth is left after 2, a hundredth: 1/2 and 1 decades each
         {"corvid_Mtl_Dielectric", R"("u_ior": 2)", R"("u_reflectance": 0.11111)",
          R"("u_absorptionCoef": [0, 0.5, 1])", R"("u_falloffEnable": true)"}},
        {R"("pbrMetallicRoughness": {"metallicFactor": 0, "baseColorFactor": [0.2, 0.4, 0.6, 1]},
            "extensions": {"KHR_materials_transmission": {"transmissionFactor": 1}})",
         {"corvid_Mtl_Glazing", R"("u_reflectance": 0.2,)",
          R"("u_refractColor": [0.2, 0.4, 0.6])"}},
        {R"("emissiveFactor": [1, 0.5, 0], "pbrMetallicRoughness": {"metallicFactor": 0},
            "extensions": {"KHR_materials_emissive_strength": {"emissiveStrength": 8}})",
         {"corvid_Mtl_Ward", R"("u_additionalColor": [8, 4, 0])",
          R"("u_brdf00Reflectivity": 0.04)"}},
        {R"("extensions": {"KHR_materials_unlit": {}},
            "pbrMetallicRoughness": {"baseColorFactor": [0.2, 0.4, 0.6, 1]})",
         {"corvid_Mtl_Unlit", R"("diffuseColor": [0.2, 0.4, 0.6])"}},
        {R"("alphaMode": "BLEND", "pbrMetallicRoughness": {"baseColorFactor": [1, 1, 1, 0.25]})",
         {R"("maskingColor": [0.75, 0.75, 0.75])"}},
        // Along the direction mix(0.25, 1, 0.8²); across 0.25.
        {R"("pbrMetallicRoughness": {"roughnessFactor": 0.5}, "extensions":
            {"KHR_materials_anisotropy": {"anisotropyStrength": 0.8, "anisotropyRotation": 0.5}})",
         {R"("u_roughValue": 0.73)", R"("u_anisotropyValue": 0.34247)",
          R"("u_anisoRotationValue": 0.5)"}},
        {R"("pbrMetallicRoughness": {"metallicFactor": 0, "roughnessFactor": 0.9},
            "extensions": {"KHR_materials_clearcoat": {"clearcoatFactor": 1, "clearcoatRoughnessFactor": 0.2}})",
         {R"("u_coatReflectivity": 0.04,)", R"("u_coatRoughValue": 0.04)"}},
    };
    std::string const primitive =
        R"("meshes": [{"primitives": [{"attributes": {"POSITION": 0}, "material": 0}]}],)";
    for (Mapped const& c : cases) {
        JsonValue const scene =
            readSceneFile(write(kBuffers + "," + primitive + kNodes
                                + R"(, "materials": [{"name": "M", )" + c.material + "}]"));
        SCOPED_TRACE(c.material);
        expectContains(told(scene.find("materials")->find("M")), c.parts);
        EXPECT_EQ(errorOf([&] { loadScene(folder.path / "m.glb", libraries()); }), "no error");
    }
}

/// Pictures of 2 x 2 texels; text, rows from the top.
TEST_F(Model, PicturesBecomeWhatTheClassesRead)
{
    // Left metal, right none; rough 0.5 everywhere (128 / 255); base colour a quarter below, 1
    // above.
    folder.write("orm.ppm", "P3 2 2 255  9 128 255  9 128 0  9 128 255  9 128 0");
    folder.write("base.ppm", "P3 2 2 255  255 255 255  255 255 255  137 137 137  137 137 137");
    Scene const scene = load(kBuffers + "," + kNodes + R"(,
      "images": [{"uri": "orm.ppm"}, {"uri": "base.ppm"}], "textures": [{"source": 0}, {"source": 1}],
      "meshes": [{"primitives": [{"attributes": {"POSITION": 0, "TEXCOORD_0": 1}, "material": 0}]}],
      "materials": [{"pbrMetallicRoughness": {"baseColorFactor": [1, 0.5, 1, 1],
        "baseColorTexture": {"index": 1}, "metallicRoughnessTexture": {"index": 0}}}])");
    Shader const& ward = scene.materials[0];
    ASSERT_EQ(ward.className(), "corvid_Mtl_Ward");
    auto const seen = [&](char const* name, float u, float v) {
        Vec2f const at(u, v);
        Vec4f texel;
        static_cast<TextureSampler2D const*>(ward.find(name)->field)->texture->lookup(&texel, &at);
        return rgb(texel);
    };
    auto const near = [](Vec3f got, Vec3f want) {
        EXPECT_LT(length(got - want), 0.004f) << got.x << ' ' << got.y << ' ' << got.z;
    };
    near(seen("u_diffuseMap", 0.25f, 0.75f), {0, 0, 0});
    near(seen("u_diffuseMap", 0.75f, 0.75f), {1, 0.5f, 1});
    near(seen("u_diffuseMap", 0.75f, 0.25f), {0.25f, 0.125f, 0.25f});
    near(seen("u_specularMap", 0.25f, 0.25f), {0.25f, 0.125f, 0.25f});
    near(seen("u_specularMap", 0.75f, 0.25f), {1, 1, 1});
    near(seen("u_brdf00ReflectMap", 0.25f, 0.75f), {1, 1, 1});
    near(seen("u_brdf00ReflectMap", 0.75f, 0.75f), grey(0.04f));
    // The class's width for this glossiness is 0.25: 1 - 0.282 goes through its cubic.
    float const x = 1 - seen("u_roughMap", 0.5f, 0.5f).x;
    EXPECT_NEAR(((24.1745f * x - 45.6128f) * x + 28.605f) * x - 5.72202f, 0.25f, 0.005f);
}

TEST_F(Model, SamplersTransformsAndCutoffsAreThoseOfTheFile)
{
    folder.write("base.ppm", "P3 2 2 255  255 0 0  0 255 0  0 0 255  255 255 255");
    Scene const scene = load(kBuffers + "," + kNodes + R"(,
      "images": [{"uri": "base.ppm"}],
      "samplers": [{"wrapS": 33071, "wrapT": 33648}],
      "textures": [{"source": 0, "sampler": 0}],
      "meshes": [{"primitives": [{"attributes": {"POSITION": 0, "TEXCOORD_0": 1}, "material": 0}]}],
      "materials": [{"alphaMode": "MASK", "alphaCutoff": 0.5,
        "pbrMetallicRoughness": {"metallicFactor": 0, "baseColorFactor": [1, 1, 1, 0.4],
        "baseColorTexture": {"index": 0, "extensions": {"KHR_texture_transform":
          {"offset": [0.25, 0], "rotation": 1.5707963, "scale": [2, 1]}}}}}])");
    Shader const& paint = scene.materials[0];
    auto const lookup = [&](char const* name, Vec2f at) {
        Vec4f texel;
        static_cast<TextureSampler2D const*>(paint.find(name)->field)->texture->lookup(&texel, &at);
        return rgb(texel);
    };
    expectNear(lookup("u_baseMap", {-7, 0.25f}), {0, 0, 1}); // stops at the left
    expectNear(lookup("u_baseMap", {9, 0.25f}), {1, 1, 1});
    expectNear(lookup("u_baseMap", {0, 1.25f}), {1, 0, 0}); // the upper row again
    expectNear(lookup("u_baseMap", {0, 1.75f}), {0, 0, 1});
    EXPECT_EQ(lookup("maskingTexture", {0.5f, 0.5f}).x, 0.0f) << "0.4 is below the cutoff";
    // Downwards (u, w): scaled to (2u, w), turned counterclockwise to (w, -2u), moved to (w + 0.25,
    // -2u). Upwards w = 1 - v: (1.25 - v, 1 + 2u).
    Vec2f const at =
        transformUv(*static_cast<Mat3f const*>(paint.find("u_baseTransform")->field), {0.1f, 0.3f});
    EXPECT_NEAR(at.x, 0.95f, 1e-6f);
    EXPECT_NEAR(at.y, 1.2f, 1e-6f);
}

TEST(NormalMap, HeightsHaveItsSlopes)
{
    // z = a sin(2 pi (2 u + v)), v upwards, over 64 x 32 texels.
    constexpr int kWidth = 64, kHeight = 32;
    constexpr float kA = 0.02f, kTurn = 6.2831853f;
    std::vector<Vec3f> normals;
    std::vector<float> want;
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) {
            float const phase = kTurn
                * (2 * (static_cast<float>(x) + 0.5f) / kWidth + 1
                   - (static_cast<float>(y) + 0.5f) / kHeight);
            float const slope = kA * kTurn * std::cos(phase);
            Vec3f const n = normalize(Vec3f(-2 * slope, -slope, 1));
            normals.push_back(n * 0.5f + Vec3f(0.5f, 0.5f, 0.5f));
            want.push_back(kA * std::sin(phase));
        }
    std::vector<float> const heights = heightsOfNormals(normals, kWidth, kHeight);
    for (std::size_t i = 0; i < want.size(); ++i)
        ASSERT_NEAR(heights[i], want[i], 1e-4f * kA) << i;
}

TEST_F(Model, ObjFilesBringTheirMaterials)
{
    folder.write("a.mtl",
                 "newmtl red\nKd 1 0 0\nNs 30\nnewmtl tin\nKd .5 .5 .5\nPm 1\nPr 0.5\n"
                 "newmtl unused\nmap_Kd no.png\n");
    fs::path const file = folder.write(
        "a.obj",
        "mtllib a.mtl\nv 0 0 0\nv 1 0 0\nv 0 1 0\nusemtl red\nf 1 2 3\nusemtl tin\nf 3 2 1\n"
        "usemtl lost\nf 1 3 2\n");
    Scene const scene = loadScene(file, libraries());
    ASSERT_GE(scene.materials.size(), 3u);
    EXPECT_EQ(scene.materialNames[0] + scene.materialNames[1] + scene.materialNames[2],
              "redtinplain");
    // An exponent of 30: the width is the root of 2 / 32.
    EXPECT_NEAR(*static_cast<float const*>(scene.materials[0].find("u_coatRoughValue")->field),
                0.25f, 1e-4f);
    EXPECT_EQ(scene.materials[1].className(), "corvid_Mtl_Metal");
    expectNear(placed(scene, 0, 2), {0, 0, 1}); // y is up
    fs::remove(folder.path / "a.mtl");
    expectContains(loadScene(file, libraries()).warnings.at(0), {"a.obj: ", "not there", "a.mtl"});
}

TEST_F(Model, LightsAndTheCameraKeepTheirUnits)
{
    // 4 pi candela: a white surface at distance 2 that faces it shows 4 / 2². The node looks down.
    JsonValue const scene = readSceneFile(write(kBuffers + "," + kMesh + R"(,
      "extensions": {"KHR_lights_punctual": {"lights": [
        {"type": "point", "intensity": 12.566371, "color": [1, 0.5, 0]},
        {"type": "spot", "spot": {"outerConeAngle": 0.5235988, "innerConeAngle": 0.2617994}},
        {"type": "directional", "intensity": 3.1415927}]}},
      "cameras": [{"type": "perspective", "perspective": {"yfov": 0.7853982, "aspectRatio": 2, "znear": 1}}],
      "scenes": [{"nodes": [0, 1, 2, 3, 4]}],
      "nodes": [{"mesh": 0}, {"camera": 0, "translation": [0, 0, 5]},
        {"name": "point", "translation": [1, 2, 3], "extensions": {"KHR_lights_punctual": {"light": 0}}},
        {"name": "spot", "rotation": [-0.70710678, 0, 0, 0.70710678],
         "extensions": {"KHR_lights_punctual": {"light": 1}}},
        {"name": "sun", "extensions": {"KHR_lights_punctual": {"light": 2}}}])"));
    JsonValue const& lights = *scene.find("lights");
    ASSERT_EQ(lights.members.size(), 3u) << "the studio's are out";
    expectContains(told(lights.find("point")),
                   {R"("position": [1, -3, 2])", R"("color": [4, 2, 0])"});
    expectContains(told(lights.find("spot")), {R"("angle": 60)", R"("innerAngle": 30)"});
    expectNear(JsonReader(lights).at("spot").at("axis").toVec3f(), {0, 0, -1});
    expectContains(told(lights.find("sun")),
                   {R"("direction": [0, -1, 0])", R"("color": [1, 1, 1])"});
    expectContains(told(scene.find("camera")), {R"("position": [0, -5, 0])", R"("fov": 45)"});
    expectContains(told(scene.find("film")), {R"("width": 1280, "height": 640)"});
    EXPECT_FALSE(scene.find("instances")->find("ground")) << "a model with both is a scene";
}

TEST_F(Model, TheCameraSeesAllOfIt)
{
    for (std::string const scale : {"[1, 1, 1]", "[1000, 1, 1]", "[0.01, 50, 0.01]"}) {
        Scene const scene = load(kBuffers + "," + kMesh + R"(, "scenes": [{"nodes": [0]}],
          "nodes": [{"mesh": 0, "translation": [7, 8, 9], "scale": )"
                                 + scale + "}]");
        Vec3f const ahead = normalize(scene.camera.target - scene.camera.position);
        Vec3f const right = normalize(cross(ahead, Vec3f(0, 0, 1))), up = cross(right, ahead);
        float const tall = std::tan(scene.camera.verticalFov * 0.00872665f);
        float widest = 0;
        for (std::size_t corner = 0; corner < 3; ++corner) {
            Vec3f const p = placed(scene, 0, corner) - scene.camera.position;
            float const depth = dot(p, ahead);
            widest = std::max({widest, std::fabs(dot(p, right)) / (depth * tall * 1.5f),
                               std::fabs(dot(p, up)) / (depth * tall)});
        }
        EXPECT_LT(widest, 1.0f) << scale;
        EXPECT_GT(widest, 0.5f) << scale;
    }
}

TEST_F(Model, WhatIsBrokenIsNamedWithItsPlace)
{
    std::string const good = kBuffers + "," + kMesh + "," + kNodes;
    auto const with = [&](std::string const& from, std::string const& to) {
        std::string text = good;
        std::size_t const at = text.find(from);
        EXPECT_NE(at, std::string::npos) << from;
        return text.replace(at, from.size(), to);
    };
    std::pair<std::string, std::vector<std::string>> const cases[] = {
        {with(R"({"mesh": 0})", R"({"mesh": 3})"),
         {"m.glb: nodes[0].mesh: there is no meshes[3]; the file has 1"}},
        {with(R"({"mesh": 0})", R"({"mesh": "a"})"), {"m.glb: nodes[0].mesh: expected an integer"}},
        {with(R"({"mesh": 0})", R"({"children": [0]})"),
         {"m.glb: nodes[0].children[0]:", "one parent"}},
        {with(R"("count": 3, "type": "VEC3")", R"("count": 4, "type": "VEC3")"),
         {"m.glb: bufferViews[0]: has 36 bytes; 48 are needed"}},
        {with(R"("byteLength": 68)", R"("byteLength": 40)"),
         {"m.glb: buffers[0]: it has 40 bytes"}},
        {with(R"("VEC2")", R"("VEC3")"), {"m.glb: accessors[1].type: expected VEC2"}},
        {with(R"("indices": 2)", R"("indices": 0)"),
         {"accessors[0].componentType: expected 5121, 5123 or 5125"}},
        {R"("extensionsRequired": ["KHR_draco_mesh_compression"],)" + good,
         {"m.glb: extensionsRequired[0]:", "KHR_draco_mesh_compression"}},
    };
    for (auto const& broken : cases)
        expectContains(errorOf([&] { load(broken.first); }), broken.second);
    std::string const whole = glb(model(good), kData);
    for (std::size_t const length : {3ul, 11ul, 30ul, 200ul, whole.size() - 40}) {
        folder.write("m.glb", whole.substr(0, length));
        expectContains(errorOf([&] { loadScene(folder.path / "m.glb", libraries()); }), {"m.glb"});
    }
    expectContains(errorOf([&] { loadScene(folder.path / "no.glb", libraries()); }),
                   {"no.glb: no such file"});
}

} // namespace
} // namespace zsi::host
