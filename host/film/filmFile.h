// SPDX-License-Identifier: Apache-2.0
/// Films in files, to the bit.
#pragma once

#include "film/film.h"

#include <filesystem>

namespace zsi::host {

struct StoredFilm {
    Film film;
    std::vector<Attachment> label;
};

/// An EXR of unsigned integers in the film's place in its frame: the words of every sum
/// ("sums.<i>.<word>", the lowest first), "counts.<i>", and of layers of names pairs "ids.<i>.<k>",
/// "shares.<i>.<k>". The header has the layers ("zsi:layers") and `label`. What stands there is
/// whole or as it was. Throws InputError.
void writeFilm(std::filesystem::path const& file, Film const& film,
               std::vector<Attachment> const& label);
/// Throws InputError where there is no such file, or another one or a damaged one.
StoredFilm readFilm(std::filesystem::path const& file);

} // namespace zsi::host
