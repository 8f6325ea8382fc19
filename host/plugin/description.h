// SPDX-License-Identifier: Apache-2.0
/// What a shader library says about its classes in a file beside it.
#pragma once

#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace zsi::host {

/// Holds while one of the parameters is on: a number from `from` to `to`, a switch that is true, a
/// texture that is bound.
struct Condition {
    std::vector<std::string> parameters; ///< of the same class
    std::optional<int> from, to; ///< both or none
};

/// Where a person would drag a number; values outside are legal.
struct SliderRange {
    double minimum = 0, maximum = 1;
    double step = 0; ///< 0: not told
};

struct ParameterDescription {
    std::string meaning;
    bool hasDefault = true; ///< false: the host must write it before the shader reads it
    std::string group; ///< parameters that belong together; may be empty
    std::optional<SliderRange> slider;
    double objectSize = 0; ///< the default, a length, is for an object so large; 0: not told
    std::vector<Condition> when; ///< the shader reads it only while all of these hold
};

struct ClassDescription {
    std::string summary; ///< a line
    std::string text; ///< paragraphs, the summary among them
    std::map<std::string, ParameterDescription> parameters;
    /// What `zsi lab --check` need not find, by the name of the check: why.
    std::map<std::string, std::string> departures;
};

/// By class name.
using LibraryDescription = std::map<std::string, ClassDescription>;

/// Reads `<stem>.json` beside the shared object, every key of which may be missing:
///   {"Class": {"summary": "...", "description": "...", "parameters": {"name": {
///       "meaning": "...", "default": true, "group": "...",
///       "minimum": 0, "maximum": 1, "step": 0.1,
///       "objectSize": 2.5,
///       "when": [{"parameters": ["other"], "from": 1, "to": 3}]}},
///       "departures": {"reciprocity": "..."}}}
/// Other keys are for other readers. Empty when there is no such file; throws InputError when it
/// cannot be understood.
LibraryDescription readDescription(std::filesystem::path const& sharedObject);

} // namespace zsi::host
