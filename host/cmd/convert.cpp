// SPDX-License-Identifier: Apache-2.0
// zsi convert: a model as the scene that shows it.
#include "base/error.h"
#include "base/names.h"
#include "base/replacedFile.h"
#include "cmd/command.h"
#include "model/gltfFile.h"
#include "model/modelScene.h"
#include "json/jsonText.h"

#include <CLI/CLI.hpp>
#include <fmt/format.h>
#include <memory>

namespace zsi::cmd {
namespace {

namespace fs = std::filesystem;

struct Arguments {
    std::string model, scene;
    bool quiet = false;
};

void write(fs::path const& file, std::span<unsigned char const> bytes)
{
    host::ReplacedFile goal(file);
    goal.write(bytes);
    goal.commit();
}

int convert(Arguments const& arguments)
{
    if (!host::isModel(arguments.model))
        throw host::InputError(
            fmt::format("{}: expected a model: a .gltf, .glb, .obj, .ply or .stl file",
                        host::printable(arguments.model)));
    fs::path const scene = arguments.scene;
    if (scene.extension() != ".json")
        throw UsageError(
            fmt::format("{}: expected the name of a .json file", host::printable(arguments.scene)));
    host::ReplacedFile::check(scene);
    std::string const folder = scene.stem().string() + "_pictures";
    host::ModelScene const made = host::modelScene(arguments.model, {scene.parent_path(), folder});
    if (!arguments.quiet)
        for (std::string const& warning : made.warnings)
            warn(warning);
    // The scene last: where it stands, its pictures do.
    std::shared_ptr<host::GltfFile const> model;
    for (auto const& [name, image] : made.pictures) {
        if (!model) {
            model = host::GltfFile::open(arguments.model);
            std::error_code failed;
            fs::create_directories(scene.parent_path() / folder, failed);
            if (failed)
                throw host::InputError(fmt::format("{}: cannot be made: {}",
                                                   (scene.parent_path() / folder).string(),
                                                   failed.message()));
        }
        write(scene.parent_path() / name, model->imageBytes(image));
    }
    std::string const text = host::jsonText(made.document);
    write(scene, {reinterpret_cast<unsigned char const*>(text.data()), text.size()});
    return 0;
}

} // namespace

Subcommand addConvert(CLI::App& app)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command =
        app.add_subcommand("convert", "Write the scene that shows a model, for editing");
    command->add_option("MODEL", arguments->model, "The model: glTF, GLB, OBJ, PLY or STL")
        ->required();
    command
        ->add_option("SCENE", arguments->scene,
                     "The scene file; pictures that lie in the model go into the folder "
                     "NAME_pictures beside it")
        ->required();
    command->add_flag("-q,--quiet", arguments->quiet, "Tell of nothing but errors");
    command->footer("It renders to the same picture, bit for bit, as the model itself.");
    return {command, [=] { return convert(*arguments); }};
}

} // namespace zsi::cmd
