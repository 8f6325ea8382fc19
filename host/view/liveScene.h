// SPDX-License-Identifier: Apache-2.0
/// A scene that follows its document, ready to be rendered at any time.
#pragma once

#include "load/loadScene.h"
#include "render/session.h"
#include "view/document.h"

#include <memory>

namespace zsi::view {

/// What an edit has come to.
struct SceneChange {
    bool picture = false; ///< samples that there are show another scene
    bool display = false; ///< they are shown differently
    bool reloaded = false; ///< all was built anew
    std::vector<std::string> warnings;
};

/// Holds scene and session. Nothing may be rendering while it is changed.
class LiveScene {
public:
    /// Throws InputError, with lines where `tree` has them. `file`: of messages.
    LiveScene(host::JsonValue const& tree, std::filesystem::path file,
              host::ShaderSource const& shaders, host::BuildProgress const& progress);

    /// Makes the scene what `after` says, where it was what `before` says: what has changed and
    /// what stands on it. Throws InputError, and leaves all as it was.
    SceneChange change(Json const& before, Json const& after, host::BuildProgress const& progress);
    /// The picture's size in place of the document's, for cameras whose picture is as wide.
    void setSize(int width, int height);
    /// Whether the environment counts in pixels, so that another size takes it being read again.
    bool countsPixels() const;

    host::Scene& scene() { return *scene_; }
    host::Scene const& scene() const { return *scene_; }
    host::Session& session() { return *session_; }
    host::Session const& session() const { return *session_; }
    /// Size of the picture that the document asks for.
    int documentWidth() const { return film_.width; }
    int documentHeight() const { return film_.height; }

private:
    struct Plan;
    struct Parts;
    Plan planned(std::vector<Difference> const& changes, Json const& before,
                 Json const& after) const;
    void reload(Json const& before, Json const& after, SceneChange& change,
                host::BuildProgress const& progress);
    Parts read(Plan const& plan, Json const& after);
    void readPlaces(Plan const& plan, Json const& after, Parts& parts);
    void commit(Parts parts, host::BuildProgress const& progress);
    void fitFilm();

    std::filesystem::path file_;
    host::ShaderSource const& shaders_;
    std::unique_ptr<host::Scene> scene_; // before the session, which refers to it
    std::unique_ptr<host::Session> session_;
    host::FilmSettings film_; ///< as the document has it
    host::JsonValue environment_; ///< likewise
    int width_ = 0, height_ = 0; ///< 0: as the document says
};

} // namespace zsi::view
