// SPDX-License-Identifier: Apache-2.0
#include "load/shaders.h"

#include "base/error.h"
#include "base/names.h"
#include "load/parameterValues.h"
#include "load/unwrittenParameters.h"

#include <fmt/format.h>

namespace zsi::host {
namespace {

void warnAboutUnwritten(JsonReader const& reader, Shader const& shader,
                        std::set<std::string> const& written, SceneBuilder& builder)
{
    std::vector<std::string> const names = unwrittenParameters(shader, written);
    if (names.empty())
        return;
    builder.scene.warnings.push_back(
        fmt::format("{}: {} reads {}, which {} no default and {} not written here (0 is used)",
                    reader.place(), shader.className(), fmt::join(names, ", "),
                    names.size() == 1 ? "has" : "have", names.size() == 1 ? "is" : "are"));
}

} // namespace

Shader readShader(JsonReader const& reader, ShaderKind wanted, SceneBuilder& builder)
{
    builder.begin(reader);
    JsonReader const className = reader.at("class");
    Shader shader = createShader(className, className.toString(), builder);
    if (shader.kind() != wanted) {
        constexpr char const* kKinds[] = {"a material", "a light", "an environment"};
        className.fail(fmt::format("{} is {}, expected {}", shader.className(),
                                   kKinds[shader.kind()], kKinds[wanted]));
    }
    std::set<std::string> written;
    if (auto const parameters = reader.find("parameters"))
        for (auto const& [name, value] : parameters->members()) {
            Parameter const* const parameter = shader.find(name);
            if (!parameter)
                value.fail(fmt::format("unknown parameter of {}{}", shader.className(),
                                       suggestion(name, shader.parameterNames())));
            shader.set(name, readParameterValue(value, parameter->type, *builder.scene.textures));
            written.insert(name);
        }
    warnAboutUnwritten(reader, shader, written, builder);
    for (Parameter const& p : shader.parameters())
        if (p.about.objectSize > 0 && p.type == ParameterType::Float && wanted == kMaterial
            && !written.contains(p.name))
            builder.openLengths.push_back(
                {builder.scene.materials.size(), p.name, p.about.objectSize});
    return shader;
}

Shader createShader(JsonReader const& place, std::string const& name, SceneBuilder const& builder)
{
    try {
        return builder.shaders.create(name);
    } catch (InputError const& error) {
        place.fail(error.what());
    }
}

} // namespace zsi::host
