#include "FormatBase.h"

#include <iostream>
#include <utility>
#include "../Interfaces/Keys.h"

namespace Tarvek {
namespace Conf {

FormatBase::FormatBase(const std::string& name) : property_(name) {
  // The key holds no '.', so put() would read it as a path of one top-level entry. This adds that
  // entry without parsing a path or building a temporary tree: a copy of an empty entry kept for
  // the purpose, then its value.
  static const boost::property_tree::ptree::value_type kEmptyEntry(TAG_OBJECT,
                                                                   boost::property_tree::ptree());
  internal_properties_.push_back(kEmptyEntry)->second.data() = name;
  property_.SetChild(TAG_METADATA);
}

FormatBase::FormatBase(TreesOf trees)
    : property_(trees.source.property_), internal_properties_(trees.source.internal_properties_) {}

FormatBase::~FormatBase() = default;

int FormatBase::AddRef() const { return ref_count_.AddRefImpl(); }

int FormatBase::GetRefCount() const { return ref_count_.GetRefCountImpl(); }

int FormatBase::Release() const {
  const int left = ref_count_.ReleaseImpl();
  if (left == 0) delete this;
  return left;
}

const Core::Property& FormatBase::GetProperty() const { return property_; }

void FormatBase::SetProperty(const Core::Property& tree) {
  // Build the new tree aside, so that a tree that cannot take the metadata child (a leaf) is
  // refused with the description untouched, instead of leaving a root without metadata.
  Core::Property replacement(property_.GetName());
  replacement = tree;
  if (!replacement.ChildExists(TAG_METADATA)) replacement.SetChild(TAG_METADATA);
  property_ = std::move(replacement);
}

boost::property_tree::ptree& FormatBase::GetInternalProperties() { return internal_properties_; }

const boost::property_tree::ptree& FormatBase::GetInternalProperties() const {
  return internal_properties_;
}

void FormatBase::SetMetadata(const Core::Property& metadata) {
  property_.SetChild(TAG_METADATA, metadata);
}

const Core::Property& FormatBase::GetMetadata() const { return property_[Keys::Metadata]; }

void FormatBase::PrintContent() {
  std::ostream& out = std::cout;
  out << "======External props:=====" << std::endl;
  Core::PrintPropertyValue(property_, 0, out, true, true);
  out << "======Runtime props:=======" << std::endl;
  for (const auto& entry : internal_properties_) {
    out << entry.first << ": " << entry.second.data() << std::endl;
  }
}

bool FormatBase::Compare(boost::intrusive_ptr<const IFormat> other) const {
  // A description equals no absent one.
  if (!other) return false;
  return property_ == other->GetProperty();
}

bool FormatBase::IsCompatible(boost::intrusive_ptr<const IFormat> /*other*/) const { return true; }

}  // namespace Conf
}  // namespace Tarvek
