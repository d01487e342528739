// Writes the small media files the probe tests read, with libavformat and libavcodec's own
// encoders, into each folder named on the command line:
//   MakeProbeMedia FOLDER...
// or, with --streaming, one DASH presentation a codec in a folder of its own ("h264/stream.mpd"),
// for every codec whose encoder the installed libavcodec has; the codec string tests read them:
//   MakeProbeMedia --streaming FOLDER
// Every file is made from synthetic pictures and tones with single-threaded, bit-exact encoders,
// so the same libraries write the same bytes on every run. What each file holds is listed in
// Files() below; the tests name the same values.
extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/opt.h>
}

#include <cmath>
#include <cstdint>
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

// One stream of a file. Video: size, pixel aspect, rate, frames, picture; audio: sample rate,
// layout, seconds of tone; subtitles: styled lines with a header; attachments: a font's name.
struct Stream {
  AVMediaType type = AVMEDIA_TYPE_VIDEO;
  AVCodecID codec = AV_CODEC_ID_MPEG4;
  std::int64_t bitrate = 0;  // the rate control's target; 0 for PCM; a flat picture stays below
  const char* encoder = nullptr;  // an encoder by name, where the codec has several
  int width = 0, height = 0;
  AVRational pixelAspect{1, 1}, frameRate{25, 1};
  int frames = 0;
  Picture picture = Picture::Grainy;
  bool withoutPackets = false;  // declared in the header, but no picture is written
  int sampleRate = 48000;
  std::uint64_t layout = AV_CH_LAYOUT_STEREO;
  double seconds = 1.0;
  std::string language, title;  // a subtitle's title, an attachment's file name
};

Stream Video(int width, int height, AVRational aspect, AVRational rate, int frames, Picture picture,
             std::int64_t bitrate) {
  Stream s;
  s.width = width, s.height = height, s.pixelAspect = aspect, s.frameRate = rate;
  s.frames = frames, s.picture = picture, s.bitrate = bitrate;
  return s;
}

Stream Audio(AVCodecID codec, std::uint64_t layout, std::int64_t bitrate,
             std::string language = "") {
  Stream s;
  s.type = AVMEDIA_TYPE_AUDIO, s.codec = codec, s.layout = layout, s.bitrate = bitrate;
  s.language = std::move(language);
  return s;
}

// The header of the styled subtitles: what a demuxer gives as their extradata.
const char kAssHeader[] = "[Script Info]\nTitle: Interview\nScriptType: v4.00+\n";

// The files, by what the tests check with them:
// - two sizes of MPEG-4 video with non-square pixels; one stream encoded well below the presets'
//   range (a flat picture, which needs almost nothing), one inside it (aiming at the range's
//   default), one well above it (noise at a bitrate twelve times the range's maximum);
// - AC-3 in mono, stereo and 5.1, PCM in mono, stereo and 5.1, some with a language;
// - styled subtitles with language, title and header beside a font attachment, and beside video
//   whose container gives no bitrate;
// - a transport stream whose video stream has no packet, so its picture size cannot be known.
std::vector<std::pair<std::string, std::vector<Stream>>> Files() {
  const Stream sd = Video(720, 576, {64, 45}, {25, 1}, 25, Picture::Grainy, 3400000);
  const Stream low = Video(352, 288, {12, 11}, {30000, 1001}, 30, Picture::Flat, 100000);
  Stream high = low, brief = low, unseen = sd;
  high.frames = brief.frames = 10;
  high.picture = Picture::Noise;
  high.bitrate = 20000000;
  unseen.withoutPackets = true;
  const Stream surround = Audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_5POINT1, 448000, "eng");
  const Stream stereo = Audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_STEREO, 192000, "fre");
  Stream subtitle, font;
  subtitle.type = AVMEDIA_TYPE_SUBTITLE, subtitle.codec = AV_CODEC_ID_ASS;
  subtitle.language = "ger", subtitle.title = "Director's commentary";
  font.type = AVMEDIA_TYPE_ATTACHMENT, font.codec = AV_CODEC_ID_TTF, font.title = "font.ttf";
  const auto pcm = [](std::uint64_t layout) { return Audio(AV_CODEC_ID_PCM_S16LE, layout, 0); };
  return {
      {"sd.mp4", {sd, surround}},
      {"low.avi", {low, pcm(AV_CH_LAYOUT_MONO)}},
      {"high.mp4", {high}},
      {"mono.ac3", {Audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_MONO, 96000)}},
      {"surround.ac3", {surround}},
      {"stereo.wav", {pcm(AV_CH_LAYOUT_STEREO)}},
      {"surround.wav", {pcm(AV_CH_LAYOUT_5POINT1)}},
      {"subtitles.mkv", {brief, stereo, subtitle, font}},
      {"damaged.ts", {unseen, stereo}},
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

