// SPDX-License-Identifier: Apache-2.0
// Writes src/materials/legacy/albedoTables.h: what perfectly reflecting facets send out after one
// bounce, of the light along a direction.
//
//   g++ -std=c++20 -O2 scripts/albedoTables.cpp -o build/albedoTables
//   build/albedoTables > src/materials/legacy/albedoTables.h
#include <algorithm>
#include <cmath>
#include <cstdio>

constexpr int kWidths = 12, kCosines = 16;
constexpr int kGrid = 512; // of facet normals, a quarter as many in azimuth
constexpr double kLeastCosine = 1e-4; // stands for 0

struct Vector {
    double x, y, z;
};
double dot(Vector a, Vector b) { return a.x * b.x + a.y * b.y + a.z * b.z; }

// Mean over the azimuths of one half of the mirrored directions: weight(u, phi) for u in (0, 1).
template <class Weight>
double mean(Weight const& weight)
{
    double sum = 0;
    for (int i = 0; i < kGrid; ++i)
        for (int j = 0; j < kGrid / 4; ++j)
            sum += weight((i + 0.5) / kGrid, M_PI * (j + 0.5) / (kGrid / 4));
    return sum / (kGrid * (kGrid / 4));
}

// Trowbridge-Reitz facets with height-correlated masking: the mean of G2/G1 over visible normals
// (Heitz 2018, "Sampling the GGX Distribution of Visible Normals", eq. 19), drawn as Dupuy and
// Benyoub 2023, "Sampling Visible GGX Normals with Spherical Caps".
double lobe(double width, double cosine)
{
    Vector const v{std::sqrt(1 - cosine * cosine), 0, cosine};
    auto const stretched = [width](Vector w) {
        return std::sqrt(width * width * (w.x * w.x + w.y * w.y) + w.z * w.z);
    };
    double const sv = stretched(v);
    return mean([&](double u, double phi) {
        double const z = (1 - u) * (1 + v.z / sv) - v.z / sv;
        double const r = std::sqrt(std::max(0.0, 1 - z * z));
        Vector const h{(r * std::cos(phi) + width * v.x / sv) * width, r * std::sin(phi) * width,
                       z + v.z / sv};
        double const k = 2 * dot(v, h) / dot(h, h);
        Vector const l{h.x * k - v.x, h.y * k, h.z * k - v.z};
        return l.z > 0 ? l.z * (v.z + sv) / (v.z * stretched(l) + l.z * sv) : 0;
    });
}

// Gaussian slopes (Beckmann facets) with the masking that flakeLayer.h takes, drawn by D cos.
double flakes(double width, double cosine)
{
    Vector const v{std::sqrt(1 - cosine * cosine), 0, cosine};
    auto const masking = [width](double c) {
        return c + std::sqrt(c * c + width * width * (1 - c * c));
    };
    return mean([&](double u, double phi) {
        double const slope = width * std::sqrt(-std::log(1 - u));
        double const n = std::sqrt(1 + slope * slope);
        Vector const h{slope * std::cos(phi) / n, slope * std::sin(phi) / n, 1 / n};
        double const vh = dot(v, h), lz = 2 * vh * h.z - v.z;
        return vh > 0 && lz > 0 ? 4 * vh * lz / (h.z * masking(v.z) * masking(lz)) : 0;
    });
}

void print(char const* name, double leastWidth, double (*albedo)(double, double))
{
    std::printf("inline constexpr float %s[%d][%d] = {\n", name, kWidths, kCosines);
    for (int w = 0; w < kWidths; ++w) {
        double const least = std::sqrt(leastWidth);
        double const width = std::pow(least + (1 - least) * w / (kWidths - 1), 2);
        std::printf("    {");
        for (int c = 0; c < kCosines; ++c) {
            double const x = double(c) / (kCosines - 1);
            double const cosine = std::clamp(x * width / (1 + width - x), kLeastCosine, 1.0);
            std::printf("%.4ff%s", albedo(width, cosine),
                        c + 1 == kCosines ? "},\n"
                            : c == 7      ? ",\n     "
                                          : ", ");
        }
    }
    std::printf("};\n");
}

int main()
{
    std::printf(
        "/// Albedo of perfectly reflecting facets after one bounce; made by "
        "scripts/albedoTables.cpp.\n"
        "/// Nodes in equal steps: sqrt(width) up to 1, and c (1 + width) / (c + width) with "
        "c the\n/// cosine of the direction.\n"
        "#pragma once\n\nnamespace zsi {\n\n// clang-format off\n"
        "/// Trowbridge-Reitz facets, widths from 0.02.\n");
    print("kLobeAlbedo", 0.02, lobe);
    std::printf("/// Gaussian slopes, widths from 0.1.\n");
    print("kFlakeAlbedo", 0.1, flakes);
    std::printf("// clang-format on\n\n} // namespace zsi\n");
}
