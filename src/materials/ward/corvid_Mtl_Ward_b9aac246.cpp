#include "materials/ward/corvid_Mtl_Ward_b9aac246.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_b9aac246)

} // namespace zsi
