// zsi info: what the loaded libraries offer.
#include "base/error.h"
#include "cmd/command.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <array>
#include <cmath>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <memory>
#include <nlohmann/json.hpp>

namespace zsi::cmd {
namespace {

using Json = nlohmann::ordered_json;

char const* kindName(int kind)
{
    constexpr std::array kNames{"material", "light", "environment"};
    return kNames[static_cast<std::size_t>(kind)];
}

char const* attributeTypeName(int kind)
{
    constexpr std::array kNames{"Vec2f", "Vec3f", "Vec4f"};
    return kNames[static_cast<std::size_t>(kind - kAttributeVec2f)];
}

std::vector<std::string> entryPointNames(int mask)
{
    constexpr std::pair<int, char const*> kNames[] = {
        {kShade, "shade"},   {kTransmission, "transmission"}, {kTransfer, "transfer"},
        {kSample, "sample"}, {kIllumination, "illumination"}, {kEnvironmentShade, "shade"},
    };
    std::vector<std::string> names;
    for (auto const& [bit, name] : kNames)
        if (mask & bit)
            names.emplace_back(name);
    return names;
}

/// The floats of a parameter that consists of them.
std::vector<float> floatsOf(host::Parameter const& p)
{
    using enum host::ParameterType;
    std::size_t count = 0;
    switch (p.type) {
    case Float:
        count = 1;
        break;
    case Vec2f:
        count = 2;
        break;
    case Vec3f:
        count = 3;
        break;
    case Vec4f:
        count = 4;
        break;
    case Mat3f:
        count = 9;
        break;
    case Mat4f:
        count = 16;
        break;
    default:
        break;
    }
    auto const* const first = static_cast<float const*>(p.field);
    return {first, first + count};
}

/// What a new object holds, as text that a scene could repeat.
std::string defaultText(host::Parameter const& p)
{
    if (!p.hasDefault)
        return "none";
    if (p.type == host::ParameterType::Bool)
        return *static_cast<bool const*>(p.field) ? "true" : "false";
    if (p.type == host::ParameterType::Int)
        return fmt::format("{}", *static_cast<int const*>(p.field));
    std::vector<float> const v = floatsOf(p);
    if (v.empty())
        return "no texture";
    return v.size() == 1 ? fmt::format("{}", v[0]) : fmt::format("({})", fmt::join(v, ", "));
}

/// The shortest decimal that reads back as the same float.
double decimal(float v)
{
    return std::isfinite(v) ? std::stod(fmt::format("{}", v)) : static_cast<double>(v);
}

/// Null for a texture, which is empty, and for what has no default.
Json defaultJson(host::Parameter const& p)
{
    if (!p.hasDefault)
        return nullptr;
    if (p.type == host::ParameterType::Bool)
        return *static_cast<bool const*>(p.field);
    if (p.type == host::ParameterType::Int)
        return *static_cast<int const*>(p.field);
    std::vector<float> const v = floatsOf(p);
    if (v.empty())
        return nullptr;
    if (v.size() == 1)
        return decimal(v[0]);
    Json list = Json::array();
    for (float const x : v)
        list.push_back(decimal(x));
    return list;
}

Json headJson(host::Shader const& shader)
{
    return {{"name", shader.className()},
            {"kind", kindName(shader.kind())},
            {"entryPoints", entryPointNames(shader.entryPoints())}};
}

Json classJson(host::Shader const& shader)
{
    Json json = headJson(shader);
    json["parameters"] = Json::array();
    for (host::Parameter const& p : shader.parameters())
        json["parameters"].push_back({{"name", p.name},
                                      {"type", host::typeName(p.type)},
                                      {"hasDefault", p.hasDefault},
                                      {"default", defaultJson(p)},
                                      {"meaning", p.meaning}});
    json["attributes"] = Json::array();
    for (host::Attribute const& a : shader.attributes())
        json["attributes"].push_back(
            {{"name", a.name}, {"type", attributeTypeName(a.kind)}, {"offset", a.offset}});
    return json;
}

/// Columns as wide as their longest entry, the last one as it is.
std::string table(std::vector<std::vector<std::string>> const& rows)
{
    std::vector<std::size_t> width;
    for (auto const& row : rows)
        for (std::size_t i = 0; i < row.size(); ++i) {
            width.resize(std::max(width.size(), i + 1));
            width[i] = std::max(width[i], row[i].size());
        }
    std::string text;
    for (auto const& row : rows) {
        std::string line = " ";
        for (std::size_t i = 0; i < row.size(); ++i)
            line += fmt::format(" {:<{}} ", row[i], width[i]);
        line.erase(line.find_last_not_of(' ') + 1);
        text += line + '\n';
    }
    return text;
}

std::string classText(host::Shader const& shader)
{
    std::string text =
        fmt::format("{}: {}\nentry points: {}\n", shader.className(), kindName(shader.kind()),
                    fmt::join(entryPointNames(shader.entryPoints()), ", "));
    std::vector<std::vector<std::string>> rows;
    for (host::Parameter const& p : shader.parameters())
        rows.push_back({p.name, host::typeName(p.type), defaultText(p), p.meaning});
    text += rows.empty() ? "no parameters\n" : "parameters (name, type, default, meaning):\n";
    text += table(rows);
    rows.clear();
    for (host::Attribute const& a : shader.attributes())
        rows.push_back({a.name, attributeTypeName(a.kind), fmt::format("offset {}", a.offset)});
    text += rows.empty() ? "no vertex attributes\n" : "vertex attributes (name, type, offset):\n";
    return text + table(rows);
}

/// One object of each class; a class that gives none leads to a warning.
std::vector<host::Shader> allShaders(host::ShaderLibraries const& libraries)
{
    std::vector<host::Shader> shaders;
    for (std::string const& name : libraries.classNames()) {
        try {
            shaders.push_back(libraries.create(name));
        } catch (host::InputError const& error) {
            warn(error.what());
        }
    }
    return shaders;
}

std::string listText(std::vector<host::Shader> const& shaders)
{
    std::vector<std::vector<std::string>> rows;
    rows.reserve(shaders.size());
    for (host::Shader const& shader : shaders)
        rows.push_back({shader.className(), kindName(shader.kind()),
                        fmt::format("{}", fmt::join(entryPointNames(shader.entryPoints()), ", "))});
    return table(rows);
}

std::string listJson(std::vector<host::Shader> const& shaders)
{
    Json classes = Json::array();
    for (host::Shader const& shader : shaders)
        classes.push_back(headJson(shader));
    return Json{{"classes", classes}}.dump(2) + '\n';
}

struct Arguments {
    std::string className;
    bool json = false;
};

int info(Arguments const& arguments, std::string const& shaderPath)
{
    host::ShaderLibraries const libraries = loadLibraries(shaderPath);
    if (arguments.className.empty()) {
        std::vector<host::Shader> const shaders = allShaders(libraries);
        print(arguments.json ? listJson(shaders) : listText(shaders));
        return 0;
    }
    host::Shader const shader = libraries.create(arguments.className);
    print(arguments.json ? classJson(shader).dump(2) + '\n' : classText(shader));
    return 0;
}

} // namespace

Subcommand addInfo(CLI::App& app, std::string const& shaderPath)
{
    auto const arguments = std::make_shared<Arguments>();
    CLI::App* const command = app.add_subcommand(
        "info", "List the shader classes, or the parameters and vertex attributes of one");
    command->add_option("CLASS", arguments->className, "A class; without it all are listed");
    command->add_flag("--json", arguments->json, "Write JSON, for programs");
    return {command, [=, &shaderPath] { return info(*arguments, shaderPath); }};
}

} // namespace zsi::cmd
