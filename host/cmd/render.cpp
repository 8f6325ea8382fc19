// SPDX-License-Identifier: Apache-2.0
// zsi render: a scene file to a picture file.
#include "render/render.h"
#include "base/activity.h"
#include "base/error.h"
#include "base/replacedFile.h"
#include "cmd/command.h"
#include "cmd/interruption.h"
#include "cmd/progressBar.h"
#include "cmd/sceneOptions.h"
#include "denoise/denoise.h"
#include "film/imageFile.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <fmt/format.h>
#include <memory>
#include <optional>
#include <sys/resource.h>
#include <utility>

namespace zsi::cmd {
namespace {

constexpr int kMaxSamples = 1 << 20;

struct Arguments {
    SceneOptions scene;
    std::string output;
    int threads = 0;
    std::optional<int> samples;
    std::optional<float> noise;
    double seconds = 0;
    std::string checkpoint;
    double checkpointSeconds = 30;
    bool resume = false, stats = false;
    ViewOptions view;
    bool denoise = false;
    double previewSeconds = 0;
    bool quiet = false, verbose = false, progress = false;
};

/// What differs from one line of the command to the next is where it goes: warnings and what
/// --verbose tells to stderr, the closing line to stdout.
class Reporter {
public:
    explicit Reporter(Arguments const& arguments)
        : quiet_(arguments.quiet)
        , verbose_(arguments.verbose)
    {
    }
    bool quiet() const { return quiet_; }
    void warning(std::string const& message) const
    {
        if (!quiet_)
            warn(message);
    }
    /// With the seconds since the last one.
    void detail(std::string const& message)
    {
        auto const now = Clock::now();
        double const seconds =
            std::chrono::duration<double>(now - std::exchange(last_, now)).count();
        if (verbose_)
            std::fputs(fmt::format("zsi: {}, {:.2f} s\n", message, seconds).c_str(), stderr);
    }

