// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward.h"

namespace zsi {

template class WardMaterial<WardFields>;

} // namespace zsi
