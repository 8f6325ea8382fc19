// SPDX-License-Identifier: Apache-2.0
/// JSON trees made by the program, and their text.
#pragma once

#include "json/jsonTree.h"

#include <span>
#include <zsi/types.h>

namespace zsi::host {

/// Laid out for people: short objects and arrays in one line. Numbers read back as the same.
std::string jsonText(JsonValue const& value);

// Values that stand in no file yet.

JsonValue jsonOf(bool value);
JsonValue jsonOf(double value);
JsonValue jsonOf(float value); ///< the shortest number that is this float
JsonValue jsonOf(int value);
JsonValue jsonOf(std::string value);
JsonValue jsonOf(char const* value);
JsonValue jsonOf(Vec3f value);
JsonValue jsonOf(std::span<float const> values);
/// Of what was computed: five digits, for people who edit it.
JsonValue jsonShort(float value);
JsonValue jsonShort(Vec3f value);
JsonValue jsonObject(std::vector<JsonMember> members = {});
JsonValue jsonArray(std::vector<JsonValue> items = {});

/// Says of the whole tree that it comes from `file`, in whose folder its relative names start.
/// It has no lines there.
void setOrigin(JsonValue& tree, std::filesystem::path const& file);

} // namespace zsi::host
