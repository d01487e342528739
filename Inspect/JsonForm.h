// A lossless, versioned text form of a codec description: Tarvek::Conf::ToJson writes one as
// JSON, Tarvek::Conf::FromJson reads it back. Part of the inspection library (Tarvek::Inspect).
//
//   std::string text = Tarvek::Conf::ToJson(video);             // store it anywhere
//   auto back = Tarvek::Conf::FromJson(text);                    // the same description again
//   auto video2 = boost::dynamic_pointer_cast<Tarvek::Conf::IFormatCodecVideo>(back);
//
// The document is one JSON object:
//   "format": "tarvek-description", "version": 1,
//   "kind": "codec" | "video" | "audio" | "subtitle",
//   "object_name": the name of the tree's root,
//   "tree": the root node: {"type": "container", "children": [node, ...]}, where every node is
//       {"name": ..., "type": "bool" | "int64" | "string" | "container", "value": ...} with
//       "children" instead of "value" for a container, in the tree's order, repeated names kept;
//   "internal": the runtime entries: {"value": ..., "children": [entry, ...]}, an entry being
//       {"key": ..., "value": ..., "children": [...]} ("children" only when it has any);
//   "private_data": the private data in base64 (RFC 4648, with padding), or null for none.
// Integers are JSON integers holding all 64 bits. A name, key or text that is not valid UTF-8
// is written as "name_base64", "key_base64" or "value_base64" instead, so any bytes survive.
// Readers ignore members of the top-level object they do not know, so tools may add derived
// values beside a description; inside the tree and the entries every member must be known.
#ifndef TARVEK_CONF_FORMATS_JSONFORM_H_
#define TARVEK_CONF_FORMATS_JSONFORM_H_

#include <boost/exception/error_info.hpp>
#include <boost/intrusive_ptr.hpp>
#include <string>

#include "../Conf/Interfaces/IFormat.h"
#include "../Conf/Interfaces/IFormatCodec.h"
#include "../Core/Errors/ConfException.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {

/// A text that is not a description in the JSON form (malformed JSON, a member missing or of
/// the wrong type, an unknown format, version or kind, invalid base64, nesting beyond
/// kJsonFormMaxDepth), or a description that cannot be written in it. Its DescriptionInfo says
/// where and what ("/tree/children/3/value: expected an integer, found a string"); its
/// JsonPointerInfo, when present, holds the JSON pointer alone ("" is the whole document).
class TARVEK_VISIBLE_TYPE JsonFormError : public virtual ConfException {
 public:
  ~JsonFormError() noexcept override {}

  /// Tag of the JSON pointer (RFC 6901) of the offending value.
  struct TagJsonPointer;
  using JsonPointerInfo = boost::error_info<TagJsonPointer, std::string>;
};

/// The version of the JSON form that ToJson writes and FromJson reads.
constexpr int kJsonFormVersion = 1;

/// The deepest property tree, and the deepest runtime entries, the JSON form holds: this many
/// levels, the root counting as one. It bounds the work and the stack a hostile text can cost.
constexpr int kJsonFormMaxDepth = 64;

/// `description` as a JSON document (see above), indented by two spaces, each node of the tree
/// on a line of its own when it fits. Takes a non-const pointer because the private data is read
/// through IFormatCodec::GetPrivateData, which is not const; nothing is changed. Throws
/// JsonFormError for a null pointer or a tree or runtime entries deeper than kJsonFormMaxDepth,
/// std::bad_alloc when memory runs out.
TARVEK_INSPECT_API std::string ToJson(const boost::intrusive_ptr<IFormatCodec>& description);

/// A new description, of the document's kind and made by that kind's Create() factory, holding
/// the document's tree, runtime entries and private data: FromJson(ToJson(d)) compares equal to
/// d, has its runtime entries and the same private-data bytes, and is of its kind. Callers
/// dynamic_cast to the kind's interface. Throws JsonFormError, naming where and what, for any
/// text that is not such a document, among them a version other than kJsonFormVersion, a root
/// that is not a container, an object_name other than the kind's own, and a tree without a
/// metadata child (which every description has); then nothing is built. Throws std::bad_alloc
/// when memory runs out.
TARVEK_INSPECT_API boost::intrusive_ptr<IFormatCodec> FromJson(const std::string& text);

/// The kind of `description` as the JSON form names it: "video", "audio", "subtitle", or
/// "codec" for any other codec description; "" for a null pointer or a description that is no
/// codec. Never throws.
TARVEK_INSPECT_API const char* DescriptionKind(
    const boost::intrusive_ptr<const IFormat>& description) noexcept;

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_JSONFORM_H_
