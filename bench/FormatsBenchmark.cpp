// Measures the format description library on one video description with twelve settings, next to
// a plain C++ struct holding the same twelve fields (the floor) and, when they were found at
// configure time, GStreamer caps and FFmpeg codec parameters (GstPeer.cpp, FfmpegPeer.cpp).
// After the run it prints one table of median times per workload with the library's ratio to
// each of the others, so that no script is needed to read the results.
#include <Tarvek/Formats.h>
#include <benchmark/benchmark.h>
#include <boost/property_tree/ptree.hpp>

#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <map>
#include <new>
#include <streambuf>
#include <string>
#include <utility>
#include <vector>

#include <unistd.h>

#include "BenchSettings.h"

// ---------------------------------------------------------------------------------------------
// Heap accounting: a replacement global operator new/delete that counts allocation calls and,
// while a measurement asks for it, records the blocks allocated with their sizes, so that the
// bytes one description holds can be summed. Only C++ allocations are seen: the peers allocate
// with g_malloc and av_malloc, which this does not count. So the counting must cost next to
// nothing and must not change what the allocator does: no header on the blocks (it would move
// every library allocation into a larger size class, which the peers' never are) and no locked
// read-modify-write (the benchmarks run on one thread; were another thread to allocate meanwhile,
// a count could be lost, never corrupted).
namespace {

std::atomic<long long> g_allocations{0};

// The blocks recorded while tracing is on, still live. Searched linearly: a measurement records
// a few dozen.
struct TracedBlock {
  void* block;
  std::size_t size;
};
constexpr std::size_t kMostTraced = 1024;
TracedBlock g_traced[kMostTraced];
std::size_t g_traced_count = 0;
bool g_tracing = false;
bool g_traced_overflow = false;

void* CountedAlloc(std::size_t size) noexcept {
  void* block = std::malloc(size == 0 ? 1 : size);
  if (block == nullptr) return nullptr;
  g_allocations.store(g_allocations.load(std::memory_order_relaxed) + 1, std::memory_order_relaxed);
  if (g_tracing) {
    if (g_traced_count < kMostTraced) {
      g_traced[g_traced_count++] = {block, size};
    } else {
      g_traced_overflow = true;
    }
  }
  return block;
}

void CountedFree(void* pointer) noexcept {
  if (pointer == nullptr) return;
  for (std::size_t i = 0; i < g_traced_count; ++i) {
    if (g_traced[i].block == pointer) {
      g_traced[i] = g_traced[--g_traced_count];
      break;
    }
  }
  std::free(pointer);
}

// The bytes of the recorded blocks still live.
long long TracedBytes() {
  long long bytes = 0;
  for (std::size_t i = 0; i < g_traced_count; ++i)
    bytes += static_cast<long long>(g_traced[i].size);
  return bytes;
}

void* CountedAllocOrThrow(std::size_t size) {
  void* pointer = CountedAlloc(size);
  if (pointer == nullptr) throw std::bad_alloc();
  return pointer;
}

}  // namespace

void* operator new(std::size_t size) { return CountedAllocOrThrow(size); }
void* operator new[](std::size_t size) { return CountedAllocOrThrow(size); }
void* operator new(std::size_t size, const std::nothrow_t&) noexcept { return CountedAlloc(size); }
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
  return CountedAlloc(size);
}
void operator delete(void* pointer) noexcept { CountedFree(pointer); }
void operator delete[](void* pointer) noexcept { CountedFree(pointer); }
void operator delete(void* pointer, std::size_t) noexcept { CountedFree(pointer); }
void operator delete[](void* pointer, std::size_t) noexcept { CountedFree(pointer); }
void operator delete(void* pointer, const std::nothrow_t&) noexcept { CountedFree(pointer); }
void operator delete[](void* pointer, const std::nothrow_t&) noexcept { CountedFree(pointer); }

