# SPDX-License-Identifier: Apache-2.0
# What `cmake --install` puts below the prefix. Components: `runtime`, the command and the
# shaders; `development`, what others compile and link against; `python`, the Python package.
include(CMakePackageConfigHelpers)
include(${CMAKE_CURRENT_LIST_DIR}/hostDependencies.cmake)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/zsi)
set(pkgconfig_dir ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
set(staging ${PROJECT_BINARY_DIR}/install)

# The shaders with their description beside them.
install(TARGETS zephyrShaders64 LIBRARY
    DESTINATION ${ZSI_INSTALL_SHADERDIR} COMPONENT runtime)
install(FILES ${PROJECT_BINARY_DIR}/shaders/zephyrShaders64.json
    DESTINATION ${ZSI_INSTALL_SHADERDIR} COMPONENT runtime)

# Each part has targets of its own, so that who writes shaders needs none of the host's libraries.
install(TARGETS zsi_contract EXPORT zsiContract
    FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} COMPONENT development)
install(EXPORT zsiContract NAMESPACE zsi:: FILE zsiContractTargets.cmake
    DESTINATION ${package_dir} COMPONENT development)

configure_package_config_file(cmake/zsiConfig.cmake.in ${staging}/zsiConfig.cmake
    INSTALL_DESTINATION ${package_dir} PATH_VARS ZSI_INSTALL_SHADERDIR)
write_basic_package_version_file(${staging}/zsiConfigVersion.cmake
    COMPATIBILITY SameMajorVersion)
install(FILES ${staging}/zsiConfig.cmake ${staging}/zsiConfigVersion.cmake
    DESTINATION ${package_dir} COMPONENT development)

# Paths in the .pc files start at the file, so that the whole prefix can be moved.
file(RELATIVE_PATH pc_to_prefix ${CMAKE_INSTALL_PREFIX}/${pkgconfig_dir} ${CMAKE_INSTALL_PREFIX})
configure_file(cmake/zsi.pc.in ${staging}/zsi.pc @ONLY)
install(FILES ${staging}/zsi.pc DESTINATION ${pkgconfig_dir} COMPONENT development)

if(ZSI_BUILD_HOST)
    install(TARGETS zsi RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT runtime)
    install(TARGETS zsi_host EXPORT zsiHost
        ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT development
        FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/zsi-host COMPONENT development)
    install(EXPORT zsiHost NAMESPACE zsi:: FILE zsiHostTargets.cmake
        DESTINATION ${package_dir} COMPONENT development)
    install(FILES cmake/hostDependencies.cmake
        DESTINATION ${package_dir} COMPONENT development)
    configure_file(cmake/zsi-host.pc.in ${staging}/zsi-host.pc @ONLY)
    install(FILES ${staging}/zsi-host.pc DESTINATION ${pkgconfig_dir} COMPONENT development)

    configure_file(host/cmd/zsi.1.in ${staging}/zsi.1 @ONLY)
    install(FILES ${staging}/zsi.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT runtime)
    # With the classes of this build; other libraries' are in what `zsi schema` writes.
    set(schema ${PROJECT_BINARY_DIR}/scene.schema.json)
    add_custom_command(OUTPUT ${schema}
        COMMAND zsi schema --shader-path ${PROJECT_BINARY_DIR}/shaders > ${schema}
        DEPENDS zsi description zephyrShaders64 VERBATIM)
    add_custom_target(schema ALL DEPENDS ${schema})
    install(FILES ${schema} DESTINATION ${CMAKE_INSTALL_DATADIR}/zsi COMPONENT runtime)
    if(TARGET blender_addon)
        install(FILES ${PROJECT_BINARY_DIR}/zsi-blender.zip
            DESTINATION ${CMAKE_INSTALL_DATADIR}/zsi COMPONENT runtime)
    endif()
    install(DIRECTORY scenes assets DESTINATION ${CMAKE_INSTALL_DATADIR}/zsi COMPONENT runtime)
endif()

if(ZSI_BUILD_PYTHON)
    install(TARGETS _core LIBRARY DESTINATION ${ZSI_INSTALL_PYTHONDIR}/zsi COMPONENT python)
    install(DIRECTORY ${PROJECT_BINARY_DIR}/python/zsi DESTINATION ${ZSI_INSTALL_PYTHONDIR}
        COMPONENT python FILES_MATCHING PATTERN *.py PATTERN *.pyi PATTERN py.typed
        PATTERN __pycache__ EXCLUDE)
endif()

set(doc_dir ${CMAKE_INSTALL_DATADIR}/doc)
install(FILES LICENSE DESTINATION ${doc_dir}/zsi RENAME copyright COMPONENT runtime)
install(FILES README.md CHANGELOG.md DESTINATION ${doc_dir}/zsi COMPONENT runtime)
install(DIRECTORY docs DESTINATION ${doc_dir}/zsi COMPONENT runtime)
install(FILES LICENSE DESTINATION ${doc_dir}/zsi-dev RENAME copyright COMPONENT development)
install(DIRECTORY examples DESTINATION ${doc_dir}/zsi-dev COMPONENT development)
if(ZSI_BUILD_PYTHON)
    install(FILES LICENSE DESTINATION ${doc_dir}/python3-zsi RENAME copyright COMPONENT python)
    install(DIRECTORY python/notebooks DESTINATION ${doc_dir}/python3-zsi COMPONENT python)
endif()
