// The presets library: the six bitrate look-ups over the published figures in PresetTables.cpp.
//
// Video. Each codec has a ladder: bitrates at known picture sizes and a reference frame rate.
//   - Size: log-log interpolation in pixel count between ladder points; beyond the ends a power
//     law (pixels^0.75 for the H.264 ladder, pixels^1 for ProRes and DNx, whose bits per pixel
//     are constant). Pixel counts above 65536 x 65536 (the largest AV1 frame) count as that.
//   - Frame rate: bitrate ~ (fps / reference)^e, e = log2(1.5) for the software codecs (1.5x at
//     double rate, as YouTube and VP9 publish) and 1 for ProRes and DNx (fixed bits per frame).
//     0.0 means unknown and is taken as 30 fps; other rates are clamped to 1..240 fps.
//   - Codec: H.264's ladder times a published efficiency factor (HEVC, VP9 0.7, AV1 0.5,
//     MPEG-2 2.0, MPEG-4 Part 2 1.5); ProRes and DNx have their own tables.
//   - Quality (VBR): the ladder is the encoder's default quality; a CRF q moves it by
//     2^((reference - q) / steps) (x264 23, x265 28, 6 steps; VP9, AV1 31, 8 steps), an MPEG
//     qscale by 4 / q. Negative means none; other values are clamped to the codec's scale.
//     ProRes and DNx have fixed rates and ignore it.
//   - Range: min 0.5x and max 2x the default (ProRes 0.9x and 1x, DNxHR 1x and 1x, DNxHD from its
//     smallest to its largest 1080p frame size). The maximum is then capped at the ceiling of the
//     lowest level that admits the picture size and rate (the top level when none does), the
//     default and the minimum follow it down, and every figure is at least 1 kbit/s.
//
// Audio. The channel count is the number of speakers in the layout.
//   - PCM: sample rate x channels x bits per sample, exactly; min = default = max.
//   - FLAC, ALAC: fractions of that PCM rate (0.3 / 0.6 / 1.0), the bits from the sample format.
//   - Lossy codecs: a default per channel count (linear between published anchors, proportional
//     outside them) times min(1, rate / 44.1 kHz) for full-band codecs; bounds of the form
//     fixed + per channel (+ per channel and Hz for AAC's frame-size ceiling); AC-3 and MP3
//     snap to their bitrate tables and MP3 below 32 kHz uses the MPEG-2 LSF table. Sample rates
//     outside a lossy codec's range are taken as the nearest supported one (an encoder
//     resamples); channel counts outside it are an error. Figures are whole kbit/s.
//   - Opus: 64 kbit/s a stream plus 32 a coupled stream, 6 a stream at least, at most 510 a
//     stream and 256 a channel.
//   - Min <= default <= max is kept by clamping the default between the bounds.
//
// Every figure is computed in double from clamped inputs, so no step can overflow; the results
// stay below 10^14 bit/s. Look-ups allocate nothing unless they throw.
#include <Tarvek/Presets/BitratePresets.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <limits>

#include <boost/current_function.hpp>

#include <Tarvek/Core/Errors/AddStack.h>

#include "PresetTables.h"

