// Writes the small media files the probe tests read into each folder named (MakeProbeMedia
// FOLDER...), or with --streaming FOLDER, for the codec string tests, one DASH presentation a
// codec the installed libavcodec can encode ("h264/stream.mpd"). Synthetic pictures and tones go
// through bit-exact encoders and libavformat's muxers: the same libraries write the same bytes.
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
#include <memory>
#include <stdexcept>
#include <string>
#include <tuple>
#include <type_traits>
#include <vector>

namespace {

// A flat grey picture costs almost nothing to encode, a moving gradient with a little grain a
// moderate amount, noise as much as it is given.
enum class Picture { Flat, Grainy, Noise };

// One stream of a file: video, audio (tones at 48 kHz), styled subtitles (two lines under
// kAssHeader) or a font attachment, which the probe skips.
struct Stream {
  AVMediaType type;
  AVCodecID codec;
  std::int64_t bitrate;  // the rate control's target; 0 for PCM; a flat picture stays below
  std::uint64_t layout;  // audio
  std::string language;
  int width, height, frames;  // video; no frame for a stream of unknown size
  AVRational aspect, rate;
  Picture picture;
  const char* encoder;  // by name, where the codec has several
  double seconds;       // audio
};

const char kAssHeader[] = "[Script Info]\nTitle: Interview\nScriptType: v4.00+\n";
constexpr AVMediaType kVideo = AVMEDIA_TYPE_VIDEO, kAudio = AVMEDIA_TYPE_AUDIO;

// MPEG-4 video well below the presets' range (a flat picture), inside it and well above it
// (noise at twelve times the maximum); AC-3 and PCM in mono, stereo and 5.1; subtitles beside a
// font and video whose container gives no bitrate; video without a packet, so of unknown size.
std::vector<std::pair<std::string, std::vector<Stream>>> Files() {
  const auto video = [](int width, int height, int frames, AVRational aspect, AVRational rate,
                        Picture picture, std::int64_t bitrate) {
    return Stream{kVideo, AV_CODEC_ID_MPEG4, bitrate, 0, "", width, height, frames, aspect,
                  rate,   picture,           nullptr, 0};
  };
  const auto audio = [](AVCodecID codec, std::uint64_t layout, std::int64_t bitrate,
                        const char* language) {
    return Stream{kAudio, codec, bitrate, layout, language, 0, 0, 0, {}, {}, {}, nullptr, 1.0};
  };
  const Stream sd = video(720, 576, 25, {64, 45}, {25, 1}, Picture::Grainy, 3400000);
  const Stream low = video(352, 288, 30, {12, 11}, {30000, 1001}, Picture::Flat, 100000);
  const Stream surround = audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_5POINT1, 448000, "eng");
  const Stream stereo = audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_STEREO, 192000, "fre");
  const auto pcm = [&](std::uint64_t mask) { return audio(AV_CODEC_ID_PCM_S16LE, mask, 0, ""); };
  Stream subtitle = audio(AV_CODEC_ID_ASS, 0, 0, "ger"), font = subtitle, unseen = sd;
  subtitle.type = AVMEDIA_TYPE_SUBTITLE;
  font.type = AVMEDIA_TYPE_ATTACHMENT, font.codec = AV_CODEC_ID_TTF;
  unseen.frames = 0;
  return {
      {"sd.mp4", {sd, surround}},
      {"low.avi", {low, pcm(AV_CH_LAYOUT_MONO)}},
      {"high.mp4", {video(352, 288, 10, {12, 11}, {30000, 1001}, Picture::Noise, 20000000)}},
      {"mono.ac3", {audio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_MONO, 96000, "")}},
      {"surround.ac3", {surround}},
      {"stereo.wav", {pcm(AV_CH_LAYOUT_STEREO)}},
      {"surround.wav", {pcm(AV_CH_LAYOUT_5POINT1)}},
      {"subtitles.mkv",
       {video(352, 288, 10, {12, 11}, {30000, 1001}, Picture::Flat, 100000), stereo, subtitle,
        font}},
      {"damaged.ts", {unseen, stereo}},
  };
}

