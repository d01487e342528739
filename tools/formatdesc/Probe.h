// formatdesc probe: the streams of a media file, read with libavformat and described by the FFmpeg
// bridge library, and a verdict on each stream's bitrate against the range the presets give for
// it. This file keeps the presentation: which streams count as damaged, the verdicts, the text
// and the JSON.
#ifndef TARVEK_TOOLS_FORMATDESC_PROBE_H_
#define TARVEK_TOOLS_FORMATDESC_PROBE_H_

#include <Tarvek/Formats.h>

#include <iosfwd>
#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <vector>

#include "Describe.h"

struct AVFormatContext;

namespace Formatdesc {

/// Where a bitrate lies against the presets' minimum to maximum.
enum class Placement { Below, Within, Above };

/// "below", "within" or "above".
const char* PlacementName(Placement placement);

/// A bitrate judged against a range, all in bits per second.
struct Verdict {
  Placement placement = Placement::Within;
  long long bitrate = 0;
  /// The bound passed: the minimum when below, the maximum when above; 0 within the range.
  long long bound = 0;
  /// How far past the bound, always positive outside the range; 0 within it.
  long long difference = 0;
  /// `difference` as a share of `bound`, in per cent.
  double percent = 0.0;
};

/// `bitrate` against `range`: within from range.minimum to range.maximum, both included.
Verdict JudgeBitrate(long long bitrate, const Bitrates& range);

/// "within the range", or how far outside and which bound, in the tool's bitrate units:
/// "below the range by 62% (1.98 Mb/s under the minimum of 3.20 Mb/s)",
/// "above the range by 150% (3.00 Mb/s over the maximum of 2.00 Mb/s)"; a share under one per
/// cent reads "less than 1%".
std::string VerdictText(const Verdict& verdict);

/// What the probe made of one stream of a file.
struct StreamReport {
  int index = 0;
  /// libavutil's name of the stream's media kind: "video", "audio", "subtitle", "data",
  /// "attachment", or "unknown".
  std::string kind;
  /// FFmpeg's name of the stream's codec ("none" when libavformat does not know it).
  std::string codec;
  /// The description; null for a stream of another kind (skipped) or a damaged one.
  boost::intrusive_ptr<Tarvek::Conf::IFormatCodec> description;
  /// Why a video, audio or subtitle stream could not be described; empty when it was.
  std::string damage;
  /// Values the file does not give, or gives in a form the library cannot hold, and that the
  /// description therefore leaves unset, one sentence each.
  std::vector<std::string> notes;
  /// The presets' bitrates for a video or audio description, when they have them.
  std::optional<Bitrates> range;
  /// The stream's own bitrate against `range`, when both are known and the codec is lossy or PCM.
  std::optional<Verdict> verdict;
  /// For a compressed lossless codec (flac, alac, ffv1, png ...) with a bitrate, instead of a
  /// verdict: the uncompressed bitrate of the same samples or pixels, when it is known.
  std::optional<long long> uncompressed;
  /// Where the bitrate came from ("stream", "statistics_tag", "container", "packets"); empty
  /// without one.
  std::string bitrateSource;
  /// Instead of a verdict, "no preset for codec X", or "none (...)" saying why: a setting the
  /// presets need that the file does not give, their refusal, or no bitrate in the file. Empty
  /// for other kinds.
  std::string noVerdict;
  /// The JSON "result" that stands for it: "no_preset", "no_bitrate", or "none" for the others.
  std::string noVerdictResult = "none";

  bool Skipped() const { return description == nullptr && damage.empty(); }
};

/// The report of stream `index` of `context`: for video, audio and subtitle streams the FFmpeg
/// bridge's description and notes, with `measured` (bit/s) as its bitrate when the file states
/// none and it is positive, and for video and audio the range and the verdict (or, for a
/// lossless codec, the compression against the uncompressed rate). A stream without a size,
/// sample rate, channel count or known codec is damaged. Throws only std::bad_alloc.
StreamReport DescribeStream(const AVFormatContext& context, unsigned int index,
                            long long measured = 0);

/// What the probe made of a file.
struct FileReport {
  /// libavformat's name of the container ("QuickTime / MOV").
  std::string container;
  std::vector<StreamReport> streams;
};

/// What `path` is when it exists and is not a regular file ("a FIFO", "a folder", "a character
/// device" ...); empty for a regular file or a path that cannot be looked up. Throws only
/// std::bad_alloc.
std::string OtherFileKind(const std::string& path);

/// Opens the file at `path` (a local regular file, never a network address, another protocol, a
/// FIFO or a device) and reports every stream; with `measure`, reads every packet first to
/// measure the bitrate of streams for which the file states none (with a progress bar on a
/// terminal when `progress`). Throws UsageError, with libavformat's reason, for a file that
/// cannot be opened or read, is not a regular file, that libavformat does not recognise as
/// media, or that holds no stream. A damaged stream is reported, not thrown. libavformat's own
/// messages are kept off the terminal while it runs. Safe to call on several threads at once.
FileReport ProbeFile(const std::string& path, bool measure = false, bool progress = true);

/// Prints a line naming `path`, its container and its stream count, then each stream of
/// `report` (only stream `only` when given): a heading line "Stream N: kind (codec)", then the
/// description as the other subcommands print it with the bitrate verdict and the notes in its
/// summary; a damaged or skipped stream is the heading line alone, saying why.
void PrintProbe(const std::string& path, const FileReport& report, std::optional<int> only);

/// The same as one JSON object: "file", "container" and "streams", each stream with "index",
/// "kind", "codec", "status" ("described", "damaged" or "skipped") and, as they apply,
/// "damage", "notes", "description" (in the library's JSON form, with the derived values and
/// the presets' bitrates, as --json gives for one description) and "verdict" ("result" below,
/// within, above, lossless or none, "text", and "bitrate_source").
nlohmann::ordered_json ProbeJson(const std::string& path, const FileReport& report,
                                 std::optional<int> only);

}  // namespace Formatdesc

#endif  // TARVEK_TOOLS_FORMATDESC_PROBE_H_
