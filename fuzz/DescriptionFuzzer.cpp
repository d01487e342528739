// A libFuzzer target that reads its input as a program of calls on a small set of format
// descriptions of every kind, blobs and a scratch property tree, and checks after every step that
// nothing is corrupted.
//
// Each step is one byte naming an operation, followed by its arguments (slot numbers, integers,
// texts, whole trees), all read from the input; reading past the end yields zeros. Exceptions that
// the library documents for a call are caught by their type and checked against what the trees
// say; any other exception escapes and aborts, as does a broken invariant. After every step:
//   - every description has a container root with the metadata child and its object name;
//   - the reference count of every description and blob equals the references the program holds
//     (its slots and the descriptions' private data), so no temporary kept one;
//   - the live harness blobs are exactly those still referenced.
// Inside the steps: what a Set wrote reads back and the rest of the tree is unchanged, a refused
// call changes nothing, a clone compares equal to its source, every getter agrees with the tree.
// Leaks at exit are the leak sanitizer's to report.
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <map>
#include <numeric>
#include <sstream>
#include <string>
#include <vector>

#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Settings.h>
#include <Tarvek/Presets/BitratePresets.h>
#include <boost/exception/get_error_info.hpp>

#include "Support/CountingBlob.h"

namespace {

namespace Conf = Tarvek::Conf;
namespace Core = Tarvek::Core;
using Codec = Conf::IFormatCodec;
using CodecPtr = boost::intrusive_ptr<Codec>;
using ConstCodecPtr = boost::intrusive_ptr<const Codec>;
using Core::Property;
using Tarvek::IBlob;

constexpr std::size_t kCodecSlots = 6;
constexpr std::size_t kBlobSlots = 3;
// Bounds the trees: nesting a description's tree into itself doubles it, and a program of a few
// thousand bytes must stay fast.
constexpr std::size_t kMaxNodes = 256;
constexpr int kMaxBuildDepth = 4;

[[noreturn]] void Fail(const char* what) {
  std::fprintf(stderr, "broken invariant: %s\n", what);
  std::fflush(stderr);
  std::abort();
}

void Require(bool ok, const char* what) {
  if (!ok) Fail(what);
}

// ---- Reading the program ----

const std::vector<std::string>& Words() {
  static const std::vector<std::string> words = [] {
    std::vector<std::string> list = {Conf::IFormat::TAG_METADATA,
                                     Conf::IFormatCodec::TAG_NAME,
                                     Conf::IFormatCodec::TAG_CODEC_ID,
                                     Conf::IFormatCodec::TAG_FOURCC,
                                     Conf::IFormatCodec::TAG_BITRATE_MODE,
                                     Conf::IFormatCodec::TAG_BITRATE_MODE_VBR,
                                     Conf::IFormatCodec::TAG_BITRATE,
                                     Conf::IFormatCodec::TAG_QUALITY,
                                     Conf::IFormatCodec::TAG_LOSSLESS,
                                     Conf::IFormatCodec::TAG_THREAD_NUMBER,
                                     Conf::IFormatCodec::TAG_TWO_PASS_ENCODING,
                                     Conf::IFormatCodec::TAG_GLOBAL_HEADER,
                                     Conf::IFormatCodec::TAG_MAIN_STREAM,
                                     Conf::IFormatCodec::TAG_CODEC_OPTIONS_ENCODE,
                                     Conf::IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE,
                                     Conf::IFormatCodec::TAG_LANGUAGE,
                                     Conf::IFormatCodecVideo::TAG_WIDTH,
                                     Conf::IFormatCodecVideo::TAG_HEIGHT,
                                     Conf::IFormatCodecVideo::TAG_ASPECTX,
                                     Conf::IFormatCodecVideo::TAG_ASPECTY,
                                     Conf::IFormatCodecVideo::TAG_TIMEBASE_N,
                                     Conf::IFormatCodecVideo::TAG_TIMEBASE_D,
                                     Conf::IFormatCodecVideo::TAG_PIX_FMT,
                                     Conf::IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO,
                                     Conf::IFormatCodecAudio::TAG_SAMPLE_RATE,
                                     Conf::IFormatCodecAudio::TAG_LAYOUT,
                                     Conf::IFormatCodecAudio::TAG_FRAME_SIZE,
                                     Conf::IFormatCodecAudio::TAG_SAMPLE_FORMAT,
                                     Conf::IFormatCodecAudio::TAG_FORMAT_CODEC_AUDIO,
                                     Conf::IFormatCodecSubtitle::TAG_SUBTITLE_AUTHOR,
                                     Conf::IFormatCodecSubtitle::TAG_SUBTITLE_HEADER,
                                     Conf::IFormatCodecSubtitle::TAG_DVB_WIDTH,
                                     Conf::IFormatCodecSubtitle::TAG_DVB_HEIGHT,
                                     Conf::IFormatCodecSubtitle::TAG_FORMAT_CODEC_SUBTITLE,
                                     Conf::IFormatFile::TAG_TITLE,
                                     Conf::TAG_OBJECT,
                                     "",
                                     "VBR",
                                     "a.b",
                                     "..",
                                     "object_name.x",
                                     std::string("nul\0byte", 8),
                                     "\xff\xfe\xc3",
                                     "\xc3\xa9t\xc3\xa9",
                                     "eng",
                                     "Unknown codec"};
    for (const auto& id : Conf::GetPresetVideoCodecs()) list.push_back(id);
    for (const auto& id : Conf::GetPresetAudioCodecs()) list.push_back(id);
    list.push_back("H264");
    list.push_back("nosuchcodec");
    return list;
  }();
  return words;
}

// clang-format off
constexpr long long kInteresting[] = {
    0, 1, -1, 2, 9, 16, 23, 25,                                       // small
    720, 576, 1080, 1920, 44100, 48000, 0x3, 0x3f, 65536, 65537,      // sizes, rates, masks
    0x7fffffff, -0x7fffffff - 1, 0x80000000LL, 0xffffffffLL, 0x100000000LL,  // 32-bit edges
    0x7fffffffffffffffLL, -0x7fffffffffffffffLL - 1};                 // 64-bit edges
// clang-format on

class Program {
 public:
  Program(const std::uint8_t* data, std::size_t size) : data_(data), size_(size) {}

  bool Done() const { return position_ >= size_; }

  std::uint8_t Byte() { return position_ < size_ ? data_[position_++] : 0; }
  bool Flag() { return (Byte() & 1) != 0; }
  std::size_t Below(std::size_t count) { return Byte() % count; }

