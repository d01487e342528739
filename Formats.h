// The Tarvek format description library: every public header in one include.
//
//   #include <Tarvek/Formats.h>
//   auto codec = Tarvek::Conf::FormatCodec::Create();
//   codec->SetCodecID("h264");
//   codec->PrintContent();
#ifndef TARVEK_FORMATS_H_
#define TARVEK_FORMATS_H_

#include "Core/Errors/AddStack.h"
#include "Core/Errors/ConfException.h"
#include "Core/Errors/CoreException.h"
#include "Core/Errors/Exception.h"
#include "Core/Errors/PropertyException.h"
#include "Core/Interfaces/CallStack.h"
#include "Core/Interfaces/Export.h"
#include "Core/Interfaces/IBlob.h"
#include "Core/Interfaces/IRefCountable.h"
#include "Core/Interfaces/Property.h"
#include "Core/Interfaces/PropertyTypes.h"
#include "Core/Interfaces/RefCountImpl.h"

#include "Conf/Interfaces/AVUtilTypes.h"
#include "Conf/Interfaces/ChannelLayout.h"
#include "Conf/Interfaces/IFormat.h"
#include "Conf/Interfaces/IFormatCodec.h"
#include "Conf/Interfaces/IFormatCodecAudio.h"
#include "Conf/Interfaces/IFormatCodecSubtitle.h"
#include "Conf/Interfaces/IFormatCodecVideo.h"
#include "Conf/Interfaces/IFormatFile.h"

#include "Conf/Formats/BitrateCalculator.h"
#include "Conf/Formats/Diff.h"
#include "Conf/Formats/FormatBase.h"
#include "Conf/Formats/FormatCodec.h"
#include "Conf/Formats/FormatCodecAudio.h"
#include "Conf/Formats/FormatCodecSubtitle.h"
#include "Conf/Formats/FormatCodecVideo.h"
#include "Conf/Formats/JsonForm.h"
#include "Conf/Formats/Validate.h"

#include <Tarvek/Presets/BitratePresets.h>

#endif  // TARVEK_FORMATS_H_
