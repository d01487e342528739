// formatdesc's readers of option values: sizes, ratios, rates, counts, four-character codes,
// channel layouts and libavutil format names. Each takes the option's name (for the message) and
// the text given, returns the value, and throws UsageError when the text is not one.
#ifndef TARVEK_TOOLS_FORMATDESC_OPTIONS_H_
#define TARVEK_TOOLS_FORMATDESC_OPTIONS_H_

#include <Tarvek/Formats.h>

#include <cstdint>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace Formatdesc {

/// Bad input on the command line; what() is the one-line message without the program name,
/// such as "--size: expected WIDTHxHEIGHT with positive integers, got '19x'".
class UsageError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Builds the UsageError for `option` given `text`, where `expected` says what it takes.
UsageError BadValue(const std::string& option, const std::string& expected,
                    const std::string& text);

/// Two positive 32-bit numbers: a frame size, a ratio or a frame rate.
struct Pair {
  unsigned int first = 0;
  unsigned int second = 0;
};

/// "WIDTHxHEIGHT", both positive.
Pair ParseSize(const std::string& option, const std::string& text);
/// "W:H", both positive (an aspect ratio).
Pair ParseRatio(const std::string& option, const std::string& text);
/// A positive frame rate as NUM/DEN ("30000/1001"), an integer ("25") or a decimal ("12.5").
/// Decimals written as the rounding of N*1000/1001 to two or more places ("29.97", "23.976",
/// "59.94") give that fraction, as those rates are meant; other decimals are reduced exactly.
Pair ParseFrameRate(const std::string& option, const std::string& text);

/// A decimal integer from 1 to `max`.
long long ParsePositive(const std::string& option, const std::string& text, long long max);
/// A decimal integer from 0 to `max`.
long long ParseNonNegative(const std::string& option, const std::string& text, long long max);
/// A positive bitrate in bits per second, with an optional k or K (1000), M (10^6) or G (10^9)
/// suffix that may follow a decimal: "4500000", "4500k", "4.5M", "1G". Rounded to whole bits per
/// second.
long long ParseBitrate(const std::string& option, const std::string& text);
/// A codec tag: four characters ("avc1") packed as FFmpeg does, first character in the lowest
/// byte, or a 32-bit number in decimal or 0x hexadecimal.
long long ParseCodecTag(const std::string& option, const std::string& text);

/// A channel layout as libavutil reads it: FFmpeg's names in any case ("5.1(side)", "Stereo"),
/// speaker lists ("FL+FR+LFE") and non-zero 32-bit speaker masks ("0x3f", "4").
Tarvek::Conf::ChannelLayout ParseChannelLayout(const std::string& option, const std::string& text);
/// libavutil's standard layouts that fit the 32-bit mask, by their FFmpeg names, in its order.
const std::vector<std::pair<std::string, Tarvek::Conf::ChannelLayout>>& ChannelLayoutNames();

/// A pixel format by libavutil's name ("yuv420p"), in any letter case.
AVPixelFormat ParsePixelFormat(const std::string& option, const std::string& text);
/// A sample format by libavutil's name ("fltp", "s16"), in any letter case.
AVSampleFormat ParseSampleFormat(const std::string& option, const std::string& text);

/// "KEY=VALUE" with a non-empty key; the value may be empty or hold further '=' signs.
std::pair<std::string, std::string> ParseKeyValue(const std::string& option,
                                                  const std::string& text);

/// The one of `accepted` that `text` names in any letter case, in its canonical form; otherwise a
/// UsageError naming the accepted values.
std::string ParseChoice(const std::string& option, const std::string& text,
                        const std::vector<std::string>& accepted);

/// `text` when it is one of `known` (compared without regard to ASCII case, as the presets do);
/// otherwise a UsageError saying that a `kind` codec identifier was expected.
std::string CheckCodecId(const std::string& option, const std::string& text,
                         const std::vector<std::string>& known, const std::string& kind);

}  // namespace Formatdesc

#endif  // TARVEK_TOOLS_FORMATDESC_OPTIONS_H_
