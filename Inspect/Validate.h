// Validation of a format description: Tarvek::Conf::Validate reports, in sentences, what would
// make a description fail later (in a getter, a bitrate function or an encoder). Part of the
// inspection library (Tarvek::Inspect).
//
//   for (const auto& finding : Tarvek::Conf::Validate(video)) {
//     std::cerr << SeverityName(finding.severity) << ": " << finding.message << '\n';
//   }
#ifndef TARVEK_CONF_FORMATS_VALIDATE_H_
#define TARVEK_CONF_FORMATS_VALIDATE_H_

#include <boost/intrusive_ptr.hpp>
#include <string>
#include <vector>

#include "../Conf/Interfaces/IFormat.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {

/// How serious a finding is.
enum class Severity {
  Error,    ///< a getter, the bitrate functions or the compatibility test will fail on it
  Warning,  ///< usable, but probably not meant (a bitrate outside the presets' range)
};

/// "error" or "warning". Never throws.
TARVEK_INSPECT_API const char* SeverityName(Severity severity) noexcept;

/// One thing Validate found.
struct Finding {
  Severity severity = Severity::Error;
  /// The setting concerned, as a path like Diff's ("width", "metadata/language"), or "" for the
  /// description as a whole.
  std::string setting;
  /// A sentence for a person, naming the setting and the value found.
  std::string message;
};

/// What is wrong with `description`; empty for a valid one. Findings come in the order of the
/// checks, each check in the order of the keys it reads:
/// - every kind: a setting under a key the description's kind knows that holds another value
///   type than its accessors read (possible after SetProperty), the metadata child included
///   (error); an integer beyond the 32-bit range its accessor reads, such as threads, width or
///   the DVB size (error);
/// - video and audio: a setting the bitrate functions need that is missing (error): the codec
///   identifier, width, height, frame rate and bitrate mode, and the quality in "vbr" mode, for
///   video; the codec identifier, sample rate, channel layout and sample format for audio; a
///   missing pixel aspect (warning: the frame aspect and IsCompatible need it); a codec
///   identifier the presets do not know for the kind; a zero width, height, pixel-aspect term or
///   frame-rate denominator; a pixel or sample format outside libavutil's enumeration; a channel
///   layout of 0 (errors);
/// - video and audio without any of these errors: the presets' refusal of the description, with
///   their reason (error), or a stored bitrate outside the presets' minimum to maximum for the
///   description (warning).
/// A null pointer gives one error. Never throws for anything the description holds; only
/// std::bad_alloc.
TARVEK_INSPECT_API std::vector<Finding> Validate(
    const boost::intrusive_ptr<const IFormat>& description);

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_VALIDATE_H_
