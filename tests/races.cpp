// What the thread sanitizer has to pass over: the maps of the bus library copy a random key, which
// it makes anew now and then without a lock. Any bytes serve as a key.

extern "C" __attribute__((visibility("default"))) const char* __tsan_default_suppressions() {
    return "race:libsystemd.so.0\n";
}
