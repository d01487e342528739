// Checks of the built formatdesc that take more than comparing its output with a file:
//   FormatdescCheck json TOOL ARGUMENT...
//     the --json output of the arguments parses, and agrees with their text output: same kind,
//     same settings in the same order, same derived values, same bitrates;
//   FormatdescCheck fromjson TOOL SUBCOMMAND ARGUMENT...
//     the --json output of SUBCOMMAND ARGUMENT..., stored in a file and read back with
//     SUBCOMMAND --from-json, gives the same output again, as JSON and as text;
//   FormatdescCheck values TOOL ARGUMENT... -- ASSERTION...
//     the output of the arguments (which ask for --json) parses, and each assertion holds:
//     "/json/pointer=VALUE" (a string value equals VALUE, any other value's JSON text does) or
//     "!/json/pointer" (no such member: a setting left unset);
//   FormatdescCheck probeback TOOL MEDIA...
//     each description probe --json gives for the media files, stored in a file, is read back by
//     the subcommand of its kind with --from-json: same kind, same tree, same private data; and
//     the whole document, read with --stream, gives the range the probe gave;
//   FormatdescCheck survives TOOL FILE...
//     probe reads damaged copies of each media file (cut short at seven points, and with bytes
//     overwritten at eight places) without crashing: every run ends with status 0 or 1 and
//     nothing on standard error, or with one "formatdesc: " line on it (status 1 or 2);
//   FormatdescCheck readme TOOL README
//     every console block of the README's formatdesc section ("$ formatdesc ..." then the
//     output) prints what it shows; with FORMATDESC_UPDATE_EXPECTED set, the blocks are
//     rewritten with what the tool prints instead.
// The tool runs through the shell (popen), so README commands are read as a user's shell would.
#include <sys/wait.h>
#include <unistd.h>
#include <algorithm>
#include <cmath>
#include <cstdint>
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

int CheckValues(const std::string& tool, const std::vector<std::string>& arguments,
                const std::vector<std::string>& assertions) {
  std::string command = Quote(tool);
  for (const std::string& argument : arguments) command += ' ' + Quote(argument);
  const Json json = Json::parse(Capture(command), nullptr, false);
  if (json.is_discarded()) return Fail("output is not JSON");
  int failures = 0;
  for (const std::string& assertion : assertions) {
    const bool absent = assertion.rfind('!', 0) == 0;
    const std::size_t equals = assertion.find('=');
    const std::string pointer =
        absent ? assertion.substr(1)
               : assertion.substr(0, equals == std::string::npos ? assertion.size() : equals);
    const Json::json_pointer at(pointer);
    std::string problem;
    if (absent) {
      if (json.contains(at)) problem = "present, holding " + json.at(at).dump();
    } else if (equals == std::string::npos) {
      problem = "an assertion needs =VALUE";
    } else if (!json.contains(at)) {
      problem = "missing";
    } else {
      const Json& value = json.at(at);
      const std::string actual = value.is_string() ? value.get<std::string>() : value.dump();
      if (actual != assertion.substr(equals + 1)) problem = "holds " + actual;
    }
    if (!problem.empty()) {
      ++failures;
      std::cerr << "FormatdescCheck: " << assertion << ": " << problem << '\n';
    }
  }
  return failures == 0 ? 0 : Fail(std::to_string(failures) + " assertions failed");
}

int CheckProbeBack(const std::string& tool, const std::vector<std::string>& media) {
  int described = 0;
  int failures = 0;
  const std::string file = "probeback-" + std::to_string(getpid()) + ".json";
  const std::string whole = "probeback-whole-" + std::to_string(getpid()) + ".json";
  for (const std::string& path : media) {
    const Json probed =
        Json::parse(Capture(Quote(tool) + " probe " + Quote(path) + " --json"), nullptr, false);
    if (probed.is_discarded()) return Fail("probe " + path + " --json is not JSON");
    for (const Json& stream : probed.value("streams", Json::array())) {
      if (!stream.contains("description")) continue;
      ++described;
      const Json& description = stream["description"];
      std::ofstream(file) << description.dump();
      const std::string kind = description.value("kind", "?");
      // Without the bitrates: a probed video description has no bitrate mode, and an audio one
      // may have no layout.
      const Json back =
          Json::parse(Capture(Quote(tool) + ' ' + kind + " --from-json " + file +
                              (kind == "subtitle" ? "" : " --no-bitrate") + " --json"),
                      nullptr, false);
      const std::string where = path + " stream " + std::to_string(stream.value("index", -1));
      if (back.is_discarded()) {
        ++failures;
        std::cerr << "FormatdescCheck: " << where << ": not read back\n";
        continue;
      }
      for (const char* member : {"kind", "tree", "private_data"}) {
        if (description.contains(member) != back.contains(member) ||
            (description.contains(member) && description[member] != back[member])) {
          ++failures;
          std::cerr << "FormatdescCheck: " << where << ": " << member
                    << " differs when read back\n";
        }
      }
      // The whole document read with --stream gives the range the probe gave (video in a
      // target-bitrate mode, as the probe judges it).
      if (!description.contains("bitrate")) continue;
      std::ofstream(whole) << probed.dump();
      const Json range =
          Json::parse(Capture(Quote(tool) + ' ' + kind + " --from-json " + whole + " --stream " +
                              std::to_string(stream.value("index", -1)) +
                              (kind == "video" ? " --bitrate-mode cbr" : "") + " --json"),
                      nullptr, false);
      if (range.is_discarded() || range.value("bitrate", Json()) != description["bitrate"]) {
        ++failures;
        std::cerr << "FormatdescCheck: " << where << ": --from-json --stream gives another range\n";
      }
    }
  }
  std::remove(file.c_str());
  std::remove(whole.c_str());
  if (described == 0) return Fail("no stream was described");
  return failures == 0 ? 0 : Fail(std::to_string(failures) + " differences");
}

