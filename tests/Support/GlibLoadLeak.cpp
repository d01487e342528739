// Sanitizer settings for programs that load GLib: GLib's library constructor keeps a block for
// the life of the process, which LeakSanitizer reports at exit. Its stack reaches the dynamic
// loader's _dl_init only with the slow unwinder (GLib has no frame pointers), so that is chosen
// here and the loader's constructors, no code of ours, are kept out of the report.
extern "C" const char* __asan_default_options() { return "fast_unwind_on_malloc=0"; }
extern "C" const char* __lsan_default_suppressions() { return "leak:_dl_init\n"; }
