/// Writes what the parameter rows say, for hosts (a JSON file that lies beside the library) and for
/// people (one manual page per shader). Nothing here repeats a row.
///
///   describe json FILE
///   describe pages FOLDER SOURCE_FOLDER
#include "exports/catalogue.h"

#include <charconv>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace {

using namespace zsi;

inline std::string text(float v)
{
    char buffer[32];
    auto const end = std::to_chars(buffer, buffer + sizeof buffer, v).ptr;
    return {buffer, end};
}
inline std::string text(bool v) { return v ? "true" : "false"; }
inline std::string text(int v) { return std::to_string(v); }
inline std::string text(float const* v, int n)
{
    std::string s = "(";
    for (int i = 0; i < n; ++i)
        s += (i ? ", " : "") + text(v[i]);
    return s + ")";
}
inline std::string text(Vec2f const& v) { return text(&v.x, 2); }
inline std::string text(Vec3f const& v) { return text(&v.x, 3); }
[[maybe_unused]] inline std::string text(Vec4f const& v) { return text(&v.x, 4); }
inline std::string text(Mat3f const& v) { return text(v.m, 9); }
inline std::string text(Mat4f const& v) { return text(v.m, 16); }
template <class Coordinate>
inline std::string text(TextureSampler<Coordinate> const&)
{
    return "no texture";
}

constexpr char const* typeName(bool const*) { return "bool"; }
constexpr char const* typeName(int const*) { return "int"; }
constexpr char const* typeName(float const*) { return "float"; }
constexpr char const* typeName(Vec2f const*) { return "Vec2f"; }
constexpr char const* typeName(Vec3f const*) { return "Vec3f"; }
constexpr char const* typeName(Vec4f const*) { return "Vec4f"; }
constexpr char const* typeName(Mat3f const*) { return "Mat3f"; }
constexpr char const* typeName(Mat4f const*) { return "Mat4f"; }
[[maybe_unused]] constexpr char const* typeName(TextureSampler1D const*)
{
    return "TextureSampler1D";
}
constexpr char const* typeName(TextureSampler2D const*) { return "TextureSampler2D"; }
constexpr char const* typeName(TextureSamplerCube const*) { return "TextureSamplerCube"; }

struct Row {
    std::string name, type, value, meaning;
    bool hasDefault;
};
struct AttributeRow {
    std::string name, type;
    std::size_t offset;
};
struct Description {
    std::string name;
    std::vector<Row> rows;
    std::vector<AttributeRow> attributes;
    int mask = 0;
    int kind = 0;
};

struct Describer {
    Description& d;

    template <class T>
    void parameter(char const* name, T const& field, char const* meaning, bool hasDefault)
    {
        d.rows.push_back(
            {name, typeName(static_cast<T const*>(nullptr)), text(field), meaning, hasDefault});
    }
    template <class T>
    void attribute(char const* name, std::size_t offset)
    {
        d.attributes.push_back({name, typeName(static_cast<T const*>(nullptr)), offset});
    }
};

/// Hears only the mask; the rows come from the visit, which knows meaning and defaults too.
struct MaskListener final : IShaderManager {
    int mask = 0;
    void declareEntryPoints(IShaderBase*, int m) override { mask = m; }
    void registerBool(IShaderBase*, char const*, bool*) override { }
    void registerInt(IShaderBase*, char const*, int*) override { }
    void registerFloat(IShaderBase*, char const*, float*) override { }
    void registerVec2f(IShaderBase*, char const*, Vec2f*) override { }
    void registerVec3f(IShaderBase*, char const*, Vec3f*) override { }
    void registerVec4f(IShaderBase*, char const*, Vec4f*) override { }
    void registerMat3f(IShaderBase*, char const*, Mat3f*) override { }
    void registerMat4f(IShaderBase*, char const*, Mat4f*) override { }
    void registerTexture1D(IShaderBase*, char const*, TextureSampler1D*) override { }
    void registerTexture2D(IShaderBase*, char const*, TextureSampler2D*) override { }
    void registerTextureCube(IShaderBase*, char const*, TextureSamplerCube*) override { }
    void registerAttribute(IShaderBase*, int, char const*, long) override { }
};

template <class Class>
Description describe(char const* name)
{
    auto const shader = std::make_unique<Class>();
    Description d;
    d.name = name;
    Class::visit(*shader, Describer{d});
    MaskListener listener;
    shader->registerShader(&listener);
    d.mask = listener.mask;
    d.kind = shader->getType();
    return d;
}

