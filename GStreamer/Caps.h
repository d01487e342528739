// The bridge between descriptions and GStreamer caps: a description becomes fixed caps that
// GStreamer's parsers and decoders accept, and caps, or their text, become a description.
//
//   GstCaps* caps = Tarvek::GStreamer::ToCaps(video);   // video/x-h264, stream-format=avc, ...
//   auto back = Tarvek::GStreamer::FromCapsString("audio/x-raw, format=S16LE, ...");
//
// What maps: the codec identifier to the media type and the fields that tell codecs of one media
// type apart (one table, GetCapsMappings()); width, height, framerate and pixel-aspect-ratio
// (fractions); the pixel format to video/x-raw's format; rate, channels and channel-mask
// (GStreamer's channel positions) from the channel layout; raw sample formats to audio/x-raw's
// format and layout; the private data to codec_data, with the packaged stream-format (avc, hvc1,
// raw) when the codec has one and the private data is a configuration record rather than an
// Annex B byte stream. Settings without a place in caps (bitrates, options) are not written; caps
// fields without a place in the interfaces are kept under the description's metadata child as
// typed children (integers, booleans and strings as such, any other value as GStreamer's text).
// gst_init() must have been called before any of these functions.
#ifndef TARVEK_GSTREAMER_CAPS_H_
#define TARVEK_GSTREAMER_CAPS_H_

#include <gst/gst.h>

#include <boost/exception/error_info.hpp>
#include <boost/intrusive_ptr.hpp>
#include <cstddef>
#include <string>

#include <Tarvek/Conf/Interfaces/IFormatCodec.h>
#include <Tarvek/Core/Errors/ConfException.h>
#include <Tarvek/GStreamer/Export.h>

namespace Tarvek {
namespace GStreamer {

/// Caps or a description that cannot be converted. Its DescriptionInfo names the caps field or
/// the setting and what is wrong ("width: expected an integer, found a string",
/// "codec_data: avcC: truncated: ..."); its FieldInfo holds the field or setting name alone
/// ("" when the fault is the caps as a whole).
class TARVEK_VISIBLE_TYPE CapsError : public virtual Conf::ConfException {
 public:
  ~CapsError() noexcept override {}

  /// Tag of the caps field or description setting at fault.
  struct TagField;
  using FieldInfo = boost::error_info<TagField, std::string>;
};

/// The type of a distinguishing caps field's value.
enum class CapsFieldType { kNone, kString, kInt, kBoolean };

/// A caps field with a fixed value: `text` for a string, `number` for an integer or a boolean
/// (0 or 1). Unused fields of a row have the type kNone and a null name.
struct CapsField {
  const char* name;
  CapsFieldType type;
  const char* text;
  int number;
};

/// One row of the mapping table: a codec identifier of the descriptions and the caps that carry
/// it. Rows of one media type differ in their fields; caps match the row whose fields they all
/// hold, the row with the most fields when several do.
struct CapsMapping {
  const char* codecId;         ///< the description's codec identifier, e.g. "h264", "pcm_s16le"
  int codecType;               ///< 0 video, 1 audio, 3 subtitle (IFormatCodec::GetCodecType)
  const char* mediaType;       ///< e.g. "video/x-h264"
  CapsField fields[2];         ///< the distinguishing fields; unused ones have a null name
  const char* packagedFormat;  ///< stream-format with codec_data ("avc"), or null
  const char* bareFormat;      ///< stream-format without codec_data ("byte-stream"), or null
  const char* alignment;       ///< alignment, or null
};

/// The mapping table, in a fixed order; `count` receives its number of rows. Never throws.
TARVEK_GSTREAMER_API const CapsMapping* GetCapsMappings(std::size_t& count) noexcept;

/// The row of the table for `codecId` and `codecType`, or null. Never throws.
TARVEK_GSTREAMER_API const CapsMapping* FindCapsMapping(const std::string& codecId,
                                                        int codecType) noexcept;

/// Fixed caps for `description`, a video, audio or subtitle description with a codec
/// identifier of the table, or "rawvideo" with a pixel format GStreamer knows. The caller owns
/// the returned reference (gst_caps_unref). Throws CapsError naming the setting that is missing,
/// out of GStreamer's range or without a GStreamer counterpart, or the private data that does
/// not hold the record its codec needs; std::bad_alloc when memory runs out.
TARVEK_GSTREAMER_API GstCaps* ToCaps(const boost::intrusive_ptr<Conf::IFormatCodec>& description);

/// ToCaps as the text gst_caps_to_string() writes. Throws as ToCaps.
TARVEK_GSTREAMER_API std::string ToCapsString(
    const boost::intrusive_ptr<Conf::IFormatCodec>& description);

/// A new video, audio or subtitle description from `caps`, which must hold one fixed structure
/// of a media type of the table (or video/x-raw, audio/x-raw). Throws CapsError naming the field
/// that is not fixed, of the wrong type, out of range or unknown to the table, or a codec_data
/// that does not hold the record its stream-format declares; std::bad_alloc when memory runs
/// out. Nothing is built then.
TARVEK_GSTREAMER_API boost::intrusive_ptr<Conf::IFormatCodec> FromCaps(const GstCaps* caps);

/// FromCaps on the caps that gst_caps_from_string() reads from `text`. Throws as FromCaps, and
/// CapsError when the text is not caps.
TARVEK_GSTREAMER_API boost::intrusive_ptr<Conf::IFormatCodec> FromCapsString(
    const std::string& text);

}  // namespace GStreamer
}  // namespace Tarvek

#endif  // TARVEK_GSTREAMER_CAPS_H_
