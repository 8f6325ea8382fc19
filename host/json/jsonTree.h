// SPDX-License-Identifier: Apache-2.0
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
    int line = 0; ///< from 1; 0: of no file that has lines
    /// A reader has taken it for the name of a file.
    mutable bool namesFile = false;

    JsonValue const* find(std::string_view name) const; ///< null when there is none
};

struct JsonMember {
    std::string key;
    JsonValue value;
};

/// JSON text in which comments may stand. `file`: where it comes from. Throws InputError that names
/// file, line and column when it is no JSON, and for a key that an object has twice.
JsonValue parseJson(std::string const& text, std::filesystem::path const& file);

/// `parseJson` of a file, which can also be one that cannot be read.
JsonValue readJson(std::filesystem::path const& file);

} // namespace zsi::host
