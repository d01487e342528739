// Tests of formatdesc probe's parts that need no media file: the verdict on a bitrate, and the
// description of a stream as libavformat hands it over, built here field by field so that every
// value a file may leave unknown or give in a form the library cannot hold can be tried.
#include <gtest/gtest.h>

#include "Probe.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/mem.h>
}

#include <cstring>
#include <memory>

namespace Formatdesc {
namespace {

using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecSubtitle;
using Tarvek::Conf::IFormatCodecVideo;

const Bitrates kRange{2000000, 1000000, 4000000};

TEST(FormatdescVerdict, RangeIncludesBothBounds) {
  for (const long long bitrate : {1000000LL, 2500000LL, 4000000LL}) {
    const Verdict verdict = JudgeBitrate(bitrate, kRange);
    EXPECT_EQ(verdict.placement, Placement::Within) << bitrate;
    EXPECT_EQ(verdict.difference, 0);
    EXPECT_EQ(VerdictText(verdict), "within the range");
  }
}

TEST(FormatdescVerdict, BelowSaysHowFarUnderTheMinimum) {
  const Verdict verdict = JudgeBitrate(380000, kRange);
  EXPECT_EQ(verdict.placement, Placement::Below);
  EXPECT_EQ(verdict.bound, 1000000);
  EXPECT_EQ(verdict.difference, 620000);
  EXPECT_DOUBLE_EQ(verdict.percent, 62.0);
  EXPECT_STREQ(PlacementName(verdict.placement), "below");
  EXPECT_EQ(VerdictText(verdict),
            "below the range by 62% (620.00 kb/s under the minimum of 1.00 Mb/s)");
}

TEST(FormatdescVerdict, AboveSaysHowFarOverTheMaximum) {
  const Verdict verdict = JudgeBitrate(10000000, kRange);
  EXPECT_EQ(verdict.placement, Placement::Above);
  EXPECT_EQ(verdict.bound, 4000000);
  EXPECT_EQ(verdict.difference, 6000000);
  EXPECT_STREQ(PlacementName(verdict.placement), "above");
  EXPECT_EQ(VerdictText(verdict),
            "above the range by 150% (6.00 Mb/s over the maximum of 4.00 Mb/s)");
}

TEST(FormatdescVerdict, TinyShareReadsLessThanOnePercent) {
  EXPECT_EQ(VerdictText(JudgeBitrate(4000001, kRange)),
            "above the range by less than 1% (0.00 kb/s over the maximum of 4.00 Mb/s)");
  EXPECT_EQ(VerdictText(JudgeBitrate(995000, kRange)),
            "below the range by less than 1% (5.00 kb/s under the minimum of 1.00 Mb/s)");
  EXPECT_EQ(VerdictText(JudgeBitrate(986000, kRange)),
            "below the range by 1% (14.00 kb/s under the minimum of 1.00 Mb/s)");
}

// A stream as libavformat gives it, inside a context that owns it.
class FormatdescProbeStream : public ::testing::Test {
 protected:
  AVStream& NewStream(AVMediaType type, AVCodecID codec) {
    AVStream* stream = avformat_new_stream(context_.get(), nullptr);
    if (stream == nullptr) throw std::bad_alloc();
    stream->codecpar->codec_type = type;
    stream->codecpar->codec_id = codec;
    return *stream;
  }

  AVStream& NewVideo(AVCodecID codec, int width, int height) {
    AVStream& stream = NewStream(AVMEDIA_TYPE_VIDEO, codec);
    stream.codecpar->width = width;
    stream.codecpar->height = height;
    stream.codecpar->format = AV_PIX_FMT_YUV420P;
    stream.avg_frame_rate = AVRational{25, 1};
    return stream;
  }

  AVStream& NewAudio(AVCodecID codec, std::uint64_t mask) {
    AVStream& stream = NewStream(AVMEDIA_TYPE_AUDIO, codec);
    stream.codecpar->sample_rate = 48000;
    stream.codecpar->format = AV_SAMPLE_FMT_FLTP;
    if (av_channel_layout_from_mask(&stream.codecpar->ch_layout, mask) < 0) {
      throw std::runtime_error("no such layout");
    }
    return stream;
  }

