// SPDX-License-Identifier: Apache-2.0
#include "load/transforms.h"

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {

namespace {

constexpr double kRadians = 3.14159265358979323846 / 180.0;

/// Sine and cosine of degrees, exact for quarter turns, so that boxes stay square.
void sineAndCosine(float degrees, double& sine, double& cosine)
{
    double const turn = std::fmod(static_cast<double>(degrees), 360.0);
    double const quarters = turn / 90.0;
    if (quarters == std::floor(quarters)) {
        constexpr double kSines[] = {0, 1, 0, -1};
        int const i = (static_cast<int>(quarters) + 4) % 4;
        sine = kSines[i];
        cosine = kSines[(i + 1) % 4];
        return;
    }
    sine = std::sin(turn * kRadians);
    cosine = std::cos(turn * kRadians);
}

template <std::size_t N>
using Square = std::array<std::array<double, N>, N>;

template <std::size_t N>
Square<N> identity()
{
    Square<N> m{};
    for (std::size_t i = 0; i < N; ++i)
        m[i][i] = 1;
    return m;
}

template <std::size_t N>
Square<N> operator*(Square<N> const& a, Square<N> const& b)
{
    Square<N> m{};
    for (std::size_t i = 0; i < N; ++i)
        for (std::size_t j = 0; j < N; ++j)
            for (std::size_t k = 0; k < N; ++k)
                m[i][j] += a[i][k] * b[k][j];
    return m;
}

/// N * N numbers, or N rows of N.
template <std::size_t N>
Square<N> readRows(JsonReader const& reader)
{
    std::vector<float> numbers;
    std::vector<JsonReader> const items = reader.items();
    bool const rows = items.size() == N && items[0].kind() == JsonValue::Kind::Array;
    if (rows) {
        for (JsonReader const& row : items)
            for (float const number : row.toFloats(N))
                numbers.push_back(number);
    } else if (items.size() == N * N) {
        numbers = reader.toFloats(N * N);
    } else {
        reader.failExpected(
            N == 3 ? "9 numbers, 3 rows of 3, or {\"scale\", \"rotate\", \"translate\"}"
                   : "16 numbers, 4 rows of 4, or {\"scale\", \"rotate\", "
                     "\"translate\"}");
    }
    Square<N> m;
    for (std::size_t i = 0; i < N * N; ++i)
        m[i / N][i % N] = static_cast<double>(numbers[i]);
    return m;
}

/// A turn about an axis for row vectors (Rodrigues), in the upper left 3 x 3 block.
template <std::size_t N>
Square<N> readRotation(JsonReader const& reader)
{
    std::vector<float> const v = reader.toFloats(4);
    double axis[3] = {static_cast<double>(v[0]), static_cast<double>(v[1]),
                      static_cast<double>(v[2])};
    double const length = std::hypot(axis[0], axis[1], axis[2]);
    if (!(length > 0))
        reader.fail("expected [x, y, z, degrees] with an axis that is not 0");
    double sine, cosine;
    sineAndCosine(v[3], sine, cosine);
    for (double& a : axis)
        a /= length;
    double const across[3][3] = {
        {0, axis[2], -axis[1]}, {-axis[2], 0, axis[0]}, {axis[1], -axis[0], 0}};
    Square<N> m = identity<N>();
    for (std::size_t i = 0; i < 3; ++i)
        for (std::size_t j = 0; j < 3; ++j)
            m[i][j] =
                (i == j ? cosine : 0) + (1 - cosine) * axis[i] * axis[j] + sine * across[i][j];
    return m;
}

template <std::size_t N>
Square<N> readRotations(JsonReader const& reader)
{
    std::vector<JsonReader> const items = reader.items();
    if (items.empty() || items[0].kind() != JsonValue::Kind::Array)
        return readRotation<N>(reader);
    Square<N> m = identity<N>();
    for (JsonReader const& item : items)
        m = m * readRotation<N>(item);
    return m;
}

/// A number for all axes or `axes` numbers.
std::vector<float> readScale(JsonReader const& reader, std::size_t axes)
{
    if (reader.kind() == JsonValue::Kind::Array)
        return reader.toFloats(axes);
    if (reader.kind() != JsonValue::Kind::Integer && reader.kind() != JsonValue::Kind::Float)
        reader.failExpected("a number or an array of " + std::to_string(axes));
    return std::vector<float>(axes, reader.toFloat());
}

template <std::size_t N>
void scaleBy(Square<N>& m, std::vector<float> const& scale)
{
    for (std::size_t i = 0; i < scale.size(); ++i)
        m[i][i] = static_cast<double>(scale[i]);
}

/// Whether a 3 x 3 transform is meant for directions: what it has needs three axes.
bool turnsDirections(JsonReader const& reader)
{
    std::optional<JsonReader> const scale = reader.find("scale"), rotate = reader.find("rotate");
    return (rotate && rotate->kind() == JsonValue::Kind::Array)
        || (scale && scale->value().items.size() == 3);
}

Square<3> readUvTransform(JsonReader const& reader)
{
    Square<3> m = identity<3>();
    if (auto const scale = reader.find("scale"))
        scaleBy<3>(m, readScale(*scale, 2));
    if (auto const rotate = reader.find("rotate")) {
        double sine, cosine;
        sineAndCosine(rotate->toFloat(), sine, cosine);
        m = m * Square<3>{{{cosine, sine, 0}, {-sine, cosine, 0}, {0, 0, 1}}};
    }
    if (auto const translate = reader.find("translate")) {
        std::vector<float> const v = translate->toFloats(2);
        m[2][0] = static_cast<double>(v[0]);
        m[2][1] = static_cast<double>(v[1]);
    }
    return m;
}

template <class Matrix, std::size_t N>
Matrix toMatrix(Square<N> const& m)
{
    Matrix result;
    for (std::size_t i = 0; i < N * N; ++i)
        result.m[i] = static_cast<float>(m[i / N][i % N]);
    return result;
}

} // namespace

Mat4f readTransform(JsonReader const& reader)
{
    if (!reader.isObject())
        return toMatrix<Mat4f>(readRows<4>(reader));
    reader.expectKeys({"scale", "rotate", "translate"});
    Square<4> m = identity<4>();
    if (auto const scale = reader.find("scale"))
        scaleBy<4>(m, readScale(*scale, 3));
    if (auto const rotate = reader.find("rotate"))
        m = m * readRotations<4>(*rotate);
    if (auto const translate = reader.find("translate")) {
        std::vector<float> const v = translate->toFloats(3);
        for (std::size_t i = 0; i < 3; ++i)
            m[3][i] = static_cast<double>(v[i]);
    }
    return toMatrix<Mat4f>(m);
}

Mat3f readTransform3(JsonReader const& reader)
{
    if (!reader.isObject())
        return toMatrix<Mat3f>(readRows<3>(reader));
    if (!turnsDirections(reader)) {
        reader.expectKeys({"scale", "rotate", "translate"});
        return toMatrix<Mat3f>(readUvTransform(reader));
    }
    if (auto const translate = reader.find("translate"))
        translate->fail("a transform of directions has no translation");
    reader.expectKeys({"scale", "rotate"});
    Square<3> m = identity<3>();
    if (auto const scale = reader.find("scale"))
        scaleBy<3>(m, readScale(*scale, 3));
    if (auto const rotate = reader.find("rotate"))
        m = m * readRotations<3>(*rotate);
    return toMatrix<Mat3f>(m);
}

Mat3f turnAroundZ(float degrees)
{
    double sine, cosine;
    sineAndCosine(degrees, sine, cosine);
    return toMatrix<Mat3f>(Square<3>{{{cosine, sine, 0}, {-sine, cosine, 0}, {0, 0, 1}}});
}

} // namespace zsi::host
