// SPDX-License-Identifier: Apache-2.0
/// Films in files, to the bit.
#pragma once

#include "film/film.h"

#include <filesystem>

namespace zsi::host {

/// What a film's file says before its sums.
struct FilmHead {
    int frameWidth = 0, frameHeight = 0;
    Window window;
    std::vector<LayerFormat> layers;
    std::vector<Attachment> label;
};

struct StoredFilm {
    Film film;
    std::vector<Attachment> label;
};

/// An EXR of unsigned integers in the film's place in its frame: the words of every sum
/// ("sums.<i>.<word>", the lowest first), "counts.<i>", and of layers of names pairs "ids.<i>.<k>",
/// "shares.<i>.<k>". Sums that were rounded to floats would depend on the order of adding. The
/// header has the layers ("zsi:layers") and `label`. Throws InputError.
std::vector<unsigned char> filmBytes(Film const& film, std::vector<Attachment> const& label);
/// The same to a file: what stands there is whole or as it was.
void writeFilm(std::filesystem::path const& file, Film const& film,
               std::vector<Attachment> const& label);

/// Throws InputError where there is no such file, or another one or a damaged one.
StoredFilm readFilm(std::filesystem::path const& file);
StoredFilm readFilm(std::string const& name, std::span<unsigned char const> bytes);
FilmHead readFilmHead(std::filesystem::path const& file);

/// The text of that name in a label; empty where there is none.
std::string labelText(std::vector<Attachment> const& label, std::string_view name);

} // namespace zsi::host
