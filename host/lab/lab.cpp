// SPDX-License-Identifier: Apache-2.0
#include "lab/lab.h"

#include "base/error.h"
#include "lab/report.h"

namespace zsi::lab {
namespace {

struct Step {
    char const* what;
    void (*run)(Report&);
};
constexpr Step kSteps[] = {{"lobe", measureLobe},
                           {"one light", measureOneLight},
                           {"slice", measureSlice},
                           {"albedo", measureAlbedo},
                           {"reciprocity", measureReciprocity},
                           {"density", measureDensity},
                           {"error to tables", measureTableError}};

void run(Report& report)
{
    Json materials = Json::array();
    for (Specimen const& specimen : report.specimens)
        materials.push_back(
            {{"label", specimen.label()},
             {"class", specimen.shader() ? Json(specimen.shader()->className()) : Json()}});
    report.summary["materials"] = std::move(materials);
    for (std::size_t i = 0; i < std::size(kSteps) && !report.isCancelled(); ++i) {
        if (report.options.progress)
            report.options.progress(kSteps[i].what, static_cast<double>(i) / std::size(kSteps));
        kSteps[i].run(report);
    }
    if (report.files.empty() && !report.isCancelled())
        throw host::InputError(report.specimens.front().label()
                               + ": has no entry point that can be measured");
}

} // namespace

LabOptions quickOptions()
{
    LabOptions options;
    options.draws = 1u << 14;
    return options;
}

std::vector<LabFile> measure(std::span<Specimen const> specimens, LabOptions const& options)
{
    Report report{specimens, options};
    run(report);
    if (report.isCancelled())
        return {};
    Json figures = Json::array();
    for (LabFile const& file : report.files)
        figures.push_back(file.name);
    report.summary["files"] = std::move(figures);
    report.add("lab.json", report.summary.dump(1) + '\n');
    return std::move(report.files);
}

std::string labJson(std::span<Specimen const> specimens, LabOptions const& options)
{
    Report report{specimens, options};
    run(report);
    if (report.isCancelled())
        return {};
    Json figures = Json::object();
    for (LabFile& file : report.files)
        if (file.name.ends_with(".svg"))
            figures[file.name.substr(0, file.name.size() - 4)] = std::move(file.content);
    report.summary["figures"] = std::move(figures);
    return report.summary.dump();
}

} // namespace zsi::lab
