// Readers of the codec configuration records that a stream's private data holds in MP4-style
// packaging: avcC (H.264), hvcC (HEVC), vpcC (VP9), av1C (AV1) and the MPEG-4 audio
// AudioSpecificConfig (AAC). Each reads only what the codec string and the caps need, stays
// within the bytes it is given and within the lengths the record declares for its own parts,
// and refuses a record that is truncated or whose lengths run past its end.
#ifndef TARVEK_CODECSTRING_RECORDS_H_
#define TARVEK_CODECSTRING_RECORDS_H_

#include <cstddef>
#include <cstdint>

#include <Tarvek/CodecString/Export.h>
#include <Tarvek/Core/Errors/ConfException.h>

namespace Tarvek {
namespace CodecString {

/// A record that cannot be read, or a description whose codec string cannot be made. Its
/// DescriptionInfo names the record or setting and what is wrong or missing, e.g.
/// "avcC: truncated: sequence parameter set 1 declares 40 bytes, 12 remain".
class TARVEK_VISIBLE_TYPE CodecStringError : public virtual Conf::ConfException {
 public:
  ~CodecStringError() noexcept override {}
};

/// The parts of an AVCDecoderConfigurationRecord that name the stream's profile and level.
struct AvcConfig {
  std::uint8_t profile = 0;        ///< AVCProfileIndication (profile_idc)
  std::uint8_t compatibility = 0;  ///< profile_compatibility (the constraint_set flags)
  std::uint8_t level = 0;          ///< AVCLevelIndication (level_idc)
  std::uint8_t nalLengthSize = 0;  ///< bytes of the length before each NAL unit: 1, 2 or 4
};

/// The profile, tier and level of an HEVCDecoderConfigurationRecord (or of a sequence
/// parameter set's profile_tier_level).
struct HevcConfig {
  std::uint8_t profileSpace = 0;
  bool highTier = false;
  std::uint8_t profile = 0;              ///< general_profile_idc
  std::uint32_t compatibilityFlags = 0;  ///< general_profile_compatibility_flags, flag 0 highest
  std::uint8_t constraintFlags[6] = {};  ///< the 48 constraint indicator flags, first byte first
  std::uint8_t level = 0;                ///< general_level_idc
};

/// A VPCodecConfigurationRecord (the payload of the vpcC box, version and flags first).
struct Vp9Config {
  std::uint8_t profile = 0;
  std::uint8_t level = 0;  ///< level times ten: 10 is level 1, 41 level 4.1
  std::uint8_t bitDepth = 0;
  std::uint8_t chromaSubsampling = 0;
  bool fullRange = false;
};

/// An AV1CodecConfigurationRecord.
struct Av1Config {
  std::uint8_t profile = 0;  ///< seq_profile
  std::uint8_t level = 0;    ///< seq_level_idx_0
  bool highTier = false;     ///< seq_tier_0
  std::uint8_t bitDepth = 0;
  bool monochrome = false;
  std::uint8_t chromaSubsamplingX = 0;
  std::uint8_t chromaSubsamplingY = 0;
  std::uint8_t chromaSamplePosition = 0;
};

/// An MPEG-4 AudioSpecificConfig.
struct AacConfig {
  int objectType = 0;  ///< audioObjectType as signalled first: 2 LC, 5 SBR, 29 PS, ...
  int sampleRate = 0;  ///< the signalled sampling frequency in Hz
  int channelConfiguration = 0;
};

/// @name Record readers
/// Each reads the record in `data[0, size)` and returns its parts. `data` may be null only when
/// `size` is 0. Throw CodecStringError naming the record and the part that is missing, too short
/// or of an unknown version; never read outside the given bytes.
TARVEK_CODEC_STRING_API AvcConfig ParseAvcConfig(const std::uint8_t* data, std::size_t size);
TARVEK_CODEC_STRING_API HevcConfig ParseHevcConfig(const std::uint8_t* data, std::size_t size);
TARVEK_CODEC_STRING_API Vp9Config ParseVp9Config(const std::uint8_t* data, std::size_t size);
TARVEK_CODEC_STRING_API Av1Config ParseAv1Config(const std::uint8_t* data, std::size_t size);
TARVEK_CODEC_STRING_API AacConfig ParseAacConfig(const std::uint8_t* data, std::size_t size);

/// @name Parameter sets in Annex B byte streams
/// Private data as an H.264 or HEVC encoder writes it without packaging: NAL units after start
/// codes. These read the profile and level from the first sequence parameter set. Throw
/// CodecStringError when there is none or it is too short.
TARVEK_CODEC_STRING_API AvcConfig ParseAvcByteStream(const std::uint8_t* data, std::size_t size);
TARVEK_CODEC_STRING_API HevcConfig ParseHevcByteStream(const std::uint8_t* data, std::size_t size);

/// Whether `data[0, size)` starts with an Annex B start code (00 00 01 or 00 00 00 01) rather
/// than a configuration record. Never throws.
TARVEK_CODEC_STRING_API bool IsByteStream(const std::uint8_t* data, std::size_t size) noexcept;

}  // namespace CodecString
}  // namespace Tarvek

#endif  // TARVEK_CODECSTRING_RECORDS_H_
