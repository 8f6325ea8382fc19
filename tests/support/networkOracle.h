/// The procedural nodes of the Ward networks in double, written from their description, and a
/// reader of a whole network by the names of its parameters.
#pragma once

#include "support/loadedLibrary.h"
#include "support/scriptedHost.h"

#include <array>
#include <cmath>
#include <cstring>
#include <map>
#include <optional>
#include <string>

namespace zsi::test {

using Rgba = std::array<double, 4>;

/// Noise in [0, 1], smooth, different along each axis.
inline double smoothNoise(double x, double y, double z, double w)
{
    return 0.5 + 0.5 * std::sin(1.3 * x + 0.7 * y + 0.2) * std::cos(0.9 * z - 1.1 * w + 0.3 * y);
}
/// Three numbers in [0, 1) for the integer cell that holds a point.
inline std::array<double, 3> cellNumbers(double x, double y, double z)
{
    auto const cell = [](double v) {
        return static_cast<std::uint32_t>(std::int64_t(std::floor(v)));
    };
    std::uint32_t h = cell(x) * 0x9E3779B1u ^ cell(y) * 0x85EBCA77u ^ cell(z) * 0xC2B2AE3Du;
    std::array<double, 3> r;
    for (double& v : r) {
        h = (h ^ (h >> 15)) * 0x2C1B3C6Du;
        h = (h ^ (h >> 12)) * 0x297A2D39u;
        h ^= h >> 15;
        v = (h >> 8) * 0x1p-24;
    }
    return r;
}

inline void giveNoise(ScriptedHost& host)
{
    host.onNoise = [](Vec4f p) {
        return static_cast<float>(smoothNoise(double(p.x), double(p.y), double(p.z), double(p.w)));
    };
    host.onCellNoise = [](Vec3f p) {
        auto const r = cellNumbers(double(p.x), double(p.y), double(p.z));
        return Vec3f(float(r[0]), float(r[1]), float(r[2]));
    };
}

/// (x, y, z, 1) times the matrix column by column.
inline std::array<double, 3> transformed(double const* m, double x, double y, double z)
{
    std::array<double, 3> r;
    for (int i = 0; i < 3; ++i)
        r[std::size_t(i)] = m[i] * x + m[4 + i] * y + m[8 + i] * z + m[12 + i];
    return r;
}

inline double clamped(double v) { return std::min(std::max(v, 0.0), 1.0); }

/// A network's parameters by name, as a host wrote them into a shader.
class NetworkOracle {
public:
    /// Values of all numeric parameters; textures stay with `texel`.
    std::map<std::string, std::vector<double>> values;
    double uv[2] = {}, position[3] = {}, normal[3] = {};
    bool ambiguous = false; ///< a float may fall on the other side of an edge here

    /// The texel that the test's texture of this parameter holds.
    static Rgba texel(std::string const& name, double u, double v)
    {
        double const k = static_cast<double>(std::hash<std::string>{}(name) % 97) / 97.0;
        return {0.5 + 0.4 * std::sin(3 * u + 2 * v + k), 0.5 + 0.4 * std::cos(2 * u - v + 5 * k),
                0.5 + 0.4 * std::sin(u + 4 * v - 3 * k), 0.6 + 0.3 * std::cos(u + v + 7 * k)};
    }

    void read(RecordingManager const& shader)
    {
        for (Registered const& row : shader.rows) {
            std::vector<double>& v = values[row.name];
            v.clear();
            if (row.type == "bool")
                v.push_back(*row.field);
            else if (row.type == "int")
                v.push_back(*reinterpret_cast<int const*>(row.field));
            else if (row.field && !row.type.starts_with("Texture"))
                for (std::size_t i = 0; i < row.size / 4; ++i)
                    v.push_back(double(reinterpret_cast<float const*>(row.field)[i]));
        }
    }

    /// Value of the node that feeds `path`; nothing where no node does.
    std::optional<Rgba> evaluate(std::string const& path)
    {
        if (values.contains(path + "_UnifiedBitmap_xform"))
            return bitmap(path + "_UnifiedBitmap_");
        if (values.contains(path + "_Noise_xform"))
            return noise(path + "_Noise_");
        if (values.contains(path + "_Tile_xform"))
            return tile(path + "_Tile_");
        return std::nullopt;
    }

private:
    std::string prefix_;
    double get(char const* name) const { return values.at(prefix_ + name).at(0); }
    double const* matrix() const { return values.at(prefix_ + "xform").data(); }
    Rgba input(std::string const& path)
    {
        if (auto const fed = evaluate(path))
            return *fed;
        std::vector<double> const& c = values.at(path);
        return {c.at(0), c.at(1), c.at(2), c.at(3)};
    }

