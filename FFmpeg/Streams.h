// Descriptions of FFmpeg streams and back: a description from libavcodec's codec parameters,
// or from a stream of a file opened with libavformat (with what the container adds), and codec
// parameters from a description.
//
//   AVFormatContext* input = ...;  // avformat_open_input, avformat_find_stream_info
//   Tarvek::FFmpeg::StreamDescription stream = Tarvek::FFmpeg::DescribeStream(*input, 0);
//   for (const std::string& note : stream.notes) std::cerr << note << '\n';
//
// Values the interfaces have no setter for live in the metadata child under FFmpeg's option
// names (the Keys below), so that JSON, diff and validate carry them.
#ifndef TARVEK_FFMPEG_STREAMS_H_
#define TARVEK_FFMPEG_STREAMS_H_

#include <Tarvek/FFmpeg/Export.h>
#include <Tarvek/Formats.h>

#include <functional>
#include <string>
#include <vector>

struct AVCodecParameters;
struct AVFormatContext;

namespace Tarvek {
namespace FFmpeg {

/// The metadata children a stream's description may hold, named as FFmpeg's options are.
namespace Keys {
inline constexpr char kProfile[] = "profile";  ///< integer, libavcodec's profile number
inline constexpr char kLevel[] = "level";      ///< integer, libavcodec's level number
inline constexpr char kBitsPerRawSample[] = "bits_per_raw_sample";  ///< integer
inline constexpr char kFieldOrder[] = "field_order";  ///< "progressive", "tt", "bb", "tb", "bt"
inline constexpr char kColorPrimaries[] = "color_primaries";         ///< libavutil's name, "bt709"
inline constexpr char kColorTransfer[] = "color_trc";                ///< libavutil's name
inline constexpr char kColorSpace[] = "colorspace";                  ///< libavutil's name
inline constexpr char kColorRange[] = "color_range";                 ///< "tv" or "pc"
inline constexpr char kChromaLocation[] = "chroma_sample_location";  ///< libavutil's name
inline constexpr char kRotation[] = "rotation";        ///< integer degrees, as libavutil reads them
inline constexpr char kDisposition[] = "disposition";  ///< flags joined by '+': "default+forced"
inline constexpr char kTitle[] = "title";              ///< video and audio (subtitles: SetTitle)
inline constexpr char kLanguage[] = "language";        ///< video (audio: SetLanguage)
inline constexpr char kDuration[] = "duration";        ///< integer, microseconds
inline constexpr char kBitrateSource[] = "bitrate_source";  ///< see BitrateSourceName
/// integer, audio whose channels have no speaker order the library can hold: their count
inline constexpr char kChannels[] = "channels";
}  // namespace Keys

/// A stream's description and what could not go into it.
struct StreamDescription {
  /// A video, audio or subtitle description by the stream's kind; the generic codec description
  /// for other kinds. Never null.
  boost::intrusive_ptr<Conf::IFormatCodec> description;
  /// One sentence for each value that is unknown or invalid in the input and therefore left
  /// unset ("the pixel aspect is unknown (0:1), so it is left unset").
  std::vector<std::string> notes;
};

/// The description of a stream with codec parameters `parameters` alone: codec identifier and
/// name, tag, bitrate (source "stream"), the extradata as private data, size, pixel aspect and
/// pixel format, or sample rate, layout, frame size and sample format, or a subtitle's header
/// and DVB size; profile, level, bits per raw sample, field order, colour and chroma location
/// in the metadata. Any field values are accepted: out-of-range ones are left unset with a
/// note. Throws only std::bad_alloc.
TARVEK_FFMPEG_API StreamDescription DescribeCodecParameters(const AVCodecParameters& parameters);

/// The description of stream `index` of `context` (opened by avformat_open_input, ideally after
/// avformat_find_stream_info): DescribeCodecParameters, then the container's view: the pixel
/// aspect libavformat guesses, the frame rate (average, else the real base rate r_frame_rate),
/// the rotation of the display matrix, language, title, disposition, duration, and when the
/// stream states no bitrate the container's statistics tag BPS or, for a file of one stream,
/// the container's total. An index out of range gives the generic description with a note.
/// Throws only std::bad_alloc.
TARVEK_FFMPEG_API StreamDescription DescribeStream(const AVFormatContext& context,
                                                   unsigned int index);

/// The average bitrate of every stream of `context` measured from its packets: reads the whole
/// file from where it stands (av_read_frame), adds up each stream's packet sizes and divides by
/// the span of its timestamps. One entry a stream, in bit/s; 0 for a stream without packets or
/// without a measurable span. `progress`, when given, is called now and then with the share of
/// the file read (0 to 1). Stops at the first read error other than the end of the file, with
/// what was measured up to there. Throws only std::bad_alloc and what `progress` throws.
TARVEK_FFMPEG_API std::vector<long long> MeasureBitrates(
    AVFormatContext& context, const std::function<void(double)>& progress = {});

/// Sets `bitrate` as the description's bitrate with source "packets" (MeasureBitrates), when it
/// states none and `bitrate` is positive; returns whether it did. Throws only std::bad_alloc.
TARVEK_FFMPEG_API bool SetMeasuredBitrate(Conf::IFormatCodec& description, long long bitrate);

/// Writes into `parameters` every field `description` holds (the others are left as they are):
/// kind, codec identifier, tag, bitrate, private data as extradata, geometry or sample layout,
/// and the metadata values that codec parameters have fields for. Returns one sentence for each
/// value that has no place in codec parameters (such as an identifier libavcodec does not know
/// or a tag beyond 32 bits), left out. Throws only std::bad_alloc.
TARVEK_FFMPEG_API std::vector<std::string> ToCodecParameters(const Conf::IFormatCodec& description,
                                                             AVCodecParameters& parameters);

}  // namespace FFmpeg
}  // namespace Tarvek

#endif  // TARVEK_FFMPEG_STREAMS_H_
