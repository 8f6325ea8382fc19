// SPDX-License-Identifier: Apache-2.0
// Writes src/materials/physical/shared/facetLossTable.h: what one bounce on GGX facets loses.
//
//   g++ -std=c++20 -O2 scripts/facetLossTable.cpp -o build/facetLossTable
//   build/facetLossTable > src/materials/physical/shared/facetLossTable.h
//
// Loss = 1 - E with E the directional albedo of perfectly reflecting facets: the mean of G2/G1 over
// visible facet normals (Heitz 2018, "Sampling the GGX Distribution of Visible Normals", eq. 19),
// taken on a regular grid with the mapping of Dupuy and Benyoub 2023, "Sampling Visible GGX Normals
// with Spherical Caps". The table is fitted to the loss at random settings by Kaczmarz's method;
// then it is lowered until it exceeds the true loss nowhere by more than kExcess: compensated
// facets must not create light.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <random>
#include <vector>

// Nodes in equal steps of a^2 (1 + k) / (a^2 + k), with a^2 the mean of the squared widths, and of
// t = cos / stretched, the direction's cosine over its length after stretching by the widths:
// narrow lobes of every width and ratio lose the same at the same t. A node has three terms: for
// equal widths, and per d and d g, with d = |ax^2 - ay^2| / (ax^2 + ay^2) and g = (least width x
// sine / stretched)^2, which tells how much narrower the facets are along the direction than across
// it.
constexpr int kWidths = 9, kCosines = 17, kTerms = 3;
constexpr double kBend = 0.3; // k
constexpr double kExcess = 0.006;
// Nodes of the mean: powers of 2 of a^2, from kFirstPower on, and half-way between them; linear in
// a^2 between nodes.
constexpr int kFirstPower = -20, kPowers = 21;
constexpr double kHeadroom = 1.002; // of the mean, over what lies between its nodes
constexpr int kChecks = 24000, kFitPasses = 400, kLowerPasses = 300;

double loss(double ax, double ay, double mu, double azimuth, int grid)
{
    double const s = std::sqrt(std::max(0.0, 1 - mu * mu));
    double const v[3] = {s * std::cos(azimuth), s * std::sin(azimuth), mu};
    double const length = std::sqrt(ax * ax * v[0] * v[0] + ay * ay * v[1] * v[1] + mu * mu);
    double const c[3] = {ax * v[0] / length, ay * v[1] / length, mu / length};
    double sum = 0;
    for (int i = 0; i < grid; ++i)
        for (int j = 0; j < grid; ++j) {
            double const phi = 2 * M_PI * (i + 0.5) / grid;
            double const z = (1 - (j + 0.5) / grid) * (1 + c[2]) - c[2];
            double const r = std::sqrt(std::max(0.0, 1 - z * z));
            double const h[3] = {ax * (r * std::cos(phi) + c[0]), ay * (r * std::sin(phi) + c[1]),
                                 z + c[2]};
            double const vh = v[0] * h[0] + v[1] * h[1] + v[2] * h[2];
            double const k = 2 * vh / (h[0] * h[0] + h[1] * h[1] + h[2] * h[2]);
            double const l[3] = {k * h[0] - v[0], k * h[1] - v[1], k * h[2] - v[2]};
            if (l[2] <= 0)
                continue;
            double const out =
                std::sqrt(ax * ax * l[0] * l[0] + ay * ay * l[1] * l[1] + l[2] * l[2]);
            sum += l[2] * (mu + length) / (mu * out + l[2] * length); // G2/G1
        }
    return 1 - sum / (grid * grid);
}

double table[kWidths][kCosines][kTerms];

// The table's coefficients at a direction; ax is the wider width.
struct Terms {
    double* node[4 * kTerms];
    double weight[4 * kTerms];

    Terms(double ax, double ay, double mu, double azimuth)
    {
        double const x = ax * ax, y = ay * ay, s2 = std::max(0.0, 1 - mu * mu);
        double const c = std::cos(azimuth);
        double const stretched2 = s2 * (x * c * c + y * (1 - c * c)) + mu * mu;
        double const d = (x - y) / (x + y), g = y * s2 / stretched2;
        double const a2 = (x + y) / 2, width = a2 * (1 + kBend) / (a2 + kBend) * (kWidths - 1);
        double const t = mu / std::sqrt(stretched2) * (kCosines - 1);
        int const i = std::min(int(width), kWidths - 2), j = std::min(int(t), kCosines - 2);
        for (int corner = 0; corner < 4; ++corner) {
            int const di = corner & 1, dj = corner >> 1;
            double const w = (di ? width - i : 1 - (width - i)) * (dj ? t - j : 1 - (t - j));
            // Flat facets seen head-on lose nothing: the tail of narrow lobes stays in proportion.
            bool const flat = i + di == 0 && j + dj == kCosines - 1;
            double const term[kTerms] = {flat ? 0 : w, flat ? 0 : w * d, w * d * g};
            for (int k = 0; k < kTerms; ++k) {
                node[corner * kTerms + k] = &table[i + di][j + dj][k];
                weight[corner * kTerms + k] = term[k];
            }
        }
    }
    double sum() const
    {
        double total = 0;
        for (int k = 0; k < 4 * kTerms; ++k)
            total += *node[k] * weight[k];
        return std::max(0.0, total);
    }
    void add(double amount) const // to the sum, by the least change of the nodes
    {
        double norm = 0;
        for (double w : weight)
            norm += w * w;
        for (int k = 0; k < 4 * kTerms; ++k)
            *node[k] += amount * weight[k] / norm;
    }
};

