# SPDX-License-Identifier: Apache-2.0
# What a program needs that links to the host library: the same libraries under the names that
# find_package, pkg-config and Debian know them by.
set(zsi_host_packages "embree 3" OpenImageIO Imath OpenEXR TBB assimp fmt)
set(zsi_host_pkgconfig "OpenImageIO Imath OpenEXR tbb assimp fmt libelf")
set(zsi_host_link_flags "-lembree3 -ldl") # those that come without such files
# openimageio-tools, libimath-dev, zlib1g-dev: the CMake packages of OpenImageIO and assimp ask for them.
set(zsi_host_debian "libembree-dev, libopenimageio-dev, openimageio-tools, libimath-dev, libopenexr-dev, libtbb-dev, libassimp-dev, zlib1g-dev, libfmt-dev, libelf-dev")