  static void SetExtradata(AVStream& stream, const std::string& bytes) {
    auto* data =
        static_cast<std::uint8_t*>(av_mallocz(bytes.size() + AV_INPUT_BUFFER_PADDING_SIZE));
    if (data == nullptr) throw std::bad_alloc();
    std::memcpy(data, bytes.data(), bytes.size());
    stream.codecpar->extradata = data;
    stream.codecpar->extradata_size = static_cast<int>(bytes.size());
  }

  StreamReport Describe(const AVStream& stream) {
    return DescribeStream(*context_, static_cast<unsigned int>(stream.index));
  }

  template <class Kind>
  static boost::intrusive_ptr<Kind> As(const StreamReport& report) {
    auto description = boost::dynamic_pointer_cast<Kind>(report.description);
    if (!description) throw std::runtime_error("no description of the expected kind");
    return description;
  }

 private:
  struct Free {
    void operator()(AVFormatContext* context) const { avformat_free_context(context); }
  };
  std::unique_ptr<AVFormatContext, Free> context_{avformat_alloc_context()};
};

TEST_F(FormatdescProbeStream, VideoTakesWhatTheStreamGives) {
  AVStream& stream = NewVideo(AV_CODEC_ID_H264, 720, 576);
  stream.codecpar->codec_tag = MKTAG('a', 'v', 'c', '1');
  stream.codecpar->bit_rate = 3000000;
  stream.sample_aspect_ratio = AVRational{128, 90};  // given unreduced
  stream.avg_frame_rate = AVRational{30000, 1001};
  SetExtradata(stream, std::string("\x01\x64\x00\x1f", 4));

  const StreamReport report = Describe(stream);
  ASSERT_TRUE(report.damage.empty()) << report.damage;
  EXPECT_EQ(report.kind, "video");
  EXPECT_EQ(report.codec, "h264");
  const auto video = As<IFormatCodecVideo>(report);
  EXPECT_EQ(video->GetCodecID(), "h264");
  EXPECT_EQ(video->GetCodecName(), "H.264 / AVC / MPEG-4 AVC / MPEG-4 part 10");
  EXPECT_EQ(video->GetCodecTag(), MKTAG('a', 'v', 'c', '1'));
  EXPECT_EQ(video->GetBitrate(), 3000000);
  EXPECT_EQ(video->GetWidth(), 720u);
  EXPECT_EQ(video->GetHeight(), 576u);
  EXPECT_EQ(video->GetPixelAspectX(), 64u);
  EXPECT_EQ(video->GetPixelAspectY(), 45u);
  EXPECT_EQ(video->GetFrameAspectX(), 16u);
  EXPECT_EQ(video->GetFrameAspectY(), 9u);
  EXPECT_EQ(video->GetFrameRateNum(), 30000u);
  EXPECT_EQ(video->GetFrameRateDen(), 1001u);
  EXPECT_EQ(video->GetPixelFormat(), AV_PIX_FMT_YUV420P);
  EXPECT_FALSE(video->ExistsBitrateMode());  // the file does not say; only the range assumes one
  ASSERT_TRUE(video->GetPrivateData());
  EXPECT_EQ(video->GetPrivateData()->GetSize(), 4u);
  EXPECT_EQ(video->GetPrivateData()->GetData()[1], 0x64);
  EXPECT_TRUE(report.notes.empty());

  // The range is the presets' for the same settings in a target-bitrate mode.
  auto asked = video->Clone();
  asked->SetBitrateMode("cbr");
  const Bitrates expected = VideoBitrates(asked);
  ASSERT_TRUE(report.range);
  EXPECT_EQ(report.range->minimum, expected.minimum);
  EXPECT_EQ(report.range->maximum, expected.maximum);
  ASSERT_TRUE(report.verdict);
  EXPECT_EQ(report.verdict->bitrate, 3000000);
  EXPECT_EQ(report.verdict->placement, JudgeBitrate(3000000, expected).placement);
}

TEST_F(FormatdescProbeStream, CodecPixelAspectStandsInForTheContainers) {
  AVStream& stream = NewVideo(AV_CODEC_ID_MPEG4, 352, 288);
  stream.codecpar->sample_aspect_ratio = AVRational{12, 11};
  const auto video = As<IFormatCodecVideo>(Describe(stream));
  EXPECT_EQ(video->GetPixelAspectX(), 12u);
  EXPECT_EQ(video->GetPixelAspectY(), 11u);
}

TEST_F(FormatdescProbeStream, UnknownVideoValuesStayUnset) {
  AVStream& stream = NewVideo(AV_CODEC_ID_MPEG4, 640, 480);
  stream.avg_frame_rate = AVRational{0, 0};
  stream.codecpar->format = AV_PIX_FMT_NB;  // beyond libavutil's formats, as a bad file may say
  stream.codecpar->bit_rate = 800000;

  const StreamReport report = Describe(stream);
  const auto video = As<IFormatCodecVideo>(report);
  EXPECT_EQ(video->GetWidth(), 640u);
  EXPECT_EQ(video->GetHeight(), 480u);
  EXPECT_FALSE(video->ExistsPixelAspectX());  // 0:1 is unknown, not a zero aspect
  EXPECT_FALSE(video->ExistsPixelAspectY());
  EXPECT_FALSE(video->ExistsFrameRateNum());
  EXPECT_FALSE(video->ExistsFrameRateDen());
  EXPECT_FALSE(video->ExistsPixelFormat());
  EXPECT_FALSE(video->GetPrivateData());
  EXPECT_EQ(report.notes.size(), 3u);
  EXPECT_FALSE(report.range);
  EXPECT_FALSE(report.verdict);
  EXPECT_EQ(report.noVerdict,
            "none (the presets need the frame rate, which the file does not give)");
}

TEST_F(FormatdescProbeStream, NoBitrateInTheFileGivesRangeWithoutVerdict) {
  AVStream& stream = NewVideo(AV_CODEC_ID_H264, 1920, 1080);
  const StreamReport report = Describe(stream);
  EXPECT_FALSE(report.description->ExistsBitrate());
  EXPECT_FALSE(report.description->ExistsCodecTag());
  EXPECT_TRUE(report.range);
  EXPECT_FALSE(report.verdict);
  EXPECT_EQ(report.noVerdict, "none (the file gives no bitrate for this stream)");
}

TEST_F(FormatdescProbeStream, CodecWithoutPresetKeepsItsDescription) {
  AVStream& stream = NewVideo(AV_CODEC_ID_CINEPAK, 640, 480);
  stream.codecpar->bit_rate = 5000000;
  const StreamReport report = Describe(stream);
  ASSERT_TRUE(report.description);
  EXPECT_EQ(report.description->GetCodecID(), "cinepak");
  EXPECT_FALSE(report.range);
  EXPECT_FALSE(report.verdict);
  EXPECT_EQ(report.noVerdict, "no preset for codec cinepak");
}

TEST_F(FormatdescProbeStream, StreamsWithoutTheirEssentialsAreDamaged) {
  AVStream& noSize = NewVideo(AV_CODEC_ID_MPEG4, 0, 0);
  AVStream& noCodec = NewVideo(AV_CODEC_ID_NONE, 320, 240);
  AVStream& noRate = NewAudio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_STEREO);
  noRate.codecpar->sample_rate = 0;
  AVStream& noChannels = NewAudio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_STEREO);
  av_channel_layout_uninit(&noChannels.codecpar->ch_layout);
  for (const AVStream* stream : {&noSize, &noCodec, &noRate, &noChannels}) {
    const StreamReport report = Describe(*stream);
    EXPECT_FALSE(report.description) << stream->index;
    EXPECT_FALSE(report.damage.empty()) << stream->index;
    EXPECT_FALSE(report.Skipped()) << stream->index;
    EXPECT_FALSE(report.range) << stream->index;
  }
  EXPECT_EQ(Describe(noSize).damage,
            "the frame size is unknown (libavformat could read no picture of it)");
  EXPECT_EQ(Describe(noCodec).damage, "libavformat does not know the stream's codec");
}

