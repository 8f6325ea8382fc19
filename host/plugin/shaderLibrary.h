// SPDX-License-Identifier: Apache-2.0
/// Loads shader libraries.
#pragma once

#include "plugin/shaderSource.h"

#include <filesystem>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace zsi::host {

/// All classes of the libraries of the shader directories. A class found twice is the first's.
class ShaderLibraries final : public ShaderSource {
public:
    /// Loads one shared object, with its description where a file of the same name with the
    /// extension .json lies beside it (meaning of each parameter, and whether it has a default;
    /// without one, matrices count as having none), and finds its classes (pairs of `_create` and
    /// `_getAPIVersion` in its dynamic symbols). Throws InputError when it cannot be loaded, has
    /// none, or was built against another interface version.
    void load(std::filesystem::path const& sharedObject);
    /// Loads every shared object (*.so) of the directory, by name. One that cannot be used does not
    /// keep the others away: the result tells why each was left out. Throws InputError when the
    /// directory cannot be read or none of its libraries can be used.
    std::vector<std::string> loadDirectory(std::filesystem::path const& directory);

    std::vector<std::string> const& classNames() const override { return names_; }

private:
    struct Library;
    struct Class {
        std::shared_ptr<Library const> library;
        CreateShaderFunction create;
    };

    Shader make(std::string const& knownClass) const override;

    std::map<std::string, Class> classes_;
    std::vector<std::string> names_;
};

/// Where to look for shader libraries: the option when not empty, else ZSI_SHADER_PATH (colon
/// separated), else `shaders` beside the program, else the folder that the installation has for
/// them (such as ../lib/zsi/shaders from the program).
std::vector<std::filesystem::path> shaderDirectories(std::string const& option);

} // namespace zsi::host
