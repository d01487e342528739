// Tests of formatdesc's workings in process, through the static library the tool links: option
// readers, each builder refusing bad values with the option named, the probe's verdicts and
// stream reports (streams built field by field, and the media files MakeProbeMedia writes),
// descriptions read back from their JSON, damaged copies of the media files; and the README's
// examples run through the built tool.
#include <gtest/gtest.h>
#include <unistd.h>

#include <boost/exception/get_error_info.hpp>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <functional>
#include <iostream>
#include <memory>
#include <sstream>

#include "Options.h"
#include "Output.h"
#include "Probe.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/mem.h>
}

namespace Formatdesc {
namespace {

using Json = nlohmann::ordered_json;
const std::string kMedia = FORMATDESC_MEDIA "/";
const std::string kStored = FORMATDESC_STORED "/";

std::string Slurp(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// A file of this process's own in the media folder, so that tests running at once do not meet.
std::string Scratch(const std::string& name, const std::string& bytes) {
  const std::string path = kMedia + "scratch-" + std::to_string(getpid()) + "-" + name;
  std::ofstream(path, std::ios::binary) << bytes;
  return path;
}

// The exit status the tool gives for what `run` throws (2 bad usage, 1 any other failure, 0
// none) and the message.
std::pair<int, std::string> Outcome(const std::function<void()>& run) {
  try {
    run();
  } catch (const UsageError& e) {
    return {2, e.what()};
  } catch (const std::exception& e) {
    return {1, e.what()};
  }
  return {0, ""};
}

// Each assertion holds in the probe's JSON `json`: "POINTER=VALUE" (a string equals VALUE,
// another value's JSON text does), "POINTER" (present) or "!POINTER" (absent: a setting left
// unset). A pointer "N:key" stands for /streams/N/description/settings/key, "N/rest" for
// /streams/N/rest.
void ExpectValues(const Json& json, const std::vector<std::string>& assertions,
                  const std::string& where) {
  for (const std::string& assertion : assertions) {
    const bool absent = assertion[0] == '!';
    const std::size_t equals = assertion.find('=');
    std::string pointer = assertion.substr(absent, equals - absent);
    if (pointer[0] != '/') pointer.insert(0, "/streams/");
    if (pointer[10] == ':') pointer.replace(10, 1, "/description/settings/");
    const Json::json_pointer at(pointer);
    if (absent) {
      EXPECT_FALSE(json.contains(at)) << where << ": " << assertion << ": " << json.at(at).dump();
    } else if (!json.contains(at)) {
      ADD_FAILURE() << where << ": " << assertion << ": missing";
    } else if (equals != std::string::npos) {
      const Json& value = json.at(at);
      EXPECT_EQ(value.is_string() ? value.get<std::string>() : value.dump(),
                assertion.substr(equals + 1))
          << where << ": " << assertion;
    }
  }
}

TEST(Options, ValuesReadAsMeant) {
  const auto pair = [](Pair (*parse)(const std::string&, const std::string&)) {
    return [parse](const std::string& text) {
      const Pair read = parse("--option", text);
      return std::to_string(read.first) + "/" + std::to_string(read.second);
    };
  };
  const auto number = [](auto parse) {
    return [parse](const std::string& text) { return std::to_string(parse("--option", text)); };
  };
  // Each parser with what it reads, given and read in turn.
  const std::pair<std::function<std::string(const std::string&)>, std::vector<const char*>>
      kValues[] = {
          {pair(ParseSize), {"1920x1080", "1920/1080"}},
          {pair(ParseRatio), {"16:9", "16/9"}},
          // Decimals of the rates with 1001 are their fractions; 29.98 is near 30000/1001 but
          // not its rounding: exact.
          {pair(ParseFrameRate),
           {"30000/1001", "30000/1001", "25",         "25/1",       "12.5",
            "25/2",       "25.0",       "25/1",       "0.001",      "1/1000",
            "29.97",      "30000/1001", "29.970",     "30000/1001", "23.976",
            "24000/1001", "59.94",      "60000/1001", "29.98",      "1499/50"}},
          {number(ParseBitrate),
           {"4500000", "4500000", "4500k", "4500000", "4K", "4000", "4.5M", "4500000", "1.25G",
            "1250000000", "1.0005k", "1001"}},
          {number(ParseCodecTag), {"avc1", "828601953", "0x31637661", "828601953", "1234", "1234"}},
          // FFmpeg's names: its "5.1" has back speakers, "5.1(side)" side ones.
          {number(ParseChannelLayout),
           {"5.1", "63", "5.1(side)", "1551", "Stereo", "3", "7.1(wide-side)", "1743", "0x3f", "63",
            "4", "4", "FL+FR+LFE", "11"}},
          {number(
               [](const std::string& o, const std::string& t) { return ParsePositive(o, t, 9); }),
           {"9", "9"}},
          {number([](const std::string& o, const std::string& t) {
             return ParseNonNegative(o, t, 10);
           }),
           {"0", "0", "10", "10"}},
          {number(ParsePixelFormat), {"yuv420p", "0", "YUV420P10LE", "62"}},
          {number(ParseSampleFormat), {"fltp", "8", "S16", "1"}},
      };
  for (const auto& [parse, values] : kValues) {
    for (std::size_t i = 0; i < values.size(); i += 2) EXPECT_EQ(parse(values[i]), values[i + 1]);
  }
  for (const auto& [name, layout] : ChannelLayoutNames()) {
    EXPECT_EQ(ParseChannelLayout("--layout", name), layout) << name;
  }
  EXPECT_EQ(ParseKeyValue("--encode-option", "x264-params=a=b"),
            std::make_pair(std::string("x264-params"), std::string("a=b")));
  EXPECT_EQ(ParseKeyValue("--encode-option", "tune=").second, "");
  // Choices and codec identifiers in any letter case, given back in their own.
  EXPECT_EQ(ParseChoice("--kind", "AUDIO", {"video", "audio"}), "audio");
  EXPECT_EQ(CheckCodecId("--codec-id", "H264", {"aac", "h264"}, "video"), "h264");
}

TEST(Options, BadValuesAreRefused) {
  const std::pair<std::function<void(const std::string&)>, std::vector<const char*>> kBad[] = {
      {[](const std::string& t) { ParseSize("--size", t); },
       {"x1080", "0x1080", "1920x0", "-1920x1080", "1920x+1080", " 1920x1080", "1920x1080x3",
        "1920:1080", "4294967296x1", ""}},
      {[](const std::string& t) { ParseRatio("--frame-aspect", t); }, {"16/9", "16:0"}},
      {[](const std::string& t) { ParseFrameRate("--frame-rate", t); },
       {"0", "0.0", "0/1", "30/0", "-25", "25.", ".5", "1.2345678", "25fps", "4294967296", ""}},
      {[](const std::string& t) { ParseNonNegative("--threads", t, 10); },
       {"-1", "+5", "5 ", "0x10", "11", ""}},
      {[](const std::string& t) { ParseBitrate("--bitrate", t); },
       {"0", "0k", "-1", "4.5m", "4.5T", "M", "4.5.1M", "1.5e6", "0.0000001M"}},
      {[](const std::string& t) { ParseCodecTag("--tag", t); },
       {"avc", "avc12", "0x100000000", ""}},
      {[](const std::string& t) { ParseChannelLayout("--layout", t); },
       {"0", "0x0", "5.2", "0x100000000", ""}},
      {[](const std::string& t) { ParsePixelFormat("--pix-fmt", t); }, {""}},
      {[](const std::string& t) { ParseKeyValue("--encode-option", t); }, {"=slow", "slow"}},
  };
  for (const auto& [parse, texts] : kBad) {
    for (const char* text : texts) EXPECT_THROW(parse(text), UsageError) << text;
  }
}

std::function<void()> Video(const std::function<void(VideoArgs&)>& set) {
  return [set] {
    VideoArgs args;
    set(args);
    BuildVideo(args);
  };
}
std::function<void()> Audio(const std::function<void(AudioArgs&)>& set) {
  return [set] {
    AudioArgs args;
    set(args);
    BuildAudio(args);
  };
}

// Every option's value and file refused by its builder or reader: exit status and message.
TEST(Options, BuildersNameTheOptionRefused) {
  const std::string size = "expected WIDTHxHEIGHT with positive integers";
  const std::string ratio = "expected W:H with positive integers";
  const std::string positive = "expected a positive integer up to 2147483647";
  const std::string videoId = "expected a video codec identifier (see 'formatdesc codecs')";
  const std::string settings = " (the settings are derived from the tree: edit the tree)";
  const struct {
    std::function<void()> run;
    int status;
    std::string message;
  } kRows[] = {
    {Video([](VideoArgs& a) { a.size = "19x"; }), 2, "--size: " + size + ", got '19x'"},
    {[] {
       SubtitleArgs args;
       args.dvbSize = "720*576";
       BuildSubtitle(args);
     },
     2, "--dvb-size: " + size + ", got '720*576'"},
    {Video([](VideoArgs& a) { a.size = "8x8", a.frameAspect = "16-9"; }), 2,
     "--frame-aspect: " + ratio + ", got '16-9'"},
    {Video([](VideoArgs& a) { a.size = "8x8", a.pixelAspect = "1:0"; }), 2,
     "--pixel-aspect: " + ratio + ", got '1:0'"},
    {Video([](VideoArgs& a) { a.frameRate = "-25"; }), 2,
     "--frame-rate: expected a positive frame rate such as 25, 29.97 or 30000/1001, got '-25'"},
    {Audio([](AudioArgs& a) { a.sampleRate = "0"; }), 2,
     "--sample-rate: " + positive + ", got '0'"},
    {Audio([](AudioArgs& a) { a.frameSize = "0"; }), 2, "--frame-size: " + positive + ", got '0'"},
    {Video([](VideoArgs& a) { a.codec.bitrate = "-1"; }), 2,
     "--bitrate: expected a positive number of bits per second such as 4500000, 4500k, 4.5M or "
     "1G, got '-1'"},
    {Audio([](AudioArgs& a) { a.codec.threads = "-2"; }), 2,
     "--threads: expected a non-negative integer up to 4294967295, got '-2'"},
    {Video([](VideoArgs& a) { a.codec.quality = "-1"; }), 2,
     "--quality: expected a non-negative integer up to 2147483647, got '-1'"},
    {Video([](VideoArgs& a) { a.pixelFormat = "yuv999p"; }), 2,
     "--pix-fmt: expected a pixel format name such as yuv420p, got 'yuv999p'"},
    {Audio([](AudioArgs& a) { a.sampleFormat = "float"; }), 2,
     "--sample-fmt: expected a sample format name such as fltp or s16, got 'float'"},
    {Audio([](AudioArgs& a) { a.layout = "5.2"; }), 2,
     "--layout: expected a channel layout such as mono, stereo, 5.1 or 5.1(side) (FFmpeg's "
     "names), or a non-zero speaker mask, got '5.2'"},
    {Video([](VideoArgs& a) { a.codec.codecId = "aac"; }), 2,
     "--codec-id: " + videoId + ", got 'aac'"},
    {Audio([](AudioArgs& a) { a.codec.codecId = "h264"; }), 2,
     "--codec-id: expected an audio codec identifier (see 'formatdesc codecs'), got 'h264'"},
    {Video([](VideoArgs& a) { a.codec.tag = "avc"; }), 2,
     "--tag: expected a four-character code such as avc1, or a number, got 'avc'"},
    {Video([](VideoArgs& a) {
       a.codec.encodeOptions = {"preset=slow", "slow"};
     }),
     2, "--encode-option: expected KEY=VALUE, got 'slow'"},
    {Audio([](AudioArgs& a) { a.codec.analyzeOptions = {"=1"}; }), 2,
     "--analyze-option: expected KEY=VALUE, got '=1'"},
    {Video([](VideoArgs& a) { a.codec.bitrateMode = "foo"; }), 2,
     "--bitrate-mode: expected cbr or vbr, got 'foo'"},
    {Audio([](AudioArgs& a) { a.codec.fromJson = kStored + "none.json"; }), 2,
     "--from-json: cannot read '" + kStored + "none.json': No such file or directory"},
    {Video([](VideoArgs& a) { a.codec.fromJson = kStored + "stereo.json"; }), 2,
     "--from-json: '" + kStored +
         "stereo.json' holds an audio description, not a video description"},
    {Video([](VideoArgs& a) { a.codec.fromJson = a.codec.fromCaps = "video/x-h264"; }), 2,
     "--from-caps excludes --from-json"},
    {[] { LoadDescription("", kStored + "edited.json"); }, 1,
     kStored + "edited.json: /settings/width: 1280 disagrees with the tree's 1920" + settings},
    {[] { LoadDescription("", kStored + "truncated.json"); }, 1,
     kStored + "truncated.json: malformed JSON at line 13, column 7: syntax error while parsing "
               "object key - unexpected end of input; expected string literal"},
    {[] { LoadDescription("", kStored + "version2.json"); }, 1,
     kStored + "version2.json: /version: version 2 is not known; this library reads version 1"},
#if TARVEK_FORMATDESC_GSTREAMER
    {Video([](VideoArgs& a) { a.codec.fromCaps = "video/x-h264, width=(int)[1,5]"; }), 2,
     "--from-caps: width: not fixed: [ 1, 5 ]"},
    {Video([](VideoArgs& a) {
       a.codec.fromCaps = "video/x-h264, stream-format=(string)avc, codec_data=(buffer)0164ff";
     }),
     2,
     "--from-caps: codec_data: avcC: truncated: AVCLevelIndication needs 1 byte at offset 3, 0 "
     "remain"},
    {Video([](VideoArgs& a) { a.codec.fromCaps = "audio/x-ac3"; }), 2,
     "--from-caps: the caps give an audio description, not a video description"},
#endif
  };
  for (const auto& row : kRows) {
    EXPECT_EQ(Outcome(row.run), std::make_pair(row.status, row.message));
  }
}

// The first setting the bitrates miss, as the library names it, and the option that gives it.
TEST(Options, MissingSettingsNameTheirOption) {
  const auto missing = [](const std::function<Bitrates()>& bitrates) {
    try {
      bitrates();
    } catch (const Tarvek::Core::ChildNotFound& e) {
      const std::string* child =
          boost::get_error_info<Tarvek::Core::ChildNotFound::ChildNameInfo>(e);
      return LibraryDescription(e) + " (" + OptionForSetting(child ? *child : "") + ")";
    }
    return std::string("nothing missing");
  };
  VideoArgs video;
  video.codec.codecId = "h264";
  video.codec.bitrateMode = "CBR";
  video.frameRate = "25";
  EXPECT_EQ(missing([&] { return VideoBitrates(BuildVideo(video)); }),
            "property \"video_codec\" has no child \"width\" (--size)");
  video.size = "1920x1080";
  video.codec.bitrateMode = "VBR";
  EXPECT_EQ(MissingForBitrates(*BuildVideo(video)), std::vector<std::string>{"quality"});
  EXPECT_EQ(missing([&] { return VideoBitrates(BuildVideo(video)); }),
            "property \"video_codec\" has no child \"quality\" (--quality)");
  video.codec.quality = "23";
  EXPECT_EQ(VideoBitrates(BuildVideo(video)).typical, 7190713);
  AudioArgs audio;
  audio.codec.codecId = "aac";
  audio.sampleRate = "48000";
  audio.layout = "stereo";
  EXPECT_EQ(missing([&] { return AudioBitrates(BuildAudio(audio)); }),
            "property \"audio_codec\" has no child \"sample_fmt\" (--sample-fmt)");
  EXPECT_EQ(MissingForBitrates(*BuildAudio(AudioArgs())),
            (std::vector<std::string>{"codec_id", "sample_rate", "channel_layout", "sample_fmt"}));
}

// Every setting read back from the JSON it was written as: the same description again.
TEST(Options, DescriptionsReadBackFromTheirJson) {
  CodecArgs codec{
      {},   {},  {},   "hevc", "H.265 / HEVC", "hvc1", "cbr",           "4.5M",
      "28", "8", true, false,  true,           true,   {"preset=slow"}, {"probesize=5000000"}};
  const VideoArgs video{codec, "720x576", {}, "64:45", "25", "yuv420p10le"};
  codec = CodecArgs();
  codec.codecId = "aac";
  const AudioArgs audio{codec, "48000", "5.1", "1024", "fltp", "eng"};
  codec.codecId = "ass";
  codec.threads = "2";
  const SubtitleArgs subtitle{codec,        "eng",           "Director's commentary",
                              "A. Smithee", "[Script Info]", "720x576"};
  const auto again = [](auto args, auto build) {
    const Json json = DescriptionJson(build(args), std::nullopt);
    args = decltype(args)();
    args.codec.fromJson = Scratch("again.json", json.dump());
    EXPECT_EQ(DescriptionJson(build(args), std::nullopt), json);
    return json;
  };
  const Json hevc = again(video, BuildVideo);
  EXPECT_EQ(hevc["settings"].size(), 21u) << hevc.dump();
  EXPECT_EQ(again(audio, BuildAudio)["settings"].size(), 9u);
  EXPECT_EQ(again(subtitle, BuildSubtitle)["settings"].size(), 12u);
  std::remove(Scratch("again.json", "").c_str());
}

TEST(Output, ReadableUnits) {
  const std::pair<long long, const char*> kBitrates[] = {
      {4500000, "4.50 Mb/s"}, {128000, "128.00 kb/s"},  {999994, "999.99 kb/s"},
      {999995, "1.00 Mb/s"},  {15990648, "15.99 Mb/s"},
  };
  for (const auto& [bitrate, text] : kBitrates) EXPECT_EQ(ReadableBitrate(bitrate), text);
  EXPECT_EQ(DescribeBitrate(384000), "384.00 kb/s (384000 b/s)");
  EXPECT_EQ(ReadableFrameRate(30000.0 / 1001), "29.97");
  EXPECT_EQ(ReadableFrameRate(24000.0 / 1001), "23.976");
  EXPECT_EQ(ReadableFrameRate(25.0), "25");
}

TEST(Verdict, PlacementBoundAndText) {
  const Bitrates range{2000000, 1000000, 4000000};
  const struct {
    long long bitrate;
    const char* placement;
    long long bound, difference;
    double percent;
    const char* text;
  } kRows[] = {
      {1000000, "within", 0, 0, 0, "within the range"},
      {4000000, "within", 0, 0, 0, "within the range"},
      {380000, "below", 1000000, 620000, 62,
       "below the range by 62% (620.00 kb/s under the minimum of 1.00 Mb/s)"},
      {10000000, "above", 4000000, 6000000, 150,
       "above the range by 150% (6.00 Mb/s over the maximum of 4.00 Mb/s)"},
      {4000001, "above", 4000000, 1, 0.000025,
       "above the range by less than 1% (0.00 kb/s over the maximum of 4.00 Mb/s)"},
      {995000, "below", 1000000, 5000, 0.5,
       "below the range by less than 1% (5.00 kb/s under the minimum of 1.00 Mb/s)"},
      {986000, "below", 1000000, 14000, 1.4,
       "below the range by 1% (14.00 kb/s under the minimum of 1.00 Mb/s)"},
  };
  for (const auto& row : kRows) {
    const Verdict verdict = JudgeBitrate(row.bitrate, range);
    EXPECT_STREQ(PlacementName(verdict.placement), row.placement) << row.bitrate;
    EXPECT_EQ(verdict.bound, row.bound) << row.bitrate;
    EXPECT_EQ(verdict.difference, row.difference) << row.bitrate;
    EXPECT_DOUBLE_EQ(verdict.percent, row.percent) << row.bitrate;
    EXPECT_EQ(VerdictText(verdict), row.text);
  }
}

// A stream as libavformat hands it over, set field by field, so that every value a file may
// leave unknown or give in a form the library cannot hold can be tried; checked in the probe's
// JSON for it.
TEST(Probe, StreamsAsLibavformatGivesThem) {
  struct Free {
    void operator()(AVFormatContext* context) const { avformat_free_context(context); }
  };
  const std::unique_ptr<AVFormatContext, Free> context(avformat_alloc_context());
  const auto stream = [&](AVMediaType type, AVCodecID codec) -> AVCodecParameters& {
    AVStream* made = avformat_new_stream(context.get(), nullptr);
    made->codecpar->codec_type = type;
    made->codecpar->codec_id = codec;
    return *made->codecpar;
  };
  const auto video = [&](AVCodecID codec, int width, int height) -> AVCodecParameters& {
    AVCodecParameters& p = stream(AVMEDIA_TYPE_VIDEO, codec);
    p.width = width;
    p.height = height;
    p.format = AV_PIX_FMT_YUV420P;
    context->streams[context->nb_streams - 1]->avg_frame_rate = AVRational{25, 1};
    return p;
  };
  const auto audio = [&](AVCodecID codec, std::uint64_t mask) -> AVCodecParameters& {
    AVCodecParameters& p = stream(AVMEDIA_TYPE_AUDIO, codec);
    p.sample_rate = 48000;
    p.format = AV_SAMPLE_FMT_FLTP;
    av_channel_layout_from_mask(&p.ch_layout, mask);
    return p;
  };
  const auto last = [&]() -> AVStream& { return *context->streams[context->nb_streams - 1]; };
  const auto extradata = [](AVCodecParameters& p, const std::string& bytes) {
    p.extradata = static_cast<std::uint8_t*>(av_mallocz(bytes.size() + 64));
    std::memcpy(p.extradata, bytes.data(), bytes.size());
    p.extradata_size = static_cast<int>(bytes.size());
  };
  const std::string header = "[Script Info]\nScriptType: v4.00+\n";
  const std::pair<std::function<void()>, std::vector<std::string>> kStreams[] = {
      {[&] {
         AVCodecParameters& p = video(AV_CODEC_ID_H264, 720, 576);
         p.codec_tag = MKTAG('a', 'v', 'c', '1');
         p.bit_rate = 3000000;
         last().sample_aspect_ratio = AVRational{128, 90};  // given unreduced
         last().avg_frame_rate = AVRational{30000, 1001};
         extradata(p, std::string("\x01\x64\x00\x1f", 4));
       },
       {"0/status=described", "0/codec=h264", "0:codec_id=h264",
        "0:codec_name=H.264 / AVC / MPEG-4 AVC / MPEG-4 part 10", "0:codec_tag=828601953",
        "0:bit_rate=3000000", "0:width=720", "0:height=576", "0:sample_aspect_num=64",
        "0:sample_aspect_den=45", "0/description/frame_aspect=16:9", "0:framerate_num=30000",
        "0:framerate_den=1001", "0:pix_fmt=0", "!0:bitrate_mode",
        "0/description/private_data=AWQAHw==", "0/notes=[]", "0/description/bitrate/min=1261775",
        "0/verdict/result=within"}},
      {[&] {
         video(AV_CODEC_ID_MPEG4, 352, 288).sample_aspect_ratio = AVRational{12, 11};
       },
       {"0:sample_aspect_num=12", "0:sample_aspect_den=11"}},
      {[&] {
         AVCodecParameters& p = video(AV_CODEC_ID_MPEG4, 640, 480);
         last().avg_frame_rate = AVRational{0, 0};
         p.format = AV_PIX_FMT_NB;  // beyond libavutil's formats, as a bad file may say
         p.bit_rate = 800000;
       },
       {"0:width=640", "!0:sample_aspect_num", "!0:framerate_num", "!0:framerate_den", "!0:pix_fmt",
        "0/description/private_data=null", "0/notes/2", "!0/notes/3", "!0/description/bitrate",
        "0/verdict/result=none",
        "0/verdict/text=none (the presets need the frame rate, which the file does not give)"}},
      {[&] { video(AV_CODEC_ID_CINEPAK, 640, 480).bit_rate = 5000000; },
       {"0:codec_id=cinepak", "!0/description/bitrate", "0/verdict/result=no_preset",
        "0/verdict/text=no preset for codec cinepak"}},
      {[&] { video(AV_CODEC_ID_NONE, 320, 240); },
       {"0/status=damaged", "0/damage=libavformat does not know the stream's codec"}},
      {[&] { audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_STEREO).sample_rate = 0; },
       {"0/status=damaged", "!0/description"}},
      {[&] { av_channel_layout_uninit(&audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_STEREO).ch_layout); },
       {"0/status=damaged", "!0/description"}},
      {[&] {
         AVCodecParameters& p = audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_5POINT1);
         p.bit_rate = 448000;
         p.frame_size = 1536;
         p.codec_tag = 0x2000;
         av_dict_set(&last().metadata, "language", "eng", 0);
       },
       {"0:codec_id=ac3", "0:codec_tag=8192", "0:bit_rate=448000", "0:sample_rate=48000",
        "0:channel_layout=1551", "0:frame_size=1536", "0:sample_fmt=8", "0:metadata/language=eng",
        "0/notes=[]", "0/description/bitrate/default=448000", "0/verdict/result=within"}},
      {[&] {
         AVCodecParameters& p = audio(AV_CODEC_ID_FLAC, AV_CH_LAYOUT_STEREO);
         p.format = AV_SAMPLE_FMT_NONE;
         p.bit_rate = 900000;
       },
       {"!0:sample_fmt", "0/notes=[\"the sample format is unknown, so it is left unset\"]",
        "0/verdict/text=none (the presets need the sample format, which the file does not give)"}},
      {[&] {
         audio(AV_CODEC_ID_PCM_S16LE, AV_CH_LAYOUT_STEREO | AV_CH_SURROUND_DIRECT_LEFT).format =
             AV_SAMPLE_FMT_S16;
       },
       {"!0:channel_layout",
        "0/notes/0=the speaker mask 0x200000003 names speakers beyond the library's 32, so the "
        "channel layout is left unset"}},
      {[&] { audio(AV_CODEC_ID_MP3, AV_CH_LAYOUT_5POINT1).bit_rate = 320000; },
       {"0/status=described", "0/verdict/result=none",
        "0/verdict/text=none (the presets refuse the description: Channel layout 0x60f has 6 "
        "channels; codec mp3 carries 1 to 2)"}},
      {[&] {
         extradata(stream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_ASS), header + std::string(1, '\0'));
         av_dict_set(&last().metadata, "language", "ger", 0);
         av_dict_set(&last().metadata, "title", "Director's commentary", 0);
       },
       {"0:codec_id=ass", "0:subtitle_header=" + header, "0:language=ger",
        "0:title=Director's commentary", "!0:dvb_width",
        "0/description/private_data=W1NjcmlwdCBJbmZvXQpTY3JpcHRUeXBlOiB2NC4wMCsKAA==",
        "!0/description/bitrate", "!0/verdict"}},
      {[&] {
         extradata(stream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_MOV_TEXT),
                   std::string("\x00\x00\x00\x00\x01", 5));
       },
       {"!0:subtitle_header", "!0:language", "!0:title", "0/description/private_data=AAAAAAE="}},
      {[&] {
         AVCodecParameters& p = stream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_DVB_SUBTITLE);
         p.width = 1920;
         p.height = 1080;
       },
       {"0:dvb_width=1920", "0:dvb_height=1080"}},
      {[&] { stream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_DVB_SUBTITLE); }, {"!0:dvb_width"}},
      {[&] {  // only DVB subtitles have a DVB size
         AVCodecParameters& p = stream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_HDMV_PGS_SUBTITLE);
         p.width = 1920;
         p.height = 1080;
       },
       {"!0:dvb_width"}},
      {[&] { stream(AVMEDIA_TYPE_DATA, AV_CODEC_ID_NONE); },
       {"0/status=skipped", "0/kind=data", "!0/damage"}},
  };
  for (const auto& [make, assertions] : kStreams) {
    make();
    FileReport report;
    report.streams.push_back(DescribeStream(*context, context->nb_streams - 1));
    ExpectValues(ProbeJson("", report, std::nullopt), assertions,
                 "stream " + std::to_string(context->nb_streams - 1));
  }
}

