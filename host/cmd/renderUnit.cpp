// SPDX-License-Identifier: Apache-2.0
// zsi render-unit: some samples of some pixels of a scene, to a file that `zsi merge` takes.
#include "base/error.h"
#include "base/replacedFile.h"
#include "cmd/command.h"
#include "cmd/interruption.h"
#include "cmd/sceneOptions.h"
#include "film/imageFile.h"
#include "render/unit.h"

#include <CLI/CLI.hpp>
#include <cstdio>
#include <fmt/format.h>
#include <memory>

namespace zsi::cmd {
namespace {

struct Arguments {
    SceneOptions scene;
    std::string output, window, samples;
    int threads = 0;
    bool quiet = false;
};

int renderUnit(Arguments const& arguments, std::string const& shaderPath)
{
    checkOptions(arguments.scene);
    host::RenderUnit place;
    if (!arguments.window.empty()) {
        auto const w = parseWindow("--window", arguments.window);
        place.pixels = {w[0], w[1], w[2], w[3]};
    }
    if (!arguments.samples.empty()) {
        auto const s = parseRange("--samples", arguments.samples);
        place.samples = {static_cast<std::uint32_t>(s[0]), static_cast<std::uint32_t>(s[1])};
    }
    host::checkPictureFile(arguments.output);
    if (!host::keepsLayers(arguments.output))
        throw UsageError(arguments.output + ": a unit is an .exr file");

    Interruption interruption;
    host::ShaderLibraries const libraries = loadLibraries(shaderPath);
    ProgressBar bar(!arguments.quiet);
    host::Scene const scene = loadScene(arguments.scene, libraries, bar);
    if (!arguments.quiet)
        for (std::string const& warning : scene.warnings)
            warn(warning);
    host::UnitOrigin const origin = host::unitOriginOf(scene);
    if (arguments.window.empty())
        place.pixels = origin.window;
    if (arguments.samples.empty())
        place.samples = {0, origin.samples};
    std::optional<host::Unit> unit;
    try {
        std::atomic<bool> const& interrupted = interruption.defer();
        host::Session session(scene, [&](double done) {
            bar.show("building", done);
            return !interrupted;
        });
        host::RenderJob job;
        job.threads = arguments.threads;
        job.cancel = &interrupted;
        job.progress = [&](double done) { bar.show("rendering", done); };
        unit = host::renderUnit(session, origin, place, job);
    } catch (host::Cancelled const&) {
        // Told below, as an interruption while rendering is.
    }
    if (int const status = interruption.resume()) {
        std::fputs("zsi: interrupted, no unit written\n", stderr);
        return status;
    }
    host::ReplacedFile goal(arguments.output);
    goal.write(host::unitBytes(*unit));
    goal.commit();
    if (!arguments.quiet)
        print(fmt::format("{}: {} ({} of the picture), {} rays\n", arguments.output,
                          host::placeText(place), origin.samples, unit->head.rays));
    return 0;
}

} // namespace

Subcommand addRenderUnit(CLI::App& app, std::string const& shaderPath)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command = app.add_subcommand(
        "render-unit", "Render a share of a scene's picture, for merge to add up");
    addSceneOptions(*command, arguments->scene);
    command->add_option("-o,--output", arguments->output, "The unit, an .exr of exact sums")
        ->required()
        ->type_name("FILE");
    command
        ->add_option("--window", arguments->window,
                     "Pixels of the share, from the top left, end exclusive; all without it")
        ->type_name("X0,Y0,X1,Y1");
    command
        ->add_option("--samples", arguments->samples,
                     "Samples of the share, from number A to before B, of those that the scene "
                     "asks for (--set settings.samples=N); all without it")
        ->type_name("A:B");
    addThreadsOption(*command, arguments->threads);
    command->add_flag("-q,--quiet", arguments->quiet, "Tell of nothing but errors");
    command->footer("Units whose windows and samples make up the picture without overlaps merge to "
                    "the bytes that zsi render writes.");
    return {command, [=, &shaderPath] { return renderUnit(*arguments, shaderPath); }};
}

} // namespace zsi::cmd
