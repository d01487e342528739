#include "JsonForm.h"

#include <boost/current_function.hpp>
#include <boost/property_tree/ptree.hpp>
#include <cstdint>
#include <limits>
#include <memory>
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
#include "JsonDocument.h"
#include "JsonLayout.h"
#include "Settings.h"

namespace Tarvek {
namespace Conf {
namespace {

// Ordered, so that members are written in the order the format lists them.
using Json = nlohmann::ordered_json;
using Entries = boost::property_tree::ptree;

constexpr const char* kFormatName = "tarvek-description";

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

// ----- Writing ------------------------------------------------------------------------------

// Member `member` holding `text`, or `member`_base64 holding its bytes when it is not UTF-8.
void PutText(Json& object, const std::string& member, const std::string& text) {
  if (JsonLayout::IsUtf8(text)) {
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
  json.get_ptr<Json::object_t*>()->reserve(3);
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

void RequireObject(const Json& value, const std::string& pointer, const char* what) {
  if (!value.is_object()) {
    Fail(pointer, std::string("expected an object (") + what + "), found " + Found(value));
  }
}

const Json& RequireArray(const Json& object, const std::string& pointer,
                         const std::string& member) {
  const Json& value = Require(object, pointer, member);
  if (!value.is_array()) Fail(pointer + "/" + member, "expected an array, found " + Found(value));
  return value;
}

// The members an object of the form may have: at most five.
struct Members {
  const char* names[5];
  std::size_t count = 0;
  void Add(const char* name) { names[count++] = name; }
};

void OnlyMembers(const Json& object, const std::string& pointer, const Members& allowed) {
  for (auto item = object.begin(); item != object.end(); ++item) {
    bool known = false;
    for (std::size_t i = 0; i < allowed.count && !known; ++i)
      known = item.key() == allowed.names[i];
    if (!known) {
      Fail(pointer + "/" + Token(item.key()), "unknown member " + Quote(item.key()) + " here");
    }
  }
}

// Refuses a node or entry deeper than the form holds; a parsed document may nest deeper than
// the form's own text when it holds the description as a member.
void CheckReadDepth(int level, const std::string& pointer, const char* what) {
  if (level > kJsonFormMaxDepth) {
    Fail(pointer, std::string("the ") + what + " is deeper than " +
                      std::to_string(kJsonFormMaxDepth) + " levels, the most the JSON form holds");
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

long long ReadInt64(const Json& object, const std::string& pointer) {
  const Json& value = Require(object, pointer, "value");
  if (value.is_number_unsigned()) {
    const auto number = value.get<std::uint64_t>();
    if (number > static_cast<std::uint64_t>(std::numeric_limits<long long>::max())) {
      Fail(pointer + "/value",
           "expected an integer in the 64-bit signed range, found " + value.dump());
    }
    return static_cast<long long>(number);
  }
  if (!value.is_number_integer()) {
    Fail(pointer + "/value", "expected an integer, found " + Found(value));
  }
  return value.get<long long>();
}

// Appends `child` to `parent` keeping repeated names: CreateChildT always appends, and the
// move then gives the new child `child`'s type, value and children.
void Append(Core::Property& parent, Core::Property&& child) {
  Core::Property& slot = parent.CreateChildT<bool>(child.GetName(), false);
  slot = std::move(child);
}

// `pointer` is where the node is; the readers extend it for each child and restore it, so that
// no path is spelt out per node. Recursive, to the depth CheckReadDepth allows.
Core::Property ReadNode(const Json& json, std::string& pointer, const std::string* rootName,
                        int level) {
  CheckReadDepth(level, pointer, "property tree");
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
  Members allowed;
  allowed.Add("type");
  if (rootName == nullptr) {
    allowed.Add("name");
    allowed.Add("name_base64");
  }
  if (container) {
    allowed.Add("children");
  } else {
    allowed.Add("value");
    if (type == "string") allowed.Add("value_base64");
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
  if (type == "int64") return Core::Property(name, ReadInt64(json, pointer));
  if (type == "string") return Core::Property(name, ReadText(json, pointer, "value"));
  if (!container) {
    Fail(pointer + "/type", "unknown type " + Quote(type) +
                                "; expected \"bool\", \"int64\", \"string\" or \"container\"");
  }
  Core::Property node(name);
  const Json& children = RequireArray(json, pointer, "children");
  const std::size_t length = pointer.size();
  for (std::size_t i = 0; i < children.size(); ++i) {
    pointer += "/children/";
    pointer += std::to_string(i);
    Append(node, ReadNode(children[i], pointer, nullptr, level + 1));
    pointer.resize(length);
  }
  return node;
}

Entries ReadEntry(const Json& json, std::string& pointer, std::string* key, int level) {
  CheckReadDepth(level, pointer, "runtime entries' tree");
  RequireObject(json, pointer, "a runtime entry");
  Members allowed;
  allowed.Add("value");
  allowed.Add("value_base64");
  allowed.Add("children");
  if (key != nullptr) {
    allowed.Add("key");
    allowed.Add("key_base64");
  }
  OnlyMembers(json, pointer, allowed);
  if (key != nullptr) *key = ReadText(json, pointer, "key");
  Entries entry(ReadText(json, pointer, "value"));
  if (key != nullptr && !json.contains("children")) return entry;
  const Json& children = RequireArray(json, pointer, "children");
  const std::size_t length = pointer.size();
  for (std::size_t i = 0; i < children.size(); ++i) {
    pointer += "/children/";
    pointer += std::to_string(i);
    std::string childKey;
    Entries child = ReadEntry(children[i], pointer, &childKey, level + 1);
    entry.push_back(Entries::value_type(childKey, std::move(child)));
    pointer.resize(length);
  }
  return entry;
}

// Refuses nesting beyond `maxNesting` before anything is built, so that a hostile text costs
// neither memory nor time; the readers above check the depth of what they read on their own.
// Brackets inside strings do not count.
void CheckNesting(const std::string& text, int maxNesting) {
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
      if (++depth > maxNesting) {
        FailPlain("JSON nested deeper than " + std::to_string(maxNesting) + " levels at line " +
                  std::to_string(line) + ", column " + std::to_string(column) +
                  "; a description's tree holds at most " + std::to_string(kJsonFormMaxDepth) +
                  " levels");
      }
    } else if (c == ']' || c == '}') {
      --depth;
    }
  }
}

// "[json.exception.parse_error.101] parse error at line 1, column 7: ..." as "malformed JSON at
// line 1, column 7: ...".
[[noreturn]] void FailMalformed(const std::string& what) {
  const std::size_t at = what.find("parse error ");
  FailPlain("malformed JSON " + (at == std::string::npos ? what : what.substr(at + 12)));
}

// Builds the document from the parser's events, refusing an object that names a member twice
// (JSON takes the last one silently, so an edit of the first would be lost) with the member's
// JSON pointer. An object's members are gathered aside and moved into it whole when it ends:
// the JSON library's own builder finds each key by a scan of its object, and its object's
// storage copies every member, subtrees included, each time it grows, which makes a large object
// or a member after a large one cost quadratic time.
class Builder : public nlohmann::json_sax<Json> {
 public:
  bool null() override { return Put(nullptr); }
  bool boolean(bool value) override { return Put(value); }
  bool number_integer(number_integer_t value) override { return Put(value); }
  bool number_unsigned(number_unsigned_t value) override { return Put(value); }
  bool number_float(number_float_t value, const string_t& /*text*/) override { return Put(value); }
  bool string(string_t& value) override { return Put(std::move(value)); }
  bool binary(binary_t& value) override { return Put(Json::binary(std::move(value))); }
  bool start_object(std::size_t /*elements*/) override {
    frames_.push_back({Place(Json::object()), {}, nullptr});
    return true;
  }
  bool start_array(std::size_t /*elements*/) override {
    frames_.push_back({Place(Json::array()), {}, nullptr});
    return true;
  }
  bool end_object() override {
    Frame& frame = frames_.back();
    auto& object = *frame.value->get_ptr<Json::object_t*>();
    object.reserve(frame.members.size());
    for (auto& [name, value] : frame.members) {
      object.Container::emplace_back(std::move(name), std::move(value));
    }
    frames_.pop_back();
    return true;
  }
  bool end_array() override {
    frames_.pop_back();
    return true;
  }
  bool key(string_t& key) override {
    Frame& frame = frames_.back();
    if (Repeated(frame, key)) {
      Fail(Pointer() + "/" + Token(key),
           "the member " + Quote(key) + " appears twice in one object");
    }
    frame.members.emplace_back(std::move(key), nullptr);
    return true;
  }
  bool parse_error(std::size_t /*position*/, const std::string& /*token*/,
                   const nlohmann::detail::exception& error) override {
    error_ = error.what();
    return false;
  }

  const std::string& Error() const { return error_; }
  Json Take() { return std::move(root_); }

 private:
  // Up to this many members, an object is searched for a repeated name; past it, the names go
  // into a set.
  static constexpr std::size_t kScanned = 16;

  struct Frame {
    Json* value;                                        // the object or array being filled
    std::vector<std::pair<std::string, Json>> members;  // an object's, until it ends
    std::unique_ptr<std::unordered_set<std::string>> names;
  };

  Json* Place(Json&& value) {
    if (frames_.empty()) {
      root_ = std::move(value);
      return &root_;
    }
    Frame& frame = frames_.back();
    if (frame.value->is_array()) {
      auto& elements = *frame.value->get_ptr<Json::array_t*>();
      elements.push_back(std::move(value));
      return &elements.back();
    }
    Json& member = frame.members.back().second;
    member = std::move(value);
    return &member;
  }
  bool Put(Json&& value) {
    Place(std::move(value));
    return true;
  }

  static bool Repeated(Frame& frame, const std::string& name) {
    if (!frame.names) {
      for (const auto& member : frame.members) {
        if (member.first == name) return true;
      }
      if (frame.members.size() < kScanned) return false;
      frame.names = std::make_unique<std::unordered_set<std::string>>();
      for (const auto& member : frame.members) frame.names->insert(member.first);
    }
    return !frame.names->insert(name).second;
  }

  // The JSON pointer of the innermost container: how each container reaches its last child.
  std::string Pointer() const {
    std::string pointer;
    for (std::size_t i = 0; i + 1 < frames_.size(); ++i) {
      const Frame& frame = frames_[i];
      pointer += "/";
      pointer += frame.value->is_object() ? Token(frame.members.back().first)
                                          : std::to_string(frame.value->size() - 1);
    }
    return pointer;
  }

  Json root_;
  std::vector<Frame> frames_;
  std::string error_;
};

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

Json JsonDocument::Parse(const std::string& text, int maxNesting) {
  CheckNesting(text, maxNesting);
  Builder builder;
  bool parsed = false;
  try {
    parsed = Json::sax_parse(text, &builder);
  } catch (const Json::exception& e) {
    FailMalformed(e.what());
  }
  if (!parsed) FailMalformed(builder.Error());
  return builder.Take();
}

Json JsonDocument::Make(const boost::intrusive_ptr<IFormatCodec>& description) {
  if (!description) FailPlain("ToJson: there is no description (a null pointer)");
  const IFormatCodec& codec = *description;
  const Core::Property& tree = codec.GetProperty();
  Json document = Json::object();
  // Room for every member first: the object's storage copies its members when it grows.
  document.get_ptr<Json::object_t*>()->reserve(8);
  document["format"] = kFormatName;
  document["version"] = kJsonFormVersion;
  document["kind"] = DescriptionKind(description);
  PutText(document, "object_name", tree.GetName());
  document["tree"] = NodeJson(tree, 1, true);
  document["internal"] = EntryJson(codec.GetInternalProperties(), nullptr, 1);
  const boost::intrusive_ptr<IBlob> data = description->GetPrivateData();
  document["private_data"] =
      data ? Json(EncodeBase64(data->GetData(), data->GetSize())) : Json(nullptr);
  return document;
}

boost::intrusive_ptr<IFormatCodec> JsonDocument::Read(const Json& document) {
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
  std::string pointer = "/tree";
  Core::Property tree = ReadNode(Require(document, "", "tree"), pointer, &objectName, 1);
  if (!tree.ChildExists(IFormat::TAG_METADATA)) {
    Fail("/tree/children",
         "no child named " + Quote(IFormat::TAG_METADATA) + ", which every description has");
  }
  pointer = "/internal";
  Entries entries = ReadEntry(Require(document, "", "internal"), pointer, nullptr, 1);
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

std::string ToJson(const boost::intrusive_ptr<IFormatCodec>& description) {
  std::string text;
  JsonLayout::Write(JsonDocument::Make(description), text);
  return text;
}

boost::intrusive_ptr<IFormatCodec> FromJson(const std::string& text) {
  return JsonDocument::Read(JsonDocument::Parse(text, JsonDocument::kMaxNesting));
}

}  // namespace Conf
}  // namespace Tarvek
