#include "Diff.h"

#include <map>
#include <utility>

#include "../Conf/Interfaces/IFormatCodecAudio.h"
#include "../Conf/Interfaces/IFormatCodecVideo.h"
#include "../Core/Interfaces/EscapedText.h"
#include "JsonForm.h"
#include "Settings.h"

namespace Tarvek {
namespace Conf {
namespace {

// `text` between double quotes, escaped as PrintPropertyValue escapes it, so that the extent of a
// value is never in doubt.
std::string Quoted(const std::string& text) {
  std::string out = "\"";
  Core::AppendEscaped(out, text);
  return out + "\"";
}

// A name as a path segment: plain when that cannot be misread, quoted otherwise.
std::string Segment(const std::string& name, std::size_t occurrence) {
  bool plain = !name.empty();
  for (const char c : name) {
    const auto byte = static_cast<unsigned char>(c);
    if (c == '/' || c == '[' || c == '\\' || c == '"' || byte < 0x20 || byte == 0x7f) plain = false;
  }
  std::string segment = plain ? name : Quoted(name);
  if (occurrence > 0) segment += "[" + std::to_string(occurrence) + "]";
  return segment;
}

std::string Join(const std::string& path, const std::string& segment) {
  return path.empty() ? segment : path + "/" + segment;
}

bool SameLeaf(const Core::Property& a, const Core::Property& b) {
  switch (a.GetType()) {
    case PropertyTypeBool:
      return a.GetBool() == b.GetBool();
    case PropertyTypeInt64:
      return a.GetInt64() == b.GetInt64();
    case PropertyTypeString:
      return a.GetString() == b.GetString();
    default:
      return true;
  }
}

std::string NamesText(const Core::Property& container) {
  std::string text;
  for (const Core::Property& child : container.GetChildren()) {
    text += (text.empty() ? "" : ", ") + Quoted(child.GetName());
  }
  return text;
}

void DiffNodes(const Core::Property& a, const Core::Property& b, const std::string& path,
               std::vector<Difference>& out);

// Children are keyed by (name, occurrence of that name so far), which pairs the n-th child of a
// name in a with the n-th in b. Compare also wants the same order: when the pairs stand in
// another order, one OtherOrder entry at the container says so.
void DiffChildren(const Core::Property& a, const Core::Property& b, const std::string& path,
                  std::vector<Difference>& out) {
  using Key = std::pair<std::string, std::size_t>;
  std::map<Key, std::size_t> inB;
  std::vector<const Core::Property*> childrenB;
  std::vector<std::size_t> occurrencesB;
  std::map<std::string, std::size_t> seen;
  for (const Core::Property& child : b.GetChildren()) {
    const std::size_t occurrence = seen[child.GetName()]++;
    inB.emplace(Key(child.GetName(), occurrence), childrenB.size());
    childrenB.push_back(&child);
    occurrencesB.push_back(occurrence);
  }
  std::vector<bool> matched(childrenB.size(), false);
  std::vector<Difference> entries;
  bool inOrder = true;
  std::size_t lastMatch = 0;
  bool anyMatch = false;
  seen.clear();
  for (const Core::Property& child : a.GetChildren()) {
    const std::size_t occurrence = seen[child.GetName()]++;
    const std::string childPath = Join(path, Segment(child.GetName(), occurrence));
    const auto found = inB.find(Key(child.GetName(), occurrence));
    if (found == inB.end()) {
      entries.push_back(
          {childPath, DifferenceKind::OnlyInA, ValueText(child), "", &child, nullptr});
      continue;
    }
    if (anyMatch && found->second < lastMatch) inOrder = false;
    anyMatch = true;
    lastMatch = found->second;
    matched[found->second] = true;
    DiffNodes(child, *childrenB[found->second], childPath, entries);
  }
  for (std::size_t i = 0; i < childrenB.size(); ++i) {
    if (matched[i]) continue;
    entries.push_back({Join(path, Segment(childrenB[i]->GetName(), occurrencesB[i])),
                       DifferenceKind::OnlyInB, "", ValueText(*childrenB[i]), nullptr,
                       childrenB[i]});
  }
  if (!inOrder) out.push_back({path, DifferenceKind::OtherOrder, NamesText(a), NamesText(b)});
  out.insert(out.end(), entries.begin(), entries.end());
}

void DiffNodes(const Core::Property& a, const Core::Property& b, const std::string& path,
               std::vector<Difference>& out) {
  if (a.GetType() != b.GetType()) {
    out.push_back({path, DifferenceKind::OtherType, ValueText(a), ValueText(b), &a, &b});
  } else if (a.GetType() == PropertyTypeContainer) {
    DiffChildren(a, b, path, out);
  } else if (!SameLeaf(a, b)) {
    out.push_back({path, DifferenceKind::OtherValue, ValueText(a), ValueText(b), &a, &b});
  }
}

// "an audio description" and the like, for sentences about the kind of a description.
std::string KindPhrase(const boost::intrusive_ptr<const IFormat>& description) {
  const std::optional<FormatKind> kind = KindOf(description.get());
  return kind ? Conf::KindPhrase(*kind) : "a description of no codec kind";
}

// What the compatibility test reads of one setting on one side.
struct Reading {
  bool ok = false;
  bool missing = false;
  long long value = 0;
  std::string text;  // the value, "missing", or the stored node's ValueText
};

template <class Getter>
Reading Read(const IFormat& description, const std::string& key, Getter get) {
  Reading reading;
  try {
    reading.value = static_cast<long long>(get());
    reading.ok = true;
    reading.text = std::to_string(reading.value);
  } catch (const Core::ChildNotFound&) {
    reading.missing = true;
    reading.text = "missing";
  } catch (const Core::WrongPropertyType&) {
    const Core::Property& tree = description.GetProperty();
    const auto found = tree.FindChild(key);
    reading.text = found != tree.GetChildren().end() ? ValueText(*found) : "unreadable";
  }
  return reading;
}

// Why one side could not be read: "is missing in a", "holds "x" (string) in b, where ...".
std::string Problem(const Reading& reading, const char* side) {
  if (reading.missing) return std::string("is missing in ") + side;
  return "holds " + reading.text + " in " + side + ", where the test reads an integer";
}

void Explain(const std::string& key, const std::string& label, const Reading& a, const Reading& b,
             std::vector<Incompatibility>& out) {
  std::string reason;
  if (a.ok && b.ok) {
    if (a.value == b.value) return;
    reason = "the " + label + " differs: " + a.text + " in a, " + b.text + " in b";
  } else if (a.missing && b.missing) {
    reason = "the " + label + " is missing in a and in b";
  } else if (!a.ok && !b.ok) {
    reason = "the " + label + " " + Problem(a, "a") + ", and " + Problem(b, "b");
  } else {
    reason = "the " + label + " " + (a.ok ? Problem(b, "b") : Problem(a, "a"));
  }
  out.push_back({key, a.text, b.text, reason});
}

// The kind test itself: `b` must be of a's kind; a null or other `b` is the only reason then.
template <class Kind>
const Kind* SameKind(const boost::intrusive_ptr<const IFormat>& a,
                     const boost::intrusive_ptr<const IFormat>& b, const std::string& kind,
                     std::vector<Incompatibility>& out) {
  const auto* other = dynamic_cast<const Kind*>(b.get());
  if (other == nullptr) {
    const std::string what = b ? KindPhrase(b) : std::string("null");
    out.push_back({"", kind, b ? DescriptionKind(b) : "null",
                   "b is " + what + "; " + KindPhrase(a) + " accepts only " + KindPhrase(a)});
  }
  return other;
}

void ExplainVideo(const IFormatCodecVideo& a, const boost::intrusive_ptr<const IFormat>& pa,
                  const boost::intrusive_ptr<const IFormat>& pb,
                  std::vector<Incompatibility>& out) {
  const auto* b = SameKind<IFormatCodecVideo>(pa, pb, KindName(FormatKind::Video), out);
  if (b == nullptr) return;
  Explain(IFormatCodecVideo::TAG_WIDTH, "width",
          Read(a, IFormatCodecVideo::TAG_WIDTH, [&] { return a.GetWidth(); }),
          Read(*b, IFormatCodecVideo::TAG_WIDTH, [&] { return b->GetWidth(); }), out);
  Explain(IFormatCodecVideo::TAG_HEIGHT, "height",
          Read(a, IFormatCodecVideo::TAG_HEIGHT, [&] { return a.GetHeight(); }),
          Read(*b, IFormatCodecVideo::TAG_HEIGHT, [&] { return b->GetHeight(); }), out);
  Explain(IFormatCodecVideo::TAG_ASPECTX, "pixel aspect X",
          Read(a, IFormatCodecVideo::TAG_ASPECTX, [&] { return a.GetPixelAspectX(); }),
          Read(*b, IFormatCodecVideo::TAG_ASPECTX, [&] { return b->GetPixelAspectX(); }), out);
  Explain(IFormatCodecVideo::TAG_ASPECTY, "pixel aspect Y",
          Read(a, IFormatCodecVideo::TAG_ASPECTY, [&] { return a.GetPixelAspectY(); }),
          Read(*b, IFormatCodecVideo::TAG_ASPECTY, [&] { return b->GetPixelAspectY(); }), out);
}

void ExplainAudio(const IFormatCodecAudio& a, const boost::intrusive_ptr<const IFormat>& pa,
                  const boost::intrusive_ptr<const IFormat>& pb,
                  std::vector<Incompatibility>& out) {
  const auto* b = SameKind<IFormatCodecAudio>(pa, pb, KindName(FormatKind::Audio), out);
  if (b == nullptr) return;
  Explain(IFormatCodecAudio::TAG_SAMPLE_RATE, "sample rate",
          Read(a, IFormatCodecAudio::TAG_SAMPLE_RATE, [&] { return a.GetSampleRate(); }),
          Read(*b, IFormatCodecAudio::TAG_SAMPLE_RATE, [&] { return b->GetSampleRate(); }), out);
  Explain(IFormatCodecAudio::TAG_LAYOUT, "channel layout",
          Read(a, IFormatCodecAudio::TAG_LAYOUT, [&] { return a.GetChannelLayout(); }),
          Read(*b, IFormatCodecAudio::TAG_LAYOUT, [&] { return b->GetChannelLayout(); }), out);
  Explain(IFormatCodecAudio::TAG_SAMPLE_FORMAT, "sample format",
          Read(a, IFormatCodecAudio::TAG_SAMPLE_FORMAT, [&] { return a.GetSampleFormat(); }),
          Read(*b, IFormatCodecAudio::TAG_SAMPLE_FORMAT, [&] { return b->GetSampleFormat(); }),
          out);
}

}  // namespace

const char* DifferenceKindName(DifferenceKind kind) noexcept {
  switch (kind) {
    case DifferenceKind::OnlyInA:
      return "only in a";
    case DifferenceKind::OnlyInB:
      return "only in b";
    case DifferenceKind::OtherType:
      return "other type";
    case DifferenceKind::OtherValue:
      return "other value";
    case DifferenceKind::OtherOrder:
      return "other order";
    case DifferenceKind::OtherName:
      return "other name";
  }
  return "unknown";
}

std::string ValueText(const Core::Property& node) {
  switch (node.GetType()) {
    case PropertyTypeBool:
      return node.GetBool() ? "true (bool)" : "false (bool)";
    case PropertyTypeInt64:
      return std::to_string(node.GetInt64()) + " (int64)";
    case PropertyTypeString:
      return Quoted(node.GetString()) + " (string)";
    case PropertyTypeContainer: {
      const std::size_t count = node.GetChildren().size();
      return "container (" + std::to_string(count) + (count == 1 ? " child)" : " children)");
    }
  }
  return "unknown type";
}

std::vector<Difference> Diff(const boost::intrusive_ptr<const IFormat>& a,
                             const boost::intrusive_ptr<const IFormat>& b) {
  std::vector<Difference> out;
  if (!a && !b) return out;
  if (!a) {
    out.push_back(
        {"", DifferenceKind::OnlyInB, "", ValueText(b->GetProperty()), nullptr, &b->GetProperty()});
  } else if (!b) {
    out.push_back(
        {"", DifferenceKind::OnlyInA, ValueText(a->GetProperty()), "", &a->GetProperty(), nullptr});
  } else {
    const Core::Property& treeA = a->GetProperty();
    const Core::Property& treeB = b->GetProperty();
    if (treeA.GetName() != treeB.GetName()) {
      out.push_back(
          {"", DifferenceKind::OtherName, Quoted(treeA.GetName()), Quoted(treeB.GetName())});
    }
    DiffNodes(treeA, treeB, "", out);
  }
  return out;
}

std::vector<Incompatibility> ExplainCompatibility(const boost::intrusive_ptr<const IFormat>& a,
                                                  const boost::intrusive_ptr<const IFormat>& b) {
  std::vector<Incompatibility> out;
  if (!a) {
    out.push_back({"", "null", b ? DescriptionKind(b) : "null",
                   "a is null: there is no description to test b against"});
    return out;
  }
  // The kind's own answer decides whether there is anything to explain, so that the list is
  // empty exactly when IsCompatible is true, whatever implementation stands behind `a`. An
  // answer that throws (a setting missing or of another type) is a "no" to explain.
  bool compatible = false;
  try {
    compatible = a->IsCompatible(b);
  } catch (const Tarvek::Exception&) {
    compatible = false;
  }
  if (compatible) return out;
  if (const auto* video = dynamic_cast<const IFormatCodecVideo*>(a.get())) {
    ExplainVideo(*video, a, b, out);
  } else if (const auto* audio = dynamic_cast<const IFormatCodecAudio*>(a.get())) {
    ExplainAudio(*audio, a, b, out);
  }
  if (out.empty()) {
    out.push_back({"", DescriptionKind(a), b ? DescriptionKind(b) : "null",
                   "the compatibility test of " + KindPhrase(a) + " refuses b"});
  }
  return out;
}

}  // namespace Conf
}  // namespace Tarvek
