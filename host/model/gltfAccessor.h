// SPDX-License-Identifier: Apache-2.0
/// The numbers of a glTF file's accessors.
#pragma once

#include "model/gltfFile.h"

namespace zsi::host {

/// Elements side by side.
struct AccessorValues {
    std::size_t count = 0; ///< of elements
    std::size_t components = 0; ///< of each
    std::vector<float> values;
};

/// `index`: an accessor's, somewhere in the file. Normalised integers become 0..1 or -1..1; what
/// `sparse` replaces is replaced. `components`: how many are expected, one of these.
AccessorValues readAccessor(GltfFile const& file, JsonReader const& index,
                            std::initializer_list<std::size_t> components);

/// Unsigned integers, exactly.
std::vector<std::uint32_t> readIndices(GltfFile const& file, JsonReader const& index);

} // namespace zsi::host
