#include "FormatCodec.h"

#include <utility>

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

std::string FormatCodec::GetCodecName() const { return property_[KeyOf<TAG_NAME>()].GetString(); }
bool FormatCodec::ExistsCodecName() const { return property_.ChildExists(KeyOf<TAG_NAME>()); }
void FormatCodec::SetCodecName(const std::string& name) {
  property_.SetChildT<std::string>(TAG_NAME, name);
}

std::string FormatCodec::GetCodecID() const { return property_[KeyOf<TAG_CODEC_ID>()].GetString(); }
bool FormatCodec::ExistsCodecID() const { return property_.ChildExists(KeyOf<TAG_CODEC_ID>()); }
void FormatCodec::SetCodecID(const std::string& id) {
  property_.SetChildT<std::string>(TAG_CODEC_ID, id);
}

long long FormatCodec::GetCodecTag() const { return property_[KeyOf<TAG_FOURCC>()].GetInt64(); }
bool FormatCodec::ExistsCodecTag() const { return property_.ChildExists(KeyOf<TAG_FOURCC>()); }
void FormatCodec::SetCodecTag(long long tag) { property_.SetChildT<long long>(TAG_FOURCC, tag); }

std::string FormatCodec::GetBitrateMode() const {
  return property_[KeyOf<TAG_BITRATE_MODE>()].GetString();
}
bool FormatCodec::ExistsBitrateMode() const {
  return property_.ChildExists(KeyOf<TAG_BITRATE_MODE>());
}
void FormatCodec::SetBitrateMode(const std::string& mode) {
  property_.SetChildT<std::string>(TAG_BITRATE_MODE, mode);
}

long long FormatCodec::GetBitrate() const { return property_[KeyOf<TAG_BITRATE>()].GetInt64(); }
bool FormatCodec::ExistsBitrate() const { return property_.ChildExists(KeyOf<TAG_BITRATE>()); }
void FormatCodec::SetBitrate(long long bitrate) {
  property_.SetChildT<long long>(TAG_BITRATE, bitrate);
}

long long FormatCodec::GetQuality() const { return property_[KeyOf<TAG_QUALITY>()].GetInt64(); }
bool FormatCodec::ExistsQuality() const { return property_.ChildExists(KeyOf<TAG_QUALITY>()); }
void FormatCodec::SetQuality(long long quality) {
  property_.SetChildT<long long>(TAG_QUALITY, quality);
}

bool FormatCodec::GetLossless() const { return property_[KeyOf<TAG_LOSSLESS>()].GetBool(); }
bool FormatCodec::ExistsLossless() const { return property_.ChildExists(KeyOf<TAG_LOSSLESS>()); }
void FormatCodec::SetLossless(bool lossless) { property_.SetChildT<bool>(TAG_LOSSLESS, lossless); }

unsigned int FormatCodec::GetThreadNumber() const {
  return static_cast<unsigned int>(property_[KeyOf<TAG_THREAD_NUMBER>()].GetInt64());
}
bool FormatCodec::ExistsThreadNumber() const {
  return property_.ChildExists(KeyOf<TAG_THREAD_NUMBER>());
}
void FormatCodec::SetThreadNumber(unsigned int threads) {
  // Zero extension: counts from 2^31 up are stored as the positive numbers they are.
  property_.SetChildT<long long>(TAG_THREAD_NUMBER, static_cast<long long>(threads));
}

bool FormatCodec::GetTwoPassEncoding() const {
  return property_[KeyOf<TAG_TWO_PASS_ENCODING>()].GetBool();
}
bool FormatCodec::ExistsTwoPassEncoding() const {
  return property_.ChildExists(KeyOf<TAG_TWO_PASS_ENCODING>());
}
void FormatCodec::SetTwoPassEncoding(bool twoPass) {
  property_.SetChildT<bool>(TAG_TWO_PASS_ENCODING, twoPass);
}

bool FormatCodec::GetGlobalHeader() const {
  return property_[KeyOf<TAG_GLOBAL_HEADER>()].GetBool();
}
bool FormatCodec::ExistsGlobalHeader() const {
  return property_.ChildExists(KeyOf<TAG_GLOBAL_HEADER>());
}
void FormatCodec::SetGlobalHeader(bool globalHeader) {
  property_.SetChildT<bool>(TAG_GLOBAL_HEADER, globalHeader);
}

bool FormatCodec::GetMainStream() const { return property_[KeyOf<TAG_MAIN_STREAM>()].GetBool(); }
bool FormatCodec::ExistsMainStream() const {
  return property_.ChildExists(KeyOf<TAG_MAIN_STREAM>());
}
void FormatCodec::SetMainStream(bool mainStream) {
  property_.SetChildT<bool>(TAG_MAIN_STREAM, mainStream);
}

bool FormatCodec::ExistsOptionsEncode() const {
  return property_.ChildExists(KeyOf<TAG_CODEC_OPTIONS_ENCODE>());
}
bool FormatCodec::ExistsOptionsAnalyze() const {
  return property_.ChildExists(KeyOf<TAG_CODEC_OPTIONS_ANALYZE>());
}
// SetChild assigns to the child, or appends a complete copy when SetProperty removed it, so a
// copy that fails leaves the tree as it was (no empty child appended first).
void FormatCodec::SetOptionsEncode(const Core::Property& options) {
  property_.SetChild(TAG_CODEC_OPTIONS_ENCODE, options);
}
const Core::Property& FormatCodec::GetOptionsEncode() const {
  return property_[KeyOf<TAG_CODEC_OPTIONS_ENCODE>()];
}
void FormatCodec::SetOptionsAnalyze(const Core::Property& options) {
  property_.SetChild(TAG_CODEC_OPTIONS_ANALYZE, options);
}
const Core::Property& FormatCodec::GetOptionsAnalyze() const {
  return property_[KeyOf<TAG_CODEC_OPTIONS_ANALYZE>()];
}

boost::intrusive_ptr<IBlob> FormatCodec::GetPrivateData() { return private_data_; }

void FormatCodec::SetPrivateData(boost::intrusive_ptr<IBlob> data) {
  // Assignment references the new blob before it releases the old one, so handing in the blob
  // already held keeps it alive.
  private_data_ = std::move(data);
}

}  // namespace Conf
}  // namespace Tarvek
