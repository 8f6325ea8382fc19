// SPDX-License-Identifier: Apache-2.0
/// Tests as tables of text: a shader of the loaded library, set by "name=value" words, and lines
/// of settings and numbers.
#pragma once

#include "support/loadedLibrary.h"
#include "support/scriptedHost.h"
#include "support/stateFields.h"

#include <fstream>
#include <iterator>
#include <map>
#include <memory>
#include <sstream>

namespace zsi::test {

inline std::vector<float> numbers(std::string text)
{
    std::replace(text.begin(), text.end(), ',', ' ');
    std::istringstream in(text);
    std::vector<float> v;
    for (std::string word; in >> word;)
        v.push_back(std::strtof(word.c_str(), nullptr));
    return v;
}
/// A constant of `n` numbers or, behind it, `n` more for each coordinate: what they add per unit.
inline Vec4f plane(std::vector<float> const& v, std::size_t n, std::vector<float> const& at)
{
    EXPECT_TRUE(v.size() == n || v.size() == n * (at.size() + 1)) << v.size();
    float result[4] = {};
    for (std::size_t i = 0; i < v.size(); ++i)
        result[i % n] += v[i] * (i < n ? 1 : at.at(i / n - 1));
    return {result[0], result[1], result[2], result[3]};
}
inline Vec3f vec3(std::vector<float> const& v, std::size_t at = 0)
{
    return {v.at(at), v.at(at + 1), v.at(at + 2)};
}

/// A line "why | settings | results".
struct Row {
    std::string why, settings, results;

    explicit Row(std::string const& line)
    {
        std::istringstream cells(line);
        std::getline(cells, why, '|');
        std::getline(cells, settings, '|');
        std::getline(cells, results);
    }
};

/// A row whose results are numbers.
struct Line {
    std::string why, settings;
    std::vector<float> want;
};
inline std::vector<Line> table(std::string const& text)
{
    std::vector<Line> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);)
        if (Row const row(line); !line.starts_with('#') && line.find('|') != line.npos)
            lines.push_back({row.why, row.settings, numbers(row.results)});
    EXPECT_FALSE(lines.empty());
    return lines;
}
/// Of a file of tests/data.
inline std::vector<Line> tableOf(char const* name)
{
    std::ifstream in(std::string(ZSI_SOURCE_DIR "/tests/data/") + name);
    return table({std::istreambuf_iterator<char>(in), {}});
}

/// A shader with identity matrices, seen head-on; tangents along x and y.
struct Subject {
    std::unique_ptr<IShaderBase> shader;
    RecordingManager rows;
    std::map<std::string, Registered> byName;
    std::vector<std::unique_ptr<FunctionTexture<Vec2f>>> textures;
    std::vector<std::unique_ptr<FunctionTexture<Vec3f>>> cubes;
    ScriptedHost host;
    ShadeState state = plainHit();
    double tolerance = 2e-6; ///< of comparisons