// The same bytes on every run, unlike rand().
std::uint32_t NextRandom(std::uint32_t& state) {
  state = state * 1664525u + 1013904223u;
  return state >> 8;
}

// Runs the probe on `file` and returns what is wrong with how it ended, or "".
std::string ProbeEnding(const std::string& tool, const std::string& file, bool json) {
  const std::string errors = "survives-" + std::to_string(getpid()) + ".err";
  const std::string command = Quote(tool) + " probe " + Quote(file) + (json ? " --json" : "") +
                              " >/dev/null 2>" + Quote(errors);
  const int raw = std::system(command.c_str());
  std::ifstream in(errors);
  const std::string said((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  std::remove(errors.c_str());
  if (raw == -1 || !WIFEXITED(raw)) return "did not exit normally";
  const int status = WEXITSTATUS(raw);
  const bool oneLine = said.rfind("formatdesc: ", 0) == 0 && said.find('\n') == said.size() - 1;
  if (status == 2 && oneLine) return "";
  if ((status == 0 || status == 1) && (said.empty() || oneLine)) return "";
  return "exit status " + std::to_string(status) + ", standard error:\n" + said;
}

int CheckSurvives(const std::string& tool, const std::vector<std::string>& files) {
  int failures = 0;
  std::uint32_t state = 2024;
  for (const std::string& file : files) {
    std::ifstream in(file, std::ios::binary);
    const std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    if (bytes.size() < 64) return Fail(file + " is missing or too short to damage");
    std::vector<std::string> copies;
    for (std::size_t eighth = 1; eighth < 8; ++eighth) {
      copies.push_back(bytes.substr(0, bytes.size() * eighth / 8));
    }
    for (int place = 0; place < 8; ++place) {
      std::string copy = bytes;
      const std::size_t at = NextRandom(state) % (copy.size() - 16);
      for (std::size_t i = at; i < at + 16; ++i) copy[i] = static_cast<char>(NextRandom(state));
      copies.push_back(copy);
    }
    const std::string name = file.substr(file.find_last_of('/') + 1);
    for (std::size_t i = 0; i < copies.size(); ++i) {
      const std::string copy = "damaged-" + std::to_string(i) + "-" + name;
      std::ofstream(copy, std::ios::binary) << copies[i];
      for (const bool json : {false, true}) {
        const std::string problem = ProbeEnding(tool, copy, json);
        if (!problem.empty()) {
          ++failures;
          std::cerr << "FormatdescCheck: probe " << copy << (json ? " --json" : "") << ": "
                    << problem << '\n';
        }
      }
      std::remove(copy.c_str());
    }
  }
  return failures == 0 ? 0 : Fail(std::to_string(failures) + " damaged files ended badly");
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
  if (args.size() >= 3 && args[0] == "values") {
    const auto separator = std::find(args.begin() + 2, args.end(), "--");
    return CheckValues(
        args[1], std::vector<std::string>(args.begin() + 2, separator),
        std::vector<std::string>(separator == args.end() ? args.end() : separator + 1, args.end()));
  }
  if (args.size() >= 3 && args[0] == "probeback") {
    return CheckProbeBack(args[1], std::vector<std::string>(args.begin() + 2, args.end()));
  }
  if (args.size() >= 3 && args[0] == "survives") {
    return CheckSurvives(args[1], std::vector<std::string>(args.begin() + 2, args.end()));
  }
  if (args.size() == 3 && args[0] == "readme") return CheckReadme(args[1], args[2]);
  return Fail(
      "usage: FormatdescCheck json TOOL ARGUMENT... | fromjson TOOL SUBCOMMAND ARGUMENT... | "
      "values TOOL ARGUMENT... -- ASSERTION... | probeback TOOL MEDIA... | survives TOOL FILE... | "
      "readme TOOL README");
}
