#include "materials/ward/corvid_Mtl_Ward_5592d496.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_5592d496)

} // namespace zsi
