// SPDX-License-Identifier: Apache-2.0
// Many lights, of which a few are asked.
#include "light/lights.h"
#include "support/hostScene.h"

#include <gtest/gtest.h>
#include <random>

namespace zsi::test {
namespace {

/// Lamps of every kind that a tree holds, over the ground about the origin.
void addLamps(Stage& stage, int count, std::mt19937& random)
{
    auto const in = [&](float a, float b) {
        return std::uniform_real_distribution<float>(a, b)(random);
    };
    for (int i = 0; i < count; ++i) {
        Vec3f const at(in(-5, 5), in(-5, 5), in(0.3f, 2));
        Vec3f const color = grey(std::exp(in(-4, 2)));
        if (i % 3 < 2) {
            host::PointLight light{at, color};
            if (i % 3 == 1) {
                light.axis = normalize(Vec3f(in(-1, 1), in(-1, 1), in(-1, 0.3f)));
                light.innerAngle = 20, light.angle = in(30, 170);
            }
            stage.scene.lights.push_back(light);
            continue;
        }
        stage.add(host::planeMesh({0.2f, 0.1f}), -1, at);
        host::Instance& lamp = stage.scene.instances.back();
        float const turn = in(0, 6), c = std::cos(turn), s = std::sin(turn);
        lamp.objectToWorld.m[5] = lamp.objectToWorld.m[10] = c;
        lamp.objectToWorld.m[6] = s, lamp.objectToWorld.m[9] = -s;
        lamp.light = static_cast<int>(stage.scene.lights.size());
        stage.scene.lights.push_back(
            host::SurfaceLight{static_cast<int>(stage.scene.instances.size()) - 1, color * 20});
    }
}

TEST(Lights, AFewStandForManyWithoutLoss)
{
    std::mt19937 random(7);
    Stage stage;
    addLamps(stage, 300, random);
    stage.scene.lights.push_back(host::SunLight{{0, 0, 1}, kWhite, 1});
    host::LightSet const lights(stage.scene);
    auto const next = [&] { return std::uniform_real_distribution<float>(0, 1)(random); };
    for (int point = 0; point < 24; ++point) {
        Vec3f const P(8 * next() - 4, 8 * next() - 4, 3 * next() - 0.5f);
        Vec3f const normal = normalize(Vec3f(next() - 0.5f, next() - 0.5f, next() - 0.3f));
        auto const brought = [&](std::size_t light) {
            auto const a = lights.arrival(light, P, normal, {0.3f, 0.6f});
            return a ? double(a->color.x * dot(a->L, normal)) : 0.0;
        };
        double want = 0, sum = 0, squares = 0;
        for (std::size_t i = 0; i < stage.scene.lights.size(); ++i)
            want += brought(i);
        constexpr int kTries = 4000;
        for (int i = 0; i < kTries; ++i) {
            double got = 0;
            std::size_t asked = 0;
            lights.forEach(P, normal, next, [&](std::size_t light, float scale) {
                got += brought(light) * double(scale);
                ++asked;
            });
            ASSERT_LE(asked, host::LightTree::kMost + 1);
            sum += got, squares += got * got;
        }
        double const mean = sum / kTries, variance = squares / kTries - mean * mean;
        EXPECT_NEAR(mean, want, 4.5 * std::sqrt(std::max(variance, 0.0) / kTries) + 1e-5 * want)
            << point;
        // Nine drawn evenly from 301 would have a deviation of several times the sum.
        EXPECT_LT(std::sqrt(variance), 1.2 * want + 1e-6) << point;
    }
}

TEST(Lights, BothIntegratorsShowTheSumOfMany)
{
    std::mt19937 random(3);
    for (char const* integrator : {"shade", "path"}) {
        Stage stage;
        stage.scene.settings.integrator = integrator;
        stage.scene.settings.samples = 64;
        stage.scene.settings.maxDepth = 1;
        stage.card(stage.matte(), 0, 5);
        double want = 0;
        for (int i = 0; i < 200; ++i) {
            float const x = 0.05f * static_cast<float>(i % 20) - 0.5f,
                        y = 0.1f * static_cast<float>(i / 20) - 0.5f;
            Vec3f const at(4 * x, 4 * y, i % 7 == 0 ? -1.0f : 0.5f); // some below the ground
            float const color = 0.01f * static_cast<float>(1 + i % 5);
            stage.scene.lights.push_back(host::PointLight{at, grey(color)});
            if (at.z > 0)
                want += double(color * at.z / (dot(at, at) * length(at)));
        }
        stage.watch({0, 0, 0}, {0, 0, 0.25f});
        EXPECT_NEAR(double(mean(stage.render()).x) / want, 1, 0.01) << integrator;
    }
}

} // namespace
} // namespace zsi::test
