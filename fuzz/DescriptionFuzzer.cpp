// A libFuzzer target that reads its input as a program of calls on four format descriptions and
// three blobs, and checks invariants in and after every step (a step is a byte naming an operation,
// then its arguments; past the end every byte is zero). The settings are those of the inspection
// library's table (Inspect/Settings.h): one Set, read and tree write for each. A broken invariant
// (each Require names it), or an exception the call does not document, aborts. After every step:
// each root is a container named after its kind with the metadata child GetMetadata returns,
// GetCodecType matches the kind, the private data is the blob last set, every reference count
// equals the references the program holds, and no counting blob leaks.
#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <numeric>
#include <sstream>
#include <string>
#include <type_traits>
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
using BlobPtr = boost::intrusive_ptr<Tarvek::IBlob>;
using Core::Property;
using Kind = Conf::FormatKind;
using Video = Conf::IFormatCodecVideo;
using Audio = Conf::IFormatCodecAudio;
using Subtitle = Conf::IFormatCodecSubtitle;
using TarvekTest::CountingBlob;  // counts live instances: a blob freed twice or never shows

constexpr std::size_t kSlots = 4;
constexpr std::size_t kBlobs = 3;
constexpr std::size_t kMaxNodes = 256;  // nesting a tree into itself doubles it
constexpr Kind kKinds[kSlots] = {Kind::Codec, Kind::Video, Kind::Audio, Kind::Subtitle};
constexpr auto kInt = Tarvek::PropertyTypeInt64;
constexpr auto kContainer = Tarvek::PropertyTypeContainer;

void Require(bool ok, const char* what) {
  if (ok) return;
  std::fprintf(stderr, "broken invariant: %s\n", what);
  std::abort();
}

// Whether `call` threw `Error`.
template <class Error, class Call>
bool Threw(Call&& call) {
  try {
    call();
  } catch (const Error&) {
    return true;
  }
  return false;
}

// ---- Reading the program ----

// The keys of every kind's settings, the object names, and texts the library interprets.
const std::vector<std::string>& Words() {
  static const std::vector<std::string> words = [] {
    // clang-format off
    std::vector<std::string> list = {Conf::TAG_OBJECT, Video::TAG_FORMAT_CODEC_VIDEO,
        Audio::TAG_FORMAT_CODEC_AUDIO, Subtitle::TAG_FORMAT_CODEC_SUBTITLE,
        Codec::TAG_BITRATE_MODE_VBR, "", "VBR", "a.b", "..", "object_name.x",
        std::string("nul\0byte", 8), "\xff\xfe\xc3", "\xc3\xa9t\xc3\xa9", "eng", "Unknown codec",
        "H264", "nosuchcodec"};
    // clang-format on
    for (const Kind kind : kKinds) {
      for (const auto& setting : Conf::SettingsOf(kind)) {
        if (std::count(list.begin(), list.end(), setting.key) == 0) list.push_back(setting.key);
      }
    }
    for (const auto& id : Conf::GetPresetVideoCodecs()) list.push_back(id);
    for (const auto& id : Conf::GetPresetAudioCodecs()) list.push_back(id);
    return list;
  }();
  return words;
}

