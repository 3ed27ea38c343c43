# Interface checks, as CTest tests of every build that has tests:
#   abi.<arch>          scripts/check-abi: field and virtual-slot layout of the host-facing types
#                       and the exported symbols of libvelmora.so, against abi/<arch>/
#   abi.exports         scripts/check-exports: libvelmora.so exports nothing outside its
#                       interface (every flavour, sanitizers included)
#   android_bp.sources  scripts/check-android-bp: Android.bp builds the sources of `velmora`
#   android_bp.build    scripts/build-android-bp: Android.bp, turned into a Makefile by
#                       mini-soong, builds a hardened libvelmora.so with the same exports
#                       (skipped where mini-soong is missing)
# Included at the end of the top-level CMakeLists.
if(NOT BUILD_TESTING)
    return()
endif()

add_test(NAME abi.exports
         COMMAND ${PROJECT_SOURCE_DIR}/scripts/check-exports ${PROJECT_BINARY_DIR})

# Sanitizer builds export instrumentation symbols of their own; the reference describes the
# plain library.
if(VELMORA_SANITIZE STREQUAL "" AND CMAKE_SYSTEM_PROCESSOR MATCHES "^(x86_64|aarch64)$")
    add_test(NAME abi.${CMAKE_SYSTEM_PROCESSOR}
             COMMAND ${PROJECT_SOURCE_DIR}/scripts/check-abi ${PROJECT_BINARY_DIR}
                     ${CMAKE_SYSTEM_PROCESSOR})
endif()
# Natively only: mini-soong builds for the machine it runs on.
if(VELMORA_SANITIZE STREQUAL "" AND NOT CMAKE_CROSSCOMPILING)
    add_test(NAME android_bp.build
             COMMAND ${PROJECT_SOURCE_DIR}/scripts/build-android-bp ${PROJECT_BINARY_DIR})
    set_tests_properties(android_bp.build PROPERTIES SKIP_RETURN_CODE 77 TIMEOUT 600)
endif()

find_package(Python3 COMPONENTS Interpreter QUIET)
if(Python3_Interpreter_FOUND)
    add_test(NAME android_bp.sources
             COMMAND ${Python3_EXECUTABLE} ${PROJECT_SOURCE_DIR}/scripts/check-android-bp
                     ${PROJECT_BINARY_DIR})
endif()
