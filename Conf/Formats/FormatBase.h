// Tarvek::Conf::FormatBase: the common implementation of IFormat under every format description:
// the reference count, the property tree with its metadata child, and the runtime entries.
// It has no factory; the description classes (FormatCodec and its kinds) build on it.
#ifndef TARVEK_CONF_FORMATS_FORMATBASE_H_
#define TARVEK_CONF_FORMATS_FORMATBASE_H_

#include <boost/intrusive_ptr.hpp>
#include <boost/property_tree/ptree.hpp>
#include <string>
#include <typeinfo>

#include "../../Core/Interfaces/Property.h"
#include "../../Core/Interfaces/RefCountImpl.h"
#include "../Interfaces/IFormat.h"
#include "ChildHelpers.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {

/// The shared part of every description. Constructed with an object name, which names the
/// property tree's root and is recorded as the runtime entry TAG_OBJECT. The count starts at 0;
/// the Release() that brings it back to 0 deletes the whole object, so descriptions are created
/// with new and held through boost::intrusive_ptr.
class TARVEK_FORMATS_API FormatBase : public virtual IFormat {
 public:
  /// A description named `name`: a root with one empty metadata child, one runtime entry.
  explicit FormatBase(const std::string& name);
  FormatBase(const FormatBase&) = delete;
  FormatBase& operator=(const FormatBase&) = delete;
  ~FormatBase() override;

  int AddRef() const override;
  int GetRefCount() const override;
  int Release() const override;

  const Core::Property& GetProperty() const override;
  void SetProperty(const Core::Property& tree) override;
  boost::property_tree::ptree& GetInternalProperties() override;
  const boost::property_tree::ptree& GetInternalProperties() const override;
  void SetMetadata(const Core::Property& metadata) override;
  const Core::Property& GetMetadata() const override;
  /// Writes "======External props:=====", the property tree, "======Runtime props:=======" and
  /// one "key: value" line a top-level runtime entry to standard output, flushing each line.
  void PrintContent() override;
  bool Compare(boost::intrusive_ptr<const IFormat> other) const override;
  /// Always true: a description with no kind of its own accepts any other.
  bool IsCompatible(boost::intrusive_ptr<const IFormat> other) const override;

 protected:
  /// Names the description a copy starts from (see the copying constructors, used by Clone).
  struct TreesOf {
    const FormatBase& source;
  };
  /// A description holding copies of `trees.source`'s property tree and runtime entries, with a
  /// fresh count. The trees are copied once, straight from the source.
  explicit FormatBase(TreesOf trees);

  /// `other` as the interface `Kind`, or null when it is not one (or is null): a dynamic_cast,
  /// with a shortcut for the usual case of a description of exactly the class `Exact`, which two
  /// type comparisons establish.
  template <class Kind, class Exact>
  static const Kind* AsKind(const IFormat* other) {
    if (other == nullptr) return nullptr;
    if (typeid(*other) == typeid(Exact)) {
      return static_cast<const Exact*>(dynamic_cast<const void*>(other));
    }
    return dynamic_cast<const Kind*>(other);
  }

  // Declared in construction order: count, property tree, runtime entries.
 private:
  RefCountImpl ref_count_;

 protected:
  /// The settings; the description classes keep each one as a child of this root.
  Core::Property property_;

 private:
  boost::property_tree::ptree internal_properties_;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_FORMATBASE_H_
