// SPDX-License-Identifier: Apache-2.0
#include "support/loadedLibrary.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <gtest/gtest.h>
#include <map>
#include <sstream>

namespace zsi {
namespace {

test::Library const& library() { return test::Library::instance(); }

std::vector<unsigned char> bytes(test::Registered const& row)
{
    return {row.field, row.field + row.size};
}

/// A class as lines of text, one for what it is and one for each row: numbers as bits, without the
/// zeros at the end.
using Lines = std::vector<std::string>;

std::string line(std::string text, std::vector<std::uint32_t> words)
{
    while (!words.empty() && words.back() == 0)
        words.pop_back();
    for (std::uint32_t const word : words)
        text += ' ', text += std::to_string(word);
    return text;
}

/// What the catalogue says; see there for its words.
std::map<std::string, Lines> const& catalogue()
{
    static std::map<std::string, Lines> const all = [] {
        std::map<std::string, Lines> read;
        Lines* lines = nullptr;
        std::ifstream file(ZSI_SOURCE_DIR "/tests/data/catalogue.txt");
        for (std::string text; std::getline(file, text);) {
            std::istringstream in(text);
            std::string type, name, v;
            if (!(in >> type) || type[0] == '#')
                continue;
            in >> name;
            if (type == "class" || type == "block")
                lines = &read[name];
            if (type == "block")
                continue;
            if (type == "use") {
                in >> v;
                for (std::string const& row : Lines(read.at(name))) {
                    std::size_t const space = row.find(' ') + 1;
                    lines->push_back(row.substr(0, space) + v + row.substr(space));
                }
            } else if (type == "rows") {
                EXPECT_EQ(lines->size() - 1, std::stoul(name)) << text;
            } else if (type == "attribute") {
                in >> v >> text;
                lines->push_back(type + " " + v + " " + name + " " + text);
            } else if (type == "open") {
                lines->push_back(type);
            } else {
                std::vector<std::uint32_t> words;
                while (in >> v) {
                    if (v == "none")
                        words = {0, 0, ~0u, ~0u};
                    else if (v == "true" || v == "false" || v == "unset")
                        words.push_back(v == "true");
                    else if (v.starts_with("0x") || type == "int")
                        words.push_back(static_cast<std::uint32_t>(std::stoll(v, nullptr, 0)));
                    else if (type == "class")
                        name += " " + v;
                    else
                        words.push_back(std::bit_cast<std::uint32_t>(std::stof(v)));
                }
                lines->push_back(line(type + " " + name, words));
            }
        }
        return read;
    }();
    return all;
}

/// What a class of the library registers.
Lines recorded(std::string const& name)
{
    auto const shader = library().create(name);
    test::RecordingManager const got(*shader);
    EXPECT_TRUE(got.maskFirst && got.sameShader && got.masks.size() == 1);
    char const* const kinds[] = {"material", "light", "environment"};
    Lines lines{"class " + name + " " + kinds[shader->getType()] + " "
                + std::to_string(got.masks.at(0))};
    for (test::Registered const& row : got.rows) {
        std::vector<std::uint32_t> words((row.size + 3) / 4);
        if (row.field) // null for an attribute
            std::memcpy(words.data(), row.field, row.size);
        lines.push_back(row.field ? line(row.type + " " + row.name, words)
                                  : row.type + " " + row.name + " " + std::to_string(row.kind) + " "
                                + std::to_string(row.offset));
    }
    return lines;
}

TEST(Contract, EveryClassRegistersWhatTheCatalogueSays)
{
    for (std::string const& name : library().classes) {
        SCOPED_TRACE(name);
        EXPECT_EQ(library().apiVersion(name), 2722);
        EXPECT_EQ(library().create(name)->getVersion(), 1);
        Lines got = recorded(name), want = catalogue().at(name);
        // Where parameters are free, attributes may stand anywhere among them.
        if (auto const open = std::find(want.begin(), want.end(), "open"); open != want.end()) {
            want.erase(open);
            for (Lines* lines : {&got, &want})
                std::stable_partition(lines->begin(), lines->end(), [](std::string const& row) {
                    return row.starts_with("class") || row.starts_with("attribute");
                });
            ASSERT_GT(got.size(), want.size());
            got.resize(want.size());
        }
        EXPECT_EQ(got, want);
    }
}

TEST(Contract, FieldsStandInRegistrationOrderBehindTheVtableLink)
{
    for (std::string const& name : library().classes) {
        SCOPED_TRACE(name);
        auto const shader = library().create(name);
        auto address = reinterpret_cast<std::uintptr_t>(shader.get()) + sizeof(void*);
        std::set<std::string> names;
        long attributeEnd = 0;
        for (test::Registered const& row : test::RecordingManager(*shader).rows) {
            EXPECT_TRUE(names.insert(row.name).second) << row.name << " stands twice";
            for (char const c : row.name)
                EXPECT_TRUE(c > ' ' && c < 127) << row.name;
            if (row.type == "attribute") {
                EXPECT_EQ(row.offset, attributeEnd) << row.name;
                attributeEnd += row.kind == 1 ? 8 : row.kind == 2 ? 12 : 16;
                continue;
            }
            address = (address + row.alignment - 1) / row.alignment * row.alignment;
            EXPECT_EQ(reinterpret_cast<std::uintptr_t>(row.field), address) << row.name;
            address += row.size;
        }
        EXPECT_LE(attributeEnd, static_cast<long>(sizeof ShadeState::attributes));
    }
}

TEST(Contract, CopyCarriesEveryFieldAndRestoresDefaults)
{
    for (std::string const& name : library().classes) {
        SCOPED_TRACE(name);
        auto const changed = library().create(name), target = library().create(name),
                   fresh = library().create(name);
        test::RecordingManager const source(*changed), got(*target), defaults(*fresh);
        unsigned char value = 1; // differs from field to field; valid in a bool
        for (test::Registered const& row : source.rows)
            if (row.field) {
                std::memset(row.field, row.type == "bool" ? !*row.field : value, row.size);
                value = value == 250 ? 1 : static_cast<unsigned char>(value + 1);
            }
        target->copy(changed.get());
        for (std::size_t i = 0; i < got.rows.size(); ++i)
            EXPECT_EQ(bytes(got.rows[i]), bytes(source.rows[i])) << got.rows[i].name;
        target->copy(fresh.get());
        for (std::size_t i = 0; i < got.rows.size(); ++i)
            EXPECT_EQ(bytes(got.rows[i]), bytes(defaults.rows[i])) << got.rows[i].name;
    }
}

/// Slot of a virtual member in its table: the Itanium ABI keeps 1 + the byte offset in the pointer.
template <class Member>
std::intptr_t slot(Member member)
{
    std::intptr_t word;
    std::memcpy(&word, &member, sizeof word);
    return (word - 1) / static_cast<std::intptr_t>(sizeof(void*));
}

#define ZSI_SLOTS(Class, first, ...)                  \
    {                                                 \
        using C = Class;                              \
        std::intptr_t want = first;                   \
        for (std::intptr_t const got : {__VA_ARGS__}) \
            EXPECT_EQ(got, want++) << #Class;         \
    }
#define S(member) slot(&C::member)

TEST(Contract, VirtualTablesKeepTheirOrder)
{
    ZSI_SLOTS(IShaderManager, 0, S(declareEntryPoints), S(registerBool), S(registerInt),
              S(registerFloat), S(registerVec2f), S(registerVec3f), S(registerVec4f),
              S(registerMat3f), S(registerMat4f), S(registerTexture1D), S(registerTexture2D),
              S(registerTextureCube), S(registerAttribute))
    ZSI_SLOTS(IShaderAPI, 0, S(getLightSamples), S(ambientLight), S(shadowTransmission),
              S(traceContinue), S(traceReflection), S(traceThrough), S(traceSpecular),
              S(traceRefraction), S(occlusion), S(indirectDiffuse), S(random), S(random2D),
              S(cellNoise1D), S(noise2D), S(noise3DPoint), S(noise3D), S(noise3DRecord),
              S(cellNoise3D))
    // Two slots belong to the virtual destructor.
    ZSI_SLOTS(MaterialShader, 2, S(registerShader), S(copy), S(getVersion), S(getType), S(shade),
              S(transmission), S(transfer), S(sample), S(specularity))
    ZSI_SLOTS(LightShader, 6, S(illumination))
    ZSI_SLOTS(EnvironmentShader, 6, S(shade))
    ZSI_SLOTS(HostTexture2D, 2, S(lookup))
}

} // namespace
} // namespace zsi
