# The Debian packages of the host build (cpack -G DEB in the build directory), under /usr, one
# per install component (VelmoraInstall.cmake):
#   velmora      the libraries, the host layer, the tools, examples and docs
#   velmora-dev  headers, the libraries' link names, pkg-config and CMake files
#
# The run-time dependencies of velmora are read off its programs and libraries by
# dpkg-shlibdeps (dpkg-dev); it declares its own shared libraries (shlibs) and activates the
# ldconfig trigger. velmora-dev needs velmora of the same version and the development packages
# its headers and CMake files refer to. Each package carries its copyright and changelog
# (packaging/debian), and velmora the one lintian override it needs: the run path to Debian's
# private directory of the Android host libraries, which Debian's own users of those libraries
# carry too. The install.lintian test runs lintian on the packages: no error allowed.
set(CPACK_PACKAGE_NAME "velmora")
set(CPACK_PACKAGE_VENDOR "Velmora developers")
set(VELMORA_PACKAGE_MAINTAINER "Velmora developers <velmora-dev@example.org>" CACHE STRING
    "Maintainer field of the Debian packages")
set(CPACK_PACKAGE_CONTACT "${VELMORA_PACKAGE_MAINTAINER}")
set(CPACK_DEBIAN_PACKAGE_MAINTAINER "${VELMORA_PACKAGE_MAINTAINER}")
# No package-wide summary: CPack would put it before each package's own first line.
set(CPACK_PACKAGING_INSTALL_PREFIX "/usr")
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_STRIP_FILES ON)
set(CPACK_GENERATOR "DEB")

set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL runtime dev)
set(CPACK_COMPONENTS_GROUPING IGNORE)

set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME "velmora")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION "libs")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SHLIBDEPS ON)
# python3 for velmora-fleet; python3-distributed only for its --scheduler, so only suggested.
set(CPACK_DEBIAN_RUNTIME_PACKAGE_DEPENDS "python3")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SUGGESTS "python3-distributed")
set(CPACK_DEBIAN_RUNTIME_DESCRIPTION
    "performance server library with a Linux host layer
libvelmora, the performance server of a mobile device's vendor layer, built
for a Linux host with its host platform layer (a simulated device), and the
tools: velmora-replay (event trace replay), velmora-lint (configuration
checker), velmora-import-logcat (device logs into traces), velmora-fleet
(many sessions under two configurations), velmora-synth (generated
sessions), with the example configuration, traces and the documentation.")

set(CPACK_DEBIAN_DEV_PACKAGE_NAME "velmora-dev")
set(CPACK_DEBIAN_DEV_PACKAGE_SECTION "libdevel")
set(VELMORA_DEBIAN_VERSION "${PROJECT_VERSION}-${CPACK_DEBIAN_PACKAGE_RELEASE}")
set(CPACK_DEBIAN_DEV_PACKAGE_DEPENDS
    "velmora (= ${VELMORA_DEBIAN_VERSION}), android-libutils-dev, android-liblog-dev, android-libcutils-dev, libtinyxml2-dev")
set(CPACK_DEBIAN_DEV_DESCRIPTION
    "performance server library with a Linux host layer - development files
Headers, pkg-config files (velmora, velmora-host) and a CMake package
(find_package(velmora)) for building programs against libvelmora and its
host platform layer.")

# Copyright, changelog (compressed as Debian wants it) and the lintian override, per package.
set(VELMORA_DEBIAN_DIR "${PROJECT_BINARY_DIR}/debian")
file(MAKE_DIRECTORY "${VELMORA_DEBIAN_DIR}")
execute_process(
    COMMAND sh -c "gzip -9n < '${PROJECT_SOURCE_DIR}/packaging/debian/changelog' > '${VELMORA_DEBIAN_DIR}/changelog.Debian.gz'"
    RESULT_VARIABLE VELMORA_GZIP_RESULT)
if(NOT VELMORA_GZIP_RESULT EQUAL 0)
    message(FATAL_ERROR "gzip of packaging/debian/changelog failed")
endif()
foreach(component runtime dev)
    string(TOUPPER ${component} upper)
    set(package ${CPACK_DEBIAN_${upper}_PACKAGE_NAME})
    install(FILES "${PROJECT_SOURCE_DIR}/packaging/debian/copyright"
                  "${VELMORA_DEBIAN_DIR}/changelog.Debian.gz"
            DESTINATION "${CMAKE_INSTALL_DATADIR}/doc/${package}" COMPONENT ${component})
endforeach()
# The libraries' shlibs, and the ldconfig trigger rather than maintainer scripts calling it.
configure_file("${PROJECT_SOURCE_DIR}/packaging/debian/shlibs.in" "${VELMORA_DEBIAN_DIR}/shlibs"
               @ONLY)
# CPack writes postinst and postrm calling ldconfig for libraries under /usr/lib unless the
# package brings its own: these do nothing, the trigger refreshes the cache.
file(WRITE "${VELMORA_DEBIAN_DIR}/triggers" "activate-noawait ldconfig\n")
foreach(script postinst postrm)
    file(WRITE "${VELMORA_DEBIAN_DIR}/${script}"
         "#!/bin/sh\n# The ldconfig trigger (triggers) refreshes the libraries' cache.\nset -e\nexit 0\n")
endforeach()
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA
    "${VELMORA_DEBIAN_DIR}/shlibs;${VELMORA_DEBIAN_DIR}/triggers;${VELMORA_DEBIAN_DIR}/postinst;${VELMORA_DEBIAN_DIR}/postrm")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_STRICT_PERMISSION ON)
configure_file("${PROJECT_SOURCE_DIR}/packaging/debian/velmora.lintian-overrides.in"
               "${VELMORA_DEBIAN_DIR}/velmora" @ONLY)
install(FILES "${VELMORA_DEBIAN_DIR}/velmora" DESTINATION "${CMAKE_INSTALL_DATADIR}/lintian/overrides"
        COMPONENT runtime)
include(CPack)
