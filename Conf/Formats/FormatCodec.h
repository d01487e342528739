// Tarvek::Conf::FormatCodec: the generic codec description, and the implementation of the
// settings that every codec description shares. Create one with FormatCodec::Create().
#ifndef TARVEK_CONF_FORMATS_FORMATCODEC_H_
#define TARVEK_CONF_FORMATS_FORMATCODEC_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include "../../Core/Interfaces/IBlob.h"
#include "../Interfaces/IFormatCodec.h"
#include "FormatBase.h"

namespace Tarvek {
namespace Conf {

/// A codec description of no particular media kind, and the base of the video, audio and
/// subtitle descriptions. A new one holds the codec name "Unknown codec" and two empty option
/// sub-trees. Every accessor goes to the property tree; only the private data is kept aside.
class TARVEK_FORMATS_API FormatCodec : public virtual IFormatCodec, public virtual FormatBase {
 public:
  /// Returns a new generic description, with the empty object name, holding the only reference.
  /// Throws std::bad_alloc when memory runs out.
  static boost::intrusive_ptr<IFormatCodec> Create();

  /// `name` is the object name when FormatCodec is the complete object; a derived description
  /// names the FormatBase part itself and this argument is unused.
  explicit FormatCodec(const std::string& name);
  ~FormatCodec() override;

  /// -1: no particular media kind.
  int GetCodecType() const override;

  std::string GetCodecName() const override;
  bool ExistsCodecName() const override;
  void SetCodecName(const std::string& name) override;

  std::string GetCodecID() const override;
  bool ExistsCodecID() const override;
  void SetCodecID(const std::string& id) override;

  long long GetCodecTag() const override;
  bool ExistsCodecTag() const override;
  void SetCodecTag(long long tag) override;

  std::string GetBitrateMode() const override;
  bool ExistsBitrateMode() const override;
  void SetBitrateMode(const std::string& mode) override;

  long long GetBitrate() const override;
  bool ExistsBitrate() const override;
  void SetBitrate(long long bitrate) override;

  long long GetQuality() const override;
  bool ExistsQuality() const override;
  void SetQuality(long long quality) override;

  bool GetLossless() const override;
  bool ExistsLossless() const override;
  void SetLossless(bool lossless) override;

  unsigned int GetThreadNumber() const override;
  bool ExistsThreadNumber() const override;
  void SetThreadNumber(unsigned int threads) override;

  bool GetTwoPassEncoding() const override;
  bool ExistsTwoPassEncoding() const override;
  void SetTwoPassEncoding(bool twoPass) override;

  bool GetGlobalHeader() const override;
  bool ExistsGlobalHeader() const override;
  void SetGlobalHeader(bool globalHeader) override;

  bool GetMainStream() const override;
  bool ExistsMainStream() const override;
  void SetMainStream(bool mainStream) override;

  bool ExistsOptionsEncode() const override;
  bool ExistsOptionsAnalyze() const override;
  void SetOptionsEncode(const Core::Property& options) override;
  const Core::Property& GetOptionsEncode() const override;
  void SetOptionsAnalyze(const Core::Property& options) override;
  const Core::Property& GetOptionsAnalyze() const override;

  boost::intrusive_ptr<IBlob> GetPrivateData() override;
  void SetPrivateData(boost::intrusive_ptr<IBlob> data) override;

 protected:
  /// The codec part of a copy: the copied tree already holds everything, so it lays nothing
  /// down; the private data is not copied.
  explicit FormatCodec(TreesOf trees);

 private:
  boost::intrusive_ptr<IBlob> private_data_;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_FORMATCODEC_H_
