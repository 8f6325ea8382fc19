// SPDX-License-Identifier: Apache-2.0
// zsi denoise: a picture with both of its halves to one without noise.
#include "denoise/denoise.h"
#include "base/error.h"
#include "cmd/command.h"
#include "cmd/interruption.h"
#include "cmd/progressBar.h"
#include "film/imageFile.h"

#include <CLI/CLI.hpp>
#include <cstdio>
#include <fmt/format.h>
#include <memory>

namespace zsi::cmd {
namespace {

struct Arguments {
    std::string input, output;
    float exposure = 0.0f;
    int threads = 0;
    bool quiet = false;
    ViewOptions view;
};

int denoise(Arguments const& arguments)
{
    host::checkPictureFile(arguments.output);
    host::ScreenView const view{arguments.exposure, false, arguments.view.view.value_or(""),
                                arguments.view.ocioConfig};
    host::screenTransform(view); // refuses what it cannot show
    Interruption interruption;
    host::Picture picture = host::readPicture(arguments.input);
    std::optional<host::Picture> result;
    try {
        ProgressBar bar(!arguments.quiet);
        host::DenoiseOptions options;
        options.threads = arguments.threads;
        options.cancel = &interruption.defer();
        options.progress = [&](double done) { bar.show("denoising", done); };
        result = host::denoised(std::move(picture), options);
    } catch (host::InputError const& error) {
        throw host::InputError(host::printable(arguments.input) + ": " + error.what());
    }
    if (int const status = interruption.resume()) {
        std::fputs("zsi: interrupted, no picture written\n", stderr);
        return status;
    }
    host::writePicture(arguments.output, *result, view);
    if (!arguments.quiet)
        print(fmt::format("{}: {}x{}, denoised\n", arguments.output, result->width(),
                          result->height()));
    return 0;
}

} // namespace

Subcommand addDenoise(CLI::App& app)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command = app.add_subcommand("denoise", "Take the noise out of a picture");
    command
        ->add_option("PICTURE", arguments->input, "An .exr that was rendered with --layers halves")
        ->required();
    command
        ->add_option("-o,--output", arguments->output,
                     "The picture: .exr with all layers, .hdr, .png or .jpg")
        ->required()
        ->type_name("FILE");
    command->add_option("--exposure", arguments->exposure, "Stops, for 8-bit pictures")
        ->check(CLI::Range(-64.0, 64.0));
    addViewOptions(*command, arguments->view);
    command->add_option("--threads", arguments->threads, "Threads; 0 is one per processor")
        ->check(CLI::Range(0, 1024));
    command->add_flag("-q,--quiet", arguments->quiet, "Tell of nothing but errors");
    return {command, [=] { return denoise(*arguments); }};
}

} // namespace zsi::cmd
