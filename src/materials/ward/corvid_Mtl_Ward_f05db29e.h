#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_f05db29e : NoNetwork {
    using normal0_map = Bitmap<0>;
    using diffuse_color = Tile<1, Bitmap<2>, Bitmap<3>>;
};
} // namespace network

/// Ward surface of brickwork: pictures for bricks and mortar, and one as bump.
class corvid_Mtl_Ward_f05db29e final
    : public WardVariant<corvid_Mtl_Ward_f05db29e, network::Ward_f05db29e>,
      public TileFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
