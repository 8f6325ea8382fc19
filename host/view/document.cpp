// SPDX-License-Identifier: Apache-2.0
#include "view/document.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>
#include <charconv>
#include <fmt/format.h>
#include <string_view>

namespace zsi::view {
namespace {

constexpr std::size_t kMostSteps = 500;

[[noreturn]] void fail(std::string const& path, std::string const& why)
{
    throw host::InputError(fmt::format("{}: {}", host::printable(path), why));
}

/// Takes the next key off `rest`: the longest that the object has, since names may have points in
/// them; else up to the next point.
std::string nextKey(Json const& object, std::string_view& rest)
{
    std::string key;
    for (auto const& [name, value] : object.items())
        if (name.size() > key.size() && rest.starts_with(name)
            && (rest.size() == name.size() || rest[name.size()] == '.' || rest[name.size()] == '['))
            key = name;
    if (key.empty())
        key = rest.substr(0, rest.find('.'));
    rest.remove_prefix(key.size());
    return key;
}

Json& element(Json& array, std::string_view& rest, std::string const& path)
{
    std::size_t const end = rest.find(']');
    std::size_t index = 0;
    char const* const last = rest.data() + std::min(end, rest.size());
    auto const [at, error] = std::from_chars(rest.data() + 1, last, index);
    if (end == std::string_view::npos || error != std::errc() || at != last)
        fail(path, "expected [i] with a number");
    if (!array.is_array() || index >= array.size())
        fail(path, "there is no such element");
    rest.remove_prefix(end + 1);
    return array[index];
}

/// Objects that a document has even where it does not write them.
bool isImplied(int depth, std::string_view key)
{
    constexpr std::string_view kSections[] = {"camera",    "film",      "settings", "meshes",
                                              "materials", "instances", "lights",   "environment"};
    return depth == 0 ? std::ranges::find(kSections, key) != std::end(kSections)
                      : key == "parameters";
}

void apply(Json& document, Edit const& edit)
{
    if (edit.path.empty())
        fail("edit", "expected a path, such as materials.glass.parameters.u_ior");
    Json* at = &document;
    std::string_view rest = edit.path;
    for (int depth = 0; !rest.empty(); ++depth) {
        if (rest.starts_with('[')) {
            at = &element(*at, rest, edit.path);
            if (rest.empty()) {
                if (edit.value.is_null())
                    fail(edit.path, "an array keeps its elements");
                *at = edit.value;
            }
        } else {
            if (!at->is_object())
                fail(edit.path, "leads into what is no object");
            std::string const key = nextKey(*at, rest);
            if (key.empty())
                fail(edit.path, "expected keys with points between them");
            if (rest.empty() && edit.value.is_null())
                at->erase(key);
            else if (rest.empty())
                (*at)[key] = edit.value;
            else if (at->contains(key) || isImplied(depth, key))
                at = &(*at)[key];
            else
                fail(edit.path, fmt::format("there is no \"{}\"", host::printable(key)));
            if (at->is_null()) // made this moment
                *at = Json::object();
        }
        if (rest.starts_with('.'))
            rest.remove_prefix(1);
    }
}

void differences(Json const& before, Json const& after, std::vector<std::string>& path,
                 std::vector<Difference>& found)
{
    if (before == after)
        return;
    if (!before.is_object() || !after.is_object()) {
        found.push_back({path, after});
        return;
    }
    for (auto const& [key, value] : before.items()) {
        path.push_back(key);
        auto const other = after.find(key);
        if (other == after.end())
            found.push_back({path, nullptr});
        else
            differences(value, *other, path, found);
        path.pop_back();
    }
    for (auto const& [key, value] : after.items())
        if (!before.contains(key)) {
            path.push_back(key);
            found.push_back({path, value});
            path.pop_back();
        }
}

/// Keys whose texts are files.
bool namesFile(std::string_view key) { return key == "file" || key == "texture" || key == "cube"; }

} // namespace

std::vector<Difference> differences(Json const& before, Json const& after)
{
    std::vector<Difference> found;
    std::vector<std::string> path;
    differences(before, after, path, found);
    return found;
}

std::string pathText(std::vector<std::string> const& path)
{
    return fmt::format("{}", fmt::join(path, "."));
}

host::JsonValue toTree(Json const& json, std::filesystem::path const& file)
{
    using Kind = host::JsonValue::Kind;
    auto const source = std::make_shared<std::filesystem::path const>(file);
    auto const convert = [&](auto const& self, Json const& from) -> host::JsonValue {
        host::JsonValue to;
        to.file = source;
        switch (from.type()) {
        case Json::value_t::boolean:
            to.kind = Kind::Bool;
            to.boolean = from.get<bool>();
            break;
        case Json::value_t::number_integer:
        case Json::value_t::number_unsigned:
            to.kind = Kind::Integer;
            to.number = from.get<double>();
            break;
        case Json::value_t::number_float:
            to.kind = Kind::Float;
            to.number = from.get<double>();
            break;
        case Json::value_t::string:
            to.kind = Kind::String;
            to.text = from.get_ref<std::string const&>();
            break;
        case Json::value_t::array:
            to.kind = Kind::Array;
            for (Json const& item : from)
                to.items.push_back(self(self, item));
            break;
        case Json::value_t::object:
            to.kind = Kind::Object;
            for (auto const& [key, value] : from.items())
                to.members.push_back({key, self(self, value)});
            break;
        default:
            break;
        }
        return to;
    };
    return convert(convert, json);
}

Json toJson(host::JsonValue const& tree, std::filesystem::path const& folder)
{
    using Kind = host::JsonValue::Kind;
    switch (tree.kind) {
    case Kind::Bool:
        return tree.boolean;
    case Kind::Integer:
        return static_cast<std::int64_t>(tree.number);
    case Kind::Float:
        return tree.number;
    case Kind::String:
        return tree.text;
    case Kind::Array: {
        Json array = Json::array();
        for (host::JsonValue const& item : tree.items)
            array.push_back(toJson(item, folder));
        return array;
    }
    case Kind::Object: {
        Json object = Json::object();
        for (auto const& [key, value] : tree.members) {
            object[key] = toJson(value, folder);
            if (!namesFile(key) || value.kind != Kind::String || !value.file)
                continue;
            std::filesystem::path const name = value.text;
            std::filesystem::path const from = value.file->parent_path();
            if (name.is_relative() && from != folder)
                object[key] = std::filesystem::proximate(from / name, folder).string();
        }
        return object;
    }
    default:
        return nullptr;
    }
}

Json Document::edited(std::vector<Edit> const& edits) const
{
    Json after = json_;
    for (Edit const& edit : edits)
        apply(after, edit);
    return after;
}

void Document::commit(Json after, std::string const& label, std::string const& group)
{
    bool const goesOn = !group.empty() && !past_.empty() && past_.back().group == group;
    if (!goesOn)
        past_.push_back({std::move(json_), label, group});
    if (past_.size() > kMostSteps)
        past_.erase(past_.begin());
    future_.clear();
    json_ = std::move(after);
}

void Document::move(std::vector<Step>& from, std::vector<Step>& to)
{
    Step step = std::move(from.back());
    from.pop_back();
    std::swap(step.json, json_);
    step.group.clear(); // what follows is a step of its own
    to.push_back(std::move(step));
}

} // namespace zsi::view
