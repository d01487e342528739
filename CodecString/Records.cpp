#include <Tarvek/CodecString/Records.h>

#include <Tarvek/Core/Errors/AddStack.h>

#include <boost/current_function.hpp>
#include <string>
#include <vector>

namespace Tarvek {
namespace CodecString {
namespace {

[[noreturn]] void Fail(const std::string& what) {
  ThrowWithLocation(__LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
                    AddStack(CodecStringError() << DescriptionInfo(what)));
}

// Bytes of one record, read front to back; every read is checked against what remains. Parts are
// named by static texts (and an index for repeated parts), so reading allocates nothing.
class ByteReader {
 public:
  ByteReader(const char* record, const std::uint8_t* data, std::size_t size)
      : record_(record), data_(data), size_(data ? size : 0) {}

  std::uint8_t U8(const char* part) {
    Need(1, part);
    return data_[pos_++];
  }
  std::uint16_t U16(const char* part, unsigned index = 0) {
    Need(2, part, index);
    const auto value = static_cast<std::uint16_t>(data_[pos_] << 8 | data_[pos_ + 1]);
    pos_ += 2;
    return value;
  }
  std::uint32_t U32(const char* part) {
    const std::uint32_t high = U16(part);
    return high << 16 | U16(part);
  }
  // Skips `count` bytes that the record declared for part `index` of `part` (or, with index 0,
  // `count` bytes of fixed fields).
  void Skip(std::size_t count, const char* part, unsigned index = 0, bool declared = false) {
    Need(count, part, index, declared);
    pos_ += count;
  }

 private:
  void Need(std::size_t count, const char* part, unsigned index = 0, bool declared = false) const {
    if (count <= size_ - pos_) return;
    std::string name = part;
    if (index) name += " " + std::to_string(index);
    if (declared) name += " (declared " + std::to_string(count) + " bytes)";
    Fail(std::string(record_) + ": truncated: " + name + " needs " + std::to_string(count) +
         " byte" + (count == 1 ? "" : "s") + " at offset " + std::to_string(pos_) + ", " +
         std::to_string(size_ - pos_) + " remain");
  }

  const char* record_;
  const std::uint8_t* data_;
  std::size_t size_;
  std::size_t pos_ = 0;
};

// Bits of one record, most significant first.
class BitReader {
 public:
  BitReader(const char* record, const std::uint8_t* data, std::size_t size)
      : record_(record), data_(data), bits_(data ? size * 8 : 0) {}

  unsigned Bits(unsigned count, const char* part) {
    if (count > bits_ - pos_)
      Fail(std::string(record_) + ": truncated: " + part + " needs " + std::to_string(count) +
           " bits at bit " + std::to_string(pos_) + ", " + std::to_string(bits_ - pos_) +
           " remain");
    unsigned value = 0;
    for (unsigned i = 0; i < count; ++i, ++pos_)
      value = value << 1 | ((data_[pos_ / 8] >> (7 - pos_ % 8)) & 1u);
    return value;
  }

