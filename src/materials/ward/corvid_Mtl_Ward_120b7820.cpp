#include "materials/ward/corvid_Mtl_Ward_120b7820.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_120b7820)

} // namespace zsi
