// formatdesc: builds a format description from command-line options (or a stored one) and shows
// it, with the bitrates the presets give for it; compares and validates stored descriptions;
// describes the streams of a media file. This file wires the subcommands and their options and
// turns every failure into one line on standard error and an exit status:
//   0 success, 1 the library refused (for example a setting the bitrates need is missing, or a
//   file holds no description), validate found an error or probe found a damaged stream, 2 bad
//   usage (an unknown option, a value or file that cannot be read, a file that is not media;
//   for probe of several paths, some path that could not be read).
#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Diff.h>
#include <Tarvek/Inspect/JsonForm.h>
#include <Tarvek/Inspect/Validate.h>
#include <Tarvek/Presets/BitratePresets.h>
#include <CLI/CLI.hpp>

#include <algorithm>
#include <boost/exception/get_error_info.hpp>
#include <cstdint>
#include <iostream>
#include <limits>
#include <new>
#include <thread>

#include "Audit.h"
#include "Describe.h"
#include "Options.h"
#include "Output.h"
#include "Probe.h"

namespace {

using namespace Formatdesc;

constexpr int kLibraryError = 1;
constexpr int kUsageError = 2;
constexpr const char* kExitStatus =
    "Exit status: 0 on success, 1 when the library refuses the description, 2 for bad usage.";

// Options every description subcommand has besides its settings.
struct ShowFlags {
  bool json = false;
  bool noBitrate = false;
};

struct LadderArgs {
  std::optional<std::string> codecId;
  std::optional<std::string> frameRate;
  std::optional<std::string> quality;
  std::optional<std::string> fromJson;
  bool json = false;
};

struct DiffArgs {
  std::string a;
  std::string b;
  std::optional<std::string> stream;
  bool json = false;
};

struct ValidateArgs {
  std::string file;
  std::optional<std::string> stream;
  bool json = false;
};

constexpr const char* kStreamHelp =
    "Of a file of several streams (probe --json), the stream to read: an index (2), or the n-th "
    "of a kind (v:0, a:1, s:0)";

constexpr const char* kFromJsonHelp =
    "Start from the description in FILE (as --json writes it); the options change it";

struct ProbeArgs {
  std::vector<std::string> paths;
  std::optional<std::string> stream;
  std::optional<std::string> jobs;
  std::optional<std::string> report;
  bool json = false;
  bool jsonl = false;
  bool measure = false;
};

struct CodecsArgs {
  std::optional<std::string> kind;
  bool json = false;
};

// A text option that may be left out.
CLI::Option* AddText(CLI::App& app, const std::string& name, std::optional<std::string>& value,
                     const std::string& help, const std::string& type = "TEXT") {
  return app.add_option(name, value, help)->type_name(type);
}

// --NAME sets a bool setting, --no-NAME (left out of the help, which mentions it) clears it;
// with neither, the setting is left out. Each acts as it is parsed, so the last one given wins.
void AddSwitch(CLI::App& app, const std::string& name, std::optional<bool>& value,
               const std::string& help) {
  CLI::Option* set = app.add_flag_callback(
      "--" + name, [&value] { value = true; }, help);
  CLI::Option* clear = app.add_flag_callback("--no-" + name, [&value] { value = false; });
  set->disable_flag_override()->trigger_on_parse()->group("Codec settings");
  clear->disable_flag_override()->trigger_on_parse()->group("");
}

void AddCodecOptions(CLI::App& app, CodecArgs& args, const std::string& idHelp) {
  AddText(app, "--from-json", args.fromJson, kFromJsonHelp, "FILE");
  AddText(app, "--stream", args.stream, kStreamHelp, "STREAM");
  AddText(app, "--from-caps", args.fromCaps,
          "Start from the description that GStreamer caps give (as the summary's Caps line "
          "shows them); the options change it",
          "CAPS");
  const std::string group = "Codec settings";
  AddText(app, "--codec-id", args.codecId, idHelp, "ID")->group(group);
  AddText(app, "--codec-name", args.codecName, "Codec name (free text)")->group(group);
  AddText(app, "--tag", args.tag, "Codec tag: four characters (avc1) or a number", "FOURCC")
      ->group(group);
  AddText(app, "--bitrate-mode", args.bitrateMode,
          "Bitrate mode: vbr (quality-driven) or cbr (target bitrate)", "MODE")
      ->group(group);
  AddText(app, "--bitrate", args.bitrate, "Bitrate in b/s: 4500000, 4500k, 4.5M or 1G", "RATE")
      ->group(group);
  AddText(app, "--quality", args.quality, "Encoder quality figure for vbr (CRF, qscale)", "N")
      ->group(group);
  AddText(app, "--threads", args.threads, "Encoder thread count (0: the encoder chooses)", "N")
      ->group(group);
  AddSwitch(app, "lossless", args.lossless, "Lossless encoding (--no-lossless: false)");
  AddSwitch(app, "two-pass", args.twoPass, "Two-pass encoding (--no-two-pass: false)");
  AddSwitch(app, "global-header", args.globalHeader, "Global header (--no-global-header: false)");
  AddSwitch(app, "main-stream", args.mainStream, "Main stream (--no-main-stream: false)");
  app.add_option("--encode-option", args.encodeOptions, "Encoder option, repeatable")
      ->type_name("KEY=VALUE")
      ->group(group);
  app.add_option("--analyze-option", args.analyzeOptions, "Analyser option, repeatable")
      ->type_name("KEY=VALUE")
      ->group(group);
}

void AddShowFlags(CLI::App& app, ShowFlags& flags, bool bitrates) {
  app.add_flag("--json", flags.json, "Print one JSON object instead of text");
  if (bitrates) {
    app.add_flag("--no-bitrate", flags.noBitrate, "Show the description without its bitrates");
  }
}

std::string LayoutNamesText() {
  std::string text;
  for (const auto& entry : ChannelLayoutNames()) text += (text.empty() ? "" : ", ") + entry.first;
  return text;
}

void AddVideo(CLI::App& app, VideoArgs& args, ShowFlags& flags) {
  CLI::App* video = app.add_subcommand("video", "Describe a video stream");
  AddCodecOptions(*video, args.codec, "Codec identifier known to the presets (h264, hevc, ...)");
  const std::string group = "Video settings";
  CLI::Option* size = AddText(*video, "--size", args.size, "Frame size", "WxH")->group(group);
  CLI::Option* frameAspect =
      AddText(*video, "--frame-aspect", args.frameAspect, "Display aspect (needs --size)", "W:H")
          ->group(group);
  AddText(*video, "--pixel-aspect", args.pixelAspect, "Pixel aspect (needs --size; default 1:1)",
          "W:H")
      ->group(group)
      ->needs(size)
      ->excludes(frameAspect);
  frameAspect->needs(size);
  AddText(*video, "--frame-rate", args.frameRate, "Frame rate: 30000/1001, 25 or 29.97", "RATE")
      ->group(group);
  AddText(*video, "--pix-fmt", args.pixelFormat, "Pixel format by name (yuv420p)", "NAME")
      ->group(group);
  AddShowFlags(*video, flags, true);
  video->footer(
      "The bitrates need --codec-id, --size, --frame-rate and --bitrate-mode, and --quality in\n"
      "vbr mode; when one is missing, formatdesc names it and exits with status 1. --no-bitrate\n"
      "shows the description without them.\n" +
      std::string(kExitStatus));
}

void AddAudio(CLI::App& app, AudioArgs& args, ShowFlags& flags) {
  CLI::App* audio = app.add_subcommand("audio", "Describe an audio stream");
  AddCodecOptions(*audio, args.codec, "Codec identifier known to the presets (aac, opus, ...)");
  const std::string group = "Audio settings";
  AddText(*audio, "--sample-rate", args.sampleRate, "Sample rate in Hz", "HZ")->group(group);
  AddText(*audio, "--layout", args.layout,
          "Channel layout: " + LayoutNamesText() + ", or a speaker mask (0x3f)", "LAYOUT")
      ->group(group);
  AddText(*audio, "--frame-size", args.frameSize, "Samples per channel in a frame", "N")
      ->group(group);
  AddText(*audio, "--sample-fmt", args.sampleFormat, "Sample format by name (fltp, s16)", "NAME")
      ->group(group);
  AddText(*audio, "--language", args.language, "Language code (eng)", "LANG")->group(group);
  AddShowFlags(*audio, flags, true);
  audio->footer(
      "The bitrates need --codec-id, --sample-rate, --layout and --sample-fmt; when one is\n"
      "missing, formatdesc names it and exits with status 1. --no-bitrate shows the description\n"
      "without them.\n" +
      std::string(kExitStatus));
}

void AddSubtitle(CLI::App& app, SubtitleArgs& args, ShowFlags& flags) {
  CLI::App* subtitle = app.add_subcommand("subtitle", "Describe a subtitle stream");
  AddCodecOptions(*subtitle, args.codec, "Codec identifier (any: ass, dvb_subtitle, ...)");
  const std::string group = "Subtitle settings";
  AddText(*subtitle, "--language", args.language, "Language code (eng)", "LANG")->group(group);
  AddText(*subtitle, "--title", args.title, "Title")->group(group);
  AddText(*subtitle, "--author", args.author, "Author")->group(group);
  AddText(*subtitle, "--header", args.header, "The codec's header text (styles)")->group(group);
  AddText(*subtitle, "--dvb-size", args.dvbSize, "DVB display size", "WxH")->group(group);
  AddShowFlags(*subtitle, flags, false);
  subtitle->footer("Any codec identifier is taken: the presets have no subtitle codecs.\n" +
                   std::string(kExitStatus));
}

void AddLadder(CLI::App& app, LadderArgs& args) {
  CLI::App* ladder =
      app.add_subcommand("ladder", "Default, minimum and maximum bitrates from 240p to 2160p");
  AddText(*ladder, "codec-id", args.codecId, "Video codec identifier known to the presets", "ID");
  AddText(*ladder, "--frame-rate", args.frameRate,
          "Frame rate: 30000/1001, 25 or 29.97 (30 when not given)", "RATE");
  AddText(*ladder, "--quality", args.quality, "Encoder quality figure (vbr mode)", "N");
  AddText(*ladder, "--from-json", args.fromJson,
          "Take codec, frame rate and vbr quality from the video description in FILE", "FILE");
  ladder->add_flag("--json", args.json, "Print one JSON object instead of the table");
  ladder->footer(
      "Each size has square pixels; with --quality the bitrates are those of vbr mode at that\n"
      "quality. The codec-id, --frame-rate and --quality given win over those of --from-json.\n" +
      std::string(kExitStatus));
}

void AddCodecs(CLI::App& app, CodecsArgs& args) {
  CLI::App* codecs = app.add_subcommand("codecs", "The codec identifiers the presets know");
  AddText(*codecs, "--kind", args.kind, "Only this kind, one identifier a line", "video|audio");
  codecs->add_flag("--json", args.json, "Print one JSON object instead of text");
  codecs->footer(kExitStatus);
}

void AddDiff(CLI::App& app, DiffArgs& args) {
  CLI::App* diff = app.add_subcommand("diff", "Compare two stored descriptions, with reasons");
  diff->add_option("a", args.a, "The description expected (as --json writes it)")
      ->required()
      ->type_name("A.json");
  diff->add_option("b", args.b, "The description compared with it")
      ->required()
      ->type_name("B.json");
  AddText(*diff, "--stream", args.stream, kStreamHelp, "STREAM");
  diff->add_flag("--json", args.json, "Print one JSON object instead of text");
  diff->footer(
      "Lists every setting that differs (only in a, only in b, other type, other value, other\n"
      "order), then whether a stream described by b can be used where a is expected (video:\n"
      "size and pixel aspect; audio: sample rate, layout and sample format) and why not.\n"
      "Exit status: 0 when they are equal, 1 when they differ, 2 for bad usage or a file that\n"
      "cannot be read or holds no description.");
}

void AddValidate(CLI::App& app, ValidateArgs& args) {
  CLI::App* validate = app.add_subcommand("validate", "Check a stored description");
  validate->add_option("file", args.file, "The description (as --json writes it)")
      ->required()
      ->type_name("FILE.json");
  AddText(*validate, "--stream", args.stream, kStreamHelp, "STREAM");
  validate->add_flag("--json", args.json, "Print one JSON object instead of text");
  validate->footer(
      "Prints one line a finding (error or warning) naming the setting, or 'valid'. Errors are\n"
      "what a getter, the bitrates or the compatibility test would fail on; warnings, such as a\n"
      "bitrate outside the presets' range, are usable but probably not meant.\n"
      "Exit status: 0 when no error is found, 1 when one is or the file holds no description, 2\n"
      "for bad usage or a file that cannot be read.");
}

void AddProbe(CLI::App& app, ProbeArgs& args) {
  CLI::App* probe = app.add_subcommand(
      "probe", "Describe the streams of media files or a whole library, with bitrate verdicts");
  probe
      ->add_option("file", args.paths,
                   "Media files, folders (walked recursively, in sorted order), or - for a list "
                   "of paths on standard input, one a line")
      ->required()
      ->type_name("PATH");
  AddText(*probe, "--stream", args.stream,
          "Only the stream of this index (0 is the first); one file only", "N");
  probe->add_flag("--json", args.json, "Print one JSON object instead of text; one file only");
  probe->add_flag("--jsonl", args.jsonl,
                  "One JSON object a line for each path, in input order, and the summary on "
                  "standard error");
  AddText(*probe, "--jobs", args.jobs, "Files probed at once (default: the number of cores)", "N");
  AddText(*probe, "--report", args.report,
          "Also write a self-contained XHTML page with the summary and a chart of the video "
          "streams' bits per pixel",
          "FILE.html");
  probe->add_flag("--measure", args.measure,
                  "Read every packet to measure the bitrate of streams the file states none for");
  probe->footer(
      "Builds a description of every video, audio and subtitle stream from what the file says,\n"
      "and lists streams of other kinds as skipped. A value the file leaves unknown, such as a\n"
      "0:1 pixel aspect, stays unset, with a note. For video and audio it gives the presets'\n"
      "range (video in a target-bitrate mode, as a file holds no quality figure) and whether the\n"
      "stream's bitrate is below, within or above it and by how much; 'no preset for codec X'\n"
      "when the presets do not know the codec, or why there is no verdict. A lossless codec "
      "(flac,\n"
      "alac, ffv1, png) gets its compression against the uncompressed rate instead. The bitrate\n"
      "is the stream's, else the container's statistics tag (BPS), else the container's total\n"
      "for a file of one stream; --measure counts the packets where the file states none. The\n"
      "output says which. Layouts and tags are named as FFmpeg names them.\n"
      "Several paths, a folder, - or --jsonl audit a library: each file in input order, then a\n"
      "summary; FIFOs, devices and loops of links are skipped with a note.\n"
      "Exit status: 0 when every file was read, 1 when a stream is damaged (it is reported, the\n"
      "others are described), 2 for bad usage or a path that cannot be read or is not media.");
}

void Show(const boost::intrusive_ptr<Tarvek::Conf::IFormatCodec>& codec,
          const std::optional<Bitrates>& bitrates, bool json) {
  if (json) {
    PrintJson(std::cout, DescriptionJson(codec, bitrates));
  } else {
    PrintDescription(*codec, bitrates);
  }
}

std::string LibraryMessage(const Tarvek::Exception& e);

// The bitrates of `codec` by `compute`; when settings they need are missing, the library's error
// for the first, then every other one missing, so that one run names them all.
template <class Compute>
Bitrates BitratesNamingEveryMissing(const boost::intrusive_ptr<Tarvek::Conf::IFormatCodec>& codec,
                                    Compute compute) {
  try {
    return compute();
  } catch (const Tarvek::Core::ChildNotFound& e) {
    const std::string* first = boost::get_error_info<Tarvek::Core::ChildNotFound::ChildNameInfo>(e);
    // The others grouped by the option that gives them; the first one's option gives all the
    // settings it sets (--size: width and height), so those are not named again.
    const std::string firstOption = first != nullptr ? OptionForSetting(*first) : std::string();
    std::vector<std::pair<std::string, std::string>> groups;  // option, keys
    for (const std::string& key : MissingForBitrates(*codec)) {
      const std::string option = OptionForSetting(key);
      if ((first != nullptr && key == *first) || (!option.empty() && option == firstOption)) {
        continue;
      }
      const auto group = std::find_if(groups.begin(), groups.end(),
                                      [&](const auto& g) { return g.first == option; });
      if (group == groups.end() || option.empty()) {
        groups.emplace_back(option, key);
      } else {
        group->second += " and " + key;
      }
    }
    std::string others;
    for (const auto& [option, keys] : groups) {
      others += (others.empty() ? "" : ", ") + keys + (option.empty() ? "" : " (" + option + ")");
    }
    if (others.empty()) throw;
    throw std::runtime_error(LibraryMessage(e) + "; also missing: " + others);
  }
}

void RunVideo(const VideoArgs& args, const ShowFlags& flags) {
  const auto video = BuildVideo(args);
  std::optional<Bitrates> bitrates;
  if (!flags.noBitrate) {
    bitrates = BitratesNamingEveryMissing(video, [&] { return VideoBitrates(video); });
  }
  Show(video, bitrates, flags.json);
}

void RunAudio(const AudioArgs& args, const ShowFlags& flags) {
  const auto audio = BuildAudio(args);
  std::optional<Bitrates> bitrates;
  if (!flags.noBitrate) {
    bitrates = BitratesNamingEveryMissing(audio, [&] { return AudioBitrates(audio); });
  }
  Show(audio, bitrates, flags.json);
}

// What the ladder takes from a stored video description: its codec, its frame rate when it has
// one, and its quality in vbr mode.
void LadderFromJson(const std::string& path, std::optional<std::string>& codecId,
                    std::optional<Pair>& rate, std::optional<long long>& quality) {
  const auto loaded = LoadDescription("--from-json", path);
  const auto video = boost::dynamic_pointer_cast<Tarvek::Conf::IFormatCodecVideo>(
      RequireKind(loaded, Tarvek::Conf::FormatKind::Video, path));
  if (video->ExistsCodecID()) codecId = video->GetCodecID();
  if (video->ExistsFrameRateNum() && video->ExistsFrameRateDen() && video->GetFrameRateNum() != 0 &&
      video->GetFrameRateDen() != 0) {
    rate = Pair{video->GetFrameRateNum(), video->GetFrameRateDen()};
  }
  if (video->ExistsBitrateMode() &&
      video->GetBitrateMode() == Tarvek::Conf::IFormatCodec::TAG_BITRATE_MODE_VBR &&
      video->ExistsQuality()) {
    quality = video->GetQuality();
  }
}

void RunLadder(const LadderArgs& args) {
  std::optional<std::string> fileCodecId;
  std::optional<Pair> fileRate;
  std::optional<long long> quality;
  if (args.fromJson) LadderFromJson(*args.fromJson, fileCodecId, fileRate, quality);
  const std::optional<std::string> given = args.codecId ? args.codecId : fileCodecId;
  if (!given) {
    throw UsageError(args.fromJson
                         ? "codec-id: not given, and '" + *args.fromJson + "' holds no codec_id"
                         : std::string("codec-id is required (or --from-json)"));
  }
  const std::string codecId =
      CheckCodecId("codec-id", *given, Tarvek::Conf::GetPresetVideoCodecs(), "video");
  const Pair rate = args.frameRate || !fileRate
                        ? ParseFrameRate("--frame-rate", args.frameRate.value_or("30"))
                        : *fileRate;
  if (args.quality) {
    quality = ParseNonNegative("--quality", *args.quality, std::numeric_limits<int>::max());
  }
  const auto rows = BuildLadder(codecId, rate, quality);
  if (args.json) {
    PrintJson(std::cout, LadderJson(codecId, rate, quality, rows));
  } else {
    PrintLadder(std::cout, codecId, rate, quality, rows);
  }
}

// True when the descriptions differ. Every failure is trouble, exit status 2, as diff(1) has it.
bool RunDiff(const DiffArgs& args) {
  boost::intrusive_ptr<Tarvek::Conf::IFormatCodec> a, b;
  try {
    a = LoadDescription("", args.a, args.stream);
    b = LoadDescription("", args.b, args.stream);
  } catch (const LoadError& e) {
    throw UsageError(e.what());
  }
  const auto differences = Tarvek::Conf::Diff(a, b);
  const auto reasons = Tarvek::Conf::ExplainCompatibility(a, b);
  if (args.json) {
    PrintJson(std::cout, DiffJson(differences, reasons));
  } else {
    PrintDiff(std::cout, differences, reasons);
  }
  return !differences.empty();
}

// True when an error was found.
bool RunValidate(const ValidateArgs& args) {
  const auto findings = Tarvek::Conf::Validate(LoadDescription("", args.file, args.stream));
  if (args.json) {
    PrintJson(std::cout, FindingsJson(findings));
  } else {
    PrintFindings(std::cout, findings);
  }
  return std::any_of(findings.begin(), findings.end(), [](const Tarvek::Conf::Finding& f) {
    return f.severity == Tarvek::Conf::Severity::Error;
  });
}

// One file as before the library audit: exit status 1 when a stream shown is damaged; a file
// that cannot be read throws.
int RunProbeFile(const ProbeArgs& args) {
  const std::string& path = args.paths.front();
  std::optional<long long> only;
  if (args.stream) {
    only = ParseNonNegative("--stream", *args.stream, std::numeric_limits<int>::max());
  }
  const FileReport report = ProbeFile(path, args.measure);
  const auto count = static_cast<long long>(report.streams.size());
  if (only && *only >= count) {
    throw BadValue("--stream",
                   "a stream index from 0 to " + std::to_string(count - 1) + " of '" + path + "'",
                   *args.stream);
  }
  const std::optional<int> shown =
      only ? std::optional<int>(static_cast<int>(*only)) : std::optional<int>();
  if (args.json) {
    PrintJson(std::cout, ProbeJson(path, report, shown));
  } else {
    PrintProbe(path, report, shown);
  }
  const bool damaged = std::any_of(
      report.streams.begin(), report.streams.end(),
      [&](const StreamReport& s) { return !s.damage.empty() && (!shown || s.index == *shown); });
  return damaged ? kLibraryError : 0;
}

// The exit status of probe: one file named alone as before, otherwise the audit of every path.
int RunProbe(const ProbeArgs& args) {
  const bool folder = std::any_of(args.paths.begin(), args.paths.end(), [](const std::string& p) {
    return p == "-" || OtherFileKind(p) == "a folder";
  });
  if (args.paths.size() == 1 && !folder && !args.jsonl && !args.report) return RunProbeFile(args);
  if (args.json) throw UsageError("--json describes one file; use --jsonl for several");
  if (args.stream) throw UsageError("--stream picks a stream of one file; give one file");
  AuditOptions options;
  const unsigned int cores = std::max(1u, std::thread::hardware_concurrency());
  options.jobs =
      args.jobs ? static_cast<unsigned int>(ParsePositive("--jobs", *args.jobs, 1024)) : cores;
  options.measure = args.measure;
  options.jsonl = args.jsonl;
  options.report = args.report;
  // The total is known when every path is named on the command line.
  const std::optional<long long> total =
      folder ? std::nullopt : std::optional<long long>(static_cast<long long>(args.paths.size()));
  PathWalk walk(args.paths, std::cin);
  return RunAudit(walk, options, total);
}

void RunCodecs(const CodecsArgs& args) {
  std::optional<std::string> kind;
  if (args.kind) kind = ParseChoice("--kind", *args.kind, {"video", "audio"});
  if (args.json) {
    PrintJson(std::cout, CodecsJson(kind));
  } else {
    PrintCodecs(std::cout, kind);
  }
}

// The library's own description of its error, and for a setting the bitrates need, the option
// that gives it.
std::string LibraryMessage(const Tarvek::Exception& e) {
  std::string message = LibraryDescription(e);
  const std::string* child = boost::get_error_info<Tarvek::Core::ChildNotFound::ChildNameInfo>(e);
  if (child != nullptr && !OptionForSetting(*child).empty()) {
    message += " (needed for the bitrates: give " + OptionForSetting(*child) +
               ", or --no-bitrate to leave them out)";
  }
  return message;
}

int Fail(const std::string& message, int status) {
  std::cout.flush();
  std::cerr << "formatdesc: " << message << '\n';
  return status;
}

// The switch given a value ("--lossless=1"), named as typed: CLI11's own message names it
// without dashes, and not at all for a --no- form.
std::string SwitchValueMessage(int argc, char** argv) {
  static const char* const kSwitches[] = {"lossless", "two-pass", "global-header", "main-stream"};
  for (int i = 1; i < argc; ++i) {
    const std::string argument = argv[i];
    const std::string name = argument.substr(0, argument.find('='));
    for (const char* const known : kSwitches) {
      if (name == std::string("--") + known || name == std::string("--no-") + known) {
        return name + ": expected no value (a switch), got '" + argument + "'";
      }
    }
  }
  return "a switch was given a value";
}

// The first argument nothing took, an option before any other: CLI11 lists them all, options
// last.
std::string ExtrasMessage(const CLI::App& app) {
  std::string help = "formatdesc";
  if (!app.get_subcommands().empty()) help += ' ' + app.get_subcommands().front()->get_name();
  const std::vector<std::string> extras = app.remaining(true);
  if (extras.empty()) return "unexpected arguments (see " + help + " --help)";
  const auto option = std::find_if(extras.begin(), extras.end(), [](const std::string& extra) {
    return extra.rfind('-', 0) == 0;
  });
  const std::string shown = option != extras.end() ? "unknown option '" + *option + "'"
                                                   : "unexpected argument '" + extras.front() + "'";
  return shown + " (see " + help + " --help)";
}

// The first option given twice, in the form the command line has it ("--size"); empty when none.
std::string RepeatedOption(int argc, char** argv) {
  std::vector<std::string> seen;
  for (int i = 1; i < argc; ++i) {
    const std::string argument = argv[i];
    if (argument.rfind("--", 0) != 0 || argument == "--") continue;
    const std::string name = argument.substr(0, argument.find('='));
    if (std::find(seen.begin(), seen.end(), name) != seen.end()) return name;
    seen.push_back(name);
  }
  return std::string();
}

// CLI11's message, except where it does not name what was wrong as the command line has it: a
// switch given a value, an option given twice, an unknown or missing subcommand.
std::string ParseErrorMessage(const CLI::App& app, const CLI::ParseError& e, int argc,
                              char** argv) {
  const std::string known = "video, audio, subtitle, ladder, codecs, diff, validate or probe";
  if (std::string(e.what()).find("disallowed flag override") != std::string::npos) {
    return SwitchValueMessage(argc, argv);
  }
  if (dynamic_cast<const CLI::ExtrasError*>(&e) != nullptr) return ExtrasMessage(app);
  if (dynamic_cast<const CLI::ArgumentMismatch*>(&e) != nullptr) {
    const std::string repeated = RepeatedOption(argc, argv);
    if (!repeated.empty()) return repeated + ": given more than once; it takes one value";
  }
  if (!app.get_subcommands().empty() || dynamic_cast<const CLI::RequiredError*>(&e) == nullptr) {
    return e.what();
  }
  if (argc > 1 && argv[1][0] == '-') {
    return "unknown option '" + std::string(argv[1]) + "' (see formatdesc --help)";
  }
  if (argc > 1) return "unknown subcommand '" + std::string(argv[1]) + "' (expected " + known + ")";
  return "a subcommand is required: " + known + " (see formatdesc --help)";
}

int Run(int argc, char** argv) {
  CLI::App app(
      "Builds a media format description from options and shows it; compares and checks stored "
      "ones; describes the streams of a media file.",
      "formatdesc");
  app.set_version_flag("--version", std::string("formatdesc ") + TARVEK_FORMATS_VERSION);
  app.require_subcommand(1);
  app.footer(
      "Run 'formatdesc SUBCOMMAND --help' for the options of each.\n"
      "Exit status: 0 on success, 1 when the library refuses the description, validate finds an\n"
      "error or probe finds a damaged stream, 2 for bad usage or a file that cannot be read.");
  VideoArgs video;
  AudioArgs audio;
  SubtitleArgs subtitle;
  ShowFlags videoFlags, audioFlags, subtitleFlags;
  LadderArgs ladder;
  CodecsArgs codecs;
  DiffArgs diff;
  ValidateArgs validate;
  ProbeArgs probe;
  AddVideo(app, video, videoFlags);
  AddAudio(app, audio, audioFlags);
  AddSubtitle(app, subtitle, subtitleFlags);
  AddLadder(app, ladder);
  AddCodecs(app, codecs);
  AddDiff(app, diff);
  AddValidate(app, validate);
  AddProbe(app, probe);
  for (int i = 1; i < argc; ++i) {
    if (std::string(argv[i]) == "--version" && argc != 2) {
      return Fail("--version takes nothing else (see formatdesc --help)", kUsageError);
    }
  }
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& e) {
    if (e.get_exit_code() == 0) return app.exit(e);  // --help, --version
    return Fail(ParseErrorMessage(app, e, argc, argv), kUsageError);
  } catch (const std::exception& e) {
    // A value CLI11 converts itself and gets wrong is bad usage too.
    return Fail(e.what(), kUsageError);
  }
  const std::string name = app.get_subcommands().front()->get_name();
  if (name == "video") RunVideo(video, videoFlags);
  if (name == "audio") RunAudio(audio, audioFlags);
  if (name == "subtitle") Show(BuildSubtitle(subtitle), std::nullopt, subtitleFlags.json);
  if (name == "ladder") RunLadder(ladder);
  if (name == "codecs") RunCodecs(codecs);
  const bool invalid =
      (name == "diff" && RunDiff(diff)) || (name == "validate" && RunValidate(validate));
  const int probed = name == "probe" ? RunProbe(probe) : 0;
  if (!std::cout.flush()) return Fail("cannot write to standard output", kLibraryError);
  return invalid ? kLibraryError : probed;
}

}  // namespace

int main(int argc, char** argv) {
  try {
    return Run(argc, argv);
  } catch (const UsageError& e) {
    return Fail(e.what(), kUsageError);
  } catch (const Tarvek::Exception& e) {
    return Fail(LibraryMessage(e), kLibraryError);
  } catch (const std::bad_alloc&) {
    return Fail("out of memory", kLibraryError);
  } catch (const std::exception& e) {
    return Fail(e.what(), kLibraryError);
  } catch (...) {
    return Fail("unexpected error", kLibraryError);
  }
}
