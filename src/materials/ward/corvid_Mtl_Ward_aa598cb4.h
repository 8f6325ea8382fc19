#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_aa598cb4 : NoNetwork {
    using normal0_map = Noise<2, Bitmap<0>, Bitmap<1>>;
    using diffuse_color = Noise<5, Bitmap<3>, Bitmap<4>>;
};
} // namespace network

/// Ward surface whose diffuse colour and bump are each two pictures blended by a noise.
class corvid_Mtl_Ward_aa598cb4 final
    : public WardVariant<corvid_Mtl_Ward_aa598cb4, network::Ward_aa598cb4>,
      public NoiseFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
