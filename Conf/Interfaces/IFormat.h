// Tarvek::Conf::IFormat: the interface of every format description. Descriptions are created by
// the Create() factories of the classes in Conf/Formats and held through boost::intrusive_ptr.
#ifndef TARVEK_CONF_INTERFACES_IFORMAT_H_
#define TARVEK_CONF_INTERFACES_IFORMAT_H_

#include <boost/intrusive_ptr.hpp>
#include <boost/property_tree/ptree.hpp>
#include <string>

#include "../../Core/Interfaces/IRefCountable.h"
#include "../../Core/Interfaces/Property.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {

/// Key of the runtime entry holding a description's object name.
const std::string TAG_OBJECT = "object_name";

/// A description of how a media stream is, or is to be, encoded. Its settings live in a
/// property tree (GetProperty) under the TAG_* keys of the interfaces; a second, flat table of
/// runtime string entries (GetInternalProperties) holds the object name and whatever callers add.
/// Not synchronised: one thread writes at a time; concurrent reads are safe.
class TARVEK_VISIBLE_TYPE IFormat : public virtual IRefCountable {
 public:
  ~IFormat() override {}

  /// Key of the metadata child: a sub-tree that every description has.
  TARVEK_CONF_INTERFACES_API static const std::string TAG_METADATA;

  /// The whole property tree, by reference (no copy).
  virtual const Core::Property& GetProperty() const = 0;
  /// Replaces the settings with a copy of `tree`'s type, value and children; the root keeps the
  /// object name. An empty metadata child is added when `tree` has none. Throws
  /// Core::MethodIsNotApplicable when `tree` is not a container; the description is unchanged.
  virtual void SetProperty(const Core::Property& tree) = 0;

  /// The runtime entries, writable; they hold "object_name" and take no part in Compare.
  virtual boost::property_tree::ptree& GetInternalProperties() = 0;
  virtual const boost::property_tree::ptree& GetInternalProperties() const = 0;

  /// Replaces the metadata child's type, value and children with those of `metadata`.
  virtual void SetMetadata(const Core::Property& metadata) = 0;
  /// The metadata child, by reference.
  virtual const Core::Property& GetMetadata() const = 0;

  /// Prints the property tree and the top-level runtime entries to standard output.
  virtual void PrintContent() = 0;
  /// Whether `other`'s property tree equals this one's (names, types, values, children, order).
  /// Runtime entries and private data take no part. False when `other` is null.
  virtual bool Compare(boost::intrusive_ptr<const IFormat> other) const = 0;
  /// Whether a stream described by `other` could be used where this description is expected.
  /// The generic and subtitle descriptions accept anything; video and audio compare their
  /// geometry or sample layout.
  virtual bool IsCompatible(boost::intrusive_ptr<const IFormat> other) const = 0;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_INTERFACES_IFORMAT_H_