namespace {

using Tarvek::Conf::IFormat;
using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecVideo;
using VideoPtr = boost::intrusive_ptr<IFormatCodecVideo>;
namespace S = TarvekBench;

// Reports the C++ allocation calls made per iteration of a timed loop.
class AllocationsPerIteration {
 public:
  AllocationsPerIteration() : start_(g_allocations.load(std::memory_order_relaxed)) {}
  void Report(benchmark::State& state) const {
    const long long calls = g_allocations.load(std::memory_order_relaxed) - start_;
    state.counters["allocs_per_iter"] =
        benchmark::Counter(static_cast<double>(calls), benchmark::Counter::kAvgIterations);
  }

 private:
  long long start_;
};

// ---------------------------------------------------------------------------------------------
// The library.

VideoPtr BuildFull() {
  VideoPtr video = Tarvek::Conf::FormatCodecVideo::Create();
  video->SetCodecName(S::kCodecName);
  video->SetCodecID(S::kCodecId);
  video->SetBitrateMode(IFormatCodec::TAG_BITRATE_MODE_VBR);
  video->SetBitrate(S::kBitrate);
  video->SetQuality(S::kQuality);
  video->InitByPixelAspect(S::kWidth, S::kHeight, S::kPixelAspectX, S::kPixelAspectY);
  video->SetFrameRate(S::kFrameRateNum, S::kFrameRateDen);
  video->SetPixelFormat(static_cast<AVPixelFormat>(S::kPixelFormat));
  video->SetLossless(S::kLossless);
  video->SetTwoPassEncoding(S::kTwoPass);
  return video;
}

// A second description with only the geometry, for the compatibility test.
VideoPtr BuildGeometry() {
  VideoPtr video = Tarvek::Conf::FormatCodecVideo::Create();
  video->InitByPixelAspect(S::kWidth, S::kHeight, S::kPixelAspectX, S::kPixelAspectY);
  return video;
}

void TarvekBuild(benchmark::State& state) {
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    VideoPtr video = BuildFull();
    benchmark::DoNotOptimize(video.get());
  }
  allocations.Report(state);
}

void TarvekRead(benchmark::State& state) {
  const VideoPtr video = BuildFull();
  const IFormatCodecVideo& v = *video;
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    if (v.ExistsCodecName()) benchmark::DoNotOptimize(v.GetCodecName());
    if (v.ExistsCodecID()) benchmark::DoNotOptimize(v.GetCodecID());
    if (v.ExistsBitrateMode()) benchmark::DoNotOptimize(v.GetBitrateMode());
    if (v.ExistsBitrate()) benchmark::DoNotOptimize(v.GetBitrate());
    if (v.ExistsQuality()) benchmark::DoNotOptimize(v.GetQuality());
    if (v.ExistsWidth()) benchmark::DoNotOptimize(v.GetWidth());
    if (v.ExistsHeight()) benchmark::DoNotOptimize(v.GetHeight());
    if (v.ExistsPixelAspectX() && v.ExistsPixelAspectY()) {
      benchmark::DoNotOptimize(v.GetPixelAspectX());
      benchmark::DoNotOptimize(v.GetPixelAspectY());
    }
    if (v.ExistsFrameRateNum() && v.ExistsFrameRateDen()) {
      benchmark::DoNotOptimize(v.GetFrameRateNum());
      benchmark::DoNotOptimize(v.GetFrameRateDen());
    }
    if (v.ExistsPixelFormat()) benchmark::DoNotOptimize(v.GetPixelFormat());
    if (v.ExistsLossless()) benchmark::DoNotOptimize(v.GetLossless());
    if (v.ExistsTwoPassEncoding()) benchmark::DoNotOptimize(v.GetTwoPassEncoding());
  }
  allocations.Report(state);
}

void TarvekClone(benchmark::State& state) {
  const VideoPtr video = BuildFull();
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    VideoPtr copy = video->Clone();
    benchmark::DoNotOptimize(copy.get());
  }
  allocations.Report(state);
}

void TarvekCompare(benchmark::State& state) {
  const VideoPtr first = BuildFull();
  const boost::intrusive_ptr<const IFormat> second = BuildFull();
  AllocationsPerIteration allocations;
  for (auto _ : state) benchmark::DoNotOptimize(first->Compare(second));
  allocations.Report(state);
  if (!first->Compare(second)) state.SkipWithError("the two descriptions differ");
}

