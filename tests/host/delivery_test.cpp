// SPDX-License-Identifier: Apache-2.0
// What a scene says reaches the shaders and the picture: each test sees one thing left out,
// mirrored or swapped.
#include "film/imageFile.h"
#include "support/hostScene.h"
#include "support/record.h"
#include "support/temporaryFolder.h"
#include "texture/textureStore.h"

#include <gtest/gtest.h>

namespace zsi::test {
namespace {

EntryPointFunction show(std::function<Vec3f(ShadeState const&)> what)
{
    return [=](IShaderAPI*, ShadeState& s) { s.Ci = withAlpha(what(s), 1); };
}
void expectColor(Vec4f got, Vec3f want, float tolerance, std::string const& why)
{
    EXPECT_TRUE(near(rgb(got), want, double(tolerance))) << why;
}

TEST(Delivery, ASpotShinesAlongItsAxisFromItsPlace)
{
    for (float const down : {1.0f, -1.0f}) {
        Stage stage;
        stage.card(stage.matte(), 0, 20);
        host::ShaderLight spot{libraries().create("voSpotLight"), {0, 0, 5}, {0, 0, -down}};
        spot.shader.set("color", kWhite);
        spot.shader.set("attenuationFactors", Vec3f(1e9f, 1, 0));
        stage.scene.lights.push_back(std::move(spot));
        stage.scene.settings.maxDepth = 1;
        EXPECT_EQ(stage.middle().x > 0.9f, down > 0) << "under it";
        stage.watch({15, 0, 0}, {0, 0, 1});
        EXPECT_EQ(stage.middle().x, 0.0f) << "beside its cone";
    }
}

TEST(Delivery, AttributesAreThoseOfTheHitInTheirOwnCorners)
{
    // Corners at (0, 0), (4, 0), (0, 4) with attributes that tell them apart; seen at (1, 2), where
    // they weigh 1/4, 1/4 and 1/2.
    host::Mesh mesh;
    mesh.positions = {{0, 0, 0}, {4, 0, 0}, {0, 4, 0}};
    mesh.normals.assign(3, {0, 0, 1});
    mesh.uv = {{1, 0}, {0, 1}, {0, 0}};
    mesh.uv1 = {{0, 8}, {0, 0}, {8, 0}};
    mesh.tangents = {{1, 0, 0}, {0, 1, 0}, {0, 0, 1}};
    mesh.bitangents = {{0, 0, 4}, {4, 0, 0}, {0, 4, 0}};
    mesh.triangles = {{0, 1, 2}};
    ShadeState seen;
    Stage stage;
    stage.add(mesh, stage.probe([&](IShaderAPI*, ShadeState& s) { seen = s; }), {10, 20, 30});
    stage.watch({11, 22, 30}, {0, 0, 1});
    stage.scene.film.crop = {4, 5, 5, 6};
    stage.render(1);
    float const want[] = {0.25f, 0.25f, 4, 2, 0.25f, 0.25f, 0.5f, 1, 2, 1};
    for (std::size_t i = 0; i < std::size(want); ++i)
        EXPECT_NEAR(Probe::attribute<float>(seen, 4 * i), want[i], 2e-3f) << "attribute " << i;
    EXPECT_TRUE(near(seen.Pref, {1, 2, 0}, 2e-3)) << "in the object's own space";
    EXPECT_TRUE(near(seen.P, {11, 22, 30}, 2e-3));
    float const* const m = seen.objectToWorld.m;
    EXPECT_EQ(Vec3f(m[12], m[13], m[14]), Vec3f(10, 20, 30));
    // The pixel's filter reaches 1.5 pixels from its middle.
    EXPECT_NEAR(seen.rasterX, 4.5f, 1.5f);
    EXPECT_NEAR(seen.rasterY, 5.5f, 1.5f);
    EXPECT_EQ(seen.imageHeight, 8);
}

TEST(Delivery, NormalsOfAStretchedInstanceStandOnItsSurface)
{
    Stage stage;
    stage.add(host::sphereMesh(1, 256), stage.probe(show([](ShadeState const& s) { return s.N; })),
              {0, 0, 0});
    stage.scene.instances[0].objectToWorld.m[0] = 4; // x by 4
    // x = 4 c, z = c with c = 1/sqrt 2: the normal leans to (c/4, 0, c), not to (4 c, 0, c).
    float const c = std::sqrt(0.5f);
    stage.watch({4 * c, 0, c}, {0, 0, 3});
    Vec3f const want = normalize(Vec3f(0.25f, 0, 1));
    expectColor(stage.middle(), want, 0.01f, "inverse transposed");
}

/// Writes a sky of 64 x 32 texels as `light` says of the direction in the world.
std::string skyFile(TemporaryFolder const& folder, std::function<Vec3f(Vec3f)> light)
{
    host::Picture picture{64, 32, {0, 0, 64, 32}, {{"beauty", {"R", "G", "B", "A"}, {}}}};
    for (int y = 0; y < 32; ++y)
        for (int x = 0; x < 64; ++x) {
            // The middle column lies towards +y, columns run to the right from there, rows down.
            double const turn = 2 * M_PI * ((x + 0.5) / 64 - 0.5), tilt = M_PI * (y + 0.5) / 32;
            Vec3f const d(float(std::sin(turn) * std::sin(tilt)),
                          float(std::cos(turn) * std::sin(tilt)), float(std::cos(tilt)));
            Vec3f const v = light(d);
            picture.layers[0].values.insert(picture.layers[0].values.end(), {v.x, v.y, v.z, 1});
        }
    std::string const file = (folder.path / "sky.exr").string();
    host::writePicture(file, picture, {});
    return file;
}

TEST(Delivery, TheSkyStandsAsItsPictureSays)
{
    TemporaryFolder const folder;
    std::string const file = skyFile(folder, [](Vec3f d) {
        return Vec3f(0.5f + 0.5f * d.x, 0.5f + 0.5f * d.y, 0.5f + 0.5f * d.z);
    });
    for (Vec3f const d : {Vec3f(1, 0, 0), Vec3f(-1, 0, 0), Vec3f(0, 1, 0), Vec3f(0, -1, 0),
                          Vec3f(0.6f, 0.64f, 0.48f), Vec3f(-0.48f, 0.6f, -0.64f)}) {
        Stage stage;
        stage.scene.textures = std::make_shared<host::TextureStore>();
        stage.sky(kWhiteSky);
        stage.scene.environment->set("reflectionCube",
                                     stage.scene.textures->loadCube(file, host::ColorSpace::Auto));
        stage.card(stage.probe([d](IShaderAPI* api, ShadeState& s) {
            s.Ci = withAlpha(api->traceReflection(&s.P, &d, 1), 1);
        }));
        stage.scene.instances[0].objectToWorld.m[0] = 1e-3f; // out of the way
        stage.scene.instances[0].objectToWorld.m[5] = 1e-3f;
        expectColor(stage.middle(), {0.5f + 0.5f * d.x, 0.5f + 0.5f * d.y, 0.5f + 0.5f * d.z},
                    0.02f, "sky");
    }
}

TEST(Delivery, FilmAndSettingsCount)
{
    auto const glow = [](float value, float alpha) {
        return [=](IShaderAPI*, ShadeState& s) { s.Ci = {value, value, value, alpha}; };
    };
    Stage stage;
    stage.card(stage.probe(glow(8, 0.25f)));
    EXPECT_EQ(stage.middle().x, 8.0f);
    EXPECT_EQ(stage.middle().w, 0.25f);
    stage.scene.film.alpha = false;
    EXPECT_EQ(stage.middle().w, 1.0f);
    stage.scene.settings.sampleClamp = 2;
    EXPECT_EQ(stage.middle().x, 2.0f);

    Stage ambient;
    ambient.scene.settings.ambient = {0.3f, 0.2f, 0.1f};
    ambient.card(ambient.matte());
    expectColor(ambient.middle(), {0.3f, 0.2f, 0.1f}, 1e-5f, "ambient light");

    // 8-bit files: a quarter is 137 in sRGB, two stops up white; with and without alpha.
    Stage quarter;
    quarter.card(quarter.probe(glow(0.25f, 0.5f)));
    TemporaryFolder const folder;
    host::Picture const picture = quarter.render();
    host::TextureStore store;
    struct Row {
        char const* name;
        host::ScreenView view;
        float want, alpha;
    };
    for (Row const& r : {Row{"a.png", {0, false}, 0.25f, 1}, Row{"b.png", {1, true}, 0.5f, 0.5f},
                         Row{"c.png", {2, false, "plain"}, 1, 1}}) {
        host::writePicture(folder.path / r.name, picture, r.view);
        Vec4f seen{0, 0, 0, 0};
        Vec2f const at(0.5f, 0.5f);
        store.load2D(folder.path / r.name, host::ColorSpace::Auto)->lookup(&seen, &at);
        EXPECT_NEAR(seen.x, r.want, 0.005f) << r.name;
        EXPECT_NEAR(seen.w, r.alpha, 0.005f) << r.name;
    }
}

TEST(Delivery, TheLensIsSharpAtItsFocusAlone)
{
    auto const brightness = [](float focus) {
        Stage stage;
        stage.scene.settings.samples = 64;
        stage.card(stage.probe(show([](ShadeState const&) { return kWhite; })), 0, 0.05f);
        stage.watch({0, 0, 0}, {0, 0, 4});
        stage.scene.camera.lensRadius = 0.5f;
        stage.scene.camera.focusDistance = focus;
        return mean(stage.render()).x;
    };
    EXPECT_EQ(brightness(0), 1.0f) << "the target is in focus";
    EXPECT_EQ(brightness(4), 1.0f);
    // In focus at 8 the lens's disc of radius 1/2 is seen at half size on the card's plane.
    EXPECT_NEAR(brightness(8), 0.1f * 0.1f / (3.14159265f * 0.0625f), 0.03f);
}

TEST(Delivery, SpreadTurnsRaysAwayFromTheirAxis)
{
    // A sky white in the upper half: a ray along the horizon sees half of it, at an eighth of a
    // turn up all but what a wide lobe turns below.
    Sky const sky([](Vec3f d) { return d.z > 0 ? kWhite : Vec3f(0, 0, 0); });
    auto const seen = [&](float z, float spread, bool refracted) {
        Vec3f const d = normalize(Vec3f(1, 0, z));
        Stage stage;
        stage.scene.settings.samples = 64;
        stage.sky(sky);
        stage.card(stage.probe([=](IShaderAPI* api, ShadeState& s) {
            s.Ci = withAlpha(refracted ? api->traceRefraction(&s.P, &d, spread, 1)
                                       : api->traceSpecular(&s.P, &d, spread, 1),
                             1);
        }));
        stage.scene.instances[0].objectToWorld = // upright, so that both halves are free
            {0, 0, -1, 0, 0, 1, 0, 0, 1, 0, 0, 0, 0, 0, 0, 1};
        stage.watch({0, 0, 0}, {1, 0, 0});
        return mean(stage.render()).x;
    };
    EXPECT_EQ(seen(0.1f, 0, false), 1.0f);
    EXPECT_EQ(seen(-0.1f, 0, false), 0.0f);
    // Twice a tilt whose tangent squared is w^2 u / (1 - u) passes 0.1 rad down in half the turns.
    EXPECT_NEAR(seen(0.1f, 0.2f, false), 0.71f, 0.1f);
    EXPECT_GT(seen(0.1f, 0.2f, true), seen(0.1f, 0.2f, false) + 0.05f) << "half the tilt";
}

TEST(Delivery, PathsKnowTheirMediaAndLightFromBehind)
{
    // Two balls of glass in each other, seen straight through: 1.5 outside, 1.2 inside.
    std::vector<Vec2f> seen;
    auto const glass = [&](float ior) {
        auto p = std::make_unique<Probe>();
        p->u_ior = ior;
        p->onShade = p->onTransfer = [](IShaderAPI*, ShadeState&) {};
        p->onSample = [&](IShaderAPI*, ShadeState& s) {
            seen.push_back({s.incomingIor, s.beyondIor});
            s.sampleType = kSampleMixture;
            s.sampleDirection = s.I;
            s.outBrdf = kWhite;
            s.sampleCosine = s.sampleInvPdf = 1;
        };
        return p;
    };
    Stage stage;
    stage.scene.settings.integrator = "path";
    stage.scene.film.width = stage.scene.film.height = 1;
    stage.sky(kWhiteSky);
    stage.add(host::sphereMesh(2, 32), stage.probe(glass(1.5f)), {0, 0, 0});
    stage.add(host::sphereMesh(1, 32), stage.probe(glass(1.2f)), {0, 0, 0});
    stage.watch({0, 0, 0}, {0.1f, 0.2f, 5});
    EXPECT_EQ(pixel(stage.render(1), 0, 0).x, 1.0f);
    std::vector<Vec2f> const want{{1, 1.5f}, {1.5f, 1.2f}, {1.2f, 1.5f}, {1.5f, 1}};
    ASSERT_GE(seen.size(), want.size());
    seen.erase(seen.begin(), seen.end() - 4); // draws before the first ray
    for (std::size_t i = 0; i < want.size(); ++i)
        EXPECT_TRUE(seen[i].x == want[i].x && seen[i].y == want[i].y)
            << i << ": " << seen[i].x << ' ' << seen[i].y;

    // A sheet that sends half of its light through: the lamp behind it shows, before it as well.
    for (float const side : {2.0f, -2.0f})
        for (bool const lets : {true, false}) {
            auto p = std::make_unique<Probe>();
            p->onShade = [](IShaderAPI*, ShadeState&) {};
            if (lets)
                p->onTransmission = [](IShaderAPI*, ShadeState&) {};
            p->onTransfer = [](IShaderAPI*, ShadeState& s) {
                s.outBrdf = grey(0.5f / 3.14159265f);
                s.sampleCosine = std::fabs(s.sampleDirection.z);
            };
            p->onSample = [](IShaderAPI*, ShadeState& s) { s.sampleType = kSampleMixture; };
            Stage sheet;
            sheet.scene.settings.integrator = "path";
            sheet.lamp({0, 0, side});
            sheet.card(sheet.probe(std::move(p)));
            sheet.watch({0, 0, 0}, {0, 0, 1});
            EXPECT_NEAR(sheet.middle().x, side > 0 || lets ? 0.5f : 0.0f, 1e-4f) << side << lets;
        }
}

} // namespace
} // namespace zsi::test
