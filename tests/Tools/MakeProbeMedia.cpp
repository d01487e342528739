// Writes the small media files the probe tests read, with libavformat and libavcodec's own
// encoders, into each folder named on the command line:
//   MakeProbeMedia FOLDER...
// or, with --streaming, one DASH presentation a codec in a folder of its own ("h264/stream.mpd"),
// for every codec whose encoder the installed libavcodec has; the codec string tests read them:
//   MakeProbeMedia --streaming FOLDER
// Every file is made from synthetic pictures and tones with single-threaded, bit-exact encoders,
// so the same libraries write the same bytes on every run. What each file holds is listed in
// kFiles below; the tests name the same values.
extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/mathematics.h>
#include <libavutil/opt.h>
}

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

// What a synthetic picture shows: a flat grey picture costs almost nothing to encode, a moving
// gradient with a little grain a moderate amount, noise as much as it is given.
enum class Picture { Flat, Grainy, Noise };

struct VideoStream {
  AVCodecID codec = AV_CODEC_ID_MPEG4;
  int width = 0;
  int height = 0;
  AVRational pixelAspect{1, 1};
  AVRational frameRate{25, 1};
  int frames = 0;
  Picture picture = Picture::Grainy;
  std::int64_t bitrate = 0;       // the rate control's target; a flat picture stays far below it
  bool withoutPackets = false;    // declared in the header, but no picture is written
  const char* encoder = nullptr;  // an encoder by name, where the codec has several
};

struct AudioStream {
  AVCodecID codec = AV_CODEC_ID_AC3;
  int sampleRate = 48000;
  std::uint64_t layout = AV_CH_LAYOUT_STEREO;
  std::int64_t bitrate = 0;  // 0 for PCM, whose bitrate follows from its samples
  double seconds = 1.0;
  std::string language;
  const char* encoder = nullptr;
};

struct SubtitleStream {
  std::string language;
  std::string title;
};

// A font carried as an attachment: a stream of a kind the probe lists and skips.
struct Attachment {
  std::string fileName;
};

struct MediaFile {
  std::string name;
  std::vector<VideoStream> video;
  std::vector<AudioStream> audio;
  std::vector<SubtitleStream> subtitles;
  std::vector<Attachment> attachments;
};

// The header of the styled subtitles: what a demuxer gives as their extradata.
const char kAssHeader[] =
    "[Script Info]\n"
    "Title: Interview\n"
    "ScriptType: v4.00+\n";

// The files, by what the tests check with them:
// - two sizes of MPEG-4 video with non-square pixels; one stream encoded well below the presets'
//   range (a flat picture, which needs almost nothing), one inside it (aiming at the range's
//   default), one well above it (noise at a bitrate twelve times the range's maximum);
// - AC-3 in mono, stereo and 5.1, PCM in mono, stereo and 5.1, some with a language;
// - styled subtitles with language, title and header beside a font attachment, and beside video
//   whose container gives no bitrate;
// - a transport stream whose video stream has no packet, so its picture size cannot be known.
std::vector<MediaFile> Files() {
  VideoStream sd;
  sd.width = 720;
  sd.height = 576;
  sd.pixelAspect = {64, 45};
  sd.frameRate = {25, 1};
  sd.frames = 25;
  sd.bitrate = 3400000;

  VideoStream low;
  low.width = 352;
  low.height = 288;
  low.pixelAspect = {12, 11};
  low.frameRate = {30000, 1001};
  low.frames = 30;
  low.picture = Picture::Flat;
  low.bitrate = 100000;

  VideoStream high = low;
  high.frames = 10;
  high.picture = Picture::Noise;
  high.bitrate = 20000000;

  AudioStream surround;
  surround.layout = AV_CH_LAYOUT_5POINT1;
  surround.bitrate = 448000;
  surround.language = "eng";

  AudioStream pcmMono;
  pcmMono.codec = AV_CODEC_ID_PCM_S16LE;
  pcmMono.layout = AV_CH_LAYOUT_MONO;

  AudioStream pcmStereo = pcmMono;
  pcmStereo.layout = AV_CH_LAYOUT_STEREO;

  AudioStream pcmSurround = pcmMono;
  pcmSurround.layout = AV_CH_LAYOUT_5POINT1;

  AudioStream ac3Mono;
  ac3Mono.layout = AV_CH_LAYOUT_MONO;
  ac3Mono.bitrate = 96000;

  AudioStream ac3Stereo;
  ac3Stereo.bitrate = 192000;
  ac3Stereo.language = "fre";

  VideoStream brief = low;
  brief.frames = 10;

  VideoStream unseen = sd;
  unseen.withoutPackets = true;

  return {
      {"sd.mp4", {sd}, {surround}, {}, {}},
      {"low.avi", {low}, {pcmMono}, {}, {}},
      {"high.mp4", {high}, {}, {}, {}},
      {"mono.ac3", {}, {ac3Mono}, {}, {}},
      {"surround.ac3", {}, {surround}, {}, {}},
      {"stereo.wav", {}, {pcmStereo}, {}, {}},
      {"surround.wav", {}, {pcmSurround}, {}, {}},
      {"subtitles.mkv", {brief}, {ac3Stereo}, {{"ger", "Director's commentary"}}, {{"font.ttf"}}},
      {"damaged.ts", {unseen}, {ac3Stereo}, {}, {}},
  };
}

