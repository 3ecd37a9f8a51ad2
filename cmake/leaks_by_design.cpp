// What LeakSanitizer is not to report in a program that is built with it: the package's archive is
// never closed, since the process ends right after its one run.
extern "C" const char* __lsan_default_suppressions() { return "leak:OpenArchiveFd\n"; }

extern "C" const char* __lsan_default_options() { return "print_suppressions=0"; }
