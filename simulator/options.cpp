#include "simulator/options.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cmath>
#include <cstring>
#include <ctime>
#include <iostream>

#include "simulator/phone/text.h"
#include "simulator/run/tool_process.h"

namespace simulator {

namespace {

constexpr char kDescription[] =
    "Runs the unchanged apktoolkit for each FILE inside a simulated phone. Prints\n"
    "what the phone accepted, why it refused the rest, and what to change.";

constexpr char kFooter[] =
    "Exit status (of several FILEs the highest one):\n"
    "  0  everything that had to be signed was signed\n"
    "  1  something was refused: by the tool, by a phone's installer, or by --signer\n"
    "     or --werror\n"
    "  2  the command line is wrong\n"
    "  3  a FILE could not be judged, or the output could not be written\n"
    "  4  the tool could not look at a FILE: missing, no permission, read-only;\n"
    "     or a directory has no packages\n"
    "More, with examples: man apktoolkit-sim";

constexpr struct {
  const char* name;
  InstallerUse use;
} kInstallerUses[] = {{"auto", InstallerUse::kAuto},
                      {"required", InstallerUse::kRequired},
                      {"off", InstallerUse::kOff}};

constexpr char kInstall[] = "--install";
constexpr char kInstallNo[] = "no";
constexpr struct {
  const char* name;
  InstalledAbi abi;
} kAbis[] = {{"phone", InstalledAbi::kPreferred},
             {"all", InstalledAbi::kAll},
             {"arm64", InstalledAbi::kArm64},
             {"arm", InstalledAbi::kArm}};

std::vector<std::string> CommandLineOf(int argc, char** argv);
void AddPhone(CLI::App* app, Options* options);
void AddKernelAnswer(CLI::App* app, const char* name, int* error, const char* description);
void AddFiles(CLI::App* app, Options* options);
void AddInstallation(CLI::App* app, Options* options);
void AddInstaller(CLI::App* app, Options* options);
void AddGate(CLI::App* app, Options* options);
void AddOutput(CLI::App* app, Options* options);
void AddRun(CLI::App* app, Options* options, std::string* runner);
void AddVerify(CLI::App* app, Options* options);
std::string WhyNoName(const std::string& name);
bool ReadLevels(const std::string& text, LevelRange* levels);
int ErrorNumber(const std::string& name);
std::optional<int> NameUnknownOption(const CLI::App& app);
int MissFile();

}  // namespace

std::optional<int> ParseOptions(int argc, char** argv, Options* options) {
  CLI::App app(kDescription, "apktoolkit-sim");
  app.footer(kFooter);
  app.get_formatter()->column_width(28);
  app.allow_extras();  // NameUnknownOption reports unknown options
  options->installer.program = ProgramDirectory() + "/../share/apktoolkit/installer.jar";
  std::string runner;

  app.add_option("FILE", options->files.names, "Packages, JARs or other files")->type_name("");
  app.option_defaults()->group("The phone");
  AddPhone(&app, options);
  app.option_defaults()->group("The run");
  AddFiles(&app, options);
  AddInstallation(&app, options);
  AddInstaller(&app, options);
  AddGate(&app, options);
  AddOutput(&app, options);
  AddRun(&app, options, &runner);
  AddVerify(&app, options);
  app.set_help_flag("-h,--help", "Print this help");
  app.set_version_flag("--version", "apktoolkit-sim " APKTOOLKIT_VERSION, "Print the version");
  try {
    app.parse(CommandLineOf(argc, argv));
    if (options->verify && options->run.install == InstallWhen::kAlways) {
      throw CLI::ExcludesError(kInstall, "--verify");
    }
    if (options->verify && options->installer.use == InstallerUse::kRequired) {
      throw CLI::ExcludesError("--installer=required", "--verify");
    }
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? 0 : kUsageError;
  }
  options->installer.timeout = options->run.timeout;
  if (options->verify) {
    options->installer.use = InstallerUse::kOff;
    options->run.install = InstallWhen::kNever;
  }
  for (const std::string& word : Split(runner, ' ')) {
    if (!word.empty()) options->run.runner.push_back(word);
  }
  if (options->show.journal == "-") {
    options->show.json = true;
    options->show.journal.clear();
  }
  options->judge.now = time(nullptr);
  options->run.is_own_tool = app.count("--tool") == 0;
  if (options->run.is_own_tool) {
    options->run.tool =
        ProgramDirectory() + (options->verify ? "/apktoolkit-verify" : "/apktoolkit");
  } else {
    options->show.tool = options->run.tool;
  }
  if (const auto status = NameUnknownOption(app)) return status;
  if (options->files.names.empty() && options->files.list.empty()) return MissFile();
  return {};
}

namespace {

// The command line in reverse order, as CLI11 expects it. An --install without a value becomes
// --install=phone. Otherwise CLI11 would use the next word, for example a file, as the value.
std::vector<std::string> CommandLineOf(int argc, char** argv) {
  std::vector<std::string> words(argv + std::min(argc, 1), argv + argc);
  const auto end_of_options = std::find(words.begin(), words.end(), "--");
  std::replace(words.begin(), end_of_options, std::string(kInstall),
               std::string(kInstall) + "=" + kAbis[0].name);
  std::reverse(words.begin(), words.end());
  return words;
}

void AddPhone(CLI::App* app, Options* options) {
  PhoneSettings* const phone = &options->run.phone;
  app->add_option_function<std::string>(
         "--integrity", [phone](const std::string& text) { phone->integrity = Split(text, ','); },
         "The tool's integrity value: a TEXT for each\n"
         "reading. The last TEXT repeats; \"missing\" means\n"
         "that the file does not exist [default: 1f]")
      ->type_name("TEXT[,TEXT]...");
  AddKernelAnswer(app, "--sign-errno", &phone->sign_errno,
                  "The kernel answers every signing with this\n"
                  "error, such as EPERM [default: it signs]");
  AddKernelAnswer(app, "--verify-errno", &phone->verify_errno,
                  "The kernel's answer for a file that it does\n"
                  "not trust [default: ENOKEY]");
  app->add_option("--zu-result", phone->zu_result, "The answer of libzu [default: 0]")
      ->type_name("N");
  app->add_option("--trust", options->run.trust, "The kernel trusts this file; may be repeated")
      ->check(CLI::ExistingFile.description(""))
      ->type_name("FILE")
      ->allow_extra_args(false);
  app->add_option("--state", options->run.state,
                  "Remember signed files in DIR, and trust them\n"
                  "while their bytes stay the same")
      ->type_name("DIR")
      ->check(WhyNoName);
}

void AddKernelAnswer(CLI::App* app, const char* name, int* error, const char* description) {
  const auto check = [](const std::string& text) {
    return ErrorNumber(text) == 0 ? "no error has the name " + text : std::string();
  };
  const auto set = [error](const std::string& text) { *error = ErrorNumber(text); };
  app->add_option_function<std::string>(name, set, description)->type_name("NAME")->check(check);
}

void AddFiles(CLI::App* app, Options* options) {
  FileListOptions* const files = &options->files;
  app->add_flag("--recursive", files->is_recursive,
                "Look at the packages in and below a directory:\n"
                ".apk .jar .apks .xapk .apkm .aab");
  CLI::Option* const list = app->add_option("--files-from", files->list,
                                            "Read more FILEs from a list, one a line;\n"
                                            "\"-\" is standard input")
                                ->type_name("LIST")
                                ->check(WhyNoName);
  app->add_flag("-0,--null", files->has_nul, "The names of the list end with NUL bytes")
      ->needs(list);
}

void AddInstallation(CLI::App* app, Options* options) {
  const auto install = [options](const std::string& name) {
    options->run.install = name == kInstallNo ? InstallWhen::kNever : InstallWhen::kAlways;
    for (const auto& abi : kAbis) {
      if (name == abi.name) options->run.abi = abi.abi;
    }
  };
  const auto check = [](const std::string& name) {
    const bool is_known =
        name == kInstallNo || std::any_of(std::begin(kAbis), std::end(kAbis),
                                          [&name](const auto& abi) { return name == abi.name; });
    return is_known ? std::string() : name + " is not one of phone, all, arm64, arm and no";
  };
  app->add_option_function<std::string>(kInstall, install,
                                        "First extract the libraries into a temporary\n"
                                        "directory, as an installer does. ABI is one of\n"
                                        "phone, all, arm64, arm and no, which extracts\n"
                                        "nothing [default: phone, if no libraries are\n"
                                        "beside the package]")
      ->type_name("[=ABI]")
      ->check(check)
      ->take_last();
  app->add_flag("--strict", options->judge.is_strict,
                "A library that is not beside its package, or is\n"
                "damaged in it, counts as refused");
}

void AddInstaller(CLI::App* app, Options* options) {
  InstallerOptions* const installer = &options->installer;
  const auto use = [installer](const std::string& name) {
    for (const auto& each : kInstallerUses) {
      if (name == each.name) installer->use = each.use;
    }
  };
  const auto is_use = [](const std::string& name) {
    const bool is_known = std::any_of(std::begin(kInstallerUses), std::end(kInstallerUses),
                                      [&name](const auto& each) { return name == each.name; });
    return is_known ? std::string() : name + " is not one of auto, required and off";
  };
  app->add_option_function<std::string>("--installer", use,
                                        "Also ask apksig, the verifier of a phone's\n"
                                        "installer: auto (if it is installed), required\n"
                                        "or off [default: auto]")
      ->type_name("WHEN")
      ->check(is_use)
      ->take_last();
  const auto set = [installer](const std::string& text) { ReadLevels(text, &installer->levels); };
  const auto is_range = [](const std::string& text) {
    LevelRange levels = {0, 0};
    return ReadLevels(text, &levels) ? std::string()
                                     : text + " is not an API level or a range such as 27-33";
  };
  app->add_option_function<std::string>("--api", set,
                                        "Ask about phones with these API levels\n"
                                        "[default: 27-, which means 27 and later]")
      ->type_name("LEVEL[-LEVEL]")
      ->check(is_range);
}

void AddGate(CLI::App* app, Options* options) {
  std::vector<std::string>* const signers = &options->gate.signers;
  const auto is_digest = [](const std::string& text) {
    return ReadDigest(text) ? std::string()
                            : text +
                                  " is not a SHA-256 digest: 64 hexadecimal digits, or 32 pairs "
                                  "of them with colons between";
  };
  const auto add = [signers](const std::vector<std::string>& texts) {
    for (const std::string& text : texts) signers->push_back(*ReadDigest(text));
  };
  app->add_option_function<std::vector<std::string>>(
         "--signer", add,
         "Refuse packages of other signers. SHA256 is the\n"
         "digest of certificate, public key or modulus;\n"
         "may be repeated")
      ->type_name("SHA256")
      ->check(is_digest)
      ->allow_extra_args(false);
  app->add_flag("--werror", options->gate.refuses_warnings,
                "Warnings count as refusals, and so does the\n"
                "verdict SIGNED, OTHER SIGNER");
}

void AddOutput(CLI::App* app, Options* options) {
  const auto print = [app, options](const char* name, Detail detail, const char* description) {
    const auto set = [name, options, detail](int64_t) {
      if (options->show.detail != Detail::kUsual) {
        throw CLI::ValidationError(name, "--quiet and --verbose exclude each other");
      }
      options->show.detail = detail;
    };
    app->add_flag_function(name, set, description);
  };
  print("--quiet", Detail::kVerdict, "Print only the verdicts");
  print("--verbose", Detail::kAll,
        "Also print the unprotected entries, all signers,\n"
        "and the chain from key to entries");
  app->add_flag("--json", options->show.json, "Print the journal, one JSON object a line");
  app->add_option("--journal", options->show.journal, "Write the journal to FILE; - is like --json")
      ->type_name("FILE")
      ->check(WhyNoName);
  // Standard output has the verdicts or the journal. A JUnit, SARIF or HTML document there would
  // therefore be malformed.
  const auto is_no_stream = [](const std::string& path) {
    return std::string(
        path == "-" ? "it cannot be written to standard output; for a file named -, write ./-"
                    : "");
  };
  const auto document = [&](const char* name, std::string* path, const char* description) {
    app->add_option(name, *path, description)
        ->type_name("FILE")
        ->check(WhyNoName)
        ->check(is_no_stream);
  };
  document("--junit", &options->show.junit, "Write test results to FILE, in JUnit format");
  document("--sarif", &options->show.sarif, "Write results to FILE, as a SARIF 2.1.0 log");
  document("--html", &options->show.html, "Write everything to FILE, as an HTML page");
}

void AddRun(CLI::App* app, Options* options, std::string* runner) {
  // CLI::Range accepts "nan" in every range.
  const auto is_number = [](const std::string& text) {
    return std::isnan(strtod(text.c_str(), nullptr)) ? text + " is not a number" : std::string();
  };
  app->add_option("--jobs", options->run.jobs, "Look at N files at the same time [default: 1]")
      ->type_name("N")
      ->check(CLI::Range(1, 1024).description(""));
  app->add_option("--timeout", options->run.timeout,
                  "Stop the tool if a file takes longer than this\n"
                  "[default: 30]")
      ->type_name("SECONDS")
      ->check(CLI::Range(0.001, 1e6).description(""))
      ->check(is_number);
  app->add_option("--tool", options->run.tool,
                  "The program to run [default: the apktoolkit\n"
                  "beside this program]")
      ->type_name("PATH");
  app->add_option("--runner", *runner,
                  "Put these words before the tool: an emulator\n"
                  "that accepts -E NAME=VALUE [default: none]")
      ->type_name("COMMAND")
      ->take_last();
}

// With --verify, nothing is signed, and there are no registrations and no verdicts. --verify
// therefore excludes the options about signing, registrations and verdicts. It also excludes
// --recursive, which finds only packages and would leave out the native libraries beside them.
void AddVerify(CLI::App* app, Options* options) {
  CLI::Option* const verify = app->add_flag("--verify", options->verify,
                                            "Sign nothing. Run the apktoolkit-verify beside\n"
                                            "this program: it asks which FILEs the kernel\n"
                                            "trusts");
  for (const char* name :
       {"--integrity", "--sign-errno", "--zu-result", "--api", "--signer", "--werror", "--strict",
        "--recursive", "--quiet", "--verbose", "--html", "--junit", "--sarif"}) {
    verify->excludes(app->get_option(name));
  }
  verify->option_text(" ");  // replaces the list of excluded options, which is too long for a line
}

// If the command line has an unknown option, prints a message and returns the exit status. The
// message also helps a user whose file has a name that begins with "-".
std::optional<int> NameUnknownOption(const CLI::App& app) {
  std::vector<std::string> unknown = app.remaining();
  unknown.erase(std::remove(unknown.begin(), unknown.end(), "--"), unknown.end());
  if (unknown.empty()) return {};
  const std::string word = Printable(unknown[0], {});
  std::cerr << "there is no option " << word << "; for a file of this name, write ./" << word
            << "\nRun with --help for more information.\n";
  return kUsageError;
}

int MissFile() {
  std::cerr << "name at least one FILE, or use --files-from LIST\nRun with --help for more "
               "information.\n";
  return kUsageError;
}

// Returns why the name is not accepted; empty if the name is accepted. A script passes an empty
// name if it uses a variable that is not set.
std::string WhyNoName(const std::string& name) {
  return name.empty() ? "the name is empty" : std::string();
}

// Reads LEVEL, LEVEL-LEVEL or LEVEL-. The last form has no upper end. Returns false if the text is
// not valid.
bool ReadLevels(const std::string& text, LevelRange* levels) {
  constexpr size_t kMostDigits = 5;
  const std::vector<std::string> parts = Split(text, '-');
  const auto is_number = [](const std::string& part) {
    return !part.empty() && part.size() <= kMostDigits &&
           part.find_first_not_of("0123456789") == std::string::npos;
  };
  if (parts.size() > 2 || !is_number(parts[0])) return false;
  const bool has_end = parts.size() == 1 || !parts[1].empty();
  if (has_end && !is_number(parts.back())) return false;
  levels->first = std::stoi(parts[0]);
  levels->last = has_end ? std::stoi(parts.back()) : kNewestLevel;
  return levels->first >= 1 && levels->first <= levels->last;
}

// Returns 0 if no error has this name.
int ErrorNumber(const std::string& name) {
  constexpr int kLast = 4095;  // the highest errno that a system call can return
  for (int error = 1; error <= kLast; ++error) {
    const char* const known = strerrorname_np(error);
    if (known != nullptr && name == known) return error;
  }
  return 0;
}

}  // namespace

}  // namespace simulator
