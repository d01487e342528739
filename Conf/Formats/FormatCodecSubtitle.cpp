#include "FormatCodecSubtitle.h"

#include "../Interfaces/IFormatFile.h"

namespace Tarvek {
namespace Conf {
namespace {

// The keys this description reads, hashed once when the library is loaded. The key texts
// come from the configuration interface library, which is loaded and initialised first.
const Core::PropertyKey kLanguageKey(IFormatCodecSubtitle::TAG_LANGUAGE);
const Core::PropertyKey kTitleKey(IFormatFile::TAG_TITLE);
const Core::PropertyKey kSubtitleAuthorKey(IFormatCodecSubtitle::TAG_SUBTITLE_AUTHOR);
const Core::PropertyKey kSubtitleHeaderKey(IFormatCodecSubtitle::TAG_SUBTITLE_HEADER);
const Core::PropertyKey kDvbWidthKey(IFormatCodecSubtitle::TAG_DVB_WIDTH);
const Core::PropertyKey kDvbHeightKey(IFormatCodecSubtitle::TAG_DVB_HEIGHT);

}  // namespace

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

std::string FormatCodecSubtitle::GetLanguage() const { return property_[kLanguageKey].GetString(); }
bool FormatCodecSubtitle::ExistsLanguage() const { return property_.ChildExists(kLanguageKey); }
void FormatCodecSubtitle::SetLanguage(const std::string& language) {
  property_.SetChildT<std::string>(TAG_LANGUAGE, language);
}

std::string FormatCodecSubtitle::GetTitle() const { return property_[kTitleKey].GetString(); }
bool FormatCodecSubtitle::ExistsTitle() const { return property_.ChildExists(kTitleKey); }
void FormatCodecSubtitle::SetTitle(const std::string& title) {
  property_.SetChildT<std::string>(IFormatFile::TAG_TITLE, title);
}

std::string FormatCodecSubtitle::GetAuthor() const {
  return property_[kSubtitleAuthorKey].GetString();
}
bool FormatCodecSubtitle::ExistsAuthor() const { return property_.ChildExists(kSubtitleAuthorKey); }
void FormatCodecSubtitle::SetAuthor(const std::string& author) {
  property_.SetChildT<std::string>(TAG_SUBTITLE_AUTHOR, author);
}

std::string FormatCodecSubtitle::GetSubtitleHeader() const {
  return property_[kSubtitleHeaderKey].GetString();
}
bool FormatCodecSubtitle::ExistsSubtitleHeader() const {
  return property_.ChildExists(kSubtitleHeaderKey);
}
void FormatCodecSubtitle::SetSubtitleHeader(const std::string& header) {
  property_.SetChildT<std::string>(TAG_SUBTITLE_HEADER, header);
}

unsigned int FormatCodecSubtitle::GetDVBWidth() const {
  return static_cast<unsigned int>(property_[kDvbWidthKey].GetInt64());
}
bool FormatCodecSubtitle::ExistsDVBWidth() const { return property_.ChildExists(kDvbWidthKey); }
void FormatCodecSubtitle::SetDVBWidth(unsigned int width) {
  property_.SetChildT<long long>(TAG_DVB_WIDTH, width);
}

unsigned int FormatCodecSubtitle::GetDVBHeight() const {
  return static_cast<unsigned int>(property_[kDvbHeightKey].GetInt64());
}
bool FormatCodecSubtitle::ExistsDVBHeight() const { return property_.ChildExists(kDvbHeightKey); }
void FormatCodecSubtitle::SetDVBHeight(unsigned int height) {
  property_.SetChildT<long long>(TAG_DVB_HEIGHT, height);
}

boost::intrusive_ptr<IFormatCodecSubtitle> FormatCodecSubtitle::Clone() {
  return boost::intrusive_ptr<IFormatCodecSubtitle>(new FormatCodecSubtitle(*this));
}

}  // namespace Conf
}  // namespace Tarvek
