// The GStreamer bridge and the codec strings beside GStreamer building, reading and writing the
// same caps: an H.264 1080p description with its avcC record, and the caps it maps to.
// Compiled only when the GStreamer bridge is built.
#include <Tarvek/CodecString/CodecString.h>
#include <Tarvek/Conf/Formats/FormatCodecVideo.h>
#include <Tarvek/GStreamer/Caps.h>
#include <benchmark/benchmark.h>

namespace {

using namespace Tarvek;

const std::uint8_t kAvcC[] = {0x01, 0x64, 0x00, 0x28, 0xFF, 0xE1, 0x00, 0x04, 0x67,
                              0x64, 0x00, 0x28, 0x01, 0x00, 0x02, 0x68, 0xEE};

boost::intrusive_ptr<Conf::IFormatCodecVideo> Description() {
  gst_init(nullptr, nullptr);
  auto video = Conf::FormatCodecVideo::Create();
  video->SetCodecID("h264");
  video->InitByPixelAspect(1920, 1080, 1, 1);
  video->SetFrameRate(30000, 1001);
  video->SetPrivateData(CreateBlob(kAvcC, sizeof kAvcC));
  return video;
}

// The caps ToCaps makes for Description(), built field by field.
GstCaps* NewSimple(GstBuffer* codecData) {
  return gst_caps_new_simple("video/x-h264", "width", G_TYPE_INT, 1920, "height", G_TYPE_INT, 1080,
                             "framerate", GST_TYPE_FRACTION, 30000, 1001, "pixel-aspect-ratio",
                             GST_TYPE_FRACTION, 1, 1, "stream-format", G_TYPE_STRING, "avc",
                             "alignment", G_TYPE_STRING, "au", "codec_data", GST_TYPE_BUFFER,
                             codecData, nullptr);
}

void TarvekToCaps(benchmark::State& state) {
  const auto video = Description();
  for (auto _ : state) {
    GstCaps* caps = GStreamer::ToCaps(video);
    benchmark::DoNotOptimize(caps);
    gst_caps_unref(caps);
  }
}

void GstToCaps(benchmark::State& state) {
  gst_init(nullptr, nullptr);
  for (auto _ : state) {
    // The private data is copied into a buffer on each build, as ToCaps does.
    GstBuffer* buffer = gst_buffer_new_memdup(kAvcC, sizeof kAvcC);
    GstCaps* caps = NewSimple(buffer);
    gst_buffer_unref(buffer);
    benchmark::DoNotOptimize(caps);
    gst_caps_unref(caps);
  }
}

void TarvekFromCaps(benchmark::State& state) {
  GstCaps* caps = GStreamer::ToCaps(Description());
  for (auto _ : state) benchmark::DoNotOptimize(GStreamer::FromCaps(caps));
  gst_caps_unref(caps);
}

void TarvekFromCapsString(benchmark::State& state) {
  const std::string text = GStreamer::ToCapsString(Description());
  for (auto _ : state) benchmark::DoNotOptimize(GStreamer::FromCapsString(text));
}

void GstFromCapsString(benchmark::State& state) {
  const std::string text = GStreamer::ToCapsString(Description());
  for (auto _ : state) {
    GstCaps* caps = gst_caps_from_string(text.c_str());
    benchmark::DoNotOptimize(caps);
    gst_caps_unref(caps);
  }
}

void TarvekToCapsString(benchmark::State& state) {
  const auto video = Description();
  for (auto _ : state) benchmark::DoNotOptimize(GStreamer::ToCapsString(video));
}

void GstToCapsString(benchmark::State& state) {
  GstCaps* caps = GStreamer::ToCaps(Description());
  for (auto _ : state) {
    gchar* text = gst_caps_to_string(caps);
    benchmark::DoNotOptimize(text);
    g_free(text);
  }
  gst_caps_unref(caps);
}

void TarvekCodecString(benchmark::State& state) {
  const boost::intrusive_ptr<Conf::IFormatCodec> video = Description();
  for (auto _ : state) benchmark::DoNotOptimize(CodecString::GetCodecString(video));
}

const bool kRegistered = [] {
  benchmark::RegisterBenchmark("Tarvek/to_caps", TarvekToCaps);
  benchmark::RegisterBenchmark("GStreamer/to_caps", GstToCaps);
  benchmark::RegisterBenchmark("Tarvek/from_caps", TarvekFromCaps);
  benchmark::RegisterBenchmark("Tarvek/from_caps_string", TarvekFromCapsString);
  benchmark::RegisterBenchmark("GStreamer/from_caps_string", GstFromCapsString);
  benchmark::RegisterBenchmark("Tarvek/to_caps_string", TarvekToCapsString);
  benchmark::RegisterBenchmark("GStreamer/to_caps_string", GstToCapsString);
  benchmark::RegisterBenchmark("Tarvek/codec_string", TarvekCodecString);
  return true;
}();

}  // namespace
