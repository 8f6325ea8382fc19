// SPDX-License-Identifier: Apache-2.0
// A picture in shares: added up it is what one machine renders, or it is refused.
#include "film/filmFile.h"
#include "render/merging.h"
#include "support/hostScene.h"
#include "support/inputError.h"

#include <gtest/gtest.h>
#include <random>

namespace zsi::test {
namespace {

/// Noise in several layers, in a crop.
Stage noisy()
{
    Stage stage;
    stage.card(stage.probe([](IShaderAPI* api, ShadeState& s) {
        s.Ci = {api->random(), 3 * api->random(), s.rasterX, api->random()};
    }));
    stage.scene.film.width = 40;
    stage.scene.film.height = 30;
    stage.scene.film.crop = {3, 1, 38, 29};
    stage.scene.film.alpha = false;
    stage.scene.film.layers = {"normal", "objectId", "variance", "halves", "samples"};
    stage.scene.settings.samples = 13;
    return stage;
}

host::Unit rendered(host::Scene const& scene, host::RenderUnit const& place)
{
    host::Session session(scene);
    return *host::renderUnit(session, host::unitOriginOf(scene), place);
}

/// Random parts of a box.
void divide(host::RenderUnit const& box, std::mt19937& random, std::vector<host::RenderUnit>& parts)
{
    host::RenderUnit a = box, b = box;
    auto const cut = [&](auto& end, auto& begin, auto from, auto to) {
        if (to - from < 2)
            return false;
        end = begin = std::uniform_int_distribution(from + 1, to - 1)(random);
        return true;
    };
    unsigned const axis = random() % 4;
    bool const isCut = axis == 0 ? cut(a.pixels.x1, b.pixels.x0, box.pixels.x0, box.pixels.x1)
        : axis == 1              ? cut(a.pixels.y1, b.pixels.y0, box.pixels.y0, box.pixels.y1)
        : axis == 2 ? cut(a.samples.end, b.samples.begin, box.samples.begin, box.samples.end)
                    : false;
    if (!isCut) {
        parts.push_back(box);
        return;
    }
    divide(a, random, parts);
    divide(b, random, parts);
}

TEST(Units, AddUpToThePictureHoweverTheyAreDivided)
{
    Stage const stage = noisy();
    host::Picture const whole = stage.render();
    host::Session session(stage.scene);
    host::UnitOrigin const origin = host::unitOriginOf(stage.scene);
    std::mt19937 random(5);
    std::size_t most = 0;
    for (int round = 0; round < 12; ++round) {
        std::vector<host::RenderUnit> parts;
        divide({origin.window, {0, 13}}, random, parts);
        most = std::max(most, parts.size());
        std::shuffle(parts.begin(), parts.end(), random);
        host::Merging merging;
        for (host::RenderUnit const& place : parts) {
            ASSERT_TRUE(merging.units() == 0 || !merging.missing().empty());
            auto const bytes = host::unitBytes(*host::renderUnit(session, origin, place));
            merging.add("unit", host::readUnit("unit", bytes));
        }
        EXPECT_TRUE(merging.missing().empty());
        EXPECT_TRUE(merging.picture() == whole) << round;
    }
    EXPECT_GT(most, 12u);
}

TEST(Units, WhatIsMissingIsNamed)
{
    Stage const stage = noisy();
    host::Merging merging(host::unitOriginOf(stage.scene));
    merging.add("a", rendered(stage.scene, {{3, 1, 38, 10}, {0, 13}}));
    merging.add("b", rendered(stage.scene, {{3, 10, 20, 29}, {0, 5}}));
    EXPECT_EQ(merging.missingSamples(), (17u * 8 + 18 * 13) * 19);
    expectContains(merging.missingText(),
                   {"samples 5 to 13 of 3,10,20,29", "samples 0 to 13 of 20,10,38,29"});
    // What there is can be looked at: a pixel has the mean of its own samples.
    host::Picture const partial = merging.picture();
    EXPECT_EQ(partial.find("samples")->values.front(), 13);
    EXPECT_EQ(partial.find("samples")->values.back(), 0);
}

TEST(Units, OfAnotherPictureOrTwiceAreRefused)
{
    host::RenderUnit const first{{3, 1, 20, 29}, {0, 13}}, second{{20, 1, 38, 29}, {0, 13}};
    struct Row {
        void (*change)(host::Scene& scene);
        std::string message;
    };
    for (Row const& row : {
             Row{[](host::Scene& s) { s.settings.seed = 2; }, "is of seed 2, expected 1"},
             Row{[](host::Scene& s) { s.meshes[0].positions[0].x += 1e-6f; }, "is of scene "},
             Row{[](host::Scene& s) { s.film.height = 31; }, "is of size 40x31, expected 40x30"},
             Row{[](host::Scene& s) {
                     s.film.crop = {3, 1, 39, 29};
                 },
                 "is of crop 3,1,39,29"},
             Row{[](host::Scene& s) { s.settings.samples = 14; }, "samples 14, expected 13"},
             Row{[](host::Scene& s) { s.film.layers = {"normal"}; }, "is of layers beauty,normal"},
             Row{[](host::Scene& s) { s.instanceNames = {"other"}; }, "other names"},
         }) {
        Stage stage = noisy();
        host::Merging merging;
        merging.add("a.exr", rendered(stage.scene, first));
        row.change(stage.scene);
        host::Unit const other = rendered(stage.scene, second);
        expectContains(errorOf([&] { merging.add("b.exr", other); }),
                       {"b.exr: does not belong to a.exr: ", row.message});
        EXPECT_EQ(merging.units(), 1u);
    }
    Stage stage = noisy();
    host::Merging merging;
    merging.add("a.exr", rendered(stage.scene, first));
    host::Unit const over = rendered(stage.scene, {{19, 4, 21, 5}, {12, 13}});
    expectContains(errorOf([&] { merging.add("b.exr", over); }),
                   {"b.exr: has samples 12 to 13 of 19,4,21,5, of which a.exr has some"});
    host::Unit old = rendered(stage.scene, second);
    old.head.origin.version = "0.9";
    expectContains(
        errorOf([&] { merging.add("b.exr", host::readUnit("b.exr", host::unitBytes(old))); }),
        {"b.exr: ", "is of version 0.9, expected "});
    merging.add("c.exr", rendered(stage.scene, second));
    EXPECT_TRUE(merging.picture() == stage.render()) << "what was refused has left something";
    // Where noise decides, a unit alone cannot know what to render.
    stage.scene.settings.noise = 0.1f;
    expectContains(errorOf([&] { host::unitOriginOf(stage.scene); }), {"settings.noise"});
    stage.scene.settings.noise = 0;
    expectContains(errorOf([&] { rendered(stage.scene, {{2, 1, 9, 9}, {0, 1}}); }), {"2,1,9,9"});
    expectContains(errorOf([&] { rendered(stage.scene, {{3, 1, 9, 9}, {0, 14}}); }), {"0 to 14"});
}

TEST(Units, DamageIsNoticed)
{
    Stage const stage = noisy();
    host::RenderUnit const place{{5, 4, 30, 20}, {2, 6}};
    auto const whole = host::unitBytes(rendered(stage.scene, place));
    std::mt19937 random(3);
    int noticed = 0;
    constexpr int kRounds = 300;
    for (int round = 0; round < kRounds; ++round) {
        auto bytes = whole;
        if (round < 30)
            bytes.resize(bytes.size() * static_cast<unsigned>(round) / 30);
        else // one half of them in the header
            bytes[random() % (round % 2 ? bytes.size() : 3000)] ^=
                static_cast<unsigned char>(1u << random() % 8);
        std::string const error = errorOf([&] {
            host::Unit const unit = host::readUnit("x.exr", bytes);
            // Some bits of the file mean nothing, such as those of the rows' order.
            EXPECT_TRUE(unit.head.place == place) << round;
            EXPECT_TRUE(host::unitBytes(unit) == whole) << round;
        });
        noticed += error != "no error";
        EXPECT_TRUE(error == "no error" || error.starts_with("x.exr: ")) << error;
    }
    EXPECT_GT(noticed, kRounds * 2 / 3);
}

} // namespace
} // namespace zsi::test
