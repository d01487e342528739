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

# tarvek_add_library(<target> <export name> <output name> <export macro> sources...)
# A shared library with hidden symbols, exported as Tarvek::<export name>.
function(tarvek_add_library target export_name output_name export_macro)
  add_library(${target} SHARED ${ARGN})
  add_library(Tarvek::${export_name} ALIAS ${target})
  tarvek_configure_target(${target})
  target_include_directories(${target} PUBLIC "$<BUILD_INTERFACE:${TARVEK_BUILD_INCLUDE_DIR}>"
                                              "$<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>")
  set_target_properties(${target} PROPERTIES
    EXPORT_NAME ${export_name}
    OUTPUT_NAME ${output_name}
    DEFINE_SYMBOL ${export_macro}
    VERSION ${PROJECT_VERSION}
    SOVERSION ${PROJECT_VERSION_MAJOR}
    INSTALL_NAME_DIR "@rpath"
    # Installed libraries find their sibling libraries wherever the prefix is.
    INSTALL_RPATH "${TARVEK_ORIGIN}")
endfunction()
