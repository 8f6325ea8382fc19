// SPDX-License-Identifier: Apache-2.0
/// Whether mesh files in text are whole, which the importer does not tell.
#pragma once

#include <filesystem>

namespace zsi::host {

// Each throws InputError with file and line where a file ends early, or has another thing where a
// number or a keyword has to be.

/// The header, and of files in text that all the elements it counts are there. The importer never
/// comes back from a header that does not end or has a line of another kind.
void checkPly(std::filesystem::path const& file);
/// Files in text, from "solid" to the last "endsolid"; binary ones tell their own size.
void checkStl(std::filesystem::path const& file);
/// Numbers of vertices, and corners of faces.
void checkObj(std::filesystem::path const& file);

} // namespace zsi::host
