// SPDX-License-Identifier: Apache-2.0
#include "load/sceneFile.h"

#include "base/error.h"
#include "base/names.h"
#include "load/assignment.h"
#include "model/modelScene.h"
#include "json/jsonReader.h"

#include <algorithm>
#include <iostream>
#include <iterator>
#include <unordered_map>
#include <unordered_set>

namespace zsi::host {

namespace {

namespace fs = std::filesystem;

/// What lies at a level of a scene file, as far as files are put together there.
enum class Level {
    Scene, ///< of sections
    Named, ///< meshes, materials, instances, lights: things by name
    Shader, ///< material, light, environment: keys, with parameters
    Keys, ///< camera, film, settings, instance, parameters: keys with values
    Value, ///< replaced as a whole
};

Level below(Level level, std::string_view section, std::string_view key)
{
    switch (level) {
    case Level::Scene:
        if (key == "camera" || key == "film" || key == "settings")
            return Level::Keys;
        return key == "environment" ? Level::Shader : Level::Named;
    case Level::Named:
        // A mesh is of one kind; mixing the keys of two makes no sense.
        if (section == "meshes")
            return Level::Value;
        return section == "instances" ? Level::Keys : Level::Shader;
    case Level::Shader:
        return key == "parameters" ? Level::Keys : Level::Value;
    case Level::Keys:
        return section == "instances" && key == "materials" ? Level::Keys : Level::Value;
    default:
        return Level::Value;
    }
}

std::vector<std::string> keysOf(JsonValue const& object)
{
    std::vector<std::string> keys;
    for (auto const& [key, value] : object.members)
        keys.push_back(key);
    return keys;
}

/// Parameters of another class mean nothing to this one.
bool changesClass(JsonValue const& base, JsonValue const& over)
{
    JsonValue const* const before = base.find("class");
    JsonValue const* const after = over.find("class");
    return before && after && before->text != after->text;
}

void merge(JsonValue& base, JsonReader const& over, Level level, std::string_view section)
{
    if (level == Level::Value || base.kind != JsonValue::Kind::Object || !over.isObject()) {
        base = over.value();
        return;
    }
    // An environment is a class or a file.
    bool const otherKind = level == Level::Shader
        && ((base.find("file") && over.find("class")) || (base.find("class") && over.find("file")));
    if (otherKind) {
        base = over.value();
        return;
    }
    if (level == Level::Shader && changesClass(base, over.value()))
        std::erase_if(base.members, [](JsonMember const& m) { return m.key == "parameters"; });
    std::unordered_map<std::string, std::size_t> places;
    for (std::size_t i = 0; i < base.members.size(); ++i)
        places[base.members[i].key] = i;
    std::unordered_set<std::string> taken;
    for (auto const& [key, value] : over.members()) {
        auto const old = places.find(key);
        if (value.kind() == JsonValue::Kind::Null) {
            if (old == places.end())
                value.fail("null takes out what an included file has, which is nothing here"
                           + suggestion(key, keysOf(base)));
            taken.insert(key);
        } else if (old != places.end()) {
            merge(base.members[old->second].value, value, below(level, section, key),
                  level == Level::Scene ? key : section);
        } else {
            base.members.push_back({key, value.value()});
        }
    }
    if (!taken.empty())
        std::erase_if(base.members, [&](JsonMember const& m) { return taken.contains(m.key); });
    // Messages about the object as a whole lead to where it was last changed.
    base.file = over.value().file;
    base.line = over.value().line;
}

bool hasNull(JsonValue const& value)
{
    return value.kind == JsonValue::Kind::Null
        || std::any_of(value.members.begin(), value.members.end(),
                       [](JsonMember const& m) { return hasNull(m.value); });
}

void refuseNull(JsonReader const& reader)
{
    if (!hasNull(reader.value())) // spares the paths of a large scene
        return;
    if (reader.kind() == JsonValue::Kind::Null)
        reader.fail("null takes out what an included file has; here is nothing to take out");
    for (auto const& [key, member] : reader.members())
        refuseNull(member);
}

JsonValue readStandardInput()
{
    std::string const text{std::istreambuf_iterator<char>(std::cin), {}};
    return parseJson(text, "<stdin>");
}

/// A scene file, or the scene that shows a model.
JsonValue readFile(fs::path const& file, std::vector<std::string>* warnings)
{
    if (!isModel(file))
        return readJson(file);
    ModelScene model = modelScene(file, {file.parent_path(), {}});
    if (warnings)
        warnings->insert(warnings->end(), model.warnings.begin(), model.warnings.end());
    return std::move(model.document);
}

JsonValue withIncludes(JsonValue scene, fs::path const& file, std::vector<fs::path>& open,
                       std::vector<std::string>* warnings)
{
    JsonReader const reader(scene);
    if (!reader.isObject())
        reader.failExpected("an object");
    std::optional<JsonReader> const include = reader.find("include");
    if (!include)
        return scene;
    fs::path const included = include->toFile();
    open.push_back(fs::weakly_canonical(file));
    if (std::find(open.begin(), open.end(), fs::weakly_canonical(included)) != open.end())
        include->fail(included.string() + " includes itself");
    if (!fs::exists(included))
        include->fail(included.string() + ": no such file");
    JsonValue merged = withIncludes(readFile(included, warnings), included, open, warnings);
    std::erase_if(scene.members, [](JsonMember const& m) { return m.key == "include"; });
    merge(merged, JsonReader(scene), Level::Scene, {});
    return merged;
}

} // namespace

JsonValue readSceneFile(fs::path const& file, std::vector<std::string> const& assignments,
                        std::vector<std::string>* warnings)
{
    std::vector<fs::path> open;
    bool const piped = file == "-";
    JsonValue scene = withIncludes(piped ? readStandardInput() : readFile(file, warnings),
                                   piped ? "<stdin>" : file, open, warnings);
    for (std::string const& assignment : assignments)
        assign(scene, assignment, "--set");
    refuseNull(JsonReader(scene));
    return scene;
}

} // namespace zsi::host