// `result`, unless it is an error (a negative code or a null pointer), which throws.
template <class T>
T Check(T result, const std::string& what) {
  if constexpr (std::is_pointer_v<T>) {
    if (result == nullptr) throw std::runtime_error(what + " failed");
  } else if (result < 0) {
    char text[AV_ERROR_MAX_STRING_SIZE] = {};
    av_strerror(result, text, sizeof text);
    throw std::runtime_error(what + ": " + text);
  }
  return result;
}

template <class T, void (*Free)(T**)>
struct Freer {
  void operator()(T* pointer) const { Free(&pointer); }
};
using CodecContext = std::unique_ptr<AVCodecContext, Freer<AVCodecContext, avcodec_free_context>>;
using Frame = std::unique_ptr<AVFrame, Freer<AVFrame, av_frame_free>>;
using Packet = std::unique_ptr<AVPacket, Freer<AVPacket, av_packet_free>>;

// Picture `index` of a stream; `state` carries its noise from picture to picture, the same numbers
// on every run and every machine, unlike rand().
void FillPicture(AVFrame& frame, Picture picture, int index, std::uint32_t& state) {
  const auto noise = [&state] { return (state = state * 1664525u + 1013904223u) >> 24; };
  for (int plane = 0; plane < 3; ++plane) {
    for (int y = 0; y < (plane == 0 ? frame.height : frame.height / 2); ++y) {
      std::uint8_t* row = frame.data[plane] + std::ptrdiff_t{y} * frame.linesize[plane];
      for (int x = 0; x < (plane == 0 ? frame.width : frame.width / 2); ++x) {
        unsigned int value = 128;
        if (picture == Picture::Grainy && plane == 0)
          value = ((x + y + 3 * index) & 0x7f) + (noise() >> 4) + 56;
        if (picture == Picture::Noise) value = noise();
        row[x] = static_cast<std::uint8_t>(value);
      }
    }
  }
}

// A tone of a different pitch on each channel, in planar float or packed 16 bits.
void FillTone(AVFrame& frame, std::int64_t first) {
  const int channels = frame.ch_layout.nb_channels;
  for (int c = 0; c < channels; ++c) {
    for (int i = 0; i < frame.nb_samples; ++i) {
      const double value =
          0.25 * std::sin(2.0 * M_PI * 220.0 * (c + 1) * double(first + i) / frame.sample_rate);
      if (frame.format == AV_SAMPLE_FMT_FLTP) {
        reinterpret_cast<float*>(frame.data[c])[i] = static_cast<float>(value);
      } else {  // the other encoders' first format is packed 16 bits
        reinterpret_cast<std::int16_t*>(frame.data[0])[i * channels + c] =
            static_cast<std::int16_t>(value * 32767.0);
      }
    }
  }
}

// A stream being written and its packets in the encoder's time base: the muxer may choose the
// stream's own time base only when it writes the header.
struct Track {
  AVStream* stream = nullptr;
  AVRational timeBase{1, 1000};
  std::vector<Packet> packets;

