// formatdesc probe over a media library, run as a user runs it: a folder tree holding good,
// damaged and unreadable entries, a FIFO, a loop of links and names no terminal shows well; the
// same list sharded with GNU parallel; the XHTML report read by an XML parser and its chart drawn
// by rsvg-convert; and --json of a description with 100,000 metadata entries.
#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/JsonForm.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <vector>

namespace {

namespace fs = std::filesystem;

struct Result {
  int status = -1;
  std::string out;
  std::string err;
};

std::string Slurp(const fs::path& path) {
  std::ifstream file(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
}

// Runs `command` with sh in the work folder, with a time limit so that a stalled run fails.
Result Shell(const std::string& command) {
  const std::string err = std::string(AUDIT_WORK) + "/stderr.txt";
  const std::string line =
      "cd '" AUDIT_WORK "' && timeout 120 sh -c '" + command + "' 2>'" + err + "'";
  Result result;
  FILE* pipe = popen(line.c_str(), "r");
  if (pipe == nullptr) return result;
  char buffer[4096];
  std::size_t n = 0;
  while ((n = fread(buffer, 1, sizeof buffer, pipe)) > 0) result.out.append(buffer, n);
  const int status = pclose(pipe);
  result.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  result.err = Slurp(err);
  return result;
}

std::vector<std::string> Lines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) lines.push_back(line);
  return lines;
}

const std::string kTool = FORMATDESC;

void Copy(const std::string& name, const fs::path& to) {
  fs::create_directories(to.parent_path());
  fs::copy_file(fs::path(PROBE_MEDIA) / name, to, fs::copy_options::overwrite_existing);
}

// A library of good files, a damaged one, a link to nothing, a FIFO, a link back to the top,
// a name with a newline and one that is not UTF-8.
class AuditLibrary : public ::testing::Test {
 protected:
  // Made once for the suite; a failure here fails each test rather than skipping it.
  void SetUp() override {
    static const bool made = [] {
      const fs::path work = AUDIT_WORK;
      fs::remove_all(work);
      const fs::path lib = work / "lib";
      Copy("sd.mp4", lib / "a/sd.mp4");
      Copy("stereo.wav", lib / "a/stereo.wav");
      Copy("damaged.ts", lib / "b/damaged.ts");
      fs::create_symlink("nowhere.mp4", lib / "b/gone.mp4");
      fs::create_directories(lib / "c");
      fs::create_directory_symlink("..", lib / "c/loop");
      Copy("stereo.wav", lib / "new\nline.wav");
      Copy("surround.ac3", lib / "\xff\xfe.ac3");
      for (const char* name : {"sd.mp4", "low.avi", "stereo.wav", "mono.ac3", "subtitles.mkv"}) {
        Copy(name, work / "shard" / name);
      }
      return mkfifo((lib / "c/fifo").c_str(), 0600) == 0;
    }();
    ASSERT_TRUE(made);
  }
};

TEST_F(AuditLibrary, EveryEntryIsReportedInOrderAndSummarised) {
  const Result run = Shell(kTool + " probe lib --jsonl --jobs 3");
  EXPECT_EQ(run.status, 2) << run.err;  // the link to nothing could not be read
  const std::vector<std::string> lines = Lines(run.out);
  ASSERT_EQ(lines.size(), 8u) << run.out;
  const std::vector<std::pair<std::string, std::string>> expected = {
      {"lib/a/sd.mp4", "read"},        {"lib/a/stereo.wav", "read"},
      {"lib/b/damaged.ts", "damaged"}, {"lib/b/gone.mp4", "error"},
      {"lib/c/fifo", "skipped"},       {"lib/c/loop", "skipped"},
      {"lib/new\nline.wav", "read"},   {"", "read"}};
  std::vector<nlohmann::json> records;
  for (std::size_t i = 0; i < lines.size(); ++i) {
    records.push_back(nlohmann::json::parse(lines[i]));
    const nlohmann::json& record = records.back();
    EXPECT_EQ(record["status"], expected[i].second) << lines[i];
    if (!expected[i].first.empty()) {
      EXPECT_EQ(record["path"], expected[i].first);
    }
  }
  // Bytes that are not UTF-8 are kept exactly, in base64.
  EXPECT_FALSE(records[7].contains("path"));
  EXPECT_EQ(records[7]["path_base64"], "bGliL//+LmFjMw==");  // "lib/\xff\xfe.ac3"
  EXPECT_EQ(records[4]["note"], "skipped 'lib/c/fifo': a FIFO, not a regular file");
  EXPECT_EQ(records[5]["note"], "skipped 'lib/c/loop': a loop, it leads back to 'lib'");
  EXPECT_EQ(records[3]["error"], "cannot read 'lib/b/gone.mp4': No such file or directory");
  EXPECT_EQ(records[0]["verdicts"],
            nlohmann::json::parse(R"([{"index":0,"codec":"mpeg4","result":"within"},
                                      {"index":1,"codec":"ac3","result":"within"}])"));
  // A file's streams are those probe --json gives for it alone.
  const Result alone = Shell(kTool + " probe lib/a/sd.mp4 --json");
  EXPECT_EQ(records[0]["streams"], nlohmann::json::parse(alone.out)["streams"]);
  EXPECT_EQ(run.err,
            "Summary: 8 paths, 5 read (1 with a damaged stream), 1 error, 2 skipped\n"
            "Streams: 5 audio, 2 video\n"
            "Verdicts by codec:\n"
            "  codec             below     within      above  no preset no bitrate      other"
            "   lossless\n"
            "  ac3                   0          3          0          0          0          0"
            "          0\n"
            "  mpeg4                 0          1          0          0          0          0"
            "          0\n"
            "  pcm_s16le             0          2          0          0          0          0"
            "          0\n");
  // One thread writes the same lines; text mode the same summary on standard output.
  EXPECT_EQ(Shell(kTool + " probe lib --jsonl --jobs 1").out, run.out);
  const Result text = Shell(kTool + " probe lib --jobs 2");
  EXPECT_EQ(text.status, 2);
  EXPECT_NE(text.out.find("\nFile: lib/c/fifo\nSkipped: skipped 'lib/c/fifo'"), std::string::npos);
  EXPECT_EQ(text.out.substr(text.out.size() - run.err.size()), run.err);
}

