# SPDX-License-Identifier: Apache-2.0
# `cpack -G DEB` makes two packages: zsi, and zsi-dev for those who compile against it.
set(CPACK_PACKAGE_NAME zsi)
set(CPACK_PACKAGE_VENDOR "The Zephyr shaders authors")
set(CPACK_PACKAGE_CONTACT "The Zephyr shaders authors")
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_RESOURCE_FILE_LICENSE ${PROJECT_SOURCE_DIR}/LICENSE)
set(CPACK_COMPONENTS_ALL runtime development)
set(CPACK_STRIP_FILES ON)

set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON) # of the programs and libraries, as dpkg-shlibdeps finds them
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS OFF) # the shaders are loaded, nothing links to them
set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME zsi)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION graphics)
set(CPACK_COMPONENT_RUNTIME_DESCRIPTION 
"27 surface materials, lights and environments in one shared object, which a ray
tracer loads through a fixed contract, and the command zsi, which lists them and
renders scenes with them.")
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME zsi-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "zsi (= ${PROJECT_VERSION}), ${zsi_host_debian}")
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION 
"What programs compile and link against: the contract between shaders and ray
tracers as C++ headers, the host library that zsi is made of, their CMake package
and pkg-config files, and examples.")
include(CPack)