TEST_F(FormatdescProbeStream, AudioTakesWhatTheStreamGives) {
  AVStream& stream = NewAudio(AV_CODEC_ID_AC3, AV_CH_LAYOUT_5POINT1);
  stream.codecpar->bit_rate = 448000;
  stream.codecpar->frame_size = 1536;
  stream.codecpar->codec_tag = 0x2000;
  av_dict_set(&stream.metadata, "language", "eng", 0);
  av_dict_set(&stream.metadata, "title", "Main", 0);  // audio descriptions have no title

  const StreamReport report = Describe(stream);
  const auto audio = As<IFormatCodecAudio>(report);
  EXPECT_EQ(audio->GetCodecID(), "ac3");
  EXPECT_EQ(audio->GetCodecTag(), 0x2000);
  EXPECT_EQ(audio->GetBitrate(), 448000);
  EXPECT_EQ(audio->GetSampleRate(), 48000);
  EXPECT_EQ(audio->GetChannelLayout(), Tarvek::Conf::CH_LAYOUT_5POINT1);
  EXPECT_EQ(audio->GetFrameSize(), 1536);
  EXPECT_EQ(audio->GetSampleFormat(), AV_SAMPLE_FMT_FLTP);
  EXPECT_EQ(audio->GetLanguage(), "eng");
  EXPECT_TRUE(report.notes.empty());
  const Bitrates expected = AudioBitrates(audio);
  ASSERT_TRUE(report.range);
  EXPECT_EQ(report.range->typical, expected.typical);
  ASSERT_TRUE(report.verdict);
  EXPECT_EQ(report.verdict->placement, Placement::Within);
}

