// SPDX-License-Identifier: Apache-2.0
#include "load/environment.h"

#include "load/parameterValues.h"
#include "load/shaders.h"
#include "load/transforms.h"

namespace zsi::host {
namespace {

constexpr float kRadians = 0.0174532925f; // of a degree

} // namespace

void readEnvironment(JsonReader const& reader, SceneBuilder& builder)
{
    reader.onlyOf({"class", "file"});
    auto const visible = reader.find("visible");
    if (!reader.find("file")) {
        reader.expectKeys({"class", "parameters", "visible"});
        builder.scene.environmentVisible = visible && visible->toBool();
        builder.scene.environment = readShader(reader, kEnvironment, builder);
        return;
    }
    reader.expectKeys(
        {"file", "colorSpace", "visible", "rotate", "intensity", "diffuseBlur", "background"});
    builder.begin(reader);
    builder.scene.environmentVisible = !visible || visible->toBool();
    auto const rotate = reader.find("rotate"), intensity = reader.find("intensity");
    auto const blur = reader.find("diffuseBlur"), background = reader.find("background");
    Vec3f gain{1, 1, 1};
    if (intensity && intensity->kind() == JsonValue::Kind::Array)
        gain = intensity->toVec3f();
    else if (intensity)
        gain = gain * intensity->toFloat(0);
    Shader shader = createShader(reader, "corvid_Env_Default", builder);
    shader.set("globalIBLMatrix", turnAroundZ(rotate ? rotate->toFloat() : 0.0f));
    shader.set("reflectionCube", readPictureAround(reader, 0.0f, *builder.scene.textures));
    shader.set("diffuseCube",
               readPictureAround(reader, blur ? blur->toFloat(0, 90) * kRadians : 0.0f,
                                 *builder.scene.textures));
    for (char const* kind : {"reflect", "diffuse"}) {
        shader.set(std::string(kind) + "IBLGainMode", 1); // by channel
        shader.set(std::string(kind) + "IBLGain", gain);
    }
    shader.set("backgroundColor", background ? background->toVec3f() : Vec3f(0, 0, 0));
    builder.scene.environment = std::move(shader);
}

} // namespace zsi::host
