#include "support/catalogueFile.h"
#include "support/loadedLibrary.h"

#include <algorithm>
#include <cstring>
#include <gtest/gtest.h>

namespace zsi {
namespace {

test::Library const& library() { return test::Library::instance(); }

test::Catalogue const& catalogue()
{
    static test::Catalogue const c(ZSI_SOURCE_DIR "/tests/data/catalogue.txt");
    return c;
}

std::vector<unsigned char> bytes(test::Registered const& row)
{
    return {row.field, row.field + row.size};
}

/// One line for each row. Where parameters are free, attributes may stand anywhere among them.
std::vector<std::string> lines(auto rows, bool attributesFirst, auto const& value)
{
    if (attributesFirst)
        std::stable_partition(rows.begin(), rows.end(),
                              [](auto const& row) { return row.type == "attribute"; });
    std::vector<std::string> all;
    for (auto const& row : rows) {
        std::ostringstream line;
        line << row.type << " " << row.name << " " << row.kind << " " << row.offset << std::hex;
        for (unsigned const byte : value(row))
            line << " " << byte;
        all.push_back(line.str());
    }
    return all;
}

TEST(Contract, DynamicSymbolsAreThePairsOfTheCatalogue)
{
    std::set<std::string> want;
    for (std::string const& name : library().classes) {
        EXPECT_TRUE(catalogue().classes.contains(name)) << name << " has no rows in the catalogue";
        want.insert({name + "_create", name + "_getAPIVersion"});
    }
    EXPECT_FALSE(want.empty());
    EXPECT_EQ(test::ElfFile(ZSI_SHADER_LIBRARY).defined, want);
}

#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
TEST(Contract, NeedsTheLanguageLibrariesOnlyRunsNoCodeAtLoadAndKeepsNoState)
{
    test::ElfFile const file(ZSI_SHADER_LIBRARY);
    for (std::string const& needed : file.needed)
        EXPECT_TRUE(needed == "libstdc++.so.6" || needed == "libm.so.6" || needed == "libc.so.6"
                    || needed == "libgcc_s.so.1")
            << needed;
    EXPECT_EQ(file.initialisers, 1u) << "more than the compiler's own frame_dummy";
    EXPECT_EQ(file.variables, std::set<std::string>{});
}
#endif

TEST(Contract, EveryClassRegistersWhatTheCatalogueSays)
{
    for (std::string const& name : library().classes) {
        SCOPED_TRACE(name);
        test::CatalogueClass const& want = catalogue().classes.at(name);
        auto const shader = library().create(name);
        EXPECT_EQ(library().apiVersion(name), 2722);
        EXPECT_EQ(shader->getVersion(), 1);
        EXPECT_EQ(shader->getType(), want.kind);

        test::RecordingManager const got(*shader);
        EXPECT_EQ(got.masks, std::vector<int>{want.mask});
        EXPECT_TRUE(got.maskFirst && got.sameShader);
        auto gotLines = lines(got.rows, want.open, bytes);
        auto const wantLines =
            lines(want.rows, want.open, [](auto const& row) { return row.value; });
        if (want.open) {
            EXPECT_GT(gotLines.size(), wantLines.size());
            gotLines.resize(wantLines.size());
        }
        EXPECT_EQ(gotLines, wantLines) << "type, name, kind, offset, bytes of the default";
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

TEST(Contract, VirtualTablesKeepTheirOrder)
{
    using M = IShaderManager;
    using A = IShaderAPI;
    using S = MaterialShader;
    auto const sequence = [](std::intptr_t want, std::vector<std::intptr_t> const& slots) {
        for (std::intptr_t const got : slots)
            EXPECT_EQ(got, want++);
    };
    sequence(0,
             {slot(&M::declareEntryPoints), slot(&M::registerBool), slot(&M::registerInt),
              slot(&M::registerFloat), slot(&M::registerVec2f), slot(&M::registerVec3f),
              slot(&M::registerVec4f), slot(&M::registerMat3f), slot(&M::registerMat4f),
              slot(&M::registerTexture1D), slot(&M::registerTexture2D),
              slot(&M::registerTextureCube), slot(&M::registerAttribute)});
    sequence(0,
             {slot(&A::getLightSamples), slot(&A::ambientLight), slot(&A::shadowTransmission),
              slot(&A::traceContinue), slot(&A::traceReflection), slot(&A::traceThrough),
              slot(&A::traceSpecular), slot(&A::traceRefraction), slot(&A::occlusion),
              slot(&A::indirectDiffuse), slot(&A::random), slot(&A::random2D),
              slot(&A::cellNoise1D), slot(&A::noise2D), slot(&A::noise3DPoint), slot(&A::noise3D),
              slot(&A::noise3DRecord), slot(&A::cellNoise3D)});
    // Two slots belong to the virtual destructor.
    sequence(2,
             {slot(&IShaderBase::registerShader), slot(&IShaderBase::copy),
              slot(&IShaderBase::getVersion), slot(&IShaderBase::getType), slot(&S::shade),
              slot(&S::transmission), slot(&S::transfer), slot(&S::sample), slot(&S::specularity)});
    EXPECT_EQ(slot(&LightShader::illumination), 6);
    EXPECT_EQ(slot(&EnvironmentShader::shade), 6);
    EXPECT_EQ(slot(&HostTexture2D::lookup), 2);
}

} // namespace
} // namespace zsi
