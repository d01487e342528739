# Helpers that give every Tarvek target the same compiler settings.

# What a binary's run-time search path calls its own folder.
if(APPLE)
  set(TARVEK_ORIGIN "@loader_path")
else()
  set(TARVEK_ORIGIN "$ORIGIN")
endif()

# The warning list of our own targets; never pushed onto consumers.
function(tarvek_set_warnings target)
  target_compile_options(${target} PRIVATE -Wall -Wextra -Wpedantic -Wconversion
                                           -Wnon-virtual-dtor -Woverloaded-virtual)
  if(TARVEK_WERROR)
    target_compile_options(${target} PRIVATE -Werror)
  endif()
endfunction()

# Settings of every target built from our sources: C++17, warnings, and source paths recorded
# relative to the source root, so error locations read the same on every machine.
function(tarvek_configure_target target)
  target_compile_features(${target} PUBLIC cxx_std_17)
  set_target_properties(${target} PROPERTIES CXX_EXTENSIONS OFF)
  tarvek_set_warnings(${target})
  target_compile_options(${target} PRIVATE "-fmacro-prefix-map=${PROJECT_SOURCE_DIR}/=")
endfunction()

# tarvek_link_headers(<name> <folder>): makes <folder> reachable as <Tarvek/<name>...> in the
# build tree, as it is once installed.
function(tarvek_link_headers name folder)
  get_filename_component(parent "${TARVEK_BUILD_INCLUDE_DIR}/Tarvek/${name}" DIRECTORY)
  file(MAKE_DIRECTORY "${parent}")
  file(CREATE_LINK "${folder}" "${TARVEK_BUILD_INCLUDE_DIR}/Tarvek/${name}" SYMBOLIC)
endfunction()

# tarvek_add_library(<target> <export name> <output name> <export macro> sources...)
# A library exported as Tarvek::<export name>, shared or static as BUILD_SHARED_LIBS says. Shared,
# it hides every symbol it does not mark; static, it defines TARVEK_STATIC for itself and its
# users, which leaves the marks empty.
function(tarvek_add_library target export_name output_name export_macro)
  add_library(${target} ${ARGN})
  add_library(Tarvek::${export_name} ALIAS ${target})
  tarvek_configure_target(${target})
  target_include_directories(${target} PUBLIC "$<BUILD_INTERFACE:${TARVEK_BUILD_INCLUDE_DIR}>"
                                              "$<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>")
  get_target_property(type ${target} TYPE)
  if(type STREQUAL "STATIC_LIBRARY")
    target_compile_definitions(${target} PUBLIC TARVEK_STATIC)
  endif()
  set_target_properties(${target} PROPERTIES
    EXPORT_NAME ${export_name}
    OUTPUT_NAME ${output_name}
    VERSION ${PROJECT_VERSION}
    SOVERSION ${PROJECT_VERSION_MAJOR}
    INSTALL_NAME_DIR "@rpath"
    # Installed libraries find their sibling libraries wherever the prefix is.
    INSTALL_RPATH "${TARVEK_ORIGIN}")
  # Set while the library's own sources are compiled, shared or static.
  target_compile_definitions(${target} PRIVATE ${export_macro})
endfunction()

# tarvek_install_library(<target> HEADERS_TO <folder under include/Tarvek> [HEADERS files...]
#                        [COMPONENT <name>] DESCRIPTION <text> [REQUIRES modules...]
#                        [REQUIRES_PRIVATE modules...] [LIBS_PRIVATE flags...]
#                        [CFLAGS flags...])
# Installs the library, its public headers, and a pkg-config file named after its output name. A
# library of a component goes to the export set Tarvek<component>Targets, read by the package
# configuration only when that component is asked for.
function(tarvek_install_library target)
  if(NOT TARVEK_FORMATS_INSTALL)
    return()
  endif()
  cmake_parse_arguments(arg "" "HEADERS_TO;COMPONENT;DESCRIPTION"
                        "HEADERS;REQUIRES;REQUIRES_PRIVATE;LIBS_PRIVATE;CFLAGS" ${ARGN})
  if(NOT arg_COMPONENT)
    set(arg_COMPONENT Formats)
  endif()
  install(TARGETS ${target} EXPORT Tarvek${arg_COMPONENT}Targets
          LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}"
          ARCHIVE DESTINATION "${CMAKE_INSTALL_LIBDIR}"
          RUNTIME DESTINATION "${CMAKE_INSTALL_BINDIR}")
  install(FILES ${arg_HEADERS} DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/Tarvek/${arg_HEADERS_TO}")
  set_property(GLOBAL APPEND PROPERTY TARVEK_COMPONENTS ${arg_COMPONENT})

  get_target_property(PC_NAME ${target} OUTPUT_NAME)
  set(PC_DESCRIPTION "${arg_DESCRIPTION}")
  string(REPLACE ";" " " PC_REQUIRES "${arg_REQUIRES}")
  string(REPLACE ";" " " PC_REQUIRES_PRIVATE "${arg_REQUIRES_PRIVATE}")
  string(REPLACE ";" " " PC_LIBS_PRIVATE "${arg_LIBS_PRIVATE}")
  string(REPLACE ";" " " PC_CFLAGS "${arg_CFLAGS}")
  if(PC_CFLAGS)
    set(PC_CFLAGS " ${PC_CFLAGS}")
  endif()
  get_target_property(type ${target} TYPE)
  if(type STREQUAL "STATIC_LIBRARY")
    string(APPEND PC_CFLAGS " -DTARVEK_STATIC")
  endif()
  file(RELATIVE_PATH PC_TO_PREFIX "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
  string(REGEX REPLACE "/$" "" PC_TO_PREFIX "${PC_TO_PREFIX}")
  configure_file("${PROJECT_SOURCE_DIR}/cmake/tarvek-library.pc.in"
                 "${PROJECT_BINARY_DIR}/pkgconfig/${PC_NAME}.pc" @ONLY)
  install(FILES "${PROJECT_BINARY_DIR}/pkgconfig/${PC_NAME}.pc"
          DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
endfunction()
