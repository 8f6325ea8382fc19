// SPDX-License-Identifier: Apache-2.0
/// What measurements are made with, and where they leave their results.
#pragma once

#include "lab/chart.h"
#include "lab/lab.h"

#include <nlohmann/json.hpp>

namespace zsi::lab {

using Json = nlohmann::ordered_json;

struct Report {
    std::span<Specimen const> specimens;
    LabOptions const& options;
    Json summary = Json::object();
    std::vector<LabFile> files = {};

    void add(std::string name, std::string content)
    {
        files.push_back({std::move(name), std::move(content)});
    }
    bool isCancelled() const { return options.cancel && *options.cancel; }
};

/// Lines of numbers below a line of names.
class Csv {
public:
    explicit Csv(std::string const& names)
        : text_(names + '\n')
    {
    }
    void row(std::string const& label, std::initializer_list<double> numbers);
    std::string const& text() const { return text_; }

private:
    std::string text_;
};

/// A unit direction in the plane of incidence, `degrees` from the normal; positive ones lie where
/// light from `incidentAt` is mirrored to.
Vec3f exitAt(double degrees);
Vec3f incidentAt(double degrees);
double luminance(Vec3f color); ///< Rec. 709 primaries
/// Numbers that are not finite are null in JSON.
Json jsonOf(std::vector<double> const& values);
/// "30°" for legends and names of series.
std::string degreesText(double degrees);
/// Colour by specimen where there are several, with dashes by angle, else colour by angle.
void style(Curve& curve, Report const& report, std::size_t specimen, std::size_t angle);

// Each adds figures, numbers and a key of the summary, for those of the specimens that have what it
// takes; nothing where none does.
void measureLobe(Report& report);
void measureSlice(Report& report);
void measureDensity(Report& report);
void measureAlbedo(Report& report);
void measureReciprocity(Report& report);
void measureOneLight(Report& report);
void measureTableError(Report& report);

} // namespace zsi::lab
