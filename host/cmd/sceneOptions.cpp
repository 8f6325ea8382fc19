// SPDX-License-Identifier: Apache-2.0
#include "cmd/sceneOptions.h"

#include "base/names.h"
#include "cmd/command.h"
#include "integrate/integrators.h"
#include "integrate/layers.h"
#include "load/loadScene.h"
#include "scene/resize.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <limits>

namespace zsi::cmd {
namespace {

constexpr int kMaxThreads = 1024;
constexpr int kMaxCache = 1 << 20; ///< megabytes
constexpr int kMaxSide = 32768; ///< pixels
constexpr std::int64_t kMaxSeed = std::numeric_limits<std::uint32_t>::max();

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

/// A word of a list, or a usage error that names the option.
void checkWord(char const* option, std::string const& word, std::vector<std::string> const& known)
{
    if (std::find(known.begin(), known.end(), word) == known.end())
        throw UsageError(fmt::format("{} {}: unknown{}", option, host::printable(word),
                                     host::suggestion(word, known)));
}

} // namespace

std::array<int, 4> parseWindow(char const* option, std::string const& text)
{
    auto const w = integers<4>(text, ',');
    if (!w || (*w)[0] < 0 || (*w)[1] < 0 || (*w)[2] <= (*w)[0] || (*w)[3] <= (*w)[1])
        throw UsageError(fmt::format("{} {}: expected X0,Y0,X1,Y1 in pixels from the top left, "
                                     "0 <= X0 < X1 and 0 <= Y0 < Y1",
                                     option, host::printable(text)));
    return *w;
}

std::array<int, 2> parseRange(char const* option, std::string const& text)
{
    auto const range = integers<2>(text, ':');
    if (!range || (*range)[0] < 0 || (*range)[1] <= (*range)[0])
        throw UsageError(fmt::format("{} {}: expected A:B, the samples from number A to before "
                                     "number B, 0 <= A < B",
                                     option, host::printable(text)));
    return *range;
}

void checkOptions(SceneOptions const& options)
{
    if (!options.size.empty())
        parseSize(options.size);
    if (!options.crop.empty())
        parseWindow("--crop", options.crop);
    if (!options.integrator.empty())
        checkWord("--integrator", options.integrator, host::integratorNames());
    for (std::string const& layer : options.layers)
        checkWord("--layers", layer, host::layerNames());
}

host::Scene loadScene(SceneOptions const& options, host::ShaderLibraries const& libraries,
                      ProgressBar& bar)
{
    host::LoadOptions loading;
    loading.assignments = options.assignments;
    if (options.textureCache)
        loading.textures.cacheBytes = static_cast<std::size_t>(*options.textureCache) << 20;
    loading.progress = [&](std::string const& path) { bar.show("loading " + path); };
    host::Scene scene = host::loadScene(options.file, libraries, loading);
    if (!options.size.empty()) {
        auto const size = parseSize(options.size);
        host::resize(scene, size[0], size[1]);
    }
    if (!options.crop.empty()) {
        auto const crop = parseWindow("--crop", options.crop);
        if (crop[2] > scene.film.width || crop[3] > scene.film.height)
            throw UsageError(fmt::format("--crop {}: reaches out of the picture, which is {}x{}",
                                         options.crop, scene.film.width, scene.film.height));
        scene.film.crop = crop;
    }
    if (options.seed)
        scene.settings.seed = static_cast<std::uint32_t>(*options.seed);
    if (!options.integrator.empty())
        scene.settings.integrator = options.integrator;
    if (!options.layers.empty())
        scene.film.layers = options.layers;
    return scene;
}

void addThreadsOption(CLI::App& command, int& threads)
{
    command.add_option("--threads", threads, "Threads; 0 is one per processor")
        ->check(CLI::Range(0, kMaxThreads));
}

void addSceneOptions(CLI::App& command, SceneOptions& options)
{
    command
        .add_option(
            "SCENE", options.file,
            "The scene, a JSON file, or a model (glTF, GLB, OBJ, PLY, STL); - is standard input")
        ->required();
    command.add_option("--size", options.size, "Size in pixels, instead of the scene's")
        ->type_name("WxH");
    command
        .add_option("--crop", options.crop,
                    "Render only this part of the picture: pixels from the top left, end exclusive")
        ->type_name("X0,Y0,X1,Y1");
    command
        .add_option("--seed", options.seed,
                    "Seed of the random numbers: another one gives other noise")
        ->check(CLI::Range(std::int64_t(0), kMaxSeed));
    command.add_option("--integrator", options.integrator, "How light is gathered")
        ->type_name(fmt::format("{}", fmt::join(host::integratorNames(), "|")));
    command
        .add_option("--layers", options.layers,
                    "Layers of an .exr beside the beauty: "
                        + fmt::format("{}", fmt::join(host::layerNames(), ", ")))
        ->delimiter(',')
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
        ->allow_extra_args(false)
        ->type_name("NAME[,NAME]");
    command
        .add_option("--set", options.assignments,
                    "Put a value in the place of the scene's, as often as wanted: "
                    "materials.glass.parameters.u_ior=1.4, camera.position[2]=3")
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
        ->allow_extra_args(false)
        ->type_name("PATH=VALUE");
    command
        .add_option("--texture-cache", options.textureCache,
                    "Megabytes of pictures in memory; more than that lies in scratch files")
        ->check(CLI::Range(1, kMaxCache))
        ->type_name("MB");
}

} // namespace zsi::cmd
