// SPDX-License-Identifier: Apache-2.0
// zsi farm: hands over to the Python package's command of that name.
#include "base/error.h"
#include "cmd/command.h"

#include <CLI/CLI.hpp>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fmt/format.h>
#include <memory>
#include <unistd.h>

namespace zsi::cmd {
namespace {

namespace fs = std::filesystem;

/// Where the Python package is: beside the program in the build tree, else in the installation.
fs::path packages()
{
    fs::path const here = fs::read_symlink("/proc/self/exe").parent_path();
    std::string looked;
    for (fs::path const& place : {here / "python", here / ZSI_INSTALLED_PYTHON}) {
        fs::path folder = place.lexically_normal();
        if (fs::exists(folder / "zsi" / "farm" / "__main__.py"))
            return folder;
        looked += (looked.empty() ? "" : " and ") + folder.string();
    }
    throw host::InputError("farm: the Python package zsi is missing; it was looked for in " + looked
                           + " (apt install python3-zsi)");
}

int farm(std::vector<std::string> arguments, std::string const& shaderPath)
{
    fs::path const folder = packages();
    char const* const before = std::getenv("PYTHONPATH");
    setenv("PYTHONPATH", (folder.string() + (before ? ':' + std::string(before) : "")).c_str(), 1);
    if (!shaderPath.empty())
        setenv("ZSI_SHADER_PATH", shaderPath.c_str(), 1);
    char const* const chosen = std::getenv("ZSI_PYTHON");
    std::string const python = chosen ? chosen : ZSI_PYTHON;
    arguments.insert(arguments.begin(), {python, "-m", "zsi.farm"});
    std::vector<char*> line;
    line.reserve(arguments.size() + 1);
    for (std::string& argument : arguments)
        line.push_back(argument.data());
    line.push_back(nullptr);
    execvp(python.c_str(), line.data());
    throw host::InputError(fmt::format("farm: {} cannot be run: {}", python, std::strerror(errno)));
}

} // namespace

Subcommand addFarm(CLI::App& app, std::string const& shaderPath)
{
    CLI::App* const command =
        app.add_subcommand("farm", "Render pictures on many machines (its own --help tells how)");
    command->allow_extras()->fallthrough(false); // all to the other program
    command->set_help_flag();
    auto const own = std::make_shared<std::string>();
    command->add_option("--shader-path", *own);
    auto const help = std::make_shared<bool>(false);
    command->add_flag("-h,--help", *help, "Print the options of the command");
    return {command, [=, &shaderPath] {
                std::vector<std::string> arguments = command->remaining();
                if (*help)
                    arguments = {"--help"};
                return farm(std::move(arguments), own->empty() ? shaderPath : *own);
            }};
}

} // namespace zsi::cmd
