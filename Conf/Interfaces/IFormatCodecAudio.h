// Tarvek::Conf::IFormatCodecAudio: the description of an audio codec configuration, and its
// keys. Created by FormatCodecAudio::Create().
#ifndef TARVEK_CONF_INTERFACES_IFORMATCODECAUDIO_H_
#define TARVEK_CONF_INTERFACES_IFORMATCODECAUDIO_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include "AVUtilTypes.h"
#include "ChannelLayout.h"
#include "IFormatCodec.h"

namespace Tarvek {
namespace Conf {

/// An audio codec description: language, sample rate, channel layout, frame size and sample
/// format on top of the shared codec settings. Accessors behave as IFormatCodec describes, except
/// that the language lives in the metadata child and reads as empty when absent.
class TARVEK_VISIBLE_TYPE IFormatCodecAudio : public virtual IFormatCodec {
 public:
  ~IFormatCodecAudio() override {}

  TARVEK_CONF_INTERFACES_API static const std::string TAG_SAMPLE_RATE;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_LAYOUT;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_FRAME_SIZE;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_SAMPLE_FORMAT;
  /// The object name of every audio description (not a child key).
  TARVEK_CONF_INTERFACES_API static const std::string TAG_FORMAT_CODEC_AUDIO;

  /// @name Language (IFormatCodec::TAG_LANGUAGE inside the metadata child), e.g. "eng".
  virtual std::string GetLanguage() const = 0;
  virtual bool ExistsLanguage() const = 0;
  virtual void SetLanguage(const std::string& language) = 0;

  /// @name Sample rate in Hz (TAG_SAMPLE_RATE), stored sign-extended.
  virtual int GetSampleRate() const = 0;
  virtual bool ExistsSampleRate() const = 0;
  virtual void SetSampleRate(int sampleRate) = 0;

  /// @name Channel layout (TAG_LAYOUT): a speaker mask, stored zero-extended.
  virtual ChannelLayout GetChannelLayout() const = 0;
  virtual bool ExistsChannelLayout() const = 0;
  virtual void SetChannelLayout(ChannelLayout layout) = 0;

  /// @name Samples per channel in one frame (TAG_FRAME_SIZE), stored sign-extended.
  virtual int GetFrameSize() const = 0;
  virtual bool ExistsFrameSize() const = 0;
  virtual void SetFrameSize(int frameSize) = 0;

  /// @name Sample format (TAG_SAMPLE_FORMAT), libavutil's AVSampleFormat, stored sign-extended.
  virtual AVSampleFormat GetSampleFormat() const = 0;
  virtual bool ExistsSampleFormat() const = 0;
  virtual void SetSampleFormat(AVSampleFormat format) = 0;

  /// Returns an independent copy holding the only reference; the private data is not copied.
  virtual boost::intrusive_ptr<IFormatCodecAudio> Clone() const = 0;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_INTERFACES_IFORMATCODECAUDIO_H_