TEST_F(FormatdescProbeStream, UnorderedChannelsLeaveLayoutUnsetAndRangeUsesUsualLayout) {
  AVStream& stream = NewAudio(AV_CODEC_ID_PCM_S16LE, AV_CH_LAYOUT_STEREO);
  av_channel_layout_uninit(&stream.codecpar->ch_layout);
  stream.codecpar->ch_layout.order = AV_CHANNEL_ORDER_UNSPEC;
  stream.codecpar->ch_layout.nb_channels = 2;
  stream.codecpar->format = AV_SAMPLE_FMT_S16;
  stream.codecpar->bit_rate = 1536000;

  const StreamReport report = Describe(stream);
  const auto audio = As<IFormatCodecAudio>(report);
  EXPECT_FALSE(audio->ExistsChannelLayout());
  ASSERT_EQ(report.notes.size(), 2u);
  EXPECT_EQ(report.notes[0],
            "the file gives 2 channels in no speaker order (unspecified), so the channel layout "
            "is left unset");
  EXPECT_EQ(report.notes[1], "the range is that of 2 channels in the usual layout (stereo)");
  ASSERT_TRUE(report.range);
  EXPECT_EQ(report.range->minimum, 1536000);  // 48000 Hz x 2 channels x 16 bits
  ASSERT_TRUE(report.verdict);
  EXPECT_EQ(report.verdict->placement, Placement::Within);
}

TEST_F(FormatdescProbeStream, UnknownSampleFormatStaysUnset) {
  AVStream& stream = NewAudio(AV_CODEC_ID_FLAC, AV_CH_LAYOUT_STEREO);
  stream.codecpar->format = AV_SAMPLE_FMT_NONE;
  stream.codecpar->bit_rate = 900000;
  const StreamReport report = Describe(stream);
  EXPECT_FALSE(As<IFormatCodecAudio>(report)->ExistsSampleFormat());
  EXPECT_EQ(report.notes,
            std::vector<std::string>{"the sample format is unknown, so it is left unset"});
  EXPECT_EQ(report.noVerdict,
            "none (the presets need the sample format, which the file does not give)");
}

TEST_F(FormatdescProbeStream, MaskBeyondThirtyTwoSpeakersStaysUnset) {
  AVStream& stream =
      NewAudio(AV_CODEC_ID_PCM_S16LE, AV_CH_LAYOUT_STEREO | AV_CH_SURROUND_DIRECT_LEFT);
  stream.codecpar->format = AV_SAMPLE_FMT_S16;
  const StreamReport report = Describe(stream);
  EXPECT_FALSE(As<IFormatCodecAudio>(report)->ExistsChannelLayout());
  ASSERT_FALSE(report.notes.empty());
  EXPECT_EQ(report.notes[0],
            "the speaker mask 0x200000003 names speakers beyond the library's 32, so the channel "
            "layout is left unset");
}

TEST_F(FormatdescProbeStream, PresetsRefusingTheLayoutKeepTheDescription) {
  AVStream& stream = NewAudio(AV_CODEC_ID_MP3, AV_CH_LAYOUT_5POINT1);
  stream.codecpar->bit_rate = 320000;
  const StreamReport report = Describe(stream);
  ASSERT_TRUE(report.description);
  EXPECT_TRUE(report.damage.empty());
  EXPECT_FALSE(report.verdict);
  EXPECT_EQ(report.noVerdict.rfind("none (the presets refuse the description: ", 0), 0u)
      << report.noVerdict;
}