void Check(int result, const std::string& what) {
  if (result < 0) {
    char text[AV_ERROR_MAX_STRING_SIZE] = {};
    av_strerror(result, text, sizeof text);
    throw std::runtime_error(what + ": " + text);
  }
}

template <class T>
T* Require(T* pointer, const std::string& what) {
  if (pointer == nullptr) throw std::runtime_error(what + " failed");
  return pointer;
}

struct CodecContextFree {
  void operator()(AVCodecContext* context) const { avcodec_free_context(&context); }
};
using CodecContext = std::unique_ptr<AVCodecContext, CodecContextFree>;

struct FrameFree {
  void operator()(AVFrame* frame) const { av_frame_free(&frame); }
};
using Frame = std::unique_ptr<AVFrame, FrameFree>;

struct PacketFree {
  void operator()(AVPacket* packet) const { av_packet_free(&packet); }
};
using Packet = std::unique_ptr<AVPacket, PacketFree>;

struct OutputFree {
  void operator()(AVFormatContext* context) const {
    if (context->pb != nullptr) avio_closep(&context->pb);
    avformat_free_context(context);
  }
};
using Output = std::unique_ptr<AVFormatContext, OutputFree>;

// The same numbers on every run and every machine, unlike rand().
class Noise {
 public:
  std::uint8_t Next() {
    state_ = state_ * 1664525u + 1013904223u;
    return static_cast<std::uint8_t>(state_ >> 24);
  }

 private:
  std::uint32_t state_ = 12345;
};

void FillPicture(AVFrame& frame, Picture picture, int index, Noise& noise) {
  for (int plane = 0; plane < 3; ++plane) {
    const int width = plane == 0 ? frame.width : frame.width / 2;
    const int height = plane == 0 ? frame.height : frame.height / 2;
    for (int y = 0; y < height; ++y) {
      std::uint8_t* row =
          frame.data[plane] + static_cast<std::ptrdiff_t>(y) * frame.linesize[plane];
      for (int x = 0; x < width; ++x) {
        int value = 128;
        if (picture == Picture::Grainy && plane == 0)
          value = ((x + y + 3 * index) & 0x7f) + (noise.Next() >> 4) + 56;
        if (picture == Picture::Noise) value = noise.Next();
        row[x] = static_cast<std::uint8_t>(value);
      }
    }
  }
}

