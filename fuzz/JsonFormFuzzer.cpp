// libFuzzer target over the JSON form: FromJson refuses a text with a JsonFormError or gives a
// description whose JSON form reads back to the same description, and is stable.
#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/JsonForm.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {

[[noreturn]] void Broken(const char* what) {
  std::fprintf(stderr, "JsonFormFuzzer: %s\n", what);
  std::abort();
}

bool SameBytes(const boost::intrusive_ptr<Tarvek::IBlob>& a,
               const boost::intrusive_ptr<Tarvek::IBlob>& b) {
  if (!a || !b) return !a && !b;
  return a->GetSize() == b->GetSize() &&
         (a->GetSize() == 0 || std::memcmp(a->GetData(), b->GetData(), a->GetSize()) == 0);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  boost::intrusive_ptr<Tarvek::Conf::IFormatCodec> description;
  try {
    description = Tarvek::Conf::FromJson(text);
  } catch (const Tarvek::Conf::JsonFormError&) {
    return 0;  // refused, as documented
  }
  if (!description) Broken("FromJson returned null without an error");
  const std::string form = Tarvek::Conf::ToJson(description);
  const auto again = Tarvek::Conf::FromJson(form);
  if (!again->Compare(description)) Broken("the round trip changed the property tree");
  if (again->GetCodecType() != description->GetCodecType()) Broken("the round trip changed kind");
  if (again->GetInternalProperties() != description->GetInternalProperties() ||
      !SameBytes(again->GetPrivateData(), description->GetPrivateData())) {
    Broken("the round trip changed the runtime entries or the private data");
  }
  if (Tarvek::Conf::ToJson(again) != form) Broken("the JSON form is not stable");
  if (description->GetRefCount() != 1 || again->GetRefCount() != 1) Broken("a reference left");
  return 0;
}
