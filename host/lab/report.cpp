// SPDX-License-Identifier: Apache-2.0
#include "lab/report.h"

#include "lab/svg.h"

#include <cmath>
#include <fmt/format.h>

namespace zsi::lab {
namespace {

constexpr double kRadians = 3.14159265358979323846 / 180;

} // namespace

void Csv::row(std::string const& label, std::initializer_list<double> numbers)
{
    text_ += '"';
    for (char const c : label)
        text_ += c == '"' ? std::string("\"\"") : std::string(1, c);
    text_ += '"';
    for (double const n : numbers)
        text_ += std::isfinite(n) ? fmt::format(",{:.7g}", n) : ",";
    text_ += '\n';
}

Vec3f exitAt(double degrees)
{
    double const a = degrees * kRadians;
    return {static_cast<float>(-std::sin(a)), 0.0f, static_cast<float>(std::cos(a))};
}

Vec3f incidentAt(double degrees) { return exitAt(-degrees); }

double luminance(Vec3f c)
{
    return 0.2126 * static_cast<double>(c.x) + 0.7152 * static_cast<double>(c.y)
        + 0.0722 * static_cast<double>(c.z);
}

Json jsonOf(std::vector<double> const& values)
{
    Json result = Json::array();
    for (double const v : values) // seven digits are what a float has
        result.push_back(std::isfinite(v) ? Json(std::stod(fmt::format("{:.7g}", v))) : Json());
    return result;
}

std::string degreesText(double degrees) { return fmt::format("{:g}°", degrees); }

void style(Curve& curve, Report const& report, std::size_t specimen, std::size_t angle)
{
    bool const several = report.specimens.size() > 1;
    curve.color = static_cast<int>(several ? specimen : angle);
    curve.dash = several ? static_cast<int>(angle) % kDashes : 0;
    curve.label = degreesText(report.options.incident[angle]);
    if (several)
        curve.label = report.specimens[specimen].label() + ", " + curve.label;
}

} // namespace zsi::lab
