// The layout of every JSON document the project writes (the JSON form of a description and the
// tool's output), so that a stored file and the tool's output read and diff alike: indented by
// two, an object or array of plain values on one line when it stays within 100 columns. Not
// installed: the inspection library and the tool share it.
#ifndef TARVEK_INSPECT_JSONLAYOUT_H_
#define TARVEK_INSPECT_JSONLAYOUT_H_

#include <cstddef>
#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>

namespace Tarvek {
namespace Conf {
namespace JsonLayout {

constexpr std::size_t kLineWidth = 100;

// Well-formed UTF-8 (Unicode table 3-7): what a JSON string may hold.
inline bool IsUtf8(const std::string& text) {
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

// A value as JSON text; bytes that are not UTF-8 become U+FFFD instead of an exception.
inline std::string Dump(const nlohmann::ordered_json& value) {
  return value.dump(-1, ' ', false, nlohmann::ordered_json::error_handler_t::replace);
}

// Appends `text` as a JSON string, escaped as the JSON library escapes it, without building a
// JSON value for it: the writer's hot path.
inline void WriteString(const std::string& text, std::string& out) {
  if (!IsUtf8(text)) {
    out += Dump(text);
    return;
  }
  constexpr char kHex[] = "0123456789abcdef";
  // The bytes JSON escapes with a letter, each followed by its letter; other control bytes are
  // written as \u00XX.
  constexpr char kLetters[] = "\"\"\\\\\bb\ff\nn\rr\tt";
  out += '"';
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte >= 0x20 && c != '"' && c != '\\') {
      out += c;
      continue;
    }
    out += '\\';
    const char* letter = kLetters;
    while (*letter != '\0' && *letter != c) letter += 2;
    if (*letter != '\0') {
      out += letter[1];
    } else {
      out += "u00";
      out += kHex[byte >> 4];
      out += kHex[byte & 0xf];
    }
  }
  out += '"';
}

// Appends a value that is not a non-empty container.
inline void WriteScalar(const nlohmann::ordered_json& value, std::string& out) {
  switch (value.type()) {
    case nlohmann::ordered_json::value_t::string:
      WriteString(value.get_ref<const std::string&>(), out);
      break;
    case nlohmann::ordered_json::value_t::number_integer:
      out += std::to_string(value.get<std::int64_t>());
      break;
    case nlohmann::ordered_json::value_t::number_unsigned:
      out += std::to_string(value.get<std::uint64_t>());
      break;
    default:
      out += Dump(value);
  }
}

// Appends `value` on one line, with ", " and ": " between items; stops and returns false as soon
// as `out` grows past `limit` characters.
inline bool WriteOneLine(const nlohmann::ordered_json& value, std::string& out, std::size_t limit) {
  if (!value.is_structured() || value.empty()) {
    WriteScalar(value, out);
    return out.size() <= limit;
  }
  const bool object = value.is_object();
  out += object ? '{' : '[';
  for (auto item = value.begin(); item != value.end(); ++item) {
    if (item != value.begin()) out += ", ";
    if (object) {
      WriteString(item.key(), out);
      out += ": ";
    }
    if (!WriteOneLine(*item, out, limit)) return false;
  }
  out += object ? '}' : ']';
  return out.size() <= limit;
}

// Appends `value`, laid out, to `out`; `indent` is the indentation of its closing bracket and
// `column` where it starts.
inline void Write(const nlohmann::ordered_json& value, std::string& out, std::size_t indent = 0,
                  std::size_t column = 0) {
  if (!value.is_structured() || value.empty()) {
    WriteScalar(value, out);
    return;
  }
  bool plain = true;
  for (const auto& element : value) {
    if (element.is_structured() && !element.empty()) {
      plain = false;
      break;
    }
  }
  const std::size_t start = out.size();
  if (plain && column <= kLineWidth && WriteOneLine(value, out, start + kLineWidth - column)) {
    return;
  }
  out.resize(start);
  const bool object = value.is_object();
  out += object ? "{\n" : "[\n";
  for (auto item = value.begin(); item != value.end(); ++item) {
    if (item != value.begin()) out += ",\n";
    out.append(indent + 2, ' ');
    const std::size_t keyStart = out.size();
    if (object) {
      WriteString(item.key(), out);
      out += ": ";
    }
    Write(*item, out, indent + 2, indent + 2 + out.size() - keyStart);
  }
  out += '\n';
  out.append(indent, ' ');
  out += object ? '}' : ']';
}

}  // namespace JsonLayout
}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_INSPECT_JSONLAYOUT_H_
