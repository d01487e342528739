// The descriptions: the layout masks, reference counting, the printed content, the derived values
// of video and the compatibility test of every kind. The description fuzz target checks the rest:
// the setting accessors (where each write lands, the keys kept apart), Create's defaults, Clone,
// Compare, SetProperty and the option setters (with trees of their own), and the private data's
// references.
#include <Tarvek/Formats.h>

#include <cmath>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

extern "C" {
#include <libavutil/channel_layout.h>
}

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;
using Tarvek::Core::Property;
using TarvekTest::CatchAs;
using TarvekTest::MissingKey;
using Format = boost::intrusive_ptr<const IFormat>;

static_assert(std::is_same_v<std::underlying_type_t<ChannelLayout>, std::uint32_t>);

template <class T, class = void>
struct HasClone : std::false_type {};
template <class T>
struct HasClone<T, std::void_t<decltype(std::declval<T&>().Clone())>> : std::true_type {};
// Video and audio descriptions clone through const ones too; subtitles only through non-const.
static_assert(HasClone<const IFormatCodecVideo>::value &&
              HasClone<const IFormatCodecAudio>::value && HasClone<IFormatCodecSubtitle>::value &&
              !HasClone<const IFormatCodecSubtitle>::value);

// Its arguments as a vector, to list many values without one line each.
template <class First, class... Rest>
std::vector<First> List(const First& first, const Rest&... rest) {
  return {first, rest...};
}

// Masks exchanged with media libraries must mean the same speakers there.
TEST(KeysTest, ChannelLayoutsAreLibavutilsMasks) {
#define SAME(name) std::pair<std::uint64_t, std::uint64_t>(CH_##name, AV_CH_##name)
  const auto rows =
      List(SAME(FRONT_LEFT), SAME(FRONT_RIGHT), SAME(FRONT_CENTER), SAME(LOW_FREQUENCY),
           SAME(BACK_LEFT), SAME(BACK_RIGHT), SAME(FRONT_LEFT_OF_CENTER),
           SAME(FRONT_RIGHT_OF_CENTER), SAME(BACK_CENTER), SAME(SIDE_LEFT), SAME(SIDE_RIGHT),
           SAME(TOP_CENTER), SAME(TOP_FRONT_LEFT), SAME(TOP_FRONT_CENTER), SAME(TOP_FRONT_RIGHT),
           SAME(TOP_BACK_LEFT), SAME(TOP_BACK_CENTER), SAME(TOP_BACK_RIGHT), SAME(LAYOUT_MONO),
           SAME(LAYOUT_STEREO), SAME(LAYOUT_2POINT1), SAME(LAYOUT_2_1), SAME(LAYOUT_SURROUND),
           SAME(LAYOUT_3POINT1), SAME(LAYOUT_4POINT0), SAME(LAYOUT_4POINT1), SAME(LAYOUT_2_2),
           SAME(LAYOUT_QUAD), SAME(LAYOUT_5POINT0), SAME(LAYOUT_5POINT1), SAME(LAYOUT_5POINT0_BACK),
           SAME(LAYOUT_5POINT1_BACK), SAME(LAYOUT_6POINT0), SAME(LAYOUT_6POINT1),
           SAME(LAYOUT_7POINT0), SAME(LAYOUT_7POINT1), SAME(LAYOUT_7POINT1_WIDE));
#undef SAME
  for (const auto& [ours, theirs] : rows) {
    EXPECT_EQ(static_cast<std::uint64_t>(ours), theirs) << std::hex << "libavutil's 0x" << theirs;
  }
}

// A description that records its destruction, to see when Release frees the whole object.
class TrackedFormat : public FormatBase {
 public:
  TrackedFormat(const std::string& name, bool* destroyed)
      : FormatBase(name), destroyed_(destroyed) {}
  ~TrackedFormat() override { *destroyed_ = true; }

 private:
  bool* destroyed_;
};

// The count starts at 0 for the first intrusive_ptr to take; only the Release that reaches 0
// frees the object, derived part included.
TEST(FormatBaseTest, OnlyTheLastReleaseFreesTheObject) {
  bool destroyed = false;
  const auto* raw = new TrackedFormat("x", &destroyed);
  EXPECT_EQ(raw->GetRefCount(), 0);
  boost::intrusive_ptr<const IFormat> held(raw);
  EXPECT_EQ(raw->AddRef(), 2);
  EXPECT_EQ(raw->Release(), 1);
  EXPECT_FALSE(destroyed);
  EXPECT_EQ(held.detach()->Release(), 0);
  EXPECT_TRUE(destroyed);
}

