// SPDX-License-Identifier: Apache-2.0
#include "load/assignment.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>
#include <charconv>
#include <fmt/format.h>
#include <optional>

namespace zsi::host {
namespace {

using Kind = JsonValue::Kind;

/// One assignment on its way down the tree.
class Assignment {
public:
    Assignment(std::string const& text, std::string const& option)
        : option_(option)
    {
        std::size_t const equals = text.find('=');
        path_ = text.substr(0, equals);
        if (equals == std::string::npos || path_.empty())
            throw InputError(fmt::format("{} {}: expected PATH=VALUE, such as "
                                         "materials.glass.parameters.u_ior=1.4",
                                         option, printable(text)));
        value_ = parsed(text.substr(equals + 1));
    }

    void apply(JsonValue& scene)
    {
        JsonValue* at = &scene;
        std::string_view rest = path_;
        for (;;) {
            if (rest.starts_with('[')) {
                at = &element(*at, rest);
                if (rest.empty()) {
                    *at = value_;
                    return;
                }
            } else if (JsonValue* const next = member(*at, rest)) {
                at = next;
            } else {
                return;
            }
            if (rest.starts_with('.'))
                rest.remove_prefix(1);
        }
    }

private:
    [[noreturn]] void fail(std::string const& why) const
    {
        throw InputError(fmt::format("{} {}: {}", option_, printable(path_), why));
    }

    std::string before(std::string_view rest) const
    {
        return printable(std::string_view(path_).substr(
            0, path_.size() - rest.size() - (path_.size() > rest.size() ? 1 : 0)));
    }

    /// JSON where it looks like JSON, else the text itself.
    JsonValue parsed(std::string const& text) const
    {
        auto const source = std::make_shared<std::filesystem::path>(option_);
        try {
            JsonValue value = parseJson(text, *source);
            forget(value, source);
            return value;
        } catch (InputError const& error) {
            if (text.starts_with('{') || text.starts_with('[') || text.starts_with('"'))
                fail(fmt::format("{}: {}", printable(text), error.what()));
        }
        JsonValue value;
        value.kind = Kind::String;
        value.text = text;
        forget(value, source);
        return value;
    }

    /// Messages about the value name the option, which has no lines.
    static void forget(JsonValue& value, std::shared_ptr<std::filesystem::path const> const& source)
    {
        value.file = source;
        value.line = 0;
        for (JsonValue& item : value.items)
            forget(item, source);
        for (JsonMember& member : value.members)
            forget(member.value, source);
    }

    JsonValue& element(JsonValue& array, std::string_view& rest) const
    {
        std::size_t const end = rest.find(']');
        std::size_t index = 0;
        auto const [last, error] =
            std::from_chars(rest.data() + 1, rest.data() + std::min(end, rest.size()), index);
        if (end == std::string_view::npos || error != std::errc() || last != rest.data() + end)
            fail("expected the number of an element between [ and ]");
        if (array.kind != Kind::Array || index >= array.items.size())
            fail(array.kind == Kind::Array
                     ? fmt::format("the array has {} elements, from [0]", array.items.size())
                     : "there is no array with elements");
        if (value_.kind == Kind::Null)
            fail("an array keeps its elements");
        rest.remove_prefix(end + 1);
        if (!rest.empty() && !rest.starts_with('.') && !rest.starts_with('['))
            fail("expected . or [ behind ]");
        return array.items[index];
    }

    /// Goes down by a key; null when that was the last one and the value is set.
    JsonValue* member(JsonValue& object, std::string_view& rest)
    {
        if (object.kind != Kind::Object)
            fail(fmt::format("{} is no object", before(rest)));
        // The longest key that is there: names may have points in them.
        auto found = object.members.end();
        for (auto m = object.members.begin(); m != object.members.end(); ++m) {
            bool const fits = rest.starts_with(m->key)
                && (rest.size() == m->key.size() || rest[m->key.size()] == '.'
                    || rest[m->key.size()] == '[');
            if (fits && (found == object.members.end() || m->key.size() > found->key.size()))
                found = m;
        }
        bool const isThere = found != object.members.end();
        std::string const key = isThere ? found->key : std::string(rest.substr(0, rest.find('.')));
        if (key.empty())
            fail("expected keys with points between them");
        std::string_view const all = rest;
        rest.remove_prefix(std::min(rest.size(), key.size()));
        ++depth_;
        if (rest.empty()) {
            if (value_.kind != Kind::Null) {
                if (isThere)
                    found->value = value_;
                else
                    object.members.push_back({key, value_});
                return nullptr;
            }
            if (!isThere)
                fail("null takes out what the scene has, which is nothing here"
                     + suggestion(key, keysOf(object)));
            object.members.erase(found);
            return nullptr;
        }
        if (isThere)
            return &found->value;
        // Sections and parameters that a file leaves out are there all the same; things are not.
        constexpr std::string_view kSections[] = {"camera", "film", "settings", "environment"};
        std::vector<std::string> known = keysOf(object);
        if (depth_ == 1)
            known.insert(known.end(), std::begin(kSections), std::end(kSections));
        bool const implied = depth_ == 1
            ? std::find(std::begin(kSections), std::end(kSections), key) != std::end(kSections)
            : key == "parameters";
        if (!implied)
            fail(fmt::format("{} has no \"{}\"{}", depth_ == 1 ? "the scene" : before(all),
                             printable(key), suggestion(key, known)));
        JsonValue made;
        made.kind = Kind::Object;
        made.file = value_.file;
        object.members.push_back({key, std::move(made)});
        return &object.members.back().value;
    }

    static std::vector<std::string> keysOf(JsonValue const& object)
    {
        std::vector<std::string> keys;
        for (JsonMember const& m : object.members)
            keys.push_back(m.key);
        return keys;
    }

    std::string const& option_;
    std::string path_;
    JsonValue value_;
    int depth_ = 0;
};

} // namespace

void assign(JsonValue& scene, std::string const& assignment, std::string const& option)
{
    Assignment(assignment, option).apply(scene);
}

} // namespace zsi::host
