// Tarvek::Conf::FormatCodecSubtitle: the subtitle codec description. Create one with
// FormatCodecSubtitle::Create(); its keys are those of IFormatCodecSubtitle.
#ifndef TARVEK_CONF_FORMATS_FORMATCODECSUBTITLE_H_
#define TARVEK_CONF_FORMATS_FORMATCODECSUBTITLE_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include "../Interfaces/IFormatCodecSubtitle.h"
#include "FormatCodec.h"

namespace Tarvek {
namespace Conf {

/// A subtitle codec description, named TAG_FORMAT_CODEC_SUBTITLE. All six settings, the language
/// included, are children of the property tree's root. It is compatible with any description.
class TARVEK_FORMATS_API FormatCodecSubtitle : public virtual IFormatCodecSubtitle,
                                               public virtual FormatCodec {
 public:
  /// Returns a new subtitle description holding the only reference. Throws std::bad_alloc.
  static boost::intrusive_ptr<IFormatCodecSubtitle> Create();

  FormatCodecSubtitle();
  /// A copy of `source`'s property tree and runtime entries, without its private data, with a
  /// reference count of its own starting at 0.
  FormatCodecSubtitle(const FormatCodecSubtitle& source);
  FormatCodecSubtitle& operator=(const FormatCodecSubtitle&) = delete;
  ~FormatCodecSubtitle() override;

  /// 3: subtitle.
  int GetCodecType() const override;

  std::string GetLanguage() const override;
  bool ExistsLanguage() const override;
  void SetLanguage(const std::string& language) override;

  std::string GetTitle() const override;
  bool ExistsTitle() const override;
  void SetTitle(const std::string& title) override;

  std::string GetAuthor() const override;
  bool ExistsAuthor() const override;
  void SetAuthor(const std::string& author) override;

  std::string GetSubtitleHeader() const override;
  bool ExistsSubtitleHeader() const override;
  void SetSubtitleHeader(const std::string& header) override;

  unsigned int GetDVBWidth() const override;
  bool ExistsDVBWidth() const override;
  void SetDVBWidth(unsigned int width) override;

  unsigned int GetDVBHeight() const override;
  bool ExistsDVBHeight() const override;
  void SetDVBHeight(unsigned int height) override;

  boost::intrusive_ptr<IFormatCodecSubtitle> Clone() override;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_FORMATCODECSUBTITLE_H_
