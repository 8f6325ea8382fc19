// SPDX-License-Identifier: Apache-2.0
#include "base/error.h"
#include "cmd/command.h"
#include "film/screenTransform.h"

#include <CLI/CLI.hpp>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <new>
#include <unistd.h>

namespace zsi::cmd {
namespace {

constexpr int kBadInput = 1;
constexpr int kBadUsage = 2;

/// The parser's complaint in the words of the other errors, with what may have been meant.
std::string explain(CLI::App const& app, CLI::ParseError const& error)
{
    auto const* extras = dynamic_cast<CLI::ExtrasError const*>(&error);
    std::vector<std::string> const unknown = app.remaining(true);
    if (!extras || unknown.empty())
        return error.what();

    std::string const& word = unknown.front();
    auto const chosen = app.get_subcommands();
    std::vector<std::string> known;
    if (word.starts_with("-")) {
        std::string const name = word.substr(0, word.find('='));
        std::vector<CLI::App const*> levels{&app};
        levels.insert(levels.end(), chosen.begin(), chosen.end());
        for (CLI::App const* level : levels)
            for (CLI::Option const* option : level->get_options()) {
                if (level != &app && option->check_name(name))
                    return fmt::format("{}: goes behind the subcommand, zsi {} {}",
                                       host::printable(name), level->get_name(), name);
                for (std::string const& longName : option->get_lnames())
                    if (level == &app || longName != "help")
                        known.push_back("--" + longName);
            }
        return fmt::format("{}: unknown option{}", host::printable(name),
                           host::suggestion(name, known));
    }
    if (!chosen.empty())
        return fmt::format("{}: unexpected argument (zsi {} --help)", host::printable(word),
                           chosen.front()->get_name());
    for (CLI::App const* subcommand : app.get_subcommands({}))
        known.push_back(subcommand->get_name());
    return fmt::format("{}: unknown subcommand{}", host::printable(word),
                       host::suggestion(word, known));
}

int run(int argc, char** argv)
{
    CLI::App app{"Lists shaders and renders scenes with them."};
    app.name("zsi");
    app.fallthrough();
    app.option_defaults()->take_last();
    app.set_version_flag("--version",
                         fmt::format("zsi {}, shader interface {}", ZSI_VERSION, kApiVersion));
    std::string shaderPath;
    app.add_option("--shader-path", shaderPath,
                   "Folders with shader libraries, separated by colons. Without it: "
                   "ZSI_SHADER_PATH, else the folder `shaders` beside this program, else the "
                   "installed one")
        ->type_name("FOLDER[:FOLDER]");
    Subcommand const subcommands[] = {addInfo(app, shaderPath),       addRender(app, shaderPath),
                                      addView(app, shaderPath),       addConvert(app),
                                      addSchema(app, shaderPath),     addDenoise(app),
                                      addRenderUnit(app, shaderPath), addMerge(app),
                                      addFarm(app, shaderPath),       addLab(app, shaderPath)};
    app.footer("Exit status: 0 done, 1 bad input, 2 bad command line, 130 interrupted.");

    try {
        app.parse(argc, argv);
    } catch (CLI::ParseError const& error) {
        if (error.get_exit_code() == 0) // --help, --version
            return app.exit(error);
        throw UsageError(explain(app, error));
    }
    for (Subcommand const& subcommand : subcommands)
        if (subcommand.app->parsed())
            return subcommand.run();
    throw UsageError("a subcommand is missing: info, render, view, convert, denoise, schema, "
                     "render-unit, merge, farm or lab (zsi --help)");
}

} // namespace

host::ShaderLibraries loadLibraries(std::string const& shaderPath)
{
    host::ShaderLibraries libraries;
    for (std::filesystem::path const& folder : host::shaderDirectories(shaderPath))
        for (std::string const& leftOut : libraries.loadDirectory(folder))
            warn(leftOut);
    return libraries;
}

void addViewOptions(CLI::App& command, ViewOptions& options)
{
    command
        .add_option("--view", options.view,
                    "How 8-bit pictures show light: a tone curve or a view of the OpenColorIO "
                    "config")
        ->type_name(fmt::format("{}|[DISPLAY/]VIEW", fmt::join(host::toneCurveNames(), "|")));
    command
        .add_option("--ocio", options.ocioConfig,
                    "OpenColorIO config: its default view shows 8-bit pictures that name no other")
        ->envname("OCIO")
        ->type_name("FILE");
}

void print(std::string const& text)
{
    if (std::fwrite(text.data(), 1, text.size(), stdout) != text.size() || std::fflush(stdout))
        throw host::InputError(fmt::format("cannot write to the output: {}", std::strerror(errno)));
}

// A message that cannot be written is lost; there is nowhere left to tell it.
void warn(std::string const& message)
{
    std::fputs(("zsi: warning: " + message + '\n').c_str(), stderr);
}

} // namespace zsi::cmd

int main(int argc, char** argv)
{
    // A file that grows over a limit is an error of writing, not the end of the program.
    std::signal(SIGXFSZ, SIG_IGN);
    // Allocates nothing: there may be nothing left.
    auto const complain = [](char const* message, int status) {
        for (char const* part : {"zsi: ", message, "\n"})
            if (write(STDERR_FILENO, part, std::strlen(part)) < 0)
                break; // nowhere left to tell it
        return status;
    };
    try {
        return zsi::cmd::run(argc, argv);
    } catch (zsi::cmd::UsageError const& error) {
        return complain(error.what(), zsi::cmd::kBadUsage);
    } catch (std::bad_alloc const&) {
        return complain("out of memory", zsi::cmd::kBadInput);
    } catch (std::exception const& error) {
        return complain(error.what(), zsi::cmd::kBadInput);
    }
}