template <class T, void (*Free)(T**)>
struct Freer {
  void operator()(T* pointer) const { Free(&pointer); }
};
using CodecContext = std::unique_ptr<AVCodecContext, Freer<AVCodecContext, avcodec_free_context>>;
using Frame = std::unique_ptr<AVFrame, Freer<AVFrame, av_frame_free>>;
using Packet = std::unique_ptr<AVPacket, Freer<AVPacket, av_packet_free>>;

struct OutputFree {
  void operator()(AVFormatContext* context) const {
    if (context->pb != nullptr) avio_closep(&context->pb);
    avformat_free_context(context);
  }
};

// The same numbers on every run and every machine, unlike rand().
struct Noise {
  std::uint32_t state = 12345;
  std::uint8_t Next() {
    return static_cast<std::uint8_t>((state = state * 1664525u + 1013904223u) >> 24);
  }
};

void FillPicture(AVFrame& frame, Picture picture, int index, Noise& noise) {
  for (int plane = 0; plane < 3; ++plane) {
    for (int y = 0; y < (plane == 0 ? frame.height : frame.height / 2); ++y) {
      std::uint8_t* row =
          frame.data[plane] + static_cast<std::ptrdiff_t>(y) * frame.linesize[plane];
      for (int x = 0; x < (plane == 0 ? frame.width : frame.width / 2); ++x) {
        int value = 128;
        if (picture == Picture::Grainy && plane == 0)
          value = ((x + y + 3 * index) & 0x7f) + (noise.Next() >> 4) + 56;
        if (picture == Picture::Noise) value = noise.Next();
        row[x] = static_cast<std::uint8_t>(value);
      }
    }
  }
}

// A tone of a different pitch on each channel, in the encoder's planar float or packed 16 bits.
void FillTone(AVFrame& frame, std::int64_t first, int sampleRate) {
  const int channels = frame.ch_layout.nb_channels;
  for (int c = 0; c < channels; ++c) {
    for (int i = 0; i < frame.nb_samples; ++i) {
      const double value =
          0.25 * std::sin(2.0 * M_PI * 220.0 * (c + 1) * double(first + i) / sampleRate);
      if (frame.format == AV_SAMPLE_FMT_FLTP) {
        reinterpret_cast<float*>(frame.data[c])[i] = static_cast<float>(value);
      } else if (frame.format == AV_SAMPLE_FMT_S16) {
        reinterpret_cast<std::int16_t*>(frame.data[0])[i * channels + c] =
            static_cast<std::int16_t>(value * 32767.0);
      } else {
        throw std::runtime_error("no tone for this sample format");
      }
    }
  }
}

// One stream being written and the packets made for it, in the encoder's time base: the muxer
// may choose the stream's own time base only when it writes the header.
struct Track {
  AVStream* stream = nullptr;
  AVRational timeBase{1, 1};
  std::vector<Packet> packets;

  void Keep(const AVPacket& packet) {
    Packet copy(Require(av_packet_clone(&packet), "copying a packet"));
    copy->stream_index = stream->index;
    packets.push_back(std::move(copy));
  }
  // Sends `frame` (null to drain) and keeps every packet the encoder gives.
  void Encode(AVCodecContext& encoder, const AVFrame* frame, AVPacket& packet) {
    Check(avcodec_send_frame(&encoder, frame), "sending a frame to the encoder");
    for (int result; (result = avcodec_receive_packet(&encoder, &packet)) != AVERROR_EOF;) {
      if (result == AVERROR(EAGAIN)) return;
      Check(result, "receiving a packet from the encoder");
      if (packet.duration == 0 && encoder.codec_type == AVMEDIA_TYPE_VIDEO) packet.duration = 1;
      Keep(packet);
      av_packet_unref(&packet);
    }
  }
};

