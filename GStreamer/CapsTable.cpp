// The one table between codec identifiers and GStreamer media types. ToCaps writes a row's
// media type and fields, FromCaps finds the row whose fields the caps hold, and the tool lists it.
#include <Tarvek/GStreamer/Caps.h>

#include <cstring>

namespace Tarvek {
namespace GStreamer {
namespace {

constexpr int kVideo = 0;
constexpr int kAudio = 1;
constexpr int kSubtitle = 3;

constexpr CapsField kNoField{nullptr, CapsFieldType::kNone, nullptr, 0};

constexpr CapsField Text(const char* name, const char* value) {
  return CapsField{name, CapsFieldType::kString, value, 0};
}
constexpr CapsField Int(const char* name, int value) {
  return CapsField{name, CapsFieldType::kInt, nullptr, value};
}
constexpr CapsField Bool(const char* name, bool value) {
  return CapsField{name, CapsFieldType::kBoolean, nullptr, value ? 1 : 0};
}

constexpr CapsMapping Plain(const char* codecId, int codecType, const char* mediaType,
                            CapsField first = kNoField, CapsField second = kNoField) {
  return CapsMapping{codecId, codecType, mediaType, {first, second}, nullptr, nullptr, nullptr};
}

constexpr CapsMapping Pcm(const char* codecId, const char* format, bool planar = false) {
  return Plain(codecId, kAudio, "audio/x-raw", Text("format", format),
               Text("layout", planar ? "non-interleaved" : "interleaved"));
}

constexpr CapsMapping Prores(const char* codecId, const char* variant) {
  return Plain(codecId, kVideo, "video/x-prores", Text("variant", variant));
}

// Where one set of caps fits several identifiers (dnxhd and the DNxHR flavours, the AAC
// profiles), the first row is the one caps read back as; codec_data refines the AAC profile.
constexpr CapsMapping kRows[] = {
    // Video.
    {"h264", kVideo, "video/x-h264", {kNoField, kNoField}, "avc", "byte-stream", "au"},
    {"hevc", kVideo, "video/x-h265", {kNoField, kNoField}, "hvc1", "byte-stream", "au"},
    Plain("vp9", kVideo, "video/x-vp9"),
    {"av1", kVideo, "video/x-av1", {kNoField, kNoField}, "obu-stream", "obu-stream", "tu"},
    Plain("mpeg2video", kVideo, "video/mpeg", Int("mpegversion", 2), Bool("systemstream", false)),
    Plain("mpeg4", kVideo, "video/mpeg", Int("mpegversion", 4), Bool("systemstream", false)),
    Prores("prores", "standard"),
    Prores("prores_proxy", "proxy"),
    Prores("prores_lt", "lt"),
    Prores("prores_hq", "hq"),
    Prores("prores_4444", "4444"),
    Prores("prores_4444xq", "4444xq"),
    Plain("dnxhd", kVideo, "video/x-dnxhd"),
    Plain("dnxhr_lb", kVideo, "video/x-dnxhd"),
    Plain("dnxhr_sq", kVideo, "video/x-dnxhd"),
    Plain("dnxhr_hq", kVideo, "video/x-dnxhd"),
    Plain("dnxhr_hqx", kVideo, "video/x-dnxhd"),
    Plain("dnxhr_444", kVideo, "video/x-dnxhd"),
    Plain("rawvideo", kVideo, "video/x-raw"),
    // Audio.
    {"aac", kAudio, "audio/mpeg", {Int("mpegversion", 4), kNoField}, "raw", "adts", nullptr},
    {"aac_he", kAudio, "audio/mpeg", {Int("mpegversion", 4), kNoField}, "raw", "adts", nullptr},
    {"aac_he_v2", kAudio, "audio/mpeg", {Int("mpegversion", 4), kNoField}, "raw", "adts", nullptr},
    Plain("mp3", kAudio, "audio/mpeg", Int("mpegversion", 1), Int("layer", 3)),
    Plain("ac3", kAudio, "audio/x-ac3"),
    Plain("eac3", kAudio, "audio/x-eac3"),
    Plain("alac", kAudio, "audio/x-alac"),
    Plain("flac", kAudio, "audio/x-flac"),
    Plain("opus", kAudio, "audio/x-opus"),
    Plain("vorbis", kAudio, "audio/x-vorbis"),
    Plain("pcm_alaw", kAudio, "audio/x-alaw"),
    Plain("pcm_mulaw", kAudio, "audio/x-mulaw"),
    Pcm("pcm_f32be", "F32BE"),
    Pcm("pcm_f32le", "F32LE"),
    Pcm("pcm_f64be", "F64BE"),
    Pcm("pcm_f64le", "F64LE"),
    Pcm("pcm_s16be", "S16BE"),
    Pcm("pcm_s16be_planar", "S16BE", true),
    Pcm("pcm_s16le", "S16LE"),
    Pcm("pcm_s16le_planar", "S16LE", true),
    Pcm("pcm_s24be", "S24BE"),
    Pcm("pcm_s24le", "S24LE"),
    Pcm("pcm_s24le_planar", "S24LE", true),
    Pcm("pcm_s32be", "S32BE"),
    Pcm("pcm_s32le", "S32LE"),
    Pcm("pcm_s32le_planar", "S32LE", true),
    Pcm("pcm_s8", "S8"),
    Pcm("pcm_s8_planar", "S8", true),
    Pcm("pcm_u16be", "U16BE"),
    Pcm("pcm_u16le", "U16LE"),
    Pcm("pcm_u24be", "U24BE"),
    Pcm("pcm_u24le", "U24LE"),
    Pcm("pcm_u32be", "U32BE"),
    Pcm("pcm_u32le", "U32LE"),
    Pcm("pcm_u8", "U8"),
    // Subtitles.
    Plain("ass", kSubtitle, "application/x-ass"),
    Plain("ssa", kSubtitle, "application/x-ssa"),
    Plain("subrip", kSubtitle, "application/x-subtitle"),
    Plain("webvtt", kSubtitle, "application/x-subtitle-vtt"),
    Plain("text", kSubtitle, "text/x-raw", Text("format", "utf8")),
    Plain("dvd_subtitle", kSubtitle, "subpicture/x-dvd"),
    Plain("dvb_subtitle", kSubtitle, "subpicture/x-dvb"),
    Plain("hdmv_pgs_subtitle", kSubtitle, "subpicture/x-pgs"),
};

}  // namespace

const CapsMapping* GetCapsMappings(std::size_t& count) noexcept {
  count = sizeof(kRows) / sizeof(kRows[0]);
  return kRows;
}

const CapsMapping* FindCapsMapping(const std::string& codecId, int codecType) noexcept {
  for (const CapsMapping& row : kRows)
    if (row.codecType == codecType && codecId == row.codecId) return &row;
  return nullptr;
}

}  // namespace GStreamer
}  // namespace Tarvek
