// SPDX-License-Identifier: Apache-2.0
#include "lab/svg.h"

#include <fmt/format.h>

namespace zsi::lab {
namespace {

/// Okabe and Ito 2008, "Color Universal Design", without the yellow, which white paper swallows;
/// the order keeps neighbours apart in lightness too. On dark pages the darker ones are lifted.
struct Color {
    char const *light, *dark;
};
constexpr Color kColors[kCurveColors] = {{"#0072b2", "#4aa8e0"}, {"#d55e00", "#ff8a3d"},
                                         {"#009e73", "#2bc79a"}, {"#cc79a7", "#e59cc6"},
                                         {"#8a6d00", "#f0d55a"}, {"#3a3f46", "#d6dbe1"}};
constexpr char const* kDashArrays[kDashes] = {"", "7 4", "2 3", "9 3 2 3"};

struct Style {
    std::string_view name;
    char const* attributes; ///< on light pages
    char const* dark; ///< CSS
};
constexpr Style kStyles[] = {
    {"page", "fill='#ffffff'", "fill:#14171b"},
    {"frame", "fill='none' stroke='#59636e'", "stroke:#9aa4ae"},
    {"grid", "stroke='#d9dfe5' fill='none'", "stroke:#30363d"},
    {"mark", "stroke='#59636e' stroke-dasharray='2 4' fill='none'", "stroke:#9aa4ae"},
    {"text", "fill='#1f2328'", "fill:#e6eaef"},
    {"note", "fill='#59636e'", "fill:#9aa4ae"},
    {"title", "fill='#1f2328' font-weight='600'", "fill:#e6eaef"},
};

Style const& styleOf(std::string_view name)
{
    for (Style const& style : kStyles)
        if (style.name == name)
            return style;
    return kStyles[0];
}

std::string escaped(std::string_view text)
{
    std::string result;
    for (char const c : text)
        switch (c) {
        case '<':
            result += "&lt;";
            break;
        case '&':
            result += "&amp;";
            break;
        case '\'':
            result += "&#39;";
            break;
        default:
            result += static_cast<unsigned char>(c) < 32 ? ' ' : c; // no XML has control characters
        }
    return result;
}

std::string base64(std::string const& bytes)
{
    constexpr char const* kDigits =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        unsigned bits = 0;
        for (std::size_t k = 0; k < 3; ++k)
            bits =
                bits << 8 | (i + k < bytes.size() ? static_cast<unsigned char>(bytes[i + k]) : 0u);
        for (std::size_t k = 0; k < 4; ++k)
            text += i + k <= bytes.size() ? kDigits[bits >> (18 - 6 * k) & 63] : '=';
    }
    return text;
}

} // namespace

double textWidth(std::string_view text)
{
    double width = 0;
    for (char const c : text)
        if ((c & 0xc0) != 0x80) // of a character of several bytes the first alone
            width += 6.7;
    return width;
}

void Svg::line(double x0, double y0, double x1, double y1, char const* className)
{
    body_ += fmt::format("<path class='{}' {} d='M{:.2f} {:.2f}L{:.2f} {:.2f}'/>\n", className,
                         styleOf(className).attributes, x0, y0, x1, y1);
}

void Svg::rectangle(double x, double y, double width, double height, char const* className)
{
    body_ +=
        fmt::format("<rect class='{}' {} x='{:.2f}' y='{:.2f}' width='{:.2f}' height='{:.2f}'/>\n",
                    className, styleOf(className).attributes, x, y, width, height);
}

void Svg::circle(double x, double y, double radius, char const* className)
{
    body_ += fmt::format("<circle class='{}' {} cx='{:.2f}' cy='{:.2f}' r='{:.2f}'/>\n", className,
                         styleOf(className).attributes, x, y, radius);
}

void Svg::text(double x, double y, std::string_view text, Anchor anchor, char const* className,
               double turn)
{
    constexpr char const* kAnchors[] = {"start", "middle", "end"};
    body_ += fmt::format("<text class='{}' {} x='{:.2f}' y='{:.2f}' text-anchor='{}'", className,
                         styleOf(className).attributes, x, y, kAnchors[static_cast<int>(anchor)]);
    if (turn != 0)
        body_ += fmt::format(" transform='rotate({} {:.2f} {:.2f})'", turn, x, y);
    body_ += '>' + escaped(text) + "</text>\n";
}

void Svg::curve(std::string const& points, int color, int dash)
{
    color %= kCurveColors;
    body_ += fmt::format("<path class='c{}' fill='none' stroke='{}' stroke-width='1.75' "
                         "stroke-linejoin='round'",
                         color, kColors[color].light);
    if (dash % kDashes)
        body_ += fmt::format(" stroke-dasharray='{}'", kDashArrays[dash % kDashes]);
    body_ += " d='" + points + "'/>\n";
}

void Svg::dot(double x, double y, int color)
{
    color %= kCurveColors;
    body_ += fmt::format("<circle class='c{}' fill='none' stroke='{}' stroke-width='1.25' "
                         "cx='{:.2f}' cy='{:.2f}' r='3'/>\n",
                         color, kColors[color].light, x, y);
}

void Svg::image(double x, double y, double width, double height, std::string const& png)
{
    body_ += fmt::format("<image x='{:.2f}' y='{:.2f}' width='{:.2f}' height='{:.2f}' "
                         "preserveAspectRatio='none' image-rendering='pixelated' "
                         "href='data:image/png;base64,{}'/>\n",
                         x, y, width, height, base64(png));
}

void Svg::beginClip(double x, double y, double width, double height)
{
    // A drawing of its own inside the drawing: names of clip paths would clash where a page holds
    // several drawings.
    body_ += fmt::format("<svg x='{0:.2f}' y='{1:.2f}' width='{2:.2f}' height='{3:.2f}' "
                         "viewBox='{0:.2f} {1:.2f} {2:.2f} {3:.2f}'>\n",
                         x, y, width, height);
    ++clips_;
}

void Svg::endClip() { body_ += "</svg>\n"; }

std::string Svg::document(double width, double height, std::string_view title) const
{
    std::string style = "@media (prefers-color-scheme:dark){";
    for (Style const& s : kStyles)
        style += fmt::format(".lab .{}{{{}}}", s.name, s.dark);
    for (int i = 0; i < kCurveColors; ++i)
        style += fmt::format(".lab .c{}{{stroke:{}}}", i, kColors[i].dark);
    style += "}";
    Svg page;
    page.rectangle(0, 0, width, height, "page");
    return fmt::format("<svg class='lab' xmlns='http://www.w3.org/2000/svg' viewBox='0 0 {0:.0f} "
                       "{1:.0f}' width='{0:.0f}' height='{1:.0f}' role='img' font-size='12' "
                       "font-family='system-ui, -apple-system, \"Segoe UI\", \"DejaVu Sans\", "
                       "sans-serif'>\n<title>{2}</title>\n<style>{3}</style>\n{4}{5}</svg>\n",
                       width, height, escaped(title), style, page.body_, body_);
}

} // namespace zsi::lab
