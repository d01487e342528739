// Reference counting shared between threads: threads copy, read, clone and drop descriptions and
// blobs that no thread writes; the last references go with whichever thread ends last. A data
// race fails the ThreadSanitizer build; every build checks counts and frees.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include <Tarvek/Formats.h>

#include "Support/TestSupport.h"

namespace {

namespace Conf = Tarvek::Conf;
namespace Core = Tarvek::Core;
using VideoPtr = boost::intrusive_ptr<Conf::IFormatCodecVideo>;
using AudioPtr = boost::intrusive_ptr<Conf::IFormatCodecAudio>;
using SubtitlePtr = boost::intrusive_ptr<Conf::IFormatCodecSubtitle>;
using BlobPtr = boost::intrusive_ptr<Tarvek::IBlob>;
using ConstCodecPtr = boost::intrusive_ptr<const Conf::IFormatCodec>;

constexpr int kThreads = 4;
constexpr int kRounds = 200;

// A video description that counts its destructions.
class CountedVideo final : public Conf::FormatCodecVideo {
 public:
  static std::atomic<int>& Destroyed() {
    static std::atomic<int> destroyed{0};
    return destroyed;
  }
  CountedVideo()
      : FormatBase(TAG_FORMAT_CODEC_VIDEO),
        FormatCodec(TAG_FORMAT_CODEC_VIDEO),
        FormatCodecVideo() {}
  ~CountedVideo() override { ++Destroyed(); }
};

struct Descriptions {
  VideoPtr video;
  AudioPtr audio;
  SubtitlePtr subtitle;
  BlobPtr blob;
};

Descriptions Make() {
  Descriptions made;
  made.video = VideoPtr(new CountedVideo);
  made.video->SetCodecID("h264");
  made.video->InitByFrameAspect(720, 576, 16, 9);
  made.video->SetFrameRate(25, 1);
  made.video->SetBitrateMode(Conf::IFormatCodec::TAG_BITRATE_MODE_VBR);
  made.video->SetQuality(23);
  made.audio = Conf::FormatCodecAudio::Create();
  made.audio->SetCodecID("aac");
  made.audio->SetLanguage("eng");
  made.audio->SetSampleRate(48000);
  made.audio->SetChannelLayout(Conf::CH_LAYOUT_STEREO);
  made.audio->SetSampleFormat(AV_SAMPLE_FMT_FLTP);
  made.subtitle = Conf::FormatCodecSubtitle::Create();
  made.subtitle->SetTitle("Commentary");
  made.blob = TarvekTest::CountingBlob::Create();
  made.video->SetPrivateData(made.blob);
  made.audio->SetPrivateData(made.blob);
  return made;
}

// One thread's work: `shared` is read by all threads at once; `handover` holds this thread's own
// pointers to objects whose last reference some thread drops at its end. `bitrates` are the
// default video and audio bitrates. Returns the number of wrong results.
int ReadConcurrently(const Descriptions& shared, Descriptions handover, const long long* bitrates) {
  int wrong = 0;
  const auto check = [&wrong](bool ok) { wrong += ok ? 0 : 1; };
  try {
    for (int round = 0; round < kRounds; ++round) {
      const Descriptions& source = round % 2 == 0 ? shared : handover;
      const VideoPtr video = source.video;  // copies and drops, concurrently with other threads
      const AudioPtr audio = source.audio;
      const SubtitlePtr subtitle = source.subtitle;
      const ConstCodecPtr asCodec = video;

      check(video->GetWidth() == 720 && video->GetFrameAspectX() == 16);
      check(video->GetFrameRate() == 25.0 && video->GetCodecID() == "h264");
      check(audio->GetLanguage() == "eng" && audio->GetSampleRate() == 48000);
      check(subtitle->GetTitle() == "Commentary");
      check(Conf::GetDefaultVideoBitrate(asCodec) == bitrates[0]);
      check(Conf::GetDefaultAudioBitrate(audio) == bitrates[1]);
      check(video->IsCompatible(video) && !video->IsCompatible(audio) &&
            subtitle->IsCompatible(audio));

      try {  // a missing setting: the error, with its call stack, is built on this thread
        audio->GetFrameSize();
        check(false);
      } catch (const Core::ChildNotFound&) {
      }

      // The private data, shared by two descriptions and every thread.
      const BlobPtr blob = video->GetPrivateData();
      check(blob == audio->GetPrivateData() && blob->GetSize() == 4 && blob->GetData()[3] == 4);

      // Clones are this thread's own: writes to them are safe, and they take the blob too.
      const VideoPtr clone = video->Clone();
      check(clone->Compare(video) && video->Compare(clone));
      clone->SetCodecID("hevc");
      clone->SetPrivateData(blob);
      check(!clone->Compare(video) && video->GetCodecID() == "h264");
      const SubtitlePtr subtitleClone = source.subtitle->Clone();
      check(subtitleClone->Compare(subtitle));
    }
  } catch (...) {
    ++wrong;
  }
  return wrong;
}

TEST(RefCountThreadsTest, SharedReadsCopiesAndClonesKeepCountsRight) {
  const int videosBefore = CountedVideo::Destroyed();
  const int blobsBefore = TarvekTest::CountingBlob::Live();
  Descriptions shared = Make();
  Descriptions handover = Make();
  const long long bitrates[] = {Conf::GetDefaultVideoBitrate(ConstCodecPtr(shared.video)),
                                Conf::GetDefaultAudioBitrate(ConstCodecPtr(shared.audio))};

  std::vector<std::thread> threads;
  std::vector<int> wrong(kThreads, 0);
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&shared, &bitrates, &wrong, i, copy = handover] {
      wrong[static_cast<std::size_t>(i)] = ReadConcurrently(shared, copy, bitrates);
    });
  }
  // From here on only the threads hold the handed-over objects: the last one to end frees them.
  handover = Descriptions();
  for (std::thread& thread : threads) thread.join();

  EXPECT_EQ(wrong, std::vector<int>(kThreads, 0));
  EXPECT_EQ(CountedVideo::Destroyed(), videosBefore + 1);        // the handed-over video, once
  EXPECT_EQ(TarvekTest::CountingBlob::Live(), blobsBefore + 1);  // the shared blob only
  EXPECT_EQ(shared.video->GetRefCount(), 1);
  EXPECT_EQ(shared.audio->GetRefCount(), 1);
  EXPECT_EQ(shared.subtitle->GetRefCount(), 1);
  EXPECT_EQ(shared.blob->GetRefCount(), 3);  // here, and as the video's and audio's private data

  shared = Descriptions();
  EXPECT_EQ(CountedVideo::Destroyed(), videosBefore + 2);
  EXPECT_EQ(TarvekTest::CountingBlob::Live(), blobsBefore);
}

}  // namespace
