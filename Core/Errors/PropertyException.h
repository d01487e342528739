// Errors of operations on a Tarvek::Core::Property: the base PropertyException and the three
// concrete refusals, MethodIsNotApplicable, ChildNotFound and WrongPropertyType.
#ifndef TARVEK_CORE_ERRORS_PROPERTYEXCEPTION_H_
#define TARVEK_CORE_ERRORS_PROPERTYEXCEPTION_H_

#include <string>

#include "../Interfaces/PropertyTypes.h"
#include "CoreException.h"

namespace Tarvek {
namespace Core {

/// An operation on a property was refused. Carries the items below and the call stack.
class TARVEK_VISIBLE_TYPE PropertyException : public virtual CoreException {
 public:
  ~PropertyException() noexcept override {}

  /// Tag of the name of the property on which the operation was attempted.
  struct TagPropertyName;
  /// Tag of the bare name of the operation that refused ("SetChildT", "GetInt64", ...).
  struct TagMethodName;
  /// Tag of the type of that property; renders as its decimal value.
  struct TagPropertyType;

  using PropertyNameInfo = boost::error_info<TagPropertyName, std::string>;
  using MethodNameInfo = boost::error_info<TagMethodName, std::string>;
  using PropertyTypeInfo = boost::error_info<TagPropertyType, Tarvek::PropertyTypes>;
};

/// Children were to be added to a property that cannot hold them (any type but the container).
class TARVEK_VISIBLE_TYPE MethodIsNotApplicable : public PropertyException {
 public:
  ~MethodIsNotApplicable() noexcept override {}
};

/// A read-only look-up found no child of the requested name. Also carries ChildNameInfo and a
/// DescriptionInfo sentence naming both.
class TARVEK_VISIBLE_TYPE ChildNotFound : public PropertyException {
 public:
  ~ChildNotFound() noexcept override {}

  /// Tag of the name of the child that was asked for.
  struct TagChildName;
  using ChildNameInfo = boost::error_info<TagChildName, std::string>;
};

/// A typed getter was called on a property holding another type (PropertyTypeInfo). Also carries
/// RequestedTypeInfo and a DescriptionInfo sentence naming both types.
class TARVEK_VISIBLE_TYPE WrongPropertyType : public PropertyException {
 public:
  ~WrongPropertyType() noexcept override {}

  /// Tag of the type the getter reads; renders as its decimal value.
  struct TagRequestedType;
  using RequestedTypeInfo = boost::error_info<TagRequestedType, Tarvek::PropertyTypes>;
};

}  // namespace Core
}  // namespace Tarvek

#endif  // TARVEK_CORE_ERRORS_PROPERTYEXCEPTION_H_
