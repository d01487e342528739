// Tarvek::Conf::FormatCodecVideo: the video codec description. Create one with
// FormatCodecVideo::Create(); its keys are those of IFormatCodecVideo.
#ifndef TARVEK_CONF_FORMATS_FORMATCODECVIDEO_H_
#define TARVEK_CONF_FORMATS_FORMATCODECVIDEO_H_

#include <boost/intrusive_ptr.hpp>

#include "../Interfaces/IFormatCodecVideo.h"
#include "FormatCodec.h"

namespace Tarvek {
namespace Conf {

/// A video codec description, named TAG_FORMAT_CODEC_VIDEO. It keeps no settings of its own:
/// size, pixel aspect, frame rate and pixel format are children of the property tree, and the
/// frame aspect and frame rate are derived from them on every read, through the virtual getters.
class TARVEK_FORMATS_API FormatCodecVideo : public virtual IFormatCodecVideo,
                                            public virtual FormatCodec {
 public:
  /// Returns a new video description holding the only reference. Throws std::bad_alloc.
  static boost::intrusive_ptr<IFormatCodecVideo> Create();

  FormatCodecVideo();
  /// A copy of `source`'s property tree and runtime entries, without its private data, with a
  /// reference count of its own starting at 0.
  FormatCodecVideo(const FormatCodecVideo& source);
  FormatCodecVideo& operator=(const FormatCodecVideo&) = delete;
  ~FormatCodecVideo() override;

  /// 0: video.
  int GetCodecType() const override;
  /// True when `other` is a video description with the same width, height and pixel aspect
  /// (read in that order, this description's value first); false for null or another kind.
  /// Throws Core::ChildNotFound when one of these settings is missing on either side.
  bool IsCompatible(boost::intrusive_ptr<const IFormat> other) const override;

  unsigned int GetWidth() const override;
  bool ExistsWidth() const override;
  unsigned int GetHeight() const override;
  bool ExistsHeight() const override;
  unsigned int GetPixelAspectX() const override;
  bool ExistsPixelAspectX() const override;
  unsigned int GetPixelAspectY() const override;
  bool ExistsPixelAspectY() const override;

  /// The frame aspect (width x pixel aspect X) : (height x pixel aspect Y), computed exactly in
  /// 64 bits and reduced; a term that still exceeds 32 bits keeps its low 32 bits. Reads pixel
  /// aspect X, width, pixel aspect Y and height, in that order, so the first of them missing is
  /// the one reported.
  unsigned int GetFrameAspectX() const override;
  unsigned int GetFrameAspectY() const override;
  /// GetFrameAspectX() / GetFrameAspectY() in double: infinity for x:0, NaN for 0:0.
  double GetFrameAspect() const override;

  unsigned int GetFrameRateNum() const override;
  bool ExistsFrameRateNum() const override;
  void SetFrameRateNum(unsigned int numerator) override;
  unsigned int GetFrameRateDen() const override;
  bool ExistsFrameRateDen() const override;
  void SetFrameRateDen(unsigned int denominator) override;
  /// Numerator / denominator; 0.0 when the denominator is 0 (the numerator is then not read).
  double GetFrameRate() const override;

  AVPixelFormat GetPixelFormat() const override;
  bool ExistsPixelFormat() const override;
  void SetPixelFormat(AVPixelFormat format) override;

  void SetFrameRate(unsigned int numerator, unsigned int denominator) override;
  void InitByPixelAspect(unsigned int width, unsigned int height, unsigned int aspectX,
                         unsigned int aspectY) override;
  /// The pixel aspect is (frameAspectX x height) : (frameAspectY x width), computed exactly in
  /// 64 bits and reduced, then handed to InitByPixelAspect.
  void InitByFrameAspect(unsigned int width, unsigned int height, unsigned int frameAspectX,
                         unsigned int frameAspectY) override;
  boost::intrusive_ptr<IFormatCodecVideo> Clone() const override;

  /// @name Setters of the geometry, not on the interface: callers of the interface set size and
  /// pixel aspect together through InitByPixelAspect or InitByFrameAspect.
  virtual void SetWidth(unsigned int width);
  virtual void SetHeight(unsigned int height);
  virtual void SetPixelAspectX(unsigned int aspectX);
  virtual void SetPixelAspectY(unsigned int aspectY);

 private:
  // Reads the four geometry settings in the documented order and reduces the frame aspect.
  void ReadFrameAspect(unsigned int& x, unsigned int& y) const;
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_FORMATS_FORMATCODECVIDEO_H_
