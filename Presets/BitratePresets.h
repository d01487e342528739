// The presets library: default, minimum and maximum bitrates, in bits per second, for a codec
// at a given picture size and frame rate (video) or sample layout (audio), from published
// recommendations and the hard limits of codecs and levels.
//
// The format description library's bitrate functions read these arguments from a description;
// callers with plain values may call the look-ups directly.
#ifndef TARVEK_PRESETS_BITRATEPRESETS_H_
#define TARVEK_PRESETS_BITRATEPRESETS_H_

#include <cstdint>
#include <string>
#include <vector>

#include <Tarvek/Conf/Interfaces/AVUtilTypes.h>
#include <Tarvek/Conf/Interfaces/ChannelLayout.h>
#include <Tarvek/Core/Errors/ConfException.h>

#include "Export.h"

namespace Tarvek {
namespace Conf {

/// The codec identifier has no preset, or names a codec of the other media kind. Its
/// DescriptionInfo names the identifier.
class TARVEK_VISIBLE_TYPE UnknownCodecError : public virtual ConfException {
 public:
  ~UnknownCodecError() noexcept override {}
};

/// An argument of a look-up is out of its domain (a non-positive size or sample rate, a negative
/// or non-finite frame rate, an unknown or unsuitable sample format, a channel count the codec
/// cannot carry). Its DescriptionInfo names the argument and the value.
class TARVEK_VISIBLE_TYPE InvalidPresetArgumentError : public virtual ConfException {
 public:
  ~InvalidPresetArgumentError() noexcept override {}
};

/// @name Video look-ups
/// `codecId` is a short codec name, matched without regard to case: "h264", "hevc", "vp9", "av1",
/// "mpeg2video", "mpeg4", "prores" (422) and "prores_proxy", "_lt", "_hq", "_4444", "_4444xq",
/// "dnxhd" and "dnxhr_lb", "_sq", "_hq", "_hqx", "_444" (see GetPresetVideoCodecs()).
/// `width` and `height` are in pixels (pictures above 65536 x 65536 pixels count as that size).
/// `frameRate` is in frames per second; 0.0 means unknown and is taken as 30; other rates are
/// clamped to 1..240. `quality` is the encoder's VBR quality figure (CRF for h264, hevc, vp9 and
/// av1, qscale for mpeg2video and mpeg4), a higher number meaning a lower bitrate; a negative
/// value means none, other values are clamped to the codec's scale; ProRes and DNx ignore it.
/// The default follows published ladders by size and frame rate; min and max bound it and never
/// pass the ceiling of the lowest codec level that admits the picture. Min <= default <= max.
/// Throw UnknownCodecError, or InvalidPresetArgumentError for a non-positive size or a negative
/// or non-finite frame rate.
TARVEK_PRESETS_API std::int64_t GetDefaultVideoBitrate(const std::string& codecId, long long width,
                                                       long long height, double frameRate,
                                                       int quality);
TARVEK_PRESETS_API std::int64_t GetMinVideoBitrate(const std::string& codecId, long long width,
                                                   long long height, double frameRate, int quality);
TARVEK_PRESETS_API std::int64_t GetMaxVideoBitrate(const std::string& codecId, long long width,
                                                   long long height, double frameRate, int quality);

/// @name Audio look-ups
/// `codecId` is a short codec name, matched without regard to case: "aac" (LC), "aac_he",
/// "aac_he_v2", "mp3", "opus", "vorbis", "ac3", "eac3", "flac", "alac" and the pcm_* names such
/// as "pcm_s16le" (see GetPresetAudioCodecs()). `sampleRate` is in Hz, up to 2^31 - 1; lossy
/// codecs take a rate outside their range as the nearest one they support. `layout` is the
/// speaker mask; its bit count is the channel count, which must be within the codec's limits
/// (mp3 at most 2, aac_he_v2 exactly 2, ac3 at most 6). `sampleFormat` is read by flac and alac
/// only, which take its bits per sample (integer formats up to 32 bits); pcm_* names fix their own
/// sample size and give sampleRate x channels x bits exactly. Min <= default <= max.
/// Throw UnknownCodecError, or InvalidPresetArgumentError for a bad sample rate, an empty or
/// oversized layout, or a sample format flac or alac cannot take.
TARVEK_PRESETS_API std::int64_t GetDefaultAudioBitrate(const std::string& codecId,
                                                       long long sampleRate, ChannelLayout layout,
                                                       AVSampleFormat sampleFormat);
TARVEK_PRESETS_API std::int64_t GetMinAudioBitrate(const std::string& codecId, long long sampleRate,
                                                   ChannelLayout layout,
                                                   AVSampleFormat sampleFormat);
TARVEK_PRESETS_API std::int64_t GetMaxAudioBitrate(const std::string& codecId, long long sampleRate,
                                                   ChannelLayout layout,
                                                   AVSampleFormat sampleFormat);

/// The codec identifiers the video look-ups know, lower case, sorted.
TARVEK_PRESETS_API const std::vector<std::string>& GetPresetVideoCodecs();
/// The codec identifiers the audio look-ups know, lower case, sorted.
TARVEK_PRESETS_API const std::vector<std::string>& GetPresetAudioCodecs();

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_PRESETS_BITRATEPRESETS_H_
