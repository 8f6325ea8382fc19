// SPDX-License-Identifier: Apache-2.0
// What holds for every entry point of every class, whatever it shades.
#include "support/steadyHost.h"

#include <cstddef>
#include <gtest/gtest.h>
#include <iterator>
#include <map>
#include <sstream>
#include <thread>

namespace zsi {
namespace {

test::Library const& library() { return test::Library::instance(); }

struct Span {
    int entryPoint; ///< bit
    std::size_t begin, end;
};
/// The bytes that each entry point may write.
constexpr Span kResults[] = {
    {1, 336, 352}, {1, 476, 477},  {2, 352, 364},  {4, 376, 392},
    {8, 364, 400}, {32, 452, 476}, {64, 336, 352},
};
/// The index that a dielectric `sample` hands to the continuation ray.
constexpr Span kBeyondIor{8, 116, 120};

/// Bytes that the host fills for itself or reads afterwards: no result may depend on them.
constexpr Span kNotInputs[] = {
    {0, 84, 96},   {0, 104, 108}, {0, 120, 184}, {0, 248, 320},
    {0, 332, 364}, {0, 376, 400}, {0, 406, 412}, {0, 452, 480},
};

using Bytes = std::array<unsigned char, sizeof(ShadeState)>;
Bytes bytes(ShadeState const& s)
{
    Bytes b;
    std::memcpy(b.data(), &s, sizeof s);
    return b;
}

/// One shader with filled parameters, and its entry points one after the other.
struct Subject {
    std::string name;
    std::unique_ptr<IShaderBase> shader;
    int mask;
    std::size_t attributeEnd = 480;

    Subject(std::string const& className, unsigned seed, bool hostile)
        : name(className)
        , shader(library().create(className))
    {
        test::RecordingManager const registered(*shader);
        mask = registered.masks.at(0);
        test::Supply supply(seed, hostile);
        test::fillParameters(registered, supply, hostile);
        for (test::Registered const& row : registered.rows)
            if (row.type == "attribute")
                attributeEnd = 480 + static_cast<std::size_t>(row.offset)
                    + 4 * static_cast<std::size_t>(row.kind + 1);
    }

    ShadeState run(test::EntryPointCall const& e, ShadeState state, unsigned seed,
                   bool hostile) const
    {
        test::SteadyHost host(seed, hostile);
        e.call(*shader, &host, state);
        return state;
    }

    bool mayWrite(int bit, std::size_t byte) const
    {
        if (!(mask & bit))
            return false;
        for (Span const& s : kResults)
            if (s.entryPoint == bit && byte >= s.begin && byte < s.end)
                return true;
        return name == "corvid_Mtl_Dielectric" && bit == kBeyondIor.entryPoint
            && byte >= kBeyondIor.begin && byte < kBeyondIor.end;
    }

