// The report of a run as one SARIF log (OASIS Static Analysis Results Interchange Format, version
// 2.1.0), for programs that read results of static analysis. A refused item of a file is a result
// of level "error", with one exception: an item of severity kFollows (simulator/verdict/causes.h)
// is left out if the file also has a refused item of another severity. Each warning is a result of
// level "warning". The rules are the causes of the results. A file that was not looked at, or not
// simulated, gets a notification of level "error" in addition to its results, and the run then
// counts as not successful. In messages, hidden characters (IsHidden in simulator/phone/text.h) and
// bytes that are not UTF-8 become \xNN. In URIs, paths are percent-encoded.
#pragma once

#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <string_view>

#include "simulator/verdict/report.h"

namespace simulator {

// The beginning of each log.
inline constexpr std::string_view kSarifStart =
    "{\n"
    "  \"$schema\": \"https://docs.oasis-open.org/sarif/sarif/v2.1.0/errata01/os/schemas/"
    "sarif-schema-2.1.0.json\",\n"
    "  \"version\": \"2.1.0\",\n"
    "  \"runs\": [\n"
    "    {\n"
    "      \"tool\": {\n"
    "        \"driver\": {\n"
    "          \"name\": \"apktoolkit-sim\",\n";

class Sarif {
 public:
  // Adds the report of one file. Must be called in the order of the files on the command line.
  void Add(const Report& report);

  // Adds a failure of the run itself, for example that the journal cannot be written.
  void AddProblem(const std::string& problem);

  // The whole log, in UTF-8.
  std::string Log() const;

 private:
  using Json = nlohmann::ordered_json;

  size_t AddArtifact(const Report& report);
  void AddResult(const Cause& cause, const char* level, const std::string& text,
                 const Json& location);
  size_t RuleOf(const Cause& cause, const char* level);

  std::map<std::string, size_t> rule_of_;      // the index in rules_, by the cause's code
  std::map<std::string, size_t> artifact_of_;  // the index in artifacts_, by the artifact's JSON
  Json rules_ = Json::array();
  Json artifacts_ = Json::array();
  Json results_ = Json::array();
  Json notifications_ = Json::array();
  bool is_successful_ = true;          // no notification has the level "error"
  bool is_installer_missing_ = false;  // reported once for the whole run
};

// The path as a URI reference (RFC 3986 §4.1). An absolute path becomes a "file" URI.
std::string UriOf(std::string_view path);

}  // namespace simulator
