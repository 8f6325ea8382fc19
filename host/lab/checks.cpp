// SPDX-License-Identifier: Apache-2.0
#include "lab/checks.h"

#include "base/hash.h"
#include "lab/densityTest.h"
#include "lab/integral.h"
#include "lab/reciprocity.h"
#include "lab/report.h"
#include "sampling/directions.h"
#include "sampling/sampler.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>

namespace zsi::lab {
namespace {

constexpr double kAngles[] = {15, 50, 75}; ///< degrees from the normal
constexpr std::size_t kPairs = 2000;
/// Relative. Facets of a width of 0.01 lose four digits of a float's seven where lobes are steep.
constexpr double kAlike = 2e-3;
constexpr double kFaint = 1e-3; ///< 1/sr; values below count by their difference

double greatest(Vec3f v) { return static_cast<double>(maxComponent(v)); }

bool isFinite(Vec3f v) { return std::isfinite(v.x + v.y + v.z); }

/// Relative to what should be.
double errorOf(Vec3f got, Vec3f want)
{
    Vec3f const d = got - want;
    return greatest({std::fabs(d.x), std::fabs(d.y), std::fabs(d.z)})
        / std::max(greatest(want), kFaint);
}

/// How many of `errors` are too large, and the largest.
struct Spread {
    std::size_t count = 0, off = 0;
    double worst = 0;
    void add(double error)
    {
        ++count;
        off += error > kAlike;
        worst = std::max(worst, error);
    }
    /// Single pairs are off at an edge that rounding shifts: of a cell of noise, or a horizon.
    Verdict verdict() const { return off * 500 > count ? Verdict::Fails : Verdict::Holds; }
    std::string text() const
    {
        return fmt::format("{} of {} differ by more than {:g} %, the most by {:.2g} %", off, count,
                           100 * kAlike, 100 * worst);
    }
};

/// One material's checks.
class Checker {
public:
    Checker(Specimen const& specimen, CheckOptions const& options)
        : specimen_(specimen)
        , options_(options)
        , probe_(*specimen.shader())
    {
        host::Sampler sampler(options.seed, 0, 0);
        for (std::uint32_t i = 0; i < kPairs; ++i) {
            sampler.start(i);
            // Every other pair near where the surface mirrors.
            Vec3f const a = host::cosineDirection({0, 0, 1}, sampler.next2D());
            Vec3f b = host::cosineDirection({0, 0, 1}, sampler.next2D());
            if (i & 1)
                b = normalize(b * 0.2f + Vec3f(-a.x, -a.y, a.z));
            first_.push_back(a);
            second_.push_back(b);
        }
        if (specimen.has(kTransfer)) {
            there_.resize(kPairs);
            probe_.evaluate(first_, second_, true, there_, options.threads);
        }
    }

    Check finite() const
    {
        std::vector<Vec3f> all = there_;
        std::size_t calls = all.size();
        if (specimen_.has(kShade)) {
            std::vector<Vec3f> shown(kPairs);
            probe_.lit(first_, second_, shown, options_.threads);
            // A hit that is discarded shows nothing, alike under every light.
            if (!std::all_of(shown.begin(), shown.end(), [](Vec3f v) { return std::isnan(v.x); }))
                all.insert(all.end(), shown.begin(), shown.end());
            calls += kPairs;
        }
        if (specimen_.has(kSample)) {
            std::vector<Vec3f> direction(kPairs), weight(kPairs);
            std::vector<float> density(kPairs);
            std::vector<std::uint32_t> type(kPairs);
            probe_.sample(first_, options_.seed, {direction, weight, density, type},
                          options_.threads);
            all.insert(all.end(), direction.begin(), direction.end());
            all.insert(all.end(), weight.begin(), weight.end());
            calls += kPairs;
        }
        auto const broken =
            std::count_if(all.begin(), all.end(), [](Vec3f v) { return !isFinite(v); });
        return {"finite", broken ? Verdict::Fails : Verdict::Holds,
                broken ? fmt::format("{} results of {} calls are no finite numbers", broken, calls)
                       : fmt::format("{} calls", calls)};
    }

