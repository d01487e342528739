// formatdesc probe over a whole media library: the paths named (files, folders walked in a stable
// order, or a list on standard input) probed on several threads, each file's report written in
// the order of the input as it is done, and a summary of counters at the end. Memory stays flat
// however long the list: the walk holds one folder listing a level, the run a bounded window of
// files in flight, and the summary only counters.
#ifndef TARVEK_TOOLS_FORMATDESC_AUDIT_H_
#define TARVEK_TOOLS_FORMATDESC_AUDIT_H_

#include <sys/types.h>

#include <array>
#include <iosfwd>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "Probe.h"

namespace Formatdesc {

/// One path of the walk: a regular file to probe, or a path reported without being opened.
struct AuditEntry {
  enum class Kind { File, Skipped, Error };
  std::string path;
  Kind kind = Kind::File;
  /// Why it is skipped ("a FIFO, not a regular file") or what failed; empty for a file.
  std::string message;
};

/// The paths named on the command line, expanded one at a time: "-" reads further paths from
/// `input`, one a line (empty lines are ignored); a folder yields its entries recursively, sorted
/// by the bytes of their names, following symbolic links to folders but never into a folder that
/// is its own ancestor (a loop, skipped with a note); a FIFO, device or socket is skipped with a
/// note, never opened; a path that cannot be looked up or a folder that cannot be listed is an
/// error entry.
class PathWalk {
 public:
  PathWalk(std::vector<std::string> arguments, std::istream& input);
  /// The next entry, or nothing at the end. Throws only std::bad_alloc.
  std::optional<AuditEntry> Next();

 private:
  struct Level {
    std::string folder;
    std::vector<std::string> names;
    std::size_t next = 0;
    dev_t device = 0;
    ino_t inode = 0;
  };
  // The entry for `path`, or nothing when it is a folder, whose listing is then entered.
  std::optional<AuditEntry> Examine(const std::string& path);

  std::vector<std::string> arguments_;
  std::size_t nextArgument_ = 0;
  std::istream& input_;
  bool reading_ = false;
  std::vector<Level> levels_;
};

/// Where the streams' bitrates lie, by codec: the counts of each verdict result.
enum class VerdictKind { Below, Within, Above, NoPreset, NoBitrate, Other, Lossless };
constexpr std::size_t kVerdictKinds = 7;

/// One video stream's bits per pixel and its presets' range in the same unit, for the report.
struct PixelRate {
  std::string path;
  int index = 0;
  std::string codec;
  double bitsPerPixel = 0.0;
  double minimum = 0.0;
  double maximum = 0.0;
};

/// The counters of an audit run, and the first video streams' bits per pixel for the report.
struct AuditSummary {
  long long files = 0;
  long long read = 0;
  long long damaged = 0;  // files read with at least one damaged stream
  long long errors = 0;
  long long skipped = 0;
  std::map<std::string, long long> streamsByKind;
  std::map<std::string, std::array<long long, kVerdictKinds>> verdicts;
  struct Lossless {
    long long streams = 0;
    double ratioSum = 0.0;
    double ratioMin = 0.0;
    double ratioMax = 0.0;
  };
  std::map<std::string, Lossless> lossless;  // compression ratios by codec
  std::vector<PixelRate> pixelRates;         // at most kPixelRates, in input order
  long long pixelRatesLeftOut = 0;
  static constexpr std::size_t kPixelRates = 400;

  /// Counts `entry` and, for a file read, its `report`.
  void Add(const AuditEntry& entry, const FileReport* report);
  /// 2 when some path could not be read, else 1 when a stream was damaged, else 0.
  int ExitStatus() const;
};

/// The summary as an aligned text table: files, streams by kind, verdicts by codec, lossless
/// compression ratios.
void PrintSummary(std::ostream& out, const AuditSummary& summary);

/// A self-contained XHTML page (inline CSS, no script, nothing fetched) with the summary and an
/// SVG chart of each video stream's bits per pixel against its presets' range.
void WriteReport(std::ostream& out, const AuditSummary& summary);

/// `path` as a JSON member: "path" when it is valid UTF-8, otherwise "path_base64" with its bytes
/// in base64 (RFC 4648, with padding), so that every name is kept exactly.
std::pair<std::string, std::string> PathMember(const std::string& path);

/// One JSON Lines record (no newline): the path, "status" ("read", "damaged", "skipped" or
/// "error"), and for a file read its "container", "streams" (as probe --json gives them) and
/// "verdicts" (index, codec and result of each judged stream), else the "error" or "note".
std::string AuditLine(const AuditEntry& entry, const FileReport* report);

struct AuditOptions {
  unsigned int jobs = 1;
  bool measure = false;
  bool jsonl = false;
  std::optional<std::string> report;
};

/// Probes every path of `walk` on `options.jobs` threads and writes each file's result to
/// standard output in the order of the walk, as text or JSON Lines; then the summary (standard
/// output in text mode, standard error with JSON Lines) and the report. A progress bar goes to
/// standard error when it is a terminal (with done/total when `total` is known). Returns the exit
/// status (AuditSummary::ExitStatus). Throws UsageError when the report cannot be written.
int RunAudit(PathWalk& walk, const AuditOptions& options, std::optional<long long> total);

}  // namespace Formatdesc

#endif  // TARVEK_TOOLS_FORMATDESC_AUDIT_H_
