#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_33632204 : NoNetwork {
    using normal0_map = Noise<4, Noise<5, Bitmap<0>, Bitmap<1>>, Noise<6, Bitmap<2>, Bitmap<3>>>;
    using diffuse_color =
        Noise<11, Noise<12, Bitmap<7>, Bitmap<8>>, Noise<13, Bitmap<9>, Bitmap<10>>>;
};
} // namespace network

/// Ward surface of mottled pictures: noises of noises blend four pictures, once for the diffuse
/// colour and once, with pictures and noises of its own, for the bump.
class corvid_Mtl_Ward_33632204 final
    : public WardVariant<corvid_Mtl_Ward_33632204, network::Ward_33632204>,
      public NoiseFunctions,
      public BumpLookupFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
