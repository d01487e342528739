#include "Options.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/opt.h>
}

#include <cstring>

namespace Tarvek {
namespace FFmpeg {
namespace Detail {
namespace {

// The constants of option unit `unit` in libavcodec's context options, one at a time.
template <class Visit>
const AVOption* FindConstant(const char* unit, Visit&& matches) noexcept {
  const AVClass* codecClass = avcodec_get_class();
  const AVOption* option = nullptr;
  while ((option = av_opt_next(&codecClass, option)) != nullptr) {
    if (option->type == AV_OPT_TYPE_CONST && option->unit != nullptr &&
        std::strcmp(option->unit, unit) == 0 && matches(*option)) {
      return option;
    }
  }
  return nullptr;
}

}  // namespace

const char* OptionConstantName(const char* unit, long long value) noexcept {
  const AVOption* found = FindConstant(
      unit, [value](const AVOption& option) { return option.default_val.i64 == value; });
  return found != nullptr ? found->name : nullptr;
}

std::optional<long long> OptionConstantValue(const char* unit, const std::string& name) noexcept {
  const AVOption* found =
      FindConstant(unit, [&name](const AVOption& option) { return name == option.name; });
  if (found == nullptr) return std::nullopt;
  return static_cast<long long>(found->default_val.i64);
}

std::string Channels(long long count) {
  return std::to_string(count) + (count == 1 ? " channel" : " channels");
}

}  // namespace Detail
}  // namespace FFmpeg
}  // namespace Tarvek