// The runtime entry key is read by tools that inspect descriptions, so its text is fixed; runtime
// entries print in insertion order, top level only ("a.b" shows as the empty "a").
TEST(FormatBaseTest, NewBaseAndItsPrintedContent) {
  FormatBase base("desc");
  Property expected("desc");
  expected.SetChild(IFormat::TAG_METADATA);
  EXPECT_EQ(base.GetProperty(), expected);
  EXPECT_EQ(&base.GetMetadata(), &base.GetProperty().GetChildren().front());
  auto& internal = base.GetInternalProperties();
  ASSERT_EQ(internal.size(), 1u);
  EXPECT_TRUE(internal.front().second.empty());

  Property metadata("ignored");
  metadata.SetChildT<std::string>("language", "eng");
  base.SetMetadata(metadata);
  internal.put("zeta", "1");
  internal.put("a.b", "hidden");
  internal.put("alpha", "two words");
  TarvekTest::CaptureStdout capture;
  base.PrintContent();
  EXPECT_EQ(capture.Text(),
            "======External props:=====\n"
            "desc (container)\n"
            "  metadata (container)\n"
            "    language (string): \"eng\"\n"
            "======Runtime props:=======\n"
            "object_name: desc\n"
            "zeta: 1\n"
            "a: \n"
            "alpha: two words\n");
}

// The layout is read by people diagnosing streams and by tools that diff it: fixed to the byte,
// the empty object name included.
TEST(FormatCodecTest, PrintContentOfNewDescriptionIsExact) {
  TarvekTest::CaptureStdout capture;
  FormatCodec::Create()->PrintContent();
  EXPECT_EQ(capture.Text(),
            "======External props:=====\n"
            "<unnamed> (container)\n"
            "  metadata (container)\n"
            "  encode_options (container)\n"
            "  analyze_options (container)\n"
            "  codec_name (string): \"Unknown codec\"\n"
            "======Runtime props:=======\n"
            "object_name: \n");
}

// Numerator over denominator, the denominator read first: when it is 0 the rate is 0 and the
// numerator is not read at all. The frame aspect reads aspect X, width, aspect Y, height.
TEST(FormatCodecVideoTest, DerivedValuesReadTheirSettingsInOrder) {
  const auto video = FormatCodecVideo::Create();
  EXPECT_EQ(MissingKey([&] { video->GetFrameRate(); }), IFormatCodecVideo::TAG_TIMEBASE_D);
  video->SetFrameRateDen(0);
  EXPECT_EQ(video->GetFrameRate(), 0.0);
  video->SetFrameRateDen(1);
  EXPECT_EQ(MissingKey([&] { video->GetFrameRate(); }), IFormatCodecVideo::TAG_TIMEBASE_N);
  video->SetFrameRate(4294967295u, 2);
  EXPECT_DOUBLE_EQ(video->GetFrameRate(), 4294967295.0 / 2);

  EXPECT_EQ(MissingKey([&] { video->GetFrameAspectX(); }), IFormatCodecVideo::TAG_ASPECTX);
  auto& concrete = dynamic_cast<FormatCodecVideo&>(*video);
  concrete.SetPixelAspectX(1);
  EXPECT_EQ(MissingKey([&] { video->GetFrameAspectY(); }), IFormatCodecVideo::TAG_WIDTH);
  concrete.SetWidth(1);
  EXPECT_EQ(MissingKey([&] { video->GetFrameAspect(); }), IFormatCodecVideo::TAG_ASPECTY);
  concrete.SetPixelAspectY(1);
  EXPECT_EQ(MissingKey([&] { video->GetFrameAspectX(); }), IFormatCodecVideo::TAG_HEIGHT);
}

// InitByFrameAspect stores the pixel aspect that gives the frame aspect back; products above 32
// bits reduce exactly, a reduced term beyond 32 bits keeps its low 32 bits, and the aspect
// divides in double precision (x:0 is infinite, 0:0 not a number).
TEST(FormatCodecVideoTest, FrameAndPixelAspectsConvertExactly) {
  const struct {
    bool byFrame;
    unsigned int width, height, givenX, givenY, pixelX, pixelY, frameX, frameY;
  } rows[] = {
      {true, 720, 576, 16, 9, 64, 45, 16, 9},
      {true, 720, 480, 4, 3, 8, 9, 4, 3},
      {true, 1920, 1080, 16, 9, 1, 1, 16, 9},
      {true, 1440, 1080, 16, 9, 4, 3, 16, 9},
      {true, 65536, 65536, 65536, 32768, 2, 1, 2, 1},  // 2^32 : 2^31
      {false, 65536, 65536, 65536, 32768, 65536, 32768, 2, 1},
      {false, 4294967295u, 4294967295u, 4294967295u, 4294967295u, 4294967295u, 4294967295u, 1, 1},
      // (2^32-1)(2^32-2) : 2 reduces to (2^32-1)(2^31-1) : 1.
      {false, 4294967295u, 1, 4294967294u, 2, 4294967294u, 2, 2147483649u, 1},
      {false, 0, 1080, 1, 1, 1, 1, 0, 1},
      {false, 1920, 0, 1, 1, 1, 1, 1, 0},
      {false, 0, 0, 1, 1, 1, 1, 0, 0},
  };
  const auto video = FormatCodecVideo::Create();
  for (const auto& r : rows) {
    SCOPED_TRACE(std::to_string(r.width) + "x" + std::to_string(r.height) + " " +
                 std::to_string(r.givenX) + ":" + std::to_string(r.givenY));
    if (r.byFrame) {
      video->InitByFrameAspect(r.width, r.height, r.givenX, r.givenY);
    } else {
      video->InitByPixelAspect(r.width, r.height, r.givenX, r.givenY);
    }
    EXPECT_EQ(video->GetWidth(), r.width);
    EXPECT_EQ(video->GetHeight(), r.height);
    EXPECT_EQ(video->GetPixelAspectX(), r.pixelX);
    EXPECT_EQ(video->GetPixelAspectY(), r.pixelY);
    EXPECT_EQ(video->GetFrameAspectX(), r.frameX);
    EXPECT_EQ(video->GetFrameAspectY(), r.frameY);
    const double aspect = video->GetFrameAspect();
    if (r.frameY != 0 || r.frameX != 0) {
      EXPECT_DOUBLE_EQ(aspect, static_cast<double>(r.frameX) / r.frameY);
    } else {
      EXPECT_TRUE(std::isnan(aspect));
    }
  }
}

