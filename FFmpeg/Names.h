// The mapping rules between FFmpeg's view of a stream and the descriptions, one rule each:
// channel layout names (libavutil's), codec tags as four characters, the presets a profile
// reaches, lossless compression ratios and where a bitrate came from. The formatdesc tool uses
// the same rules, so a name means there what it means in FFmpeg.
#ifndef TARVEK_FFMPEG_NAMES_H_
#define TARVEK_FFMPEG_NAMES_H_

#include <Tarvek/FFmpeg/Export.h>
#include <Tarvek/Formats.h>

#include <cstdint>
#include <optional>
#include <string>

namespace Tarvek {
namespace FFmpeg {

/// libavutil's name of the layout with speaker mask `mask`: "5.1(side)" for 0x60f, "5.1" for
/// 0x3f, and for a mask without a name the speakers ("3 channels (FL+FR+LFE)"). Empty for 0.
/// Throws only std::bad_alloc.
TARVEK_FFMPEG_API std::string ChannelLayoutName(std::uint64_t mask);

/// The speaker mask libavutil reads `text` as: FFmpeg's layout names ("5.1(side)",
/// "hexagonal"), speaker lists ("FL+FR+LFE"), masks ("0x60f") and channel counts ("6c").
/// Nothing when libavutil refuses the text, or when its layout is no speaker mask or needs
/// more than the 32 bits a description holds. Throws only std::bad_alloc.
TARVEK_FFMPEG_API std::optional<Conf::ChannelLayout> ParseChannelLayout(const std::string& text);

/// A codec tag as its four characters, first byte lowest ("avc1" for 0x31637661), as
/// libavutil prints tags; bytes that are not printable appear as "[n]". Empty for a value
/// outside 1 to 2^32 - 1. Throws only std::bad_alloc.
TARVEK_FFMPEG_API std::string FourccText(long long tag);

/// The identifier the presets know the description's codec by: the codec identifier, refined
/// by the profile in the metadata child where the presets have a row of their own for it
/// (ProRes profiles to "prores_proxy", "prores_lt", "prores", "prores_hq", "prores_4444",
/// "prores_4444xq"; DNxHR profiles to "dnxhr_lb" ... "dnxhr_444"; AAC HE and HE v2 to
/// "aac_he", "aac_he_v2"). Empty when the description has no codec identifier. Throws only
/// std::bad_alloc.
TARVEK_FFMPEG_API std::string PresetCodecID(const Conf::IFormatCodec& description);

/// Whether libavcodec describes the codec `codecId` as compressed lossless (flac, alac, ffv1,
/// png ...): lossless, not lossy, and not plain PCM, whose bitrate follows from its samples.
TARVEK_FFMPEG_API bool IsCompressedLossless(const std::string& codecId) noexcept;

/// The bitrate of the same content uncompressed, in bit/s: for audio, sample rate x channels x
/// bits per raw sample (the metadata's "bits_per_raw_sample", else the sample format's size);
/// for video, width x height x frame rate x the pixel format's bits per pixel. 0 when a setting
/// it needs is missing or the product overflows.
TARVEK_FFMPEG_API long long UncompressedBitrate(const Conf::IFormatCodec& description) noexcept;

/// The presets' bitrates for a video or audio description, in bit/s.
struct PresetBitrates {
  long long minimum = 0;
  long long typical = 0;
  long long maximum = 0;
};

/// The presets' range for `description` under its preset identifier (PresetCodecID): video at a
/// target bitrate (a file holds no encoder quality), audio without a layout in libavutil's usual
/// layout for `channels` when that is given, and FLAC and ALAC at the stream's bits per raw
/// sample rather than the sample format's size. Throws what the bitrate functions throw
/// (Conf::UnknownCodecError for a codec without presets, Core::ChildNotFound for a missing
/// setting, ConfException for a description of another kind).
TARVEK_FFMPEG_API PresetBitrates PresetRange(const Conf::IFormatCodec& description,
                                             int channels = 0);

/// Where a description's bitrate came from, as recorded in the metadata's "bitrate_source".
enum class BitrateSource {
  kNone,           ///< no bitrate
  kStream,         ///< the stream's own (codec parameters)
  kStatisticsTag,  ///< the container's statistics tag BPS (Matroska)
  kContainer,      ///< the container's total bitrate, the file holding this stream alone
  kPackets,        ///< measured: the packets' sizes over the stream's duration
};

/// "stream", "statistics_tag", "container", "packets"; "" for kNone.
TARVEK_FFMPEG_API const char* BitrateSourceName(BitrateSource source) noexcept;

/// The source recorded in `description`'s metadata; kNone when it records none.
TARVEK_FFMPEG_API BitrateSource GetBitrateSource(const Conf::IFormatCodec& description) noexcept;

}  // namespace FFmpeg
}  // namespace Tarvek

#endif  // TARVEK_FFMPEG_NAMES_H_
