// SPDX-License-Identifier: Apache-2.0
#include "view/sceneText.h"

#include <algorithm>

namespace zsi::view {
namespace {

constexpr std::size_t kLine = 100;

/// In one line: {"key": [1, 2, 3]}.
std::string inOneLine(Json const& value)
{
    if (!value.is_structured())
        return value.dump();
    std::string text;
    for (auto const& [key, member] : value.items()) {
        text += text.empty() ? "" : ", ";
        if (value.is_object())
            text += Json(key).dump() + ": ";
        text += inOneLine(member);
    }
    return value.is_object() ? '{' + text + '}' : '[' + text + ']';
}

std::string laidOut(Json const& value, std::size_t indent)
{
    bool const hasObjects = value.is_object() && std::ranges::any_of(value, [](Json const& member) {
                                return member.is_object() && !member.empty();
                            });
    std::string line = inOneLine(value);
    if (!value.is_structured() || value.empty()
        || ((!hasObjects || indent > 4) && indent + line.size() < kLine))
        return line;
    std::string const inner(indent + 2, ' ');
    std::string text;
    for (auto const& [key, member] : value.items()) {
        text += (text.empty() ? "" : ",\n") + inner;
        if (value.is_object())
            text += Json(key).dump() + ": ";
        text += laidOut(member, indent + 2);
    }
    text = '\n' + text + '\n' + std::string(indent, ' ');
    return value.is_object() ? '{' + text + '}' : '[' + text + ']';
}

} // namespace

std::string sceneText(Json const& document) { return laidOut(document, 0) + '\n'; }

} // namespace zsi::view
