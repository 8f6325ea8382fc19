// SPDX-License-Identifier: Apache-2.0
/// Tests as tables of text: a shader of the loaded library, set by "name=value" words, and lines
/// of settings and numbers.
#pragma once

#include "support/loadedLibrary.h"
#include "support/scriptedHost.h"

#include <map>
#include <memory>
#include <sstream>

namespace zsi::test {

inline std::vector<float> numbers(std::string text)
{
    std::replace(text.begin(), text.end(), ',', ' ');
    std::istringstream in(text);
    std::vector<float> v;
    for (float f; in >> f;)
        v.push_back(f);
    EXPECT_TRUE(in.eof()) << text;
    return v;
}
inline Vec3f vec3(std::vector<float> const& v, std::size_t at = 0)
{
    return {v.at(at), v.at(at + 1), v.at(at + 2)};
}

/// "why | settings | numbers" per line; empty lines are skipped.
struct Line {
    std::string why, settings;
    std::vector<float> want;
};
inline std::vector<Line> table(char const* text)
{
    std::vector<Line> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) {
        std::istringstream cells(line);
        std::string why, settings, want;
        if (std::getline(cells, why, '|') && std::getline(cells, settings, '|')) {
            std::getline(cells, want);
            lines.push_back({why, settings, numbers(want)});
        }
    }
    EXPECT_FALSE(lines.empty());
    return lines;
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
        else if (row.type == "texture2D")
            texture(name, [=](Vec2f) { return Vec4f(v.at(0), v.at(1), v.at(2), v.at(3)); });
        else if (row.type == "textureCube")
            cube(name, [=](Vec3f) { return Vec4f(v.at(0), v.at(1), v.at(2), v.at(3)); });
        else {
            EXPECT_EQ(v.size() * sizeof(float), row.size) << name;
            std::memcpy(row.field, v.data(), std::min(row.size, v.size() * sizeof(float)));
        }
    }
    /// Words "name=value": I, N, Pref, Nref, uv, or parameters; `prefix` (of a network's node) or
    /// "u_" may be left out, and a texture is of one texel.
    std::string prefix;
    void set(std::string const& settings)
    {
        std::istringstream in(settings);
        for (std::string word; in >> word;) {
            std::string const name = word.substr(0, word.find('='));
            auto const v = numbers(word.substr(name.size() + 1));
            if (name == "I" || name == "N" || name == "Pref" || name == "Nref")
                (name == "I"          ? state.I
                     : name == "N"    ? state.N
                     : name == "Pref" ? state.Pref
                                      : state.Nref) = vec3(v);
            else if (name == "uv")
                attribute("uv", Vec2f(v.at(0), v.at(1)));
            else
                set((byName.contains(prefix + name)     ? prefix
                         : byName.contains("u_" + name) ? "u_"
                                                        : "")
                        + name,
                    v);
        }
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
