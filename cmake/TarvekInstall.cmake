# Installs the libraries, the public headers under <prefix>/include/Tarvek, a CMake package
# (find_package(TarvekFormats) -> Tarvek::Formats) and the pkg-config file tarvek-formats.pc.
include(CMakePackageConfigHelpers)

set(TARVEK_CMAKE_DIR "${CMAKE_INSTALL_LIBDIR}/cmake/TarvekFormats")

install(TARGETS TarvekAVUtilHeaders TarvekCore TarvekConfInterfaces TarvekMediaWrapper
                TarvekPresets TarvekFormats TarvekInspect
        EXPORT TarvekFormatsTargets
        LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}"
        ARCHIVE DESTINATION "${CMAKE_INSTALL_LIBDIR}"
        RUNTIME DESTINATION "${CMAKE_INSTALL_BINDIR}")

install(FILES "${PROJECT_SOURCE_DIR}/Formats.h"
        DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/Tarvek")
install(FILES "${PROJECT_SOURCE_DIR}/platform/MediaWrapper/Reduce.h"
        DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/Tarvek/MediaWrapper")
install(FILES "${PROJECT_SOURCE_DIR}/platform/Presets/BitratePresets.h"
        DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/Tarvek/Presets")
foreach(dir Core/Interfaces Core/Errors Conf/Interfaces Conf/Formats)
  install(DIRECTORY "${PROJECT_SOURCE_DIR}/${dir}/"
          DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/Tarvek/${dir}"
          FILES_MATCHING PATTERN "*.h")
endforeach()

install(EXPORT TarvekFormatsTargets NAMESPACE Tarvek:: DESTINATION "${TARVEK_CMAKE_DIR}")

configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/TarvekFormatsConfig.cmake.in"
                              "${PROJECT_BINARY_DIR}/TarvekFormatsConfig.cmake"
                              INSTALL_DESTINATION "${TARVEK_CMAKE_DIR}")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/TarvekFormatsConfigVersion.cmake"
                                 COMPATIBILITY SameMinorVersion)
install(FILES "${PROJECT_BINARY_DIR}/TarvekFormatsConfig.cmake"
              "${PROJECT_BINARY_DIR}/TarvekFormatsConfigVersion.cmake"
        DESTINATION "${TARVEK_CMAKE_DIR}")

file(RELATIVE_PATH TARVEK_PC_TO_PREFIX "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
string(REGEX REPLACE "/$" "" TARVEK_PC_TO_PREFIX "${TARVEK_PC_TO_PREFIX}")
configure_file("${PROJECT_SOURCE_DIR}/cmake/tarvek-formats.pc.in"
               "${PROJECT_BINARY_DIR}/tarvek-formats.pc" @ONLY)
install(FILES "${PROJECT_BINARY_DIR}/tarvek-formats.pc"
        DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