// Sends `frame` (null to drain) and hands every packet the encoder gives to `take`.
template <class Take>
void Encode(AVCodecContext& encoder, const AVFrame* frame, AVPacket& packet, Take take) {
  Check(avcodec_send_frame(&encoder, frame), "sending a frame to the encoder");
  for (;;) {
    const int result = avcodec_receive_packet(&encoder, &packet);
    if (result == AVERROR(EAGAIN) || result == AVERROR_EOF) return;
    Check(result, "receiving a packet from the encoder");
    take(packet);
    av_packet_unref(&packet);
  }
}

// One stream being written and the packets made for it, in the encoder's time base: the muxer
// may choose the stream's own time base only when it writes the header.
struct Track {
  AVStream* stream = nullptr;
  AVRational timeBase{1, 1};
  std::vector<Packet> packets;
};

void Keep(Track& track, const AVPacket& packet) {
  Packet copy(Require(av_packet_clone(&packet), "copying a packet"));
  copy->stream_index = track.stream->index;
  track.packets.push_back(std::move(copy));
}

CodecContext OpenEncoder(AVCodecID id, AVFormatContext& output,
                         void (*configure)(AVCodecContext&, const void*), const void* stream,
                         const char* name = nullptr) {
  const AVCodec* codec = Require(
      name ? avcodec_find_encoder_by_name(name) : avcodec_find_encoder(id), "finding the encoder");
  CodecContext encoder(Require(avcodec_alloc_context3(codec), "allocating an encoder"));
  encoder->thread_count = 1;
  encoder->flags |= AV_CODEC_FLAG_BITEXACT;
  if ((output.oformat->flags & AVFMT_GLOBALHEADER) != 0) {
    encoder->flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
  }
  configure(*encoder, stream);
  Check(avcodec_open2(encoder.get(), codec, nullptr), "opening the encoder");
  return encoder;
}

void ConfigureVideo(AVCodecContext& encoder, const void* stream) {
  const auto& video = *static_cast<const VideoStream*>(stream);
  encoder.width = video.width;
  encoder.height = video.height;
  encoder.sample_aspect_ratio = video.pixelAspect;
  encoder.time_base = av_inv_q(video.frameRate);
  encoder.framerate = video.frameRate;
  encoder.pix_fmt = AV_PIX_FMT_YUV420P;
  encoder.gop_size = 12;
  encoder.max_b_frames = 0;
  encoder.bit_rate = video.bitrate;
  if (std::strcmp(encoder.codec->name, "libx265") == 0)
    av_opt_set(encoder.priv_data, "x265-params", "log-level=error", 0);
}

void AddVideo(AVFormatContext& output, const VideoStream& video, std::vector<Track>& tracks) {
  CodecContext encoder = OpenEncoder(video.codec, output, &ConfigureVideo, &video, video.encoder);
  Track track;
  track.stream = Require(avformat_new_stream(&output, nullptr), "adding a stream");
  track.stream->time_base = encoder->time_base;
  track.stream->avg_frame_rate = video.frameRate;
  track.stream->sample_aspect_ratio = video.pixelAspect;
  Check(avcodec_parameters_from_context(track.stream->codecpar, encoder.get()),
        "copying the video parameters");
  Frame frame(Require(av_frame_alloc(), "allocating a frame"));
  frame->format = AV_PIX_FMT_YUV420P;
  frame->width = video.width;
  frame->height = video.height;
  Check(av_frame_get_buffer(frame.get(), 0), "allocating a picture");
  Packet packet(Require(av_packet_alloc(), "allocating a packet"));
  track.timeBase = encoder->time_base;
  const auto keep = [&](AVPacket& made) {
    if (made.duration == 0) made.duration = 1;
    Keep(track, made);
  };
  Noise noise;
  for (int i = 0; i < (video.withoutPackets ? 0 : video.frames); ++i) {
    Check(av_frame_make_writable(frame.get()), "writing a picture");
    FillPicture(*frame, video.picture, i, noise);
    frame->pts = i;
    Encode(*encoder, frame.get(), *packet, keep);
  }
  if (!video.withoutPackets) Encode(*encoder, nullptr, *packet, keep);
  tracks.push_back(std::move(track));
}

