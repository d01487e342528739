// Sanitizer settings for programs that load GLib: GLib's library constructor keeps a block for
// the life of the process, which LeakSanitizer reports at exit. Its stack reaches the dynamic
// loader's _dl_init only with the slow unwinder (GLib has no frame pointers), so that is chosen
// here and the loader's constructors, no code of ours, are kept out of the report.
// Visible, so that a sanitizer runtime in a shared library finds them too.
#define TARVEK_SANITIZER_HOOK extern "C" __attribute__((visibility("default"), used))
TARVEK_SANITIZER_HOOK const char* __asan_default_options() { return "fast_unwind_on_malloc=0"; }
// The caps fuzz target also keeps GStreamer's caps parser and start-up out: on some malformed
// texts the parser leaks the value it was reading (GStreamer 1.22), and the registry it loads at
// start-up is kept. What our code does with the caps the parser returns is checked for leaks by
// the bridge's tests, which do not set this.
#if defined(TARVEK_IGNORE_CAPS_PARSER_LEAK)
TARVEK_SANITIZER_HOOK const char* __lsan_default_suppressions() {
  return "leak:_dl_init\nleak:gst_caps_from_string\nleak:gst_init_check\n";
}
#else
TARVEK_SANITIZER_HOOK const char* __lsan_default_suppressions() { return "leak:_dl_init\n"; }
#endif
// The tool's tests read its standard error: no statistics of suppressions there.
TARVEK_SANITIZER_HOOK const char* __lsan_default_options() { return "print_suppressions=0"; }
