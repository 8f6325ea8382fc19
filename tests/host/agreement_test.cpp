// SPDX-License-Identifier: Apache-2.0
// Paths show what shading shows: the same light, by two ways of gathering it.
#include "support/hostScene.h"

#include <gtest/gtest.h>

namespace zsi::test {
namespace {

/// One colour everywhere.
class Plain final : public HostTexture2D {
public:
    explicit Plain(float value)
        : value_(value)
    {
    }
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Vec2f const*) const override
    {
        *result = {value_, value_, value_, 1};
    }

private:
    float value_;
};

struct Estimate {
    Vec4f mean;
    float error; ///< standard, of the worst channel
};

/// Pixels all see the same and are drawn apart, so that their spread tells the error of the mean.
Estimate estimate(Stage& stage, char const* integrator)
{
    stage.scene.settings.integrator = integrator;
    host::Picture const picture = stage.render();
    Vec4f const middle = mean(picture);
    float const* const means[] = {&middle.x, &middle.y, &middle.z, &middle.w};
    std::size_t const pixels = picture.rgba().size() / 4;
    float worst = 0;
    for (std::size_t c = 0; c < 4; ++c) {
        double sum = 0;
        for (std::size_t i = 0; i < pixels; ++i) {
            double const d = static_cast<double>(picture.rgba()[4 * i + c] - *means[c]);
            sum += d * d;
        }
        auto const n = static_cast<double>(pixels);
        worst = std::max(worst, static_cast<float>(std::sqrt(sum / n / (n - 1))));
    }
    return {middle, worst};
}

TEST(Agreement, PathsShowWhatShadingShows)
{
    Sky const sky(
        [](Vec3f d) { return d.z > 0 ? Vec3f(0.9f, 0.7f, 0.5f) : Vec3f(0.1f, 0.3f, 0.6f); });
    Plain const part(0.4f);
    HostTexture2D const* const map = &part;
    Mat3f const identity = Mat3f::identity();
    using Values = Stage::Values;
    Values const layer{{"u_diffuseColor", Vec3f(0.8f, 0.5f, 0.3f)},
                       {"u_brdf00Reflectivity", 0.0f},
                       {"u_brdf90Reflectivity", 0.0f},
                       {"u_additionalColor", Vec3f(0, 0, 0)}};
    auto const with = [](Values values, Values const& more) {
        values.insert(values.end(), more.begin(), more.end());
        return values;
    };
    Values const leaf{{"u_transparency", true}, {"u_transparencyValue", 0.6f}, {"u_ior", 1.0f}};
    Values const glass{{"u_refractColor", Vec3f(0.9f, 0.8f, 0.7f)},
                       {"u_falloffEnable", true},
                       {"u_absorptionCoef", Vec3f(0.2f, 0.5f, 1.0f)}};
    struct Row {
        char const* what;
        char const* className;
        Values values;
        bool solid = false;
        float ambient = 0;
    };
    std::vector<Row> const rows{
        {"plain", "corvid_Mtl_Ward", layer},
        {"mask", "corvid_Mtl_Ward", with(layer, {{"maskingColor", Vec3f(0.2f, 0.5f, 0.9f)}})},
        {"hole", "corvid_Mtl_Ward", with(layer, {{"maskingColor", kWhite}})},
        {"mask over lobes", "corvid_Mtl_Metal", {{"maskingColor", Vec3f(0.7f, 0.5f, 0.2f)}}},
        {"cut-out", "corvid_Mtl_Ward",
         with(
             layer,
             {{"u_cutoutMapEnable", true}, {"u_cutoutMap", map}, {"u_cutoutTransform", identity}})},
        {"cut-out, mask and emission", "corvid_Mtl_Ward",
         with(layer,
              {{"u_cutoutMapEnable", true},
               {"u_cutoutMap", map},
               {"u_cutoutTransform", identity},
               {"maskingColor", grey(0.3f)},
               {"u_additionalColor", Vec3f(0.2f, 0.1f, 2.0f)}})},
        {"emission", "corvid_Mtl_Ward", with(layer, {{"u_additionalColor", Vec3f(0.2f, 3, 0.5f)}})},
        {"ambient light", "corvid_Mtl_Ward", layer, false, 0.3f},
        {"leaf", "corvid_Mtl_Ward", with(with(layer, leaf), {{"u_translucencyValue", 0.5f}})},
        {"leaf, cut out", "corvid_Mtl_Ward",
         with(with(layer, leaf),
              {{"u_translucencyValue", 0.5f},
               {"u_cutoutMapEnable", true},
               {"u_cutoutMap", map},
               {"u_cutoutTransform", identity}})},
        {"refracting body", "corvid_Mtl_Ward", with(with(layer, leaf), {{"u_ior", 1.4f}}), true},
        {"legacy mask",
         "MarlowLegacy",
         {{"maskingColor", Vec3f(0.2f, 0.5f, 0.9f)},
          {"transparencyMode", -1},
          {"specularColor", Vec3f(0, 0, 0)},
          {"specular2Color", Vec3f(0, 0, 0)},
          {"diffuseColor", grey(0.5f)},
          {"usingHDRbuffer", true}}},
        {"mirror, masked",
         "corvid_Mtl_Mirror",
         {{"u_tintColor", kWhite}, {"maskingColor", grey(0.3f)}}},
        {"glass", "corvid_Mtl_Dielectric", glass, true},
        {"rough glass", "corvid_Mtl_Dielectric", with(glass, {{"u_roughValue", 0.3f}}), true},
        {"pane",
         "corvid_Mtl_Glazing",
         {{"u_refractColor", Vec3f(0.9f, 0.8f, 0.7f)}, {"maskingColor", grey(0.2f)}},
         true},
    };
    for (Row const& row : rows)
        for (float const above : {1.0f, -1.0f}) {
            Stage stage;
            stage.sky(sky, {0.5f, 0.5f, 0.5f});
            stage.lamp({0.5f, 0.2f, 3}, {0.5f, 0.4f, 0.3f});
            stage.lamp({0.5f, 0.2f, -3}, {0.2f, 0.4f, 0.7f});
            stage.scene.settings.samples = 32;
            stage.scene.settings.ambient = grey(row.ambient);
            int const subject = stage.material(row.className, row.values);
            if (row.solid)
                stage.slab(subject, 0, 0.4f, 2);
            else
                stage.card(subject);
            stage.watch({0, 0, row.solid && above < 0 ? -0.4f : 0.0f}, {1, 0.5f, above});
            Estimate const shade = estimate(stage, "shade"), path = estimate(stage, "path");
            float const tolerance = 4 * std::hypot(shade.error, path.error) + 1e-3f;
            auto const near = [&](float a, float b, char const* channel) {
                EXPECT_NEAR(a, b, tolerance) << row.what << ", " << channel << above;
            };
            EXPECT_LT(tolerance, 0.05f) << row.what << ": too few samples to tell";
            near(path.mean.x, shade.mean.x, "red");
            near(path.mean.y, shade.mean.y, "green");
            near(path.mean.z, shade.mean.z, "blue");
            near(path.mean.w, shade.mean.w, "alpha");
        }
}

TEST(Agreement, GlassFollowsBeerAndSchlick)
{
    for (char const* integrator : {"shade", "path"}) {
        Stage stage;
        stage.sky(kWhiteSky);
        stage.slab(stage.material("corvid_Mtl_Dielectric",
                                  {{"u_reflectance", 0.0f},
                                   {"u_falloffEnable", true},
                                   {"u_absorptionCoef", Vec3f(0.5f, 1, 2)}}),
                   0, 0.4f, 2);
        stage.scene.settings.samples = 16;
        // Refracted at sin = 0.8 / 1.52, so that the way inside is 0.4 / cos of that.
        stage.watch({0, 0, 0}, {0.8f, 0, 0.6f});
        float const way = 0.4f / std::sqrt(1 - 0.64f / (1.52f * 1.52f));
        // Schlick at a cosine of 0.6: 0.4^5 is reflected.
        float const F = 0.01024f;
        Estimate const seen = estimate(stage, integrator);
        float const* const got[] = {&seen.mean.x, &seen.mean.y, &seen.mean.z};
        for (int i = 0; i < 3; ++i) {
            float const kept = std::pow(10.0f, -0.5f * static_cast<float>(1 << i) * way);
            EXPECT_NEAR(*got[i], F + (1 - F) * kept, 4 * seen.error + 2e-3f) << integrator << i;
        }
    }
}

TEST(Agreement, LightThroughALeafCountsOnce)
{
    // Half of the light that a disc of radius 1 sends from 2 above comes out below: 3 / 2 of 1 / 5.
    for (char const* integrator : {"shade", "path"}) {
        Stage stage;
        stage.scene.settings.samples = 64;
        stage.card(stage.material("corvid_Mtl_Ward",
                                  {{"u_diffuseColor", kWhite},
                                   {"u_brdf00Reflectivity", 0.0f},
                                   {"u_brdf90Reflectivity", 0.0f},
                                   {"u_additionalColor", Vec3f(0, 0, 0)},
                                   {"u_transparency", true},
                                   {"u_transparencyValue", 0.5f},
                                   {"u_translucencyValue", 1.0f}}));
        stage.add(host::discMesh(1), 0, {0, 0, 2});
        stage.scene.instances[1].objectToWorld.m[5] = -1; // turned to shine down
        stage.scene.instances[1].objectToWorld.m[10] = -1;
        stage.scene.instances[1].light = 0;
        stage.scene.lights.push_back(host::SurfaceLight{1, grey(3)});
        stage.watch({0, 0, 0}, {0, 0, -1});
        Estimate const seen = estimate(stage, integrator);
        EXPECT_NEAR(seen.mean.x, 0.3f, 4 * seen.error + 1e-3f) << integrator;
    }
}

} // namespace
} // namespace zsi::test
