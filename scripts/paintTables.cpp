// SPDX-License-Identifier: Apache-2.0
// Writes src/materials/physical/paintTables.h: what the layers of metallic paint send back.
//
//   g++ -std=c++20 -O2 scripts/paintTables.cpp -o build/paintTables
//   build/paintTables > src/materials/physical/paintTables.h
//
// Clear coat: isotropic GGX facets that reflect all send back the share 1 - loss of the light along
// a direction (G2/G1 over visible normals: Heitz 2018, "Sampling the GGX Distribution of Visible
// Normals", eq. 19); with Schlick's weight on them it is that share times the weight at another
// cosine. Both are tabulated, and their means over the hemisphere, of the tables as interpolated.
//
// Flakes: V-shaped grooves of perfect mirrors (Torrance and Sparrow 1967, "Theory for Off-Specular
// Reflection From Roughened Surfaces") whose slopes are Gaussian lose what is shadowed after one
// bounce. What they send out lower than it came meets more of Schlick's weight on the coat.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <random>
#include <vector>

namespace {

constexpr int kWidths = 14, kLossCosines = 17, kCosines = 25;
constexpr double kLeastWidth = 0.001, kMostWidth = 0.5;
constexpr double kLift =
    0.0015; // of the coat's share, above the tables' error: paint must not glow
constexpr int kSpreads = 29, kFlakeCosines = 33;
constexpr double kMostSpread = 1.5;

using Table = std::vector<std::vector<double>>;

double interpolated(Table const& t, double a, double b)
{
    auto const i = std::min(std::size_t(a), t.size() - 2);
    auto const j = std::min(std::size_t(b), t[0].size() - 2);
    double const x = a - double(i), y = b - double(j);
    return (1 - x) * ((1 - y) * t[i][j] + y * t[i][j + 1])
        + x * ((1 - y) * t[i + 1][j] + y * t[i + 1][j + 1]);
}

double fourthRoot(double x) { return std::sqrt(std::sqrt(x)); }
double widthNode(double w)
{
    double const least = fourthRoot(kLeastWidth / kMostWidth);
    return (fourthRoot(w / kMostWidth) - least) / (1 - least) * (kWidths - 1);
}
double widthOf(int node)
{
    double const least = fourthRoot(kLeastWidth / kMostWidth);
    return kMostWidth * std::pow(least + (1 - least) * node / (kWidths - 1), 4);
}
// Near 1 where the cosine is large against the width, so that one axis serves all widths.
double relative(double mu, double w) { return mu * (1 + w) / (mu + w); }
double cosineOf(double relative, double w)
{
    return std::clamp(relative * w / (1 + w - relative), 1e-6, 1.0);
}

// Shares sent back along mu: of perfect mirrors, and weighted with (1 - cosine on the facet)^5.
void coat(double mu, double w, double& all, double& grazing)
{
    constexpr int kGrid = 192;
    double const s = std::sqrt(1 - mu * mu), length = std::sqrt(w * w * s * s + mu * mu);
    double const cx = w * s / length, cz = mu / length;
    all = grazing = 0;
    for (int i = 0; i < kGrid; ++i)
        for (int j = 0; j < kGrid; ++j) {
            double const phi = M_PI * (i + 0.5) / kGrid;
            double const z = (1 - (j + 0.5) / kGrid) * (1 + cz) - cz;
            double const r = std::sqrt(std::max(0.0, 1 - z * z));
            double const hx = w * (r * std::cos(phi) + cx), hy = w * r * std::sin(phi), hz = z + cz;
            double const hh = hx * hx + hy * hy + hz * hz, vh = s * hx + mu * hz;
            double const k = 2 * vh / hh;
            double const lx = k * hx - s, ly = k * hy, lz = k * hz - mu;
            if (lz <= 0)
                continue;
            double const out = std::sqrt(w * w * (lx * lx + ly * ly) + lz * lz);
            double const passed = lz * (mu + length) / (mu * out + lz * length); // G2/G1
            all += passed;
            grazing += passed * std::pow(1 - std::min(vh / std::sqrt(hh), 1.0), 5);
        }
    all /= double(kGrid) * kGrid;
    grazing /= double(kGrid) * kGrid;
}

double schlickWeight(double c) { return std::pow(1 - std::min(c, 1.0), 5); }

// Of light along a direction of cosine c, what grooves lose after one bounce, and the rise of
// Schlick's weight for what they send out lower.
struct FlakeShares {
    double lost, lowered;
};
FlakeShares flakeShares(double c, double spread)
{
    constexpr int kGrid = 400;
    double const s = std::sqrt(1 - c * c);
    FlakeShares sum{1, 0};
    for (int i = 0; i < kGrid; ++i)
        for (int j = 0; j < kGrid; ++j) {
            double const r = spread * std::sqrt(-std::log(1 - (i + 0.5) / kGrid));
            double const x = r * std::cos(M_PI / 2 * (j + 0.5) / kGrid);
            for (double const lean : {s * x, -s * x}) {
                double const up = 2 * (c + lean) / (1 + r * r) - c; // mirrored to this cosine
                double const sent = std::min({0.5 * (c + lean), c, up}) / (c * kGrid * kGrid);
                if (sent <= 0)
                    continue;
                sum.lost -= sent;
                sum.lowered += sent * std::max(0.0, schlickWeight(up) - schlickWeight(c));
            }
        }
    return sum;
}

double spreadNode(double a) { return std::sqrt(a / kMostSpread) * (kSpreads - 1); }
double spreadOf(int node)
{
    double const t = double(node) / (kSpreads - 1);
    return std::max(1e-3, kMostSpread * t * t);
}

template <class F>
double hemisphere(F const& f) // weighted with the cosine
{
    constexpr int kSteps = 20000;
    double sum = 0;
    for (int i = 0; i < kSteps; ++i) {
        double const u = (i + 0.5) / kSteps; // mu = u^3: 2 mu dmu = 6 u^5 du
        sum += 6 * std::pow(u, 5) * f(u * u * u);
    }
    return sum / kSteps;
}

void print(char const* what, char const* name, Table const& t)
{
    std::printf("\n/// %s\ninline constexpr float %s[%zu][%zu] = {\n", what, name, t.size(),
                t[0].size());
    for (auto const& row : t) {
        std::printf("    {");
        for (std::size_t i = 0; i < row.size(); ++i)
            std::printf("%s%.5gf",
                        i % 10  ? ", "
                            : i ? ",\n     "
                                : "",
                        row[i] == 0 ? 1e-9 : row[i]);
        std::printf("},\n");
    }
    std::printf("};\n");
}

} // namespace

