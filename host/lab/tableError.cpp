// SPDX-License-Identifier: Apache-2.0
// How far materials are from measured tables.
#include "lab/report.h"

#include <cmath>

namespace zsi::lab {

void measureTableError(Report& report)
{
    // Measurements are not to be trusted closer to the horizon (Ngan et al. 2005, "Experimental
    // Analysis of BRDF Models", 3.1).
    constexpr float kLowest = 0.17364818f; // 80 degrees
    constexpr std::size_t kStep = 7; // shares no factor with the sizes of a table
    Json errors = Json::array();
    Csv csv("material | table,rms,mean_relative,rms_log,cells");
    for (Specimen const& measured : report.specimens) {
        if (!measured.table())
            continue;
        std::vector<Vec3f> wi, wo, want;
        for (std::size_t cell = 0; cell < MerlTable::kCells; cell += kStep) {
            auto const directions = MerlTable::directionsOf(cell);
            Vec3f const value = measured.table()->values[cell];
            if (directions[0].z < kLowest || directions[1].z < kLowest || value.x < 0.0f)
                continue;
            wi.push_back(directions[0]);
            wo.push_back(directions[1]);
            want.push_back(value);
        }
        for (Specimen const& specimen : report.specimens) {
            if (!specimen.has(kTransfer) || want.empty())
                continue;
            std::vector<Vec3f> got(want.size());
            specimen.values(wi, wo, got, report.options.threads);
            double squares = 0, relative = 0, logs = 0;
            for (std::size_t i = 0; i < want.size(); ++i) {
                float const cosine = wo[i].z;
                float const a[] = {got[i].x, got[i].y, got[i].z};
                float const b[] = {want[i].x, want[i].y, want[i].z};
                for (int c = 0; c < 3; ++c) {
                    auto const x = static_cast<double>(a[c] * cosine);
                    auto const y = static_cast<double>(b[c] * cosine);
                    squares += (x - y) * (x - y);
                    relative += std::fabs(x - y) / std::max(y, 1e-4);
                    // Loew et al. 2012, "BRDF Models for Accurate and Efficient Rendering of Glossy
                    // Surfaces", eq. 11: highlights do not outvote the rest.
                    double const ratio = std::log1p(x) - std::log1p(y);
                    logs += ratio * ratio;
                }
            }
            auto const n = 3 * static_cast<double>(want.size());
            double const rms = std::sqrt(squares / n), rmsLog = std::sqrt(logs / n);
            errors.push_back({{"material", specimen.label()},
                              {"table", measured.label()},
                              {"rms", rms},
                              {"meanRelative", relative / n},
                              {"rmsLog", rmsLog},
                              {"cells", want.size()}});
            csv.row(specimen.label() + " | " + measured.label(),
                    {rms, relative / n, rmsLog, static_cast<double>(want.size())});
        }
    }
    if (errors.empty())
        return;
    report.summary["tableError"] = {
        {"unit", "1/sr, value times cosine, both angles up to 80 degrees"},
        {"pairs", std::move(errors)}};
    report.add("table-error.csv", csv.text());
}

} // namespace zsi::lab
