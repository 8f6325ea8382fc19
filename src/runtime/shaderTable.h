// SPDX-License-Identifier: Apache-2.0
/// How a shader states its parameters once: `SHADER(Class, mask, ROWS)`.
///
/// ROWS is a macro `ROWS(P, U, A)` that lists, in registration order,
///   P(type, name, (default), "meaning")   a parameter
///   U(type, name, "meaning")              a parameter that has no default: the host writes it;
///                                         zeroed, so that nothing ever reads undefined memory
///   A(type, name)                         a vertex attribute
/// After the meaning, P and U take facts for people and for programs that show parameters:
///   slider(0, 1)                          where a person would drag it; values outside are legal
///   group("masking"), groupEnd()          the group that begins or ends with this row
///   when("maskingMode", 2, 4)             the shader reads it only with these values of another
///   when("maskingTexture")                ... with this texture bound, or this switch on
///   whenAny("diffuseCube", "specularCube")    ... with at least one of up to three
///   suits(5.0f)                           the default, a length, is for an object of this size;
///                                         hosts may scale it to the object's own
/// Several conditions must all hold. Facts cost the library nothing; `tools/describe.cpp` reads
/// them.
/// Shared blocks are such macros too; a class puts them where its order wants them. From the rows
/// derive the fields (flat members, same order), registration, copy, the attribute offsets, and an
/// `attribute_<name>(state)` reader for each attribute.
#pragma once

#include <bit>
#include <cstddef>
#include <cstring>
#include <type_traits>
#include <zsi/zsi.h>

namespace zsi {

struct Slider {
    float minimum, maximum, step;
};
/// A step of 0 tells nothing: whatever suits the type and the range.
constexpr Slider slider(float minimum, float maximum, float step = 0.0f)
{
    return {minimum, maximum, step};
}

struct Suits {
    float objectSize;
};
constexpr Suits suits(float objectSize) { return {objectSize}; }

struct Group {
    char const* name;
};
constexpr Group group(char const* name) { return {name}; }
struct GroupEnd { };
constexpr GroupEnd groupEnd() { return {}; }

struct When {
    char const* parameters[3]; ///< the first ones are not null
    bool ranged = false;
    int from = 0, to = 0;
};
constexpr When when(char const* mode, int from, int to) { return {{mode}, true, from, to}; }
constexpr When when(char const* parameter) { return {{parameter}}; }
constexpr When whenAny(auto... parameters) { return {{parameters...}}; }

/// Tells the host's manager about each row; one overload per parameter and attribute type.
struct Registrar {
    IShaderManager* manager;
    IShaderBase* shader;

    void field(char const* name, bool& f) const { manager->registerBool(shader, name, &f); }
    void field(char const* name, int& f) const { manager->registerInt(shader, name, &f); }
    void field(char const* name, float& f) const { manager->registerFloat(shader, name, &f); }
    void field(char const* name, Vec2f& f) const { manager->registerVec2f(shader, name, &f); }
    void field(char const* name, Vec3f& f) const { manager->registerVec3f(shader, name, &f); }
    void field(char const* name, Vec4f& f) const { manager->registerVec4f(shader, name, &f); }
    void field(char const* name, Mat3f& f) const { manager->registerMat3f(shader, name, &f); }
    void field(char const* name, Mat4f& f) const { manager->registerMat4f(shader, name, &f); }
    void field(char const* name, TextureSampler1D& f) const
    {
        manager->registerTexture1D(shader, name, &f);
    }
    void field(char const* name, TextureSampler2D& f) const
    {
        manager->registerTexture2D(shader, name, &f);
    }
    void field(char const* name, TextureSamplerCube& f) const
    {
        manager->registerTextureCube(shader, name, &f);
    }

    void parameter(char const* name, auto& f, bool /*hasDefault*/, char const* /*meaning*/,
                   auto const&... /*facts*/)
    {
        field(name, f);
    }
    template <class T>
    void attribute(char const* name, std::size_t offset)
    {
        constexpr int kind = std::is_same_v<T, Vec2f> ? kAttributeVec2f
            : std::is_same_v<T, Vec3f>                ? kAttributeVec3f
                                                      : kAttributeVec4f;
        static_assert(kind != kAttributeVec4f || std::is_same_v<T, Vec4f>);
        manager->registerAttribute(shader, kind, name, static_cast<long>(offset));
    }
};

/// The attribute at `offset` of the record's attribute block.
template <class T>
inline T readAttribute(ShadeState const& state, std::size_t offset)
{
    // Float by float: as one block it would go through memory a second time.
    constexpr std::size_t kFloats = sizeof(T) / sizeof(float);
    float value[kFloats];
    for (std::size_t i = 0; i < kFloats; ++i)
        std::memcpy(&value[i], state.attributes + offset + i * sizeof(float), sizeof(float));
    return std::bit_cast<T>(value);
}

/// A property that scattering is measured for and that a class's formulas leave out on purpose: the
/// name of the check of `zsi lab --check`, and why. A class lists its own in `kDepartures`.
struct Departure {
    char const *check, *why;
};

} // namespace zsi

#define ZSI_ROW_NONE(...)
#define ZSI_ROW_FIELD(T, name, init, ...) T name = T init;
#define ZSI_ROW_UNSET(T, name, ...) T name{};
#define ZSI_ROW_ATTRIBUTE(T, name) T name;
#define ZSI_ROW_READER(T, name)                                     \
    static T attribute_##name(ShadeState const& state)              \
    {                                                               \
        return readAttribute<T>(state, offsetof(Attributes, name)); \
    }
#define ZSI_VISIT_FIELD(T, name, init, ...) visitor.parameter(#name, self.name, true, __VA_ARGS__);
#define ZSI_VISIT_UNSET(T, name, ...) visitor.parameter(#name, self.name, false, __VA_ARGS__);
#define ZSI_VISIT_ATTRIBUTE(T, name) \
    visitor.template attribute<T>(#name, offsetof(Attributes, name));

/// Fields, attribute readers, `registerShader` and `copy` of a class from its rows.
#define SHADER(Class, MASK, ROWS)                                        \
    ROWS(ZSI_ROW_FIELD, ZSI_ROW_UNSET, ZSI_ROW_NONE)                     \
    struct Attributes {                                                  \
        ROWS(ZSI_ROW_NONE, ZSI_ROW_NONE, ZSI_ROW_ATTRIBUTE)              \
    };                                                                   \
    static_assert(sizeof(Attributes) <= sizeof(ShadeState::attributes)); \
    ROWS(ZSI_ROW_NONE, ZSI_ROW_NONE, ZSI_ROW_READER)                     \
    static void visit([[maybe_unused]] auto& self, auto&& visitor)       \
    {                                                                    \
        ROWS(ZSI_VISIT_FIELD, ZSI_VISIT_UNSET, ZSI_VISIT_ATTRIBUTE)      \
    }                                                                    \
    void registerShader(IShaderManager* manager) override                \
    {                                                                    \
        manager->declareEntryPoints(this, MASK);                         \
        visit(*this, Registrar{manager, this});                          \
    }                                                                    \
    void copy(IShaderBase const* other) override { *this = *static_cast<Class const*>(other); }
