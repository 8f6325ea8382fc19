// SPDX-License-Identifier: Apache-2.0
/// Typed, checked access to the values of a JSON tree.
#pragma once

#include "json/jsonTree.h"

#include <array>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <vector>
#include <zsi/types.h>

namespace zsi::host {

/// A value of a tree with the path to it, for messages. Every operation that finds something else
/// than it expects throws InputError: "file:line: path: expected ..., got ...".
class JsonReader {
public:
    static constexpr float kHuge = std::numeric_limits<float>::max();

    explicit JsonReader(JsonValue const& value, std::string path = {})
        : value_(&value)
        , path_(std::move(path))
    {
    }

    JsonValue const& value() const { return *value_; }
    JsonValue::Kind kind() const { return value_->kind; }
    bool isObject() const { return kind() == JsonValue::Kind::Object; }
    std::string const& path() const { return path_; }
    std::string place() const; ///< "file:line: path"
    [[noreturn]] void fail(std::string const& why) const;
    [[noreturn]] void failExpected(std::string const& what) const; ///< "expected `what`, got ..."

    bool toBool() const;
    int toInt(int least, int most) const;
    std::uint32_t toUint32() const;
    float toFloat(float least = -kHuge, float most = kHuge) const; ///< finite
    float toPositive() const; ///< above 0
    std::string const& toString() const;
    /// One of `words`; its index.
    std::size_t toChoice(std::vector<std::string> const& words) const;
    Vec3f toVec3f() const;
    /// As many numbers as `count`.
    std::vector<float> toFloats(std::size_t count) const;
    /// A file that the value names, relative to the file in which the value stands.
    std::filesystem::path toFile() const;

    std::vector<JsonReader> items() const; ///< of an array
    std::vector<std::pair<std::string, JsonReader>> members() const; ///< of an object
    std::optional<JsonReader> find(std::string_view key) const; ///< in an object
    JsonReader at(std::string_view key) const; ///< in an object, which must have it
    /// Refuses other keys of an object than these.
    void expectKeys(std::vector<std::string> const& known) const;
    /// The one of `keys` that the object has; none or several are refused.
    JsonReader onlyOf(std::vector<std::string> const& keys) const;

private:
    JsonReader child(std::string const& key, JsonValue const& value) const;
    void expect(JsonValue::Kind wanted, char const* what) const;

    JsonValue const* value_;
    std::string path_;
};

} // namespace zsi::host
