// SPDX-License-Identifier: Apache-2.0
/// What has to hold of a material whatever it models, as `zsi lab --check` asks (docs/lab.md).
#pragma once

#include "lab/specimen.h"

#include <cstdint>

namespace zsi::lab {

enum class Verdict {
    Holds,
    NotApplicable, ///< nothing there that could hold, by what the entry points did
    Known, ///< does not hold, and the class's description says that and why
    Fails,
};

struct Check {
    std::string name; ///< finite, density, value, integral, energy, reciprocity or light
    Verdict verdict;
    std::string text; ///< the numbers, or why not
};

struct CheckOptions {
    /// Chance that a density that is right fails, which is divided among all densities of the call.
    double falseAlarm = 1e-6;
    std::size_t densities = 1; ///< that many materials are checked with the same options
    std::uint32_t draws = 1u << 16; ///< of `sample`, for each of three angles
    std::uint32_t seed = 1;
    int threads = 0;
};

/// All checks of a material. Fixed by the seed.
std::vector<Check> checkMaterial(Specimen const& specimen, CheckOptions const& options);

} // namespace zsi::lab
