// SPDX-License-Identifier: Apache-2.0
#include "plugin/description.h"

#include "base/error.h"

#include <fstream>
#include <nlohmann/json.hpp>

namespace zsi::host {

namespace {

using Json = nlohmann::json;

Condition readCondition(Json const& json)
{
    Condition condition{json.at("parameters").get<std::vector<std::string>>(), {}, {}};
    if (json.contains("from")) {
        condition.from = json.at("from").get<int>();
        condition.to = json.at("to").get<int>();
    }
    return condition;
}

ParameterDescription readParameter(Json const& json)
{
    ParameterDescription parameter;
    parameter.meaning = json.value("meaning", "");
    parameter.hasDefault = json.value("default", true);
    parameter.group = json.value("group", "");
    if (json.contains("minimum"))
        parameter.slider = {json.at("minimum").get<double>(), json.at("maximum").get<double>(),
                            json.value("step", 0.0)};
    parameter.objectSize = json.value("objectSize", 0.0);
    for (Json const& condition : json.value("when", Json::array()))
        parameter.when.push_back(readCondition(condition));
    return parameter;
}

ClassDescription readClass(Json const& json)
{
    ClassDescription description;
    description.summary = json.value("summary", "");
    description.text = json.value("description", "");
    if (json.contains("parameters"))
        for (auto const& [name, parameter] : json.at("parameters").items())
            description.parameters[name] = readParameter(parameter);
    if (json.contains("departures"))
        json.at("departures").get_to(description.departures);
    return description;
}

} // namespace

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
        Json const root = Json::parse(in);
        for (auto const& [name, entry] : root.items())
            description[name] = readClass(entry);
    } catch (Json::exception const& error) {
        throw InputError(file.string()
                         + ": not a description of shader parameters: " + error.what());
    }
    return description;
}

} // namespace zsi::host
