#include "RecordingPresets.h"

#include <stdexcept>

namespace RecordingPresets {
namespace {

bool failNext = false;

std::int64_t RecordVideo(const char* function, const std::string& codecId, long long width,
                         long long height, double frameRate, int quality, std::int64_t result) {
  Call& call = Last();
  call = Call{};
  call.function = function;
  call.codecId = codecId;
  call.width = width;
  call.height = height;
  call.frameRate = frameRate;
  call.quality = quality;
  if (failNext) {
    failNext = false;
    throw std::runtime_error("presets failure");
  }
  return result;
}

std::int64_t RecordAudio(const char* function, const std::string& codecId, long long sampleRate,
                         Tarvek::Conf::ChannelLayout layout, AVSampleFormat format,
                         std::int64_t result) {
  Call& call = Last();
  call = Call{};
  call.function = function;
  call.codecId = codecId;
  call.sampleRate = sampleRate;
  call.layout = layout;
  call.sampleFormat = format;
  if (failNext) {
    failNext = false;
    throw std::runtime_error("presets failure");
  }
  return result;
}

}  // namespace

Call& Last() {
  static Call call;
  return call;
}

void Reset() {
  Last() = Call{};
  failNext = false;
}

void FailNextCall() { failNext = true; }

}  // namespace RecordingPresets

namespace Tarvek {
namespace Conf {

std::int64_t GetDefaultVideoBitrate(const std::string& codecId, long long width, long long height,
                                    double frameRate, int quality) {
  return RecordingPresets::RecordVideo("GetDefaultVideoBitrate", codecId, width, height, frameRate,
                                       quality, RecordingPresets::kDefaultVideo);
}
std::int64_t GetMinVideoBitrate(const std::string& codecId, long long width, long long height,
                                double frameRate, int quality) {
  return RecordingPresets::RecordVideo("GetMinVideoBitrate", codecId, width, height, frameRate,
                                       quality, RecordingPresets::kMinVideo);
}
std::int64_t GetMaxVideoBitrate(const std::string& codecId, long long width, long long height,
                                double frameRate, int quality) {
  return RecordingPresets::RecordVideo("GetMaxVideoBitrate", codecId, width, height, frameRate,
                                       quality, RecordingPresets::kMaxVideo);
}
std::int64_t GetDefaultAudioBitrate(const std::string& codecId, long long sampleRate,
                                    ChannelLayout layout, AVSampleFormat sampleFormat) {
  return RecordingPresets::RecordAudio("GetDefaultAudioBitrate", codecId, sampleRate, layout,
                                       sampleFormat, RecordingPresets::kDefaultAudio);
}
std::int64_t GetMinAudioBitrate(const std::string& codecId, long long sampleRate,
                                ChannelLayout layout, AVSampleFormat sampleFormat) {
  return RecordingPresets::RecordAudio("GetMinAudioBitrate", codecId, sampleRate, layout,
                                       sampleFormat, RecordingPresets::kMinAudio);
}
std::int64_t GetMaxAudioBitrate(const std::string& codecId, long long sampleRate,
                                ChannelLayout layout, AVSampleFormat sampleFormat) {
  return RecordingPresets::RecordAudio("GetMaxAudioBitrate", codecId, sampleRate, layout,
                                       sampleFormat, RecordingPresets::kMaxAudio);
}

}  // namespace Conf
}  // namespace Tarvek
