// Streaming codec strings: the `codecs` parameter of RFC 6381 that HLS playlists, DASH manifests
// and MediaSource.isTypeSupported() take, made from a description's private data and settings.
//
//   std::string codecs = Tarvek::CodecString::GetCodecString(video);  // "avc1.640028"
#ifndef TARVEK_CODECSTRING_CODECSTRING_H_
#define TARVEK_CODECSTRING_CODECSTRING_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include <Tarvek/CodecString/Export.h>
#include <Tarvek/CodecString/Records.h>
#include <Tarvek/Conf/Interfaces/IFormatCodec.h>

namespace Tarvek {
namespace CodecString {

/// The codec string of `description`, by its codec identifier:
/// - h264 "avc1.PPCCLL" and hevc "hvc1.P.C.TL.F" (ISO/IEC 14496-15) from the avcC or hvcC record
///   in the private data, or from the sequence parameter set when the private data is an Annex B
///   byte stream; the sample entry is the codec tag when that is avc3 or hev1, else avc1 or hvc1;
/// - vp9 "vp09.PP.LL.DD" from a vpcC record, or else from the pixel format (profile and bit
///   depth), the size and the frame rate (level);
/// - av1 "av01.P.LLT.DD" from the av1C record;
/// - aac "mp4a.40.N" with N the audio object type of the AudioSpecificConfig, or, without private
///   data, 2, 5 or 29 for aac, aac_he and aac_he_v2;
/// - mp3 "mp4a.6B" (or "mp4a.69" below 32 kHz), mpeg4 "mp4v.20[.PL]", mpeg2video "mp4v.61",
///   opus "opus", flac "fLaC", ac3 "ac-3", eac3 "ec-3", alac "alac", vorbis "vorbis", the ProRes
///   and DNx sample entries ("apch", "AVdn", ...), webvtt "wvtt", mov_text "tx3g".
/// Throws CodecStringError naming what is missing (no codec identifier, a codec without a codec
/// string, private data without the record the string needs, a setting the string needs) or the
/// record's fault; std::bad_alloc when memory runs out.
TARVEK_CODEC_STRING_API std::string GetCodecString(
    const boost::intrusive_ptr<Conf::IFormatCodec>& description);

}  // namespace CodecString
}  // namespace Tarvek

#endif  // TARVEK_CODECSTRING_CODECSTRING_H_