namespace Tarvek {
namespace Conf {
namespace {

using Presets::AudioCodec;
using Presets::AudioKind;
using Presets::ChannelAnchor;
using Presets::Ladder;
using Presets::LadderPoint;
using Presets::LevelTable;
using Presets::LosslessAudio;
using Presets::LossyAudio;
using Presets::OpusFigures;
using Presets::QualityRule;
using Presets::QualityScale;
using Presets::SampleFormatInfo;
using Presets::Table;
using Presets::VideoCodec;
using Presets::VideoLevel;

constexpr double kNominalFrameRate = 30.0;  // the ladders' reference rate
constexpr double kLowestFrameRate = 1.0;
constexpr double kHighestFrameRate = 240.0;
constexpr double kLargestPicture = 65536.0 * 65536.0;
constexpr double kVideoFloor = 1000.0;  // below this, per-frame headers exceed the budget
constexpr long long kHighestSampleRate = std::numeric_limits<std::int32_t>::max();

struct Figures {
  std::int64_t min;
  std::int64_t def;
  std::int64_t max;
};

// ---- Messages (built only when throwing) ----

std::string Number(double value) {
  char text[32];
  std::snprintf(text, sizeof text, "%g", value);
  return text;
}

std::string Hex(std::uint32_t value) {
  char text[16];
  std::snprintf(text, sizeof text, "0x%x", static_cast<unsigned>(value));
  return text;
}

[[noreturn]] void ThrowInvalid(int line, const char* function, const std::string& description) {
  ThrowWithLocation(line, __FILE__, function,
                    AddStack(InvalidPresetArgumentError() << DescriptionInfo(description)));
}

// ---- Codec look-up ----

char ToLowerAscii(char c) { return (c >= 'A' && c <= 'Z') ? static_cast<char>(c - 'A' + 'a') : c; }

// strcmp of a table id against `name` read in lower case; no copy of `name` is made.
int CompareId(const char* id, const std::string& name) {
  std::size_t i = 0;
  for (; id[i] != '\0' && i < name.size(); ++i) {
    const auto a = static_cast<unsigned char>(id[i]);
    const auto b = static_cast<unsigned char>(ToLowerAscii(name[i]));
    if (a != b) return a < b ? -1 : 1;
  }
  if (id[i] != '\0') return 1;
  return i == name.size() ? 0 : -1;
}

template <class Row>
const Row* FindRow(Table<Row> table, const std::string& name) {
  const Row* row = std::lower_bound(
      table.begin(), table.end(), name,
      [](const Row& r, const std::string& key) { return CompareId(r.id, key) < 0; });
  return (row != table.end() && CompareId(row->id, name) == 0) ? row : nullptr;
}

const VideoCodec& FindVideoCodec(const std::string& codecId) {
  if (const VideoCodec* row = FindRow(Presets::VideoCodecs(), codecId)) return *row;
  const std::string description =
      FindRow(Presets::AudioCodecs(), codecId) != nullptr
          ? "Codec identifier \"" + codecId + "\" names an audio codec, not a video codec"
          : "No video bitrate preset for codec identifier \"" + codecId + "\"";
  ThrowWithLocation(__LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
                    AddStack(UnknownCodecError() << DescriptionInfo(description)));
}

const AudioCodec& FindAudioCodec(const std::string& codecId) {
  if (const AudioCodec* row = FindRow(Presets::AudioCodecs(), codecId)) return *row;
  const std::string description =
      FindRow(Presets::VideoCodecs(), codecId) != nullptr
          ? "Codec identifier \"" + codecId + "\" names a video codec, not an audio codec"
          : "No audio bitrate preset for codec identifier \"" + codecId + "\"";
  ThrowWithLocation(__LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
                    AddStack(UnknownCodecError() << DescriptionInfo(description)));
}

// ---- Video ----

void CheckDimension(const char* name, long long value) {
  if (value <= 0) {
    ThrowInvalid(
        __LINE__, BOOST_CURRENT_FUNCTION,
        std::string(name) + " " + std::to_string(value) + " is not a positive number of pixels");
  }
}

double EffectiveFrameRate(double frameRate) {
  if (!std::isfinite(frameRate)) {
    ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
                 "Frame rate " + Number(frameRate) + " is not a finite number");
  }
  if (frameRate < 0.0) {
    ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
                 "Frame rate " + Number(frameRate) + " is negative");
  }
  if (frameRate == 0.0) return kNominalFrameRate;
  return std::min(std::max(frameRate, kLowestFrameRate), kHighestFrameRate);
}

// The ladder's bitrate for `pixels` at its reference frame rate.
double LadderRate(const Ladder& ladder, double pixels) {
  const LadderPoint& first = ladder.points.front();
  const LadderPoint& last = ladder.points.back();
  if (pixels <= first.pixels) {
    return first.bitsPerSecond * std::pow(pixels / first.pixels, ladder.extrapolationExponent);
  }
  if (pixels >= last.pixels) {
    return last.bitsPerSecond * std::pow(pixels / last.pixels, ladder.extrapolationExponent);
  }
  const LadderPoint* upper =
      std::upper_bound(ladder.points.begin(), ladder.points.end(), pixels,
                       [](double p, const LadderPoint& point) { return p < point.pixels; });
  const LadderPoint& lower = upper[-1];
  const double t = std::log(pixels / lower.pixels) / std::log(upper->pixels / lower.pixels);
  return lower.bitsPerSecond * std::pow(upper->bitsPerSecond / lower.bitsPerSecond, t);
}

double QualityFactor(const QualityScale* scale, int quality) {
  if (scale == nullptr || quality < 0) return 1.0;
  const double q = std::min(std::max(quality, scale->lowest), scale->highest);
  if (scale->rule == QualityRule::kQuantiser) return scale->reference / q;
  return std::exp2((scale->reference - q) / scale->stepsPerHalving);
}

// The bitrate ceiling of the lowest level admitting the picture at `frameRate`; the top level's
// when none does.
double LevelCeiling(const LevelTable& table, long long width, long long height, double frameRate) {
  const double blocks = std::ceil(static_cast<double>(width) / table.blockSize) *
                        std::ceil(static_cast<double>(height) / table.blockSize);
  const VideoLevel* chosen = &table.levels.back();
  for (const VideoLevel& level : table.levels) {
    if ((level.maxFrameSize == 0.0 || blocks <= level.maxFrameSize) &&
        (level.maxBlockRate == 0.0 || blocks * frameRate <= level.maxBlockRate)) {
      chosen = &level;
      break;
    }
  }
  return chosen->maxKbps * 1000.0 * table.profileFactor;
}

std::int64_t ToBitsPerSecond(double value) {
  // The inputs are clamped so that this bound is never reached; it keeps the conversion defined.
  return static_cast<std::int64_t>(std::llround(std::min(value, 1.0e15)));
}

Figures VideoFigures(const std::string& codecId, long long width, long long height,
                     double frameRate, int quality) {
  const VideoCodec& codec = FindVideoCodec(codecId);
  CheckDimension("Width", width);
  CheckDimension("Height", height);
  const double fps = EffectiveFrameRate(frameRate);
  const double pixels =
      std::min(static_cast<double>(width) * static_cast<double>(height), kLargestPicture);

  const Ladder& ladder = *codec.ladder;
  const double base = LadderRate(ladder, pixels) *
                      std::pow(fps / ladder.referenceFrameRate, ladder.frameRateExponent) *
                      codec.codecFactor * QualityFactor(codec.quality, quality);
  double max = base * codec.maxFactor;
  if (codec.levels != nullptr) {
    max = std::min(max, LevelCeiling(*codec.levels, width, height, fps));
  }
  const double def = std::min(base, max);
  const double min = std::min(base * codec.minFactor, def);
  return {ToBitsPerSecond(std::max(min, kVideoFloor)), ToBitsPerSecond(std::max(def, kVideoFloor)),
          ToBitsPerSecond(std::max(max, kVideoFloor))};
}

// ---- Audio ----

int ChannelCount(ChannelLayout layout) {
  int count = 0;
  for (auto mask = static_cast<std::uint32_t>(layout); mask != 0; mask &= mask - 1) ++count;
  if (count == 0) {
    ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
                 "Channel layout " + Hex(static_cast<std::uint32_t>(layout)) + " has no channels");
  }
  return count;
}

