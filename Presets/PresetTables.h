// Private to the presets library: the shapes of the bitrate tables and access to the tables,
// whose published figures all live in PresetTables.cpp. BitratePresets.cpp holds the rules that
// read them.
#ifndef TARVEK_PRESETS_PRESETTABLES_H_
#define TARVEK_PRESETS_PRESETTABLES_H_

#include <cstddef>

#include <Tarvek/Conf/Interfaces/AVUtilTypes.h>

namespace Tarvek {
namespace Conf {
namespace Presets {

// A read-only view of a constant array.
template <class T>
struct Table {
  const T* rows = nullptr;
  std::size_t size = 0;

  constexpr const T* begin() const { return rows; }
  constexpr const T* end() const { return rows + size; }
  constexpr bool empty() const { return size == 0; }
  constexpr const T& front() const { return rows[0]; }
  constexpr const T& back() const { return rows[size - 1]; }
};

template <class T, std::size_t N>
constexpr Table<T> MakeTable(const T (&rows)[N]) {
  return Table<T>{rows, N};
}

// ---- Video ----

// One rung of a bitrate ladder: the picture size in luma samples and the bitrate at the ladder's
// reference frame rate, in bit/s.
struct LadderPoint {
  double pixels;
  double bitsPerSecond;
};

// A ladder and the rules that extend it to any size and frame rate: log-log interpolation
// between the points, a power law in pixels beyond them, a power law in frame rate.
struct Ladder {
  Table<LadderPoint> points;     // ascending in pixels and in bitrate
  double referenceFrameRate;     // the frame rate the points hold at
  double frameRateExponent;      // bitrate ~ (fps / reference)^exponent
  double extrapolationExponent;  // bitrate ~ pixels^exponent before the first, after the last
};

// How an encoder's quality number moves the bitrate.
enum class QualityRule {
  kHalvingSteps,  // x 2^((reference - q) / steps): CRF-like scales
  kQuantiser,     // x reference / q: linear quantiser scales (MPEG qscale)
};

struct QualityScale {
  int lowest;  // out-of-range qualities are clamped to lowest..highest
  int highest;
  double reference;  // the quality at which the ladder figure holds
  QualityRule rule;
  double stepsPerHalving;  // kHalvingSteps only
};

// One level of a codec: the largest frame and sample rate it admits and its bitrate ceiling.
struct VideoLevel {
  const char* name;
  double maxFrameSize;  // in the table's blocks; 0 when the level states none
  double maxBlockRate;  // blocks per second; 0 when the level states none
  double maxKbps;       // kbit/s, before the table's profile factor
};

struct LevelTable {
  Table<VideoLevel> levels;  // ascending: each admits what the previous one does
  double blockSize;          // 16 for macroblock counts, 1 for luma samples
  double profileFactor;      // MaxBR multiplier of the profile the figures are for
};

struct VideoCodec {
  const char* id;               // lower case, the table sorted by it
  const Ladder* ladder;         // the default at quality "none"
  double codecFactor;           // applied to the ladder figure
  const QualityScale* quality;  // nullptr: the codec has fixed rates, quality is ignored
  double minFactor;             // of the default
  double maxFactor;             // of the default
  const LevelTable* levels;     // nullptr: no level ceiling
};

// ---- Audio ----

// A default bitrate for a channel count; between anchors the default is linear in channels,
// outside them proportional to the channel count.
struct ChannelAnchor {
  int channels;
  double bitsPerSecond;
};

struct ChannelRange {
  int lowest;
  int highest;
};

// Sample rates in Hz; a lossy codec takes other rates as the nearest of these.
struct RateRange {
  double lowest;
  double highest;
};

// A bitrate bound: fixed + perChannel x channels + perChannelPerHz x sample rate x channels.
struct AudioBound {
  double fixed;
  double perChannel;
  double perChannelPerHz;
};

struct LowRateVariant;

// A lossy codec's figures.
struct LossyAudio {
  ChannelRange channels;
  RateRange rates;
  Table<ChannelAnchor> defaults;  // ascending in channels
  bool scalesWithRate;            // default x min(1, rate / kFullBandRate)
  AudioBound min;
  AudioBound max;
  Table<int> allowedKbps;         // empty: any rate; else the default snaps to these
  const LowRateVariant* lowRate;  // nullptr, or other figures for low sample rates
};

// Figures that replace a codec's own below a sample rate (MP3's MPEG-2 LSF mode).
struct LowRateVariant {
  double belowRate;
  const LossyAudio* figures;
};

// Opus: the figures follow the multistream layout, streams and coupled (stereo) streams.
struct OpusLayout {
  int channels;
  int streams;
  int coupled;
};

struct OpusFigures {
  Table<OpusLayout> layouts;  // channels 1.. in order; above, one uncoupled stream a channel
  int maxChannels;
  double lowestRate;
  double highestRate;
  double defaultPerStream;
  double defaultPerCoupled;
  double minPerStream;
  double maxPerStream;
  double maxPerChannel;
};

// A lossless codec's figures as fractions of the PCM rate of the same samples.
struct LosslessAudio {
  double minFraction;
  double defaultFraction;
  double maxFraction;
  int maxSampleBits;  // largest integer sample the format stores
};

enum class AudioKind { kLossy, kOpus, kLossless, kPcm };

struct AudioCodec {
  const char* id;  // lower case, the table sorted by it
  AudioKind kind;
  const LossyAudio* lossy;        // kLossy
  const LosslessAudio* lossless;  // kLossless
  int pcmBits;                    // kPcm: bits per sample, named by the identifier
};

// A libavutil sample format as the look-ups see it.
struct SampleFormatInfo {
  AVSampleFormat format;
  const char* name;
  int bits;
  bool integer;
};

// ---- Shared constants ----

// The sample rate at and above which lossy defaults hold in full (CD rate).
constexpr double kFullBandRate = 44100.0;

// ---- The tables (PresetTables.cpp) ----

Table<VideoCodec> VideoCodecs();  // sorted by id
Table<AudioCodec> AudioCodecs();  // sorted by id
const OpusFigures& Opus();
Table<SampleFormatInfo> SampleFormats();

}  // namespace Presets
}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_PRESETS_PRESETTABLES_H_
