// SPDX-License-Identifier: Apache-2.0
/// The catalogue: every class of the library, once. Exports and tests derive from this list.
#pragma once

#include "environments/BackgroundGeometry.h"
#include "environments/corvid_Env_Backplate.h"
#include "environments/corvid_Env_Default.h"
#include "lights/voPointLight.h"
#include "lights/voSpotLight.h"
#include "materials/legacy/MarlowLegacy.h"
#include "materials/legacy/XRite.h"
#include "materials/physical/corvid_Mtl_Dielectric.h"
#include "materials/physical/corvid_Mtl_Glazing.h"
#include "materials/physical/corvid_Mtl_Metal.h"
#include "materials/physical/corvid_Mtl_MetallicPaint.h"
#include "materials/utility/corvid_Mtl_AmbientOnly.h"
#include "materials/utility/corvid_Mtl_Mirror.h"
#include "materials/utility/corvid_Mtl_NormalsOnly.h"
#include "materials/utility/corvid_Mtl_ShadowPlane.h"
#include "materials/utility/corvid_Mtl_Solid.h"
#include "materials/utility/corvid_Mtl_Unlit.h"
#include "materials/ward/corvid_Mtl_Ward.h"
#include "materials/ward/corvid_Mtl_Ward_120b7820.h"
#include "materials/ward/corvid_Mtl_Ward_33632204.h"
#include "materials/ward/corvid_Mtl_Ward_5592d496.h"
#include "materials/ward/corvid_Mtl_Ward_5ba0bfff.h"
#include "materials/ward/corvid_Mtl_Ward_82261344.h"
#include "materials/ward/corvid_Mtl_Ward_aa598cb4.h"
#include "materials/ward/corvid_Mtl_Ward_b9aac246.h"
#include "materials/ward/corvid_Mtl_Ward_ccb3a2e6.h"
#include "materials/ward/corvid_Mtl_Ward_f05db29e.h"

#define ZSI_CATALOGUE(X)        \
    X(voPointLight)             \
    X(voSpotLight)              \
    X(corvid_Env_Default)       \
    X(corvid_Env_Backplate)     \
    X(BackgroundGeometry)       \
    X(corvid_Mtl_Solid)         \
    X(corvid_Mtl_Unlit)         \
    X(corvid_Mtl_NormalsOnly)   \
    X(corvid_Mtl_ShadowPlane)   \
    X(corvid_Mtl_AmbientOnly)   \
    X(corvid_Mtl_Ward)          \
    X(corvid_Mtl_Ward_120b7820) \
    X(corvid_Mtl_Ward_33632204) \
    X(corvid_Mtl_Ward_5592d496) \
    X(corvid_Mtl_Ward_5ba0bfff) \
    X(corvid_Mtl_Ward_82261344) \
    X(corvid_Mtl_Ward_aa598cb4) \
    X(corvid_Mtl_Ward_b9aac246) \
    X(corvid_Mtl_Ward_ccb3a2e6) \
    X(corvid_Mtl_Ward_f05db29e) \
    X(corvid_Mtl_Mirror)        \
    X(corvid_Mtl_Dielectric)    \
    X(corvid_Mtl_Glazing)       \
    X(corvid_Mtl_Metal)         \
    X(corvid_Mtl_MetallicPaint) \
    X(MarlowLegacy)             \
    X(XRite)
