// SPDX-License-Identifier: Apache-2.0
#include "json/jsonReader.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>

namespace zsi::host {

namespace {

std::string quoted(std::vector<std::string> const& words)
{
    std::string text;
    for (std::size_t i = 0; i < words.size(); ++i)
        text += fmt::format("{}\"{}\"",
                            i == 0                      ? ""
                                : i + 1 == words.size() ? " or "
                                                        : ", ",
                            words[i]);
    return text;
}

std::string shown(JsonValue const& v)
{
    switch (v.kind) {
    case JsonValue::Kind::Bool:
        return v.boolean ? "true" : "false";
    case JsonValue::Kind::Integer:
    case JsonValue::Kind::Float:
        return fmt::format("{}", v.number);
    case JsonValue::Kind::String:
        return '"' + printable(v.text) + '"';
    case JsonValue::Kind::Array:
        return fmt::format("an array of {}", v.items.size());
    case JsonValue::Kind::Object:
        return "an object";
    case JsonValue::Kind::Null:
        break;
    }
    return "null";
}

} // namespace

std::string JsonReader::place() const
{
    std::string text = value_->file->string();
    if (value_->line > 0)
        text += fmt::format(":{}", value_->line);
    return path_.empty() ? text : text + ": " + path_;
}

void JsonReader::fail(std::string const& why) const { throw InputError(place() + ": " + why); }

void JsonReader::failExpected(std::string const& what) const
{
    fail("expected " + what + ", got " + shown(*value_));
}

void JsonReader::expect(JsonValue::Kind wanted, char const* what) const
{
    if (kind() != wanted)
        failExpected(what);
}

bool JsonReader::toBool() const
{
    expect(JsonValue::Kind::Bool, "true or false");
    return value_->boolean;
}

int JsonReader::toInt(int least, int most) const
{
    bool const inside =
        kind() == JsonValue::Kind::Integer && value_->number >= least && value_->number <= most;
    if (!inside)
        failExpected(most == std::numeric_limits<int>::max()
                             && least == std::numeric_limits<int>::min()
                         ? std::string("an integer of 32 bits")
                         : fmt::format("an integer from {} to {}", least, most));
    return static_cast<int>(value_->number);
}

std::uint32_t JsonReader::toUint32() const
{
    constexpr std::uint32_t kMost = std::numeric_limits<std::uint32_t>::max();
    if (kind() != JsonValue::Kind::Integer || value_->number < 0 || value_->number > kMost)
        failExpected(fmt::format("an integer from 0 to {}", kMost));
    return static_cast<std::uint32_t>(value_->number);
}

float JsonReader::toFloat(float least, float most) const
{
    bool const isNumber = kind() == JsonValue::Kind::Integer || kind() == JsonValue::Kind::Float;
    double const number = value_->number;
    if (isNumber && number >= static_cast<double>(least) && number <= static_cast<double>(most))
        return static_cast<float>(number);
    if (least == -kHuge && most == kHuge)
        failExpected(isNumber ? "a number in the range of a 32-bit float" : "a number");
    if (most == kHuge)
        failExpected(fmt::format("a number of {} or more", least));
    failExpected(fmt::format("a number from {} to {}", least, most));
}

float JsonReader::toPositive() const
{
    bool const isNumber = kind() == JsonValue::Kind::Integer || kind() == JsonValue::Kind::Float;
    auto const number = static_cast<float>(value_->number); // tested as it is used: may round to 0
    if (!isNumber || !(number > 0.0f) || !std::isfinite(number))
        failExpected("a number above 0");
    return number;
}

std::string const& JsonReader::toString() const
{
    expect(JsonValue::Kind::String, "a string");
    return value_->text;
}

std::size_t JsonReader::toChoice(std::vector<std::string> const& words) const
{
    for (std::size_t i = 0; i < words.size(); ++i)
        if (kind() == JsonValue::Kind::String && value_->text == words[i])
            return i;
    failExpected(quoted(words));
}

std::vector<float> JsonReader::toFloats(std::size_t count) const
{
    if (kind() != JsonValue::Kind::Array || value_->items.size() != count)
        failExpected(fmt::format("an array of {} numbers", count));
    std::vector<float> numbers;
    for (JsonReader const& item : items())
        numbers.push_back(item.toFloat());
    return numbers;
}

Vec3f JsonReader::toVec3f() const
{
    std::vector<float> const v = toFloats(3);
    return {v[0], v[1], v[2]};
}

std::filesystem::path JsonReader::toFile() const
{
    std::string const& name = toString();
    if (name.empty() || name.find('\0') != std::string::npos)
        failExpected("a file name");
    value_->namesFile = true;
    return (value_->file->parent_path() / name).lexically_normal();
}

JsonReader JsonReader::child(std::string const& key, JsonValue const& value) const
{
    std::string const name = printable(key);
    return JsonReader(value, path_.empty() ? name : path_ + '.' + name);
}

std::vector<JsonReader> JsonReader::items() const
{
    expect(JsonValue::Kind::Array, "an array");
    std::vector<JsonReader> readers;
    for (std::size_t i = 0; i < value_->items.size(); ++i)
        readers.emplace_back(value_->items[i], fmt::format("{}[{}]", path_, i));
    return readers;
}

std::vector<std::pair<std::string, JsonReader>> JsonReader::members() const
{
    expect(JsonValue::Kind::Object, "an object");
    std::vector<std::pair<std::string, JsonReader>> readers;
    for (auto const& [key, value] : value_->members)
        readers.emplace_back(key, child(key, value));
    return readers;
}

std::optional<JsonReader> JsonReader::find(std::string_view key) const
{
    expect(JsonValue::Kind::Object, "an object");
    JsonValue const* const found = value_->find(key);
    if (!found)
        return {};
    return child(std::string(key), *found);
}

JsonReader JsonReader::at(std::string_view key) const
{
    std::optional<JsonReader> const found = find(key);
    if (!found)
        fail(fmt::format("the key \"{}\" is missing", key));
    return *found;
}

void JsonReader::expectKeys(std::vector<std::string> const& known) const
{
    for (auto const& [key, reader] : members())
        if (std::find(known.begin(), known.end(), key) == known.end())
            reader.fail("unknown key" + suggestion(key, known));
}

JsonReader JsonReader::onlyOf(std::vector<std::string> const& keys) const
{
    std::optional<JsonReader> found;
    for (std::string const& key : keys)
        if (std::optional<JsonReader> const reader = find(key)) {
            if (found)
                reader->fail(fmt::format("only one of {} may be given", quoted(keys)));
            found = reader;
        }
    if (!found)
        fail(fmt::format("expected the key {}", quoted(keys)));
    return *found;
}

} // namespace zsi::host