TEST_F(FormatdescProbeStream, StyledSubtitleHeaderIsBothHeaderAndPrivateData) {
  AVStream& stream = NewStream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_ASS);
  const std::string header = "[Script Info]\nScriptType: v4.00+\n";
  SetExtradata(stream, header + std::string(1, '\0'));
  av_dict_set(&stream.metadata, "language", "ger", 0);
  av_dict_set(&stream.metadata, "title", "Director's commentary", 0);

  const StreamReport report = Describe(stream);
  const auto subtitle = As<IFormatCodecSubtitle>(report);
  EXPECT_EQ(subtitle->GetCodecID(), "ass");
  EXPECT_EQ(subtitle->GetSubtitleHeader(), header);  // up to the terminating zero
  EXPECT_EQ(subtitle->GetLanguage(), "ger");
  EXPECT_EQ(subtitle->GetTitle(), "Director's commentary");
  EXPECT_FALSE(subtitle->ExistsDVBWidth());
  ASSERT_TRUE(subtitle->GetPrivateData());
  EXPECT_EQ(subtitle->GetPrivateData()->GetSize(), header.size() + 1);
  EXPECT_FALSE(report.range);
  EXPECT_TRUE(report.noVerdict.empty());
}

TEST_F(FormatdescProbeStream, OtherSubtitlesKeepExtradataOnlyAsPrivateData) {
  AVStream& text = NewStream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_MOV_TEXT);
  SetExtradata(text, std::string("\x00\x00\x00\x00\x01", 5));
  const auto described = As<IFormatCodecSubtitle>(Describe(text));
  EXPECT_FALSE(described->ExistsSubtitleHeader());
  EXPECT_FALSE(described->ExistsLanguage());
  EXPECT_FALSE(described->ExistsTitle());
  ASSERT_TRUE(described->GetPrivateData());
  EXPECT_EQ(described->GetPrivateData()->GetSize(), 5u);
}

TEST_F(FormatdescProbeStream, DvbSubtitlesTakeTheirDisplaySize) {
  AVStream& dvb = NewStream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_DVB_SUBTITLE);
  dvb.codecpar->width = 1920;
  dvb.codecpar->height = 1080;
  const auto withSize = As<IFormatCodecSubtitle>(Describe(dvb));
  EXPECT_EQ(withSize->GetDVBWidth(), 1920u);
  EXPECT_EQ(withSize->GetDVBHeight(), 1080u);

  AVStream& unsized = NewStream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_DVB_SUBTITLE);
  EXPECT_FALSE(As<IFormatCodecSubtitle>(Describe(unsized))->ExistsDVBWidth());
  // Only DVB subtitles have a DVB size.
  AVStream& other = NewStream(AVMEDIA_TYPE_SUBTITLE, AV_CODEC_ID_HDMV_PGS_SUBTITLE);
  other.codecpar->width = 1920;
  other.codecpar->height = 1080;
  EXPECT_FALSE(As<IFormatCodecSubtitle>(Describe(other))->ExistsDVBWidth());
}

TEST_F(FormatdescProbeStream, OtherKindsAreSkipped) {
  AVStream& font = NewStream(AVMEDIA_TYPE_ATTACHMENT, AV_CODEC_ID_TTF);
  AVStream& data = NewStream(AVMEDIA_TYPE_DATA, AV_CODEC_ID_NONE);
  const StreamReport attachment = Describe(font);
  EXPECT_TRUE(attachment.Skipped());
  EXPECT_EQ(attachment.kind, "attachment");
  EXPECT_EQ(attachment.codec, "ttf");
  const StreamReport skipped = Describe(data);
  EXPECT_TRUE(skipped.Skipped());  // not damaged, though libavformat knows no codec for it
  EXPECT_EQ(skipped.kind, "data");
}

TEST(FormatdescProbeFile, FilesThatCannotBeReadAreUsageErrors) {
  const auto message = [](const std::string& path) {
    try {
      ProbeFile(path);
    } catch (const UsageError& e) {
      return std::string(e.what());
    }
    return std::string("no error");
  };
  EXPECT_EQ(message("no-such-file.mp4"),
            "cannot read 'no-such-file.mp4': No such file or directory");
  // Only local files: a network address is a file name that does not exist.
  EXPECT_EQ(message("http://localhost/clip.mp4"),
            "cannot read 'http://localhost/clip.mp4': No such file or directory");
}

}  // namespace
}  // namespace Formatdesc