    Check density()
    {
        if (!specimen_.has(kSample))
            return {"density", Verdict::NotApplicable, "no entry point sample"};
        double least = 1, specular = 0, untold = 0, judged = 0;
        std::string worst;
        for (double const angle : kAngles) {
            DensityTest const test = testDensity(probe_, incidentAt(angle), options_.draws,
                                                 options_.seed, options_.threads);
            specular += test.specular / std::size(kAngles);
            untold += test.untold / std::size(kAngles);
            judged += test.judged / std::size(kAngles);
            if (test.applies() && (worst.empty() || test.pValue < least)) {
                least = test.pValue;
                worst = test.isBroken()
                    ? fmt::format(
                        "at {:g} degrees {:.2g} % of the draws are no unit vectors, {:.2g} "
                        "% tell a density that is not above 0",
                        angle, 100 * test.notUnit, 100 * test.noDensity)
                    : fmt::format("chi-square {:.0f} of {} cells, drawn over told {:.4f} +- {:.4f} "
                                  "at {:g} degrees",
                                  test.chiSquare, test.degrees, test.scale, test.scaleError, angle);
            }
        }
        isSpread_ = !worst.empty();
        if (!isSpread_)
            return {
                "density", Verdict::NotApplicable,
                untold > 0 ? fmt::format("sample spreads {:.0f} % of its draws without telling a "
                                         "density (1)",
                                         100 * untold)
                    : specular > 0 ? "sample reports a few directions of density 1, as of a mirror"
                                   : "too few draws to judge"};
        // Of one of as many tests as there are angles and materials (Sidak 1967).
        double const all = 1 - std::pow(1 - least, static_cast<double>(std::size(kAngles)));
        bool const fails = all * static_cast<double>(options_.densities) < options_.falseAlarm;
        return {"density", fails ? Verdict::Fails : Verdict::Holds,
                fmt::format("{}, p {:.2g} of {} angles; {:.0f} % of the draws judged", worst, all,
                            std::size(kAngles), 100 * judged)};
    }

    Check value() const
    {
        if (!specimen_.has(kSample))
            return {"value", Verdict::NotApplicable, "no entry point sample"};
        if (Check none = needsLobes("value"); !none.name.empty())
            return none;
        Spread spread;
        std::size_t const draws = 4000;
        std::vector<Vec3f> direction(draws), weight(draws), said(draws);
        std::vector<float> density(draws);
        std::vector<std::uint32_t> type(draws);
        for (double const angle : kAngles) {
            Vec3f const wi = incidentAt(angle);
            probe_.sample({&wi, 1}, options_.seed, {direction, weight, density, type},
                          options_.threads);
            probe_.evaluate({&wi, 1}, direction, true, said, options_.threads);
            for (std::size_t i = 0; i < draws; ++i)
                if (type[i] == kSampleMixture && density[i] != 1.0f)
                    spread.add(errorOf(weight[i] * density[i], said[i]));
        }
        return {"value", spread.verdict(), "what sample draws and transfer: " + spread.text()};
    }

    Check integral() const
    {
        if (!specimen_.has(kSample))
            return {"integral", Verdict::NotApplicable, "no entry point sample"};
        if (Check none = needsLobes("integral"); !none.name.empty())
            return none;
        std::string text;
        bool fails = false;
        double worst = -1;
        for (double const angle : kAngles) {
            Vec3f const wi = incidentAt(angle);
            // Draws that depend on each other in nothing, so that their spread tells the error.
            std::size_t const draws = options_.draws;
            std::vector<Vec3f> direction(draws), weight(draws);
            std::vector<float> density(draws);
            std::vector<std::uint32_t> type(draws);
            probe_.sampleApart(wi, options_.seed, {direction, weight, density, type},
                               options_.threads);
            double sum = 0, squares = 0;
            for (std::size_t i = 0; i < draws; ++i)
                if (type[i] != kSampleNone && density[i] != 1.0f && direction[i].z > 0.0f) {
                    double const w = luminance(weight[i]);
                    sum += w;
                    squares += w * w;
                }
            auto const n = static_cast<double>(draws);
            double const mean = sum / n;
            double const error = std::sqrt(std::max(0.0, squares / n - mean * mean) / n);
            Estimate const want =
                reflected(specimen_, wi, 1 << 17, options_.seed, options_.threads);
            double const wanted = luminance(want.mean);
            // Five standard errors, and what the quadrature leaves out at the horizon.
            double const allowed =
                5 * std::hypot(error, luminance(want.error)) + 2e-3 + 3e-3 * wanted;
            double const off = std::fabs(mean - wanted);
            fails = fails || off > allowed;
            if (off / allowed > worst) {
                worst = off / allowed;
                text =
                    fmt::format("mean weight {:.4f}, integral of transfer {:.4f} at {:g} degrees",
                                mean, wanted, angle);
            }
        }
        return {"integral", fails ? Verdict::Fails : Verdict::Holds, text};
    }

