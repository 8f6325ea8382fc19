/// Networks of procedural textures as types: a node names its inputs, and all else follows.
///
/// A network is a struct that may hold the aliases `diffuse_color`, `normal0_map` and `cutout_map`,
/// each the root of a tree of nodes:
///
///   struct Network : NoNetwork {
///       using normal0_map = Bitmap<0>;
///       using diffuse_color = Tile<1, Bitmap<2>, Bitmap<3>>;
///   };
///
/// The number of a node is its place in the registration order of the network. Names, fields,
/// registration and evaluation derive from the tree. A parameter's name is its path:
/// "_ward_diffuse_color_Tile_brickColor_UnifiedBitmap_amount".
#pragma once

#include "materials/physical/shared/masking.h"
#include "materials/ward/bitmapNode.h"
#include "materials/ward/compileTimeText.h"
#include "materials/ward/noiseNode.h"
#include "materials/ward/tileNode.h"

#include <utility>

namespace zsi::network {

/// Where a network is asked for its value.
struct Site {
    Vec2f uv;
    Vec3f position; ///< reference position, `Pref`
};

template <class...>
struct List {
    static constexpr int kSize = 0;
};
template <class First, class... Rest>
struct List<First, Rest...> {
    static constexpr int kSize = 1 + static_cast<int>(sizeof...(Rest));
};

template <class... Lists>
struct Join {
    using Type = List<>;
};
template <class... A>
struct Join<List<A...>> {
    using Type = List<A...>;
};
template <class... A, class... B, class... Rest>
struct Join<List<A...>, List<B...>, Rest...> : Join<List<A..., B...>, Rest...> {
};

/// A node together with the text before the names of its parameters.
template <class NodeType, Text kNodePath>
struct Placed {
    using Node = NodeType;
    static constexpr auto kPath = kNodePath;
};

/// The part of a shader that holds the fields of one node.
template <template <class> class Fields, class Base>
Fields<Base>& part(Fields<Base>& shader)
{
    return shader;
}
template <template <class> class Fields, class Base>
Fields<Base> const& part(Fields<Base> const& shader)
{
    return shader;
}

// What every node has: kOrder, its place; Nodes<prefix>, itself and its inputs in tree order, with
// paths; Fields<Base>, its parameters behind those of Base; visit<path>; evaluate.

#define ZSI_VISIT_NODE(T, name, meaning) \
    visitor.parameter(kStoredText<kPath + Text("_" #name)>.data, fields.name, meaning, false);

/// A picture.
template <int kPlace>
struct Bitmap {
    static constexpr int kOrder = kPlace;
    template <Text kPrefix>
    using Nodes = List<Placed<Bitmap, kPrefix + Text("_UnifiedBitmap")>>;

    template <class Base>
    struct Fields : Base {
        BITMAP_NODE(ZSI_ROW_NONE, ZSI_ROW_UNSET, ZSI_ROW_NONE)
    };
    template <Text kPath>
    static void visit(auto& fields, auto&& visitor)
    {
        BITMAP_NODE(ZSI_ROW_NONE, ZSI_VISIT_NODE, ZSI_ROW_NONE)
    }
    static Vec4f evaluate(IShaderAPI*, ShadeState const& state, auto const& shader, Site const& at)
    {
        auto const& f = part<Bitmap::template Fields>(shader);
        Vec2f picture;
        if (f.isCube) {
            picture = maskCoordinate(kMaskBox, transformPoint(f.xform, at.position),
                                     transformDirection(f.xform, state.Nref), 1.0f);
        } else {
            Vec3f const q = transformPoint(f.xform, {at.uv.x, at.uv.y, 1.0f});
            picture = {q.x, q.y};
        }
        return f.texture.lookup(picture) * f.amount;
    }
};

/// Noise between two constant colours.
template <int kPlace>
struct PlainNoise {
    static constexpr int kOrder = kPlace;
    template <Text kPrefix>
    using Nodes = List<Placed<PlainNoise, kPrefix + Text("_Noise")>>;

#define ZSI_PLAIN_NOISE(P, U, A) \
    NOISE_NODE_PLACE(P, U, A)    \
    NOISE_NODE_COLORS(P, U, A)   \
    NOISE_NODE_SHAPE(P, U, A)
    template <class Base>
    struct Fields : Base {
        ZSI_PLAIN_NOISE(ZSI_ROW_NONE, ZSI_ROW_UNSET, ZSI_ROW_NONE)
    };
    template <Text kPath>
    static void visit(auto& fields, auto&& visitor)
    {
        ZSI_PLAIN_NOISE(ZSI_ROW_NONE, ZSI_VISIT_NODE, ZSI_ROW_NONE)
    }
#undef ZSI_PLAIN_NOISE
    static Vec4f evaluate(IShaderAPI* api, ShadeState const& state, auto const& shader,
                          Site const& at)
    {
        auto const& f = part<PlainNoise::template Fields>(shader);
        return NoiseFunctions().f_Noise(api, state, at.uv, at.position, f.color1, f.color2,
                                        f.thresholdLow, f.thresholdHigh, f.xform, f.size, f.levels,
                                        f.phase, f.type);
    }
};

/// Noise between the results of two nodes.
template <int kPlace, class Color1, class Color2>
struct Noise {
    static constexpr int kOrder = kPlace;
    template <Text kPrefix>
    using Nodes =
        typename Join<List<Placed<Noise, kPrefix + Text("_Noise")>>,
                      typename Color1::template Nodes<kPrefix + Text("_Noise_color1")>,
                      typename Color2::template Nodes<kPrefix + Text("_Noise_color2")>>::Type;

#define ZSI_FED_NOISE(P, U, A) \
    NOISE_NODE_PLACE(P, U, A)  \
    NOISE_NODE_SHAPE(P, U, A)
    template <class Base>
    struct Fields : Base {
        ZSI_FED_NOISE(ZSI_ROW_NONE, ZSI_ROW_UNSET, ZSI_ROW_NONE)
    };
    template <Text kPath>
    static void visit(auto& fields, auto&& visitor)
    {
        ZSI_FED_NOISE(ZSI_ROW_NONE, ZSI_VISIT_NODE, ZSI_ROW_NONE)
    }
#undef ZSI_FED_NOISE
    static Vec4f evaluate(IShaderAPI* api, ShadeState const& state, auto const& shader,
                          Site const& at)
    {
        auto const& f = part<Noise::template Fields>(shader);
        // Inputs in their order, here and in Tile: as arguments they would come in any.
        Vec4f const color1 = Color1::evaluate(api, state, shader, at);
        Vec4f const color2 = Color2::evaluate(api, state, shader, at);
        return NoiseFunctions().f_Noise(api, state, at.uv, at.position, color1, color2,
                                        f.thresholdLow, f.thresholdHigh, f.xform, f.size, f.levels,
                                        f.phase, f.type);
    }
};

/// Brickwork of the results of two nodes.
template <int kPlace, class BrickColor, class MortarColor>
struct Tile {
    static constexpr int kOrder = kPlace;
    template <Text kPrefix>
    using Nodes = typename Join<
        List<Placed<Tile, kPrefix + Text("_Tile")>>,
        typename BrickColor::template Nodes<kPrefix + Text("_Tile_brickColor")>,
        typename MortarColor::template Nodes<kPrefix + Text("_Tile_mortarColor")>>::Type;

    template <class Base>
    struct Fields : Base {
        TileParameters tile;
    };
    template <Text kPath>
    static void visit(auto& self, auto&& visitor)
    {
        auto& fields = self.tile;
        TILE_NODE(ZSI_ROW_NONE, ZSI_VISIT_NODE, ZSI_ROW_NONE)
    }
    static Vec4f evaluate(IShaderAPI* api, ShadeState const& state, auto const& shader,
                          Site const& at)
    {
        Vec2f const footprint =
            uvFootprint(state, shader.attribute_tangent(state), shader.attribute_bitangent(state));
        Vec4f const brick = BrickColor::evaluate(api, state, shader, at);
        Vec4f const mortar = MortarColor::evaluate(api, state, shader, at);
        return TileFunctions().f_Tile(api, state, at.uv, at.position, brick, mortar,
                                      part<Tile::template Fields>(shader).tile, footprint);
    }
};
// Held as one member, so that `f_Tile` gets them without a copy. At this alignment the block starts
// and ends where its fields would on their own.
static_assert(alignof(TileParameters) == alignof(Mat4f));

#undef ZSI_VISIT_NODE

/// A channel without a network.
struct None {
    template <Text>
    using Nodes = List<>;
};

struct NoNetwork {
    using diffuse_color = None;
    using normal0_map = None;
    using cutout_map = None;
};

/// Nodes of a network in tree order.
template <class Network>
using Nodes =
    typename Join<typename Network::diffuse_color::template Nodes<Text("_ward_diffuse_color")>,
                  typename Network::normal0_map::template Nodes<Text("_ward_normal0_map")>,
                  typename Network::cutout_map::template Nodes<Text("_ward_cutout_map")>>::Type;

/// The node of a list whose place in the registration order is kPlace.
template <int kPlace, class Nodes>
struct Find; // not defined: a place that no node takes does not compile
template <int kPlace, class First, class... Rest>
struct Find<kPlace, List<First, Rest...>>
    : std::conditional_t<First::Node::kOrder == kPlace, std::type_identity<First>,
                         Find<kPlace, List<Rest...>>> {
};

/// Fields of the first kCount nodes in registration order, behind those of Base. Each node derives
/// from the one before, which lets every field take the next address that suits it.
template <class Network, class Base, int kCount>
struct FieldsOf {
    using Node = typename Find<kCount - 1, Nodes<Network>>::type::Node;
    using Type = typename Node::template Fields<typename FieldsOf<Network, Base, kCount - 1>::Type>;
};
template <class Network, class Base>
struct FieldsOf<Network, Base, 0> {
    using Type = Base;
};

/// Base with the parameters of the network behind its own.
template <class Network, class Base>
using WithNetwork = typename FieldsOf<Network, Base, Nodes<Network>::kSize>::Type;

/// Shows every parameter of the network to the visitor, in registration order.
template <class Network>
void visit(auto& shader, auto& visitor)
{
    [&]<int... kPlace>(std::integer_sequence<int, kPlace...>)
    {
        auto const one = [&](auto identity) {
            using Found = typename decltype(identity)::type;
            using Node = typename Found::Node;
            Node::template visit<Found::kPath>(part<Node::template Fields>(shader), visitor);
        };
        (one(typename std::type_identity<typename Find<kPlace, Nodes<Network>>::type>{}), ...);
    }
    (std::make_integer_sequence<int, Nodes<Network>::kSize>{});
}

} // namespace zsi::network
