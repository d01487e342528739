// Exception safety under failing allocations. A counting replacement of the global operator new
// makes the n-th allocation of an operation throw std::bad_alloc, for n = 1, 2, ... until the
// operation runs to its end without meeting the failure. Every run must end in one of the two
// states a run without failures can end in: the state before the call (a failure or refusal
// changes nothing) or the state after it; and it must free every allocation it made.
#include <cstddef>
#include <new>
#include <string>

#include <gtest/gtest.h>

#include <Tarvek/Formats.h>
#include "Reliability/FailingAllocator.h"

namespace {

using Tarvek::Core::Property;
using TarvekTest::BlocksInUse;
using TarvekTest::FailAllocation;
using TarvekTest::StopFailing;
namespace Conf = Tarvek::Conf;
using CodecPtr = boost::intrusive_ptr<Conf::IFormatCodec>;

constexpr std::size_t kMostAllocations = 100000;

enum class Outcome { kDone, kRefused, kOutOfMemory };

template <class Subject, class Operation>
Outcome Run(Operation& operation, Subject& subject) {
  try {
    operation(subject);
  } catch (const std::bad_alloc&) {
    return Outcome::kOutOfMemory;
  } catch (const Tarvek::Exception&) {
    return Outcome::kRefused;
  }
  return Outcome::kDone;
}

// Runs `operation` on fresh subjects from `make` with each allocation failing in turn (see the
// top of the file). `stateOf` gives what must be equal between runs. Returns the number of
// allocations the operation makes.
template <class Make, class Operation, class StateOf>
std::size_t ExpectAllOrNothing(Make make, Operation operation, StateOf stateOf) {
  // A run without failures gives the state after; it also sets up any lazily built statics.
  auto reference = make();
  const auto before = stateOf(reference);
  const Outcome expectedOutcome = Run(operation, reference);
  const auto after = stateOf(reference);
  if (expectedOutcome == Outcome::kRefused) {
    EXPECT_TRUE(after == before) << "a refused call changed the state";
  }

  for (std::size_t n = 1; n <= kMostAllocations; ++n) {
    const std::size_t base = BlocksInUse();
    bool reached = false;
    Outcome outcome = Outcome::kDone;
    bool unchanged = false;
    bool completed = false;
    {
      auto subject = make();
      FailAllocation(n);
      outcome = Run(operation, subject);
      reached = StopFailing();
      const auto state = stateOf(subject);
      unchanged = state == before;
      completed = state == after;
    }
    // Checked before any expectation below can fail: a failure report allocates too.
    EXPECT_EQ(BlocksInUse(), base) << "allocation " << n << " failed and memory leaked";
    if (outcome == Outcome::kOutOfMemory) {
      EXPECT_TRUE(unchanged) << "allocation " << n << " failed and the state changed";
    } else {
      EXPECT_EQ(outcome, expectedOutcome) << "allocation " << n;
      EXPECT_TRUE(completed) << "allocation " << n << " was survived with another result";
    }
    if (!reached) return n - 1;
    if (::testing::Test::HasFailure()) return n;  // one report is enough
  }
  ADD_FAILURE() << "the operation never ran to its end";
  return kMostAllocations;
}

// What an operation may change on a description: the trees, the references to it, and the
// private data with the references to it.
struct DescriptionState {
  Property tree;
  boost::property_tree::ptree runtime;
  int references;
  std::string privateData;
  int privateReferences;

