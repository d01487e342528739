// formatdesc's readers of option values. Numbers are read digit by digit rather than with
// std::stoul and friends, which accept signs, spaces and trailing junk.
#include "Options.h"

#include <Tarvek/FFmpeg/Names.h>

#include <algorithm>
#include <cctype>
#include <limits>
#include <numeric>
#include <optional>
#include <string_view>

extern "C" {
#include <libavutil/channel_layout.h>
#include <libavutil/pixdesc.h>
#include <libavutil/samplefmt.h>
}

namespace Formatdesc {
namespace {

using Tarvek::Conf::ChannelLayout;

constexpr std::uint64_t kMaxUnsigned = std::numeric_limits<unsigned int>::max();
constexpr std::uint64_t kMaxUint32 = 0xffffffffu;

// The value of a non-empty run of decimal digits no greater than `max`; nothing otherwise.
std::optional<std::uint64_t> Digits(std::string_view text, std::uint64_t max) {
  if (text.empty()) return std::nullopt;
  std::uint64_t value = 0;
  for (const char c : text) {
    if (c < '0' || c > '9') return std::nullopt;
    const auto digit = static_cast<std::uint64_t>(c - '0');
    if (value > (max - digit) / 10) return std::nullopt;
    value = value * 10 + digit;
  }
  return value;
}

// As Digits, or a run of hexadecimal digits after "0x" or "0X".
std::optional<std::uint64_t> Number(std::string_view text, std::uint64_t max) {
  if (text.size() < 3 || text[0] != '0' || (text[1] != 'x' && text[1] != 'X')) {
    return Digits(text, max);
  }
  std::uint64_t value = 0;
  for (const char c : text.substr(2)) {
    const char* const hex = "0123456789abcdef";
    const char lower = (c >= 'A' && c <= 'F') ? static_cast<char>(c - 'A' + 'a') : c;
    const char* const found = std::char_traits<char>::find(hex, 16, lower);
    if (found == nullptr) return std::nullopt;
    const auto digit = static_cast<std::uint64_t>(found - hex);
    if (value > (max - digit) / 16) return std::nullopt;
    value = value * 16 + digit;
  }
  return value;
}

// Two positive 32-bit numbers around `separator`, or nothing.
std::optional<Pair> PositivePair(std::string_view text, char separator) {
  const std::size_t at = text.find(separator);
  if (at == std::string_view::npos) return std::nullopt;
  const auto first = Digits(text.substr(0, at), kMaxUnsigned);
  const auto second = Digits(text.substr(at + 1), kMaxUnsigned);
  if (!first || !second || *first == 0 || *second == 0) return std::nullopt;
  return Pair{static_cast<unsigned int>(*first), static_cast<unsigned int>(*second)};
}

char LowerAscii(char c) { return (c >= 'A' && c <= 'Z') ? static_cast<char>(c - 'A' + 'a') : c; }

std::string Lower(std::string text) {
  for (char& c : text) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return text;
}

bool EqualsIgnoringCase(std::string_view a, std::string_view b) {
  return a.size() == b.size() && std::equal(a.begin(), a.end(), b.begin(), [](char x, char y) {
           return LowerAscii(x) == LowerAscii(y);
         });
}

// 10 to the power `exponent` (at most 19).
std::uint64_t PowerOfTen(std::size_t exponent) {
  std::uint64_t value = 1;
  while (exponent-- > 0) value *= 10;
  return value;
}

// The fraction N*1000/1001 whose rounding to `scale` is mantissa/scale, if there is one: how
// "29.97" and "23.976" are meant.
std::optional<Pair> NtscRate(std::uint64_t mantissa, std::uint64_t scale) {
  const std::uint64_t n = (mantissa * 1001 + 500 * scale) / (1000 * scale);
  if (n == 0 || n * 1000 > kMaxUnsigned) return std::nullopt;
  const std::uint64_t rounded = (2 * n * 1000 * scale + 1001) / 2002;
  if (rounded != mantissa) return std::nullopt;
  return Pair{static_cast<unsigned int>(n * 1000), 1001};
}

// A decimal frame rate "WHOLE.FRACTION" (at most six places) as a fraction, or nothing.
std::optional<Pair> DecimalRate(std::string_view text) {
  const std::size_t dot = text.find('.');
  const std::string_view fraction = text.substr(dot + 1);
  const auto whole = Digits(text.substr(0, dot), kMaxUnsigned);
  const auto decimals = Digits(fraction, 999999);
  if (!whole || !decimals || fraction.size() > 6) return std::nullopt;
  const std::uint64_t scale = PowerOfTen(fraction.size());
  const std::uint64_t mantissa = *whole * scale + *decimals;
  if (mantissa == 0) return std::nullopt;
  if (fraction.size() >= 2) {
    if (const auto ntsc = NtscRate(mantissa, scale)) return ntsc;
  }
  const std::uint64_t divisor = std::gcd(mantissa, scale);
  if (mantissa / divisor > kMaxUnsigned) return std::nullopt;
  return Pair{static_cast<unsigned int>(mantissa / divisor),
              static_cast<unsigned int>(scale / divisor)};
}

}  // namespace

UsageError BadValue(const std::string& option, const std::string& expected,
                    const std::string& text) {
  return UsageError(option + ": expected " + expected + ", got '" + text + "'");
}

Pair ParseSize(const std::string& option, const std::string& text) {
  if (const auto size = PositivePair(text, 'x')) return *size;
  throw BadValue(option, "WIDTHxHEIGHT with positive integers", text);
}

Pair ParseRatio(const std::string& option, const std::string& text) {
  if (const auto ratio = PositivePair(text, ':')) return *ratio;
  throw BadValue(option, "W:H with positive integers", text);
}

Pair ParseFrameRate(const std::string& option, const std::string& text) {
  std::optional<Pair> rate;
  if (text.find('/') != std::string::npos) {
    rate = PositivePair(text, '/');
  } else if (text.find('.') != std::string::npos) {
    rate = DecimalRate(text);
  } else if (const auto whole = Digits(text, kMaxUnsigned); whole && *whole > 0) {
    rate = Pair{static_cast<unsigned int>(*whole), 1};
  }
  if (rate) return *rate;
  throw BadValue(option, "a positive frame rate such as 25, 29.97 or 30000/1001", text);
}

long long ParsePositive(const std::string& option, const std::string& text, long long max) {
  const auto value = Digits(text, static_cast<std::uint64_t>(max));
  if (value && *value > 0) return static_cast<long long>(*value);
  throw BadValue(option, "a positive integer up to " + std::to_string(max), text);
}

long long ParseNonNegative(const std::string& option, const std::string& text, long long max) {
  if (const auto value = Digits(text, static_cast<std::uint64_t>(max))) {
    return static_cast<long long>(*value);
  }
  throw BadValue(option, "a non-negative integer up to " + std::to_string(max), text);
}

long long ParseBitrate(const std::string& option, const std::string& text) {
  std::string_view digits = text;
  std::uint64_t unit = 1;
  if (!digits.empty()) {
    switch (digits.back()) {
      case 'k':
      case 'K':
        unit = 1000;
        break;
      case 'M':
        unit = 1000000;
        break;
      case 'G':
        unit = 1000000000;
        break;
      default:
        break;
    }
    if (unit != 1) digits.remove_suffix(1);
  }
  const std::size_t dot = std::min(digits.find('.'), digits.size());
  const std::string_view fraction = digits.substr(std::min(dot + 1, digits.size()));
  // The whole part is bounded so that whole * unit stays well within 64 bits; at most six places.
  const auto whole = Digits(digits.substr(0, dot), 1000000000000ull);
  const auto decimals =
      dot == digits.size() ? std::optional<std::uint64_t>(0) : Digits(fraction, 999999);
  if (whole && decimals && fraction.size() <= 6) {
    const std::uint64_t scale = PowerOfTen(dot == digits.size() ? 0 : fraction.size());
    const std::uint64_t bits = *whole * unit + (*decimals * unit + scale / 2) / scale;
    if (bits > 0) return static_cast<long long>(bits);
  }
  throw BadValue(option, "a positive number of bits per second such as 4500000, 4500k, 4.5M or 1G",
                 text);
}

long long ParseCodecTag(const std::string& option, const std::string& text) {
  if (const auto number = Number(text, kMaxUint32)) return static_cast<long long>(*number);
  const bool printable =
      std::all_of(text.begin(), text.end(), [](char c) { return c >= 0x20 && c < 0x7f; });
  if (text.size() == 4 && printable) {
    std::uint32_t tag = 0;
    for (std::size_t i = 0; i < 4; ++i) {
      tag |= static_cast<std::uint32_t>(static_cast<unsigned char>(text[i])) << (8 * i);
    }
    return tag;
  }
  throw BadValue(option, "a four-character code such as avc1, or a number", text);
}

const std::vector<std::pair<std::string, ChannelLayout>>& ChannelLayoutNames() {
  // libavutil's standard layouts that a description's 32-bit mask holds, named as it names them.
  static const std::vector<std::pair<std::string, ChannelLayout>> names = [] {
    std::vector<std::pair<std::string, ChannelLayout>> list;
    void* position = nullptr;
    while (const AVChannelLayout* layout = av_channel_layout_standard(&position)) {
      if (layout->order != AV_CHANNEL_ORDER_NATIVE || layout->u.mask > kMaxUint32) continue;
      list.emplace_back(Tarvek::FFmpeg::ChannelLayoutName(layout->u.mask),
                        static_cast<ChannelLayout>(layout->u.mask));
    }
    return list;
  }();
  return names;
}

ChannelLayout ParseChannelLayout(const std::string& option, const std::string& text) {
  // libavutil's reading, and its names in any case ("Stereo").
  std::string lower = text;
  std::transform(lower.begin(), lower.end(), lower.begin(),
                 [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
  for (const std::string& candidate : {text, lower}) {
    if (const auto layout = Tarvek::FFmpeg::ParseChannelLayout(candidate)) return *layout;
  }
  throw BadValue(option,
                 "a channel layout such as mono, stereo, 5.1 or 5.1(side) (FFmpeg's names), or a "
                 "non-zero speaker mask",
                 text);
}

AVPixelFormat ParsePixelFormat(const std::string& option, const std::string& text) {
  const AVPixelFormat format = av_get_pix_fmt(Lower(text).c_str());
  if (format != AV_PIX_FMT_NONE && text.find('\0') == std::string::npos) return format;
  throw BadValue(option, "a pixel format name such as yuv420p", text);
}

AVSampleFormat ParseSampleFormat(const std::string& option, const std::string& text) {
  const AVSampleFormat format = av_get_sample_fmt(Lower(text).c_str());
  if (format != AV_SAMPLE_FMT_NONE && text.find('\0') == std::string::npos) return format;
  throw BadValue(option, "a sample format name such as fltp or s16", text);
}

std::pair<std::string, std::string> ParseKeyValue(const std::string& option,
                                                  const std::string& text) {
  const std::size_t equals = text.find('=');
  if (equals != std::string::npos && equals > 0) {
    return {text.substr(0, equals), text.substr(equals + 1)};
  }
  throw BadValue(option, "KEY=VALUE", text);
}

std::string ParseChoice(const std::string& option, const std::string& text,
                        const std::vector<std::string>& accepted) {
  for (const std::string& choice : accepted) {
    if (EqualsIgnoringCase(choice, text)) return choice;
  }
  std::string names;
  for (std::size_t i = 0; i < accepted.size(); ++i) {
    names += (i == 0 ? "" : i + 1 == accepted.size() ? " or " : ", ") + accepted[i];
  }
  throw BadValue(option, names, text);
}

std::string CheckCodecId(const std::string& option, const std::string& text,
                         const std::vector<std::string>& known, const std::string& kind) {
  for (const std::string& id : known) {
    if (EqualsIgnoringCase(id, text)) return id;
  }
  const std::string article = kind.find_first_of("aeiou") == 0 ? "an " : "a ";
  throw BadValue(option, article + kind + " codec identifier (see 'formatdesc codecs')", text);
}

}  // namespace Formatdesc