// Encodes `s` whole into a new stream of `output`.
Track Add(AVFormatContext& output, const Stream& s) {
  const AVCodec* codec =
      Require(s.encoder ? avcodec_find_encoder_by_name(s.encoder) : avcodec_find_encoder(s.codec),
              "finding the encoder");
  CodecContext encoder(Require(avcodec_alloc_context3(codec), "allocating an encoder"));
  encoder->thread_count = 1;
  encoder->flags |= AV_CODEC_FLAG_BITEXACT;
  if ((output.oformat->flags & AVFMT_GLOBALHEADER) != 0) {
    encoder->flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
  }
  if (s.type != AVMEDIA_TYPE_SUBTITLE) encoder->bit_rate = s.bitrate;
  if (s.type == AVMEDIA_TYPE_VIDEO) {
    encoder->width = s.width;
    encoder->height = s.height;
    encoder->sample_aspect_ratio = s.pixelAspect;
    encoder->time_base = av_inv_q(s.frameRate);
    encoder->framerate = s.frameRate;
    encoder->pix_fmt = AV_PIX_FMT_YUV420P;
    encoder->gop_size = 12;
    encoder->max_b_frames = 0;
    if (std::strcmp(codec->name, "libx265") == 0)
      av_opt_set(encoder->priv_data, "x265-params", "log-level=error", 0);
  } else if (s.type == AVMEDIA_TYPE_AUDIO) {
    encoder->sample_rate = s.sampleRate;
    encoder->time_base = AVRational{1, s.sampleRate};
    Check(av_channel_layout_from_mask(&encoder->ch_layout, s.layout), "setting the layout");
    encoder->sample_fmt = codec->sample_fmts[0];
  } else {
    encoder->time_base = AVRational{1, 1000};
    // With its terminating zero, as the encoder wants it.
    encoder->subtitle_header =
        Require(static_cast<std::uint8_t*>(av_mallocz(sizeof kAssHeader)), "allocating the header");
    std::memcpy(encoder->subtitle_header, kAssHeader, sizeof kAssHeader);
    encoder->subtitle_header_size = static_cast<int>(sizeof kAssHeader - 1);
  }
  Check(avcodec_open2(encoder.get(), codec, nullptr), "opening the encoder");
  Track track;
  track.stream = Require(avformat_new_stream(&output, nullptr), "adding a stream");
  track.stream->time_base = track.timeBase = encoder->time_base;
  if (s.type == AVMEDIA_TYPE_VIDEO) {
    track.stream->avg_frame_rate = s.frameRate;
    track.stream->sample_aspect_ratio = s.pixelAspect;
  }
  Check(avcodec_parameters_from_context(track.stream->codecpar, encoder.get()),
        "copying the parameters");
  if (!s.language.empty()) av_dict_set(&track.stream->metadata, "language", s.language.c_str(), 0);
  Frame frame(Require(av_frame_alloc(), "allocating a frame"));
  Packet packet(Require(av_packet_alloc(), "allocating a packet"));
  if (s.type == AVMEDIA_TYPE_VIDEO) {
    frame->format = AV_PIX_FMT_YUV420P;
    frame->width = s.width;
    frame->height = s.height;
    Check(av_frame_get_buffer(frame.get(), 0), "allocating a picture");
    if (s.withoutPackets) return track;
    Noise noise;
    for (int i = 0; i < s.frames; ++i) {
      Check(av_frame_make_writable(frame.get()), "writing a picture");
      FillPicture(*frame, s.picture, i, noise);
      frame->pts = i;
      track.Encode(*encoder, frame.get(), *packet);
    }
  } else if (s.type == AVMEDIA_TYPE_AUDIO) {
    frame->format = encoder->sample_fmt;
    frame->nb_samples = encoder->frame_size > 0 ? encoder->frame_size : 1024;
    frame->sample_rate = s.sampleRate;
    Check(av_channel_layout_copy(&frame->ch_layout, &encoder->ch_layout), "copying the layout");
    Check(av_frame_get_buffer(frame.get(), 0), "allocating samples");
    const auto total = static_cast<std::int64_t>(s.seconds * s.sampleRate);
    for (std::int64_t first = 0; first < total; first += frame->nb_samples) {
      Check(av_frame_make_writable(frame.get()), "writing samples");
      FillTone(*frame, first, s.sampleRate);
      frame->pts = first;
      track.Encode(*encoder, frame.get(), *packet);
    }
  } else {
    av_dict_set(&track.stream->metadata, "title", s.title.c_str(), 0);
    std::int64_t start = 0;
    for (std::string text : {"0,0,Default,,0,0,0,,Hello", "1,0,Default,,0,0,0,,Goodbye"}) {
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
      Check(av_new_packet(packet.get(), size), "allocating a subtitle packet");
      std::memcpy(packet->data, buffer, static_cast<std::size_t>(size));
      packet->pts = packet->dts = start;
      packet->duration = 400;
      track.Keep(*packet);
      av_packet_unref(packet.get());
      start += 500;
    }
    return track;
  }
  track.Encode(*encoder, nullptr, *packet);
  return track;
}

