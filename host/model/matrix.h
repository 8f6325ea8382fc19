// SPDX-License-Identifier: Apache-2.0
/// Places of a model's nodes, in double precision: chains of them are long.
#pragma once

#include "json/jsonReader.h"

#include <array>

namespace zsi::host {

/// Points are row vectors: rows are the axes and the origin.
struct Matrix {
    std::array<double, 16> m{1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1};

    Vec3f point(Vec3f p) const;
    Vec3f direction(Vec3f d) const;
    double volume() const; ///< of the unit cube, with its sign
    bool isFinite() const;
};

/// First `a`, then `b`.
Matrix operator*(Matrix const& a, Matrix const& b);

/// What a node says: "matrix", or "translation", "rotation" and "scale".
Matrix nodeMatrix(JsonReader const& node);
Matrix matrixOf(std::array<double, 3> translation, std::array<double, 4> quaternion,
                std::array<double, 3> scale);

/// The same motion where what had y up has z up, and what faced +z faces -y.
Matrix turnedUp(Matrix const& matrix);

/// As an instance writes it; null for none.
JsonValue transformValue(Matrix const& matrix);

} // namespace zsi::host
