#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_b9aac246 : NoNetwork {
    using normal0_map = Bitmap<0>;
    using diffuse_color = Noise<5, Tile<6, Bitmap<1>, Bitmap<2>>, Tile<7, Bitmap<3>, Bitmap<4>>>;
};
} // namespace network

/// Ward surface of two kinds of brickwork of pictures, blended by a noise, with a picture as bump.
class corvid_Mtl_Ward_b9aac246 final
    : public WardVariant<corvid_Mtl_Ward_b9aac246, network::Ward_b9aac246>,
      public NoiseFunctions,
      public TileFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
