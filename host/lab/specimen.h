// SPDX-License-Identifier: Apache-2.0
/// What is measured.
#pragma once

#include "lab/merl.h"
#include "plugin/shaderSource.h"

#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

namespace zsi::lab {

/// A material with its parameters, or a table of measured values.
class Specimen {
public:
    Specimen(std::string label, MerlTable table);
    /// `owner` keeps alive what the shader and its textures stand in.
    Specimen(std::string label, host::Shader const& shader, std::shared_ptr<void const> owner);

    std::string const& label() const { return label_; } ///< "CLASS name=value"
    host::Shader const* shader() const { return shader_; } ///< null for a table
    MerlTable const* table() const { return table_.get(); } ///< null for a material
    /// Whether a material has these entry points, a mask of `zsi::EntryPoint`.
    bool has(int entryPoints) const;
    bool hasValues() const { return table_ || has(kTransfer); }

    /// 1/sr without the cosine, for each pair of directions away from the surface; see
    /// host/measure/materialProbe.h. One of either stands for all. Where a table has nothing: NaN.
    void values(std::span<Vec3f const> wi, std::span<Vec3f const> wo, std::span<Vec3f> out,
                int threads) const;

private:
    std::string label_;
    host::Shader const* shader_ = nullptr;
    std::shared_ptr<void const> owner_;
    std::shared_ptr<MerlTable const> table_;
};

/// A material as words: its class, or FILE.json:NAME for a material of a scene; then "name=value"
/// as often as wanted. A value is what a scene file has; without quotes around strings and brackets
/// around numbers ("1,0.5,0"), and a texture may be a file name alone.
/// Throws InputError for what names no material, unknown parameters and values that do not fit.
Specimen specimenOf(std::span<std::string const> words, host::ShaderSource const& shaders);

/// Several of them: every word without "=" begins another one, and a "+" alone may stand between.
std::vector<Specimen> specimensOf(std::span<std::string const> words,
                                  host::ShaderSource const& shaders);

/// A table, called by the name of its file.
Specimen measuredSpecimen(std::filesystem::path const& file);

} // namespace zsi::lab
