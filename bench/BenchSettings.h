// The twelve settings every workload describes, shared by the library's benchmarks and the peers'
// so that each one describes the same stream.
#ifndef TARVEK_BENCH_BENCHSETTINGS_H_
#define TARVEK_BENCH_BENCHSETTINGS_H_

namespace TarvekBench {

constexpr const char* kCodecName = "H.264 / AVC";
constexpr const char* kCodecId = "h264";
constexpr const char* kBitrateMode = "vbr";
constexpr long long kBitrate = 8000000;
constexpr long long kQuality = 23;
constexpr unsigned int kWidth = 1920;
constexpr unsigned int kHeight = 1080;
constexpr unsigned int kPixelAspectX = 1;
constexpr unsigned int kPixelAspectY = 1;
constexpr unsigned int kFrameRateNum = 30000;
constexpr unsigned int kFrameRateDen = 1001;
constexpr int kPixelFormat = 0;
constexpr bool kLossless = false;
constexpr bool kTwoPass = true;

// The workload names, in the order of the summary table. A benchmark named "<Subject>/<workload>"
// is one cell of that table.
constexpr const char* kBuild = "build";
constexpr const char* kRead = "read";
constexpr const char* kClone = "clone";
constexpr const char* kCompare = "compare";
constexpr const char* kCompatible = "compatible";

}  // namespace TarvekBench

#endif  // TARVEK_BENCH_BENCHSETTINGS_H_