// What MakeProbeMedia writes, stream by stream: the settings it gave its encoders and muxers.
TEST(Probe, MediaFilesHoldWhatTheyWereWrittenWith) {
  const std::pair<const char*, std::vector<std::string>> kFiles[] = {
      {"sd.mp4",
       {"0/kind=video", "0/codec=mpeg4", "0:codec_id=mpeg4", "0:codec_tag=1983148141",
        "0:width=720", "0:height=576", "0:sample_aspect_num=64", "0:sample_aspect_den=45",
        "0/description/frame_aspect=16:9", "0/description/frame_rate=25.0",
        "0/description/pix_fmt_name=yuv420p", "0:framerate_num=25", "0:framerate_den=1",
        "0:pix_fmt=0", "0/verdict/result=within", "/container=QuickTime / MOV"}},
      {"sd.mp4",
       {"1/kind=audio", "1:codec_id=ac3", "1:bit_rate=448000", "1:sample_rate=48000",
        "1:channel_layout=1551", "1:sample_fmt=8", "1:metadata/language=eng",
        "1/description/channel_layout_name=5.1(side)", "1/verdict/result=within"}},
      {"low.avi",
       {"0:codec_tag=877677894", "0:width=352", "0:height=288", "0:sample_aspect_num=12",
        "0:sample_aspect_den=11", "0/description/frame_aspect=4:3", "0:framerate_num=30000",
        "0:framerate_den=1001", "0/verdict/result=below", "1:codec_id=pcm_s16le", "1:codec_tag=1",
        "1:bit_rate=768000", "1:sample_fmt=1", "!1:channel_layout", "!1:metadata/language",
        "1/verdict/result=within",
        "1/notes/1=the range is that of 1 channel in the usual layout (mono)"}},
      {"high.mp4",
       {"0:width=352", "0:framerate_num=30000", "0/verdict/result=above", "!/streams/1"}},
      {"surround.ac3",
       {"/container=raw AC-3", "0:bit_rate=448000", "0:channel_layout=1551",
        "0/verdict/result=within", "0/description/bitrate/max=640000"}},
      {"mono.ac3", {"0:bit_rate=96000", "0:channel_layout=4", "0/description/channels=1"}},
      {"stereo.wav",
       {"0:bit_rate=1536000", "!0:channel_layout", "0/description/bitrate/min=1536000",
        "0/verdict/result=within",
        "0/notes/0=the file gives 2 channels in no speaker order (unspecified), so the channel "
        "layout is left unset",
        "0/notes/1=the range is that of 2 channels in the usual layout (stereo)"}},
      {"surround.wav",
       {"0:bit_rate=4608000", "0:channel_layout=1551", "0:sample_rate=48000",
        "0/verdict/result=within", "0/notes=[]"}},
      {"subtitles.mkv",
       {"0:width=352", "0:sample_aspect_num=12", "0:framerate_den=1001", "!0:bit_rate",
        "!0:codec_tag", "0/verdict/result=no_bitrate", "1:codec_id=ac3", "1:channel_layout=3",
        "1:metadata/language=fre", "2/kind=subtitle", "2:codec_id=ass", "2:language=ger",
        "2:title=Director's commentary",
        "2:subtitle_header=[Script Info]\nTitle: Interview\nScriptType: v4.00+\n",
        "2/description/private_data="
        "W1NjcmlwdCBJbmZvXQpUaXRsZTogSW50ZXJ2aWV3ClNjcmlwdFR5cGU6IHY0LjAwKwo=",
        "!2/verdict", "3/kind=attachment", "3/status=skipped", "!3/description"}},
      {"damaged.ts",
       {"0/status=damaged", "!0/description", "1/status=described", "1/verdict/result=within",
        "1/verdict/bound=null"}},
  };
  for (const auto& [file, assertions] : kFiles) {
    ExpectValues(ProbeJson(file, ProbeFile(kMedia + file), std::nullopt), assertions, file);
  }
  // Only local files that libavformat recognises as media: a network address is a file name.
  const std::pair<std::string, std::string> kUnreadable[] = {
      {kMedia + "notes.txt", "as media: Invalid data found when processing input"},
      {kMedia + "none.mp4", ": No such file or directory"},
      {"http://localhost/clip.mp4", ": No such file or directory"},
  };
  for (const auto& [path, reason] : kUnreadable) {
    EXPECT_EQ(
        Outcome([&] { ProbeFile(path); }),
        std::make_pair(2, "cannot read '" + path + "'" + (reason[0] == ':' ? "" : " ") + reason));
  }
}