    explicit Subject(std::string const& name)
        : shader(Library::instance().create(name))
        , rows(*shader)
    {
        for (Registered const& row : rows.rows) {
            byName.emplace(row.name, row);
            if (row.type.starts_with("Mat"))
                for (std::size_t i = 0, n = row.type == "Mat3f" ? 4 : 5; i * 4 < row.size; i += n)
                    reinterpret_cast<float*>(row.field)[i] = 1;
        }
        if (byName.contains("tangent"))
            attribute("tangent", Vec3f(1, 0, 0));
        if (byName.contains("bitangent"))
            attribute("bitangent", Vec3f(0, 1, 0));
        std::memset(state.allowReflection, 1, sizeof state.allowReflection);
    }
    template <class T>
    void attribute(char const* name, T const& value)
    {
        setAttribute(state, byName.at(name).offset, value);
    }
    FunctionTexture<Vec2f>& texture(std::string const& name, std::function<Vec4f(Vec2f)> texel)
    {
        auto* const t =
            textures.emplace_back(std::make_unique<FunctionTexture<Vec2f>>(std::move(texel))).get();
        std::memcpy(byName.at(name).field, &t, sizeof t);
        return *t;
    }
    void cube(std::string const& name, std::function<Vec4f(Vec3f)> texel)
    {
        auto* const t =
            cubes.emplace_back(std::make_unique<FunctionTexture<Vec3f>>(std::move(texel))).get();
        std::memcpy(byName.at(name).field, &t, sizeof t);
    }
    void set(std::string const& name, float v) { set(name, std::vector<float>{v}); }
    void set(std::string const& name, std::vector<float> const& v)
    {
        Registered const& row = byName.at(name);
        if (row.type == "bool")
            *row.field = v.at(0) != 0;
        else if (row.type == "int")
            *reinterpret_cast<int*>(row.field) = static_cast<int>(v.at(0));
        else if (row.type == "attribute")
            std::memcpy(state.attributes + row.offset, v.data(), v.size() * sizeof(float));
        else if (row.type == "texture2D")
            texture(name, [=](Vec2f p) { return plane(v, 4, {p.x, p.y}); });
        else if (row.type == "textureCube")
            cube(name, [=](Vec3f p) { return plane(v, 4, {p.x, p.y, p.z}); });
        else {
            EXPECT_EQ(v.size() * sizeof(float), row.size) << name;
            std::memcpy(row.field, v.data(), std::min(row.size, v.size() * sizeof(float)));
        }
    }
    /// Words "name=value": a field of the record, what the host answers (`light` adds one: L,
    /// colour, shadow, weight), or a parameter or attribute; `prefix` (of a network's node) or "u_"
    /// may be left out. Textures and answers are planes: see `plane`.
    std::string prefix;
    void set(std::string const& settings)
    {
        std::istringstream in(settings);
        for (std::string word; in >> word;) {
            std::string const name = word.substr(0, word.find('='));
            if (name == "prefix")
                prefix = word.substr(7);
            else if (name == "tolerance")
                tolerance = std::stod(word.substr(10));
            else if (auto const v = numbers(word.substr(name.size() + 1)); !setHost(name, v))
                if (!writeState(state, name, v))
                    set((byName.contains(prefix + name)     ? prefix
                             : byName.contains("u_" + name) ? "u_"
                                                            : "")
                            + name,
                        v);
        }
    }
    bool setHost(std::string const& name, std::vector<float> const& v)
    {
        std::map<std::string, ScriptedHost::Answer*> const answers{
            {"trace", &host.onTrace},       {"ambient", &host.onAmbient},
            {"indirect", &host.onIndirect}, {"occlusion", &host.onOcclusion},
            {"shadow", &host.onShadow},
        };
        auto const list = [](Vec3f d) { return std::vector{d.x, d.y, d.z}; };
        if (auto const answer = answers.find(name); answer != answers.end())
            *answer->second = [=](Vec3f, Vec3f d) { return rgb(plane(v, 3, list(d))); };
        else if (name == "through")
            host.onThrough = [=](Vec3f, Vec3f d) { return plane(v, 4, list(d)); };
        else if (name == "noise")
            host.onNoise = [=](Vec4f p) { return plane(v, 1, {p.x, p.y, p.z, p.w}).x; };
        else if (name == "random")
            host.randoms = v;
        else if (name == "light")
            host.addLight(vec3(v), vec3(v, 3), vec3(v, 6), v.at(9));
        else
            return false;
        return true;
    }
    MaterialShader const& material() const { return static_cast<MaterialShader const&>(*shader); }
    Vec3f shade()
    {
        host.calls.clear();
        material().shade(&host, state);
        return rgb(state.Ci);
    }
    Vec3f transfer(Vec3f L)
    {
        state.sampleDirection = L;
        material().transfer(&host, state);
        return state.outBrdf;
    }
};

} // namespace zsi::test
