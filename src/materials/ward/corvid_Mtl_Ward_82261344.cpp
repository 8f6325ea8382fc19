#include "materials/ward/corvid_Mtl_Ward_82261344.h"

namespace zsi {

WARD_VARIANT_DEFINITIONS(corvid_Mtl_Ward_82261344)

} // namespace zsi
