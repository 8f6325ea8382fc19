// zsi render: a scene file to a picture file.
#include "render/render.h"
#include "base/error.h"
#include "cmd/command.h"
#include "cmd/interruption.h"
#include "cmd/progressBar.h"
#include "film/imageFile.h"
#include "load/loadScene.h"

#include <CLI/CLI.hpp>
#include <charconv>
#include <cmath>
#include <cstdio>
#include <fmt/format.h>
#include <limits>
#include <memory>
#include <optional>

namespace zsi::cmd {
namespace {

constexpr int kMaxThreads = 1024;
constexpr int kMaxSamples = 1 << 20;
constexpr int kMaxSide = 32768; ///< pixels
constexpr std::int64_t kMaxSeed = std::numeric_limits<std::uint32_t>::max();

struct Arguments {
    std::string scene, output;
    std::string size, crop;
    int threads = 0;
    std::optional<int> samples;
    std::optional<std::int64_t> seed;
};

/// Exactly N decimal integers with `separator` between them.
template <std::size_t N>
std::optional<std::array<int, N>> integers(std::string_view text, char separator)
{
    std::array<int, N> values{};
    char const* at = text.data();
    char const* const end = at + text.size();
    for (std::size_t i = 0; i < N; ++i) {
        if (i > 0 && (at == end || *at++ != separator))
            return {};
        auto const [next, error] = std::from_chars(at, end, values[i]);
        if (error != std::errc())
            return {};
        at = next;
    }
    return at == end ? std::optional(values) : std::nullopt;
}

std::array<int, 2> parseSize(std::string const& text)
{
    auto const size = integers<2>(text, 'x');
    auto const valid = [](int side) { return side >= 1 && side <= kMaxSide; };
    if (!size || !valid((*size)[0]) || !valid((*size)[1]))
        throw UsageError(fmt::format("--size {}: expected WIDTHxHEIGHT in pixels, such as 640x360, "
                                     "each from 1 to {}",
                                     host::printable(text), kMaxSide));
    return *size;
}

std::array<int, 4> parseCrop(std::string const& text)
{
    auto const crop = integers<4>(text, ',');
    if (!crop || (*crop)[0] < 0 || (*crop)[1] < 0 || (*crop)[2] <= (*crop)[0]
        || (*crop)[3] <= (*crop)[1])
        throw UsageError(fmt::format("--crop {}: expected X0,Y0,X1,Y1 in pixels from the top left, "
                                     "0 <= X0 < X1 and 0 <= Y0 < Y1",
                                     host::printable(text)));
    return *crop;
}

/// A crop of the scene keeps its share of a picture of another size.
void resize(host::FilmSettings& film, std::array<int, 2> size)
{
    if (film.crop) {
        auto const scaled = [](int at, int to, int from, auto round) {
            return static_cast<int>(round(static_cast<double>(at) * to / from));
        };
        auto const down = [](double v) { return std::floor(v); };
        auto const up = [](double v) { return std::ceil(v); };
        auto& c = *film.crop;
        c = {scaled(c[0], size[0], film.width, down), scaled(c[1], size[1], film.height, down),
             scaled(c[2], size[0], film.width, up), scaled(c[3], size[1], film.height, up)};
    }
    film.width = size[0];
    film.height = size[1];
}

int render(Arguments const& arguments, std::string const& shaderPath)
{
    std::optional<std::array<int, 2>> size;
    if (!arguments.size.empty())
        size = parseSize(arguments.size);
    std::optional<std::array<int, 4>> crop;
    if (!arguments.crop.empty())
        crop = parseCrop(arguments.crop);

    Interruption interruption;
    host::checkPictureFile(arguments.output);
    host::ShaderLibraries const libraries = loadLibraries(shaderPath);
    host::Scene scene = host::loadScene(arguments.scene, libraries);
    for (std::string const& warning : scene.warnings)
        warn(warning);

    if (size)
        resize(scene.film, *size);
    if (crop)
        scene.film.crop = crop;
    if (crop && ((*crop)[2] > scene.film.width || (*crop)[3] > scene.film.height))
        throw UsageError(fmt::format("--crop {}: reaches out of the picture, which is {}x{}",
                                     arguments.crop, scene.film.width, scene.film.height));
    if (arguments.samples)
        scene.settings.samples = *arguments.samples;
    if (arguments.seed)
        scene.settings.seed = static_cast<std::uint32_t>(*arguments.seed);

    host::RenderReport report;
    host::Picture picture;
    try {
        ProgressBar bar;
        host::RenderOptions options;
        options.threads = arguments.threads;
        options.progress = [&](double done) { bar.show(done); };
        options.cancel = &interruption.defer();
        picture = host::render(scene, options, &report);
    } catch (host::Cancelled const&) {
        // Told below, as an interruption while rendering is.
    }
    if (int const status = interruption.resume()) {
        std::fputs("zsi: interrupted, no picture written\n", stderr);
        return status;
    }
    host::writePicture(arguments.output, picture, {scene.film.exposure, scene.film.alpha == true});
    print(fmt::format("{}: {}x{}, {} samples a pixel, {} rays, {} non-finite results left out, "
                      "{:.2f} s\n",
                      arguments.output, picture.width(), picture.height(), scene.settings.samples,
                      report.rays, report.nonFinite, report.seconds));
    return 0;
}

} // namespace

Subcommand addRender(CLI::App& app, std::string const& shaderPath)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command =
        app.add_subcommand("render", "Render a scene file into a picture file");
    command->add_option("SCENE", arguments->scene, "The scene, a JSON file")->required();
    command
        ->add_option("-o,--output", arguments->output,
                     "The picture: .exr or .hdr linear, .png or .jpg for the screen")
        ->required()
        ->type_name("FILE");
    command->add_option("--threads", arguments->threads, "Threads; 0 is one per processor")
        ->check(CLI::Range(0, kMaxThreads));
    command->add_option("--samples", arguments->samples, "Samples a pixel, instead of the scene's")
        ->check(CLI::Range(1, kMaxSamples));
    command->add_option("--size", arguments->size, "Size in pixels, instead of the scene's")
        ->type_name("WxH");
    command
        ->add_option(
            "--crop", arguments->crop,
            "Render only this part of the picture: pixels from the top left, end exclusive")
        ->type_name("X0,Y0,X1,Y1");
    command
        ->add_option("--seed", arguments->seed,
                     "Seed of the random numbers: another one gives other noise")
        ->check(CLI::Range(std::int64_t(0), kMaxSeed));
    command->footer("Options override the scene. The same scene and seed give the same picture, "
                    "bit for bit, with any number of threads.");
    return {command, [=, &shaderPath] { return render(*arguments, shaderPath); }};
}

} // namespace zsi::cmd
