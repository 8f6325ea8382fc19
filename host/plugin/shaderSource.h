// SPDX-License-Identifier: Apache-2.0
/// Where shaders come from, whatever holds their code.
#pragma once

#include "plugin/shader.h"

#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace zsi::host {

/// Makes shader objects by class name.
class ShaderSource {
public:
    virtual ~ShaderSource() = default;

    virtual std::vector<std::string> const& classNames() const = 0; ///< sorted
    bool has(std::string_view className) const;
    /// A new object of the class. Throws InputError for an unknown class (with the nearest ones)
    /// and for an object that cannot be made.
    Shader create(std::string_view className) const;

protected:
    ShaderSource() = default;
    ShaderSource(ShaderSource&&) = default;
    ShaderSource& operator=(ShaderSource&&) = default;

private:
    virtual Shader make(std::string const& knownClass) const = 0;
};

/// Classes whose code is part of the program: no shared object has to be found.
class StaticShaders final : public ShaderSource {
public:
    /// Class name to a function that gives a new object, such as a library's `<Class>_create`.
    using Table = std::map<std::string, std::function<IShaderBase*()>>;

    /// `description`: as it lies beside a library (`readDescription`); without one, matrices count
    /// as having no default.
    explicit StaticShaders(Table table, LibraryDescription description = {});

    std::vector<std::string> const& classNames() const override { return names_; }

private:
    Shader make(std::string const& knownClass) const override;

    Table table_;
    LibraryDescription description_;
    std::vector<std::string> names_;
};

} // namespace zsi::host
