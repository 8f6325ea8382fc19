// SPDX-License-Identifier: Apache-2.0
#include "base/names.h"

#include <algorithm>
#include <cctype>
#include <fmt/format.h>

namespace zsi::host {

namespace {

// Longer than any name a library registers; bounds the work on hostile input.
constexpr std::size_t kLongestName = 128;
constexpr std::size_t kShownLength = 200;
constexpr std::size_t kFewNames = 12;

/// Optimal string alignment distance, three rows at a time.
std::size_t editDistance(std::string_view a, std::string_view b)
{
    std::vector<std::size_t> before(b.size() + 1), last(b.size() + 1), row(b.size() + 1);
    for (std::size_t j = 0; j <= b.size(); ++j)
        last[j] = j;
    for (std::size_t i = 1; i <= a.size(); ++i) {
        row[0] = i;
        for (std::size_t j = 1; j <= b.size(); ++j) {
            std::size_t const replaced = last[j - 1] + (a[i - 1] != b[j - 1]);
            row[j] = std::min({row[j - 1] + 1, last[j] + 1, replaced});
            if (i > 1 && j > 1 && a[i - 1] == b[j - 2] && a[i - 2] == b[j - 1])
                row[j] = std::min(row[j], before[j - 2] + 1);
        }
        before.swap(last);
        last.swap(row);
    }
    return last[b.size()];
}

/// "u_roughValue" as "u", "rough", "value".
std::vector<std::string> words(std::string_view name)
{
    std::vector<std::string> found(1);
    bool afterLower = false;
    for (char const c : name) {
        bool const upper = std::isupper(static_cast<unsigned char>(c)) != 0;
        if (c == '_' || (upper && afterLower))
            found.emplace_back();
        afterLower = !upper;
        if (c != '_')
            found.back() += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    return found;
}

/// Whether a word of one begins a word of the other, as "rough" does "roughness".
bool shareStem(std::string_view a, std::string_view b)
{
    constexpr std::size_t kShortestStem = 4;
    for (std::string const& x : words(a))
        for (std::string const& y : words(b)) {
            std::size_t const stem = std::min(x.size(), y.size());
            if (stem >= kShortestStem && x.compare(0, stem, y, 0, stem) == 0)
                return true;
        }
    return false;
}

} // namespace

std::string lowered(std::string_view text)
{
    std::string out(text);
    for (char& c : out)
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return out;
}

std::vector<std::string> nearestNames(std::string_view name,
                                      std::vector<std::string> const& candidates)
{
    if (name.empty() || name.size() > kLongestName)
        return {};
    std::string const wanted = lowered(name);
    std::size_t const limit = std::max<std::size_t>(1, wanted.size() / 3);
    std::vector<std::pair<std::size_t, std::string const*>> near, related;
    for (std::string const& candidate : candidates) {
        if (candidate.size() > kLongestName)
            continue;
        std::string const other = lowered(candidate);
        std::size_t distance = editDistance(wanted, other);
        // "Dielectric" for a class whose name ends so: behind everything that is nearly the same.
        if (distance > limit && wanted.size() > 2 && other.find(wanted) != std::string::npos)
            distance = limit;
        if (distance <= limit)
            near.emplace_back(distance, &candidate);
        else if (distance <= wanted.size() / 2 && shareStem(name, candidate))
            related.emplace_back(distance, &candidate);
    }
    if (near.empty())
        near = std::move(related);
    std::stable_sort(near.begin(), near.end(),
                     [](auto const& a, auto const& b) { return a.first < b.first; });
    std::vector<std::string> names;
    for (auto const& [distance, candidate] : near) {
        if (names.size() == 3)
            break;
        names.push_back(*candidate);
    }
    return names;
}

std::string suggestion(std::string_view name, std::vector<std::string> const& candidates)
{
    auto const joined = [](std::vector<std::string> const& names, char const* lastSeparator) {
        std::string text;
        for (std::size_t i = 0; i < names.size(); ++i) {
            if (i > 0)
                text += i + 1 == names.size() ? lastSeparator : ", ";
            text += printable(names[i]);
        }
        return text;
    };
    std::vector<std::string> const near = nearestNames(name, candidates);
    if (!near.empty())
        return fmt::format("; did you mean {}?", joined(near, " or "));
    if (!candidates.empty() && candidates.size() <= kFewNames)
        return fmt::format("; known: {}", joined(candidates, ", "));
    return {};
}

std::string printable(std::string_view text)
{
    std::string out;
    for (char const c : text.substr(0, kShownLength)) {
        auto const u = static_cast<unsigned char>(c);
        if (u >= 0x20 && u != 0x7f) {
            out += c;
            continue;
        }
        out += fmt::format("\\x{:02x}", u);
    }
    if (text.size() > kShownLength)
        out += "...";
    return out;
}

} // namespace zsi::host
