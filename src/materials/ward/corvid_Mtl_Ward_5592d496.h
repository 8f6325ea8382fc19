#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_5592d496 : NoNetwork {
    using normal0_map = Bitmap<0>;
    using diffuse_color = Noise<3, Bitmap<1>, Bitmap<2>>;
};
} // namespace network

/// Ward surface whose diffuse colour is two pictures blended by a noise, with a picture as bump.
class corvid_Mtl_Ward_5592d496 final
    : public WardVariant<corvid_Mtl_Ward_5592d496, network::Ward_5592d496>,
      public NoiseFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
