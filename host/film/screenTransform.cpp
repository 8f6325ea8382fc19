// SPDX-License-Identifier: Apache-2.0
#include "film/screenTransform.h"

#include "base/error.h"
#include "base/names.h"

#include <OpenImageIO/color.h>
#include <OpenImageIO/imagebuf.h>
#include <OpenImageIO/imagebufalgo.h>
#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <memory>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

/// IEC 61966-2-1.
float encodeSrgb(float linear)
{
    if (!(linear > 0.0f))
        return 0.0f;
    if (linear >= 1.0f)
        return 1.0f;
    return linear <= 0.0031308f ? 12.92f * linear : 1.055f * std::pow(linear, 1.0f / 2.4f) - 0.055f;
}

Vec3f encodeSrgb(Vec3f c) { return {encodeSrgb(c.x), encodeSrgb(c.y), encodeSrgb(c.z)}; }

/// Plain up to a knee, so that a colour chart under white light shows its own values; above it the
/// brightest channel nears 1 and the colour white. Roll-off and desaturation as in the Khronos PBR
/// Neutral tone mapper (2024); its shift of the blacks, made for surfaces that reflect 4 %, is left
/// out.
Vec3f neutral(Vec3f c)
{
    constexpr float kKnee = 0.8f, kRoom = 1.0f - kKnee, kDesaturation = 0.15f;
    float const peak = std::max({c.x, c.y, c.z});
    if (!(peak > kKnee))
        return encodeSrgb(c);
    float const shown = 1.0f - kRoom * kRoom / (peak + kRoom - kKnee);
    float const white = 1.0f - 1.0f / (kDesaturation * (peak - shown) + 1.0f);
    return encodeSrgb(c * (shown / peak) * (1.0f - white) + Vec3f(shown, shown, shown) * white);
}

/// Low contrast at both ends over 16.5 stops, and colours that fade as they grow bright, as film's
/// do: AgX (Sobotka 2022), by the matrices and the sixth-order fit of Wrensch (2023). The fit is of
/// the encoded signal.
Vec3f filmic(Vec3f c)
{
    auto const signal = [](float linear) {
        constexpr float kDarkest = -12.47393f, kBrightest = 4.026069f; // stops
        float const x =
            clamp01((std::log2(std::max(linear, 1e-10f)) - kDarkest) / (kBrightest - kDarkest));
        return (((((15.5f * x - 40.14f) * x + 31.96f) * x - 6.868f) * x + 0.4298f) * x + 0.1191f)
            * x
            - 0.00232f;
    };
    Vec3f const inset{signal(0.842479062f * c.x + 0.0784336f * c.y + 0.0792237451f * c.z),
                      signal(0.0423282423f * c.x + 0.878468636f * c.y + 0.0791661275f * c.z),
                      signal(0.0423756549f * c.x + 0.0784336f * c.y + 0.879142974f * c.z)};
    return {1.19687900f * inset.x - 0.0980208811f * inset.y - 0.0990297441f * inset.z,
            -0.0528968518f * inset.x + 1.15190313f * inset.y - 0.0989611768f * inset.z,
            -0.0529716355f * inset.x - 0.0980434501f * inset.y + 1.15107367f * inset.z};
}

struct ToneCurve {
    char const* name;
    Vec3f (*apply)(Vec3f linear);
};
constexpr ToneCurve kToneCurves[] = {
    {"neutral", neutral}, {"plain", encodeSrgb}, {"filmic", filmic}};

/// The name that a config has for linear light of Rec. 709 primaries; where none of the usual ones
/// is there, its working space.
std::string linearSpace(OIIO::ColorConfig const& config)
{
    for (char const* usual : {"lin_rec709", "lin_srgb", "Linear Rec.709 (sRGB)",
                              "Utility - Linear - Rec.709", "Utility - Linear - sRGB"})
        for (std::string const& name : config.getColorSpaceNames()) {
            std::vector<std::string> const aliases = config.getAliases(name);
            if (name == usual || std::find(aliases.begin(), aliases.end(), usual) != aliases.end())
                return name;
        }
    char const* const role = config.getColorSpaceNameByRole("scene_linear");
    return role ? role : "";
}

