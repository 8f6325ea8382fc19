// SPDX-License-Identifier: Apache-2.0
/// Where a render stands, in a file, so that another process can go on from there.
#pragma once

#include "render/session.h"

#include <filesystem>
#include <optional>

namespace zsi::host {

/// How far a tile is: samples from 0 to before `next` are in the film, and of later ones `ahead`.
struct TileState {
    std::uint32_t next = 0;
    bool isGood = false; ///< by its noise: gets no more
    std::vector<SampleRange> ahead = {}; ///< rising
};

/// Writes and reads the film of one render with the state of its tiles.
class Checkpoint {
public:
    /// `file` is of renders of this scene by this version of the program.
    Checkpoint(std::filesystem::path file, Scene const& scene);

    void write(Film const& film, std::vector<TileState> const& tiles) const;
    /// Puts what the file holds into `film` and `tiles`; false where there is no file. Throws
    /// InputError for one of another scene, version, size or choice of layers.
    bool read(Film& film, std::vector<TileState>& tiles) const;

private:
    std::filesystem::path file_;
    std::string scene_;
};

} // namespace zsi::host