int main()
{
    Table loss(kWidths, std::vector<double>(kLossCosines)),
        rise(kWidths, std::vector<double>(kCosines)), coatMean(kWidths, std::vector<double>(2));
    for (int i = 0; i < kWidths; ++i) {
        double const w = widthOf(i);
        for (int j = 0; j < kLossCosines; ++j) {
            double all, grazing;
            coat(cosineOf(j / (kLossCosines - 1.0), w), w, all, grazing);
            loss[i][j] = std::max(0.0, 1 - all - kLift);
        }
        for (int j = 0; j < kCosines; ++j) {
            double const mu = std::max(1e-6, std::pow(j / (kCosines - 1.0), 4));
            double all, grazing;
            coat(std::min(mu, 0.9999), w, all, grazing);
            rise[i][j] = 1 - std::pow(grazing / all, 0.2) - mu;
        }
    }
    auto const share = [&](double mu, double w, double r0) {
        double const all =
            1 - interpolated(loss, widthNode(w), relative(mu, w) * (kLossCosines - 1));
        double const c = mu + interpolated(rise, widthNode(w), fourthRoot(mu) * (kCosines - 1));
        double const grazing = std::pow(1 - std::min(c, 1.0), 5);
        return all * (r0 + (1 - r0) * grazing);
    };
    for (int i = 0; i < kWidths; ++i)
        for (int r0 = 0; r0 < 2; ++r0)
            coatMean[i][r0] = hemisphere([&](double mu) { return share(mu, widthOf(i), r0); });

    Table lost(kSpreads, std::vector<double>(kFlakeCosines)),
        lowered = lost, means(kSpreads, std::vector<double>(3));
    for (int i = 0; i < kSpreads; ++i) {
        double const a = spreadOf(i);
        for (int j = 0; j < kFlakeCosines; ++j) {
            FlakeShares const shares = flakeShares(cosineOf(j / (kFlakeCosines - 1.0), a), a);
            lost[i][j] = std::max(0.0, shares.lost);
            lowered[i][j] = shares.lowered;
        }
        auto const mean = [&](Table const& t, auto const& weight) {
            return hemisphere([&](double mu) {
                return weight(mu)
                    * interpolated(t, spreadNode(a), relative(mu, a) * (kFlakeCosines - 1));
            });
        };
        auto const one = [](double) { return 1.0; };
        double const loss = mean(lost, one);
        means[i] = {loss / (std::sqrt(1 + a * a) - 1), mean(lowered, one) / a,
                    mean(lost, schlickWeight) / loss};
    }

    std::printf(
        "// SPDX-License-Identifier: Apache-2.0\n"
        "/// What the layers of metallic paint send back. Written by scripts/paintTables.cpp.\n"
        "#pragma once\n\nnamespace zsi {\n");
    print("Of the light that facets of a coat mirror, what they do not send out after one bounce:\n"
          "/// by width, (width / 0.5)^(1/4) from 0.001 to 0.5, and mu (1 + width) / (mu + width).",
          "kCoatLoss", loss);
    print("What the cosine that Schlick's weight sees on the facets exceeds mu by: by width and\n"
          "/// mu^(1/4).",
          "kCoatRise", rise);
    print("Means of what is sent back, weighted with the cosine, at reflectance 0 and 1: by width.",
          "kCoatMean", coatMean);
    print("What flakes lose after one bounce: by width of their slopes, (width / 1.5)^(1/2), and\n"
          "/// mu (1 + width) / (mu + width).",
          "kFlakeLoss", lost);
    print(
        "What Schlick's weight rises by for light that flakes send out lower than it came, after\n"
        "/// one bounce: as kFlakeLoss.",
        "kFlakeLowered", lowered);
    print("Means of the two, weighted with the cosine, over sqrt(1 + width^2) - 1 and over the\n"
          "/// width; mean of Schlick's weight, weighted with the first and the cosine.",
          "kFlakeMeans", means);
    std::printf("\n} // namespace zsi\n");

    // How far the tables are off, above and below.
    std::mt19937 engine(5);
    std::uniform_real_distribution<double> uniform(0, 1);
    double off[4][2] = {};
    for (int k = 0; k < 1500; ++k) {
        double const mu = std::max(1e-4, std::pow(uniform(engine), k % 2 ? 1 : 4));
        double const w = kLeastWidth + (kMostWidth - kLeastWidth) * std::pow(uniform(engine), 2);
        double const a = std::max(0.01, 1.414 * std::pow(uniform(engine), 2));
        double all, grazing;
        coat(mu, w, all, grazing);
        double const r0[3] = {0, 0.04, 1};
        for (int i = 0; i < 4; ++i) {
            double const error = i < 3 ? share(mu, w, r0[i]) - (r0[i] * (all - grazing) + grazing)
                : k % 10               ? 0
                         : interpolated(lost, spreadNode(a), relative(mu, a) * (kFlakeCosines - 1))
                    - flakeShares(mu, a).lost;
            off[i][0] = std::min(off[i][0], error);
            off[i][1] = std::max(off[i][1], error);
        }
    }
    std::fprintf(stderr, "error, reflectance 0, 0.04, 1, flakes:");
    for (auto const& e : off)
        std::fprintf(stderr, "  %.4f %.4f", e[0], e[1]);
    std::fprintf(stderr, "\n");
}
