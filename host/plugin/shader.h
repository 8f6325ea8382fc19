// SPDX-License-Identifier: Apache-2.0
/// Shader objects that can be described and set by name.
#pragma once

#include "base/names.h"
#include "plugin/description.h"

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <variant>
#include <vector>
#include <zsi/zsi.h>

namespace zsi::host {

/// In the order of `zsi::ParameterTypes` and of the alternatives of `ParameterValue`.
enum class ParameterType {
    Bool,
    Int,
    Float,
    Vec2f,
    Vec3f,
    Vec4f,
    Mat3f,
    Mat4f,
    Texture1D,
    Texture2D,
    TextureCube,
};

char const* typeName(ParameterType type); ///< "bool", "int", ..., "textureCube"

/// A parameter as a shader object registered it; `field` points into that object.
struct Parameter {
    std::string name;
    ParameterType type;
    void* field;
    ParameterDescription about = {}; ///< from the library's description
};

struct Attribute {
    std::string name;
    int kind; ///< a `zsi::AttributeKind`
    long offset; ///< bytes into `ShadeState::attributes`
};

/// A value for a parameter. Textures are given as handles' host pointers.
using ParameterValue =
    std::variant<bool, int, float, Vec2f, Vec3f, Vec4f, Mat3f, Mat4f, HostTexture1D const*,
                 HostTexture2D const*, HostTextureCube const*>;

/// A shader object with what it told about itself. Movable; owns the object and keeps the library
/// that made it loaded.
class Shader {
public:
    /// Takes the object over and lets it register. `library`: what keeps the object's code loaded,
    /// if anything has to. Throws InputError for a null object, an unknown kind, or an attribute
    /// outside the attribute block.
    Shader(std::string className, std::unique_ptr<IShaderBase> object,
           std::shared_ptr<void const> library = {});
    Shader(Shader&&) noexcept;
    ~Shader();
    Shader& operator=(Shader&& other) noexcept;

    std::string const& className() const { return className_; }
    int kind() const; ///< a `zsi::ShaderKind`
    int entryPoints() const { return entryPoints_; } ///< mask of `zsi::EntryPoint`
    std::vector<Parameter> const& parameters() const { return parameters_; } ///< registered order
    std::vector<Attribute> const& attributes() const { return attributes_; }
    Parameter const* find(std::string_view name) const; ///< null when there is none
    std::vector<std::string> parameterNames() const; ///< registered order
    std::string const& summary() const { return summary_; } ///< a line, empty if not described
    std::string const& text() const { return text_; } ///< what the class models, likewise
    /// Properties that its formulas leave out on purpose (`ClassDescription`).
    std::map<std::string, std::string> const& departures() const { return departures_; }
    void describe(LibraryDescription const& description);

    /// Writes the field. Throws InputError for an unknown name (with the nearest ones) or a type
    /// that does not fit; an int is taken for a float.
    void set(std::string_view name, ParameterValue const& value);

    IShaderBase* object() const { return object_.get(); }
    MaterialShader const* material() const; ///< null when it is none
    LightShader const* light() const;
    EnvironmentShader const* environment() const;

private:
    std::string className_;
    std::shared_ptr<void const> library_; ///< before the object, so that it goes after it
    std::unique_ptr<IShaderBase> object_;
    int entryPoints_ = 0;
    std::vector<Parameter> parameters_;
    std::vector<Attribute> attributes_;
    std::string summary_, text_;
    std::map<std::string, std::string> departures_;
};

} // namespace zsi::host
