// SPDX-License-Identifier: Apache-2.0
// Models show what their format says: pictures of assets/models against numbers that
// tools/make_models.py works out.
#include "load/loadScene.h"
#include "render/render.h"
#include "support/hostScene.h"

#include <algorithm>
#include <fstream>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

namespace zsi::test {
namespace {

using Json = nlohmann::json;

constexpr int kWidth = 192, kHeight = 128;
/// Pixels around each place, whose mean counts.
constexpr int kAround = 2;

Vec3f meanAround(host::Picture const& picture, double x, double y)
{
    Vec3f sum{0, 0, 0};
    for (int dy = -kAround; dy <= kAround; ++dy)
        for (int dx = -kAround; dx <= kAround; ++dx)
            sum += rgb(pixel(picture, static_cast<int>(x * kWidth) + dx,
                             static_cast<int>(y * kHeight) + dy));
    constexpr int kSide = 2 * kAround + 1;
    return sum / static_cast<float>(kSide * kSide);
}

TEST(ModelPictures, ShowWhatTheFormatSays)
{
    std::filesystem::path const folder = std::filesystem::path(ZSI_SOURCE_DIR) / "assets/models";
    std::ifstream file(folder / "expected.json");
    Json const expected = Json::parse(file);
    ASSERT_GE(expected.size(), 9u);
    for (auto const& [name, model] : expected.items()) {
        host::Scene scene = host::loadScene(folder / name, libraries());
        scene.film.width = kWidth;
        scene.film.height = kHeight;
        scene.settings.samples = model["samples"];
        host::Picture const picture = host::render(scene, {});
        for (Json const& probe : model["probes"]) {
            Vec3f const got = meanAround(picture, probe["at"][0], probe["at"][1]);
            auto const want = probe["rgb"].get<std::array<float, 3>>();
            float const largest = std::max({want[0], want[1], want[2], 0.02f});
            float const within = probe["within"].get<float>() * largest;
            std::string const place = name + " at " + probe["at"].dump();
            EXPECT_NEAR(got.x, want[0], within) << place;
            EXPECT_NEAR(got.y, want[1], within) << place;
            EXPECT_NEAR(got.z, want[2], within) << place;
        }
    }
}

} // namespace
} // namespace zsi::test
