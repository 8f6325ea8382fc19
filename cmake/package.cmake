# SPDX-License-Identifier: Apache-2.0
# `cpack -G DEB` makes the packages zsi, zsi-dev for those who compile against it, and
# python3-zsi, which has a module of its own and needs the shaders of zsi.
set(CPACK_PACKAGE_NAME zsi)
set(CPACK_PACKAGE_VENDOR "The Zephyr shaders authors")
set(CPACK_PACKAGE_CONTACT "The Zephyr shaders authors")
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_RESOURCE_FILE_LICENSE ${PROJECT_SOURCE_DIR}/LICENSE)
set(CPACK_COMPONENTS_ALL runtime development)
if(ZSI_BUILD_PYTHON)
    list(APPEND CPACK_COMPONENTS_ALL python)
endif()
set(CPACK_STRIP_FILES ON)

set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON) # of the programs and libraries, as dpkg-shlibdeps finds them
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS OFF) # the shaders are loaded, nothing links to them
set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME zsi)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION graphics)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SUGGESTS "python3-zsi")
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
if(ZSI_BUILD_PYTHON)
    math(EXPR python_next "${Python_VERSION_MINOR} + 1")
endif()
set(CPACK_DEBIAN_PYTHON_PACKAGE_NAME python3-zsi)
set(CPACK_DEBIAN_PYTHON_PACKAGE_SECTION python)
set(CPACK_DEBIAN_PYTHON_PACKAGE_DEPENDS "zsi (= ${PROJECT_VERSION}), python3 (>= ${Python_VERSION_MAJOR}.${Python_VERSION_MINOR}), python3 (<< ${Python_VERSION_MAJOR}.${python_next}), python3-numpy")
set(CPACK_DEBIAN_PYTHON_PACKAGE_RECOMMENDS "python3-pil, python3-distributed")
set(CPACK_COMPONENT_PYTHON_DESCRIPTION 
"The library in Python: materials measured and fitted over numpy arrays, scenes
loaded, made, edited, rendered, and rendered on many machines (zsi farm).")
include(CPack)
