// Private to the FFmpeg bridge library: names of libavcodec's option constants, read from its
// option table, and small helpers shared by the sources.
#ifndef TARVEK_FFMPEG_SOURCE_OPTIONS_H_
#define TARVEK_FFMPEG_SOURCE_OPTIONS_H_

#include <optional>
#include <string>

namespace Tarvek {
namespace FFmpeg {
namespace Detail {

/// The name libavcodec's context options give value `value` in option unit `unit`
/// ("field_order"), or null.
const char* OptionConstantName(const char* unit, long long value) noexcept;

/// The value of constant `name` in libavcodec's option unit `unit`, if there is one.
std::optional<long long> OptionConstantValue(const char* unit, const std::string& name) noexcept;

/// "`count` channels" or "1 channel".
std::string Channels(long long count);

}  // namespace Detail
}  // namespace FFmpeg
}  // namespace Tarvek

#endif  // TARVEK_FFMPEG_SOURCE_OPTIONS_H_
