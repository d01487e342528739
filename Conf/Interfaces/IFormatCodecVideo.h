// Tarvek::Conf::IFormatCodecVideo: the description of a video codec configuration, and its keys.
// Created by FormatCodecVideo::Create().
#ifndef TARVEK_CONF_INTERFACES_IFORMATCODECVIDEO_H_
#define TARVEK_CONF_INTERFACES_IFORMATCODECVIDEO_H_

#include <boost/intrusive_ptr.hpp>
#include <string>

#include "AVUtilTypes.h"
#include "IFormatCodec.h"

namespace Tarvek {
namespace Conf {

/// A video codec description: frame size, pixel aspect, frame rate and pixel format on top of the
/// shared codec settings, with the frame aspect and frame rate derived from them. Accessors
/// behave as IFormatCodec describes: Get throws for a missing setting, so test Exists first.
/// Width, height and pixel aspect are set together, through InitByPixelAspect or
/// InitByFrameAspect.
class TARVEK_VISIBLE_TYPE IFormatCodecVideo : public virtual IFormatCodec {
 public:
  ~IFormatCodecVideo() override {}

  TARVEK_CONF_INTERFACES_API static const std::string TAG_WIDTH;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_HEIGHT;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_ASPECTX;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_ASPECTY;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_TIMEBASE_N;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_TIMEBASE_D;
  TARVEK_CONF_INTERFACES_API static const std::string TAG_PIX_FMT;
  /// The object name of every video description (not a child key).
  TARVEK_CONF_INTERFACES_API static const std::string TAG_FORMAT_CODEC_VIDEO;

  /// @name Frame size in pixels (TAG_WIDTH, TAG_HEIGHT).
  virtual unsigned int GetWidth() const = 0;
  virtual bool ExistsWidth() const = 0;
  virtual unsigned int GetHeight() const = 0;
  virtual bool ExistsHeight() const = 0;

  /// @name Pixel aspect: the shape of one pixel, X over Y (TAG_ASPECTX, TAG_ASPECTY); 1:1 for
  /// square pixels.
  virtual unsigned int GetPixelAspectX() const = 0;
  virtual bool ExistsPixelAspectX() const = 0;
  virtual unsigned int GetPixelAspectY() const = 0;
  virtual bool ExistsPixelAspectY() const = 0;

  /// @name Frame (display) aspect, derived from size and pixel aspect on every call and reduced
  /// to lowest terms; GetFrameAspect() is X / Y in double precision.
  virtual unsigned int GetFrameAspectX() const = 0;
  virtual unsigned int GetFrameAspectY() const = 0;
  virtual double GetFrameAspect() const = 0;

  /// @name Frame rate as frames per second = Num / Den (TAG_TIMEBASE_N, TAG_TIMEBASE_D);
  /// GetFrameRate() is 0.0 when the denominator is 0.
  virtual unsigned int GetFrameRateNum() const = 0;
  virtual bool ExistsFrameRateNum() const = 0;
  virtual void SetFrameRateNum(unsigned int numerator) = 0;
  virtual unsigned int GetFrameRateDen() const = 0;
  virtual bool ExistsFrameRateDen() const = 0;
  virtual void SetFrameRateDen(unsigned int denominator) = 0;
  virtual double GetFrameRate() const = 0;

  /// @name Pixel format (TAG_PIX_FMT), libavutil's AVPixelFormat, stored sign-extended.
  virtual AVPixelFormat GetPixelFormat() const = 0;
  virtual bool ExistsPixelFormat() const = 0;
  virtual void SetPixelFormat(AVPixelFormat format) = 0;

  /// Sets the frame rate numerator, then the denominator.
  virtual void SetFrameRate(unsigned int numerator, unsigned int denominator) = 0;
  /// Sets width, height and pixel aspect, in that order.
  virtual void InitByPixelAspect(unsigned int width, unsigned int height, unsigned int aspectX,
                                 unsigned int aspectY) = 0;
  /// Sets width and height and the pixel aspect that gives the frame aspect
  /// frameAspectX:frameAspectY at that size (720x576 at 16:9 gives pixel aspect 64:45).
  virtual void InitByFrameAspect(unsigned int width, unsigned int height, unsigned int frameAspectX,
                                 unsigned int frameAspectY) = 0;
  /// Returns an independent copy holding the only reference; the private data is not copied.
  virtual boost::intrusive_ptr<IFormatCodecVideo> Clone() const = 0;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_INTERFACES_IFORMATCODECVIDEO_H_
