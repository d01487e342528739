#include "Validate.h"

#include <algorithm>
#include <boost/exception/get_error_info.hpp>
#include <cctype>
#include <cstdint>
#include <limits>

#include <Tarvek/Presets/BitratePresets.h>
#include "../Conf/Formats/BitrateCalculator.h"
#include "../Conf/Interfaces/AVUtilTypes.h"
#include "../Conf/Interfaces/IFormatCodecAudio.h"
#include "../Conf/Interfaces/IFormatCodecVideo.h"
#include "Diff.h"
#include "JsonForm.h"
#include "Settings.h"

namespace Tarvek {
namespace Conf {
namespace {

using Video = IFormatCodecVideo;
using Audio = IFormatCodecAudio;

// The settings under review, read without a getter, so that nothing the tree holds can throw.
class Review {
 public:
  Review(const Core::Property& tree, std::vector<Finding>& findings)
      : tree_(tree), findings_(findings) {}

  // The first child `key` of `parent` ("" for the root), as the getters find it; null when the
  // child or its container is missing, or the container is a leaf.
  const Core::Property* Find(const std::string& parent, const std::string& key) const {
    const Core::Property* container = &tree_;
    if (!parent.empty()) {
      const auto found = tree_.FindChild(parent);
      if (found == tree_.GetChildren().end()) return nullptr;
      container = &*found;
    }
    if (container->GetType() != PropertyTypeContainer) return nullptr;
    const auto found = container->FindChild(key);
    return found == container->GetChildren().end() ? nullptr : &*found;
  }

  // How many children named `key` the container `parent` ("" for the root) has.
  std::size_t Count(const std::string& parent, const std::string& key) const {
    const Core::Property* container = parent.empty() ? &tree_ : Find("", parent);
    if (container == nullptr || container->GetType() != PropertyTypeContainer) return 0;
    const auto& children = container->GetChildren();
    return static_cast<std::size_t>(
        std::count_if(children.begin(), children.end(),
                      [&](const Core::Property& child) { return child.GetName() == key; }));
  }

  // The root child `key` when it holds an int64, else null.
  const Core::Property* Integer(const std::string& key) const {
    const Core::Property* node = Find("", key);
    return node != nullptr && node->GetType() == PropertyTypeInt64 ? node : nullptr;
  }

  void Add(Severity severity, const std::string& setting, const std::string& message) {
    findings_.push_back({severity, setting, message});
  }

  bool HasError() const {
    return std::any_of(findings_.begin(), findings_.end(),
                       [](const Finding& f) { return f.severity == Severity::Error; });
  }

