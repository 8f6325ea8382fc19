// SPDX-License-Identifier: Apache-2.0
/// Materials of OBJ files.
#pragma once

#include "model/leftOut.h"

#include <array>
#include <filesystem>
#include <map>
#include <optional>
#include <zsi/types.h>

namespace zsi::host {

/// One "newmtl": the statements that have a counterpart, by their words in the file.
struct MtlMaterial {
    std::string name;
    std::map<std::string, Vec3f> colors; ///< Kd, Ks, Ke, Tf
    std::map<std::string, float> numbers; ///< Ns, Ni, d, Pr, Pm, illum
    std::map<std::string, std::filesystem::path> pictures; ///< map_Kd, map_Ke, map_d, map_Pr, ...
};

/// The materials of the libraries that an OBJ file names, in their order; those that are not there
/// are told of. Throws InputError with file and line where a statement lacks its numbers.
std::vector<MtlMaterial> readMtlOf(std::filesystem::path const& obj, LeftOut& leftOut);

} // namespace zsi::host
