// The bitrate functions: the default, minimum and maximum bitrate, in bits per second, of a video
// or audio codec description, looked up in the presets library from the description's settings.
#ifndef TARVEK_CONF_FORMATS_BITRATECALCULATOR_H_
#define TARVEK_CONF_FORMATS_BITRATECALCULATOR_H_

#include <boost/cstdint.hpp>
#include <boost/intrusive_ptr.hpp>

#include "../../Core/Errors/ConfException.h"
#include "../Interfaces/IFormatCodec.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {

/// @name Video bitrates
/// Read the codec identifier, width, height and frame rate of a video description, and its
/// quality when the bitrate mode is exactly IFormatCodec::TAG_BITRATE_MODE_VBR (else -1 is
/// passed and the quality is not read); return the presets library's figure unchanged.
/// Throw ConfException ("Incompatible type of IFormatCodec structure") for an empty pointer or a
/// description that is not video; Core::ChildNotFound when a setting read is missing; the
/// presets library's errors (UnknownCodecError, InvalidPresetArgumentError) unchanged.
TARVEK_FORMATS_API boost::int64_t GetDefaultVideoBitrate(
    const boost::intrusive_ptr<const IFormatCodec>& codec);
TARVEK_FORMATS_API boost::int64_t GetMinVideoBitrate(
    const boost::intrusive_ptr<const IFormatCodec>& codec);
TARVEK_FORMATS_API boost::int64_t GetMaxVideoBitrate(
    const boost::intrusive_ptr<const IFormatCodec>& codec);

/// @name Audio bitrates
/// Read the codec identifier, sample rate, channel layout and sample format of an audio
/// description and return the presets library's figure unchanged. Throw ConfException for an
/// empty pointer or a description that is not audio, and pass other errors on as the video
/// functions do.
TARVEK_FORMATS_API boost::int64_t GetDefaultAudioBitrate(
    const boost::intrusive_ptr<const IFormatCodec>& codec);
TARVEK_FORMATS_API boost::int64_t GetMinAudioBitrate(
    const boost::intrusive_ptr<const IFormatCodec>& codec);
TARVEK_FORMATS_API boost::int64_t GetMaxAudioBitrate(
    const boost::intrusive_ptr<const IFormatCodec>& codec);

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_BITRATECALCULATOR_H_
