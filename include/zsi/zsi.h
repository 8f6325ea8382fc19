// SPDX-License-Identifier: Apache-2.0
/// Everything a host needs to load and call a shader library.
#pragma once

#include <zsi/shadeState.h>
#include <zsi/shader.h>
#include <zsi/shaderApi.h>
#include <zsi/shaderManager.h>
#include <zsi/texture.h>
#include <zsi/types.h>
