// SPDX-License-Identifier: Apache-2.0
#include "model/leftOut.h"

#include "base/names.h"

#include <algorithm>
#include <fmt/format.h>
#include <fmt/ranges.h>

namespace zsi::host {

void LeftOut::add(std::string const& what, std::string const& who)
{
    auto thing = std::ranges::find(things_, what, [](auto const& t) { return t.first; });
    if (thing == things_.end())
        thing = things_.insert(things_.end(), {what, {}});
    if (!who.empty() && std::ranges::find(thing->second, who) == thing->second.end())
        thing->second.push_back(who);
}

std::vector<std::string> LeftOut::warnings(std::string const& file) const
{
    constexpr std::size_t kNamed = 4;
    std::vector<std::string> lines;
    for (auto const& [what, all] : things_) {
        std::vector<std::string> named;
        for (std::size_t i = 0; i < std::min(all.size(), kNamed); ++i)
            named.push_back(printable(all[i]));
        std::string const more =
            all.size() > kNamed ? fmt::format(" and {} more", all.size() - kNamed) : "";
        lines.push_back(
            fmt::format("{}: {}{}", file, what,
                        all.empty() ? "" : fmt::format(" ({}{})", fmt::join(named, ", "), more)));
    }
    return lines;
}

} // namespace zsi::host
