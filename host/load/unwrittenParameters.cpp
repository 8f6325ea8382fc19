#include "load/unwrittenParameters.h"

#include <algorithm>
#include <limits>
#include <optional>

namespace zsi::host {

namespace {

/// What a name's ending says about when the parameter is read.
struct Ending {
    std::string_view text;
    /// Values of `<x>Mode` that read it. Mapping modes are 0 colour, 1 uv, 2 to 4 projections, of
    /// which 4 wraps around an axis and needs the way back.
    int leastMode, mostMode;
    bool ofMap; ///< read only while the channel is switched on and its texture bound
};

constexpr int kAnyMode = std::numeric_limits<int>::max();

constexpr Ending kEndings[] = {
    {"TextureMatrixInverse", 4, 4, true},
    {"TextureMatrix", 2, 4, true},
    {"UVMatrix", 1, 1, true},
    {"MapTransform", 1, kAnyMode, true},
    {"Transform", 1, kAnyMode, true},
    {"transform", 1, kAnyMode, true},
    {"Rotation", 1, kAnyMode, true},
    {"Color", 0, 0, false},
};

template <class Value>
Value valueOf(Parameter const& p)
{
    return *static_cast<Value const*>(p.field);
}

bool isTexture(Parameter const& p) { return p.type >= ParameterType::Texture1D; }

bool isBound(Parameter const& p)
{
    // All handles begin with the texture object.
    return valueOf<void const*>(p) != nullptr;
}

/// Whether the channel `x` is switched off, by a switch that it has.
bool isOff(Shader const& shader, std::string const& x)
{
    for (char const* const name : {"Enable", "MapEnable", ""})
        if (Parameter const* const p = shader.find(x + name)) {
            if (p->type == ParameterType::Bool && !valueOf<bool>(*p))
                return true;
            if (p->type == ParameterType::Int && valueOf<int>(*p) <= 0)
                return true;
        }
    return false;
}

/// Whether the channel `x` has textures; of those that it has, whether one is bound.
std::optional<bool> textureBound(Shader const& shader, std::string const& x)
{
    std::optional<bool> bound;
    for (char const* const name : {"Map", "Texture", "Cube", ""})
        if (Parameter const* const p = shader.find(x + name); p && isTexture(*p))
            bound = bound.value_or(false) || isBound(*p);
    return bound;
}

std::optional<bool> cubeBound(Shader const& shader)
{
    std::optional<bool> bound;
    for (Parameter const& p : shader.parameters())
        if (p.type == ParameterType::TextureCube)
            bound = bound.value_or(false) || isBound(p);
    return bound;
}

bool isRead(Shader const& shader, Parameter const& p)
{
    bool const isMatrix = p.type == ParameterType::Mat3f || p.type == ParameterType::Mat4f;
    for (Ending const& ending : kEndings) {
        if (!p.name.ends_with(ending.text))
            continue;
        std::string const x = p.name.substr(0, p.name.size() - ending.text.size());
        Parameter const* const mode = shader.find(x + "Mode");
        if (mode && mode->type == ParameterType::Int) {
            int const value = valueOf<int>(*mode);
            if (value < ending.leastMode || value > ending.mostMode)
                return false;
        }
        if (!ending.ofMap)
            return true;
        if (isOff(shader, x))
            return false;
        if (std::optional<bool> const bound = textureBound(shader, x))
            return *bound;
        break;
    }
    return !isMatrix || cubeBound(shader).value_or(true);
}

} // namespace

std::vector<std::string> unwrittenParameters(Shader const& shader,
                                             std::set<std::string> const& written)
{
    std::vector<std::string> names;
    for (Parameter const& p : shader.parameters())
        if (!p.about.hasDefault && !written.contains(p.name) && isRead(shader, p))
            names.push_back(p.name);
    return names;
}

} // namespace zsi::host
