// SPDX-License-Identifier: Apache-2.0
/// What the subcommands of `zsi` share. Each adds its options to the command line and gives back
/// what to run.
#pragma once

#include "plugin/shaderLibrary.h"

#include <functional>
#include <optional>
#include <stdexcept>
#include <string>

namespace CLI {
class App;
}

namespace zsi::cmd {

/// A command line that cannot be meant: exit status 2. Bad input is a host::InputError, status 1.
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

struct Subcommand {
    CLI::App* app;
    std::function<int()> run; ///< gives the exit status; call it after a successful parse
};

/// `shaderPath`: the global option, which outlives the subcommand and is filled by the parse.
Subcommand addInfo(CLI::App& app, std::string const& shaderPath);
Subcommand addRender(CLI::App& app, std::string const& shaderPath);
Subcommand addView(CLI::App& app, std::string const& shaderPath);
Subcommand addConvert(CLI::App& app);
Subcommand addSchema(CLI::App& app, std::string const& shaderPath);
Subcommand addDenoise(CLI::App& app);
Subcommand addRenderUnit(CLI::App& app, std::string const& shaderPath);
Subcommand addMerge(CLI::App& app);
Subcommand addFarm(CLI::App& app, std::string const& shaderPath);
Subcommand addLab(CLI::App& app, std::string const& shaderPath);

/// The options of how 8-bit pictures show light.
struct ViewOptions {
    std::optional<std::string> view;
    std::string ocioConfig;
};
void addViewOptions(CLI::App& command, ViewOptions& options);

/// All shader libraries; those that cannot be used lead to warnings on stderr.
host::ShaderLibraries loadLibraries(std::string const& shaderPath);

/// To stdout, at once. Throws InputError when that cannot be written.
void print(std::string const& text);
/// One line on stderr: "zsi: warning: ...".
void warn(std::string const& message);

} // namespace zsi::cmd
