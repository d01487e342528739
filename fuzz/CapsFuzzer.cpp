// libFuzzer target over caps text: FromCapsString refuses a text with a CapsError or gives a
// description whose caps read back as the same codec, width and channel layout.
#include <Tarvek/Conf/Interfaces/IFormatCodecAudio.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecVideo.h>
#include <Tarvek/GStreamer/Caps.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

namespace {

[[noreturn]] void Broken(const char* what) {
  std::fprintf(stderr, "CapsFuzzer: %s\n", what);
  std::abort();
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  gst_init(nullptr, nullptr);
  // GStreamer's registry and caches live until gst_deinit; freed at exit, they are no leak.
  std::atexit(gst_deinit);
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace Tarvek;
  const std::string text(reinterpret_cast<const char*>(data), size);
  if (text.find('\0') != std::string::npos) return 0;  // caps text is a C string
  boost::intrusive_ptr<Conf::IFormatCodec> description;
  try {
    description = GStreamer::FromCapsString(text);
  } catch (const GStreamer::CapsError&) {
    return 0;
  }
  std::string again;
  try {
    again = GStreamer::ToCapsString(description);
  } catch (const GStreamer::CapsError&) {
    return 0;  // read, but not writable (a size beyond GStreamer's range, say)
  }
  const auto back = GStreamer::FromCapsString(again);
  if (back->GetCodecID() != description->GetCodecID()) Broken("the codec changed");
  auto video = boost::dynamic_pointer_cast<Conf::IFormatCodecVideo>(description);
  auto videoBack = boost::dynamic_pointer_cast<Conf::IFormatCodecVideo>(back);
  if (video && video->ExistsWidth() && videoBack->GetWidth() != video->GetWidth())
    Broken("the width changed");
  auto audio = boost::dynamic_pointer_cast<Conf::IFormatCodecAudio>(description);
  auto audioBack = boost::dynamic_pointer_cast<Conf::IFormatCodecAudio>(back);
  if (audio && audio->ExistsChannelLayout() &&
      audioBack->GetChannelLayout() != audio->GetChannelLayout())
    Broken("the channel layout changed");
  return 0;
}
