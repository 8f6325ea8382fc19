// SPDX-License-Identifier: Apache-2.0
/// The exported pair of plain C functions of every class.
#include "exports/catalogue.h"

#include <new>

#define ZSI_EXPORT extern "C" __attribute__((visibility("default")))

#define ZSI_EXPORT_CLASS(Class)                                                             \
    ZSI_EXPORT zsi::IShaderBase* Class##_create() { return new (std::nothrow) zsi::Class; } \
    ZSI_EXPORT int Class##_getAPIVersion() { return zsi::kApiVersion; }

ZSI_CATALOGUE(ZSI_EXPORT_CLASS)
