// Writes src/materials/physical/shared/facetLossTable.h: what one bounce on GGX facets loses.
//
//   g++ -std=c++20 -O2 scripts/facetLossTable.cpp -o build/facetLossTable
//   build/facetLossTable > src/materials/physical/shared/facetLossTable.h
//
// Loss = 1 - E with E the directional albedo of perfectly reflecting facets: the mean of G2/G1 over
// visible facet normals (Heitz 2018, "Sampling the GGX Distribution of Visible Normals", eq. 19),
// taken on a regular grid with the mapping of Dupuy and Benyoub 2023, "Sampling Visible GGX Normals
// with Spherical Caps". Then the nodes are lowered until the table, interpolated, exceeds the true
// loss nowhere by more than kExcess: compensated facets must not create light.
#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <random>
#include <vector>

// Nodes along sqrt(wide), the ratio, mu (1 + wide) / (mu + wide) and the azimuth's cosine. Narrow
// lobes lose the same at the same mu / wide, so along that third axis the table changes slowly.
constexpr int kWide = 7, kRatio = 4, kCosine = 9, kAzimuth = 5;
constexpr double kLeastRatio = 0.1, kExcess = 0.0005;
constexpr double kNarrow = 1e-3; // stands for width 0
constexpr double kHeadroom = 1.005; // of the mean
constexpr int kGrid = 96; // of visible normals, squared; of even size
constexpr int kChecks = 20000, kPasses = 60;

// cosAzimuth: of the direction's projection against the axis of the wide facets.
double loss(double wide, double ratio, double mu, double cosAzimuth)
{
    double const ax = wide, ay = wide * ratio;
    double const s = std::sqrt(1 - mu * mu);
    double const v[3] = {s * cosAzimuth, s * std::sqrt(1 - cosAzimuth * cosAzimuth), mu};
    double const length = std::sqrt(ax * ax * v[0] * v[0] + ay * ay * v[1] * v[1] + mu * mu);
    double const c[3] = {ax * v[0] / length, ay * v[1] / length, mu / length};
    double sum = 0;
    for (int i = 0; i < kGrid; ++i)
        for (int j = 0; j < kGrid; ++j) {
            double const phi = 2 * M_PI * (i + 0.5) / kGrid;
            double const z = (1 - (j + 0.5) / kGrid) * (1 + c[2]) - c[2];
            double const r = std::sqrt(std::max(0.0, 1 - z * z));
            double h[3] = {ax * (r * std::cos(phi) + c[0]), ay * (r * std::sin(phi) + c[1]),
                           z + c[2]};
            double const n = std::sqrt(h[0] * h[0] + h[1] * h[1] + h[2] * h[2]);
            double const vh = (v[0] * h[0] + v[1] * h[1] + v[2] * h[2]) / n;
            double l[3];
            for (int k = 0; k < 3; ++k)
                l[k] = 2 * vh * h[k] / n - v[k];
            if (l[2] <= 0)
                continue;
            double const out =
                std::sqrt(ax * ax * l[0] * l[0] + ay * ay * l[1] * l[1] + l[2] * l[2]);
            sum += l[2] * (mu + length) / (mu * out + l[2] * length); // G2/G1
        }
    return 1 - sum / (kGrid * kGrid);
}

double wideOf(double node) { return std::max(kNarrow, std::pow(node / (kWide - 1), 2)); }
double ratioOf(double node) { return kLeastRatio + (1 - kLeastRatio) * node / (kRatio - 1); }

double table[kWide][kRatio][kCosine][kAzimuth];

struct Corner {
    double* node;
    double weight;
};
std::array<Corner, 16> corners(double wide, double ratio, double mu, double cosAzimuth)
{
    double const x[4] = {
        std::sqrt(wide) * (kWide - 1), (ratio - kLeastRatio) / (1 - kLeastRatio) * (kRatio - 1),
        mu * (1 + wide) / (mu + wide) * (kCosine - 1), cosAzimuth * (kAzimuth - 1)};
    int const size[4] = {kWide, kRatio, kCosine, kAzimuth};
    int cell[4];
    for (int d = 0; d < 4; ++d)
        cell[d] = std::min(int(x[d]), size[d] - 2);
    std::array<Corner, 16> result;
    for (int c = 0; c < 16; ++c) {
        int at[4];
        double weight = 1;
        for (int d = 0; d < 4; ++d) {
            int const up = c >> d & 1;
            at[d] = cell[d] + up;
            weight *= up ? x[d] - cell[d] : 1 - (x[d] - cell[d]);
        }
        result[std::size_t(c)] = {&table[at[0]][at[1]][at[2]][at[3]], weight};
    }
    return result;
}

double interpolated(std::array<Corner, 16> const& at)
{
    double sum = 0;
    for (Corner const& c : at)
        sum += *c.node * c.weight;
    return sum;
}

