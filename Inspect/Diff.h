// Differences between two format descriptions, with reasons: Tarvek::Conf::Diff lists every
// setting in which two property trees differ, and Tarvek::Conf::ExplainCompatibility says why
// IsCompatible answers false. Part of the inspection library (Tarvek::Inspect).
//
//   for (const auto& d : Tarvek::Conf::Diff(recorded, wanted)) {
//     std::cout << d.path << ": " << DifferenceKindName(d.kind) << ": " << d.a << " / " << d.b;
//   }
#ifndef TARVEK_CONF_FORMATS_DIFF_H_
#define TARVEK_CONF_FORMATS_DIFF_H_

#include <boost/intrusive_ptr.hpp>
#include <string>
#include <vector>

#include "../Conf/Interfaces/IFormat.h"
#include "../Core/Interfaces/Property.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {

/// How a setting differs between description a and description b.
enum class DifferenceKind {
  OnlyInA,     ///< the setting exists in a only
  OnlyInB,     ///< the setting exists in b only
  OtherType,   ///< both have it, holding values of other types
  OtherValue,  ///< both have it, of one type, holding other values
  OtherOrder,  ///< a container whose children are the same but stand in another order
  OtherName,   ///< the roots carry other names: descriptions of other kinds (path "")
};

/// A short lower-case name of `kind`: "only in a", "only in b", "other type", "other value",
/// "other order", "other name". Never throws.
TARVEK_INSPECT_API const char* DifferenceKindName(DifferenceKind kind) noexcept;

/// One difference between two property trees.
struct Difference {
  /// Where: the names from the root down, joined by '/' ("metadata/language"); "" is the root.
  /// A name that is empty or holds '/', '[', '\', '"' or a control byte is written quoted and
  /// escaped as ValueText writes strings. The second and later children of one name among
  /// their siblings are followed by "[n]", n counting from 0 ("x", "x[1]", "x[2]").
  std::string path;
  DifferenceKind kind = DifferenceKind::OtherValue;
  /// The setting in a and in b as ValueText gives it; "" on the side that lacks it. For
  /// OtherOrder, the children's names in order, quoted and separated by ", "; for OtherName,
  /// the two root names, quoted.
  std::string a;
  std::string b;
  /// The nodes themselves, inside the trees of a and b, for a setting only in a, only in b, of
  /// another type or value; null on the side that lacks it and for the other kinds. They stay
  /// valid while both descriptions live and their trees are not changed.
  const Core::Property* nodeA = nullptr;
  const Core::Property* nodeB = nullptr;
};

/// Every difference between the property trees of `a` and `b`, in the order of a's tree, with
/// the settings only b has after the others at each level. Children are matched by name, the
/// n-th child of a name in a with the n-th of that name in b. The list is empty exactly when
/// a->Compare(b) is true; runtime entries and private data take no part, as in Compare. A null
/// side lacks the whole tree (one entry at the root); two null pointers give an empty list.
/// Throws only std::bad_alloc.
TARVEK_INSPECT_API std::vector<Difference> Diff(const boost::intrusive_ptr<const IFormat>& a,
                                                const boost::intrusive_ptr<const IFormat>& b);

/// One reason why a->IsCompatible(b) answers false.
struct Incompatibility {
  /// The key of the setting the kind's test compares ("width", "sample_rate"), or "" when the
  /// reason is not a setting (a null pointer, a description of another kind).
  std::string setting;
  /// The value the test reads in a and in b (as the getter returns it), "missing", ValueText
  /// of a setting of the wrong type; for a reason that is not a setting, the kinds ("video",
  /// "audio", "null").
  std::string a;
  std::string b;
  /// A sentence for a person: "the width differs: 1920 in a, 1280 in b".
  std::string reason;
};

/// The reasons why `a` does not accept `b` in the terms of a's own test: for video, which of
/// width, height and pixel aspect (X and Y) differ; for audio, which of sample rate, channel
/// layout and sample format; a `b` of another kind, or null, is one reason. A setting that is
/// missing, or holds a value of another type, on either side is a reason, not an error. Empty
/// exactly when a->IsCompatible(b) is true (the generic and subtitle descriptions accept any
/// `b`); a null `a` gives one reason. Throws only std::bad_alloc.
TARVEK_INSPECT_API std::vector<Incompatibility> ExplainCompatibility(
    const boost::intrusive_ptr<const IFormat>& a, const boost::intrusive_ptr<const IFormat>& b);

/// A node's value as text, with its type: `1920 (int64)`, `true (bool)`, `"eng" (string)` with
/// quotes, backslashes and control bytes escaped as PrintPropertyValue does, `container (2
/// children)`. Throws only std::bad_alloc.
TARVEK_INSPECT_API std::string ValueText(const Core::Property& node);

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_DIFF_H_
