// SPDX-License-Identifier: Apache-2.0
// zsi merge: units of a picture to the picture.
#include "base/error.h"
#include "base/names.h"
#include "base/threads.h"
#include "cmd/command.h"
#include "cmd/interruption.h"
#include "cmd/progressBar.h"
#include "cmd/sceneOptions.h"
#include "denoise/denoise.h"
#include "film/imageFile.h"
#include "render/merging.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <atomic>
#include <fmt/format.h>
#include <fstream>
#include <iostream>
#include <memory>
#include <mutex>

namespace zsi::cmd {
namespace {

namespace fs = std::filesystem;

struct Arguments {
    std::vector<std::string> units;
    std::string list, output;
    ViewOptions view;
    bool denoise = false, partial = false, quiet = false;
    int threads = 0;
};

/// The .exr files of folders, by name, and files as they are.
std::vector<std::string> unitFiles(Arguments const& arguments)
{
    std::vector<std::string> named = arguments.units;
    if (!arguments.list.empty()) {
        std::ifstream file;
        if (arguments.list != "-")
            file.open(arguments.list);
        std::istream& in = arguments.list == "-" ? std::cin : file;
        if (!in)
            throw host::InputError(arguments.list + ": cannot be read");
        for (std::string line; std::getline(in, line);)
            if (!line.empty())
                named.push_back(line);
    }
    std::vector<std::string> files;
    for (std::string const& name : named) {
        std::error_code error;
        if (!fs::is_directory(name, error)) {
            files.push_back(name);
            continue;
        }
        auto const before = static_cast<std::ptrdiff_t>(files.size());
        for (auto const& entry : fs::directory_iterator(name))
            if (entry.path().extension() == ".exr")
                files.push_back(entry.path().string());
        std::sort(files.begin() + before, files.end());
        if (files.size() == static_cast<std::size_t>(before))
            throw host::InputError(name + ": has no .exr files");
    }
    if (files.empty())
        throw UsageError("no units: expected files, folders of .exr files, or --list");
    return files;
}

class Merge {
public:
    Merge(Arguments const& arguments, std::atomic<bool> const& interrupted)
        : arguments_(arguments)
        , interrupted_(interrupted)
        , files_(unitFiles(arguments))
        , isUsable_(files_.size(), 1)
        , bar_(!arguments.quiet)
    {
    }

    /// What is wrong by the headers alone, so that nobody waits for the sums to hear of it.
    void check()
    {
        host::Merging claims;
        for (std::size_t i = 0; i < files_.size() && !interrupted_; ++i) {
            bar_.show("checking", share(i));
            unlessDamaged(
                i, [&] { return host::readUnitHead(files_[i]); },
                [&](host::UnitHead const& head) { claims.claim(files_[i], head); });
        }
        if (!interrupted_)
            refuseMissing(claims);
    }

    /// Several units are read at a time, each added and forgotten.
    host::Merging const& run()
    {
        std::atomic<std::size_t> next = 0;
        std::size_t done = 0;
        std::mutex lock;
        host::onThreads(arguments_.threads, [&] {
            for (std::size_t i; !interrupted_ && (i = next++) < files_.size();)
                if (isUsable_[i])
                    unlessDamaged(
                        i, [&] { return host::readUnit(files_[i]); },
                        [&](host::Unit const& unit) {
                            std::lock_guard const one(lock);
                            merging_.add(files_[i], unit);
                            bar_.show("merging", share(++done));
                        });
        });
        if (!interrupted_)
            refuseMissing(merging_);
        return merging_;
    }

private:
    double share(std::size_t i) const
    {
        return static_cast<double>(i) / static_cast<double>(files_.size());
    }
    /// use(read()); with --partial a unit that cannot be read is told of and left out.
    template <class Read, class Use>
    void unlessDamaged(std::size_t i, Read const& read, Use const& use)
    {
        std::optional<decltype(read())> unit;
        try {
            unit = read();
        } catch (host::InputError const& error) {
            if (!arguments_.partial)
                throw;
            warn(std::string(error.what()) + "; left out");
            isUsable_[i] = 0;
            return;
        }
        use(*unit);
    }
    void refuseMissing(host::Merging const& merging) const
    {
        if (merging.units() == 0)
            throw host::InputError("no unit that can be read");
        std::string const missing = merging.missingText();
        if (!missing.empty() && !arguments_.partial)
            throw host::InputError("missing: " + missing + " (--partial takes what there is)");
    }

    Arguments const& arguments_;
    std::atomic<bool> const& interrupted_;
    std::vector<std::string> files_;
    std::vector<char> isUsable_; ///< each file
    host::Merging merging_;
    ProgressBar bar_;
};

int merge(Arguments const& arguments)
{
    host::checkPictureFile(arguments.output);
    Interruption interruption;
    std::atomic<bool> const& interrupted = interruption.defer();
    host::Picture picture;
    host::ScreenView view;
    std::string told;
    {
        Merge merge(arguments, interrupted);
        merge.check();
        host::Merging const& merged = merge.run();
        if (!interrupted) {
            view = merged.origin().development.view;
            view.ocioConfig = arguments.view.ocioConfig;
            view.view = arguments.view.view.value_or(view.view);
            host::screenTransform(view); // refuses what it cannot show
            picture = merged.picture();
            told = fmt::format("{:.4g} samples a pixel, {} units, {} rays, {} non-finite results "
                               "left out",
                               merged.film().meanSamples(), merged.units(), merged.rays(),
                               merged.nonFinite());
            if (std::string const missing = merged.missingText(); !missing.empty())
                told += "; missing: " + missing;
        }
    }
    if (arguments.denoise && !interrupted) {
        ProgressBar bar(!arguments.quiet);
        host::DenoiseOptions options;
        options.threads = arguments.threads;
        options.cancel = &interrupted;
        options.progress = [&](double done) { bar.show("denoising", done); };
        if (auto result = host::denoised(picture, options))
            picture = std::move(*result);
    }
    if (int const status = interruption.resume()) {
        std::fputs("zsi: interrupted, no picture written\n", stderr);
        return status;
    }
    host::writePicture(arguments.output, picture, view);
    if (!arguments.quiet)
        print(fmt::format("{}: {}x{}, {}\n", arguments.output, picture.width(), picture.height(),
                          told));
    return 0;
}

} // namespace

Subcommand addMerge(CLI::App& app)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command = app.add_subcommand("merge", "Add units of a picture up to it");
    command->add_option("UNIT", arguments->units,
                        "What render-unit wrote: files, and folders of .exr files");
    command
        ->add_option("--list", arguments->list,
                     "A file that names more, one a line; - is standard input")
        ->type_name("FILE");
    command
        ->add_option("-o,--output", arguments->output,
                     "The picture: .exr or .hdr linear, .png or .jpg for the screen")
        ->required()
        ->type_name("FILE");
    command->add_flag("--partial", arguments->partial,
                      "A picture of what there is, where units are missing or damaged");
    addViewOptions(*command, arguments->view);
    command->add_flag("--denoise", arguments->denoise,
                      "Take the noise out; the units were rendered with --layers halves");
    addThreadsOption(*command, arguments->threads);
    command->add_flag("-q,--quiet", arguments->quiet, "Tell of nothing but errors");
    return {command, [=] { return merge(*arguments); }};
}

} // namespace zsi::cmd