void TarvekCompatible(benchmark::State& state) {
  const VideoPtr first = BuildFull();
  const boost::intrusive_ptr<const IFormat> second = BuildGeometry();
  AllocationsPerIteration allocations;
  for (auto _ : state) benchmark::DoNotOptimize(first->IsCompatible(second));
  allocations.Report(state);
  if (!first->IsCompatible(second)) state.SkipWithError("the descriptions are not compatible");
}

// The bitrate look-up end to end: the reads of the settings it needs and the presets' figure.
void TarvekDefaultBitrate(benchmark::State& state) {
  const boost::intrusive_ptr<const IFormatCodec> video = BuildFull();
  AllocationsPerIteration allocations;
  for (auto _ : state) benchmark::DoNotOptimize(Tarvek::Conf::GetDefaultVideoBitrate(video));
  allocations.Report(state);
}

// A bitrate function refusing a description of another kind: the error is built with its call
// stack, thrown and caught. The first throw of the process is timed apart (first_throw_us): it
// pays once for what the unwinder and the loader set up.
void TarvekBitrateError(benchmark::State& state) {
  const boost::intrusive_ptr<const IFormatCodec> audio = Tarvek::Conf::FormatCodecAudio::Create();
  const auto refuse = [&audio] {
    try {
      benchmark::DoNotOptimize(Tarvek::Conf::GetDefaultVideoBitrate(audio));
    } catch (const Tarvek::Conf::ConfException& error) {
      benchmark::DoNotOptimize(&error);
    }
  };
  static const double first_throw_us = [&refuse] {
    const auto start = std::chrono::steady_clock::now();
    refuse();
    return std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - start)
        .count();
  }();
  for (auto _ : state) refuse();
  state.counters["first_throw_us"] = first_throw_us;
}

// Replacing a description's whole tree with that of a full description.
void TarvekSetProperty(benchmark::State& state) {
  const Tarvek::Core::Property tree = BuildFull()->GetProperty();
  const VideoPtr target = Tarvek::Conf::FormatCodecVideo::Create();
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    target->SetProperty(tree);
    benchmark::ClobberMemory();
  }
  allocations.Report(state);
}

// A stream buffer that takes every character and keeps none.
class NullBuffer : public std::streambuf {
 protected:
  int_type overflow(int_type c) override { return traits_type::not_eof(c); }
  std::streamsize xsputn(const char_type*, std::streamsize count) override { return count; }
};

// PrintContent writes to std::cout; its output is discarded for the measurement.
void TarvekPrintContent(benchmark::State& state) {
  const VideoPtr video = BuildFull();
  NullBuffer null_buffer;
  std::streambuf* const saved = std::cout.rdbuf(&null_buffer);
  AllocationsPerIteration allocations;
  for (auto _ : state) video->PrintContent();
  allocations.Report(state);
  std::cout.rdbuf(saved);
}

// What one full description holds on the heap, and in how many blocks. The timed loop builds and
// frees descriptions; the counters come from one description measured alone.
void TarvekHeapOfOneDescription(benchmark::State& state) {
  for (auto _ : state) {
    VideoPtr video = BuildFull();
    benchmark::DoNotOptimize(video.get());
  }
  const long long calls_before = g_allocations.load();
  g_traced_count = 0;
  g_tracing = true;
  VideoPtr video = BuildFull();
  g_tracing = false;
  const long long bytes = TracedBytes();
  const long long calls = g_allocations.load() - calls_before;
  if (g_traced_overflow) state.SkipWithError("too many blocks to record");
  // Blocks freed while building (temporaries) are counted as calls but not as bytes held.
  state.counters["heap_bytes"] = static_cast<double>(bytes);
  state.counters["allocations"] = static_cast<double>(calls);
}

// ---------------------------------------------------------------------------------------------
// What the fixed parts of the design cost on their own, to set build and clone against: a
// std::list holds each child in a heap block of its own, and the runtime entries are a Boost
// ptree holding the object name.

