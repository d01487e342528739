// formatdesc's output: a description as text (its own PrintContent, then a summary of readable
// values and bitrates) or as one JSON object, the bitrate ladder, and the preset codec lists.
#ifndef TARVEK_TOOLS_FORMATDESC_OUTPUT_H_
#define TARVEK_TOOLS_FORMATDESC_OUTPUT_H_

#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Diff.h>
#include <Tarvek/Inspect/JsonForm.h>
#include <Tarvek/Inspect/Validate.h>
#include <Tarvek/Presets/BitratePresets.h>

#include <iosfwd>
#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Describe.h"

namespace Formatdesc {

/// A property tree as plain JSON, the tool's "settings": containers as objects (the first child of
/// a repeated name, as the library's look-ups find it), leaves as their values.
nlohmann::ordered_json SettingsJson(const Tarvek::Core::Property& tree);

/// Readies GStreamer for the caps in the summary and --from-caps, once per process; a no-op in a
/// tool built without GStreamer.
void InitGStreamer();

/// "4.50 Mb/s" from 1 Mb/s up, "128.00 kb/s" below, both rounded to two places.
std::string ReadableBitrate(long long bitsPerSecond);
/// "4.50 Mb/s (4500000 b/s)".
std::string DescribeBitrate(long long bitsPerSecond);
/// A frame rate with at most three decimal places and no trailing zeros: "29.97", "25".
std::string ReadableFrameRate(double framesPerSecond);

/// Prints `codec`'s PrintContent to standard output, then under "======Summary:=============" the
/// derived values that are set (frame aspect and rate, format and layout names, the size of the
/// private data) and the bitrates when given, one "Label: value" line each, then the `extra`
/// lines a caller adds (such as a verdict on the bitrate).
void PrintDescription(Tarvek::Conf::IFormatCodec& codec, const std::optional<Bitrates>& bitrates,
                      const std::vector<std::pair<std::string, std::string>>& extra = {});

/// The same as one JSON object: the library's JSON form of the description (ToJson, which
/// --from-json reads back), then "settings" (the property tree under the description's own
/// keys, the first child of a repeated name), the derived values, and "bitrate" {"default",
/// "min", "max"} when given.
nlohmann::ordered_json DescriptionJson(
    const boost::intrusive_ptr<Tarvek::Conf::IFormatCodec>& codec,
    const std::optional<Bitrates>& bitrates);

/// The differences between descriptions a and b, one line each under "Differences:" (or
/// "Differences: none"), then whether b can be used where a is expected and, if not, why.
void PrintDiff(std::ostream& out, const std::vector<Tarvek::Conf::Difference>& differences,
               const std::vector<Tarvek::Conf::Incompatibility>& reasons);
nlohmann::ordered_json DiffJson(const std::vector<Tarvek::Conf::Difference>& differences,
                                const std::vector<Tarvek::Conf::Incompatibility>& reasons);

/// Validate's findings, one "severity: setting: message" line each, or "valid" when there are
/// none; as JSON, {"valid": no error found, "findings": [...]}.
void PrintFindings(std::ostream& out, const std::vector<Tarvek::Conf::Finding>& findings);
nlohmann::ordered_json FindingsJson(const std::vector<Tarvek::Conf::Finding>& findings);

/// The ladder as an aligned table under a title line naming codec, frame rate and quality.
void PrintLadder(std::ostream& out, const std::string& codecId, Pair frameRate,
                 std::optional<long long> quality, const std::vector<LadderRow>& rows);
nlohmann::ordered_json LadderJson(const std::string& codecId, Pair frameRate,
                                  std::optional<long long> quality,
                                  const std::vector<LadderRow>& rows);

/// The preset codec identifiers: by kind under a heading each, or one a line for `kind` alone
/// ("video" or "audio"); as JSON, an array under each kind's name.
void PrintCodecs(std::ostream& out, const std::optional<std::string>& kind);
nlohmann::ordered_json CodecsJson(const std::optional<std::string>& kind);

/// Writes `value` indented by two, an object or array of plain values on one line when it fits in
/// 100 columns (as the library writes its JSON form), with invalid UTF-8 in strings replaced
/// rather than refused.
void PrintJson(std::ostream& out, const nlohmann::ordered_json& value);

}  // namespace Formatdesc

#endif  // TARVEK_TOOLS_FORMATDESC_OUTPUT_H_
