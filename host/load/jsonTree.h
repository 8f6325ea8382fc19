/// JSON files as trees that remember where each value stands.
#pragma once

#include <filesystem>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace zsi::host {

struct JsonMember;

/// A JSON value with its place in a file. Members of an object keep the file's order.
struct JsonValue {
    enum class Kind { Null, Bool, Integer, Float, String, Array, Object };

    Kind kind = Kind::Null;
    bool boolean = false;
    double number = 0; ///< of Integer and Float; exact up to 2^53
    std::string text;
    std::vector<JsonValue> items;
    std::vector<JsonMember> members;
    std::shared_ptr<std::filesystem::path const> file;
    int line = 0; ///< from 1

    JsonValue const* find(std::string_view name) const; ///< null when there is none
};

struct JsonMember {
    std::string key;
    JsonValue value;
};

/// Reads a JSON file in which comments may stand. Throws InputError that names file, line and
/// column when it cannot be read or is no JSON, and for a key that an object has twice.
JsonValue readJson(std::filesystem::path const& file);

} // namespace zsi::host