void ConfigureAudio(AVCodecContext& encoder, const void* stream) {
  const auto& audio = *static_cast<const AudioStream*>(stream);
  encoder.sample_rate = audio.sampleRate;
  encoder.time_base = AVRational{1, audio.sampleRate};
  Check(av_channel_layout_from_mask(&encoder.ch_layout, audio.layout), "setting the layout");
  encoder.sample_fmt = encoder.codec->sample_fmts[0];
  encoder.bit_rate = audio.bitrate;
}

// A tone of a different pitch on each channel.
void FillTone(AVFrame& frame, std::int64_t first, int sampleRate) {
  const int channels = frame.ch_layout.nb_channels;
  const bool planar = av_sample_fmt_is_planar(static_cast<AVSampleFormat>(frame.format)) != 0;
  for (int c = 0; c < channels; ++c) {
    for (int i = 0; i < frame.nb_samples; ++i) {
      const double t = double(first + i) / sampleRate;
      const double value = 0.25 * std::sin(2.0 * M_PI * 220.0 * (c + 1) * t);
      if (frame.format == AV_SAMPLE_FMT_FLTP) {
        reinterpret_cast<float*>(frame.data[c])[i] = static_cast<float>(value);
      } else if (frame.format == AV_SAMPLE_FMT_S16 && !planar) {
        reinterpret_cast<std::int16_t*>(frame.data[0])[i * channels + c] =
            static_cast<std::int16_t>(value * 32767.0);
      } else {
        throw std::runtime_error("no tone for this sample format");
      }
    }
  }
}

void AddAudio(AVFormatContext& output, const AudioStream& audio, std::vector<Track>& tracks) {
  CodecContext encoder = OpenEncoder(audio.codec, output, &ConfigureAudio, &audio, audio.encoder);
  Track track;
  track.stream = Require(avformat_new_stream(&output, nullptr), "adding a stream");
  track.stream->time_base = encoder->time_base;
  Check(avcodec_parameters_from_context(track.stream->codecpar, encoder.get()),
        "copying the audio parameters");
  if (!audio.language.empty()) {
    av_dict_set(&track.stream->metadata, "language", audio.language.c_str(), 0);
  }
  Frame frame(Require(av_frame_alloc(), "allocating a frame"));
  frame->format = encoder->sample_fmt;
  frame->nb_samples = encoder->frame_size > 0 ? encoder->frame_size : 1024;
  frame->sample_rate = audio.sampleRate;
  Check(av_channel_layout_copy(&frame->ch_layout, &encoder->ch_layout), "copying the layout");
  Check(av_frame_get_buffer(frame.get(), 0), "allocating samples");
  Packet packet(Require(av_packet_alloc(), "allocating a packet"));
  track.timeBase = encoder->time_base;
  const auto keep = [&](AVPacket& made) { Keep(track, made); };
  const auto total = static_cast<std::int64_t>(audio.seconds * audio.sampleRate);
  for (std::int64_t first = 0; first < total; first += frame->nb_samples) {
    Check(av_frame_make_writable(frame.get()), "writing samples");
    FillTone(*frame, first, audio.sampleRate);
    frame->pts = first;
    Encode(*encoder, frame.get(), *packet, keep);
  }
  Encode(*encoder, nullptr, *packet, keep);
  tracks.push_back(std::move(track));
}

void ConfigureSubtitle(AVCodecContext& encoder, const void*) {
  encoder.time_base = AVRational{1, 1000};
  const std::size_t size = sizeof kAssHeader;  // with its terminating zero, as the encoder wants
  encoder.subtitle_header = static_cast<std::uint8_t*>(av_mallocz(size));
  if (encoder.subtitle_header == nullptr) throw std::bad_alloc();
  std::memcpy(encoder.subtitle_header, kAssHeader, size);
  encoder.subtitle_header_size = static_cast<int>(size - 1);
}

