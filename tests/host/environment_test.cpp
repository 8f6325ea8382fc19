// SPDX-License-Identifier: Apache-2.0
// What the camera sees where it meets nothing.
#include "scene/resize.h"
#include "support/hostScene.h"

#include <gtest/gtest.h>

namespace zsi::test {
namespace {

TEST(Environment, IsSeenAsItIsReflectedWhereItIsVisible)
{
    Sky const sky([](Vec3f d) { return d.z < -0.5f ? Vec3f(2, 3, 4) : kWhite; });
    for (char const* integrator : {"shade", "path"}) {
        Stage stage;
        stage.scene.settings.integrator = integrator;
        stage.sky(sky, {1, 0, 0});
        Vec4f const hidden = stage.middle();
        stage.scene.environmentVisible = true;
        Vec4f const seen = stage.middle(); // of what lies below
        EXPECT_TRUE(rgb(hidden) == Vec3f(1, 0, 0) && hidden.w == 0.0f) << integrator;
        EXPECT_TRUE(rgb(seen) == Vec3f(2, 3, 4) && seen.w == 1.0f) << integrator;
    }
}

/// A picture that tells where it is looked up.
class Plate final : public HostTexture2D {
public:
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Vec2f const* uv) const override { *result = {uv->x, uv->y, 1, 1}; }
};

TEST(Environment, ABackplateKeepsItsPlaceWhateverTheSize)
{
    Plate const plate;
    HostTexture2D const* const picture = &plate;
    for (Vec2f const stated : {Vec2f(-1, -1), Vec2f(16, 8)})
        for (auto const& [width, height] : {std::pair{16, 8}, {32, 16}, {64, 16}}) {
            Stage stage;
            stage.scene.film.width = 16;
            stage.scene.film.height = 8;
            host::Shader shader = libraries().create("corvid_Env_Backplate");
            shader.set("useBackgroundImage", true);
            shader.set("backgroundImage", picture);
            shader.set("render_size", stated);
            shader.set("uv_scale", Vec2f(1.0f / 16, 1.0f / 8));
            stage.scene.environment = std::move(shader);
            host::resize(stage.scene, width, height);
            host::Picture const p = stage.render();
            ASSERT_EQ(p.width(), width);
            // Within a pixel of where it lies when the plate is two heights wide and in the middle.
            auto const w = static_cast<float>(width), h = static_cast<float>(height);
            for (int x = width / 2 - height + 1; x < width / 2 + height; x += 3) {
                Vec4f const seen = pixel(p, x, height / 4);
                float const u = 0.5f + (static_cast<float>(x) + 0.5f - w / 2) / (2 * h);
                EXPECT_NEAR(seen.x, u, 0.75f / h) << width;
                EXPECT_NEAR(seen.y, 0.75f - 0.5f / h, 1.5f / h) << width;
            }
            EXPECT_EQ(pixel(p, 4, height / 2).z == 1.0f, width < 64) << "beside it, the background";
        }
}

} // namespace
} // namespace zsi::test
