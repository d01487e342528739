// The published figures behind the bitrate look-ups, in one place. Every row names its source:
//   YT-UP       YouTube recommended upload encoding settings
//   HLS         Apple HLS authoring requirements for Apple devices
//   VP9-G       Google VP9 encoding settings (developers.google.com/media/vp9)
//   FF-264, FF-265, FF-VP9, FF-AV1, FF-AAC, FF-MP3   FFmpeg wiki, Encode/<codec>
//   FF-ENC      FFmpeg libx264.c, libvpxenc.c, libaomenc.c, libsvtav1.c option tables
//   FF-OPUS     FFmpeg libopusenc.c;  FF-AACENC  FFmpeg aacenc.c;  MPA  mpegaudiotabs.h
//   AC3         FFmpeg ac3tab.c;  DNXHD  FFmpeg dnxhddata.c;  SFMT  libavutil samplefmt.h
//   H264LV      H.264 Tables A-1, A-2 (FFmpeg h264_levels.c)
//   H265LV      H.265 Annex A level limits (FFmpeg h265_profile_level.c; AOSP)
//   AOSP        Android MediaCodecInfo.java, applyLevelLimits
//   MP2L        MPEG-2 profiles and levels summary (bretl.com)
//   FF-TGT      FFmpeg ffmpeg_opt.c, the -target presets (DVD, SVCD)
//   NIST, AVC-GOAL, BD   MPEG-2 vs AVC comparisons and the H.264 design goal
//   VCODEX      H.264 quantiser step doubles every 6 QP
//   MPL         MPlayer x264encopts: H.264 QP ~ 12 + 6 log2(MPEG qscale)
//   SO-CRF      measured x264 size per CRF step
//   PRORES      Apple ProRes White Paper, Target Data Rates;  PRORES-VBR  its data-rate notes
//   DNXHR       DNxHR bytes-per-frame table (root6technology.com)
//   FDK-H, FDK-C  fdk-aac aacenc_lib.h, aacenc.cpp;  SONNOX  Fraunhofer Pro-Codec manual
//   LAME        lame(1);  OPUS, OPUSENC  Opus API documentation, opusenc defaults
//   VORBIS, FLAC, ALAC, DD, EAC3   codec summaries of those formats
//   RFC7845     Ogg Opus, section 5.1.1.2 (channel mapping family 1)
//   VCD         Video CD (White Book): MPEG-1 video 1150 kbit/s at 352x288/25 and 352x240/29.97
//   DVD         DVD-Video: MPEG-1 video at most 1.856 Mbit/s; DTS at 754.5 or 1509.75 kbit/s
//   DTS         DTS Coherent Acoustics core: 32-1536 kbit/s (1509.75 on CD and DVD), up to 5.1,
//               sample rates up to 48 kHz
//   TRUEHD      Dolby TrueHD (MLP): lossless, up to 24-bit samples, 18 Mbit/s peak (Blu-ray)
// "derived" marks arithmetic on sourced figures; "assumption" marks a choice no source fixes.
#include "PresetTables.h"

