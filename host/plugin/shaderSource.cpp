// SPDX-License-Identifier: Apache-2.0
#include "plugin/shaderSource.h"

#include "base/error.h"

#include <algorithm>
#include <fmt/format.h>

namespace zsi::host {

bool ShaderSource::has(std::string_view className) const
{
    return std::binary_search(classNames().begin(), classNames().end(), className);
}

Shader ShaderSource::create(std::string_view className) const
{
    if (!has(className))
        throw InputError(fmt::format("{}: unknown shader class{}", printable(className),
                                     suggestion(className, classNames())));
    return make(std::string(className));
}

StaticShaders::StaticShaders(Table table, LibraryDescription description)
    : table_(std::move(table))
    , description_(std::move(description))
{
    for (auto const& [name, create] : table_)
        names_.push_back(name);
}

Shader StaticShaders::make(std::string const& knownClass) const
{
    Shader shader(knownClass, std::unique_ptr<IShaderBase>(table_.at(knownClass)()));
    shader.describe(description_);
    return shader;
}

} // namespace zsi::host