// Of the interpolated loss, at a position between the nodes.
double meanOverWidth(double widthNode, double ratioNode)
{
    double const wide = wideOf(widthNode), ratio = ratioOf(ratioNode);
    double mean = 0;
    constexpr int kSteps = 300;
    for (int i = 0; i < kSteps; ++i)
        for (int j = 0; j < kSteps; ++j) {
            double const u = (i + 0.5) / kSteps, mu = u * u; // 2 mu dmu = 4 u^3 du
            double const azimuth = std::cos(M_PI / 2 * (j + 0.5) / kSteps);
            mean += 4 * u * u * u * interpolated(corners(wide, ratio, mu, azimuth));
        }
    return mean / kSteps / kSteps / wide;
}

struct Check {
    std::array<Corner, 16> at;
    double loss;
};

void report(std::vector<Check> const& checks)
{
    double most = 0, least = 0;
    for (Check const& check : checks) {
        double const error = interpolated(check.at) - check.loss;
        most = std::max(most, error);
        least = std::min(least, error);
    }
    std::fprintf(stderr, "interpolated minus true loss: %.4f to %.4f\n", least, most);
}

int main()
{
    for (int w = 0; w < kWide; ++w)
        for (int r = 0; r < kRatio; ++r)
            for (int c = 1; c < kCosine; ++c)
                for (int a = 0; a < kAzimuth; ++a) {
                    double const wide = wideOf(w), x = double(c) / (kCosine - 1);
                    table[w][r][c][a] =
                        loss(wide, ratioOf(r), std::min(1.0, x * wide / (1 + wide - x)),
                             double(a) / (kAzimuth - 1));
                }

    std::mt19937 engine(1);
    std::uniform_real_distribution<double> uniform(0, 1);
    std::vector<Check> checks;
    for (int i = 0; i < kChecks; ++i) {
        double const wide = std::pow(std::max(0.03, uniform(engine)), 2), u = uniform(engine);
        double const ratio = i % 4 ? kLeastRatio + (1 - kLeastRatio) * u : 1;
        double const mu = std::pow(std::max(0.03, uniform(engine)), 2);
        double const azimuth = std::cos(M_PI / 2 * uniform(engine));
        checks.push_back({corners(wide, ratio, mu, azimuth), loss(wide, ratio, mu, azimuth)});
    }
    report(checks);
    for (int pass = 0; pass < kPasses; ++pass)
        for (Check const& check : checks) {
            double norm = 0;
            for (Corner const& c : check.at)
                norm += c.weight * c.weight;
            double const excess = interpolated(check.at) - check.loss - kExcess;
            if (excess > 0)
                for (Corner const& c : check.at)
                    *c.node = std::max(0.0, *c.node - excess * c.weight / norm);
        }
    report(checks);

    std::printf(
        "/// Light that one bounce on GGX facets loses; made by scripts/facetLossTable.cpp.\n"
        "/// Nodes in equal steps: sqrt(a) with a the wider width, ratio of the widths over\n"
        "/// [%g, 1], c (1 + a) / (c + a) with c the direction's cosine, and the cosine of\n"
        "/// its azimuth from the axis of the wider width.\n"
        "#pragma once\n\nnamespace zsi {\n\n// clang-format off\n"
        "inline constexpr float kFacetLoss[%d][%d][%d][%d] = {\n",
        kLeastRatio, kWide, kRatio, kCosine, kAzimuth);
    for (auto const& plane : table) {
        std::printf("{\n");
        for (auto const& row : plane) {
            int column = std::printf(" {");
            for (auto const& cell : row) {
                if (column > 66)
                    std::printf("\n"), column = std::printf("  ");
                column += std::printf("{");
                for (int a = 0; a < kAzimuth; ++a)
                    column += std::printf("%.3ff%s", cell[a], a + 1 < kAzimuth ? "," : "},");
            }
            std::printf("},\n");
        }
        std::printf("},\n");
    }
    std::printf("};\n");

    // The mean has twice the nodes along the width, so that the headroom covers what lies between
    // them: compensated facets create no light.
    constexpr int kMeanWide = 2 * kWide - 1;
    std::printf("/// The mean of the loss over the hemisphere, weighted with the cosine, over a.\n"
                "/// Half the steps of sqrt(a).\n"
                "inline constexpr float kMeanFacetLoss[%d][%d] = {\n",
                kMeanWide, kRatio);
    for (int w = 0; w < kMeanWide; ++w) {
        std::printf("{");
        for (int r = 0; r < kRatio; ++r)
            std::printf("%.5ff%s", w > 0 ? kHeadroom * meanOverWidth(0.5 * w, r) : 0.0,
                        r + 1 < kRatio ? "," : "},\n");
    }
    std::printf("};\n// clang-format on\n\n} // namespace zsi\n");
}
