// Small pictures with known answers.
#include "support/hostScene.h"

#include <functional>
#include <gtest/gtest.h>
#include <limits>

namespace zsi::test {
namespace {

constexpr Vec3f kWhite{1, 1, 1};
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// An environment picture as a function of the world direction (z up).
class Sky final : public HostTextureCube {
public:
    explicit Sky(std::function<Vec3f(Vec3f)> light)
        : light_(std::move(light))
    {
    }
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Vec3f const* d) const override
    {
        *result = withAlpha(light_({d->x, -d->z, d->y}), 1.0f);
    }

private:
    std::function<Vec3f(Vec3f)> light_;
};

Sky const kWhiteSky([](Vec3f) { return kWhite; });

/// Entry points as functions; bounds a medium like glass where `ior` is not 0.
class Probe final : public MaterialShader {
public:
    using EntryPointFunction = std::function<void(IShaderAPI*, ShadeState&)>;

    Probe(EntryPointFunction shade, EntryPointFunction transmission, float ior = 0.0f)
        : u_ior(ior)
        , shade_(std::move(shade))
        , transmission_(std::move(transmission))
    {
    }
    void registerShader(IShaderManager* manager) override
    {
        manager->declareEntryPoints(this, kShade | (transmission_ ? kTransmission : 0));
        if (u_ior > 0.0f)
            manager->registerFloat(this, "u_ior", &u_ior);
    }
    void copy(IShaderBase const*) override { }
    void shade(IShaderAPI* api, ShadeState& state) const override { shade_(api, state); }
    void transmission(IShaderAPI* api, ShadeState& state) const override
    {
        transmission_(api, state);
    }

    float u_ior;

private:
    EntryPointFunction shade_, transmission_;
};

struct Stage : SceneBuilder {
    Stage() { scene.settings.samples = 1; }