// As many blocks of a list node's size as a full description has children, allocated and freed.
void ConstraintListNodes(benchmark::State& state) {
  const std::size_t children = BuildFull()->GetProperty().GetChildren().size();
  const std::size_t nodeSize = sizeof(Tarvek::Core::Property) + 2 * sizeof(void*);
  std::vector<void*> blocks(children);
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    for (void*& block : blocks) block = ::operator new(nodeSize);
    benchmark::DoNotOptimize(blocks.data());
    for (void* block : blocks) ::operator delete(block);
  }
  allocations.Report(state);
}

// The runtime entries of a new video description, built as a description builds them.
boost::property_tree::ptree RuntimeEntries() {
  static const boost::property_tree::ptree::value_type kEmptyEntry(Tarvek::Conf::TAG_OBJECT,
                                                                   boost::property_tree::ptree());
  boost::property_tree::ptree entries;
  entries.push_back(kEmptyEntry)->second.data() = IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO;
  return entries;
}

void ConstraintRuntimeEntries(benchmark::State& state) {
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    boost::property_tree::ptree entries = RuntimeEntries();
    benchmark::DoNotOptimize(&entries);
  }
  allocations.Report(state);
}

void ConstraintRuntimeEntriesCopy(benchmark::State& state) {
  const boost::property_tree::ptree entries = RuntimeEntries();
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    boost::property_tree::ptree copy(entries);
    benchmark::DoNotOptimize(&copy);
  }
  allocations.Report(state);
}

// ---------------------------------------------------------------------------------------------
// The floor: a plain struct with the same twelve fields.

struct PlainVideo {
  std::string codec_name;
  std::string codec_id;
  std::string bitrate_mode;
  long long bitrate = 0;
  long long quality = 0;
  unsigned int width = 0;
  unsigned int height = 0;
  unsigned int aspect_x = 0;
  unsigned int aspect_y = 0;
  unsigned int frame_rate_num = 0;
  unsigned int frame_rate_den = 0;
  int pixel_format = -1;
  bool lossless = false;
  bool two_pass = false;

  bool operator==(const PlainVideo& o) const {
    return codec_name == o.codec_name && codec_id == o.codec_id && bitrate_mode == o.bitrate_mode &&
           bitrate == o.bitrate && quality == o.quality && width == o.width && height == o.height &&
           aspect_x == o.aspect_x && aspect_y == o.aspect_y && frame_rate_num == o.frame_rate_num &&
           frame_rate_den == o.frame_rate_den && pixel_format == o.pixel_format &&
           lossless == o.lossless && two_pass == o.two_pass;
  }
  bool IsCompatible(const PlainVideo& o) const {
    return width == o.width && height == o.height && aspect_x == o.aspect_x &&
           aspect_y == o.aspect_y;
  }
};

// Heap-allocated, as a description is, so that build and clone pay for one allocation too.
PlainVideo* BuildPlain() {
  auto* video = new PlainVideo;
  video->codec_name = S::kCodecName;
  video->codec_id = S::kCodecId;
  video->bitrate_mode = S::kBitrateMode;
  video->bitrate = S::kBitrate;
  video->quality = S::kQuality;
  video->width = S::kWidth;
  video->height = S::kHeight;
  video->aspect_x = S::kPixelAspectX;
  video->aspect_y = S::kPixelAspectY;
  video->frame_rate_num = S::kFrameRateNum;
  video->frame_rate_den = S::kFrameRateDen;
  video->pixel_format = S::kPixelFormat;
  video->lossless = S::kLossless;
  video->two_pass = S::kTwoPass;
  return video;
}

void PlainBuild(benchmark::State& state) {
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    PlainVideo* video = BuildPlain();
    benchmark::DoNotOptimize(video);
    delete video;
  }
  allocations.Report(state);
}

// The strings are looked at in place: a struct reader need not copy them, the floor is the loads.
void PlainRead(benchmark::State& state) {
  PlainVideo* video = BuildPlain();
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    benchmark::DoNotOptimize(video);
    const PlainVideo& v = *video;
    // Summed, so that every field is loaded: DoNotOptimize alone may take a field by address.
    benchmark::DoNotOptimize(v.codec_name.size() + v.codec_id.size() + v.bitrate_mode.size() +
                             static_cast<std::size_t>(v.bitrate + v.quality + v.pixel_format) +
                             v.width + v.height + v.aspect_x + v.aspect_y + v.frame_rate_num +
                             v.frame_rate_den + static_cast<std::size_t>(v.lossless) +
                             static_cast<std::size_t>(v.two_pass));
  }
  allocations.Report(state);
  delete video;
}

