#include "materials/ward/corvid_Mtl_Ward_aa598cb4.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_aa598cb4)

} // namespace zsi
