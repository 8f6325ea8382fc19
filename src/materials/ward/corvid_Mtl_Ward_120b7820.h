#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_120b7820 : NoNetwork {
    using diffuse_color = PlainNoise<0>;
};
} // namespace network

/// Ward surface whose diffuse colour is a noise between two colours: marble, clouds, patina.
class corvid_Mtl_Ward_120b7820 final
    : public WardVariant<corvid_Mtl_Ward_120b7820, network::Ward_120b7820>,
      public NoiseFunctions {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