void PlainClone(benchmark::State& state) {
  PlainVideo* video = BuildPlain();
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    benchmark::DoNotOptimize(video);
    auto* copy = new PlainVideo(*video);
    benchmark::DoNotOptimize(copy);
    delete copy;
  }
  allocations.Report(state);
  delete video;
}

void PlainCompare(benchmark::State& state) {
  PlainVideo* first = BuildPlain();
  PlainVideo* second = BuildPlain();
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    benchmark::DoNotOptimize(first);
    benchmark::DoNotOptimize(second);
    benchmark::DoNotOptimize(*first == *second);
  }
  allocations.Report(state);
  delete first;
  delete second;
}

void PlainCompatible(benchmark::State& state) {
  PlainVideo* first = BuildPlain();
  auto* second = new PlainVideo;
  second->width = S::kWidth;
  second->height = S::kHeight;
  second->aspect_x = S::kPixelAspectX;
  second->aspect_y = S::kPixelAspectY;
  AllocationsPerIteration allocations;
  for (auto _ : state) {
    benchmark::DoNotOptimize(first);
    benchmark::DoNotOptimize(second);
    benchmark::DoNotOptimize(first->IsCompatible(*second));
  }
  allocations.Report(state);
  delete first;
  delete second;
}

std::string Name(const char* subject, const char* workload) {
  return std::string(subject) + "/" + workload;
}

// Registered at start-up, as the peers register theirs in their own files.
const bool kRegistered = [] {
  benchmark::RegisterBenchmark(Name("Tarvek", S::kBuild).c_str(), TarvekBuild);
  benchmark::RegisterBenchmark(Name("Tarvek", S::kRead).c_str(), TarvekRead);
  benchmark::RegisterBenchmark(Name("Tarvek", S::kClone).c_str(), TarvekClone);
  benchmark::RegisterBenchmark(Name("Tarvek", S::kCompare).c_str(), TarvekCompare);
  benchmark::RegisterBenchmark(Name("Tarvek", S::kCompatible).c_str(), TarvekCompatible);
  benchmark::RegisterBenchmark("Tarvek/default_bitrate", TarvekDefaultBitrate);
  benchmark::RegisterBenchmark("Tarvek/bitrate_error", TarvekBitrateError);
  benchmark::RegisterBenchmark("Tarvek/set_property", TarvekSetProperty);
  benchmark::RegisterBenchmark("Tarvek/print_content", TarvekPrintContent);
  benchmark::RegisterBenchmark("Tarvek/heap_of_one_description", TarvekHeapOfOneDescription)
      ->Iterations(1000);
  benchmark::RegisterBenchmark("Constraint/list_nodes", ConstraintListNodes);
  benchmark::RegisterBenchmark("Constraint/runtime_entries", ConstraintRuntimeEntries);
  benchmark::RegisterBenchmark("Constraint/runtime_entries_copy", ConstraintRuntimeEntriesCopy);
  benchmark::RegisterBenchmark(Name("PlainStruct", S::kBuild).c_str(), PlainBuild);
  benchmark::RegisterBenchmark(Name("PlainStruct", S::kRead).c_str(), PlainRead);
  benchmark::RegisterBenchmark(Name("PlainStruct", S::kClone).c_str(), PlainClone);
  benchmark::RegisterBenchmark(Name("PlainStruct", S::kCompare).c_str(), PlainCompare);
  benchmark::RegisterBenchmark(Name("PlainStruct", S::kCompatible).c_str(), PlainCompatible);
  return true;
}();

// ---------------------------------------------------------------------------------------------
// The summary table: the console output as usual, then the median (or, without repetitions, the
// single) real time of every "<Subject>/<workload>" benchmark, with the library's ratio to each
// other subject.