// The descriptions in probe's JSON are the library's lossless form: read back alone, they are
// the same description; the whole document, read with --stream, gives the range the probe gave
// (video in a target-bitrate mode, as the probe judges it).
TEST(Probe, DescriptionsReadBack) {
  int described = 0;
  for (const char* file : {"sd.mp4", "low.avi", "stereo.wav", "subtitles.mkv"}) {
    const Json probed = ProbeJson(file, ProbeFile(kMedia + file), std::nullopt);
    const std::string whole = Scratch("whole.json", probed.dump());
    for (const Json& stream : probed["streams"]) {
      if (!stream.contains("description")) continue;
      ++described;
      const Json& description = stream["description"];
      const std::string where = std::string(file) + " stream " + stream["index"].dump();
      const Json back = DescriptionJson(
          LoadDescription("--from-json", Scratch("one.json", description.dump())), std::nullopt);
      for (const char* member : {"kind", "tree", "private_data"}) {
        EXPECT_EQ(back[member], description[member]) << where << ' ' << member;
      }
      if (!description.contains("bitrate")) continue;
      Bitrates range;
      if (stream["kind"] == "video") {
        VideoArgs args;
        args.codec.fromJson = whole;
        args.codec.stream = stream["index"].dump();
        args.codec.bitrateMode = "cbr";
        range = VideoBitrates(BuildVideo(args));
      } else {
        AudioArgs args;
        args.codec.fromJson = whole;
        args.codec.stream = "a:0";
        range = AudioBitrates(BuildAudio(args));
      }
      EXPECT_EQ(Json({{"default", range.typical}, {"min", range.minimum}, {"max", range.maximum}}),
                description["bitrate"])
          << where;
    }
    if (std::string(file) != "sd.mp4") continue;
    // Streams picked wrongly.
    const std::pair<const char*, std::string> kPicks[] = {
        {"", "'" + whole + "' holds 2 described streams; pick one with --stream (2, v:0, a:1)"},
        {"x:0",
         "--stream: expected a stream index (2) or a kind and an index (v:0, a:1, s:0), got 'x:0'"},
        {"9", "--stream: '" + whole + "' has no stream 9"},
        {"s:0", "--stream: '" + whole + "' has no stream s:0"},
    };
    for (const auto& [pick, message] : kPicks) {
      const auto stream = *pick ? std::optional<std::string>(pick) : std::nullopt;
      EXPECT_EQ(Outcome([&] { LoadDescription("", whole, stream); }), std::make_pair(2, message));
    }
  }
  EXPECT_EQ(described, 8);
  std::remove(Scratch("whole.json", "").c_str());
  std::remove(Scratch("one.json", "").c_str());
}

