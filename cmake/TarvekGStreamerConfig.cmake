# Component GStreamer of the TarvekFormats package: Tarvek::GStreamer, with Tarvek::CodecString,
# which it links.
include("${CMAKE_CURRENT_LIST_DIR}/TarvekCodecStringConfig.cmake")
if(NOT TARGET PkgConfig::TARVEK_GST)
  pkg_check_modules(TARVEK_GST QUIET IMPORTED_TARGET gstreamer-1.0)
endif()
if(NOT TARGET PkgConfig::TARVEK_GST_FORMATS)
  pkg_check_modules(TARVEK_GST_FORMATS QUIET IMPORTED_TARGET gstreamer-video-1.0
                    gstreamer-audio-1.0 libavutil)
endif()
if(TarvekFormats_CodecString_FOUND AND TARGET PkgConfig::TARVEK_GST
   AND TARGET PkgConfig::TARVEK_GST_FORMATS
   AND EXISTS "${CMAKE_CURRENT_LIST_DIR}/TarvekGStreamerTargets.cmake")
  include("${CMAKE_CURRENT_LIST_DIR}/TarvekGStreamerTargets.cmake")
  set(TarvekFormats_GStreamer_FOUND TRUE)
else()
  set(TarvekFormats_GStreamer_FOUND FALSE)
endif()