    void note(std::string const& message) const
    {
        if (verbose_)
            std::fputs(("zsi: " + message + '\n').c_str(), stderr);
    }

private:
    using Clock = std::chrono::steady_clock;
    bool quiet_, verbose_;
    Clock::time_point last_ = Clock::now();
};

std::string contents(host::Scene const& scene)
{
    std::size_t triangles = 0;
    for (host::Mesh const& mesh : scene.meshes)
        triangles += mesh.triangles.size();
    return fmt::format("{}: {} meshes of {} triangles, {} instances, {} materials, {} lights, {}",
                       scene.file, scene.meshes.size(), triangles, scene.instances.size(),
                       scene.materials.size(), scene.lights.size(),
                       scene.environment ? scene.environment->className() : "no environment");
}

/// "12 non-finite results left out (glass 10, environment 2)".
std::string nonFinite(host::Scene const& scene, host::RenderReport const& report)
{
    std::string who;
    for (std::size_t i = 0; i < report.nonFiniteOf.size(); ++i)
        if (std::uint64_t const count = report.nonFiniteOf[i])
            who +=
                fmt::format("{}{} {}", who.empty() ? "" : ", ",
                            i < scene.materialNames.size() ? host::printable(scene.materialNames[i])
                                                           : "environment",
                            count);
    return fmt::format("{} non-finite results left out{}", report.nonFinite,
                       who.empty() ? "" : " (" + who + ")");
}

/// "64 samples a pixel", "16 to 256 samples a pixel (41.5 in the mean)".
std::string samplesText(host::Film const& film)
{
    auto const [least, most] = film.sampleRange();
    return least == most ? fmt::format("{} samples a pixel", least)
                         : fmt::format("{} to {} samples a pixel ({:.1f} in the mean)", least, most,
                                       film.meanSamples());
}

std::string statusText(host::RenderStatus const& status)
{
    return fmt::format("{:.0f} samples{}", status.samples,
                       status.noise >= 0 ? fmt::format(", noise {:.2g}", status.noise) : "");
}

/// What --stats tells.
std::string statsText(host::Scene const& scene, host::RenderReport const& report,
                      std::string const& samples,
                      std::array<std::uint64_t, host::kActivities> const& seen)
{
    auto const rays = [&](char const* kind, std::uint64_t count) {
        return fmt::format("  {:<11}{:>14}  {:>8.3f} million/s\n", kind, count,
                           static_cast<double>(count) * 1e-6 / report.seconds);
    };
    std::uint64_t looks = 0;
    for (std::uint64_t const count : seen)
        looks += count;
    auto const share = [&](host::Activity what) {
        return looks ? 100.0 * static_cast<double>(seen[static_cast<std::size_t>(what)])
                / static_cast<double>(looks)
                     : 0.0;
    };
    rusage usage = {};
    getrusage(RUSAGE_SELF, &usage);
    return "rays\n" + rays("camera", report.rays.camera)
        + rays("reflection", report.rays.reflection) + rays("diffuse", report.rays.diffuse)
        + rays("shadow", report.rays.shadow)
        + fmt::format("time of rendering threads: tracing {:.0f} %, shading {:.0f} %, textures "
                      "{:.0f} %\nmemory: {} MB at most\n{}\n{}\n",
                      share(host::Activity::Tracing), share(host::Activity::Shading),
                      share(host::Activity::Textures), usage.ru_maxrss >> 10, samples,
                      nonFinite(scene, report));
}

ProgressBar::Style progressStyle(Arguments const& arguments)
{
    return arguments.progress ? ProgressBar::Style::Lines
        : arguments.quiet     ? ProgressBar::Style::None
                              : ProgressBar::Style::Terminal;
}

bool keepsState(Arguments const& arguments)
{
    return arguments.resume || !arguments.checkpoint.empty();
}

std::string checkpointFile(Arguments const& arguments)
{
    return arguments.checkpoint.empty() ? arguments.output + ".checkpoint" : arguments.checkpoint;
}

/// The scene as the command line wants it.
host::Scene load(Arguments const& arguments, host::ShaderLibraries const& libraries)
{
    ProgressBar bar(progressStyle(arguments));
    host::Scene scene = loadScene(arguments.scene, libraries, bar);
    if (arguments.samples)
        scene.settings.samples = *arguments.samples;
    else if (arguments.noise || arguments.seconds > 0)
        scene.settings.samples = kMaxSamples; // what the scene says was meant for no other limit
    if (arguments.noise)
        scene.settings.noise = *arguments.noise;
    if (arguments.denoise
        && std::find(scene.film.layers.begin(), scene.film.layers.end(), "halves")
            == scene.film.layers.end())
        scene.film.layers.push_back("halves");
    if (arguments.view.view)
        scene.film.view = *arguments.view.view;
    return scene;
}

void check(Arguments const& arguments)
{
    checkOptions(arguments.scene);
    host::checkPictureFile(arguments.output);
    if (keepsState(arguments))
        host::ReplacedFile::check(checkpointFile(arguments));
    if (!arguments.scene.layers.empty() && !host::keepsLayers(arguments.output))
        throw UsageError(fmt::format("--layers: {} has no layers; expected an .exr file",
                                     host::printable(arguments.output)));
}

int render(Arguments const& arguments, std::string const& shaderPath)
{
    check(arguments);
    Interruption interruption;
    Reporter reporter(arguments);
    host::ShaderLibraries const libraries = loadLibraries(shaderPath);
    host::Scene const scene = load(arguments, libraries);
    host::ScreenView const view = host::screenView(scene.film, arguments.view.ocioConfig);
    host::screenTransform(view); // refuses what it cannot show before the picture is rendered
    for (std::string const& warning : scene.warnings)
        reporter.warning(warning);
    if (scene.instances.empty() && !scene.environment)
        reporter.warning(scene.file + ": nothing to see: no instances and no environment");
    reporter.detail(contents(scene));
    for (std::string const& note : scene.notes)
        reporter.note(note);

    host::RenderReport report;
    host::Picture picture;
    std::string samples;
    std::array<std::uint64_t, host::kActivities> seen{};
    try {
        ProgressBar bar(progressStyle(arguments));
        std::atomic<bool> const& interrupted = interruption.defer();
        host::Session session(scene, [&](double done) {
            bar.show("building", done);
            return !interrupted;
        });
        reporter.detail("acceleration structures built");
        for (std::string const& omission : session.omissions())
            reporter.warning(scene.file + ": " + omission);
        host::Film film = session.newFilm();
        host::RenderOptions options;
        options.threads = arguments.threads;
        options.progress = [&](host::RenderStatus const& status) {
            bar.show("rendering", status.done, statusText(status));
        };
        options.cancel = &interrupted;
        options.seconds = arguments.seconds;
        if (keepsState(arguments))
            options.checkpoint = checkpointFile(arguments);
        options.checkpointSeconds = arguments.checkpointSeconds;
        if (arguments.previewSeconds > 0)
            options.preview = [&](host::Film const& soFar) {
                host::writePicture(arguments.output, host::developed(soFar, scene), view);
            };
        options.previewSeconds = arguments.previewSeconds;
        std::optional<host::ActivitySampler> activity;
        if (arguments.stats)
            activity.emplace();
        report = host::renderProgressively(session, film, options);
        if (activity)
            seen = activity->counts();
        if (film.sampleRange().second > 0) {
            picture = host::developed(film, scene);
            samples = samplesText(film);
        }
        if (arguments.denoise && !interrupted && !picture.layers.empty()) {
            host::DenoiseOptions denoising;
            denoising.threads = arguments.threads;
            denoising.cancel = &interrupted;
            denoising.progress = [&](double done) { bar.show("denoising", done); };
            if (auto result = host::denoised(picture, denoising))
                picture = std::move(*result);
        }
        reporter.detail(fmt::format("rendered with \"{}\"", scene.settings.integrator));
    } catch (host::Cancelled const&) {
        // Told below, as an interruption while rendering is.
    }
    int const status = interruption.resume();
    if (status != 0) {
        if (!picture.layers.empty())
            host::writePicture(arguments.output, picture, view);
        std::fputs(
            picture.layers.empty()
                ? "zsi: interrupted, no picture written\n"
                : fmt::format("zsi: interrupted; {} has {}\n", arguments.output, samples).c_str(),
            stderr);
        return status;
    }
    if (!scene.instances.empty() && report.surfaces == 0)
        reporter.warning(fmt::format("{}: the camera sees none of its {} instances", scene.file,
                                     scene.instances.size()));
    host::writePicture(arguments.output, picture, view);
    reporter.detail("written to " + arguments.output);
    // A file that was asked for by name stays: more samples can be added to it.
    if (arguments.checkpoint.empty() && arguments.resume && report.complete)
        std::filesystem::remove(checkpointFile(arguments));
    if (!reporter.quiet())
        print(fmt::format("{}: {}x{}, {}, {}{} rays, {}, {:.2f} s\n", arguments.output,
                          picture.width(), picture.height(), samples,
                          report.noise >= 0 ? fmt::format("noise {:.2g}, ", report.noise) : "",
                          report.rays.sum(), nonFinite(scene, report), report.seconds));
    if (arguments.stats)
        print(statsText(scene, report, samples, seen));
    return 0;
}

} // namespace

Subcommand addRender(CLI::App& app, std::string const& shaderPath)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command =
        app.add_subcommand("render", "Render a scene file into a picture file");
    command
        ->add_option("-o,--output", arguments->output,
                     "The picture: .exr or .hdr linear, .png or .jpg for the screen")
        ->required()
        ->type_name("FILE");
    addSceneOptions(*command, arguments->scene);
    addThreadsOption(*command, arguments->threads);
    command->add_option("--samples", arguments->samples, "Samples a pixel, instead of the scene's")
        ->check(CLI::Range(1, kMaxSamples));
    command
        ->add_option("--noise", arguments->noise,
                     "Stop where the picture's noise is below this, such as 0.01; without "
                     "--samples as many as that takes")
        ->check(CLI::PositiveNumber)
        ->type_name("T");
    command
        ->add_option("--time", arguments->seconds,
                     "Stop rendering after so many seconds; without --samples as many as fit")
        ->check(CLI::PositiveNumber)
        ->type_name("SECONDS");
    command->add_flag("--resume", arguments->resume,
                      "Keep the state of the render beside the picture, in FILE.checkpoint, and go "
                      "on from it where it is there; it goes when the picture is complete");
    command
        ->add_option("--checkpoint", arguments->checkpoint,
                     "Likewise in this file, which stays, so that samples can be added")
        ->type_name("FILE");
    command
        ->add_option("--checkpoint-every", arguments->checkpointSeconds,
                     "Seconds between two writings of that state; it never takes more than a "
                     "fortieth of the time")
        ->check(CLI::NonNegativeNumber)
        ->type_name("SECONDS");
    command
        ->add_option("--preview-every", arguments->previewSeconds,
                     "Write the picture so far to FILE every so many seconds, so that it can be "
                     "watched")
        ->check(CLI::PositiveNumber)
        ->type_name("SECONDS");
    addViewOptions(*command, arguments->view);
    command->add_flag("--denoise", arguments->denoise,
                      "Take the noise out of the picture; keeps both of its halves apart");
    command->add_flag("--stats", arguments->stats,
                      "Tell of rays by kind, where the time went, memory and samples");
    command->add_flag("--progress", arguments->progress,
                      "Tell on stderr how far it is, in lines \"zsi: progress SHARE WHAT\", SHARE "
                      "from 0 to 1");
    command->add_flag("-q,--quiet", arguments->quiet, "Tell of nothing but errors");
    command
        ->add_flag("-v,--verbose", arguments->verbose, "Tell what is loaded and how long it takes")
        ->excludes("--quiet");
    command->footer("Options override the scene. The same scene and seed give the same picture, "
                    "bit for bit, with any number of threads.");
    return {command, [=, &shaderPath] { return render(*arguments, shaderPath); }};
}

} // namespace zsi::cmd
