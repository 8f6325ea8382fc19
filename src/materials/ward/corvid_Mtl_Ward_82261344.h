#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_82261344 : NoNetwork {
    using cutout_map = Bitmap<0>;
    using diffuse_color = Noise<1, Bitmap<2>, Bitmap<3>>;
};
} // namespace network

/// Ward surface whose diffuse colour is two pictures blended by a noise, cut out by a picture.
class corvid_Mtl_Ward_82261344 final
    : public WardVariant<corvid_Mtl_Ward_82261344, network::Ward_82261344>,
      public NoiseFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
