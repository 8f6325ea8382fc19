// SPDX-License-Identifier: Apache-2.0
/// Measures materials and draws what it finds (docs/lab.md).
#pragma once

#include "lab/specimen.h"

#include <atomic>
#include <functional>

namespace zsi::lab {

struct LabOptions {
    std::vector<double> incident{0, 30, 60, 80}; ///< degrees from the normal, below 90
    std::uint32_t draws = 1u << 16; ///< of `sample`, for each angle
    std::uint32_t seed = 1;
    int threads = 0; ///< 0: one per processor
    std::atomic<bool> const* cancel = nullptr;
    std::function<void(std::string const& what, double done)> progress = {};
};

/// Fast enough to follow a slider.
LabOptions quickOptions();

struct LabFile {
    std::string name; ///< such as "lobe.svg"
    std::string content;
};

/// Everything that can be measured of the specimens, overlaid: figures (.svg, .png), numbers (.csv)
/// and a summary, "lab.json", which comes last. Empty when it was cancelled. Throws InputError when
/// there is nothing to measure.
std::vector<LabFile> measure(std::span<Specimen const> specimens, LabOptions const& options = {});

/// The same for a page: the JSON of the summary with each figure's SVG under its name in
/// "figures". Empty when it was cancelled.
std::string labJson(std::span<Specimen const> specimens, LabOptions const& options);

} // namespace zsi::lab
