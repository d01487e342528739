# Component FFmpeg of the TarvekFormats package: Tarvek::FFmpeg, the FFmpeg bridge, found when
# pkg-config finds libavformat, libavcodec and libavutil (its functions take their structures).
pkg_check_modules(TARVEK_LIBAV QUIET IMPORTED_TARGET libavformat libavcodec libavutil)
if(TARVEK_LIBAV_FOUND)
  include("${CMAKE_CURRENT_LIST_DIR}/TarvekFFmpegTargets.cmake")
  set(TarvekFormats_FFmpeg_FOUND TRUE)
else()
  set(TarvekFormats_FFmpeg_FOUND FALSE)
  set(TarvekFormats_NOT_FOUND_MESSAGE
      "component FFmpeg: libavformat, libavcodec or libavutil (pkg-config) was not found")
endif()