void CheckSampleRate(long long sampleRate) {
  if (sampleRate <= 0) {
    ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
                 "Sample rate " + std::to_string(sampleRate) + " Hz is not positive");
  }
  if (sampleRate > kHighestSampleRate) {
    ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
                 "Sample rate " + std::to_string(sampleRate) +
                     " Hz is above the largest a stream can carry (" +
                     std::to_string(kHighestSampleRate) + " Hz)");
  }
}

void CheckChannels(const char* codecId, ChannelLayout layout, int channels, int lowest,
                   int highest) {
  if (channels < lowest || channels > highest) {
    const std::string carried = lowest == highest
                                    ? "exactly " + std::to_string(lowest)
                                    : std::to_string(lowest) + " to " + std::to_string(highest);
    ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
                 "Channel layout " + Hex(static_cast<std::uint32_t>(layout)) + " has " +
                     std::to_string(channels) + " channels; codec " + codecId + " carries " +
                     carried);
  }
}

const SampleFormatInfo& FindSampleFormat(AVSampleFormat format) {
  for (const SampleFormatInfo& info : Presets::SampleFormats()) {
    if (info.format == format) return info;
  }
  ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
               "Sample format " + std::to_string(static_cast<int>(format)) +
                   " is not a known sample format");
}

double AnchorRate(Table<ChannelAnchor> anchors, int channels) {
  const ChannelAnchor& first = anchors.front();
  const ChannelAnchor& last = anchors.back();
  if (channels <= first.channels) return first.bitsPerSecond * channels / first.channels;
  if (channels >= last.channels) return last.bitsPerSecond * channels / last.channels;
  const ChannelAnchor* upper =
      std::upper_bound(anchors.begin(), anchors.end(), channels,
                       [](int c, const ChannelAnchor& anchor) { return c < anchor.channels; });
  const ChannelAnchor& lower = upper[-1];
  const double t = static_cast<double>(channels - lower.channels) /
                   static_cast<double>(upper->channels - lower.channels);
  return lower.bitsPerSecond + t * (upper->bitsPerSecond - lower.bitsPerSecond);
}

