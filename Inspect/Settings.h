// The kinds of description and the settings each kind knows, in one table that validation, the
// JSON form and formatdesc's options all read. Part of the inspection library (Tarvek::Inspect).
#ifndef TARVEK_INSPECT_SETTINGS_H_
#define TARVEK_INSPECT_SETTINGS_H_

#include <boost/intrusive_ptr.hpp>
#include <optional>
#include <string>
#include <vector>

#include "../Conf/Interfaces/IFormat.h"
#include "../Core/Interfaces/PropertyTypes.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {

/// The kinds of codec description.
enum class FormatKind { Codec, Video, Audio, Subtitle };

/// The kind of `description`, or none for a null pointer or a description that is no codec.
/// Never throws.
TARVEK_INSPECT_API std::optional<FormatKind> KindOf(const IFormat* description) noexcept;

/// "codec", "video", "audio" or "subtitle": the kind as the JSON form and formatdesc name it.
TARVEK_INSPECT_API const char* KindName(FormatKind kind) noexcept;

/// The kind named `name` (KindName's texts, exactly), or none.
TARVEK_INSPECT_API std::optional<FormatKind> KindFromName(const std::string& name) noexcept;

/// "a video description", "an audio description", "a generic codec description"..., for
/// sentences about a kind.
TARVEK_INSPECT_API const char* KindPhrase(FormatKind kind) noexcept;

/// The integers an accessor makes of a stored 64-bit value.
enum class ValueRange {
  Int64,       ///< all of them
  Signed32,    ///< the low 32 bits, as int
  Unsigned32,  ///< the low 32 bits, as unsigned int
};

/// A setting that a kind of description knows.
struct Setting {
  /// The container that holds it: empty for a child of the root, else the key of a root child
  /// (the audio language lives in the metadata).
  std::string parent;
  std::string key;
  /// The type its accessors read.
  PropertyTypes type;
  /// For an integer, what its accessors return; Int64 for the others.
  ValueRange range;
  /// The formatdesc option that sets it, or empty.
  std::string option;
};

/// Every setting a description of `kind` knows, the metadata child first, then the codec
/// settings, then the kind's own, in the order of their accessors.
TARVEK_INSPECT_API const std::vector<Setting>& SettingsOf(FormatKind kind);

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_INSPECT_SETTINGS_H_
