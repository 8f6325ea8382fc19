// SPDX-License-Identifier: Apache-2.0
#include "plugin/shader.h"

#include "base/error.h"

#include <array>
#include <cstring>
#include <zsi/registration.h>

namespace zsi::host {

namespace {

static_assert(std::tuple_size_v<ParameterTypes> == std::variant_size_v<ParameterValue>);
static_assert(
    std::tuple_size_v<ParameterTypes> == static_cast<std::size_t>(ParameterType::TextureCube) + 1);

/// Writes down what a shader registers. Nothing is thrown through the shader's code.
class RecordingManager final : public GenericManager<RecordingManager> {
public:
    int entryPoints = 0;
    std::vector<Parameter> parameters;
    std::vector<Attribute> attributes;

    void declareEntryPoints(IShaderBase*, int mask) override { entryPoints = mask; }
    void registerAttribute(IShaderBase*, int kind, char const* name, long offset) override
    {
        attributes.push_back({name, kind, offset});
    }
    template <class T>
    void parameter(IShaderBase*, char const* name, T* field)
    {
        constexpr bool kMatrix = std::is_same_v<T, Mat3f> || std::is_same_v<T, Mat4f>;
        constexpr auto kType = static_cast<ParameterType>(parameterTypeIndex<T>());
        parameters.push_back({name, kType, field});
        parameters.back().about.hasDefault = !kMatrix;
    }
};

/// The host writes attributes at the shader's word, so they must lie inside the block.
void checkAttribute(std::string const& className, Attribute const& a)
{
    if (a.kind < kAttributeVec2f || a.kind > kAttributeVec4f)
        throw InputError(className + ": attribute " + a.name + " has the unknown kind "
                         + std::to_string(a.kind));
    constexpr std::array<long, 3> sizes{sizeof(Vec2f), sizeof(Vec3f), sizeof(Vec4f)};
    long const room = static_cast<long>(sizeof(ShadeState::attributes))
        - sizes[static_cast<std::size_t>(a.kind - 1)];
    if (a.offset < 0 || a.offset > room)
        throw InputError(className + ": attribute " + a.name + " at byte "
                         + std::to_string(a.offset) + " lies outside the attribute block");
}

} // namespace

char const* typeName(ParameterType type)
{
    return kParameterTypeNames[static_cast<std::size_t>(type)];
}

Shader::Shader(std::string className, std::unique_ptr<IShaderBase> object,
               std::shared_ptr<void const> library)
    : className_(std::move(className))
    , library_(std::move(library))
    , object_(std::move(object))
{
    if (!object_)
        throw InputError(className_ + ": the library could not create an object");
    if (kind() < kMaterial || kind() > kEnvironment)
        throw InputError(className_ + ": unknown shader kind " + std::to_string(kind()));
    RecordingManager manager;
    object_->registerShader(&manager);
    for (Attribute const& attribute : manager.attributes)
        checkAttribute(className_, attribute);
    entryPoints_ = manager.entryPoints;
    parameters_ = std::move(manager.parameters);
    attributes_ = std::move(manager.attributes);
}

Shader::Shader(Shader&&) noexcept = default;
Shader::~Shader() = default;

Shader& Shader::operator=(Shader&& other) noexcept
{
    // The object goes before the library that holds its destructor.
    object_ = std::move(other.object_);
    library_ = std::move(other.library_);
    className_ = std::move(other.className_);
    entryPoints_ = other.entryPoints_;
    parameters_ = std::move(other.parameters_);
    attributes_ = std::move(other.attributes_);
    summary_ = std::move(other.summary_);
    text_ = std::move(other.text_);
    return *this;
}

int Shader::kind() const { return object_->getType(); }

Parameter const* Shader::find(std::string_view name) const
{
    for (Parameter const& p : parameters_)
        if (p.name == name)
            return &p;
    return nullptr;
}

std::vector<std::string> Shader::parameterNames() const
{
    std::vector<std::string> names;
    for (Parameter const& p : parameters_)
        names.push_back(p.name);
    return names;
}

void Shader::describe(LibraryDescription const& description)
{
    auto const found = description.find(className_);
    if (found == description.end())
        return;
    summary_ = found->second.summary;
    text_ = found->second.text;
    departures_ = found->second.departures;
    auto const& rows = found->second.parameters;
    for (Parameter& p : parameters_)
        if (auto const row = rows.find(p.name); row != rows.end())
            p.about = row->second;
}

void Shader::set(std::string_view name, ParameterValue const& value)
{
    Parameter const* parameter = find(name);
    if (!parameter)
        throw InputError(printable(name) + ": unknown parameter of " + className_
                         + suggestion(name, parameterNames()));
    ParameterType const given = static_cast<ParameterType>(value.index());
    if (parameter->type == ParameterType::Float && given == ParameterType::Int) {
        *static_cast<float*>(parameter->field) = static_cast<float>(std::get<int>(value));
        return;
    }
    if (parameter->type != given)
        throw InputError(parameter->name + ": parameter of " + className_ + " is of type "
                         + typeName(parameter->type) + ", not " + typeName(given));
    std::visit(
        [&](auto const& v) {
            using Value = std::decay_t<decltype(v)>;
            if constexpr (std::is_pointer_v<Value>) {
                // All three handles are alike: the texture object, then a word of the host's.
                using Texture = std::remove_pointer_t<Value>;
                std::memcpy(parameter->field, &v, sizeof(Texture*));
            } else {
                *static_cast<Value*>(parameter->field) = v;
            }
        },
        value);
}

MaterialShader const* Shader::material() const
{
    return kind() == kMaterial ? static_cast<MaterialShader const*>(object()) : nullptr;
}

LightShader const* Shader::light() const
{
    return kind() == kLight ? static_cast<LightShader const*>(object()) : nullptr;
}

EnvironmentShader const* Shader::environment() const
{
    return kind() == kEnvironment ? static_cast<EnvironmentShader const*>(object()) : nullptr;
}

} // namespace zsi::host