double RateScale(double sampleRate) { return std::min(1.0, sampleRate / Presets::kFullBandRate); }

double NearestAllowed(Table<int> allowedKbps, double bitsPerSecond) {
  const double kbps = bitsPerSecond / 1000.0;
  int best = allowedKbps.front();
  for (int value : allowedKbps) {
    if (std::abs(value - kbps) < std::abs(best - kbps)) best = value;
  }
  return best * 1000.0;
}

double BoundRate(const Presets::AudioBound& bound, double sampleRate, int channels) {
  return bound.fixed + (bound.perChannel + bound.perChannelPerHz * sampleRate) * channels;
}

// Whole kbit/s, the maximum rounded down so a hard ceiling is never passed; then the default is
// kept between the bounds.
Figures KbpsFigures(double min, double def, double max) {
  const double top = std::floor(max / 1000.0) * 1000.0;
  const double bottom = std::min(std::round(min / 1000.0) * 1000.0, top);
  const double middle = std::min(std::max(std::round(def / 1000.0) * 1000.0, bottom), top);
  return {ToBitsPerSecond(bottom), ToBitsPerSecond(middle), ToBitsPerSecond(top)};
}

Figures LossyFigures(const AudioCodec& codec, double sampleRate, ChannelLayout layout,
                     int channels) {
  const Presets::LowRateVariant* lowRate = codec.lossy->lowRate;
  const LossyAudio& figures =
      (lowRate != nullptr && sampleRate < lowRate->belowRate) ? *lowRate->figures : *codec.lossy;
  CheckChannels(codec.id, layout, channels, figures.channels.lowest, figures.channels.highest);
  const double rate = std::min(std::max(sampleRate, figures.rates.lowest), figures.rates.highest);
  double def = AnchorRate(figures.defaults, channels);
  if (figures.scalesWithRate) def *= RateScale(rate);
  if (!figures.allowedKbps.empty()) def = NearestAllowed(figures.allowedKbps, def);
  return KbpsFigures(BoundRate(figures.min, rate, channels), def,
                     BoundRate(figures.max, rate, channels));
}

Figures OpusFiguresFor(const AudioCodec& codec, double sampleRate, ChannelLayout layout,
                       int channels) {
  const OpusFigures& opus = Presets::Opus();
  CheckChannels(codec.id, layout, channels, 1, opus.maxChannels);
  const auto known = static_cast<std::size_t>(channels) <= opus.layouts.size;
  const int streams = known ? opus.layouts.rows[channels - 1].streams : channels;
  const int coupled = known ? opus.layouts.rows[channels - 1].coupled : 0;
  const double rate = std::min(std::max(sampleRate, opus.lowestRate), opus.highestRate);
  const double def =
      (opus.defaultPerStream * streams + opus.defaultPerCoupled * coupled) * RateScale(rate);
  const double max = std::min(opus.maxPerStream * streams, opus.maxPerChannel * channels);
  return KbpsFigures(opus.minPerStream * streams, def, max);
}