std::vector<Description> describeAll()
{
    std::vector<Description> all;
#define ZSI_DESCRIBE(Class) all.push_back(describe<Class>(#Class));
    ZSI_CATALOGUE(ZSI_DESCRIBE)
#undef ZSI_DESCRIBE
    return all;
}

std::string quoted(std::string const& s)
{
    std::string q = "\"";
    for (char c : s) {
        if (c == '"' || c == '\\')
            q += '\\';
        q += c;
    }
    return q + '"';
}

std::string json(std::vector<Description> const& all)
{
    std::ostringstream o;
    char const* separator = "{";
    for (Description const& d : all) {
        o << separator << "\n  " << quoted(d.name) << ": {\"parameters\": {";
        char const* comma = "";
        for (Row const& r : d.rows) {
            o << comma << "\n    " << quoted(r.name) << ": {\"default\": " << text(r.hasDefault)
              << ", \"meaning\": " << quoted(r.meaning) << "}";
            comma = ",";
        }
        o << "}}";
        separator = ",";
    }
    o << "\n}\n";
    return o.str();
}

/// The comment that stands before the rows in the class's header, as prose.
std::string summary(fs::path const& source, std::string const& name)
{
    std::string found, block;
    for (auto const& entry : fs::recursive_directory_iterator(source)) {
        if (entry.path().filename() != name + ".h")
            continue;
        std::ifstream in(entry.path());
        for (std::string line; std::getline(in, line);) {
            if (line.starts_with("/// "))
                block += line.substr(4) + "\n";
            else if (line.starts_with("///"))
                block += "\n";
            else if (!block.empty() && (line.starts_with("#define") || line.starts_with("class")))
                return block;
            else
                block.clear();
        }
    }
    return found;
}

std::string page(Description const& d, fs::path const& source)
{
    constexpr char const* kKinds[] = {"material", "light", "environment"};
    struct Bit {
        int bit;
        char const* name;
    };
    constexpr Bit kBits[] = {
        {kShade, "shade"},   {kTransmission, "transmission"}, {kTransfer, "transfer"},
        {kSample, "sample"}, {kIllumination, "illumination"}, {kEnvironmentShade, "shade"}};
    std::ostringstream o;
    o << "<!-- Generated from the parameter rows by `scripts/reference.sh`; edit those. -->\n# "
      << d.name << "\n\n"
      << summary(source, d.name) << "\n![" << d.name << "](../gallery/" << d.name
      << ".jpg)\n\nThe scene: [scenes/gallery/" << d.name << ".json](../../scenes/gallery/"
      << d.name << ".json)\n\nKind: " << kKinds[d.kind] << ". Entry points:";
    for (Bit const& b : kBits)
        if (d.mask & b.bit)
            o << " `" << b.name << "`";
    o << " (mask " << d.mask
      << ").\n\n| Parameter | Type | Default | Meaning |\n|---|---|---|---|\n";
    for (Row const& r : d.rows)
        o << "| `" << r.name << "` | " << r.type << " | " << (r.hasDefault ? r.value : "none")
          << " | " << r.meaning << " |\n";
    if (!d.attributes.empty()) {
        o << "\n| Vertex attribute | Type | Offset |\n|---|---|---|\n";
        for (AttributeRow const& a : d.attributes)
            o << "| `" << a.name << "` | " << a.type << " | " << a.offset << " |\n";
    }
    return o.str();
}

void write(fs::path const& file, std::string const& content)
{
    std::ofstream out(file, std::ios::binary);
    out << content;
    if (!out.flush())
        throw std::runtime_error(file.string() + ": cannot be written");
}

} // namespace

int main(int argc, char** argv)
try {
    std::string const verb = argc > 1 ? argv[1] : "";
    if (verb == "json" && argc == 3) {
        write(argv[2], json(describeAll()));
        return 0;
    }
    if (verb == "pages" && argc == 4) {
        fs::create_directories(argv[2]);
        for (Description const& d : describeAll())
            write(fs::path(argv[2]) / (d.name + ".md"), page(d, argv[3]));
        return 0;
    }
    std::fprintf(stderr, "usage: describe json FILE | describe pages FOLDER SOURCE_FOLDER\n");
    return 2;
} catch (std::exception const& e) {
    std::fprintf(stderr, "describe: %s\n", e.what());
    return 1;
}
