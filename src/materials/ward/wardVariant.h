/// The Ward material with a network of procedural textures in some of its channels.
#pragma once

#include "materials/ward/bumpLookup.h"
#include "materials/ward/network.h"
#include "materials/ward/wardFunctions.h"

namespace zsi {

#define WARD_VARIANT_FRONT(P, U, A) \
    TANGENT_ATTRIBUTES(P, U, A)     \
    WARD_CHANNELS(P, U, A)
#define WARD_VARIANT_BACK(P, U, A) \
    AMBIENT_OCCLUSION(P, U, A)     \
    MASKING(P, U, A)

/// Fields before those of the network.
struct WardVariantFront : MaterialShader {
    WARD_VARIANT_FRONT(ZSI_ROW_FIELD, ZSI_ROW_UNSET, ZSI_ROW_NONE)
};

/// All fields: channels, network, occlusion and masking, each at the next address that suits it.
template <class Network>
struct WardVariantFields : network::WithNetwork<Network, WardVariantFront> {
    WARD_VARIANT_BACK(ZSI_ROW_FIELD, ZSI_ROW_UNSET, ZSI_ROW_NONE)
};

/// What `SHADER` gives a class of one flat list of rows, and the splice points of the network.
/// A class derives from this with itself and its network, and says WARD_VARIANT_ENTRY_POINTS.
template <class Shader, class Network>
class WardVariant : public WardVariantFields<Network>, public WardFunctions<Shader> {
public:
    struct Attributes {
        WARD_VARIANT_FRONT(ZSI_ROW_NONE, ZSI_ROW_NONE, ZSI_ROW_ATTRIBUTE)
        WARD_VARIANT_BACK(ZSI_ROW_NONE, ZSI_ROW_NONE, ZSI_ROW_ATTRIBUTE)
    };
    WARD_VARIANT_FRONT(ZSI_ROW_NONE, ZSI_ROW_NONE, ZSI_ROW_READER)
    WARD_VARIANT_BACK(ZSI_ROW_NONE, ZSI_ROW_NONE, ZSI_ROW_READER)

    static void visit(auto& self, auto&& visitor)
    {
        WARD_VARIANT_FRONT(ZSI_VISIT_FIELD, ZSI_VISIT_UNSET, ZSI_VISIT_ATTRIBUTE)
        network::visit<Network>(self, visitor);
        WARD_VARIANT_BACK(ZSI_VISIT_FIELD, ZSI_VISIT_UNSET, ZSI_VISIT_ATTRIBUTE)
    }
    void registerShader(IShaderManager* manager) override
    {
        manager->declareEntryPoints(this, kWardEntryPoints);
        visit(*this, Registrar{manager, this});
    }
    void copy(IShaderBase const* other) override
    {
        *this = *static_cast<WardVariant const*>(other);
    }

    // Splice points. They stay out of line: the paths without a network pay nothing for them.
    // A network stands where a map stands: at the coordinate that the channel's transform gives.
    // The diffuse network is the exception. It stands for transform, map and amount together.

    [[gnu::noinline]] Vec4f diffuseMap(IShaderAPI* api, ShadeState const& state, Vec2f uv,
                                       Vec3f position) const
    {
        using Root = typename Network::diffuse_color;
        if constexpr (kHas<Root>)
            return Root::evaluate(api, state, *this, {uv, position});
        else
            return Functions::diffuseMap(api, state, uv, position);
    }
    [[gnu::noinline]] SLArray<float> normal0Heights(IShaderAPI* api, ShadeState const& state,
                                                    SLArray<Vec3f> const& frame, Vec2f uv,
                                                    Vec3f position) const
    {
        using Root = typename Network::normal0_map;
        if constexpr (kHas<Root>) {
            auto const value = [&](network::Site const& at) {
                return Root::evaluate(api, state, *this, at);
            };
            return BumpLookupFunctions().f_bumpLookup(
                api, state, value, frame, {transformUv(this->u_normal0Transform, uv), position});
        } else {
            return Functions::normal0Heights(api, state, frame, uv, position);
        }
    }
    [[gnu::noinline]] float cutoutMap(IShaderAPI* api, ShadeState const& state, Vec2f uv,
                                      Vec3f position) const
    {
        using Root = typename Network::cutout_map;
        if constexpr (kHas<Root>)
            return Root::evaluate(api, state, *this,
                                  {transformUv(this->u_cutoutTransform, uv), position})
                .x;
        else
            return Functions::cutoutMap(api, state, uv, position);
    }

private:
    using Functions = WardFunctions<Shader>;
    template <class Root>
    static constexpr bool kHas = !std::is_same_v<Root, network::None>;

    WardVariant() = default;
    friend Shader;
};

/// Declares the entry points of a variant, and defines them in its source file.
#define WARD_VARIANT_ENTRY_POINTS                                         \
    void shade(IShaderAPI* api, ShadeState& state) const override;        \
    void transmission(IShaderAPI* api, ShadeState& state) const override; \
    void transfer(IShaderAPI* api, ShadeState& state) const override;     \
    void sample(IShaderAPI* api, ShadeState& state) const override;

#define WARD_VARIANT_DEFINITIONS(Class)                                                          \
    void Class::shade(IShaderAPI* api, ShadeState& state) const { shadeWard(api, state); }       \
    void Class::transmission(IShaderAPI* api, ShadeState& state) const                           \
    {                                                                                            \
        transmissionWard(api, state);                                                            \
    }                                                                                            \
    void Class::transfer(IShaderAPI* api, ShadeState& state) const { transferWard(api, state); } \
    void Class::sample(IShaderAPI* api, ShadeState& state) const { sampleWard(api, state); }

} // namespace zsi
