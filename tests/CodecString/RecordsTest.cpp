// The record readers and the codec strings made from them: the strings of known records, and
// every record cut short or lying about its lengths refused with the part named.
#include <Tarvek/CodecString/CodecString.h>
#include <Tarvek/Conf/Formats/FormatCodecAudio.h>
#include <Tarvek/Conf/Formats/FormatCodecVideo.h>
#include <gtest/gtest.h>

#include <boost/exception/get_error_info.hpp>
#include <functional>
#include <string>
#include <vector>

namespace {

using namespace Tarvek;
using Bytes = std::vector<std::uint8_t>;

const Bytes kAvcC = {0x01, 0x64, 0x00, 0x28, 0xFF, 0xE1, 0x00, 0x04, 0x67,
                     0x64, 0x00, 0x28, 0x01, 0x00, 0x02, 0x68, 0xEE};
const Bytes kHvcC = {0x01, 0x01, 0x60, 0x00, 0x00, 0x00, 0x90, 0x00, 0x00, 0x00,
                     0x00, 0x00, 0x78, 0xF0, 0x00, 0xFC, 0xFD, 0xF8, 0xF8, 0x00,
                     0x00, 0x0F, 0x01, 0x20, 0x00, 0x01, 0x00, 0x02, 0x40, 0x01};
const Bytes kVpcC = {0x01, 0x00, 0x00, 0x00, 0x00, 0x29, 0x82, 0x01, 0x01, 0x01, 0x00, 0x00};
const Bytes kAv1C = {0x81, 0x08, 0x0C, 0x00};
const Bytes kAacLc = {0x12, 0x10};
const Bytes kHeAac = {0x2B, 0x11, 0x88};

std::string Error(const std::function<void()>& call) {
  try {
    call();
  } catch (const CodecString::CodecStringError& error) {
    const std::string* what = boost::get_error_info<DescriptionInfo>(error);
    return what ? *what : "(no description)";
  }
  return "";
}

boost::intrusive_ptr<Conf::IFormatCodec> Video(const std::string& codecId, const Bytes& data) {
  auto video = Conf::FormatCodecVideo::Create();
  video->SetCodecID(codecId);
  if (!data.empty()) video->SetPrivateData(CreateBlob(data.data(), data.size()));
  return video;
}

boost::intrusive_ptr<Conf::IFormatCodec> Audio(const std::string& codecId, const Bytes& data) {
  auto audio = Conf::FormatCodecAudio::Create();
  audio->SetCodecID(codecId);
  if (!data.empty()) audio->SetPrivateData(CreateBlob(data.data(), data.size()));
  return audio;
}

TEST(CodecStringTest, StringsOfKnownRecords) {
  EXPECT_EQ(CodecString::GetCodecString(Video("h264", kAvcC)), "avc1.640028");
  EXPECT_EQ(CodecString::GetCodecString(Video("hevc", kHvcC)), "hvc1.1.6.L120.90");
  EXPECT_EQ(CodecString::GetCodecString(Video("vp9", kVpcC)), "vp09.00.41.08");
  EXPECT_EQ(CodecString::GetCodecString(Video("av1", kAv1C)), "av01.0.08M.08");
  EXPECT_EQ(CodecString::GetCodecString(Audio("aac", kAacLc)), "mp4a.40.2");
  EXPECT_EQ(CodecString::GetCodecString(Audio("aac", kHeAac)), "mp4a.40.5");
  EXPECT_EQ(CodecString::GetCodecString(Audio("aac_he_v2", {})), "mp4a.40.29");
  EXPECT_EQ(CodecString::GetCodecString(Audio("eac3", {})), "ec-3");
  // Parameter sets in an Annex B byte stream, the picture parameter set first.
  const Bytes annexB = {0, 0, 1, 0x68, 0xEE, 0, 0, 0, 1, 0x67, 0x4D, 0x40, 0x1F, 0xAB};
  EXPECT_EQ(CodecString::GetCodecString(Video("h264", annexB)), "avc1.4d401f");
  // VP9 without a record: profile and depth from the pixel format, level from size and rate.
  auto vp9 = boost::dynamic_pointer_cast<Conf::IFormatCodecVideo>(Video("vp9", {}));
  vp9->InitByPixelAspect(1920, 1080, 1, 1);
  vp9->SetFrameRate(30, 1);
  vp9->SetPixelFormat(AV_PIX_FMT_YUV420P10LE);
  EXPECT_EQ(CodecString::GetCodecString(vp9), "vp09.02.40.10");
}

// A byte stream starts with a three- or four-byte start code; a record never does.
TEST(CodecStringTest, ByteStreamsAreToldFromRecords) {
  const std::pair<Bytes, bool> rows[] = {
      {{0, 0, 1}, true},        {{0, 0, 0, 1}, true},  {{0, 0, 1, 0x67}, true},
      {{0, 0}, false},          {{0, 0, 0}, false},    {{0, 0, 2}, false},
      {{0, 1, 0, 1}, false},    {{1, 0, 0, 1}, false}, {{0, 0, 0, 0}, false},
      {{0, 0, 0, 0, 1}, false}, {{1, 1, 1}, false},    {kAvcC, false},
      {kHvcC, false},
  };
  for (const auto& [bytes, expected] : rows) {
    EXPECT_EQ(CodecString::IsByteStream(bytes.data(), bytes.size()), expected)
        << ::testing::PrintToString(bytes);
  }
  EXPECT_FALSE(CodecString::IsByteStream(nullptr, 4));
}

TEST(CodecStringTest, MissingPartsAreNamed) {
  EXPECT_EQ(Error([] { CodecString::GetCodecString(Video("h264", {})); }),
            "h264: the codec string needs the avcC record or a sequence parameter set (no "
            "private data)");
  EXPECT_EQ(Error([] { CodecString::GetCodecString(Video("vp9", {})); }),
            "vp9: the codec string needs a vpcC record in the private data, or the pixel format "
            "(pix_fmt)");
  EXPECT_EQ(Error([] { CodecString::GetCodecString(Audio("pcm_s16le", {})); }),
            "codec pcm_s16le has no streaming codec string");
  EXPECT_EQ(Error([] { CodecString::GetCodecString(Audio("", {})); }),
            "codec  has no streaming codec string");
  EXPECT_EQ(Error([] { CodecString::GetCodecString(Conf::FormatCodecVideo::Create()); }),
            "the codec string needs the codec identifier (codec_id)");
}

// Every proper prefix of a record is refused, never read past; so is a record whose parameter
// sets claim more bytes than it has.
TEST(CodecStringTest, TruncatedAndLyingRecordsAreRefused) {
  const struct {
    const char* codecId;
    const Bytes* record;
  } kRecords[] = {{"h264", &kAvcC}, {"hevc", &kHvcC}, {"vp9", &kVpcC},
                  {"av1", &kAv1C},  {"aac", &kAacLc}, {"aac", &kHeAac}};
  for (const auto& record : kRecords) {
    for (std::size_t size = 1; size < record.record->size(); ++size) {
      const Bytes prefix(record.record->begin(), record.record->begin() + size);
      const bool video = std::string(record.codecId) != "aac";
      const std::string error = Error([&] {
        CodecString::GetCodecString(video ? Video(record.codecId, prefix)
                                          : Audio(record.codecId, prefix));
      });
      EXPECT_NE(error.find("truncated"), std::string::npos)
          << record.codecId << " cut to " << size << " bytes: " << error;
    }
  }
  Bytes lying = kAvcC;
  lying[7] = 0x40;  // the sequence parameter set claims 64 bytes
  EXPECT_EQ(Error([&] { CodecString::ParseAvcConfig(lying.data(), lying.size()); }),
            "avcC: truncated: sequence parameter set 1 (declared 64 bytes) needs 64 bytes at "
            "offset 8, 9 remain");
  Bytes wrongVersion = kHvcC;
  wrongVersion[0] = 2;
  EXPECT_EQ(Error([&] { CodecString::ParseHevcConfig(wrongVersion.data(), wrongVersion.size()); }),
            "hvcC: configurationVersion 2 is not known (expected 1)");
  EXPECT_EQ(Error([] { CodecString::ParseAacConfig(nullptr, 0); }),
            "AudioSpecificConfig: truncated: audioObjectType needs 5 bits at bit 0, 0 remain");
}

}  // namespace
