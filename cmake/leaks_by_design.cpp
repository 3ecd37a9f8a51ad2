// What LeakSanitizer is not to report in a program that is built with it: the zip archive's handle
// is never closed and the RSA key's limbs are never released, since the process ends right after
// its one run.
extern "C" const char* __lsan_default_suppressions() {
  return "leak:libziparchive.so\nleak:rsa_set_key\n";
}

extern "C" const char* __lsan_default_options() { return "print_suppressions=0"; }
