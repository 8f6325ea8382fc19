// SPDX-License-Identifier: Apache-2.0
#include "lab/specimen.h"

#include "base/error.h"
#include "base/names.h"
#include "load/loadScene.h"
#include "load/parameterValues.h"
#include "measure/materialProbe.h"
#include "texture/textureStore.h"

#include <algorithm>
#include <fmt/format.h>
#include <limits>

namespace zsi::lab {
namespace {

using host::InputError;
using host::JsonValue;
using host::ParameterType;
using host::Shader;

/// A shader with the pictures that its handles point to.
struct Owned {
    std::shared_ptr<host::TextureStore> textures;
    Shader shader;
};

bool takesNumbers(ParameterType type)
{
    return type >= ParameterType::Vec2f && type <= ParameterType::Mat4f;
}

void setSource(JsonValue& value, std::shared_ptr<std::filesystem::path const> const& source)
{
    value.file = source; // relative to the current folder, and without lines
    value.line = 0;
    for (JsonValue& item : value.items)
        setSource(item, source);
    for (host::JsonMember& member : value.members)
        setSource(member.value, source);
}

/// What the text says for a parameter of that type.
JsonValue valueOf(std::string const& text, ParameterType type,
                  std::shared_ptr<std::filesystem::path const> const& source)
{
    bool const isTexture = type >= ParameterType::Texture1D;
    JsonValue value;
    if (isTexture && !text.starts_with('{')) {
        JsonValue file;
        file.kind = JsonValue::Kind::String;
        file.text = text;
        value.kind = JsonValue::Kind::Object;
        value.members.push_back({type == ParameterType::TextureCube ? "cube" : "texture", file});
    } else {
        bool const bare = takesNumbers(type) && !text.starts_with('[') && !text.starts_with('{');
        try {
            value = host::parseJson(bare ? '[' + text + ']' : text, *source);
        } catch (InputError const&) {
            value.kind = JsonValue::Kind::String;
            value.text = text;
        }
    }
    setSource(value, source);
    return value;
}

void assign(Shader& shader, std::string const& word, host::TextureStore& textures)
{
    std::size_t const equals = word.find('=');
    std::string const name = word.substr(0, equals);
    host::Parameter const* const parameter = shader.find(name);
    if (!parameter)
        throw InputError(fmt::format("{}: unknown parameter of {}{}", host::printable(name),
                                     shader.className(),
                                     host::suggestion(name, shader.parameterNames())));
    auto const source = std::make_shared<std::filesystem::path const>(shader.className());
    JsonValue const value = valueOf(word.substr(equals + 1), parameter->type, source);
    shader.set(name,
               host::readParameterValue(host::JsonReader(value, name), parameter->type, textures));
}

/// A material of a scene file; `word` is FILE:NAME.
std::shared_ptr<Owned> ofScene(std::string const& word, std::size_t colon,
                               host::ShaderSource const& shaders)
{
    std::string const file = word.substr(0, colon), name = word.substr(colon + 1);
    host::Scene scene = host::loadScene(file, shaders);
    auto const found = std::find(scene.materialNames.begin(), scene.materialNames.end(), name);
    if (found == scene.materialNames.end())
        throw InputError(fmt::format("{}: has no material {}{}", host::printable(file),
                                     host::printable(name),
                                     host::suggestion(name, scene.materialNames)));
    auto const index = static_cast<std::size_t>(found - scene.materialNames.begin());
    return std::make_shared<Owned>(Owned{scene.textures, std::move(scene.materials[index])});
}

} // namespace

Specimen::Specimen(std::string label, MerlTable table)
    : label_(std::move(label))
    , table_(std::make_shared<MerlTable const>(std::move(table)))
{
}

Specimen::Specimen(std::string label, Shader const& shader, std::shared_ptr<void const> owner)
    : label_(std::move(label))
    , shader_(&shader)
    , owner_(std::move(owner))
{
}

bool Specimen::has(int entryPoints) const
{
    return shader_ && (shader_->entryPoints() & entryPoints) == entryPoints;
}

void Specimen::values(std::span<Vec3f const> wi, std::span<Vec3f const> wo, std::span<Vec3f> out,
                      int threads) const
{
    if (shader_) {
        host::MaterialProbe(*shader_).evaluate(wi, wo, false, out, threads);
        return;
    }
    constexpr float kNone = std::numeric_limits<float>::quiet_NaN();
    for (std::size_t i = 0; i < out.size(); ++i) {
        Vec3f const a = wi[wi.size() == 1 ? 0 : i], b = wo[wo.size() == 1 ? 0 : i];
        out[i] = {kNone, kNone, kNone};
        if (a.z <= 0.0f || b.z <= 0.0f)
            continue;
        if (Vec3f const v = table_->values[MerlTable::cellOf(a, b)]; v.x >= 0.0f)
            out[i] = v;
    }
}

Specimen specimenOf(std::span<std::string const> words, host::ShaderSource const& shaders)
{
    std::string const& word = words.front();
    std::shared_ptr<Owned> owned;
    std::size_t const colon = word.rfind(':');
    if (!shaders.has(word) && colon != std::string::npos)
        owned = ofScene(word, colon, shaders);
    else
        owned = std::make_shared<Owned>(
            Owned{std::make_shared<host::TextureStore>(), shaders.create(word)});
    if (!owned->shader.material())
        throw InputError(owned->shader.className() + ": is no material");
    std::string label = word;
    for (std::string const& assignment : words.subspan(1)) {
        assign(owned->shader, assignment, *owned->textures);
        label += ' ' + assignment;
    }
    return {host::printable(label), owned->shader, owned};
}

std::vector<Specimen> specimensOf(std::span<std::string const> words,
                                  host::ShaderSource const& shaders)
{
    std::vector<Specimen> specimens;
    for (std::size_t i = 0; i < words.size();) {
        if (words[i] == "+") {
            ++i;
            continue;
        }
        if (words[i].find('=') != std::string::npos && words[i].find(':') == std::string::npos)
            throw InputError(fmt::format("{}: expected a class before its parameters",
                                         host::printable(words[i])));
        std::size_t end = i + 1;
        while (end < words.size() && words[end].find('=') != std::string::npos)
            ++end;
        specimens.push_back(specimenOf(words.subspan(i, end - i), shaders));
        i = end;
    }
    return specimens;
}

Specimen measuredSpecimen(std::filesystem::path const& file)
{
    return {host::printable(file.filename().string()), MerlTable::read(file)};
}

} // namespace zsi::lab
