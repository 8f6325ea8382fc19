// SPDX-License-Identifier: Apache-2.0
#include "load/packScene.h"

#include "load/sceneFile.h"
#include "json/jsonReader.h"

#include <fmt/format.h>
#include <map>
#include <nlohmann/json.hpp>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;
using Files = std::map<std::string, std::string>;

/// The file's name in the pack.
std::string pack(fs::path const& file, Files& files)
{
    fs::path const here = fs::absolute(file).lexically_normal();
    std::string name = "files" + here.string();
    files[name] = here.string();
    return name;
}

std::string quoted(std::string const& text) { return nlohmann::json(text).dump(); }

void write(JsonReader const& reader, Files& files, std::string& text)
{
    JsonValue const& value = reader.value();
    auto const list = [&](char const* brackets, auto const& parts, auto const& part) {
        text += brackets[0];
        for (std::size_t i = 0; i < parts.size(); ++i) {
            text += i ? ", " : "";
            part(parts[i]);
        }
        text += brackets[1];
    };
    switch (value.kind) {
    case JsonValue::Kind::Null:
        text += "null";
        break;
    case JsonValue::Kind::Bool:
        text += value.boolean ? "true" : "false";
        break;
    case JsonValue::Kind::Integer:
    case JsonValue::Kind::Float:
        text += fmt::format("{:.17g}", value.number); // reads back as the same number
        break;
    case JsonValue::Kind::String:
        text += quoted(value.namesFile ? pack(reader.toFile(), files) : value.text);
        break;
    case JsonValue::Kind::Array:
        list("[]", value.items,
             [&](JsonValue const& item) { write(JsonReader(item), files, text); });
        break;
    case JsonValue::Kind::Object:
        list("{}", value.members, [&](JsonMember const& member) {
            text += quoted(member.key) + ": ";
            write(JsonReader(member.value), files, text);
        });
        break;
    }
}

} // namespace

PackedScene packScene(fs::path const& file, ShaderSource const& shaders, LoadOptions const& options)
{
    std::vector<std::string> warnings;
    JsonValue const tree = readSceneFile(file, options.assignments, &warnings);
    PackedScene packed{loadScene(tree, file, shaders, options), {}, {}};
    packed.scene.warnings.insert(packed.scene.warnings.begin(), warnings.begin(), warnings.end());
    Files files;
    write(JsonReader(tree), files, packed.text);
    packed.text += '\n';
    for (std::string const& further : packed.scene.furtherFiles)
        pack(further, files);
    packed.files.assign(files.begin(), files.end());
    return packed;
}

} // namespace zsi::host