    Rgba bitmap(std::string const& prefix)
    {
        prefix_ = prefix;
        double const* m = matrix();
        auto q = transformed(m, uv[0], uv[1], 1);
        if (get("isCube") != 0) {
            q = transformed(m, position[0], position[1], position[2]);
            double n[3];
            for (int i = 0; i < 3; ++i)
                n[i] = std::fabs(m[i] * normal[0] + m[4 + i] * normal[1] + m[8 + i] * normal[2]);
            if (n[1] <= n[0] && n[0] > n[2])
                q = {q[2], q[1], 0};
            else if (n[1] > n[0] && n[2] <= n[1])
                q = {q[0], q[2], 0};
        }
        Rgba c = texel(prefix + "texture", q[0], q[1]);
        for (double& v : c)
            v *= get("amount");
        return c;
    }

    Rgba noise(std::string const& prefix)
    {
        Rgba const a = input(prefix + "color1"), b = input(prefix + "color2");
        prefix_ = prefix;
        auto q = transformed(matrix(), position[0], position[1], position[2]);
        double const phase = get("phase"), size = get("size"), type = get("type");
        auto const n = [&](double f) {
            return smoothNoise(q[0] / size * f, q[1] / size * f, q[2] / size * f, phase);
        };
        double v = 0;
        if (type == 0)
            v = n(1);
        if (type == 1 || type == 2) {
            double left = get("levels"), f = 1;
            auto const octave = [&] {
                double const o = 2 * n(f) - 1;
                return (type == 2 ? std::fabs(o) : o) / f;
            };
            for (; left >= 1; --left, f *= 2)
                v += octave();
            if (left > 0)
                v += octave();
            if (type == 1)
                v = (v + 1) / 2;
        }
        double const low = get("thresholdLow"), high = get("thresholdHigh");
        double const w = low == high ? v : v < low ? 0 : v > high ? 1 : (v - low) / (high - low);
        Rgba c;
        for (std::size_t i = 0; i < 4; ++i)
            c[i] = a[i] * (1 - w) + b[i] * w;
        return c;
    }

    double whole(double x)
    {
        ambiguous = ambiguous || std::fabs(x - std::round(x)) < 1e-3;
        return std::floor(x);
    }
    /// 1 in the brick, 0 in the mortar, of a cell coordinate.
    double brick(double x, double gap)
    {
        double const inside = std::min(x - gap, 1 - gap - x);
        ambiguous = ambiguous || std::fabs(inside) < 1e-3;
        return inside > 0 ? 1 : 0;
    }

    /// Without filter.
    Rgba tile(std::string const& prefix)
    {
        Rgba const brickColor = input(prefix + "brickColor");
        Rgba const mortarColor = input(prefix + "mortarColor");
        prefix_ = prefix;
        auto const q = transformed(matrix(), uv[0], uv[1], 1);
        double s = q[0], t = q[1];
        if ((s < 0 || s > 1) && get("repeatX") == 0)
            return {0, 0, 0, 0};
        if ((t < 0 || t > 1) && get("repeatY") == 0)
            return {0, 0, 0, 0};
        s -= s < 0 || s > 1 ? whole(s) : 0;
        t -= t < 0 || t > 1 ? whole(t) : 0;
        double cw = get("brickWidth") / (get("horizontalCount") + get("horizontalGap"));
        double ch = get("brickHeight") / (get("verticalCount") + get("verticalGap"));
        bool const editRow = get("useRowEdit") != 0
            && static_cast<long>(whole(t / ch) + 1) % static_cast<long>(get("perRow")) == 0;
        bool const editColumn = get("useColumnEdit") != 0
            && static_cast<long>(whole(s / cw) + 1) % static_cast<long>(get("perColumn")) == 0;
        cw *= editRow ? get("changeRow") : 1;
        ch *= editColumn ? get("changeColumn") : 1;
        double const d = (2 * smoothNoise(s / (cw / 17), t / (ch / 17), 0, 0) - 1)
            * get("edgeRoughness") * 0.001;
        s += d;
        t += d;
        double const row = whole(t / ch), seed = get("randomSeed");
        double const r = smoothNoise(seed + 0.5 + row, 0, 0, 0);
        double x = s / cw + (2 * r - 1 - 0.5) * get("randomShift");
        if (t / ch * 0.5 - std::floor(t / ch * 0.5) > 0.5)
            x += get("lineShift") + 0.5;
        double column = whole(x);
        double m = brick(x - column, get("horizontalGap"));
        m *= brick(t / ch - row, get("verticalGap"));
        if (get("repeatX") != 0) {
            double const n = std::max(1.0, std::round(1 / cw));
            column -= n * std::floor(column / n);
        }
        auto const random = cellNumbers(column, row, seed);
        double const holes = get("holes");
        if (holes == 100 || (holes > 0 && random[0] > 1 / (holes + 1)))
            m = 0;
        double const k = std::max(0.0, (2 * random[1] - 1) * get("colorVariance") + 1)
            * std::max(0.0, (2 * random[2] - 1) * get("fadeVariance") + 1);
        Rgba c;
        for (std::size_t i = 0; i < 4; ++i)
            c[i] = clamped(mortarColor[i] * (1 - m) + brickColor[i] * k * m);
        return c;
    }
};

} // namespace zsi::test