 private:
  const char* record_;
  const std::uint8_t* data_;
  std::size_t bits_;
  std::size_t pos_ = 0;
};

// Every array of parameter sets of an avcC or hvcC record must lie within the record. `length`
// names the length field of one, `kind` the unit.
void CheckUnits(ByteReader& reader, unsigned count, const char* length, const char* kind) {
  for (unsigned i = 0; i < count; ++i) reader.Skip(reader.U16(length, i + 1), kind, i + 1, true);
}

int AacSampleRate(unsigned index, BitReader& bits) {
  static constexpr int kRates[] = {96000, 88200, 64000, 48000, 44100, 32000, 24000,
                                   22050, 16000, 12000, 11025, 8000,  7350};
  if (index == 15) return static_cast<int>(bits.Bits(24, "samplingFrequency"));
  if (index >= sizeof(kRates) / sizeof(kRates[0]))
    Fail("AudioSpecificConfig: samplingFrequencyIndex " + std::to_string(index) + " is reserved");
  return kRates[index];
}

unsigned AacObjectType(BitReader& bits) {
  const unsigned type = bits.Bits(5, "audioObjectType");
  return type == 31 ? 32 + bits.Bits(6, "audioObjectTypeExt") : type;
}

// The payload of the first NAL unit of `type` in an Annex B byte stream, with the emulation
// prevention bytes removed, at most `limit` bytes of it; `typeOf` reads a unit's type from its
// first byte.
template <class TypeOf>
std::vector<std::uint8_t> FindUnit(const std::uint8_t* data, std::size_t size, unsigned type,
                                   TypeOf typeOf, std::size_t limit) {
  std::vector<std::uint8_t> payload;
  if (!data) return payload;
  for (std::size_t i = 0; i + 3 <= size; ++i) {
    if (data[i] != 0 || data[i + 1] != 0 || data[i + 2] != 1) continue;
    const std::size_t start = i + 3;
    if (start >= size || typeOf(data[start]) != type) continue;
    int zeros = 0;
    for (std::size_t j = start; j < size && payload.size() < limit; ++j) {
      if (zeros >= 2 && data[j] == 3) {
        zeros = 0;
        continue;
      }
      if (zeros >= 2 && data[j] <= 2) break;  // the next start code
      zeros = data[j] == 0 ? zeros + 1 : 0;
      payload.push_back(data[j]);
    }
    return payload;
  }
  return payload;
}

// general_profile_space .. general_level_idc: 12 bytes, as in hvcC and in profile_tier_level.
HevcConfig ReadProfileTierLevel(ByteReader& reader) {
  HevcConfig config;
  const std::uint8_t first = reader.U8("general_profile_idc");
  config.profileSpace = static_cast<std::uint8_t>(first >> 6);
  config.highTier = (first >> 5 & 1) != 0;
  config.profile = static_cast<std::uint8_t>(first & 0x1f);
  config.compatibilityFlags = reader.U32("general_profile_compatibility_flags");
  for (auto& flags : config.constraintFlags)
    flags = reader.U8("general_constraint_indicator_flags");
  config.level = reader.U8("general_level_idc");
  return config;
}

}  // namespace

bool IsByteStream(const std::uint8_t* data, std::size_t size) noexcept {
  if (!data) return false;
  if (size >= 3 && data[0] == 0 && data[1] == 0 && data[2] == 1) return true;
  return size >= 4 && data[0] == 0 && data[1] == 0 && data[2] == 0 && data[3] == 1;
}

AvcConfig ParseAvcConfig(const std::uint8_t* data, std::size_t size) {
  ByteReader reader("avcC", data, size);
  const std::uint8_t version = reader.U8("configurationVersion");
  if (version != 1)
    Fail("avcC: configurationVersion " + std::to_string(version) + " is not known (expected 1)");
  AvcConfig config;
  config.profile = reader.U8("AVCProfileIndication");
  config.compatibility = reader.U8("profile_compatibility");
  config.level = reader.U8("AVCLevelIndication");
  const unsigned lengthSize = (reader.U8("lengthSizeMinusOne") & 3u) + 1;
  if (lengthSize == 3) Fail("avcC: lengthSizeMinusOne 2 is not allowed");
  config.nalLengthSize = static_cast<std::uint8_t>(lengthSize);
  CheckUnits(reader, reader.U8("numOfSequenceParameterSets") & 0x1fu, "sequenceParameterSetLength",
             "sequence parameter set");
  CheckUnits(reader, reader.U8("numOfPictureParameterSets"), "pictureParameterSetLength",
             "picture parameter set");
  return config;
}

HevcConfig ParseHevcConfig(const std::uint8_t* data, std::size_t size) {
  ByteReader reader("hvcC", data, size);
  const std::uint8_t version = reader.U8("configurationVersion");
  if (version != 1)
    Fail("hvcC: configurationVersion " + std::to_string(version) + " is not known (expected 1)");
  const HevcConfig config = ReadProfileTierLevel(reader);
  reader.Skip(9, "the fields from min_spatial_segmentation_idc to lengthSizeMinusOne");
  const unsigned arrays = reader.U8("numOfArrays");
  for (unsigned i = 0; i < arrays; ++i) {
    reader.U8("NAL_unit_type");
    CheckUnits(reader, reader.U16("numNalus"), "nalUnitLength", "NAL unit");
  }
  return config;
}

Vp9Config ParseVp9Config(const std::uint8_t* data, std::size_t size) {
  ByteReader reader("vpcC", data, size);
  const std::uint8_t version = reader.U8("version");
  if (version != 1) Fail("vpcC: version " + std::to_string(version) + " is not known (expected 1)");
  reader.Skip(3, "flags");
  Vp9Config config;
  config.profile = reader.U8("profile");
  config.level = reader.U8("level");
  const std::uint8_t packed = reader.U8("bitDepth");
  config.bitDepth = static_cast<std::uint8_t>(packed >> 4);
  config.chromaSubsampling = static_cast<std::uint8_t>(packed >> 1 & 7);
  config.fullRange = (packed & 1) != 0;
  reader.Skip(3, "colourPrimaries to matrixCoefficients");
  const std::uint16_t initSize = reader.U16("codecIntializationDataSize");
  reader.Skip(initSize, "codecIntializationData", 0, true);
  if (config.bitDepth != 8 && config.bitDepth != 10 && config.bitDepth != 12)
    Fail("vpcC: bitDepth " + std::to_string(config.bitDepth) + " is not 8, 10 or 12");
  return config;
}

Av1Config ParseAv1Config(const std::uint8_t* data, std::size_t size) {
  ByteReader reader("av1C", data, size);
  const std::uint8_t first = reader.U8("marker and version");
  if (first != 0x81)
    Fail("av1C: marker and version byte is " + std::to_string(first) + " (expected 129)");
  Av1Config config;
  const std::uint8_t second = reader.U8("seq_profile");
  config.profile = static_cast<std::uint8_t>(second >> 5);
  config.level = static_cast<std::uint8_t>(second & 0x1f);
  const std::uint8_t third = reader.U8("seq_tier_0");
  config.highTier = (third & 0x80) != 0;
  const bool highBitdepth = (third & 0x40) != 0;
  const bool twelveBit = (third & 0x20) != 0;
  config.bitDepth = static_cast<std::uint8_t>(highBitdepth ? (twelveBit ? 12 : 10) : 8);
  config.monochrome = (third & 0x10) != 0;
  config.chromaSubsamplingX = static_cast<std::uint8_t>(third >> 3 & 1);
  config.chromaSubsamplingY = static_cast<std::uint8_t>(third >> 2 & 1);
  config.chromaSamplePosition = static_cast<std::uint8_t>(third & 3);
  reader.U8("initial_presentation_delay");
  if (twelveBit && config.profile != 2)
    Fail("av1C: twelve_bit is set in profile " + std::to_string(config.profile));
  return config;
}

AacConfig ParseAacConfig(const std::uint8_t* data, std::size_t size) {
  BitReader bits("AudioSpecificConfig", data, size);
  AacConfig config;
  config.objectType = static_cast<int>(AacObjectType(bits));
  config.sampleRate = AacSampleRate(bits.Bits(4, "samplingFrequencyIndex"), bits);
  config.channelConfiguration = static_cast<int>(bits.Bits(4, "channelConfiguration"));
  if (config.objectType == 0) Fail("AudioSpecificConfig: audioObjectType 0 is not allowed");
  if (config.objectType == 5 || config.objectType == 29) {
    AacSampleRate(bits.Bits(4, "extensionSamplingFrequencyIndex"), bits);
    AacObjectType(bits);
  }
  return config;
}

AvcConfig ParseAvcByteStream(const std::uint8_t* data, std::size_t size) {
  const auto sps = FindUnit(
      data, size, 7, [](std::uint8_t header) { return header & 0x1fu; }, 4);
  if (sps.empty()) Fail("H.264 byte stream: no sequence parameter set");
  ByteReader reader("H.264 sequence parameter set", sps.data(), sps.size());
  reader.U8("NAL unit header");
  AvcConfig config;
  config.profile = reader.U8("profile_idc");
  config.compatibility = reader.U8("constraint_set flags");
  config.level = reader.U8("level_idc");
  config.nalLengthSize = 4;
  return config;
}

HevcConfig ParseHevcByteStream(const std::uint8_t* data, std::size_t size) {
  const auto sps = FindUnit(
      data, size, 33, [](std::uint8_t header) { return header >> 1 & 0x3fu; }, 15);
  if (sps.empty()) Fail("HEVC byte stream: no sequence parameter set");
  ByteReader reader("HEVC sequence parameter set", sps.data(), sps.size());
  reader.Skip(3, "NAL unit header and sps_max_sub_layers_minus1");
  return ReadProfileTierLevel(reader);
}

}  // namespace CodecString
}  // namespace Tarvek
