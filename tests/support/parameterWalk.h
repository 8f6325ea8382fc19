/// Changes the parameters of a shader one by one.
#pragma once

#include "support/loadedLibrary.h"

#include <cstring>
#include <string>

namespace zsi::test {

/// A different value of the same type: flips a bool, turns any int into 1 and 1 into 2, moves
/// numbers, and empties a texture handle.
inline void changeParameter(Registered const& row)
{
    if (row.type == "bool") {
        *row.field = !*row.field;
    } else if (row.type == "int") {
        int v;
        std::memcpy(&v, row.field, sizeof v);
        v = v == 1 ? 2 : 1;
        std::memcpy(row.field, &v, sizeof v);
    } else if (row.type.starts_with("Texture")) {
        std::memset(row.field, 0, sizeof(void*));
    } else {
        for (std::size_t at = 0; at < row.size; at += sizeof(float)) {
            float v;
            std::memcpy(&v, row.field + at, sizeof v);
            v = v * 0.6f + 0.15f;
            std::memcpy(row.field + at, &v, sizeof v);
        }
    }
}

} // namespace zsi::test
