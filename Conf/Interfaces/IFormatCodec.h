// Tarvek::Conf::IFormatCodec: the settings shared by every codec description, and their keys.
// Implemented by FormatCodec (generic; FormatCodec::Create()) and by the video, audio and
// subtitle descriptions.
#ifndef TARVEK_CONF_INTERFACES_IFORMATCODEC_H_
#define TARVEK_CONF_INTERFACES_IFORMATCODEC_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include "../../Core/Interfaces/IBlob.h"
#include "IFormat.h"

namespace Tarvek {
namespace Conf {

/// A codec description. Each setting has three accessors over one child of the property tree:
/// Exists<Setting>() tests for the child; Get<Setting>() reads it with no test of its own, so a
/// missing setting throws Core::ChildNotFound and a child of another type (possible after
/// SetProperty) throws Core::WrongPropertyType; Set<Setting>() overwrites the child in place or
/// appends it, validates nothing, and throws Core::MethodIsNotApplicable only when the tree's
/// root is not a container. Integers are stored as 64-bit children; 32-bit getters return the low
/// 32 bits.
class TARVEK_VISIBLE_TYPE IFormatCodec : public virtual IFormat {
 public:
  ~IFormatCodec() override {}

  TARVEK_CONF_INTERFACES_API static const std::string TAG_NAME;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_CODEC_ID;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_FOURCC;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_BITRATE_MODE;
  /// The bitrate mode value that means variable bitrate driven by Quality (not a key).
  TARVEK_CONF_INTERFACES_API static const std::string TAG_BITRATE_MODE_VBR;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_BITRATE;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_QUALITY;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_LOSSLESS;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_THREAD_NUMBER;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_TWO_PASS_ENCODING;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_GLOBAL_HEADER;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_MAIN_STREAM;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_CODEC_OPTIONS_ENCODE;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_CODEC_OPTIONS_ANALYZE;
  /// Language key: inside the metadata child for audio, at the root for subtitles.
  TARVEK_CONF_INTERFACES_API static const std::string TAG_LANGUAGE;

  /// The media kind: -1 generic, 0 video, 1 audio, 3 subtitle (libavutil's AVMediaType numbers).
  virtual int GetCodecType() const = 0;

  /// @name Codec name (TAG_NAME, string); "Unknown codec" on a new description.
  virtual std::string GetCodecName() const = 0;
  virtual bool ExistsCodecName() const = 0;
  virtual void SetCodecName(const std::string& name) = 0;

  /// @name Codec identifier (TAG_CODEC_ID, string), e.g. "h264"; the bitrate look-ups key on it.
  virtual std::string GetCodecID() const = 0;
  virtual bool ExistsCodecID() const = 0;
  virtual void SetCodecID(const std::string& id) = 0;

  /// @name Codec tag (TAG_FOURCC, 64-bit): the four-character code as an integer.
  virtual long long GetCodecTag() const = 0;
  virtual bool ExistsCodecTag() const = 0;
  virtual void SetCodecTag(long long tag) = 0;

  /// @name Bitrate mode (TAG_BITRATE_MODE, string): free text; only TAG_BITRATE_MODE_VBR has a
  /// meaning to the library.
  virtual std::string GetBitrateMode() const = 0;
  virtual bool ExistsBitrateMode() const = 0;
  virtual void SetBitrateMode(const std::string& mode) = 0;

  /// @name Bitrate (TAG_BITRATE, 64-bit), bits per second.
  virtual long long GetBitrate() const = 0;
  virtual bool ExistsBitrate() const = 0;
  virtual void SetBitrate(long long bitrate) = 0;

  /// @name Quality (TAG_QUALITY, 64-bit): the encoder's quality figure in VBR mode.
  virtual long long GetQuality() const = 0;
  virtual bool ExistsQuality() const = 0;
  virtual void SetQuality(long long quality) = 0;

  /// @name Lossless flag (TAG_LOSSLESS, bool).
  virtual bool GetLossless() const = 0;
  virtual bool ExistsLossless() const = 0;
  virtual void SetLossless(bool lossless) = 0;

  /// @name Encoder thread count (TAG_THREAD_NUMBER, stored zero-extended to 64 bits).
  virtual unsigned int GetThreadNumber() const = 0;
  virtual bool ExistsThreadNumber() const = 0;
  virtual void SetThreadNumber(unsigned int threads) = 0;

  /// @name Two-pass encoding flag (TAG_TWO_PASS_ENCODING, bool).
  virtual bool GetTwoPassEncoding() const = 0;
  virtual bool ExistsTwoPassEncoding() const = 0;
  virtual void SetTwoPassEncoding(bool twoPass) = 0;

  /// @name Global header flag (TAG_GLOBAL_HEADER, bool).
  virtual bool GetGlobalHeader() const = 0;
  virtual bool ExistsGlobalHeader() const = 0;
  virtual void SetGlobalHeader(bool globalHeader) = 0;

  /// @name Main stream flag (TAG_MAIN_STREAM, bool).
  virtual bool GetMainStream() const = 0;
  virtual bool ExistsMainStream() const = 0;
  virtual void SetMainStream(bool mainStream) = 0;

  /// @name Option sub-trees (TAG_CODEC_OPTIONS_ENCODE, TAG_CODEC_OPTIONS_ANALYZE): free-form
  /// settings for the encoder and the analyser, empty on a new description. Set replaces the
  /// sub-tree's content with a copy of `options` (recreating the child if SetProperty removed
  /// it); Get returns a reference into the tree and throws Core::ChildNotFound when it is gone.
  virtual bool ExistsOptionsEncode() const = 0;
  virtual bool ExistsOptionsAnalyze() const = 0;
  virtual void SetOptionsEncode(const Core::Property& options) = 0;
  virtual const Core::Property& GetOptionsEncode() const = 0;
  virtual void SetOptionsAnalyze(const Core::Property& options) = 0;
  virtual const Core::Property& GetOptionsAnalyze() const = 0;

  /// @name Private data: an opaque codec data block kept outside the property tree, so Clone,
  /// Compare, SetProperty and PrintContent ignore it. Get returns a new reference to the held
  /// blob, or null; Set takes a reference to `data` (null drops the blob) and releases the old.
  virtual boost::intrusive_ptr<IBlob> GetPrivateData() = 0;
  virtual void SetPrivateData(boost::intrusive_ptr<IBlob> data) = 0;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_INTERFACES_IFORMATCODEC_H_
