// SPDX-License-Identifier: Apache-2.0
// The tables of tests/data/shading: what an entry point of a class gives for settings, by numbers
// worked out by hand. tests/data/shading/README.md tells how they are written.
#include "support/textTable.h"

#include <filesystem>

namespace zsi::test {
namespace {

struct Table {
    std::string name, classes, entry, settings;
    std::vector<Row> rows;

    friend std::ostream& operator<<(std::ostream& out, Table const& t) { return out << t.name; }
};

std::vector<Table> tables()
{
    std::vector<Table> all;
    for (auto const& file :
         std::filesystem::directory_iterator(ZSI_SOURCE_DIR "/tests/data/shading")) {
        std::ifstream in(file.path());
        if (file.path().extension() != ".txt")
            continue;
        for (std::string line; std::getline(in, line);) {
            if (line.empty() || line[0] == '#')
                continue;
            std::istringstream words(line.substr(1));
            if (line[0] == '[') {
                Table& table = all.emplace_back();
                words >> table.classes >> table.entry >> table.name;
                table.name = file.path().stem().string() + "_" + table.name;
                table.name.pop_back(); // the bracket
            } else if (line[0] == '+') {
                all.back().settings += line.substr(1) + " ";
            } else {
                all.back().rows.push_back(Row(line));
            }
        }
    }
    return all;
}

/// Two numbers apart by no more than the tolerance, of 1 or of themselves; NaN is like NaN.
bool alike(float got, float want, double tolerance)
{
    if (std::isnan(want) || std::isinf(want))
        return std::isnan(want) ? std::isnan(got) : got == want;
    return std::fabs(double(got) - double(want))
        <= tolerance * std::max(1.0, std::fabs(double(want)));
}
testing::AssertionResult alike(std::vector<float> const& got, std::vector<float> const& want,
                               double tolerance)
{
    // What is left out at the end of a list is not looked at.
    bool same = got.size() >= want.size();
    for (std::size_t i = 0; same && i < want.size(); ++i)
        same = alike(got[i], want[i], tolerance);
    return same ? testing::AssertionSuccess()
                : testing::AssertionFailure()
            << testing::PrintToString(got) << " is not " << testing::PrintToString(want);
}

/// want: "vector:scalars".
void expectCall(Subject const& subject, Call const& call, std::string const& want)
{
    std::string const vector = want.substr(0, want.find(':'));
    std::string const scalars = want.substr(std::min(want.size(), vector.size() + 1));
    Vec3f const d = call.vectors.at(1);
    EXPECT_EQ(call.vectors[0], subject.state.P) << call.service;
    EXPECT_TRUE(alike({d.x, d.y, d.z}, numbers(vector), subject.tolerance)) << call.service;
    EXPECT_TRUE(alike(call.scalars, numbers(scalars), subject.tolerance)) << call.service;
}

/// All calls: "service:vector:scalars", joined by "+".
void expectCalls(Subject const& subject, std::string const& want)
{
    std::istringstream in(want);
    std::size_t count = 0;
    for (std::string text; std::getline(in, text, '+'); ++count) {
        ASSERT_LT(count, subject.host.calls.size()) << text;
        Call const& call = subject.host.calls[count];
        ASSERT_TRUE(text.starts_with(call.service + ":")) << text << ", not " << call.service;
        expectCall(subject, call, text.substr(call.service.size() + 1));
    }
    EXPECT_EQ(subject.host.calls.size(), count) << "calls";
}

void expectResult(Subject const& subject, std::string const& what, std::string const& value)
{
    std::vector<float> const got = readState(subject.state, what);
    if (what == "calls")
        expectCalls(subject, value);
    else if (what == "draws")
        EXPECT_EQ(subject.host.randomCalls, std::stoi(value)) << what;
    else if (!got.empty())
        EXPECT_TRUE(alike(got, numbers(value), subject.tolerance)) << what;
    else {
        ASSERT_EQ(subject.host.count(what.c_str()), 1) << what;
        for (Call const& call : subject.host.calls)
            if (call.service == what)
                expectCall(subject, call, value);
    }
}

class Shading : public testing::TestWithParam<Table> { };

TEST_P(Shading, GivesWhatTheTableSays)
{
    Table const& table = GetParam();
    ASSERT_FALSE(table.rows.empty());
    std::istringstream classes(table.classes);
    for (std::string name; std::getline(classes, name, ',');)
        for (Row const& row : table.rows) {
            SCOPED_TRACE(name + ": " + row.why);
            Subject subject(name);
            subject.set(table.settings + row.settings);
            for (EntryPointCall const& e : kEntryPoints)
                if (e.kind == subject.shader->getType()
                    && std::string(e.name).ends_with(table.entry))
                    e.call(*subject.shader, &subject.host, subject.state);
            std::istringstream want(row.results);
            for (std::string word; want >> word;) {
                std::string const what = word.substr(0, word.find('='));
                expectResult(subject, what, word.substr(what.size() + 1));
            }
        }
}

INSTANTIATE_TEST_SUITE_P(Tables, Shading, testing::ValuesIn(tables()),
                         [](auto const& of) { return of.param.name; });

} // namespace
} // namespace zsi::test
