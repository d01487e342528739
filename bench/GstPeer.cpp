// The five workloads on GStreamer caps: one GstStructure with the twelve settings in a GstCaps.
// Compiled only when pkg-config finds gstreamer-1.0.
#include <benchmark/benchmark.h>
#include <gst/gst.h>

#include <string>

#include "BenchSettings.h"

namespace {

namespace S = TarvekBench;

void EnsureGst() {
  static const bool initialised = [] {
    gst_init(nullptr, nullptr);
    return true;
  }();
  (void)initialised;
}

GstCaps* BuildFull() {
  GstStructure* s = gst_structure_new_empty("video/x-h264");
  gst_structure_set(s, "codec-name", G_TYPE_STRING, S::kCodecName,                             //
                    "codec-id", G_TYPE_STRING, S::kCodecId,                                    //
                    "bitrate-mode", G_TYPE_STRING, S::kBitrateMode,                            //
                    "bitrate", G_TYPE_INT64, static_cast<gint64>(S::kBitrate),                 //
                    "quality", G_TYPE_INT, static_cast<gint>(S::kQuality),                     //
                    "width", G_TYPE_INT, static_cast<gint>(S::kWidth),                         //
                    "height", G_TYPE_INT, static_cast<gint>(S::kHeight),                       //
                    "pixel-aspect-ratio", GST_TYPE_FRACTION,                                   //
                    static_cast<gint>(S::kPixelAspectX), static_cast<gint>(S::kPixelAspectY),  //
                    "framerate", GST_TYPE_FRACTION,                                            //
                    static_cast<gint>(S::kFrameRateNum), static_cast<gint>(S::kFrameRateDen),  //
                    "pix-fmt", G_TYPE_INT, static_cast<gint>(S::kPixelFormat),                 //
                    "lossless", G_TYPE_BOOLEAN, static_cast<gboolean>(S::kLossless),           //
                    "two-pass", G_TYPE_BOOLEAN, static_cast<gboolean>(S::kTwoPass),            //
                    nullptr);
  return gst_caps_new_full(s, nullptr);
}

// Caps with only the geometry, for the compatibility test: absent fields do not constrain.
GstCaps* BuildGeometry() {
  GstStructure* s = gst_structure_new_empty("video/x-h264");
  gst_structure_set(s, "width", G_TYPE_INT, static_cast<gint>(S::kWidth),  //
                    "height", G_TYPE_INT, static_cast<gint>(S::kHeight),   //
                    "pixel-aspect-ratio", GST_TYPE_FRACTION,               //
                    static_cast<gint>(S::kPixelAspectX), static_cast<gint>(S::kPixelAspectY),
                    nullptr);
  return gst_caps_new_full(s, nullptr);
}

void GstBuild(benchmark::State& state) {
  EnsureGst();
  for (auto _ : state) {
    GstCaps* caps = BuildFull();
    benchmark::DoNotOptimize(caps);
    gst_caps_unref(caps);
  }
}

void GstRead(benchmark::State& state) {
  EnsureGst();
  GstCaps* caps = BuildFull();
  const GstStructure* s = gst_caps_get_structure(caps, 0);
  for (auto _ : state) {
    gint i = 0;
    gint j = 0;
    gint64 l = 0;
    gboolean b = FALSE;
    if (gst_structure_has_field(s, "codec-name"))
      benchmark::DoNotOptimize(gst_structure_get_string(s, "codec-name"));
    if (gst_structure_has_field(s, "codec-id"))
      benchmark::DoNotOptimize(gst_structure_get_string(s, "codec-id"));
    if (gst_structure_has_field(s, "bitrate-mode"))
      benchmark::DoNotOptimize(gst_structure_get_string(s, "bitrate-mode"));
    if (gst_structure_has_field(s, "bitrate") && gst_structure_get_int64(s, "bitrate", &l))
      benchmark::DoNotOptimize(l);
    if (gst_structure_has_field(s, "quality") && gst_structure_get_int(s, "quality", &i))
      benchmark::DoNotOptimize(i);
    if (gst_structure_has_field(s, "width") && gst_structure_get_int(s, "width", &i))
      benchmark::DoNotOptimize(i);
    if (gst_structure_has_field(s, "height") && gst_structure_get_int(s, "height", &i))
      benchmark::DoNotOptimize(i);
    if (gst_structure_has_field(s, "pixel-aspect-ratio") &&
        gst_structure_get_fraction(s, "pixel-aspect-ratio", &i, &j)) {
      benchmark::DoNotOptimize(i);
      benchmark::DoNotOptimize(j);
    }
    if (gst_structure_has_field(s, "framerate") &&
        gst_structure_get_fraction(s, "framerate", &i, &j)) {
      benchmark::DoNotOptimize(i);
      benchmark::DoNotOptimize(j);
    }
    if (gst_structure_has_field(s, "pix-fmt") && gst_structure_get_int(s, "pix-fmt", &i))
      benchmark::DoNotOptimize(i);
    if (gst_structure_has_field(s, "lossless") && gst_structure_get_boolean(s, "lossless", &b))
      benchmark::DoNotOptimize(b);
    if (gst_structure_has_field(s, "two-pass") && gst_structure_get_boolean(s, "two-pass", &b))
      benchmark::DoNotOptimize(b);
  }
  gst_caps_unref(caps);
}

void GstClone(benchmark::State& state) {
  EnsureGst();
  GstCaps* caps = BuildFull();
  for (auto _ : state) {
    GstCaps* copy = gst_caps_copy(caps);
    benchmark::DoNotOptimize(copy);
    gst_caps_unref(copy);
  }
  gst_caps_unref(caps);
}

void GstCompare(benchmark::State& state) {
  EnsureGst();
  GstCaps* first = BuildFull();
  GstCaps* second = BuildFull();
  for (auto _ : state) benchmark::DoNotOptimize(gst_caps_is_equal(first, second));
  if (!gst_caps_is_equal(first, second)) state.SkipWithError("the two caps differ");
  gst_caps_unref(first);
  gst_caps_unref(second);
}

void GstCompatible(benchmark::State& state) {
  EnsureGst();
  GstCaps* first = BuildFull();
  GstCaps* second = BuildGeometry();
  for (auto _ : state) benchmark::DoNotOptimize(gst_caps_can_intersect(first, second));
  if (!gst_caps_can_intersect(first, second)) state.SkipWithError("the caps do not intersect");
  gst_caps_unref(first);
  gst_caps_unref(second);
}

std::string Name(const char* workload) { return std::string("GStreamer/") + workload; }

const bool kRegistered = [] {
  benchmark::RegisterBenchmark(Name(S::kBuild).c_str(), GstBuild);
  benchmark::RegisterBenchmark(Name(S::kRead).c_str(), GstRead);
  benchmark::RegisterBenchmark(Name(S::kClone).c_str(), GstClone);
  benchmark::RegisterBenchmark(Name(S::kCompare).c_str(), GstCompare);
  benchmark::RegisterBenchmark(Name(S::kCompatible).c_str(), GstCompatible);
  return true;
}();

}  // namespace
