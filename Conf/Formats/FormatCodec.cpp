#include "FormatCodec.h"

#include <utility>
#include "../Interfaces/Keys.h"

namespace Tarvek {
namespace Conf {

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

std::string FormatCodec::GetCodecName() const { return property_[Keys::CodecName].GetString(); }
bool FormatCodec::ExistsCodecName() const { return property_.ChildExists(Keys::CodecName); }
void FormatCodec::SetCodecName(const std::string& name) {
  property_.SetChildT<std::string>(TAG_NAME, name);
}

std::string FormatCodec::GetCodecID() const { return property_[Keys::CodecId].GetString(); }
bool FormatCodec::ExistsCodecID() const { return property_.ChildExists(Keys::CodecId); }
void FormatCodec::SetCodecID(const std::string& id) {
  property_.SetChildT<std::string>(TAG_CODEC_ID, id);
}

long long FormatCodec::GetCodecTag() const { return property_[Keys::Fourcc].GetInt64(); }
bool FormatCodec::ExistsCodecTag() const { return property_.ChildExists(Keys::Fourcc); }
void FormatCodec::SetCodecTag(long long tag) { property_.SetChildT<long long>(TAG_FOURCC, tag); }

std::string FormatCodec::GetBitrateMode() const { return property_[Keys::BitrateMode].GetString(); }
bool FormatCodec::ExistsBitrateMode() const { return property_.ChildExists(Keys::BitrateMode); }
void FormatCodec::SetBitrateMode(const std::string& mode) {
  property_.SetChildT<std::string>(TAG_BITRATE_MODE, mode);
}

long long FormatCodec::GetBitrate() const { return property_[Keys::Bitrate].GetInt64(); }
bool FormatCodec::ExistsBitrate() const { return property_.ChildExists(Keys::Bitrate); }
void FormatCodec::SetBitrate(long long bitrate) {
  property_.SetChildT<long long>(TAG_BITRATE, bitrate);
}

long long FormatCodec::GetQuality() const { return property_[Keys::Quality].GetInt64(); }
bool FormatCodec::ExistsQuality() const { return property_.ChildExists(Keys::Quality); }
void FormatCodec::SetQuality(long long quality) {
  property_.SetChildT<long long>(TAG_QUALITY, quality);
}

bool FormatCodec::GetLossless() const { return property_[Keys::Lossless].GetBool(); }
bool FormatCodec::ExistsLossless() const { return property_.ChildExists(Keys::Lossless); }
void FormatCodec::SetLossless(bool lossless) { property_.SetChildT<bool>(TAG_LOSSLESS, lossless); }

unsigned int FormatCodec::GetThreadNumber() const {
  return static_cast<unsigned int>(property_[Keys::ThreadNumber].GetInt64());
}
bool FormatCodec::ExistsThreadNumber() const { return property_.ChildExists(Keys::ThreadNumber); }
void FormatCodec::SetThreadNumber(unsigned int threads) {
  // Zero extension: counts from 2^31 up are stored as the positive numbers they are.
  property_.SetChildT<long long>(TAG_THREAD_NUMBER, static_cast<long long>(threads));
}

bool FormatCodec::GetTwoPassEncoding() const { return property_[Keys::TwoPassEncoding].GetBool(); }
bool FormatCodec::ExistsTwoPassEncoding() const {
  return property_.ChildExists(Keys::TwoPassEncoding);
}
void FormatCodec::SetTwoPassEncoding(bool twoPass) {
  property_.SetChildT<bool>(TAG_TWO_PASS_ENCODING, twoPass);
}

bool FormatCodec::GetGlobalHeader() const { return property_[Keys::GlobalHeader].GetBool(); }
bool FormatCodec::ExistsGlobalHeader() const { return property_.ChildExists(Keys::GlobalHeader); }
void FormatCodec::SetGlobalHeader(bool globalHeader) {
  property_.SetChildT<bool>(TAG_GLOBAL_HEADER, globalHeader);
}

bool FormatCodec::GetMainStream() const { return property_[Keys::MainStream].GetBool(); }
bool FormatCodec::ExistsMainStream() const { return property_.ChildExists(Keys::MainStream); }
void FormatCodec::SetMainStream(bool mainStream) {
  property_.SetChildT<bool>(TAG_MAIN_STREAM, mainStream);
}

bool FormatCodec::ExistsOptionsEncode() const {
  return property_.ChildExists(Keys::CodecOptionsEncode);
}
bool FormatCodec::ExistsOptionsAnalyze() const {
  return property_.ChildExists(Keys::CodecOptionsAnalyze);
}
// SetChild assigns to the child, or appends a complete copy when SetProperty removed it, so a
// copy that fails leaves the tree as it was (no empty child appended first).
void FormatCodec::SetOptionsEncode(const Core::Property& options) {
  property_.SetChild(TAG_CODEC_OPTIONS_ENCODE, options);
}
const Core::Property& FormatCodec::GetOptionsEncode() const {
  return property_[Keys::CodecOptionsEncode];
}
void FormatCodec::SetOptionsAnalyze(const Core::Property& options) {
  property_.SetChild(TAG_CODEC_OPTIONS_ANALYZE, options);
}
const Core::Property& FormatCodec::GetOptionsAnalyze() const {
  return property_[Keys::CodecOptionsAnalyze];
}

boost::intrusive_ptr<IBlob> FormatCodec::GetPrivateData() { return private_data_; }

void FormatCodec::SetPrivateData(boost::intrusive_ptr<IBlob> data) {
  // Assignment references the new blob before it releases the old one, so handing in the blob
  // already held keeps it alive.
  private_data_ = std::move(data);
}

}  // namespace Conf
}  // namespace Tarvek
