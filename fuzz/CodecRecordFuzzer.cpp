// libFuzzer target over the codec configuration record readers: the first byte chooses the codec,
// the rest is the private data; every input gives a codec string or a CodecStringError.
#include <Tarvek/CodecString/CodecString.h>
#include <Tarvek/Conf/Formats/FormatCodecAudio.h>
#include <Tarvek/Conf/Formats/FormatCodecVideo.h>

#include <cstddef>
#include <cstdint>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace Tarvek;
  if (size == 0) return 0;
  static const char* const kCodecs[] = {"h264", "hevc", "vp9", "av1", "aac", "mpeg4"};
  const char* codec = kCodecs[data[0] % (sizeof kCodecs / sizeof kCodecs[0])];
  // An exact copy of the record, so the sanitizer sees any read past its end.
  const std::vector<std::uint8_t> record(data + 1, data + size);
  boost::intrusive_ptr<Conf::IFormatCodec> description;
  if (std::string(codec) == "aac") {
    description = Conf::FormatCodecAudio::Create();
  } else {
    auto video = Conf::FormatCodecVideo::Create();
    video->InitByPixelAspect(1920, 1080, 1, 1);
    video->SetPixelFormat(AV_PIX_FMT_YUV420P);
    description = video;
  }
  description->SetCodecID(codec);
  description->SetPrivateData(CreateBlob(record.data(), record.size()));
  try {
    CodecString::GetCodecString(description);
  } catch (const CodecString::CodecStringError&) {
  }
  return 0;
}
