// SPDX-License-Identifier: Apache-2.0
// zsi lab: figures and numbers of what materials do to light.
#include "lab/lab.h"
#include "base/error.h"
#include "base/names.h"
#include "base/replacedFile.h"
#include "cmd/command.h"
#include "cmd/interruption.h"
#include "cmd/progressBar.h"
#include "cmd/sceneOptions.h"
#include "lab/checks.h"

#include <CLI/CLI.hpp>
#include <cstdio>
#include <fmt/format.h>
#include <memory>

namespace zsi::cmd {
namespace {

namespace fs = std::filesystem;

struct Arguments {
    std::vector<std::string> words, tables;
    std::string output;
    lab::LabOptions options;
    bool quiet = false, check = false;
};

/// The folder, made if it is not there; throws when no file can be written into it.
void prepareFolder(fs::path const& folder)
{
    std::error_code error;
    fs::create_directories(folder, error);
    if (error || !fs::is_directory(folder))
        throw host::InputError(
            fmt::format("{}: no folder can be made here: {}", folder.string(),
                        error ? error.message() : std::string("a file has this name")));
    host::ReplacedFile::check(folder / "lab.json");
}

int measureInto(Arguments const& arguments, host::ShaderLibraries const& libraries)
{
    std::vector<lab::Specimen> specimens = lab::specimensOf(arguments.words, libraries);
    for (std::string const& file : arguments.tables)
        specimens.push_back(lab::measuredSpecimen(file));
    if (specimens.empty())
        throw UsageError("what is to be measured is missing: CLASS name=value ..., or --merl FILE");
    prepareFolder(arguments.output);
    Interruption interruption;
    std::vector<lab::LabFile> files;
    {
        ProgressBar bar(!arguments.quiet);
        lab::LabOptions options = arguments.options;
        options.cancel = &interruption.defer();
        options.progress = [&](std::string const& what, double done) {
            bar.show("measuring, " + what, done);
        };
        files = lab::measure(specimens, options);
    }
    if (int const status = interruption.resume()) {
        std::fputs("zsi: interrupted, nothing written\n", stderr);
        return status;
    }
    for (lab::LabFile const& file : files) {
        host::ReplacedFile out(fs::path(arguments.output) / file.name);
        out.write(
            {reinterpret_cast<unsigned char const*>(file.content.data()), file.content.size()});
        out.commit();
    }
    if (!arguments.quiet)
        print(fmt::format("{}: {} files\n", arguments.output, files.size()));
    return 0;
}

/// Every material class, as it is made, that the libraries have.
std::vector<lab::Specimen> allMaterials(host::ShaderLibraries const& libraries)
{
    std::vector<lab::Specimen> specimens;
    for (std::string const& name : libraries.classNames()) {
        try {
            auto const shader = std::make_shared<host::Shader>(libraries.create(name));
            if (shader->material())
                specimens.emplace_back(name, *shader, shader);
        } catch (host::InputError const& error) {
            warn(error.what());
        }
    }
    return specimens;
}

int check(Arguments const& arguments, host::ShaderLibraries const& libraries)
{
    std::vector<lab::Specimen> const specimens = arguments.words.empty()
        ? allMaterials(libraries)
        : lab::specimensOf(arguments.words, libraries);
    lab::CheckOptions options;
    options.densities = specimens.size();
    options.draws = arguments.options.draws;
    options.seed = arguments.options.seed;
    options.threads = arguments.options.threads;
    int failures = 0;
    for (lab::Specimen const& specimen : specimens)
        for (lab::Check const& c : lab::checkMaterial(specimen, options)) {
            constexpr char const* kWords[] = {"ok", "n/a", "known", "FAIL"};
            bool const fails = c.verdict == lab::Verdict::Fails;
            failures += fails;
            if (!arguments.quiet || fails)
                print(fmt::format("{:5}  {}  {}: {}\n", kWords[static_cast<int>(c.verdict)],
                                  specimen.label(), c.name, c.text));
        }
    return failures ? 1 : 0;
}

} // namespace

Subcommand addLab(CLI::App& app, std::string const& shaderPath)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command = app.add_subcommand(
        "lab", "Measure materials: lobes, densities, albedo, reciprocity; figures and numbers");
    command->add_option(
        "MATERIAL", arguments->words,
        "CLASS name=value ..., or SCENE.json:NAME name=value ... for a material of a scene; "
        "several are overlaid, a + may stand between");
    auto* const output =
        command->add_option("-o,--output", arguments->output,
                            "The folder for figures (.svg, .png), numbers (.csv) and lab.json");
    output->type_name("FOLDER");
    command
        ->add_option("--merl", arguments->tables,
                     "A measured material in the MERL binary format, overlaid; with the error of "
                     "the others to it")
        ->type_name("FILE")
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
        ->allow_extra_args(false);
    command
        ->add_option("--angles", arguments->options.incident,
                     "Incident angles, degrees from the normal")
        ->delimiter(',')
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
        ->allow_extra_args(false)
        ->check(CLI::Range(0.0, 89.5))
        ->type_name("A[,A]");
    command->add_option("--draws", arguments->options.draws, "Draws of sample for each angle")
        ->check(CLI::Range(1024u, 1u << 26));
    command->add_option("--seed", arguments->options.seed, "Seed of the random numbers");
    command
        ->add_flag("--check", arguments->check,
                   "Check what has to hold of each material, of all classes where none is named; a "
                   "line a check, exit status 1 if one fails")
        ->excludes(output);
    addThreadsOption(*command, arguments->options.threads);
    command->add_flag("-q,--quiet", arguments->quiet, "Tell of nothing but errors");
    return {command, [=, &shaderPath] {
                if (arguments->check)
                    return check(*arguments, loadLibraries(shaderPath));
                if (arguments->output.empty())
                    throw UsageError("--output: the folder for the results is missing");
                return measureInto(*arguments, loadLibraries(shaderPath));
            }};
}

} // namespace zsi::cmd
