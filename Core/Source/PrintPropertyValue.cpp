// The core property library: the human-readable tree printer and its escaping of texts.
#include <ostream>

#include <Tarvek/Core/Interfaces/EscapedText.h>
#include <Tarvek/Core/Interfaces/Property.h>

namespace Tarvek {
namespace Core {
namespace {

void WriteEscaped(std::ostream& out, const std::string& text) {
  std::string escaped;
  AppendEscaped(escaped, text);
  out << escaped;
}

void PrintNode(const Property& node, int depth, std::ostream& out, bool showTypes, bool recursive) {
  for (int i = 0; i < depth; ++i) out << "  ";
  if (node.GetName().empty()) {
    out << "<unnamed>";
  } else {
    WriteEscaped(out, node.GetName());
  }
  const PropertyTypes type = node.GetType();
  if (showTypes) out << " (" << PropertyTypeName(type) << ')';
  switch (type) {
    case PropertyTypeBool:
      out << ": " << (node.GetBool() ? "true" : "false");
      break;
    case PropertyTypeInt64:
      out << ": " << node.GetInt64();
      break;
    case PropertyTypeString:
      out << ": \"";
      WriteEscaped(out, node.GetString());
      out << '"';
      break;
    default:
      break;
  }
  out << '\n';
  if (!recursive) return;
  for (const Property& child : node.GetChildren()) {
    PrintNode(child, depth + 1, out, showTypes, recursive);
  }
}

}  // namespace

void AppendEscaped(std::string& out, const std::string& text) {
  static const char kHex[] = "0123456789abcdef";
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    switch (c) {
      case '"':
        out += "\\\"";
        break;
      case '\\':
        out += "\\\\";
        break;
      case '\n':
        out += "\\n";
        break;
      case '\r':
        out += "\\r";
        break;
      case '\t':
        out += "\\t";
        break;
      default:
        if (byte < 0x20 || byte == 0x7f) {
          out += "\\x";
          out += kHex[byte >> 4];
          out += kHex[byte & 0xf];
        } else {
          out += c;
        }
    }
  }
}

void PrintPropertyValue(const Property& property, int indent, std::ostream& out, bool showTypes,
                        bool recursive) {
  PrintNode(property, indent < 0 ? 0 : indent, out, showTypes, recursive);
}

}  // namespace Core
}  // namespace Tarvek