Figures LosslessFigures(const AudioCodec& codec, long long sampleRate, int channels,
                        AVSampleFormat sampleFormat) {
  const SampleFormatInfo& format = FindSampleFormat(sampleFormat);
  const LosslessAudio& figures = *codec.lossless;
  if (!format.integer || format.bits > figures.maxSampleBits) {
    ThrowInvalid(__LINE__, BOOST_CURRENT_FUNCTION,
                 std::string("Codec ") + codec.id + " stores integer samples of at most " +
                     std::to_string(figures.maxSampleBits) + " bits, not sample format " +
                     format.name);
  }
  // Exact in double: at most 2^31 Hz x 32 channels x 32 bits.
  const double pcm = static_cast<double>(sampleRate) * channels * format.bits;
  return {ToBitsPerSecond(pcm * figures.minFraction),
          ToBitsPerSecond(pcm * figures.defaultFraction),
          ToBitsPerSecond(pcm * figures.maxFraction)};
}

Figures AudioFigures(const std::string& codecId, long long sampleRate, ChannelLayout layout,
                     AVSampleFormat sampleFormat) {
  const AudioCodec& codec = FindAudioCodec(codecId);
  CheckSampleRate(sampleRate);
  const int channels = ChannelCount(layout);
  switch (codec.kind) {
    case AudioKind::kPcm: {
      // At most 2^31 Hz x 32 channels x 64 bits, well inside 64 bits.
      const std::int64_t pcm = sampleRate * channels * codec.pcmBits;
      return {pcm, pcm, pcm};
    }
    case AudioKind::kLossless:
      return LosslessFigures(codec, sampleRate, channels, sampleFormat);
    case AudioKind::kOpus:
      return OpusFiguresFor(codec, static_cast<double>(sampleRate), layout, channels);
    case AudioKind::kLossy:
      break;
  }
  return LossyFigures(codec, static_cast<double>(sampleRate), layout, channels);
}

template <class Row>
std::vector<std::string> IdsOf(Table<Row> table) {
  std::vector<std::string> ids;
  ids.reserve(table.size);
  for (const Row& row : table) ids.emplace_back(row.id);
  return ids;
}

}  // namespace

std::int64_t GetDefaultVideoBitrate(const std::string& codecId, long long width, long long height,
                                    double frameRate, int quality) {
  return VideoFigures(codecId, width, height, frameRate, quality).def;
}

std::int64_t GetMinVideoBitrate(const std::string& codecId, long long width, long long height,
                                double frameRate, int quality) {
  return VideoFigures(codecId, width, height, frameRate, quality).min;
}

std::int64_t GetMaxVideoBitrate(const std::string& codecId, long long width, long long height,
                                double frameRate, int quality) {
  return VideoFigures(codecId, width, height, frameRate, quality).max;
}

std::int64_t GetDefaultAudioBitrate(const std::string& codecId, long long sampleRate,
                                    ChannelLayout layout, AVSampleFormat sampleFormat) {
  return AudioFigures(codecId, sampleRate, layout, sampleFormat).def;
}

std::int64_t GetMinAudioBitrate(const std::string& codecId, long long sampleRate,
                                ChannelLayout layout, AVSampleFormat sampleFormat) {
  return AudioFigures(codecId, sampleRate, layout, sampleFormat).min;
}

std::int64_t GetMaxAudioBitrate(const std::string& codecId, long long sampleRate,
                                ChannelLayout layout, AVSampleFormat sampleFormat) {
  return AudioFigures(codecId, sampleRate, layout, sampleFormat).max;
}

const std::vector<std::string>& GetPresetVideoCodecs() {
  static const std::vector<std::string> ids = IdsOf(Presets::VideoCodecs());
  return ids;
}

const std::vector<std::string>& GetPresetAudioCodecs() {
  static const std::vector<std::string> ids = IdsOf(Presets::AudioCodecs());
  return ids;
}

}  // namespace Conf
}  // namespace Tarvek
