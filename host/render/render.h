// SPDX-License-Identifier: Apache-2.0
/// Renders a scene into a picture: one use of a session.
#pragma once

#include "film/screenTransform.h"
#include "render/progressive.h"

namespace zsi::host {

/// All samples of the scene's picture, or of its crop. The same scene and seed give the same
/// picture bit for bit, whatever the number of threads. Throws Cancelled when stopped while the
/// acceleration structures are built; stopped later, the picture is incomplete.
Picture render(Scene const& scene, RenderOptions const& options = {},
               RenderReport* report = nullptr);

/// All of a scene that its film's sums need to become the picture.
struct Development {
    bool halves = false; ///< appended to the layers
    bool opaque = false;
    std::vector<Attachment> attachments; ///< such as manifests of names
    ScreenView view;

    bool operator==(Development const&) const = default;
};
Development developmentOf(Scene const& scene);
/// The film's picture as the scene's film settings want it.
Picture developed(Film const& film, Development const& development);
Picture developed(Film const& film, Scene const& scene);
/// How such a picture is shown; `ocioConfig` as in ScreenView.
ScreenView screenView(FilmSettings const& settings, std::string const& ocioConfig = {});

} // namespace zsi::host
