// SPDX-License-Identifier: Apache-2.0
// Renders that stop by themselves, and those that go on where another one was stopped.
#include "support/hostScene.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"

#include <fstream>
#include <gtest/gtest.h>

namespace zsi::test {
namespace {

namespace fs = std::filesystem;

/// Columns left of `border` are noise around 0.5, the others 0.5 as they are.
Stage noisyUpTo(float border, int width)
{
    Stage stage;
    stage.card(stage.probe([border](IShaderAPI* api, ShadeState& s) {
        float const fine = 4001 * api->random(); // a net is as uneven as chance here
        float const v = s.rasterX < border ? fine - std::floor(fine) : 0.5f;
        s.Ci = withAlpha(grey(v), 1);
    }));
    stage.scene.film.width = width;
    stage.scene.film.height = 40;
    stage.scene.settings.samples = 4096;
    stage.scene.settings.noise = 0.02f;
    return stage;
}

struct Rendered {
    host::Film film;
    host::RenderReport report;
};

Rendered rendered(Stage const& stage, host::RenderOptions const& options)
{
    host::Session session(stage.scene);
    Rendered r{session.newFilm(), {}};
    r.report = host::renderProgressively(session, r.film, options);
    return r;
}

TEST(Progressive, NoiseDecidesWhereSamplesGoAndThreadsDoNot)
{
    Stage const stage = noisyUpTo(40, 128);
    Rendered const one = rendered(stage, {.threads = 1}), many = rendered(stage, {.threads = 3});
    EXPECT_TRUE(one.film.picture() == many.film.picture());
    EXPECT_EQ(one.film.count(127, 20, 0), 16u) << "nothing to be gained";
    std::uint32_t const spent = one.film.count(8, 20, 0);
    EXPECT_TRUE(spent >= 32 && spent < 4096 && spent % 16 == 0) << spent;
    // Standard error over the brightness' root, as the limit has it; measured against the truth.
    double squares = 0;
    for (int y = 0; y < 40; ++y)
        for (int x = 0; x < 32; ++x) {
            auto const half = one.film.halves(x, y, 0, 0);
            double const off = static_cast<double>((half[0] + half[1]) / 2) - 0.5;
            squares += off * off / 0.5;
        }
    double const noise = std::sqrt(squares / (40 * 32));
    EXPECT_TRUE(noise > 0.012 && noise < 0.022) << noise;
}

TEST(Progressive, AnInterruptedRenderGoesOnToTheSameBits)
{
    TemporaryFolder const folder;
    for (bool const adaptive : {false, true}) {
        Stage stage = noisyUpTo(40, 70);
        stage.scene.film.crop = {3, 1, 64, 37};
        stage.scene.film.layers = {"normal", "objectId", "variance", "halves", "samples"};
        stage.scene.settings.samples = adaptive ? 4096 : 90;
        stage.scene.settings.noise = adaptive ? 0.03f : 0;
        host::Picture const whole = rendered(stage, {.threads = 2}).film.picture();
        host::RenderOptions options;
        options.threads = 2;
        options.checkpoint = folder.path / (adaptive ? "adaptive" : "plain");
        options.checkpointSeconds = 0;
        int runs = 0;
        for (bool complete = false; !complete; ++runs) {
            std::atomic<bool> stop = false;
            int calls = 0;
            options.cancel = &stop;
            options.progress = [&](host::RenderStatus const&) { stop = ++calls > 20 + 13 * runs; };
            Rendered const part = rendered(stage, options);
            complete = part.report.complete;
            if (complete) {
                EXPECT_TRUE(part.film.picture() == whole) << adaptive;
            }
            ASSERT_LT(runs, 100);
        }
        EXPECT_GT(runs, 2);
        if (adaptive)
            continue;
        // More samples are added to what is there.
        stage.scene.settings.samples = 100;
        options.progress = {};
        options.cancel = nullptr; // gone with its run
        Rendered const more = rendered(stage, options);
        host::RenderOptions const fresh{.threads = 1};
        EXPECT_TRUE(more.film.picture() == rendered(stage, fresh).film.picture());
        EXPECT_LT(more.report.surfaces, 61u * 36 * 11);
    }
}

TEST(Progressive, ACheckpointOfSomethingElseIsRefused)
{
    TemporaryFolder const folder;
    host::RenderOptions options;
    options.checkpoint = folder.path / "state";
    auto const small = [] {
        Stage stage = noisyUpTo(4, 8);
        stage.scene.settings.samples = 2;
        stage.scene.settings.noise = 0;
        return stage;
    };
    rendered(small(), options);
    struct Row {
        void (*change)(host::Scene& scene);
        std::string message;
    };
    for (Row const& row : {
             Row{[](host::Scene& s) { s.settings.seed = 2; }, "another scene"},
             Row{[](host::Scene& s) { s.meshes[0].positions[0].x += 1e-6f; }, "another scene"},
             Row{[](host::Scene& s) { s.film.height = 41; }, "another size"},
             Row{[](host::Scene& s) { s.film.layers = {"normal"}; }, "other layers"},
             Row{[](host::Scene& s) { s.settings.noise = 1; }, "other layers"},
         }) {
        Stage stage = small();
        row.change(stage.scene);
        expectContains(errorOf([&] { rendered(stage, options); }), {"state: ", row.message});
    }
    fs::resize_file(options.checkpoint, fs::file_size(options.checkpoint) / 2);
    expectContains(errorOf([&] { rendered(small(), options); }), {"state: "});
    std::ofstream(options.checkpoint) << "text";
    expectContains(errorOf([&] { rendered(small(), options); }), {"state: cannot be read"});
}

TEST(Progressive, TimeEndsARenderWithAllPixelsSeen)
{
    Stage stage = noisyUpTo(64, 64);
    stage.scene.settings.samples = 1 << 20;
    stage.scene.settings.noise = 0;
    host::RenderOptions options;
    options.seconds = 0.3;
    Rendered const r = rendered(stage, options);
    EXPECT_FALSE(r.report.complete);
    EXPECT_LT(r.report.seconds, 10);
    EXPECT_GT(r.film.sampleRange().first, 0u);
}

} // namespace
} // namespace zsi::test
