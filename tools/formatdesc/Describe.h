// formatdesc's descriptions: the option values of each subcommand as given on the command line,
// the descriptions built from them through the library's public interfaces, and their bitrates.
#ifndef TARVEK_TOOLS_FORMATDESC_DESCRIBE_H_
#define TARVEK_TOOLS_FORMATDESC_DESCRIBE_H_

#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Diff.h>
#include <Tarvek/Inspect/JsonForm.h>
#include <Tarvek/Inspect/Settings.h>
#include <Tarvek/Inspect/Validate.h>
#include <Tarvek/Presets/BitratePresets.h>

#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "Options.h"

namespace Formatdesc {

/// Values of the settings every codec description has; an empty optional is an option not given.
/// Texts are read (and refused with a UsageError) only when the description is built.
struct CodecArgs {
  std::optional<std::string> fromJson;  // a file holding the description to start from
  std::optional<std::string> stream;    // which stream of a --from-json file of several
  std::optional<std::string> fromCaps;  // GStreamer caps text to start from
  std::optional<std::string> codecId;
  std::optional<std::string> codecName;
  std::optional<std::string> tag;
  std::optional<std::string> bitrateMode;
  std::optional<std::string> bitrate;
  std::optional<std::string> quality;
  std::optional<std::string> threads;
  std::optional<bool> lossless;
  std::optional<bool> twoPass;
  std::optional<bool> globalHeader;
  std::optional<bool> mainStream;
  std::vector<std::string> encodeOptions;   // KEY=VALUE each
  std::vector<std::string> analyzeOptions;  // KEY=VALUE each
};

struct VideoArgs {
  CodecArgs codec;
  std::optional<std::string> size;
  std::optional<std::string> frameAspect;
  std::optional<std::string> pixelAspect;
  std::optional<std::string> frameRate;
  std::optional<std::string> pixelFormat;
};

struct AudioArgs {
  CodecArgs codec;
  std::optional<std::string> sampleRate;
  std::optional<std::string> layout;
  std::optional<std::string> frameSize;
  std::optional<std::string> sampleFormat;
  std::optional<std::string> language;
};

struct SubtitleArgs {
  CodecArgs codec;
  std::optional<std::string> language;
  std::optional<std::string> title;
  std::optional<std::string> author;
  std::optional<std::string> header;
  std::optional<std::string> dvbSize;
};

/// @name Builders
/// A new description holding every given setting, on top of the description read from
/// --from-json when one is given. Throw UsageError for a value that cannot be read, a file that
/// cannot be read or holds another kind, or a codec identifier the presets do not know for video
/// or audio; LoadError for a file that is not a description; nothing else is checked, so a
/// description may lack settings (its bitrates then fail, see below).
boost::intrusive_ptr<Tarvek::Conf::IFormatCodecVideo> BuildVideo(const VideoArgs& args);
boost::intrusive_ptr<Tarvek::Conf::IFormatCodecAudio> BuildAudio(const AudioArgs& args);
boost::intrusive_ptr<Tarvek::Conf::IFormatCodecSubtitle> BuildSubtitle(const SubtitleArgs& args);

/// A file that is not a description in the JSON form; what() names the file, where in it and
/// what is wrong.
class LoadError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// The description in the file at `path`, read with the library's FromJson: any document
/// formatdesc --json writes. Of a document with several streams (probe --json), the one `stream`
/// picks (an index "2", or "v:0", "a:1", "s:0"), or the only described one when not given. A
/// "settings" block beside the tree must agree with it. Throws UsageError naming `option` (when
/// not empty) for a file that cannot be read or a stream that cannot be picked, LoadError for a
/// file that holds no description or settings that disagree with its tree.
boost::intrusive_ptr<Tarvek::Conf::IFormatCodec> LoadDescription(
    const std::string& option, const std::string& path,
    const std::optional<std::string>& stream = std::nullopt);

/// `description` when it is of `kind`; otherwise a UsageError
/// saying that the --from-json file at `path` holds another kind.
const boost::intrusive_ptr<Tarvek::Conf::IFormatCodec>& RequireKind(
    const boost::intrusive_ptr<Tarvek::Conf::IFormatCodec>& description,
    Tarvek::Conf::FormatKind kind, const std::string& path);

/// Default, minimum and maximum bitrate in bits per second.
struct Bitrates {
  long long typical = 0;
  long long minimum = 0;
  long long maximum = 0;
};

/// The library's bitrates of a video or audio description. Throw what the library throws: for
/// a missing setting, Core::ChildNotFound naming it (see OptionForSetting).
Bitrates VideoBitrates(const boost::intrusive_ptr<const Tarvek::Conf::IFormatCodec>& video);
Bitrates AudioBitrates(const boost::intrusive_ptr<const Tarvek::Conf::IFormatCodec>& audio);

/// The settings the bitrate functions need that `codec` lacks, in the order they are listed
/// in its kind's help: codec identifier, bitrate mode, size, frame rate and (vbr) quality for
/// video; codec identifier, sample rate, layout and sample format for audio.
std::vector<std::string> MissingForBitrates(const Tarvek::Conf::IFormatCodec& codec);

/// The option that gives the setting stored under `key`, or "" for a key no option gives alone.
std::string OptionForSetting(const std::string& key);

/// The library's own description of error `e` (its DescriptionInfo), or a fixed sentence saying
/// it gave none.
std::string LibraryDescription(const Tarvek::Exception& e);

/// One row of a bitrate ladder: a usual picture size and its bitrates.
struct LadderRow {
  std::string name;  // "1080p"
  Pair size;
  Bitrates bitrates;
};

/// The bitrates of video codec `codecId` (a preset identifier) at the usual sizes from 240p to
/// 2160p, with square pixels at `frameRate`, in VBR mode at `quality` when one is given.
std::vector<LadderRow> BuildLadder(const std::string& codecId, Pair frameRate,
                                   std::optional<long long> quality);

}  // namespace Formatdesc

#endif  // TARVEK_TOOLS_FORMATDESC_DESCRIBE_H_
