// Runs of the tool, as events, and the reports about these runs.
#pragma once

#include "simulator/verdict/make_report.h"

#include "apk/native_libraries.h"

#include "simulator/phone/probe_run.h"

namespace simulator {

inline const std::string kFile = "/data/app/base.apk";
inline const std::string kLibrary = "/data/app/lib/arm64/libfoo.so";
inline constexpr char kPackagePayload[] = "0100ab";
inline constexpr char kNoData[] = "0000";

inline const Json kStart = {{"event", "start"}, {"file", "base.apk"}, {"path", kFile}};
inline const Json kExit = {{"event", "exit"}, {"status", 0}};

inline Json Log(int priority, const std::string& text, const std::string& tag = "ApkToolkit") {
  return {{"event", "log"}, {"priority", priority}, {"tag", tag}, {"text", text}};
}

inline Json Sign(const std::string& path, const std::string& payload, int error = 0) {
  return {{"event", "sign"},          {"fd", 3},       {"path", path}, {"payload", payload},
          {"result", error ? -1 : 0}, {"errno", error}};
}

inline Json Verify(int error) {
  return {{"event", "verify"},
          {"fd", 3},
          {"path", kFile},
          {"result", error ? -1 : 0},
          {"errno", error}};
}

inline Json Integrity(const Json& text) {
  return {{"event", "integrity"}, {"pid", 0}, {"text", text}};
}

inline Json Register(int64_t result) {
  return {{"event", "register"}, {"fd", 3},      {"path", kFile},
          {"name", "com.app"},   {"data", "ab"}, {"result", result}};
}

inline RunRecord Record(Events events, const Json& end = kExit) {
  events.insert(events.begin(), kStart);
  events.push_back(end);
  return TakeApart(events);
}

inline Report Made(const Events& events, const PackageFacts& facts = {},
                   const JudgeOptions& options = {}, const Json& end = kExit) {
  return MakeReport(Record(events, end), facts, options);
}

// One line for each item: "name state", then the code of the cause and the detail if the item has
// them.
inline Lines ItemsOf(const Report& report) {
  Lines lines;
  for (const Item& item : report.items) {
    constexpr const char* kStates[] = {"done", "refused", "absent", "nothing"};
    std::string line = item.name + " " + kStates[static_cast<size_t>(item.state)];
    if (item.reason.cause != nullptr) line += std::string(" ") + item.reason.cause->code;
    if (!item.reason.detail.empty()) line += " " + item.reason.detail;
    lines.push_back(line);
  }
  return lines;
}

inline Lines Items(const Events& events, const PackageFacts& facts = {}) {
  return ItemsOf(Made(events, facts));
}

// Log lines of the tool. The tool logs kTakesUp before it decides whether it asks the kernel to
// sign the package or a library. kLibrariesStart is the first line of the step that signs the
// libraries, and kFileStart is the first line of the step that signs the file.
inline const Json kTakesUp = Log(4, "VeltSignOat: Apk case.\n");
inline const Json kLibrariesStart = Log(4, "VeltSignJni starts: 3.\n");
inline const Json kFileStart = Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n");

inline Json CannotSign(int error) {
  return Log(6, "VELT can't sign a file (result=10000, errno " + std::to_string(error) + ": x).\n");
}

// The facts of a package with the libraries `entries`. `error` and `has_directory` are the
// values of these fields of LibraryFacts, for every library.
inline PackageFacts WithLibraries(const Lines& entries, int error = 0, bool has_directory = false) {
  PackageFacts facts;
  for (const std::string& name : entries) {
    const std::string place = ApkTools::InstalledLibraryPath("", name);
    facts.libraries.push_back({name, place, true, error, has_directory});
  }
  return facts;
}

}  // namespace simulator
