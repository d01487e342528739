// Encoder settings from a description: which libavcodec encoder to open and with what options,
// as an AVDictionary for avcodec_open2 and as ffmpeg command-line arguments.
//
//   Tarvek::FFmpeg::EncoderSettings settings = Tarvek::FFmpeg::MakeEncoderSettings(*description);
//   const AVCodec* encoder = avcodec_find_encoder_by_name(settings.encoder.c_str());
//   AVCodecContext* context = avcodec_alloc_context3(encoder);
//   std::vector<std::string> left;
//   int result = Tarvek::FFmpeg::OpenEncoder(settings, *context, &left);
#ifndef TARVEK_FFMPEG_ENCODER_H_
#define TARVEK_FFMPEG_ENCODER_H_

#include <Tarvek/FFmpeg/Export.h>
#include <Tarvek/Formats.h>

#include <memory>
#include <string>
#include <vector>

struct AVCodecContext;
struct AVDictionary;

namespace Tarvek {
namespace FFmpeg {

/// Frees an AVDictionary (av_dict_free).
struct DictionaryFree {
  TARVEK_FFMPEG_API void operator()(AVDictionary* dictionary) const noexcept;
};
/// An owned AVDictionary.
using Dictionary = std::unique_ptr<AVDictionary, DictionaryFree>;

/// What to open an encoder with for a description.
struct EncoderSettings {
  /// libavcodec's name of the encoder ("libx264"): the first of the codec's encoders that the
  /// installed libavcodec has. Empty when it has none.
  std::string encoder;
  /// The options, by libavcodec's names (context options and the encoder's private ones):
  /// rate control, quality, passes, threads, flags, size, pixel aspect, time base, pixel format,
  /// sample rate, layout, profile, and the description's encode options the encoder knows.
  Dictionary options;
  /// The sample format (an AVSampleFormat) and frame rate, which are not options of the codec
  /// context; -1 and 0/0 when the description gives none.
  int sampleFormat = -1;
  int frameRateNum = 0;
  int frameRateDen = 0;
  /// The same settings as ffmpeg output options: "-c:v", "libx264", "-b:v", "5000000", ...
  std::vector<std::string> arguments;
  /// The description's encode options ("key=value") that the encoder has no option for: not
  /// among the options above, so never dropped silently.
  std::vector<std::string> unconsumed;
  /// One sentence for each setting of the description that the encoder cannot take.
  std::vector<std::string> notes;
};

/// The encoder settings for `description` (video, audio or subtitle): the encoder by codec
/// identifier (libx264, libx265, libvpx-vp9, libvpx, an AV1 encoder the library has, mpeg1video,
/// mpeg2video, mpeg4, mjpeg, prores_ks and dnxhd with their profiles, libtheora, ffv1, png, aac,
/// libopus, flac, alac, ac3, eac3, libmp3lame, mp2, libvorbis, dca, truehd, pcm_*; libavcodec's
/// default encoder for other codecs); bitrate mode "cbr" as the bitrate with equal minimum and
/// maximum rate and a one-second buffer, "vbr" as the encoder's own quality option (crf, qscale)
/// at the description's quality; two-pass as the first pass; threads, global header, lossless.
/// Throws only std::bad_alloc.
TARVEK_FFMPEG_API EncoderSettings MakeEncoderSettings(const Conf::IFormatCodec& description);

/// Opens `context`, allocated by avcodec_alloc_context3 for `settings.encoder`, with the
/// settings: the sample format and frame rate (and, when unset, a time base of one frame or one
/// sample), the encoder's private options, then avcodec_open2 with the remaining options.
/// Returns avcodec_open2's result (negative: an AVERROR code; also AVERROR_ENCODER_NOT_FOUND
/// when `context` is for another codec or the encoder is missing). The names of options the
/// encoder left unused are appended to `left` when given. Throws only std::bad_alloc.
TARVEK_FFMPEG_API int OpenEncoder(const EncoderSettings& settings, AVCodecContext& context,
                                  std::vector<std::string>* left = nullptr);

}  // namespace FFmpeg
}  // namespace Tarvek

#endif  // TARVEK_FFMPEG_ENCODER_H_
