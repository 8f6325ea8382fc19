// SPDX-License-Identifier: Apache-2.0
// What changes the document of a session.
#include "base/error.h"
#include "base/replacedFile.h"
#include "view/sceneText.h"
#include "view/studio.h"

#include <algorithm>
#include <fmt/format.h>

namespace zsi::view {

void Studio::edit(PageId page, std::vector<Edit> const& edits, std::string const& group)
{
    if (edits.empty())
        throw host::InputError("an edit without a path");
    Json after = document_.edited(edits);
    goTo(page, after, [&] { document_.commit(after, edits.front().path, group); });
}

void Studio::undo(PageId page, bool again)
{
    Json const* const to = again ? document_.after() : document_.before();
    if (!to)
        throw host::InputError(again ? "nothing to redo" : "nothing to undo");
    goTo(page, Json(*to), [&] { again ? document_.redo() : document_.undo(); });
}

/// Scene first: when it refuses, the document stays too.
void Studio::goTo(PageId page, Json const& after, std::function<void()> const& commit)
{
    std::vector<Difference> const changes = differences(document_.json(), after);
    int const width = live_.documentWidth(), height = live_.documentHeight();
    SceneChange const change = live_.change(document_.json(), after, {});
    commit();
    ++revision_;
    bool const isReshaped = live_.documentWidth() != width || live_.documentHeight() != height;
    if (isReshaped)
        live_.setSize(live_.documentWidth(), live_.documentHeight());
    if (change.picture)
        restart();
    else if (change.display)
        preview_.redisplay();
    if (change.reloaded) {
        warnings_ = change.warnings;
        tellScene(kAllPages, warnings_);
        return;
    }
    Json edits = Json::array();
    for (Difference const& difference : changes)
        edits.push_back({{"path", pathText(difference.path)}, {"value", difference.value}});
    audience_->tell(kAllPages,
                    {{"type", "changed"},
                     {"revision", revision_},
                     {"edits", edits},
                     {"undo", document_.undoLabel()},
                     {"redo", document_.redoLabel()},
                     {"materials", sceneMaterials()},
                     {"warnings", change.warnings},
                     {"from", page}});
}

/// What the loader filled in where the document says nothing.
Json Studio::sceneMaterials() const
{
    Json materials = Json::array();
    host::Scene const& scene = live_.scene();
    for (std::size_t i = 0; i < scene.materials.size(); ++i) {
        std::string const& name = scene.materialNames[i];
        host::Shader const& shader = scene.materials[i];
        Json const& entry = document_.json()["materials"][name];
        Json unwritten = Json::object();
        for (host::Parameter const& p : shader.parameters())
            if (p.about.objectSize > 0 && p.type == host::ParameterType::Float
                && !(entry.contains("parameters") && entry["parameters"].contains(p.name)))
                unwritten[p.name] = *static_cast<float const*>(p.field);
        materials.push_back(
            {{"name", name}, {"class", shader.className()}, {"unwritten", unwritten}});
    }
    return materials;
}

void Studio::tellScene(PageId page, std::vector<std::string> const& warnings)
{
    audience_->tell(page,
                    {{"type", "scene"},
                     {"revision", revision_},
                     {"document", document_.json()},
                     {"undo", document_.undoLabel()},
                     {"redo", document_.redoLabel()},
                     {"materials", sceneMaterials()},
                     {"warnings", warnings}});
}

void Studio::save(PageId page, std::string const& path)
{
    if (options_.saveFolder.empty())
        throw host::InputError(
            "save: this session has no folder; start zsi view with --save FOLDER");
    std::filesystem::path const name(path);
    bool const leavesFolder = name.is_absolute()
        || std::find(name.begin(), name.end(), std::filesystem::path("..")) != name.end();
    if (leavesFolder || name.extension() != ".json")
        throw host::InputError(
            "save: expected the name of a .json file in the folder of the scene");
    std::filesystem::path const folder = file_.parent_path();
    std::filesystem::path const file = options_.saveFolder / name;
    // File names of the document start in the scene's folder; those of the file in its own.
    std::filesystem::path const from = file.parent_path();
    std::string const text = sceneText(
        from == folder ? document_.json() : toJson(toTree(document_.json(), file_), from));
    host::ReplacedFile goal(file);
    goal.write({reinterpret_cast<unsigned char const*>(text.data()), text.size()});
    goal.commit();
    audience_->tell(page, {{"type", "saved"}, {"path", file.string()}});
}

} // namespace zsi::view
