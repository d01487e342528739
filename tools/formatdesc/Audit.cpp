// formatdesc probe over many files: the walk, the threads, the ordered output and the summary.
#include "Audit.h"

#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <deque>
#include <fstream>
#include <iomanip>
#include <iostream>
#include <memory>
#include <mutex>
#include <new>
#include <sstream>
#include <thread>

#include "Options.h"

namespace Formatdesc {
namespace {

std::string Join(const std::string& folder, const std::string& name) {
  return !folder.empty() && folder.back() == '/' ? folder + name : folder + "/" + name;
}

std::string FileKindOf(mode_t mode) {
  if (S_ISFIFO(mode)) return "a FIFO";
  if (S_ISCHR(mode)) return "a character device";
  if (S_ISBLK(mode)) return "a block device";
  if (S_ISSOCK(mode)) return "a socket";
  return "not a regular file";
}

// The names in `folder` but "." and "..", sorted by their bytes; false with errno set when the
// folder cannot be listed.
bool ListFolder(const std::string& folder, std::vector<std::string>& names) {
  DIR* listing = opendir(folder.c_str());
  if (listing == nullptr) return false;
  errno = 0;
  while (const dirent* entry = readdir(listing)) {
    const std::string name = entry->d_name;
    if (name != "." && name != "..") names.push_back(name);
    errno = 0;
  }
  const int error = errno;
  closedir(listing);
  errno = error;
  std::sort(names.begin(), names.end());
  return error == 0;
}

VerdictKind KindOf(const StreamReport& stream) {
  if (stream.uncompressed) return VerdictKind::Lossless;
  if (stream.verdict) {
    switch (stream.verdict->placement) {
      case Placement::Below:
        return VerdictKind::Below;
      case Placement::Above:
        return VerdictKind::Above;
      case Placement::Within:
        break;
    }
    return VerdictKind::Within;
  }
  if (stream.noVerdictResult == "no_preset") return VerdictKind::NoPreset;
  if (stream.noVerdictResult == "no_bitrate") return VerdictKind::NoBitrate;
  return VerdictKind::Other;
}

bool Judged(const StreamReport& stream) {
  return stream.verdict || stream.uncompressed || !stream.noVerdict.empty();
}

// The stream's bits per pixel and its range in the same unit, when it has a bitrate, a range, a
// size and a frame rate.
std::optional<PixelRate> PixelRateOf(const std::string& path, const StreamReport& stream) {
  const auto* video =
      dynamic_cast<const Tarvek::Conf::IFormatCodecVideo*>(stream.description.get());
  if (video == nullptr || !stream.range || !video->ExistsBitrate() || !video->ExistsWidth() ||
      !video->ExistsHeight() || !video->ExistsFrameRateNum() || !video->ExistsFrameRateDen() ||
      video->GetFrameRateDen() == 0) {
    return std::nullopt;
  }
  const double pixels =
      static_cast<double>(video->GetWidth()) * static_cast<double>(video->GetHeight()) *
      static_cast<double>(video->GetFrameRateNum()) / static_cast<double>(video->GetFrameRateDen());
  if (!(pixels > 0.0)) return std::nullopt;
  return PixelRate{path,
                   stream.index,
                   stream.codec,
                   static_cast<double>(video->GetBitrate()) / pixels,
                   static_cast<double>(stream.range->minimum) / pixels,
                   static_cast<double>(stream.range->maximum) / pixels};
}

std::string Base64(const std::string& bytes) {
  static const char kDigits[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string text;
  for (std::size_t i = 0; i < bytes.size(); i += 3) {
    const std::size_t n = std::min<std::size_t>(3, bytes.size() - i);
    unsigned long group = 0;
    for (std::size_t k = 0; k < 3; ++k) {
      group = (group << 8) | (k < n ? static_cast<unsigned char>(bytes[i + k]) : 0u);
    }
    for (std::size_t k = 0; k < 4; ++k) {
      text += k <= n ? kDigits[(group >> (18 - 6 * k)) & 63u] : '=';
    }
  }
  return text;
}

// Escapes text for XHTML content and attribute values; bytes that are not valid UTF-8 become
// U+FFFD, as XML allows nothing else.
std::string Xml(const std::string& text) {
  const std::string valid =
      nlohmann::json(text).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
  const std::string plain = nlohmann::json::parse(valid).get<std::string>();
  std::string out;
  for (const char c : plain) {
    switch (c) {
      case '&':
        out += "&amp;";
        break;
      case '<':
        out += "&lt;";
        break;
      case '>':
        out += "&gt;";
        break;
      case '"':
        out += "&quot;";
        break;
      default:
        // Control characters (a newline in a file name) are not allowed in XML 1.0 text.
        out += static_cast<unsigned char>(c) < 0x20 ? '?' : c;
    }
  }
  return out;
}

std::string Fixed(double value, int places) {
  std::ostringstream text;
  text << std::fixed << std::setprecision(places) << value;
  return text.str();
}

constexpr const char* kVerdictHeadings[kVerdictKinds] = {
    "below", "within", "above", "no preset", "no bitrate", "other", "lossless"};

// One run's files in flight: the walk's entries in order, each probed by a worker and written by
// the caller once it and every one before it are done.
class Pipeline {
 public:
  Pipeline(const AuditOptions& options) : options_(options) {
    for (unsigned int i = 0; i < options.jobs; ++i) workers_.emplace_back([this] { Work(); });
  }
  ~Pipeline() {
    {
      const std::lock_guard<std::mutex> lock(mutex_);
      stop_ = true;
    }
    workReady_.notify_all();
    for (std::thread& worker : workers_) worker.join();
  }
  Pipeline(const Pipeline&) = delete;
  Pipeline& operator=(const Pipeline&) = delete;

  struct Slot {
    AuditEntry entry;
    std::optional<FileReport> report;
    std::string line;  // the JSON Lines record, made by the worker
    bool done = false;
  };

  std::size_t InFlight() const { return window_.size(); }

  void Push(AuditEntry entry) {
    auto slot = std::make_unique<Slot>();
    slot->entry = std::move(entry);
    Slot* pointer = slot.get();
    const std::lock_guard<std::mutex> lock(mutex_);
    window_.push_back(std::move(slot));
    pending_.push_back(pointer);
    workReady_.notify_one();
  }

  // The oldest slot once it is done, taken out of the window.
  std::unique_ptr<Slot> PopFront() {
    std::unique_lock<std::mutex> lock(mutex_);
    resultReady_.wait(lock, [this] { return window_.front()->done; });
    std::unique_ptr<Slot> slot = std::move(window_.front());
    window_.pop_front();
    return slot;
  }

 private:
  void Work() {
    for (;;) {
      Slot* slot = nullptr;
      {
        std::unique_lock<std::mutex> lock(mutex_);
        workReady_.wait(lock, [this] { return stop_ || !pending_.empty(); });
        if (pending_.empty()) return;
        slot = pending_.front();
        pending_.pop_front();
      }
      Process(*slot);
      {
        const std::lock_guard<std::mutex> lock(mutex_);
        slot->done = true;
      }
      resultReady_.notify_all();
    }
  }

  // Nothing a file holds may end the run: every failure becomes the file's error.
  void Process(Slot& slot) {
    AuditEntry& entry = slot.entry;
    if (entry.kind == AuditEntry::Kind::File) {
      try {
        slot.report = ProbeFile(entry.path, options_.measure, false);
      } catch (const std::exception& e) {
        Failed(slot, e.what());
      } catch (...) {
        Failed(slot, "cannot read '" + entry.path + "': an unexpected error");
      }
    }
    if (!options_.jsonl) return;
    try {
      slot.line = AuditLine(entry, slot.report ? &*slot.report : nullptr);
    } catch (...) {
      Failed(slot, "cannot write the record of '" + entry.path + "'");
      try {
        slot.line = AuditLine(entry, nullptr);
      } catch (...) {
        slot.line = R"({"status":"error","error":"out of memory"})";
      }
    }
  }

  static void Failed(Slot& slot, const std::string& message) {
    slot.report.reset();
    slot.entry.kind = AuditEntry::Kind::Error;
    slot.entry.message = message;
  }

  const AuditOptions& options_;
  std::mutex mutex_;
  std::condition_variable workReady_;
  std::condition_variable resultReady_;
  std::deque<std::unique_ptr<Slot>> window_;
  std::deque<Slot*> pending_;
  bool stop_ = false;
  std::vector<std::thread> workers_;
};

// A progress bar on standard error, redrawn at most ten times a second.
class Progress {
 public:
  Progress(bool shown, std::optional<long long> total)
      : shown_(shown), total_(total), start_(std::chrono::steady_clock::now()) {}

  void Update(long long done, bool last = false) {
    if (!shown_) return;
    const auto now = std::chrono::steady_clock::now();
    if (!last && now - drawn_ < std::chrono::milliseconds(100)) return;
    drawn_ = now;
    const double seconds = std::chrono::duration<double>(now - start_).count();
    const double rate = seconds > 0.0 ? static_cast<double>(done) / seconds : 0.0;
    std::string line = "\r";
    if (total_ && *total_ > 0) {
      const long long filled = std::min<long long>(20, done * 20 / *total_);
      line += "[" + std::string(static_cast<std::size_t>(filled), '#') +
              std::string(static_cast<std::size_t>(20 - filled), ' ') + "] " +
              std::to_string(done) + "/" + std::to_string(*total_) + " files";
    } else {
      line += std::to_string(done) + " files";
    }
    line += ", " + Fixed(rate, 1) + " files/s";
    if (total_ && rate > 0.0) {
      const long long left = static_cast<long long>(static_cast<double>(*total_ - done) / rate);
      line += ", " + std::to_string(left / 60) + ":" + (left % 60 < 10 ? "0" : "") +
              std::to_string(left % 60) + " left";
    }
    line += "   ";
    width_ = std::max(width_, line.size());
    std::cerr << line << std::flush;
  }
  // Clears the bar, before the summary.
  void Clear() {
    if (shown_ && width_ > 0) std::cerr << "\r" << std::string(width_, ' ') << "\r" << std::flush;
    width_ = 0;
  }

 private:
  bool shown_;
  std::optional<long long> total_;
  std::chrono::steady_clock::time_point start_;
  std::chrono::steady_clock::time_point drawn_{};
  std::size_t width_ = 0;
};

}  // namespace

PathWalk::PathWalk(std::vector<std::string> arguments, std::istream& input)
    : arguments_(std::move(arguments)), input_(input) {}

std::optional<AuditEntry> PathWalk::Examine(const std::string& path) {
  struct stat status {};
  if (stat(path.c_str(), &status) != 0) {
    const int error = errno;
    if (error == ELOOP) {
      return AuditEntry{path, AuditEntry::Kind::Skipped,
                        "skipped '" + path + "': a loop of symbolic links"};
    }
    return AuditEntry{path, AuditEntry::Kind::Error,
                      "cannot read '" + path + "': " + std::strerror(error)};
  }
  if (S_ISREG(status.st_mode)) return AuditEntry{path, AuditEntry::Kind::File, std::string()};
  if (!S_ISDIR(status.st_mode)) {
    return AuditEntry{
        path, AuditEntry::Kind::Skipped,
        "skipped '" + path + "': " + FileKindOf(status.st_mode) + ", not a regular file"};
  }
  for (const Level& level : levels_) {
    if (level.device == status.st_dev && level.inode == status.st_ino) {
      return AuditEntry{path, AuditEntry::Kind::Skipped,
                        "skipped '" + path + "': a loop, it leads back to '" + level.folder + "'"};
    }
  }
  Level level;
  level.folder = path;
  level.device = status.st_dev;
  level.inode = status.st_ino;
  if (!ListFolder(path, level.names)) {
    return AuditEntry{path, AuditEntry::Kind::Error,
                      "cannot read '" + path + "': " + std::strerror(errno)};
  }
  levels_.push_back(std::move(level));
  return std::nullopt;
}

std::optional<AuditEntry> PathWalk::Next() {
  for (;;) {
    if (!levels_.empty()) {
      Level& level = levels_.back();
      if (level.next == level.names.size()) {
        levels_.pop_back();
        continue;
      }
      const std::string path = Join(level.folder, level.names[level.next++]);
      if (auto entry = Examine(path)) return entry;
      continue;
    }
    if (reading_) {
      std::string line;
      if (std::getline(input_, line)) {
        if (line.empty()) continue;
        if (auto entry = Examine(line)) return entry;
        continue;
      }
      reading_ = false;
    }
    if (nextArgument_ == arguments_.size()) return std::nullopt;
    const std::string& argument = arguments_[nextArgument_++];
    if (argument == "-") {
      reading_ = true;
      continue;
    }
    if (auto entry = Examine(argument)) return entry;
  }
}

void AuditSummary::Add(const AuditEntry& entry, const FileReport* report) {
  ++files;
  if (entry.kind == AuditEntry::Kind::Error) ++errors;
  if (entry.kind == AuditEntry::Kind::Skipped) ++skipped;
  if (report == nullptr) return;
  ++read;
  bool damage = false;
  for (const StreamReport& stream : report->streams) {
    ++streamsByKind[stream.kind];
    damage = damage || !stream.damage.empty();
    if (!stream.description || !Judged(stream)) continue;
    auto& counts = verdicts.try_emplace(stream.codec).first->second;
    ++counts[static_cast<std::size_t>(KindOf(stream))];
    if (stream.uncompressed) {
      const double ratio = static_cast<double>(*stream.uncompressed) /
                           static_cast<double>(stream.description->GetBitrate());
      Lossless& sums = lossless[stream.codec];
      sums.ratioMin = sums.streams == 0 ? ratio : std::min(sums.ratioMin, ratio);
      sums.ratioMax = sums.streams == 0 ? ratio : std::max(sums.ratioMax, ratio);
      sums.ratioSum += ratio;
      ++sums.streams;
    }
    if (auto rate = PixelRateOf(entry.path, stream)) {
      if (pixelRates.size() < kPixelRates) {
        pixelRates.push_back(std::move(*rate));
      } else {
        ++pixelRatesLeftOut;
      }
    }
  }
  if (damage) ++damaged;
}

int AuditSummary::ExitStatus() const { return errors > 0 ? 2 : damaged > 0 ? 1 : 0; }

void PrintSummary(std::ostream& out, const AuditSummary& summary) {
  out << "Summary: " << summary.files << (summary.files == 1 ? " path" : " paths") << ", "
      << summary.read << " read (" << summary.damaged << " with a damaged stream), "
      << summary.errors << (summary.errors == 1 ? " error" : " errors") << ", " << summary.skipped
      << " skipped\n";
  out << "Streams:";
  if (summary.streamsByKind.empty()) out << " none";
  bool first = true;
  for (const auto& [kind, count] : summary.streamsByKind) {
    out << (first ? " " : ", ") << count << ' ' << kind;
    first = false;
  }
  out << '\n';
  if (!summary.verdicts.empty()) {
    out << "Verdicts by codec:\n" << std::left << std::setw(14) << "  codec";
    for (const char* heading : kVerdictHeadings) out << std::right << std::setw(11) << heading;
    out << '\n';
    for (const auto& [codec, counts] : summary.verdicts) {
      out << "  " << std::left << std::setw(12) << codec;
      for (const long long count : counts) out << std::right << std::setw(11) << count;
      out << '\n';
    }
  }
  if (!summary.lossless.empty()) {
    out << "Lossless compression (uncompressed:compressed):\n"
        << std::left << std::setw(14) << "  codec" << std::right << std::setw(9) << "streams"
        << std::setw(9) << "mean" << std::setw(9) << "min" << std::setw(9) << "max" << '\n';
    for (const auto& [codec, sums] : summary.lossless) {
      out << "  " << std::left << std::setw(12) << codec << std::right << std::setw(9)
          << sums.streams << std::setw(9)
          << Fixed(sums.ratioSum / static_cast<double>(sums.streams), 2) + ":1" << std::setw(9)
          << Fixed(sums.ratioMin, 2) + ":1" << std::setw(9) << Fixed(sums.ratioMax, 2) + ":1"
          << '\n';
    }
  }
  out << std::left;
}

void WriteReport(std::ostream& out, const AuditSummary& summary) {
  std::ostringstream text;
  PrintSummary(text, summary);
  out << "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
         "<!DOCTYPE html>\n"
         "<html xmlns=\"http://www.w3.org/1999/xhtml\" lang=\"en\">\n<head>\n"
         "<meta charset=\"UTF-8\"/>\n<title>formatdesc probe report</title>\n<style>\n"
         "body { font-family: sans-serif; margin: 2em; color: #222; }\n"
         "table { border-collapse: collapse; margin: 1em 0; }\n"
         "th, td { border: 1px solid #bbb; padding: 0.2em 0.6em; text-align: right; }\n"
         "th:first-child, td:first-child { text-align: left; }\n"
         "</style>\n</head>\n<body>\n<h1>Media library report</h1>\n";
  out << "<p>" << summary.files << " paths: " << summary.read << " read (" << summary.damaged
      << " with a damaged stream), " << summary.errors << " errors, " << summary.skipped
      << " skipped.</p>\n<h2>Streams</h2>\n<table>\n<tr><th>kind</th><th>streams</th></tr>\n";
  for (const auto& [kind, count] : summary.streamsByKind) {
    out << "<tr><td>" << Xml(kind) << "</td><td>" << count << "</td></tr>\n";
  }
  out << "</table>\n<h2>Bitrate verdicts by codec</h2>\n<table>\n<tr><th>codec</th>";
  for (const char* heading : kVerdictHeadings) out << "<th>" << heading << "</th>";
  out << "</tr>\n";
  for (const auto& [codec, counts] : summary.verdicts) {
    out << "<tr><td>" << Xml(codec) << "</td>";
    for (const long long count : counts) out << "<td>" << count << "</td>";
    out << "</tr>\n";
  }
  out << "</table>\n<h2>Lossless compression</h2>\n<table>\n"
         "<tr><th>codec</th><th>streams</th><th>mean</th><th>min</th><th>max</th></tr>\n";
  for (const auto& [codec, sums] : summary.lossless) {
    out << "<tr><td>" << Xml(codec) << "</td><td>" << sums.streams << "</td><td>"
        << Fixed(sums.ratioSum / static_cast<double>(sums.streams), 2) << ":1</td><td>"
        << Fixed(sums.ratioMin, 2) << ":1</td><td>" << Fixed(sums.ratioMax, 2) << ":1</td></tr>\n";
  }
  out << "</table>\n";

  // Bits per pixel on a logarithmic axis: each stream's range as a bar, its own rate as a dot
  // (red outside the range).
  const auto& rates = summary.pixelRates;
  out << "<h2>Video bits per pixel against the presets' range</h2>\n";
  if (rates.empty()) {
    out << "<p>No video stream with a bitrate, a size, a frame rate and a preset.</p>\n";
  } else {
    double low = rates.front().bitsPerPixel, high = low;
    for (const PixelRate& rate : rates) {
      low = std::min({low, rate.bitsPerPixel, rate.minimum});
      high = std::max({high, rate.bitsPerPixel, rate.maximum});
    }
    low = std::pow(10.0, std::floor(std::log10(std::max(low, 1e-6))));
    high = std::pow(10.0, std::ceil(std::log10(std::max(high, low * 10.0))));
    const double left = 260.0, plot = 480.0, row = 18.0, top = 30.0;
    const double height = top + row * static_cast<double>(rates.size()) + 20.0;
    const auto x = [&](double value) {
      const double clamped = std::min(std::max(value, low), high);
      return left + plot * std::log10(clamped / low) / std::log10(high / low);
    };
    out << "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"" << left + plot + 20
        << "\" height=\"" << height << "\" viewBox=\"0 0 " << left + plot + 20 << ' ' << height
        << "\" font-family=\"sans-serif\" font-size=\"11\">\n"
        << "<rect width=\"100%\" height=\"100%\" fill=\"white\"/>\n";
    for (double tick = low; tick <= high * 1.0001; tick *= 10.0) {
      out << "<line x1=\"" << x(tick) << "\" y1=\"" << top - 8 << "\" x2=\"" << x(tick)
          << "\" y2=\"" << height - 20 << "\" stroke=\"#ddd\"/>\n<text x=\"" << x(tick) << "\" y=\""
          << top - 12 << "\" text-anchor=\"middle\">" << tick << "</text>\n";
    }
    double y = top;
    for (const PixelRate& rate : rates) {
      const bool within = rate.bitsPerPixel >= rate.minimum && rate.bitsPerPixel <= rate.maximum;
      out << "<text x=\"4\" y=\"" << y + 12 << "\">"
          << Xml(rate.path.size() > 36 ? "..." + rate.path.substr(rate.path.size() - 33)
                                       : rate.path)
          << " #" << rate.index << " (" << Xml(rate.codec) << ")</text>\n"
          << "<rect x=\"" << x(rate.minimum) << "\" y=\"" << y + 4 << "\" width=\""
          << std::max(1.0, x(rate.maximum) - x(rate.minimum))
          << "\" height=\"10\" fill=\"#cde\"/>\n"
          << "<circle cx=\"" << x(rate.bitsPerPixel) << "\" cy=\"" << y + 9 << "\" r=\"4\" fill=\""
          << (within ? "#262" : "#c22") << "\"><title>" << Fixed(rate.bitsPerPixel, 4)
          << " bits per pixel; range " << Fixed(rate.minimum, 4) << " to " << Fixed(rate.maximum, 4)
          << "</title></circle>\n";
      y += row;
    }
    out << "<text x=\"" << left << "\" y=\"" << height - 4
        << "\">bits per pixel (logarithmic)</text>\n</svg>\n";
    if (summary.pixelRatesLeftOut > 0) {
      out << "<p>" << summary.pixelRatesLeftOut << " more video streams are counted above but not "
          << "drawn.</p>\n";
    }
  }
  out << "<h2>Summary as text</h2>\n<pre>" << Xml(text.str()) << "</pre>\n</body>\n</html>\n";
}

std::pair<std::string, std::string> PathMember(const std::string& path) {
  try {
    (void)nlohmann::json(path).dump();
    return {"path", path};
  } catch (const nlohmann::json::type_error&) {
    return {"path_base64", Base64(path)};
  }
}

std::string AuditLine(const AuditEntry& entry, const FileReport* report) {
  nlohmann::ordered_json json;
  const auto [key, value] = PathMember(entry.path);
  json[key] = value;
  if (report == nullptr) {
    const bool skipped = entry.kind == AuditEntry::Kind::Skipped;
    json["status"] = skipped ? "skipped" : "error";
    json[skipped ? "note" : "error"] = entry.message;
  } else {
    const bool damaged = std::any_of(report->streams.begin(), report->streams.end(),
                                     [](const StreamReport& s) { return !s.damage.empty(); });
    json["status"] = damaged ? "damaged" : "read";
    nlohmann::ordered_json whole = ProbeJson(entry.path, *report, std::nullopt);
    json["container"] = std::move(whole["container"]);
    json["streams"] = std::move(whole["streams"]);
    nlohmann::ordered_json verdicts = nlohmann::ordered_json::array();
    for (const StreamReport& stream : report->streams) {
      if (stream.description && Judged(stream)) {
        const auto& verdict =
            json["streams"][static_cast<std::size_t>(&stream - report->streams.data())];
        verdicts.push_back({{"index", stream.index},
                            {"codec", stream.codec},
                            {"result", verdict["verdict"]["result"]}});
      }
    }
    json["verdicts"] = std::move(verdicts);
  }
  return json.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

int RunAudit(PathWalk& walk, const AuditOptions& options, std::optional<long long> total) {
  // The report's file is opened first, so that a name that cannot be written is known at once.
  std::ofstream page;
  if (options.report) {
    page.open(*options.report, std::ios::binary);
    if (!page) {
      throw UsageError("--report: cannot write '" + *options.report + "': " + std::strerror(errno));
    }
  }
  AuditSummary summary;
  Progress progress(isatty(STDERR_FILENO) != 0, total);
  // Text written to the terminal the bar is drawn on: the bar is cleared before each file's text
  // and drawn again below it.
  const bool shared = !options.jsonl && isatty(STDOUT_FILENO) != 0;
  {
    Pipeline pipeline(options);
    const std::size_t window = std::max(4u, options.jobs * 4u);
    bool more = true;
    for (;;) {
      while (more && pipeline.InFlight() < window) {
        std::optional<AuditEntry> entry = walk.Next();
        if (entry) {
          pipeline.Push(std::move(*entry));
        } else {
          more = false;
        }
      }
      if (pipeline.InFlight() == 0) break;
      const std::unique_ptr<Pipeline::Slot> slot = pipeline.PopFront();
      if (shared) progress.Clear();
      const AuditEntry& entry = slot->entry;
      const FileReport* report = slot->report ? &*slot->report : nullptr;
      if (options.jsonl) {
        std::cout << slot->line << '\n' << std::flush;
      } else {
        if (summary.files > 0) std::cout << '\n';
        if (report != nullptr) {
          PrintProbe(entry.path, *report, std::nullopt);
        } else {
          std::cout << "File: " << entry.path << '\n'
                    << (entry.kind == AuditEntry::Kind::Skipped ? "Skipped: " : "Error: ")
                    << entry.message << '\n';
        }
      }
      summary.Add(entry, report);
      if (shared) std::cout << std::flush;
      progress.Update(summary.files, shared);
    }
  }
  progress.Update(summary.files, true);
  progress.Clear();
  if (options.jsonl) {
    PrintSummary(std::cerr, summary);
  } else {
    std::cout << '\n';
    PrintSummary(std::cout, summary);
  }
  if (options.report) {
    WriteReport(page, summary);
    if (!page.flush()) {
      throw UsageError("--report: cannot write '" + *options.report + "': " + std::strerror(errno));
    }
  }
  return summary.ExitStatus();
}

}  // namespace Formatdesc
