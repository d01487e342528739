// The Tarvek format description library in one include: the descriptions, their interfaces and
// keys, the errors, and the bitrate functions. The presets (<Tarvek/Presets/BitratePresets.h>)
// and the inspection functions (<Tarvek/Inspect/...>) come from their own headers.
//
//   #include <Tarvek/Formats.h>
//   auto codec = Tarvek::Conf::FormatCodec::Create();
//   codec->SetCodecID("h264");
//   codec->PrintContent();
#ifndef TARVEK_FORMATS_H_
#define TARVEK_FORMATS_H_

#include <Tarvek/Core/Errors/AddStack.h>
#include <Tarvek/Core/Errors/ConfException.h>
#include <Tarvek/Core/Errors/CoreException.h>
#include <Tarvek/Core/Errors/Exception.h>
#include <Tarvek/Core/Errors/PropertyException.h>
#include <Tarvek/Core/Interfaces/CallStack.h>
#include <Tarvek/Core/Interfaces/EscapedText.h>
#include <Tarvek/Core/Interfaces/IBlob.h>
#include <Tarvek/Core/Interfaces/IRefCountable.h>
#include <Tarvek/Core/Interfaces/Property.h>
#include <Tarvek/Core/Interfaces/PropertyTypes.h>
#include <Tarvek/Core/Interfaces/RefCountImpl.h>

#include <Tarvek/Conf/Interfaces/AVUtilTypes.h>
#include <Tarvek/Conf/Interfaces/ChannelLayout.h>
#include <Tarvek/Conf/Interfaces/IFormat.h>
#include <Tarvek/Conf/Interfaces/IFormatCodec.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecAudio.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecSubtitle.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecVideo.h>
#include <Tarvek/Conf/Interfaces/IFormatFile.h>
#include <Tarvek/Conf/Interfaces/Keys.h>

#include <Tarvek/Conf/Formats/BitrateCalculator.h>
#include <Tarvek/Conf/Formats/FormatBase.h>
#include <Tarvek/Conf/Formats/FormatCodec.h>
#include <Tarvek/Conf/Formats/FormatCodecAudio.h>
#include <Tarvek/Conf/Formats/FormatCodecSubtitle.h>
#include <Tarvek/Conf/Formats/FormatCodecVideo.h>

#endif  // TARVEK_FORMATS_H_
