// SPDX-License-Identifier: Apache-2.0
#include "cmd/classText.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <nlohmann/json.hpp>

namespace zsi::cmd {
namespace {

using Row = std::vector<std::string>;

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
    constexpr std::array<std::size_t, 11> kCounts{0, 0, 1, 2, 3, 4, 9, 16, 0, 0, 0}; // by type
    auto const* const first = static_cast<float const*>(p.field);
    return {first, first + kCounts[static_cast<std::size_t>(p.type)]};
}

/// What a new object holds, as text that a scene could repeat.
std::string defaultText(host::Parameter const& p)
{
    if (!p.about.hasDefault)
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

std::string rangeText(host::Parameter const& p)
{
    if (!p.about.slider)
        return {};
    auto const& [minimum, maximum, step] = *p.about.slider;
    std::string const range = fmt::format("{} .. {}", minimum, maximum);
    return step > 0 ? fmt::format("{} by {}", range, step) : range;
}

std::string meaningText(host::Parameter const& p)
{
    std::string meaning = p.about.meaning;
    if (p.about.objectSize > 0)
        meaning +=
            fmt::format("; scenes that do not say take the default for an object of size {}, "
                        "and as much more or less for others",
                        p.about.objectSize);
    std::vector<std::string> conditions;
    for (host::Condition const& c : p.about.when) {
        std::string text = fmt::format("{}", fmt::join(c.parameters, " or "));
        if (c.from)
            text += *c.from == *c.to ? fmt::format(" {}", *c.from)
                                     : fmt::format(" {} to {}", *c.from, *c.to);
        conditions.push_back(std::move(text));
    }
    if (conditions.empty())
        return meaning;
    return fmt::format("{}{}read with {}", meaning, meaning.empty() ? "" : "; ",
                       fmt::join(conditions, ", "));
}

/// Name, type, default, range, meaning. A row of one cell begins a group.
std::vector<Row> parameterRows(host::Shader const& shader)
{
    std::vector<Row> rows;
    std::string group;
    for (host::Parameter const& p : shader.parameters()) {
        if (p.about.group != group) {
            group = p.about.group;
            rows.push_back({group.empty() ? "others" : group});
        }
        rows.push_back(
            {p.name, host::typeName(p.type), defaultText(p), rangeText(p), meaningText(p)});
    }
    return rows;
}

std::vector<Row> attributeRows(host::Shader const& shader)
{
    std::vector<Row> rows;
    for (host::Attribute const& a : shader.attributes())
        rows.push_back({a.name, attributeTypeName(a.kind), fmt::format("{}", a.offset)});
    return rows;
}

/// Columns as wide as their longest entry, the last one as it is. A row of one cell is a heading.
std::string columns(std::vector<Row> const& rows)
{
    std::vector<std::size_t> width;
    for (Row const& row : rows)
        for (std::size_t i = 0; i < row.size() && row.size() > 1; ++i) {
            width.resize(std::max(width.size(), i + 1));
            width[i] = std::max(width[i], row[i].size());
        }
    std::string text;
    for (Row const& row : rows) {
        std::string line = row.size() > 1 ? " " : fmt::format(" [{}]", row[0]);
        for (std::size_t i = 0; i < row.size() && row.size() > 1; ++i)
            line += fmt::format(" {:<{}} ", row[i], width[i]);
        line.erase(line.find_last_not_of(' ') + 1);
        text += line + '\n';
    }
    return text;
}

/// The same as Markdown, names as code.
std::string markdownTable(Row const& head, std::vector<Row> const& rows)
{
    auto const line = [&](std::string text, Row const& cells) {
        for (std::size_t i = 0; i < head.size(); ++i) {
            text += i < cells.size() && !cells[i].empty() ? ' ' + cells[i] + " |" : " |";
        }
        return text + '\n';
    };
    std::string text = line("|", head) + line("|", Row(head.size(), "---"));
    for (Row row : rows) {
        row[0] = row.size() > 1 ? '`' + row[0] + '`' : "**" + row[0] + "**";
        text += line("|", row);
    }
    return text;
}

Json headJson(host::Shader const& shader)
{
    return {{"name", shader.className()},
            {"kind", kindName(shader.kind())},
            {"summary", shader.summary()},
            {"entryPoints", entryPointNames(shader.entryPoints())}};
}

Json parameterJson(host::Parameter const& p)
{
    Json json{{"name", p.name},
              {"type", host::typeName(p.type)},
              {"hasDefault", p.about.hasDefault},
              {"default", defaultJson(p)},
              {"meaning", p.about.meaning}};
    if (!p.about.group.empty())
        json["group"] = p.about.group;
    if (p.about.slider) {
        json["minimum"] = p.about.slider->minimum;
        json["maximum"] = p.about.slider->maximum;
        if (p.about.slider->step > 0)
            json["step"] = p.about.slider->step;
    }
    if (p.about.objectSize > 0)
        json["objectSize"] = p.about.objectSize;
    for (host::Condition const& c : p.about.when) {
        Json condition{{"parameters", c.parameters}};
        if (c.from) {
            condition["from"] = *c.from;
            condition["to"] = *c.to;
        }
        json["when"].push_back(std::move(condition));
    }
    return json;
}

} // namespace

Json defaultJson(host::Parameter const& p)
{
    if (!p.about.hasDefault)
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

std::string classText(host::Shader const& shader)
{
    std::vector<Row> const parameters = parameterRows(shader), attributes = attributeRows(shader);
    return fmt::format(
        "{}: {}\n{}entry points: {}\n{}{}{}{}", shader.className(), kindName(shader.kind()),
        shader.text(), fmt::join(entryPointNames(shader.entryPoints()), ", "),
        parameters.empty() ? "no parameters\n"
                           : "parameters (name, type, default, range, meaning):\n",
        columns(parameters),
        attributes.empty() ? "no vertex attributes\n" : "vertex attributes (name, type, offset):\n",
        columns(attributes));
}

std::string classMarkdown(host::Shader const& shader)
{
    std::vector<Row> const parameters = parameterRows(shader), attributes = attributeRows(shader);
    std::string text =
        fmt::format("# {}\n\n{}\nKind: {}. Entry points: `{}` (mask {}).\n", shader.className(),
                    shader.text(), kindName(shader.kind()),
                    fmt::join(entryPointNames(shader.entryPoints()), "` `"), shader.entryPoints());
    if (!parameters.empty())
        text +=
            '\n' + markdownTable({"Parameter", "Type", "Default", "Range", "Meaning"}, parameters);
    if (!attributes.empty())
        text += '\n' + markdownTable({"Vertex attribute", "Type", "Offset"}, attributes);
    return text;
}

Json classJson(host::Shader const& shader)
{
    Json json = headJson(shader);
    json["description"] = shader.text();
    json["parameters"] = Json::array();
    for (host::Parameter const& p : shader.parameters())
        json["parameters"].push_back(parameterJson(p));
    json["attributes"] = Json::array();
    for (host::Attribute const& a : shader.attributes())
        json["attributes"].push_back(
            {{"name", a.name}, {"type", attributeTypeName(a.kind)}, {"offset", a.offset}});
    return json;
}

std::string listText(std::vector<host::Shader> const& shaders)
{
    std::vector<Row> rows;
    rows.reserve(shaders.size());
    for (host::Shader const& shader : shaders)
        rows.push_back({shader.className(), kindName(shader.kind()), shader.summary()});
    return columns(rows);
}

Json listJson(std::vector<host::Shader> const& shaders)
{
    Json classes = Json::array();
    for (host::Shader const& shader : shaders)
        classes.push_back(headJson(shader));
    return {{"classes", classes}};
}

} // namespace zsi::cmd
