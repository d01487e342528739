#include "FormatCodecSubtitle.h"

#include "../Interfaces/IFormatFile.h"
#include "../Interfaces/Keys.h"

namespace Tarvek {
namespace Conf {

boost::intrusive_ptr<IFormatCodecSubtitle> FormatCodecSubtitle::Create() {
  return boost::intrusive_ptr<IFormatCodecSubtitle>(new FormatCodecSubtitle());
}

FormatCodecSubtitle::FormatCodecSubtitle()
    : FormatBase(TAG_FORMAT_CODEC_SUBTITLE), FormatCodec(TAG_FORMAT_CODEC_SUBTITLE) {}

FormatCodecSubtitle::FormatCodecSubtitle(const FormatCodecSubtitle& source)
    : IRefCountable(),
      IFormat(),
      IFormatCodec(),
      IFormatCodecSubtitle(),
      FormatBase(TreesOf{source}),
      FormatCodec(TreesOf{source}) {}

FormatCodecSubtitle::~FormatCodecSubtitle() = default;

int FormatCodecSubtitle::GetCodecType() const { return 3; }

std::string FormatCodecSubtitle::GetLanguage() const {
  return property_[Keys::Language].GetString();
}
bool FormatCodecSubtitle::ExistsLanguage() const { return property_.ChildExists(Keys::Language); }
void FormatCodecSubtitle::SetLanguage(const std::string& language) {
  property_.SetChildT<std::string>(TAG_LANGUAGE, language);
}

std::string FormatCodecSubtitle::GetTitle() const { return property_[Keys::Title].GetString(); }
bool FormatCodecSubtitle::ExistsTitle() const { return property_.ChildExists(Keys::Title); }
void FormatCodecSubtitle::SetTitle(const std::string& title) {
  property_.SetChildT<std::string>(IFormatFile::TAG_TITLE, title);
}

std::string FormatCodecSubtitle::GetAuthor() const {
  return property_[Keys::SubtitleAuthor].GetString();
}
bool FormatCodecSubtitle::ExistsAuthor() const {
  return property_.ChildExists(Keys::SubtitleAuthor);
}
void FormatCodecSubtitle::SetAuthor(const std::string& author) {
  property_.SetChildT<std::string>(TAG_SUBTITLE_AUTHOR, author);
}

std::string FormatCodecSubtitle::GetSubtitleHeader() const {
  return property_[Keys::SubtitleHeader].GetString();
}
bool FormatCodecSubtitle::ExistsSubtitleHeader() const {
  return property_.ChildExists(Keys::SubtitleHeader);
}
void FormatCodecSubtitle::SetSubtitleHeader(const std::string& header) {
  property_.SetChildT<std::string>(TAG_SUBTITLE_HEADER, header);
}

unsigned int FormatCodecSubtitle::GetDVBWidth() const {
  return static_cast<unsigned int>(property_[Keys::DvbWidth].GetInt64());
}
bool FormatCodecSubtitle::ExistsDVBWidth() const { return property_.ChildExists(Keys::DvbWidth); }
void FormatCodecSubtitle::SetDVBWidth(unsigned int width) {
  property_.SetChildT<long long>(TAG_DVB_WIDTH, width);
}

unsigned int FormatCodecSubtitle::GetDVBHeight() const {
  return static_cast<unsigned int>(property_[Keys::DvbHeight].GetInt64());
}
bool FormatCodecSubtitle::ExistsDVBHeight() const { return property_.ChildExists(Keys::DvbHeight); }
void FormatCodecSubtitle::SetDVBHeight(unsigned int height) {
  property_.SetChildT<long long>(TAG_DVB_HEIGHT, height);
}

boost::intrusive_ptr<IFormatCodecSubtitle> FormatCodecSubtitle::Clone() {
  return boost::intrusive_ptr<IFormatCodecSubtitle>(new FormatCodecSubtitle(*this));
}

}  // namespace Conf
}  // namespace Tarvek
