#include "BitrateCalculator.h"

#include <Tarvek/Presets/BitratePresets.h>
#include "../Interfaces/IFormatCodecAudio.h"
#include "../Interfaces/IFormatCodecVideo.h"

namespace Tarvek {
namespace Conf {
namespace {
constexpr const char kThisFile[] = "Conf/Formats/BitrateCalculator.cpp";
}  // namespace

boost::int64_t GetDefaultVideoBitrate(const boost::intrusive_ptr<const IFormatCodec>& codec) {
  const auto* cast = dynamic_cast<const IFormatCodecVideo*>(codec.get());
  if (cast == nullptr) {
    ThrowWithLocation(__LINE__, kThisFile,
                      "boost::int64_t Tarvek::Conf::GetDefaultVideoBitrate(const "
                      "boost::intrusive_ptr<const IFormatCodec> &)",
                      AddStack(ConfException()
                               << DescriptionInfo("Incompatible type of IFormatCodec structure")));
  }
  const boost::intrusive_ptr<const IFormatCodecVideo> video(cast);
  // Held for the whole call: the pointer gives the reference back on every way out, also when
  // an accessor or the presets look-up throws. The quality counts only in VBR mode, an exact and
  // case-sensitive match of the mode; in any other mode it is not read, so it may be absent.
  // The values are handed on unchanged; width and height are zero-extended.
  const bool vbr = video->GetBitrateMode() == IFormatCodec::TAG_BITRATE_MODE_VBR;
  const int quality = vbr ? static_cast<int>(video->GetQuality()) : -1;
  const std::string codecId = video->GetCodecID();
  const long long width = video->GetWidth();
  const long long height = video->GetHeight();
  const double frameRate = video->GetFrameRate();
  return GetDefaultVideoBitrate(codecId, width, height, frameRate, quality);
}

// The minimum and maximum read the same settings as the default, in the same order, so the
// three agree on which missing setting they report; only the look-up they call differs. A
// quality outside the int range reaches the look-up as its low 32 bits.
boost::int64_t GetMinVideoBitrate(const boost::intrusive_ptr<const IFormatCodec>& codec) {
  const auto* cast = dynamic_cast<const IFormatCodecVideo*>(codec.get());
  if (cast == nullptr) {
    ThrowWithLocation(__LINE__, kThisFile,
                      "boost::int64_t Tarvek::Conf::GetMinVideoBitrate(const "
                      "boost::intrusive_ptr<const IFormatCodec> &)",
                      AddStack(ConfException()
                               << DescriptionInfo("Incompatible type of IFormatCodec structure")));
  }
  const boost::intrusive_ptr<const IFormatCodecVideo> video(cast);
  // As in GetDefaultVideoBitrate: the reference is held for the call and the quality is read
  // only in VBR mode. A frame-rate denominator of 0 reaches the look-up as a frame rate of 0.0,
  // which the presets library reads as an unknown rate.
  // Nothing is written to the description.
  const bool vbr = video->GetBitrateMode() == IFormatCodec::TAG_BITRATE_MODE_VBR;
  const int quality = vbr ? static_cast<int>(video->GetQuality()) : -1;
  const std::string codecId = video->GetCodecID();
  const long long width = video->GetWidth();
  const long long height = video->GetHeight();
  const double frameRate = video->GetFrameRate();
  return GetMinVideoBitrate(codecId, width, height, frameRate, quality);
}

// The presets library keeps minimum <= default <= maximum for the same arguments, so the three
// functions never cross.
boost::int64_t GetMaxVideoBitrate(const boost::intrusive_ptr<const IFormatCodec>& codec) {
  const auto* cast = dynamic_cast<const IFormatCodecVideo*>(codec.get());
  if (cast == nullptr) {
    ThrowWithLocation(__LINE__, kThisFile,
                      "boost::int64_t Tarvek::Conf::GetMaxVideoBitrate(const "
                      "boost::intrusive_ptr<const IFormatCodec> &)",
                      AddStack(ConfException()
                               << DescriptionInfo("Incompatible type of IFormatCodec structure")));
  }
  const boost::intrusive_ptr<const IFormatCodecVideo> video(cast);
  // As in GetDefaultVideoBitrate: the reference is held for the call and the quality is read
  // only in VBR mode. The description's own bitrate, pixel aspect and pixel format take no part:
  // the figure depends on codec, size, frame rate and quality alone.
  // Nothing is written to the description.
  const bool vbr = video->GetBitrateMode() == IFormatCodec::TAG_BITRATE_MODE_VBR;
  const int quality = vbr ? static_cast<int>(video->GetQuality()) : -1;
  const std::string codecId = video->GetCodecID();
  const long long width = video->GetWidth();
  const long long height = video->GetHeight();
  const double frameRate = video->GetFrameRate();
  return GetMaxVideoBitrate(codecId, width, height, frameRate, quality);
}

// The audio functions read neither the bitrate mode nor the quality: an audio figure depends on
// the codec, the sample rate, the channel layout (its speaker count) and the sample format. The
// sample rate is sign-extended, so a negative rate reaches the look-up as negative and is
// refused there with a clear error.
boost::int64_t GetDefaultAudioBitrate(const boost::intrusive_ptr<const IFormatCodec>& codec) {
  const auto* cast = dynamic_cast<const IFormatCodecAudio*>(codec.get());
  if (cast == nullptr) {
    ThrowWithLocation(__LINE__, kThisFile,
                      "boost::int64_t Tarvek::Conf::GetDefaultAudioBitrate(const "
                      "boost::intrusive_ptr<const IFormatCodec> &)",
                      AddStack(ConfException()
                               << DescriptionInfo("Incompatible type of IFormatCodec structure")));
  }
  const boost::intrusive_ptr<const IFormatCodecAudio> audio(cast);
  // Held for the whole call, and given back on every way out.
  return GetDefaultAudioBitrate(audio->GetCodecID(), audio->GetSampleRate(),
                                audio->GetChannelLayout(), audio->GetSampleFormat());
}

// Same reads as GetDefaultAudioBitrate, handed to the minimum look-up.
boost::int64_t GetMinAudioBitrate(const boost::intrusive_ptr<const IFormatCodec>& codec) {
  const auto* cast = dynamic_cast<const IFormatCodecAudio*>(codec.get());
  if (cast == nullptr) {
    ThrowWithLocation(__LINE__, kThisFile,
                      "boost::int64_t Tarvek::Conf::GetMinAudioBitrate(const "
                      "boost::intrusive_ptr<const IFormatCodec> &)",
                      AddStack(ConfException()
                               << DescriptionInfo("Incompatible type of IFormatCodec structure")));
  }
  const boost::intrusive_ptr<const IFormatCodecAudio> audio(cast);
  return GetMinAudioBitrate(audio->GetCodecID(), audio->GetSampleRate(), audio->GetChannelLayout(),
                            audio->GetSampleFormat());
}

// Same reads as GetDefaultAudioBitrate, handed to the maximum look-up.
boost::int64_t GetMaxAudioBitrate(const boost::intrusive_ptr<const IFormatCodec>& codec) {
  const auto* cast = dynamic_cast<const IFormatCodecAudio*>(codec.get());
  if (cast == nullptr) {
    ThrowWithLocation(__LINE__, kThisFile,
                      "boost::int64_t Tarvek::Conf::GetMaxAudioBitrate(const "
                      "boost::intrusive_ptr<const IFormatCodec> &)",
                      AddStack(ConfException()
                               << DescriptionInfo("Incompatible type of IFormatCodec structure")));
  }
  const boost::intrusive_ptr<const IFormatCodecAudio> audio(cast);
  return GetMaxAudioBitrate(audio->GetCodecID(), audio->GetSampleRate(), audio->GetChannelLayout(),
                            audio->GetSampleFormat());
}

}  // namespace Conf
}  // namespace Tarvek
