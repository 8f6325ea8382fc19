#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_ccb3a2e6 : NoNetwork {
    using diffuse_color = Noise<0, Bitmap<1>, Bitmap<2>>;
};
} // namespace network

/// Ward surface whose diffuse colour is two pictures blended by a noise.
class corvid_Mtl_Ward_ccb3a2e6 final
    : public WardVariant<corvid_Mtl_Ward_ccb3a2e6, network::Ward_ccb3a2e6>,
      public NoiseFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