void AddSubtitle(AVFormatContext& output, const SubtitleStream& subtitle,
                 std::vector<Track>& tracks) {
  CodecContext encoder = OpenEncoder(AV_CODEC_ID_ASS, output, &ConfigureSubtitle, nullptr);
  Track track;
  track.stream = Require(avformat_new_stream(&output, nullptr), "adding a stream");
  track.stream->time_base = encoder->time_base;
  track.timeBase = encoder->time_base;
  Check(avcodec_parameters_from_context(track.stream->codecpar, encoder.get()),
        "copying the subtitle parameters");
  av_dict_set(&track.stream->metadata, "language", subtitle.language.c_str(), 0);
  av_dict_set(&track.stream->metadata, "title", subtitle.title.c_str(), 0);
  const char* const lines[] = {"0,0,Default,,0,0,0,,Hello", "1,0,Default,,0,0,0,,Goodbye"};
  std::int64_t start = 0;
  for (const char* line : lines) {
    std::string text = line;
    AVSubtitleRect rect{};
    rect.type = SUBTITLE_ASS;
    rect.ass = text.data();
    AVSubtitleRect* rects[] = {&rect};
    AVSubtitle sub{};
    sub.num_rects = 1;
    sub.rects = rects;
    sub.end_display_time = 400;
    std::uint8_t buffer[1024];
    const int size = avcodec_encode_subtitle(encoder.get(), buffer, sizeof buffer, &sub);
    Check(size, "encoding a subtitle");
    Packet packet(Require(av_packet_alloc(), "allocating a packet"));
    Check(av_new_packet(packet.get(), size), "allocating a subtitle packet");
    std::memcpy(packet->data, buffer, static_cast<std::size_t>(size));
    packet->pts = packet->dts = start;
    packet->duration = 400;
    Keep(track, *packet);
    start += 500;
  }
  tracks.push_back(std::move(track));
}

void AddAttachment(AVFormatContext& output, const Attachment& attachment) {
  AVStream* stream = Require(avformat_new_stream(&output, nullptr), "adding a stream");
  stream->codecpar->codec_type = AVMEDIA_TYPE_ATTACHMENT;
  stream->codecpar->codec_id = AV_CODEC_ID_TTF;
  const char bytes[] = "not really a font";
  stream->codecpar->extradata =
      static_cast<std::uint8_t*>(av_mallocz(sizeof bytes + AV_INPUT_BUFFER_PADDING_SIZE));
  if (stream->codecpar->extradata == nullptr) throw std::bad_alloc();
  std::memcpy(stream->codecpar->extradata, bytes, sizeof bytes);
  stream->codecpar->extradata_size = static_cast<int>(sizeof bytes);
  av_dict_set(&stream->metadata, "filename", attachment.fileName.c_str(), 0);
  av_dict_set(&stream->metadata, "mimetype", "application/x-truetype-font", 0);
}

void Write(const MediaFile& file, const std::string& path) {
  AVFormatContext* raw = nullptr;
  Check(avformat_alloc_output_context2(&raw, nullptr, nullptr, path.c_str()), path);
  Output output(raw);
  output->flags |= AVFMT_FLAG_BITEXACT;
  // The DASH muxer's MP4 segments take FLAC only as an experimental feature.
  if (std::strcmp(output->oformat->name, "dash") == 0)
    output->strict_std_compliance = FF_COMPLIANCE_EXPERIMENTAL;
  std::vector<Track> tracks;
  for (const VideoStream& video : file.video) AddVideo(*output, video, tracks);
  for (const AudioStream& audio : file.audio) AddAudio(*output, audio, tracks);
  for (const SubtitleStream& subtitle : file.subtitles) AddSubtitle(*output, subtitle, tracks);
  for (const Attachment& attachment : file.attachments) AddAttachment(*output, attachment);
  if ((output->oformat->flags & AVFMT_NOFILE) == 0)
    Check(avio_open(&output->pb, path.c_str(), AVIO_FLAG_WRITE), path);
  Check(avformat_write_header(output.get(), nullptr), path + ": writing the header");
  for (Track& track : tracks) {
    for (Packet& packet : track.packets) {
      av_packet_rescale_ts(packet.get(), track.timeBase, track.stream->time_base);
      Check(av_interleaved_write_frame(output.get(), packet.get()), path + ": writing a packet");
    }
  }
  Check(av_write_trailer(output.get()), path + ": writing the trailer");
}

