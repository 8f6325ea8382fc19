// SPDX-License-Identifier: Apache-2.0
/// A scene's JSON while it is edited: the one truth of a session, with its past.
#pragma once

#include "json/jsonTree.h"

#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <vector>

namespace zsi::view {

using Json = nlohmann::ordered_json;

/// Puts `value` at `path`, keys with points between them and [i] for elements of arrays as in
/// `zsi render --set`; null takes out what is there. Sections and `parameters` that are missing
/// are made.
struct Edit {
    std::string path;
    Json value;
};

/// Where two documents differ: keys down to a value that one of them lacks, or that is no object in
/// one. `value` of the later one; null where it is gone.
struct Difference {
    std::vector<std::string> path;
    Json value;
};
std::vector<Difference> differences(Json const& before, Json const& after);
std::string pathText(std::vector<std::string> const& path);

/// `json` as if it had been read from `file`, from whose folder relative file names start.
host::JsonValue toTree(Json const& json, std::filesystem::path const& file);
/// The other way. File names of values that come from other folders, as those of included files,
/// are rewritten to start from `folder`.
Json toJson(host::JsonValue const& tree, std::filesystem::path const& folder);

/// The document, and steps to undo and redo.
class Document {
public:
    explicit Document(Json json)
        : json_(std::move(json))
    {
    }
    Json const& json() const { return json_; }
    /// What the document would be. Throws InputError where a path leads nowhere.
    Json edited(std::vector<Edit> const& edits) const;
    /// Makes it `after`. Edits of the same `group` that follow each other are one step, unless the
    /// group is empty.
    void commit(Json after, std::string const& label, std::string const& group);

    /// What undoing or redoing would lead to and what it is called; null when there is nothing.
    Json const* before() const { return past_.empty() ? nullptr : &past_.back().json; }
    Json const* after() const { return future_.empty() ? nullptr : &future_.back().json; }
    Json undoLabel() const { return past_.empty() ? Json() : Json(past_.back().label); }
    Json redoLabel() const { return future_.empty() ? Json() : Json(future_.back().label); }
    void undo() { move(past_, future_); }
    void redo() { move(future_, past_); }

private:
    struct Step {
        Json json;
        std::string label, group;
    };
    void move(std::vector<Step>& from, std::vector<Step>& to);

    Json json_;
    std::vector<Step> past_, future_;
};

} // namespace zsi::view
