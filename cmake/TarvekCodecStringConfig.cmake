# Component CodecString of the TarvekFormats package: Tarvek::CodecString.
if(NOT TARGET PkgConfig::TARVEK_CODEC_STRING_AVUTIL)
  pkg_check_modules(TARVEK_CODEC_STRING_AVUTIL QUIET IMPORTED_TARGET libavutil)
endif()
if(TARGET PkgConfig::TARVEK_CODEC_STRING_AVUTIL
   AND EXISTS "${CMAKE_CURRENT_LIST_DIR}/TarvekCodecStringTargets.cmake")
  include("${CMAKE_CURRENT_LIST_DIR}/TarvekCodecStringTargets.cmake")
  set(TarvekFormats_CodecString_FOUND TRUE)
else()
  set(TarvekFormats_CodecString_FOUND FALSE)
endif()