    /// Every pixel looks at `point` from `offset` beside it.
    void watch(Vec3f point, Vec3f offset)
    {
        scene.camera.verticalFov = 1e-3f;
        lookAt(point + offset, point,
               std::fabs(offset.x) + std::fabs(offset.y) > 0 ? Vec3f(0, 0, 1) : Vec3f(0, 1, 0));
    }
    void sky(Sky const& sky, Vec3f background = {0, 0, 0})
    {
        HostTextureCube const* const cube = &sky;
        scene.environment = make("corvid_Env_Default",
                                 {{"globalIBLMatrix", Mat3f::identity()},
                                  {"reflectionCube", cube},
                                  {"diffuseCube", cube},
                                  {"backgroundColor", background}});
    }
    /// Neither distance nor angle dims it.
    host::Light& lamp(Vec3f position, Vec3f color = kWhite)
    {
        return light("voPointLight", position,
                     {{"color", color}, {"attenuationFactors", Vec3f(1e9f, 1, 0)}});
    }
    /// Nothing but a white diffuse layer.
    int matte(bool withOcclusion = false)
    {
        return material("corvid_Mtl_Ward",
                        {{"u_diffuseColor", kWhite},
                         {"u_brdf00Reflectivity", 0.0f},
                         {"u_brdf90Reflectivity", 0.0f},
                         {"usePrecalcAO", false},
                         {"usingRaytracedAO", withOcclusion}});
    }
    /// Shows the sum of the lights alone.
    int lightMeter()
    {
        return probe<Probe>(
            [](IShaderAPI* api, ShadeState& s) {
                Vec3f sum{0, 0, 0};
                for (LightSample const* l = api->getLightSamples(0, &s.P, &s.N); l; l = l->next)
                    sum += l->color * l->shadow * l->weight;
                s.Ci = withAlpha(sum, 1);
            },
            nullptr);
    }
    int mirror(float tint, Vec3f mask = {0, 0, 0})
    {
        return material("corvid_Mtl_Mirror",
                        {{"u_tintColor", Vec3f(tint, tint, tint)}, {"maskingColor", mask}});
    }
    Vec4f middle() const { return pixel(render(1), 4, 4); }
};

void expectNear(Vec4f got, Vec4f want, float tolerance, char const* why)
{
    EXPECT_NEAR(got.x, want.x, tolerance) << why;
    EXPECT_NEAR(got.y, want.y, tolerance) << why;
    EXPECT_NEAR(got.z, want.z, tolerance) << why;
    EXPECT_NEAR(got.w, want.w, tolerance) << why;
}

void expectNear(Vec3f got, Vec3f want, float tolerance, char const* why)
{
    expectNear(withAlpha(got, 0), withAlpha(want, 0), tolerance, why);
}

/// A slab: two faces of one closed thing, their normals outwards.
host::Mesh slab(float half, float thickness)
{
    host::Mesh m = square(half);
    auto const corners = static_cast<std::uint32_t>(m.positions.size());
    for (std::uint32_t i = 0; i < corners; ++i) {
        m.positions.push_back(m.positions[i] - Vec3f(0, 0, thickness));
        m.normals.push_back({0, 0, -1});
        m.uv.push_back(m.uv[i]);
        m.tangents.push_back(m.tangents[i]);
        m.bitangents.push_back(-m.bitangents[i]);
    }
    m.triangles.push_back({4, 6, 5});
    m.triangles.push_back({4, 7, 6});
    return m;
}

TEST(Render, AWhiteDiffuseSurfaceShowsTheLightThatArrives)
{
    for (char const* integrator : {"shade", "path"}) {
        Stage sky;
        sky.scene.settings.integrator = integrator;
        sky.sky(kWhiteSky);
        sky.add(square(1), sky.matte(true));
        sky.watch({0, 0, 0}, {1, 0, 1});
        expectNear(sky.middle(), {1, 1, 1, 1}, 1e-4f, integrator);

        for (float degrees : {0.0f, 30.0f, 60.0f}) {
            float const angle = degrees * 3.14159265f / 180;
            Stage lit;
            lit.scene.settings.integrator = integrator;
            lit.lamp({3 * std::sin(angle), 0, 3 * std::cos(angle)}, {1, 0.5f, 2});
            lit.add(square(1), lit.matte());
            lit.watch({0, 0, 0}, {0, 1, 1});
            float const c = std::cos(angle);
            expectNear(lit.middle(), {c, c / 2, 2 * c, 1}, 1e-4f, integrator);
        }
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
        stage.add(ball(p.radius, p.segments), stage.matte(true),
                  translation(p.at.x, p.at.y, p.at.z));
        stage.lookAt(p.at + Vec3f(0, -4 * p.radius, 0), p.at);
        host::Picture const picture = stage.render();
        for (int y = 0; y < 8; ++y)
            for (int x = 0; x < 8; ++x) {
                Vec4f const c = pixel(picture, x, y);
                EXPECT_NEAR(c.x, c.w, 1e-3f) << p.radius << " at pixel " << x << ' ' << y;
            }
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
        stage.add(square(5), stage.matte());
        stage.add(square(1), stage.matte(), translation(0, 0, 1));
        stage.watch({r.x, 0, 0}, {0, 0, 0.5f});
        EXPECT_NEAR(stage.middle().x, r.want, r.tolerance) << r.x << ", light radius " << r.radius;
    }
}

TEST(Render, ShadowRaysAreColouredByAllTheyGoThrough)
{
    SceneBuilder::Values const pane{{"u_reflectance", 0.5f},
                                    {"u_refractColor", Vec3f(0.8f, 0.5f, 1)}};
    SceneBuilder::Values const glass{{"u_reflectance", 0.04f},
                                     {"u_absorptionCoef", Vec3f(1, 0.5f, 0)}};
    auto const decades = [](float d) { return std::pow(10.0f, d); };
    float const through = 0.96f * 0.96f;
    struct Row {
        char const* why;
        char const* className;
        SceneBuilder::Values values;
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
    for (Row const& row : rows) {
        Stage stage;
        stage.lamp({0, 0, 5});
        stage.add(square(1), stage.lightMeter());
        stage.add(slab(1, 0.5f), stage.material(row.className, row.values), translation(0, 0, 1.5));
        stage.watch({0, 0, 0}, {0, 0, 0.5f});
        expectNear(rgb(stage.middle()), row.want, 1e-4f, row.why);
    }
}

TEST(Render, TheRecordTellsRaysAndMedia)
{
    // A ball of water in a ball of glass; every ray goes straight on. The camera ray goes down
    // through both to the ground, from where a shadow ray comes up again beside it.
    struct Seen {
        std::uint32_t type, depth;
        float E, P, I; ///< z
        float incoming, beyond;
    };
    std::vector<Seen> seen;
    auto const note = [&](ShadeState const& s) {
        seen.push_back({s.rayType, s.rayDepth, s.E.z, s.P.z, s.I.z, s.incomingIor, s.beyondIor});
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
    stage.add(slab(3, 4), stage.probe<Probe>(shade, transmit, 1.5f), translation(0, 0, 6));
    stage.add(slab(2, 2), stage.probe<Probe>(shade, transmit, 1.33f), translation(0, 0, 5));
    stage.add(square(5), stage.probe<Probe>(ground, nullptr));
    stage.watch({0, 0, 0}, {0, 0, 9});
    Vec4f const c = pixel(stage.render(1), 0, 0);
    EXPECT_FLOAT_EQ(c.x, 0.0625f);

    Seen const want[] = {
        {kRayCamera, 0, 9, 6, -1, 1, 1.5f},         {kRayReflection, 1, 6, 5, -1, 1.5f, 1.33f},
        {kRayReflection, 2, 5, 3, -1, 1.33f, 1.5f}, {kRayReflection, 3, 3, 2, -1, 1.5f, 1},
        {kRayReflection, 4, 2, 0, -1, 1, 1},        {kRayShadow, 5, 0, 2, 1, 1, 1.5f},
        {kRayShadow, 5, 2, 3, 1, 1.5f, 1.33f},      {kRayShadow, 5, 3, 5, 1, 1.33f, 1.5f},
        {kRayShadow, 5, 5, 6, 1, 1.5f, 1},
    };
    ASSERT_EQ(seen.size(), std::size(want));
    for (std::size_t i = 0; i < seen.size(); ++i) {
        Seen const &s = seen[i], &w = want[i];
        EXPECT_TRUE(s.type == w.type && s.depth == w.depth && s.incoming == w.incoming
                    && s.beyond == w.beyond)
            << "hit " << i << ": type " << s.type << " depth " << s.depth << " from " << s.incoming
            << " to " << s.beyond;
        EXPECT_NEAR(s.E, w.E, 1e-5f) << "hit " << i;
        EXPECT_NEAR(s.P, w.P, 1e-5f) << "hit " << i;
        EXPECT_NEAR(s.I, w.I, 1e-5f) << "hit " << i;
    }
}

TEST(Render, AnIgnoredHitIsAsIfNothingWereThere)
{
    Stage stage;
    for (float z : {1.0f, 2.0f, 3.0f})
        stage.add(square(1), stage.mirror(1, kWhite), translation(0, 0, z));
    auto const ground = [](IShaderAPI*, ShadeState& s) {
        s.Ci = {static_cast<float>(s.rayType), static_cast<float>(s.rayDepth), s.E.z, 1};
    };
    stage.add(square(1), stage.probe<Probe>(ground, nullptr));
    stage.watch({0, 0, 0}, {0, 0, 4});
    expectNear(stage.middle(), {1, 0, 4, 1}, 0, "type, depth, z of the ray's origin");
}

TEST(Render, AMirrorSeesTheEnvironmentAndNothingThatHidesFromIt)
{
    Sky const directions([](Vec3f d) { return (d + kWhite) * 0.5f; });
    Stage stage;
    stage.sky(directions);
    stage.add(square(1), stage.mirror(0.5f));
    stage.add(square(9), stage.material("corvid_Mtl_Unlit"), translation(0, 0, 8));
    stage.watch({0, 0, 0}, Vec3f(std::sqrt(3.0f), 0, 1)); // 60 degrees off the normal
    float const F = 0.92f + 0.08f / 32;
    Vec3f const mirrored{-std::sqrt(0.75f), 0, 0.5f};
    expectNear(rgb(stage.middle()), (mirrored + kWhite) * (0.25f * F), 1e-4f, "mirrored direction");
}

TEST(Render, AlphaIsWhatStandsBeforeThePlate)
{
    Vec3f const plate{0.2f, 0.4f, 0.6f};
    struct Row {
        char const* why;
        std::function<int(Stage&)> material;
        bool covered;
        Vec4f want;
    };
    Row const rows[] = {
        {"solid: its colour, opaque",
         [](Stage& s) {
             return s.material("corvid_Mtl_Solid", {{"patchState", 2}});
         },
         false,
         {0.85f, 0.85f, 0.85f, 1}},
        {"half a black mirror: alpha of what lies behind",
         [](Stage& s) {
             return s.mirror(0, {0.5f, 0.5f, 0.5f});
         },
         false,
         {0.1f, 0.2f, 0.3f, 0}},
        {"catcher in the light: not there",
         [](Stage& s) { return s.material("corvid_Mtl_ShadowPlane"); },
         false,
         {0.2f, 0.4f, 0.6f, 0}},
        {"catcher in full shadow, which is 0.7 strong",
         [](Stage& s) { return s.material("corvid_Mtl_ShadowPlane"); },
         true,
         {0.06f, 0.12f, 0.18f, 0.7f}},
    };
    for (Row const& row : rows) {
        Stage stage;
        stage.sky(kWhiteSky, plate);
        stage.scene.settings.occlusionDistance = 1;
        stage.lamp({0, 0, 5});
        stage.add(square(1), row.material(stage));
        if (row.covered)
            stage.add(square(1), stage.matte(), translation(0, 0, 2));
        stage.watch({0, 0, 0}, {0, 0, 1});
        expectNear(stage.middle(), row.want, 1e-5f, row.why);
    }
}

TEST(Render, MirrorsFaceEachOtherUntilTheDepthEnds)
{
    struct Row {
        char const* integrator;
        float tint;
        int depth, samples;
        float want, tolerance; ///< relative; 4 standard errors where rays end at random
    };
    // At the depth limit the sky answers, which is 1. Rays whose weight is low are traced with a
    // chance p and count 1/p: over n rays the relative error is sqrt((1/p - 1)/n).
    for (Row const& r : {Row{"shade", 1, 3, 1, 0.92f * 0.92f * 0.92f, 1e-5f},
                         Row{"shade", 0.1f, 4, 4096, std::pow(0.092f, 4.0f), 0.17f},
                         Row{"path", 0.5f, 6, 4096, std::pow(0.5f, 6.0f), 0.065f}}) {
        Stage stage;
        stage.sky(kWhiteSky);
        stage.scene.settings.integrator = r.integrator;
        stage.scene.settings.maxDepth = r.depth;
        stage.scene.settings.samples = r.samples;
        int const mirror = stage.mirror(r.tint);
        stage.add(square(1), mirror);
        stage.add(square(1), mirror, translation(0, 0, 2));
        stage.watch({0, 0, 0}, {0, 0, 1});
        EXPECT_NEAR(mean(stage.render()).x / r.want, 1, r.tolerance) << r.integrator << r.depth;
    }
}

TEST(Render, BrokenResultsAreCountedAndStayAlone)
{
    float const nan = std::numeric_limits<float>::quiet_NaN();
    auto const broken = [&](IShaderAPI* api, ShadeState& s) {
        float const bad = api->random() < 0.25f ? nan : kInfinity;
        s.Ci = api->random() < 0.5f ? Vec4f(1, bad, 1, 1) : Vec4f(1, 1, 1, 1);
    };
    Stage direct;
    direct.scene.settings.samples = 64;
    direct.add(square(1), direct.probe<Probe>(broken, nullptr));
    direct.watch({0, 0, 0}, {0, 0, 1});
    host::RenderReport report;
    expectNear(mean(direct.render(2, &report)), {1, 1, 1, 1}, 0, "what is left is whole");
    EXPECT_NEAR(static_cast<double>(report.nonFinite), 64 * 64 / 2, 150);

    Stage lit; // a broken light beside a good one, a broken surface in a mirror
    lit.lamp({0, 0, 5}, {nan, 1, 1});
    lit.lamp({0, 0, 5});
    lit.add(square(1), lit.matte());
    lit.watch({0, 0, 0}, {0, 0, 1});
    expectNear(mean(lit.render(2, &report)), {1, 1, 1, 1}, 1e-5f, "the good light");
    EXPECT_EQ(report.nonFinite, 64u);

    Stage huge; // finite, but their sum is not
    huge.scene.settings.samples = 16;
    float const most = std::numeric_limits<float>::max();
    huge.add(square(1),
             huge.probe<Probe>(
                 [&](IShaderAPI*, ShadeState& s) {
                     s.Ci = {most, 1, 1, 1};
                 },
                 nullptr));
    huge.watch({0, 0, 0}, {0, 0, 1});
    EXPECT_EQ(huge.middle().x, most);
}

/// Something of everything that draws random numbers.
Stage busy(char const* integrator)
{
    Stage stage;
    stage.sky(kWhiteSky, {0.1f, 0.2f, 0.3f});
    stage.scene.settings.samples = 5;
    stage.scene.settings.integrator = integrator;
    stage.scene.film.width = 41;
    stage.scene.film.height = 35;
    stage.scene.camera.verticalFov = 40;
    stage.scene.camera.lensRadius = 0.05f;
    stage.lamp({2, -2, 4}).radius = 0.5f;
    stage.add(square(4), stage.matte(true));
    stage.add(ball(0.7f, 24), stage.material("corvid_Mtl_Dielectric", {{"u_roughValue", 0.2f}}),
              translation(-0.8f, 0, 0.7f));
    stage.add(ball(0.7f, 24),
              stage.material(
                  "corvid_Mtl_Ward",
                  {{"u_reflectGlossyValue", 0.3f}, {"u_diffuseColor", Vec3f(0.5f, 0.1f, 0.1f)}}),
              translation(0.8f, 0, 0.7f));
    stage.lookAt({0, -4, 2}, {0, 0, 0.5f});
    return stage;
}

TEST(Render, PicturesRepeatBitForBitOverThreadsSeedsAndCrops)
{
    for (char const* integrator : {"shade", "path"}) {
        Stage stage = busy(integrator);
        host::RenderReport one, many;
        host::Picture const picture = stage.render(1, &one);
        for (int threads : {2, 5}) {
            EXPECT_EQ(stage.render(threads, &many).rgba, picture.rgba) << threads << integrator;
            EXPECT_EQ(many.rays, one.rays);
        }

        stage.scene.film.crop = {7, 3, 40, 21};
        host::Picture const part = stage.render();
        ASSERT_TRUE(part.width == 33 && part.height == 18);
        for (int y = 0; y < part.height; ++y)
            for (int x = 0; x < part.width; ++x)
                expectNear(pixel(part, x, y), pixel(picture, x + 7, y + 3), 0, "crop");

        stage.scene.film.crop.reset();
        stage.scene.settings.seed = 2;
        host::Picture const other = stage.render();
        EXPECT_NE(other.rgba, picture.rgba);
        expectNear(mean(other), mean(picture), 0.02f, "another seed is other noise alone");
    }
}

TEST(Render, ACancelledRenderEndsSoon)
{
    Stage stage = busy("shade");
    stage.scene.settings.samples = 1 << 20;
    std::atomic<bool> cancel{false};
    host::RenderOptions options;
    options.cancel = &cancel;
    host::RenderReport report;
    auto const stop = [&](IShaderAPI*, ShadeState&) { cancel = true; };
    stage.add(square(9), stage.probe<Probe>(stop, nullptr), translation(0, 0, -1));
    stage.scene.film.width = stage.scene.film.height = 512;
    stage.scene.settings.samples = 1;
    host::render(stage.scene, options, &report);
    EXPECT_LT(report.rays, 100000u);
}

} // namespace
} // namespace zsi::test
