// The typed child helpers Property::SetChildT and Property::CreateChildT, as the format description
// library exports them: one instance per value type (bool, long long, std::string), which every
// description setter writes with and which users link instead of compiling their own.
#ifndef TARVEK_CONF_FORMATS_CHILDHELPERS_H_
#define TARVEK_CONF_FORMATS_CHILDHELPERS_H_

#include <string>

#include "../../Core/Interfaces/Property.h"
#include "Export.h"

namespace Tarvek {
namespace Core {

extern template TARVEK_FORMATS_API Property& Property::SetChildT<bool>(const std::string&,
                                                                       const bool&);
extern template TARVEK_FORMATS_API Property& Property::SetChildT<long long>(const std::string&,
                                                                            const long long&);
extern template TARVEK_FORMATS_API Property& Property::SetChildT<std::string>(const std::string&,
                                                                              const std::string&);
extern template TARVEK_FORMATS_API Property& Property::CreateChildT<bool>(const std::string&,
                                                                          const bool&);
extern template TARVEK_FORMATS_API Property& Property::CreateChildT<long long>(const std::string&,
                                                                               const long long&);
extern template TARVEK_FORMATS_API Property& Property::CreateChildT<std::string>(
    const std::string&, const std::string&);

}  // namespace Core
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_CHILDHELPERS_H_
