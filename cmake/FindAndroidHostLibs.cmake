# Finds the Android host libraries Debian ships (android-libutils-dev, android-liblog-dev,
# android-libcutils-dev). Headers live under /usr/include/android, libraries under
# /usr/lib/<multiarch>/android. Defines the imported targets Android::utils, Android::log and
# Android::cutils (atrace; on a host its trace calls are stubs).

find_path(ANDROID_INCLUDE_DIR utils/String8.h PATH_SUFFIXES android)
find_path(ANDROID_LOG_INCLUDE_DIR log/log.h PATH_SUFFIXES android)
find_library(ANDROID_UTILS_LIBRARY NAMES utils PATH_SUFFIXES android
             PATHS /usr/lib/${CMAKE_LIBRARY_ARCHITECTURE}/android)
find_library(ANDROID_LOG_LIBRARY NAMES log PATH_SUFFIXES android
             PATHS /usr/lib/${CMAKE_LIBRARY_ARCHITECTURE}/android)
find_path(ANDROID_CUTILS_INCLUDE_DIR cutils/trace.h PATH_SUFFIXES android)
find_library(ANDROID_CUTILS_LIBRARY NAMES cutils PATH_SUFFIXES android
             PATHS /usr/lib/${CMAKE_LIBRARY_ARCHITECTURE}/android)

include(FindPackageHandleStandardArgs)
find_package_handle_standard_args(AndroidHostLibs DEFAULT_MSG ANDROID_INCLUDE_DIR
                                  ANDROID_LOG_INCLUDE_DIR ANDROID_UTILS_LIBRARY
                                  ANDROID_LOG_LIBRARY ANDROID_CUTILS_INCLUDE_DIR
                                  ANDROID_CUTILS_LIBRARY)

if(AndroidHostLibs_FOUND AND NOT TARGET Android::log)
    add_library(Android::log UNKNOWN IMPORTED)
    set_target_properties(Android::log PROPERTIES
        IMPORTED_LOCATION "${ANDROID_LOG_LIBRARY}"
        INTERFACE_SYSTEM_INCLUDE_DIRECTORIES "${ANDROID_LOG_INCLUDE_DIR}"
        INTERFACE_INCLUDE_DIRECTORIES "${ANDROID_LOG_INCLUDE_DIR}")
    add_library(Android::utils UNKNOWN IMPORTED)
    set_target_properties(Android::utils PROPERTIES
        IMPORTED_LOCATION "${ANDROID_UTILS_LIBRARY}"
        INTERFACE_SYSTEM_INCLUDE_DIRECTORIES "${ANDROID_INCLUDE_DIR}"
        INTERFACE_INCLUDE_DIRECTORIES "${ANDROID_INCLUDE_DIR}"
        INTERFACE_LINK_LIBRARIES Android::log)
    add_library(Android::cutils UNKNOWN IMPORTED)
    set_target_properties(Android::cutils PROPERTIES
        IMPORTED_LOCATION "${ANDROID_CUTILS_LIBRARY}"
        INTERFACE_SYSTEM_INCLUDE_DIRECTORIES "${ANDROID_CUTILS_INCLUDE_DIR}"
        INTERFACE_INCLUDE_DIRECTORIES "${ANDROID_CUTILS_INCLUDE_DIR}")
    get_filename_component(ANDROID_LIBRARY_DIR "${ANDROID_UTILS_LIBRARY}" DIRECTORY)
endif()
mark_as_advanced(ANDROID_INCLUDE_DIR ANDROID_LOG_INCLUDE_DIR ANDROID_UTILS_LIBRARY
                 ANDROID_LOG_LIBRARY ANDROID_CUTILS_INCLUDE_DIR ANDROID_CUTILS_LIBRARY)
