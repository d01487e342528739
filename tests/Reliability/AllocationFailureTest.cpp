// Exception safety: the n-th allocation of an operation throws std::bad_alloc, for n = 1, 2, ...
// until it runs to its end. Each run must end in the state before the call or the state a run
// without failures ends in, and free every allocation it made.
#include <cstddef>
#include <iterator>
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

// Runs `operation` on fresh subjects from `make` with each allocation failing in turn; `stateOf`
// gives what must be equal between runs. Expects the operation to allocate at all.
template <class Make, class Operation, class StateOf>
void ExpectAllOrNothing(Make make, Operation operation, StateOf stateOf) {
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
    EXPECT_TRUE(reached || n > 1) << "the operation allocates nothing";
    if (!reached || ::testing::Test::HasFailure()) return;  // one report is enough
  }
  ADD_FAILURE() << "the operation never ran to its end";
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

Property Options() {
  Property options("any name");
  options.SetChildT<std::string>("preset", "veryslow");
  options.SetChildT<long long>("bframes", 3);
  options.SetChild("x264-params").SetChildT<bool>("aq", true);
  return options;
}

template <class Interface>
Interface& As(CodecPtr& codec) {
  return dynamic_cast<Interface&>(*codec);
}

// Description operations, each on a filled description of `kind` (or of every kind when null)
// after `prepare`. Refusals build their errors (items, call stack) from allocations too.
TEST(AllocationFailureTest, DescriptionOperationsAreAllOrNothing) {
  using Op = void (*)(CodecPtr&);
  using CP = boost::intrusive_ptr<const Conf::IFormatCodec>;
  struct Case {
    MakeCodec kind;
    Op prepare;
    Op operation;
  };
  const Case cases[] = {
      {Video, nullptr, [](CodecPtr& c) { As<Conf::IFormatCodecVideo>(c).Clone(); }},
      {Audio, nullptr, [](CodecPtr& c) { As<Conf::IFormatCodecAudio>(c).Clone(); }},
      {Subtitle, nullptr, [](CodecPtr& c) { As<Conf::IFormatCodecSubtitle>(c).Clone(); }},
      // SetProperty with a tree with and without metadata, a leaf, and its own tree and sub-tree
      // (which must be copied before they are replaced).
      {nullptr, nullptr,
       [](CodecPtr& c) {
         Property tree("tree");
         tree.SetChildT<std::string>("codec_id", std::string(40, 'c'));
         tree.SetChild("metadata").SetChildT<std::string>("language", "fra");
         c->SetProperty(tree);
       }},
      {nullptr, nullptr,
       [](CodecPtr& c) {
         Property tree("tree");
         tree.SetChildT<long long>("width", 640);
         tree.SetChild("encode_options").SetChildT<bool>("fast", true);
         c->SetProperty(tree);
       }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetProperty(Property("t", std::string(40, 'l'))); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetProperty(c->GetProperty()); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetProperty(c->GetMetadata()); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetCodecName(std::string(50, 'n')); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetCodecID(std::string(50, 'i')); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetBitrateMode("vbr"); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetQuality(23); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetThreadNumber(8); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetTwoPassEncoding(true); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetMetadata(Options()); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetMetadata(c->GetProperty()); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetOptionsEncode(Options()); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetOptionsAnalyze(Options()); }},
      {nullptr, nullptr, [](CodecPtr& c) { c->SetPrivateData(Tarvek::CreateBlob("new", 3)); }},
      // Metadata and options that are leaves, replaced by trees: type, value and children change.
      {nullptr, [](CodecPtr& c) { c->SetMetadata(Property("m", 7LL)); },
       [](CodecPtr& c) { c->SetMetadata(Options()); }},
      {nullptr, [](CodecPtr& c) { c->SetOptionsEncode(Property("o", "a leaf")); },
       [](CodecPtr& c) { c->SetOptionsEncode(Options()); }},
      // Options after SetProperty removed their child: the child must not be left behind, empty,
      // when the copy of the options fails.
      {Video, [](CodecPtr& c) { c->SetProperty(Property("any")); },
       [](CodecPtr& c) { c->SetOptionsEncode(Options()); }},
      {Video, [](CodecPtr& c) { c->SetProperty(Property("any")); },
       [](CodecPtr& c) { c->SetOptionsAnalyze(Options()); }},
      {Audio, nullptr,
       [](CodecPtr& c) { As<Conf::IFormatCodecAudio>(c).SetLanguage(std::string(30, 'l')); }},
      {Subtitle, nullptr,
       [](CodecPtr& c) { As<Conf::IFormatCodecSubtitle>(c).SetAuthor(std::string(30, 'a')); }},
      {Video, nullptr,
       [](CodecPtr& c) { As<Conf::IFormatCodecVideo>(c).SetPixelFormat(AV_PIX_FMT_YUV420P); }},
      // Refusals: a missing setting, one of another type, a Set into a leaf metadata child, the
      // bitrate functions (wrong kind or missing setting, a codec the presets do not know).
      {nullptr, nullptr, [](CodecPtr& c) { c->GetQuality(); }},
      {nullptr,
       [](CodecPtr& c) {
         Property tree(c->GetProperty());
         tree.SetChildT<std::string>(Conf::IFormatCodec::TAG_LOSSLESS, "yes");
         c->SetProperty(tree);
       },
       [](CodecPtr& c) { c->GetLossless(); }},
      {Audio, [](CodecPtr& c) { c->SetMetadata(Property("m", true)); },
       [](CodecPtr& c) { As<Conf::IFormatCodecAudio>(c).SetLanguage(std::string(30, 'l')); }},
      {nullptr, nullptr, [](CodecPtr& c) { Conf::GetDefaultAudioBitrate(CP(c)); }},
      {nullptr, nullptr, [](CodecPtr& c) { Conf::GetMaxVideoBitrate(CP(c)); }},
      {Video,
       [](CodecPtr& c) {
         c->SetCodecID("no such codec");
         c->SetBitrateMode("cbr");
       },
       [](CodecPtr& c) { Conf::GetMinVideoBitrate(CP(c)); }},
  };
  for (const Case& test : cases) {
    for (MakeCodec kind : kKinds) {
      if (test.kind != nullptr && test.kind != kind) continue;
      SCOPED_TRACE(kind()->GetProperty().GetName() + " case " +
                   std::to_string(&test - std::begin(cases)));
      const auto make = [kind, prepare = test.prepare] {
        CodecPtr codec = kind();
        if (prepare != nullptr) prepare(codec);
        return codec;
      };
      ExpectAllOrNothing(make, test.operation, StateOf);
    }
  }
}