OIIO::ColorProcessorHandle processorOf(ScreenView const& view)
{
    OIIO::ColorConfig config(view.ocioConfig);
    auto const fail = [&](std::string const& why) {
        throw InputError(fmt::format("{}: {}", printable(view.ocioConfig), why));
    };
    if (config.has_error() || config.getNumDisplays() == 0)
        fail(config.has_error() ? config.geterror() : "the OpenColorIO config has no display");
    std::string const linear = linearSpace(config);
    if (linear.empty())
        fail("the OpenColorIO config has neither a linear Rec. 709 space nor the role "
             "scene_linear");
    std::size_t const slash = view.view.find('/');
    std::string const display =
        slash == std::string::npos ? config.getDefaultDisplayName() : view.view.substr(0, slash);
    std::string const name = view.view.empty() ? config.getDefaultViewName(display)
        : slash == std::string::npos           ? view.view
                                               : view.view.substr(slash + 1);
    std::vector<std::string> known = toneCurveNames();
    for (std::string const& d : config.getDisplayNames())
        for (std::string const& v : config.getViewNames(d)) {
            known.push_back(v);
            if (d != config.getDefaultDisplayName())
                known.back().insert(0, d + '/');
            if (d != display || v != name)
                continue;
            auto processor = config.createDisplayTransform(d, v, linear);
            if (!processor)
                fail(config.geterror());
            return processor;
        }
    fail(fmt::format("no view \"{}\"{}", printable(view.view), suggestion(view.view, known)));
    return nullptr;
}

} // namespace

std::vector<std::string> const& toneCurveNames()
{
    static std::vector<std::string> const names = [] {
        std::vector<std::string> all;
        for (ToneCurve const& curve : kToneCurves)
            all.emplace_back(curve.name);
        return all;
    }();
    return names;
}

std::function<void(std::span<float>)> screenTransform(ScreenView const& view)
{
    float const gain = std::exp2(view.exposure);
    // Far beyond what a screen shows, but with room for arithmetic.
    auto const light = [gain](float v) {
        return v == v ? std::clamp(v * gain, -1e9f, 1e9f) : 0.0f;
    };
    auto const forEach = [](std::span<float> rgb, auto const& change) {
        for (std::size_t i = 0; i + 2 < rgb.size(); i += 3) {
            Vec3f const c = change(Vec3f(rgb[i], rgb[i + 1], rgb[i + 2]));
            for (std::size_t j = 0; j < 3; ++j) {
                float const v = j == 0 ? c.x : j == 1 ? c.y : c.z;
                rgb[i + j] = v > 0.0f ? std::min(v, 1.0f) : 0.0f;
            }
        }
    };
    for (ToneCurve const& curve : kToneCurves)
        if (view.view == curve.name
            || (view.view.empty() && view.ocioConfig.empty() && &curve == &kToneCurves[0]))
            return [=, apply = curve.apply](std::span<float> rgb) {
                forEach(rgb, [&](Vec3f c) { return apply({light(c.x), light(c.y), light(c.z)}); });
            };
    if (view.ocioConfig.empty())
        throw InputError(fmt::format("view \"{}\": expected {}, or a view of an OpenColorIO config",
                                     printable(view.view), fmt::join(toneCurveNames(), ", ")));
    return [=, processor = processorOf(view)](std::span<float> rgb) {
        for (float& v : rgb)
            v = light(v);
        OIIO::ImageBuf picture(
            OIIO::ImageSpec(static_cast<int>(rgb.size() / 3), 1, 3, OIIO::TypeDesc::FLOAT),
            rgb.data());
        if (!OIIO::ImageBufAlgo::colorconvert(picture, picture, processor.get(), false))
            throw InputError(fmt::format("{}: {}", printable(view.ocioConfig), picture.geterror()));
        forEach(rgb, [](Vec3f c) { return c; });
    };
}

} // namespace zsi::host
