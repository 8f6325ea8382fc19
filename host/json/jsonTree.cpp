// SPDX-License-Identifier: Apache-2.0
#include "json/jsonTree.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>
#include <fmt/format.h>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>
#include <unordered_set>
#include <utility>

namespace zsi::host {

namespace {

// Deeper than any scene; keeps the recursion over a hostile file's tree short.
constexpr std::size_t kMaxDepth = 64;

/// Where the parser is: the last character that it took, which is the end of a word just read and
/// the first character too many of a wrong one. A number ends before it, on the same line.
struct Place {
    int line = 1;
    int column = 0;
    bool lineEnds = false;
};

/// Gives the parser its characters and keeps count of lines on the way.
class CountingIterator {
public:
    using iterator_category = std::input_iterator_tag;
    using value_type = char;
    using difference_type = std::ptrdiff_t;
    using pointer = char const*;
    using reference = char const&;

    CountingIterator(char const* at, Place* last)
        : at_(at)
        , last_(last)
    {
    }
    char const& operator*() const { return *at_; }
    CountingIterator& operator++()
    {
        if (std::exchange(last_->lineEnds, *at_ == '\n')) {
            ++last_->line;
            last_->column = 0;
        }
        ++last_->column;
        ++at_;
        return *this;
    }
    bool operator==(CountingIterator const& other) const { return at_ == other.at_; }

private:
    char const* at_;
    Place* last_;
};

/// Builds the tree from the parser's events.
class TreeBuilder final : public nlohmann::json_sax<nlohmann::json> {
public:
    TreeBuilder(std::filesystem::path const& file, Place const& last)
        : file_(std::make_shared<std::filesystem::path>(file))
        , last_(last)
    {
    }

    JsonValue take() { return std::move(root_); }

    bool null() override { return add(made(JsonValue::Kind::Null)); }
    bool boolean(bool value) override
    {
        JsonValue v = made(JsonValue::Kind::Bool);
        v.boolean = value;
        return add(std::move(v));
    }
    bool number_integer(number_integer_t value) override
    {
        return number(JsonValue::Kind::Integer, static_cast<double>(value));
    }
    bool number_unsigned(number_unsigned_t value) override
    {
        return number(JsonValue::Kind::Integer, static_cast<double>(value));
    }
    bool number_float(number_float_t value, string_t const&) override
    {
        return number(JsonValue::Kind::Float, value);
    }
    bool string(string_t& value) override
    {
        JsonValue v = made(JsonValue::Kind::String);
        v.text = std::move(value);
        return add(std::move(v));
    }
    bool binary(binary_t&) override { return false; } // not in text
    bool start_object(std::size_t) override { return open(JsonValue::Kind::Object); }
    bool start_array(std::size_t) override { return open(JsonValue::Kind::Array); }
    bool end_object() override { return close(); }
    bool end_array() override { return close(); }

    bool key(string_t& name) override
    {
        if (!open_.back().keys.insert(name).second)
            fail(fmt::format("the key \"{}\" stands twice in this object", printable(name)));
        key_ = std::move(name);
        return true;
    }

    bool parse_error(std::size_t, std::string const&,
                     nlohmann::json::exception const& error) override
    {
        // Ours is the place; theirs what is wrong with it, behind their own two prefixes.
        std::string_view why = error.what();
        for (std::string_view const prefix : {"] ", "syntax error while "})
            if (std::size_t const at = why.find(prefix); at != std::string_view::npos)
                why.remove_prefix(at + prefix.size());
        fail("no valid JSON: " + printable(why));
    }

private:
    /// An object or an array that goes on.
    struct Open {
        JsonValue* value;
        std::unordered_set<std::string> keys = {};
    };

    [[noreturn]] void fail(std::string const& why) const
    {
        throw InputError(fmt::format("{}:{}:{}: {}", file_->string(), last_.line,
                                     std::max(last_.column, 1), why));
    }

    JsonValue made(JsonValue::Kind kind) const
    {
        JsonValue v;
        v.kind = kind;
        v.file = file_;
        v.line = last_.line;
        return v;
    }

    bool number(JsonValue::Kind kind, double value)
    {
        JsonValue v = made(kind);
        v.number = value;
        return add(std::move(v));
    }

    JsonValue* insert(JsonValue value)
    {
        if (open_.empty()) {
            root_ = std::move(value);
            return &root_;
        }
        JsonValue& parent = *open_.back().value;
        if (parent.kind == JsonValue::Kind::Array)
            return &parent.items.emplace_back(std::move(value));
        parent.members.push_back({std::move(key_), std::move(value)});
        return &parent.members.back().value;
    }
    bool add(JsonValue value)
    {
        insert(std::move(value));
        return true;
    }
    bool open(JsonValue::Kind kind)
    {
        if (open_.size() == kMaxDepth)
            fail(fmt::format("nested deeper than {} levels", kMaxDepth));
        open_.push_back({insert(made(kind))});
        return true;
    }
    bool close()
    {
        open_.pop_back();
        return true;
    }

    std::shared_ptr<std::filesystem::path const> file_;
    Place const& last_;
    JsonValue root_;
    std::vector<Open> open_; ///< from the root to where values are added now
    std::string key_;
};

std::string readText(std::filesystem::path const& file)
{
    std::error_code failed;
    if (!std::filesystem::exists(file, failed))
        throw InputError(file.string() + ": no such file");
    if (std::filesystem::is_directory(file, failed)) // reading one throws
        throw InputError(file.string() + ": is a folder; expected a scene file");
    std::ifstream in(file, std::ios::binary);
    std::string text{std::istreambuf_iterator<char>(in), {}};
    if (!in)
        throw InputError(file.string() + ": cannot be read");
    return text;
}

} // namespace

JsonValue const* JsonValue::find(std::string_view name) const
{
    for (auto const& [key, value] : members)
        if (key == name)
            return &value;
    return nullptr;
}

JsonValue readJson(std::filesystem::path const& file) { return parseJson(readText(file), file); }

JsonValue parseJson(std::string const& text, std::filesystem::path const& file)
{
    Place last;
    TreeBuilder builder(file, last);
    nlohmann::json::sax_parse(CountingIterator(text.data(), &last),
                              CountingIterator(text.data() + text.size(), &last), &builder,
                              nlohmann::json::input_format_t::json, true, true);
    return builder.take();
}

} // namespace zsi::host
