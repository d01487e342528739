// The exported instances of the typed child helpers (ChildHelpers.h).
#include "ChildHelpers.h"

namespace Tarvek {
namespace Core {

template Property& Property::SetChildT<bool>(const std::string&, const bool&);
template Property& Property::SetChildT<long long>(const std::string&, const long long&);
template Property& Property::SetChildT<std::string>(const std::string&, const std::string&);
template Property& Property::CreateChildT<bool>(const std::string&, const bool&);
template Property& Property::CreateChildT<long long>(const std::string&, const long long&);
template Property& Property::CreateChildT<std::string>(const std::string&, const std::string&);

}  // namespace Core
}  // namespace Tarvek
