// SPDX-License-Identifier: Apache-2.0
#include "json/jsonText.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <fmt/format.h>
#include <nlohmann/json.hpp>

namespace zsi::host {
namespace {

using Kind = JsonValue::Kind;

constexpr std::size_t kLine = 100;

std::string quoted(std::string const& text)
{
    return nlohmann::json(text).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

bool isStructured(JsonValue const& value)
{
    return value.kind == Kind::Array || value.kind == Kind::Object;
}

bool isEmpty(JsonValue const& value) { return value.items.empty() && value.members.empty(); }

std::string plain(JsonValue const& value)
{
    switch (value.kind) {
    case Kind::Bool:
        return value.boolean ? "true" : "false";
    case Kind::Integer:
        return fmt::format("{:.0f}", value.number);
    case Kind::Float:
        return nlohmann::json(value.number).dump();
    case Kind::String:
        return quoted(value.text);
    default:
        return "null";
    }
}

/// `part(text of a key or nothing, value)` of each.
template <class Part>
void forParts(JsonValue const& value, Part const& part)
{
    for (JsonValue const& item : value.items)
        part(std::string(), item);
    for (JsonMember const& member : value.members)
        part(quoted(member.key) + ": ", member.value);
}

std::string bracketed(JsonValue const& value, std::string const& inside)
{
    return value.kind == Kind::Object ? '{' + inside + '}' : '[' + inside + ']';
}

/// In one line: {"key": [1, 2, 3]}.
std::string inOneLine(JsonValue const& value)
{
    if (!isStructured(value))
        return plain(value);
    std::string text;
    forParts(value, [&](std::string const& key, JsonValue const& part) {
        text += (text.empty() ? "" : ", ") + key + inOneLine(part);
    });
    return bracketed(value, text);
}

std::string laidOut(JsonValue const& value, std::size_t indent)
{
    bool const hasObjects = std::ranges::any_of(value.members, [](JsonMember const& member) {
        return member.value.kind == Kind::Object && !isEmpty(member.value);
    });
    std::string line = inOneLine(value);
    if (!isStructured(value) || isEmpty(value)
        || ((!hasObjects || indent > 4) && indent + line.size() < kLine))
        return line;
    std::string const inner(indent + 2, ' ');
    std::string text;
    forParts(value, [&](std::string const& key, JsonValue const& part) {
        text += (text.empty() ? "" : ",\n") + inner + key + laidOut(part, indent + 2);
    });
    return bracketed(value, '\n' + text + '\n' + std::string(indent, ' '));
}

JsonValue made(Kind kind)
{
    JsonValue value;
    value.kind = kind;
    return value;
}

void setOriginTo(JsonValue& tree, std::shared_ptr<std::filesystem::path const> const& file)
{
    tree.file = file;
    tree.line = 0;
    for (JsonValue& item : tree.items)
        setOriginTo(item, file);
    for (JsonMember& member : tree.members)
        setOriginTo(member.value, file);
}

} // namespace

std::string jsonText(JsonValue const& value) { return laidOut(value, 0) + '\n'; }

JsonValue jsonOf(bool value)
{
    JsonValue json = made(Kind::Bool);
    json.boolean = value;
    return json;
}

JsonValue jsonOf(double value)
{
    bool const whole =
        std::abs(value) < 1e15 && value == static_cast<double>(static_cast<long long>(value));
    JsonValue json = made(whole ? Kind::Integer : Kind::Float);
    json.number = value + 0.0; // no -0
    return json;
}

JsonValue jsonOf(float value)
{
    return jsonOf(std::strtod(fmt::format("{}", value).c_str(), nullptr));
}

JsonValue jsonOf(int value) { return jsonOf(static_cast<double>(value)); }

JsonValue jsonOf(std::string value)
{
    JsonValue json = made(Kind::String);
    json.text = std::move(value);
    return json;
}

JsonValue jsonOf(char const* value) { return jsonOf(std::string(value)); }

JsonValue jsonOf(Vec3f value) { return jsonOf(std::array{value.x, value.y, value.z}); }

JsonValue jsonOf(std::span<float const> values)
{
    JsonValue json = made(Kind::Array);
    for (float const value : values)
        json.items.push_back(jsonOf(value));
    return json;
}

JsonValue jsonShort(float value)
{
    return jsonOf(std::strtod(fmt::format("{:.5g}", value).c_str(), nullptr));
}

JsonValue jsonShort(Vec3f value)
{
    return jsonArray({jsonShort(value.x), jsonShort(value.y), jsonShort(value.z)});
}

JsonValue jsonObject(std::vector<JsonMember> members)
{
    JsonValue json = made(Kind::Object);
    json.members = std::move(members);
    return json;
}

JsonValue jsonArray(std::vector<JsonValue> items)
{
    JsonValue json = made(Kind::Array);
    json.items = std::move(items);
    return json;
}

void setOrigin(JsonValue& tree, std::filesystem::path const& file)
{
    setOriginTo(tree, std::make_shared<std::filesystem::path const>(file));
}

} // namespace zsi::host
