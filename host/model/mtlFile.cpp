// SPDX-License-Identifier: Apache-2.0
#include "model/mtlFile.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>
#include <charconv>
#include <fmt/format.h>
#include <fstream>
#include <sstream>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;

/// The rest of a line, without spaces at its ends.
std::string restOf(std::istream& line)
{
    std::string rest;
    std::getline(line >> std::ws, rest);
    while (!rest.empty() && (rest.back() == ' ' || rest.back() == '\t' || rest.back() == '\r'))
        rest.pop_back();
    return rest;
}

/// The file that a map names, behind its options, each of which has numbers or a word.
std::string pictureOf(std::string const& rest)
{
    std::istringstream words(rest);
    std::string word, file = rest;
    bool hasOptions = false;
    while (words >> word)
        if (word.starts_with('-')) {
            hasOptions = true;
            file.clear();
        } else if (hasOptions) {
            file = word; // the last word: names with spaces stand without options
        }
    return file;
}

class Parser {
public:
    Parser(fs::path const& file, std::vector<MtlMaterial>& into)
        : file_(file)
        , into_(into)
    {
    }

    void parse()
    {
        std::ifstream in(file_);
        std::string text;
        while (std::getline(in, text)) {
            ++line_;
            std::istringstream line(text);
            std::string word;
            if (line >> word && !word.starts_with('#'))
                statement(word, line);
        }
    }

private:
    void statement(std::string const& word, std::istream& line)
    {
        static constexpr std::string_view kColors[] = {"Kd", "Ks", "Ke", "Tf"};
        static constexpr std::string_view kNumbers[] = {"Ns", "Ni", "d", "Tr", "Pr", "Pm", "illum"};
        if (word == "newmtl") {
            into_.push_back({restOf(line), {}, {}, {}});
        } else if (into_.empty()) {
            return;
        } else if (std::ranges::find(kColors, word) != std::end(kColors)) {
            std::vector<float> const c = numbers(word, line, 1);
            into_.back().colors[word] = {c[0], c.size() > 1 ? c[1] : c[0],
                                         c.size() > 2 ? c[2] : c[0]};
        } else if (std::ranges::find(kNumbers, word) != std::end(kNumbers)) {
            float const value = numbers(word, line, 1).front();
            if (word == "Tr") // the other way round
                into_.back().numbers["d"] = 1 - value;
            else
                into_.back().numbers[word] = value;
        } else if (word.starts_with("map_") || word == "norm" || word == "bump") {
            std::string name = pictureOf(restOf(line));
            std::ranges::replace(name, '\\', '/');
            if (!name.empty())
                into_.back().pictures[word == "bump" ? "map_Bump" : word] =
                    (file_.parent_path() / name).lexically_normal();
        }
    }

    std::vector<float> numbers(std::string const& word, std::istream& line, std::size_t least) const
    {
        std::vector<float> values;
        std::string text;
        while (line >> text) {
            float value = 0;
            auto const [end, error] =
                std::from_chars(text.data(), text.data() + text.size(), value);
            if (error != std::errc() || end != text.data() + text.size())
                break;
            values.push_back(value);
        }
        if (values.size() < least)
            throw InputError(fmt::format("{}:{}: expected a number behind {}", file_.string(),
                                         line_, printable(word)));
        return values;
    }

    fs::path const& file_;
    std::vector<MtlMaterial>& into_;
    int line_ = 0;
};

} // namespace

std::vector<MtlMaterial> readMtlOf(fs::path const& obj, LeftOut& leftOut)
{
    std::vector<MtlMaterial> materials;
    std::ifstream in(obj);
    std::string text;
    while (std::getline(in, text)) {
        if (!text.starts_with("mtllib"))
            continue;
        std::istringstream line(text.substr(6));
        fs::path const file = (obj.parent_path() / restOf(line)).lexically_normal();
        std::error_code failed;
        if (fs::is_regular_file(file, failed))
            Parser(file, materials).parse();
        else
            leftOut.add("its material library is not there: " + printable(file.string()));
    }
    return materials;
}

} // namespace zsi::host
