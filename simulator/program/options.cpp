#include "simulator/program/options.h"

#include <CLI/CLI.hpp>
#include <cstring>
#include <limits>

#include "simulator/phone/text.h"
#include "simulator/program/run.h"

namespace {

constexpr char kDescription[] =
    "Runs apktoolkit, as it is, for each FILE inside a simulated phone, and shows what a phone "
    "would have done.";

constexpr char kFooter[] =
    "Exit status, the highest of all FILEs:\n"
    "  0  all that should be signed was signed: the file itself, every library beside it that\n"
    "     was tried, and every key that was to be registered\n"
    "  1  something was refused; the first reason is printed first\n"
    "  2  the command line is wrong\n"
    "  3  the simulation itself could not run, or the tool did not end in time";

void AddPhone(CLI::App* app, PhoneSettings* phone);
void AddKernelAnswer(CLI::App* app, const char* name, int* error, const char* description);
int ErrorNumber(const std::string& name);

}  // namespace

std::optional<int> ParseOptions(int argc, char** argv, Options* options) {
  CLI::App app(kDescription, "apktoolkit-sim");
  app.footer(kFooter);
  options->tool = ProgramDirectory() + "/apktoolkit";
  options->timeout = 30;
  std::string runner;

  AddPhone(&app, &options->phone);
  app.add_option("--trust", options->trust, "The kernel trusts FILE (may be repeated)")
      ->check(CLI::ExistingFile.description(""))
      ->type_name("FILE")
      ->allow_extra_args(false);
  app.add_option("--state", options->state,
                 "What was signed is remembered in DIR, and trusted while its bytes stay the same")
      ->type_name("DIR");
  app.add_option("--journal", options->journal, "Keep the journal in FILE")->type_name("FILE");
  app.add_flag("--json", options->json, "Print the journal, one JSON object a line");
  app.add_option("--tool", options->tool, "The program to run, if not the apktoolkit beside this")
      ->type_name("PATH");
  app.add_option("--timeout", options->timeout, "Give up a tool that takes longer")
      ->type_name("SECONDS")
      ->check(CLI::Range(0.001, 1e6).description(""))
      ->capture_default_str();
  app.add_option("--runner", runner,
                 "Words to put before the tool: an emulator that takes -E NAME=VALUE")
      ->type_name("COMMAND")
      ->take_last();
  app.add_option("FILE", options->files, "Packages, JARs or other files")
      ->type_name("")
      ->required();

  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? 0 : kUsageError;
  }
  for (const std::string& word : Split(runner, ' ')) {
    if (!word.empty()) options->runner.push_back(word);
  }
  return {};
}

namespace {

void AddPhone(CLI::App* app, PhoneSettings* phone) {
  app->add_option_function<std::string>(
         "--integrity", [phone](const std::string& text) { phone->integrity = Split(text, ','); },
         "What the tool reads as its integrity value; the last TEXT repeats, \"missing\" is a "
         "file that is not there [1f]")
      ->type_name("TEXT[,TEXT]...");
  AddKernelAnswer(app, "--sign-errno", &phone->sign_errno,
                  "The kernel answers every signing with this error, such as EPERM");
  AddKernelAnswer(app, "--verify-errno", &phone->verify_errno,
                  "The kernel's answer for a file that it does not trust [ENOKEY]");
  app->add_option("--zu-result", phone->zu_result, "What libzu answers")
      ->type_name("N")
      ->capture_default_str();
}

void AddKernelAnswer(CLI::App* app, const char* name, int* error, const char* description) {
  const auto check = [](const std::string& text) {
    return ErrorNumber(text) == 0 ? "no error has the name " + text : std::string();
  };
  const auto set = [error](const std::string& text) { *error = ErrorNumber(text); };
  app->add_option_function<std::string>(name, set, description)->type_name("NAME")->check(check);
}

// 0 when there is no error of this name.
int ErrorNumber(const std::string& name) {
  constexpr int kLast = 4095;  // the highest that a system call can answer
  for (int error = 1; error <= kLast; ++error) {
    const char* const known = strerrorname_np(error);
    if (known != nullptr && name == known) return error;
  }
  return 0;
}

}  // namespace
