// SPDX-License-Identifier: Apache-2.0
// zsi view: a session for web pages.
#include "cmd/classText.h"
#include "cmd/command.h"
#include "view/pageFiles.h"
#include "view/server.h"

#include <CLI/CLI.hpp>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <spawn.h>

namespace zsi::cmd {
namespace {

struct Arguments {
    std::string scene, address = "127.0.0.1", saveFolder;
    unsigned short port = 0;
    std::vector<std::string> assignments;
    bool noOpen = false, quiet = false;
};

/// Where there is a desktop; nothing comes of it where there is none.
void openBrowser(std::string const& url)
{
    if (!std::getenv("DISPLAY") && !std::getenv("WAYLAND_DISPLAY"))
        return;
    std::string program = "xdg-open", address = url;
    char* const argv[] = {program.data(), address.data(), nullptr};
    pid_t child = 0;
    posix_spawnp(&child, program.c_str(), nullptr, nullptr, argv, environ);
}

int view(Arguments const& arguments, std::string const& shaderPath)
{
    host::ShaderLibraries const libraries = loadLibraries(shaderPath);
    view::OpenedScene const opened =
        view::openScene(arguments.scene, libraries, arguments.assignments);
    view::StudioOptions options;
    options.version = ZSI_VERSION;
    if (!arguments.saveFolder.empty())
        options.saveFolder = arguments.saveFolder;
    else if (opened.isFile)
        options.saveFolder = std::filesystem::absolute(opened.file).parent_path();
    options.describeClass = classJson;
    options.listClasses = listJson;
    view::Server server({arguments.address, arguments.port});
    view::Studio studio(opened, libraries, std::move(options));
    if (!arguments.quiet)
        for (std::string const& warning : studio.warnings())
            warn(warning);
    if (!server.isLoopback())
        warn(arguments.address
             + ": other machines reach this; who has the address below can edit "
               "and save the scene, and what is sent can be read on the way");
    if (view::pageFiles().empty())
        warn("this build has no page (it was built without npm); the session answers programs "
             "alone");
    print(server.url() + '\n');
    if (!arguments.noOpen && !view::pageFiles().empty())
        openBrowser(server.url());
    server.run(studio);
    return 0;
}

} // namespace

Subcommand addView(CLI::App& app, std::string const& shaderPath)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command =
        app.add_subcommand("view", "Edit a scene in the browser, with its picture beside");
    command
        ->add_option(
            "SCENE", arguments->scene,
            "The scene, a JSON file; a model (glTF, GLB, OBJ, PLY, STL); or a shader class, shown "
            "on a small stage")
        ->required();
    command->add_option("--port", arguments->port, "Port to serve on; 0 is any that is free");
    command
        ->add_option("--bind", arguments->address,
                     "Address to serve on; other machines reach any but a loopback address")
        ->type_name("ADDRESS");
    command->add_flag("--no-open", arguments->noOpen, "Open no browser");
    command
        ->add_option("--save", arguments->saveFolder,
                     "Folder that scenes are saved in; without it that of the scene file")
        ->check(CLI::ExistingDirectory)
        ->type_name("FOLDER");
    command
        ->add_option("--set", arguments->assignments,
                     "Put a value in the place of the scene's, as for zsi render")
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
        ->allow_extra_args(false)
        ->type_name("PATH=VALUE");
    command->add_flag("-q,--quiet", arguments->quiet, "Tell of nothing but the address and errors");
    command->footer("Ctrl-C ends it.");
    return {command, [=, &shaderPath] { return view(*arguments, shaderPath); }};
}

} // namespace zsi::cmd
