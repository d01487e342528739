// Checks of the built formatdesc that take more than comparing its output with a file:
//   FormatdescCheck json TOOL ARGUMENT...
//     the --json output of the arguments parses, and agrees with their text output: same kind,
//     same settings in the same order, same derived values, same bitrates;
//   FormatdescCheck fromjson TOOL SUBCOMMAND ARGUMENT...
//     the --json output of SUBCOMMAND ARGUMENT..., stored in a file and read back with
//     SUBCOMMAND --from-json, gives the same output again, as JSON and as text;
//   FormatdescCheck readme TOOL README
//     every console block of the README's formatdesc section ("$ formatdesc ..." then the
//     output) prints what it shows; with FORMATDESC_UPDATE_EXPECTED set, the blocks are
//     rewritten with what the tool prints instead.
// The tool runs through the shell (popen), so README commands are read as a user's shell would.
#include <unistd.h>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <vector>

namespace {

using Json = nlohmann::ordered_json;

std::string Quote(const std::string& text) {
  std::string quoted = "'";
  for (const char c : text) quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
  return quoted + "'";
}

// What `command` prints on standard output.
std::string Capture(const std::string& command) {
  std::string out;
  FILE* pipe = popen(command.c_str(), "r");
  if (pipe == nullptr) return out;
  char buffer[4096];
  for (std::size_t n; (n = std::fread(buffer, 1, sizeof buffer, pipe)) > 0;) out.append(buffer, n);
  pclose(pipe);
  return out;
}

std::vector<std::string> Lines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) lines.push_back(line);
  return lines;
}

// The lines PrintContent writes for the settings `tree` at `depth`.
void TreeLines(const Json& tree, int depth, std::vector<std::string>& lines) {
  const std::string indent(static_cast<std::size_t>(2 * depth), ' ');
  for (const auto& [key, value] : tree.items()) {
    if (value.is_object()) {
      lines.push_back(indent + key + " (container)");
      TreeLines(value, depth + 1, lines);
    } else if (value.is_boolean()) {
      lines.push_back(indent + key + " (bool): " + (value.get<bool>() ? "true" : "false"));
    } else if (value.is_number_integer()) {
      lines.push_back(indent + key + " (int64): " + std::to_string(value.get<long long>()));
    } else {
      lines.push_back(indent + key + " (string): \"" + value.get<std::string>() + "\"");
    }
  }
}

// The text after "Label:" on the summary line of that label, or "" when there is none.
std::string SummaryValue(const std::vector<std::string>& lines, const std::string& label) {
  for (const std::string& line : lines) {
    if (line.rfind(label + ":", 0) == 0) {
      return line.substr(line.find_first_not_of(' ', label.size() + 1));
    }
  }
  return "";
}

// The text between the last '(' and the following ' ' or ')' of `text`: "(4500000 b/s)".
std::string Parenthesised(const std::string& text) {
  const std::size_t open = text.rfind('(');
  if (open == std::string::npos) return "";
  return text.substr(open + 1, text.find_first_of(" )", open) - open - 1);
}

int Fail(const std::string& what) {
  std::cerr << "FormatdescCheck: " << what << '\n';
  return 1;
}

int CheckJson(const std::string& tool, const std::vector<std::string>& arguments) {
  std::string command = Quote(tool);
  for (const std::string& argument : arguments) command += ' ' + Quote(argument);
  const std::vector<std::string> text = Lines(Capture(command));
  const Json json = Json::parse(Capture(command + " --json"), nullptr, false);
  if (json.is_discarded() || !json.is_object()) return Fail("--json output is not a JSON object");

  std::vector<std::string> expected = {json.value("kind", "?") + "_codec (container)"};
  TreeLines(json["settings"], 1, expected);
  std::size_t at = 0;
  for (const std::string& line : expected) {
    while (at < text.size() && text[at] != line) ++at;
    if (at == text.size()) return Fail("text output lacks, in order: " + line);
  }
  if (json.contains("frame_aspect") &&
      SummaryValue(text, "Frame aspect") != json["frame_aspect"].get<std::string>()) {
    return Fail("frame aspects differ");
  }
  if (json.contains("frame_rate")) {
    const std::string fraction = Parenthesised(SummaryValue(text, "Frame rate"));
    const double rate =
        std::atof(fraction.c_str()) / std::atof(fraction.substr(fraction.find('/') + 1).c_str());
    if (std::fabs(rate - json["frame_rate"].get<double>()) > 1e-9) {
      return Fail("frame rates differ");
    }
  }
  const std::pair<const char*, const char*> bitrates[] = {
      {"Default bitrate", "default"}, {"Minimum bitrate", "min"}, {"Maximum bitrate", "max"}};
  if (!json.contains("bitrate")) return Fail("--json output has no bitrate");
  for (const auto& [label, key] : bitrates) {
    if (Parenthesised(SummaryValue(text, label)) !=
        std::to_string(json["bitrate"][key].get<long long>())) {
      return Fail(std::string(label) + " differs");
    }
  }
  return 0;
}

