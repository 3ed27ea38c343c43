# Install rules: the two libraries, the tools, the public headers under include/velmora (the
# list in VelmoraPublicHeaders.cmake), a pkg-config file per library, a CMake package
# (find_package(velmora) gives velmora::velmora and velmora::velmora_host), and under
# share/velmora everything in examples/ and docs/.
#
# Two components, which the Debian package makes two packages of (VelmoraPackage.cmake):
# runtime (the libraries, the tools, examples and docs) and dev (headers, the libraries' link
# names, CMake and pkg-config files).
#
# Included by the top-level CMakeLists right after the velmora target exists; the host layer's
# target is defined later (host/), so the rules run deferred, at the end of the top directory.
# Libraries go to the multiarch directory (lib/x86_64-linux-gnu) where the toolchain names one,
# as Debian's own libraries do, for a prefix install as for the package.
if(NOT DEFINED CMAKE_INSTALL_LIBDIR AND CMAKE_LIBRARY_ARCHITECTURE)
    set(CMAKE_INSTALL_LIBDIR "lib/${CMAKE_LIBRARY_ARCHITECTURE}" CACHE PATH
        "Object code libraries (LIBDIR)")
endif()
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(VELMORA_INSTALL_CMAKEDIR "${CMAKE_INSTALL_LIBDIR}/cmake/velmora")
include(${CMAKE_CURRENT_LIST_DIR}/VelmoraPublicHeaders.cmake)
set(VELMORA_INSTALL_DATADIR "${CMAKE_INSTALL_DATADIR}/velmora")

# Installed files find each other relative to their own place ($ORIGIN), so that an install
# prefix or an unpacked package can move; the Android host libraries stay outside the loader's
# default search path wherever we are. Programs are made after this point (host/, tools/) and
# take the run path from here; the libraries get theirs in velmora_install_rules.
file(RELATIVE_PATH VELMORA_BIN_TO_LIB "/prefix/${CMAKE_INSTALL_BINDIR}"
     "/prefix/${CMAKE_INSTALL_LIBDIR}")
set(CMAKE_INSTALL_RPATH "$ORIGIN/${VELMORA_BIN_TO_LIB};${ANDROID_LIBRARY_DIR}")
# Where velmora-replay looks for the installed example, relative to its own directory.
file(RELATIVE_PATH VELMORA_BIN_TO_EXAMPLES "/prefix/${CMAKE_INSTALL_BINDIR}"
     "/prefix/${VELMORA_INSTALL_DATADIR}/examples")

function(velmora_install_rules)
    set(targets velmora)
    if(TARGET velmora_host)
        list(APPEND targets velmora_host)
    endif()
    set_target_properties(${targets} PROPERTIES INSTALL_RPATH "$ORIGIN;${ANDROID_LIBRARY_DIR}")
    install(TARGETS ${targets} EXPORT velmoraTargets
            LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT dev
            ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT dev
            RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT runtime)
    foreach(tool velmora-replay velmora-lint velmora-import-logcat velmora-synth)
        if(TARGET ${tool})
            install(TARGETS ${tool} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT runtime)
        endif()
    endforeach()
    # velmora-fleet and its Python package: tools/CMakeLists.txt, which lists the files.
    install(DIRECTORY "${PROJECT_SOURCE_DIR}/examples" "${PROJECT_SOURCE_DIR}/docs"
            DESTINATION "${VELMORA_INSTALL_DATADIR}" COMPONENT runtime)
    foreach(header IN LISTS VELMORA_PUBLIC_HEADERS)
        get_filename_component(dir "${header}" DIRECTORY)
        install(FILES "${PROJECT_SOURCE_DIR}/${header}"
                DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/velmora/${dir}" COMPONENT dev)
    endforeach()

    install(EXPORT velmoraTargets NAMESPACE velmora:: DESTINATION ${VELMORA_INSTALL_CMAKEDIR}
            COMPONENT dev)
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
            DESTINATION ${VELMORA_INSTALL_CMAKEDIR} COMPONENT dev)

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
                DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig" COMPONENT dev)
    endforeach()
endfunction()

cmake_language(DEFER DIRECTORY "${PROJECT_SOURCE_DIR}" CALL velmora_install_rules)

include(${CMAKE_CURRENT_LIST_DIR}/VelmoraPackage.cmake)