 private:
  const Core::Property& tree_;
  std::vector<Finding>& findings_;
};

std::string PathOf(const Setting& known) {
  return known.parent.empty() ? known.key : known.parent + "/" + known.key;
}

void CheckTypesAndRanges(Review& review, const std::vector<Setting>& keys) {
  for (const Setting& known : keys) {
    const Core::Property* node = review.Find(known.parent, known.key);
    if (node == nullptr) continue;
    const std::string path = PathOf(known);
    if (review.Count(known.parent, known.key) > 1) {
      review.Add(Severity::Error, path,
                 path + " is present " + std::to_string(review.Count(known.parent, known.key)) +
                     " times; the accessors read the first and the others are lost to them");
    }
    if (node->GetType() != known.type) {
      review.Add(Severity::Error, path,
                 path + " holds " + ValueText(*node) + ", but its accessors read " +
                     (known.type == PropertyTypeInt64 ? "an " : "a ") +
                     PropertyTypeName(known.type));
      continue;
    }
    if (known.range == ValueRange::Int64) continue;
    const long long value = node->GetInt64();
    const bool isUnsigned = known.range == ValueRange::Unsigned32;
    const long long low = isUnsigned ? 0 : std::numeric_limits<std::int32_t>::min();
    const long long high = isUnsigned ? std::numeric_limits<std::uint32_t>::max()
                                      : std::numeric_limits<std::int32_t>::max();
    if (value < low || value > high) {
      const long long read = isUnsigned ? static_cast<long long>(static_cast<std::uint32_t>(value))
                                        : static_cast<long long>(static_cast<std::int32_t>(value));
      review.Add(Severity::Error, path,
                 path + " holds " + std::to_string(value) + ", beyond the range " +
                     std::to_string(low) + " to " + std::to_string(high) +
                     " its accessor reads (it reads " + std::to_string(read) + ")");
    }
  }
}

void CheckPresent(Review& review, const std::vector<std::string>& keys, Severity severity,
                  const std::string& why) {
  for (const std::string& key : keys) {
    if (review.Find("", key) == nullptr) review.Add(severity, key, key + " is missing; " + why);
  }
}

// A setting that must not be 0, when it holds an int64 in range (else it was reported above).
void CheckNotZero(Review& review, const std::string& key, const std::string& sentence) {
  const Core::Property* node = review.Integer(key);
  if (node != nullptr && node->GetInt64() == 0) review.Add(Severity::Error, key, sentence);
}

std::string Lower(std::string text) {
  for (char& c : text) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return text;
}

bool Knows(const std::vector<std::string>& ids, const std::string& id) {
  return std::find(ids.begin(), ids.end(), Lower(id)) != ids.end();
}

void CheckCodecId(Review& review, bool video) {
  const Core::Property* node = review.Find("", IFormatCodec::TAG_CODEC_ID);
  if (node == nullptr || node->GetType() != PropertyTypeString) return;
  const std::string& id = node->GetString();
  const auto& own = video ? GetPresetVideoCodecs() : GetPresetAudioCodecs();
  const auto& other = video ? GetPresetAudioCodecs() : GetPresetVideoCodecs();
  if (Knows(own, id)) return;
  const std::string held = "codec_id holds " + ValueText(*node);
  review.Add(Severity::Error, IFormatCodec::TAG_CODEC_ID,
             Knows(other, id)
                 ? held + ", " + (video ? "an audio" : "a video") + " codec; " +
                       (video ? "a video" : "an audio") + " description needs one of its own kind"
                 : held + ", which is not " + (video ? "a video" : "an audio") +
                       " codec the presets know");
}

void CheckEnumeration(Review& review, const std::string& key, long long count,
                      const std::string& what) {
  const Core::Property* node = review.Integer(key);
  if (node == nullptr) return;
  const long long value = node->GetInt64();
  // A value beyond 32 bits is reported with the ranges.
  if (value < std::numeric_limits<std::int32_t>::min() ||
      value > std::numeric_limits<std::int32_t>::max()) {
    return;
  }
  if (value < 0 || value >= count) {
    review.Add(Severity::Error, key,
               key + " " + std::to_string(value) + " is not " + what + " libavutil knows");
  }
}

void CheckVideo(Review& review) {
  const std::string bitrates = "the bitrate functions need it";
  CheckPresent(review,
               {IFormatCodec::TAG_CODEC_ID, Video::TAG_WIDTH, Video::TAG_HEIGHT,
                Video::TAG_TIMEBASE_N, Video::TAG_TIMEBASE_D},
               Severity::Error, bitrates);
  // A stream read from a file states no bitrate mode: usable, the bitrates wait for one.
  CheckPresent(review, {IFormatCodec::TAG_BITRATE_MODE}, Severity::Warning, bitrates);
  const Core::Property* mode = review.Find("", IFormatCodec::TAG_BITRATE_MODE);
  if (mode != nullptr && mode->GetType() == PropertyTypeString &&
      mode->GetString() == IFormatCodec::TAG_BITRATE_MODE_VBR) {
    CheckPresent(review, {IFormatCodec::TAG_QUALITY}, Severity::Error, bitrates + " in vbr mode");
  }
  CheckPresent(review, {Video::TAG_ASPECTX, Video::TAG_ASPECTY}, Severity::Warning,
               "the frame aspect and the compatibility test need it");
  CheckCodecId(review, true);
  CheckNotZero(review, Video::TAG_WIDTH, "the width is 0");
  CheckNotZero(review, Video::TAG_HEIGHT, "the height is 0");
  CheckNotZero(review, Video::TAG_ASPECTX, "the pixel aspect X (sample_aspect_num) is 0");
  CheckNotZero(review, Video::TAG_ASPECTY, "the pixel aspect Y (sample_aspect_den) is 0");
  CheckNotZero(review, Video::TAG_TIMEBASE_D,
               "the frame-rate denominator is 0, which leaves the frame rate unknown");
  CheckEnumeration(review, Video::TAG_PIX_FMT, AV_PIX_FMT_NB, "a pixel format");
}

void CheckAudio(Review& review) {
  CheckPresent(review,
               {IFormatCodec::TAG_CODEC_ID, Audio::TAG_SAMPLE_RATE, Audio::TAG_LAYOUT,
                Audio::TAG_SAMPLE_FORMAT},
               Severity::Error, "the bitrate functions need it");
  CheckCodecId(review, false);
  CheckNotZero(review, Audio::TAG_LAYOUT, "the channel layout is 0: it names no speaker");
  CheckEnumeration(review, Audio::TAG_SAMPLE_FORMAT, AV_SAMPLE_FMT_NB, "a sample format");
}

// Asked only when no error was found, so that every setting the look-ups read is there and of
// its type: what they still refuse, the presets refuse, and say why.
void CheckBitrate(Review& review, const boost::intrusive_ptr<const IFormatCodec>& codec,
                  bool video) {
  if (review.HasError() || (video && review.Find("", IFormatCodec::TAG_BITRATE_MODE) == nullptr)) {
    return;
  }
  long long minimum = 0;
  long long maximum = 0;
  try {
    minimum = video ? GetMinVideoBitrate(codec) : GetMinAudioBitrate(codec);
    maximum = video ? GetMaxVideoBitrate(codec) : GetMaxAudioBitrate(codec);
  } catch (const Tarvek::Exception& e) {
    const std::string* what = boost::get_error_info<DescriptionInfo>(e);
    review.Add(Severity::Error, "",
               "the presets refuse this description: " +
                   (what != nullptr ? *what : std::string("no reason given")));
    return;
  }
  const Core::Property* node = review.Integer(IFormatCodec::TAG_BITRATE);
  if (node == nullptr) return;
  const long long bitrate = node->GetInt64();
  if (bitrate < minimum || bitrate > maximum) {
    review.Add(
        Severity::Warning, IFormatCodec::TAG_BITRATE,
        "bit_rate " + std::to_string(bitrate) + " b/s is " +
            (bitrate < minimum ? "below the presets' minimum of " + std::to_string(minimum)
                               : "above the presets' maximum of " + std::to_string(maximum)) +
            " b/s for this description");
  }
}

}  // namespace

const char* SeverityName(Severity severity) noexcept {
  return severity == Severity::Error ? "error" : "warning";
}

std::vector<Finding> Validate(const boost::intrusive_ptr<const IFormat>& description) {
  std::vector<Finding> findings;
  if (!description) {
    findings.push_back({Severity::Error, "", "there is no description (a null pointer)"});
    return findings;
  }
  const std::optional<FormatKind> kind = KindOf(description.get());
  Review review(description->GetProperty(), findings);
  if (!kind) {
    // Only the metadata child is known of a description that is no codec.
    CheckTypesAndRanges(review, {SettingsOf(FormatKind::Codec).front()});
    return findings;
  }
  CheckTypesAndRanges(review, SettingsOf(*kind));
  if (kind == FormatKind::Video || kind == FormatKind::Audio) {
    const bool video = kind == FormatKind::Video;
    if (video) {
      CheckVideo(review);
    } else {
      CheckAudio(review);
    }
    const boost::intrusive_ptr<const IFormatCodec> codec(
        dynamic_cast<const IFormatCodec*>(description.get()));
    CheckBitrate(review, codec, video);
  }
  return findings;
}

}  // namespace Conf
}  // namespace Tarvek
