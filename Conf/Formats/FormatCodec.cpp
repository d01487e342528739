#include "FormatCodec.h"

#include <utility>

namespace Tarvek {
namespace Conf {
namespace {

// The keys this description reads, hashed once when the library is loaded. The key texts
// come from the configuration interface library, which is loaded and initialised first.
const Core::PropertyKey kNameKey(IFormatCodec::TAG_NAME);
const Core::PropertyKey kCodecIdKey(IFormatCodec::TAG_CODEC_ID);
const Core::PropertyKey kFourccKey(IFormatCodec::TAG_FOURCC);
const Core::PropertyKey kBitrateModeKey(IFormatCodec::TAG_BITRATE_MODE);
const Core::PropertyKey kBitrateKey(IFormatCodec::TAG_BITRATE);
const Core::PropertyKey kQualityKey(IFormatCodec::TAG_QUALITY);
const Core::PropertyKey kLosslessKey(IFormatCodec::TAG_LOSSLESS);
const Core::PropertyKey kThreadNumberKey(IFormatCodec::TAG_THREAD_NUMBER);
const Core::PropertyKey kTwoPassEncodingKey(IFormatCodec::TAG_TWO_PASS_ENCODING);
const Core::PropertyKey kGlobalHeaderKey(IFormatCodec::TAG_GLOBAL_HEADER);
const Core::PropertyKey kMainStreamKey(IFormatCodec::TAG_MAIN_STREAM);
const Core::PropertyKey kCodecOptionsEncodeKey(IFormatCodec::TAG_CODEC_OPTIONS_ENCODE);
const Core::PropertyKey kCodecOptionsAnalyzeKey(IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE);

}  // namespace

boost::intrusive_ptr<IFormatCodec> FormatCodec::Create() {
  return boost::intrusive_ptr<IFormatCodec>(new FormatCodec(""));
}

FormatCodec::FormatCodec(const std::string& name) : FormatBase(name) {
  property_.SetChild(TAG_CODEC_OPTIONS_ENCODE);
  property_.SetChild(TAG_CODEC_OPTIONS_ANALYZE);
  SetCodecName("Unknown codec");
}

FormatCodec::FormatCodec(TreesOf trees) : FormatBase(trees) {}

FormatCodec::~FormatCodec() = default;

int FormatCodec::GetCodecType() const { return -1; }

std::string FormatCodec::GetCodecName() const { return property_[kNameKey].GetString(); }
bool FormatCodec::ExistsCodecName() const { return property_.ChildExists(kNameKey); }
void FormatCodec::SetCodecName(const std::string& name) {
  property_.SetChildT<std::string>(TAG_NAME, name);
}

std::string FormatCodec::GetCodecID() const { return property_[kCodecIdKey].GetString(); }
bool FormatCodec::ExistsCodecID() const { return property_.ChildExists(kCodecIdKey); }
void FormatCodec::SetCodecID(const std::string& id) {
  property_.SetChildT<std::string>(TAG_CODEC_ID, id);
}

long long FormatCodec::GetCodecTag() const { return property_[kFourccKey].GetInt64(); }
bool FormatCodec::ExistsCodecTag() const { return property_.ChildExists(kFourccKey); }
void FormatCodec::SetCodecTag(long long tag) { property_.SetChildT<long long>(TAG_FOURCC, tag); }

std::string FormatCodec::GetBitrateMode() const { return property_[kBitrateModeKey].GetString(); }
bool FormatCodec::ExistsBitrateMode() const { return property_.ChildExists(kBitrateModeKey); }
void FormatCodec::SetBitrateMode(const std::string& mode) {
  property_.SetChildT<std::string>(TAG_BITRATE_MODE, mode);
}

long long FormatCodec::GetBitrate() const { return property_[kBitrateKey].GetInt64(); }
bool FormatCodec::ExistsBitrate() const { return property_.ChildExists(kBitrateKey); }
void FormatCodec::SetBitrate(long long bitrate) {
  property_.SetChildT<long long>(TAG_BITRATE, bitrate);
}

long long FormatCodec::GetQuality() const { return property_[kQualityKey].GetInt64(); }
bool FormatCodec::ExistsQuality() const { return property_.ChildExists(kQualityKey); }
void FormatCodec::SetQuality(long long quality) {
  property_.SetChildT<long long>(TAG_QUALITY, quality);
}

bool FormatCodec::GetLossless() const { return property_[kLosslessKey].GetBool(); }
bool FormatCodec::ExistsLossless() const { return property_.ChildExists(kLosslessKey); }
void FormatCodec::SetLossless(bool lossless) { property_.SetChildT<bool>(TAG_LOSSLESS, lossless); }

unsigned int FormatCodec::GetThreadNumber() const {
  return static_cast<unsigned int>(property_[kThreadNumberKey].GetInt64());
}
bool FormatCodec::ExistsThreadNumber() const { return property_.ChildExists(kThreadNumberKey); }
void FormatCodec::SetThreadNumber(unsigned int threads) {
  // Zero extension: counts from 2^31 up are stored as the positive numbers they are.
  property_.SetChildT<long long>(TAG_THREAD_NUMBER, static_cast<long long>(threads));
}

bool FormatCodec::GetTwoPassEncoding() const { return property_[kTwoPassEncodingKey].GetBool(); }
bool FormatCodec::ExistsTwoPassEncoding() const {
  return property_.ChildExists(kTwoPassEncodingKey);
}
void FormatCodec::SetTwoPassEncoding(bool twoPass) {
  property_.SetChildT<bool>(TAG_TWO_PASS_ENCODING, twoPass);
}

bool FormatCodec::GetGlobalHeader() const { return property_[kGlobalHeaderKey].GetBool(); }
bool FormatCodec::ExistsGlobalHeader() const { return property_.ChildExists(kGlobalHeaderKey); }
void FormatCodec::SetGlobalHeader(bool globalHeader) {
  property_.SetChildT<bool>(TAG_GLOBAL_HEADER, globalHeader);
}

bool FormatCodec::GetMainStream() const { return property_[kMainStreamKey].GetBool(); }
bool FormatCodec::ExistsMainStream() const { return property_.ChildExists(kMainStreamKey); }
void FormatCodec::SetMainStream(bool mainStream) {
  property_.SetChildT<bool>(TAG_MAIN_STREAM, mainStream);
}

bool FormatCodec::ExistsOptionsEncode() const {
  return property_.ChildExists(kCodecOptionsEncodeKey);
}
bool FormatCodec::ExistsOptionsAnalyze() const {
  return property_.ChildExists(kCodecOptionsAnalyzeKey);
}
// SetChild assigns to the child, or appends a complete copy when SetProperty removed it, so a
// copy that fails leaves the tree as it was (no empty child appended first).
void FormatCodec::SetOptionsEncode(const Core::Property& options) {
  property_.SetChild(TAG_CODEC_OPTIONS_ENCODE, options);
}
const Core::Property& FormatCodec::GetOptionsEncode() const {
  return property_[kCodecOptionsEncodeKey];
}
void FormatCodec::SetOptionsAnalyze(const Core::Property& options) {
  property_.SetChild(TAG_CODEC_OPTIONS_ANALYZE, options);
}
const Core::Property& FormatCodec::GetOptionsAnalyze() const {
  return property_[kCodecOptionsAnalyzeKey];
}

boost::intrusive_ptr<IBlob> FormatCodec::GetPrivateData() { return private_data_; }

void FormatCodec::SetPrivateData(boost::intrusive_ptr<IBlob> data) {
  // Assignment references the new blob before it releases the old one, so handing in the blob
  // already held keeps it alive.
  private_data_ = std::move(data);
}

}  // namespace Conf
}  // namespace Tarvek
