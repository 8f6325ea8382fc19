// SPDX-License-Identifier: Apache-2.0
#include "mesh/meshFileCheck.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <cstring>
#include <fmt/format.h>
#include <fstream>
#include <set>
#include <string_view>
#include <vector>

namespace zsi::host {
namespace {

/// Words of a text file, line by line.
class Words {
public:
    explicit Words(std::filesystem::path const& file)
        : file_(file)
        , in_(file, std::ios::binary)
    {
    }

    /// False after the last line.
    bool nextLine()
    {
        if (!std::getline(in_, line_))
            return false;
        ++number_;
        words_.clear();
        std::string_view rest = line_;
        constexpr std::string_view kBlanks = " \t\r\v\f";
        for (;;) {
            rest.remove_prefix(std::min(rest.find_first_not_of(kBlanks), rest.size()));
            if (rest.empty())
                return true;
            std::size_t const end = std::min(rest.find_first_of(kBlanks), rest.size());
            words_.push_back(rest.substr(0, end));
            rest.remove_prefix(end);
        }
    }
    std::vector<std::string_view> const& words() const { return words_; }

    /// The next word of the file, over ends of lines. An error where there is none.
    std::string_view next(char const* expected)
    {
        while (at_ >= words_.size()) {
            at_ = 0;
            if (!nextLine())
                throw InputError(
                    fmt::format("{}: ends early, expected {}", file_.string(), expected));
        }
        return words_[at_++];
    }
    void skipLine() { at_ = words_.size(); }

    double number() { return number(next("a number")); }
    double number(std::string_view word) const
    {
        double value = 0;
        std::string_view digits = word;
        if (digits.starts_with('+'))
            digits.remove_prefix(1);
        auto const [end, error] =
            std::from_chars(digits.data(), digits.data() + digits.size(), value);
        // What is too large or too small for a number is one all the same.
        if (end != digits.data() + digits.size() || error == std::errc::invalid_argument)
            fail("a number", word);
        return value;
    }
    [[noreturn]] void fail(char const* expected, std::string_view found) const
    {
        throw InputError(fmt::format("{}:{}: expected {}, found \"{}\"", file_.string(), number_,
                                     expected, printable(std::string(found))));
    }

private:
    std::filesystem::path file_;
    std::ifstream in_;
    std::string line_;
    int number_ = 0;
    std::vector<std::string_view> words_;
    std::size_t at_ = 0;
};

bool isSame(std::string_view a, std::string_view lower)
{
    return std::equal(a.begin(), a.end(), lower.begin(), lower.end(), [](char x, char y) {
        return (x >= 'A' && x <= 'Z' ? static_cast<char>(x - 'A' + 'a') : x) == y;
    });
}

} // namespace

void checkPly(std::filesystem::path const& file)
{
    static std::set<std::string_view> const kWords{"format",  "comment",  "obj_info",
                                                   "element", "property", "end_header"};
    constexpr int kMostLines = 1000;
    struct Element {
        double count;
        std::vector<bool> lists; ///< of each property, whether it is one
    };
    std::vector<Element> elements;
    bool isText = false;
    Words words(file);
    for (int line = 1;; ++line) {
        if (line > kMostLines || !words.nextLine())
            throw InputError(file.string() + ": the PLY header has no end_header");
        auto const& w = words.words();
        std::string_view const first = w.empty() ? std::string_view() : w[0];
        if (line == 1 ? first != "ply" : !kWords.contains(first))
            words.fail("a PLY header", first);
        if (first == "end_header")
            break;
        if (first == "format" && w.size() > 1)
            isText = w[1] == "ascii";
        if (first == "element" && w.size() > 2)
            elements.push_back({words.number(w[2]), {}});
        if (first == "property" && w.size() > 1 && !elements.empty())
            elements.back().lists.push_back(w[1] == "list");
    }
    if (!isText)
        return;
    words.skipLine();
    for (Element const& element : elements)
        for (double i = 0; i < element.count && !element.lists.empty(); ++i)
            for (bool const isList : element.lists)
                for (double rest = isList ? words.number() : 1; rest > 0; --rest)
                    words.number();
}

void checkStl(std::filesystem::path const& file)
{
    {
        std::ifstream in(file, std::ios::binary);
        char head[84] = {};
        in.read(head, sizeof head);
        std::uint32_t triangles = 0;
        std::memcpy(&triangles, head + 80, sizeof triangles);
        if (!isSame(std::string_view(head, 5), "solid")
            || std::filesystem::file_size(file) == 84 + 50 * std::uintmax_t(triangles))
            return;
    }
    Words words(file);
    auto const expect = [&](char const* what) {
        std::string_view const word = words.next(what);
        if (!isSame(word, what))
            words.fail(what, word);
    };
    auto const numbers = [&] {
        for (int i = 0; i < 3; ++i)
            words.number();
    };
    do {
        if (!isSame(words.words().empty() ? words.next("solid") : words.words()[0], "solid"))
            words.fail("solid", words.words()[0]);
        words.skipLine(); // a name
        for (;;) {
            std::string_view const word = words.next("facet or endsolid");
            if (isSame(word, "endsolid"))
                break;
            if (!isSame(word, "facet"))
                words.fail("facet or endsolid", word);
            expect("normal");
            numbers();
            expect("outer");
            expect("loop");
            for (int corner = 0; corner < 3; ++corner) {
                expect("vertex");
                numbers();
            }
            expect("endloop");
            expect("endfacet");
        }
        words.skipLine(); // the name again
        bool more = false;
        while (!more && words.nextLine())
            more = !words.words().empty();
        if (!more)
            return;
    } while (true);
}

void checkObj(std::filesystem::path const& file)
{
    Words words(file);
    while (words.nextLine()) {
        auto const& w = words.words();
        if (w.empty())
            continue;
        std::size_t const least = w[0] == "v" || w[0] == "vn" ? 3 : w[0] == "vt" ? 1 : 0;
        if (least > 0 && w.size() <= least)
            words.fail("numbers", w[0]);
        for (std::size_t i = 1; least > 0 && i < w.size(); ++i) {
            if (w[i].starts_with('#') || w[i] == "\\")
                break;
            words.number(w[i]);
        }
        if (w[0] == "f" && w.size() < 4 && w.back() != "\\")
            words.fail("three corners or more", w.back());
        for (std::size_t i = 1; w[0] == "f" && i < w.size(); ++i) {
            if (w[i].starts_with('#') || w[i] == "\\")
                break;
            if (w[i].find_first_not_of("0123456789/-") != std::string_view::npos)
                words.fail("a corner such as 1/2/3", w[i]);
        }
    }
}

} // namespace zsi::host
