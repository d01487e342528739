// Tarvek::Media::reduce: reduction of a ratio to lowest terms, as used for aspect ratios.
#ifndef TARVEK_MEDIAWRAPPER_REDUCE_H_
#define TARVEK_MEDIAWRAPPER_REDUCE_H_

#include "Export.h"

namespace Tarvek {
namespace Media {

/// Replaces x:y, in place, by the same ratio in lowest terms: both are divided by their greatest
/// common divisor (16:9 stays 16:9, 46080:25920 becomes 16:9). Signs are kept as they were
/// (-4:6 becomes -2:3). With a zero term the divisor is the other term's magnitude, so 0:y
/// becomes 0:1 and x:0 becomes 1:0 (signs kept); 0:0 stays 0:0. Never throws.
TARVEK_MEDIA_WRAPPER_API void reduce(long long& x, long long& y) noexcept;

}  // namespace Media
}  // namespace Tarvek

#endif  // TARVEK_MEDIAWRAPPER_REDUCE_H_