// Damaged copies of the media files, cut short and overwritten in places, are read without a
// crash: refused as not media, or reported stream by stream.
TEST(Probe, DamagedFilesAreReported) {
  std::uint32_t state = 2024;  // the same bytes on every run, unlike rand()
  const auto next = [&state] { return (state = state * 1664525u + 1013904223u) >> 8; };
  std::ostringstream printed;
  std::streambuf* const out = std::cout.rdbuf(printed.rdbuf());
  int reported = 0;
  for (const char* file :
       {"sd.mp4", "low.avi", "subtitles.mkv", "damaged.ts", "surround.wav", "surround.ac3"}) {
    const std::string bytes = Slurp(kMedia + file);
    ASSERT_GT(bytes.size(), 64u) << file;
    std::vector<std::string> copies;
    for (std::size_t quarter = 1; quarter < 4; ++quarter) {
      copies.push_back(bytes.substr(0, bytes.size() * quarter / 4));
    }
    for (int place = 0; place < 3; ++place) {
      std::string copy = bytes;
      const std::size_t at = next() % (copy.size() - 16);
      for (std::size_t i = at; i < at + 16; ++i) copy[i] = static_cast<char>(next());
      copies.push_back(copy);
    }
    for (std::size_t i = 0; i < copies.size(); ++i) {
      const std::string path = Scratch(std::to_string(i) + "-" + file, copies[i]);
      try {
        const FileReport report = ProbeFile(path);
        PrintProbe(path, report, std::nullopt);
        const Json json = ProbeJson(path, report, std::nullopt);
        for (const Json& stream : json["streams"]) {
          const std::string status = stream["status"];
          EXPECT_TRUE(status == "described" || status == "skipped" ||
                      (status == "damaged" && !stream["damage"].get<std::string>().empty()))
              << path << ": " << stream.dump();
        }
        ++reported;
      } catch (const UsageError& e) {
        EXPECT_NE(std::string(e.what()).find(path), std::string::npos) << e.what();
      }
      std::remove(path.c_str());
    }
  }
  std::cout.rdbuf(out);
  EXPECT_GT(reported, 0);
}

