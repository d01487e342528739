// Tarvek::Conf::FormatCodecAudio: the audio codec description. Create one with
// FormatCodecAudio::Create(); its keys are those of IFormatCodecAudio.
#ifndef TARVEK_CONF_FORMATS_FORMATCODECAUDIO_H_
#define TARVEK_CONF_FORMATS_FORMATCODECAUDIO_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include "../Interfaces/IFormatCodecAudio.h"
#include "FormatCodec.h"

namespace Tarvek {
namespace Conf {

/// An audio codec description, named TAG_FORMAT_CODEC_AUDIO. Sample rate, channel layout, frame
/// size and sample format are children of the property tree's root; the language is a child of
/// the metadata child, so it travels with the metadata.
class TARVEK_FORMATS_API FormatCodecAudio : public virtual IFormatCodecAudio,
                                            public virtual FormatCodec {
 public:
  /// Returns a new audio description holding the only reference. Throws std::bad_alloc.
  static boost::intrusive_ptr<IFormatCodecAudio> Create();

  FormatCodecAudio();
  /// A copy of `source`'s property tree (metadata and language included) and runtime entries,
  /// without its private data, with a reference count of its own starting at 0.
  FormatCodecAudio(const FormatCodecAudio& source);
  FormatCodecAudio& operator=(const FormatCodecAudio&) = delete;
  ~FormatCodecAudio() override;

  /// 1: audio.
  int GetCodecType() const override;
  /// True when `other` is an audio description with the same sample rate, channel layout and
  /// sample format (read in that order, this description's value first); false for null or
  /// another kind. Throws Core::ChildNotFound when one of these is missing on either side.
  bool IsCompatible(boost::intrusive_ptr<const IFormat> other) const override;

  /// The language, or the empty string when the metadata holds none; never throws for absence.
  std::string GetLanguage() const override;
  bool ExistsLanguage() const override;
  /// Writes the language into the metadata child. Throws Core::MethodIsNotApplicable when the
  /// metadata child was replaced by a leaf.
  void SetLanguage(const std::string& language) override;

  int GetSampleRate() const override;
  bool ExistsSampleRate() const override;
  void SetSampleRate(int sampleRate) override;

  ChannelLayout GetChannelLayout() const override;
  bool ExistsChannelLayout() const override;
  void SetChannelLayout(ChannelLayout layout) override;

  int GetFrameSize() const override;
  bool ExistsFrameSize() const override;
  void SetFrameSize(int frameSize) override;

  AVSampleFormat GetSampleFormat() const override;
  bool ExistsSampleFormat() const override;
  void SetSampleFormat(AVSampleFormat format) override;

  boost::intrusive_ptr<IFormatCodecAudio> Clone() const override;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_FORMATCODECAUDIO_H_
