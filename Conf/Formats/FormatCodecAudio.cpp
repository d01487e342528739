#include "FormatCodecAudio.h"

#include "../Interfaces/Keys.h"

namespace Tarvek {
namespace Conf {
namespace {

// The low 32 bits of a stored value, as the signed accessors return them.
int LowBitsAsInt(long long value) { return static_cast<int>(value); }

}  // namespace

boost::intrusive_ptr<IFormatCodecAudio> FormatCodecAudio::Create() {
  return boost::intrusive_ptr<IFormatCodecAudio>(new FormatCodecAudio());
}

FormatCodecAudio::FormatCodecAudio()
    : FormatBase(TAG_FORMAT_CODEC_AUDIO), FormatCodec(TAG_FORMAT_CODEC_AUDIO) {}

FormatCodecAudio::FormatCodecAudio(const FormatCodecAudio& source)
    : IRefCountable(),
      IFormat(),
      IFormatCodec(),
      IFormatCodecAudio(),
      FormatBase(TreesOf{source}),
      FormatCodec(TreesOf{source}) {}

FormatCodecAudio::~FormatCodecAudio() = default;

int FormatCodecAudio::GetCodecType() const { return 1; }

bool FormatCodecAudio::IsCompatible(boost::intrusive_ptr<const IFormat> other) const {
  // `other` holds a reference for the whole call, released on every way out.
  const auto* audio = AsKind<IFormatCodecAudio, FormatCodecAudio>(other.get());
  if (audio == nullptr) return false;
  return GetSampleRate() == audio->GetSampleRate() &&
         GetChannelLayout() == audio->GetChannelLayout() &&
         GetSampleFormat() == audio->GetSampleFormat();
}

std::string FormatCodecAudio::GetLanguage() const {
  // Asks ExistsLanguage through virtual dispatch, so that a subclass overriding it decides.
  if (!ExistsLanguage()) return std::string();
  return property_[Keys::Metadata][Keys::Language].GetString();
}
bool FormatCodecAudio::ExistsLanguage() const {
  const auto metadata = property_.FindChild(Keys::Metadata);
  return metadata != property_.GetChildren().end() && metadata->ChildExists(Keys::Language);
}
void FormatCodecAudio::SetLanguage(const std::string& language) {
  property_[TAG_METADATA].SetChildT<std::string>(TAG_LANGUAGE, language);
}

int FormatCodecAudio::GetSampleRate() const {
  return LowBitsAsInt(property_[Keys::SampleRate].GetInt64());
}
bool FormatCodecAudio::ExistsSampleRate() const { return property_.ChildExists(Keys::SampleRate); }
void FormatCodecAudio::SetSampleRate(int sampleRate) {
  property_.SetChildT<long long>(TAG_SAMPLE_RATE, sampleRate);
}

ChannelLayout FormatCodecAudio::GetChannelLayout() const {
  return static_cast<ChannelLayout>(static_cast<std::uint32_t>(property_[Keys::Layout].GetInt64()));
}
bool FormatCodecAudio::ExistsChannelLayout() const { return property_.ChildExists(Keys::Layout); }
void FormatCodecAudio::SetChannelLayout(ChannelLayout layout) {
  // Zero extension: every mask is stored as the positive number it is.
  property_.SetChildT<long long>(TAG_LAYOUT, static_cast<std::uint32_t>(layout));
}

int FormatCodecAudio::GetFrameSize() const {
  return LowBitsAsInt(property_[Keys::FrameSize].GetInt64());
}
bool FormatCodecAudio::ExistsFrameSize() const { return property_.ChildExists(Keys::FrameSize); }
void FormatCodecAudio::SetFrameSize(int frameSize) {
  property_.SetChildT<long long>(TAG_FRAME_SIZE, frameSize);
}

AVSampleFormat FormatCodecAudio::GetSampleFormat() const {
  return static_cast<AVSampleFormat>(LowBitsAsInt(property_[Keys::SampleFormat].GetInt64()));
}
bool FormatCodecAudio::ExistsSampleFormat() const {
  return property_.ChildExists(Keys::SampleFormat);
}
void FormatCodecAudio::SetSampleFormat(AVSampleFormat format) {
  property_.SetChildT<long long>(TAG_SAMPLE_FORMAT, static_cast<long long>(format));
}

boost::intrusive_ptr<IFormatCodecAudio> FormatCodecAudio::Clone() const {
  return boost::intrusive_ptr<IFormatCodecAudio>(new FormatCodecAudio(*this));
}

}  // namespace Conf
}  // namespace Tarvek
