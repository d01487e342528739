// Builds a generic codec description, fills a few settings and prints it.
#include <Tarvek/Formats.h>

#include <exception>
#include <iostream>

#include <boost/exception/diagnostic_information.hpp>

int main() {
  try {
    using Tarvek::Conf::IFormatCodec;
    boost::intrusive_ptr<IFormatCodec> codec = Tarvek::Conf::FormatCodec::Create();
    codec->SetCodecName("H.264 / AVC");
    codec->SetCodecID("h264");
    codec->SetBitrateMode(IFormatCodec::TAG_BITRATE_MODE_VBR);
    codec->SetQuality(23);
    codec->SetThreadNumber(4);
    codec->SetGlobalHeader(true);

    Tarvek::Core::Property options("options");
    options.SetChildT<std::string>("preset", "medium");
    options.SetChildT<std::string>("tune", "film");
    codec->SetOptionsEncode(options);

    codec->PrintContent();
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "describe_codec: " << boost::diagnostic_information(e) << '\n';
    return 1;
  }
}