struct Check {
    Terms terms;
    double loss;
};

void report(std::vector<Check> const& checks)
{
    double most = 0, least = 0;
    for (Check const& check : checks) {
        double const error = check.terms.sum() - check.loss;
        most = std::max(most, error);
        least = std::min(least, error);
    }
    std::fprintf(stderr, "fitted minus true loss: %.4f to %.4f\n", least, most);
}

/// Over a^2, of the fitted loss, weighted with the cosine over the hemisphere.
double mean(double a2, double d)
{
    double const ax = std::sqrt(a2 * (1 + d)), ay = std::sqrt(a2 * (1 - d));
    double sum = 0;
    // 2 mu dmu in equal steps of the logarithm of mu^2 + a^2, in which narrow lobes lose evenly.
    constexpr int kSteps = 400;
    double const range = std::log1p(1 / a2);
    for (int i = 0; i < kSteps; ++i)
        for (int j = 0; j < 32; ++j) {
            double const m = a2 * std::expm1(range * (i + 0.5) / kSteps);
            double const azimuth = M_PI / 2 * (j + 0.5) / 32;
            sum += Terms(ax, ay, std::sqrt(m), azimuth).sum() * (m + a2);
        }
    return sum * range / kSteps / 32 / a2;
}

int main()
{
    std::mt19937 engine(1);
    std::uniform_real_distribution<double> uniform(0, 1);
    std::vector<Check> checks;
    for (int i = 0; i < kChecks; ++i) {
        // Some at the ends of the ranges: greatest width, equal widths, along the axes.
        double const ax = i % 8 ? std::max(1e-3, uniform(engine)) : 1;
        double const ratio = i % 5 ? std::pow(0.1, uniform(engine)) : 1;
        double const ay = std::max(1e-3, ax * ratio);
        double const turn = i % 4 < 2 ? i % 4 * M_PI / 2 : uniform(engine) * M_PI / 2;
        double const azimuth = std::atan2(ax * std::sin(turn), ay * std::cos(turn));
        double const along = std::hypot(ax * std::cos(azimuth), ay * std::sin(azimuth));
        double const u = uniform(engine), t = i % 3 ? u : 1 - u * u;
        double const mu = std::min(1.0, t * along / std::sqrt(1 - t * t * (1 - along * along)));
        checks.push_back({Terms(ax, ay, mu, azimuth), loss(ax, ay, mu, azimuth, 64)});
    }
    for (int pass = 0; pass < kFitPasses; ++pass)
        for (Check const& check : checks)
            check.terms.add((check.loss - check.terms.sum()) * 0.5 / (1 + 0.02 * pass));
    report(checks);
    for (int pass = 0; pass < kLowerPasses; ++pass)
        for (Check const& check : checks)
            check.terms.add(-0.7 * std::max(0.0, check.terms.sum() - check.loss - kExcess));
    report(checks);

    std::printf(
        "/// Light that one bounce on GGX facets loses; made by scripts/facetLossTable.cpp, which\n"
        "/// tells the nodes and the terms.\n"
        "#pragma once\n\nnamespace zsi {\n\n// clang-format off\n"
        "inline constexpr float kFacetLoss[%d][%d][%d] = {\n",
        kWidths, kCosines, kTerms);
    for (auto const& row : table) {
        int column = std::printf("{");
        for (auto const& node : row) {
            if (column > 70)
                std::printf("\n"), column = std::printf(" ");
            column += std::printf("{%.4ff,%.4ff,%.4ff},", node[0], node[1], node[2]);
        }
        std::printf("},\n");
    }
    std::printf("};\n");

    std::printf(
        "/// By powers of 2 of a^2, from 2^%d on, and half-way between them: the mean of the loss "
        "over\n"
        "/// the hemisphere, weighted with the cosine, over a^2, and how it changes with d and\n"
        "/// d^2; and log(1 + 1 / a^2).\n"
        "inline constexpr int kFirstPower = %d;\n"
        "inline constexpr float kMeanFacetLoss[%d][4] = {\n",
        kFirstPower, kFirstPower, 2 * kPowers);
    for (int i = 0; i < 2 * kPowers; ++i) {
        double const power = std::ldexp(1.0, kFirstPower + i / 2);
        double const a2 = std::min(1.0, i % 2 ? 1.5 * power : power), even = mean(a2, 0);
        // By least squares over the unevenness that widths up to 1 and ratios down to 0.1 have.
        double dd = 1e-9, ddd = 0, dddd = 1e-9, first = 0, second = 0;
        for (int k = 1; k <= 8; ++k) {
            double const d = std::min(0.98, 1 / a2 - 1) * k / 8, change = mean(a2, d) - even;
            dd += d * d;
            ddd += d * d * d;
            dddd += d * d * d * d;
            first += d * change;
            second += d * d * change;
        }
        double const determinant = dd * dddd - ddd * ddd;
        std::printf("{%.5ff,%.5ff,%.5ff,%.6ff},\n", kHeadroom * even,
                    kHeadroom * (first * dddd - second * ddd) / determinant,
                    kHeadroom * (second * dd - first * ddd) / determinant, std::log1p(1 / a2));
    }
    std::printf("};\n// clang-format on\n\n} // namespace zsi\n");
}
