// Tarvek::Conf::IFormatCodecSubtitle: the description of a subtitle codec configuration, and its
// keys. Created by FormatCodecSubtitle::Create().
#ifndef TARVEK_CONF_INTERFACES_IFORMATCODECSUBTITLE_H_
#define TARVEK_CONF_INTERFACES_IFORMATCODECSUBTITLE_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include "IFormatCodec.h"

namespace Tarvek {
namespace Conf {

/// A subtitle codec description: language, title, author, the codec's header text and the DVB
/// display size on top of the shared codec settings. Accessors behave as IFormatCodec describes.
class TARVEK_VISIBLE_TYPE IFormatCodecSubtitle : public virtual IFormatCodec {
 public:
  ~IFormatCodecSubtitle() override {}

  TARVEK_CONF_INTERFACES_API static const std::string TAG_SUBTITLE_AUTHOR;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_SUBTITLE_HEADER;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_DVB_WIDTH;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_DVB_HEIGHT;
  /// The object name of every subtitle description (not a child key).
  TARVEK_CONF_INTERFACES_API static const std::string TAG_FORMAT_CODEC_SUBTITLE;

  /// @name Language (IFormatCodec::TAG_LANGUAGE, at the root of the tree).
  virtual std::string GetLanguage() const = 0;
  virtual bool ExistsLanguage() const = 0;
  virtual void SetLanguage(const std::string& language) = 0;

  /// @name Title (IFormatFile::TAG_TITLE).
  virtual std::string GetTitle() const = 0;
  virtual bool ExistsTitle() const = 0;
  virtual void SetTitle(const std::string& title) = 0;

  /// @name Author (TAG_SUBTITLE_AUTHOR).
  virtual std::string GetAuthor() const = 0;
  virtual bool ExistsAuthor() const = 0;
  virtual void SetAuthor(const std::string& author) = 0;

  /// @name The codec's header text (TAG_SUBTITLE_HEADER), such as a styled format's style block.
  virtual std::string GetSubtitleHeader() const = 0;
  virtual bool ExistsSubtitleHeader() const = 0;
  virtual void SetSubtitleHeader(const std::string& header) = 0;

  /// @name DVB display size in pixels (TAG_DVB_WIDTH, TAG_DVB_HEIGHT), stored zero-extended.
  virtual unsigned int GetDVBWidth() const = 0;
  virtual bool ExistsDVBWidth() const = 0;
  virtual void SetDVBWidth(unsigned int width) = 0;
  virtual unsigned int GetDVBHeight() const = 0;
  virtual bool ExistsDVBHeight() const = 0;
  virtual void SetDVBHeight(unsigned int height) = 0;

  /// Returns an independent copy holding the only reference; the private data is not copied.
  virtual boost::intrusive_ptr<IFormatCodecSubtitle> Clone() = 0;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_INTERFACES_IFORMATCODECSUBTITLE_H_