    Check energy() const
    {
        if (!specimen_.has(kSample))
            return {"energy", Verdict::NotApplicable, "no entry point sample"};
        std::vector<float> angles;
        angles.reserve(18);
        for (int i = 0; i < 18; ++i)
            angles.push_back(static_cast<float>(i) * 0.08726646f); // 5 degrees
        std::vector<Vec3f> albedo(angles.size());
        probe_.albedo(angles, options_.draws / 8, options_.seed, albedo, options_.threads);
        std::size_t worst = 0;
        for (std::size_t i = 0; i < albedo.size(); ++i)
            if (greatest(albedo[i]) > greatest(albedo[worst]))
                worst = i;
        double const most = greatest(albedo[worst]);
        // The stratified mean of 8192 weights about 1 is good to some thousandths.
        return {"energy", most > 1.01 ? Verdict::Fails : Verdict::Holds,
                fmt::format("albedo up to {:.4f}, at {} degrees", most, worst * 5)};
    }

    Check reciprocity() const
    {
        if (Check none = needsLobes("reciprocity"); !none.name.empty())
            return none;
        std::vector<Vec3f> there(kPairs), back(kPairs);
        probe_.evaluate(first_, second_, false, there, options_.threads);
        probe_.evaluate(second_, first_, false, back, options_.threads);
        Spread spread;
        for (std::size_t i = 0; i < kPairs; ++i)
            spread.add(reciprocityError(there[i], back[i]));
        return {"reciprocity", spread.verdict(), "there and back: " + spread.text()};
    }

    Check light() const
    {
        if (Check none = needsLobes("light"); !none.name.empty())
            return none;
        std::vector<Vec3f> shown(kPairs);
        probe_.lit(first_, second_, shown, options_.threads);
        Spread spread;
        double sumShown = 0, sumSaid = 0;
        for (std::size_t i = 0; i < kPairs; ++i) {
            Vec3f const said = there_[i] * 3.14159265f;
            spread.add(errorOf(shown[i], said));
            sumShown += luminance(shown[i]);
            sumSaid += luminance(said);
        }
        return {"light", spread.verdict(),
                fmt::format("shade and transfer: {}; in the mean {:.3f} of it", spread.text(),
                            sumShown / sumSaid)};
    }

private:
    bool isBlack() const
    {
        return std::all_of(there_.begin(), there_.end(), [](Vec3f v) { return greatest(v) == 0; });
    }
    Check needsLobes(char const* name) const
    {
        if (isBlack())
            return {name, Verdict::NotApplicable, "transfer gives nothing"};
        // As of glass: transfer has the highlights of lights, which sample's rays do not stand for.
        if (specimen_.has(kSample) && !isSpread_)
            return {name, Verdict::NotApplicable, "transfer is no lobe that sample draws from"};
        return {};
    }

    Specimen const& specimen_;
    CheckOptions const& options_;
    host::MaterialProbe probe_;
    std::vector<Vec3f> first_, second_; ///< pairs of directions
    std::vector<Vec3f> there_; ///< transfer with its cosine
    bool isSpread_ = false;
};

} // namespace

std::vector<Check> checkMaterial(Specimen const& specimen, CheckOptions const& options)
{
    Checker checker(specimen, options);
    std::vector<Check> checks{checker.finite(),   checker.density(), checker.value(),
                              checker.integral(), checker.energy(),  checker.reciprocity(),
                              checker.light()};
    auto const& departures = specimen.shader()->departures();
    for (Check& check : checks)
        if (auto const known = departures.find(check.name);
            check.verdict == Verdict::Fails && known != departures.end()) {
            check.verdict = Verdict::Known;
            check.text += " (" + known->second + ')';
        }
    return checks;
}

} // namespace zsi::lab
