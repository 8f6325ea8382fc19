// SPDX-License-Identifier: Apache-2.0
/// A drawing in SVG that suits light and dark pages.
#pragma once

#include <string>
#include <string_view>

namespace zsi::lab {

constexpr int kCurveColors = 6; ///< that can be told apart; more curves repeat them
constexpr int kDashes = 4; ///< 0 is an unbroken line

/// Collects elements; lengths are CSS pixels, y downwards. What has a colour carries it as an
/// attribute for light pages and as a class that a style sheet inside the drawing changes for dark
/// ones, so that readers without style sheets show it too.
class Svg {
public:
    enum class Anchor { Start, Middle, End };

    void line(double x0, double y0, double x1, double y1, char const* className);
    void rectangle(double x, double y, double width, double height, char const* className);
    void circle(double x, double y, double radius, char const* className);
    void text(double x, double y, std::string_view text, Anchor anchor = Anchor::Start,
              char const* className = "text", double turn = 0);
    /// A curve: `points` are the data of an SVG path.
    void curve(std::string const& points, int color, int dash);
    void dot(double x, double y, int color);
    void image(double x, double y, double width, double height, std::string const& png);
    /// What follows, up to `endClip`, shows inside this rectangle only.
    void beginClip(double x, double y, double width, double height);
    void endClip();

    /// The document; `title` is for readers that cannot see it.
    std::string document(double width, double height, std::string_view title) const;

private:
    std::string body_;
    int clips_ = 0;
};

/// About how wide a text is at the size of text in drawings.
double textWidth(std::string_view text);

} // namespace zsi::lab