  bool operator==(const DescriptionState& other) const {
    return tree == other.tree && runtime == other.runtime && references == other.references &&
           privateData == other.privateData && privateReferences == other.privateReferences;
  }
};

DescriptionState StateOf(const CodecPtr& codec) {
  DescriptionState state{codec->GetProperty(), codec->GetInternalProperties(), codec->GetRefCount(),
                         "<none>", 0};
  if (const auto blob = codec->GetPrivateData()) {
    state.privateData.assign(reinterpret_cast<const char*>(blob->GetData()), blob->GetSize());
    state.privateReferences = blob->GetRefCount() - 1;  // less the one held here
  }
  return state;
}

// A description of each kind with settings, metadata, options, runtime entries and private data.
CodecPtr Filled(CodecPtr codec) {
  codec->SetCodecID("h264");
  codec->SetBitrate(4000000);
  codec->SetLossless(false);
  Property metadata("metadata");
  metadata.SetChildT<std::string>("title", "Intro");
  codec->SetMetadata(metadata);
  Property options("options");
  options.SetChildT<std::string>("preset", "slow");
  options.SetChildT<long long>("refs", 4);
  codec->SetOptionsEncode(options);
  codec->GetInternalProperties().put("session.id", "42");
  codec->SetPrivateData(Tarvek::CreateBlob("xy", 2));
  return codec;
}

CodecPtr Video() {
  auto codec = Filled(Conf::FormatCodecVideo::Create());
  auto* video = dynamic_cast<Conf::IFormatCodecVideo*>(codec.get());
  video->InitByPixelAspect(1920, 1080, 1, 1);
  video->SetFrameRate(25, 1);
  return codec;
}

CodecPtr Audio() {
  auto codec = Filled(Conf::FormatCodecAudio::Create());
  auto* audio = dynamic_cast<Conf::IFormatCodecAudio*>(codec.get());
  audio->SetLanguage("eng");
  audio->SetSampleRate(48000);
  return codec;
}

CodecPtr Subtitle() {
  auto codec = Filled(Conf::FormatCodecSubtitle::Create());
  dynamic_cast<Conf::IFormatCodecSubtitle*>(codec.get())->SetTitle("Commentary");
  return codec;
}

CodecPtr Generic() { return Filled(Conf::FormatCodec::Create()); }

using MakeCodec = CodecPtr (*)();
constexpr MakeCodec kKinds[] = {Generic, Video, Audio, Subtitle};

// Runs a description operation on a filled description of every kind, after `prepare`.
template <class Operation>
void ForEveryKind(Operation operation, void (*prepare)(CodecPtr&) = nullptr) {
  for (MakeCodec kind : kKinds) {
    SCOPED_TRACE(kind()->GetProperty().GetName());
    const auto make = [kind, prepare] {
      CodecPtr codec = kind();
      if (prepare != nullptr) prepare(codec);
      return codec;
    };
    EXPECT_GT(ExpectAllOrNothing(make, operation, StateOf), 0u);
  }
}

Property Options() {
  Property options("any name");
  options.SetChildT<std::string>("preset", "veryslow");
  options.SetChildT<long long>("bframes", 3);
  options.SetChild("x264-params").SetChildT<bool>("aq", true);
  return options;
}

struct Nothing {
  bool operator==(const Nothing&) const { return true; }
};
Nothing NoState(const Nothing&) { return {}; }
Nothing MakeNothing() { return {}; }

TEST(AllocationFailureTest, FactoriesAndConstructionLeakNothing) {
  const auto create = [](auto factory) { return [factory](Nothing&) { factory(); }; };
  EXPECT_GT(ExpectAllOrNothing(MakeNothing, create(&Conf::FormatCodec::Create), NoState), 0u);
  EXPECT_GT(ExpectAllOrNothing(MakeNothing, create(&Conf::FormatCodecVideo::Create), NoState), 0u);
  EXPECT_GT(ExpectAllOrNothing(MakeNothing, create(&Conf::FormatCodecAudio::Create), NoState), 0u);
  EXPECT_GT(ExpectAllOrNothing(MakeNothing, create(&Conf::FormatCodecSubtitle::Create), NoState),
            0u);
  EXPECT_GT(
      ExpectAllOrNothing(
          MakeNothing,
          [](Nothing&) { boost::intrusive_ptr<Conf::FormatBase> base(new Conf::FormatBase("b")); },
          NoState),
      0u);
  EXPECT_GT(ExpectAllOrNothing(
                MakeNothing, [](Nothing&) { Tarvek::CreateBlob("bytes", 5); }, NoState),
            0u);
}

TEST(AllocationFailureTest, CloneLeavesTheSourceAsItWas) {
  EXPECT_GT(
      ExpectAllOrNothing(
          Video, [](CodecPtr& c) { dynamic_cast<Conf::IFormatCodecVideo&>(*c).Clone(); }, StateOf),
      0u);
  EXPECT_GT(
      ExpectAllOrNothing(
          Audio, [](CodecPtr& c) { dynamic_cast<Conf::IFormatCodecAudio&>(*c).Clone(); }, StateOf),
      0u);
  EXPECT_GT(
      ExpectAllOrNothing(
          Subtitle, [](CodecPtr& c) { dynamic_cast<Conf::IFormatCodecSubtitle&>(*c).Clone(); },
          StateOf),
      0u);
}

// The typed child helpers on a container (overwrite in place, append) and on a leaf (refused,
// with an error built from the node's name and type and the call stack).
TEST(AllocationFailureTest, TypedChildHelpersAreAllOrNothing) {
  const auto tree = [] {
    Property node("settings");
    node.SetChildT<std::string>("codec_id", "a codec identifier too long for a short string");
    node.SetChildT<long long>("width", 720);
    node.SetChild("nested").SetChildT<bool>("flag", true);
    return node;
  };
  const auto leaf = [] { return Property("leaf", 5LL); };
  const auto same = [](const Property& node) { return node; };

  const auto helpers = {
      +[](Property& p) { p.SetChildT<std::string>("codec_id", std::string(100, 'y')); },
      +[](Property& p) { p.SetChildT<std::string>("new child", std::string(100, 'y')); },
      +[](Property& p) { p.SetChildT<std::string>("width", std::string(100, 'y')); },
      +[](Property& p) { p.SetChildT<std::string>("nested", std::string(100, 'y')); },
      +[](Property& p) { p.SetChildT<long long>("height", 576); },
      +[](Property& p) { p.SetChildT<bool>("flag", false); },
      +[](Property& p) { p.CreateChildT<std::string>("codec_id", std::string(100, 'z')); },
      +[](Property& p) { p.CreateChildT<long long>("width", 1); },
      +[](Property& p) { p.CreateChildT<bool>("flag", true); },
  };
  for (auto helper : helpers) {
    EXPECT_GT(ExpectAllOrNothing(tree, helper, same), 0u);
    EXPECT_GT(ExpectAllOrNothing(leaf, helper, same), 0u);
  }
}

// Copies of string values: a copy that fails part-way must leave nothing half-built behind (the
// variant's own copy constructor in libstdc++ 12 did, which the sanitized build reports).
TEST(AllocationFailureTest, CopiesOfStringValuesAreAllOrNothing) {
  const auto strings = [] {
    Property node("strings");
    node.SetChildT<std::string>("first", std::string(60, 'a'));
    node.SetChild("nested").SetChildT<std::string>("second", std::string(60, 'b'));
    return node;
  };
  const auto same = [](const Property& node) { return node; };
  EXPECT_GT(ExpectAllOrNothing(
                strings, [](Property& p) { Property copy(p); }, same),
            0u);
  EXPECT_GT(ExpectAllOrNothing(
                strings, [](Property& p) { p = Property("other", std::string(60, 'c')); }, same),
            0u);
  EXPECT_GT(ExpectAllOrNothing([] { return Property("leaf", 1LL); },
                               [&strings](Property& p) { p = strings(); }, same),
            0u);
}

TEST(AllocationFailureTest, SetPropertyIsAllOrNothing) {
  Property withMetadata("tree");
  withMetadata.SetChildT<std::string>("codec_id", std::string(40, 'c'));
  withMetadata.SetChild("metadata").SetChildT<std::string>("language", "fra");
  Property withoutMetadata("tree");
  withoutMetadata.SetChildT<long long>("width", 640);
  withoutMetadata.SetChild("encode_options").SetChildT<bool>("fast", true);
  Property leaf("tree", std::string(40, 'l'));
  for (const Property* tree : {&withMetadata, &withoutMetadata, &leaf}) {
    ForEveryKind([tree](CodecPtr& c) { c->SetProperty(*tree); });
  }
  // The description's own tree and sub-trees, which must be copied before they are replaced.
  ForEveryKind([](CodecPtr& c) { c->SetProperty(c->GetProperty()); });
  ForEveryKind([](CodecPtr& c) { c->SetProperty(c->GetMetadata()); });
}

TEST(AllocationFailureTest, SettersAreAllOrNothing) {
  ForEveryKind([](CodecPtr& c) { c->SetCodecName(std::string(50, 'n')); });
  ForEveryKind([](CodecPtr& c) { c->SetCodecID(std::string(50, 'i')); });
  ForEveryKind([](CodecPtr& c) { c->SetBitrateMode("vbr"); });
  ForEveryKind([](CodecPtr& c) { c->SetQuality(23); });
  ForEveryKind([](CodecPtr& c) { c->SetThreadNumber(8); });
  ForEveryKind([](CodecPtr& c) { c->SetTwoPassEncoding(true); });
  ForEveryKind([](CodecPtr& c) { c->SetMetadata(Options()); });
  ForEveryKind([](CodecPtr& c) { c->SetMetadata(c->GetProperty()); });
  ForEveryKind([](CodecPtr& c) { c->SetOptionsEncode(Options()); });
  ForEveryKind([](CodecPtr& c) { c->SetOptionsAnalyze(Options()); });
  // Metadata and options that are leaves, replaced by trees: type, value and children change.
  ForEveryKind([](CodecPtr& c) { c->SetMetadata(Options()); },
               [](CodecPtr& c) { c->SetMetadata(Property("m", 7LL)); });
  ForEveryKind([](CodecPtr& c) { c->SetOptionsEncode(Options()); },
               [](CodecPtr& c) { c->SetOptionsEncode(Property("o", "a leaf")); });
  ForEveryKind([](CodecPtr& c) { c->SetPrivateData(Tarvek::CreateBlob("new", 3)); });
  EXPECT_GT(ExpectAllOrNothing(
                Audio,
                [](CodecPtr& c) {
                  dynamic_cast<Conf::IFormatCodecAudio&>(*c).SetLanguage(std::string(30, 'l'));
                },
                StateOf),
            0u);
  EXPECT_GT(ExpectAllOrNothing(
                Subtitle,
                [](CodecPtr& c) {
                  dynamic_cast<Conf::IFormatCodecSubtitle&>(*c).SetAuthor(std::string(30, 'a'));
                },
                StateOf),
            0u);
  EXPECT_GT(ExpectAllOrNothing(
                Video,
                [](CodecPtr& c) {
                  dynamic_cast<Conf::IFormatCodecVideo&>(*c).SetPixelFormat(AV_PIX_FMT_YUV420P);
                },
                StateOf),
            0u);
}

// Setting the options after SetProperty removed their child recreates it: the child must not be
// left behind, empty, when the copy of the options fails.
TEST(AllocationFailureTest, SetOptionsRecreatesTheChildAllOrNothing) {
  const auto withoutOptions = [] {
    CodecPtr codec = Video();
    Property tree("any");
    tree.SetChildT<std::string>("codec_id", "h264");
    codec->SetProperty(tree);
    return codec;
  };
  EXPECT_GT(ExpectAllOrNothing(
                withoutOptions, [](CodecPtr& c) { c->SetOptionsEncode(Options()); }, StateOf),
            0u);
  EXPECT_GT(ExpectAllOrNothing(
                withoutOptions, [](CodecPtr& c) { c->SetOptionsAnalyze(Options()); }, StateOf),
            0u);
}

// Refusals build their errors (items, description, call stack) from allocations too; a failure
// there reaches the caller as std::bad_alloc and still changes nothing.
TEST(AllocationFailureTest, ErrorPathsChangeNothing) {
  using CP = boost::intrusive_ptr<const Conf::IFormatCodec>;
  // A missing setting, and a setting of another type.
  ForEveryKind([](CodecPtr& c) { c->GetQuality(); });
  ForEveryKind([](CodecPtr& c) { c->GetLossless(); },
               [](CodecPtr& c) {
                 Property tree(c->GetProperty());
                 tree.SetChildT<std::string>(Conf::IFormatCodec::TAG_LOSSLESS, "yes");
                 c->SetProperty(tree);
               });
  // A Set into a leaf metadata child.
  EXPECT_GT(ExpectAllOrNothing(
                [] {
                  CodecPtr codec = Audio();
                  codec->SetMetadata(Property("m", true));
                  return codec;
                },
                [](CodecPtr& c) {
                  dynamic_cast<Conf::IFormatCodecAudio&>(*c).SetLanguage(std::string(30, 'l'));
                },
                StateOf),
            0u);
  // The bitrate functions: the wrong kind (or a missing setting), a codec the presets do not know.
  ForEveryKind([](CodecPtr& c) { Conf::GetDefaultAudioBitrate(CP(c)); });
  ForEveryKind([](CodecPtr& c) { Conf::GetMaxVideoBitrate(CP(c)); });
  EXPECT_GT(ExpectAllOrNothing(
                [] {
                  CodecPtr codec = Video();
                  codec->SetCodecID("no such codec");
                  codec->SetBitrateMode("cbr");
                  return codec;
                },
                [](CodecPtr& c) { Conf::GetMinVideoBitrate(CP(c)); }, StateOf),
            0u);
  EXPECT_GT(ExpectAllOrNothing(
                MakeNothing, [](Nothing&) { Tarvek::CreateBlob(nullptr, 1); }, NoState),
            0u);
}

// Reading an integer or a flag, testing for a setting, comparing and testing compatibility sit on
// the hot paths of media applications; none of them may allocate. With every allocation set to
// fail, they must all still run (after one warm-up call, which may build lasting statics).
TEST(AllocationFailureTest, IntegerAndFlagReadsCompareAndCompatibilityAllocateNothing) {
  const CodecPtr video = Video();
  const CodecPtr twin = Video();
  const auto& v = dynamic_cast<const Conf::IFormatCodecVideo&>(*video);
  const auto reads = [&] {
    long long sum = v.GetBitrate() + v.GetWidth() + v.GetHeight() + v.GetPixelAspectX() +
                    v.GetPixelAspectY() + v.GetFrameRateNum() + v.GetFrameRateDen() +
                    static_cast<long long>(v.GetLossless());
    sum += static_cast<long long>(v.ExistsQuality()) + static_cast<long long>(v.ExistsCodecID()) +
           static_cast<long long>(v.ExistsPixelFormat());
    sum += static_cast<long long>(video->Compare(twin)) +
           static_cast<long long>(video->IsCompatible(twin));
    return sum;
  };
  const long long expected = reads();
  FailAllocation(1);
  long long got = 0;
  EXPECT_NO_THROW(got = reads());
  EXPECT_FALSE(StopFailing()) << "an allocation was made";
  EXPECT_EQ(got, expected);
}

}  // namespace
