#include "JsonForm.h"

#include <boost/current_function.hpp>
#include <boost/property_tree/ptree.hpp>
#include <cstdint>
#include <limits>
#include <nlohmann/json.hpp>
#include <unordered_set>
#include <utility>
#include <vector>

#include "../Conf/Formats/FormatCodec.h"
#include "../Conf/Formats/FormatCodecAudio.h"
#include "../Conf/Formats/FormatCodecSubtitle.h"
#include "../Conf/Formats/FormatCodecVideo.h"
#include "../Conf/Interfaces/IFormatCodecAudio.h"
#include "../Conf/Interfaces/IFormatCodecSubtitle.h"
#include "../Conf/Interfaces/IFormatCodecVideo.h"
#include "../Core/Errors/AddStack.h"
#include "JsonLayout.h"
#include "Settings.h"

namespace Tarvek {
namespace Conf {
namespace {

// Ordered, so that members are written in the order the format lists them.
using Json = nlohmann::ordered_json;
using Entries = boost::property_tree::ptree;

constexpr const char* kFormatName = "tarvek-description";
// A node at level L of the tree (or of the runtime entries) sits 2L deep in the document, its
// "children" array one deeper; nothing deeper than that is needed.
constexpr int kMaxNesting = 2 * kJsonFormMaxDepth + 1;

// ----- Errors -------------------------------------------------------------------------------

// `pointer` is where in the document ("" for the whole of it), `what` the fault.
[[noreturn]] void Fail(const std::string& pointer, const std::string& what) {
  ThrowWithLocation(
      __LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
      AddStack(JsonFormError() << DescriptionInfo((pointer.empty() ? "the document" : pointer) +
                                                  ": " + what)
                               << JsonFormError::JsonPointerInfo(pointer)));
}

// A fault with no place in a parsed document: the text itself, or the description written.
[[noreturn]] void FailPlain(const std::string& what) {
  ThrowWithLocation(__LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
                    AddStack(JsonFormError() << DescriptionInfo(what)));
}

// A text as a JSON string literal, for messages.
std::string Quote(const std::string& text) {
  return Json(text).dump(-1, ' ', false, Json::error_handler_t::replace);
}

// What a JSON value is, in the words of a message: "a string", "the number 1.5".
std::string Found(const Json& value) {
  switch (value.type()) {
    case Json::value_t::null:
      return "null";
    case Json::value_t::boolean:
      return value.get<bool>() ? "true" : "false";
    case Json::value_t::string:
      return "a string";
    case Json::value_t::array:
      return "an array";
    case Json::value_t::object:
      return "an object";
    default:
      return "the number " + value.dump();
  }
}

// RFC 6901: '~' and '/' in a member name are escaped as "~0" and "~1".
std::string Token(const std::string& name) {
  std::string token;
  for (const char c : name) {
    if (c == '~') {
      token += "~0";
    } else if (c == '/') {
      token += "~1";
    } else {
      token += c;
    }
  }
  return token;
}

// ----- Text encodings -----------------------------------------------------------------------

constexpr char kBase64[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

std::string EncodeBase64(const std::uint8_t* data, std::size_t size) {
  std::string text;
  text.reserve((size + 2) / 3 * 4);
  for (std::size_t i = 0; i < size; i += 3) {
    const std::uint32_t group = (std::uint32_t{data[i]} << 16) |
                                (i + 1 < size ? std::uint32_t{data[i + 1]} << 8 : 0u) |
                                (i + 2 < size ? std::uint32_t{data[i + 2]} : 0u);
    text += kBase64[(group >> 18) & 63];
    text += kBase64[(group >> 12) & 63];
    text += i + 1 < size ? kBase64[(group >> 6) & 63] : '=';
    text += i + 2 < size ? kBase64[group & 63] : '=';
  }
  return text;
}

std::string EncodeBase64(const std::string& bytes) {
  return EncodeBase64(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
}

int Base64Value(char c) {
  if (c >= 'A' && c <= 'Z') return c - 'A';
  if (c >= 'a' && c <= 'z') return c - 'a' + 26;
  if (c >= '0' && c <= '9') return c - '0' + 52;
  if (c == '+') return 62;
  if (c == '/') return 63;
  return -1;
}

// Strict RFC 4648 base64: padded to a multiple of 4, '=' only as the last one or two
// characters, no other characters, and no stray bits in the last group, so that every byte
// string has exactly one text.
std::string DecodeBase64(const std::string& text, const std::string& pointer) {
  if (text.size() % 4 != 0) {
    Fail(pointer,
         "invalid base64: its length, " + std::to_string(text.size()) + ", is not a multiple of 4");
  }
  std::size_t padding = 0;
  if (!text.empty() && text.back() == '=') padding = text[text.size() - 2] == '=' ? 2 : 1;
  std::string bytes;
  bytes.reserve(text.size() / 4 * 3);
  std::uint32_t group = 0;
  for (std::size_t i = 0; i < text.size() - padding; ++i) {
    const int value = Base64Value(text[i]);
    if (value < 0) {
      const auto byte = static_cast<unsigned char>(text[i]);
      const std::string shown = byte >= 0x20 && byte < 0x7f ? "'" + std::string(1, text[i]) + "'"
                                                            : "byte " + std::to_string(byte);
      Fail(pointer, "invalid base64: character " + std::to_string(i + 1) + ", " + shown +
                        ", is not in the base64 alphabet");
    }
    group = (group << 6) | static_cast<std::uint32_t>(value);
    if (i % 4 == 3) {
      bytes += static_cast<char>((group >> 16) & 0xff);
      bytes += static_cast<char>((group >> 8) & 0xff);
      bytes += static_cast<char>(group & 0xff);
      group = 0;
    }
  }
  if (padding == 2) {
    if ((group & 0xf) != 0) Fail(pointer, "invalid base64: stray bits before the padding");
    bytes += static_cast<char>((group >> 4) & 0xff);
  } else if (padding == 1) {
    if ((group & 0x3) != 0) Fail(pointer, "invalid base64: stray bits before the padding");
    bytes += static_cast<char>((group >> 10) & 0xff);
    bytes += static_cast<char>((group >> 2) & 0xff);
  }
  return bytes;
}

// Well-formed UTF-8 (Unicode table 3-7): what a JSON string may hold, and what the JSON library
// accepts when it writes one.
bool IsUtf8(const std::string& text) {
  const auto* s = reinterpret_cast<const unsigned char*>(text.data());
  const std::size_t n = text.size();
  for (std::size_t i = 0; i < n;) {
    const unsigned char c = s[i];
    std::size_t length = 0;
    unsigned char low = 0x80;
    unsigned char high = 0xbf;
    if (c < 0x80) {
      ++i;
      continue;
    } else if (c >= 0xc2 && c <= 0xdf) {
      length = 2;
    } else if (c >= 0xe0 && c <= 0xef) {
      length = 3;
      if (c == 0xe0) low = 0xa0;
      if (c == 0xed) high = 0x9f;
    } else if (c >= 0xf0 && c <= 0xf4) {
      length = 4;
      if (c == 0xf0) low = 0x90;
      if (c == 0xf4) high = 0x8f;
    } else {
      return false;
    }
    if (i + length > n || s[i + 1] < low || s[i + 1] > high) return false;
    for (std::size_t k = 2; k < length; ++k) {
      if (s[i + k] < 0x80 || s[i + k] > 0xbf) return false;
    }
    i += length;
  }
  return true;
}

// ----- Writing ------------------------------------------------------------------------------

// Member `member` holding `text`, or `member`_base64 holding its bytes when it is not UTF-8.
void PutText(Json& object, const std::string& member, const std::string& text) {
  if (IsUtf8(text)) {
    object[member] = text;
  } else {
    object[member + "_base64"] = EncodeBase64(text);
  }
}

void CheckWriteDepth(int level, const char* what) {
  if (level > kJsonFormMaxDepth) {
    FailPlain(std::string("ToJson: the ") + what + " is deeper than " +
              std::to_string(kJsonFormMaxDepth) + " levels, the most the JSON form holds");
  }
}

Json NodeJson(const Core::Property& node, int level, bool root) {
  CheckWriteDepth(level, "property tree");
  Json json = Json::object();
  if (!root) PutText(json, "name", node.GetName());
  json["type"] = PropertyTypeName(node.GetType());
  switch (node.GetType()) {
    case PropertyTypeBool:
      json["value"] = node.GetBool();
      break;
    case PropertyTypeInt64:
      json["value"] = node.GetInt64();
      break;
    case PropertyTypeString:
      PutText(json, "value", node.GetString());
      break;
    default: {
      Json children = Json::array();
      for (const Core::Property& child : node.GetChildren()) {
        children.push_back(NodeJson(child, level + 1, false));
      }
      json["children"] = std::move(children);
    }
  }
  return json;
}

// The root of the entries has no key and always lists its children; an entry lists them only
// when it has some.
Json EntryJson(const Entries& entry, const std::string* key, int level) {
  CheckWriteDepth(level, "runtime entries' tree");
  Json json = Json::object();
  if (key != nullptr) PutText(json, "key", *key);
  PutText(json, "value", entry.data());
  if (key == nullptr || !entry.empty()) {
    Json children = Json::array();
    for (const auto& [childKey, child] : entry) {
      children.push_back(EntryJson(child, &childKey, level + 1));
    }
    json["children"] = std::move(children);
  }
  return json;
}

// ----- Reading ------------------------------------------------------------------------------

const Json& Require(const Json& object, const std::string& pointer, const std::string& member) {
  const auto found = object.find(member);
  if (found == object.end()) Fail(pointer, "missing member " + Quote(member));
  return *found;
}

void RequireObject(const Json& value, const std::string& pointer, const std::string& what) {
  if (!value.is_object()) Fail(pointer, "expected an object (" + what + "), found " + Found(value));
}

const Json& RequireArray(const Json& object, const std::string& pointer,
                         const std::string& member) {
  const Json& value = Require(object, pointer, member);
  if (!value.is_array()) Fail(pointer + "/" + member, "expected an array, found " + Found(value));
  return value;
}

void OnlyMembers(const Json& object, const std::string& pointer,
                 const std::vector<std::string>& allowed) {
  for (const auto& item : object.items()) {
    bool known = false;
    for (const std::string& name : allowed) known = known || item.key() == name;
    if (!known) {
      Fail(pointer + "/" + Token(item.key()), "unknown member " + Quote(item.key()) + " here");
    }
  }
}

// Member `member` as text, or `member`_base64 as bytes; exactly one of them.
std::string ReadText(const Json& object, const std::string& pointer, const std::string& member) {
  const std::string encoded = member + "_base64";
  const bool plain = object.contains(member);
  if (plain && object.contains(encoded)) {
    Fail(pointer, "both " + Quote(member) + " and " + Quote(encoded) + " given; give one");
  }
  if (!plain && !object.contains(encoded)) Fail(pointer, "missing member " + Quote(member));
  const std::string name = plain ? member : encoded;
  const Json& value = object.at(name);
  if (!value.is_string()) Fail(pointer + "/" + name, "expected a string, found " + Found(value));
  const std::string& text = value.get_ref<const std::string&>();
  return plain ? text : DecodeBase64(text, pointer + "/" + name);
}

long long ReadInt64(const Json& value, const std::string& pointer) {
  if (value.is_number_unsigned()) {
    const auto number = value.get<std::uint64_t>();
    if (number > static_cast<std::uint64_t>(std::numeric_limits<long long>::max())) {
      Fail(pointer, "expected an integer in the 64-bit signed range, found " + value.dump());
    }
    return static_cast<long long>(number);
  }
  if (!value.is_number_integer()) Fail(pointer, "expected an integer, found " + Found(value));
  return value.get<long long>();
}

// Appends `child` to `parent` keeping repeated names: CreateChildT always appends, and the
// move then gives the new child `child`'s type, value and children.
void Append(Core::Property& parent, Core::Property&& child) {
  Core::Property& slot = parent.CreateChildT<bool>(child.GetName(), false);
  slot = std::move(child);
}

// Recursive, to a depth that CheckNesting bounded before the text was parsed.
Core::Property ReadNode(const Json& json, const std::string& pointer, const std::string* rootName) {
  RequireObject(json, pointer, "a node of the tree");
  const Json& typeJson = Require(json, pointer, "type");
  if (!typeJson.is_string()) {
    Fail(pointer + "/type", "expected a string, found " + Found(typeJson));
  }
  const std::string& type = typeJson.get_ref<const std::string&>();
  const bool container = type == "container";
  if (rootName != nullptr && !container) {
    Fail(pointer + "/type", "the root of the tree must be a container, found " + Quote(type));
  }
  std::vector<std::string> allowed = {"type"};
  if (rootName == nullptr) allowed.insert(allowed.end(), {"name", "name_base64"});
  if (container) {
    allowed.push_back("children");
  } else {
    allowed.push_back("value");
    if (type == "string") allowed.push_back("value_base64");
  }
  OnlyMembers(json, pointer, allowed);
  const std::string name = rootName != nullptr ? *rootName : ReadText(json, pointer, "name");

  if (type == "bool") {
    const Json& value = Require(json, pointer, "value");
    if (!value.is_boolean()) {
      Fail(pointer + "/value", "expected true or false, found " + Found(value));
    }
    return Core::Property(name, value.get<bool>());
  }
  if (type == "int64") {
    return Core::Property(name, ReadInt64(Require(json, pointer, "value"), pointer + "/value"));
  }
  if (type == "string") return Core::Property(name, ReadText(json, pointer, "value"));
  if (!container) {
    Fail(pointer + "/type", "unknown type " + Quote(type) +
                                "; expected \"bool\", \"int64\", \"string\" or \"container\"");
  }
  Core::Property node(name);
  const Json& children = RequireArray(json, pointer, "children");
  for (std::size_t i = 0; i < children.size(); ++i) {
    Append(node, ReadNode(children[i], pointer + "/children/" + std::to_string(i), nullptr));
  }
  return node;
}

Entries ReadEntry(const Json& json, const std::string& pointer, std::string* key) {
  RequireObject(json, pointer, "a runtime entry");
  std::vector<std::string> allowed = {"value", "value_base64", "children"};
  if (key != nullptr) allowed.insert(allowed.end(), {"key", "key_base64"});
  OnlyMembers(json, pointer, allowed);
  if (key != nullptr) *key = ReadText(json, pointer, "key");
  Entries entry(ReadText(json, pointer, "value"));
  if (key != nullptr && !json.contains("children")) return entry;
  const Json& children = RequireArray(json, pointer, "children");
  for (std::size_t i = 0; i < children.size(); ++i) {
    std::string childKey;
    Entries child = ReadEntry(children[i], pointer + "/children/" + std::to_string(i), &childKey);
    entry.push_back(Entries::value_type(childKey, std::move(child)));
  }
  return entry;
}

// Refuses nesting beyond what a description needs before the JSON library builds anything, so
// that a hostile text costs neither memory nor stack, and the readers below, which recurse, stay
// within kJsonFormMaxDepth levels of tree. Brackets inside strings do not count.
void CheckNesting(const std::string& text) {
  int depth = 0;
  bool inString = false;
  bool escaped = false;
  std::size_t line = 1;
  std::size_t column = 0;
  for (const char c : text) {
    ++column;
    if (c == '\n') {
      ++line;
      column = 0;
    }
    if (inString) {
      if (escaped) {
        escaped = false;
      } else if (c == '\\') {
        escaped = true;
      } else if (c == '"') {
        inString = false;
      }
    } else if (c == '"') {
      inString = true;
    } else if (c == '[' || c == '{') {
      if (++depth > kMaxNesting) {
        FailPlain("JSON nested deeper than " + std::to_string(kMaxNesting) + " levels at line " +
                  std::to_string(line) + ", column " + std::to_string(column) +
                  "; a description's tree holds at most " + std::to_string(kJsonFormMaxDepth) +
                  " levels");
      }
    } else if (c == ']' || c == '}') {
      --depth;
    }
  }
}

// A member's name as a JSON pointer component (RFC 6901).
std::string PointerComponent(const std::string& name) {
  std::string out;
  for (const char c : name) {
    if (c == '~') {
      out += "~0";
    } else if (c == '/') {
      out += "~1";
    } else {
      out += c;
    }
  }
  return out;
}

// Reads the text as a stream of events, holding no values, to refuse an object that names a
// member twice (JSON takes the last one silently, so an edit of the first would be lost), naming
// the member's JSON pointer. A reader of its own rather than a parse callback: the callback parser
// searches the enclosing container at every object's end, which makes a long array of objects
// (a container of many children) take quadratic time.
class DuplicateMembers : public nlohmann::json_sax<Json> {
 public:
  bool null() override { return Value(); }
  bool boolean(bool /*value*/) override { return Value(); }
  bool number_integer(number_integer_t /*value*/) override { return Value(); }
  bool number_unsigned(number_unsigned_t /*value*/) override { return Value(); }
  bool number_float(number_float_t /*value*/, const string_t& /*text*/) override { return Value(); }
  bool string(string_t& /*value*/) override { return Value(); }
  bool binary(binary_t& /*value*/) override { return Value(); }
  bool start_object(std::size_t /*elements*/) override { return Start(true); }
  bool start_array(std::size_t /*elements*/) override { return Start(false); }
  bool end_object() override { return End(); }
  bool end_array() override { return End(); }
  bool key(string_t& key) override {
    Frame& frame = frames_.back();
    frame.key = key;
    if (!frame.keys.insert(frame.key).second) {
      Fail(Pointer() + "/" + PointerComponent(frame.key),
           "the member " + Quote(frame.key) + " appears twice in one object");
    }
    return true;
  }
  // Malformed text stops the reading; the parse that follows reports it.
  bool parse_error(std::size_t /*position*/, const std::string& /*token*/,
                   const nlohmann::detail::exception& /*error*/) override {
    return false;
  }

 private:
  struct Frame {
    bool object;
    std::string component;  // how the parent reaches it
    std::unordered_set<std::string> keys;
    std::string key;   // the member being read, in an object
    std::size_t next;  // the index of the next element, in an array
  };

  bool Value() {
    if (!frames_.empty() && !frames_.back().object) ++frames_.back().next;
    return true;
  }
  bool Start(bool object) {
    frames_.push_back({object, Component(), {}, {}, 0});
    return true;
  }
  bool End() {
    frames_.pop_back();
    return true;
  }

  // The component of a value that starts now, inside the innermost container.
  std::string Component() {
    if (frames_.empty()) return std::string();
    Frame& parent = frames_.back();
    return parent.object ? PointerComponent(parent.key) : std::to_string(parent.next++);
  }

  std::string Pointer() const {
    std::string pointer;
    for (std::size_t i = 1; i < frames_.size(); ++i) pointer += "/" + frames_[i].component;
    return pointer;
  }

  std::vector<Frame> frames_;
};

Json Parse(const std::string& text) {
  CheckNesting(text);
  try {
    DuplicateMembers duplicates;
    Json::sax_parse(text, &duplicates);
    return Json::parse(text);
  } catch (const Json::exception& e) {
    // "[json.exception.parse_error.101] parse error at line 1, column 7: ..." without its tag.
    const std::string what = e.what();
    const std::size_t at = what.find("parse error ");
    FailPlain("malformed JSON " + (at == std::string::npos ? what : what.substr(at + 12)));
  }
}

boost::intrusive_ptr<IFormatCodec> CreateOfKind(const Json& document) {
  const Json& kind = Require(document, "", "kind");
  if (!kind.is_string()) Fail("/kind", "expected a string, found " + Found(kind));
  const std::string& name = kind.get_ref<const std::string&>();
  switch (KindFromName(name).value_or(FormatKind::Codec)) {
    case FormatKind::Video:
      return FormatCodecVideo::Create();
    case FormatKind::Audio:
      return FormatCodecAudio::Create();
    case FormatKind::Subtitle:
      return FormatCodecSubtitle::Create();
    case FormatKind::Codec:
      if (name == KindName(FormatKind::Codec)) return FormatCodec::Create();
      break;
  }
  Fail("/kind", "unknown kind " + Quote(name) +
                    "; expected \"codec\", \"video\", \"audio\" or \"subtitle\"");
}

}  // namespace

const char* DescriptionKind(const boost::intrusive_ptr<const IFormat>& description) noexcept {
  const std::optional<FormatKind> kind = KindOf(description.get());
  return kind ? KindName(*kind) : "";
}

std::string ToJson(const boost::intrusive_ptr<IFormatCodec>& description) {
  if (!description) FailPlain("ToJson: there is no description (a null pointer)");
  const IFormatCodec& codec = *description;
  const Core::Property& tree = codec.GetProperty();
  Json document = Json::object();
  document["format"] = kFormatName;
  document["version"] = kJsonFormVersion;
  document["kind"] = DescriptionKind(description);
  PutText(document, "object_name", tree.GetName());
  document["tree"] = NodeJson(tree, 1, true);
  document["internal"] = EntryJson(codec.GetInternalProperties(), nullptr, 1);
  const boost::intrusive_ptr<IBlob> data = description->GetPrivateData();
  document["private_data"] =
      data ? Json(EncodeBase64(data->GetData(), data->GetSize())) : Json(nullptr);
  std::string text;
  JsonLayout::Write(document, text);
  return text;
}

boost::intrusive_ptr<IFormatCodec> FromJson(const std::string& text) {
  const Json document = Parse(text);
  RequireObject(document, "", "a description");
  const Json& format = Require(document, "", "format");
  if (!format.is_string() || format.get_ref<const std::string&>() != kFormatName) {
    Fail("/format", "expected " + Quote(kFormatName) + ", found " +
                        (format.is_string() ? Quote(format.get<std::string>()) : Found(format)));
  }
  const Json& version = Require(document, "", "version");
  if (!version.is_number_integer()) {
    Fail("/version", "expected an integer, found " + Found(version));
  }
  if (version != kJsonFormVersion) {
    Fail("/version", "version " + version.dump() + " is not known; this library reads version " +
                         std::to_string(kJsonFormVersion));
  }
  // Everything is read into local values first; the description is filled only when all of it
  // has been read, so a refusal leaves nothing behind.
  boost::intrusive_ptr<IFormatCodec> description = CreateOfKind(document);
  const std::string& expectedName = description->GetProperty().GetName();
  const std::string objectName = ReadText(document, "", "object_name");
  if (objectName != expectedName) {
    Fail(document.contains("object_name") ? "/object_name" : "/object_name_base64",
         "a " + std::string(DescriptionKind(description)) + " description is named " +
             Quote(expectedName) + ", found " + Quote(objectName));
  }
  Core::Property tree = ReadNode(Require(document, "", "tree"), "/tree", &objectName);
  if (!tree.ChildExists(IFormat::TAG_METADATA)) {
    Fail("/tree/children",
         "no child named " + Quote(IFormat::TAG_METADATA) + ", which every description has");
  }
  Entries entries = ReadEntry(Require(document, "", "internal"), "/internal", nullptr);
  const Json& dataJson = Require(document, "", "private_data");
  boost::intrusive_ptr<IBlob> data;
  if (dataJson.is_string()) {
    const std::string bytes = DecodeBase64(dataJson.get_ref<const std::string&>(), "/private_data");
    data = CreateBlob(bytes.data(), bytes.size());
  } else if (!dataJson.is_null()) {
    Fail("/private_data", "expected a base64 string or null, found " + Found(dataJson));
  }
  description->SetProperty(tree);
  description->GetInternalProperties() = std::move(entries);
  description->SetPrivateData(data);
  return description;
}

}  // namespace Conf
}  // namespace Tarvek
