// SPDX-License-Identifier: Apache-2.0
// What layers of a picture show beside the beauty.
#include "film/cryptomatte.h"
#include "film/halves.h"
#include "support/hostScene.h"

#include <bit>
#include <gtest/gtest.h>

namespace zsi::test {
namespace {

constexpr char const* kIntegrators[] = {"shade", "path"};

Vec3f middleOf(host::Picture const& picture, std::string const& name)
{
    host::Layer const* const layer = picture.find(name);
    std::size_t const n = layer ? layer->channels.size() : 0;
    if (n == 0)
        return grey(-1);
    float const* const v = &layer->values[(4 * 8 + 4) * n];
    return n == 1 ? Vec3f(v[0], 0, 0) : Vec3f(v[0], v[1], v[2]);
}

void expectNear(Vec3f got, Vec3f want, float tolerance, std::string const& why)
{
    EXPECT_NEAR(got.x, want.x, tolerance) << why;
    EXPECT_NEAR(got.y, want.y, tolerance) << why;
    EXPECT_NEAR(got.z, want.z, tolerance) << why;
}

// Glass and a mirror between rough things, under a lamp, a shining ball and a sky.
Stage everything(char const* integrator)
{
    Stage stage;
    stage.scene.settings.integrator = integrator;
    stage.scene.settings.samples = 8;
    static Sky const sky([](Vec3f d) { return Vec3f(0.2f, 0.3f, 0.5f) * (d.z + 1.5f); });
    stage.sky(sky, {0.1f, 0.2f, 0.3f});
    stage.lamp({1, 2, 5});
    stage.card(stage.matte(), 0, 3);
    stage.add(host::sphereMesh(0.6f, 24), stage.material("corvid_Mtl_Dielectric"), {-1, 0, 1});
    stage.add(host::sphereMesh(0.5f, 24), stage.mirror(0.8f), {1, 0, 0.6f});
    stage.add(host::sphereMesh(0.4f, 24), stage.matte(true), {0, 1.2f, 0.6f});
    stage.add(host::sphereMesh(0.3f, 24), -1, {0, -1, 1.5f});
    stage.scene.instances.back().light = static_cast<int>(stage.scene.lights.size());
    stage.scene.lights.push_back(host::SurfaceLight{4, grey(3)});
    stage.watch({0, 0, 0.7f}, {0, -6, 2});
    stage.scene.camera.verticalFov = 45;
    stage.scene.film.width = stage.scene.film.height = 24;
    return stage;
}

TEST(Layers, PartsOfLightAddUpAndNoLayerChangesThePicture)
{
    for (char const* integrator : kIntegrators) {
        Stage stage = everything(integrator);
        host::Picture const plain = stage.render();
        stage.scene.film.layers = {"direct", "indirect", "emission", "environment",
                                   "halves", "objectId", "variance"};
        host::Picture const picture = stage.render();
        EXPECT_EQ(picture.rgba(), plain.rgba()) << integrator;
        std::vector<float> sum(picture.rgba().size() / 4 * 3);
        for (char const* part : {"direct", "indirect", "emission", "environment"}) {
            double all = 0;
            std::vector<float> const& values = picture.find(part)->values;
            for (std::size_t i = 0; i < sum.size(); ++i) {
                sum[i] += values[i];
                all += static_cast<double>(values[i]);
                EXPECT_GT(values[i], -1e-5f) << part;
            }
            EXPECT_GT(all / static_cast<double>(sum.size()), 0.01) << part << integrator;
        }
        for (std::size_t i = 0; i < sum.size(); ++i)
            EXPECT_NEAR(sum[i], picture.rgba()[i / 3 * 4 + i % 3], 1e-4f) << i << integrator;
    }
}

TEST(Layers, PartsTellTheWayOfTheLight)
{
    struct Row {
        char const* why;
        void (*build)(Stage& stage);
        Vec3f environment, emission, direct, indirect;
    };
    Vec3f const none{0, 0, 0}, blue{0.1f, 0.2f, 0.4f};
    Row const rows[] = {
        {"sky through a pane that keeps half", // 1 - 0.5^2 at either face
         [](Stage& s) {
             s.sky(kWhiteSky, {0.1f, 0.2f, 0.4f});
             s.card(s.material("corvid_Mtl_Glazing",
                               {{"u_reflectance", 0.0f}, {"u_refractColor", grey(0.5f)}}));
         },
         blue * 0.5f, none, none, none},
        {"lamp's light on a surface",
         [](Stage& s) {
             s.lamp({0, 0, 5}, {1, 0.5f, 2});
             s.card(s.matte());
         },
         none,
         none,
         {1, 0.5f, 2},
         none},
        {"sky's light on a surface",
         [](Stage& s) {
             s.sky(kWhiteSky);
             s.card(s.matte());
         },
         none, none, kWhite, none},
        {"a lit surface in a mirror, which hides it from the lamp's back",
         [](Stage& s) {
             s.lamp({4, 0, 0.5f});
             s.card(s.mirror(1), 0, 1);
             s.add(host::planeMesh({9, 9}), s.probe([](IShaderAPI* api, ShadeState& state) {
                 Vec3f const N{0, 0, -1};
                 LightSample const* const l = api->getLightSamples(0, &state.P, &N);
                 state.Ci = l ? withAlpha(l->color, 1) : Vec4f(9, 9, 9, 1);
             }),
                   {0, 0, 3});
         },
         none, none, none, kWhite},
        {"what a surface shows in the dark, and the square of the light beside it",
         [](Stage& s) {
             s.lamp({0, 0, 5}, grey(2));
             s.card(s.probe([](IShaderAPI* api, ShadeState& state) {
                 LightSample const* const l = api->getLightSamples(0, &state.P, &state.N);
                 Vec3f const color = l ? l->color : Vec3f(0, 0, 0);
                 state.Ci = withAlpha(color * color + grey(0.25f), 1);
             }));
         },
         none, grey(0.25f), grey(4), none},
    };
    for (char const* integrator : kIntegrators)
        for (Row const& row : rows) {
            Stage stage;
            stage.scene.settings.integrator = integrator;
            stage.scene.film.layers = {"direct", "indirect", "emission", "environment"};
            row.build(stage);
            if (std::string(row.why).starts_with("a lit surface"))
                stage.watch({0, 0, 0}, {0, 0, 2});
            host::Picture const picture = stage.render();
            std::string const why = std::string(row.why) + ", " + integrator;
            float const scale = row.direct == kWhite || row.indirect == kWhite ? 0.1f : 1e-3f;
            expectNear(middleOf(picture, "environment"), row.environment, 1e-3f, why);
            expectNear(middleOf(picture, "emission"), row.emission, 1e-3f, why);
            expectNear(middleOf(picture, "direct"), row.direct, scale, why);
            expectNear(middleOf(picture, "indirect"), row.indirect, scale, why);
        }
}

// Looking down through a pane at a mirror, in which a card above the camera is seen.
TEST(Layers, FeaturesFollowGlassAndMirrorsToARoughSurface)
{
    for (char const* integrator : kIntegrators) {
        Stage stage;
        stage.scene.settings.integrator = integrator;
        stage.scene.film.layers = {"halves", "normal", "depth"};
        stage.scene.settings.samples = 2;
        stage.lamp({0, 0, 4});
        stage.sky(kWhiteSky);
        stage.card(stage.material("corvid_Mtl_Glazing", {{"u_reflectance", 0.0f}}), 1);
        stage.card(stage.mirror(1));
        int const teal = stage.matte();
        stage.scene.materials.back().set("u_diffuseColor", Vec3f(0.1f, 0.4f, 0.5f));
        stage.card(teal, 3, 5);
        stage.watch({0, 0, 0}, {0, 0, 2});
        host::Picture const picture = stage.render();
        expectNear(middleOf(picture, "albedo"), Vec3f(0.1f, 0.4f, 0.5f) * 0.92f, 1e-3f, integrator);
        expectNear(middleOf(picture, "denoiseNormal"), {0, 0, 1}, 0.02f, integrator);
        expectNear(middleOf(picture, "denoiseDepth"), {5, 0, 0}, 0.01f, integrator);
        expectNear(middleOf(picture, "depth"), {1, 0, 0}, 1e-4f, integrator);
    }
}

TEST(Layers, HalvesAreTheSamplesOfEvenAndOddNumber)
{
    Stage stage = everything("shade");
    stage.scene.film.layers = {"halves"};
    host::Session session(stage.scene);
    host::Film film = session.newFilm();
    session.render(film, {film.window(), {0, 1}, 2});
    std::vector<float> const first = film.picture().rgba();
    film.clear();
    session.render(film, {film.window(), {0, 2}, 2});
    EXPECT_EQ(film.half(0).rgba(), first);
    host::Picture picture = host::developed(film, stage.scene);
    auto const halves = host::halvesOf(picture);
    ASSERT_TRUE(halves);
    std::vector<std::string> names;
    for (host::Layer const& layer : (*halves)[1].layers)
        names.push_back(layer.name);
    EXPECT_EQ(names, (std::vector<std::string>{"beauty", "albedo", "normal", "depth"}));
    EXPECT_EQ((*halves)[0].rgba(), first);
    for (std::size_t i = 0; i < first.size(); ++i)
        EXPECT_NEAR((*halves)[0].rgba()[i] + (*halves)[1].rgba()[i], 2 * picture.rgba()[i], 1e-5f);
}

TEST(Layers, VarianceIsThatOfTheMean)
{
    Stage stage;
    stage.scene.settings.samples = 64;
    stage.scene.film.layers = {"variance"};
    stage.card(stage.probe([](IShaderAPI* api, ShadeState& s) {
        s.Ci = withAlpha(Vec3f(api->random(), 3, api->random() < 0.25f ? 4.0f : 0.0f), 1);
    }));
    // Of a uniform number 1/12, of a coin p (1 - p) 4^2, each over 64. Points of a net are even.
    expectNear(middleOf(stage.render(), "variance"), {1.0f / 12 / 64, 0, 3.0f / 64}, 1e-3f, "");
}

TEST(Layers, MattesTellNamesAndShares)
{
    // Of the hash's author's verification, and words whose hashes are widely printed.
    EXPECT_EQ(host::murmurHash3(""), 0u);
    EXPECT_EQ(host::murmurHash3("hello"), 0x248bfa47u);
    EXPECT_EQ(host::murmurHash3("hello, world"), 0x149bbb7fu);
    EXPECT_EQ(host::murmurHash3("The quick brown fox jumps over the lazy dog"), 0x2e4ff723u);
    EXPECT_TRUE(std::isnormal(host::cryptomatteId(""))) << "no denormal";

    Stage stage;
    stage.scene.settings.samples = 256;
    stage.scene.film.width = stage.scene.film.height = 1;
    stage.scene.film.layers = {"objectId", "shaderId"};
    stage.add(host::planeMesh({6, 6}), stage.matte(), {-3, 0, 0});
    stage.add(host::planeMesh({6, 6}), 0, {3, 0, 0});
    stage.scene.instanceNames = {"left", "right"};
    stage.scene.materialNames = {"chalk"};
    stage.watch({0.2f, 0, 0}, {0, 0, 1});
    stage.scene.camera.verticalFov = 60;
    host::Picture const picture = stage.render();
    std::vector<float> const& pairs = picture.find("objectId00")->values;
    EXPECT_EQ(pairs[0], host::cryptomatteId("right"));
    EXPECT_EQ(pairs[2], host::cryptomatteId("left"));
    EXPECT_FLOAT_EQ(pairs[1] + pairs[3], 1);
    EXPECT_GT(pairs[1], pairs[3]);
    EXPECT_EQ(picture.find("shaderId00")->values[1], 1.0f);
    std::string all;
    for (host::Attachment const& line : picture.attachments)
        all += line.name + '=' + line.text + '\n';
    char hash[9];
    std::snprintf(hash, sizeof hash, "%08x", std::bit_cast<std::uint32_t>(pairs[0]));
    EXPECT_NE(all.find("\"right\":\"" + std::string(hash)), std::string::npos) << all;
}

} // namespace
} // namespace zsi::test
