// SPDX-License-Identifier: Apache-2.0
/// Shares of a picture that machines render apart, and their files.
#pragma once

#include "film/filmFile.h"
#include "render/render.h"

namespace zsi::host {

/// What all units of a picture have in common: what they show, and all that the picture is made
/// with from their sums.
struct UnitOrigin {
    std::string version; ///< of the library
    std::string scene; ///< sceneHash
    std::uint32_t seed = 0;
    std::uint32_t samples = 0; ///< a pixel's in the whole picture
    int frameWidth = 0, frameHeight = 0;
    Window window; ///< of the picture
    std::vector<LayerFormat> layers;
    Development development;
};
/// Throws InputError where the scene's noise decides how many samples a pixel gets: no unit alone
/// knows of it.
UnitOrigin unitOriginOf(Scene const& scene);
/// What `unit` has another than `expected`: "is of version 1, expected 2"; empty: nothing.
std::string differenceOf(UnitOrigin const& unit, UnitOrigin const& expected);

struct UnitHead {
    UnitOrigin origin;
    RenderUnit place;
    std::uint64_t rays = 0, nonFinite = 0;
};
struct Unit {
    UnitHead head;
    Film film;
};

/// Renders the samples of `place`. `origin`: of the session's scene. Nothing when cancelled. Throws
/// InputError where the place is not in the picture.
std::optional<Unit> renderUnit(Session& session, UnitOrigin const& origin, RenderUnit const& place,
                               RenderJob job = {});

/// A unit's file: its film (film/filmFile.h), with the head as texts of the header, "zsi:version",
/// "zsi:scene", "zsi:seed", "zsi:block" (how many blocks of its length lie before it),
/// "zsi:samples" and so on.
std::vector<unsigned char> unitBytes(Unit const& unit);
/// All throw InputError where it is another file or a damaged one.
UnitHead readUnitHead(std::filesystem::path const& file);
Unit readUnit(std::filesystem::path const& file);
Unit readUnit(std::string const& name, std::span<unsigned char const> bytes);

/// "samples 0 to 16 of 0,0,64,64".
std::string placeText(RenderUnit const& place);

} // namespace zsi::host
