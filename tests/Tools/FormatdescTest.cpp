// Tests of formatdesc: its workings in process, through the library the tool links, and the built
// tool as a user runs it. Expected outputs are in expected/, rewritten instead of compared with
// FORMATDESC_UPDATE_EXPECTED set.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iostream>
#include <memory>
#include <sstream>

#include "Options.h"
#include "Output.h"
#include "Probe.h"

extern "C" {
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/mem.h>
}

namespace Formatdesc {
namespace {

using Json = nlohmann::ordered_json;
namespace fs = std::filesystem;
// The media files; stored/ among them holds the stored descriptions.
const std::string kMedia = FORMATDESC_MEDIA "/";
const bool kUpdate = std::getenv("FORMATDESC_UPDATE_EXPECTED") != nullptr;

std::string Slurp(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// `text` equals expected/NAME.txt, or rewrites it.
void ExpectFile(const std::string& name, const std::string& text) {
  const std::string path = FORMATDESC_EXPECTED "/" + name + ".txt";
  if (kUpdate) std::ofstream(path, std::ios::binary) << text;
  EXPECT_EQ(text, Slurp(path)) << path;
}

// A file of this process's own in the media folder, so that tests running at once do not meet.
std::string Scratch(const std::string& name, const std::string& bytes) {
  const std::string path = kMedia + "scratch-" + std::to_string(getpid()) + "-" + name;
  std::ofstream(path, std::ios::binary) << bytes;
  return path;
}

struct Ran {
  int status;
  std::string out, err;
};

// Runs the shell `command` in `folder`, with the built formatdesc first on the PATH.
Ran Shell(const std::string& folder, const std::string& command) {
  const std::string err = Scratch("stderr", ""), tools = fs::path(FORMATDESC_TOOL).parent_path();
  FILE* pipe = popen(
      ("cd '" + folder + "' && PATH='" + tools + "':$PATH && { " + command + "\n} 2>'" + err + "'")
          .c_str(),
      "r");
  Ran run{-1, "", ""};
  char buffer[4096];
  for (std::size_t n; (n = std::fread(buffer, 1, sizeof buffer, pipe)) > 0;)
    run.out.append(buffer, n);
  const int status = pclose(pipe);
  run.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  run.err = Slurp(err);
  std::remove(err.c_str());
  return run;
}

// What formatdesc's reader of `option` makes of `text`.
std::string Read(const std::string& option, const std::string& text) {
  const auto pair = [](Pair p) { return std::to_string(p.first) + "/" + std::to_string(p.second); };
  if (option == "--size") return pair(ParseSize(option, text));
  if (option == "--frame-aspect") return pair(ParseRatio(option, text));
  if (option == "--frame-rate") return pair(ParseFrameRate(option, text));
  if (option == "--bitrate") return std::to_string(ParseBitrate(option, text));
  if (option == "--tag") return std::to_string(ParseCodecTag(option, text));
  if (option == "--layout") return std::to_string(ParseChannelLayout(option, text));
  if (option == "--jobs") return std::to_string(ParsePositive(option, text, 9));
  if (option == "--threads") return std::to_string(ParseNonNegative(option, text, 10));
  if (option == "--pix-fmt") return std::to_string(ParsePixelFormat(option, text));
  if (option == "--sample-fmt") return std::to_string(ParseSampleFormat(option, text));
  if (option == "--kind") return ParseChoice(option, text, {"video", "audio"});
  if (option == "--codec-id") return CheckCodecId(option, text, {"aac", "h264"}, "video");
  const auto [key, value] = ParseKeyValue(option, text);
  return key + "|" + value;
}

// The option readers and the verdicts, on the values that matter, against expected/values.txt:
// each text a reader is given with what it reads or its refusal, each bitrate's verdict against a
// range of 1 to 4 Mb/s.
TEST(Output, ReadersAndVerdicts) {
  // Decimals of the rates with 1001 are their fractions (29.98 is no such rounding); layouts are
  // FFmpeg's names, its "5.1" with back speakers; choices and codec identifiers in any case.
  const std::pair<const char*, std::vector<const char*>> kReaders[] = {
      {"--size",
       {"1920x1080", "x1080", "0x1080", "1920x0", "-1920x1080", "1920x+1080", " 1920x1080",
        "1920x1080x3", "1920:1080", "4294967296x1", ""}},
      {"--frame-aspect", {"16:9", "16/9", "16:0"}},
      {"--frame-rate",
       {"30000/1001", "25",    "12.5",  "25.0",      "0.001", "29.97",      "29.970",
        "23.976",     "59.94", "29.98", "0",         "0.0",   "0/1",        "30/0",
        "-25",        "25.",   ".5",    "1.2345678", "25fps", "4294967296", ""}},
      {"--bitrate",
       {"4500000", "4500k", "4K", "4.5M", "1.25G", "1.0005k", "0", "0k", "-1", "4.5m", "4.5T", "M",
        "4.5.1M", "1.5e6", "0.0000001M"}},
      {"--tag", {"avc1", "0x31637661", "1234", "avc", "avc12", "0x100000000", ""}},
      {"--layout",
       {"5.1", "5.1(side)", "Stereo", "7.1(wide-side)", "0x3f", "4", "FL+FR+LFE", "0", "0x0", "5.2",
        "0x100000000", ""}},
      {"--jobs", {"9", "0", "10"}},
      {"--threads", {"0", "10", "-1", "+5", "5 ", "0x10", "11", ""}},
      {"--pix-fmt", {"yuv420p", "YUV420P10LE", ""}},
      {"--sample-fmt", {"fltp", "S16"}},
      {"--encode-option", {"x264-params=a=b", "tune=", "=slow", "slow"}},
      {"--kind", {"AUDIO", "subtitle"}},
      {"--codec-id", {"H264", "h265"}}};
  std::ostringstream out;
  for (const auto& [option, texts] : kReaders) {
    for (const char* text : texts) {
      out << option << " '" << text << "': ";
      try {
        out << Read(option, text) << '\n';
      } catch (const UsageError& e) {
        out << "refused: " << e.what() << '\n';
      }
    }
  }
  for (const auto& [name, layout] : ChannelLayoutNames()) {
    EXPECT_EQ(ParseChannelLayout("--layout", name), layout) << name;
  }
  out << DescribeBitrate(384000) << ", " << ReadableFrameRate(30000.0 / 1001) << ", "
      << ReadableFrameRate(24000.0 / 1001) << ", " << ReadableFrameRate(25.0) << " fps\n";
  out.precision(10);
  for (const long long bitrate : {1000000LL, 4000000LL, 380000LL, 10000000LL, 4000001LL, 995000LL,
                                  986000LL, 4999994LL, 4999995LL, 19990648LL}) {
    const Verdict verdict = JudgeBitrate(bitrate, Bitrates{2000000, 1000000, 4000000});
    out << bitrate << " b/s: " << PlacementName(verdict.placement) << ", bound " << verdict.bound
        << ", difference " << verdict.difference << ", " << verdict.percent
        << "%: " << VerdictText(verdict) << '\n';
  }
  ExpectFile("values", out.str());
}

// Each stream of probe --json read back from its JSON is the same description, and the whole
// document read with --stream gives the range the probe judged by (video in a target-bitrate
// mode, as the probe judges it).
TEST(Json, DescriptionsReadBack) {
  int described = 0;
  for (const char* file : {"sd.mp4", "low.avi", "stereo.wav", "subtitles.mkv"}) {
    const Json probed = ProbeJson(file, ProbeFile(kMedia + file), std::nullopt);
    const std::string whole = Scratch("whole.json", probed.dump());
    for (const Json& stream : probed["streams"]) {
      if (!stream.contains("description")) continue;
      ++described;
      const Json& description = stream["description"];
      const std::string where = std::string(file) + " stream " + stream["index"].dump();
      Json back = DescriptionJson(LoadDescription("", Scratch("one.json", description.dump())),
                                  std::nullopt);
      if (description.contains("bitrate")) back["bitrate"] = description["bitrate"];
      EXPECT_EQ(back, description) << where;
      if (!description.contains("bitrate")) continue;
      VideoArgs video;
      AudioArgs audio;
      audio.codec.fromJson = whole, audio.codec.stream = stream["index"].dump();
      video.codec = audio.codec, video.codec.bitrateMode = "cbr";
      const Bitrates range = stream["kind"] == "video" ? VideoBitrates(BuildVideo(video))
                                                       : AudioBitrates(BuildAudio(audio));
      EXPECT_EQ(Json({{"default", range.typical}, {"min", range.minimum}, {"max", range.maximum}}),
                description["bitrate"])
          << where;
    }
  }
  EXPECT_EQ(described, 8);
  for (const char* name : {"whole.json", "one.json"}) std::remove(Scratch(name, "").c_str());
}

// A stream as libavformat hands it over, set field by field, so that every value a file may
// leave unknown or give in a form the library cannot hold can be tried: the probe's JSON of each
// against expected/streams.txt.
TEST(Output, StreamsAsLibavformatGivesThem) {
  const std::unique_ptr<AVFormatContext, void (*)(AVFormatContext*)> context(
      avformat_alloc_context(), avformat_free_context);
  const auto last = [&]() -> AVStream& { return *context->streams[context->nb_streams - 1]; };
  // A video stream of 720x576 at 25 fps, stereo audio at 48 kHz, or a stream of another kind.
  const auto stream = [&](AVMediaType type, AVCodecID codec,
                          std::int64_t bitrate = 0) -> AVCodecParameters& {
    AVCodecParameters& p = *avformat_new_stream(context.get(), nullptr)->codecpar;
    p.codec_type = type, p.codec_id = codec, p.bit_rate = bitrate;
    if (type == AVMEDIA_TYPE_VIDEO) {
      p.width = 720, p.height = 576, p.format = AV_PIX_FMT_YUV420P;
      last().avg_frame_rate = AVRational{25, 1};
    } else if (type == AVMEDIA_TYPE_AUDIO) {
      p.sample_rate = 48000, p.format = AV_SAMPLE_FMT_FLTP;
      av_channel_layout_from_mask(&p.ch_layout, AV_CH_LAYOUT_STEREO);
    }
    return p;
  };
  const auto extradata = [](AVCodecParameters& p, const std::string& bytes) {
    p.extradata = static_cast<std::uint8_t*>(av_mallocz(bytes.size() + 64));
    std::memcpy(p.extradata, bytes.data(), bytes.size());
    p.extradata_size = static_cast<int>(bytes.size());
  };
  const AVMediaType video = AVMEDIA_TYPE_VIDEO, audio = AVMEDIA_TYPE_AUDIO;
  const AVMediaType subtitle = AVMEDIA_TYPE_SUBTITLE;
  extradata(stream(video, AV_CODEC_ID_H264, 3000000), std::string("\x01\x64\x00\x1f", 4));
  last().codecpar->codec_tag = MKTAG('a', 'v', 'c', '1');
  last().sample_aspect_ratio = AVRational{128, 90};  // given unreduced
  last().avg_frame_rate = AVRational{30000, 1001};
  stream(video, AV_CODEC_ID_MPEG4, 800000).format = AV_PIX_FMT_NB;  // beyond libavutil's formats
  last().avg_frame_rate = AVRational{0, 0};
  stream(video, AV_CODEC_ID_CINEPAK, 5000000);
  stream(video, AV_CODEC_ID_NONE);
  stream(video, AV_CODEC_ID_MPEG4).width = 0;
  stream(audio, AV_CODEC_ID_AC3).sample_rate = 0;
  av_channel_layout_uninit(&stream(audio, AV_CODEC_ID_AC3).ch_layout);
  stream(audio, AV_CODEC_ID_FLAC, 900000).format = AV_SAMPLE_FMT_NONE;
  av_channel_layout_from_mask(&stream(audio, AV_CODEC_ID_PCM_S16LE).ch_layout,
                              AV_CH_LAYOUT_STEREO | AV_CH_SURROUND_DIRECT_LEFT);
  av_channel_layout_from_mask(&stream(audio, AV_CODEC_ID_MP3, 320000).ch_layout,
                              AV_CH_LAYOUT_5POINT1);
  // The header's terminating zero is not part of its text.
  extradata(stream(subtitle, AV_CODEC_ID_ASS),
            std::string("[Script Info]\nScriptType: v4.00+\n", 34));
  extradata(stream(subtitle, AV_CODEC_ID_MOV_TEXT), std::string("\x00\x00\x00\x00\x01", 5));
  stream(subtitle, AV_CODEC_ID_DVB_SUBTITLE);
  for (const AVCodecID codec : {AV_CODEC_ID_DVB_SUBTITLE, AV_CODEC_ID_HDMV_PGS_SUBTITLE}) {
    stream(subtitle, codec).width = 1920;  // a DVB size for DVB subtitles only
    last().codecpar->height = 1080;
  }
  FileReport report;
  for (unsigned int i = 0; i < context->nb_streams; ++i) {
    report.streams.push_back(DescribeStream(*context, i));
  }
  std::ostringstream out;
  PrintJson(out, ProbeJson("", report, std::nullopt));
  ExpectFile("streams", out.str());
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
    for (std::size_t i = 0; i < 6; ++i) {
      std::string copy = bytes.substr(0, i < 3 ? bytes.size() * (i + 1) / 4 : bytes.size());
      const std::size_t at = i < 3 ? 0 : next() % (copy.size() - 16);
      for (std::size_t j = at; i >= 3 && j < at + 16; ++j) copy[j] = static_cast<char>(next());
      const std::string path = Scratch(std::to_string(i) + "-" + file, copy);
      try {
        const FileReport report = ProbeFile(path);
        PrintProbe(path, report, std::nullopt);
        const Json json = ProbeJson(path, report, std::nullopt);
        for (const Json& stream : json["streams"]) {  // damaged, and saying why, or not
          EXPECT_EQ(stream["status"] == "damaged", stream.value("damage", "") != "") << path;
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

// The built tool as a user runs it, for what its command line wires: one transcript of commands,
// each with its standard output, standard error and exit status, against expected/transcript.txt.
// Run among the media files, the stored descriptions under stored/, and under audit/ a library
// tree of good, damaged and unreadable entries, a FIFO, a loop of links and names no terminal
// shows well, made by the first command.
TEST(Output, Transcript) {
  // Each subcommand's options and output forms; diff exits as diff(1) does, probe with 1 for a
  // damaged stream shown and 2 when a path of several is not media. Then bad usage: exit status 2
  // and one line naming what was wrong as the command line has it; the library refusing: exit
  // status 1 and its description (for missing settings, the option of the first and every other
  // one missing, in the order of the help).
  const std::string every =
      "video --codec-id hevc --codec-name 'H.265 / HEVC' --tag hvc1 --bitrate-mode cbr --bitrate "
      "4.5M --quality 28 --threads 8 --lossless --no-two-pass --global-header --main-stream "
      "--encode-option preset=slow --analyze-option probesize=5000000 --size 720x576 "
      "--pixel-aspect 64:45 --frame-rate 25 --pix-fmt yuv420p10le";
  const std::vector<std::string> kArguments[] = {
      {every},
      {"video --size 720x576 --frame-aspect 16:9 --frame-rate 29.97 --no-bitrate", "--version"},
      {"video --from-json stored/sd.json --size 1280x720 --pix-fmt yuv420p"},
      {"audio --from-caps 'audio/mpeg, mpegversion=(int)4, stream-format=(string)raw, "
       "codec_data=(buffer)2b1188, rate=(int)24000, channels=(int)2, base-profile=(string)lc' "
       "--sample-fmt fltp"},
      {"ladder vp9 --frame-rate 60 --quality 31 --json", "codecs --kind audio"},
      {"ladder --from-json stored/sd.json --quality 23", "diff stored/hd.json stored/sd.json"},
      {"diff stored/hd.json stored/sd.json --json", "diff stored/hd.json stored/stereo.json"},
      {"diff stored/streams.json stored/streams.json --stream 1"},
      {"validate stored/streams.json --stream a:0", "validate stored/broken.json --json"},
      {"probe damaged.ts", "probe damaged.ts --stream 1", "probe surround.ac3 --json"},
      {"probe sd.mp4 low.avi high.mp4 mono.ac3 stereo.wav surround.wav notes.txt --jobs 1"},
      {"video --size 1x1 --size 2x2", "audio --lossless=yes", "video --sizes 1920x1080"},
      {"", "image --size 1x1", "--version extra", "codecs h264", "codecs --kind subtitle"},
      {"ladder", "ladder aac", "ladder h264 --frame-rate 0/1", "ladder h264 --quality -1"},
      {"video --frame-aspect 16:9", "video --size 8x8 --frame-aspect 16-9"},
      {"video --size 1920x1080 --frame-aspect 16:9 --pixel-aspect 1:1"},
      {"video --size 8x8 --pixel-aspect 1:0", "subtitle --dvb-size '720*576'"},
      {"video --frame-rate -25", "video --bitrate -1", "video --quality -1", "video --tag avc"},
      {"audio --sample-rate 0", "audio --frame-size 0", "audio --threads -2", "audio --layout 5.2"},
      {"video --pix-fmt yuv999p", "audio --sample-fmt float", "video --bitrate-mode foo"},
      {"video --codec-id aac", "audio --codec-id h264", "audio --analyze-option =1"},
      {"video --encode-option preset=slow --encode-option slow"},
      {"audio --from-json stored/none.json", "video --from-caps audio/x-ac3"},
      {"video --from-json stored/streams.json --stream a:0"},
      {"video --from-json stored/sd.json --from-caps video/x-h264"},
      {"video --from-caps 'video/x-h264, width=(int)[1,5]'"},
      {"video --from-caps 'video/x-h264, stream-format=(string)avc, codec_data=(buffer)0164ff'"},
      {"validate stored/streams.json", "validate stored/streams.json --stream 9"},
      {"validate stored/streams.json --stream x:0", "validate stored/streams.json --stream s:0"},
      {"diff stored/hd.json", "diff stored/hd.json stored/version2.json", "probe", "audio"},
      {"probe sd.mp4 --stream 2", "probe sd.mp4 --stream audio", "probe http://localhost/clip.mp4"},
      {"video --size 64x64", "validate stored/edited.json", "validate stored/truncated.json"},
      {"video --codec-id h264 --bitrate-mode CBR --frame-rate 25"},
      {"video --codec-id h264 --bitrate-mode VBR --frame-rate 25 --size 8x8"},
      {"audio --codec-id mp3 --sample-rate 48000 --layout 5.1 --sample-fmt s16p"}};
  // A library: every entry in order, the same lines on one thread, the summary on standard error;
  // in text mode, and sharded with GNU parallel; the report well-formed XHTML that fetches
  // nothing, with one dot a video stream with a bitrate, that rsvg-convert draws.
  std::vector<std::string> commands = {
      "rm -rf audit && mkdir -p audit/lib/a audit/lib/b audit/shard && cp sd.mp4 low.avi "
      "stereo.wav mono.ac3 subtitles.mkv audit/shard && cp sd.mp4 stereo.wav audit/lib/a && cp "
      "damaged.ts audit/lib/b && cp stereo.wav \"audit/lib/$(printf 'new\\nline.wav')\" && cp "
      "surround.ac3 \"audit/lib/$(printf '\\377\\376.ac3')\" && cd audit/lib && ln -s . loop && "
      "ln -s nowhere.mp4 b/gone.mp4 && mkfifo fifo",
      "cd audit && formatdesc probe lib --jsonl --jobs 3",
      "cd audit && formatdesc probe lib --jsonl --jobs 1 >1 2>&1; formatdesc probe lib --jsonl "
      "--jobs 3 >3 2>&1; cmp 1 3",
      "cd audit && formatdesc probe lib --jobs 2 | grep -a -A 1 -E '^(File: lib/[bfl]|Summary)'",
      "cd audit && find shard -type f | parallel --will-cite --pipe -N2 --sshlogin : formatdesc "
      "probe - --jsonl 2>/dev/null | sort >1 && find shard -type f | formatdesc probe - --jsonl "
      "2>/dev/null | sort | cmp - 1 && formatdesc probe shard --jsonl 2>/dev/null | sort | cmp - 1 "
      "&& cut -d , -f 1-2 1",
      "printf '' | formatdesc probe - --jsonl",
      "cd audit && formatdesc probe shard --report r.html >/dev/null && xmllint --noout r.html && "
      "! grep -E '<script|src=|href=|<link' r.html && sed -n '/<svg/,/<\\/svg>/p' r.html >c.svg && "
      "grep -o '<circle' c.svg | wc -l && rsvg-convert -o c.png c.svg && test -s c.png",
      "for s in video audio subtitle ladder codecs diff validate probe; do formatdesc $s --help | "
      "grep '^Usage'; done",
      // Every setting read back from the JSON it was written as: the same description again.
      "formatdesc " + every +
          " --json >v.json && formatdesc video --from-json v.json --json | "
          "cmp - v.json",
      "formatdesc audio --codec-id aac --sample-rate 48000 --layout 5.1 --frame-size 1024 "
      "--sample-fmt fltp --language eng --json >a.json && formatdesc audio --from-json a.json "
      "--json | cmp - a.json && cat a.json",
      "formatdesc subtitle --codec-id ass --threads 2 --language eng --title Commentary --author "
      "'A. Smithee' --header '[Script Info]' --dvb-size 720x576 --json >s.json && formatdesc "
      "subtitle --from-json s.json --json | cmp - s.json && cat s.json"};
  for (const auto& group : kArguments) {
    for (const std::string& arguments : group) commands.push_back("formatdesc " + arguments);
  }
  std::string transcript;
  for (const std::string& command : commands) {
    const Ran run = Shell(kMedia, command);
    transcript += "$ " + command + "\n" + run.out +
                  (run.err.empty() ? "" : "[standard error] " + run.err) + "[exit status " +
                  std::to_string(run.status) + "]\n\n";
  }
  ExpectFile("transcript", transcript);
}

// Every console block of the README's formatdesc section ("$ formatdesc ..." then the output)
// prints what it shows, run through the shell in a folder of the media files where each example
// writes the files later ones read; with FORMATDESC_UPDATE_EXPECTED set, the blocks are rewritten
// with what the tool prints instead.
TEST(Readme, ExamplesPrintWhatTheyShow) {
  const std::string readme = Slurp(FORMATDESC_README);
  std::string shown = readme;
  const std::size_t section = shown.find("\n## The formatdesc tool\n");
  const std::string open = "```console\n$ ";
  int examples = 0;
  // The section ends at the next heading of its level, which the outputs shown move.
  for (std::size_t block = shown.find(open, section); block < shown.find("\n## ", section + 1);
       block = shown.find(open, block + 1), ++examples) {
    // The command runs to the first line that does not end in a backslash.
    std::size_t commandEnd = shown.find('\n', block + open.size());
    while (shown[commandEnd - 1] == '\\') commandEnd = shown.find('\n', commandEnd + 1);
    const std::string command = shown.substr(block + open.size(), commandEnd - block - open.size());
    const std::size_t outputEnd = shown.find("```\n", commandEnd);
    shown.replace(commandEnd + 1, outputEnd - commandEnd - 1,
                  Shell(FORMATDESC_README_WORK, command + " 2>&1").out);
  }
  if (kUpdate) std::ofstream(FORMATDESC_README) << shown;
  EXPECT_EQ(readme, shown);
  EXPECT_GT(examples, 10);
}

// --json of a description with 100,000 metadata entries, and of that output read back (its
// settings hold an object of 100,000 members): quadratic time would take minutes here, linear
// time about a second each. An unoptimised or sanitizer build is a hundred times slower
// throughout: there a smaller description checks the memory errors alone.
TEST(Audit, LargeDescriptionInLinearTime) {
#if defined(__SANITIZE_ADDRESS__) || !defined(NDEBUG)
  constexpr std::size_t kEntries = 2000;
#else
  constexpr std::size_t kEntries = 100000;
#endif
  const auto video = Tarvek::Conf::FormatCodecVideo::Create();
  Tarvek::Core::Property metadata("metadata");
  for (std::size_t i = 0; i < kEntries; ++i)
    metadata.SetChildT<std::string>("k" + std::to_string(i), "v");
  video->SetMetadata(metadata);
  std::string text = Tarvek::Conf::ToJson(video);
  for (const char* name : {"big.json", "big-out.json"}) {
    const std::string big = Scratch(name, text);
    const auto start = std::chrono::steady_clock::now();
    const Ran run = Shell(kMedia, "formatdesc video --from-json '" + big + "' --no-bitrate --json");
    EXPECT_LT(std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count(), 20);
    ASSERT_EQ(run.status, 0) << run.err;
    // A plain (unordered) document: the ordered one finds each key by a scan of its object.
    EXPECT_EQ(nlohmann::json::parse(run.out)["settings"]["metadata"].size(), kEntries);
    std::remove(big.c_str());
    text = run.out;
  }
}

}  // namespace
}  // namespace Formatdesc
