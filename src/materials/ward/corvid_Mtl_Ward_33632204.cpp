#include "materials/ward/corvid_Mtl_Ward_33632204.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_33632204)

} // namespace zsi
