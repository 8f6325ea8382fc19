/// What a shader library says about its parameters in a file beside it.
#pragma once

#include <filesystem>
#include <map>
#include <string>

namespace zsi::host {

struct ParameterDescription {
    std::string meaning;
    bool hasDefault = true;
};

/// Class name to parameter name to description.
using LibraryDescription = std::map<std::string, std::map<std::string, ParameterDescription>>;

/// Reads `<stem>.json` beside the shared object:
///   {"Class": {"parameters": {"name": {"meaning": "...", "default": true}}}}
/// Other keys are for other readers. Empty when there is no such file; throws InputError when it
/// cannot be understood.
LibraryDescription readDescription(std::filesystem::path const& sharedObject);

} // namespace zsi::host