TEST_F(AuditLibrary, ShardedWithParallelGivesTheSameLines) {
  const std::string list = "find shard -type f | ";
  const Result single = Shell(list + kTool + " probe - --jsonl | sort");
  const Result sharded = Shell(list + "parallel --will-cite --pipe -N2 --sshlogin : " + kTool +
                               " probe - --jsonl | sort");
  EXPECT_EQ(sharded.status, 0) << sharded.err;
  EXPECT_EQ(Lines(single.out).size(), 5u);
  EXPECT_EQ(sharded.out, single.out);
  EXPECT_EQ(Shell(kTool + " probe shard --jsonl | sort").out, single.out);
  EXPECT_EQ(Shell("printf \"\" | " + kTool + " probe - --jsonl").status, 0);
}

TEST_F(AuditLibrary, ReportIsWellFormedAndItsChartRenders) {
  const Result run = Shell(kTool + " probe shard --report report.html");
  EXPECT_EQ(run.status, 0) << run.err;
  const std::string page = Slurp(fs::path(AUDIT_WORK) / "report.html");
  EXPECT_EQ(Shell("xmllint --noout report.html").status, 0);
  for (const char* fetch : {"<script", "src=", "href=", "<link"}) {
    EXPECT_EQ(page.find(fetch), std::string::npos) << fetch;
  }
  const std::size_t begin = page.find("<svg"), end = page.find("</svg>");
  ASSERT_NE(begin, std::string::npos);
  ASSERT_NE(end, std::string::npos);
  const std::string chart = page.substr(begin, end + 6 - begin);
  // One dot a video stream with a bitrate: sd.mp4 and low.avi (Matroska gives none).
  std::size_t dots = 0;
  for (std::size_t at = chart.find("<circle"); at != std::string::npos;
       at = chart.find("<circle", at + 1)) {
    ++dots;
  }
  EXPECT_EQ(dots, 2u);
  std::ofstream(fs::path(AUDIT_WORK) / "chart.svg") << chart;
  EXPECT_EQ(Shell("rsvg-convert -o chart.png chart.svg").status, 0);
  EXPECT_GT(fs::file_size(fs::path(AUDIT_WORK) / "chart.png"), 0u);
}

// Quadratic time would take minutes here; linear time takes about a second. An unoptimised
// sanitizer build is a hundred times slower throughout: there a smaller description checks the
// memory errors alone.
#if defined(__SANITIZE_ADDRESS__) || !defined(NDEBUG)
constexpr int kEntries = 2000;
#else
constexpr int kEntries = 100000;
#endif

TEST(AuditJson, HundredThousandMetadataEntries) {
  auto video = Tarvek::Conf::FormatCodecVideo::Create();
  video->SetCodecID("h264");
  Tarvek::Core::Property metadata("metadata");
  for (int i = 0; i < kEntries; ++i) {
    metadata.SetChildT<std::string>("key" + std::to_string(i), "value");
  }
  video->SetMetadata(metadata);
  fs::create_directories(AUDIT_WORK);
  std::ofstream(fs::path(AUDIT_WORK) / "big.json") << Tarvek::Conf::ToJson(video);
  const auto start = std::chrono::steady_clock::now();
  const Result run = Shell(kTool + " video --from-json big.json --no-bitrate --json");
  const double seconds =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_LT(seconds, 20.0);
  EXPECT_EQ(nlohmann::json::parse(run.out)["settings"]["metadata"].size(),
            static_cast<std::size_t>(kEntries));
}

}  // namespace
