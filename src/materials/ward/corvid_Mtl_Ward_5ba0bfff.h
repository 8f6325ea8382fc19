#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

namespace network {
struct Ward_5ba0bfff : NoNetwork {
    using normal0_map = PlainNoise<0>;
};
} // namespace network

/// Ward surface with a bump of noise: hammered, cast or rippled.
class corvid_Mtl_Ward_5ba0bfff final
    : public WardVariant<corvid_Mtl_Ward_5ba0bfff, network::Ward_5ba0bfff> {
public:
    WARD_VARIANT_ENTRY_POINTS
};

} // namespace zsi
