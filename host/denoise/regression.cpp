// SPDX-License-Identifier: Apache-2.0
#include "denoise/regression.h"

#include <algorithm>
#include <cmath>

namespace zsi::host {

void Regression::add(FeatureRow const& row, Float4 const& color, float weight)
{
    std::array<float, kColumns> all{};
    std::copy(row.begin(), row.end(), all.begin());
    std::copy(color.begin(), color.end(), all.begin() + kColor);
    for (std::size_t i = 0; i < kRows; ++i) {
        float const scaled = weight * row[i];
        for (std::size_t j = i / kLanes * kLanes; j < kColumns; ++j)
            products_[i][j] += scaled * all[j];
    }
}

void Regression::solve(FeatureRow const& noise)
{
    // Cholesky's factors, in double since features that follow one another differ by little. The
    // noise on the diagonal keeps it well above 0.
    std::array<std::array<double, kRows>, kRows> lower{};
    std::array<std::array<double, 4>, kRows> y{};
    double const total = static_cast<double>(products_[0][0]);
    for (std::size_t i = 0; i < kRows; ++i) {
        for (std::size_t j = 0; j <= i; ++j) {
            double sum = static_cast<double>(products_[j][i]);
            if (i == j)
                sum += i == 0 ? 0.0 : total * static_cast<double>(noise[i]);
            for (std::size_t k = 0; k < j; ++k)
                sum -= lower[i][k] * lower[j][k];
            lower[i][j] = i == j ? std::sqrt(std::max(sum, 1e-12)) : sum / lower[j][j];
        }
        for (std::size_t c = 0; c < 4; ++c) {
            double sum = static_cast<double>(products_[i][kColor + c]);
            for (std::size_t k = 0; k < i; ++k)
                sum -= lower[i][k] * y[k][c];
            y[i][c] = sum / lower[i][i];
        }
    }
    for (std::size_t i = kRows; i-- > 0;)
        for (std::size_t c = 0; c < 4; ++c) {
            double sum = y[i][c];
            for (std::size_t k = i + 1; k < kRows; ++k)
                sum -= lower[k][i] * y[k][c];
            y[i][c] = sum / lower[i][i];
            plane_[i][c] = static_cast<float>(y[i][c]);
        }
}

Float4 Regression::at(FeatureRow const& row) const
{
    Float4 color{};
    for (std::size_t i = 0; i < kRows; ++i)
        for (std::size_t c = 0; c < 4; ++c)
            color[c] += row[i] * plane_[i][c];
    return color;
}

} // namespace zsi::host
