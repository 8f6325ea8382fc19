// SPDX-License-Identifier: Apache-2.0
/// Adds the units of a picture up.
#pragma once

#include "render/unit.h"

namespace zsi::host {

/// Which samples of a picture are still to come, as boxes of pixels and samples that do not
/// overlap.
class Missing {
public:
    explicit Missing(RenderUnit const& all)
        : boxes_{all}
    {
    }
    /// False, and nothing changed, where some of it has been taken before.
    bool take(RenderUnit const& unit);
    std::vector<RenderUnit> const& boxes() const { return boxes_; }

private:
    std::vector<RenderUnit> boxes_;
};

/// Holds one film of the whole picture, whatever the number of units. Adding is exact, so that the
/// picture is that of one machine however it was divided, in any order. For one thread.
class Merging {
public:
    /// `expected`: what all units are to be of; without it, what the first one is of.
    explicit Merging(std::optional<UnitOrigin> expected = {});

    /// Throws InputError where a unit is of another picture than the others, or has samples that
    /// one before it has; nothing is changed then.
    void add(std::string const& name, Unit const& unit);
    /// Likewise, but for the sums: to find out what is wrong before they are read.
    void claim(std::string const& name, UnitHead const& head);

    std::size_t units() const { return taken_.size(); }
    std::uint64_t rays() const { return rays_; }
    std::uint64_t nonFinite() const { return nonFinite_; }
    std::vector<RenderUnit> missing() const; ///< nothing before the first one
    std::uint64_t missingSamples() const; ///< of all pixels
    /// The first of what is missing, and how much more there is; empty: nothing.
    std::string missingText() const;
    Film const& film() const { return film_; }
    UnitOrigin const& origin() const { return *origin_; } ///< after the first unit
    Picture picture() const { return developed(film_, origin_->development); }

private:
    std::optional<UnitOrigin> origin_;
    std::string first_; ///< name; empty where the origin was given
    std::optional<Missing> missing_;
    std::vector<std::pair<std::string, RenderUnit>> taken_;
    Film film_;
    std::uint64_t rays_ = 0, nonFinite_ = 0;
};

} // namespace zsi::host
