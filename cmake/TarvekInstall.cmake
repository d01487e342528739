# The CMake package TarvekFormats: the export sets that tarvek_install_library filled, the package
# configuration and its version. Each optional component <C> installs its export set
# Tarvek<C>Targets and cmake/Tarvek<C>Config.cmake, which finds the component's own dependencies,
# includes its targets and sets TarvekFormats_<C>_FOUND.
include(CMakePackageConfigHelpers)

set(TARVEK_CMAKE_DIR "${CMAKE_INSTALL_LIBDIR}/cmake/TarvekFormats")

install(TARGETS TarvekAVUtilHeaders EXPORT TarvekFormatsTargets)
install(FILES "${PROJECT_SOURCE_DIR}/Conf/Formats/Formats.h"
        DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/Tarvek")

get_property(components GLOBAL PROPERTY TARVEK_COMPONENTS)
list(REMOVE_DUPLICATES components)
set(TARVEK_OPTIONAL_COMPONENTS "")
foreach(component IN LISTS components)
  install(EXPORT Tarvek${component}Targets NAMESPACE Tarvek:: DESTINATION "${TARVEK_CMAKE_DIR}")
  if(NOT component STREQUAL "Formats")
    list(APPEND TARVEK_OPTIONAL_COMPONENTS ${component})
    install(FILES "${PROJECT_SOURCE_DIR}/cmake/Tarvek${component}Config.cmake"
            DESTINATION "${TARVEK_CMAKE_DIR}")
  endif()
endforeach()
string(REPLACE ";" ", " TARVEK_OPTIONAL_COMPONENTS "${TARVEK_OPTIONAL_COMPONENTS}")
if(NOT TARVEK_OPTIONAL_COMPONENTS)
  set(TARVEK_OPTIONAL_COMPONENTS "none in this build")
endif()

configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/TarvekFormatsConfig.cmake.in"
                              "${PROJECT_BINARY_DIR}/TarvekFormatsConfig.cmake"
                              INSTALL_DESTINATION "${TARVEK_CMAKE_DIR}")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/TarvekFormatsConfigVersion.cmake"
                                 COMPATIBILITY SameMinorVersion)
install(FILES "${PROJECT_BINARY_DIR}/TarvekFormatsConfig.cmake"
              "${PROJECT_BINARY_DIR}/TarvekFormatsConfigVersion.cmake"
        DESTINATION "${TARVEK_CMAKE_DIR}")