// The audio language lives in the metadata; one of another type is reported, not hidden.
TEST(FormatCodecAudioTest, MistypedLanguageIsReported) {
  const auto audio = FormatCodecAudio::Create();
  Property metadata("m");
  metadata.SetChildT<long long>(IFormatCodec::TAG_LANGUAGE, 7);
  audio->SetMetadata(metadata);
  EXPECT_TRUE(audio->ExistsLanguage());
  EXPECT_TRUE(CatchAs<Tarvek::Core::WrongPropertyType>([&] { audio->GetLanguage(); }));
}

boost::intrusive_ptr<IFormatCodecVideo> Video(unsigned w, unsigned h, unsigned x, unsigned y) {
  auto video = FormatCodecVideo::Create();
  video->InitByPixelAspect(w, h, x, y);
  return video;
}

boost::intrusive_ptr<IFormatCodecAudio> Audio(int rate, ChannelLayout layout, AVSampleFormat f) {
  auto audio = FormatCodecAudio::Create();
  audio->SetSampleRate(rate);
  audio->SetChannelLayout(layout);
  audio->SetSampleFormat(f);
  return audio;
}

// Video compares the geometry only, audio the rate, layout and sample format only, and neither
// accepts null or another kind; the base and subtitles accept anything. The other description
// gets its reference back, also when a missing setting throws (the first one read is named).
TEST(CompatibilityTest, EachKindComparesItsOwnSettingsOnly) {
  const auto sd = Video(720, 576, 64, 45);
  const auto sdOther = Video(720, 576, 64, 45);
  sdOther->SetCodecID("mpeg2video");
  sdOther->SetFrameRate(25, 1);
  sdOther->SetPixelFormat(AV_PIX_FMT_YUV422P);
  const auto stereo = Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  const auto stereoOther = Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  stereoOther->SetFrameSize(1024);
  stereoOther->SetLanguage("eng");
  stereoOther->SetCodecID("opus");
  const Format subtitle = FormatCodecSubtitle::Create();
  const Format codec = FormatCodec::Create();
  const Format base(new FormatBase("base"));
  const struct {
    Format a, b;
    bool compatible;
  } rows[] = {
      {sd, sdOther, true},
      {sdOther, sd, true},
      {sd, sd->Clone(), true},
      {sd, Video(721, 576, 64, 45), false},
      {sd, Video(720, 576, 64, 46), false},
      {sd, nullptr, false},
      {sd, stereo, false},
      {sd, codec, false},
      {stereo, stereoOther, true},
      {stereo, Audio(44100, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP), false},
      {stereo, Audio(48000, CH_LAYOUT_MONO, AV_SAMPLE_FMT_FLTP), false},
      {stereo, Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16), false},
      {stereo, nullptr, false},
      {stereo, sd, false},
      {subtitle, sd, true},
      {subtitle, stereo, true},
      {subtitle, nullptr, true},
      {base, new FormatBase("other"), true},
      {base, codec, true},
      {base, nullptr, true},
  };
  int index = 0;
  for (const auto& row : rows) {
    const int held = row.b ? row.b->GetRefCount() : 0;
    EXPECT_EQ(row.a->IsCompatible(row.b), row.compatible) << "row " << index++;
    EXPECT_EQ(row.b ? row.b->GetRefCount() : 0, held);
  }

  const auto bare = FormatCodecVideo::Create();
  const auto rateOnly = FormatCodecAudio::Create();
  rateOnly->SetSampleRate(48000);
  const int sdHeld = sd->GetRefCount(), stereoHeld = stereo->GetRefCount();
  EXPECT_EQ(MissingKey([&] { sd->IsCompatible(bare); }), IFormatCodecVideo::TAG_WIDTH);
  EXPECT_EQ(bare->GetRefCount(), 1);
  EXPECT_EQ(MissingKey([&] { bare->IsCompatible(sd); }), IFormatCodecVideo::TAG_WIDTH);
  EXPECT_EQ(MissingKey([&] { rateOnly->IsCompatible(stereo); }), IFormatCodecAudio::TAG_LAYOUT);
  EXPECT_EQ(sd->GetRefCount(), sdHeld);
  EXPECT_EQ(stereo->GetRefCount(), stereoHeld);
}

}  // namespace
