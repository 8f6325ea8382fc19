#include "materials/ward/corvid_Mtl_Ward_ccb3a2e6.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_ccb3a2e6)

} // namespace zsi