int CheckFromJson(const std::string& tool, const std::vector<std::string>& arguments) {
  std::string command = Quote(tool);
  for (const std::string& argument : arguments) command += ' ' + Quote(argument);
  const std::string json = Capture(command + " --json");
  if (json.empty()) return Fail("no --json output");
  // In the working directory, named by the process so that checks running at once do not meet.
  const std::string file = "fromjson-" + std::to_string(getpid()) + ".json";
  std::ofstream(file) << json;
  const std::string again = Quote(tool) + ' ' + Quote(arguments.front()) + " --from-json " + file;
  const bool sameJson = Capture(again + " --json") == json;
  const bool sameText = Capture(again) == Capture(command);
  std::remove(file.c_str());
  if (!sameJson) return Fail("--from-json changes the --json output");
  if (!sameText) return Fail("--from-json changes the text output");
  return 0;
}

int CheckReadme(const std::string& tool, const std::string& path) {
  std::ifstream in(path);
  std::string readme((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  const std::size_t section = readme.find("\n## The formatdesc tool\n");
  if (section == std::string::npos) return Fail(path + " has no formatdesc section");
  const bool update = std::getenv("FORMATDESC_UPDATE_EXPECTED") != nullptr;
  const std::string open = "```console\n$ formatdesc";
  int examples = 0;
  int failures = 0;
  // The section ends at the next heading of its level; updates move it, so it is found anew.
  for (std::size_t block = readme.find(open, section); block < readme.find("\n## ", section + 1);
       block = readme.find(open, block + 1)) {
    // The command runs to the first line that does not end in a backslash.
    std::size_t commandEnd = readme.find('\n', block + open.size());
    while (commandEnd != std::string::npos && readme[commandEnd - 1] == '\\') {
      commandEnd = readme.find('\n', commandEnd + 1);
    }
    const std::size_t outputEnd = readme.find("```\n", commandEnd);
    if (outputEnd == std::string::npos) return Fail("unclosed example in " + path);
    const std::size_t outputStart = commandEnd + 1;
    const std::string command =
        readme.substr(block + open.size(), commandEnd - block - open.size());
    const std::string actual = Capture(Quote(tool) + command + " 2>&1");
    ++examples;
    if (update) {
      readme.replace(outputStart, outputEnd - outputStart, actual);
    } else if (readme.substr(outputStart, outputEnd - outputStart) != actual) {
      ++failures;
      std::cerr << "formatdesc" << command << " prints:\n" << actual;
    }
  }
  if (update) std::ofstream(path) << readme;
  if (examples == 0) return Fail("no examples in the formatdesc section of " + path);
  return failures == 0 ? 0 : Fail(std::to_string(failures) + " README examples differ");
}

}  // namespace

int main(int argc, char** argv) {
  const std::vector<std::string> args(argv + 1, argv + argc);
  if (args.size() >= 3 && args[0] == "json") {
    return CheckJson(args[1], std::vector<std::string>(args.begin() + 2, args.end()));
  }
  if (args.size() >= 3 && args[0] == "fromjson") {
    return CheckFromJson(args[1], std::vector<std::string>(args.begin() + 2, args.end()));
  }
  if (args.size() == 3 && args[0] == "readme") return CheckReadme(args[1], args[2]);
  return Fail(
      "usage: FormatdescCheck json TOOL ARGUMENT... | fromjson TOOL SUBCOMMAND ARGUMENT... | "
      "readme TOOL README");
}