// The first `size` bytes of `from`: a file cut short, as by an interrupted download.
void Truncate(const std::string& from, const std::string& to, std::size_t size) {
  std::ifstream in(from, std::ios::binary);
  std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  if (bytes.size() <= size) throw std::runtime_error(from + " is too short to cut");
  std::ofstream(to, std::ios::binary) << bytes.substr(0, size);
}

// One DASH presentation a codec, each stream as its encoder's defaults make it: the codec string
// tests compare the manifest's codecs attribute with their own.
void WriteStreaming(const std::string& folder) {
  VideoStream video;
  video.width = 320;
  video.height = 240;
  video.frames = 5;
  video.bitrate = 300000;
  AudioStream audio;
  audio.bitrate = 128000;
  audio.seconds = 0.2;
  const struct {
    const char* name;
    AVCodecID codec;
    const char* encoder;
  } kStreams[] = {
      {"h264", AV_CODEC_ID_H264, nullptr}, {"hevc", AV_CODEC_ID_HEVC, nullptr},
      {"vp9", AV_CODEC_ID_VP9, nullptr},   {"av1", AV_CODEC_ID_AV1, "libsvtav1"},
      {"aac", AV_CODEC_ID_AAC, nullptr},   {"opus", AV_CODEC_ID_OPUS, "libopus"},
      {"flac", AV_CODEC_ID_FLAC, nullptr}, {"ac3", AV_CODEC_ID_AC3, nullptr},
      {"eac3", AV_CODEC_ID_EAC3, nullptr},
  };
  for (const auto& stream : kStreams) {
    if (!(stream.encoder ? avcodec_find_encoder_by_name(stream.encoder)
                         : avcodec_find_encoder(stream.codec)))
      continue;  // the tests skip a codec this libavcodec cannot encode
    MediaFile file;
    file.name = std::string(stream.name) + "/stream.mpd";
    if (avcodec_get_type(stream.codec) == AVMEDIA_TYPE_VIDEO) {
      file.video.push_back(video);
      file.video.back().codec = stream.codec;
      file.video.back().encoder = stream.encoder;
    } else {
      file.audio.push_back(audio);
      file.audio.back().codec = stream.codec;
      file.audio.back().encoder = stream.encoder;
    }
    std::filesystem::create_directories(folder + "/" + stream.name);
    Write(file, folder + "/" + file.name);
  }
}

}  // namespace

// libx265 keeps a block of its own until the process ends; leaks of the encoder libraries are
// theirs, not the tests'.
extern "C" __attribute__((visibility("default"), used)) const char* __lsan_default_suppressions() {
  return "leak:libx265.so\n";
}

int main(int argc, char** argv) {
  if (argc < 2) {
    std::cerr << "usage: MakeProbeMedia FOLDER...\n";
    return 2;
  }
  av_log_set_level(AV_LOG_ERROR);
  try {
    if (argc == 3 && std::string(argv[1]) == "--streaming") {
      WriteStreaming(argv[2]);
      return 0;
    }
    for (int i = 1; i < argc; ++i) {
      const std::string folder = argv[i];
      for (const MediaFile& file : Files()) Write(file, folder + "/" + file.name);
      Truncate(folder + "/sd.mp4", folder + "/truncated.mp4", 600);
      std::ofstream(folder + "/notes.txt") << "Shot list\n1. Opening titles\n2. Interview\n";
    }
  } catch (const std::exception& e) {
    std::cerr << "MakeProbeMedia: " << e.what() << '\n';
    return 1;
  }
  return 0;
}
