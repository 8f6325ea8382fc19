// SPDX-License-Identifier: Apache-2.0
#include "model/matrix.h"

#include "json/jsonText.h"

#include <algorithm>
#include <cmath>

namespace zsi::host {
namespace {

template <std::size_t N>
std::array<double, N> numbers(JsonReader const& node, char const* key,
                              std::array<double, N> otherwise)
{
    auto const given = node.find(key);
    if (!given)
        return otherwise;
    std::vector<float> const v = given->toFloats(N);
    std::copy(v.begin(), v.end(), otherwise.begin());
    return otherwise;
}

} // namespace

Vec3f Matrix::point(Vec3f p) const
{
    std::array<double, 3> const from{double(p.x), double(p.y), double(p.z)};
    std::array<double, 3> r{};
    for (std::size_t c = 0; c < 3; ++c)
        r[c] = m[c] * from[0] + m[4 + c] * from[1] + m[8 + c] * from[2] + m[12 + c];
    return {static_cast<float>(r[0]), static_cast<float>(r[1]), static_cast<float>(r[2])};
}

Vec3f Matrix::direction(Vec3f d) const
{
    Matrix linear = *this;
    linear.m[12] = linear.m[13] = linear.m[14] = 0;
    return linear.point(d);
}

double Matrix::volume() const
{
    return m[0] * (m[5] * m[10] - m[6] * m[9]) - m[1] * (m[4] * m[10] - m[6] * m[8])
        + m[2] * (m[4] * m[9] - m[5] * m[8]);
}

bool Matrix::isFinite() const
{
    return std::ranges::all_of(m, [](double v) { return std::abs(v) < 1e30; });
}

Matrix operator*(Matrix const& a, Matrix const& b)
{
    Matrix r;
    for (std::size_t i = 0; i < 4; ++i)
        for (std::size_t j = 0; j < 4; ++j) {
            double sum = 0;
            for (std::size_t k = 0; k < 4; ++k)
                sum += a.m[4 * i + k] * b.m[4 * k + j];
            r.m[4 * i + j] = sum;
        }
    return r;
}

Matrix matrixOf(std::array<double, 3> t, std::array<double, 4> q, std::array<double, 3> s)
{
    double const norm = std::sqrt(q[0] * q[0] + q[1] * q[1] + q[2] * q[2] + q[3] * q[3]);
    if (norm > 0)
        for (double& v : q)
            v /= norm;
    auto const [x, y, z, w] = q;
    Matrix r;
    r.m = {s[0] * (1 - 2 * (y * y + z * z)),
           s[0] * 2 * (x * y + z * w),
           s[0] * 2 * (x * z - y * w),
           0,
           s[1] * 2 * (x * y - z * w),
           s[1] * (1 - 2 * (x * x + z * z)),
           s[1] * 2 * (y * z + x * w),
           0,
           s[2] * 2 * (x * z + y * w),
           s[2] * 2 * (y * z - x * w),
           s[2] * (1 - 2 * (x * x + y * y)),
           0,
           t[0],
           t[1],
           t[2],
           1};
    return r;
}

Matrix nodeMatrix(JsonReader const& node)
{
    if (auto const given = node.find("matrix")) {
        // The file writes columns of a matrix for column vectors: the rows of this one.
        std::vector<float> const v = given->toFloats(16);
        if (v[3] != 0.0f || v[7] != 0.0f || v[11] != 0.0f || v[15] != 1.0f)
            given->fail("expected 0, 0, 0, 1 in the fourth row");
        Matrix r;
        std::copy(v.begin(), v.end(), r.m.begin());
        return r;
    }
    return matrixOf(numbers<3>(node, "translation", {0, 0, 0}),
                    numbers<4>(node, "rotation", {0, 0, 0, 1}),
                    numbers<3>(node, "scale", {1, 1, 1}));
}

Matrix turnedUp(Matrix const& matrix)
{
    // (x, y, z) becomes (x, -z, y), in the rows and in the columns.
    constexpr std::array<std::size_t, 4> kFrom{0, 2, 1, 3};
    constexpr std::array<double, 4> kSign{1, -1, 1, 1};
    Matrix r;
    for (std::size_t i = 0; i < 4; ++i)
        for (std::size_t j = 0; j < 4; ++j)
            r.m[4 * i + j] = kSign[i] * kSign[j] * matrix.m[4 * kFrom[i] + kFrom[j]];
    return r;
}

JsonValue transformValue(Matrix const& matrix)
{
    std::array<float, 16> m{};
    std::ranges::transform(matrix.m, m.begin(), [](double v) { return static_cast<float>(v); });
    constexpr std::array<float, 12> kLinear{1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0};
    if (std::equal(kLinear.begin(), kLinear.end(), m.begin())) {
        if (m[12] == 0.0f && m[13] == 0.0f && m[14] == 0.0f)
            return {};
        return jsonObject({{"translate", jsonOf(std::span(m).subspan(12, 3))}});
    }
    std::vector<JsonValue> rows;
    for (std::size_t i = 0; i < 4; ++i)
        rows.push_back(jsonOf(std::span<float const>(m).subspan(4 * i, 4)));
    return jsonArray(std::move(rows));
}

} // namespace zsi::host