// Every console block of the README's formatdesc section ("$ formatdesc ..." then the output)
// prints what it shows, run through the shell as a user's would be; with
// FORMATDESC_UPDATE_EXPECTED set, the blocks are rewritten with what the tool prints instead.
TEST(Readme, ExamplesPrintWhatTheyShow) {
  std::string readme = Slurp(FORMATDESC_README);
  const std::size_t section = readme.find("\n## The formatdesc tool\n");
  ASSERT_NE(section, std::string::npos);
  const bool update = std::getenv("FORMATDESC_UPDATE_EXPECTED") != nullptr;
  const std::string open = "```console\n$ formatdesc";
  int examples = 0;
  // The section ends at the next heading of its level; updates move it, so it is found anew.
  for (std::size_t block = readme.find(open, section); block < readme.find("\n## ", section + 1);
       block = readme.find(open, block + 1)) {
    // The command runs to the first line that does not end in a backslash.
    std::size_t commandEnd = readme.find('\n', block + open.size());
    while (readme[commandEnd - 1] == '\\') commandEnd = readme.find('\n', commandEnd + 1);
    const std::size_t outputEnd = readme.find("```\n", commandEnd);
    ASSERT_NE(outputEnd, std::string::npos);
    const std::string command =
        readme.substr(block + open.size(), commandEnd - block - open.size());
    std::string actual;
    FILE* pipe = popen(
        ("cd '" FORMATDESC_README_WORK "' && '" FORMATDESC_TOOL "'" + command + " 2>&1").c_str(),
        "r");
    ASSERT_NE(pipe, nullptr);
    char buffer[4096];
    for (std::size_t n; (n = std::fread(buffer, 1, sizeof buffer, pipe)) > 0;) {
      actual.append(buffer, n);
    }
    pclose(pipe);
    ++examples;
    if (update) {
      readme.replace(commandEnd + 1, outputEnd - commandEnd - 1, actual);
    } else {
      EXPECT_EQ(readme.substr(commandEnd + 1, outputEnd - commandEnd - 1), actual)
          << "formatdesc" << command;
    }
  }
  if (update) std::ofstream(FORMATDESC_README) << readme;
  EXPECT_GT(examples, 10);
}

}  // namespace
}  // namespace Formatdesc
