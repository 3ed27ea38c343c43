# A Debian package of the host build (cpack -G DEB in the build directory): everything the
# install rules install (libraries, host layer, tools, headers, pkg-config and CMake files,
# examples and docs) under /usr.
#
# Run-time dependencies are read off the installed programs and libraries by dpkg-shlibdeps
# (dpkg-dev); the headers and the pkg-config and CMake files also need the Android host
# libraries' development packages.
set(CPACK_PACKAGE_NAME "velmora")
set(CPACK_PACKAGE_VENDOR "Velmora developers")
set(CPACK_PACKAGE_CONTACT "Velmora developers <velmora@localhost>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY
    "Performance server library with its Linux host platform layer and tools")
set(CPACK_PACKAGE_DESCRIPTION
    "libvelmora, the performance server of a mobile device's vendor layer, built for a Linux host
with its host platform layer (a simulated device), velmora-replay (event trace replay),
velmora-lint (configuration checker), velmora-import-logcat (device logs into traces),
velmora-fleet (many sessions under two configurations), velmora-synth (generated sessions),
headers, pkg-config and CMake files, the example
configuration and traces, and the documentation.")
set(CPACK_PACKAGING_INSTALL_PREFIX "/usr")
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION "devel")
set(CPACK_STRIP_FILES ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
# python3 for velmora-fleet; python3-distributed only for its --scheduler, so only suggested.
set(CPACK_DEBIAN_PACKAGE_DEPENDS
    "android-libutils-dev, android-liblog-dev, android-libcutils-dev, python3")
set(CPACK_DEBIAN_PACKAGE_SUGGESTS "python3-distributed")
set(CPACK_GENERATOR "DEB")
include(CPack)
