// What the leak sanitizer has to pass over: fontconfig keeps what it looked up until the process
// ends, by pointers that the sanitizer does not follow.

extern "C" __attribute__((visibility("default"))) const char* __lsan_default_suppressions() {
    return "leak:libfontconfig.so\n";
}
