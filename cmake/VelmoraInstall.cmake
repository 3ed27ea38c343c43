# Install rules: the two libraries, the public headers under include/velmora, a pkg-config file
# per library and a CMake package (find_package(velmora) gives velmora::velmora and
# velmora::velmora_host).
#
# Included by the top-level CMakeLists right after the velmora target exists; the host layer's
# target is defined later (host/), so the rules run deferred, at the end of the top directory.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(VELMORA_INSTALL_CMAKEDIR "${CMAKE_INSTALL_LIBDIR}/cmake/velmora")
set(VELMORA_PUBLIC_HEADER_DIRS server config platform freq sched probe report compat host)

function(velmora_install_rules)
    set(targets velmora)
    if(TARGET velmora_host)
        list(APPEND targets velmora_host)
    endif()
    install(TARGETS ${targets} EXPORT velmoraTargets
            LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
            ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
            RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
    if(TARGET velmora-replay)
        install(TARGETS velmora-replay RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
    endif()
    foreach(dir IN LISTS VELMORA_PUBLIC_HEADER_DIRS)
        if(EXISTS "${PROJECT_SOURCE_DIR}/${dir}")
            install(DIRECTORY "${PROJECT_SOURCE_DIR}/${dir}/"
                    DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/velmora/${dir}"
                    FILES_MATCHING PATTERN "*.h")
        endif()
    endforeach()

    install(EXPORT velmoraTargets NAMESPACE velmora:: DESTINATION ${VELMORA_INSTALL_CMAKEDIR})
    configure_package_config_file(
        "${PROJECT_SOURCE_DIR}/cmake/velmoraConfig.cmake.in"
        "${PROJECT_BINARY_DIR}/velmoraConfig.cmake"
        INSTALL_DESTINATION ${VELMORA_INSTALL_CMAKEDIR})
    write_basic_package_version_file("${PROJECT_BINARY_DIR}/velmoraConfigVersion.cmake"
                                     VERSION ${PROJECT_VERSION} COMPATIBILITY SameMajorVersion)
    # The exported targets link the Android host libraries through this find module.
    install(FILES "${PROJECT_BINARY_DIR}/velmoraConfig.cmake"
                  "${PROJECT_BINARY_DIR}/velmoraConfigVersion.cmake"
                  "${PROJECT_SOURCE_DIR}/cmake/FindAndroidHostLibs.cmake"
            DESTINATION ${VELMORA_INSTALL_CMAKEDIR})

    # Relocatable: the prefix is found from the .pc file's own place.
    file(RELATIVE_PATH VELMORA_PC_TO_PREFIX "/prefix/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/prefix")
    string(REGEX REPLACE "/$" "" VELMORA_PC_TO_PREFIX "${VELMORA_PC_TO_PREFIX}")
    foreach(pc velmora velmora-host)
        if(pc STREQUAL "velmora-host" AND NOT TARGET velmora_host)
            continue()
        endif()
        configure_file("${PROJECT_SOURCE_DIR}/cmake/${pc}.pc.in"
                       "${PROJECT_BINARY_DIR}/${pc}.pc" @ONLY)
        install(FILES "${PROJECT_BINARY_DIR}/${pc}.pc"
                DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
    endforeach()
endfunction()

cmake_language(DEFER DIRECTORY "${PROJECT_SOURCE_DIR}" CALL velmora_install_rules)
