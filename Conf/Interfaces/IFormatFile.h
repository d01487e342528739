// Tarvek::Conf::IFormatFile: the description of a media file (a container of streams). Only its
// key TAG_TITLE is used by the codec descriptions, for the subtitle title.
#ifndef TARVEK_CONF_INTERFACES_IFORMATFILE_H_
#define TARVEK_CONF_INTERFACES_IFORMATFILE_H_

#include <string>

#include "IFormat.h"

namespace Tarvek {
namespace Conf {

/// A media file description. No implementation ships with the format description library.
class TARVEK_VISIBLE_TYPE IFormatFile : public virtual IFormat {
 public:
  ~IFormatFile() override {}

  /// Key of a title: of the file, and of a subtitle stream.
  TARVEK_CONF_INTERFACES_API static const std::string TAG_TITLE;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_INTERFACES_IFORMATFILE_H_
