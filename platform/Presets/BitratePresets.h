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
#include <Tarvek/Core/Interfaces/Export.h>

namespace Tarvek {
namespace Conf {

/// The codec identifier has no preset (or names a codec of the other media kind). Its
/// DescriptionInfo names the identifier.
class TARVEK_VISIBLE_TYPE UnknownCodecError : public virtual ConfException {
 public:
  ~UnknownCodecError() noexcept override {}
};

/// An argument of a look-up is out of its domain (a non-positive size or sample rate, a negative
/// or non-finite frame rate, an unknown sample format, an empty channel layout). Its
/// DescriptionInfo names the argument and the value.
class TARVEK_VISIBLE_TYPE InvalidPresetArgumentError : public virtual ConfException {
 public:
  ~InvalidPresetArgumentError() noexcept override {}
};

/// @name Video look-ups
/// `codecId` is a short codec name ("h264", "hevc", "vp9", "av1", ...); `width` and `height`
/// are in pixels; `frameRate` is frames per second, 0.0 meaning unknown (a nominal rate is used);
/// `quality` is the encoder's quality figure in VBR mode (a higher number means a lower
/// bitrate), or -1 for none. Min <= default <= max. Throw UnknownCodecError or
/// InvalidPresetArgumentError.
TARVEK_PRESETS_API std::int64_t GetDefaultVideoBitrate(const std::string& codecId, long long width,
                                                       long long height, double frameRate,
                                                       int quality);
TARVEK_PRESETS_API std::int64_t GetMinVideoBitrate(const std::string& codecId, long long width,
                                                   long long height, double frameRate,
                                                   int quality);
TARVEK_PRESETS_API std::int64_t GetMaxVideoBitrate(const std::string& codecId, long long width,
                                                   long long height, double frameRate,
                                                   int quality);

/// @name Audio look-ups
/// `codecId` is a short codec name ("aac", "opus", "flac", "pcm_s16le", ...); `sampleRate` is
/// in Hz; `layout` is the speaker mask (its bit count is the channel count); `sampleFormat` is
/// the sample format, which fixes lossless and PCM figures. Min <= default <= max. Throw
/// UnknownCodecError or InvalidPresetArgumentError.
TARVEK_PRESETS_API std::int64_t GetDefaultAudioBitrate(const std::string& codecId,
                                                       long long sampleRate, ChannelLayout layout,
                                                       AVSampleFormat sampleFormat);
TARVEK_PRESETS_API std::int64_t GetMinAudioBitrate(const std::string& codecId,
                                                   long long sampleRate, ChannelLayout layout,
                                                   AVSampleFormat sampleFormat);
TARVEK_PRESETS_API std::int64_t GetMaxAudioBitrate(const std::string& codecId,
                                                   long long sampleRate, ChannelLayout layout,
                                                   AVSampleFormat sampleFormat);

/// The codec identifiers the video look-ups know, sorted.
TARVEK_PRESETS_API const std::vector<std::string>& GetPresetVideoCodecs();
/// The codec identifiers the audio look-ups know, sorted.
TARVEK_PRESETS_API const std::vector<std::string>& GetPresetAudioCodecs();

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_PRESETS_BITRATEPRESETS_H_