// clang-format off
constexpr long long kInteresting[] = {0, 1, -1, 2, 16, 23, 720, 1080, 1920, 48000, 0x3f, 65537,
    0x7fffffff, -0x7fffffff - 1, 0x80000000LL, 0xffffffffLL, 0x100000000LL,
    0x7fffffffffffffffLL, -0x7fffffffffffffffLL - 1};
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
    if (form % 4 == 0) return kInteresting[(form / 4) % std::size(kInteresting)];
    if (form % 4 == 1) return static_cast<std::int8_t>(Byte());
    if (form % 4 == 2) return static_cast<std::int32_t>(static_cast<std::uint32_t>(Raw(4)));
    return static_cast<long long>(Raw(8));
  }
  // A word, or up to 63 raw bytes (NULs, invalid UTF-8 and all).
  std::string Text() {
    const std::uint8_t form = Byte();
    if (form < 0x80) return Words()[form % Words().size()];
    const std::size_t length = std::min<std::size_t>(form & 0x3f, size_ - position_);
    position_ += length;
    return std::string(reinterpret_cast<const char*>(data_ + position_ - length), length);
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

std::uint64_t Mix(std::uint64_t hash, std::uint64_t value) {
  for (int i = 0; i < 64; i += 8) hash = (hash ^ ((value >> i) & 0xff)) * 0x100000001b3ULL;
  return hash;
}
std::uint64_t Mix(std::uint64_t hash, const std::string& text) {
  hash = Mix(hash, text.size());
  for (const char c : text) hash = (hash ^ static_cast<unsigned char>(c)) * 0x100000001b3ULL;
  return hash;
}

// A digest of `node` named `name`: type, value and children in order, computed apart from
// Property's ==. With `key`, the first child of that name counts as the digest `child` instead,
// appended last when there is none: the digest after SetChild(key, ...). Comparing digests
// spares copying whole trees to compare them.
std::uint64_t Digest(const Property& node, const std::string& name,
                     const std::string* key = nullptr, std::uint64_t child = 0) {
  std::uint64_t hash = Mix(Mix(0xcbf29ce484222325ULL, name), node.GetType());
  if (node.GetType() == Tarvek::PropertyTypeBool) hash = Mix(hash, node.GetBool());
  if (node.GetType() == kInt) hash = Mix(hash, static_cast<std::uint64_t>(node.GetInt64()));
  if (node.GetType() == Tarvek::PropertyTypeString) hash = Mix(hash, node.GetString());
  std::size_t count = 0;
  for (const Property& each : node.GetChildren()) {
    const bool edited = key != nullptr && each.GetName() == *key;
    hash = Mix(hash, edited ? child : Digest(each, each.GetName()));
    key = edited ? nullptr : key;
    ++count;
  }
  if (key != nullptr) hash = Mix(hash, child), ++count;
  return Mix(hash, count);
}
std::uint64_t Digest(const Property& node) { return Digest(node, node.GetName()); }

// A tree of the program's choosing: leaves of every type, containers, duplicate names.
Property BuildTree(Program& program, int depth, std::size_t& budget) {
  Property node(program.Text());
  --budget;
  const std::size_t form = program.Below(8);
  if (form == 0) node = program.Flag();
  if (form == 1) node = program.Integer();
  if (form == 2) node = program.Text();
  for (std::size_t i = form < 3 || depth > 3 ? 6 : program.Below(6); i < 6 && budget > 0; ++i) {
    node.CreateChildT<bool>(program.Text(), false) = BuildTree(program, depth + 1, budget);
  }
  return node;
}

// ---- Descriptions, with their kind and typed interfaces found once ----

struct Slot {
  CodecPtr codec;
  Kind kind = Kind::Codec;
  Conf::FormatCodecVideo* video = nullptr;  // the class: width and pixel aspect have setters only
  Audio* audio = nullptr;
  Subtitle* subtitle = nullptr;
  const Tarvek::IBlob* privateData = nullptr;  // what the program set
  bool countingData = false;                   // whether that is a CountingBlob
};

void Assign(Slot& slot, const CodecPtr& codec, Kind kind) {
  slot = Slot{codec, kind, dynamic_cast<Conf::FormatCodecVideo*>(codec.get()),
              dynamic_cast<Audio*>(codec.get()), dynamic_cast<Subtitle*>(codec.get())};
  Require((kind == Kind::Video) == (slot.video != nullptr) &&
              (kind == Kind::Audio) == (slot.audio != nullptr) &&
              (kind == Kind::Subtitle) == (slot.subtitle != nullptr),
          "a description is of another kind");
}

const std::string& ObjectName(Kind kind) {
  static const std::string names[] = {"", Video::TAG_FORMAT_CODEC_VIDEO,
                                      Audio::TAG_FORMAT_CODEC_AUDIO,
                                      Subtitle::TAG_FORMAT_CODEC_SUBTITLE};
  return names[static_cast<int>(kind)];
}

// ---- The settings: the table's entries, each bound to its typed accessors ----

struct Accessor {
  bool (*exists)(const Slot&);
  Property (*get)(const Slot&, const std::string& key);  // the value read, as a leaf
  void (*set)(Slot&, const Property& value);
};

template <class C, class A>
A ArgOf(void (C::*)(A));

template <Kind K, auto Exists, auto Get, auto Set>
struct Bind {
  static auto& Of(const Slot& slot) {
    if constexpr (K == Kind::Video) return *slot.video;
    if constexpr (K == Kind::Audio) return *slot.audio;
    if constexpr (K == Kind::Subtitle) return *slot.subtitle;
    if constexpr (K == Kind::Codec) return *slot.codec;
  }
  static bool Has(const Slot& slot) { return (Of(slot).*Exists)(); }
  // A libavutil format is converted as it is returned, never held in a variable: it may hold any
  // value, which the enumeration does not name.
  static Property Read(const Slot& slot, const std::string& key) {
    using Result = decltype((Of(slot).*Get)());
    if constexpr (std::is_enum_v<Result>) return Property(key, +(Of(slot).*Get)());
    if constexpr (!std::is_enum_v<Result>) return Property(key, (Of(slot).*Get)());
  }
  static void Write(Slot& slot, const Property& value) {
    using Arg = std::decay_t<decltype(ArgOf(Set))>;
    if constexpr (std::is_same_v<Arg, std::string>) (Of(slot).*Set)(value.GetString());
    if constexpr (std::is_same_v<Arg, bool>) (Of(slot).*Set)(value.GetBool());
    if constexpr (std::is_enum_v<Arg>) {
      (Of(slot).*Set)(static_cast<Arg>(static_cast<std::underlying_type_t<Arg>>(value.GetInt64())));
    }
    if constexpr (std::is_integral_v<Arg> && !std::is_same_v<Arg, bool>) {
      (Of(slot).*Set)(static_cast<Arg>(value.GetInt64()));
    }
  }
  static Accessor Make() { return {&Has, &Read, &Write}; }
};

using CodecClass = Codec;
using VideoClass = Conf::FormatCodecVideo;
using AudioClass = Audio;
using SubtitleClass = Subtitle;
#define TARVEK_ACCESSOR(K, Name) \
  Bind<Kind::K, &K##Class::Exists##Name, &K##Class::Get##Name, &K##Class::Set##Name>::Make()
// The accessors of the leaf settings in the table's order, the codec's first, then each kind's
// own; keys, types and widths are the table's (one out of order fails its first Set).
const std::vector<Accessor> kAccessors[] = {
    {TARVEK_ACCESSOR(Codec, CodecName), TARVEK_ACCESSOR(Codec, CodecID),
     TARVEK_ACCESSOR(Codec, CodecTag), TARVEK_ACCESSOR(Codec, BitrateMode),
     TARVEK_ACCESSOR(Codec, Bitrate), TARVEK_ACCESSOR(Codec, Quality),
     TARVEK_ACCESSOR(Codec, Lossless), TARVEK_ACCESSOR(Codec, ThreadNumber),
     TARVEK_ACCESSOR(Codec, TwoPassEncoding), TARVEK_ACCESSOR(Codec, GlobalHeader),
     TARVEK_ACCESSOR(Codec, MainStream)},
    {TARVEK_ACCESSOR(Video, Width), TARVEK_ACCESSOR(Video, Height),
     TARVEK_ACCESSOR(Video, PixelAspectX), TARVEK_ACCESSOR(Video, PixelAspectY),
     TARVEK_ACCESSOR(Video, FrameRateNum), TARVEK_ACCESSOR(Video, FrameRateDen),
     TARVEK_ACCESSOR(Video, PixelFormat)},
    {TARVEK_ACCESSOR(Audio, Language), TARVEK_ACCESSOR(Audio, SampleRate),
     TARVEK_ACCESSOR(Audio, ChannelLayout), TARVEK_ACCESSOR(Audio, FrameSize),
     TARVEK_ACCESSOR(Audio, SampleFormat)},
    {TARVEK_ACCESSOR(Subtitle, Language), TARVEK_ACCESSOR(Subtitle, Title),
     TARVEK_ACCESSOR(Subtitle, Author), TARVEK_ACCESSOR(Subtitle, SubtitleHeader),
     TARVEK_ACCESSOR(Subtitle, DVBWidth), TARVEK_ACCESSOR(Subtitle, DVBHeight)},
    {}};  // a generic description has none of its own
#undef TARVEK_ACCESSOR

struct Entry {
  const Conf::Setting* setting;
  const Accessor* accessor;
};

// The leaf settings of `kind` in the table's order, each with its accessors.
const std::vector<Entry>& EntriesOf(Kind kind) {
  static const auto all = [] {
    std::array<std::vector<Entry>, 4> entries;
    for (const Kind of : kKinds) {
      auto& list = entries[static_cast<std::size_t>(of)];
      for (const Conf::Setting& setting : Conf::SettingsOf(of)) {
        const std::size_t codec = kAccessors[0].size(), at = list.size();
        const auto& own = kAccessors[of == Kind::Codec ? 4 : static_cast<std::size_t>(of)];
        if (setting.type == kContainer) continue;
        Require(at < codec || at - codec < own.size(), "a setting has no accessor");
        list.push_back({&setting, at < codec ? &kAccessors[0][at] : &own[at - codec]});
      }
      const std::size_t own = of == Kind::Codec ? 0 : kAccessors[static_cast<int>(of)].size();
      Require(list.size() == kAccessors[0].size() + own, "an accessor has no setting");
    }
    return entries;
  }();
  return all[static_cast<std::size_t>(kind)];
}

// `value` under the setting's key, an integer as the setting's width keeps it.
Property Stored(const Conf::Setting& setting, const Property& value) {
  Property stored(setting.key);
  stored = value;
  const long long wide = value.GetType() == kInt ? value.GetInt64() : 0;
  if (setting.range == Conf::ValueRange::Signed32) stored = static_cast<std::int32_t>(wide);
  if (setting.range == Conf::ValueRange::Unsigned32) stored = static_cast<std::uint32_t>(wide);
  return stored;
}

// Integer setting `key` of `slot`'s tree as its accessor reads it.
std::uint64_t Read(const Slot& slot, const std::string& key) {
  const Property& root = slot.codec->GetProperty();
  for (const Entry& entry : EntriesOf(slot.kind)) {
    if (entry.setting->key == key) {
      return static_cast<std::uint64_t>(Stored(*entry.setting, root[key]).GetInt64());
    }
  }
  return 0;
}

// Whether the integer settings `keys` all read in `slot`: else 1 for a missing one, 2 for one
// of another type, whichever comes first.
int Unreadable(const Slot& slot, std::initializer_list<const std::string*> keys) {
  for (const std::string* key : keys) {
    const Property* child = Find(slot.codec->GetProperty(), *key);
    if (child == nullptr || child->GetType() != kInt) return child == nullptr ? 1 : 2;
  }
  return 0;
}

// Exists and Get of one setting against the tree. A missing or mistyped setting is read only when
// `failing` says so: each throw records a call stack, and most settings are missing.
void CheckRead(const Slot& slot, const Entry& entry, bool failing) {
  const Conf::Setting& setting = *entry.setting;
  const Property& root = slot.codec->GetProperty();
  const Property* parent = setting.parent.empty() ? &root : Find(root, setting.parent);
  const Property* child = parent == nullptr ? nullptr : Find(*parent, setting.key);
  Require(entry.accessor->exists(slot) == (child != nullptr), "Exists disagrees with the tree");
  if (child == nullptr && !setting.parent.empty()) {
    Require(entry.accessor->get(slot, setting.key) == Property(setting.key, ""),
            "a missing setting in a container did not read as empty");
  } else if (child == nullptr && failing) {
    try {
      entry.accessor->get(slot, setting.key);
      Require(false, "a getter of a missing setting returned");
    } catch (const Core::ChildNotFound& error) {
      const auto* key = boost::get_error_info<Core::ChildNotFound::ChildNameInfo>(error);
      Require(key != nullptr && *key == setting.key, "ChildNotFound names another key");
    }
  } else if (child != nullptr && child->GetType() != setting.type && failing) {
    Require(Threw<Core::WrongPropertyType>([&] { entry.accessor->get(slot, setting.key); }),
            "a getter read a setting of another type");
  } else if (child != nullptr && child->GetType() == setting.type) {
    Require(entry.accessor->get(slot, setting.key) == Stored(setting, *child), "a Get misread");
  }
}

// (a x b) : (c x d) in lowest terms, each term cut to 32 bits: the frame aspect's arithmetic.
std::pair<std::uint64_t, std::uint64_t> Reduced(std::uint64_t a, std::uint64_t b, std::uint64_t c,
                                                std::uint64_t d) {
  const std::uint64_t divisor = std::max<std::uint64_t>(std::gcd(a * b, c * d), 1);
  return {static_cast<std::uint32_t>(a * b / divisor), static_cast<std::uint32_t>(c * d / divisor)};
}

// The frame aspect and frame rate against the settings they derive from, when those read.
void CheckDerived(const Slot& slot) {
  using V = Video;
  if (Unreadable(slot, {&V::TAG_ASPECTX, &V::TAG_WIDTH, &V::TAG_ASPECTY, &V::TAG_HEIGHT}) == 0) {
    const auto [x, y] = Reduced(Read(slot, V::TAG_WIDTH), Read(slot, V::TAG_ASPECTX),
                                Read(slot, V::TAG_HEIGHT), Read(slot, V::TAG_ASPECTY));
    const double ratio = slot.video->GetFrameAspect();
    Require(slot.video->GetFrameAspectX() == x && slot.video->GetFrameAspectY() == y &&
                (ratio == static_cast<double>(x) / static_cast<double>(y) || (x | y) == 0),
            "the frame aspect is not the reduced product");
  }
  if (Unreadable(slot, {&V::TAG_TIMEBASE_D, &V::TAG_TIMEBASE_N}) == 0) {
    const auto den = static_cast<double>(Read(slot, V::TAG_TIMEBASE_D));
    const auto num = static_cast<double>(Read(slot, V::TAG_TIMEBASE_N));
    Require(slot.video->GetFrameRate() == (den == 0 ? 0.0 : num / den), "the frame rate is off");
  }
}

// ---- The program's state ----

struct State {
  Slot slots[kSlots];
  BlobPtr blobs[kBlobs];
  bool counting[kBlobs] = {};
};

void Create(Slot& slot, Kind kind) {
  static CodecPtr (*const kCreate[])() = {
      [] { return Conf::FormatCodec::Create(); },
      [] { return CodecPtr(Conf::FormatCodecVideo::Create()); },
      [] { return CodecPtr(Conf::FormatCodecAudio::Create()); },
      [] { return CodecPtr(Conf::FormatCodecSubtitle::Create()); }};
  Assign(slot, kCreate[static_cast<int>(kind)](), kind);
  const Codec& codec = *slot.codec;
  Require(codec.GetRefCount() == 1 && codec.GetCodecName() == "Unknown codec" &&
              codec.ExistsOptionsEncode() && codec.ExistsOptionsAnalyze() &&
              codec.GetInternalProperties().get<std::string>(Conf::TAG_OBJECT) == ObjectName(kind),
          "a new description is not as Create promises");
  for (const Entry& entry : EntriesOf(kind)) {
    Require(entry.accessor->exists(slot) == (entry.setting->key == Codec::TAG_NAME),
            "a new description has a setting besides its codec name");
  }
}

// A slot of the program's choosing, its description made on first use.
Slot& Pick(State& state, Program& program) {
  const std::size_t index = program.Below(kSlots);
  if (!state.slots[index].codec) Create(state.slots[index], kKinds[index]);
  return state.slots[index];
}

void CheckState(const State& state) {
  const Tarvek::IRefCountable* objects[kSlots * 2 + kBlobs] = {};
  int counts[kSlots * 2 + kBlobs] = {};
  std::size_t distinct = 0;
  int countingBlobs = 0;
  const auto held = [&](const Tarvek::IRefCountable* object, bool counting) {
    std::size_t i = 0;
    while (i < distinct && objects[i] != object) ++i;
    if (i == distinct) objects[distinct++] = object, countingBlobs += counting;
    ++counts[i];
  };
  for (std::size_t i = 0; i < kBlobs; ++i) {
    if (state.blobs[i]) held(state.blobs[i].get(), state.counting[i]);
  }
  for (std::size_t i = 0; i < kSlots; ++i) {
    const Slot& slot = state.slots[i];
    if (!slot.codec) continue;
    bool first = true;  // a description in two slots holds its private data once
    for (std::size_t j = 0; j < i; ++j) first = first && state.slots[j].codec != slot.codec;
    if (first && slot.privateData != nullptr) held(slot.privateData, slot.countingData);
    held(slot.codec.get(), false);
    const Property& root = slot.codec->GetProperty();
    static constexpr int kTypes[] = {-1, 0, 1, 3};
    Require(root.GetType() == kContainer && root.GetName() == ObjectName(slot.kind) &&
                &slot.codec->GetMetadata() == Find(root, Conf::IFormat::TAG_METADATA) &&
                slot.codec->GetCodecType() == kTypes[static_cast<int>(slot.kind)] &&
                slot.codec->GetPrivateData().get() == slot.privateData,
            "a root, its metadata, the codec type or the private data is off");
  }
  Require(CountingBlob::Live() == countingBlobs, "a blob was freed early or leaked");
  for (std::size_t i = 0; i < distinct; ++i) {
    Require(objects[i]->GetRefCount() == counts[i], "a reference count is off");
  }
}

// ---- Operations ----

// Set of one setting through its typed setter, checked against the tree's digest.
void OpSet(State& state, Program& program) {
  Slot& slot = Pick(state, program);
  const Entry& entry = EntriesOf(slot.kind)[program.Below(EntriesOf(slot.kind).size())];
  const Conf::Setting& setting = *entry.setting;
  Property value(setting.key);
  if (setting.type == Tarvek::PropertyTypeString) value = program.Text();
  if (setting.type == Tarvek::PropertyTypeBool) value = program.Flag();
  if (setting.type == kInt) value = program.Integer();
  const Property stored = Stored(setting, value);
  const Property& root = slot.codec->GetProperty();
  const Property& parent = setting.parent.empty() ? root : root[setting.parent];
  const bool writable = parent.GetType() == kContainer;
  std::uint64_t expected = Digest(parent, parent.GetName(), &setting.key, Digest(stored));
  if (&parent != &root) expected = Digest(root, root.GetName(), &setting.parent, expected);
  if (!writable) expected = Digest(root);
  Require(Threw<Core::MethodIsNotApplicable>([&] { entry.accessor->set(slot, value); }) != writable,
          "a Set into a leaf was taken, or a Set refused");
  Require(Digest(root) == expected, "a Set changed other than its own setting");
  Require(!writable ||
              (entry.accessor->exists(slot) && entry.accessor->get(slot, setting.key) == stored),
          "a Set did not read back");
}

// Reads of one setting, missing ones included, or of all present ones and the derived values.
void OpRead(State& state, Program& program) {
  const Slot& slot = Pick(state, program);
  const auto& entries = EntriesOf(slot.kind);
  const std::size_t selector = program.Byte();
  if (selector < 0x20) return CheckRead(slot, entries[selector % entries.size()], true);
  for (const Entry& entry : entries) CheckRead(slot, entry, false);
  if (slot.kind == Kind::Video) CheckDerived(slot);
  const Codec& codec = *slot.codec;
  const Property* encode = Find(codec.GetProperty(), Codec::TAG_CODEC_OPTIONS_ENCODE);
  const Property* analyze = Find(codec.GetProperty(), Codec::TAG_CODEC_OPTIONS_ANALYZE);
  Require(codec.ExistsOptionsEncode() == (encode != nullptr) &&
              codec.ExistsOptionsAnalyze() == (analyze != nullptr) &&
              (!encode || &codec.GetOptionsEncode() == encode) &&
              (!analyze || &codec.GetOptionsAnalyze() == analyze),
          "the options disagree with the tree");
}

// A setting's child written through the tree with any type and value (integers beyond the
// setting's width among them), then read through its accessors (a failing read one time in four).
void OpStore(State& state, Program& program) {
  Slot& slot = Pick(state, program);
  const Entry& entry = EntriesOf(slot.kind)[program.Below(EntriesOf(slot.kind).size())];
  Property tree(slot.codec->GetProperty());
  auto parent = entry.setting->parent.empty() ? &tree : &*tree.FindChild(entry.setting->parent);
  if (parent->GetType() != kContainer) return;
  Property& child = parent->SetChild(entry.setting->key);
  const std::uint8_t form = program.Byte();  // the type, and whether a failing read is checked
  const std::size_t type = form % 4;
  const std::uint64_t wide = type == 1 ? 0x100000000ULL : 0;  // beyond 32 bits
  if (type <= 1)
    child = static_cast<long long>(static_cast<std::uint64_t>(program.Integer()) + wide);
  if (type == 2) child = program.Flag();
  if (type == 3) child = program.Text();
  slot.codec->SetProperty(tree);
  Require(slot.codec->GetProperty() == tree, "SetProperty stored another tree");
  CheckRead(slot, entry, (form & 0x30) == 0x30);  // not for zeros, which inputs are full of
}

// SetFrameRate, InitByPixelAspect and InitByFrameAspect: several settings at once.
void OpVideoGeometry(State& state, Program& program) {
  Slot& slot = Pick(state, program);
  if (slot.kind != Kind::Video) return;
  unsigned value[4];
  for (unsigned& v : value) v = static_cast<unsigned>(program.Integer());
  const auto [a, b, x, y] = value;
  Property expected(slot.codec->GetProperty());
  const std::size_t which = program.Below(3);
  if (which == 0) slot.video->SetFrameRate(a, b);
  if (which == 1) slot.video->InitByPixelAspect(a, b, x, y);
  if (which == 2) slot.video->InitByFrameAspect(a, b, x, y);
  const auto [aspectX, aspectY] =
      which == 2 ? Reduced(x, b, y, a) : std::pair<std::uint64_t, std::uint64_t>(x, y);
  expected.SetChildT<long long>(which == 0 ? Video::TAG_TIMEBASE_N : Video::TAG_WIDTH, a);
  expected.SetChildT<long long>(which == 0 ? Video::TAG_TIMEBASE_D : Video::TAG_HEIGHT, b);
  if (which != 0) expected.SetChildT(Video::TAG_ASPECTX, static_cast<long long>(aspectX));
  if (which != 0) expected.SetChildT(Video::TAG_ASPECTY, static_cast<long long>(aspectY));
  Require(slot.codec->GetProperty() == expected, "a geometry write stored other values");
  CheckDerived(slot);
}

// A tree to hand in: a description's tree or a sub-tree of one, or a new one.
const Property& PickTree(State& state, Program& program, Property& built) {
  const std::size_t which = program.Below(8);
  if (which == 0) return Pick(state, program).codec->GetProperty();
  if (which == 1) return Pick(state, program).codec->GetMetadata();
  if (which == 2) {
    const Property& root = Pick(state, program).codec->GetProperty();
    const Property* child = Find(root, program.Text());
    if (child != nullptr) return *child;
  }
  std::size_t budget = kMaxNodes / 4;
  return built = BuildTree(program, 0, budget);
}

// SetProperty (a leaf is refused; a missing metadata child is added), SetMetadata, SetOptions.
void OpSetTree(State& state, Program& program) {
  Codec& codec = *Pick(state, program).codec;
  const std::size_t which = program.Below(4);
  Property built("");
  const Property& source = PickTree(state, program, built);
  const Property& root = codec.GetProperty();
  if (Nodes(root) + Nodes(source) > kMaxNodes) return;
  const std::string& key = which == 2   ? Codec::TAG_CODEC_OPTIONS_ENCODE
                           : which == 3 ? Codec::TAG_CODEC_OPTIONS_ANALYZE
                                        : Conf::IFormat::TAG_METADATA;
  const bool refused = which == 0 && source.GetType() != kContainer;
  const Property* metadata = Find(source, key);
  const std::uint64_t kept = metadata != nullptr ? Digest(*metadata) : Digest(Property(key));
  std::uint64_t expected = Digest(root, root.GetName(), &key, Digest(source, key));
  if (which == 0) expected = refused ? Digest(root) : Digest(source, root.GetName(), &key, kept);
  Require(Threw<Core::MethodIsNotApplicable>([&] {
            if (which == 0) codec.SetProperty(source);
            if (which == 1) codec.SetMetadata(source);
            if (which == 2) codec.SetOptionsEncode(source);
            if (which == 3) codec.SetOptionsAnalyze(source);
          }) == refused,
          "SetProperty took a leaf, or a tree was refused");
  Require(Digest(root) == expected, "a tree was stored otherwise");
}

void OpCreate(State& state, Program& program) {
  Slot& slot = state.slots[program.Below(kSlots)];
  Create(slot, kKinds[program.Below(4)]);
}

// A clone into a slot, or (of a generic description, which has no Clone) the same description.
void OpClone(State& state, Program& program) {
  Slot& target = Pick(state, program);
  const Slot& source = Pick(state, program);
  CodecPtr clone;
  if (source.kind == Kind::Video) clone = source.video->Clone();
  if (source.kind == Kind::Audio) clone = source.audio->Clone();
  if (source.kind == Kind::Subtitle) clone = source.subtitle->Clone();
  if (!clone) return void(target = Slot(source));
  Require(clone->GetRefCount() == 1 && clone->Compare(source.codec) &&
              source.codec->Compare(clone) && !clone->GetPrivateData() &&
              clone->GetInternalProperties() == source.codec->GetInternalProperties(),
          "a clone differs from its source or took its private data");
  Assign(target, clone, Kind(source.kind));
}

void OpPrivateData(State& state, Program& program) {
  Slot& slot = Pick(state, program);
  const std::size_t blob = program.Below(kBlobs + 1);
  const CodecPtr codec = slot.codec;
  const BlobPtr data = blob < kBlobs ? state.blobs[blob] : codec->GetPrivateData();
  const bool counting = blob < kBlobs ? state.counting[blob] : slot.countingData;
  codec->SetPrivateData(data);
  for (Slot& other : state.slots) {
    if (other.codec == codec) other.privateData = data.get(), other.countingData = counting;
  }
}

void OpBlob(State& state, Program& program) {
  const std::size_t index = program.Below(kBlobs);
  const std::size_t which = program.Below(4);
  const std::size_t other = program.Below(kBlobs);
  state.counting[index] = which == 1 || (which == 2 && state.counting[other]);
  BlobPtr& slot = state.blobs[index];
  slot = which == 1 ? BlobPtr(CountingBlob::Create()) : which == 2 ? state.blobs[other] : BlobPtr();
  if (which != 0) return;
  const std::string bytes = program.Text();
  const bool refused = bytes.empty() && program.Flag();  // null data of a size
  Require(Threw<Core::CoreException>([&] {
            slot =
                Tarvek::CreateBlob(bytes.empty() ? nullptr : bytes.data(), bytes.size() + refused);
          }) == refused,
          "CreateBlob took null data of a size, or refused a blob");
  Require(refused || (slot->GetRefCount() == 1 && slot->GetSize() == bytes.size() &&
                      (bytes.empty() || !std::memcmp(slot->GetData(), bytes.data(), bytes.size()))),
          "a blob is not what it was made of");
}

void OpCompare(State& state, Program& program) {
  const CodecPtr a = Pick(state, program).codec;
  const CodecPtr b = Pick(state, program).codec;
  const bool same = a->Compare(b);
  Require(same == b->Compare(a) && same == (a->GetProperty() == b->GetProperty()) &&
              same == (Digest(a->GetProperty()) == Digest(b->GetProperty())) && a->Compare(a) &&
              !a->Compare(nullptr),
          "Compare is not symmetric, or disagrees with == or the digests");
}

// The compatibility tests read the settings of this description, then of the other, pair by
// pair; the first failing read is reported, the first differing pair answers false.
void OpIsCompatible(State& state, Program& program) {
  const Slot& a = Pick(state, program);
  const std::uint8_t form = program.Byte();  // whether there is another, and a failing call made
  const Slot* b = (form & 1) != 0 ? &Pick(state, program) : nullptr;
  static const std::vector<const std::string*> kKeys[] = {
      {},
      {&Video::TAG_WIDTH, &Video::TAG_HEIGHT, &Video::TAG_ASPECTX, &Video::TAG_ASPECTY},
      {&Audio::TAG_SAMPLE_RATE, &Audio::TAG_LAYOUT, &Audio::TAG_SAMPLE_FORMAT},
      {}};
  const auto& keys = kKeys[static_cast<int>(a.kind)];
  const bool sameKind = b != nullptr && b->kind == a.kind;
  int unreadable = 0;
  bool expected = keys.empty() || sameKind;
  for (std::size_t i = 0; sameKind && expected && unreadable == 0 && i < keys.size(); ++i) {
    unreadable = Unreadable(a, {keys[i]});
    if (unreadable == 0) unreadable = Unreadable(*b, {keys[i]});
    expected = unreadable != 0 || Read(a, *keys[i]) == Read(*b, *keys[i]);
  }
  if (unreadable != 0 && (form & 6) != 6) return;  // each throw records a call stack
  const CodecPtr other = b != nullptr ? b->codec : CodecPtr();
  bool got = false;
  const auto call = [&] { got = a.codec->IsCompatible(other); };
  Require(Threw<Core::ChildNotFound>([&] {
            Require(Threw<Core::WrongPropertyType>(call) == (unreadable == 2), "a mistyped read");
          }) == (unreadable == 1),
          "IsCompatible read a missing setting otherwise");
  Require(
      unreadable != 0 || (got == expected && (!sameKind || other->IsCompatible(a.codec) == got)),
      "IsCompatible gave the wrong answer, or another one the other way");
}

// The three bitrate functions of the description's kind (or, now and then, of another kind or
// for null, which are refused): they answer alike, and min <= default <= max. After a setting
// that does not read, the other two are not asked (each throw records a call stack).
void OpBitrate(State& state, Program& program) {
  const std::uint8_t choice = program.Byte();
  const Slot& slot = Pick(state, program);
  const bool video = choice < 8 ? (choice & 1) != 0 : slot.kind == Kind::Video;
  const bool rightKind = choice != 0 && slot.kind == (video ? Kind::Video : Kind::Audio);
  if (!rightKind && choice >= 8) return;
  // A missing codec identifier is the first read that fails: asked one time in four.
  if (rightKind && !slot.codec->ExistsCodecID() && (choice & 0x60) != 0x60) return;
  using Function = boost::int64_t (*)(const boost::intrusive_ptr<const Codec>&);
  static constexpr Function kFunctions[2][3] = {
      {&Conf::GetMinAudioBitrate, &Conf::GetDefaultAudioBitrate, &Conf::GetMaxAudioBitrate},
      {&Conf::GetMinVideoBitrate, &Conf::GetDefaultVideoBitrate, &Conf::GetMaxVideoBitrate}};
  boost::int64_t figures[3] = {};
  int outcome[3] = {};  // 0 answered, 1 refused by the presets, 2 a setting unreadable
  for (int i = 0; i < 3; ++i) {
    if (outcome[0] == 2) outcome[i] = 2;
    if (outcome[0] == 2) continue;
    try {
      figures[i] = kFunctions[video][i](choice == 0 ? CodecPtr() : slot.codec);
      Require(rightKind, "a bitrate function took the wrong kind of description");
    } catch (const Conf::UnknownCodecError&) {
      outcome[i] = 1;
    } catch (const Conf::InvalidPresetArgumentError&) {
      outcome[i] = 1;
    } catch (const Conf::ConfException& e) {
      const auto* text = boost::get_error_info<Tarvek::DescriptionInfo>(e);
      Require(!rightKind && text && *text == "Incompatible type of IFormatCodec structure",
              "the wrong kind was refused otherwise, or the right kind refused");
    } catch (const Core::ChildNotFound&) {
      outcome[i] = 2;
    } catch (const Core::WrongPropertyType&) {
      outcome[i] = 2;
    }
  }
  Require(outcome[0] == outcome[1] && outcome[1] == outcome[2] &&
              (outcome[0] != 0 || (figures[0] <= figures[1] && figures[1] <= figures[2])),
          "the bitrates answer differently, or min <= default <= max broke");
}

// The tree printer keeps every node on one line, whatever its name and value hold; runtime
// entries, which dotted paths nest, change nothing in the tree.
void OpPrintAndEntries(State& state, Program& program) {
  Codec& codec = *Pick(state, program).codec;
  const int indent = static_cast<std::int8_t>(program.Byte());  // negative too
  const bool recursive = program.Flag();
  Property built("");
  const Property& tree = program.Flag() ? codec.GetProperty() : PickTree(state, program, built);
  std::ostringstream out;
  Core::PrintPropertyValue(tree, indent, out, program.Flag(), recursive);
  const std::string text = out.str();
  Require(static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n')) ==
              (recursive ? Nodes(tree) : 1),
          "PrintPropertyValue broke a node's line");
  boost::property_tree::ptree& entries = codec.GetInternalProperties();
  Require(&static_cast<const Codec&>(codec).GetInternalProperties() == &entries,
          "the two GetInternalProperties differ");
  std::string path = program.Text();
  if (path.empty() || path.back() == '.') path += 'x';  // the last segment may not be empty
  const std::uint64_t before = Digest(codec.GetProperty());
  const std::string value = program.Text();
  if (program.Flag()) entries.erase(path);
  entries.put(path, value);
  Require(entries.get<std::string>(path) == value, "a runtime entry did not read back");
  if (entries.size() > 64) entries.clear();  // bounds the work of later steps
  Require(Digest(codec.GetProperty()) == before, "a runtime entry changed the property tree");
}

// clang-format off
constexpr void (*kOperations[])(State&, Program&) = {OpSet, OpSet, OpRead, OpStore,
    OpVideoGeometry, OpSetTree, OpCreate, OpClone, OpPrivateData, OpBlob, OpCompare,
    OpIsCompatible, OpBitrate, OpPrintAndEntries};
// clang-format on

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Program program(data, size);
  {
    State state;
    state.blobs[0] = Tarvek::CreateBlob("abc", 3);
    while (!program.Done()) {
      kOperations[program.Byte() % std::size(kOperations)](state, program);
      CheckState(state);
    }
  }
  Require(CountingBlob::Live() == 0, "a blob outlived every reference");
  return 0;
}
