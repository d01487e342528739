// The five workloads on FFmpeg codec parameters: AVCodecParameters for the settings it has a
// field for, and an AVDictionary beside it for the others (codec name, bitrate mode, quality,
// frame rate, lossless, two-pass). Compiled only when pkg-config finds libavcodec.
#include <benchmark/benchmark.h>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/dict.h>
}

#include <cstdlib>
#include <cstring>
#include <string>

#include "BenchSettings.h"

namespace {

namespace S = TarvekBench;

// One description: the parameters and the dictionary of the settings they have no field for.
struct FfVideo {
  AVCodecParameters* parameters = nullptr;
  AVDictionary* settings = nullptr;
};

void Free(FfVideo& video) {
  avcodec_parameters_free(&video.parameters);
  av_dict_free(&video.settings);
}

FfVideo BuildGeometry() {
  FfVideo video;
  video.parameters = avcodec_parameters_alloc();
  video.parameters->codec_type = AVMEDIA_TYPE_VIDEO;
  video.parameters->width = static_cast<int>(S::kWidth);
  video.parameters->height = static_cast<int>(S::kHeight);
  video.parameters->sample_aspect_ratio =
      AVRational{static_cast<int>(S::kPixelAspectX), static_cast<int>(S::kPixelAspectY)};
  return video;
}

FfVideo BuildFull() {
  FfVideo video = BuildGeometry();
  AVCodecParameters* p = video.parameters;
  p->codec_id = AV_CODEC_ID_H264;  // the codec id "h264"
  p->bit_rate = S::kBitrate;
  p->format = S::kPixelFormat;
  av_dict_set(&video.settings, "codec_name", S::kCodecName, 0);
  av_dict_set(&video.settings, "bitrate_mode", S::kBitrateMode, 0);
  av_dict_set_int(&video.settings, "quality", S::kQuality, 0);
  av_dict_set(&video.settings, "framerate", "30000/1001", 0);
  av_dict_set_int(&video.settings, "lossless", S::kLossless ? 1 : 0, 0);
  av_dict_set_int(&video.settings, "two_pass", S::kTwoPass ? 1 : 0, 0);
  return video;
}

const char* Find(const AVDictionary* settings, const char* key) {
  const AVDictionaryEntry* entry = av_dict_get(settings, key, nullptr, 0);
  return entry != nullptr ? entry->value : nullptr;
}

bool SameSettings(const AVDictionary* a, const AVDictionary* b) {
  if (av_dict_count(a) != av_dict_count(b)) return false;
  const AVDictionaryEntry* entry = nullptr;
  while ((entry = av_dict_get(a, "", entry, AV_DICT_IGNORE_SUFFIX)) != nullptr) {
    const char* other = Find(b, entry->key);
    if (other == nullptr || std::strcmp(other, entry->value) != 0) return false;
  }
  return true;
}

bool SameRational(AVRational a, AVRational b) { return a.num == b.num && a.den == b.den; }

bool Equal(const FfVideo& a, const FfVideo& b) {
  const AVCodecParameters* x = a.parameters;
  const AVCodecParameters* y = b.parameters;
  return x->codec_type == y->codec_type && x->codec_id == y->codec_id &&
         x->bit_rate == y->bit_rate && x->width == y->width && x->height == y->height &&
         SameRational(x->sample_aspect_ratio, y->sample_aspect_ratio) && x->format == y->format &&
         SameSettings(a.settings, b.settings);
}

bool Compatible(const FfVideo& a, const FfVideo& b) {
  const AVCodecParameters* x = a.parameters;
  const AVCodecParameters* y = b.parameters;
  return x->width == y->width && x->height == y->height &&
         SameRational(x->sample_aspect_ratio, y->sample_aspect_ratio);
}

void FfBuild(benchmark::State& state) {
  for (auto _ : state) {
    FfVideo video = BuildFull();
    benchmark::DoNotOptimize(video.parameters);
    Free(video);
  }
}

void FfRead(benchmark::State& state) {
  FfVideo video = BuildFull();
  for (auto _ : state) {
    benchmark::DoNotOptimize(video.parameters);
    const AVCodecParameters* p = video.parameters;
    const AVDictionary* d = video.settings;
    if (const char* v = Find(d, "codec_name")) benchmark::DoNotOptimize(v);
    if (p->codec_id != AV_CODEC_ID_NONE) benchmark::DoNotOptimize(p->codec_id);
    if (const char* v = Find(d, "bitrate_mode")) benchmark::DoNotOptimize(v);
    if (p->bit_rate > 0) benchmark::DoNotOptimize(p->bit_rate);
    if (const char* v = Find(d, "quality")) benchmark::DoNotOptimize(std::strtoll(v, nullptr, 10));
    if (p->width > 0) benchmark::DoNotOptimize(p->width);
    if (p->height > 0) benchmark::DoNotOptimize(p->height);
    if (p->sample_aspect_ratio.num != 0) benchmark::DoNotOptimize(p->sample_aspect_ratio);
    if (const char* v = Find(d, "framerate")) {
      char* end = nullptr;
      benchmark::DoNotOptimize(std::strtol(v, &end, 10));
      if (*end == '/') benchmark::DoNotOptimize(std::strtol(end + 1, nullptr, 10));
    }
    if (p->format >= 0) benchmark::DoNotOptimize(p->format);
    if (const char* v = Find(d, "lossless")) benchmark::DoNotOptimize(std::strtol(v, nullptr, 10));
    if (const char* v = Find(d, "two_pass")) benchmark::DoNotOptimize(std::strtol(v, nullptr, 10));
  }
  Free(video);
}

void FfClone(benchmark::State& state) {
  FfVideo video = BuildFull();
  for (auto _ : state) {
    FfVideo copy;
    copy.parameters = avcodec_parameters_alloc();
    avcodec_parameters_copy(copy.parameters, video.parameters);
    av_dict_copy(&copy.settings, video.settings, 0);
    benchmark::DoNotOptimize(copy.parameters);
    Free(copy);
  }
  Free(video);
}

void FfCompare(benchmark::State& state) {
  FfVideo first = BuildFull();
  FfVideo second = BuildFull();
  for (auto _ : state) {
    benchmark::DoNotOptimize(first.parameters);
    benchmark::DoNotOptimize(Equal(first, second));
  }
  if (!Equal(first, second)) state.SkipWithError("the two descriptions differ");
  Free(first);
  Free(second);
}

void FfCompatible(benchmark::State& state) {
  FfVideo first = BuildFull();
  FfVideo second = BuildGeometry();
  for (auto _ : state) {
    benchmark::DoNotOptimize(first.parameters);
    benchmark::DoNotOptimize(second.parameters);
    benchmark::DoNotOptimize(Compatible(first, second));
  }
  Free(first);
  Free(second);
}

std::string Name(const char* workload) { return std::string("FFmpeg/") + workload; }

const bool kRegistered = [] {
  benchmark::RegisterBenchmark(Name(S::kBuild).c_str(), FfBuild);
  benchmark::RegisterBenchmark(Name(S::kRead).c_str(), FfRead);
  benchmark::RegisterBenchmark(Name(S::kClone).c_str(), FfClone);
  benchmark::RegisterBenchmark(Name(S::kCompare).c_str(), FfCompare);
  benchmark::RegisterBenchmark(Name(S::kCompatible).c_str(), FfCompatible);
  return true;
}();

}  // namespace
