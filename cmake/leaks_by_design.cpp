// The leaks that LeakSanitizer must not report in programs that are built with this file. The tool
// never closes the package's archive, because its process ends right after the run.
extern "C" const char* __lsan_default_suppressions() { return "leak:OpenArchiveFd\n"; }

extern "C" const char* __lsan_default_options() { return "print_suppressions=0"; }