namespace Tarvek {
namespace Conf {
namespace Presets {
namespace {

// ============================== Video ==============================

// log2(1.5): the bitrate grows 1.5x when the frame rate doubles. YT-UP: 60 fps / 30 fps = 1.5 at
// 720p, 1080p and 1440p; VP9-G: 1.5 at 1440p and 2160p (derived).
constexpr double kDoublingRateGrowth = 0.5849625007211562;

// Beyond the ladder ends: 0.75, between the slopes of HLS H.264 720p->1080p (0.68) and HLS HEVC
// 1080p->2160p (0.77) (derived).
constexpr double kLadderExtrapolation = 0.75;

// H.264 High profile at 24-30 fps, SDR; the anchor of every software codec's default.
constexpr LadderPoint kH264Points[] = {
    {640.0 * 360.0, 1.0e6},     // YT-UP: 360p 24-30 fps SDR, 1 Mbps
    {854.0 * 480.0, 2.5e6},     // YT-UP: 480p 24-30 fps SDR, 2.5 Mbps
    {1280.0 * 720.0, 5.0e6},    // YT-UP: 720p 24-30 fps SDR, 5 Mbps
    {1920.0 * 1080.0, 8.0e6},   // YT-UP: 1080p 24-30 fps SDR, 8 Mbps
    {2560.0 * 1440.0, 16.0e6},  // YT-UP: 1440p 24-30 fps SDR, 16 Mbps
    {3840.0 * 2160.0, 40.0e6},  // YT-UP: 2160p 24-30 fps SDR, 35-45 Mbps (middle)
};
constexpr Ladder kH264Ladder{MakeTable(kH264Points), 30.0, kDoublingRateGrowth,
                             kLadderExtrapolation};

// ProRes targets at 29.97 fps, Mbps. ProRes rates are linear in frame rate (PRORES: 1080p HQ at
// 23.976 / 29.97 / 59.94 = 176 / 220 / 440) and, beyond the table, in pixel count (derived:
// HQ ~ 3.54 bit per pixel at 1080p and 2160p). The 720p row is published at 59.94 fps and
// halved here.
constexpr double kSdPixels = 720.0 * 486.0;
constexpr double k720Pixels = 1280.0 * 720.0;
constexpr double k1080Pixels = 1920.0 * 1080.0;
constexpr double k2160Pixels = 3840.0 * 2160.0;
constexpr double kProResRate = 29.97;

constexpr LadderPoint kProResProxyPoints[] = {
    {kSdPixels, 12.0e6},     // PRORES: 720x486 @ 29.97, Proxy 12
    {k720Pixels, 22.5e6},    // PRORES: 1280x720 @ 59.94, Proxy 45, halved
    {k1080Pixels, 45.0e6},   // PRORES: 1920x1080 @ 29.97, Proxy 45
    {k2160Pixels, 182.0e6},  // PRORES: 3840x2160 @ 29.97, Proxy 182
};
constexpr LadderPoint kProResLtPoints[] = {
    {kSdPixels, 29.0e6},     // PRORES: 720x486 @ 29.97, LT 29
    {k720Pixels, 50.5e6},    // PRORES: 1280x720 @ 59.94, LT 101, halved
    {k1080Pixels, 102.0e6},  // PRORES: 1920x1080 @ 29.97, LT 102
    {k2160Pixels, 410.0e6},  // PRORES: 3840x2160 @ 29.97, LT 410
};
constexpr LadderPoint kProRes422Points[] = {
    {kSdPixels, 42.0e6},     // PRORES: 720x486 @ 29.97, 422 42
    {k720Pixels, 73.5e6},    // PRORES: 1280x720 @ 59.94, 422 147, halved
    {k1080Pixels, 147.0e6},  // PRORES: 1920x1080 @ 29.97, 422 147
    {k2160Pixels, 589.0e6},  // PRORES: 3840x2160 @ 29.97, 422 589
};
constexpr LadderPoint kProResHqPoints[] = {
    {kSdPixels, 63.0e6},     // PRORES: 720x486 @ 29.97, HQ 63
    {k720Pixels, 110.0e6},   // PRORES: 1280x720 @ 59.94, HQ 220, halved
    {k1080Pixels, 220.0e6},  // PRORES: 1920x1080 @ 29.97, HQ 220
    {k2160Pixels, 884.0e6},  // PRORES: 3840x2160 @ 29.97, HQ 884
};
constexpr LadderPoint kProRes4444Points[] = {
    {kSdPixels, 94.0e6},      // PRORES: 720x486 @ 29.97, 4444 94
    {k720Pixels, 165.0e6},    // PRORES: 1280x720 @ 59.94, 4444 330, halved
    {k1080Pixels, 330.0e6},   // PRORES: 1920x1080 @ 29.97, 4444 330
    {k2160Pixels, 1326.0e6},  // PRORES: 3840x2160 @ 29.97, 4444 1326
};
constexpr LadderPoint kProRes4444XqPoints[] = {
    {kSdPixels, 141.0e6},     // PRORES: 720x486 @ 29.97, 4444 XQ 141
    {k720Pixels, 247.5e6},    // PRORES: 1280x720 @ 59.94, 4444 XQ 495, halved
    {k1080Pixels, 495.0e6},   // PRORES: 1920x1080 @ 29.97, 4444 XQ 495
    {k2160Pixels, 1989.0e6},  // PRORES: 3840x2160 @ 29.97, 4444 XQ 1989
};
constexpr Ladder kProResProxy{MakeTable(kProResProxyPoints), kProResRate, 1.0, 1.0};
constexpr Ladder kProResLt{MakeTable(kProResLtPoints), kProResRate, 1.0, 1.0};
constexpr Ladder kProRes422{MakeTable(kProRes422Points), kProResRate, 1.0, 1.0};
constexpr Ladder kProResHq{MakeTable(kProResHqPoints), kProResRate, 1.0, 1.0};
constexpr Ladder kProRes4444{MakeTable(kProRes4444Points), kProResRate, 1.0, 1.0};
constexpr Ladder kProRes4444Xq{MakeTable(kProRes4444XqPoints), kProResRate, 1.0, 1.0};

// PRORES-VBR: frames may undershoot the per-frame target and files run 5-10 % below it, so the
// target is the maximum and 90 % of it the minimum.
constexpr double kProResMinFactor = 0.9;

// DNxHD and DNxHR code every frame in a constant number of bytes, so bitrate = bytes x 8 x fps
// and, for other rasters, bytes scale with pixel count (DNXHR: HQ ~ 3.51 bit per pixel at 2K
// and UHD, derived). Each ladder is one point: bits per frame at the reference raster, at 1 fps.
constexpr double kDnxhd1080BytesLow = 188416.0;   // DNXHD: CID 1253, 1080p 8-bit (45 at 29.97)
constexpr double kDnxhd1080BytesMid = 606208.0;   // DNXHD: CID 1237, 1080p 8-bit (145 at 29.97)
constexpr double kDnxhd1080BytesHigh = 917504.0;  // DNXHD: CID 1235/1238, 1080p (220 at 29.97)
constexpr LadderPoint kDnxhdPoints[] = {{k1080Pixels, kDnxhd1080BytesMid * 8.0}};
constexpr LadderPoint kDnxhrLbPoints[] = {{k2160Pixels, 749568.0 * 8.0}};    // DNXHR: LB UHD
constexpr LadderPoint kDnxhrSqPoints[] = {{k2160Pixels, 2408448.0 * 8.0}};   // DNXHR: SQ UHD
constexpr LadderPoint kDnxhrHqPoints[] = {{k2160Pixels, 3641344.0 * 8.0}};   // DNXHR: HQ/HQX UHD
constexpr LadderPoint kDnxhr444Points[] = {{k2160Pixels, 7286784.0 * 8.0}};  // DNXHR: 444 UHD
constexpr Ladder kDnxhd{MakeTable(kDnxhdPoints), 1.0, 1.0, 1.0};
constexpr Ladder kDnxhrLb{MakeTable(kDnxhrLbPoints), 1.0, 1.0, 1.0};
constexpr Ladder kDnxhrSq{MakeTable(kDnxhrSqPoints), 1.0, 1.0, 1.0};
constexpr Ladder kDnxhrHq{MakeTable(kDnxhrHqPoints), 1.0, 1.0, 1.0};
constexpr Ladder kDnxhr444{MakeTable(kDnxhr444Points), 1.0, 1.0, 1.0};

// Codec efficiency against the H.264 ladder.
constexpr double kHevcFactor = 0.7;   // FF-265: 25-50 % below x264; HLS rungs 0.74-0.80
constexpr double kVp9Factor = 0.7;    // FF-VP9: 20-50 % below libx264
constexpr double kAv1Factor = 0.5;    // FF-AV1: ~50 % below H.264
constexpr double kMpeg2Factor = 2.0;  // NIST: AVC needs about half the MPEG-2 bitrate; BD
constexpr double kMpeg4Factor = 1.5;  // AVC-GOAL: H.264 half or less of MPEG-4 Part 2; between
                                      // H.264 and MPEG-2 (assumption, no direct figure)

constexpr double kMpeg1Factor = 2.0;   // VCD: 1150 kbit/s at 352x288/25 is 2.1x the ladder there
                                       // (derived), as MPEG-2 (NIST)
constexpr double kVp8Factor = 1.0;     // VP8 as H.264 (assumption: no comparable published figure)
constexpr double kTheoraFactor = 1.5;  // Theora as mpeg4 (assumption)
// Motion JPEG codes every frame alone, like the key frames of the other codecs, which run at
// several times a predicted frame's size: 10x the ladder (assumption, no published figure).
constexpr double kMjpegFactor = 10.0;

// Compressed lossless video, in bits per pixel of each frame at the reference frame rate 1 (a
// fixed share of the uncompressed frame, so linear in pixels and frame rate). FFV1 at half of
// 8-bit 4:2:0 (12 bit per pixel), PNG at half of RGB24 (24 bit per pixel); the range a quarter
// of uncompressed to uncompressed and more for deeper formats (assumption: lossless ratios
// depend on the picture; 2:1 is the usual figure).
constexpr LadderPoint kFfv1Points[] = {{k1080Pixels, k1080Pixels * 6.0}};
constexpr LadderPoint kPngPoints[] = {{k1080Pixels, k1080Pixels * 12.0}};
constexpr Ladder kFfv1{MakeTable(kFfv1Points), 1.0, 1.0, 1.0};
constexpr Ladder kPng{MakeTable(kPngPoints), 1.0, 1.0, 1.0};
constexpr double kLosslessVideoMinFactor = 0.25;
constexpr double kLosslessVideoMaxFactor = 4.0;

// Range around the default for the software codecs.
constexpr double kVbrMinFactor = 0.5;  // VP9-G: constrained quality, min rate 50 % of target
constexpr double kVbrMaxFactor = 2.0;  // HLS: VOD peak at most 200 % of the average

// Quality scales. The ladder figure is taken as the encoder's default quality.
// FF-264, VCODEX: +6 CRF halves the bitrate (SO-CRF measured about half per +5).
constexpr QualityScale kX264Crf{0, 51, 23.0, QualityRule::kHalvingSteps, 6.0};
constexpr QualityScale kX265Crf{0, 51, 28.0, QualityRule::kHalvingSteps, 6.0};  // FF-265
// FF-ENC, FF-VP9, FF-AV1: crf 0-63, 31 recommended for 1080p; no source gives a doubling step,
// 8 steps per halving is an assumption (6 steps of the 52-step x264 scale stretched to 64).
constexpr QualityScale kVpxAomCrf{0, 63, 31.0, QualityRule::kHalvingSteps, 8.0};
// MPL: QP ~ 12 + 6 log2(qscale), so the bitrate goes as 1 / qscale and qscale 4 ~ QP 24, next to
// x264's default CRF 23.
constexpr QualityScale kMpegQscale{1, 31, 4.0, QualityRule::kQuantiser, 0.0};

// H.264 levels, H264LV Table A-1: MaxFS and MaxMBPS in macroblocks, MaxBR in kbit/s for
// Baseline/Main; High profile allows 1.25x (Table A-2).
constexpr VideoLevel kH264LevelRows[] = {
    {"1", 99, 1485, 64},                // H264LV: level 1
    {"1b", 99, 1485, 128},              // H264LV: level 1b
    {"1.1", 396, 3000, 192},            // H264LV: level 1.1
    {"1.2", 396, 6000, 384},            // H264LV: level 1.2
    {"1.3", 396, 11880, 768},           // H264LV: level 1.3
    {"2", 396, 11880, 2000},            // H264LV: level 2
    {"2.1", 792, 19800, 4000},          // H264LV: level 2.1
    {"2.2", 1620, 20250, 4000},         // H264LV: level 2.2
    {"3", 1620, 40500, 10000},          // H264LV: level 3
    {"3.1", 3600, 108000, 14000},       // H264LV: level 3.1
    {"3.2", 5120, 216000, 20000},       // H264LV: level 3.2
    {"4", 8192, 245760, 20000},         // H264LV: level 4
    {"4.1", 8192, 245760, 50000},       // H264LV: level 4.1
    {"4.2", 8704, 522240, 50000},       // H264LV: level 4.2
    {"5", 22080, 589824, 135000},       // H264LV: level 5
    {"5.1", 36864, 983040, 240000},     // H264LV: level 5.1
    {"5.2", 36864, 2073600, 240000},    // H264LV: level 5.2
    {"6", 139264, 4177920, 240000},     // H264LV: level 6
    {"6.1", 139264, 8355840, 480000},   // H264LV: level 6.1
    {"6.2", 139264, 16711680, 800000},  // H264LV: level 6.2
};
constexpr LevelTable kH264Levels{MakeTable(kH264LevelRows), 16.0, 1.25};

// HEVC Main/Main 10 levels, H265LV: MaxLumaPs, MaxLumaSr in luma samples, MaxBR in kbit/s,
// High tier where the level has one (HLS streams use it), else Main tier.
constexpr VideoLevel kHevcLevelRows[] = {
    {"1", 36864, 552960, 128},              // H265LV: level 1, Main tier
    {"2", 122880, 3686400, 1500},           // H265LV: level 2, Main tier
    {"2.1", 245760, 7372800, 3000},         // H265LV: level 2.1, Main tier
    {"3", 552960, 16588800, 6000},          // H265LV: level 3, Main tier
    {"3.1", 983040, 33177600, 10000},       // H265LV: level 3.1, Main tier
    {"4", 2228224, 66846720, 30000},        // H265LV: level 4, High tier (Main 12000)
    {"4.1", 2228224, 133693440, 50000},     // H265LV: level 4.1, High tier (Main 20000)
    {"5", 8912896, 267386880, 100000},      // H265LV: level 5, High tier (Main 25000)
    {"5.1", 8912896, 534773760, 160000},    // H265LV: level 5.1, High tier (Main 40000)
    {"5.2", 8912896, 1069547520, 240000},   // H265LV: level 5.2, High tier (Main 60000)
    {"6", 35651584, 1069547520, 240000},    // H265LV: level 6, High tier (Main 60000)
    {"6.1", 35651584, 2139095040, 480000},  // H265LV: level 6.1, High tier (Main 120000)
    {"6.2", 35651584, 4278190080, 800000},  // H265LV: level 6.2, High tier (Main 240000)
};
constexpr LevelTable kHevcLevels{MakeTable(kHevcLevelRows), 1.0, 1.0};

// VP9 and AV1: only the top level is used; its ceiling bounds every stream of the codec. The
// per-level picture limits are not transcribed here.
constexpr VideoLevel kVp9LevelRows[] = {
    {"6.2", 0, 0, 480000},  // AOSP: VP9 level 6.2
};
constexpr LevelTable kVp9Levels{MakeTable(kVp9LevelRows), 1.0, 1.0};
constexpr VideoLevel kAv1LevelRows[] = {
    {"6.3", 0, 0, 160000},  // AOSP: AV1 Main tier levels 6.2-6.3
};
constexpr LevelTable kAv1Levels{MakeTable(kAv1LevelRows), 1.0, 1.0};

// MPEG-2 Main profile levels as rasters at a frame rate, in luma samples.
constexpr VideoLevel kMpeg2LevelRows[] = {
    {"LL", 352.0 * 288.0, 352.0 * 288.0 * 30.0, 4000},         // AOSP: LL 352x288
    {"ML", 720.0 * 576.0, 720.0 * 576.0 * 30.0, 15000},        // AOSP, MP2L: ML 720x576 30 fps
    {"H-14", 1440.0 * 1088.0, 1440.0 * 1088.0 * 60.0, 60000},  // AOSP: H-14 1440x1088 60 fps
    {"HL", 1920.0 * 1088.0, 1920.0 * 1088.0 * 60.0, 80000},    // AOSP, MP2L: HL 1920x1088 60 fps
};
constexpr LevelTable kMpeg2Levels{MakeTable(kMpeg2LevelRows), 1.0, 1.0};

// MPEG-4 Part 2 Simple profile levels with a stated raster. Levels 0-3 (QCIF/CIF, at most
// 384 kbit/s) are left out: their frame-rate limits are not modelled, and a picture-size match
// alone would hold ordinary small pictures to them.
constexpr VideoLevel kMpeg4LevelRows[] = {
    {"4a", 640.0 * 480.0, 0, 4000},   // AOSP: Simple L4a 640x480
    {"5", 720.0 * 576.0, 0, 8000},    // AOSP: Simple L5 720x576
    {"6", 1280.0 * 720.0, 0, 12000},  // AOSP: Simple L6 1280x720
};
constexpr LevelTable kMpeg4Levels{MakeTable(kMpeg4LevelRows), 1.0, 1.0};

// Sorted by identifier (FFmpeg codec names; ProRes and DNxHR flavours as FFmpeg's profile
// names). Columns: id, ladder, codec factor, quality scale, min and max factors, levels.
constexpr VideoCodec kVideoCodecRows[] = {
    {"av1", &kH264Ladder, kAv1Factor, &kVpxAomCrf, kVbrMinFactor, kVbrMaxFactor, &kAv1Levels},
    // DNXHD: the mid 1080p CID as default, the smallest and largest 1080p CIDs as the range.
    {"dnxhd", &kDnxhd, 1.0, nullptr, kDnxhd1080BytesLow / kDnxhd1080BytesMid,
     kDnxhd1080BytesHigh / kDnxhd1080BytesMid, nullptr},
    {"dnxhr_444", &kDnxhr444, 1.0, nullptr, 1.0, 1.0, nullptr},
    {"dnxhr_hq", &kDnxhrHq, 1.0, nullptr, 1.0, 1.0, nullptr},
    {"dnxhr_hqx", &kDnxhrHq, 1.0, nullptr, 1.0, 1.0, nullptr},  // DNXHR: same size as HQ
    {"dnxhr_lb", &kDnxhrLb, 1.0, nullptr, 1.0, 1.0, nullptr},
    {"dnxhr_sq", &kDnxhrSq, 1.0, nullptr, 1.0, 1.0, nullptr},
    {"ffv1", &kFfv1, 1.0, nullptr, kLosslessVideoMinFactor, kLosslessVideoMaxFactor, nullptr},
    {"h264", &kH264Ladder, 1.0, &kX264Crf, kVbrMinFactor, kVbrMaxFactor, &kH264Levels},
    {"hevc", &kH264Ladder, kHevcFactor, &kX265Crf, kVbrMinFactor, kVbrMaxFactor, &kHevcLevels},
    {"mjpeg", &kH264Ladder, kMjpegFactor, &kMpegQscale, kVbrMinFactor, kVbrMaxFactor, nullptr},
    {"mpeg1video", &kH264Ladder, kMpeg1Factor, &kMpegQscale, kVbrMinFactor, kVbrMaxFactor, nullptr},
    {"mpeg2video", &kH264Ladder, kMpeg2Factor, &kMpegQscale, kVbrMinFactor, kVbrMaxFactor,
     &kMpeg2Levels},
    {"mpeg4", &kH264Ladder, kMpeg4Factor, &kMpegQscale, kVbrMinFactor, kVbrMaxFactor,
     &kMpeg4Levels},
    {"png", &kPng, 1.0, nullptr, kLosslessVideoMinFactor, kLosslessVideoMaxFactor, nullptr},
    {"prores", &kProRes422, 1.0, nullptr, kProResMinFactor, 1.0, nullptr},  // ProRes 422
    {"prores_4444", &kProRes4444, 1.0, nullptr, kProResMinFactor, 1.0, nullptr},
    {"prores_4444xq", &kProRes4444Xq, 1.0, nullptr, kProResMinFactor, 1.0, nullptr},
    {"prores_hq", &kProResHq, 1.0, nullptr, kProResMinFactor, 1.0, nullptr},
    {"prores_lt", &kProResLt, 1.0, nullptr, kProResMinFactor, 1.0, nullptr},
    {"prores_proxy", &kProResProxy, 1.0, nullptr, kProResMinFactor, 1.0, nullptr},
    {"theora", &kH264Ladder, kTheoraFactor, nullptr, kVbrMinFactor, kVbrMaxFactor, nullptr},
    // libvpx's VP8 crf has the range of its VP9 one (FF-ENC); the same scale (assumption).
    {"vp8", &kH264Ladder, kVp8Factor, &kVpxAomCrf, kVbrMinFactor, kVbrMaxFactor, nullptr},
    {"vp9", &kH264Ladder, kVp9Factor, &kVpxAomCrf, kVbrMinFactor, kVbrMaxFactor, &kVp9Levels},
};

// ============================== Audio ==============================

// MPA: MPEG-1 Layer III bitrates (32, 44.1, 48 kHz), kbit/s.
constexpr int kMp3Mpeg1Kbps[] = {32, 40, 48, 56, 64, 80, 96, 112, 128, 160, 192, 224, 256, 320};
// MPA: MPEG-2 LSF / 2.5 Layer III bitrates (8-24 kHz), kbit/s.
constexpr int kMp3LsfKbps[] = {8, 16, 24, 32, 40, 48, 56, 64, 80, 96, 112, 128, 144, 160};
// AC3: the 19 AC-3 bitrates, kbit/s.
constexpr int kAc3Kbps[] = {32,  40,  48,  56,  64,  80,  96,  112, 128, 160,
                            192, 224, 256, 320, 384, 448, 512, 576, 640};

constexpr Table<int> kAnyBitrate{};

// MPA: MPEG-1 Layer II bitrates, kbit/s.
constexpr int kMp2Kbps[] = {32, 48, 56, 64, 80, 96, 112, 128, 160, 192, 224, 256, 320, 384};
// DTS: the core's nominal bitrates, kbit/s (1509.75 on CD and DVD is carried as 1536 here).
constexpr int kDtsKbps[] = {32,  56,  64,  96,  112, 128,  192,  224,  256,  320,  384,  448,
                            512, 576, 640, 768, 960, 1024, 1152, 1280, 1344, 1408, 1472, 1536};

constexpr ChannelAnchor kAacLcDefaults[] = {
    {2, 128000},  // FF-AAC: about 64 kbps a channel, 128 kbps stereo
};
constexpr LossyAudio kAacLc{
    // AAC-LC
    {1, 48},                    // channels: AOSP, at most 48
    {7350, 96000},              // rates: AOSP, 7350-96000 Hz
    MakeTable(kAacLcDefaults),  // default
    true,                       // full band: scales with the sample rate
    {0, 16000, 0},              // min: HLS, stereo AAC from 32 kbps
    {0, 0, 6.0},                // max: FDK-C, FF-AACENC, 6144 bits a channel per 1024 samples
    kAnyBitrate,                // bitrates
    nullptr,                    // low-rate variant
};

constexpr ChannelAnchor kAacHeDefaults[] = {
    {2, 64000},  // FDK-H: auto rate 60 kbps at 48 kHz stereo; HLS: HE-AAC up to 64 kbps
};
constexpr LossyAudio kAacHe{
    // HE-AAC v1
    {1, 48},                    // channels: AOSP, at most 48
    {22050, 96000},             // rates: SONNOX, HE from 22.05 kHz; AOSP, up to 96 kHz
    MakeTable(kAacHeDefaults),  // default
    false,                      // SBR codes the upper band: no scaling with the sample rate
    {0, 8000, 0},               // min: SONNOX, HE 16-128 kbps stereo
    {0, 64000, 0},              // max: SONNOX, HE 16-128 kbps stereo
    kAnyBitrate,                // bitrates
    nullptr,                    // low-rate variant
};

constexpr ChannelAnchor kAacHeV2Defaults[] = {
    {2, 32000},  // FDK-H: VBR mode 1, about 32 kbps stereo (HE-AAC v2)
};
constexpr LossyAudio kAacHeV2{
    // HE-AAC v2
    {2, 2},                       // channels: parametric stereo takes exactly two
    {22050, 48000},               // rates: SONNOX, HE-AAC v2 22.05-48 kHz
    MakeTable(kAacHeV2Defaults),  // default
    false,                        // SBR: no scaling with the sample rate
    {18000, 0, 0},                // min: SONNOX, HE-AAC v2 18-56 kbps
    {56000, 0, 0},                // max: SONNOX, HE-AAC v2 18-56 kbps
    kAnyBitrate,                  // bitrates
    nullptr,                      // low-rate variant
};

constexpr ChannelAnchor kMp3Defaults[] = {
    {2, 128000},  // LAME: 128 kbps CBR default; FF-MP3: V5 averages 130 kbps
};
constexpr LossyAudio kMp3Lsf{
    // MP3 at MPEG-2 and 2.5 sample rates
    {1, 2},                   // channels: AOSP, at most 2
    {8000, 24000},            // rates: MPA, MPEG-2 and 2.5
    MakeTable(kMp3Defaults),  // default
    true,                     // full band: scales with the sample rate
    {8000, 0, 0},             // min: MPA, LSF table from 8 kbps
    {160000, 0, 0},           // max: MPA, LSF table up to 160 kbps
    MakeTable(kMp3LsfKbps),   // bitrates
    nullptr,                  // low-rate variant
};
constexpr LowRateVariant kMp3LowRate{32000, &kMp3Lsf};  // MPA: LSF below 32 kHz
constexpr LossyAudio kMp3{
    // MP3 at MPEG-1 sample rates
    {1, 2},                    // channels: AOSP, at most 2
    {32000, 48000},            // rates: MPA, MPEG-1
    MakeTable(kMp3Defaults),   // default
    true,                      // full band: scales with the sample rate
    {32000, 0, 0},             // min: MPA, MPEG-1 table from 32 kbps
    {320000, 0, 0},            // max: MPA, AOSP, 320 kbps
    MakeTable(kMp3Mpeg1Kbps),  // bitrates
    &kMp3LowRate,              // low-rate variant
};

constexpr ChannelAnchor kVorbisDefaults[] = {
    {2, 112000},  // VORBIS: quality 3, 112 kbps at 44.1 kHz stereo
};
constexpr LossyAudio kVorbis{
    // Vorbis
    {1, 255},                    // channels: VORBIS, up to 255
    {8000, 192000},              // rates: AOSP, 8-192 kHz
    MakeTable(kVorbisDefaults),  // default
    true,                        // full band: scales with the sample rate
    {0, 22500, 0},               // min: VORBIS, quality -1, 45 kbps stereo
    {0, 250000, 0},              // max: VORBIS, quality 10, 500 kbps stereo
    kAnyBitrate,                 // bitrates
    nullptr,                     // low-rate variant
};

constexpr ChannelAnchor kAc3Defaults[] = {
    {2, 192000},  // DD: 192 kbps, the usual DVD stereo rate
    {6, 448000},  // FF-TGT, DD: 448 kbps 5.1 (DVD target)
};
constexpr LossyAudio kAc3{
    // AC-3
    {1, 6},                   // channels: AC3, DD, up to 5.1
    {32000, 48000},           // rates: AC3, 32, 44.1 and 48 kHz
    MakeTable(kAc3Defaults),  // default
    true,                     // full band: scales with the sample rate
    {32000, 0, 0},            // min: AC3, 32 kbps
    {640000, 0, 0},           // max: AC3, 640 kbps
    MakeTable(kAc3Kbps),      // bitrates
    nullptr,                  // low-rate variant
};

constexpr ChannelAnchor kEac3Defaults[] = {
    {2, 128000},  // HLS: E-AC-3 stereo 96-160 kbps (middle)
    {6, 192000},  // HLS: E-AC-3 5.1 192 kbps
    {8, 384000},  // HLS: E-AC-3 7.1 384 kbps
};
constexpr LossyAudio kEac3{
    // E-AC-3
    {1, 16},                   // channels: EAC3, up to 15 full-band channels and LFE
    {32000, 48000},            // rates: AC3, 32, 44.1 and 48 kHz
    MakeTable(kEac3Defaults),  // default
    true,                      // full band: scales with the sample rate
    {32000, 0, 0},             // min: EAC3, 32 kbps
    {6144000, 0, 0},           // max: EAC3, 6144 kbps
    kAnyBitrate,               // bitrates
    nullptr,                   // low-rate variant
};

constexpr ChannelAnchor kMp2Defaults[] = {
    {2, 224000},  // FF-TGT: 224 kbit/s stereo (SVCD target)
};
constexpr LossyAudio kMp2{
    // MPEG-1 Layer II
    {1, 2},                   // channels: MPA, mono to stereo
    {32000, 48000},           // rates: MPA, MPEG-1
    MakeTable(kMp2Defaults),  // default
    true,                     // full band: scales with the sample rate
    {32000, 0, 0},            // min: MPA, 32 kbit/s
    {384000, 0, 0},           // max: MPA, 384 kbit/s
    MakeTable(kMp2Kbps),      // bitrates
    nullptr,                  // low-rate variant
};

constexpr ChannelAnchor kDtsDefaults[] = {
    {6, 768000},  // DVD: DTS 5.1 at 754.5 kbit/s, nominally 768
};
constexpr LossyAudio kDts{
    // DTS Coherent Acoustics core
    {1, 6},                   // channels: DTS, up to 5.1
    {8000, 48000},            // rates: DTS, up to 48 kHz
    MakeTable(kDtsDefaults),  // default; fewer channels in proportion (assumption)
    true,                     // full band: scales with the sample rate
    {32000, 0, 0},            // min: DTS, 32 kbit/s
    {1536000, 0, 0},          // max: DTS, DVD, 1536 kbit/s
    MakeTable(kDtsKbps),      // bitrates
    nullptr,                  // low-rate variant
};

// RFC7845: streams and coupled streams of channel mapping family 1, which libopus uses for
// 1-8 channels. Above 8 channels every channel is its own uncoupled stream.
constexpr OpusLayout kOpusLayouts[] = {
    {1, 1, 0}, {2, 1, 1}, {3, 2, 1}, {4, 2, 2}, {5, 3, 2}, {6, 4, 2}, {7, 5, 2}, {8, 5, 3},
};
constexpr OpusFigures kOpus{
    // Opus
    MakeTable(kOpusLayouts),  // streams
    255,                      // channels: OPUS, up to 255
    8000,                     // lowest rate: OPUS, 8 kHz
    48000,                    // highest rate: OPUS, 48 kHz
    64000,                    // a stream: FF-OPUS, OPUSENC, 64 kbps
    32000,                    // more a coupled stream: FF-OPUS, OPUSENC, 96 kbps a pair
    6000,                     // min a stream: OPUS, 6 kbps
    510000,                   // max a stream: OPUS, 510 kbps
    256000,                   // max a channel: OPUSENC, FF-OPUS, 256 kbps
};

// FLAC: typically 50-60 % of PCM; ALAC: 40-60 %, measured CD tracks 39-64 % (derived). Default
// at the top of the typical range; maximum the PCM rate (incompressible input is stored
// verbatim); minimum below every published figure. Both store integer samples up to 32 bits.
constexpr LosslessAudio kFlac{0.3, 0.6, 1.0, 32};  // FLAC
constexpr LosslessAudio kAlac{0.3, 0.6, 1.0, 32};  // ALAC
// TRUEHD: lossless up to 24 bits, which decode into 32-bit samples; its compression taken as
// FLAC's (assumption).
constexpr LosslessAudio kTrueHd{0.3, 0.6, 1.0, 32};

constexpr AudioCodec Lossy(const char* id, const LossyAudio& figures) {
  return AudioCodec{id, AudioKind::kLossy, &figures, nullptr, 0};
}
constexpr AudioCodec Lossless(const char* id, const LosslessAudio& figures) {
  return AudioCodec{id, AudioKind::kLossless, nullptr, &figures, 0};
}
// FFmpeg's pcm_* identifiers name the stored sample size, which fixes the rate exactly.
constexpr AudioCodec Pcm(const char* id, int bits) {
  return AudioCodec{id, AudioKind::kPcm, nullptr, nullptr, bits};
}

// Sorted by identifier (FFmpeg codec names; HE-AAC as FFmpeg's AAC profile names).
constexpr AudioCodec kAudioCodecRows[] = {
    Lossy("aac", kAacLc),
    Lossy("aac_he", kAacHe),
    Lossy("aac_he_v2", kAacHeV2),
    Lossy("ac3", kAc3),
    Lossless("alac", kAlac),
    Lossy("dts", kDts),
    Lossy("eac3", kEac3),
    Lossless("flac", kFlac),
    Lossy("mp2", kMp2),
    Lossy("mp3", kMp3),
    AudioCodec{"opus", AudioKind::kOpus, nullptr, nullptr, 0},
    Pcm("pcm_alaw", 8),  // G.711 A-law: 64 kbps at 8 kHz (AOSP)
    Pcm("pcm_f32be", 32),
    Pcm("pcm_f32le", 32),
    Pcm("pcm_f64be", 64),
    Pcm("pcm_f64le", 64),
    Pcm("pcm_mulaw", 8),  // G.711 mu-law: 64 kbps at 8 kHz (AOSP)
    Pcm("pcm_s16be", 16),
    Pcm("pcm_s16be_planar", 16),
    Pcm("pcm_s16le", 16),
    Pcm("pcm_s16le_planar", 16),
    Pcm("pcm_s24be", 24),
    Pcm("pcm_s24le", 24),
    Pcm("pcm_s24le_planar", 24),
    Pcm("pcm_s32be", 32),
    Pcm("pcm_s32le", 32),
    Pcm("pcm_s32le_planar", 32),
    Pcm("pcm_s64be", 64),
    Pcm("pcm_s64le", 64),
    Pcm("pcm_s8", 8),
    Pcm("pcm_s8_planar", 8),
    Pcm("pcm_u16be", 16),
    Pcm("pcm_u16le", 16),
    Pcm("pcm_u24be", 24),
    Pcm("pcm_u24le", 24),
    Pcm("pcm_u32be", 32),
    Pcm("pcm_u32le", 32),
    Pcm("pcm_u8", 8),
    Lossless("truehd", kTrueHd),
    Lossy("vorbis", kVorbis),
};

// SFMT: bytes per sample of each format; planar formats store the same sample size.
constexpr SampleFormatInfo kSampleFormatRows[] = {
    {AV_SAMPLE_FMT_U8, "u8", 8, true},       {AV_SAMPLE_FMT_S16, "s16", 16, true},
    {AV_SAMPLE_FMT_S32, "s32", 32, true},    {AV_SAMPLE_FMT_FLT, "flt", 32, false},
    {AV_SAMPLE_FMT_DBL, "dbl", 64, false},   {AV_SAMPLE_FMT_U8P, "u8p", 8, true},
    {AV_SAMPLE_FMT_S16P, "s16p", 16, true},  {AV_SAMPLE_FMT_S32P, "s32p", 32, true},
    {AV_SAMPLE_FMT_FLTP, "fltp", 32, false}, {AV_SAMPLE_FMT_DBLP, "dblp", 64, false},
    {AV_SAMPLE_FMT_S64, "s64", 64, true},    {AV_SAMPLE_FMT_S64P, "s64p", 64, true},
};

// The look-ups search by binary search: the identifiers must be sorted and unique.
template <class Row, std::size_t N>
constexpr bool SortedById(const Row (&rows)[N]) {
  for (std::size_t i = 1; i < N; ++i) {
    const char* a = rows[i - 1].id;
    const char* b = rows[i].id;
    while (*a != '\0' && *a == *b) {
      ++a;
      ++b;
    }
    if (static_cast<unsigned char>(*a) >= static_cast<unsigned char>(*b)) return false;
  }
  return true;
}
static_assert(SortedById(kVideoCodecRows), "video codec rows must be sorted by id");
static_assert(SortedById(kAudioCodecRows), "audio codec rows must be sorted by id");

}  // namespace

Table<VideoCodec> VideoCodecs() { return MakeTable(kVideoCodecRows); }
Table<AudioCodec> AudioCodecs() { return MakeTable(kAudioCodecRows); }
const OpusFigures& Opus() { return kOpus; }
Table<SampleFormatInfo> SampleFormats() { return MakeTable(kSampleFormatRows); }

}  // namespace Presets
}  // namespace Conf
}  // namespace Tarvek
