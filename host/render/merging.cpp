// SPDX-License-Identifier: Apache-2.0
#include "render/merging.h"

#include "base/error.h"

#include <algorithm>
#include <fmt/format.h>

namespace zsi::host {
namespace {

RenderUnit common(RenderUnit const& a, RenderUnit const& b)
{
    return {intersection(a.pixels, b.pixels),
            {std::max(a.samples.begin, b.samples.begin), std::min(a.samples.end, b.samples.end)}};
}

std::uint64_t volume(RenderUnit const& u)
{
    std::uint64_t const samples =
        u.samples.end > u.samples.begin ? u.samples.end - u.samples.begin : 0;
    return static_cast<std::uint64_t>(u.pixels.width())
        * static_cast<std::uint64_t>(u.pixels.height()) * samples;
}

/// What is left of `box` without `hole`, which lies in it.
void cut(RenderUnit const& box, RenderUnit const& hole, std::vector<RenderUnit>& left)
{
    Window const &b = box.pixels, &h = hole.pixels;
    SampleRange const all = box.samples;
    for (RenderUnit const& part : {
             RenderUnit{{b.x0, b.y0, b.x1, h.y0}, all},
             RenderUnit{{b.x0, h.y0, h.x0, h.y1}, all},
             RenderUnit{h, {all.begin, hole.samples.begin}},
             RenderUnit{h, {hole.samples.end, all.end}},
             RenderUnit{{h.x1, h.y0, b.x1, h.y1}, all},
             RenderUnit{{b.x0, h.y1, b.x1, b.y1}, all},
         })
        if (volume(part) > 0)
            left.push_back(part);
}

} // namespace

bool Missing::take(RenderUnit const& unit)
{
    std::uint64_t open = 0;
    for (RenderUnit const& box : boxes_)
        open += volume(common(box, unit));
    if (open != volume(unit))
        return false;
    std::vector<RenderUnit> left;
    std::erase_if(boxes_, [&](RenderUnit const& box) {
        RenderUnit const hole = common(box, unit);
        if (volume(hole) == 0)
            return false;
        cut(box, hole, left);
        return true;
    });
    boxes_.insert(boxes_.end(), left.begin(), left.end());
    return true;
}

Merging::Merging(std::optional<UnitOrigin> expected)
    : origin_(std::move(expected))
{
}

void Merging::claim(std::string const& name, UnitHead const& head)
{
    UnitOrigin const& origin = origin_ ? *origin_ : head.origin;
    std::string difference = differenceOf(head.origin, origin);
    if (difference.empty() && head.origin.version != ZSI_HOST_VERSION)
        difference =
            fmt::format("is of version {}, expected " ZSI_HOST_VERSION, head.origin.version);
    if (!difference.empty())
        throw InputError(name + ": does not belong to " + (first_.empty() ? "this picture" : first_)
                         + ": it " + difference);
    if (!missing_)
        missing_.emplace(RenderUnit{origin.window, {0, origin.samples}});
    if (!missing_->take(head.place)) {
        auto const other = std::ranges::find_if(
            taken_, [&](auto const& t) { return volume(common(t.second, head.place)) > 0; });
        throw InputError(
            fmt::format("{}: has {}, of which {} has some already", name, placeText(head.place),
                        other == taken_.end() ? std::string("another one") : other->first));
    }
    if (!origin_) {
        origin_ = head.origin;
        first_ = name;
    }
    taken_.emplace_back(name, head.place);
    rays_ += head.rays;
    nonFinite_ += head.nonFinite;
}

void Merging::add(std::string const& name, Unit const& unit)
{
    claim(name, unit.head);
    if (film_.layers().empty())
        film_ = Film(origin_->frameWidth, origin_->frameHeight, origin_->window, origin_->layers);
    film_.add(unit.film);
}

std::vector<RenderUnit> Merging::missing() const
{
    if (missing_)
        return missing_->boxes();
    return origin_ ? std::vector{RenderUnit{origin_->window, {0, origin_->samples}}}
                   : std::vector<RenderUnit>();
}

std::uint64_t Merging::missingSamples() const
{
    if (!missing_)
        return origin_ ? volume({origin_->window, {0, origin_->samples}}) : 0;
    std::uint64_t sum = 0;
    for (RenderUnit const& box : missing_->boxes())
        sum += volume(box);
    return sum;
}

std::string Merging::missingText() const
{
    constexpr std::size_t kTold = 4;
    std::vector<RenderUnit> boxes = missing();
    std::ranges::sort(boxes, [](RenderUnit const& a, RenderUnit const& b) {
        return std::tuple(a.pixels.y0, a.pixels.x0, a.samples.begin)
            < std::tuple(b.pixels.y0, b.pixels.x0, b.samples.begin);
    });
    std::string text;
    for (std::size_t i = 0; i < std::min(kTold, boxes.size()); ++i)
        text += (i ? "; " : "") + placeText(boxes[i]);
    if (boxes.size() > kTold)
        text += fmt::format("; and {} more such parts", boxes.size() - kTold);
    return text;
}

} // namespace zsi::host
