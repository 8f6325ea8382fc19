// SPDX-License-Identifier: Apache-2.0
// Small pictures with known answers.
#include "support/hostScene.h"
#include "support/record.h"
#include "texture/textureFootprint.h"

#include <array>
#include <gtest/gtest.h>
#include <limits>

namespace zsi::test {
namespace {

constexpr char const* kIntegrators[] = {"shade", "path"};

void expectNear(Vec4f got, Vec4f want, float tolerance, std::string const& why)
{
    EXPECT_TRUE(near(got, want, double(tolerance))) << why;
}

TEST(Render, AWhiteDiffuseSurfaceShowsTheLightThatArrives)
{
    for (char const* integrator : kIntegrators) {
        Stage sky;
        sky.scene.settings.integrator = integrator;
        sky.sky(kWhiteSky);
        sky.card(sky.matte(true));
        sky.watch({0, 0, 0}, {1, 0, 1});
        expectNear(sky.middle(), {1, 1, 1, 1}, 1e-4f, integrator);

        Stage lit;
        lit.scene.settings.integrator = integrator;
        lit.lamp({9.6f, 0, 2.8f}, {1, 0.5f, 2}); // cosine 0.28
        lit.card(lit.matte());
        lit.watch({0, 0, 0}, {0, 1, 1});
        expectNear(lit.middle(), {0.28f, 0.14f, 0.56f, 1}, 1e-4f, integrator);
    }
}

// Under a uniform sky every point of something convex is as bright as the sky: what is darker saw
// itself, at any size and place, on coarse facets and at the silhouette.
TEST(Render, SurfacesDoNotShadowThemselves)
{
    struct Placed {
        float radius;
        Vec3f at;
        int segments;
    };
    for (Placed const& p : {Placed{1, {0, 0, 0}, 12}, Placed{1000, {0, 0, 0}, 64},
                            Placed{0.01f, {50, -20, 30}, 24}, Placed{1, {3000, 2000, -1000}, 32}}) {
        Stage stage;
        stage.sky(kWhiteSky);
        stage.scene.settings.samples = 32;
        stage.add(host::sphereMesh(p.radius, p.segments), stage.matte(true), p.at);
        stage.watch(p.at, {0, -4 * p.radius, 0});
        stage.scene.camera.verticalFov = 20;
        host::Picture const picture = stage.render();
        for (std::size_t i = 0; i < picture.rgba().size(); i += 4)
            EXPECT_NEAR(picture.rgba()[i], picture.rgba()[i + 3], 1e-3f)
                << "radius " << p.radius << ", pixel " << i / 4;
    }
}

TEST(Render, ShadowsLieWhereTheLightIsCovered)
{
    // A light 2 above the ground, a card of half size 1 half way: the shadow's half size is 2.
    struct Row {
        float x, radius, want, tolerance;
    };
    float const lit = 2 / std::hypot(2.0f, 2.02f);
    for (Row const& r : {Row{1.98f, 0, 0, 0}, Row{2.02f, 0, lit, 1e-3f}, Row{0, 0.2f, 0, 0},
                         Row{2, 0.2f, 2 / std::hypot(2.0f, 2.0f) / 2, 0.02f}}) {
        Stage stage;
        stage.lamp({0, 0, 2}).radius = r.radius;
        stage.scene.settings.samples = 64;
        stage.scene.settings.maxDepth = 1; // what bounces below the card is no shadow's
        stage.card(stage.matte(), 0, 5);
        stage.card(stage.matte(), 1);
        stage.watch({r.x, 0, 0}, {0, 0, 0.5f});
        EXPECT_NEAR(stage.middle().x, r.want, r.tolerance) << r.x << ", light radius " << r.radius;
    }
}

TEST(Render, TheSunIsAsWideAsItsAngle)
{
    // A card's edge 1 above the ground before a disc of 30 degrees: what part of it lies beyond.
    struct Row {
        float x, want;
    };
    for (Row const& r : {Row{0.7f, 0}, Row{0.9f, 0.26f}, Row{1.1f, 0.74f}, Row{1.3f, 1}}) {
        Stage stage;
        stage.scene.lights.push_back(host::SunLight{{0, 0, 1}, kWhite, 30});
        stage.scene.settings.samples = 64;
        stage.scene.settings.maxDepth = 1;
        stage.card(stage.matte(), 0, 5);
        stage.card(stage.matte(), 1);
        stage.watch({r.x, 0, 0}, {0, 0, 0.5f});
        EXPECT_NEAR(stage.middle().x, r.want, 0.03f) << r.x;
    }
}

TEST(Render, ShadowRaysAreColouredByAllTheyGoThrough)
{
    Stage::Values const pane{{"u_reflectance", 0.5f}, {"u_refractColor", Vec3f(0.8f, 0.5f, 1)}};
    Stage::Values const glass{{"u_reflectance", 0.04f}, {"u_absorptionCoef", Vec3f(1, 0.5f, 0)}};
    auto const decades = [](float d) { return std::pow(10.0f, d); };
    float const through = 0.96f * 0.96f;
    struct Row {
        char const* why;
        char const* className;
        Stage::Values values;
        Vec3f want;
    };
    Row const rows[] = {
        {"two faces of a pane, each 1 - 0.5^2 of its colour",
         "corvid_Mtl_Glazing",
         pane,
         {0.36f, 0.140625f, 0.5625f}},
        {"half a unit of absorbing glass, not the way to it",
         "corvid_Mtl_Dielectric",
         glass,
         {through * decades(-0.5f), through * decades(-0.25f), through}},
        {"opaque to shadow rays by definition", "corvid_Mtl_ShadowPlane", {}, {0, 0, 0}},
        {"no shadow by definition", "corvid_Mtl_Unlit", {}, {1, 1, 1}},
        {"no way through without a transmission", "corvid_Mtl_Solid", {}, {0, 0, 0}},
    };
    auto const sumOfLights = [](IShaderAPI* api, ShadeState& s) {
        Vec3f sum{0, 0, 0};
        for (LightSample const* l = api->getLightSamples(0, &s.P, &s.N); l; l = l->next)
            sum += l->color * l->shadow * l->weight;
        s.Ci = withAlpha(sum, 1);
    };
    for (Row const& row : rows) {
        Stage stage;
        stage.lamp({0, 0, 5});
        stage.card(stage.probe(sumOfLights));
        stage.slab(stage.material(row.className, row.values), 1.5f, 0.5f, 1);
        stage.slab(stage.material("corvid_Mtl_Glazing", pane), 6, 0.5f, 1); // beyond the light
        stage.watch({0, 0, 0}, {0, 0, 0.5f});
        expectNear(stage.middle(), withAlpha(row.want, 1), 1e-4f, row.why);
    }
}

TEST(Render, TheRecordTellsRaysAndMedia)
{
    // Water inside glass; every ray goes straight on. The camera ray goes down through both to the
    // ground, from where a shadow ray comes up again beside it.
    std::vector<std::array<float, 7>> seen; // type, depth, z of E, P and I, indices
    auto const note = [&](ShadeState const& s) {
        seen.push_back({static_cast<float>(s.rayType), static_cast<float>(s.rayDepth), s.E.z, s.P.z,
                        s.I.z, s.incomingIor, s.beyondIor});
    };
    auto const shade = [&](IShaderAPI* api, ShadeState& s) {
        note(s);
        s.Ci = withAlpha(api->traceRefraction(&s.P, &s.I, 0, 1), 1);
    };
    auto const transmit = [&](IShaderAPI*, ShadeState& s) {
        note(s);
        s.transmissionColor = {0.5f, 0.5f, 0.5f};
    };
    auto const ground = [&](IShaderAPI* api, ShadeState& s) {
        note(s);
        LightSample const* const l = api->getLightSamples(0, &s.P, &s.N);
        ASSERT_TRUE(l && !l->next);
        EXPECT_NEAR(l->weight, 1, 1e-5f);
        s.Ci = withAlpha(l->color * l->shadow, 1);
    };
    Stage stage;
    stage.scene.film.width = stage.scene.film.height = 1;
    stage.lamp({0, 0, 8});
    stage.slab(stage.probe(shade, transmit, 1.5f), 6, 4, 3);
    stage.slab(stage.probe(shade, transmit, 1.33f), 5, 2, 2);
    stage.card(stage.probe(ground), 0, 5);
    stage.watch({0, 0, 0}, {0, 0, 9});
    EXPECT_FLOAT_EQ(pixel(stage.render(1), 0, 0).x, 0.0625f);

    std::array<float, 7> const want[] = {
        {kRayCamera, 0, 9, 6, -1, 1, 1.5f},         {kRayReflection, 1, 6, 5, -1, 1.5f, 1.33f},
        {kRayReflection, 2, 5, 3, -1, 1.33f, 1.5f}, {kRayReflection, 3, 3, 2, -1, 1.5f, 1},
        {kRayReflection, 4, 2, 0, -1, 1, 1},        {kRayShadow, 5, 0, 2, 1, 1, 1.5f},
        {kRayShadow, 5, 2, 3, 1, 1.5f, 1.33f},      {kRayShadow, 5, 3, 5, 1, 1.33f, 1.5f},
        {kRayShadow, 5, 5, 6, 1, 1.5f, 1},
    };
    ASSERT_EQ(seen.size(), std::size(want));
    for (std::size_t i = 0; i < seen.size(); ++i)
        for (std::size_t k = 0; k < 7; ++k)
            EXPECT_NEAR(seen[i][k], want[i][k], 1e-5f) << "hit " << i << ", number " << k;
}

TEST(Render, AnIgnoredHitIsAsIfNothingWereThere)
{
    Stage stage;
    for (float z : {1.0f, 2.0f, 3.0f})
        stage.card(stage.mirror(1, kWhite), z);
    stage.card(stage.probe([](IShaderAPI*, ShadeState& s) {
        s.Ci = {static_cast<float>(s.rayType), static_cast<float>(s.rayDepth), s.E.z, 1};
    }));
    stage.watch({0, 0, 0}, {0, 0, 4});
    expectNear(stage.middle(), {1, 0, 4, 1}, 0, "type, depth, z of the ray's origin");
}

TEST(Render, AContinuedRayKeepsItsDepth)
{
    Stage stage;
    stage.card(stage.probe(
                   [](IShaderAPI* api, ShadeState& s) { s.Ci = api->traceThrough(&s.P, &s.I, 1); }),
               2);
    stage.card(stage.probe([](IShaderAPI*, ShadeState& s) {
        s.Ci = {static_cast<float>(s.rayType), static_cast<float>(s.rayDepth), s.E.z, 1};
    }));
    stage.watch({0, 0, 0}, {0, 0, 4});
    expectNear(stage.middle(), {kRayTransmission, 0, 2, 1}, 0,
               "type, depth, z of the ray's origin");
}

TEST(Render, AMirrorSeesTheEnvironmentAndNothingThatHidesFromIt)
{
    Sky const directions([](Vec3f d) { return (d + kWhite) * 0.5f; });
    Stage stage;
    stage.sky(directions);
    stage.card(stage.mirror(0.5f));
    stage.card(stage.material("corvid_Mtl_Unlit"), 8, 9);
    stage.watch({0, 0, 0}, {std::sqrt(3.0f), 0, 1}); // 60 degrees off the normal
    float const F = 0.92f + 0.08f / 32;
    Vec3f const mirrored{-std::sqrt(0.75f), 0, 0.5f};
    expectNear(stage.middle(), withAlpha((mirrored + kWhite) * (0.25f * F), 1), 1e-4f,
               "mirrored direction");
}

TEST(Render, AlphaIsWhatStandsBeforeThePlate)
{
    struct Row {
        char const* why;
        char const* className;
        Stage::Values values;
        bool covered;
        Vec4f want;
    };
    Row const rows[] = {
        {"solid: its colour, opaque",
         "corvid_Mtl_Solid",
         {{"patchState", 2}},
         false,
         {0.85f, 0.85f, 0.85f, 1}},
        {"half a black mirror: alpha of what lies behind",
         "corvid_Mtl_Mirror",
         {{"u_tintColor", grey(0)}, {"maskingColor", grey(0.5f)}},
         false,
         {0.1f, 0.2f, 0.3f, 0}},
        {"catcher in the light: not there",
         "corvid_Mtl_ShadowPlane",
         {},
         false,
         {0.2f, 0.4f, 0.6f, 0}},
        {"catcher in full shadow, which is 0.7 strong",
         "corvid_Mtl_ShadowPlane",
         {},
         true,
         {0.06f, 0.12f, 0.18f, 0.7f}},
    };
    for (Row const& row : rows) {
        Stage stage;
        stage.sky(kWhiteSky, {0.2f, 0.4f, 0.6f});
        stage.scene.settings.occlusionDistance = 1;
        stage.lamp({0, 0, 5});
        stage.card(stage.material(row.className, row.values));
        if (row.covered)
            stage.card(stage.matte(), 2);
        expectNear(stage.middle(), row.want, 1e-5f, row.why);
    }
}

TEST(Render, ChainsOfRaysEndAtRandomWithoutLoss)
{
    // Two cards that face each other glow with 1 and send on what they see: a geometric series, cut
    // off where the depth ends.
    struct Row {
        float kept, importance;
        int rays, depth, samples;
        float want, tolerance;
    };
    for (Row const& r :
         {Row{0.5f, 0.5f, 1, 2, 1, 1.75f, 1e-5f}, Row{0.9f, 0.9f, 1, 1, 1, 1.9f, 1e-5f},
          Row{0.8f, 0.8f, 1, 1000, 256, 5, 0.1f}, Row{0.01f, 0.01f, 1, 1000, 64, 1.0101f, 0.003f},
          // Rays that say they count for all, and fork: 2^1000 if nothing ended them.
          Row{0.25f, 1.5f, 2, 1000, 16, 2, 0.1f}}) {
        auto const glow = [&](IShaderAPI* api, ShadeState& s) {
            Vec3f const back = -s.I;
            Vec3f sent(0, 0, 0);
            for (int i = 0; i < r.rays && s.rayDepth < static_cast<std::uint32_t>(r.depth); ++i)
                sent += api->traceReflection(&s.P, &back, r.importance) * r.kept;
            s.Ci = withAlpha(kWhite + sent, 1);
        };
        Stage stage;
        stage.scene.settings.maxDepth = r.depth + 1;
        stage.scene.settings.samples = r.samples;
        stage.card(stage.probe(glow));
        stage.card(stage.probe(glow), 2);
        EXPECT_NEAR(mean(stage.render()).x, r.want, r.tolerance) << r.kept << ' ' << r.depth;
    }
}

// Rays that have reached their depth do not look through walls: a closed room is dark.
TEST(Render, ASealedRoomIsBlack)
{
    for (char const* integrator : kIntegrators)
        for (int const depth : {1, 3, 64}) {
            Stage stage;
            stage.sky(kWhiteSky, kWhite);
            stage.scene.settings.integrator = integrator;
            stage.scene.settings.maxDepth = depth;
            stage.scene.settings.samples = 16;
            stage.add(host::boxMesh({4, 4, 4}), stage.matte(), {0, 0, 0});
            stage.watch({0, 0, -2}, {0, 0, 3});
            EXPECT_EQ(mean(stage.render()).x, 0.0f) << integrator << depth;
        }
}

// A white floor with a white wall around it, whose light the sky alone brings: what stands in the
// way of indirect light darkens it once, by rays, not once more by the occlusion that goes with it.
TEST(Render, IndirectLightIsOccludedOnce)
{
    float const tops[] = {0.5f, 2.0f};
    for (float const top : tops) {
        Vec4f seen[2];
        for (int i = 0; i < 2; ++i) {
            Stage stage;
            stage.sky(kWhiteSky);
            stage.scene.settings.integrator = kIntegrators[i];
            stage.scene.settings.samples = 64;
            stage.card(stage.matte(), 0, 2);
            for (int side = 0; side < 4; ++side) {
                float const x = side == 0 ? 1.05f : side == 1 ? -1.05f : 0;
                float const y = side == 2 ? 1.05f : side == 3 ? -1.05f : 0;
                stage.add(host::boxMesh({side < 2 ? 0.1f : 2.2f, side < 2 ? 2.2f : 0.1f, top}), 0,
                          {x, y, top / 2});
            }
            stage.watch({0, 0, 0}, {0, 0, 3});
            seen[i] = mean(stage.render());
        }
        EXPECT_NEAR(seen[0].x / seen[1].x, 1, 0.02f) << top;
        // Albedo 1: nothing is lost between walls, all light that comes in goes out again.
        EXPECT_NEAR(seen[1].x, 1, 0.03f) << top;
    }
}

// Within a ball of albedo a, around a point light that brings c, every point shows a c / (1 - a).
TEST(Render, LightBouncesUntilItIsUsedUp)
{
    host::Mesh inside = host::sphereMesh(2, 64);
    for (Vec3f& n : inside.normals)
        n = -n;
    for (auto& t : inside.triangles)
        std::swap(t[1], t[2]);
    for (float const albedo : {0.5f, 0.8f})
        for (char const* integrator : kIntegrators) {
            Stage stage;
            stage.scene.settings.integrator = integrator;
            stage.scene.settings.samples = 64;
            stage.add(inside, stage.matte(), {0, 0, 0});
            stage.scene.materials[0].set("u_diffuseColor", grey(albedo));
            stage.scene.lights.push_back(host::PointLight{{0, 0, 0}, grey(4)});
            stage.watch({0, 0, -2}, {0, 0, 1});
            EXPECT_NEAR(mean(stage.render()).x * (1 - albedo) / albedo, 1, 0.03f)
                << integrator << albedo;
        }
}

// A sky of one lamp of 1e5, 1.4 degrees across: drawn by chance one ray in 13,000 would meet it. A
// surface under it shows its irradiance, by the light's own direction and by the surface's.
TEST(Render, SmallLampsInTheSkyAreFound)
{
    Vec3f const lamp = normalize(Vec3f(0.48f, 0.6f, 0.64f));
    float const edge = std::cos(0.012217f);
    Sky const sky([&](Vec3f d) { return dot(d, lamp) > edge ? grey(1e5f) : grey(0.1f); });
    float const want = 0.1f + 1e5f * 2 * (1 - edge) * 0.64f; // solid angle times cosine over pi
    for (char const* integrator : kIntegrators) {
        Stage stage;
        stage.scene.settings.integrator = integrator;
        stage.scene.settings.samples = 64;
        stage.scene.settings.maxDepth = 1;
        stage.sky(sky);
        stage.card(stage.matte());
        stage.watch({0, 0, 0}, {0, 0, 1});
        EXPECT_NEAR(mean(stage.render()).x / want, 1, 0.05f) << integrator;
        stage.card(0, 1, 4); // a lid
        stage.watch({0, 0, 0}, {0, 0, 0.5f});
        EXPECT_NEAR(mean(stage.render()).x, 0, 0.02f) << "shadow, " << integrator;
    }
}

// Materials that draw directions of their own share such a lamp with their lights' list: it shows
// as a sun of its width and brightness does, which stands in the list alone.
TEST(Render, LampsInTheSkyAreSharedWithDrawnRays)
{
    Vec3f const lamp = normalize(Vec3f(0.48f, 0.6f, 0.64f));
    float const edge = std::cos(0.012217f);
    Sky const lit([&](Vec3f d) { return dot(d, lamp) > edge ? grey(1e5f) : grey(0.1f); });
    Sky const plain([](Vec3f) { return grey(0.1f); });
    for (auto const& entry : std::vector<std::pair<std::string, Stage::Values>>{
             {"corvid_Mtl_Metal", {{"u_roughValue", 0.5f}}},
             {"corvid_Mtl_MetallicPaint", {{"u_flakeDensity", 0.0f}, {"u_coatRoughValue", 0.3f}}},
             {"MarlowLegacy", {{"transparencyMode", -1}, {"usingHDRbuffer", true}}}})
        for (char const* integrator : kIntegrators) {
            auto const shown = [&](Sky const& sky, float sun) {
                Stage stage;
                stage.scene.settings.integrator = integrator;
                stage.scene.settings.samples = 64;
                stage.scene.settings.maxDepth = 1;
                stage.sky(sky);
                stage.card(stage.material(entry.first, entry.second));
                if (sun > 0.0f)
                    stage.scene.lights.push_back(host::SunLight{lamp, grey(sun), 1.4f});
                stage.watch({0, 0, 0}, {-0.5f, -0.4f, 1});
                return mean(stage.render()).z;
            };
            float const want = shown(plain, 1e5f * 2 * (1 - edge));
            EXPECT_NEAR(shown(lit, 0) / want, 1, 0.03f) << entry.first << ' ' << integrator;
        }
}

TEST(Render, SurfaceLightsAreSeenAndLightTheirSurroundings)
{
    struct Row {
        char const* why;
        host::Mesh mesh;
        Vec3f at;
        float want; ///< radiance 1 over the projected solid angle / pi
    };
    float const x = 0.5f;
    for (Row const& r :
         {Row{"disc of radius 1 at height 2: sin^2", host::discMesh(1), {0, 0, 2}, 0.2f},
          Row{"square, four corner rectangles (Howell, configuration B-4)",
              host::planeMesh({2, 2}),
              {0, 0, 2},
              4 / 3.14159265f * (x / std::sqrt(1 + x * x) * std::atan(x / std::sqrt(1 + x * x)))},
          Row{"ball of radius 1/2 at distance 2", host::sphereMesh(0.5f, 64), {0, 0, 2}, 0.0625f}})
        for (char const* integrator : kIntegrators) {
            Stage stage;
            stage.scene.settings.integrator = integrator;
            stage.scene.settings.samples = 256;
            stage.scene.settings.maxDepth = 2;
            stage.card(stage.matte());
            stage.add(r.mesh, -1, r.at);
            host::Instance& shining = stage.scene.instances.back();
            if (r.mesh.positions.size() < 200) // flat: faces down
                shining.objectToWorld.m[5] = shining.objectToWorld.m[10] = -1;
            shining.light = 0;
            stage.scene.lights.push_back(host::SurfaceLight{1, kWhite});
            stage.watch({0, 0, 0}, {0, 0, 0.5f});
            EXPECT_NEAR(mean(stage.render()).x, r.want, 0.015f * r.want) << r.why << integrator;
            stage.watch(r.at, {0, 0, -1});
            expectNear(stage.middle(), {1, 1, 1, 1}, 0, "seen from below");
            stage.watch(r.at + Vec3f(0, 0, 1), {0, 0, 1});
            if (r.mesh.positions.size() < 200)
                expectNear(stage.middle(), {0, 0, 0, 1}, 0, "black from behind");
            stage.slab(0, r.at.z + 2.5f, 0.5f, 1);
            stage.watch(r.at + Vec3f(0, 0, 2), {0, 0, -0.5f});
            EXPECT_EQ(mean(stage.render()).x > 0, r.mesh.positions.size() > 200)
                << "lights what lies behind: " << r.why;
        }
}

// A chequered floor, every other texel white: from afar a sample sees the mean of many texels,
// close up and through a magnified map the texels themselves; rays by way of a mirror keep on
// widening.
TEST(Render, MapsAreReadAsWideAsARayLooks)
{
    struct Chequer final : HostTexture2D { // tells the width that it is asked for
        mutable std::vector<float> widths;
        void reserved0() override { }
        void reserved1() override { }
        void lookup(Vec4f* result, Vec2f const*) const override
        {
            *result = {1, 1, 1, 1};
            widths.push_back(host::TextureFootprint::width());
        }
    };
    Mat3f magnified = Mat3f::identity();
    magnified.m[0] = magnified.m[4] = 0.1f;
    constexpr float kFov = 40, kHalfPixel = 0.36397023f / 8; // tan 20 degrees
    struct Row {
        char const* what;
        float distance, scale;
        bool mirrored;
        float want; // width, of a floor 50 wide
    };
    for (char const* integrator : kIntegrators)
        for (Row const& r : {Row{"near", 2, 1, false, 2 * kHalfPixel / 50},
                             Row{"far", 50, 1, false, 50 * kHalfPixel / 50},
                             Row{"magnified map", 2, 0.1f, false, 2 * kHalfPixel / 500},
                             Row{"mirror", 3, 1, true, (3 + 3) * kHalfPixel / 50}}) {
            Chequer const chequer;
            HostTexture2D const* const map = &chequer;
            Stage stage;
            stage.scene.settings.integrator = integrator;
            stage.card(stage.material(
                           "corvid_Mtl_Ward",
                           {{"u_diffuseMapEnable", true},
                            {"u_diffuseMap", map},
                            {"u_diffuseTransform", r.scale < 1 ? magnified : Mat3f::identity()}}),
                       0, 25);
            stage.sky(kWhiteSky);
            stage.watch({0, 0, 0}, {0, 0, r.distance});
            if (r.mirrored) {
                stage.card(stage.mirror(1), 3, 2);
                stage.scene.instances.back().objectToWorld.m[10] = -1; // faces down
                stage.watch({0, 0, 3}, {0, 0, -r.distance + 0.001f});
            }
            stage.scene.camera.verticalFov = kFov;
            stage.render(1);
            std::erase(chequer.widths, 0.0f); // asked while the materials were prepared
            ASSERT_FALSE(chequer.widths.empty()) << r.what;
            std::sort(chequer.widths.begin(), chequer.widths.end());
            float const middle = chequer.widths[chequer.widths.size() / 2];
            // Towards the corners rays are up to 1.13 times as long.
            EXPECT_GE(middle, r.want * 0.99f) << r.what << ' ' << integrator;
            EXPECT_LE(middle, r.want * 1.14f) << r.what << ' ' << integrator;
        }
}

TEST(Render, BrokenResultsAreCountedAndStayAlone)
{
    float const nan = std::numeric_limits<float>::quiet_NaN();
    float const most = std::numeric_limits<float>::max();
    host::RenderReport report;
    Stage direct;
    direct.scene.settings.samples = 64;
    direct.card(direct.probe([&](IShaderAPI* api, ShadeState& s) {
        float const bad = api->random() < 0.25f ? nan : std::numeric_limits<float>::infinity();
        s.Ci = api->random() < 0.5f ? Vec4f(1, bad, 1, 1) : Vec4f(1, 1, 1, 1);
    }));
    expectNear(mean(direct.render(2, &report)), {1, 1, 1, 1}, 0, "what is left is whole");
    EXPECT_NEAR(static_cast<double>(report.nonFinite), 64 * 64 / 2, 150);
    EXPECT_EQ(report.nonFiniteOf, (std::vector<std::uint64_t>{report.nonFinite, 0})) << "whose";

    Stage lit;
    lit.lamp({0, 0, 5}, {nan, 1, 1});
    lit.lamp({0, 0, 5});
    lit.card(lit.matte());
    expectNear(mean(lit.render(2, &report)), {1, 1, 1, 1}, 1e-5f, "the good one of two lights");
    EXPECT_EQ(report.nonFinite, 64u);

    Stage huge;
    huge.scene.settings.samples = 16;
    huge.card(huge.probe([&](IShaderAPI*, ShadeState& s) { s.Ci = {most, 1, 1, 1}; }));
    EXPECT_EQ(huge.middle().x, 0x1p40f) << "what a film takes at most";
}

TEST(Render, PicturesRepeatBitForBitOverThreadsSeedsAndCrops)
{
    for (char const* integrator : kIntegrators) {
        // Something of everything that draws random numbers.
        Stage stage;
        stage.sky(kWhiteSky, {0.1f, 0.2f, 0.3f});
        stage.scene.settings.samples = 5;
        stage.scene.settings.integrator = integrator;
        stage.scene.film.width = 41;
        stage.scene.film.height = 35;
        stage.lamp({2, -2, 4}).radius = 0.5f;
        stage.card(stage.matte(true), 0, 4);
        stage.add(host::sphereMesh(0.7f, 24),
                  stage.material("corvid_Mtl_Dielectric", {{"u_roughValue", 0.2f}}),
                  {-0.8f, 0, 0.7f});
        stage.add(host::sphereMesh(0.7f, 24),
                  stage.material("corvid_Mtl_Ward",
                                 {{"u_reflectGlossyValue", 0.3f},
                                  {"u_diffuseColor", Vec3f(0.5f, 0.1f, 0.1f)}}),
                  {0.8f, 0, 0.7f});
        stage.watch({0, 0, 0.5f}, {0, -4, 1.5f});
        stage.scene.camera.verticalFov = 40;
        stage.scene.camera.lensRadius = 0.05f;

        host::RenderReport one, many;
        host::Picture const picture = stage.render(1, &one);
        for (int threads : {2, 5}) {
            EXPECT_EQ(stage.render(threads, &many).rgba(), picture.rgba()) << threads << integrator;
            EXPECT_EQ(many.rays, one.rays);
        }

        stage.scene.film.crop = {7, 3, 40, 21};
        host::Picture const part = stage.render();
        ASSERT_TRUE(part.width() == 33 && part.height() == 18);
        for (int y = 0; y < part.height(); ++y)
            for (int x = 0; x < part.width(); ++x)
                expectNear(pixel(part, x, y), pixel(picture, x + 7, y + 3), 0, "crop");

        stage.scene.film.crop.reset();
        stage.scene.settings.seed = 2;
        host::Picture const other = stage.render();
        EXPECT_NE(other.rgba(), picture.rgba());
        expectNear(mean(other), mean(picture), 0.05f, "another seed is other noise alone");
    }
}

TEST(Render, ACancelledRenderEndsSoon)
{
    std::atomic<bool> cancel{false};
    host::RenderOptions options;
    options.cancel = &cancel;
    host::RenderReport report;
    Stage stage;
    stage.card(stage.probe([&](IShaderAPI*, ShadeState&) { cancel = true; }));
    stage.scene.film.width = stage.scene.film.height = 512;
    host::render(stage.scene, options, &report);
    EXPECT_LT(report.rays.sum(), 1000u) << "of 262144";
}

} // namespace
} // namespace zsi::test