struct Nothing {
  bool operator==(const Nothing&) const { return true; }
};
Nothing NoState(const Nothing&) { return {}; }
Nothing MakeNothing() { return {}; }

TEST(AllocationFailureTest, FactoriesLeakNothing) {
  using Op = void (*)(Nothing&);
  for (const Op factory : std::initializer_list<Op>{
           [](Nothing&) { Conf::FormatCodec::Create(); },
           [](Nothing&) { Conf::FormatCodecVideo::Create(); },
           [](Nothing&) { Conf::FormatCodecAudio::Create(); },
           [](Nothing&) { Conf::FormatCodecSubtitle::Create(); },
           [](Nothing&) { boost::intrusive_ptr<Conf::FormatBase>(new Conf::FormatBase("b")); },
           [](Nothing&) { Tarvek::CreateBlob("bytes", 5); },
           [](Nothing&) { Tarvek::CreateBlob(nullptr, 1); }}) {
    ExpectAllOrNothing(MakeNothing, factory, NoState);
  }
}

// The typed child helpers on a container (overwrite in place, append) and on a leaf (refused);
// copies of string values, which must leave nothing half-built behind when they fail part-way
// (the variant's own copy constructor in libstdc++ 12 did, which the sanitized build reports).
TEST(AllocationFailureTest, PropertyEditsAreAllOrNothing) {
  const auto tree = [] {
    Property node("settings");
    node.SetChildT<std::string>("codec_id", "a codec identifier too long for a short string");
    node.SetChildT<long long>("width", 720);
    node.SetChild("nested").SetChildT<std::string>("second", std::string(60, 'b'));
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
    ExpectAllOrNothing(tree, helper, same);
    ExpectAllOrNothing(leaf, helper, same);
  }
  ExpectAllOrNothing(
      tree, [](Property& p) { Property copy(p); }, same);
  ExpectAllOrNothing(
      tree, [](Property& p) { p = Property("other", std::string(60, 'c')); }, same);
  ExpectAllOrNothing(
      leaf, [&tree](Property& p) { p = tree(); }, same);
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