  void Keep(const AVPacket& packet) {
    packets.emplace_back(Check(av_packet_clone(&packet), "copying a packet"));
    packets.back()->stream_index = stream->index;
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

void SetExtradata(AVCodecParameters& parameters, const char* bytes, std::size_t size) {
  parameters.extradata = Check(
      static_cast<std::uint8_t*>(av_mallocz(size + AV_INPUT_BUFFER_PADDING_SIZE)), "extradata");
  std::memcpy(parameters.extradata, bytes, size);
  parameters.extradata_size = static_cast<int>(size);
}

// Subtitles and fonts need no encoder: their packets are the lines, their extradata the header
// or the font.
Track AddRaw(AVFormatContext& output, const Stream& s) {
  Track track;
  track.stream = Check(avformat_new_stream(&output, nullptr), "adding a stream");
  track.stream->time_base = track.timeBase;
  AVCodecParameters& parameters = *track.stream->codecpar;
  parameters.codec_type = s.type;
  parameters.codec_id = s.codec;
  if (s.type == AVMEDIA_TYPE_ATTACHMENT) {
    SetExtradata(parameters, "not really a font", sizeof "not really a font");
    av_dict_set(&track.stream->metadata, "filename", "font.ttf", 0);
    av_dict_set(&track.stream->metadata, "mimetype", "application/x-truetype-font", 0);
    return track;
  }
  SetExtradata(parameters, kAssHeader, sizeof kAssHeader - 1);
  av_dict_set(&track.stream->metadata, "language", s.language.c_str(), 0);
  av_dict_set(&track.stream->metadata, "title", "Director's commentary", 0);
  const std::string kLines[] = {"0,0,Default,,0,0,0,,Hello", "1,0,Default,,0,0,0,,Goodbye"};
  for (int i = 0; i < 2; ++i) {
    Packet packet(Check(av_packet_alloc(), "allocating a packet"));
    Check(av_new_packet(packet.get(), static_cast<int>(kLines[i].size())), "a subtitle packet");
    std::memcpy(packet->data, kLines[i].data(), kLines[i].size());
    packet->pts = packet->dts = 500 * i, packet->duration = 400;
    track.Keep(*packet);
  }
  return track;
}

// Encodes `s` whole into a new stream of `output`.
Track Add(AVFormatContext& output, const Stream& s) {
  if (s.type != kVideo && s.type != kAudio) return AddRaw(output, s);
  const AVCodec* codec =
      Check(s.encoder ? avcodec_find_encoder_by_name(s.encoder) : avcodec_find_encoder(s.codec),
            "finding the encoder");
  CodecContext encoder(Check(avcodec_alloc_context3(codec), "allocating an encoder"));
  encoder->thread_count = 1;
  encoder->flags |= AV_CODEC_FLAG_BITEXACT;
  if (output.oformat->flags & AVFMT_GLOBALHEADER) encoder->flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
  encoder->bit_rate = s.bitrate;
  const bool video = s.type == kVideo;
  if (video) {
    encoder->width = s.width, encoder->height = s.height, encoder->pix_fmt = AV_PIX_FMT_YUV420P;
    encoder->sample_aspect_ratio = s.aspect, encoder->framerate = s.rate;
    encoder->time_base = av_inv_q(s.rate), encoder->gop_size = 12, encoder->max_b_frames = 0;
    if (std::strcmp(codec->name, "libx265") == 0)
      av_opt_set(encoder->priv_data, "x265-params", "log-level=error", 0);
  } else {
    encoder->sample_rate = 48000, encoder->time_base = AVRational{1, 48000};
    Check(av_channel_layout_from_mask(&encoder->ch_layout, s.layout), "setting the layout");
    encoder->sample_fmt = codec->sample_fmts[0];
  }
  Check(avcodec_open2(encoder.get(), codec, nullptr), "opening the encoder");
  Track track;
  track.stream = Check(avformat_new_stream(&output, nullptr), "adding a stream");
  track.stream->time_base = track.timeBase = encoder->time_base;
  if (video) track.stream->avg_frame_rate = s.rate, track.stream->sample_aspect_ratio = s.aspect;
  Check(avcodec_parameters_from_context(track.stream->codecpar, encoder.get()), "parameters");
  if (!s.language.empty()) av_dict_set(&track.stream->metadata, "language", s.language.c_str(), 0);
  Frame frame(Check(av_frame_alloc(), "allocating a frame"));
  Packet packet(Check(av_packet_alloc(), "allocating a packet"));
  int frames = s.frames;
  if (video) {
    frame->format = AV_PIX_FMT_YUV420P, frame->width = s.width, frame->height = s.height;
  } else {
    frame->format = encoder->sample_fmt, frame->sample_rate = 48000;
    frame->nb_samples = encoder->frame_size > 0 ? encoder->frame_size : 1024;
    frames = static_cast<int>(std::ceil(s.seconds * 48000 / frame->nb_samples));
    Check(av_channel_layout_copy(&frame->ch_layout, &encoder->ch_layout), "copying the layout");
  }
  Check(av_frame_get_buffer(frame.get(), 0), "allocating a frame's buffers");
  std::uint32_t noise = 12345;
  for (int i = 0; i < frames; ++i) {
    Check(av_frame_make_writable(frame.get()), "writing a frame");
    frame->pts = video ? i : std::int64_t{i} * frame->nb_samples;
    if (video) FillPicture(*frame, s.picture, i, noise);
    if (!video) FillTone(*frame, frame->pts);
    track.Encode(*encoder, frame.get(), *packet);
  }
  track.Encode(*encoder, nullptr, *packet);
  return track;
}

void Write(const std::vector<Stream>& streams, const std::string& path) {
  AVFormatContext* raw = nullptr;
  Check(avformat_alloc_output_context2(&raw, nullptr, nullptr, path.c_str()), path);
  const std::unique_ptr<AVFormatContext, void (*)(AVFormatContext*)> output(
      raw, [](AVFormatContext* c) {
        if (c->pb != nullptr) avio_closep(&c->pb);
        avformat_free_context(c);
      });
  output->flags |= AVFMT_FLAG_BITEXACT;
  // The DASH muxer's MP4 segments take FLAC only as an experimental feature.
  if (std::strcmp(output->oformat->name, "dash") == 0)
    output->strict_std_compliance = FF_COMPLIANCE_EXPERIMENTAL;
  std::vector<Track> tracks;
  for (const Stream& s : streams) tracks.push_back(Add(*output, s));
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

// Each stream as its encoder's defaults make it: the codec string tests compare the manifest's
// codecs attribute with their own.
void WriteStreaming(const std::string& folder) {
  const std::tuple<const char*, AVCodecID, const char*> kStreams[] = {
      {"h264", AV_CODEC_ID_H264, nullptr}, {"hevc", AV_CODEC_ID_HEVC, nullptr},
      {"vp9", AV_CODEC_ID_VP9, nullptr},   {"av1", AV_CODEC_ID_AV1, "libsvtav1"},
      {"aac", AV_CODEC_ID_AAC, nullptr},   {"opus", AV_CODEC_ID_OPUS, "libopus"},
      {"flac", AV_CODEC_ID_FLAC, nullptr}, {"ac3", AV_CODEC_ID_AC3, nullptr},
      {"eac3", AV_CODEC_ID_EAC3, nullptr},
  };
  for (const auto& [name, codec, encoder] : kStreams) {
    if (!(encoder ? avcodec_find_encoder_by_name(encoder) : avcodec_find_encoder(codec)))
      continue;  // the tests skip a codec this libavcodec cannot encode
    const Stream s = avcodec_get_type(codec) == kVideo
                         ? Stream{kVideo, codec,   300000,          0,       "", 320, 240, 5,
                                  {1, 1}, {25, 1}, Picture::Grainy, encoder, 0}
                         : Stream{kAudio, codec,   128000, AV_CH_LAYOUT_STEREO, "", 0, 0, 0, {}, {},
                                  {},     encoder, 0.2};
    std::filesystem::create_directories(folder + "/" + name);
    Write({s}, folder + "/" + name + "/stream.mpd");
  }
}

}  // namespace

// libx265 keeps a block of its own until the process ends: the encoder's leak, not the tests'.
extern "C" __attribute__((visibility("default"), used)) const char* __lsan_default_suppressions() {
  return "leak:libx265.so\n";
}

int main(int argc, char** argv) {
  if (argc < 2) {
    std::cerr << "usage: MakeProbeMedia FOLDER... | MakeProbeMedia --streaming FOLDER\n";
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
      std::filesystem::copy_file(folder + "/sd.mp4", folder + "/truncated.mp4",
                                 std::filesystem::copy_options::overwrite_existing);
      std::filesystem::resize_file(folder + "/truncated.mp4", 600);
      std::ofstream(folder + "/notes.txt") << "Shot list\n1. Opening titles\n2. Interview\n";
    }
  } catch (const std::exception& e) {
    std::cerr << "MakeProbeMedia: " << e.what() << '\n';
    return 1;
  }
  return 0;
}
