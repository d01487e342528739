// The JSON form of a description as a parsed document, for the tool: it reads documents that
// hold a description among members of their own (a probe's streams, derived settings) and adds
// members to the descriptions it writes, so it parses and lays out each text once instead of
// going through ToJson and FromJson's text. Not installed.
#ifndef TARVEK_INSPECT_JSONDOCUMENT_H_
#define TARVEK_INSPECT_JSONDOCUMENT_H_

#include <boost/intrusive_ptr.hpp>
#include <nlohmann/json.hpp>
#include <string>

#include "Export.h"
#include "JsonForm.h"

namespace Tarvek {
namespace Conf {
namespace JsonDocument {

// How deep a document of the JSON form nests at most: a node at level L of the tree sits 2L
// deep, its "children" array one deeper.
constexpr int kMaxNesting = 2 * kJsonFormMaxDepth + 1;

// `text` parsed in one pass, in time linear in its length. Throws JsonFormError for malformed
// JSON, nesting deeper than `maxNesting` (before anything is built) and an object that names a
// member twice (with that member's JSON pointer).
TARVEK_INSPECT_API nlohmann::ordered_json Parse(const std::string& text, int maxNesting);

// A new description from a parsed document of the JSON form; members besides the form's own
// are ignored. Throws what FromJson throws.
TARVEK_INSPECT_API boost::intrusive_ptr<IFormatCodec> Read(const nlohmann::ordered_json& document);

// `description` as a document of the JSON form, its members in the order the form lists them.
// Throws what ToJson throws.
TARVEK_INSPECT_API nlohmann::ordered_json Make(
    const boost::intrusive_ptr<IFormatCodec>& description);

}  // namespace JsonDocument
}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_INSPECT_JSONDOCUMENT_H_