// A font carried as an attachment: a stream of a kind the probe lists and skips.
void Attach(AVFormatContext& output, const Stream& s) {
  AVStream* stream = Require(avformat_new_stream(&output, nullptr), "adding a stream");
  stream->codecpar->codec_type = AVMEDIA_TYPE_ATTACHMENT;
  stream->codecpar->codec_id = AV_CODEC_ID_TTF;
  const char bytes[] = "not really a font";
  stream->codecpar->extradata =
      Require(static_cast<std::uint8_t*>(av_mallocz(sizeof bytes + AV_INPUT_BUFFER_PADDING_SIZE)),
              "allocating the font");
  std::memcpy(stream->codecpar->extradata, bytes, sizeof bytes);
  stream->codecpar->extradata_size = static_cast<int>(sizeof bytes);
  av_dict_set(&stream->metadata, "filename", s.title.c_str(), 0);
  av_dict_set(&stream->metadata, "mimetype", "application/x-truetype-font", 0);
}

void Write(const std::vector<Stream>& streams, const std::string& path) {
  AVFormatContext* raw = nullptr;
  Check(avformat_alloc_output_context2(&raw, nullptr, nullptr, path.c_str()), path);
  const std::unique_ptr<AVFormatContext, OutputFree> output(raw);
  output->flags |= AVFMT_FLAG_BITEXACT;
  // The DASH muxer's MP4 segments take FLAC only as an experimental feature.
  if (std::strcmp(output->oformat->name, "dash") == 0)
    output->strict_std_compliance = FF_COMPLIANCE_EXPERIMENTAL;
  std::vector<Track> tracks;
  for (const Stream& s : streams) {
    if (s.type == AVMEDIA_TYPE_ATTACHMENT) {
      Attach(*output, s);
    } else {
      tracks.push_back(Add(*output, s));
    }
  }
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

// One DASH presentation a codec, each stream as its encoder's defaults make it: the codec string
// tests compare the manifest's codecs attribute with their own.
void WriteStreaming(const std::string& folder) {
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
  for (const auto& k : kStreams) {
    if (!(k.encoder ? avcodec_find_encoder_by_name(k.encoder) : avcodec_find_encoder(k.codec)))
      continue;  // the tests skip a codec this libavcodec cannot encode
    Stream s = avcodec_get_type(k.codec) == AVMEDIA_TYPE_VIDEO
                   ? Video(320, 240, {1, 1}, {25, 1}, 5, Picture::Grainy, 300000)
                   : Audio(k.codec, AV_CH_LAYOUT_STEREO, 128000);
    s.codec = k.codec;
    s.encoder = k.encoder;
    s.seconds = 0.2;
    std::filesystem::create_directories(folder + "/" + k.name);
    Write({s}, folder + "/" + k.name + "/stream.mpd");
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
      for (const auto& [name, streams] : Files()) Write(streams, folder + "/" + name);
      // sd.mp4 cut short, as by an interrupted download, and a file that is not media.
      std::ifstream in(folder + "/sd.mp4", std::ios::binary);
      const std::string bytes((std::istreambuf_iterator<char>(in)),
                              std::istreambuf_iterator<char>());
      std::ofstream(folder + "/truncated.mp4", std::ios::binary) << bytes.substr(0, 600);
      std::ofstream(folder + "/notes.txt") << "Shot list\n1. Opening titles\n2. Interview\n";
    }
  } catch (const std::exception& e) {
    std::cerr << "MakeProbeMedia: " << e.what() << '\n';
    return 1;
  }
  return 0;
}