    /// Empty, or what was written that must not be.
    std::string strayWrite(int bit, ShadeState const& before, ShadeState const& after) const
    {
        Bytes const a = bytes(before), b = bytes(after);
        auto const differs = [&](std::size_t begin, std::size_t end) {
            return std::memcmp(&a[begin], &b[begin], end - begin) != 0;
        };
        for (std::size_t i = 0; i < a.size(); ++i)
            if (a[i] != b[i] && !mayWrite(bit, i))
                return "byte " + std::to_string(i) + " was written";
        if (bit == 1 && after.discardHit != before.discardHit
            && (after.discardHit != 1 || differs(336, 352)))
            return "a discarded hit has a colour, or discardHit is not 1";
        // The Ward lobes may be declined after the direction and its cosine were written.
        bool const early = name.starts_with("corvid_Mtl_Ward");
        if (bit == 8 && after.sampleType == 0
            && (differs(376, 388) || differs(392, 396) || differs(116, 120)
                || (!early && (differs(364, 376) || differs(388, 392)))))
            return "a declined sample has results";
        return {};
    }
};

template <class Check>
void forEveryEntryPoint(unsigned rounds, bool hostile, Check const& check)
{
    for (std::string const& name : library().classes)
        for (unsigned round = 0; round < rounds; ++round) {
            Subject const subject(name, round, hostile);
            test::Supply supply(round + 1000, hostile);
            for (test::EntryPointCall const& e : test::kEntryPoints) {
                if (e.kind != subject.shader->getType())
                    continue;
                SCOPED_TRACE(name + " " + e.name + " round " + std::to_string(round));
                check(subject, e, supply, round);
                if (testing::Test::HasFatalFailure())
                    return;
            }
        }
}

TEST(AnyShader, WritesItsOwnResultsOnlyWhateverComes)
{
    for (bool hostile : {false, true})
        forEveryEntryPoint(hostile ? 40 : 25, hostile,
                           [&](Subject const& s, auto const& e, auto& supply, unsigned seed) {
                               for (int i = 0; i < 10; ++i) {
                                   ShadeState const before = test::fillRecord(supply);
                                   ShadeState const after = s.run(e, before, seed, hostile);
                                   ASSERT_EQ(s.strayWrite(e.bit, before, after), "");
                               }
                           });
}

TEST(AnyShader, ResultsDependOnTheInputsOfTheRecordOnly)
{
    forEveryEntryPoint(20, false, [](Subject const& s, auto const& e, auto& supply, unsigned seed) {
        ShadeState const one = test::fillRecord(supply);
        ShadeState two = one;
        auto* const raw = reinterpret_cast<unsigned char*>(&two);
        auto const scramble = [&](std::size_t begin, std::size_t end) {
            for (std::size_t i = begin; i < end; ++i)
                raw[i] = static_cast<unsigned char>(raw[i] + 1 + supply.bits() % 255);
        };
        for (Span const& span : kNotInputs)
            scramble(span.begin, span.end);
        scramble(s.attributeEnd, sizeof two);
        Bytes const a = bytes(s.run(e, one, seed, false)), b = bytes(s.run(e, two, seed, false));
        Bytes const a0 = bytes(one), b0 = bytes(two);
        for (std::size_t i = 0; i < a.size(); ++i)
            ASSERT_TRUE(a[i] == b[i] || (a[i] == a0[i] && b[i] == b0[i])) << "byte " << i;
    });
}

TEST(AnyShader, ThreadsThatShareAnObjectGetTheSameBits)
{
    constexpr std::size_t kRequests = 32, kThreads = 4;
    forEveryEntryPoint(2, false, [](Subject const& s, auto const& e, auto& supply, unsigned seed) {
        std::vector<ShadeState> requests, want;
        for (std::size_t i = 0; i < kRequests; ++i) {
            requests.push_back(test::fillRecord(supply));
            want.push_back(s.run(e, requests[i], seed, false));
        }
        std::array<std::size_t, kThreads> different{};
        std::vector<std::thread> threads;
        for (std::size_t t = 0; t < kThreads; ++t)
            threads.emplace_back([&, t] {
                for (std::size_t k = 0; k < kRequests; ++k) {
                    std::size_t const i = (k * (2 * t + 1)) % kRequests;
                    different[t] += bytes(s.run(e, requests[i], seed, false)) != bytes(want[i]);
                }
            });
        for (std::thread& t : threads)
            t.join();
        for (std::size_t const d : different)
            ASSERT_EQ(d, 0u);
    });
}

/// A node of a network rarely matters at random: its channel must be on, and a wall have whole
/// bricks.
void setUpNode(std::string const& name, test::RecordingManager const& registered)
{
    for (test::Registered const& row : registered.rows) {
        if (!name.starts_with("_ward_") || row.name == name)
            continue;
        auto const put = [&](auto value, auto const&... endings) {
            if ((row.name.ends_with(endings) || ...))
                std::memcpy(row.field, &value, sizeof value);
        };
        put(true, "MapEnable", "useColumnEdit", "useRowEdit", "repeatX", "repeatY");
        put(1, "perColumn", "perRow", "holes");
        put(0.7f, "brickHeight", "brickWidth", "changeColumn", "changeRow");
        put(3.0f, "horizontalCount", "verticalCount", "edgeRoughness");
        put(0.2f, "horizontalGap", "verticalGap");
    }
}

/// Parameters that nothing reads: registered for the sake of other materials' scenes, or replaced
/// by a network.
std::set<std::string> unread(std::string const& name, test::RecordingManager const& registered)
{
    auto const words = [](char const* text) {
        std::istringstream in(text);
        return std::set<std::string>(std::istream_iterator<std::string>(in), {});
    };
    std::map<std::string, char const*> const classes{
        {"corvid_Mtl_Solid", "reverseNormal faceForward"},
        {"corvid_Mtl_Mirror",
         "ambientOcclusionTexture ambientOcclusionMode ambientOcclusionFactor "
         "ambientOcclusionColor usePrecalcAO showAmbientOnly usingRaytracedAO"},
        {"corvid_Mtl_AmbientOnly",
         "maskingColor maskingMode maskingTexture maskingTextureMatrix maskingInvertTexture "
         "maskingAngularRepeat maskingUVMatrix maskingFromAlpha"},
        {"corvid_Mtl_Dielectric", "u_glossyValue showAmbientOnly"},
        {"MarlowLegacy", ""},
        {"XRite", ""},
    };
    if (auto const found = classes.find(name); found != classes.end())
        return words(found->second);
    std::set<std::string> names{"showAmbientOnly"};
    for (test::Registered const& row : registered.rows) {
        if (row.name.starts_with("_ward_diffuse_color_"))
            names.merge(words("u_diffuseMap u_diffuseAmount u_diffuseTransform"));
        else if (row.name.starts_with("_ward_normal0_map_"))
            names.insert("u_normal0Map");
        else if (row.name.starts_with("_ward_cutout_map_"))
            names.insert("u_cutoutMap");
        if (row.name.starts_with("_ward_normal0_map_Noise_xform") && name.ends_with("5ba0bfff"))
            names.insert("u_normal0Transform"); // noise of the position has no coordinate
    }
    return names;
}

/// A different value of the same type: flips a bool, turns any int into 1 and 1 into 2, moves
/// numbers, and empties a texture handle.
void changeParameter(test::Registered const& row)
{
    auto const change = [&](auto as, auto const& to) {
        for (std::size_t at = 0; at < row.size; at += sizeof as) {
            std::memcpy(&as, row.field + at, sizeof as);
            as = to(as);
            std::memcpy(row.field + at, &as, sizeof as);
        }
    };
    if (row.type == "bool")
        *row.field = !*row.field;
    else if (row.type == "int")
        change(0, [](int v) { return v == 1 ? 2 : 1; });
    else if (row.type.starts_with("texture"))
        std::memset(row.field, 0, sizeof(void*));
    else
        change(0.0f, [](float v) { return v * 0.6f + 0.15f; });
}

/// Whether changing the parameter changes a result of any entry point, in the set-up that its name
/// tells, with everything else at random.
bool matters(std::string const& className, std::size_t row, unsigned tries)
{
    auto const one = library().create(className), two = library().create(className);
    test::RecordingManager const registered(*one), changed(*two);
    for (unsigned seed = 0; seed < tries; ++seed) {
        test::Supply supply(seed, false);
        test::fillParameters(registered, supply, false);
        setUpNode(registered.rows[row].name, registered);
        two->copy(one.get());
        changeParameter(changed.rows[row]);
        ShadeState const before = test::fillRecord(supply);
        for (test::EntryPointCall const& e : test::kEntryPoints) {
            if (e.kind != one->getType())
                continue;
            auto const run = [&](IShaderBase const& shader) {
                test::SteadyHost host(seed, false);
                ShadeState state = before;
                e.call(shader, &host, state);
                return bytes(state);
            };
            if (run(*one) != run(*two))
                return true;
        }
    }
    return false;
}

TEST(AnyShader, EveryParameterMatters)
{
    for (std::string const& name : library().classes) {
        auto const shader = library().create(name);
        test::RecordingManager const registered(*shader);
        auto const& rows = registered.rows;
        std::set<std::string> const dead = unread(name, registered);
        for (std::size_t i = 0; i < rows.size(); ++i) {
            if (rows[i].type == "attribute")
                continue;
            bool const live = !dead.contains(rows[i].name);
            // Rough edges of bricks are a thousandth wide and take many tries.
            EXPECT_EQ(matters(name, i, live ? 5000 : 100), live) << name << " " << rows[i].name;
        }
    }
}

} // namespace
} // namespace zsi
