// SPDX-License-Identifier: Apache-2.0
// zsi info: what the loaded libraries offer.
#include "base/error.h"
#include "base/names.h"
#include "cmd/classText.h"
#include "cmd/command.h"

#include <CLI/CLI.hpp>
#include <memory>
#include <nlohmann/json.hpp>

namespace zsi::cmd {
namespace {

/// One object of each class; a class that gives none leads to a warning.
std::vector<host::Shader> allShaders(host::ShaderLibraries const& libraries)
{
    std::vector<host::Shader> shaders;
    for (std::string const& name : libraries.classNames()) {
        try {
            shaders.push_back(libraries.create(name));
        } catch (host::InputError const& error) {
            warn(error.what());
        }
    }
    return shaders;
}

/// Those that have `word` in their names or in what they model, whatever the case of letters.
std::vector<host::Shader> shadersAbout(std::string const& word,
                                       host::ShaderLibraries const& libraries)
{
    std::vector<host::Shader> found;
    for (host::Shader& shader : allShaders(libraries))
        if (host::lowered(shader.className() + '\n' + shader.text()).find(host::lowered(word))
            != std::string::npos)
            found.push_back(std::move(shader));
    return found;
}

struct Arguments {
    std::string classOrWord;
    bool json = false, markdown = false;
};

int info(Arguments const& arguments, std::string const& shaderPath)
{
    host::ShaderLibraries const libraries = loadLibraries(shaderPath);
    std::string const& name = arguments.classOrWord;
    bool const isClass = libraries.has(name);
    std::vector<host::Shader> shaders;
    if (isClass)
        shaders.push_back(libraries.create(name));
    else
        shaders = name.empty() ? allShaders(libraries) : shadersAbout(name, libraries);
    if (shaders.empty() && !name.empty())
        throw host::InputError(host::printable(name)
                               + ": no shader class has this name or word in its description"
                               + host::suggestion(name, libraries.classNames()));

    std::string text;
    if (arguments.markdown)
        for (host::Shader const& shader : shaders)
            text += classMarkdown(shader);
    else if (arguments.json)
        text = (isClass ? classJson(shaders[0]) : listJson(shaders)).dump(2) + '\n';
    else
        text = isClass ? classText(shaders[0]) : listText(shaders);
    print(text);
    return 0;
}

} // namespace

Subcommand addInfo(CLI::App& app, std::string const& shaderPath)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command = app.add_subcommand(
        "info", "List the shader classes, or the parameters and vertex attributes of one");
    command->add_option("CLASS", arguments->classOrWord,
                        "A class; or a word, such as glass, for the classes that are about it. "
                        "Without it all are listed");
    auto* const json = command->add_flag("--json", arguments->json, "Write JSON, for programs");
    command->add_flag("--markdown", arguments->markdown, "Write manual pages")->excludes(json);
    return {command, [=, &shaderPath] { return info(*arguments, shaderPath); }};
}

} // namespace zsi::cmd
