// SPDX-License-Identifier: Apache-2.0
#include "plugin/shaderLibrary.h"

#include "base/error.h"
#include "plugin/symbolTable.h"

#include <algorithm>
#include <cstdlib>
#include <dlfcn.h>
#include <fmt/format.h>
#include <map>
#include <set>

namespace zsi::host {

namespace fs = std::filesystem;

namespace {

constexpr std::string_view kCreateSuffix = "_create";
constexpr std::string_view kVersionSuffix = "_getAPIVersion";

/// Names that have both functions.
std::vector<std::string> classesIn(std::vector<std::string> const& functions)
{
    std::set<std::string> const known(functions.begin(), functions.end());
    std::vector<std::string> classes;
    for (std::string const& name : known) {
        if (name.size() <= kCreateSuffix.size() || !name.ends_with(kCreateSuffix))
            continue;
        std::string className = name.substr(0, name.size() - kCreateSuffix.size());
        if (known.contains(fmt::format("{}{}", className, kVersionSuffix)))
            classes.push_back(std::move(className));
    }
    return classes;
}

template <class Function>
Function function(void* handle, std::string const& name)
{
    return reinterpret_cast<Function>(dlsym(handle, name.c_str()));
}

} // namespace

struct ShaderLibraries::Library {
    std::shared_ptr<void> handle;
    LibraryDescription description;
};

void ShaderLibraries::load(fs::path const& sharedObject)
{
    std::string const file = sharedObject.string();
    std::vector<std::string> const found = classesIn(exportedFunctions(sharedObject));
    if (found.empty())
        throw InputError(file
                         + ": no shader classes (pairs of <Class>_create and "
                           "<Class>_getAPIVersion)");
    auto library = std::make_shared<Library>();
    library->description = readDescription(sharedObject);
    // An absolute path, since a bare name would be searched for along the system's folders.
    void* const handle = dlopen(fs::absolute(sharedObject).c_str(), RTLD_NOW | RTLD_LOCAL);
    if (!handle)
        throw InputError(fmt::format("cannot load shader library: {}", dlerror()));
    library->handle.reset(handle, [](void* h) { dlclose(h); });

    std::map<std::string, Class> loaded;
    for (std::string const& name : found) {
        auto const create =
            function<CreateShaderFunction>(handle, fmt::format("{}{}", name, kCreateSuffix));
        auto const getVersion =
            function<GetApiVersionFunction>(handle, fmt::format("{}{}", name, kVersionSuffix));
        if (!create || !getVersion)
            throw InputError(fmt::format("{}: cannot find the functions of {}", file, name));
        if (int const version = getVersion(); version != kApiVersion)
            throw InputError(
                fmt::format("{}: {} was built against version {} of the shader interface, "
                            "this program has version {}",
                            file, name, version, kApiVersion));
        loaded[name] = {library, create};
    }
    classes_.insert(loaded.begin(), loaded.end());
    names_.clear();
    for (auto const& [name, entry] : classes_)
        names_.push_back(name);
}

std::vector<std::string> ShaderLibraries::loadDirectory(fs::path const& directory)
{
    std::error_code failed;
    std::vector<fs::path> files;
    for (auto const& entry : fs::directory_iterator(directory, failed))
        if (entry.path().extension() == ".so")
            files.push_back(entry.path());
    if (failed)
        throw InputError(fmt::format("{}: cannot open the shader directory ({})",
                                     directory.string(), failed.message()));
    std::sort(files.begin(), files.end());
    std::vector<std::string> leftOut;
    for (fs::path const& file : files) {
        try {
            load(file);
        } catch (InputError const& error) {
            leftOut.emplace_back(error.what());
        }
    }
    if (leftOut.size() == files.size()) {
        std::string reasons;
        for (std::string const& reason : leftOut)
            reasons.append("; ").append(reason);
        throw InputError(fmt::format("{}: no usable shader library in this directory{}",
                                     directory.string(), reasons));
    }
    return leftOut;
}

Shader ShaderLibraries::make(std::string const& knownClass) const
{
    Class const& entry = classes_.at(knownClass);
    Shader shader(knownClass, std::unique_ptr<IShaderBase>(entry.create()), entry.library->handle);
    shader.describe(entry.library->description);
    return shader;
}

std::vector<fs::path> shaderDirectories(std::string const& option)
{
    std::string list = option;
    if (char const* const variable = std::getenv("ZSI_SHADER_PATH"); list.empty() && variable)
        list = variable;
    std::vector<fs::path> directories;
    for (std::size_t begin = 0; begin < list.size();) {
        std::size_t const end = std::min(list.find(':', begin), list.size());
        if (end > begin)
            directories.emplace_back(list.substr(begin, end - begin));
        begin = end + 1;
    }
    if (directories.empty()) {
        std::error_code failed;
        fs::path const folder = fs::read_symlink("/proc/self/exe", failed).parent_path();
        fs::path const installed = (folder / ZSI_INSTALLED_SHADERS).lexically_normal();
        fs::path const beside = folder / "shaders";
        directories.push_back(
            !fs::exists(beside, failed) && fs::exists(installed, failed) ? installed : beside);
    }
    return directories;
}

} // namespace zsi::host
