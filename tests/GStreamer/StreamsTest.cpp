// Codec strings of streams encoded when the tests run (MakeProbeMedia --streaming) against two
// other implementations: the codecs attribute libavformat's DASH muxer wrote into each manifest,
// and GStreamer's gst_codec_utils_caps_get_mime_codec() on the stream's caps.
#include <Tarvek/CodecString/CodecString.h>
#include <Tarvek/FFmpeg/Streams.h>
#include <Tarvek/GStreamer/Caps.h>
#include <gst/pbutils/pbutils.h>
#include <gtest/gtest.h>

#include <cctype>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <string>

extern "C" {
#include <libavformat/avformat.h>
}

namespace {

using namespace Tarvek;
namespace fs = std::filesystem;

std::string ReadFile(const fs::path& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// The stream of a DASH folder as one file: its initialisation segment and its first media
// segment, read by libavformat and described by the FFmpeg bridge.
boost::intrusive_ptr<Conf::IFormatCodec> Describe(const fs::path& folder) {
  const std::string ext = fs::exists(folder / "init-stream0.webm") ? ".webm" : ".m4s";
  const fs::path whole = folder / ("whole" + ext);
  std::ofstream(whole, std::ios::binary) << ReadFile(folder / ("init-stream0" + ext))
                                         << ReadFile(folder / ("chunk-stream0-00001" + ext));
  AVFormatContext* input = nullptr;
  if (avformat_open_input(&input, whole.c_str(), nullptr, nullptr) < 0) return nullptr;
  avformat_find_stream_info(input, nullptr);
  const auto description = FFmpeg::DescribeStream(*input, 0).description;
  avformat_close_input(&input);
  return description;
}

// Codec strings compare without regard to case (RFC 6381 hexadecimal digits).
std::string Lower(std::string text) {
  for (char& c : text) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return text;
}

// Whether `ours` is `entry` or `entry` with its parameters.
bool Extends(const std::string& ours, const std::string& entry) {
  return ours == entry || ours.rfind(entry + ".", 0) == 0;
}

TEST(CodecStringStreamsTest, AgreeWithDashManifestAndGStreamer) {
  gst_init(nullptr, nullptr);
  const fs::path media = TARVEK_STREAMING_MEDIA;
  int compared = 0;
  for (const char* codec : {"h264", "hevc", "vp9", "av1", "aac", "opus", "flac", "ac3", "eac3"}) {
    const fs::path folder = media / codec;
    if (!fs::exists(folder / "stream.mpd")) continue;  // no encoder for it in this libavcodec
    SCOPED_TRACE(codec);
    std::smatch found;
    const std::string manifest = ReadFile(folder / "stream.mpd");
    ASSERT_TRUE(std::regex_search(manifest, found, std::regex("codecs=\"([^\"]*)\"")));
    const std::string dash = Lower(found[1]);
    const auto description = Describe(folder);
    ASSERT_TRUE(description);
    const std::string exact = CodecString::GetCodecString(description);
    const std::string ours = Lower(exact);
    if (dash == "flac")
      EXPECT_EQ(exact, "fLaC");  // the muxer writes WebM's name; MP4's sample entry is fLaC
    else if (std::string(codec) == "hevc")
      EXPECT_TRUE(Extends(ours, dash)) << ours;  // the muxer writes the entry alone
    else
      EXPECT_EQ(ours, dash);

    GstCaps* caps = GStreamer::ToCaps(description);
    gchar* mime = gst_codec_utils_caps_get_mime_codec(caps);
    gst_caps_unref(caps);
    if (!mime) continue;  // a codec GStreamer has no string for
    const std::string gst = Lower(mime);
    g_free(mime);
    if (gst.find('.') == std::string::npos)
      EXPECT_TRUE(Extends(ours, gst)) << gst;  // GStreamer writes the entry alone
    else  // the sample entry follows the packaging, which the caps choose for HEVC
      EXPECT_EQ(ours.substr(4), gst.substr(4));
    ++compared;
  }
  if (compared == 0) GTEST_SKIP() << "no stream in " << media;
}

}  // namespace
