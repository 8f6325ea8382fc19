// SPDX-License-Identifier: Apache-2.0
#include "render/checkpoint.h"

#include "base/error.h"
#include "film/filmFile.h"
#include "scene/sceneHash.h"

#include <nlohmann/json.hpp>

namespace zsi::host {
namespace {

using Json = nlohmann::json;

constexpr char const* kScene = "zsi:scene";
constexpr char const* kVersion = "zsi:version";
constexpr char const* kTiles = "zsi:tiles";

} // namespace

Checkpoint::Checkpoint(std::filesystem::path file, Scene const& scene)
    : file_(std::move(file))
    , scene_(sceneHash(scene))
{
}

void Checkpoint::write(Film const& film, std::vector<TileState> const& tiles) const
{
    Json list = Json::array();
    for (TileState const& t : tiles) {
        Json tile{t.next, t.isGood};
        for (SampleRange const& range : t.ahead)
            tile.insert(tile.end(), {range.begin, range.end});
        list.push_back(std::move(tile));
    }
    writeFilm(file_, film, {{kScene, scene_}, {kVersion, ZSI_HOST_VERSION}, {kTiles, list.dump()}});
}

bool Checkpoint::read(Film& film, std::vector<TileState>& tiles) const
{
    std::error_code error;
    if (!std::filesystem::exists(file_, error))
        return false;
    auto const refuse = [&](std::string const& why) {
        return InputError(file_.string() + ": cannot be gone on from: " + why
                          + "; remove it to begin anew");
    };
    StoredFilm stored = readFilm(file_);
    std::string const version = labelText(stored.label, kVersion);
    if (version != ZSI_HOST_VERSION)
        throw refuse("it is of version " + version + ", this is " ZSI_HOST_VERSION);
    if (stored.film.frameWidth() != film.frameWidth()
        || stored.film.frameHeight() != film.frameHeight() || stored.film.window() != film.window())
        throw refuse("it is of a picture of another size or crop");
    if (labelText(stored.label, kScene) != scene_)
        throw refuse("it is of another scene, seed or settings");
    if (stored.film.layers() != film.layers())
        throw refuse("it has other layers, or --noise was given in one of the two runs only");
    std::vector<TileState> read;
    try {
        for (Json const& t : Json::parse(labelText(stored.label, kTiles))) {
            TileState& tile =
                read.emplace_back(TileState{t.at(0).get<std::uint32_t>(), t.at(1).get<bool>()});
            for (std::size_t i = 2; i < t.size(); i += 2)
                tile.ahead.push_back(
                    {t.at(i).get<std::uint32_t>(), t.at(i + 1).get<std::uint32_t>()});
        }
    } catch (Json::exception const&) {
    }
    if (read.size() != tiles.size())
        throw refuse("it is damaged");
    film = std::move(stored.film);
    tiles = std::move(read);
    return true;
}

} // namespace zsi::host