class TableReporter : public benchmark::ConsoleReporter {
 public:
  // Colour only on a terminal, so that a log or a pipe gets plain text.
  TableReporter() : ConsoleReporter(isatty(STDOUT_FILENO) != 0 ? OO_Defaults : OO_Tabular) {}

  void ReportRuns(const std::vector<Run>& runs) override {
    // Of the aggregates of repeated runs, only the median is shown: it is what the table uses.
    std::vector<Run> shown;
    for (const Run& run : runs) {
      if (run.run_type != Run::RT_Aggregate || run.aggregate_name == "median") shown.push_back(run);
    }
    if (!shown.empty()) ConsoleReporter::ReportRuns(shown);
    for (const Run& run : runs) {
      if (run.error_occurred) continue;
      const bool median = run.run_type == Run::RT_Aggregate && run.aggregate_name == "median";
      if (!median && run.run_type != Run::RT_Iteration) continue;
      const std::string& name = run.run_name.function_name;
      const std::size_t slash = name.find('/');
      if (slash == std::string::npos) continue;
      Cell& cell = times_[name.substr(slash + 1)][name.substr(0, slash)];
      if (median || !cell.median) {
        cell.nanoseconds = run.GetAdjustedRealTime() * Multiplier(run.time_unit);
        cell.median = median;
      }
    }
  }

  void Finalize() override {
    ConsoleReporter::Finalize();
    PrintTable(std::cout);
  }

 private:
  struct Cell {
    double nanoseconds = 0;
    bool median = false;
  };

  static double Multiplier(benchmark::TimeUnit unit) {
    switch (unit) {
      case benchmark::kSecond:
        return 1e9;
      case benchmark::kMillisecond:
        return 1e6;
      case benchmark::kMicrosecond:
        return 1e3;
      case benchmark::kNanosecond:
        break;
    }
    return 1;
  }

  void PrintTable(std::ostream& out) const {
    static const char* const kSubjects[] = {"Tarvek", "PlainStruct", "GStreamer", "FFmpeg"};
    static const char* const kWorkloads[] = {S::kBuild, S::kRead, S::kClone, S::kCompare,
                                             S::kCompatible};
    std::vector<std::string> subjects;
    for (const char* subject : kSubjects) {
      for (const auto& workload : times_) {
        if (workload.second.count(subject) != 0) {
          subjects.emplace_back(subject);
          break;
        }
      }
    }
    if (subjects.empty() || subjects.front() != "Tarvek") return;

    out << "\nMedian real time per workload (ns); ratio = Tarvek time / other time\n";
    char cell[64];
    std::snprintf(cell, sizeof cell, "%-12s", "workload");
    out << cell;
    for (const std::string& subject : subjects) {
      std::snprintf(cell, sizeof cell, "%14s", subject.c_str());
      out << cell;
    }
    for (std::size_t i = 1; i < subjects.size(); ++i) {
      const std::string header = "x" + subjects[i];
      std::snprintf(cell, sizeof cell, "%14s", header.c_str());
      out << cell;
    }
    out << '\n';
    for (const char* workload : kWorkloads) {
      const auto row = times_.find(workload);
      if (row == times_.end()) continue;
      std::snprintf(cell, sizeof cell, "%-12s", workload);
      out << cell;
      for (const std::string& subject : subjects) {
        const auto found = row->second.find(subject);
        if (found == row->second.end()) {
          std::snprintf(cell, sizeof cell, "%14s", "-");
        } else {
          std::snprintf(cell, sizeof cell, "%14.1f", found->second.nanoseconds);
        }
        out << cell;
      }
      const auto own = row->second.find("Tarvek");
      for (std::size_t i = 1; i < subjects.size(); ++i) {
        const auto other = row->second.find(subjects[i]);
        if (own == row->second.end() || other == row->second.end() ||
            other->second.nanoseconds <= 0) {
          std::snprintf(cell, sizeof cell, "%14s", "-");
        } else {
          std::snprintf(cell, sizeof cell, "%13.1fx",
                        own->second.nanoseconds / other->second.nanoseconds);
        }
        out << cell;
      }
      out << '\n';
    }
    out.flush();
  }

  // workload -> subject -> time
  std::map<std::string, std::map<std::string, Cell>> times_;
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  TableReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