  // Extremes and common values from a table, or 1, 4 or 8 raw bytes.
  long long Integer() {
    const std::uint8_t form = Byte();
    switch (form % 4) {
      case 0:
        return kInteresting[(form / 4) % (sizeof kInteresting / sizeof kInteresting[0])];
      case 1:
        return static_cast<std::int8_t>(Byte());
      case 2:
        return static_cast<std::int32_t>(static_cast<std::uint32_t>(Raw(4)));
      default:
        return static_cast<long long>(Raw(8));
    }
  }

  // A key or codec text from the table, or up to 63 raw bytes (NULs, invalid UTF-8 and all).
  std::string Text() {
    const std::uint8_t form = Byte();
    if (form < 0x80) return Words()[form % Words().size()];
    const std::size_t length = std::min<std::size_t>(form & 0x3f, size_ - position_);
    std::string text(reinterpret_cast<const char*>(data_ + position_), length);
    position_ += length;
    return text;
  }

 private:
  std::uint64_t Raw(int bytes) {
    std::uint64_t value = 0;
    for (int i = 0; i < bytes; ++i) value |= std::uint64_t{Byte()} << (8 * i);
    return value;
  }

  const std::uint8_t* data_;
  std::size_t size_;
  std::size_t position_ = 0;
};

// ---- Trees ----

std::size_t Nodes(const Property& node) {
  std::size_t count = 1;
  for (const Property& child : node.GetChildren()) count += Nodes(child);
  return count;
}

// The first child named `key`, or null (always null under a leaf).
const Property* Find(const Property& container, const std::string& key) {
  const auto it = container.FindChild(key);
  return it == container.GetChildren().end() ? nullptr : &*it;
}

// What SetChildT promises: the first child named `key` takes `value`'s type, value and children,
// or a child is appended when there is none. Builds expected trees.
void SetOrAppend(Property& container, const std::string& key, const Property& value) {
  const auto it = container.FindChild(key);
  if (it != container.GetChildren().end()) {
    *it = value;
  } else {
    container.CreateChildT<bool>(key, false) = value;
  }
}

// A tree of the program's choosing: leaves of every type, containers, duplicate and missing
// keys, a leaf in place of metadata or options.
Property BuildTree(Program& program, int depth, std::size_t& budget) {
  Property node(program.Text());
  --budget;
  switch (program.Below(8)) {
    case 0:
      node = program.Flag();
      return node;
    case 1:
      node = program.Integer();
      return node;
    case 2:
      node = program.Text();
      return node;
    default:
      break;
  }
  const std::size_t children = depth < kMaxBuildDepth ? program.Below(6) : 0;
  for (std::size_t i = 0; i < children && budget > 0; ++i) {
    // Appending through CreateChildT keeps duplicate names, which SetChild would merge.
    node.CreateChildT<bool>(program.Text(), false) = BuildTree(program, depth + 1, budget);
  }
  return node;
}

// ---- Descriptions ----

enum Kind { kGeneric, kVideo, kAudio, kSubtitle, kAnyKind };

Kind KindOf(const Codec& codec) {
  if (dynamic_cast<const Conf::IFormatCodecVideo*>(&codec) != nullptr) return kVideo;
  if (dynamic_cast<const Conf::IFormatCodecAudio*>(&codec) != nullptr) return kAudio;
  if (dynamic_cast<const Conf::IFormatCodecSubtitle*>(&codec) != nullptr) return kSubtitle;
  return kGeneric;
}

CodecPtr Create(Kind kind) {
  switch (kind) {
    case kVideo:
      return Conf::FormatCodecVideo::Create();
    case kAudio:
      return Conf::FormatCodecAudio::Create();
    case kSubtitle:
      return Conf::FormatCodecSubtitle::Create();
    default:
      return Conf::FormatCodec::Create();
  }
}

const std::string& ObjectName(Kind kind) {
  static const std::string generic;
  switch (kind) {
    case kVideo:
      return Conf::IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO;
    case kAudio:
      return Conf::IFormatCodecAudio::TAG_FORMAT_CODEC_AUDIO;
    case kSubtitle:
      return Conf::IFormatCodecSubtitle::TAG_FORMAT_CODEC_SUBTITLE;
    default:
      return generic;
  }
}

template <class I>
const I& As(const Codec& codec) {
  return dynamic_cast<const I&>(codec);
}
template <class I>
I& As(Codec& codec) {
  return dynamic_cast<I&>(codec);
}

// ---- The settings, as tables: key, kind, storage and the three accessors ----

// How an integer setting is stored and read: 64 bits as they are, or 32 bits sign- or
// zero-extended (the getter returns the low 32 bits), as the inspection library's table of
// settings says; the getters are checked against it.
using Storage = Conf::ValueRange;

Storage StorageOf(Kind kind, const std::string& key) {
  const Conf::FormatKind of = kind == kVideo      ? Conf::FormatKind::Video
                              : kind == kAudio    ? Conf::FormatKind::Audio
                              : kind == kSubtitle ? Conf::FormatKind::Subtitle
                                                  : Conf::FormatKind::Codec;
  for (const Conf::Setting& setting : Conf::SettingsOf(of)) {
    if (setting.key == key) return setting.range;
  }
  return Storage::Int64;
}

long long Narrow(Storage storage, long long value) {
  switch (storage) {
    case Storage::Signed32:
      return static_cast<std::int32_t>(value);
    case Storage::Unsigned32:
      return static_cast<long long>(static_cast<std::uint32_t>(value));
    default:
      return value;
  }
}

struct IntegerSetting {
  const std::string* key;
  Kind kind;
  Storage storage;
  bool (*exists)(const Codec&);
  long long (*get)(const Codec&);
  void (*set)(Codec&, long long);
};

struct TextSetting {
  const std::string* key;
  Kind kind;
  bool inMetadata;  // the audio language lives in the metadata child and reads as "" when absent
  bool (*exists)(const Codec&);
  std::string (*get)(const Codec&);
  void (*set)(Codec&, const std::string&);
};

struct FlagSetting {
  const std::string* key;
  bool (*exists)(const Codec&);
  bool (*get)(const Codec&);
  void (*set)(Codec&, bool);
};

// One line a setting in the tables below, instead of three lambdas each.
#define TARVEK_INTEGER(Class, kind, Key, Name, Type)                                     \
  IntegerSetting {                                                                       \
    &Class::Key, kind, StorageOf(kind, Class::Key),                                      \
        [](const Codec& c) { return As<Class>(c).Exists##Name(); },                      \
        [](const Codec& c) { return static_cast<long long>(As<Class>(c).Get##Name()); }, \
        [](Codec& c, long long v) { As<Class>(c).Set##Name(static_cast<Type>(v)); }      \
  }

#define TARVEK_TEXT(Class, kind, key, inMetadata, Name)                                \
  TextSetting {                                                                        \
    key, kind, inMetadata, [](const Codec& c) { return As<Class>(c).Exists##Name(); }, \
        [](const Codec& c) { return As<Class>(c).Get##Name(); },                       \
        [](Codec& c, const std::string& v) { As<Class>(c).Set##Name(v); }              \
  }

#define TARVEK_FLAG(Key, Name)                                                                 \
  FlagSetting {                                                                                \
    &Codec::Key, [](const Codec& c) { return c.Exists##Name(); },                              \
        [](const Codec& c) { return c.Get##Name(); }, [](Codec& c, bool v) { c.Set##Name(v); } \
  }

const std::vector<IntegerSetting>& IntegerSettings() {
  // The class, not the interface: width, height and pixel aspect have no Set on the interface.
  using Video = Conf::FormatCodecVideo;
  using Audio = Conf::IFormatCodecAudio;
  using Subtitle = Conf::IFormatCodecSubtitle;
  static const std::vector<IntegerSetting> settings = {
      TARVEK_INTEGER(Codec, kAnyKind, TAG_FOURCC, CodecTag, long long),
      TARVEK_INTEGER(Codec, kAnyKind, TAG_BITRATE, Bitrate, long long),
      TARVEK_INTEGER(Codec, kAnyKind, TAG_QUALITY, Quality, long long),
      TARVEK_INTEGER(Codec, kAnyKind, TAG_THREAD_NUMBER, ThreadNumber, unsigned),
      TARVEK_INTEGER(Video, kVideo, TAG_WIDTH, Width, unsigned),
      TARVEK_INTEGER(Video, kVideo, TAG_HEIGHT, Height, unsigned),
      TARVEK_INTEGER(Video, kVideo, TAG_ASPECTX, PixelAspectX, unsigned),
      TARVEK_INTEGER(Video, kVideo, TAG_ASPECTY, PixelAspectY, unsigned),
      TARVEK_INTEGER(Video, kVideo, TAG_TIMEBASE_N, FrameRateNum, unsigned),
      TARVEK_INTEGER(Video, kVideo, TAG_TIMEBASE_D, FrameRateDen, unsigned),
      TARVEK_INTEGER(Video, kVideo, TAG_PIX_FMT, PixelFormat, AVPixelFormat),
      TARVEK_INTEGER(Audio, kAudio, TAG_SAMPLE_RATE, SampleRate, int),
      TARVEK_INTEGER(Audio, kAudio, TAG_LAYOUT, ChannelLayout, Conf::ChannelLayout),
      TARVEK_INTEGER(Audio, kAudio, TAG_FRAME_SIZE, FrameSize, int),
      TARVEK_INTEGER(Audio, kAudio, TAG_SAMPLE_FORMAT, SampleFormat, AVSampleFormat),
      TARVEK_INTEGER(Subtitle, kSubtitle, TAG_DVB_WIDTH, DVBWidth, unsigned),
      TARVEK_INTEGER(Subtitle, kSubtitle, TAG_DVB_HEIGHT, DVBHeight, unsigned),
  };
  return settings;
}

const std::vector<TextSetting>& TextSettings() {
  using Audio = Conf::IFormatCodecAudio;
  using Subtitle = Conf::IFormatCodecSubtitle;
  static const std::vector<TextSetting> settings = {
      TARVEK_TEXT(Codec, kAnyKind, &Codec::TAG_NAME, false, CodecName),
      TARVEK_TEXT(Codec, kAnyKind, &Codec::TAG_CODEC_ID, false, CodecID),
      TARVEK_TEXT(Codec, kAnyKind, &Codec::TAG_BITRATE_MODE, false, BitrateMode),
      TARVEK_TEXT(Audio, kAudio, &Codec::TAG_LANGUAGE, true, Language),
      TARVEK_TEXT(Subtitle, kSubtitle, &Codec::TAG_LANGUAGE, false, Language),
      TARVEK_TEXT(Subtitle, kSubtitle, &Conf::IFormatFile::TAG_TITLE, false, Title),
      TARVEK_TEXT(Subtitle, kSubtitle, &Subtitle::TAG_SUBTITLE_AUTHOR, false, Author),
      TARVEK_TEXT(Subtitle, kSubtitle, &Subtitle::TAG_SUBTITLE_HEADER, false, SubtitleHeader),
  };
  return settings;
}

const std::vector<FlagSetting>& FlagSettings() {
  static const std::vector<FlagSetting> settings = {
      TARVEK_FLAG(TAG_LOSSLESS, Lossless),
      TARVEK_FLAG(TAG_TWO_PASS_ENCODING, TwoPassEncoding),
      TARVEK_FLAG(TAG_GLOBAL_HEADER, GlobalHeader),
      TARVEK_FLAG(TAG_MAIN_STREAM, MainStream),
  };
  return settings;
}

#undef TARVEK_INTEGER
#undef TARVEK_TEXT
#undef TARVEK_FLAG

template <class Setting>
bool Applies(const Setting& setting, Kind kind) {
  return setting.kind == kAnyKind || setting.kind == kind;
}

// ---- Reads checked against the tree ----

enum class Outcome { kValue, kMissing, kWrongType };

Outcome Expect(const Property* child, Tarvek::PropertyTypes type) {
  if (child == nullptr) return Outcome::kMissing;
  return child->GetType() == type ? Outcome::kValue : Outcome::kWrongType;
}

// Runs `read` and checks that it fails exactly as `expected` says; true when it gave a value.
template <class Read>
bool ReadsAs(Outcome expected, Read&& read) {
  try {
    read();
  } catch (const Core::ChildNotFound&) {
    Require(expected == Outcome::kMissing, "a getter threw ChildNotFound for a present setting");
    return false;
  } catch (const Core::WrongPropertyType&) {
    Require(expected == Outcome::kWrongType, "a getter threw WrongPropertyType wrongly");
    return false;
  }
  Require(expected == Outcome::kValue, "a getter of a missing or mistyped setting returned");
  return true;
}

// The value of integer setting `key` as a 32-bit unsigned getter reads it, with its outcome.
Outcome ReadUnsigned(const Property& root, const std::string& key, std::uint64_t& value) {
  const Property* child = Find(root, key);
  const Outcome outcome = Expect(child, Tarvek::PropertyTypeInt64);
  value = outcome == Outcome::kValue ? static_cast<std::uint32_t>(child->GetInt64()) : 0;
  return outcome;
}

// (a x b) : (c x d) in lowest terms, each term cut to 32 bits: what the frame aspect and
// InitByFrameAspect compute.
void ReducedProducts(std::uint64_t a, std::uint64_t b, std::uint64_t c, std::uint64_t d,
                     std::uint64_t& x, std::uint64_t& y) {
  x = a * b;
  y = c * d;
  const std::uint64_t divisor = std::gcd(x, y);
  if (divisor > 1) {
    x /= divisor;
    y /= divisor;
  }
  x = static_cast<std::uint32_t>(x);
  y = static_cast<std::uint32_t>(y);
}

bool SameDouble(double a, double b) { return a == b || (std::isnan(a) && std::isnan(b)); }

void CheckVideoDerived(const Conf::IFormatCodecVideo& video) {
  const Property& root = video.GetProperty();
  // The frame aspect reads pixel aspect X, width, pixel aspect Y, height: the first that fails
  // is the one reported.
  std::uint64_t geometry[4] = {};
  const std::string* keys[4] = {
      &Conf::IFormatCodecVideo::TAG_ASPECTX, &Conf::IFormatCodecVideo::TAG_WIDTH,
      &Conf::IFormatCodecVideo::TAG_ASPECTY, &Conf::IFormatCodecVideo::TAG_HEIGHT};
  Outcome aspect = Outcome::kValue;
  for (int i = 0; i < 4 && aspect == Outcome::kValue; ++i) {
    aspect = ReadUnsigned(root, *keys[i], geometry[i]);
  }
  std::uint64_t x = 0;
  std::uint64_t y = 0;
  if (aspect == Outcome::kValue) {
    ReducedProducts(geometry[1], geometry[0], geometry[3], geometry[2], x, y);
  }
  unsigned got = 0;
  if (ReadsAs(aspect, [&] { got = video.GetFrameAspectX(); })) {
    Require(got == x, "GetFrameAspectX is not the reduced product");
  }
  if (ReadsAs(aspect, [&] { got = video.GetFrameAspectY(); })) {
    Require(got == y, "GetFrameAspectY is not the reduced product");
  }
  double ratio = 0.0;
  if (ReadsAs(aspect, [&] { ratio = video.GetFrameAspect(); })) {
    Require(SameDouble(ratio, static_cast<double>(x) / static_cast<double>(y)),
            "GetFrameAspect is not X / Y");
  }

  // The frame rate reads the denominator, and the numerator only when that is not 0.
  std::uint64_t den = 0;
  std::uint64_t num = 0;
  Outcome rate = ReadUnsigned(root, Conf::IFormatCodecVideo::TAG_TIMEBASE_D, den);
  if (rate == Outcome::kValue && den != 0) {
    rate = ReadUnsigned(root, Conf::IFormatCodecVideo::TAG_TIMEBASE_N, num);
  }
  if (ReadsAs(rate, [&] { ratio = video.GetFrameRate(); })) {
    const double expected = den == 0 ? 0.0 : static_cast<double>(num) / static_cast<double>(den);
    Require(SameDouble(ratio, expected), "GetFrameRate is not Num / Den");
  }
}

void CheckInteger(const Codec& codec, const IntegerSetting& setting) {
  const Property* child = Find(codec.GetProperty(), *setting.key);
  Require(setting.exists(codec) == (child != nullptr), "Exists disagrees with the tree");
  long long got = 0;
  if (ReadsAs(Expect(child, Tarvek::PropertyTypeInt64), [&] { got = setting.get(codec); })) {
    Require(got == Narrow(setting.storage, child->GetInt64()), "an integer getter misread");
  }
}

void CheckText(const Codec& codec, const TextSetting& setting) {
  const Property& root = codec.GetProperty();
  const Property* container = setting.inMetadata ? Find(root, Conf::IFormat::TAG_METADATA) : &root;
  const Property* child = container == nullptr ? nullptr : Find(*container, *setting.key);
  Require(setting.exists(codec) == (child != nullptr), "Exists disagrees with the tree");
  Outcome outcome = Expect(child, Tarvek::PropertyTypeString);
  if (setting.inMetadata && outcome == Outcome::kMissing) outcome = Outcome::kValue;
  std::string got;
  if (ReadsAs(outcome, [&] { got = setting.get(codec); })) {
    Require(got == (child == nullptr ? std::string() : child->GetString()),
            "a text getter misread");
  }
}

void CheckFlag(const Codec& codec, const FlagSetting& setting) {
  const Property* child = Find(codec.GetProperty(), *setting.key);
  Require(setting.exists(codec) == (child != nullptr), "Exists disagrees with the tree");
  bool got = false;
  if (ReadsAs(Expect(child, Tarvek::PropertyTypeBool), [&] { got = setting.get(codec); })) {
    Require(got == child->GetBool(), "a flag getter misread");
  }
}

void CheckOptions(const Codec& codec, bool encode) {
  const Property* child = Find(codec.GetProperty(), encode ? Codec::TAG_CODEC_OPTIONS_ENCODE
                                                           : Codec::TAG_CODEC_OPTIONS_ANALYZE);
  Require(
      (encode ? codec.ExistsOptionsEncode() : codec.ExistsOptionsAnalyze()) == (child != nullptr),
      "ExistsOptions disagrees with the tree");
  const Property* got = nullptr;
  if (ReadsAs(child == nullptr ? Outcome::kMissing : Outcome::kValue,
              [&] { got = encode ? &codec.GetOptionsEncode() : &codec.GetOptionsAnalyze(); })) {
    Require(got == child, "GetOptions is not the options child");
  }
}

// Getters and Exists of `codec` against its tree: the one `selector` names, or all of them for
// the last selector. (Every missing setting costs an error with its call stack, so a step that
// reads everything is slow.)
void CheckReads(const Codec& codec, std::size_t selector) {
  const Kind kind = KindOf(codec);
  const auto& integers = IntegerSettings();
  const auto& texts = TextSettings();
  const auto& flags = FlagSettings();
  const std::size_t count = integers.size() + texts.size() + flags.size() + 3;
  selector %= count + 1;
  const bool all = selector == count;
  std::size_t index = 0;
  const auto chosen = [&] { return all || index++ == selector; };
  for (const IntegerSetting& setting : integers) {
    if (chosen() && Applies(setting, kind)) CheckInteger(codec, setting);
  }
  for (const TextSetting& setting : texts) {
    if (chosen() && Applies(setting, kind)) CheckText(codec, setting);
  }
  for (const FlagSetting& setting : flags) {
    if (chosen()) CheckFlag(codec, setting);
  }
  if (chosen()) CheckOptions(codec, true);
  if (chosen()) CheckOptions(codec, false);
  if (chosen() && kind == kVideo) CheckVideoDerived(As<Conf::IFormatCodecVideo>(codec));
}

// ---- Writes checked against the tree ----

// Runs `set`, which writes `value` under `key` of the root or of the metadata child, and checks
// that exactly that changed, or that a refusal (only for a leaf container) changed nothing.
template <class Set>
bool CheckedSet(Codec& codec, bool inMetadata, const Property& value, Set&& set) {
  const Property before(codec.GetProperty());
  Property expected(before);
  Property* container = &expected;
  if (inMetadata) container = &*expected.FindChild(Conf::IFormat::TAG_METADATA);
  const bool writable = container->GetType() == Tarvek::PropertyTypeContainer;
  if (writable) SetOrAppend(*container, value.GetName(), value);
  try {
    set();
  } catch (const Core::MethodIsNotApplicable&) {
    Require(!writable, "a Set into a container was refused");
    Require(codec.GetProperty() == before, "a refused Set changed the description");
    return false;
  }
  Require(writable, "a Set into a leaf succeeded");
  Require(codec.GetProperty() == expected, "a Set changed more than its own setting");
  return true;
}

// ---- The program's state ----

using TarvekTest::CountingBlob;  // counts live instances: a blob freed twice or never shows

struct State {
  CodecPtr codecs[kCodecSlots];
  boost::intrusive_ptr<IBlob> blobs[kBlobSlots];
  // The blob each live description holds as private data, as the program set it.
  std::map<const Codec*, const IBlob*> privateData;
  Property scratch{"scratch"};
};

CodecPtr& PickCodec(State& state, Program& program) {
  return state.codecs[program.Below(kCodecSlots)];
}

void CheckState(State& state) {
  // Forget the private data of descriptions no slot holds any more: they are gone.
  for (auto it = state.privateData.begin(); it != state.privateData.end();) {
    bool held = false;
    for (const CodecPtr& codec : state.codecs) held = held || codec.get() == it->first;
    it = held ? std::next(it) : state.privateData.erase(it);
  }
  std::map<const Tarvek::IRefCountable*, int> expected;
  for (const CodecPtr& codec : state.codecs) {
    Require(codec != nullptr, "a slot lost its description");
    ++expected[codec.get()];
  }
  for (const auto& blob : state.blobs) {
    if (blob) ++expected[blob.get()];
  }
  for (const auto& [codec, blob] : state.privateData) {
    if (blob != nullptr) ++expected[blob];
  }
  int countingBlobs = 0;
  for (const auto& [object, count] : expected) {
    countingBlobs += dynamic_cast<const CountingBlob*>(object) != nullptr ? 1 : 0;
  }
  Require(CountingBlob::Live() == countingBlobs, "a blob was freed early or leaked");

  for (const CodecPtr& codec : state.codecs) {
    const Kind kind = KindOf(*codec);
    const Property& root = codec->GetProperty();
    Require(root.GetType() == Tarvek::PropertyTypeContainer, "the root is not a container");
    Require(root.GetName() == ObjectName(kind), "the root lost the object name");
    const Property* metadata = Find(root, Conf::IFormat::TAG_METADATA);
    Require(metadata != nullptr, "the metadata child is missing");
    Require(&codec->GetMetadata() == metadata, "GetMetadata is not the metadata child");
    static constexpr int kTypes[] = {-1, 0, 1, 3};
    Require(codec->GetCodecType() == kTypes[kind], "the codec type does not match the kind");
    const auto model = state.privateData.find(codec.get());
    const IBlob* held = model == state.privateData.end() ? nullptr : model->second;
    Require(codec->GetPrivateData().get() == held, "the private data is not what was set");
  }
  for (const auto& [object, count] : expected) {
    Require(object->GetRefCount() == count, "a reference count is off");
  }
}

// ---- Operations ----

// A tree to hand to SetProperty, SetMetadata or the options: built from the program, or a tree
// or sub-tree of a description (the target's own included) or the scratch tree.
const Property& PickTree(State& state, Program& program, Property& built) {
  switch (program.Below(10)) {
    case 0:
      return PickCodec(state, program)->GetProperty();
    case 1:
      return PickCodec(state, program)->GetMetadata();
    case 2: {
      const Property& root = PickCodec(state, program)->GetProperty();
      const Property* child = Find(root, program.Text());
      if (child != nullptr) return *child;
      break;
    }
    case 3:
      return state.scratch;
    default:
      break;
  }
  std::size_t budget = kMaxNodes / 4;
  built = BuildTree(program, 0, budget);
  return built;
}

void OpCreate(State& state, Program& program) {
  CodecPtr& slot = PickCodec(state, program);
  const Kind kind = static_cast<Kind>(program.Below(4));
  slot = Create(kind);
  Require(slot->GetRefCount() == 1, "Create did not return the only reference");
  Require(slot->GetCodecName() == "Unknown codec", "a new description has another codec name");
  Require(slot->ExistsOptionsEncode() && slot->ExistsOptionsAnalyze(),
          "a new description lacks its options");
  Require(slot->GetInternalProperties().get<std::string>(Conf::TAG_OBJECT) == ObjectName(kind),
          "a new description lacks its object name entry");
}

void OpClone(State& state, Program& program) {
  CodecPtr& target = PickCodec(state, program);
  const CodecPtr source = PickCodec(state, program);
  CodecPtr clone;
  switch (KindOf(*source)) {
    case kVideo:
      clone = As<Conf::IFormatCodecVideo>(*source).Clone();
      break;
    case kAudio:
      clone = As<Conf::IFormatCodecAudio>(*source).Clone();
      break;
    case kSubtitle:
      clone = As<Conf::IFormatCodecSubtitle>(*source).Clone();
      break;
    default:
      return;  // the generic description has no Clone
  }
  Require(clone->GetRefCount() == 1, "Clone did not return the only reference");
  Require(KindOf(*clone) == KindOf(*source), "a clone is of another kind");
  Require(clone->Compare(source) && source->Compare(clone), "a clone differs from its source");
  Require(clone->GetInternalProperties() == source->GetInternalProperties(),
          "a clone has other runtime entries");
  Require(!clone->GetPrivateData(), "a clone took the private data");
  target = clone;
}

void OpShare(State& state, Program& program) {
  CodecPtr& target = PickCodec(state, program);
  target = PickCodec(state, program);
}

void OpSetInteger(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  const auto& settings = IntegerSettings();
  const IntegerSetting& setting = settings[program.Below(settings.size())];
  if (!Applies(setting, KindOf(codec))) return;
  const long long value = program.Integer();
  const long long stored = Narrow(setting.storage, value);
  CheckedSet(codec, false, Property(*setting.key, stored), [&] { setting.set(codec, value); });
  Require(setting.exists(codec), "Exists is false after a Set");
  Require(setting.get(codec) == stored, "an integer did not read back");
}

void OpSetText(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  const auto& settings = TextSettings();
  const TextSetting& setting = settings[program.Below(settings.size())];
  if (!Applies(setting, KindOf(codec))) return;
  const std::string value = program.Text();
  if (!CheckedSet(codec, setting.inMetadata, Property(*setting.key, value),
                  [&] { setting.set(codec, value); })) {
    return;
  }
  Require(setting.exists(codec), "Exists is false after a Set");
  Require(setting.get(codec) == value, "a text did not read back");
}

void OpSetFlag(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  const auto& settings = FlagSettings();
  const FlagSetting& setting = settings[program.Below(settings.size())];
  const bool value = program.Flag();
  CheckedSet(codec, false, Property(*setting.key, value), [&] { setting.set(codec, value); });
  Require(setting.exists(codec), "Exists is false after a Set");
  Require(setting.get(codec) == value, "a flag did not read back");
}

// SetFrameRate, InitByPixelAspect and InitByFrameAspect: several settings at once.
void OpVideoGeometry(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  if (KindOf(codec) != kVideo) return;
  auto& video = As<Conf::IFormatCodecVideo>(codec);
  using V = Conf::IFormatCodecVideo;
  const auto a = static_cast<unsigned>(program.Integer());
  const auto b = static_cast<unsigned>(program.Integer());
  Property expected(codec.GetProperty());
  const auto put = [&expected](const std::string& key, std::uint64_t value) {
    SetOrAppend(expected, key, Property(key, static_cast<long long>(value)));
  };
  switch (program.Below(3)) {
    case 0:
      video.SetFrameRate(a, b);
      put(V::TAG_TIMEBASE_N, a);
      put(V::TAG_TIMEBASE_D, b);
      break;
    case 1: {
      const auto x = static_cast<unsigned>(program.Integer());
      const auto y = static_cast<unsigned>(program.Integer());
      video.InitByPixelAspect(a, b, x, y);
      put(V::TAG_WIDTH, a);
      put(V::TAG_HEIGHT, b);
      put(V::TAG_ASPECTX, x);
      put(V::TAG_ASPECTY, y);
      break;
    }
    default: {
      const auto frameX = static_cast<unsigned>(program.Integer());
      const auto frameY = static_cast<unsigned>(program.Integer());
      video.InitByFrameAspect(a, b, frameX, frameY);
      std::uint64_t x = 0;
      std::uint64_t y = 0;
      ReducedProducts(frameX, b, frameY, a, x, y);
      put(V::TAG_WIDTH, a);
      put(V::TAG_HEIGHT, b);
      put(V::TAG_ASPECTX, x);
      put(V::TAG_ASPECTY, y);
      break;
    }
  }
  Require(codec.GetProperty() == expected, "a geometry write stored other values");
}

void OpSetProperty(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  Property built("");
  const Property& source = PickTree(state, program, built);
  if (Nodes(source) + 1 > kMaxNodes) return;
  const Property before(codec.GetProperty());
  // Expected: the tree's type, value and children under the object name, plus an empty metadata
  // child when it has none.
  Property expected(before.GetName());
  expected = source;
  const bool container = expected.GetType() == Tarvek::PropertyTypeContainer;
  if (container && !expected.ChildExists(Conf::IFormat::TAG_METADATA)) {
    expected.SetChild(Conf::IFormat::TAG_METADATA);
  }
  try {
    codec.SetProperty(source);
  } catch (const Core::MethodIsNotApplicable&) {
    Require(!container, "SetProperty refused a container");
    Require(codec.GetProperty() == before, "a refused SetProperty changed the description");
    return;
  }
  Require(container, "SetProperty took a leaf");
  Require(codec.GetProperty() == expected, "SetProperty stored another tree");
}

void OpSetMetadata(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  Property built("");
  const Property& source = PickTree(state, program, built);
  if (Nodes(codec.GetProperty()) + Nodes(source) > kMaxNodes) return;
  Property expected(codec.GetProperty());
  *expected.FindChild(Conf::IFormat::TAG_METADATA) = source;
  codec.SetMetadata(source);
  Require(codec.GetProperty() == expected, "SetMetadata stored another tree");
}

void OpSetOptions(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  const bool encode = program.Flag();
  Property built("");
  const Property& source = PickTree(state, program, built);
  if (Nodes(codec.GetProperty()) + Nodes(source) > kMaxNodes) return;
  const std::string& key =
      encode ? Codec::TAG_CODEC_OPTIONS_ENCODE : Codec::TAG_CODEC_OPTIONS_ANALYZE;
  Property expected(codec.GetProperty());
  SetOrAppend(expected, key, source);
  if (encode) {
    codec.SetOptionsEncode(source);
  } else {
    codec.SetOptionsAnalyze(source);
  }
  Require(codec.GetProperty() == expected, "SetOptions stored another tree");
}

void OpPrivateData(State& state, Program& program) {
  CodecPtr& codec = PickCodec(state, program);
  switch (program.Below(3)) {
    case 0: {
      const auto& blob = state.blobs[program.Below(kBlobSlots)];
      codec->SetPrivateData(blob);
      state.privateData[codec.get()] = blob.get();
      break;
    }
    case 1:
      codec->SetPrivateData(nullptr);
      state.privateData[codec.get()] = nullptr;
      break;
    default:
      // Handing back the blob already held keeps it held.
      codec->SetPrivateData(codec->GetPrivateData());
      break;
  }
}

void OpBlob(State& state, Program& program) {
  auto& slot = state.blobs[program.Below(kBlobSlots)];
  switch (program.Below(5)) {
    case 0: {
      const std::string bytes = program.Text();
      slot = Tarvek::CreateBlob(bytes.data(), bytes.size());
      Require(slot->GetRefCount() == 1, "CreateBlob did not return the only reference");
      Require(slot->GetSize() == bytes.size(), "a blob has another size");
      Require(bytes.empty() ? slot->GetData() == nullptr
                            : std::memcmp(slot->GetData(), bytes.data(), bytes.size()) == 0,
              "a blob has other bytes");
      break;
    }
    case 1: {
      const auto size = static_cast<std::size_t>(program.Byte());
      try {
        slot = Tarvek::CreateBlob(nullptr, size);
      } catch (const Core::CoreException&) {
        Require(size != 0, "CreateBlob refused an empty blob");
        break;
      }
      Require(size == 0 && slot->GetSize() == 0, "CreateBlob took null data");
      break;
    }
    case 2:
      slot = CountingBlob::Create();
      break;
    case 3:
      slot = state.blobs[program.Below(kBlobSlots)];
      break;
    default:
      slot.reset();
      break;
  }
}

void OpCompare(State& state, Program& program) {
  const CodecPtr& a = PickCodec(state, program);
  const CodecPtr& b = PickCodec(state, program);
  Require(a->Compare(b) == (a->GetProperty() == b->GetProperty()), "Compare disagrees with ==");
  Require(a->Compare(a), "a description differs from itself");
  Require(!a->Compare(nullptr), "a description equals null");
}

// The compatibility tests read the settings of this description, then of the other, pair by
// pair; the first failing read is reported, the first differing pair answers false.
void OpIsCompatible(State& state, Program& program) {
  const CodecPtr& a = PickCodec(state, program);
  const CodecPtr other = program.Flag() ? PickCodec(state, program) : CodecPtr();
  const Kind kind = KindOf(*a);
  using V = Conf::IFormatCodecVideo;
  using A = Conf::IFormatCodecAudio;
  std::vector<std::pair<const std::string*, Storage>> pairs;
  if (kind == kVideo) {
    for (const std::string* key :
         {&V::TAG_WIDTH, &V::TAG_HEIGHT, &V::TAG_ASPECTX, &V::TAG_ASPECTY}) {
      pairs.emplace_back(key, StorageOf(kind, *key));
    }
  } else if (kind == kAudio) {
    for (const std::string* key : {&A::TAG_SAMPLE_RATE, &A::TAG_LAYOUT, &A::TAG_SAMPLE_FORMAT}) {
      pairs.emplace_back(key, StorageOf(kind, *key));
    }
  }
  Outcome outcome = Outcome::kValue;
  bool expected = true;
  if (!pairs.empty() && (!other || KindOf(*other) != kind)) {
    expected = false;
    pairs.clear();
  }
  for (const auto& [key, storage] : pairs) {
    const Property* mine = Find(a->GetProperty(), *key);
    outcome = Expect(mine, Tarvek::PropertyTypeInt64);
    if (outcome != Outcome::kValue) break;
    const Property* theirs = Find(other->GetProperty(), *key);
    outcome = Expect(theirs, Tarvek::PropertyTypeInt64);
    if (outcome != Outcome::kValue) break;
    if (Narrow(storage, mine->GetInt64()) != Narrow(storage, theirs->GetInt64())) {
      expected = false;
      break;
    }
  }
  bool got = false;
  if (ReadsAs(outcome, [&] { got = a->IsCompatible(other); })) {
    Require(got == expected, "IsCompatible gave the wrong answer");
  }
}

// The six bitrate functions: the wrong kind is refused, a missing or mistyped setting is
// reported, the presets library may refuse the values; min <= default <= max when all answer.
void OpBitrate(State& state, Program& program) {
  const ConstCodecPtr codec = program.Below(8) == 0 ? ConstCodecPtr() : PickCodec(state, program);
  const Kind kind = codec ? KindOf(*codec) : kGeneric;
  using Function = boost::int64_t (*)(const ConstCodecPtr&);
  const bool video = program.Flag();
  static constexpr Function kVideoFunctions[3] = {
      &Conf::GetMinVideoBitrate, &Conf::GetDefaultVideoBitrate, &Conf::GetMaxVideoBitrate};
  static constexpr Function kAudioFunctions[3] = {
      &Conf::GetMinAudioBitrate, &Conf::GetDefaultAudioBitrate, &Conf::GetMaxAudioBitrate};
  const Function* functions = video ? kVideoFunctions : kAudioFunctions;
  const int before = codec ? codec->GetRefCount() : 0;
  const bool rightKind = kind == (video ? kVideo : kAudio);
  boost::int64_t figures[3] = {};
  int answered = 0;
  int refusedByPresets = 0;
  int unreadable = 0;
  for (int i = 0; i < 3; ++i) {
    try {
      figures[i] = functions[i](codec);
      ++answered;
    } catch (const Conf::UnknownCodecError&) {
      ++refusedByPresets;
    } catch (const Conf::InvalidPresetArgumentError&) {
      ++refusedByPresets;
    } catch (const Conf::ConfException& e) {
      Require(!rightKind, "a bitrate function refused the right kind of description");
      const auto* description = boost::get_error_info<Tarvek::DescriptionInfo>(e);
      Require(
          description != nullptr && *description == "Incompatible type of IFormatCodec structure",
          "a wrong kind was refused with another description");
      continue;
    } catch (const Core::ChildNotFound&) {
      ++unreadable;
    } catch (const Core::WrongPropertyType&) {
      ++unreadable;
    }
    Require(rightKind, "a bitrate function accepted the wrong kind of description");
    Require(!codec || codec->GetRefCount() == before, "a bitrate function kept a reference");
  }
  Require(answered == 0 || answered == 3, "the three bitrate functions disagree");
  Require(unreadable == 0 || unreadable == 3, "the three bitrate functions read differently");
  Require(refusedByPresets == 0 || refusedByPresets == 3, "the presets refused only some");
  if (answered == 3) {
    Require(figures[0] <= figures[1] && figures[1] <= figures[2], "min <= default <= max broke");
  }
}

// Restores std::cout's buffer however the call ends.
class RedirectStdout {
 public:
  explicit RedirectStdout(std::streambuf* buffer) : previous_(std::cout.rdbuf(buffer)) {}
  ~RedirectStdout() { std::cout.rdbuf(previous_); }
  RedirectStdout(const RedirectStdout&) = delete;
  RedirectStdout& operator=(const RedirectStdout&) = delete;

 private:
  std::streambuf* previous_;
};

// PrintContent into a buffer that is then dropped, and the tree printer, which must keep every
// node on one line whatever its name and value hold.
void OpPrint(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  if (program.Flag()) {
    std::ostringstream discarded;
    {
      const RedirectStdout redirect(discarded.rdbuf());
      codec.PrintContent();
    }
    const std::string text = discarded.str();
    const std::size_t lines = Nodes(codec.GetProperty()) + 1;
    std::size_t position = 0;
    for (std::size_t i = 0; i < lines && position != std::string::npos; ++i) {
      position = text.find('\n', position);
      if (position != std::string::npos) ++position;
    }
    Require(text.rfind("======External props:=====\n", 0) == 0, "PrintContent lost its header");
    Require(position != std::string::npos &&
                text.compare(position, 28, "======Runtime props:=======\n") == 0,
            "PrintContent did not print one line a node");
    return;
  }
  const int indent = static_cast<std::int8_t>(program.Byte());  // negative too
  const bool showTypes = program.Flag();
  const bool recursive = program.Flag();
  const Property& tree = program.Flag() ? codec.GetProperty() : state.scratch;
  std::ostringstream out;
  Core::PrintPropertyValue(tree, indent, out, showTypes, recursive);
  const std::string text = out.str();
  const auto newlines = static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n'));
  Require(newlines == (recursive ? Nodes(tree) : 1), "PrintPropertyValue broke a node's line");
}

// The runtime entries: dotted paths create nested entries, which Clone copies and Compare
// ignores.
void OpInternal(State& state, Program& program) {
  Codec& codec = *PickCodec(state, program);
  boost::property_tree::ptree& entries = codec.GetInternalProperties();
  std::string path = program.Text();
  // Boost.PropertyTree requires a last path segment that is not empty; inner ones may be.
  if (path.empty() || path.back() == '.') path += 'x';
  const Property before(codec.GetProperty());
  switch (program.Below(4)) {
    case 0: {
      const std::string value = program.Text();
      entries.put(path, value);
      Require(entries.get<std::string>(path) == value, "a runtime entry did not read back");
      break;
    }
    case 1:
      entries.add(path, program.Text());
      break;
    case 2:
      entries.erase(path);
      break;
    default: {
      const auto& constEntries = static_cast<const Codec&>(codec).GetInternalProperties();
      Require(&constEntries == &entries, "the two GetInternalProperties differ");
      (void)constEntries.get_optional<std::string>(path);
      break;
    }
  }
  if (entries.size() > 64) entries.clear();  // bound the work of later steps
  Require(codec.GetProperty() == before, "a runtime entry changed the property tree");
}

// The typed child helpers on the scratch tree or one of its children: set-or-append and append,
// and a refusal on a leaf that names the node, its type and the helper, and changes nothing.
void OpChildHelpers(State& state, Program& program) {
  if (program.Below(6) == 0 || Nodes(state.scratch) >= kMaxNodes) {
    std::size_t budget = kMaxNodes / 4;
    state.scratch = BuildTree(program, 0, budget);
    return;
  }
  const std::string childName = program.Text();
  const bool onChild = program.Flag() && state.scratch.ChildExists(childName);
  Property& target = onChild ? *state.scratch.FindChild(childName) : state.scratch;
  const std::string name = program.Text();
  const bool create = program.Flag();
  Property value(name);
  switch (program.Below(3)) {
    case 0:
      value = program.Flag();
      break;
    case 1:
      value = program.Integer();
      break;
    default:
      value = program.Text();
      break;
  }
  const Property before(state.scratch);
  Property expected(before);
  Property& expectedTarget = onChild ? *expected.FindChild(childName) : expected;
  const bool container = target.GetType() == Tarvek::PropertyTypeContainer;
  if (container) {
    if (create) {
      expectedTarget.CreateChildT<bool>(name, false) = value;
    } else {
      SetOrAppend(expectedTarget, name, value);
    }
  }
  const std::string targetName = target.GetName();
  const Tarvek::PropertyTypes targetType = target.GetType();
  try {
    switch (value.GetType()) {
      case Tarvek::PropertyTypeBool:
        if (create) {
          target.CreateChildT<bool>(name, value.GetBool());
        } else {
          target.SetChildT<bool>(name, value.GetBool());
        }
        break;
      case Tarvek::PropertyTypeInt64:
        if (create) {
          target.CreateChildT<long long>(name, value.GetInt64());
        } else {
          target.SetChildT<long long>(name, value.GetInt64());
        }
        break;
      default:
        if (create) {
          target.CreateChildT<std::string>(name, value.GetString());
        } else {
          target.SetChildT<std::string>(name, value.GetString());
        }
        break;
    }
  } catch (const Core::MethodIsNotApplicable& e) {
    using Info = Core::PropertyException;
    Require(!container, "a typed child helper refused a container");
    Require(state.scratch == before, "a refused typed child helper changed the tree");
    const auto* node = boost::get_error_info<Info::PropertyNameInfo>(e);
    const auto* method = boost::get_error_info<Info::MethodNameInfo>(e);
    const auto* type = boost::get_error_info<Info::PropertyTypeInfo>(e);
    Require(node != nullptr && *node == targetName, "the refusal names another node");
    Require(method != nullptr && *method == (create ? "CreateChildT" : "SetChildT"),
            "the refusal names another helper");
    Require(type != nullptr && *type == targetType, "the refusal names another type");
    Require(boost::get_error_info<Tarvek::CallStackInfo>(e) != nullptr,
            "the refusal has no call stack");
    return;
  }
  Require(container, "a typed child helper added a child to a leaf");
  Require(state.scratch == expected, "a typed child helper changed more than one child");
}

using Operation = void (*)(State&, Program&);

constexpr Operation kOperations[] = {
    OpCreate,        OpClone,        OpShare,       OpSetInteger, OpSetText,     OpSetFlag,
    OpVideoGeometry, OpSetProperty,  OpSetMetadata, OpSetOptions, OpPrivateData, OpBlob,
    OpCompare,       OpIsCompatible, OpBitrate,     OpPrint,      OpInternal,    OpChildHelpers,
};

void Run(Program& program) {
  State state;
  static constexpr Kind kInitial[kCodecSlots] = {kGeneric,  kVideo, kAudio,
                                                 kSubtitle, kVideo, kAudio};
  for (std::size_t i = 0; i < kCodecSlots; ++i) state.codecs[i] = Create(kInitial[i]);
  state.blobs[0] = Tarvek::CreateBlob("abc", 3);
  state.blobs[1] = CountingBlob::Create();
  CheckState(state);
  constexpr std::size_t kOperationCount = sizeof kOperations / sizeof kOperations[0];
  while (!program.Done()) {
    const std::uint8_t code = program.Byte();
    if (code >= 0xf0) {
      // Reads of one description, checked against its tree.
      const Codec& codec = *PickCodec(state, program);
      CheckReads(codec, program.Byte());
    } else {
      kOperations[code % kOperationCount](state, program);
    }
    CheckState(state);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Program program(data, size);
  Run(program);
  Require(CountingBlob::Live() == 0, "a blob outlived every reference");
  return 0;
}
