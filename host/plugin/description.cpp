#include "plugin/description.h"

#include "base/error.h"

#include <fstream>
#include <nlohmann/json.hpp>

namespace zsi::host {

LibraryDescription readDescription(std::filesystem::path const& sharedObject)
{
    std::filesystem::path file = sharedObject;
    file.replace_extension(".json");
    std::error_code failed;
    if (!std::filesystem::exists(file, failed))
        return {};
    LibraryDescription description;
    try {
        std::ifstream in(file);
        nlohmann::json const root = nlohmann::json::parse(in);
        for (auto const& [className, entry] : root.items()) {
            auto& parameters = description[className];
            if (!entry.contains("parameters"))
                continue;
            for (auto const& [name, row] : entry.at("parameters").items())
                parameters[name] = {row.value("meaning", ""), row.value("default", true)};
        }
    } catch (nlohmann::json::exception const& error) {
        throw InputError(file.string()
                         + ": not a description of shader parameters: " + error.what());
    }
    return description;
}

} // namespace zsi::host
