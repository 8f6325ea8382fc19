// SPDX-License-Identifier: Apache-2.0
#include "load/unwrittenParameters.h"

#include <algorithm>

namespace zsi::host {

namespace {

template <class Value>
Value valueOf(Parameter const& p)
{
    return *static_cast<Value const*>(p.field);
}

bool isOn(Parameter const& p, Condition const& condition)
{
    switch (p.type) {
    case ParameterType::Bool:
        return valueOf<bool>(p);
    case ParameterType::Int: {
        int const value = valueOf<int>(p);
        return condition.from ? value >= *condition.from && value <= *condition.to : value > 0;
    }
    case ParameterType::Texture1D:
    case ParameterType::Texture2D:
    case ParameterType::TextureCube:
        return valueOf<void const*>(p) != nullptr; // all handles begin with the texture object
    default:
        return true;
    }
}

bool holds(Shader const& shader, Condition const& condition)
{
    return std::any_of(condition.parameters.begin(), condition.parameters.end(),
                       [&](std::string const& name) {
                           Parameter const* const p = shader.find(name);
                           return !p || isOn(*p, condition);
                       });
}

} // namespace

std::vector<std::string> unwrittenParameters(Shader const& shader,
                                             std::set<std::string> const& written)
{
    std::vector<std::string> names;
    for (Parameter const& p : shader.parameters())
        if (!p.about.hasDefault && !written.contains(p.name)
            && std::all_of(p.about.when.begin(), p.about.when.end(),
                           [&](Condition const& c) { return holds(shader, c); }))
            names.push_back(p.name);
    return names;
}

} // namespace zsi::host
