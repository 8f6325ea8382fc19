#include "materials/ward/corvid_Mtl_Ward_5ba0bfff.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_5ba0bfff)

} // namespace zsi
