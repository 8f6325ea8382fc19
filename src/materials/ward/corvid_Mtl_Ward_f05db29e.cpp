#include "materials/ward/corvid_Mtl_Ward_f05db29e.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_f05db29e)

} // namespace zsi
