# The build identifier: 16 lowercase hexadecimal digits drawn once per configure
# and compiled into everything built in this tree, so a module and an engine
# built together agree and a separately built engine does not.
if(NOT TARGET renderlib_build_id)
  if(NOT RENDERLIB_BUILD_ID)
    string(RANDOM LENGTH 16 ALPHABET "0123456789abcdef" RENDERLIB_BUILD_ID)
  endif()
  if(NOT RENDERLIB_BUILD_ID MATCHES "^[0-9a-f]+$")
    message(FATAL_ERROR "RENDERLIB_BUILD_ID must be 16 lowercase hexadecimal digits")
  endif()
  string(LENGTH "${RENDERLIB_BUILD_ID}" _build_id_length)
  if(NOT _build_id_length EQUAL 16)
    message(FATAL_ERROR "RENDERLIB_BUILD_ID must be 16 lowercase hexadecimal digits")
  endif()
  message(STATUS "Build identifier: ${RENDERLIB_BUILD_ID}")
  set(_build_id_dir "${CMAKE_BINARY_DIR}/generated/build-id")
  file(WRITE "${_build_id_dir}/build_id.h.in"
    "#pragma once\n/* Written by the build: the identifier shared by module and engine. */\n#define RENDERLIB_BUILD_ID \"@RENDERLIB_BUILD_ID@\"\n")
  configure_file("${_build_id_dir}/build_id.h.in" "${_build_id_dir}/build_id.h" @ONLY)
  add_library(renderlib_build_id INTERFACE)
  target_include_directories(renderlib_build_id INTERFACE "${_build_id_dir}")
endif()
