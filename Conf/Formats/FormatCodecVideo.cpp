#include "FormatCodecVideo.h"

#include <cstdint>
#include <limits>
#include <numeric>

#include <Tarvek/MediaWrapper/Reduce.h>
#include "../Interfaces/Keys.h"

namespace Tarvek {
namespace Conf {
namespace {

// The low 32 bits of a stored value, as the unsigned accessors return them.
unsigned int LowBitsAsUnsigned(long long value) { return static_cast<unsigned int>(value); }

// Reduces (a x b) : (c x d) to lowest terms. The products are exact in 64 bits, so a large size
// times a large aspect term cannot wrap; a reduced term beyond 32 bits keeps its low 32 bits, the
// most the interface can return.
void ReduceProducts(unsigned int a, unsigned int b, unsigned int c, unsigned int d, unsigned int& x,
                    unsigned int& y) {
  std::uint64_t px = std::uint64_t{a} * b;
  std::uint64_t py = std::uint64_t{c} * d;
  constexpr auto kSignedMax = static_cast<std::uint64_t>(std::numeric_limits<long long>::max());
  if (px <= kSignedMax && py <= kSignedMax) {
    long long sx = static_cast<long long>(px);
    long long sy = static_cast<long long>(py);
    Media::reduce(sx, sy);
    px = static_cast<std::uint64_t>(sx);
    py = static_cast<std::uint64_t>(sy);
  } else {
    // Beyond the signed range of reduce (both factors near 2^32): divide out the common
    // divisor here. Not both products are 0 on this path, so the divisor is not 0.
    const std::uint64_t divisor = std::gcd(px, py);
    px /= divisor;
    py /= divisor;
  }
  x = static_cast<unsigned int>(px);
  y = static_cast<unsigned int>(py);
}

}  // namespace

boost::intrusive_ptr<IFormatCodecVideo> FormatCodecVideo::Create() {
  return boost::intrusive_ptr<IFormatCodecVideo>(new FormatCodecVideo());
}

FormatCodecVideo::FormatCodecVideo()
    : FormatBase(TAG_FORMAT_CODEC_VIDEO), FormatCodec(TAG_FORMAT_CODEC_VIDEO) {}

FormatCodecVideo::FormatCodecVideo(const FormatCodecVideo& source)
    : IRefCountable(),
      IFormat(),
      IFormatCodec(),
      IFormatCodecVideo(),
      FormatBase(TreesOf{source}),
      FormatCodec(TreesOf{source}) {}

FormatCodecVideo::~FormatCodecVideo() = default;

int FormatCodecVideo::GetCodecType() const { return 0; }

bool FormatCodecVideo::IsCompatible(boost::intrusive_ptr<const IFormat> other) const {
  // `other` holds a reference for the whole call, released on every way out.
  const auto* video = AsKind<IFormatCodecVideo, FormatCodecVideo>(other.get());
  if (video == nullptr) return false;
  return GetWidth() == video->GetWidth() && GetHeight() == video->GetHeight() &&
         GetPixelAspectX() == video->GetPixelAspectX() &&
         GetPixelAspectY() == video->GetPixelAspectY();
}

unsigned int FormatCodecVideo::GetWidth() const {
  return LowBitsAsUnsigned(property_[Keys::Width].GetInt64());
}
bool FormatCodecVideo::ExistsWidth() const { return property_.ChildExists(Keys::Width); }
void FormatCodecVideo::SetWidth(unsigned int width) {
  property_.SetChildT<long long>(TAG_WIDTH, width);
}

unsigned int FormatCodecVideo::GetHeight() const {
  return LowBitsAsUnsigned(property_[Keys::Height].GetInt64());
}
bool FormatCodecVideo::ExistsHeight() const { return property_.ChildExists(Keys::Height); }
void FormatCodecVideo::SetHeight(unsigned int height) {
  property_.SetChildT<long long>(TAG_HEIGHT, height);
}

unsigned int FormatCodecVideo::GetPixelAspectX() const {
  return LowBitsAsUnsigned(property_[Keys::AspectX].GetInt64());
}
bool FormatCodecVideo::ExistsPixelAspectX() const { return property_.ChildExists(Keys::AspectX); }
void FormatCodecVideo::SetPixelAspectX(unsigned int aspectX) {
  property_.SetChildT<long long>(TAG_ASPECTX, aspectX);
}

unsigned int FormatCodecVideo::GetPixelAspectY() const {
  return LowBitsAsUnsigned(property_[Keys::AspectY].GetInt64());
}
bool FormatCodecVideo::ExistsPixelAspectY() const { return property_.ChildExists(Keys::AspectY); }
void FormatCodecVideo::SetPixelAspectY(unsigned int aspectY) {
  property_.SetChildT<long long>(TAG_ASPECTY, aspectY);
}

void FormatCodecVideo::ReadFrameAspect(unsigned int& x, unsigned int& y) const {
  const unsigned int aspectX = GetPixelAspectX();
  const unsigned int width = GetWidth();
  const unsigned int aspectY = GetPixelAspectY();
  const unsigned int height = GetHeight();
  ReduceProducts(width, aspectX, height, aspectY, x, y);
}

unsigned int FormatCodecVideo::GetFrameAspectX() const {
  unsigned int x = 0;
  unsigned int y = 0;
  ReadFrameAspect(x, y);
  return x;
}

unsigned int FormatCodecVideo::GetFrameAspectY() const {
  unsigned int x = 0;
  unsigned int y = 0;
  ReadFrameAspect(x, y);
  return y;
}

double FormatCodecVideo::GetFrameAspect() const {
  return static_cast<double>(GetFrameAspectX()) / static_cast<double>(GetFrameAspectY());
}

unsigned int FormatCodecVideo::GetFrameRateNum() const {
  return LowBitsAsUnsigned(property_[Keys::TimebaseN].GetInt64());
}
bool FormatCodecVideo::ExistsFrameRateNum() const { return property_.ChildExists(Keys::TimebaseN); }
void FormatCodecVideo::SetFrameRateNum(unsigned int numerator) {
  property_.SetChildT<long long>(TAG_TIMEBASE_N, numerator);
}

unsigned int FormatCodecVideo::GetFrameRateDen() const {
  return LowBitsAsUnsigned(property_[Keys::TimebaseD].GetInt64());
}
bool FormatCodecVideo::ExistsFrameRateDen() const { return property_.ChildExists(Keys::TimebaseD); }
void FormatCodecVideo::SetFrameRateDen(unsigned int denominator) {
  property_.SetChildT<long long>(TAG_TIMEBASE_D, denominator);
}

double FormatCodecVideo::GetFrameRate() const {
  // Through the virtual accessors, so that a subclass sees every read: the denominator is read
  // for the zero test and again for the division.
  if (GetFrameRateDen() == 0) return 0.0;
  return static_cast<double>(GetFrameRateNum()) / static_cast<double>(GetFrameRateDen());
}

AVPixelFormat FormatCodecVideo::GetPixelFormat() const {
  return static_cast<AVPixelFormat>(static_cast<int>(property_[Keys::PixFmt].GetInt64()));
}
bool FormatCodecVideo::ExistsPixelFormat() const { return property_.ChildExists(Keys::PixFmt); }
void FormatCodecVideo::SetPixelFormat(AVPixelFormat format) {
  property_.SetChildT<long long>(TAG_PIX_FMT, static_cast<long long>(format));
}

void FormatCodecVideo::SetFrameRate(unsigned int numerator, unsigned int denominator) {
  SetFrameRateNum(numerator);
  SetFrameRateDen(denominator);
}

void FormatCodecVideo::InitByPixelAspect(unsigned int width, unsigned int height,
                                         unsigned int aspectX, unsigned int aspectY) {
  SetWidth(width);
  SetHeight(height);
  SetPixelAspectX(aspectX);
  SetPixelAspectY(aspectY);
}

void FormatCodecVideo::InitByFrameAspect(unsigned int width, unsigned int height,
                                         unsigned int frameAspectX, unsigned int frameAspectY) {
  unsigned int aspectX = 0;
  unsigned int aspectY = 0;
  ReduceProducts(frameAspectX, height, frameAspectY, width, aspectX, aspectY);
  InitByPixelAspect(width, height, aspectX, aspectY);
}

boost::intrusive_ptr<IFormatCodecVideo> FormatCodecVideo::Clone() const {
  return boost::intrusive_ptr<IFormatCodecVideo>(new FormatCodecVideo(*this));
}

}  // namespace Conf
}  // namespace Tarvek
