// A stand-in for the presets library that records what the bitrate functions hand it, so tests
// can check the exact arguments. Linked instead of the real presets library.
#ifndef TARVEK_TESTS_CONF_FORMATS_RECORDINGPRESETS_H_
#define TARVEK_TESTS_CONF_FORMATS_RECORDINGPRESETS_H_

#include <cstdint>
#include <string>

#include <Tarvek/Formats.h>

namespace RecordingPresets {

// The last call to any of the six look-ups.
struct Call {
  std::string function;  // e.g. "GetMinVideoBitrate"; empty when nothing was called
  std::string codecId;
  long long width = 0, height = 0;
  double frameRate = 0.0;
  int quality = 0;
  long long sampleRate = 0;
  Tarvek::Conf::ChannelLayout layout{};
  AVSampleFormat sampleFormat = AV_SAMPLE_FMT_NONE;
};

// What the stand-in returns: a distinct figure per function, so a test sees which one answered.
constexpr std::int64_t kDefaultVideo = 1001, kMinVideo = 1002, kMaxVideo = 1003;
constexpr std::int64_t kDefaultAudio = 2001, kMinAudio = 2002, kMaxAudio = 2003;

// The recorded call; Reset() forgets it.
Call& Last();
void Reset();
// Makes the next look-up throw std::runtime_error("presets failure").
void FailNextCall();

}  // namespace RecordingPresets

#endif  // TARVEK_TESTS_CONF_FORMATS_RECORDINGPRESETS_H_
