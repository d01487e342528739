// The layout of every JSON document the project writes (the JSON form of a description and the
// tool's output), so that a stored file and the tool's output read and diff alike: indented by
// two, an object or array of plain values on one line when it stays within 100 columns. Not
// installed: the inspection library and the tool share it.
#ifndef TARVEK_INSPECT_JSONLAYOUT_H_
#define TARVEK_INSPECT_JSONLAYOUT_H_

#include <cstddef>
#include <nlohmann/json.hpp>
#include <string>

namespace Tarvek {
namespace Conf {
namespace JsonLayout {

constexpr std::size_t kLineWidth = 100;

// A value as JSON text; bytes that are not UTF-8 become U+FFFD instead of an exception.
inline std::string Dump(const nlohmann::ordered_json& value) {
  return value.dump(-1, ' ', false, nlohmann::ordered_json::error_handler_t::replace);
}

// `value` on one line, with ", " and ": " between items.
inline void WriteOneLine(const nlohmann::ordered_json& value, std::string& out) {
  if (!value.is_structured() || value.empty()) {
    out += Dump(value);
    return;
  }
  out += value.is_object() ? '{' : '[';
  bool first = true;
  for (const auto& item : value.items()) {
    if (!first) out += ", ";
    first = false;
    if (value.is_object()) out += Dump(item.key()) + ": ";
    WriteOneLine(item.value(), out);
  }
  out += value.is_object() ? '}' : ']';
}

// Appends `value`, laid out, to `out`; `indent` is the indentation of its closing bracket and
// `column` where it starts.
inline void Write(const nlohmann::ordered_json& value, std::string& out, std::size_t indent = 0,
                  std::size_t column = 0) {
  bool plain = true;
  for (const auto& element : value) {
    if (element.is_structured() && !element.empty()) {
      plain = false;
      break;
    }
  }
  if (!value.is_structured() || value.empty()) {
    out += Dump(value);
    return;
  }
  if (plain) {
    std::string line;
    WriteOneLine(value, line);
    if (column + line.size() <= kLineWidth) {
      out += line;
      return;
    }
  }
  const std::string pad(indent + 2, ' ');
  out += value.is_object() ? "{\n" : "[\n";
  bool first = true;
  for (const auto& item : value.items()) {
    out += first ? pad : ",\n" + pad;
    first = false;
    const std::string key = value.is_object() ? Dump(item.key()) + ": " : std::string();
    out += key;
    Write(item.value(), out, indent + 2, pad.size() + key.size());
  }
  out += "\n" + std::string(indent, ' ') + (value.is_object() ? '}' : ']');
}

}  // namespace JsonLayout
}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_INSPECT_JSONLAYOUT_H_
