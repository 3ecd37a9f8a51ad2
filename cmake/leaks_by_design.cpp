// The leaks that LeakSanitizer must not report in the program. The package's archive is never
// closed, because the process ends right after its only run.
extern "C" const char* __lsan_default_suppressions() { return "leak:OpenArchiveFd\n"; }

extern "C" const char* __lsan_default_options() { return "print_suppressions=0"; }
