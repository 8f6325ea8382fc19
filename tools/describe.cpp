// SPDX-License-Identifier: Apache-2.0
// Writes what the parameter rows and the headers say that a host cannot hear at registration, into
// the JSON file that lies beside the library.
//
//   describe FILE SOURCE_FOLDER
#include "exports/catalogue.h"

#include <charconv>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <utility>

namespace fs = std::filesystem;

namespace {

using Json = nlohmann::ordered_json;

/// The comment before the rows in the class's header.
std::string prose(fs::path const& sources, std::string const& name)
{
    for (auto const& entry : fs::recursive_directory_iterator(sources)) {
        if (entry.path().filename() != name + ".h")
            continue;
        std::ifstream in(entry.path());
        std::string block;
        for (std::string line; std::getline(in, line);) {
            if (line.starts_with("///"))
                block += line.substr(line.size() > 3 ? 4 : 3) + '\n';
            else if (!block.empty() && (line.starts_with("#define") || line.starts_with("class")))
                return block;
            else
                block.clear();
        }
    }
    throw std::runtime_error(name + ": no comment before the rows or the class in its header");
}

/// The first sentence, on one line.
std::string firstSentence(std::string text)
{
    for (char& c : text)
        c = c == '\n' ? ' ' : c;
    return text.substr(0, text.find(". ") + 1);
}

/// The shortest decimal that reads back as the same float.
double decimal(float v)
{
    char text[32];
    double shortest = 0;
    std::from_chars(text, std::to_chars(text, text + sizeof text, v).ptr, shortest);
    return shortest;
}

/// Listens to a visit of the rows.
struct Describer {
    Json parameters = Json::object();
    std::string group = {};

    void parameter(char const* name, auto const&, bool hasDefault, char const* meaning,
                   auto const&... facts)
    {
        Json& row = parameters[name] = {{"meaning", meaning}, {"default", hasDefault}};
        (add(row, facts), ...);
        if (!group.empty())
            row["group"] = group;
        if ((std::is_same_v<decltype(facts), zsi::GroupEnd const&> || ...))
            group.clear();
    }
    template <class T>
    void attribute(char const*, std::size_t)
    {
    }

private:
    static void add(Json& row, zsi::Slider const& slider)
    {
        row["minimum"] = decimal(slider.minimum);
        row["maximum"] = decimal(slider.maximum);
        if (slider.step > 0)
            row["step"] = decimal(slider.step);
    }
    static void add(Json& row, zsi::Suits const& suits)
    {
        row["objectSize"] = decimal(suits.objectSize);
    }
    static void add(Json& row, zsi::When const& when)
    {
        Json condition{{"parameters", Json::array()}};
        for (char const* const parameter : when.parameters)
            if (parameter)
                condition["parameters"].push_back(parameter);
        if (when.ranged) {
            condition["from"] = when.from;
            condition["to"] = when.to;
        }
        row["when"].push_back(std::move(condition));
    }
    void add(Json&, zsi::Group const& begun) { group = begun.name; }
    static void add(Json&, zsi::GroupEnd const&) { }
};

/// Refuses conditions on parameters that the class does not have.
void check(Json const& parameters, std::string const& className)
{
    for (auto const& [name, row] : parameters.items())
        for (Json const& condition : row.value("when", Json::array()))
            for (Json const& other : condition["parameters"])
                if (!parameters.contains(other.get<std::string>()))
                    throw std::runtime_error(className + ": " + name + ": read only with "
                                             + other.get<std::string>()
                                             + ", which the class does not have");
}

template <class Class>
Json describe(fs::path const& sources, char const* name)
{
    auto const shader = std::make_unique<Class>();
    Describer describer;
    Class::visit(*shader, describer);
    check(describer.parameters, name);
    std::string const text = prose(sources, name);
    Json entry{{"summary", firstSentence(text)},
               {"description", text},
               {"parameters", std::move(describer.parameters)}};
    if constexpr (requires { Class::kDepartures; })
        for (zsi::Departure const& departure : Class::kDepartures)
            entry["departures"][departure.check] = departure.why;
    return entry;
}

} // namespace

int main(int argc, char** argv)
try {
    if (argc != 3) {
        std::fputs("usage: describe FILE SOURCE_FOLDER\n", stderr);
        return 2;
    }
    Json all = Json::object();
#define ZSI_DESCRIBE(Class) all[#Class] = describe<zsi::Class>(argv[2], #Class);
    ZSI_CATALOGUE(ZSI_DESCRIBE)
#undef ZSI_DESCRIBE
    std::ofstream out(argv[1], std::ios::binary);
    out << all.dump(2) << '\n';
    if (!out.flush())
        throw std::runtime_error(std::string(argv[1]) + ": cannot be written");
    return 0;
} catch (std::exception const& e) {
    std::fprintf(stderr, "describe: %s\n", e.what());
    return 1;
}
